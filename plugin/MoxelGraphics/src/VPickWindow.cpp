#include "VPickWindow.h"

#include "VSphereBatchGl.h"

#include <CoreGraphics/VRenderContext.h>

namespace MoxelGraphics
{
namespace
{
QVector4D Normalised( const QVector4D& i_rPlane )
{
  const float Length = i_rPlane.toVector3D().length();
  return Length > 0 ? i_rPlane / Length : i_rPlane;
}
} // namespace

VPickWindow::VPickWindow( CoreGraphics::VRenderContext& io_rContext )
  : m_PixelsAtOne( MoxelGraphics::PixelsAtOne( io_rContext ) )
{
  const QMatrix4x4& rMatrix = io_rContext.ViewProjection();
  const QRect Viewport = io_rContext.Viewport();
  // A pixel more on each side, for what rounds into the window.
  const QRect Window = io_rContext.Scissor().adjusted( -1, -1, 1, 1 ).translated( -Viewport.topLeft() );
  m_Depth = rMatrix.row( 3 );
  const auto Edge = [&]( int i_Axis, int i_Pixel, int i_Extent )
  {
    const float Place = 2.0f * static_cast< float >( i_Pixel ) / static_cast< float >( std::max( i_Extent, 1 ) ) - 1.0f;
    return rMatrix.row( i_Axis ) - Place * m_Depth;
  };
  m_Planes = { Normalised( Edge( 0, Window.left(), Viewport.width() ) ),
               Normalised( -Edge( 0, Window.left() + Window.width(), Viewport.width() ) ),
               Normalised( Edge( 1, Window.top(), Viewport.height() ) ),
               Normalised( -Edge( 1, Window.top() + Window.height(), Viewport.height() ) ) };
  m_Smallest = m_PixelsAtOne > 0 ? SmallestPixels / m_PixelsAtOne : 0.0f;
}

} // namespace MoxelGraphics
