#pragma once

#include <HarrowPluginInterface/IWorkspaceContent.h>

namespace MoxelGraphics
{
struct VSceneOptions;
}

namespace HarrowGraphics
{

/// Writes every option; a key with a "-" goes into the group of what stands before it.
void WriteOptions( HarrowPluginInterface::IStateWriter& io_rWriter, const QString& i_rGroup,
                   const MoxelGraphics::VSceneOptions& i_rOptions );

/// Reads the options that are saved over those given. A value of another type or out of its range is logged, and the
/// option stays as it was given.
void ReadOptions( const HarrowPluginInterface::IStateReader& i_rReader, const QString& i_rGroup,
                  MoxelGraphics::VSceneOptions& io_rOptions );

} // namespace HarrowGraphics
