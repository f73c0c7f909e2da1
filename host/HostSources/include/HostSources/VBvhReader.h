#pragma once

#include <HostSources/VProgress.h>
#include <HostSources/VRecording.h>

#include <ZEK/Result.h>

#include <cstddef>
#include <span>
#include <string>

namespace HostSources
{

/// True for bytes that begin like a BVH file.
bool LooksLikeBvh( std::span< const std::byte > i_Bytes );

/// Reads a BVH file as one skeleton; results and messages as `ReadRecording` has them. `i_rName` is the file's name in
/// messages. The format states neither unit nor axes: centimetres and y up are taken. Rotations apply in the order of
/// their channels; positions take the place of the offset.
ZEK::IResult ReadBvh( std::span< const std::byte > i_Bytes, const std::string& i_rName, VRecording& o_rRecording,
                      std::string& o_rMessage, const VProgress& i_rProgress = {} );

} // namespace HostSources
