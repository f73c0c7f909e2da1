#pragma once

#include <QtCore/QRect>
#include <QtCore/QSize>
#include <QtCore/QString>

#include <array>
#include <cstdint>
#include <memory>
#include <vector>

namespace CoreGraphics
{
class VRenderContext;
}

namespace MoxelGraphics
{

/// One camera of a grid: where its image stands in the frame, and what part of the image is looked at.
struct VCameraTile
{
  QString DeviceURN;
  QString DisplayType;
  std::int32_t UserId = -1;
  std::array< float, 3 > Position{}; ///< mm, world
  double PixelAspect = 1.0;
  bool bVideo = false;
  std::int32_t ImageWidth = 0; ///< sensor pixels
  std::int32_t ImageHeight = 0;
  /// 2 by 2, row-major: how the image stands on screen in its mounted orientation, and snapped to quarter turns.
  std::array< float, 4 > Rotation{ 1, 0, 0, 1 };
  std::array< float, 4 > SnappedRotation{ 1, 0, 0, 1 };
  double RotatedWidth = 0.0; ///< bounding box of the image as it stands on screen
  double RotatedHeight = 0.0;
  double RotatedAspect = 1.0;
  QRect Rect;     ///< device pixels, y up
  QRect Viewport; ///< the same
  float ScaleX = 1.0f;
  float ScaleY = 1.0f;
  float Zoom = 0.9f;
  float PanX = 0.5f; ///< centre of the view in the image, 0 to 1
  float PanY = 0.5f;

  friend bool operator==( const VCameraTile&, const VCameraTile& ) = default;
};

using VCameraTiles = std::vector< VCameraTile >;

/// The tiles as they were when a frame began: made anew when something changed, never changed themselves, so that
/// the hand may go on moving tiles while a frame is drawn from them.
using VCameraTilesRef = std::shared_ptr< const VCameraTiles >;

/// Gives the context the tile's view, viewport and scissor, and unit matrices: what draws the camera's image knows its
/// projection.
void ApplyTile( const VCameraTile& i_rTile, CoreGraphics::VRenderContext& io_rContext );
/// The first tile that holds the point, in pixels of the frame, y up; -1 when there is none.
int TileAt( const VCameraTiles& i_rTiles, QPoint i_Point );
/// The same for a pointer, in pixels from the top left of the frame.
int TileUnder( const VCameraTiles& i_rTiles, QSize i_Frame, QPoint i_Point );

} // namespace MoxelGraphics
