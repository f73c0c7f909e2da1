#pragma once

// Reconstructed points. One set of each kind a state, without a name.
// The number beside a structure is the tag of its items.

#include <CoreMoxelTypes/Basic.h>

namespace CoreMoxelTypes
{

struct VReconstruction
{
  u32 Id = 0;
  D3 Position;
  f32 Radius = 0;   ///< mm
  f32 Residual = 0; ///< mm
  u32 Rays = 0;
};

/// 0x100d 0x101e
struct VReconstructionSet
{
  std::vector< VReconstruction > Items;
};

/// 0x100f 0x101f
struct VReconstructionLabelSet
{
  struct L
  {
    u32 Reconstruction = 0 /*index*/, SubjectId = 0, MarkerId = 0;
  };
  std::vector< L > Labels;
};

/// 0x100e
struct VReconstructionTrackSet
{
  struct T
  {
    u64 TrackId = 0;
    u32 Reconstruction = 0;
  };
  std::vector< T > Tracks;
};

} // namespace CoreMoxelTypes
