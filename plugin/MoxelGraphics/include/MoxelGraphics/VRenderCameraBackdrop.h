#pragma once

#include <MoxelGraphics/IRenderType.h>
#include <MoxelGraphics/VMoxelScene.h>

#include <ZEK/RenderCamera.h>

#include <cstddef>
#include <cstdint>
#include <memory>

namespace MoxelGraphics
{

/// What lies behind the world in a camera's own view: its video, and the images that were added to it. It also gives
/// the view its matrices, so that the world lies over the image, and draws the world by way of a picture of its own
/// where it is to follow the lens or to be translucent.
///
/// With `Distort3D` the video is shown as it is and the world is bent to match it; otherwise, with the world on, the
/// video is freed of the lens. A frame whose size is not the sensor's is stretched over the whole sensor, unless it
/// says where on the sensor it lies. What cannot be shown leaves its sensor dark red and a line in the log.
///
/// `DebugVideo`: 0 nothing; 1 the first plane as it came, grey; other numbers: colours without gamma and saturation.
///
/// Textures are kept by camera until it leaves the provider, and written only when its frame is another one. Stands in
/// a scene's render list before what draws on sensors, and is its backdrop. Thread: render thread.
class VRenderCameraBackdrop : public IRenderType, public IRenderBackdrop
{
public:
  /// The scene owns this object.
  VRenderCameraBackdrop( VMoxelScene& i_rScene, std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider );
  ~VRenderCameraBackdrop() override;

  /// The camera is that of the options, its tile is the context's viewport, scissor and `View2D`. False, for a camera
  /// that is not calibrated or not there, leaves matrices by which nothing is seen.
  bool RenderBackdrop( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions ) override;
  /// In the overlay's pass: lays the world over the video where it was drawn into a picture of its own.
  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

  /// Of pixels, taken to the GPU since the start.
  std::uint64_t BytesUploaded() const { return m_BytesUploaded; }
  /// Cameras that textures are kept for.
  std::size_t CameraCount() const;

private:
  struct VParts;
  struct VKept;

  void DropAbsent();
  VKept* Find( const QString& i_rName );
  void DrawVideo( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, VKept& io_rKept );
  void DrawImages( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, VKept& io_rKept );
  void FillSensor( CoreGraphics::VRenderContext& io_rContext, const QVector4D& i_rColour );
  void DrawSensor( CoreGraphics::VRenderContext& io_rContext );

  VMoxelScene& m_rScene;
  const std::shared_ptr< const ZEK::IRenderCameraProvider > m_pProvider;
  std::unique_ptr< VParts > m_pParts;
  std::uint64_t m_CameraGeneration = 0;
  std::uint64_t m_BytesUploaded = 0;
};

} // namespace MoxelGraphics
