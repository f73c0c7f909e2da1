#include "CameraTest.h"

#include <Flow2Graphics/VContributionTileData.h>
#include <Flow2Graphics/VFlowContributions.h>

#include <HostSources/ReadRecording.h>
#include <HostSources/VRecordingSource.h>
#include <HostSources/VSimulatedCapture.h>
#include <TestSupport/Paths.h>

#include <gmock/gmock.h>

#include <cmath>
#include <map>
#include <random>

namespace
{
using namespace Flow2Graphics;
using namespace CoreMoxelTypes;
using ComputeCameraModel::VImagePoint;

/// By quaternion, which the projection does not use.
D3 TurnedBack( const D3& i_rPoint, const D3& i_rTurn )
{
  const double Angle = std::sqrt( i_rTurn.x * i_rTurn.x + i_rTurn.y * i_rTurn.y + i_rTurn.z * i_rTurn.z );
  const double W = std::cos( -Angle / 2 ), Part = std::sin( -Angle / 2 ) / Angle;
  const double X = i_rTurn.x * Part, Y = i_rTurn.y * Part, Z = i_rTurn.z * Part;
  const double Tx = 2 * ( Y * i_rPoint.z - Z * i_rPoint.y ), Ty = 2 * ( Z * i_rPoint.x - X * i_rPoint.z ),
               Tz = 2 * ( X * i_rPoint.y - Y * i_rPoint.x );
  return { i_rPoint.x + W * Tx + Y * Tz - Z * Ty, i_rPoint.y + W * Ty + Z * Tx - X * Tz,
           i_rPoint.z + W * Tz + X * Ty - Y * Tx };
}

/// The place that a raw pixel shows at a depth: the lens is corrected by its polynomial, which needs no search.
D3 PlaceOf( const VImagePoint& i_rRaw, double i_Depth, const VCameraHardware& i_rHardware,
            const VCameraCalibration& i_rC )
{
  const double Dx = i_rRaw.x - i_rC.DistortionCentre[0], Dy = i_rRaw.y - i_rC.DistortionCentre[1];
  const double D2 = Dx * Dx + Dy * Dy;
  double Scale = 1, Power = D2;
  for ( const double K : i_rC.RadialParameters )
  {
    Scale += K * Power;
    Power *= D2;
  }
  const double Aspect = i_rC.AspectRatio * i_rHardware.PixelAspect;
  const double Cy = ( i_rC.DistortionCentre[1] + Dy * Scale + 0.5 ) * Aspect - 0.5;
  const double Y = ( Cy - i_rC.PrincipalPoint[1] ) / i_rC.FocalLength;
  const double X =
      ( i_rC.DistortionCentre[0] + Dx * Scale - i_rC.PrincipalPoint[0] - i_rC.Skew * Y ) / i_rC.FocalLength;
  const D3 Away = TurnedBack( { X * i_Depth, Y * i_Depth, i_Depth }, i_rC.Rotation );
  return { i_rC.Position.x + Away.x, i_rC.Position.y + Away.y, i_rC.Position.z + Away.z };
}

/// The items of a state's cameras, by URN.
struct VSeen
{
  VSensorProjection Projection;
  const VCameraHardware* pHardware = nullptr;
  const VCameraCalibration* pCalibration = nullptr;
  const VCentroidSet* pCentroids = nullptr;
  const VCentroidAssignmentSet* pAssignments = nullptr;
};

template < typename TFlow, typename TPayload >
void Collect( const ZEK::VFlowStateRef& i_rState, const TPayload* VSeen::*i_pMember,
              std::map< std::string, VSeen >& io_rSeen )
{
  ZEK::VFlowCursor At, End;
  i_rState->TagBegin( At, ZEK::FlowTag< TFlow >, ZEK::EFlowTimeMatch::Overlap );
  i_rState->TagEnd( End, ZEK::FlowTag< TFlow >, ZEK::EFlowTimeMatch::Overlap );
  for ( ; !( At == End ); ++At )
  {
    std::string_view Name;
    EXPECT_TRUE( At->pItem->Value().GetName( ZEK::EFlowNameDevice, Name ) );
    io_rSeen[std::string( Name )].*i_pMember = ZEK::FlowPayload< TPayload >( At->pItem );
  }
}

std::map< std::string, VSeen > SeenIn( const ZEK::VFlowStateRef& i_rState )
{
  std::map< std::string, VSeen > Seen;
  Collect< FlowCameraHardware >( i_rState, &VSeen::pHardware, Seen );
  Collect< FlowCameraCalibration >( i_rState, &VSeen::pCalibration, Seen );
  Collect< FlowCentroidSet >( i_rState, &VSeen::pCentroids, Seen );
  Collect< FlowCentroidAssignmentSet >( i_rState, &VSeen::pAssignments, Seen );
  for ( auto& [rName, rSeen] : Seen )
  {
    rSeen.Projection =
        rSeen.pCalibration ? VSensorProjection( *rSeen.pHardware, *rSeen.pCalibration ) : VSensorProjection();
  }
  return Seen;
}

ZEK::VFlowItemRef SetOf( const ZEK::VFlowStateRef& i_rState )
{
  ZEK::VFlowItemRef Item;
  i_rState->FindItem( Item, ZEK::FlowTag< FlowReconstructionSet >, ZEK::EFlowTimeMatch::Overlap );
  return Item;
}
} // namespace

TEST( Contributions, PlacesComeBackToTheirRawPixels )
{
  std::mt19937 Random( 11 );
  const auto Between = [&]( double i_Low, double i_High )
  {
    return std::uniform_real_distribution< double >( i_Low, i_High )( Random );
  };
  for ( int Round = 0; Round < 300; ++Round )
  {
    VCameraHardware Hardware = FlowTest::Hardware();
    VCameraCalibration Calibration = FlowTest::Calibration();
    Hardware.PixelAspect = Between( 0.8, 1.2 );
    Calibration.AspectRatio = Between( 0.9, 1.1 );
    Calibration.Skew = Between( -20, 20 );
    Calibration.Rotation = { Between( -2, 2 ), Between( -2, 2 ), Between( -2, 2 ) };
    Calibration.Position = { Between( -5000, 5000 ), Between( -5000, 5000 ), Between( 0, 3000 ) };
    Calibration.RadialModel = static_cast< u32 >( Round % 2 );
    Calibration.RadialParameters = { Between( -1e-8, 6e-8 ), Between( 0, 1e-14 ) };
    Calibration.RadialParameters.resize( Round % 2 == 0 ? 2 : 3 );
    const VSensorProjection Projection( Hardware, Calibration );
    ASSERT_TRUE( Projection.IsUsable() );
    const VImagePoint Raw{ Between( 0, 1279 ), Between( 0, 1023 ) };
    VImagePoint Image;
    ASSERT_TRUE( Projection.Project( PlaceOf( Raw, Between( 500, 9000 ), Hardware, Calibration ), Image ) );
    ASSERT_NEAR( Image.x, Raw.x, 1e-6 );
    ASSERT_NEAR( Image.y, Raw.y, 1e-6 );
    EXPECT_FALSE( Projection.Project( PlaceOf( Raw, -1000, Hardware, Calibration ), Image ) ) << "behind the camera";
  }
}

TEST( Contributions, WhatACaptureWithoutNoiseSeesLiesWhereItShould )
{
  HostSources::VSimulatedCaptureOptions Options;
  Options.NoiseMm = 0;
  Options.GapProbability = 0;
  HostSources::VSimulatedCapture Capture( Options );
  ZEK::VFlowStateRef State;
  ASSERT_TRUE( Capture.MakeState( 200, { HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 1 }, State ).IsOk() );
  const auto Seen = SeenIn( State );
  const auto SetItem = SetOf( State );
  const auto& rSet = *ZEK::FlowPayload< VReconstructionSet >( SetItem.Get() );
  std::vector< VContributor > Cameras;
  for ( const auto& [rName, rSeen] : Seen )
  {
    Cameras.push_back( { &rSeen.Projection, rSeen.pCentroids, rSeen.pAssignments } );
  }
  constexpr u8 Merged = 120;
  std::size_t Total = 0, Exact = 0;
  for ( u32 Index = 0; Index < rSet.Items.size(); ++Index )
  {
    std::vector< VContribution > Found;
    FindContributions( Cameras, rSet, Index, Found );
    EXPECT_EQ( Found.size(), rSet.Items[Index].Rays );
    Total += Found.size();
    for ( const VContribution& rFound : Found )
    {
      EXPECT_EQ( rFound.State, EContribution::Measured );
      // Where two markers lie behind one another, one centroid stands between their images.
      const bool bMerged = Cameras[rFound.Camera].pCentroids->Centroids[rFound.Centroid].Quality == Merged;
      EXPECT_LT( rFound.Error, bMerged ? 20 : 1e-3 );
      Exact += !bMerged;
    }
  }
  EXPECT_GT( Exact, Total * 9 / 10 );
  EXPECT_GT( Total, 100u );
  std::vector< VContribution > OfCameras;
  for ( u32 Camera = 0; Camera <= Cameras.size(); ++Camera )
  {
    FindCameraContributions( Cameras, rSet, Camera, OfCameras );
  }
  EXPECT_EQ( OfCameras.size(), Total ) << "the other way round finds the same";
}

TEST( Contributions, ErrorsOfARecordingAreThoseThatItsReaderMeasured )
{
  HARROW_NEEDS_RECORDINGS();
  const auto pRecording = std::make_shared< HostSources::VRecording >();
  std::string Message;
  ASSERT_TRUE(
      HostSources::ReadRecording( TestSupport::RecordingsDir() / "multicam-person/balancing", *pRecording, Message )
          .IsOk() );
  HostSources::VRecordingSource Source( pRecording );
  std::map< std::string, std::pair< double, std::size_t > > Sums;
  const HostSources::VStateMaker Maker{ HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 2 };
  for ( std::int64_t Frame = 0; Frame < Source.FrameCount(); Frame += 1 )
  {
    ZEK::VFlowStateRef State;
    ASSERT_TRUE( Source.MakeState( Frame, Maker, State ).IsOk() );
    const auto SetItem = SetOf( State );
    for ( const auto& [rName, rSeen] : SeenIn( State ) )
    {
      const VContributor Camera{ &rSeen.Projection, rSeen.pCentroids, rSeen.pAssignments };
      std::vector< VContribution > Found;
      FindCameraContributions( { &Camera, 1 }, *ZEK::FlowPayload< VReconstructionSet >( SetItem.Get() ), 0, Found );
      for ( const VContribution& rFound : Found )
      {
        // The likelihood travels as the quality, of 255.
        if ( rSeen.pCentroids->Centroids[rFound.Centroid].Quality >= 77 )
        {
          Sums[rName].first += rFound.Error;
          ++Sums[rName].second;
        }
      }
    }
  }
  for ( const HostSources::VRecordingCamera& rCamera : pRecording->Cameras )
  {
    const auto& [Sum, Count] = Sums[rCamera.Camera.Name];
    EXPECT_NEAR( Sum / static_cast< double >( Count ), rCamera.MeanDistance, 0.05 ) << rCamera.Camera.Name;
  }
}

TEST( Contributions, ErrorsHaveTheSameColoursEverywhere )
{
  const std::pair< double, u32 > Known[] = {
      { 0, 0x40C048 }, { -1, 0x40C048 }, { 1, 0xF0D030 },    { 0.5, 0x98C83C },
      { 2, 0xE88430 }, { 3, 0xE03830 },  { 1e30, 0xE03830 }, { std::nan( "" ), 0x808489 } };
  for ( const auto& [Error, Colour] : Known )
  {
    EXPECT_EQ( ReprojectionErrorColour( Error ), Colour ) << Error;
  }
}

TEST( Contributions, NonsenseMeasuresNothing )
{
  VCentroidSet Centroids = FlowTest::Centroids( 3 );
  const VCentroidAssignmentSet Assignments{ { 0, 7, -1, 0, 0 } };
  VReconstructionSet Set;
  Set.Items.push_back( { 1, { std::nan( "" ), 0, 0 }, 5, 0, 1 } );
  VCameraCalibration Broken = FlowTest::Calibration();
  Broken.FocalLength = std::nan( "" );
  const VSensorProjection Good( FlowTest::Hardware(), FlowTest::Calibration() ), Bad( FlowTest::Hardware(), Broken );
  EXPECT_FALSE( Bad.IsUsable() );
  const VContributor Cameras[] = { { &Good, &Centroids, &Assignments },
                                   { &Bad, &Centroids, &Assignments },
                                   { nullptr, &Centroids, &Assignments },
                                   { &Good, nullptr, &Assignments },
                                   { &Good, &Centroids, nullptr } };
  std::vector< VContribution > Found;
  FindContributions( Cameras, Set, 0, Found );
  FindContributions( Cameras, Set, 7, Found );
  // The second to fifth assignment are of nothing, or of no centroid.
  ASSERT_EQ( Found.size(), 3u );
  EXPECT_EQ( Found[0].State, EContribution::NotInImage );
  EXPECT_EQ( Found[1].State, EContribution::Uncalibrated );
  EXPECT_EQ( Found[2].State, EContribution::Uncalibrated );
  EXPECT_TRUE( std::isnan( Found[0].Error ) && std::isnan( Found[1].Error ) );
}

namespace
{
/// Three cameras that see two points: "a" well, "b" five pixels off, "c" without a calibration.
class ContributionFeed : public testing::Test
{
protected:
  ContributionFeed()
  {
    const VCameraHardware Hardware = FlowTest::Hardware();
    VReconstructionSet Set;
    for ( const char* const pCamera : { "a", "b", "c" } )
    {
      const VCameraCalibration Calibration = FlowTest::Calibration( *pCamera == 'a' ? 1500 : 1700 );
      const VSensorProjection Projection( Hardware, Calibration );
      if ( Set.Items.empty() )
      {
        Set.Items.push_back( { 41, PlaceOf( { 600, 500 }, 3000, Hardware, Calibration ), 7, 0, 3 } );
        Set.Items.push_back( { 42, PlaceOf( { 700, 400 }, 3500, Hardware, Calibration ), 7, 0, 2 } );
      }
      VCentroidSet Seen;
      for ( const VReconstruction& rItem : Set.Items )
      {
        VImagePoint Image;
        EXPECT_TRUE( Projection.Project( rItem.Position, Image ) );
        Seen.Centroids.push_back( { static_cast< f32 >( Image.x + ( *pCamera == 'b' ? 3 : 0 ) ),
                                    static_cast< f32 >( Image.y + ( *pCamera == 'b' ? 4 : 0 ) ), 4, 0, 0, 0, 0 } );
      }
      const VCentroidAssignmentSet Assigned{ { 0, *pCamera == 'c' ? -1 : 1 } };
      m_Items.push_back( m_Maker.Device< FlowCameraHardware >( Hardware, pCamera ) );
      m_Items.push_back( m_Maker.Device< FlowCentroidSet >( Seen, pCamera ) );
      m_Items.push_back( m_Maker.Device< FlowCentroidAssignmentSet >( Assigned, pCamera ) );
      if ( *pCamera != 'c' )
      {
        m_Items.push_back( m_Maker.Device< FlowCameraCalibration >( Calibration, pCamera ) );
      }
    }
    m_Items.push_back( m_Maker.Subject( 5, "Ada", { "Head", "Hand" } ) );
    m_Items.push_back( m_Maker.Item< FlowReconstructionLabelSet >( { { { 1, 5, 1 } } } ) );
    m_Items.push_back( m_Maker.Item< FlowReconstructionSet >( Set ) );
    ShowAgain();
  }
  void ShowAgain() { m_Scene.Show( m_Maker.State( ++m_Frame, m_Items ) ); }
  void Select( ZEK::VSelection i_Items )
  {
    m_Scene.Select( std::move( i_Items ) );
    m_Scene.MarkDirty();
    m_Scene.ProcessPending();
  }
  const VContributionReport& Shown() const { return m_Scene.Contributions()->Shown(); }
  std::vector< std::string > Cameras() const
  {
    std::vector< std::string > Names;
    for ( const auto& rRow : Shown().Rows )
    {
      Names.push_back( rRow.Camera );
    }
    return Names;
  }

  FlowTest::VMaker m_Maker;
  FlowTest::VScene m_Scene;
  std::vector< ZEK::VFlowItemRef > m_Items;
  std::int64_t m_Frame = 0;
};

const ZEK::VSelectionItem Point{ ZEK::ESelectReconstruction, {}, 0, 0 };
const ZEK::VSelectionItem Marker{ ZEK::ESelectMarker, {}, 5, 1 };
const ZEK::VSelectionItem CameraA{ ZEK::ESelectDevice, "a", 0, 0 };
} // namespace

TEST_F( ContributionFeed, TheSelectionTellsWhoSeesIt )
{
  Select( { Point } );
  EXPECT_EQ( Shown().Selected, 0u ) << "nobody watches";
  m_Scene.Contributions()->watch();
  m_Scene.ProcessPending();
  EXPECT_EQ( m_Scene.Contributions()->Summary(), "Seen by 3 of 3 cameras" );
  EXPECT_TRUE( Shown().Rows.empty() ) << "nobody watches the rows";
  m_Scene.Contributions()->watchRows();
  m_Scene.ProcessPending();
  EXPECT_THAT( Cameras(), testing::ElementsAre( "b", "a", "c" ) );
  EXPECT_NEAR( Shown().Rows[0].Error, 5, 1e-3 );
  EXPECT_NEAR( Shown().Rows[1].Error, 0, 1e-3 );
  EXPECT_EQ( Shown().Rows[2].State, EContribution::Uncalibrated );
  EXPECT_EQ( Shown().Rows[0].Id, 41u );
  EXPECT_EQ( m_Scene.Contributions()->Summary(), "Seen by 3 of 3 cameras" );
  const QVariantMap Report = m_Scene.SceneReport();
  const QVariantMap First = Report["contributions"].toList().at( 0 ).toMap();
  EXPECT_EQ( First["urn"], "b" );
  EXPECT_NEAR( First["error"].toDouble(), 5, 1e-3 );
  EXPECT_EQ( First["color"], "#e03830" );
  EXPECT_FALSE( Report["contributions"].toList().at( 2 ).toMap()["error"].isValid() );
  Select( { Marker } );
  EXPECT_THAT( Cameras(), testing::ElementsAre( "b", "a" ) );
  EXPECT_THAT( Shown().Rows[0].Label, testing::HasSubstr( "Hand" ) );
  Select( { Point, Marker, CameraA } );
  EXPECT_EQ( Shown().Rows.size(), 5u ) << "points go before cameras";
  Select( { CameraA, { ZEK::ESelectDevice, "gone", 0, 0 } } );
  EXPECT_TRUE( Shown().bOfCameras );
  ASSERT_EQ( Shown().Rows.size(), 2u );
  EXPECT_THAT( Shown().Missing, testing::ElementsAre( "There is no camera \"gone\"" ) );
  Select( { { ZEK::ESelectReconstruction, {}, 0, 9 } } );
  EXPECT_TRUE( Shown().Rows.empty() );
  EXPECT_THAT( Shown().Missing, testing::ElementsAre( "One point is not in this frame" ) );
  Select( {} );
  EXPECT_EQ( Shown(),
             []
             {
               VContributionReport None;
               None.Cameras = 3;
               return None;
             }() );
}

TEST_F( ContributionFeed, WhatDidNotChangeIsNotToldAgain )
{
  int Changes = 0;
  QObject::connect( m_Scene.Contributions().get(), &VContributions::Changed, m_Scene.Contributions().get(),
                    [&]
                    {
                      ++Changes;
                    } );
  m_Scene.Contributions()->watch();
  Select( { Point } );
  EXPECT_EQ( Changes, 1 );
  ShowAgain();
  ShowAgain();
  EXPECT_EQ( Changes, 1 ) << "the same items in other states";
  // Camera "b" now sees the point where "a" does.
  m_Items[5] = m_Maker.Device< FlowCentroidSet >( { { { 600, 500, 4, 0, 0, 0, 0 } } }, "b" );
  ShowAgain();
  EXPECT_EQ( Changes, 2 );
  m_Scene.Contributions()->unwatch();
  Select( { Marker } );
  EXPECT_EQ( Changes, 2 );
}

TEST_F( ContributionFeed, TilesAreMarkedBesideWhatElseIsKnown )
{
  class VOther final : public MoxelGraphics::ICameraModelAdditionalDataSource
  {
  public:
    QVariantMap AdditionalData( const QString& i_rURN ) const override { return { { "name", i_rURN } }; }
    ZEK::IMultiCallbackPostal< void() >& Changed() override { return Notifier; }
    ZEK::VMultiCallback< void() > Notifier;
  };
  const auto pOther = std::make_shared< VOther >();
  VContributionTileData Data( pOther, m_Scene.Contributions() );
  int Changes = 0;
  const auto Connection = Data.Changed().Connect(
      [&]
      {
        ++Changes;
      },
      nullptr );
  Select( { Marker } );
  EXPECT_EQ( Changes, 1 );
  pOther->Notifier.Fire();
  EXPECT_EQ( Changes, 2 );
  const QVariantMap B = Data.AdditionalData( "b" ), C = Data.AdditionalData( "c" );
  EXPECT_EQ( B["name"], "b" );
  EXPECT_TRUE( B["contributes"].toBool() );
  EXPECT_NEAR( B["error"].toDouble(), 5, 1e-3 );
  EXPECT_EQ( B["errorColor"], "#e03830" );
  EXPECT_EQ( C, ( QVariantMap{ { "name", "c" } } ) );
}

TEST_F( ContributionFeed, CamerasCountBeyondTheRowsThatFit )
{
  VCentroidSet Far;
  Far.Centroids.assign( 600, { 0, 0, 4, 0, 0, 0, 0 } );
  m_Items[1] = m_Maker.Device< FlowCentroidSet >( Far, "a" );
  m_Items[2] = m_Maker.Device< FlowCentroidAssignmentSet >( { std::vector< i32 >( 600, 0 ) }, "a" );
  ShowAgain();
  VContributions& rContributions = *m_Scene.Contributions();
  rContributions.watchRows();
  Select( { Point } );
  EXPECT_EQ( Shown().Rows.size(), 500u );
  EXPECT_EQ( Shown().Rows.back().Camera, "a" ) << "the others have no row";
  EXPECT_EQ( rContributions.Summary(), "Seen by 3 of 3 cameras\nThe 500 greatest errors of 602" );
  double Error = 0;
  EXPECT_TRUE( rContributions.OfCamera( "b", Error ) );
  EXPECT_NEAR( Error, 5, 1e-3 );
  EXPECT_TRUE( rContributions.OfCamera( "c", Error ) );
  EXPECT_TRUE( std::isnan( Error ) );
  // The list is closed, and the marks of the tiles stay.
  rContributions.watch();
  rContributions.unwatchRows();
  Select( { Point, Marker } );
  EXPECT_TRUE( Shown().Rows.empty() );
  EXPECT_TRUE( rContributions.OfCamera( "b", Error ) );
  EXPECT_EQ( rContributions.Summary(), "Seen by 3 of 3 cameras" );
}
