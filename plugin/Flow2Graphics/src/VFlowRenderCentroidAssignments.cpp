#include <Flow2Graphics/VFlowRenderCentroidAssignments.h>

#include <CoreMoxelTypes/FlowTypes.h>
#include <MoxelGraphics/VMoxelScene.h>

#include <utility>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;

bool Take( ZEK::VFlowItemRef& io_rHeld, const ZEK::IFlowState& i_rState, std::uint32_t i_Tag )
{
  ZEK::VFlowItemRef New;
  i_rState.FindItem( New, i_Tag, ZEK::EFlowTimeMatch::Overlap );
  const bool bOther = IsOtherValue( io_rHeld, New );
  io_rHeld = std::move( New );
  return bOther;
}
} // namespace

VFlowRenderCentroidAssignments::VFlowRenderCentroidAssignments(
    MoxelGraphics::VMoxelScene& i_rScene, std::shared_ptr< const VFlowRenderCameraProvider > i_pProvider )
  : VRenderCentroidAssignments( i_rScene.Resources() )
  , m_rScene( i_rScene )
  , m_pProvider( std::move( i_pProvider ) )
{
}

void VFlowRenderCentroidAssignments::Update( const ZEK::IFlowState& i_rState )
{
  const bool bSet = Take( m_Set, i_rState, ZEK::FlowTag< FlowReconstructionSet > );
  const bool bLabels = Take( m_Labels, i_rState, ZEK::FlowTag< FlowReconstructionLabelSet > );
  const bool bCameras = TakeCameras();
  const std::uint64_t Generation = m_rScene.Registry().MarksGeneration();
  const bool bMarks = std::exchange( m_MarksGeneration, Generation ) != Generation;
  m_bCamerasStale = m_bCamerasStale || bCameras || bMarks;
  m_bReconstructionsStale = m_bReconstructionsStale || m_bCamerasStale || bSet || bLabels;
}

void VFlowRenderCentroidAssignments::FillRecords()
{
  if ( std::exchange( m_bCamerasStale, false ) )
  {
    FillCameras();
  }
  if ( std::exchange( m_bReconstructionsStale, false ) )
  {
    FillReconstructions();
  }
}

/// Whether a camera has other assignments than it had, or stands elsewhere.
bool VFlowRenderCentroidAssignments::TakeCameras()
{
  if ( std::exchange( m_CamerasGeneration, m_pProvider->GetGeneration() ) == m_pProvider->GetGeneration() )
  {
    return false;
  }
  const auto& rCameras = m_pProvider->FlowCameras();
  bool bChanged = m_Taken.size() != rCameras.size();
  m_Taken.resize( rCameras.size() );
  for ( std::size_t Index = 0; Index < rCameras.size(); ++Index )
  {
    const VFlowRenderCamera& rCamera = *rCameras[Index];
    VTaken& rTaken = m_Taken[Index];
    const ZEK::IFlowItem* const pItem = rCamera.GetItem( ECameraCentroidAssignments );
    if ( rTaken.pCamera != &rCamera || rTaken.Assignments.Get() != pItem ||
         rTaken.ChangeCount != rCamera.GetInfo().ChangeCount )
    {
      rTaken = { ZEK::VFlowItemRef( const_cast< ZEK::IFlowItem* >( pItem ) ), rCamera.GetInfo().ChangeCount, &rCamera };
      bChanged = true;
    }
  }
  return bChanged;
}

void VFlowRenderCentroidAssignments::FillCameras()
{
  const auto& rCameras = m_pProvider->FlowCameras();
  Cameras().resize( rCameras.size() );
  for ( std::size_t Index = 0; Index < rCameras.size(); ++Index )
  {
    const VFlowRenderCamera& rCamera = *rCameras[Index];
    MoxelGraphics::VCameraAssignments& rRecord = Cameras()[Index];
    const ZEK::VMatrix4& rPose = rCamera.GetModel().WorldFromCamera;
    rRecord.Centre = { rPose[12], rPose[13], rPose[14] };
    rRecord.Selected = rCamera.GetMarks().Device & MoxelGraphics::EIdSelected;
    rRecord.Indices.clear();
    const auto* const pSet = rCamera.Value< VCentroidAssignmentSet >( ECameraCentroidAssignments );
    if ( pSet && rCamera.GetInfo().bCalibrated )
    {
      for ( const std::int32_t Reconstruction : pSet->Reconstruction )
      {
        rRecord.Indices.push_back( Reconstruction < 0 ? NoReconstruction
                                                      : static_cast< std::uint32_t >( Reconstruction ) );
      }
    }
  }
}

void VFlowRenderCentroidAssignments::FillReconstructions()
{
  m_Reconstructions.clear();
  if ( const auto* const pSet = ZEK::FlowPayload< VReconstructionSet >( m_Set.Get() ) )
  {
    for ( const VReconstruction& rItem : pSet->Items )
    {
      m_Reconstructions.push_back(
          { { static_cast< float >( rItem.Position.x ), static_cast< float >( rItem.Position.y ),
              static_cast< float >( rItem.Position.z ) },
            0 } );
    }
  }
  const auto* const pLabels = ZEK::FlowPayload< VReconstructionLabelSet >( m_Labels.Get() );
  const auto Select = [&]( std::uint32_t i_Reconstruction )
  {
    if ( i_Reconstruction < m_Reconstructions.size() )
    {
      m_Reconstructions[i_Reconstruction].Selected = 1;
    }
  };
  for ( const MoxelGraphics::VSelectionRegistry::VMark& rMark : m_rScene.Registry().Marks() )
  {
    if ( ( rMark.Flags & MoxelGraphics::EIdSelected ) == 0 )
    {
      continue;
    }
    if ( rMark.Item.Kind == ZEK::ESelectReconstruction )
    {
      Select( rMark.Item.Sub );
    }
    else if ( rMark.Item.Kind == ZEK::ESelectMarker && pLabels )
    {
      for ( const VReconstructionLabelSet::L& rLabel : pLabels->Labels )
      {
        if ( rLabel.SubjectId == rMark.Item.Object && rLabel.MarkerId == rMark.Item.Sub )
        {
          Select( rLabel.Reconstruction );
        }
      }
    }
  }
  SetReconstructions( m_Reconstructions );
}

} // namespace Flow2Graphics
