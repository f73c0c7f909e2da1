#pragma once

#include <MoxelGraphics/IRenderType.h>

#include <memory>

namespace ZEK
{
class IRenderCameraProvider;
}

namespace MoxelGraphics
{
class VMoxelScene;

/// The centroids of cameras in their own views, all tiles in one draw: tiny ones as points, larger ones as discs with a
/// border and a cross. Coloured by `CentroidColourScheme`.
class VRenderCameraData2D : public IRenderType
{
public:
  /// The scene owns this object.
  VRenderCameraData2D( VMoxelScene& i_rScene, std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider );
  ~VRenderCameraData2D() override;

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;
  void RenderTiles( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions ) override;

private:
  struct VGl;
  std::unique_ptr< VGl > m_pGl;
};

} // namespace MoxelGraphics
