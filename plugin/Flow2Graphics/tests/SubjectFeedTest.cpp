#include "SubjectFeedFixture.h"

#include <ComputeSubjectFK/VComputeSubjectFK.h>
#include <MoxelGraphics/VRenderCentroidAssignments.h>
#include <MoxelGraphics/VRenderSubjectDynamics.h>
#include <MoxelGraphics/VRenderSubjectMarkers.h>
#include <TestSupport/Allocations.h>
#include <ZEK/Callback.h>

namespace FlowTest
{
namespace
{
using namespace Flow2Graphics;
using MoxelGraphics::VSubjectGroup;

constexpr EFlowSubjectGroup AllGroups[] = { EGroupSubject,     EGroupSolving, EGroupRetargeting,
                                            EGroupRigidObject, EGroupProp,    EGroupSceneMesh };

class VMeshes : public HarrowPluginInterface::VMeshSceneCache
{
public:
  void SetSearchFolders( const std::string&, std::vector< std::filesystem::path > ) override {}
  ZEK::IMultiCallback< void() >& Changed() override { return Callback; }
  std::shared_ptr< const HarrowPluginInterface::VMeshScene > Request( const std::string&, const std::string& ) override
  {
    return nullptr;
  }
  bool CanRead( const std::filesystem::path& ) const override { return false; }

  ZEK::VMultiCallback< void() > Callback;
};

/// Holds what was posted until it is let go.
class VPost : public ZEK::IPostalService
{
public:
  void Post( std::function< void() > i_Function ) override { Waiting.push_back( std::move( i_Function ) ); }
  void Deliver()
  {
    for ( const auto& rFunction : std::exchange( Waiting, {} ) )
    {
      rFunction();
    }
  }
  std::vector< std::function< void() > > Waiting;
};

/// All generations of a group, to be compared.
std::array< std::uint64_t, 7 > Generations( const VSubjectGroup& i_rGroup )
{
  return { i_rGroup.StructureGeneration,  i_rGroup.MarkerGeneration,    i_rGroup.PoseGeneration,
           i_rGroup.MarkerIds.Generation, i_rGroup.StickIds.Generation, i_rGroup.BoneIds.Generation,
           i_rGroup.RecordGeneration };
}
} // namespace

TEST_F( VSubjects, AMeshThatArrivesHasAllSixGroupsMadeAnew )
{
  const auto pMeshes = std::make_shared< VMeshes >();
  const auto pPost = std::make_shared< VPost >();
  auto pScene = std::make_unique< VScene >( pMeshes, pPost );
  const auto pSubjects = pScene->Subjects();
  const auto& rList = pScene->RenderList();
  const auto Types = pSubjects->RenderTypes();
  ASSERT_EQ( Types.size(), 3u );
  EXPECT_TRUE( std::equal( Types.begin(), Types.end(), rList.begin() + 3 ) ) << "after floor, plates and points";
  EXPECT_TRUE( dynamic_cast< MoxelGraphics::VRenderSubjectMarkers* >( Types[0].get() ) );
  EXPECT_TRUE( dynamic_cast< MoxelGraphics::VRenderSubjectDynamics* >( Types[1].get() ) );
  EXPECT_TRUE( dynamic_cast< MoxelGraphics::VRenderCentroidAssignments* >( Types[2].get() ) );

  const ZEK::VFlowStateRef State = Maker.State( 0, { Maker.Item< FlowSubject >( Person( 1, "Ada" ), "Ada" ) } );
  pScene->Show( State );
  const auto Marked = [&]
  {
    return std::count_if( std::begin( AllGroups ), std::end( AllGroups ),
                          [&]( EFlowSubjectGroup i_Group )
                          {
                            return pSubjects->Group( i_Group ).IsMarkedDirty();
                          } );
  };
  const std::uint64_t Before = pScene->Group( EGroupSubject ).StructureGeneration;
  pMeshes->Callback.Fire();
  pScene->Show( State );
  EXPECT_EQ( pScene->Group( EGroupSubject ).StructureGeneration, Before ) << "not on the loader's thread";
  pPost->Deliver();
  EXPECT_EQ( Marked(), 6 );
  pScene->ProcessPending();
  EXPECT_EQ( Marked(), 0 );
  EXPECT_EQ( pScene->Group( EGroupSubject ).StructureGeneration, Before + 1 ) << "though the state is the same";
  pScene->UpdateFromState( *State, { "Ben" } );
  EXPECT_EQ( pScene->Group( EGroupSubject ).StructureGeneration, Before + 1 );
  pScene->UpdateFromState( *State, { "Ben", "Ada" } );
  EXPECT_EQ( pScene->Group( EGroupSubject ).StructureGeneration, Before + 2 ) << "a subject that was named";
  pMeshes->Callback.Fire();
  pScene.reset();
  pPost->Deliver();
}

TEST_F( VSubjects, AnUnchangedFrameMovesNothingAndAMovingOneAllocatesNothing )
{
  const auto Subject = Maker.Item< FlowSubject >( Person( 1, "Ada" ), "Ada" );
  const auto Data = Maker.Item< FlowSubjectApplicationData >( Looks(), "Ada" );
  const auto Solving = Maker.Item< FlowSubjectForSolving >( Person( 1, "Ada" ), "Ada" );
  VSubjectDynamicParameters Joints;
  Joints.JointState.assign( 9, 0.25 );
  const auto Frame = [&]( std::int64_t i_Frame, double i_By )
  {
    Joints.JointState[3] = i_By; // the first three turn
    return Maker.State( i_Frame, { Subject, Data, Solving, Maker.Points( 6 ), Labels( { { 1, 1, 0 }, { 4, 1, 1 } } ),
                                   Maker.Item< FlowSubjectDynamicParameters >( Motion( i_By ), "Ada" ),
                                   Maker.Item< FlowSubjectDynamicParametersForSolving >( Joints, "Ada" ) } );
  };
  const VSubjectGroup& rGroup = Group( EGroupSubject );
  const VSubjectGroup& rSolved = Group( EGroupSolving );
  const ZEK::VFlowStateRef States[] = { Frame( 0, 0 ), Frame( 1, 5 ) };
  Scene.Show( States[0] );
  const auto Before = Generations( rGroup );
  const std::uint32_t Id = rGroup.StickIds.First;

  // The same state again, and the same items in another state.
  const std::uint64_t Count = TestSupport::AllocationCount();
  Scene.Show( States[0] );
  EXPECT_EQ( TestSupport::AllocationCount(), Count );
  const ZEK::VFlowStateRef Twin = Maker.State( 0 );
  const std::uint32_t Tags[] = { 0x100d, 0x100f, 0x1011, 0x1012, 0x1013, 0x101b, 0x101d };
  Twin->CopyItems( *States[0], Tags );
  Scene.Show( Twin );
  EXPECT_EQ( Generations( rGroup ), Before );
  EXPECT_EQ( rGroup.StickIds.First, Id );

  // A selection alone: flags and nothing else.
  Scene.Select( { { ZEK::ESelectSubject, "Ada", 1, 0 }, { ZEK::ESelectSegment, "Ada:Chest", 1, 1 } } );
  Scene.Show( Twin );
  EXPECT_EQ( rGroup.StickIds.Flags, ( std::vector< std::uint8_t >{ 1, 1 } ) ) << "a stick is its subject";
  EXPECT_EQ( rGroup.BoneIds.Flags, ( std::vector< std::uint8_t >{ 0, 5 } ) );
  EXPECT_TRUE( rGroup.MarkerIds.Flags.empty() );
  EXPECT_EQ( rGroup.Records[0].Flags, 1 );
  auto After = Before;
  After[4] += 1;
  After[5] += 1;
  After[6] += 1;
  EXPECT_EQ( Generations( rGroup ), After );

  for ( int Round = 0; Round < 4; ++Round )
  {
    Scene.Show( States[Round % 2] );
  }
  const std::uint64_t Steady = TestSupport::AllocationCount();
  Scene.Show( States[0] );
  Scene.Show( States[1] );
  EXPECT_EQ( TestSupport::AllocationCount(), Steady );
  EXPECT_EQ( Xs( rGroup.Solved ), ( std::vector< float >{ 1005, 1006, 1007 } ) );
  EXPECT_EQ( rGroup.Poses[1][3], 25 );
  EXPECT_EQ( rGroup.StructureGeneration, Before[0] );
  EXPECT_EQ( rSolved.Poses[0][3], 5 ) << "moved by its joints";
}

TEST_F( VSubjects, PartsAreFoundByTheirIdsAndTheirItems )
{
  VRigidObject Wand;
  Wand.Id = 3;
  Wand.Name = "Wand";
  Wand.Markers = Person( 3, "" ).Markers;
  VRigidObjectDynamicParameters Held;
  Held.Tracked = true;
  Held.Pose = { { 0, -1, 0, 1, 0, 0, 0, 0, 1 }, { 100, 200, 300 } };
  Held.MarkerVisible = { 1, 1, 0 };
  Scene.Show( Maker.State( 0, { Maker.Item< FlowSubject >( Person( 1, "Ada" ), "Ada" ),
                                Maker.Item< FlowSubject >( Person( 2, "Ben" ), "Ben" ),
                                Maker.Item< FlowSubjectApplicationData >( Looks(), "Ben" ),
                                Maker.Item< FlowSubjectDynamicParameters >( Motion(), "Ben" ),
                                Maker.Item< FlowRigidObject >( Wand, "Wand" ),
                                Maker.Item< FlowRigidObjectDynamicParameters >( Held, "Wand" ),
                                Maker.Item< FlowSceneMesh >( { "room.fbx", 8 }, "Room" ), Maker.Points( 6 ),
                                Labels( { { 2, 2, 0 }, { 5, 2, 1 } } ) } ) );
  const VSubjectGroup& rGroup = Group( EGroupSubject );
  const VSubjectGroup& rRigid = Group( EGroupRigidObject );
  const ZEK::VSelectionItem Ben{ ZEK::ESelectSubject, "Ben", 2, 0 }, Room{ ZEK::ESelectSceneMesh, "Room", 8, 0 },
      Chest{ ZEK::ESelectSegment, "Ben:Chest", 2, 1 }, Marker{ ZEK::ESelectMarker, "Ben:CHE", 2, 1 },
      Object{ ZEK::ESelectRigidObject, "Wand", 3, 0 };
  EXPECT_EQ( Resolved( rGroup.StickIds.First + 1 ), Ben ) << "a stick is its subject";
  EXPECT_EQ( Resolved( rGroup.Records[1].Id ), Ben );
  EXPECT_EQ( Resolved( rGroup.BoneIds.First + 3 ), Chest );
  EXPECT_EQ( Resolved( rGroup.MarkerIds.First + 4 ), Marker );
  EXPECT_EQ( Resolved( rRigid.BoneIds.First ), Object ) << "it moves as one";
  EXPECT_EQ( Resolved( Group( EGroupSceneMesh ).Records[0].Id ), Room );
  EXPECT_EQ( Scene.SelectionItemsToIds( { Ben, Chest, Marker, Object, { ZEK::ESelectMarker, "Eve:CHE", 2, 1 } } ),
             ( std::vector< std::uint32_t >{ rGroup.Records[1].Id, rGroup.BoneIds.First + 3, rGroup.MarkerIds.First + 4,
                                             rRigid.Records[0].Id } ) );

  // Where a view looks at them.
  const auto Points = Scene.GetSelectionPositions( { Marker, Chest, Ben } );
  ASSERT_EQ( Points.size(), 3u );
  EXPECT_EQ( Points[0].X, 500 );
  EXPECT_EQ( Points[0].Radius, 9 );
  EXPECT_EQ( Points[1].X, 20 + 150 );
  EXPECT_EQ( Points[1].Radius, 150 );
  EXPECT_EQ( Points[2].X, 0.5F * ( 10 + 500 ) ) << "from the hips to the marker farthest away";
  EXPECT_GE( Points[2].Radius, 245 );
  MoxelGraphics::VScenePose Pose;
  ASSERT_TRUE( Scene.GetSelectionPose( { Chest }, Pose ) );
  EXPECT_EQ( Pose.Matrix[12], 20 );
  ASSERT_TRUE( Scene.GetSelectionPose( { Object }, Pose ) );
  EXPECT_EQ( Pose.Matrix[1], 1 ) << "column-major";
  EXPECT_EQ( Pose.Matrix[13], 200 );
  EXPECT_FALSE( Scene.GetSelectionPose( { { ZEK::ESelectSegment, "Ada:Chest", 1, 1 } }, Pose ) ) << "nobody posed her";

  // The object's markers are turned by its pose; the one that is not visible is missing there.
  EXPECT_EQ( rRigid.Solved[2].X, 100 - 20 );
  EXPECT_EQ( rRigid.Solved[2].Y, 200 + 10 );
  EXPECT_EQ( rRigid.Markers[0].X, 80 );
  EXPECT_TRUE( std::isnan( rRigid.Markers[2].X ) );
}

TEST_F( VSubjects, MarkersStandWhereTheirLabelsOrElseTheirModelsSay )
{
  const auto Subject = Maker.Item< FlowSubject >( Person( 1, "Ada" ), "Ada" );
  const auto Moves = Maker.Item< FlowSubjectDynamicParameters >( Motion(), "Ada" );
  const VSubjectGroup& rGroup = Group( EGroupSubject );
  const auto Unlabelled = [&]
  {
    return Scene.Reconstructions().UnlabelledPoints().Reconstruction;
  };
  // Marker 1 is in a gap; the first label of marker 0 counts, and the point of the second stays with the points.
  Scene.Show(
      Maker.State( 0, { Subject, Moves, Maker.Points( 4 ), Labels( { { 3, 1, 0 }, { 2, 1, 0 }, { 1, 1, 2 } } ) } ) );
  EXPECT_EQ( rGroup.Markers[0].X, 300 );
  EXPECT_EQ( rGroup.Markers[0].Radius, 9 );
  EXPECT_TRUE( std::isnan( rGroup.Markers[1].X ) );
  EXPECT_EQ( rGroup.Markers[2].X, 100 );
  EXPECT_EQ( Xs( rGroup.Solved ), ( std::vector< float >{ 1000, 1001, 1002 } ) );
  EXPECT_EQ( Unlabelled(), ( std::vector< std::uint32_t >{ 0, 2 } ) );
  // Points without labels: all are missing.
  Scene.Show( Maker.State( 1, { Subject, Moves, Maker.Points( 4 ) } ) );
  EXPECT_TRUE( std::isnan( rGroup.Markers[0].X ) );
  EXPECT_EQ( Unlabelled().size(), 4u );
  // No points at all: what is visible stands at the model, and nothing is missing.
  Scene.Show( Maker.State( 2, { Subject, Moves } ) );
  EXPECT_EQ( rGroup.Markers[1].X, 1001 );
  EXPECT_TRUE( std::isnan( rGroup.Markers[2].X ) && std::isnan( rGroup.Solved[2].X ) );

  // Solving takes its own set while there is one.
  const auto Solving = Maker.Item< FlowSubjectForSolving >( Person( 1, "Ada" ), "Ada" );
  const auto Main = { Solving, Maker.Points( 4 ), Labels( { { 3, 1, 0 } } ) };
  Scene.Show( Maker.State( 3, Main ) );
  EXPECT_EQ( Group( EGroupSolving ).Markers[0].X, 300 );
  EXPECT_EQ( Unlabelled().size(), 3u );
  const ZEK::VFlowStateRef Both = Maker.State( 4, Main );
  VReconstructionSet Own;
  Own.Items.resize( 1 );
  Own.Items[0].Position = { 77, 0, 0 };
  Both->AddItem( Maker.Item< FlowReconstructionSetForSolving >( Own ) );
  Both->AddItem( Maker.Item< FlowReconstructionLabelSetForSolving >( { { { 0, 1, 0 } } } ) );
  Scene.Show( Both );
  EXPECT_EQ( Group( EGroupSolving ).Markers[0].X, 77 );
  EXPECT_EQ( Unlabelled().size(), 4u ) << "of the frame's own points nobody took one";
  Scene.Show( Maker.State( 5, Main ) );
  EXPECT_EQ( Group( EGroupSolving ).Markers[0].X, 300 );
}

TEST_F( VSubjects, SettingsSayWhoIsAPropAndWhoIsHidden )
{
  const auto Named = [&]( std::uint32_t i_Id, const std::string& i_rName, VSubjectSettings::EKind i_Kind, bool i_bOn )
  {
    VSubjectSettings Settings;
    Settings.Kind = i_Kind;
    Settings.Enabled = i_bOn;
    Settings.Colour = 0x00123456;
    return std::array{ Maker.Item< FlowSubject >( Person( i_Id, i_rName ), i_rName ),
                       Maker.Item< FlowSubjectSettings >( Settings, i_rName ) };
  };
  const auto Cane = Named( 1, "Cane", VSubjectSettings::Prop, true );
  const auto Hidden = Named( 2, "Hidden", VSubjectSettings::Subject, false );
  const auto Person1 = Named( 3, "Ada", VSubjectSettings::Subject, true );
  VSceneMeshDynamicParameters Place;
  Place.Pose.T[2] = 50;
  Place.Bones.resize( 2 );
  Place.AnimationTime = 1.5;
  Scene.Show( Maker.State( 0, { Cane[0], Cane[1], Hidden[0], Hidden[1], Person1[0], Person1[1],
                                Maker.Item< FlowSubject >( Person( 4, "Plain" ), "Plain" ), Maker.Points( 3 ),
                                Labels( { { 0, 1, 0 }, { 1, 2, 0 }, { 2, 3, 0 } } ),
                                Maker.Item< FlowSceneMesh >( { "room.fbx", 8 }, "Room" ),
                                Maker.Item< FlowSceneMeshDynamicParameters >( Place, "Room" ),
                                Maker.Item< FlowSceneMeshSettings >( { true, 2.5F }, "Room" ),
                                Maker.Item< FlowSceneMesh >( { "still.fbx", 7 }, "Still" ),
                                Maker.Item< FlowSceneMesh >( { "off.fbx", 9 }, "Off" ),
                                Maker.Item< FlowSceneMeshSettings >( { false, 1 }, "Off" ) } ) );
  EXPECT_EQ( Names( EGroupProp ), std::vector< std::string >{ "Cane" } );
  EXPECT_EQ( Names( EGroupSubject ), ( std::vector< std::string >{ "Ada", "Plain" } ) );
  EXPECT_EQ( Group( EGroupSubject ).Records[0].Colour, 0xFF123456 );
  EXPECT_EQ( Group( EGroupProp ).Markers[0].X, 0 );
  EXPECT_EQ( Scene.Reconstructions().UnlabelledPoints().Reconstruction, std::vector< std::uint32_t >{ 1 } )
      << "the point of the hidden one does not vanish";
  EXPECT_EQ( Names( EGroupSceneMesh ), ( std::vector< std::string >{ "Room", "Still" } ) );
  EXPECT_EQ( Group( EGroupSceneMesh ).Records[1].Root, MoxelGraphics::VSubjectRecord().Root ) << "nothing moves it";
  const MoxelGraphics::VSubjectRecord& rRoom = Group( EGroupSceneMesh ).Records[0];
  EXPECT_EQ( rRoom.Mesh.Name, "room.fbx" );
  EXPECT_EQ( rRoom.Mesh.Scale, 2.5F );
  EXPECT_EQ( rRoom.Mesh.AnimationTime, 1.5 );
  EXPECT_EQ( rRoom.Mesh.Bones.size(), 2u );
  EXPECT_EQ( rRoom.Root[11], 50 );

  // Whoever draws markers learns that there are none any more.
  const std::uint64_t Drawn = Group( EGroupSubject ).MarkerGeneration;
  VSubject Bare = Person( 3, "Ada" );
  Bare.Markers.clear();
  Scene.Show( Maker.State( 1, { Maker.Item< FlowSubject >( Bare, "Ada" ) } ) );
  EXPECT_TRUE( Group( EGroupSubject ).Markers.empty() && !Group( EGroupSubject ).IsEmpty() );
  EXPECT_NE( Group( EGroupSubject ).MarkerGeneration, Drawn );
}

TEST_F( VSubjects, JointStatesPoseTheBonesAsTheirKinematicsDo )
{
  VSubject Subject = Person( 1, "Ada" );
  VSubjectDynamicParameters Moves;
  Moves.JointState = { 100, 200, 300, 0.3, -0.2, 0.9, 0.4, 0.5, -0.6 };
  const auto pKinematics = ComputeSubject::VComputeSubjectFK::Build( Subject );
  ASSERT_EQ( pKinematics->StateSize(), Moves.JointState.size() );
  ASSERT_TRUE( pKinematics->LoadState( Moves.JointState ).IsOk() );
  // The second subject was only ever labelled: its bones are those of its model.
  VSubjectParametrised Model;
  Model.Base = Subject;
  VSubject Bare = Person( 2, "Ben" );
  Bare.Segments.clear();
  Scene.Show( Maker.State( 0, { Maker.Item< FlowSubject >( Subject, "Ada" ), Maker.Item< FlowSubject >( Bare, "Ben" ),
                                Maker.Item< FlowSubjectParametrised >( Model, "Ben" ),
                                Maker.Item< FlowSubjectDynamicParameters >( Moves, "Ada" ),
                                Maker.Item< FlowSubjectDynamicParameters >( Moves, "Ben" ) } ) );
  const VSubjectGroup& rGroup = Group( EGroupSubject );
  ASSERT_EQ( rGroup.Poses.size(), 4u );
  for ( std::size_t Bone = 0; Bone < 4; ++Bone )
  {
    const ComputeSubject::VRigidTransform& rWorld = pKinematics->WorldTransforms()[Bone % 2];
    for ( std::size_t Row = 0; Row < 3; ++Row )
    {
      EXPECT_NEAR( static_cast< double >( rGroup.Poses[Bone][4 * Row + 3] ), rWorld.m_Translation[Row], 1e-3 );
      EXPECT_NEAR( static_cast< double >( rGroup.Poses[Bone][4 * Row] ), rWorld.m_Rotation[3 * Row], 1e-6 );
    }
  }
  EXPECT_EQ( rGroup.Records[0].Root, rGroup.Poses[0] );
  EXPECT_EQ( rGroup.Targets.size(), 4u ) << "the markers that lie on a bone";
}

TEST_F( VSubjects, BadInputCostsWhatIsBadAndNothingElse )
{
  VSubject Subject = Person( 1, "Ada" );
  Subject.Segments.resize( 6 );
  const std::int32_t Parents[] = { 2, 0, 1, 3, 99, std::numeric_limits< std::int32_t >::max() };
  for ( std::size_t Bone = 0; Bone < 6; ++Bone )
  {
    Subject.Segments[Bone].Parent = Parents[Bone];
  }
  Subject.Segments[5].BoneLength = std::numeric_limits< float >::quiet_NaN();
  Subject.Segments[4].Joint = static_cast< EJointType >( 77 );
  Subject.Markers[0].Local.x = NotANumber;
  Subject.Markers[1].Segment = 1000;
  Subject.Markers[1].Radius = -1;
  Subject.Markers[2].Segment = 2;
  Subject.Markers[2].Covariance[3] = NotANumber;
  Subject.Clusters = { { 0, 0 }, { 6, 0 }, { 0, 3 }, { 0xFFFFFFFF, 0xFFFFFFFF } };
  VSubjectApplicationData Data = Looks();
  Data.SegmentColours.resize( 5 );
  Data.Sticks = { { 0, 3, 1, 1 }, { 0xFFFFFFFF, 0, 1, 1 }, { 1, 1, 1, 1 }, { 2, 0, 1, 1 } };
  VSubjectDynamicParameters Moves;
  Moves.JointState = { NotANumber, 1 };
  Moves.MarkerPositions = { { 5, 0, 0 } };
  Moves.MarkerVisible = { 0 };
  Moves.SegmentHealth = { -3, 7, std::numeric_limits< float >::quiet_NaN() };
  const auto Items = [&]( const VSubjectDynamicParameters& i_rMoves )
  {
    return Maker.State( 0, { Maker.Item< FlowSubject >( Subject, "Ada" ),
                             Maker.Item< FlowSubjectApplicationData >( Data, "Ada" ),
                             Maker.Item< FlowSubject >( Person( 1, "Twin" ), "Twin" ),
                             Maker.Item< FlowSubjectApplicationData >( Looks( 2 ), "Twin" ),
                             Maker.Item< FlowSubjectDynamicParameters >( i_rMoves, "Ada" ),
                             Maker.Item< FlowRigidObject >( {}, "Lost" ), Maker.Item< FlowSceneMesh >( {}, "Nothing" ),
                             Maker.Item< FlowSceneMeshSettings >( { true, -3 }, "Nothing" ) } );
  };
  const VSubjectGroup& rGroup = Group( EGroupSubject );
  Scene.Show( Items( Moves ) );
  for ( const EFlowSubjectGroup Kind : AllGroups )
  {
    ExpectSound( Group( Kind ) );
  }
  EXPECT_EQ( Names( EGroupSubject ), std::vector< std::string >{ "Ada" } ) << "the twin has two colours for three";
  EXPECT_EQ( rGroup.Sticks.size(), 1u );
  EXPECT_EQ( rGroup.Wires.size(), 1u );
  ASSERT_EQ( rGroup.Targets.size(), 1u );
  EXPECT_EQ( rGroup.Targets[0].Covariance, ( std::array< float, 9 >{} ) );
  EXPECT_EQ( rGroup.Health, ( std::vector< float >{ 0, 1, 1, 1, 1, 1 } ) );
  EXPECT_TRUE( std::isnan( rGroup.Poses[0][0] ) ) << "its bones have no order";
  EXPECT_EQ( Group( EGroupSceneMesh ).Records[0].Mesh.Scale, 1 );
  EXPECT_TRUE( std::isnan( Group( EGroupRigidObject ).Records[0].Root[0] ) ) << "nobody tracks it";
  MoxelGraphics::VScenePoint Point;
  EXPECT_FALSE( Scene.Registry().GetPosition( rGroup.Records[0].Item, Point ) );
  // Poses for some bones only, one of them broken.
  Moves.Segments.resize( 9 );
  Moves.Segments[1].R[4] = NotANumber;
  Scene.Show( Items( Moves ) );
  EXPECT_TRUE( std::isnan( rGroup.Poses[1][0] ) && !std::isnan( rGroup.Poses[5][0] ) );
  Moves.Segments.resize( 1 );
  Scene.Show( Items( Moves ) );
  EXPECT_TRUE( std::isnan( rGroup.Poses[5][0] ) && !std::isnan( rGroup.Poses[0][0] ) );
}

TEST_F( VSubjects, GeometryIsHeldByNameAndWholeShapesAreDrawn )
{
  VGeometrySet Set;
  Set.Points = { { 0, 0, 0 }, { 1, 0, 0 }, { 0, 1, 0 }, { std::numeric_limits< float >::quiet_NaN(), 0, 0 } };
  Set.Lines = { 0, 1, 1, 9, 2, 3, 2 };
  Set.Triangles = { 0, 1, 2, 0, 1, 3, 0, 1 };
  Set.Colour = 0x00332211;
  const auto Walls = Maker.Device< FlowGeometrySet >( Set, "Walls" );
  VFlowRenderGeometry& rGeometry = Scene.Geometry();
  const ZEK::VFlowStateRef State = Maker.State( 0, { Walls, Maker.Device< FlowGeometrySet >( {}, "Empty" ) } );
  Scene.Show( State );
  EXPECT_EQ( rGeometry.Sets().size(), 2u );
  EXPECT_EQ( rGeometry.Sets().at( "Walls" ), Walls );
  EXPECT_EQ( rGeometry.Points().Count(), 4u );
  ASSERT_EQ( rGeometry.Lines().size(), 2u );
  EXPECT_EQ( rGeometry.Lines()[1].Colour, 0xFF332211 );
  ASSERT_EQ( rGeometry.Triangles().size(), 3u );
  EXPECT_LT( rGeometry.Triangles()[0].Colour >> 24, 0xFFu );
  const auto* const pBefore = rGeometry.Lines().data();
  Scene.UpdateFromState( *Maker.State( 1, { Walls, Maker.Points( 1 ) } ), {} );
  EXPECT_EQ( rGeometry.Sets().size(), 1u );
  EXPECT_EQ( rGeometry.Lines().data(), pBefore );
  Scene.Show( Maker.State( 2, { Maker.Points( 1 ) } ) );
  EXPECT_TRUE( rGeometry.Sets().empty() && rGeometry.Lines().empty() && rGeometry.Points().IsEmpty() );
}

} // namespace FlowTest
