#include <Flow2Graphics/VFlowRenderFloorGrid.h>

#include <CoreMoxelTypes/FlowTypes.h>

namespace Flow2Graphics
{

void VFlowRenderFloorGrid::Update( const ZEK::IFlowState& i_rState )
{
  ZEK::VFlowItemRef New;
  i_rState.FindItem( New, ZEK::FlowTag< CoreMoxelTypes::FlowVolumeProperties >, ZEK::EFlowTimeMatch::Overlap );
  if ( !IsOtherValue( m_Held, New ) )
  {
    return;
  }
  m_Held = New;
  if ( const auto* const pVolume = ZEK::FlowPayload< CoreMoxelTypes::VVolumeProperties >( m_Held.Get() ) )
  {
    SetExtents( { pVolume->XMin, pVolume->YMin, pVolume->XMax, pVolume->YMax } );
    SetSpacing( pVolume->MajorSpacing, pVolume->Subdivision );
  }
}

} // namespace Flow2Graphics
