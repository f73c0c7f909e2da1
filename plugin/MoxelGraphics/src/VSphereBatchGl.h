#pragma once

#include <MoxelGraphics/VSphereHelper.h>

#include <CoreGraphics/VVertexBuffer.h>

namespace MoxelGraphics
{

/// The buffers of a batch, and what they hold: generations of the batch's own contents, 0 for nothing.
struct VSphereBatch::VGl
{
  CoreGraphics::VDynamicBuffer Spheres;
  CoreGraphics::VDynamicBuffer Colours;
  CoreGraphics::VDynamicBuffer Flags;
  VSphereSizing Sizing;
  std::uint64_t SpheresGeneration = 0;
  std::uint64_t ColoursGeneration = 0;
  std::uint64_t FlagsGeneration = 0;
  std::uint64_t Ignored = 0; ///< generation of the scene's ignored ids that the flags hold; 0 for none
  std::uint32_t IgnoredFirstId = 0;

  void Forget() { SpheresGeneration = ColoursGeneration = FlagsGeneration = 0; }
};

} // namespace MoxelGraphics
