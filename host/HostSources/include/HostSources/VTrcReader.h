#pragma once

#include <HostSources/VProgress.h>
#include <HostSources/VRecording.h>

#include <ZEK/Result.h>

#include <cstddef>
#include <span>
#include <string>

namespace HostSources
{

/// True for bytes that begin like a TRC file.
bool LooksLikeTrc( std::span< const std::byte > i_Bytes );

/// Reads a TRC file; results and messages as `ReadRecording` has them. `i_rName` is the file's name in messages.
ZEK::IResult ReadTrc( std::span< const std::byte > i_Bytes, const std::string& i_rName, VRecording& o_rRecording,
                      std::string& o_rMessage, const VProgress& i_rProgress = {} );

} // namespace HostSources
