#include "GridFixture.h"

#include <MoxelGraphics/VCameraGridSelection.h>

#include <HostServices/VSelectionService.h>

#include <QtCore/QJsonDocument>
#include <QtCore/QJsonObject>

#include <random>

namespace MoxelGraphics
{

TEST_F( VGridTest, WhatStaysKeepsItsViewAndWhatChangedIsReported )
{
  pGrid->Resize( { 800, 300 }, 1.0f );
  pGrid->SetCameras( Cameras( { "a", "b" } ) );
  EXPECT_EQ( Resets, 1 );
  Wheel( { 100, 100 }, 120 );
  Reported.clear();
  pGrid->SetCameras( Cameras( { "a", "b" } ) );
  EXPECT_TRUE( Reported.empty() );
  auto Renamed = Cameras( { "a", "b" } );
  Renamed[0].UserId = -1;
  pGrid->SetCameras( Renamed );
  EXPECT_EQ( Reported, VRoles{ ( QList< int >{ 261, 257, 259 } ) } );
  EXPECT_EQ( Resets, 1 );
  EXPECT_EQ( Data( 0, 257 ), "-1" );
  pGrid->SetCameras( Cameras( { "c", "a" } ) );
  EXPECT_EQ( Resets, 2 );
  EXPECT_EQ( Counts, 2 );
  EXPECT_FLOAT_EQ( Tile( 1 ).Zoom, 0.99f ) << "a camera keeps its view wherever it stands";
  EXPECT_EQ( Tile( 0 ).Zoom, 0.9f );
  pGrid->SetCameras( Cameras( { "c" } ) );
  pGrid->SetCameras( Cameras( { "c", "a" } ) );
  EXPECT_EQ( Tile( 1 ).Zoom, 0.9f ) << "one that leaves and returns starts anew";

  // Written as JSON and read by another grid before its cameras come.
  Wheel( { 100, 100 }, 120 );
  Drag( Qt::LeftButton, { 100, 100 }, { 130, 90 } );
  const VCameraTile Seen = Tile( 0 );
  const QByteArray Text = QJsonDocument( QJsonObject::fromVariantMap( pGrid->SaveViews() ) ).toJson();
  QVariantMap Views = QJsonDocument::fromJson( Text ).object().toVariantMap();
  EXPECT_EQ( Views.keys(), QStringList{ "c" } );
  Views["a"] = 5;
  Views["x"] = QVariantMap{ { "zoom", "wide" }, { "panX", 0 }, { "panY", 0 } };
  Views["y"] = QVariantMap{ { "zoom", 1e9 }, { "panX", 0.25 }, { "panY", 0.75 } };
  Show( false );
  pGrid->RestoreViews( Views );
  pGrid->Resize( { 800, 300 }, 1.0f );
  pGrid->SetCameras( Cameras( { "c", "a" } ) );
  EXPECT_EQ( Tile( 0 ), Seen );
  EXPECT_EQ( Tile( 1 ).Zoom, 0.9f );
  EXPECT_EQ( pGrid->SaveViews().keys(), ( QStringList{ "c", "y" } ) );
  pGrid->SetCameras( Cameras( { "y" } ) );
  EXPECT_EQ( Tile().Zoom, 2000.0f );
}

TEST_F( VGridTest, RolesTellOfACamera )
{
  pGrid->Resize( { 1200, 300 }, 1.0f );
  auto List = Cameras( { "a", "vi:b", "vf:b", "vi:", "", "a" } );
  List[1].bVideo = true;
  pGrid->SetCameras( List );
  EXPECT_EQ( URNs(), ( QStringList{ "a", "vi:b", "vf:b", "vi:" } ) );
  const QHash< int, QByteArray > Names = pGrid->roleNames();
  EXPECT_EQ( Names.size(), 10 );
  EXPECT_EQ( Names[257], "tileUserId" );
  EXPECT_EQ( Names[266], "tileAdditionalData" );
  EXPECT_EQ( Data( 0, 257 ), "7" );
  EXPECT_FALSE( Data( 0, 258 ).isValid() );
  EXPECT_EQ( Data( 0, 259 ), "type of a" );
  EXPECT_EQ( Data( 1, 260 ), "vi:b" );
  EXPECT_EQ( Data( 1, 262 ), true );
  const bool Inputs[] = { false, true, false, true }, Files[] = { false, false, true, false };
  for ( int Row = 0; Row < 4; ++Row )
  {
    EXPECT_EQ( Data( Row, 263 ), Inputs[Row] );
    EXPECT_EQ( Data( Row, 264 ), Files[Row] );
  }
  EXPECT_FALSE( Data( 4, 257 ).isValid() );
  EXPECT_FALSE( pGrid->data( {}, 257 ).isValid() );

  // The further values come from a source, and go with their cameras.
  struct VSource final : ICameraModelAdditionalDataSource
  {
    QVariantMap AdditionalData( const QString& i_rURN ) const override { return Values.value( i_rURN ); }
    ZEK::IMultiCallback< void() >& Changed() override { return Notifier; }
    QHash< QString, QVariantMap > Values;
    ZEK::VMultiCallback< void() > Notifier;
  };
  const auto pSource = std::make_shared< VSource >();
  pSource->Values["a"] = { { "isBumped", true } };
  pGrid->SetAdditionalDataSource( pSource, nullptr );
  EXPECT_EQ( Data( 0, 266 ).toMap(), pSource->Values["a"] );
  EXPECT_TRUE( Data( 1, 266 ).toMap().isEmpty() );
  Reported.clear();
  pSource->Notifier.Fire();
  EXPECT_TRUE( Reported.empty() );
  pSource->Values["vi:b"] = { { "isBumped", false } };
  pSource->Notifier.Fire();
  EXPECT_EQ( Reported, VRoles{ { 266 } } );
  pGrid->SetSelectionItems( { { ZEK::ESelectDevice, "b", 0, 0 }, { ZEK::ESelectSubject, "a", 0, 0 } } );
  EXPECT_FALSE( Data( 0, 265 ).isValid() );
  EXPECT_EQ( Data( 2, 265 ).toMap()["device"], "b" );
  Reported.clear();
  pGrid->SetCameras( Cameras( { "vi:b", "c" } ) );
  EXPECT_EQ( Reported.back(), ( QList< int >{ 265, 266 } ) );
  pGrid->SetCameras( Cameras( { "vi:b", "a" } ) );
  EXPECT_EQ( Data( 1, 266 ).toMap(), pSource->Values["a"] ) << "a camera that comes back is asked for again";
  pGrid.reset();
  pSource->Notifier.Fire();
}

TEST_F( VGridTest, SelectedCamerasAreShownUnlessOthersArePinned )
{
  const auto pService = std::make_shared< HostServices::VSelectionService >();
  const auto Select = [&]( const ZEK::VSelection& i_rItems )
  {
    pService->Set( ZEK::ISelectionService::EPrimary, i_rItems );
  };
  const ZEK::VSelectionItem B{ ZEK::ESelectDevice, "b", 0, 0 }, Plate{ ZEK::ESelectDevice, "plate", 0, 0 };
  const ZEK::VSelectionItem Point{ ZEK::ESelectReconstruction, {}, 0, 3 };
  const QStringList All{ "a", "b", "vi:b", "c" };
  pGrid->Resize( { 900, 900 }, 1.0f );
  VCameraGridSelection Loop( pGrid, pService, nullptr );
  Select( { B, Point } );
  EXPECT_EQ( URNs(), QStringList() );
  pGrid->SetCameras( Cameras( { "a", "b", "vi:b", "c" } ) );
  EXPECT_EQ( URNs(), ( QStringList{ "b", "vi:b" } ) ) << "cameras come after their selection";
  EXPECT_TRUE( Data( 1, 265 ).isValid() );
  Select( { Plate } );
  EXPECT_EQ( URNs(), All ) << "what is no camera hides none";
  Select( { Point } );
  EXPECT_EQ( URNs(), All );

  const auto DoubleClickOn = [&]( const QString& i_rURN )
  {
    const QRectF Rect = Data( static_cast< int >( URNs().indexOf( i_rURN ) ), 261 ).toRectF();
    Mouse( QEvent::MouseButtonDblClick, Rect.center(), Qt::LeftButton );
  };
  DoubleClickOn( "c" );
  EXPECT_EQ( URNs(), QStringList{ "c" } );
  EXPECT_EQ( pService->Get( ZEK::ISelectionService::EPrimary ),
             ( ZEK::VSelection{ Point, { ZEK::ESelectDevice, "c", 0, 0 } } ) );
  DoubleClickOn( "c" );
  EXPECT_EQ( URNs(), All );
  EXPECT_EQ( pService->Get( ZEK::ISelectionService::EPrimary ), ZEK::VSelection{ Point } );
  DoubleClickOn( "b" );
  DoubleClickOn( "vi:b" );
  EXPECT_EQ( URNs(), All ) << "a device and its video are one";
  pGrid->SetShownCameras( { "a" } );
  DoubleClickOn( "a" );
  EXPECT_EQ( URNs(), All ) << "what was shown without a selection";
  EXPECT_EQ( Requested,
             ( std::vector< QStringList >{ { "c" }, QStringList(), { "b" }, QStringList(), QStringList() } ) );
  Mouse( QEvent::MouseButtonDblClick, { 2000, 5 }, Qt::LeftButton );
  EXPECT_EQ( Requested.size(), 5u );

  Select( { B } );
  pGrid->PinTiles( true );
  Select( {} );
  VCameraGrid::VURNs Pinned;
  QStringList Tiles;
  EXPECT_TRUE( pGrid->GetPinnedCameras( Pinned, Tiles ) );
  EXPECT_EQ( Pinned, ( VCameraGrid::VURNs{ "b", "vi:b" } ) );
  EXPECT_EQ( Tiles, ( QStringList{ "b", "vi:b" } ) );
  pGrid->PinTiles( false );
  EXPECT_FALSE( pGrid->GetPinnedCameras( Pinned, Tiles ) );
  EXPECT_TRUE( Pinned.isEmpty() );
  EXPECT_EQ( Tiles, All );
  const int Before = Resets;
  pGrid->SetShownCameras( {} );
  EXPECT_EQ( Resets, Before );
}

TEST( CameraOrder, OpticalCamerasByNumberThenVideo )
{
  std::vector< VCameraDefinition > List = Cameras( { "z", "a", "b", "v", "w" } );
  List[0].UserId = 1;
  List[1].UserId = List[2].UserId = -1;
  List[3].bVideo = List[4].bVideo = true;
  List[4].UserId = 0;
  std::shuffle( List.begin(), List.end(), std::mt19937( 3 ) );
  std::sort( List.begin(), List.end(), StandsBefore );
  std::string Order;
  for ( const VCameraDefinition& rCamera : List )
  {
    Order += rCamera.DeviceURN;
  }
  EXPECT_EQ( Order, "zabwv" );
}

} // namespace MoxelGraphics
