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
  m_UnlabelledPoints.Clear();
  m_bLabelledStale = true;
  const std::span< const std::uint8_t > Taken = m_pSubjects->TakenReconstructions();
  if ( const auto* const pSet = ZEK::FlowPayload< VReconstructionSet >( m_Set.Get() ) )
  {
    const std::vector< VReconstruction >& rItems = pSet->Items;
    for ( std::size_t Index = 0; Index < rItems.size(); ++Index )
    {
      if ( Taken[Index] == 0 )
      {
        m_UnlabelledPoints.Points.push_back( PointOf( rItems[Index] ) );
        m_UnlabelledPoints.Reconstruction.push_back( static_cast< std::uint32_t >( Index ) );
        m_UnlabelledPoints.Ids.push_back( rItems[Index].Id );
        m_UnlabelledPoints.Residuals.push_back( rItems[Index].Residual );
      }
    }
  }
  SetReconstructions( m_UnlabelledPoints.Points );
  SetResiduals( m_UnlabelledPoints.Residuals );
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
