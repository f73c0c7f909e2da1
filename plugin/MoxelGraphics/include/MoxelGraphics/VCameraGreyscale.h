#pragma once

#include <cstdint>
#include <memory>

namespace CoreGraphics
{
class VRenderContext;
}
namespace ZEK
{
class IRenderCameraProvider;
}

namespace MoxelGraphics
{
class VMoxelScene;
struct VSceneOptions;

/// The grey blobs of cameras in their own views: as the sensor sent them, or, with the option
/// `CameraMaximiseGreyscale`, with the columns and rows that showed no grey for `CameraMaximiseGreyscaleHistory` frames
/// squeezed to `CameraMaximiseGreyscaleFactor` of their width, so that the others fill the image.
///
/// Its owner calls it from its own `Render` and `RenderTiles`. Thread: render thread.
class VCameraGreyscale
{
public:
  VCameraGreyscale( VMoxelScene& i_rScene, std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider );
  ~VCameraGreyscale();

  /// In the overlay pass of a tile: remembers it when there is something to be drawn in it.
  void Collect( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions );
  /// After the last tile: draws the grey of all that were remembered since the last call.
  void DrawTiles( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions );

private:
  struct VGl;
  std::unique_ptr< VGl > m_pGl;
};

} // namespace MoxelGraphics
