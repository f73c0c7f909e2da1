#include <HostSources/VSimulatedCapture.h>

#include "SimulatedStage.h"
#include "SimulatedStates.h"
#include "SimulatedSubjects.h"

#include <gtest/gtest.h>

#include <map>
#include <set>

using namespace ZEK;
using namespace CoreMoxelTypes;
using namespace HostSources;
using namespace HostSources::Simulation;

namespace
{

template < typename T >
std::map< std::string, const T* > ByName( const IFlowState& i_rState, std::uint32_t i_Tag )
{
  std::map< std::string, const T* > Found;
  for ( const VFlowItemRef& rItem : ItemsOf( i_rState, i_Tag ) )
  {
    std::string_view Name;
    EXPECT_TRUE( rItem->Value().GetName( EFlowNameObject, Name ) ) << i_Tag;
    EXPECT_TRUE( Found.emplace( Name, FlowPayload< T >( rItem.Get() ) ).second ) << Name << " twice, " << i_Tag;
  }
  return Found;
}

/// The tags of what a subject is, looks like and does.
struct VTags
{
  std::uint32_t Subject, Looks, Motion, Poses;
};
constexpr VTags Tags[] = {
    { 0x1012, 0x1013, 0x1011, 0x101a }, { 0x101b, 0x101c, 0x101d, 0x102c }, { 0x1038, 0x1039, 0x103a, 0 } };

/// Where each marker of a subject was labelled.
std::map< u32, D3 > LabelledOf( const IFlowState& i_rState, u32 i_SubjectId )
{
  std::map< u32, D3 > Places;
  const auto& rPoints = Only< VReconstructionSet >( i_rState, 0x100d ).Items;
  for ( const auto& rLabel : Only< VReconstructionLabelSet >( i_rState, 0x100f ).Labels )
  {
    if ( rLabel.SubjectId == i_SubjectId )
    {
      Places[rLabel.MarkerId] = rPoints[rLabel.Reconstruction].Position;
    }
  }
  return Places;
}

/// Everything that a state says of motion, in one row.
std::vector< double > MotionOf( const IFlowState& i_rState )
{
  std::vector< double > Row;
  for ( const VTags& rTags : Tags )
  {
    for ( const auto& [rName, pMotion] : ByName< VSubjectDynamicParameters >( i_rState, rTags.Motion ) )
    {
      Row.insert( Row.end(), pMotion->JointState.begin(), pMotion->JointState.end() );
      Row.insert( Row.end(), pMotion->MarkerVisible.begin(), pMotion->MarkerVisible.end() );
      Row.insert( Row.end(), pMotion->SegmentHealth.begin(), pMotion->SegmentHealth.end() );
      Row.push_back( pMotion->Error );
    }
  }
  for ( const auto& rLabel : Only< VReconstructionLabelSet >( i_rState, 0x100f ).Labels )
  {
    Row.insert( Row.end(), { double( rLabel.Reconstruction ), double( rLabel.SubjectId ), double( rLabel.MarkerId ) } );
  }
  return Row;
}

void ExpectNear( const Rigid& i_rA, const Rigid& i_rB, double i_Tolerance )
{
  for ( int Index = 0; Index < 9; ++Index )
  {
    EXPECT_NEAR( i_rA.R[Index], i_rB.R[Index], i_Tolerance );
  }
  for ( int Index = 0; Index < 3; ++Index )
  {
    EXPECT_NEAR( i_rA.T[Index], i_rB.T[Index], i_Tolerance );
  }
}

void ExpectWhole( const VSubject& i_rSubject, const VSubjectApplicationData& i_rLooks,
                  const VSubjectDynamicParameters& i_rMotion )
{
  EXPECT_EQ( i_rLooks.MarkerColours.size(), i_rSubject.Markers.size() );
  EXPECT_EQ( i_rLooks.SegmentColours.size(), i_rSubject.Segments.size() );
  EXPECT_EQ( i_rMotion.SegmentHealth.size(), i_rSubject.Segments.size() );
  ASSERT_EQ( i_rMotion.Segments.size(), i_rSubject.Segments.size() );
  ASSERT_EQ( i_rMotion.MarkerPositions.size(), i_rSubject.Markers.size() );
  EXPECT_EQ( i_rMotion.MarkerVisible.size(), i_rSubject.Markers.size() );
  EXPECT_EQ( i_rSubject.Clusters.size(), i_rSubject.Markers.size() );
  for ( const VStick& rStick : i_rLooks.Sticks )
  {
    EXPECT_TRUE( rStick.A < i_rSubject.Markers.size() && rStick.B < i_rSubject.Markers.size() && rStick.A != rStick.B );
  }
  for ( const auto& [Segment, Marker] : i_rSubject.Clusters )
  {
    EXPECT_EQ( i_rSubject.Markers.at( Marker ).Segment, static_cast< i32 >( Segment ) );
  }
  const auto pTree = ComputeSubject::VComputeSubjectFK::Build( i_rSubject );
  ASSERT_EQ( i_rMotion.JointState.size(), pTree->StateSize() );
  ASSERT_TRUE( pTree->LoadState( i_rMotion.JointState ).IsOk() );
  for ( std::size_t Segment = 0; Segment < i_rSubject.Segments.size(); ++Segment )
  {
    SCOPED_TRACE( i_rSubject.Segments[Segment].Name );
    ExpectNear( i_rMotion.Segments[Segment], pTree->WorldTransforms()[Segment].ToRigid(), 1e-9 );
  }
  std::vector< std::array< double, 3 > > Solved( i_rSubject.Markers.size() );
  ASSERT_TRUE( pTree->Positions( Solved ).IsOk() );
  for ( std::size_t Marker = 0; Marker < Solved.size(); ++Marker )
  {
    const auto& rPlace = Solved[Marker];
    EXPECT_LT( Length( i_rMotion.MarkerPositions[Marker] - D3{ rPlace[0], rPlace[1], rPlace[2] } ), 1e-9 );
  }
}

} // namespace

TEST( SimulatedSubjects, EveryItemAgreesWithItsSkeletonAndSolvedMarkersWithLabels )
{
  VSimulatedCapture Capture(
      { .Performers = 3, .GapProbability = 0.05, .SwapProbability = 0, .bSolving = true, .bRetargeting = true } );
  std::set< EJointType > Joints;
  double Farthest = 0;
  for ( const std::int64_t Frame : { 0, 77, 5000, 123456 } )
  {
    const auto State = StateOf( Capture, Frame );
    for ( const VTags& rTags : Tags )
    {
      const auto Subjects = ByName< VSubject >( *State, rTags.Subject );
      const auto Looks = ByName< VSubjectApplicationData >( *State, rTags.Looks );
      const auto Motions = ByName< VSubjectDynamicParameters >( *State, rTags.Motion );
      EXPECT_EQ( Subjects.size(), rTags.Subject == 0x1012 ? 4u : 3u ) << "the prop is a subject too";
      for ( const auto& [rName, pSubject] : Subjects )
      {
        SCOPED_TRACE( rName );
        EXPECT_EQ( pSubject->Name, rName );
        ASSERT_TRUE( Looks.contains( rName ) && Motions.contains( rName ) );
        ExpectWhole( *pSubject, *Looks.at( rName ), *Motions.at( rName ) );
        const auto Labelled = LabelledOf( *State, pSubject->Id );
        for ( std::size_t Marker = 0; Marker < pSubject->Markers.size(); ++Marker )
        {
          const auto Place = Labelled.find( static_cast< u32 >( Marker ) );
          EXPECT_EQ( Motions.at( rName )->MarkerVisible[Marker], Place != Labelled.end() );
          Farthest = std::max( Farthest, Place == Labelled.end()
                                             ? 0
                                             : Length( Place->second - Motions.at( rName )->MarkerPositions[Marker] ) );
        }
        for ( const VSegment& rSegment : pSubject->Segments )
        {
          Joints.insert( rSegment.Joint );
        }
      }
      for ( const auto& [rName, pPoses] : ByName< VSubjectParametrised >( *State, rTags.Poses ) )
      {
        EXPECT_EQ( pPoses->Base.Segments.size(), Subjects.at( rName )->Segments.size() );
        ASSERT_EQ( pPoses->PoseNames.size(), pPoses->Poses.size() );
        EXPECT_EQ( pPoses->PoseNames[0], "Neutral" );
        for ( const auto& rPose : pPoses->Poses )
        {
          EXPECT_EQ( rPose.size(), Motions.at( rName )->JointState.size() );
        }
      }
    }
    const auto& rWand = Only< VRigidObject >( *State, 0x1035 );
    const auto& rMotion = Only< VRigidObjectDynamicParameters >( *State, 0x1034 );
    const auto Pose = ComputeSubject::VRigidTransform::From( rMotion.Pose );
    const auto Labelled = LabelledOf( *State, rWand.Id );
    ASSERT_EQ( Labelled.size(), rWand.Markers.size() );
    ASSERT_EQ( rMotion.MarkerVisible.size(), rWand.Markers.size() );
    for ( const auto& [Marker, rPlace] : Labelled )
    {
      EXPECT_LT( Length( rPlace - Placed( Pose, rWand.Markers[Marker].Local ) ), 3 );
    }
    const auto Settings = ByName< VSubjectSettings >( *State, 0x1027 );
    EXPECT_EQ( Settings.at( "Prop" )->Kind, VSubjectSettings::Prop );
    EXPECT_EQ( Settings.at( "Ben" )->Kind, VSubjectSettings::Subject );
  }
  EXPECT_EQ( Joints.size(), 6u ) << "joints of every kind";
  EXPECT_LT( Farthest, 8 ) << "mm";
  EXPECT_GT( Farthest, 1 ) << "mm: skin moves";
  const auto Plain = StateOf( *std::make_unique< VSimulatedCapture >(), 0 );
  for ( const std::uint32_t Tag : { 0x101b, 0x101c, 0x101d, 0x102c, 0x1038, 0x1039, 0x103a } )
  {
    EXPECT_TRUE( ItemsOf( *Plain, Tag ).empty() ) << "nobody asked for " << Tag;
  }
}

TEST( SimulatedSubjects, FaultsOfLabelsComeAndGoTheSameWayInAnyOrder )
{
  const VSimulatedCaptureOptions Options{
      .Cameras = 0, .Performers = 2, .GapProbability = 0.02, .SwapProbability = 0.05, .bSolving = true };
  VSimulatedCapture First( Options ), Second( Options );
  std::map< std::int64_t, std::vector< double > > Rows;
  std::size_t Swapped = 0, Sick = 0, Longest = 0;
  std::map< u32, std::size_t > Lasting;
  for ( std::int64_t Frame = 0; Frame < 1200; ++Frame )
  {
    const auto State = StateOf( First, Frame );
    if ( Frame % 97 == 0 )
    {
      Rows[Frame] = MotionOf( *State );
    }
    const auto& rAda = *ByName< VSubjectDynamicParameters >( *State, 0x1011 ).at( "Ada" );
    const auto& rSubject = *ByName< VSubject >( *State, 0x1012 ).at( "Ada" );
    const auto Labelled = LabelledOf( *State, rSubject.Id );
    std::set< i32 > Affected;
    for ( u32 Marker = 0; Marker < rSubject.Markers.size(); ++Marker )
    {
      const auto Place = Labelled.find( Marker );
      const bool bSwapped = Place != Labelled.end() && Length( Place->second - rAda.MarkerPositions[Marker] ) > 15;
      Swapped += bSwapped;
      Lasting[Marker] = bSwapped ? Lasting[Marker] + 1 : 0;
      Longest = std::max( Longest, Lasting[Marker] );
      if ( bSwapped || Place == Labelled.end() )
      {
        Affected.insert( rSubject.Markers[Marker].Segment );
      }
    }
    for ( const auto& [Segment, Marker] : rSubject.Clusters )
    {
      const bool bSick = rAda.SegmentHealth[Segment] < 1;
      EXPECT_EQ( bSick, Affected.contains( static_cast< i32 >( Segment ) ) ) << Frame << " " << Segment;
      EXPECT_GE( rAda.SegmentHealth[Segment], 0 );
      Sick += bSick;
    }
    EXPECT_LT( rAda.Error, 60 );
  }
  EXPECT_GT( Swapped, 100u );
  EXPECT_GT( Sick, Swapped / 2 );
  EXPECT_LE( Longest, 60u ) << "half a second";
  EXPECT_GT( Longest, 3u );
  for ( auto Row = Rows.rbegin(); Row != Rows.rend(); ++Row )
  {
    EXPECT_EQ( MotionOf( *StateOf( Second, Row->first ) ), Row->second ) << Row->first;
  }
}

// Feet come to the places that the way has for them, stand there as long as they bear a load, and roll over heel and
// ball.
TEST( SimulatedSubjects, FeetStandWhileTheyAreLoaded )
{
  const VSimulatedCaptureOptions Options{ .Performers = 16 };
  for ( std::uint32_t Performer = 0; Performer < 16; ++Performer )
  {
    SCOPED_TRACE( PerformerName( Performer ) );
    const VWalkerStyle Style = PerformerStyle( Options, Performer );
    const VWalkerBody Body( PerformerShape( Options, Performer ) );
    const D3 HeelEdge = Body.Neutral()[ELeftThigh].Origin;
    const VFrame& rFoot = Body.Neutral()[ELeftFoot];
    const D3 Heel = D3{ ( BallToAnkle - BallToHeel ) * Style.Scale, HeelEdge.y, 0 } - rFoot.Origin;
    const D3 LocalHeel{ Dot( rFoot.X, Heel ), Dot( rFoot.Y, Heel ), Dot( rFoot.Z, Heel ) };
    VWalkerPose Pose;
    D3 StandingHeel, StandingBall;
    double HeelSlide = 0, BallSlide = 0, Unreached = 0, LeastKnee = 1;
    double Before = 1;
    for ( int Frame = 0; Frame < 1200; ++Frame )
    {
      const double Seconds = 50 + Frame / 240.0;
      PoseWalker( Style, Body, Seconds, Pose );
      const VWalkerFoot Foot = FootAt( Style, Seconds, 1 );
      const D3 HeelNow = Placed( Pose.Segments[ELeftFoot], LocalHeel );
      const D3 BallNow = Placed( Pose.Segments[ELeftToes], {} );
      const D3 Planned = Foot.Frame.Point( 0, 0, ToeJointHeight * Style.Scale );
      Unreached = std::max( Unreached, Length( BallNow - Planned ) );
      LeastKnee = std::min( LeastKnee, Pose.State[DegreeOf( ELeftShin )] );
      StandingHeel = Foot.Stride < Before ? HeelNow : StandingHeel;
      StandingBall = Foot.Stride > 0.1 && Before <= 0.1 ? BallNow : StandingBall;
      if ( Frame > 300 && Foot.Stride < 0.36 )
      {
        HeelSlide = std::max( HeelSlide, Length( HeelNow - StandingHeel ) );
      }
      if ( Frame > 300 && Foot.Stride > 0.11 && Foot.Stride < 0.6 )
      {
        BallSlide = std::max( BallSlide, Length( BallNow - StandingBall ) );
      }
      Before = Foot.Stride;
    }
    EXPECT_LT( Unreached, 1e-6 ) << "mm: the legs are long enough";
    EXPECT_GT( LeastKnee, 0.03 ) << "rad: no knee locks";
    EXPECT_LT( HeelSlide, 2 ) << "mm";
    EXPECT_LT( BallSlide, 2 ) << "mm";
  }
}
