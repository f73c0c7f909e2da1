#include "SimulatedSubjects.h"

#include "SimulatedStage.h"

#include <algorithm>
#include <cmath>

using namespace CoreMoxelTypes;
using namespace ZEK;

namespace HostSources::Simulation
{
namespace
{

constexpr f32 HealthOfLostBone = 0.15F;

VSubject Named( const VWalkerBody& i_rBody, std::uint32_t i_Id, const std::string& i_rName, bool i_bMarkers )
{
  VSubject Subject = i_rBody.Subject();
  Subject.Id = i_Id;
  Subject.Name = i_rName;
  if ( !i_bMarkers )
  {
    Subject.Markers.clear();
    Subject.Clusters.clear();
  }
  return Subject;
}

VSubjectApplicationData LooksOf( const VSubject& i_rSubject, u32 i_Colour, const char* i_pSkin )
{
  VSubjectApplicationData Looks;
  FillColours( i_rSubject, i_Colour, Looks );
  Looks.Skin = i_pSkin;
  return Looks;
}

/// The poses of a plain body, as those of another with the same bones and more.
VSubjectParametrised ParametrisedOf( const VSubject& i_rSubject, const VWalkerBody& i_rBody, double i_MassKg )
{
  VSubjectParametrised Result;
  Result.Base = i_rSubject;
  for ( const VNamedPose& rPose : NamedPoses( i_rBody ) )
  {
    std::vector< f64 >& rState = Result.Poses.emplace_back( i_rBody.Tree().StateSize() );
    i_rBody.TakeState( rPose.State, rState );
    Result.PoseNames.push_back( rPose.Name );
  }
  Result.Parameters = { { "Height", i_rBody.Neutral()[i_rBody.Places()[EHeadEnd]].Origin.z }, { "Mass", i_MassKg } };
  return Result;
}

/// The same angles, and a way as much shorter as the legs are.
VWalkerState DrivenState( const VWalkerState& i_rState, const VWalkerBody& i_rBody, const VWalkerBody& i_rCharacter )
{
  VWalkerState State = i_rState;
  const double Share = i_rCharacter.Shape().Legs / i_rBody.Shape().Legs;
  for ( int Axis = 3; Axis < 6; ++Axis )
  {
    State[DegreeOf( EHips ) + Axis] *= Share;
  }
  return State;
}

Rigid PlaceOf( const VFrame& i_rFrame )
{
  const VFrame& rF = i_rFrame;
  return { { rF.X.x, rF.Y.x, rF.Z.x, rF.X.y, rF.Y.y, rF.Z.y, rF.X.z, rF.Y.z, rF.Z.z },
           { rF.Origin.x, rF.Origin.y, rF.Origin.z } };
}

} // namespace

VSimulatedSubjects::VSimulatedSubjects( const VSimulatedCaptureOptions& i_rOptions, const VMarkerStage& i_rStage )
  : m_rOptions( i_rOptions )
  , m_rStage( i_rStage )
{
  for ( std::uint32_t Performer = 0; Performer < i_rOptions.Performers; ++Performer )
  {
    const std::string& rName = m_Names.emplace_back( PerformerName( Performer ) );
    const VBodyShape& rShape = i_rStage.Body( Performer ).Shape();
    if ( i_rOptions.bSolving )
    {
      VWalkerBody Body( rShape, VWalkerBody::EDetail::Full );
      VSubject Subject = Named( Body, PerformerId( Performer ), rName, true );
      m_Solving.push_back( { rName, std::move( Subject ), std::move( Body ) } );
    }
    if ( i_rOptions.bRetargeting )
    {
      VBodyShape Shape = CharacterShape;
      Shape.Legs *= rShape.Legs; // so that steps as long as the legs carry it along
      VWalkerBody Body( Shape );
      const std::string Name = rName + " Character";
      VSubject Subject = Named( Body, CharacterId( i_rOptions.Performers, Performer ), Name, false );
      m_Characters.push_back( { Name, std::move( Subject ), std::move( Body ) } );
    }
  }
}

void VSimulatedSubjects::AddPerformer( std::uint32_t i_Performer, VItemMaker& io_rMaker,
                                       std::vector< VFlowItemRef >& io_rSlow ) const
{
  const u32 Colour = PerformerColour( i_Performer );
  const double MassKg = m_rStage.Styles()[i_Performer].MassKg;
  const std::string& rName = m_Names[i_Performer];
  const VWalkerBody& rBody = m_rStage.Body( i_Performer );
  const VSubject Subject = Named( rBody, PerformerId( i_Performer ), rName, true );
  const auto Add = [&]< typename TFlow >( const std::string& i_rName, auto i_Value )
  {
    io_rMaker.AddSlow< TFlow >( io_rSlow, EFlowNameObject, i_rName, std::move( i_Value ) );
  };
  Add.operator()< FlowSubject >( rName, Subject );
  Add.operator()< FlowSubjectApplicationData >( rName, LooksOf( Subject, Colour, PerformerSkin ) );
  Add.operator()< FlowSubjectParametrised >( rName, ParametrisedOf( Subject, rBody, MassKg ) );
  VSubjectSettings Settings;
  Settings.Colour = Colour;
  Add.operator()< FlowSubjectSettings >( rName, Settings );
  if ( m_rOptions.bSolving )
  {
    const VSecond& rSolving = m_Solving[i_Performer];
    const u32 Paler = Mixed( Colour, 0xFFFFFFFFu, 0.5 );
    Add.operator()< FlowSubjectForSolving >( rName, rSolving.Subject );
    Add.operator()< FlowSubjectApplicationDataForSolving >( rName, LooksOf( rSolving.Subject, Paler, PerformerSkin ) );
    Add.operator()< FlowSubjectParametrisedForSolving >( rName,
                                                         ParametrisedOf( rSolving.Subject, rSolving.Body, MassKg ) );
  }
  if ( m_rOptions.bRetargeting )
  {
    const VSecond& rCharacter = m_Characters[i_Performer];
    const u32 Duller = Mixed( Colour, 0xFF808080u, 0.6 );
    Add.operator()< FlowSubjectForRetargeting >( rCharacter.Name, rCharacter.Subject );
    Add.operator()< FlowSubjectApplicationDataForRetargeting >( rCharacter.Name,
                                                                LooksOf( rCharacter.Subject, Duller, CharacterSkin ) );
  }
}

void VSimulatedSubjects::AddObjects( VItemMaker& io_rMaker, std::vector< VFlowItemRef >& io_rSlow ) const
{
  VSubject Prop;
  VSubjectApplicationData PropLooks;
  FillProp( Prop, PropLooks );
  Prop.Id = PropId( m_rOptions.Performers );
  VSubjectSettings Settings;
  Settings.Kind = VSubjectSettings::Prop;
  Settings.Colour = PropLooks.MarkerColours.front();
  const std::string PropName = Prop.Name;
  VSubjectParametrised Poses;
  Poses.Base = Prop;
  Poses.Poses = { std::vector< f64 >( 6 ) };
  Poses.PoseNames = { "Neutral" };
  io_rMaker.AddSlow< FlowSubject >( io_rSlow, EFlowNameObject, PropName, std::move( Prop ) );
  io_rMaker.AddSlow< FlowSubjectApplicationData >( io_rSlow, EFlowNameObject, PropName, std::move( PropLooks ) );
  io_rMaker.AddSlow< FlowSubjectParametrised >( io_rSlow, EFlowNameObject, PropName, std::move( Poses ) );
  io_rMaker.AddSlow< FlowSubjectSettings >( io_rSlow, EFlowNameObject, PropName, std::move( Settings ) );

  VRigidObject Wand;
  VRigidObjectApplicationData WandLooks;
  FillWand( Wand, WandLooks );
  Wand.Id = WandId( m_rOptions.Performers );
  const std::string WandName = Wand.Name;
  io_rMaker.AddSlow< FlowRigidObject >( io_rSlow, EFlowNameObject, WandName, std::move( Wand ) );
  io_rMaker.AddSlow< FlowRigidObjectApplicationData >( io_rSlow, EFlowNameObject, WandName, std::move( WandLooks ) );
}

void VSimulatedSubjects::AddSlowItems( VItemMaker& io_rMaker, std::vector< VFlowItemRef >& io_rSlow ) const
{
  for ( std::uint32_t Performer = 0; Performer < m_rOptions.Performers; ++Performer )
  {
    AddPerformer( Performer, io_rMaker, io_rSlow );
  }
  if ( m_rOptions.bObjects )
  {
    AddObjects( io_rMaker, io_rSlow );
  }
}

void VSimulatedSubjects::See( std::uint32_t i_Performer, const std::vector< VStageMarker >& i_rMarkers,
                              const VReconstructionSet& i_rPoints )
{
  m_Seen.Visible.fill( 0 );
  m_Seen.Good.fill( 0 );
  const VStageMarker* pMarker = i_rMarkers.data() + i_Performer * WalkerMarkers;
  for ( std::size_t Index = 0; Index < WalkerMarkers; ++Index, ++pMarker )
  {
    if ( pMarker->Reconstruction >= 0 )
    {
      m_Seen.Positions[pMarker->MarkerId] =
          i_rPoints.Items[static_cast< std::size_t >( pMarker->Reconstruction )].Position;
      m_Seen.Visible[pMarker->MarkerId] = 1;
      m_Seen.Good[pMarker->MarkerId] = !pMarker->bSwapped;
    }
  }
}

/// A bone is as healthy as many of its markers are where they belong; one without markers as its parent.
void VSimulatedSubjects::FillSeen( const VSubject& i_rSubject, VParameters& io_rParameters ) const
{
  const std::size_t Bones = i_rSubject.Segments.size();
  io_rParameters.MarkerVisible.assign( m_Seen.Visible.begin(), m_Seen.Visible.end() );
  io_rParameters.SegmentHealth.resize( Bones );
  double Squares = 0;
  std::size_t Count = 0;
  for ( std::size_t Index = 0; Index < WalkerMarkers; ++Index )
  {
    if ( m_Seen.Visible[Index] )
    {
      const D3 Off = m_Seen.Positions[Index] - io_rParameters.MarkerPositions[Index];
      Squares += Dot( Off, Off );
      ++Count;
    }
  }
  io_rParameters.Error =
      static_cast< f32 >( std::sqrt( Squares / static_cast< double >( std::max< std::size_t >( Count, 1 ) ) ) );
  constexpr std::size_t Most = EBones + 16;
  std::array< std::uint8_t, Most > Markers{}, Good{};
  for ( const auto& [Segment, Marker] : i_rSubject.Clusters )
  {
    ++Markers[Segment];
    Good[Segment] += m_Seen.Good[Marker];
  }
  for ( std::size_t Bone = 0; Bone < Bones; ++Bone )
  {
    const i32 Parent = i_rSubject.Segments[Bone].Parent;
    const f32 Share = static_cast< f32 >( Good[Bone] ) / static_cast< f32 >( std::max< int >( Markers[Bone], 1 ) );
    io_rParameters.SegmentHealth[Bone] =
        Markers[Bone] > 0 ? HealthOfLostBone + ( 1 - HealthOfLostBone ) * Share
                          : ( Parent < 0 ? 1 : io_rParameters.SegmentHealth[static_cast< std::size_t >( Parent )] );
  }
}

void VSimulatedSubjects::FillPose( const VSecond& i_rSecond, const VWalkerState& i_rState, VParameters& o_rParameters )
{
  const ComputeSubject::VComputeSubjectFK& rTree = i_rSecond.Body.Tree();
  o_rParameters.JointState.resize( rTree.StateSize() );
  i_rSecond.Body.TakeState( i_rState, o_rParameters.JointState );
  m_Bones.resize( rTree.SegmentCount() );
  (void)rTree.Pose( o_rParameters.JointState, 1, m_Bones ); // the sizes are those of the tree
  o_rParameters.Segments.reserve( m_Bones.size() );
  for ( const auto& rBone : m_Bones )
  {
    o_rParameters.Segments.push_back( rBone.ToRigid() );
  }
  o_rParameters.MarkerPositions.reserve( i_rSecond.Subject.Markers.size() );
  for ( const VMarker& rMarker : i_rSecond.Subject.Markers )
  {
    o_rParameters.MarkerPositions.push_back(
        Placed( m_Bones[static_cast< std::size_t >( rMarker.Segment )], rMarker.Local ) );
  }
}

void VSimulatedSubjects::AddFrame( double i_Seconds, const std::vector< VWalkerPose >& i_rPoses,
                                   const std::vector< VStageMarker >& i_rMarkers, const VReconstructionSet& i_rPoints,
                                   VItemMaker& io_rMaker, IFlowState& io_rState )
{
  for ( std::uint32_t Performer = 0; Performer < m_rOptions.Performers; ++Performer )
  {
    const VWalkerPose& rPose = i_rPoses[Performer];
    See( Performer, i_rMarkers, i_rPoints );
    VFlowItemRef Item;
    if ( auto* pOwn = io_rMaker.MakeNamed< FlowSubjectDynamicParameters >( Item, EFlowNameObject, m_Names[Performer] ) )
    {
      pOwn->JointState.assign( rPose.State.begin(), rPose.State.end() );
      pOwn->Segments.reserve( EBones );
      for ( const auto& rBone : rPose.Segments )
      {
        pOwn->Segments.push_back( rBone.ToRigid() );
      }
      pOwn->MarkerPositions.assign( rPose.Solved.begin(), rPose.Solved.end() );
      FillSeen( m_rStage.Body( Performer ).Subject(), *pOwn );
      io_rState.AddItem( Item );
    }
    if ( m_rOptions.bSolving )
    {
      const VSecond& rSolving = m_Solving[Performer];
      if ( auto* pSolved =
               io_rMaker.MakeNamed< FlowSubjectDynamicParametersForSolving >( Item, EFlowNameObject, rSolving.Name ) )
      {
        FillPose( rSolving, rPose.State, *pSolved );
        FillSeen( rSolving.Subject, *pSolved );
        io_rState.AddItem( Item );
      }
    }
    if ( m_rOptions.bRetargeting )
    {
      const VSecond& rCharacter = m_Characters[Performer];
      if ( auto* pPosed = io_rMaker.MakeNamed< FlowSubjectDynamicParametersForRetargeting >( Item, EFlowNameObject,
                                                                                             rCharacter.Name ) )
      {
        FillPose( rCharacter, DrivenState( rPose.State, m_rStage.Body( Performer ), rCharacter.Body ), *pPosed );
        pPosed->SegmentHealth.assign( pPosed->Segments.size(), 1 );
        io_rState.AddItem( Item );
      }
    }
  }
  if ( m_rOptions.bObjects )
  {
    AddProp( i_Seconds, io_rMaker, io_rState );
    AddWand( i_Seconds, io_rMaker, io_rState );
  }
}

void VSimulatedSubjects::AddProp( double i_Seconds, VItemMaker& io_rMaker, IFlowState& io_rState ) const
{
  static const std::string Name = "Prop";
  VFlowItemRef Item;
  if ( auto* pMotion = io_rMaker.MakeNamed< FlowSubjectDynamicParameters >( Item, EFlowNameObject, Name ) )
  {
    const VFrame Frame = PropAt( i_Seconds );
    const D3 Turn = RotationVector( VFrame{}, Frame );
    pMotion->JointState = { Turn.x, Turn.y, Turn.z, Frame.Origin.x, Frame.Origin.y, Frame.Origin.z };
    pMotion->Segments.assign( 1, PlaceOf( Frame ) );
    std::array< D3, ObjectMarkers > Markers;
    PoseObjects( i_Seconds, Markers );
    pMotion->MarkerPositions.assign( Markers.begin(), Markers.begin() + PropMarkers );
    pMotion->MarkerVisible.assign( PropMarkers, 1 );
    pMotion->SegmentHealth.assign( 1, 1 );
    pMotion->Error = static_cast< f32 >( m_rOptions.NoiseMm );
    io_rState.AddItem( Item );
  }
}

void VSimulatedSubjects::AddWand( double i_Seconds, VItemMaker& io_rMaker, IFlowState& io_rState ) const
{
  static const std::string Name = "Wand";
  VFlowItemRef Item;
  if ( auto* pMotion = io_rMaker.MakeNamed< FlowRigidObjectDynamicParameters >( Item, EFlowNameObject, Name ) )
  {
    pMotion->Pose = PlaceOf( WandAt( i_Seconds ) );
    pMotion->Tracked = true;
    pMotion->MarkerVisible.assign( WandMarkers, 1 );
    pMotion->Error = static_cast< f32 >( m_rOptions.NoiseMm );
    io_rState.AddItem( Item );
  }
}

} // namespace HostSources::Simulation
