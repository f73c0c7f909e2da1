#include "RenderCamerasTest.h"

#include <MoxelGraphics/CameraDistortion.h>
#include <MoxelGraphics/VCameraTile.h>
#include <TestSupport/Golden.h>

#include <QtGui/QPolygonF>

#include <random>

using namespace FlowTest;

namespace
{
constexpr int CellSize = 64;

/// What cameras show of themselves, four tiles in a frame.
class VCameraTiles : public VRenderCamerasFixture
{
protected:
  static constexpr QSize GridSize{ 640, 512 };
  static constexpr QSize TileSize{ 320, 256 };

  VCameraTiles()
  {
    AddRing( 4 );
    auto& rOptions = Grid.Frame().Input().Options;
    rOptions.CameraView = true;
    rOptions.Show3DOverlay = rOptions.Cameras = rOptions.FloorGrid = rOptions.GlobalAxis = rOptions.Video = false;
    auto pFour = std::make_shared< MoxelGraphics::VCameraTiles >();
    for ( int Index = 0; Index < 4; ++Index )
    {
      MoxelGraphics::VCameraTile& rTile = pFour->emplace_back();
      rTile.DeviceURN = QString::fromStdString( Name( static_cast< std::size_t >( Index ) ) );
      rTile.Rect = rTile.Viewport =
          QRect( QPoint( Index % 2 * TileSize.width(), ( 1 - Index / 2 ) * TileSize.height() ), TileSize );
    }
    Tiles( std::move( pFour ) );
  }
  void Tiles( std::shared_ptr< MoxelGraphics::VCameraTiles > i_pTiles )
  {
    pTiles = i_pTiles;
    Grid.Frame().Input().Tiles = std::move( i_pTiles );
  }
  MoxelGraphics::VSceneOptions& GridOptions() { return Grid.Frame().Input().Options; }

  template < typename TFlow >
  void Give( std::size_t i_Camera, const typename ZEK::FlowValueType< TFlow >::type& i_rValue )
  {
    Items.push_back( Maker.Device< TFlow >( i_rValue, Name( i_Camera ) ) );
  }
  /// Every third cell is masked.
  static VCameraMaskGrid Mask()
  {
    VCameraMaskGrid Value{ 1280 / CellSize, 1024 / CellSize, CellSize, CellSize, {} };
    for ( std::uint32_t Cell = 0; Cell < std::uint32_t{ Value.Columns } * Value.Rows; ++Cell )
    {
      Value.Cells.push_back( Cell % 3 == 0 ? 0xFF : 0 );
    }
    return Value;
  }
  static VEdgePairSet Edges()
  {
    VEdgePairSet Set;
    for ( int Row = -150; Row <= 150; Row += 2 )
    {
      const auto Half = static_cast< float >( std::sqrt( 150.0 * 150.0 - Row * Row ) );
      Set.Pairs.push_back( { static_cast< u16 >( 512 + Row ), 640 - Half, 640 + Half, 255, 120 } );
    }
    return Set;
  }
  static VCameraWand2d Wand( int i_First, int i_Count )
  {
    VCameraWand2d Value;
    for ( int Frame = i_First; Frame < i_First + i_Count; ++Frame )
    {
      const float Angle = static_cast< float >( Frame ) * 0.012F;
      Value.Points.push_back( { 640 + 400 * std::cos( Angle ), 512 + 300 * std::sin( Angle ), Frame } );
    }
    return Value;
  }
  /// Rolled by a bit less than a quarter turn, seen through a strong lens.
  void Roll( std::size_t i_Camera )
  {
    VCameraCalibration Value = LookingAt( Eye( i_Camera, 4 ), { 0, 0, 800 } );
    const QVector3D Axis( float( Value.Rotation.x ), float( Value.Rotation.y ), float( Value.Rotation.z ) );
    const QQuaternion Turned = QQuaternion::fromAxisAndAngle( 0, 0, 1, 70 ) *
                               QQuaternion::fromAxisAndAngle( Axis, Axis.length() * 180 / std::numbers::pi_v< float > );
    QVector3D NewAxis;
    float Degrees = 0;
    Turned.getAxisAndAngle( &NewAxis, &Degrees );
    NewAxis *= Degrees * std::numbers::pi_v< float > / 180;
    Value.Rotation = { double( NewAxis.x() ), double( NewAxis.y() ), double( NewAxis.z() ) };
    Value.RadialParameters = { 2e-7, 0 };
    Give< FlowCameraCalibration >( i_Camera, Value );
  }
  QImage DrawGrid()
  {
    const QImage Picture = Grid.Draw();
    return Picture;
  }

  FlowTest::VFrame Grid{ pScene, GridSize };
  std::shared_ptr< MoxelGraphics::VCameraTiles > pTiles;
};

ZEK::VSelectionItem Cell( const std::string& i_rCamera, std::uint32_t i_Index )
{
  return { ZEK::ESelectMaskCell, i_rCamera, 0, i_Index };
}
} // namespace

TEST_F( VCameraTiles, MasksEdgesWandAndBorderEachInItsTileAndOneDrawAKind )
{
  Give< FlowCameraMaskGrid >( 0, Mask() );
  Give< FlowEdgePairSet >( 1, Edges() );
  Give< FlowCameraWand2d >( 2, Wand( 0, 450 ) );
  Give< FlowCameraMaskGrid >( 3, Mask() );
  GridOptions().CameraMaskGrid = GridOptions().CameraGreyscale = false;
  Show();
  const QImage Empty = DrawGrid();
  const auto Calls = [&]
  {
    const QImage Picture = DrawGrid();
    EXPECT_NE( Picture, Empty );
    DrawGrid();
    EXPECT_EQ( Grid.Frame().Figures().BytesUploaded, 0u ) << "the same state again";
    return Grid.Frame().Figures().DrawCalls;
  };
  const std::uint64_t None = Grid.Frame().Figures().DrawCalls;
  auto& rOptions = GridOptions();
  std::uint64_t Kinds = 0;
  for ( bool* const pOption :
        { &rOptions.CameraMaskGrid, &rOptions.CameraGreyscale, &rOptions.CameraWandSmear, &rOptions.CameraBorder } )
  {
    *pOption = true;
    EXPECT_EQ( Calls(), None + ++Kinds );
  }
  EXPECT_TRUE( TestSupport::MatchesGolden( DrawGrid(), "tiles-pictures" ) );
  // Zoomed in, nothing leaves its tile; a tile that moves changes the table alone.
  auto pZoomed = std::make_shared< MoxelGraphics::VCameraTiles >( *pTiles );
  for ( MoxelGraphics::VCameraTile& rTile : *pZoomed )
  {
    rTile.Zoom = 3;
    rTile.PanX = 0.3F;
  }
  pZoomed->erase( pZoomed->begin() );
  Tiles( pZoomed );
  const QImage Zoomed = DrawGrid();
  for ( int Place = 0; Place < 256; ++Place )
  {
    EXPECT_EQ( Zoomed.pixel( Place, Place ), Empty.pixel( Place, Place ) ) << "no camera has this tile";
  }
  EXPECT_TRUE( TestSupport::MatchesGolden( Zoomed, "tiles-pictures-zoomed" ) );
  DrawGrid();
  EXPECT_EQ( Grid.Frame().Figures().BytesUploaded, 0u );
}

TEST_F( VCameraTiles, CellsOfTheOneSelectedCameraArePickedWhereTheyAreSeen )
{
  Give< FlowCameraMaskGrid >( 1, Mask() );
  Give< FlowCameraMaskGrid >( 2, Mask() );
  Items.erase( Items.begin() + 3 * 2 + 2 );
  Roll( 2 );
  GridOptions().Show3DOverlay = true; // with a world that is not distorted, what the sensor saw is
  GridOptions().CameraSnap90Degrees = false;
  Show();
  pScene->Select( { Device( 2 ), Cell( Name( 2 ), 5 ), Cell( Name( 2 ), 133 ), Cell( Name( 2 ), 134 ) } );
  EXPECT_TRUE( TestSupport::MatchesGolden( DrawGrid(), "tiles-mask-selected" ) );

  // Where each cell is seen, computed apart from the programs; frame pixels, y up.
  const MoxelGraphics::VCameraTile& rTile = ( *pTiles )[2];
  const ZEK::VRenderCameraRef pCamera = pScene->CameraProvider()->GetCamera( Name( 2 ) );
  const MoxelGraphics::VSensorView Sensor = MoxelGraphics::MakeSensorView(
      *pCamera, GridOptions(), { rTile.ScaleX * rTile.Zoom, rTile.ScaleY * rTile.Zoom, rTile.PanX, rTile.PanY } );
  const VCameraMaskGrid Grid2 = Mask();
  const auto Corner = [&]( std::uint32_t i_Column, std::uint32_t i_Row )
  {
    const auto Clip = MoxelGraphics::SensorToClip( Sensor, i_Column * CellSize, i_Row * CellSize, 0 );
    return QPointF( rTile.Rect.x() + ( Clip[0] + 1 ) / 2 * rTile.Rect.width(),
                    rTile.Rect.y() + ( Clip[1] + 1 ) / 2 * rTile.Rect.height() );
  };
  const auto Seen = [&]( const QPointF& i_rPlace )
  {
    for ( std::uint32_t Index = 0; Index < Grid2.Cells.size(); ++Index )
    {
      const std::uint32_t Column = Index % Grid2.Columns, Row = Index / Grid2.Columns;
      const QPolygonF Outline( { Corner( Column, Row ), Corner( Column + 1, Row ), Corner( Column + 1, Row + 1 ),
                                 Corner( Column, Row + 1 ) } );
      if ( Outline.containsPoint( i_rPlace, Qt::OddEvenFill ) )
      {
        return static_cast< int >( Index );
      }
    }
    return -1;
  };
  auto& rInput = Grid.Frame().Input();
  rInput.PickMode = MoxelGraphics::EPickHover;
  std::mt19937 Random( 7 );
  int Hits = 0;
  for ( int Try = 0; Try < 120; ++Try )
  {
    rInput.Pointer = { static_cast< int >( 10 + Random() % 300 ), static_cast< int >( 266 + Random() % 236 ) };
    // A pick looks at the pixel above the pointer's.
    const QPointF Place( rInput.Pointer.x() + 0.5, GridSize.height() - rInput.Pointer.y() + 0.5 );
    const int Wanted = Seen( Place );
    const bool bSure = Wanted >= 0 && Seen( Place + QPointF( 0.3, 0.3 ) ) == Wanted &&
                       Seen( Place - QPointF( 0.3, 0.3 ) ) == Wanted &&
                       Seen( Place + QPointF( 0.3, -0.3 ) ) == Wanted && Seen( Place + QPointF( -0.3, 0.3 ) ) == Wanted;
    if ( bSure )
    {
      ++Hits;
      DrawGrid();
      ASSERT_EQ( Grid.Frame().Result().Selection,
                 ZEK::VSelection{ Cell( Name( 2 ), static_cast< std::uint32_t >( Wanted ) ) } )
          << Place.x() << ", " << Place.y();
      EXPECT_EQ( Grid.Frame().Result().Labels.at( 0 ), "Camera 3: mask cell " + std::to_string( Wanted ) );
    }
  }
  EXPECT_GT( Hits, 60 );
  // A camera that is not the selected one keeps its cells to itself, as do two.
  rInput.Pointer = { 480, 128 };
  DrawGrid();
  EXPECT_TRUE( Grid.Frame().Result().Ids.empty() );
  pScene->Select( { Device( 1 ), Cell( Name( 2 ), 5 ) } );
  rInput.Pointer = { 160, 384 };
  DrawGrid();
  EXPECT_TRUE( Grid.Frame().Result().Ids.empty() );
  pScene->Select( { Cell( Name( 2 ), 5 ) } );
  DrawGrid();
  EXPECT_EQ( Grid.Frame().Result().Ids.size(), 1u ) << "a selected cell keeps its camera's mask open";
  pScene->Select( { Cell( Name( 1 ), 5 ), Device( 2 ) } );
  DrawGrid();
  EXPECT_EQ( Grid.Frame().Result().Ids.size(), 1u ) << "cells of the camera before are in nobody's way";
}

TEST_F( VCameraTiles, WhatDisagreesOrIsNoNumberIsNotShown )
{
  Show();
  GridOptions().CameraWandSmear = true;
  const QImage Empty = DrawGrid();
  const std::size_t Plain = Items.size();
  const float NaN = std::nanf( "" );
  const auto Shows = [&]( auto&& i_rAdd )
  {
    Items.resize( Plain );
    i_rAdd();
    Show();
    return DrawGrid() != Empty;
  };
  const std::vector< std::function< void( VCameraMaskGrid& ) > > Bad{ []( auto& o_rMask )
                                                                      {
                                                                        o_rMask.Cells.pop_back();
                                                                      },
                                                                      []( auto& o_rMask )
                                                                      {
                                                                        o_rMask.Columns = 0xFFFF;
                                                                      },
                                                                      []( auto& o_rMask )
                                                                      {
                                                                        o_rMask.CellWidth = 0;
                                                                      },
                                                                      []( auto& o_rMask )
                                                                      {
                                                                        o_rMask = {};
                                                                      } };
  for ( std::size_t Case = 0; Case < Bad.size(); ++Case )
  {
    VCameraMaskGrid Value = Mask();
    Bad[Case]( Value );
    EXPECT_FALSE( Shows(
        [&]
        {
          Give< FlowCameraMaskGrid >( 0, Value );
        } ) )
        << Case;
    pScene->Select( { Device( 0 ), Cell( Name( 0 ), 3 ) } );
    DrawGrid();
    pScene->Select( {} );
  }
  EXPECT_TRUE( Shows(
      [&]
      {
        Give< FlowCameraMaskGrid >( 0, Mask() );
      } ) );
  VEdgePairSet Pairs;
  Pairs.Pairs = { { 512, NaN, NaN, 255, 255 } };
  EXPECT_FALSE( Shows(
      [&]
      {
        Give< FlowEdgePairSet >( 0, Pairs );
      } ) );
  VCameraWand2d Lost;
  Lost.Points = { { NaN, 500, 3 }, { 500, std::numeric_limits< float >::infinity(), 4 } };
  EXPECT_FALSE( Shows(
      [&]
      {
        Give< FlowCameraWand2d >( 0, Lost );
      } ) );
}

TEST_F( VCameraTiles, TheWandSmearsOverItsNewestFramesAndBeginsAnewWhenTimeGoesBack )
{
  GridOptions().CameraWandSmear = true;
  Show();
  const QImage Empty = DrawGrid();
  const auto Lit = [&]( int i_First, int i_Count )
  {
    Items.resize( 12 );
    Give< FlowCameraWand2d >( 0, Wand( i_First, i_Count ) );
    Show();
    const QImage Picture = DrawGrid();
    int Count = 0;
    for ( int Pixel = 0; Pixel < 320 * 256; ++Pixel )
    {
      Count += Picture.pixel( Pixel % 320, Pixel / 320 ) != Empty.pixel( Pixel % 320, Pixel / 320 );
    }
    return Count;
  };
  const int Few = Lit( 0, 20 );
  EXPECT_GT( Few, 50 );
  const int More = Lit( 20, 200 );
  EXPECT_GT( More, 4 * Few ) << "what was left stays";
  EXPECT_NEAR( Lit( 0, 220 ), More, 20 ) << "a source that gives all of it every time";
  const int Full = Lit( 220, 280 );
  const int Later = Lit( 500, 500 );
  EXPECT_LT( std::abs( Later - Full ), Full / 4 ) << "500 frames are kept";
  EXPECT_NEAR( Lit( 0, 20 ), Few, 5 ) << "time went back";
}

TEST_F( VCameraTiles, WhatTheWandLeftAgesWithTheWandAndThenWithTheStates )
{
  GridOptions().CameraWandSmear = true;
  Show();
  const QImage Empty = DrawGrid();
  const auto Sees = [&]( std::initializer_list< int > i_First )
  {
    Items.resize( 12 );
    std::size_t Camera = 0;
    for ( const int First : i_First )
    {
      Give< FlowCameraWand2d >( Camera++, Wand( First, 20 ) );
    }
    Show();
    return DrawGrid();
  };
  const QImage Fresh = Sees( { 100 } );
  EXPECT_NE( Sees( { 400, 400 } ), Fresh );
  EXPECT_EQ( Sees( { 100 } ), Fresh ) << "time went back; what the second camera is yet to see is not there";
  // No camera sees it any more: what it left turns from orange to blue.
  const auto Warmth = [&]( std::int64_t i_States )
  {
    Items.resize( 12 );
    Frame += i_States;
    Show();
    const QImage Picture = DrawGrid();
    EXPECT_NE( Picture, Empty );
    int Sum = 0;
    for ( int Pixel = 0; Pixel < 320 * 256; ++Pixel )
    {
      const QRgb Colour = Picture.pixel( Pixel % 320, Pixel / 320 );
      Sum += qRed( Colour ) - qBlue( Colour );
    }
    return Sum;
  };
  const int New = Warmth( 0 ), Half = Warmth( 250 );
  EXPECT_GT( New, Half + 1000 );
  EXPECT_LT( Warmth( 250 ), std::min( Half - 1000, 0 ) );
  Sees( { 700 } );
  EXPECT_GT( Warmth( 0 ), Half + 1000 ) << "seen again, it is new again";
}
