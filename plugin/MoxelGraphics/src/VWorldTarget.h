#pragma once

#include <MoxelGraphics/CameraDistortion.h>

#include <CoreGraphics/VRenderContext.h>

#include <QtCore/QRect>

#include <cstdint>
#include <memory>
#include <vector>

namespace CoreGraphics
{
class VResources;
}

namespace ZEK
{
class IRenderCamera;
}

namespace MoxelGraphics
{

/// A picture that the world of one tile is drawn into, to be laid over the tile's video: bent as the lens bends it, or
/// translucent as a whole.
///
/// A lens shows more, or less, than a picture without distortion of the same size does: the picture for the lens is
/// larger than the tile by as much as the tile's borders need. Pictures are kept by render context, and made anew only
/// when they are too small, or have been far too large for a while. Thread: render thread.
class VWorldTarget
{
public:
  explicit VWorldTarget( CoreGraphics::VResources& io_rResources );
  ~VWorldTarget();

  /// What is drawn from here on goes into a picture, for a tile that is the context's viewport, scissor and `View2D`;
  /// gives the context its projection. False when the device refuses the picture: it is then drawn as always.
  bool Begin( CoreGraphics::VRenderContext& io_rContext, const ZEK::IRenderCamera& i_rCamera,
              const VSceneOptions& i_rOptions, bool i_bLens );
  bool IsOpen() const { return m_bOpen; }
  /// Gives the context back what it had, and lays the picture over the tile, unless nothing was drawn.
  void End( CoreGraphics::VRenderContext& io_rContext, float i_Opacity );

private:
  struct VPictures;
  struct VGl;

  static VPictures& PicturesOf( CoreGraphics::VRenderContext& io_rContext );
  /// `LensReach` of `m_Sensor`, worked out where the camera was last seen another way.
  const std::array< double, 2 >& ReachOf( std::size_t i_Camera );
  void Lay( CoreGraphics::VRenderContext& io_rContext, float i_Opacity );

  std::unique_ptr< VGl > m_pGl;
  bool m_bOpen = false, m_bLens = false, m_bRefusalLogged = false;
  QOpenGLFramebufferObject* m_pPicture = nullptr;
  QOpenGLFramebufferObject* m_pBefore = nullptr;
  QRect m_Viewport, m_Scissor; ///< of the tile
  QSize m_PictureSize;
  QVector4D m_View2D;        ///< of the tile
  QVector4D m_PictureView2D; ///< the same place in the larger picture
  QMatrix4x4 m_Projection;   ///< of the world into the tile
  VSensorView m_Sensor;
  struct VReach
  {
    VSensorView Sensor;
    std::array< double, 2 > Reach{ 1, 1 }; ///< of a view without a lens, as the sensor above is one
  };
  std::vector< VReach > m_Reaches; ///< by the cameras' numbers
  std::uint64_t m_DrawsAtBegin = 0;
};

/// How many times the tile a picture without distortion has to be, in x and in y, to hold all that the lens shows of
/// it: 1 to 2, in steps of an eighth. `i_rSensor` has the lens.
std::array< double, 2 > LensReach( const VSensorView& i_rSensor );

} // namespace MoxelGraphics
