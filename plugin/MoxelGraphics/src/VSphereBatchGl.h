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

/// The radius in pixels below which no sphere is drawn, as its vertex shader has it.
constexpr float SmallestPixels = 1.75f;

/// mm; a larger sphere, through a scale that makes no sense, is not drawn.
constexpr float LargestSize = 1e9f;

/// How large a sphere of radius 1 is in pixels at a distance of 1.
float PixelsAtOne( CoreGraphics::VRenderContext& io_rContext );

/// The size of a sphere in the world; 0 when it is not drawn.
inline float SizeOf( const VScenePoint& i_rSphere, const VSphereSizing& i_rSizing )
{
  const float Own = i_rSizing.FixedRadius < 0 ? i_rSphere.Radius : i_rSizing.FixedRadius;
  const float Size = Own * i_rSizing.Scale;
  return i_rSphere.Radius >= 0 && Size > 0 && Size < LargestSize ? Size : 0.0f;
}

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

  void Forget() { SpheresGeneration = ColoursGeneration = FlagsGeneration = 0; }
};

} // namespace MoxelGraphics
