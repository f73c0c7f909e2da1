#pragma once

#include <HostFlow/VFlowFramework.h>

#include <CoreMoxelTypes/FlowTypes.h>

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace HostFlow
{

inline ZEK::VFlowStateRef NewState( const ZEK::VFlowTimeKey& i_rKey )
{
  ZEK::VFlowStateRef State;
  EXPECT_TRUE( MakeStateFactory()->CreateState( State, i_rKey, {}, {} ).IsOk() );
  return State;
}

template < typename TFlow >
ZEK::VFlowItemRef NewItem( std::uint32_t i_Selector = 0, std::string_view i_Name = {} )
{
  ZEK::VFlowItemRef Item;
  ZEK::IResult Status;
  MakeItemStore()->CreateItem( Status, ZEK::FlowValueType< TFlow >::Descriptor, Item );
  EXPECT_TRUE( Status.IsOk() );
  if ( Item && i_Selector != 0 )
  {
    Item->MutableValue().SetName( i_Selector, i_Name );
  }
  return Item;
}

inline void AddState( ZEK::IFlowWritableStateCache& i_rCache, const ZEK::VFlowStateRef& i_rState )
{
  EXPECT_TRUE( i_rCache.Add( i_rState ).IsOk() );
}

/// The entries of a tag that pass a match, as a consumer walks them.
inline std::vector< ZEK::VFlowEntry > Walk( const ZEK::IFlowState& i_rState, std::uint32_t i_Tag,
                                            ZEK::EFlowTimeMatch i_Match, const ZEK::VFlowTimeKey& i_rKey )
{
  std::vector< ZEK::VFlowEntry > Entries;
  ZEK::VFlowCursor It, End;
  i_rState.ItemsBegin( It, i_Tag, i_Match, i_rKey );
  i_rState.ItemsEnd( End, i_Tag, i_Match, i_rKey );
  for ( ; It != End; ++It )
  {
    if ( ZEK::FlowTimeMatches( i_Match, It->Key, i_rKey ) )
    {
      Entries.push_back( *It );
    }
  }
  return Entries;
}

inline std::string NameOf( const ZEK::IFlowItem& i_rItem, std::uint32_t i_Selector )
{
  std::string_view Name;
  return i_rItem.Value().GetName( i_Selector, Name ) ? std::string( Name ) : std::string( "(none)" );
}

} // namespace HostFlow
