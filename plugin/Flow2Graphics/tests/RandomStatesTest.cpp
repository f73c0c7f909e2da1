#include "SubjectFeedFixture.h"

#include <CoreMoxelTypes/Parameters.h>
#include <TestSupport/LogGuard.h>

#include <limits>
#include <random>
#include <set>

using namespace CoreMoxelTypes;

namespace
{
/// States that no source would make: items missing or twice, lists that disagree, numbers that are none, nothing and
/// ten thousand of anything.
class VRandomStates
{
public:
  explicit VRandomStates( std::uint32_t i_Seed )
    : m_Random( i_Seed )
  {
  }

  std::uint32_t Below( std::uint32_t i_Limit ) { return static_cast< std::uint32_t >( m_Random() % i_Limit ); }
  bool Chance( std::uint32_t i_Percent ) { return Below( 100 ) < i_Percent; }
  /// Mostly a place in the room.
  double Number()
  {
    constexpr double Infinite = std::numeric_limits< double >::infinity();
    const double Odd[] = { Infinite - Infinite, Infinite, -Infinite, 1e300, -3e38, 1e-310, 0 };
    return Chance( 8 ) ? Odd[Below( 7 )] : static_cast< double >( Below( 6000 ) ) - 3000;
  }
  float Float() { return static_cast< float >( Number() ); }
  std::uint32_t Count() { return Chance( 2 ) ? 10000 : Chance( 10 ) ? 0 : Below( 40 ); }
  D3 Place() { return { Number(), Number(), Number() }; }

  ZEK::VFlowStateRef Make( std::int64_t i_Frame )
  {
    const ZEK::VFlowStateRef State = m_Maker.State( i_Frame );
    for ( const auto pAdd : { &VRandomStates::AddPoints, &VRandomStates::AddSubjects, &VRandomStates::AddDevices,
                              &VRandomStates::AddRoom } )
    {
      if ( Chance( 80 ) )
      {
        ( this->*pAdd )( *State );
      }
    }
    return State;
  }

private:
  void AddPoints( ZEK::IFlowState& io_rState )
  {
    VReconstructionSet Set;
    Set.Items.resize( Count() );
    for ( VReconstruction& rItem : Set.Items )
    {
      rItem = { Below( 20 ), Place(), Chance( 80 ) ? 7.0F : Float(), Float(), Below( 9 ) };
    }
    VReconstructionLabelSet Labels;
    Labels.Labels.resize( 4 * Count() );
    for ( auto& rLabel : Labels.Labels )
    {
      rLabel = { Chance( 90 ) ? Below( 50 ) : 0xFFFFFFFF, Below( 6 ), Chance( 90 ) ? Below( 20 ) : 0xFFFFFFFF };
    }
    Put( io_rState, m_Maker.Item< FlowReconstructionSet >( Set ) );
    Put( io_rState, m_Maker.Item< FlowReconstructionLabelSet >( Labels ) );
  }
  Rigid Pose()
  {
    Rigid Pose;
    Pose.R[Below( 9 )] = Chance( 90 ) ? 0.5 : Number();
    Pose.T[Below( 3 )] = Number();
    return Pose;
  }
  VSubject RandomSubject( const std::string& i_rName )
  {
    VSubject Subject;
    Subject.Id = Below( 5 );
    Subject.Name = i_rName;
    Subject.Markers.resize( Chance( 2 ) ? 10000 : Below( 20 ) );
    for ( VMarker& rMarker : Subject.Markers )
    {
      rMarker.Radius = Chance( 80 ) ? 9.0F : Float();
      rMarker.Segment = static_cast< std::int32_t >( Below( 9 ) ) - 1;
      rMarker.Local = Place();
      rMarker.Covariance[Below( 9 )] = Number();
    }
    Subject.Segments.resize( Chance( 2 ) ? 300 : Below( 9 ) );
    for ( VSegment& rSegment : Subject.Segments )
    {
      rSegment.Parent = static_cast< std::int32_t >( Chance( 95 ) ? Below( 10 ) - 1 : Below( 0xFFFFFFFF ) );
      rSegment.Joint = static_cast< EJointType >( Below( 7 ) );
      rSegment.BoneLength = Float();
    }
    for ( std::uint32_t Cluster = Below( 9 ); Cluster > 0; --Cluster )
    {
      Subject.Clusters.emplace_back( Below( 9 ), Below( 20 ) );
    }
    return Subject;
  }
  VSubjectDynamicParameters RandomMotion()
  {
    VSubjectDynamicParameters Motion;
    Motion.JointState.resize( Below( 30 ), Number() );
    Motion.Segments.resize( Below( 10 ), Pose() );
    Motion.MarkerPositions.resize( Below( 25 ), Place() );
    Motion.MarkerVisible.resize( Below( 25 ), 1 );
    Motion.SegmentHealth.resize( Below( 10 ), Float() );
    return Motion;
  }
  std::vector< VStick > RandomSticks()
  {
    std::vector< VStick > Sticks( Below( 9 ) );
    for ( VStick& rStick : Sticks )
    {
      rStick = { Below( 20 ), Chance( 90 ) ? Below( 20 ) : 0xFFFFFFFF, 0xFF00FF00, 0xFF0000FF };
    }
    return Sticks;
  }
  void AddSubjects( ZEK::IFlowState& io_rState )
  {
    for ( std::uint32_t Number = Below( 6 ); Number > 0; --Number )
    {
      const std::string Name = "Subject " + std::to_string( Below( 4 ) );
      const VSubject Subject = RandomSubject( Name );
      Put( io_rState, m_Maker.Item< FlowSubject >( Subject, Chance( 95 ) ? Name : std::string() ) );
      VSubjectApplicationData Data;
      Data.MarkerColours.resize( Chance( 80 ) ? Subject.Markers.size() : Below( 30 ), 0xFF00FF00 );
      Data.SegmentColours.resize( Below( 9 ), 0xFF0000FF );
      Data.Sticks = RandomSticks();
      Put( io_rState, m_Maker.Item< FlowSubjectApplicationData >( Data, Name ) );
      Put( io_rState, m_Maker.Item< FlowSubjectDynamicParameters >( RandomMotion(), Name ) );
      VSubjectSettings Settings;
      Settings.Kind = Chance( 70 ) ? VSubjectSettings::Subject : VSubjectSettings::Prop;
      Settings.Enabled = Chance( 90 );
      Put( io_rState, m_Maker.Item< FlowSubjectSettings >( Settings, Name ) );
      Put( io_rState, m_Maker.Item< FlowSubjectForSolving >( RandomSubject( Name ), Name ) );
      Put( io_rState, m_Maker.Item< FlowSubjectDynamicParametersForSolving >( RandomMotion(), Name ) );
      VRigidObject Object;
      Object.Id = Below( 5 );
      Object.Markers = RandomSubject( Name ).Markers;
      Put( io_rState, m_Maker.Item< FlowRigidObject >( Object, Name ) );
      Put( io_rState, m_Maker.Item< FlowRigidObjectDynamicParameters >( { Pose(), Chance( 80 ), {}, 0 }, Name ) );
      Put( io_rState, m_Maker.Item< FlowSceneMesh >( { "none.fbx", Below( 5 ) }, Name ) );
      Put( io_rState, m_Maker.Item< FlowSceneMeshSettings >( { Chance( 80 ), Float() }, Name ) );
    }
  }
  void AddDevices( ZEK::IFlowState& io_rState )
  {
    const std::uint32_t Number = Chance( 1 ) ? 10000 : Below( 6 );
    for ( std::uint32_t Index = 0; Index < Number; ++Index )
    {
      const std::string URN = "vd:" + std::to_string( Number == 10000 ? Index : Below( 4 ) );
      VDevice Device;
      Device.Kind = static_cast< VDevice::EKind >( Chance( 85 ) ? 1 : Below( 5 ) );
      Device.Name = Chance( 50 ) ? URN : std::string();
      Device.Thickness = Float();
      for ( D3& rCorner : Device.Corners )
      {
        rCorner = Place();
      }
      Put( io_rState, m_Maker.Device< FlowDevice >( Device, Chance( 95 ) ? URN : std::string() ) );
      VDeviceSamples Samples;
      Samples.Wrench.resize( Chance( 90 ) ? Below( 3 ) : Count() );
      for ( auto& rWrench : Samples.Wrench )
      {
        for ( float& rValue : rWrench )
        {
          rValue = Float();
        }
      }
      Put( io_rState, m_Maker.Device< FlowDeviceSamples >( Samples, "vd:" + std::to_string( Below( 5 ) ) ) );
      Put( io_rState, m_Maker.Device< FlowDeviceApplicationData >( { Below( 1 << 24 ) }, URN ) );
    }
  }
  void AddRoom( ZEK::IFlowState& io_rState )
  {
    const auto Whole = [&]
    {
      return static_cast< std::int32_t >( Chance( 80 ) ? Below( 8000 ) - 4000 : m_Random() );
    };
    if ( Chance( 60 ) )
    {
      Put( io_rState,
           m_Maker.Item< FlowVolumeProperties >( { Whole(), Whole(), Whole(), Whole(), Float(), Whole() } ) );
    }
    if ( Chance( 60 ) )
    {
      Put( io_rState, m_Maker.Item< FlowWorldAxis >( { Below( 4 ) } ) );
    }
    VParametersItem Parameters;
    for ( const char* pName : ReconstructionVolumeNames )
    {
      if ( Chance( 95 ) )
      {
        Parameters.Values[pName] = Chance( 95 ) ? VVariant( Number() ) : VVariant( std::string( "far" ) );
      }
    }
    const std::string Target = Chance( 90 ) ? ReconstructionTarget : "Processing:Other";
    Put( io_rState, m_Maker.Item< FlowParametersItem >( Parameters, Target, ZEK::EFlowNameTarget ) );
  }
  /// At times beside another of the same name, or for another time.
  void Put( ZEK::IFlowState& io_rState, const ZEK::VFlowItemRef& i_rItem )
  {
    io_rState.AddItemAt( i_rItem, Chance( 90 ) ? io_rState.GetKey()
                                               : ZEK::VFlowTimeKey{ static_cast< std::int64_t >( Below( 600 ) ),
                                                                    static_cast< std::int64_t >( Below( 900 ) ), 1 } );
  }

  std::mt19937 m_Random;
  FlowTest::VMaker m_Maker;
};

bool AllFinite( std::span< const MoxelGraphics::VForcePlate > i_Plates )
{
  float Sum = 0;
  for ( const MoxelGraphics::VForcePlate& rPlate : i_Plates )
  {
    for ( const float Value : rPlate.Model )
    {
      Sum += 0 * Value;
    }
  }
  return Sum == 0;
}

/// Where the markers of the subjects stand, by looking at every label for every marker: as many as the feed placed.
std::size_t ExpectLabelled( FlowTest::VScene& io_rScene )
{
  const MoxelGraphics::VSubjectGroup& rGroup = io_rScene.Group( Flow2Graphics::EGroupSubject );
  ZEK::VFlowItemRef Set, Labels;
  io_rScene.State->FindItem( Set, ZEK::FlowTag< FlowReconstructionSet >, ZEK::EFlowTimeMatch::Overlap );
  io_rScene.State->FindItem( Labels, ZEK::FlowTag< FlowReconstructionLabelSet >, ZEK::EFlowTimeMatch::Overlap );
  const auto* const pSet = ZEK::FlowPayload< VReconstructionSet >( Set.Get() );
  const auto* const pLabels = ZEK::FlowPayload< VReconstructionLabelSet >( Labels.Get() );
  if ( !pSet )
  {
    return 0;
  }
  std::vector< const D3* > Places( rGroup.Markers.size() );
  std::set< std::uint32_t > Used;
  for ( const auto& rLabel : pLabels ? pLabels->Labels : std::vector< VReconstructionLabelSet::L >() )
  {
    const auto It = std::find_if( rGroup.Records.begin(), rGroup.Records.end(),
                                  [&]( const MoxelGraphics::VSubjectRecord& i_rRecord )
                                  {
                                    return i_rRecord.Item.Object == rLabel.SubjectId;
                                  } );
    if ( It != rGroup.Records.end() && rLabel.MarkerId < It->Markers.Count &&
         rLabel.Reconstruction < pSet->Items.size() && !Places[It->Markers.First + rLabel.MarkerId] &&
         Used.insert( rLabel.Reconstruction ).second )
    {
      Places[It->Markers.First + rLabel.MarkerId] = &pSet->Items[rLabel.Reconstruction].Position;
    }
  }
  for ( std::size_t Index = 0; Index < Places.size(); ++Index )
  {
    const float X = Places[Index] ? static_cast< float >( Places[Index]->x ) : std::nanf( "" );
    const float Own = rGroup.Markers[Index].X;
    EXPECT_TRUE( X == Own || ( std::isnan( X ) && std::isnan( Own ) ) ) << Index << ": " << X << ", " << Own;
  }
  return Used.size();
}
} // namespace

// A failed draw would log a line of level 2, which fails the test.
TEST( RandomStates, NoStateBreaksTheViewAndTheLastGoodPictureStays )
{
  VRandomStates States( 20240611 );
  const auto pScene = std::make_shared< FlowTest::VScene >();
  FlowTest::VFrame View( pScene, { 320, 180 } );
  MoxelGraphics::VFrameInput& rInput = View.Frame().Input();
  std::size_t Plates = 0, Arrows = 0, Points = 0, Volumes = 0, Picked = 0, Labelled = 0, Bones = 0;
  for ( std::int64_t Frame = 0; Frame < 500; ++Frame )
  {
    SCOPED_TRACE( testing::Message() << "state " << Frame );
    pScene->State = States.Make( Frame );
    pScene->MarkDirty();
    rInput.Options.FloorGridIsTranslucent = States.Chance( 80 );
    rInput.Options.ReconstructedRadius = States.Chance( 50 );
    rInput.Options.ReconstructionResiduals = States.Chance( 20 );
    rInput.Options.ReconstructionScale = States.Chance( 90 ) ? 1.0F : States.Float();
    for ( QPoint* const pPoint : { &rInput.Pointer, &rInput.BandStart } )
    {
      *pPoint = { static_cast< int >( States.Below( 320 ) ), static_cast< int >( States.Below( 180 ) ) };
    }
    rInput.PickMode = States.Chance( 10 ) ? MoxelGraphics::EPickBandDone : MoxelGraphics::EPickHover;
    View.Draw();
    Picked += View.Frame().Result().Selection.size();
    // What was picked may be gone in the next state.
    pScene->Select( View.Frame().Result().Selection );
    ASSERT_TRUE( AllFinite( pScene->Plates().Plates() ) && AllFinite( pScene->Plates().Arrows() ) );
    Plates += pScene->Plates().Plates().size();
    Arrows += pScene->Plates().Arrows().size();
    Points += pScene->Reconstructions().Unlabelled().Count();
    Labelled += ExpectLabelled( *pScene );
    for ( std::uint32_t Group = 0; Group < Flow2Graphics::EGroupCount; ++Group )
    {
      const auto& rGroup = pScene->Group( static_cast< Flow2Graphics::EFlowSubjectGroup >( Group ) );
      FlowTest::ExpectSound( rGroup );
      Bones += rGroup.Bones.size();
    }
    Volumes += pScene->Volume().IsShown();
    if ( Frame % 25 == 0 )
    {
      rInput.PickMode = MoxelGraphics::EPickNone;
      pScene->Select( {} );
      pScene->MarkDirty();
      View.Draw();
      const QImage Before = View.Draw();
      pScene->State = Frame % 50 == 0 ? ZEK::VFlowStateRef() : FlowTest::VMaker().State( Frame );
      pScene->MarkDirty();
      EXPECT_EQ( View.Draw(), Before );
    }
    ASSERT_FALSE( HasFailure() );
  }
  // That there was something to break.
  EXPECT_GT( Plates, 5000u );
  EXPECT_GT( Arrows, 40u );
  EXPECT_GT( Points, 50000u );
  EXPECT_GT( Volumes, 50u );
  EXPECT_GT( Picked, 100u );
  EXPECT_GT( Labelled, 200u );
  EXPECT_GT( Bones, 5000u );
}
