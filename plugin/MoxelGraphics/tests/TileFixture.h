#pragma once

#include "TestScene.h"

#include <MoxelGraphics/VCameraGrid.h>

#include <QtGui/QPainter>

#include <map>

namespace MoxelGraphics
{

/// A dot of a camera's image, in parts of the image's width and height.
struct VTestDot
{
  float U, V;
  std::uint32_t Id;
};

/// Cameras with dots: collected tile by tile, drawn for all tiles at once, a square of 9 pixels each.
class VTestDots final : public IRenderType
{
public:
  struct VSeen
  {
    std::string URN; ///< empty: the end of the tiles
    QRect Viewport, Scissor;
    int Mode;
  };

  static QPoint Place( const VTestDot& i_rDot, const QVector4D& i_rView, const QRect& i_rViewport )
  {
    const float X = i_rView.x() * ( i_rDot.U - i_rView.z() ), Y = -i_rView.y() * ( i_rDot.V - i_rView.w() );
    return { static_cast< int >( std::floor( i_rViewport.x() + i_rViewport.width() * ( 0.5f + X ) ) ),
             static_cast< int >( std::floor( i_rViewport.y() + i_rViewport.height() * ( 0.5f + Y ) ) ) };
  }
  explicit VTestDots( const VMoxelScene& i_rScene )
    : m_rScene( i_rScene )
  {
  }
  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override
  {
    if ( i_Pass != ERenderPassOverlay || !i_rOptions.CameraView )
    {
      return;
    }
    Seen.push_back( { i_rOptions.OverlayCamera.toStdString(), io_rContext.Viewport(), io_rContext.Scissor(),
                      io_rContext.RenderMode() } );
    for ( const VTestDot& rDot : Dots[i_rOptions.OverlayCamera.toStdString()] )
    {
      const QPoint Middle = Place( rDot, io_rContext.View2D(), io_rContext.Viewport() );
      if ( !m_rScene.IgnoreId( rDot.Id, io_rContext.RenderMode() ) )
      {
        m_Collected.push_back(
            { QRect( Middle - QPoint( 4, 4 ), QSize( 9, 9 ) ).intersected( io_rContext.Scissor() ), rDot.Id } );
      }
    }
  }
  void RenderTiles( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions ) override
  {
    EXPECT_TRUE( i_rOptions.OverlayCamera.isEmpty() );
    Seen.push_back( { {}, io_rContext.Viewport(), io_rContext.Scissor(), io_rContext.RenderMode() } );
    if ( !m_rScene.TilesAgain() )
    {
      m_Last = std::exchange( m_Collected, {} );
    }
    for ( const auto& [Rect, Id] : m_Last )
    {
      const QRect Part = Rect.intersected( io_rContext.Scissor() );
      if ( !Part.isEmpty() )
      {
        Fill( io_rContext, Part, QColor( static_cast< int >( Id ), 0, 0, 255 ) );
      }
    }
  }
  /// Dots in the middle of which the band lies, drawn or not.
  void PickInRect( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, const QRect& i_rRect,
                   std::vector< std::uint32_t >& io_rIds ) override
  {
    for ( const VTestDot& rDot : Dots[i_rOptions.OverlayCamera.toStdString()] )
    {
      if ( i_rRect.contains( Place( rDot, io_rContext.View2D(), io_rContext.Viewport() ) ) )
      {
        io_rIds.push_back( rDot.Id + 100 );
      }
    }
  }
  bool WantsPaint( const VSceneOptions& ) const override { return bPaints; }
  void Paint( QPainter& io_rPainter, CoreGraphics::VRenderContext& io_rContext,
              const VSceneOptions& i_rOptions ) override
  {
    Painted.push_back( { i_rOptions.OverlayCamera.toStdString(), io_rContext.Viewport(), {}, 0 } );
    if ( !i_rOptions.OverlayCamera.isEmpty() )
    {
      // More than its tile: the painter keeps it there.
      io_rPainter.fillRect( QRect( -1000, -1000, 4000, 4000 ), QColor( 0, 40 * ++m_Shade, 0 ) );
    }
  }

  std::map< std::string, std::vector< VTestDot > > Dots;
  std::vector< VSeen > Seen;
  std::vector< VSeen > Painted;
  bool bPaints = false;

private:
  const VMoxelScene& m_rScene;
  std::vector< std::pair< QRect, std::uint32_t > > m_Collected, m_Last;
  int m_Shade = 0;
};

/// A scene whose cameras have dots.
class VDotScene final : public VTestScene
{
public:
  using VTestScene::VTestScene;
  void Initialise( CoreGraphics::VRenderContext& io_rContext ) override
  {
    const bool bFirst = m_RenderList.empty();
    VTestScene::Initialise( io_rContext );
    if ( bFirst )
    {
      m_RenderList.push_back( pDots );
    }
  }
  const std::shared_ptr< VTestDots > pDots = std::make_shared< VTestDots >( *this );
};

/// Cameras "0", "1", ... of 640 by 480 pixels.
inline std::vector< VCameraDefinition > TestCameras( int i_Count )
{
  std::vector< VCameraDefinition > Cameras( static_cast< std::size_t >( i_Count ) );
  for ( int Index = 0; Index < i_Count; ++Index )
  {
    VCameraDefinition& rCamera = Cameras[static_cast< std::size_t >( Index )];
    rCamera.DeviceURN = std::to_string( Index );
    rCamera.UserId = Index;
    rCamera.ImageWidth = 640;
    rCamera.ImageHeight = 480;
    rCamera.SnappedRotation = { 0, 1, -1, 0 };
  }
  return Cameras;
}

} // namespace MoxelGraphics
