#pragma once

#include <HostSources/VSimulatedCapture.h>

#include <HostFlow/VFlowFramework.h>

#include <CoreMoxelTypes/FlowTypes.h>

#include <gtest/gtest.h>

#include <map>
#include <string>
#include <vector>

inline ZEK::VFlowStateRef StateOf( HostSources::VSimulatedCapture& i_rCapture, std::int64_t i_Index )
{
  static const HostSources::VStateMaker Maker{ HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 1 };
  ZEK::VFlowStateRef State;
  EXPECT_TRUE( i_rCapture.MakeState( i_Index, Maker, State ).IsOk() ) << i_Index;
  return State;
}

inline std::vector< ZEK::VFlowItemRef > ItemsOf( const ZEK::IFlowState& i_rState, std::uint32_t i_Tag )
{
  std::vector< ZEK::VFlowItemRef > Items;
  ZEK::VFlowCursor It, End;
  i_rState.TagBegin( It, i_Tag, ZEK::EFlowTimeMatch::Overlap );
  i_rState.TagEnd( End, i_Tag, ZEK::EFlowTimeMatch::Overlap );
  for ( ; It != End; ++It )
  {
    Items.emplace_back( It->pItem );
  }
  return Items;
}

template < typename T >
const T& Only( const ZEK::IFlowState& i_rState, std::uint32_t i_Tag )
{
  const auto Items = ItemsOf( i_rState, i_Tag );
  EXPECT_EQ( Items.size(), 1u );
  return *ZEK::FlowPayload< T >( Items.at( 0 ).Get() );
}

template < typename T >
std::map< std::string, const T* > ByCamera( const ZEK::IFlowState& i_rState, std::uint32_t i_Tag )
{
  std::map< std::string, const T* > Found;
  for ( const ZEK::VFlowItemRef& rItem : ItemsOf( i_rState, i_Tag ) )
  {
    std::string_view Name;
    EXPECT_TRUE( rItem->Value().GetName( ZEK::EFlowNameDevice, Name ) ) << i_Tag;
    EXPECT_TRUE( Found.emplace( Name, ZEK::FlowPayload< T >( rItem.Get() ) ).second ) << Name << " twice, " << i_Tag;
  }
  return Found;
}
