#include "JoinFloor.h"

#include <algorithm>
#include <cstdio>
#include <cstring>

namespace JoinFloor
{

std::string NameOf( int i_Names, int i_Object )
{
  char Name[48];
  std::snprintf( Name, sizeof Name, "device-%d-%08d", i_Names, i_Object );
  return Name;
}

int ObjectAt( int i_Place, int i_Kind, int i_Objects )
{
  return ( i_Place * 37 + i_Kind * 11 ) % i_Objects;
}

VState Make( int i_Objects, int i_Kinds, std::int64_t i_Identity, int i_Names )
{
  VState State;
  State.Kinds.resize( static_cast< std::size_t >( i_Kinds ) );
  for ( int Kind = 0; Kind < i_Kinds; ++Kind )
  {
    for ( int Place = 0; Place < i_Objects; ++Place )
    {
      const int Object = ObjectAt( Place, Kind, i_Objects );
      const VId Id{ static_cast< std::uint32_t >( Kind ), static_cast< std::uint32_t >( Object ), i_Identity };
      State.Items.push_back( std::make_unique< VItem >( VItem{ Id, NameOf( i_Names, Object ), nullptr } ) );
      State.Kinds[static_cast< std::size_t >( Kind )].push_back( State.Items.back().get() );
    }
  }
  return State;
}

void VFlat::Join( const VState& i_rState )
{
  const std::size_t Kinds = i_rState.Kinds.size();
  Values.resize( Kinds );
  Ids.resize( Kinds );
  PreviousIds.resize( Kinds );
  Changed.assign( Kinds, 0 );
  m_Hits.resize( Kinds );
  m_Map.clear();
  m_Rows.clear();
  for ( std::size_t Kind = 0; Kind < Kinds; ++Kind )
  {
    Ids[Kind].swap( PreviousIds[Kind] );
    m_Hits[Kind].clear();
    for ( const VItem* pItem : i_rState.Kinds[Kind] )
    {
      const auto [It, bNew] = m_Map.try_emplace( pItem->Name, static_cast< std::uint32_t >( m_Rows.size() ) );
      if ( bNew )
      {
        m_Rows.push_back( { pItem->Name } );
      }
      VRow& rRow = m_Rows[It->second];
      if ( rRow.Last != Kind + 1 )
      {
        rRow.Last = static_cast< std::uint32_t >( Kind + 1 );
        ++rRow.Hits;
        m_Hits[Kind].push_back( { It->second, pItem } );
      }
    }
  }
  m_Order.clear();
  for ( std::uint32_t Row = 0; Row < m_Rows.size(); ++Row )
  {
    m_Order.push_back( Row );
  }
  std::sort( m_Order.begin(), m_Order.end(),
             [&]( std::uint32_t i_Left, std::uint32_t i_Right )
             {
               return m_Rows[i_Left].Name < m_Rows[i_Right].Name;
             } );
  Names.clear();
  for ( const std::uint32_t Row : m_Order )
  {
    const bool bKept = m_Rows[Row].Hits == Kinds;
    m_Rows[Row].Index = bKept ? static_cast< std::uint32_t >( Names.size() ) : ~0u;
    if ( bKept )
    {
      Names.push_back( m_Rows[Row].Name );
    }
  }
  for ( std::size_t Kind = 0; Kind < Kinds; ++Kind )
  {
    Values[Kind].assign( Names.size(), nullptr );
    Ids[Kind].assign( Names.size(), {} );
    for ( const auto& [Row, pItem] : m_Hits[Kind] )
    {
      if ( m_Rows[Row].Index != ~0u )
      {
        Values[Kind][m_Rows[Row].Index] = pItem;
        Ids[Kind][m_Rows[Row].Index] = pItem->Id;
      }
    }
    Changed[Kind] = Ids[Kind] != PreviousIds[Kind];
  }
}

bool VKept::Keep( const VState& i_rState )
{
  const std::size_t Kinds = i_rState.Kinds.size();
  if ( m_Slots.size() != Kinds )
  {
    return false;
  }
  for ( std::size_t Kind = 0; Kind < Kinds; ++Kind )
  {
    const auto& rItems = i_rState.Kinds[Kind];
    if ( rItems.size() != m_Slots[Kind].size() )
    {
      return false;
    }
    char bChanged = 0;
    for ( std::size_t Place = 0; Place < rItems.size(); ++Place )
    {
      const std::uint32_t Slot = m_Slots[Kind][Place];
      const VItem* pItem = rItems[Place];
      if ( !( m_Ids[Kind][Slot] == pItem->Id ) )
      {
        const std::string& rName = m_Names[Slot];
        if ( pItem->Name.size() != rName.size() || std::memcmp( pItem->Name.data(), rName.data(), rName.size() ) != 0 )
        {
          return false;
        }
        bChanged = 1;
        m_Ids[Kind][Slot] = pItem->Id;
      }
      Values[Kind][Slot] = pItem;
    }
    m_Changed[Kind] = bChanged;
  }
  return true;
}

void VKept::Join( const VState& i_rState )
{
  if ( Keep( i_rState ) )
  {
    return;
  }
  m_Full.Join( i_rState );
  m_Names.assign( m_Full.Names.begin(), m_Full.Names.end() );
  m_Ids = m_Full.Ids;
  Values = m_Full.Values;
  m_Changed = m_Full.Changed;
  m_Slots.assign( i_rState.Kinds.size(), {} );
  for ( std::size_t Kind = 0; Kind < i_rState.Kinds.size(); ++Kind )
  {
    for ( const VItem* pItem : i_rState.Kinds[Kind] )
    {
      const auto It = std::lower_bound( m_Names.begin(), m_Names.end(), pItem->Name );
      m_Slots[Kind].push_back( static_cast< std::uint32_t >( It - m_Names.begin() ) );
    }
  }
}

} // namespace JoinFloor
