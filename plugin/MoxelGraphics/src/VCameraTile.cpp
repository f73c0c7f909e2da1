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

} // namespace MoxelGraphics
