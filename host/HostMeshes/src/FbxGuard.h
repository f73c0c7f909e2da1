#pragma once

#include <cstddef>
#include <span>
#include <string>

namespace HostMeshes
{

/// Looks through an FBX file for what would take the importer down rather than make it complain: records that reach
/// out of the file or lie too deep in one another, models that contain themselves, packed lists of absurd length. Says
/// what it found; empty when there is nothing.
std::string FindFbxFault( std::span< const std::byte > i_Bytes );

} // namespace HostMeshes
