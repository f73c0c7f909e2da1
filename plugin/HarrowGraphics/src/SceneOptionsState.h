#pragma once

#include <HarrowPluginInterface/IWorkspaceContent.h>

class QQmlPropertyMap;

namespace HarrowGraphics
{

/// Writes every option; a key with a "-" goes into the group of what stands before it.
void WriteOptions( HarrowPluginInterface::IStateWriter& io_rWriter, const QString& i_rGroup,
                   const QQmlPropertyMap& i_rOptions );

/// Hands each option that is saved, and of its key's type, to `i_rSet`. One that is not is left out and logged.
void ReadOptions( const HarrowPluginInterface::IStateReader& i_rReader, const QString& i_rGroup,
                  const QQmlPropertyMap& i_rOptions,
                  const std::function< void( const QString&, const QVariant& ) >& i_rSet );

} // namespace HarrowGraphics
