#include "GridFixture.h"

#include <cmath>
#include <random>
#include <set>

namespace MoxelGraphics
{
namespace
{
/// Rows of the layout with the greatest score, worked out the long way.
int BestRows( const VCameraTiles& i_rTiles, int i_Width, int i_Height )
{
  const int Count = static_cast< int >( i_rTiles.size() );
  double Best = 0;
  int Rows = 1;
  for ( int Try = 1; Try <= Count; ++Try )
  {
    const int Columns = static_cast< int >( std::ceil( static_cast< double >( Count ) / Try ) );
    std::set< int > Used;
    for ( int Index = 0; Index < Count; ++Index )
    {
      Used.insert( Index / Columns );
    }
    const int W = i_Width / Columns, H = i_Height / Try;
    if ( static_cast< int >( Used.size() ) < Try || W == 0 || H == 0 )
    {
      continue;
    }
    double Score = 0;
    for ( const VCameraTile& rTile : i_rTiles )
    {
      const double A = static_cast< double >( W ) / H, B = rTile.RotatedAspect;
      Score += std::min( A, B ) / std::max( A, B );
    }
    Score /= Columns * Try;
    Rows = Score > Best ? Try : Rows;
    Best = std::max( Best, Score );
  }
  return Rows;
}

/// All of the image is seen, as large as that allows, and nothing of it is stretched.
void ExpectFit( const VCameraTile& i_rTile, double i_W, double i_H, const std::array< float, 4 >& i_rTurn )
{
  const double PixelX = i_W * i_rTile.ScaleX / i_rTile.ImageWidth, PixelY = i_H * i_rTile.ScaleY / i_rTile.ImageHeight;
  EXPECT_NEAR( PixelX / PixelY, 1.0, 1e-4 );
  double Left = 0, Right = 0, Bottom = 0, Top = 0;
  for ( const auto& [X, Y] : { std::pair( 0, 0 ), { 1, 0 }, { 0, 1 }, { 1, 1 } } )
  {
    const double U = X * i_rTile.ImageWidth, V = Y * i_rTile.ImageHeight;
    const double Across = i_rTurn[0] * U + i_rTurn[1] * V, Down = i_rTurn[2] * U + i_rTurn[3] * V;
    Left = std::min( Left, Across ), Right = std::max( Right, Across );
    Bottom = std::min( Bottom, Down ), Top = std::max( Top, Down );
  }
  EXPECT_NEAR( std::max( ( Right - Left ) * PixelX / i_W, ( Top - Bottom ) * PixelY / i_H ), 1.0, 1e-4 );
}
} // namespace

TEST_F( VGridTest, LayoutsHaveTheBestScoreAndEveryTileItsPlace )
{
  const std::array< float, 4 > Upright{ 1, 0, 0, 1 }, Quarter{ 0, 1, -1, 0 }, Askew{ 0.8f, 0.6f, -0.6f, 0.8f };
  const QSize Sensors[] = { { 640, 480 }, { 2048, 1088 }, { 1024, 1024 } };
  std::mt19937 Random( 5 );
  const auto Below = [&]( unsigned i_End )
  {
    return static_cast< int >( Random() % i_End );
  };
  for ( std::size_t Count = 1; Count <= 64; ++Count )
  {
    std::vector< VCameraDefinition > List;
    const bool bMixed = Count % 2 == 0;
    for ( std::size_t Index = 0; Index < Count; ++Index )
    {
      const QSize& rSensor = Sensors[bMixed ? Below( 3 ) : static_cast< int >( Count % 3 )];
      List.push_back( Camera( std::to_string( Index ), rSensor.width(), rSensor.height() ) );
      List.back().Rotation = bMixed ? Askew : Upright;
      List.back().SnappedRotation = Below( 2 ) ? Quarter : Upright;
    }
    pGrid->SetCameras( List );
    for ( int Frame = 0; Frame < 12; ++Frame )
    {
      const bool bRotated = Below( 4 ) != 0, bSnapped = Below( 2 ) != 0;
      pGrid->SetRotation( bRotated, bSnapped );
      const int Width = 70 + Below( 2000 ), Height = 70 + Below( 1200 );
      pGrid->Resize( { Width, Height }, 1.0f );
      SCOPED_TRACE( testing::Message() << Count << " in " << Width << " by " << Height );
      const VCameraTiles& rTiles = pGrid->Tiles();
      const int Rows = BestRows( rTiles, Width, Height );
      const int Columns = ( static_cast< int >( Count ) + Rows - 1 ) / Rows;
      const int W = Width / Columns, H = Height / Rows;
      for ( int Index = 0; Index < static_cast< int >( Count ); ++Index )
      {
        const VCameraTile& rTile = rTiles[static_cast< std::size_t >( Index )];
        const VCameraDefinition& rCamera = List[static_cast< std::size_t >( Index )];
        const int Row = Rows - 1 - Index / Columns;
        ASSERT_EQ( rTile.Rect,
                   QRect( Index % Columns * W, Row * H, W, Row == Rows - 1 ? Height - ( Rows - 1 ) * H : H ) );
        ASSERT_EQ( rTile.Viewport, rTile.Rect );
        ExpectFit( rTile, W, H, !bRotated ? Upright : bSnapped ? rCamera.SnappedRotation : rCamera.Rotation );
      }
      if ( HasFailure() )
      {
        return;
      }
    }
  }
}

TEST_F( VGridTest, FramesThatCannotBePartedEvenlyAndThoseWithoutPixels )
{
  pGrid->SetCameras( Cameras( { "a", "b", "c", "d" } ) );
  pGrid->Resize( { 135, 101 }, 1.0f );
  EXPECT_EQ( Tile( 0 ).Rect, QRect( 0, 50, 67, 51 ) );
  EXPECT_EQ( Tile( 3 ).Rect, QRect( 67, 0, 67, 50 ) );
  EXPECT_EQ( pGrid->TileAt( { 134, 20 } ), -1 ) << "the last column is nobody's";
  EXPECT_EQ( pGrid->TileAt( { 0, 0 } ), 0 );
  EXPECT_EQ( pGrid->TileAt( { 66, 50 } ), 0 );
  EXPECT_EQ( pGrid->TileAt( { 67, 51 } ), 3 );
  EXPECT_EQ( pGrid->TileAt( { 0, 101 } ), 2 ) << "a pointer is rounded to the edge";
  EXPECT_EQ( pGrid->TileAt( { -1, 5 } ), -1 );
  EXPECT_EQ( Data( 2, VCameraGrid::TileRect ).toRectF(), QRectF( 0, 51, 67, 50 ) );
  pGrid->Resize( { 135, 101 }, 2.0f );
  EXPECT_EQ( Data( 2, VCameraGrid::TileRect ).toRectF(), QRectF( 0, 25.5, 33.5, 25 ) );

  const VCameraTiles Former = pGrid->Tiles();
  for ( const QSize& rSize : { QSize( 0, 50 ), QSize( 50, 0 ), QSize( -3, -3 ) } )
  {
    pGrid->Resize( rSize, std::numeric_limits< float >::quiet_NaN() );
    EXPECT_EQ( pGrid->Tiles(), Former );
    EXPECT_FALSE( pGrid->FrameSize().width() < 0 );
    Drag( Qt::LeftButton, { 0, 0 }, { 9, 9 } );
  }
  for ( const QSize& rSize : { QSize( 1, 1 ), QSize( 1, 900 ), QSize( 3, 1 ) } )
  {
    pGrid->Resize( rSize, 1.0f );
    for ( const VCameraTile& rTile : pGrid->Tiles() )
    {
      EXPECT_TRUE( QRect( QPoint(), rSize ).contains( rTile.Rect ) || rTile.Rect.isEmpty() );
      EXPECT_TRUE( std::isfinite( rTile.ScaleX ) && std::isfinite( rTile.ScaleY ) && rTile.ScaleX > 0 );
    }
    Drag( Qt::RightButton, { 0, 0 }, { 0, -5 } );
  }
  pGrid->SetCameras( { Camera( "none", 0, 0 ), Camera( "odd", -5, 100 ) } );
  pGrid->Resize( { 200, 100 }, 1.0f );
  EXPECT_EQ( Tile( 1 ).Rect, QRect( 100, 0, 100, 100 ) );
  EXPECT_EQ( Tile( 1 ).ScaleX, 1.0f );
  // Pixels of a shape that no sensor has are square.
  for ( const double Aspect : { 0.0, -2.0, 1e-300, 0.009, 101.0, 1e300, std::nan( "" ) } )
  {
    VCameraDefinition Definition = Camera( "a" );
    Definition.PixelAspect = Aspect;
    pGrid->SetCameras( { Definition } );
    EXPECT_EQ( Tile().PixelAspect, 1.0 ) << Aspect;
  }
  VCameraDefinition Wide = Camera( "a" );
  Wide.PixelAspect = 100;
  pGrid->SetCameras( { Wide } );
  EXPECT_EQ( Tile().PixelAspect, 100.0 );
}

TEST_F( VGridTest, OneCameraFillsTheFrameAndGivesItsAspect )
{
  Show( true );
  VCameraDefinition Turned = Camera( "a" );
  Turned.SnappedRotation = { 0, 1, -1, 0 };
  pGrid->SetCameras( { Turned } );
  pGrid->Resize( { 333, 222 }, 1.0f );
  EXPECT_EQ( Tile().Rect, QRect( 0, 0, 333, 222 ) );
  EXPECT_EQ( Tile().Zoom, 1.0f );
  EXPECT_FLOAT_EQ( pGrid->AspectRatio(), 4.0f / 3.0f );
  int Announced = 0;
  QObject::connect( pGrid.get(), &VCameraGrid::AspectRatioChanged,
                    [&]
                    {
                      ++Announced;
                    } );
  pGrid->SetRotation( true, true );
  EXPECT_FLOAT_EQ( pGrid->AspectRatio(), 0.75f );
  EXPECT_EQ( Announced, 1 );
  pGrid->SetCameras( Cameras( { "a", "b" } ) );
  EXPECT_EQ( pGrid->AspectRatio(), 1.0f );
}

TEST_F( VGridTest, TheHandZoomsAndPansWhatLiesUnderIt )
{
  pGrid->SetCameras( Cameras( { "a", "b", "c" } ) );
  pGrid->SetRotation( true, true );
  for ( const double Each : { 1.0, 1.5, 2.0 } )
  {
    Ratio = Each;
    pGrid->Resize( QSize( 900, 260 ) * Ratio, static_cast< float >( Ratio ) );
    for ( const QPointF Press : { QPointF( 310, 20 ), QPointF( 455, 131 ), QPointF( 590, 250 ) } )
    {
      SCOPED_TRACE( testing::Message() << Press.x() << " at " << Ratio );
      pGrid->ResetViews();
      const VCameraTile Other = Tile( 0 );
      const QPointF Pixel( std::round( Press.x() * Ratio ), std::round( Press.y() * Ratio ) );
      const auto Before = Under( Tile( 1 ), Pixel );
      Drag( Qt::RightButton, Press, Press + QPointF( 40, -100 ) );
      EXPECT_NEAR( Tile( 1 ).Zoom, 0.9 * ( 1 + 100 * Ratio * 0.01 ), 1e-5 );
      EXPECT_NEAR( Under( Tile( 1 ), Pixel )[0], Before[0], 1e-5 );
      EXPECT_NEAR( Under( Tile( 1 ), Pixel )[1], Before[1], 1e-5 );
      const float Zoomed = Tile( 1 ).Zoom;
      Drag( Qt::RightButton, Press, Press + QPointF( 90, 0 ) );
      EXPECT_EQ( Tile( 1 ).Zoom, Zoomed ) << "across is no zoom";
      // What was under the hand moves with it.
      const auto Held = Under( Tile( 1 ), Pixel );
      const QPointF Way( -33, 71 );
      Drag( Qt::LeftButton, Press, Press + Way );
      const auto Moved =
          Under( Tile( 1 ), { std::round( ( Press.x() - 33 ) * Ratio ), std::round( ( Press.y() + 71 ) * Ratio ) } );
      EXPECT_NEAR( Moved[0], Held[0], 1e-5 );
      EXPECT_NEAR( Moved[1], Held[1], 1e-5 );
      EXPECT_EQ( Tile( 1 ).Zoom, Zoomed );
      EXPECT_EQ( Tile( 0 ), Other );
    }
  }
}

TEST_F( VGridTest, ZoomHasItsLimitsAndGesturesTheirEnd )
{
  pGrid->SetCameras( Cameras( { "a", "b" } ) );
  pGrid->Resize( { 800, 300 }, 1.0f );
  const QPointF Place( 100, 100 );
  const auto pStill = pGrid->Snapshot();
  EXPECT_EQ( pGrid->Snapshot(), pStill );
  const float PanX = Tile().PanX;
  Wheel( Place, 120 );
  EXPECT_FLOAT_EQ( Tile().Zoom, 0.99f );
  EXPECT_EQ( pStill->front().Zoom, 0.9f ) << "what was handed out stays as it was";
  EXPECT_NE( pGrid->Snapshot(), pStill );
  for ( int Turn = 0; Turn < 120; ++Turn )
  {
    Wheel( Place, Turn < 100 ? 1 : 120 );
  }
  EXPECT_EQ( Tile().Zoom, 2000.0f );
  for ( int Turn = 0; Turn < 120; ++Turn )
  {
    Wheel( Place, Turn < 100 ? 0 : -120 );
  }
  EXPECT_EQ( Tile().Zoom, 0.5f );
  EXPECT_EQ( Tile().PanX, PanX );
  EXPECT_EQ( Tile( 1 ).Zoom, 0.9f );
  Drag( Qt::RightButton, Place, Place - QPointF( 0, 1e6 ) );
  EXPECT_EQ( Tile().Zoom, 2000.0f );
  Drag( Qt::RightButton, Place, Place + QPointF( 0, 1e6 ) );
  EXPECT_EQ( Tile().Zoom, 0.5f );

  // The middle button, a press off every tile, a button that was let go: nothing follows the pointer.
  const VCameraTiles Before = pGrid->Tiles();
  Drag( Qt::MiddleButton, Place, { 150, 150 } );
  Drag( Qt::LeftButton, { 900, 100 }, { 150, 150 } );
  Mouse( QEvent::MouseButtonPress, Place, Qt::LeftButton );
  pGrid->MouseRelease( QMouseEvent( QEvent::MouseButtonRelease, Place, Place, Qt::LeftButton, {}, {} ) );
  Mouse( QEvent::MouseMove, { 150, 150 }, Qt::LeftButton );
  EXPECT_EQ( pGrid->Tiles(), Before );
  EXPECT_FALSE( Key( Qt::Key_End ) );
  EXPECT_TRUE( Key( Qt::Key_Home ) );
  EXPECT_EQ( Tile().Zoom, 0.9f );
  EXPECT_EQ( Tile().PanX, 0.5f );
  // A camera leaves while it is dragged, and another one stands where it stood.
  Mouse( QEvent::MouseButtonPress, Place, Qt::LeftButton );
  Mouse( QEvent::MouseMove, { 110, 100 }, Qt::LeftButton );
  EXPECT_NE( Tile().PanX, 0.5f );
  pGrid->SetCameras( Cameras( { "b" } ) );
  Mouse( QEvent::MouseMove, { 190, 190 }, Qt::LeftButton );
  EXPECT_EQ( Tile().PanX, 0.5f );
  pGrid->SetCameras( {} );
  Mouse( QEvent::MouseMove, { 190, 190 }, Qt::LeftButton );
  EXPECT_FALSE( Key( Qt::Key_Home ) );
  EXPECT_EQ( pGrid->Snapshot(), nullptr );
}

} // namespace MoxelGraphics
