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

/// What calibrated cameras see, on the image planes of their frustums in the 3D view: centroids with the option
/// `CameraCentroids`, grey with `CameraGreyscale`; neither without `Cameras` and `CameraFrustums`. One draw for all.
class VRenderCameraData3D : public IRenderType
{
public:
  /// The scene owns this object.
  VRenderCameraData3D( VMoxelScene& i_rScene, std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider );
  ~VRenderCameraData3D() override;

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

private:
  struct VGl;
  std::unique_ptr< VGl > m_pGl;
};

} // namespace MoxelGraphics
