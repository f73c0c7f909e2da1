#include <Flow2Graphics/VFlowRenderSubjects.h>

#include <Flow2Graphics/VSubjectSelectionMaker.h>

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VRenderSubjectDynamics.h>
#include <MoxelGraphics/VRenderSubjectMarkers.h>

#include <algorithm>
#include <functional>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;

bool TakeItem( ZEK::VFlowItemRef& io_rHeld, const ZEK::IFlowState& i_rState, std::uint32_t i_Tag )
{
  ZEK::VFlowItemRef New;
  i_rState.FindItem( New, i_Tag, ZEK::EFlowTimeMatch::Overlap );
  const bool bOther = IsOtherValue( io_rHeld, New );
  io_rHeld = std::move( New );
  return bOther;
}

template < typename Types >
std::unique_ptr< VFlowRenderSubject > MakeGroup()
{
  return std::make_unique< VFlowRenderSubject >( std::make_unique< VSubjectSelectionMaker< Types > >() );
}
} // namespace

VFlowRenderSubjects::VFlowRenderSubjects( MoxelGraphics::VMoxelScene& i_rScene )
  : m_rScene( i_rScene )
  , m_Groups{ MakeGroup< VFlowSubjectTypes >(),
              MakeGroup< VFlowSubjectForSolvingTypes >(),
              MakeGroup< VFlowSubjectForRetargetingTypes >(),
              MakeGroup< VFlowRigidObjectTypes >(),
              MakeGroup< VFlowPropTypes >(),
              MakeGroup< VFlowSceneMeshTypes >() }
  , m_pMarkers( std::make_shared< MoxelGraphics::VRenderSubjectMarkers >( i_rScene ) )
  , m_pDynamics( std::make_shared< MoxelGraphics::VRenderSubjectDynamics >( i_rScene ) )
{
  const auto Of = [&]( EFlowSubjectGroup i_Group )
  {
    return &m_Groups[i_Group]->Group();
  };
  m_pMarkers->SetGroups( { Of( EGroupRigidObject ), Of( EGroupSubject ), Of( EGroupProp ), Of( EGroupSolving ) } );
  m_pDynamics->SetGroups( { Of( EGroupRigidObject ), Of( EGroupSubject ), Of( EGroupProp ), Of( EGroupSolving ),
                            Of( EGroupRetargeting ), Of( EGroupSceneMesh ) } );
}

VFlowRenderSubjects::~VFlowRenderSubjects()
{
  // The drawing objects may outlive the groups by a moment: the scene's list holds them too.
  m_pMarkers->SetGroups( {} );
  m_pDynamics->SetGroups( {} );
}

void VFlowRenderSubjects::MarkDirty()
{
  for ( const auto& rpGroup : m_Groups )
  {
    rpGroup->MarkDirty();
  }
}

void VFlowRenderSubjects::SetAssignments( std::shared_ptr< MoxelGraphics::IRenderType > i_pAssignments )
{
  m_pAssignments = std::move( i_pAssignments );
}

std::vector< std::shared_ptr< MoxelGraphics::IRenderType > > VFlowRenderSubjects::RenderTypes() const
{
  std::vector< std::shared_ptr< MoxelGraphics::IRenderType > > Types{ m_pMarkers, m_pDynamics };
  if ( m_pAssignments )
  {
    Types.push_back( m_pAssignments );
  }
  return Types;
}

void VFlowRenderSubjects::UpdateFromState( const ZEK::IFlowState& i_rState, const VSubjectChanges& i_rChanges )
{
  if ( !i_rChanges.empty() )
  {
    for ( const auto& rpGroup : m_Groups )
    {
      rpGroup->MarkDirty( i_rChanges );
    }
    m_bTaken = false;
  }
  TakeState( i_rState );
  m_bTaken = false;
  for ( const auto& rpGroup : m_Groups )
  {
    rpGroup->GiveIds( m_rScene.Registry() );
  }
}

void VFlowRenderSubjects::TakeState( const ZEK::IFlowState& i_rState )
{
  if ( std::exchange( m_bTaken, true ) )
  {
    return;
  }
  TakeSets( i_rState );
  bool bPlaced = m_Main.bChanged;
  for ( std::size_t Index = 0; Index < EGroupCount; ++Index )
  {
    m_Groups[Index]->Take( i_rState );
    m_Groups[Index]->PlaceMarkers( Index == EGroupSolving ? m_Solving : m_Main );
    bPlaced = bPlaced || m_Groups[Index]->WasPlaced();
  }
  if ( bPlaced )
  {
    CollectTaken();
  }
}

void VFlowRenderSubjects::TakeSets( const ZEK::IFlowState& i_rState )
{
  const bool bSet = TakeItem( m_Set, i_rState, ZEK::FlowTag< FlowReconstructionSet > );
  const bool bLabels = TakeItem( m_Labels, i_rState, ZEK::FlowTag< FlowReconstructionLabelSet > );
  m_Main = { ZEK::FlowPayload< VReconstructionSet >( m_Set.Get() ),
             ZEK::FlowPayload< VReconstructionLabelSet >( m_Labels.Get() ), bSet || bLabels };
  const bool bOwnSet = TakeItem( m_SolvingSet, i_rState, ZEK::FlowTag< FlowReconstructionSetForSolving > );
  const bool bOwnLabels = TakeItem( m_SolvingLabels, i_rState, ZEK::FlowTag< FlowReconstructionLabelSetForSolving > );
  const auto* const pOwn = ZEK::FlowPayload< VReconstructionSet >( m_SolvingSet.Get() );
  if ( pOwn )
  {
    m_Solving = { pOwn, ZEK::FlowPayload< VReconstructionLabelSet >( m_SolvingLabels.Get() ), bOwnSet || bOwnLabels };
  }
  else
  {
    m_Solving = m_Main;
    m_Solving.bChanged = m_Main.bChanged || m_bSolvingOwn;
  }
  m_bSolvingOwn = pOwn != nullptr;
}

void VFlowRenderSubjects::CollectTaken()
{
  m_Found.assign( m_Main.pSet ? m_Main.pSet->Items.size() : 0, 0 );
  for ( std::size_t Index = 0; Index < EGroupCount; ++Index )
  {
    const std::span< const std::uint8_t > Used = m_Groups[Index]->Used();
    // Markers of retargeted subjects are not drawn.
    if ( Index == EGroupRetargeting || ( Index == EGroupSolving && m_bSolvingOwn ) || Used.size() != m_Found.size() )
    {
      continue;
    }
    // Through pointers of its own, as bytes might else be those of the vector itself.
    std::transform( Used.begin(), Used.end(), m_Found.data(), m_Found.data(), std::bit_or<>() );
  }
  if ( m_Found != m_Taken )
  {
    m_Taken.swap( m_Found );
    ++m_TakenGeneration;
  }
}

} // namespace Flow2Graphics
