#include <HostSources/VSimulatedCapture.h>

#include "SimulatedObjects.h"
#include "SimulatedStage.h"
#include "SimulatedStates.h"

#include <gtest/gtest.h>

#include <limits>
#include <map>
#include <set>

using namespace ZEK;
using namespace CoreMoxelTypes;
using namespace HostSources;
using namespace HostSources::Simulation;

namespace
{

std::vector< VReconstruction > PointsOf( VSimulatedCapture& i_rCapture, std::int64_t i_Index )
{
  return Only< VReconstructionSet >( *StateOf( i_rCapture, i_Index ), 0x100d ).Items;
}

bool Same( const std::vector< VReconstruction >& i_rA, const std::vector< VReconstruction >& i_rB )
{
  return std::equal( i_rA.begin(), i_rA.end(), i_rB.begin(), i_rB.end(),
                     []( const VReconstruction& i_rX, const VReconstruction& i_rY )
                     {
                       return i_rX.Id == i_rY.Id && i_rX.Rays == i_rY.Rays && i_rX.Residual == i_rY.Residual &&
                              Length( i_rX.Position - i_rY.Position ) == 0;
                     } );
}

std::size_t MarkerNamed( std::string_view i_Name )
{
  const auto& rNames = WalkerMarkerNames();
  return static_cast< std::size_t >( std::find( rNames.begin(), rNames.end(), i_Name ) - rNames.begin() );
}

} // namespace

TEST( SimulatedCapture, TheSameSeedAndFrameGiveTheSamePointsInAnyOrder )
{
  VSimulatedCapture First, Second;
  VSimulatedCapture Other( { .Seed = 2 } );
  std::map< std::int64_t, std::vector< VReconstruction > > Points;
  for ( const std::int64_t Frame : { 0, 1, 7, 120, 1000003 } )
  {
    Points[Frame] = PointsOf( First, Frame );
  }
  for ( const std::int64_t Frame : { 1000003, 7, 1, 120, 0, 7 } )
  {
    EXPECT_TRUE( Same( PointsOf( Second, Frame ), Points[Frame] ) ) << Frame;
    EXPECT_FALSE( Same( PointsOf( Other, Frame ), Points[Frame] ) ) << Frame;
  }
  EXPECT_FALSE( Same( Points[0], Points[1] ) );
  EXPECT_EQ( StateOf( First, 120 )->GetKey().Frame, FlowTicksPerSecond );
}

TEST( SimulatedCapture, EveryLabelNamesAPointAndAMarkerThatExist )
{
  VSimulatedCapture Capture( { .Performers = 5, .GapProbability = 0.3, .ExtraPoints = 20 } );
  std::size_t Gaps = 0, Unlabelled = 0;
  VSubject Wand;
  for ( std::int64_t Frame = 0; Frame < 600; Frame += 5 )
  {
    const auto State = StateOf( Capture, Frame );
    const auto& rPoints = Only< VReconstructionSet >( *State, 0x100d ).Items;
    const auto& rLabels = Only< VReconstructionLabelSet >( *State, 0x100f ).Labels;
    std::map< u32, const VSubject* > Subjects;
    for ( const VFlowItemRef& rItem : ItemsOf( *State, 0x1012 ) )
    {
      const auto* pSubject = FlowPayload< VSubject >( rItem.Get() );
      Subjects[pSubject->Id] = pSubject;
    }
    for ( const VFlowItemRef& rItem : ItemsOf( *State, 0x1035 ) )
    {
      const auto* pWand = FlowPayload< VRigidObject >( rItem.Get() );
      Wand.Id = pWand->Id;
      Wand.Markers = pWand->Markers;
      Subjects[Wand.Id] = &Wand;
    }
    ASSERT_EQ( Subjects.size(), 7u ) << "five people, the prop, the wand";
    std::set< u32 > Used;
    std::set< std::pair< u32, u32 > > Markers;
    for ( const auto& rLabel : rLabels )
    {
      ASSERT_LT( rLabel.Reconstruction, rPoints.size() );
      ASSERT_TRUE( Subjects.contains( rLabel.SubjectId ) );
      ASSERT_LT( rLabel.MarkerId, Subjects[rLabel.SubjectId]->Markers.size() );
      EXPECT_EQ( Subjects[rLabel.SubjectId]->Markers[rLabel.MarkerId].Id, rLabel.MarkerId );
      EXPECT_TRUE( Used.insert( rLabel.Reconstruction ).second );
      EXPECT_TRUE( Markers.insert( { rLabel.SubjectId, rLabel.MarkerId } ).second );
    }
    Gaps += 5 * WalkerMarkers + ObjectMarkers - rLabels.size();
    Unlabelled += rPoints.size() - rLabels.size();
    std::set< u32 > Ids;
    for ( const VReconstruction& rPoint : rPoints )
    {
      EXPECT_TRUE( Ids.insert( rPoint.Id ).second );
    }
  }
  EXPECT_GT( Gaps, 100u );
  EXPECT_GT( Unlabelled, 1000u );
}

TEST( SimulatedCapture, PeopleWalkUprightOnTheFloorAndStayOnIt )
{
  const VSimulatedCaptureOptions Options{ .Performers = 16 };
  const std::size_t Crown = MarkerNamed( "ARIEL" ), Knee = MarkerNamed( "LKNE" ), Ankle = MarkerNamed( "LANK" );
  const std::size_t LeftToe = MarkerNamed( "LTOE" ), RightToe = MarkerNamed( "RTOE" );
  for ( std::uint32_t Performer = 0; Performer < 16; ++Performer )
  {
    SCOPED_TRACE( PerformerName( Performer ) );
    const VWalkerStyle Style = PerformerStyle( Options, Performer );
    const VWalkerBody Body( PerformerShape( Options, Performer ) );
    VWalkerPose Before, Pose;
    PoseWalker( Style, Body, 1000, Before );
    const double ShinLength = Length( Before.Markers[Knee] - Before.Markers[Ankle] );
    double Greatest = 0, Highest = 0, Lowest = 10000, Planted = 1000, Travelled = 0, ShinError = 0;
    for ( int Frame = 1; Frame <= 15 * 120; ++Frame, Before = Pose )
    {
      PoseWalker( Style, Body, 1000 + Frame / 120.0, Pose );
      double Sole = 1000;
      for ( std::size_t Marker = 0; Marker < WalkerMarkers; ++Marker )
      {
        const D3& rPoint = Pose.Markers[Marker];
        ASSERT_TRUE( std::abs( rPoint.x ) < FloorHalf && std::abs( rPoint.y ) < FloorHalf ) << Frame;
        Greatest = std::max( Greatest, Length( rPoint - Before.Markers[Marker] ) );
        Sole = std::min( Sole, rPoint.z );
      }
      ASSERT_TRUE( Sole > 0 && Sole < 50 ) << "a foot touches the floor in frame " << Frame << ": " << Sole;
      Highest = std::max( Highest, Pose.Markers[Crown].z );
      Lowest = std::min( Lowest, Pose.Markers[Crown].z );
      Planted = std::min( { Planted, Length( Pose.Markers[LeftToe] - Before.Markers[LeftToe] ),
                            Length( Pose.Markers[RightToe] - Before.Markers[RightToe] ) } );
      Travelled += Length( Pose.Markers[Crown] - Before.Markers[Crown] );
      ShinError = std::max( ShinError, std::abs( Length( Pose.Markers[Knee] - Pose.Markers[Ankle] ) - ShinLength ) );
    }
    EXPECT_LT( Greatest * 120, 5500 ) << "mm/s: nothing jumps";
    EXPECT_NEAR( Highest, 1750 * Style.Scale, 25 );
    EXPECT_GT( Lowest, 1750 * Style.Scale - 70 );
    EXPECT_LT( Planted, 0.01 ) << "a standing foot does not slide";
    EXPECT_GT( Travelled, 15 * Style.Speed * 0.9 );
    EXPECT_LT( ShinError, 15 );
  }
}

TEST( SimulatedCapture, SlowItemsAreTheSameObjectsInEveryState )
{
  VSimulatedCapture Capture( { .GapProbability = 0, .SwapProbability = 0 } );
  const auto First = StateOf( Capture, 10 ), Second = StateOf( Capture, 5000000 );
  const std::map< std::uint32_t, std::size_t > Counts = {
      { 0x1000, 12 }, { 0x1001, 12 }, { 0x1002, 10 }, { 0x100a, 12 }, { 0x100b, 12 }, { 0x102d, 12 }, { 0x102f, 12 },
      { 0x1037, 12 }, { 0x1012, 3 },  { 0x1013, 3 },  { 0x101a, 3 },  { 0x1027, 3 },  { 0x1035, 1 },  { 0x1036, 1 },
      { 0x1023, 2 },  { 0x1029, 1 },  { 0x1031, 1 },  { 0x100f, 1 },  { 0x1, 1 } };
  for ( const auto& [Tag, Count] : Counts )
  {
    EXPECT_EQ( ItemsOf( *First, Tag ).size(), Count ) << Tag;
    EXPECT_EQ( ItemsOf( *First, Tag ), ItemsOf( *Second, Tag ) ) << Tag;
  }
  EXPECT_NE( ItemsOf( *First, 0x100d ), ItemsOf( *Second, 0x100d ) );
  for ( const std::uint32_t Tag : { 0x1003, 0x1005, 0x100c, 0x1022 } )
  {
    EXPECT_EQ( ItemsOf( *First, Tag ).size(), 10u ) << Tag;
    EXPECT_NE( ItemsOf( *First, Tag ), ItemsOf( *Second, Tag ) ) << Tag;
  }
  EXPECT_EQ( ItemsOf( *First, 0x1006 ).size(), 2u );

  const auto Axis = ItemsOf( *First, 0x1029 );
  EXPECT_EQ( FlowPayload< VWorldAxis >( Axis[0].Get() )->Up, 2u );
  Capture.SetUpAxis( EUpAxis::Y );
  EXPECT_EQ( Only< VWorldAxis >( *StateOf( Capture, 11 ), 0x1029 ).Up, 1u );
  EXPECT_EQ( FlowPayload< VWorldAxis >( Axis[0].Get() )->Up, 2u ) << "states that exist do not change";
}

TEST( SimulatedCapture, PlatesFeelTheStepsOnThemAndNothingElse )
{
  VSimulatedCapture Capture( { .Cameras = 0, .RateHz = 250, .NoiseMm = 0 } );
  std::size_t Felt[2] = {}, Quiet[2] = {};
  float Heaviest = 0;
  for ( std::int64_t Frame = 0; Frame < 250 * 13; ++Frame )
  {
    const auto State = StateOf( Capture, Frame );
    const auto Devices = ItemsOf( *State, 0x1023 ), Samples = ItemsOf( *State, 0x1025 );
    ASSERT_EQ( Samples.size(), 2u );
    for ( std::size_t Plate = 0; Plate < 2; ++Plate )
    {
      const auto* pDevice = FlowPayload< VDevice >( Devices[Plate].Get() );
      const auto* pSamples = FlowPayload< VDeviceSamples >( Samples[Plate].Get() );
      ASSERT_EQ( pSamples->Wrench.size(), 4u );
      ASSERT_EQ( pSamples->RateHz, 1000 );
      ASSERT_EQ( pSamples->First, Frame * 4 );
      for ( const auto& rWrench : pSamples->Wrench )
      {
        Felt[Plate] += rWrench[2] > 10;
        Quiet[Plate] += rWrench[2] == 0;
        EXPECT_EQ( std::isnan( rWrench[6] ), rWrench[2] <= 10 );
        if ( rWrench[2] > 10 )
        {
          EXPECT_TRUE( rWrench[6] <= pDevice->Corners[0].x && rWrench[6] >= pDevice->Corners[2].x );
          EXPECT_TRUE( rWrench[7] <= pDevice->Corners[0].y && rWrench[7] >= pDevice->Corners[2].y );
        }
        Heaviest = std::max( Heaviest, rWrench[2] );
      }
    }
  }
  for ( std::size_t Plate = 0; Plate < 2; ++Plate )
  {
    EXPECT_GT( Felt[Plate], 300u ) << "ms of load in a lap";
    EXPECT_GT( Quiet[Plate], 5000u );
  }
  EXPECT_GT( Heaviest, 600 );
  EXPECT_LT( Heaviest, 1300 );
}

TEST( SimulatedCapture, CamerasLookAtThePeople )
{
  for ( const std::uint32_t Cameras : { 1u, 12u, 256u } )
  {
    std::set< std::pair< double, double > > Places;
    for ( std::uint32_t Camera = 0; Camera < Cameras; ++Camera )
    {
      VCameraHardware Hardware;
      VCameraCalibration Calibration;
      FillCamera( Camera, Cameras, 120, Hardware, Calibration );
      const auto ToSensor = [&]( const D3& i_rPoint )
      {
        const D3 Away = i_rPoint - Calibration.Position;
        const double Angle = Length( Calibration.Rotation );
        const D3 Axis = Calibration.Rotation * ( 1 / Angle );
        const D3 Seen = Away * std::cos( Angle ) + Cross( Axis, Away ) * std::sin( Angle ) +
                        Axis * ( Dot( Axis, Away ) * ( 1 - std::cos( Angle ) ) );
        return D3{ Calibration.PrincipalPoint[0] + Calibration.FocalLength * Seen.x / Seen.z,
                   Calibration.PrincipalPoint[1] + Calibration.FocalLength * Seen.y / Seen.z, Seen.z };
      };
      const D3 Middle = ToSensor( { 0, 0, 900 } ), Above = ToSensor( { 0, 0, 1700 } );
      ASSERT_NEAR( Middle.x, 639.5, 1e-6 ) << Camera;
      ASSERT_NEAR( Middle.y, 511.5, 1e-6 ) << Camera;
      ASSERT_GT( Middle.z, 3000 );
      ASSERT_NEAR( Above.x, 639.5, 1e-6 ) << "held level";
      ASSERT_LT( Above.y, 480 ) << "rows count downwards";
      Places.insert( { Calibration.Position.x * 1000 + Calibration.Position.y, Calibration.Position.z } );
    }
    EXPECT_EQ( Places.size(), Cameras ) << "no two in one place";
  }
}

TEST( SimulatedCapture, TakesAnyOptionsAndRefusesFramesThatCannotBe )
{
  VSimulatedCapture Odd( { .Cameras = 5000,
                           .Performers = 99,
                           .RateHz = std::nan( "" ),
                           .NoiseMm = -3,
                           .GapProbability = 7,
                           .ExtraPoints = 4000000000u } );
  EXPECT_EQ( Odd.Options().Cameras, 256u );
  EXPECT_EQ( Odd.Options().Performers, 16u );
  EXPECT_EQ( Odd.RateHz(), 25 );
  EXPECT_EQ( Odd.Options().NoiseMm, 0 );
  const auto Full = StateOf( Odd, 3 );
  EXPECT_EQ( ItemsOf( *Full, 0x1000 ).size(), 256u );
  EXPECT_GT( Only< VReconstructionSet >( *Full, 0x100d ).Items.size(), ObjectMarkers + 400 );

  VSimulatedCapture Bare(
      { .Cameras = 0, .Performers = 0, .ExtraPoints = 0, .bObjects = false, .bForcePlates = false } );
  EXPECT_TRUE( PointsOf( Bare, 0 ).empty() );
  const VStateMaker Maker{ HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 1 };
  VFlowStateRef State = StateOf( Bare, 0 );
  for ( const std::int64_t Frame : { std::int64_t{ -1 }, std::numeric_limits< std::int64_t >::max() } )
  {
    EXPECT_EQ( Bare.MakeState( Frame, Maker, State ), IResult( IResult::InvalidIndex ) );
    EXPECT_FALSE( State );
  }
  EXPECT_EQ( Bare.MakeState( 0, {}, State ), IResult( IResult::InvalidHandle ) );
  VSimulatedCapture Late;
  for ( const VReconstruction& rPoint : PointsOf( Late, std::int64_t{ 1 } << 40 ) )
  {
    ASSERT_TRUE( std::abs( rPoint.Position.x ) < FloorHalf + 10 && std::isfinite( rPoint.Position.z ) );
  }
}

// A late state is what a view has to take as the newest, though its key is not.
TEST( SimulatedCapture, SendsOneFrameInThirtyTwoTooLateWhereThatIsAskedFor )
{
  VSimulatedCapture InOrder( { .Cameras = 2, .Performers = 1 } );
  VSimulatedCapture Late( { .Cameras = 2, .Performers = 1, .LateFrames = 5 } );
  const auto pCache = HostFlow::MakeCache( 4 );
  std::set< std::int64_t > Frames;
  std::vector< std::int64_t > Back;
  std::int64_t Newest = -1;
  for ( std::int64_t Index = 0; Index < 128; ++Index )
  {
    const auto State = StateOf( Late, Index );
    ASSERT_TRUE( pCache->Add( State ).IsOk() );
    VFlowStateRef Fetched;
    ASSERT_TRUE( pCache->Fetch( Fetched, 31, 2, 0 ) );
    EXPECT_TRUE( Fetched == State );
    const std::int64_t Frame = State->GetKey().Frame / Late.TicksPerFrame();
    EXPECT_TRUE( Frames.insert( Frame ).second );
    if ( Frame < Newest )
    {
      Back.push_back( Newest - Frame );
    }
    Newest = std::max( Newest, Frame );
    const auto& rPoints = Only< VReconstructionSet >( *State, 0x100d ).Items;
    const auto Expected = StateOf( InOrder, Frame );
    ASSERT_EQ( rPoints.size(), Only< VReconstructionSet >( *Expected, 0x100d ).Items.size() );
    EXPECT_EQ( rPoints[0].Position.x, Only< VReconstructionSet >( *Expected, 0x100d ).Items[0].Position.x );
  }
  EXPECT_EQ( Frames.size(), 128u );
  EXPECT_EQ( *Frames.rbegin(), 127 );
  EXPECT_EQ( Back, ( std::vector< std::int64_t >{ 5, 5, 5, 5 } ) );
}

TEST( SimulatedCapture, TemperaturesDriftSlowlyAndInWhateverOrderTheyAreAskedFor )
{
  VSimulatedCapture Capture( { .Cameras = 4, .Performers = 0, .RateHz = 25, .bGreyscale = false, .VideoCameras = 0 } );
  VSimulatedCapture Other( Capture.Options() );
  std::map< std::string, std::set< float > > Read;
  std::size_t Changes = 0;
  VFlowStateRef Before;
  for ( std::int64_t Second = 0; Second < 900; ++Second )
  {
    const auto State = StateOf( Capture, Second * 25 );
    EXPECT_EQ( ItemsOf( *StateOf( Capture, Second * 25 + 24 ), 0x102e ), ItemsOf( *State, 0x102e ) ) << "read once";
    for ( const auto& [rName, pSensor] : ByCamera< VCameraPhysicalSensorData >( *State, 0x102e ) )
    {
      Read[rName].insert( pSensor->Temperature );
      if ( Before )
      {
        const auto* pBefore = ByCamera< VCameraPhysicalSensorData >( *Before, 0x102e ).at( rName );
        const float Step = std::abs( pSensor->Temperature - pBefore->Temperature );
        ASSERT_LT( Step, 0.25F ) << rName << " jumps in second " << Second;
        ASSERT_EQ( pSensor == pBefore, Step == 0 ) << "another item for another reading, and for no other reason";
        Changes += Step > 0;
      }
    }
    Before = State;
  }
  EXPECT_GT( Changes, 0u );
  ASSERT_EQ( Read.size(), 4u );
  for ( const auto& [rName, rReadings] : Read )
  {
    EXPECT_GT( rReadings.size(), 1u ) << rName;
  }
  for ( const std::int64_t Frame : { 20000, 3, 7777 } )
  {
    for ( const char* pName : { "Camera 1", "Camera 4" } )
    {
      EXPECT_EQ( ByCamera< VCameraPhysicalSensorData >( *StateOf( Other, Frame ), 0x102e ).at( pName )->Temperature,
                 ByCamera< VCameraPhysicalSensorData >( *StateOf( Capture, Frame ), 0x102e ).at( pName )->Temperature );
    }
  }
}
