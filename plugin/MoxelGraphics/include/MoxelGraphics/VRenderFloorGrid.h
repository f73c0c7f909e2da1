#pragma once

#include <MoxelGraphics/IRenderType.h>

#include <array>
#include <memory>

namespace CoreGraphics
{
class VResources;
}

namespace MoxelGraphics
{

/// The floor: a grid of lines, its border, and a cross through the origin. Stands first in a scene's render list.
class VRenderFloorGrid : public IRenderType
{
public:
  explicit VRenderFloorGrid( std::shared_ptr< CoreGraphics::VResources > i_pResources );
  ~VRenderFloorGrid() override;

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

  /// x minimum, y minimum, x maximum, y maximum in mm; with y up the second axis is z. Until they are set the floor is
  /// a square of the view's `FloorGridSize`. A maximum that is not above its minimum leaves what is set.
  void SetExtents( const std::array< int, 4 >& i_rExtents );
  const std::array< int, 4 >& GetExtents() const { return m_Extents; }
  /// `i_Spacing` in mm between thick lines; thin ones divide it. Values of 0 or less leave what is set.
  void SetSpacing( float i_Spacing, int i_Subdivision );

private:
  struct VGl;
  void FollowOptions( const VSceneOptions& i_rOptions );
  void RenderGrid( CoreGraphics::VRenderContext& io_rContext, bool i_bTranslucent );
  void RenderBorder( CoreGraphics::VRenderContext& io_rContext, bool i_bTranslucent );

  std::unique_ptr< VGl > m_pGl;
  std::array< int, 4 > m_Extents{ -3000, -3000, 3000, 3000 };
  bool m_bOwnExtents = false;
  float m_Spacing = 1000.0f;
  int m_Subdivision = 4;
};

} // namespace MoxelGraphics
