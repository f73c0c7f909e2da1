#include <Flow2Graphics/VFlowRenderReconstructions.h>

#include <Flow2Graphics/VFlowRenderSubjects.h>

#include <CoreMoxelTypes/FlowTypes.h>
#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <algorithm>

namespace Flow2Graphics
{
namespace
{
using CoreMoxelTypes::VReconstruction;
using CoreMoxelTypes::VReconstructionSet;
using MoxelGraphics::VScenePoint;
using ZEK::EFlowTimeMatch;

/// Of points that were recorded without one, mm.
constexpr float UsualRadius = 7.0F;
constexpr unsigned FlagShift = 21;
/// How many points ahead the memory is asked for one.
constexpr std::size_t Ahead = 32;
/// How much larger than a marker the sphere is that shows its residual.
constexpr float CoverScale = 1.1F;

bool Take( ZEK::VFlowItemRef& io_rHeld, const ZEK::IFlowState& i_rState, std::uint32_t i_Tag )
{
  ZEK::VFlowItemRef New;
  i_rState.FindItem( New, i_Tag, EFlowTimeMatch::Overlap );
  const bool bOther = IsOtherValue( io_rHeld, New );
  io_rHeld = std::move( New );
  return bOther;
}

VScenePoint PointOf( const VReconstruction& i_rReconstruction )
{
  return { static_cast< float >( i_rReconstruction.Position.x ), static_cast< float >( i_rReconstruction.Position.y ),
           static_cast< float >( i_rReconstruction.Position.z ),
           i_rReconstruction.Radius > 0 ? i_rReconstruction.Radius : UsualRadius };
}

/// The flags of a range's members, empty when none has any.
void MarkMembers( std::vector< std::uint8_t >& o_rFlags, const MoxelGraphics::IRangeResolver& i_rMembers,
                  std::size_t i_Count, const MoxelGraphics::VSelectionRegistry& i_rRegistry )
{
  o_rFlags.clear();
  for ( const MoxelGraphics::VSelectionRegistry::VMark& rMark : i_rRegistry.Marks() )
  {
    std::uint32_t Index = 0;
    if ( i_rMembers.FindIndex( rMark.Item, Index ) )
    {
      o_rFlags.resize( i_Count, 0 );
      o_rFlags[Index] = static_cast< std::uint8_t >( rMark.Flags >> FlagShift );
    }
  }
}
} // namespace

VFlowRenderReconstructions::VFlowRenderReconstructions( MoxelGraphics::VMoxelScene& i_rScene,
                                                        std::shared_ptr< VFlowRenderSubjects > i_pSubjects )
  : VRenderReconstructions( i_rScene )
  , m_pSubjects( std::move( i_pSubjects ) )
{
}

void VFlowRenderReconstructions::Update( const ZEK::IFlowState& i_rState )
{
  m_pSubjects->TakeState( i_rState );
  const bool bSet = Take( m_Set, i_rState, ZEK::FlowTag< CoreMoxelTypes::FlowReconstructionSet > );
  const std::uint64_t Taken = m_pSubjects->TakenGeneration();
  if ( std::exchange( m_TakenGeneration, Taken ) != Taken || bSet )
  {
    Rebuild();
  }
  GiveIds();
}

void VFlowRenderReconstructions::Rebuild()
{
  m_bLabelledStale = m_bResidualsStale = true;
  m_UnlabelledPoints.Set = m_Set;
  const std::span< const std::uint8_t > Taken = m_pSubjects->TakenReconstructions();
  const auto* const pSet = ZEK::FlowPayload< VReconstructionSet >( m_Set.Get() );
  const std::size_t Count =
      pSet ? static_cast< std::size_t >( std::count( Taken.begin(), Taken.end(), std::uint8_t{ 0 } ) ) : 0;
  m_UnlabelledPoints.Points.resize( Count );
  m_UnlabelledPoints.Reconstruction.resize( Count );
  const VReconstruction* const pItems = pSet ? pSet->Items.data() : nullptr;
  VScenePoint* pPoint = m_UnlabelledPoints.Points.data();
  std::uint32_t* pReconstruction = m_UnlabelledPoints.Reconstruction.data();
  for ( std::uint32_t Index = 0; Count != 0 && Index < Taken.size(); ++Index )
  {
    if ( Taken[Index] == 0 )
    {
      // A new state lies in the memory, not in a cache.
      __builtin_prefetch( pItems + std::min< std::size_t >( Index + Ahead, Taken.size() ) );
      *pPoint++ = PointOf( pItems[Index] );
      *pReconstruction++ = Index;
    }
  }
  SetReconstructions( m_UnlabelledPoints.Points );
}

void VFlowRenderReconstructions::FillResiduals()
{
  if ( !std::exchange( m_bResidualsStale, false ) )
  {
    return;
  }
  m_Residuals.clear();
  const auto* const pSet = ZEK::FlowPayload< VReconstructionSet >( m_Set.Get() );
  for ( const std::uint32_t Index : m_UnlabelledPoints.Reconstruction )
  {
    m_Residuals.push_back( pSet->Items[Index].Residual );
  }
  SetResiduals( m_Residuals );
}

bool VFlowRenderReconstructions::HasLabelled() const
{
  const std::span< const std::uint8_t > Taken = m_pSubjects->TakenReconstructions();
  return std::find( Taken.begin(), Taken.end(), 1 ) != Taken.end();
}

/// Subjects draw their markers themselves; here they are only for their residuals, and cover the markers.
void VFlowRenderReconstructions::FillLabelled( const MoxelGraphics::VSceneOptions& i_rOptions,
                                               MoxelGraphics::VSphereSizing& io_rSizing )
{
  const bool bByResidual = i_rOptions.ReconstructionResiduals;
  io_rSizing = { i_rOptions.MarkerRadius ? -1.0F : UsualRadius, io_rSizing.Scale * CoverScale };
  const bool bWere = std::exchange( m_bLabelledShown, bByResidual );
  if ( bWere == bByResidual && ( !bByResidual || !m_bLabelledStale ) )
  {
    return;
  }
  m_bLabelledStale = false;
  m_LabelledPoints.clear();
  m_LabelledResiduals.clear();
  if ( const auto* const pSet = ZEK::FlowPayload< VReconstructionSet >( m_Set.Get() ); pSet && bByResidual )
  {
    for ( const EFlowSubjectGroup Group : { EGroupSubject, EGroupRigidObject, EGroupProp } )
    {
      const VFlowRenderSubject& rSubjects = m_pSubjects->Group( Group );
      for ( std::size_t Index = 0; Index < rSubjects.Reconstructions().size(); ++Index )
      {
        const std::uint32_t Reconstruction = rSubjects.Reconstructions()[Index];
        if ( Reconstruction < pSet->Items.size() )
        {
          m_LabelledPoints.push_back( rSubjects.Group().Markers[Index] );
          m_LabelledResiduals.push_back( pSet->Items[Reconstruction].Residual );
        }
      }
    }
  }
  SetLabelled( m_LabelledPoints );
  SetLabelledResiduals( m_LabelledResiduals );
}

void VFlowRenderReconstructions::GiveIds()
{
  MoxelGraphics::VSelectionRegistry& rRegistry = m_rScene.Registry();
  const auto Count = static_cast< std::uint32_t >( m_UnlabelledPoints.Points.size() );
  MarkMembers( m_UnlabelledFlags, m_UnlabelledPoints, Count, rRegistry );
  SetReconstructionIds( Count != 0 ? rRegistry.AllocateRange( Count, m_UnlabelledPoints ) : 0, m_UnlabelledFlags );
}

} // namespace Flow2Graphics
