#include <Flow2Graphics/VFlowRenderReconstructions.h>

#include <CoreMoxelTypes/FlowTypes.h>
#include <MoxelGraphics/VMoxelScene.h>

namespace Flow2Graphics
{
namespace
{
using CoreMoxelTypes::VReconstruction;
using CoreMoxelTypes::VReconstructionLabelSet;
using CoreMoxelTypes::VReconstructionSet;
using MoxelGraphics::VScenePoint;
using ZEK::EFlowTimeMatch;

/// Of points that were recorded without one, mm.
constexpr float UsualRadius = 7.0F;
constexpr unsigned FlagShift = 21;

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

VFlowRenderReconstructions::VFlowRenderReconstructions( MoxelGraphics::VMoxelScene& i_rScene )
  : VRenderReconstructions( i_rScene )
{
  m_Subjects.AddCache< CoreMoxelTypes::FlowSubject >( Flow2TypesUtils::ETagRequirement::Required );
  m_Subjects.AddCache< CoreMoxelTypes::FlowSubjectApplicationData >( Flow2TypesUtils::ETagRequirement::Optional );
}

void VFlowRenderReconstructions::Update( const ZEK::IFlowState& i_rState )
{
  if ( TakeItems( i_rState ) )
  {
    Rebuild();
  }
  GiveIds();
}

bool VFlowRenderReconstructions::TakeItems( const ZEK::IFlowState& i_rState )
{
  const bool bSet = Take( m_Set, i_rState, ZEK::FlowTag< CoreMoxelTypes::FlowReconstructionSet > );
  const bool bLabels = Take( m_Labels, i_rState, ZEK::FlowTag< CoreMoxelTypes::FlowReconstructionLabelSet > );
  const bool bSubjects = TakeSubjects( i_rState );
  return bSet || bLabels || bSubjects;
}

bool VFlowRenderReconstructions::TakeSubjects( const ZEK::IFlowState& i_rState )
{
  using namespace CoreMoxelTypes;
  m_Subjects.Update( i_rState, ZEK::EFlowNameObject, EFlowTimeMatch::Overlap, i_rState.GetKey() );
  if ( !m_Subjects.NamesChanged() && !m_Subjects.Changed( ZEK::FlowTag< FlowSubject > ) &&
       !m_Subjects.Changed( ZEK::FlowTag< FlowSubjectApplicationData > ) )
  {
    return false;
  }
  m_Subjects.Items< FlowSubject >( m_SubjectItems );
  m_Subjects.Items< FlowSubjectApplicationData >( m_DataItems );
  m_LabelledPoints.Subjects.clear();
  for ( std::size_t Slot = 0; Slot < m_SubjectItems.size(); ++Slot )
  {
    if ( const auto* const pSubject = m_Subjects.Values< FlowSubject >()[Slot] )
    {
      m_LabelledPoints.Subjects.push_back( { m_SubjectItems[Slot], m_DataItems[Slot], pSubject,
                                             m_Subjects.Values< FlowSubjectApplicationData >()[Slot] } );
    }
  }
  m_SubjectItems.clear();
  m_DataItems.clear();
  return true;
}

void VFlowRenderReconstructions::Rebuild()
{
  m_UnlabelledPoints.Clear();
  m_LabelledPoints.ClearPoints();
  if ( const auto* const pSet = ZEK::FlowPayload< VReconstructionSet >( m_Set.Get() ) )
  {
    const std::vector< VReconstruction >& rItems = pSet->Items;
    m_bLabelled.assign( rItems.size(), 0 );
    if ( const auto* const pLabels = ZEK::FlowPayload< VReconstructionLabelSet >( m_Labels.Get() ) )
    {
      for ( const VReconstructionLabelSet::L& rLabel : pLabels->Labels )
      {
        if ( rLabel.Reconstruction >= rItems.size() || m_bLabelled[rLabel.Reconstruction] != 0 )
        {
          continue;
        }
        const VReconstruction& rItem = rItems[rLabel.Reconstruction];
        m_bLabelled[rLabel.Reconstruction] = m_LabelledPoints.Add( rLabel, PointOf( rItem ), rItem.Residual ) ? 1 : 0;
      }
    }
    for ( std::size_t Index = 0; Index < rItems.size(); ++Index )
    {
      if ( m_bLabelled[Index] == 0 )
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
  SetLabelled( m_LabelledPoints.Points );
  SetLabelledColours( m_LabelledPoints.Colours );
  SetLabelledResiduals( m_LabelledPoints.Residuals );
}

void VFlowRenderReconstructions::GiveIds()
{
  MoxelGraphics::VSelectionRegistry& rRegistry = m_rScene.Registry();
  const auto Give = [&]( const auto& i_rPoints, std::vector< std::uint8_t >& io_rFlags )
  {
    MarkMembers( io_rFlags, i_rPoints, i_rPoints.Points.size(), rRegistry );
    return i_rPoints.Points.empty()
               ? 0
               : rRegistry.AllocateRange( static_cast< std::uint32_t >( i_rPoints.Points.size() ), i_rPoints );
  };
  const std::uint32_t FirstUnlabelled = Give( m_UnlabelledPoints, m_UnlabelledFlags );
  SetReconstructionIds( FirstUnlabelled, m_UnlabelledFlags );
  const std::uint32_t FirstLabelled = Give( m_LabelledPoints, m_LabelledFlags );
  SetLabelledIds( FirstLabelled, m_LabelledFlags );
}

} // namespace Flow2Graphics
