#pragma once

#include <Flow2Graphics/IFlowRenderType.h>

#include <Flow2TypesUtils/ParameterSet.h>
#include <MoxelGraphics/VRenderReconstructionVolume.h>

namespace Flow2Graphics
{

/// The volume as the parameters of the reconstruction have it. Without them, or with some that cannot be read, it keeps
/// what it was given last.
class VFlowRenderReconstructionVolume : public MoxelGraphics::VRenderReconstructionVolume, public IFlowRenderType
{
public:
  explicit VFlowRenderReconstructionVolume( std::shared_ptr< CoreGraphics::VResources > i_pResources );

  void Update( const ZEK::IFlowState& i_rState ) override;

private:
  ZEK::VFlowItemRef m_Held;
  Flow2Utils::VParameterSet m_Parameters;
};

} // namespace Flow2Graphics
