#pragma once

// How a recording's items are made.

#include <HostSources/IFrameSource.h>

#include <ZEK/FlowState.h>

#include <cstring>
#include <span>

namespace HostSources
{

template < typename T >
bool SameBits( std::span< const T > i_A, std::span< const T > i_B )
{
  return i_A.size() == i_B.size() &&
         ( i_A.data() == i_B.data() || std::memcmp( i_A.data(), i_B.data(), i_A.size_bytes() ) == 0 );
}

/// Makes an item of flow type `TFlow` and gives its payload, or null after a failure, which stays in `io_rResult`.
template < typename TFlow >
typename ZEK::FlowValueType< TFlow >::type* MakeItem( const VStateMaker& i_rMaker, ZEK::VFlowItemRef& o_rItem,
                                                      ZEK::IResult& io_rResult )
{
  o_rItem.Reset();
  i_rMaker.Store->CreateItem( io_rResult, ZEK::FlowValueType< TFlow >::Descriptor, o_rItem );
  auto* pPayload = ZEK::FlowMutablePayload< typename ZEK::FlowValueType< TFlow >::type >( o_rItem.Get() );
  if ( !pPayload && io_rResult.IsOk() )
  {
    io_rResult = ZEK::IResult::InvalidType;
  }
  return io_rResult.IsOk() ? pPayload : nullptr;
}

} // namespace HostSources
