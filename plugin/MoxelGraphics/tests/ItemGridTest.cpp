#include "ItemFixture.h"
#include "TileFixture.h"

#include <MoxelGraphics/VCameraGridSelection.h>

#include <TestSupport/LogGuard.h>

// Runs at other pixel ratios too.

namespace MoxelGraphics
{
namespace
{
QRectF RectOf( const QVariant& i_rTile )
{
  const QVariantList Numbers = i_rTile.toMap()["rect"].toList();
  return { Numbers[0].toDouble(), Numbers[1].toDouble(), Numbers[2].toDouble(), Numbers[3].toDouble() };
}

double Zoom( const QVariantList& i_rTiles, int i_Index )
{
  return i_rTiles[i_Index].toMap()["zoom"].toDouble();
}
} // namespace

/// A window that shows four cameras, with the selection and the grid in their loop.
class VItemTestGrid : public VItemTest
{
protected:
  VItemTestGrid()
    : VItemTest( std::make_shared< VDotScene >() )
    , pGrid( std::make_shared< VCameraGrid >( false ) )
    , pLoop( std::make_unique< VCameraGridSelection >( pGrid, pScene->pSelection, nullptr ) )
  {
    pScene->SetCameraDefinitions( TestCameras( 4 ) );
    pItem->SetCameraGrid( pGrid.get() );
    pItem->setOption( "CameraShowRotated", false );
    pItem->setOption( "CameraView", true );
    Frames( 2 );
    EXPECT_TRUE( Shows( 4 ) );
  }
  QVariantList Tiles()
  {
    Frames( 2 );
    return pItem->frameReport()["tiles"].toList();
  }
  bool Shows( int i_Count )
  {
    return Until(
        [&]
        {
          pItem->update();
          return pItem->frameReport()["tiles"].toList().size() == i_Count;
        } );
  }
  void DoubleClick( QPointF i_Place )
  {
    Click( i_Place );
    pWidget->Press( i_Place );
    pWidget->Mouse( QEvent::MouseButtonDblClick, i_Place, Qt::LeftButton, Qt::LeftButton );
    pWidget->Release( i_Place );
  }

  std::shared_ptr< VCameraGrid > pGrid;
  std::unique_ptr< VCameraGridSelection > pLoop;
};

TEST_F( VItemTestGrid, TheFrameShowsTheTilesThatTheGridHas )
{
  const double Ratio = pWidget->devicePixelRatioF();
  const QVariantList Shown = Tiles();
  EXPECT_EQ( pGrid->FrameSize(), Size * Ratio );
  EXPECT_EQ( pItem->frameReport()["gl"].toMap()["samples"].toInt(), 0 );
  EXPECT_EQ( pItem->frameReport()["gl"].toMap()["width"].toInt(), pGrid->FrameSize().width() );
  for ( int Index = 0; Index < 4; ++Index )
  {
    const QVariantMap Tile = Shown[Index].toMap();
    EXPECT_EQ( Tile["urn"], QString::number( Index ) );
    EXPECT_EQ( RectOf( Tile ), pGrid->data( pGrid->index( Index ), VCameraGrid::TileRect ).toRectF() );
    EXPECT_NEAR( RectOf( Tile ).width() * Ratio, Tile["viewport"].toList()[2].toDouble(), 1e-9 );
    const VCameraTile& rTile = pGrid->Tiles()[static_cast< std::size_t >( Index )];
    EXPECT_EQ( Tile["view2d"].toList()[0].toFloat(), rTile.ScaleX * rTile.Zoom );
    EXPECT_EQ( Tile["pan"].toList()[1].toFloat(), 0.5f );
  }
  EXPECT_EQ( RectOf( Shown[0] ).topLeft(), QPointF( 0, 0 ) );

  // The settings that turn images, the item's size, and the scene's cameras reach the grid.
  const float Upright = pGrid->Tiles()[0].ScaleX;
  pItem->setOption( "CameraShowRotated", true );
  EXPECT_NE( pGrid->Tiles()[0].ScaleX, Upright );
  pItem->setSize( { 300, 201 } );
  EXPECT_EQ( pGrid->FrameSize(), QSize( 300, 201 ) * Ratio );
  pScene->SetCameraDefinitions( TestCameras( 5 ) );
  EXPECT_TRUE( Shows( 5 ) );
  EXPECT_EQ( pItem->frameReport()["gl"].toMap()["height"].toInt(), pGrid->FrameSize().height() );
  // A preview is one camera.
  pItem->SetPreviewCamera( "2" );
  EXPECT_TRUE( Shows( 1 ) );
  EXPECT_EQ( Tiles()[0].toMap()["urn"], "2" );
  pItem->SetPreviewCamera( {} );
  EXPECT_EQ( Tiles().size(), 1 );
  // Back in the free view nothing is left of the tiles.
  pItem->setOption( "CameraView", false );
  EXPECT_TRUE( Shows( 0 ) );
  EXPECT_GT( pItem->frameReport()["gl"].toMap()["samples"].toInt(), 0 );
  QObject Stranger;
  TestSupport::ExpectFailureLine( "The camera grid of a view must be a VCameraGrid" );
  pItem->SetCameraGrid( &Stranger );
  EXPECT_EQ( pItem->CameraGrid(), pGrid.get() );
  pLoop.reset();
  pGrid.reset();
  EXPECT_EQ( pItem->CameraGrid(), nullptr );
  pItem->setOption( "CameraView", true );
  Frames( 3 );
}

TEST_F( VItemTestGrid, MouseAndKeysWorkOnTheTiles )
{
  const float Azimuth = Camera().azimuth;
  const QPointF In1 = RectOf( Tiles()[1] ).center();
  pWidget->Press( In1 );
  pWidget->Drag( In1 + QPointF( 32, 9 ) );
  pWidget->Release( In1 + QPointF( 32, 9 ) );
  EXPECT_FALSE( pItem->IsPickPending() );
  const QVariantList Panned = Tiles();
  EXPECT_EQ( Panned[0].toMap()["pan"].toList()[0].toDouble(), 0.5 );
  const double Across = Panned[1].toMap()["view2d"].toList()[0].toDouble() * RectOf( Panned[1] ).width();
  EXPECT_NEAR( Panned[1].toMap()["pan"].toList()[0].toDouble(), 0.5 - 32 / Across, 1e-5 );
  // A gesture that is taken away leaves no trace in the next one.
  pWidget->Press( In1 );
  pItem->ungrabMouse();
  pWidget->Drag( In1 + QPointF( 90, 90 ) );
  EXPECT_EQ( Tiles(), Panned );
  pWidget->Mouse( QEvent::MouseButtonPress, In1, Qt::RightButton, Qt::RightButton );
  pWidget->Mouse( QEvent::MouseMove, In1 - QPointF( 0, 50 ), Qt::NoButton, Qt::RightButton );
  pWidget->Mouse( QEvent::MouseButtonRelease, In1 - QPointF( 0, 50 ), Qt::RightButton );
  EXPECT_NEAR( Zoom( Tiles(), 1 ), 0.9 * ( 1 + 0.5 * pWidget->devicePixelRatioF() ), 1e-5 );
  pWidget->Wheel( 120 ); // at (150, 200)
  EXPECT_NEAR( Zoom( Tiles(), 2 ), 0.99, 1e-5 );
  pItem->forceActiveFocus();
  EXPECT_FALSE( Key( Qt::Key_F7 ) );
  EXPECT_TRUE( Key( Qt::Key_Home ) );
  EXPECT_NEAR( Zoom( Tiles(), 2 ), 0.9, 1e-6 );
  EXPECT_EQ( Camera().azimuth, Azimuth ) << "the free camera has no part in it";
}

TEST_F( VItemTestGrid, ADoubleClickShowsOneCameraAndTheNextAll )
{
  const ZEK::VSelectionItem Third{ ZEK::ESelectDevice, "3", 0, 0 };
  DoubleClick( RectOf( Tiles()[3] ).center() );
  EXPECT_TRUE( Shows( 1 ) );
  EXPECT_EQ( Tiles()[0].toMap()["urn"], "3" );
  EXPECT_EQ( pWidget->Selected(), ZEK::VSelection{ Third } );
  // What is picked in the image, or missed there, leaves the camera shown.
  Click( { 320, 180 } );
  EXPECT_EQ( pWidget->Selected(), ZEK::VSelection{ Third } );
  EXPECT_TRUE( pItem->PreviewCamera().isEmpty() );
  DoubleClick( { 320, 180 } );
  EXPECT_TRUE( Shows( 4 ) );
  EXPECT_TRUE( pWidget->Selected().empty() );
}

} // namespace MoxelGraphics
