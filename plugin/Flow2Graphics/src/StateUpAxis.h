#pragma once

#include <CoreMoxelTypes/FlowTypes.h>

namespace Flow2Graphics
{

/// Whether y is up in the state, `i_bElse` where it does not say.
inline bool IsYUp( const ZEK::IFlowState& i_rState, bool i_bElse )
{
  constexpr std::uint32_t UpIsY = 1;
  ZEK::VFlowItemRef Axis;
  i_rState.FindItem( Axis, ZEK::FlowTag< CoreMoxelTypes::FlowWorldAxis >, ZEK::EFlowTimeMatch::Overlap );
  const auto* const pAxis = ZEK::FlowPayload< CoreMoxelTypes::VWorldAxis >( Axis.Get() );
  return pAxis ? pAxis->Up == UpIsY : i_bElse;
}

} // namespace Flow2Graphics
