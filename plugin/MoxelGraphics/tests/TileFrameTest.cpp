#include "FrameFixture.h"
#include "TileFixture.h"

#include <HostServices/VRenderResources.h>

namespace MoxelGraphics
{
namespace
{
/// Frames of four cameras, each with a dot of an id of its own at the same place of its image.
class VTileFrame : public VSceneTest< VDotScene >
{
protected:
  VTileFrame()
  {
    Grid.Resize( Size, 1.0f );
    Grid.SetCameras( TestCameras( 4 ) );
    for ( std::uint32_t Index = 0; Index < 4; ++Index )
    {
      Dots()[std::to_string( Index )] = { { 0.25f, 0.75f, 10 + Index } };
    }
    Options().CameraView = true;
    Show3D( false );
  }
  void Show3D( bool i_bShow ) { Options().Show3DOverlay = i_bShow; }
  QImage DrawTiles()
  {
    Input().Tiles = Grid.Snapshot();
    pScene->pDots->Seen.clear();
    return Draw();
  }
  std::map< std::string, std::vector< VTestDot > >& Dots() { return pScene->pDots->Dots; }
  const VCameraTile& Tile( int i_Index ) const { return Grid.Tiles().at( static_cast< std::size_t >( i_Index ) ); }
  /// Where the dot of a camera stands, in pixels from the top left.
  QPoint Place( int i_Index, std::size_t i_Dot = 0 )
  {
    const VCameraTile& rTile = Tile( i_Index );
    const QVector4D View( rTile.ScaleX * rTile.Zoom, rTile.ScaleY * rTile.Zoom, rTile.PanX, rTile.PanY );
    const QPoint Up = VTestDots::Place( Dots()[std::to_string( i_Index )].at( i_Dot ), View, rTile.Viewport );
    return { Up.x(), Size.height() - 1 - Up.y() };
  }
  /// Puts the middle of a tile's view on a place of its image.
  void Look( int i_Index, double i_Zoom, double i_X, double i_Y )
  {
    Grid.RestoreViews(
        { { QString::number( i_Index ), QVariantMap{ { "zoom", i_Zoom }, { "panX", i_X }, { "panY", i_Y } } } } );
    Input().Tiles = Grid.Snapshot();
  }

  VCameraGrid Grid{ false };
};
} // namespace

TEST_F( VTileFrame, EveryTileIsDrawnForItselfAndEndedOnce )
{
  const QImage Image = DrawTiles();
  const auto& rSeen = pScene->pDots->Seen;
  ASSERT_EQ( rSeen.size(), 5u ) << "without marks there is no highlight mask to draw";
  for ( int Index = 0; Index < 4; ++Index )
  {
    EXPECT_EQ( rSeen[static_cast< std::size_t >( Index )].URN, std::to_string( Index ) );
    EXPECT_EQ( rSeen[static_cast< std::size_t >( Index )].Scissor, Tile( Index ).Rect );
    EXPECT_EQ( qRed( Image.pixel( Place( Index ) ) ), 10 + Index );
    EXPECT_EQ( qRed( Image.pixel( Place( Index ) + QPoint( 7, 0 ) ) ), 0x20 );
  }
  EXPECT_EQ( rSeen[4].Viewport, QRect( QPoint(), Size ) );
  EXPECT_EQ( rSeen[4].Scissor, QRect( QPoint(), Size ) );

  // Painters keep to their tiles, and see each camera once and then the whole frame.
  pScene->pDots->bPaints = true;
  const QImage Painted = DrawTiles();
  const auto& rPainted = pScene->pDots->Painted;
  ASSERT_EQ( rPainted.size(), 5u );
  EXPECT_EQ( rPainted[4].URN, "" );
  for ( int Index = 0; Index < 4; ++Index )
  {
    EXPECT_EQ( rPainted[static_cast< std::size_t >( Index )].Viewport, Tile( Index ).Viewport );
    EXPECT_EQ( qGreen( Painted.pixel( Place( Index ) ) ), 40 * ( Index + 1 ) );
  }
  // Nothing to show is shown as nothing.
  pScene->pDots->bPaints = false;
  Grid.SetCameras( {} );
  EXPECT_EQ( DrawTiles().pixel( 100, 100 ), Background );
  Grid.SetCameras( TestCameras( 700 ) );
  Grid.Resize( { 3, 3 }, 1.0f );
  DrawTiles();
  EXPECT_EQ( pScene->pDots->Seen.size(), 1u ) << "cells without pixels";
}

TEST_F( VTileFrame, TilesAreGoneThroughAgainOnlyWhereSomethingChanged )
{
  const auto pResources = std::make_shared< HostServices::VRenderResources >();
  Show( std::make_shared< VDotScene >( pResources ) );
  Dots()["1"] = { { 0.25f, 0.75f, 11 } };
  Options().CameraView = true;
  Show3D( false );
  const auto Walked = [&]
  {
    DrawTiles();
    return pScene->pDots->Seen.size() == 5;
  };
  EXPECT_TRUE( Walked() );
  EXPECT_FALSE( Walked() );
  // Sources are read again, whichever view of the scene meets that first.
  VSceneFrame Other( pScene, std::make_shared< CoreGraphics::VCameraController >() );
  for ( const bool bOther : { false, true } )
  {
    pResources->Reload();
    if ( bOther )
    {
      Other.Resize( Size );
      Offscreen.Draw( Other, Size );
    }
    EXPECT_TRUE( Walked() ) << bOther;
    EXPECT_FALSE( Walked() );
  }
  Look( 1, 2.0, 0.5, 0.5 );
  EXPECT_TRUE( Walked() );
}

TEST_F( VTileFrame, AClickFindsWhatItsTileShowsThere )
{
  Input().Tiles = Grid.Snapshot();
  for ( int Index = 0; Index < 4; ++Index )
  {
    EXPECT_EQ( Pick( Place( Index ) ), VIds{ 10u + static_cast< std::uint32_t >( Index ) } );
    EXPECT_EQ( Pick( Place( Index ) + QPoint( 4, -4 ) ).size(), 1u );
    EXPECT_TRUE( Pick( Place( Index ) + QPoint( 0, 14 ) ).empty() );
  }
  EXPECT_TRUE( pScene->pDots->Seen.size() > 0 );
  // Zoomed, until the dot of the first tile would lie over the second: it is neither seen nor found there, though
  // the window of a pick reaches across.
  Look( 0, 4.0, 0.0, 0.75 );
  const QRect First = Tile( 0 ).Rect;
  const QPoint Across = Place( 0 );
  ASSERT_GT( Across.x(), First.x() + First.width() + 6 );
  EXPECT_EQ( DrawTiles().pixel( Across ), Background );
  EXPECT_TRUE( Pick( Across ).empty() );
  Look( 0, 1.0, 0.0, 0.75 );
  const double Border = 0.25 - 0.5 / static_cast< double >( Tile( 0 ).ScaleX );
  Look( 0, 1.0, Border, 0.75 );
  const QPoint Edge = Place( 0 );
  EXPECT_EQ( Pick( Edge - QPoint( 3, 0 ) ), VIds{ 10 } );
  EXPECT_TRUE( Pick( { First.x() + First.width() + 1, Edge.y() } ).empty() ) << "the neighbour has nothing there";
  EXPECT_TRUE( Pick( { -20, 20 } ).empty() );
  // The world of the free view is not to be picked through the tiles.
  Options().Show3DOverlay = true;
  Grid.SetCameras( {} );
  Input().Tiles = nullptr;
  pScene->Change( { { 0, 0, 0, 7 } } );
  EXPECT_TRUE( Pick( { 320, 180 } ).empty() );
}

TEST_F( VTileFrame, ABandStaysInItsTile )
{
  // Layers: another dot behind the first.
  Dots()["1"] = { { 0.25f, 0.75f, 11 }, { 0.26f, 0.75f, 21 }, { 0.8f, 0.2f, 31 } };
  Input().Tiles = Grid.Snapshot();
  const QPoint First = Place( 0 ), Second = Place( 1 );
  EXPECT_EQ( Band( Second - QPoint( 20, 20 ), Second + QPoint( 20, 20 ) ), ( VIds{ 11, 21, 111, 121 } ) );
  EXPECT_GT( pFrame->Result().Layers, 1 );
  for ( const auto& rSeen : pScene->pDots->Seen )
  {
    EXPECT_TRUE( rSeen.Mode != ERenderModeSelection || rSeen.URN == "1" || rSeen.URN.empty() );
  }
  // From one tile into another: only what the pointer's tile holds.
  EXPECT_EQ( Band( First - QPoint( 20, 20 ), Second + QPoint( 20, 20 ) ), ( VIds{ 11, 21, 111, 121 } ) );
  EXPECT_EQ( Band( Second + QPoint( 20, 20 ), First - QPoint( 20, 20 ) ), ( VIds{ 10, 110 } ) );
  EXPECT_EQ( Band( { Second.x(), 0 }, { Size.width() + 50, Size.height() + 50 } ),
             ( VIds{ 11, 21, 31, 111, 121, 131 } ) )
      << "off all tiles, the one where it began";
  EXPECT_TRUE( Band( { -50, -50 }, { -10, -10 } ).empty() );
  // The picture is whole again.
  Input().PickMode = EPickNone;
  EXPECT_EQ( qRed( DrawTiles().pixel( Place( 3 ) ) ), 13 );
}

} // namespace MoxelGraphics
