#include <Flow2Graphics/VFlowRenderReconstructionVolume.h>

#include <CoreMoxelTypes/Parameters.h>

namespace Flow2Graphics
{

VFlowRenderReconstructionVolume::VFlowRenderReconstructionVolume(
    std::shared_ptr< CoreGraphics::VResources > i_pResources )
  : VRenderReconstructionVolume( std::move( i_pResources ) )
  , m_Parameters( CoreMoxelTypes::ReconstructionVolumeNames )
{
}

void VFlowRenderReconstructionVolume::Update( const ZEK::IFlowState& i_rState )
{
  const ZEK::VFlowItemRef New( Flow2Utils::FindParameters( i_rState, CoreMoxelTypes::ReconstructionTarget ) );
  if ( !IsOtherValue( m_Held, New ) )
  {
    return;
  }
  if ( New && m_Parameters.Read( New.Get() ).IsOk() )
  {
    const auto Values = m_Parameters.Values();
    SetVolume( { Values[0], Values[1], Values[2] }, { Values[3], Values[4], Values[5] } );
  }
  m_Held = New;
}

} // namespace Flow2Graphics
