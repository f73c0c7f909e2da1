#pragma once

#include <Flow2StateCache/VFlowStateCacheTransform.h>

#include <FlowTestItems.h> // of the framework

namespace CacheTest
{

/// A state that holds one number.
inline ZEK::VFlowStateRef NumberState( const ZEK::VFlowTimeKey& i_rKey, std::uint32_t i_Number )
{
  ZEK::VFlowStateRef State = HostFlow::NewState( i_rKey );
  const ZEK::VFlowItemRef Item = HostFlow::NewItem< CoreMoxelTypes::FlowWorldAxis >();
  ZEK::FlowMutablePayload< CoreMoxelTypes::VWorldAxis >( Item.Get() )->Up = i_Number;
  State->AddItem( Item );
  return State;
}

inline std::uint32_t NumberOf( const ZEK::IFlowState& i_rState )
{
  ZEK::VFlowItemRef Item;
  i_rState.FindItem( Item, ZEK::FlowTag< CoreMoxelTypes::FlowWorldAxis >, ZEK::EFlowTimeMatch::Overlap );
  return Item ? ZEK::FlowPayload< CoreMoxelTypes::VWorldAxis >( Item.Get() )->Up : 0;
}

/// The parameter that an output was made with, and -1 for a state that was not transformed.
inline int PoseOf( const ZEK::IFlowState& i_rState )
{
  ZEK::VFlowItemRef Item;
  i_rState.FindItem( Item, ZEK::FlowTag< CoreMoxelTypes::FlowVolumeProperties >, ZEK::EFlowTimeMatch::Overlap );
  return Item ? ZEK::FlowPayload< CoreMoxelTypes::VVolumeProperties >( Item.Get() )->XMin : -1;
}

inline ZEK::VFlowParameterMap Pose( int i_Pose )
{
  return { { "PoseIndex", std::int64_t{ i_Pose } } };
}

/// Gives a clone with the parameter beside the number. Counts without a lock, which its cache must hold.
class VTransform final : public ZEK::IFlowStateTransform
{
public:
  ZEK::VFlowStateRef& Transform( ZEK::VFlowStateRef& o_rState, const ZEK::VFlowStateRef& i_rInput,
                                 const ZEK::VFlowParameterMap& i_rParameters ) override
  {
    ++Calls;
    o_rState.Reset();
    if ( NumberOf( *i_rInput ) == Refused )
    {
      return o_rState;
    }
    o_rState = Flow2StateCache::CloneState( *i_rInput );
    const ZEK::VFlowItemRef Item = HostFlow::NewItem< CoreMoxelTypes::FlowVolumeProperties >();
    const auto It = i_rParameters.find( "PoseIndex" );
    ZEK::FlowMutablePayload< CoreMoxelTypes::VVolumeProperties >( Item.Get() )->XMin =
        It == i_rParameters.end() ? 0 : static_cast< int >( std::get< std::int64_t >( It->second ) );
    o_rState->AddItem( Item );
    return o_rState;
  }

  int Calls = 0;
  std::uint32_t Refused = ~0u; ///< the number of the state that it gives nothing for
};

} // namespace CacheTest
