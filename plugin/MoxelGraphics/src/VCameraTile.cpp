#include <MoxelGraphics/VCameraTile.h>

#include <CoreGraphics/VRenderContext.h>

#include <algorithm>

namespace MoxelGraphics
{

void ApplyTile( const VCameraTile& i_rTile, CoreGraphics::VRenderContext& io_rContext )
{
  io_rContext.SetView2D(
      QVector4D( i_rTile.ScaleX * i_rTile.Zoom, i_rTile.ScaleY * i_rTile.Zoom, i_rTile.PanX, i_rTile.PanY ) );
  io_rContext.SetProjection( {} );
  io_rContext.SetView( {} );
  io_rContext.SetViewport( i_rTile.Viewport );
  io_rContext.SetScissor( i_rTile.Rect );
}

int TileAt( const VCameraTiles& i_rTiles, QPoint i_Point )
{
  const auto Found = std::find_if( i_rTiles.begin(), i_rTiles.end(),
                                   [i_Point]( const VCameraTile& i_rTile )
                                   {
                                     return i_rTile.Rect.contains( i_Point );
                                   } );
  return Found == i_rTiles.end() ? -1 : static_cast< int >( Found - i_rTiles.begin() );
}

int TileUnder( const VCameraTiles& i_rTiles, QSize i_Frame, QPoint i_Point )
{
  // A pointer at the very edge is rounded out of the frame.
  const QPoint Inside( i_Point.x() == i_Frame.width() ? i_Point.x() - 1 : i_Point.x(),
                       i_Point.y() == i_Frame.height() ? i_Point.y() - 1 : i_Point.y() );
  return i_Frame.isEmpty() ? -1 : TileAt( i_rTiles, { Inside.x(), i_Frame.height() - 1 - Inside.y() } );
}

} // namespace MoxelGraphics
