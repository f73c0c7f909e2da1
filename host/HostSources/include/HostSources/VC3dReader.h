#pragma once

#include <HostSources/VByteSource.h>
#include <HostSources/VProgress.h>
#include <HostSources/VRecording.h>

#include <ZEK/Result.h>

#include <cstddef>
#include <span>
#include <string>

namespace HostSources
{

/// True for bytes that begin like a C3D file.
bool LooksLikeC3d( std::span< const std::byte > i_Bytes );

/// Reads a C3D file; results and messages as `ReadRecording` has them. `i_rName` is the file's name in messages.
ZEK::IResult ReadC3d( IByteSource& io_rSource, const std::string& i_rName, VRecording& o_rRecording,
                      std::string& o_rMessage, const VProgress& i_rProgress = {} );
ZEK::IResult ReadC3d( std::span< const std::byte > i_Bytes, const std::string& i_rName, VRecording& o_rRecording,
                      std::string& o_rMessage, const VProgress& i_rProgress = {} );

} // namespace HostSources
