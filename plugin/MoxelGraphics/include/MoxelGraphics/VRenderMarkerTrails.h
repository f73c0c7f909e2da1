#pragma once

#include <MoxelGraphics/IRenderType.h>

#include <cstdint>
#include <memory>
#include <vector>

namespace MoxelGraphics
{
class VMoxelScene;

/// A place on a trail. Trails lie one after the other in one list; a place with a negative strength is none, and breaks
/// the trail there.
struct VTrailPoint
{
  float X = 0, Y = 0, Z = 0; ///< mm
  float Strength = -1;       ///< 1 where the marker is now, 0 at the ends
  std::uint32_t Colour = 0;  ///< 0xAABBGGRR
};

/// Where markers were and will be, as thin ribbons that fade with time. Nothing is asked of anybody while the option
/// `MarkerTrails` is off.
class VRenderMarkerTrails : public IRenderType
{
public:
  /// The scene owns this object.
  explicit VRenderMarkerTrails( VMoxelScene& i_rScene );
  ~VRenderMarkerTrails() override;

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

  const std::vector< VTrailPoint >& Points() const { return m_Points; }

protected:
  /// Called before trails are drawn, and not while they are off: the place to write `m_Points`. Whoever did says true.
  virtual bool FillTrails( const VSceneOptions& /*i_rOptions*/ ) { return false; }

  VMoxelScene& m_rScene;
  std::vector< VTrailPoint > m_Points;

private:
  struct VGl;
  std::unique_ptr< VGl > m_pGl;
  std::uint64_t m_Generation = 1;
};

} // namespace MoxelGraphics
