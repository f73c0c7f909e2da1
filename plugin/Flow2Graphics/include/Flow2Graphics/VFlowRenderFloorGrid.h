#pragma once

#include <Flow2Graphics/IFlowRenderType.h>
#include <MoxelGraphics/VRenderFloorGrid.h>

namespace Flow2Graphics
{

/// The floor as the state's volume properties have it. Without them it keeps what it was given last.
class VFlowRenderFloorGrid : public MoxelGraphics::VRenderFloorGrid, public IFlowRenderType
{
public:
  using VRenderFloorGrid::VRenderFloorGrid;

  void Update( const ZEK::IFlowState& i_rState ) override;

private:
  ZEK::VFlowItemRef m_Held;
};

} // namespace Flow2Graphics
