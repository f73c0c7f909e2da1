#pragma once

#include <CoreMoxelTypes/FlowTypes.h>
#include <ZEK/FlowState.h>

#include <string>
#include <string_view>
#include <vector>

namespace Flow2Graphics
{

/// A camera without a sensor behind it, and the items of it that hold for every frame.
struct VTestCamera
{
  static constexpr std::uint32_t SensorWidth = 1280; ///< px
  static constexpr std::uint32_t SensorHeight = 720; ///< px

  std::string Name;
  std::vector< ZEK::VFlowItemRef > StaticItems;
};

/// Makes an item of that kind and device name.
template < typename TFlow >
ZEK::IResult MakeTestItem( ZEK::VFlowItemRef& o_rItem, ZEK::IFlowStoreHandle& io_rStore, std::string_view i_Name )
{
  ZEK::IResult Status;
  io_rStore.CreateItem( Status, ZEK::FlowValueType< TFlow >::Descriptor, o_rItem );
  if ( Status.IsOk() && !ZEK::FlowPayload< typename ZEK::FlowValueType< TFlow >::type >( o_rItem.Get() ) )
  {
    return ZEK::IResult::InvalidType;
  }
  if ( Status.IsOk() && !i_Name.empty() )
  {
    o_rItem->MutableValue().SetName( ZEK::EFlowNameDevice, i_Name );
  }
  return Status;
}

template < typename TFlow >
auto& TestPayload( ZEK::IFlowItem& io_rItem )
{
  return *ZEK::FlowMutablePayload< typename ZEK::FlowValueType< TFlow >::type >( &io_rItem );
}

/// Hardware, a grid of centroids, a disc of greys, its edges, a mask of the four corners and a picture of colour bars.
ZEK::IResult MakeTestCamera( VTestCamera& o_rCamera, ZEK::IFlowStoreHandle& io_rStore, std::string i_Name );

} // namespace Flow2Graphics
