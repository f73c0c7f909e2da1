#pragma once

// Targets and names of parameter items (0x1) that sources and views agree on.

#include <array>

namespace CoreMoxelTypes
{

/// The volume in which points are reconstructed: two corners, mm.
inline constexpr const char* ReconstructionTarget = "Processing:Reconstruction";
inline constexpr std::array< const char*, 6 > ReconstructionVolumeNames{
    "VolumeMinimumX", "VolumeMinimumY", "VolumeMinimumZ", "VolumeMaximumX", "VolumeMaximumY", "VolumeMaximumZ" };

} // namespace CoreMoxelTypes
