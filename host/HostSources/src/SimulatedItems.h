#pragma once

#include <HostSources/IFrameSource.h>

#include <CoreMoxelTypes/FlowTypes.h>

#include <string>
#include <utility>
#include <vector>

namespace HostSources::Simulation
{

/// Makes the items of one source and keeps the first failure.
class VItemMaker
{
public:
  /// Before each frame.
  void Begin( const VStateMaker& i_rMaker )
  {
    m_Store = i_rMaker.Store;
    m_Failure = ZEK::IResult::Ok;
  }
  ZEK::IResult Failure() const { return m_Failure; }
  void Fail( ZEK::IResult i_Why ) { m_Failure = m_Failure.IsError() ? m_Failure : i_Why; }

  /// The payload of a new item; null after a failure.
  template < typename TFlow >
  typename ZEK::FlowValueType< TFlow >::type* Make( ZEK::VFlowItemRef& o_rItem )
  {
    ZEK::IResult Status;
    m_Store->CreateItem( Status, ZEK::FlowValueType< TFlow >::Descriptor, o_rItem );
    Fail( Status );
    return ZEK::FlowMutablePayload< typename ZEK::FlowValueType< TFlow >::type >( o_rItem.Get() );
  }
  template < typename TFlow >
  typename ZEK::FlowValueType< TFlow >::type* MakeNamed( ZEK::VFlowItemRef& o_rItem, ZEK::EFlowName i_Selector,
                                                         const std::string& i_rName )
  {
    auto* const pPayload = Make< TFlow >( o_rItem );
    if ( pPayload )
    {
      o_rItem->MutableValue().SetName( i_Selector, i_rName );
    }
    return pPayload;
  }
  /// Adds an item of that value to the list; an empty name is none.
  template < typename TFlow >
  void AddSlow( std::vector< ZEK::VFlowItemRef >& io_rSlow, ZEK::EFlowName i_Selector, const std::string& i_rName,
                typename ZEK::FlowValueType< TFlow >::type i_Value )
  {
    ZEK::VFlowItemRef Item;
    auto* const pPayload = i_rName.empty() ? Make< TFlow >( Item ) : MakeNamed< TFlow >( Item, i_Selector, i_rName );
    if ( pPayload )
    {
      *pPayload = std::move( i_Value );
      io_rSlow.push_back( std::move( Item ) );
    }
  }

private:
  ZEK::VFlowStoreRef m_Store;
  ZEK::IResult m_Failure;
};

} // namespace HostSources::Simulation
