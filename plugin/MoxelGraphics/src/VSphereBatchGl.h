#pragma once

#include <MoxelGraphics/VSphereHelper.h>

#include <CoreGraphics/VVertexBuffer.h>

namespace MoxelGraphics
{

/// Spheres of at least this radius in pixels get the fine mesh.
constexpr float FinePixels = 12.0f;
/// Below this the twenty faces of an icosahedron look as round as anything.
constexpr float RoughPixels = 2.5f;
/// Below this a sphere is a point: nobody sees the difference, and it costs a vertex in place of 42.
constexpr float CoarsePixels = 1.0f;

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
