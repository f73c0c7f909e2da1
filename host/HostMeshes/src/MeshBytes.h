#pragma once

#include <HarrowPluginInterface/VMeshScene.h>

#include <cstddef>
#include <span>
#include <string>
#include <vector>

namespace HostMeshes
{

/// What reading a file came to, as it goes from one process to another on one machine.
struct VMeshOutcome
{
  bool bRead = false;
  std::string Message; ///< why not, or what was left out
  HarrowPluginInterface::VMeshScene Mesh;
};

std::vector< std::byte > PackOutcome( const VMeshOutcome& i_rOutcome );
/// False, with a part taken at most, for bytes that are cut off or none of these.
bool UnpackOutcome( std::span< const std::byte > i_Bytes, VMeshOutcome& o_rOutcome );

} // namespace HostMeshes
