#include <Flow2TypesUtils/TaggedItemCache.h>

#include "NameTable.h"

#include <algorithm>
#include <tuple>

namespace Flow2TypesUtils
{
namespace
{
using VEntries = std::span< const ZEK::VFlowEntry >;

bool IdLess( const ZEK::VFlowValueId& i_rLeft, const ZEK::VFlowValueId& i_rRight )
{
  return std::tie( i_rLeft.Salt, i_rLeft.Type, i_rLeft.Number ) <
         std::tie( i_rRight.Salt, i_rRight.Type, i_rRight.Number );
}

/// Walks the entries of a tag that pass the time test.
class VWalk
{
public:
  VWalk( VEntries i_Entries, ZEK::EFlowTimeMatch i_Match, const ZEK::VFlowTimeKey& i_rKey )
    : m_pEntry( i_Entries.data() )
    , m_pEnd( m_pEntry + i_Entries.size() )
    , m_pAheadEnd( m_pEnd - std::min( i_Entries.size(), Ahead ) )
    , m_Match( i_Match )
    , m_Key( i_rKey )
  {
    // Entries lie in the order of their keys, and a key passes against itself.
    m_bAllPass = !i_Entries.empty() && i_Entries.front().Key == i_rKey && i_Entries.back().Key == i_rKey &&
                 ZEK::FlowTimeMatches( i_Match, i_rKey, i_rKey );
  }
  /// The next one, or null.
  const ZEK::VFlowEntry* Next()
  {
    while ( m_pEntry != m_pEnd )
    {
      if ( m_pEntry < m_pAheadEnd )
      {
        __builtin_prefetch( m_pEntry[Ahead].pItem ); // items lie all over the memory
      }
      const ZEK::VFlowEntry* pEntry = m_pEntry++;
      if ( m_bAllPass || ZEK::FlowTimeMatches( m_Match, pEntry->Key, m_Key ) )
      {
        return pEntry;
      }
    }
    return nullptr;
  }

private:
  static constexpr std::size_t Ahead = 8;
  const ZEK::VFlowEntry* m_pEntry;
  const ZEK::VFlowEntry* m_pEnd;
  const ZEK::VFlowEntry* m_pAheadEnd;
  ZEK::EFlowTimeMatch m_Match;
  ZEK::VFlowTimeKey m_Key;
  bool m_bAllPass;
};
} // namespace

VItemCache::VItemCache( std::uint32_t i_Tag, ETagRequirement i_Requirement )
  : m_Tag( i_Tag )
  , m_Requirement( i_Requirement )
{
}

VItemCache::~VItemCache() = default;

VItemCache::VRange VItemCache::RangeOf( const VJoinQuery& i_rQuery ) const
{
  ZEK::VFlowCursor Begin, End;
  i_rQuery.rState.ItemsBegin( Begin, m_Tag, i_rQuery.Match, i_rQuery.Key );
  i_rQuery.rState.ItemsEnd( End, m_Tag, i_rQuery.Match, i_rQuery.Key );
  return { { Begin.operator->(), End.operator->() }, i_rQuery.Match, i_rQuery.Key, {} };
}

ZEK::VFlowItemsId VItemCache::ItemsIdOf( const VJoinQuery& i_rQuery ) const
{
  const bool bAllPass =
      i_rQuery.Key == i_rQuery.rState.GetKey() && ZEK::FlowTimeMatches( i_rQuery.Match, i_rQuery.Key, i_rQuery.Key );
  return bAllPass ? i_rQuery.rState.ItemsId( m_Tag ) : ZEK::VFlowItemsId();
}

bool VItemCache::Collect( const VJoinQuery& i_rQuery, std::uint32_t i_CacheNumber, VNameTable& io_rTable,
                          bool& o_rbRequired )
{
  bool bAnyHit = false;
  m_ItemsId = ItemsIdOf( i_rQuery );
  m_Range = RangeOf( i_rQuery );
  VWalk Walk( m_Range.Entries, i_rQuery.Match, i_rQuery.Key );
  while ( const ZEK::VFlowEntry* pEntry = Walk.Next() )
  {
    const ZEK::IFlowItem& rItem = *pEntry->pItem;
    VSeen Seen{ rItem.Id(), &rItem, io_rTable.RowOf( rItem, i_rQuery.NameSelector ), None };
    if ( Seen.Row != None )
    {
      VJoinRow& rRow = io_rTable.Row( Seen.Row );
      if ( rRow.LastCache != i_CacheNumber )
      {
        rRow.LastCache = i_CacheNumber;
        rRow.HitCount += m_Requirement == ETagRequirement::Optional ? 0 : 1;
        Seen.Slot = Seen.Row; // the row's slot is known when all tags are counted
        bAnyHit = true;
      }
    }
    m_Seen.push_back( Seen );
  }
  o_rbRequired =
      m_Requirement == ETagRequirement::Required || ( m_Requirement != ETagRequirement::Optional && bAnyHit );
  return bAnyHit || m_Requirement != ETagRequirement::Required;
}

void VItemCache::Resize( std::size_t i_Count, ZEK::VFlowCursor i_EndEntry, VNameTable& io_rTable )
{
  const bool bAnyHit = std::any_of( m_Seen.begin(), m_Seen.end(),
                                    []( const VSeen& i_rSeen )
                                    {
                                      return i_rSeen.Slot != None;
                                    } );
  const std::size_t Count = m_Requirement == ETagRequirement::RequiredIfAny && !bAnyHit ? 0 : i_Count;
  m_Range.EndEntry = i_EndEntry;
  m_Ids.assign( Count, {} );
  for ( VSeen& rSeen : m_Seen )
  {
    rSeen.Slot = rSeen.Slot == None ? None : io_rTable.Row( rSeen.Slot ).Index;
    if ( rSeen.Slot != None )
    {
      m_Ids[rSeen.Slot] = rSeen.Id;
    }
  }
}

void VItemCache::Clear( bool i_bKeepAsPrevious )
{
  if ( i_bKeepAsPrevious && m_bSameIds )
  {
    m_Ids.swap( m_PreviousIds );
  }
  m_bSameIds = false;
  m_Ids.clear();
  m_bValuesTaken = false;
  m_bEntriesTaken = false;
  m_ItemsId = {};
  m_Range = {};
  m_pState = nullptr;
  m_Seen.clear();
}

bool VItemCache::Keep( const VJoinQuery& i_rQuery, ZEK::VFlowCursor i_EndEntry, VNameTable& io_rTable )
{
  const ZEK::VFlowItemsId Id = ItemsIdOf( i_rQuery );
  m_bEntriesTaken = false;
  if ( Id.IsKnown() && Id == m_ItemsId )
  {
    m_Range = { {}, i_rQuery.Match, i_rQuery.Key, i_EndEntry };
    m_pState = &i_rQuery.rState;
    return true;
  }
  m_ItemsId = Id;
  m_pState = nullptr;
  m_Range = RangeOf( i_rQuery );
  m_Range.EndEntry = i_EndEntry;
  VWalk Walk( m_Range.Entries, i_rQuery.Match, i_rQuery.Key );
  VSeen* pSeen = m_Seen.data();
  VSeen* const pEnd = pSeen + m_Seen.size();
  while ( const ZEK::VFlowEntry* pEntry = Walk.Next() )
  {
    if ( pSeen == pEnd )
    {
      return false;
    }
    // An item at the same place in memory with the same id is the same item.
    const ZEK::IFlowItem* pItem = pEntry->pItem;
    if ( pItem != pSeen->pItem || !( pItem->Id() == pSeen->Id ) )
    {
      return KeepOthers( pSeen, pEntry, Walk, i_rQuery.NameSelector, io_rTable );
    }
    ++pSeen;
  }
  return pSeen == pEnd;
}

template < typename TWalk >
bool VItemCache::KeepOthers( VSeen* i_pSeen, const ZEK::VFlowEntry* i_pEntry, TWalk i_Walk,
                             std::uint32_t i_NameSelector, VNameTable& io_rTable )
{
  m_PreviousIds.assign( m_Ids.begin(), m_Ids.end() );
  m_bSameIds = false;
  m_bValuesTaken = false;
  bool bSameIds = true;
  VSeen* const pEnd = m_Seen.data() + m_Seen.size();
  ZEK::VFlowValueId* const pIds = m_Ids.data();
  const std::uint32_t* const pNumbers = io_rTable.Numbers();
  for ( ; i_pEntry; i_pEntry = i_Walk.Next() )
  {
    if ( i_pSeen == pEnd )
    {
      return false;
    }
    const ZEK::IFlowItem& rItem = *i_pEntry->pItem;
    const std::uint32_t Number = rItem.NameNumber( i_NameSelector );
    const bool bSameNumber = Number != 0 && i_pSeen->Row != None && pNumbers[i_pSeen->Row] == Number;
    if ( !bSameNumber && !( rItem.Id() == i_pSeen->Id ) && !io_rTable.IsRowOf( i_pSeen->Row, rItem, i_NameSelector ) )
    {
      return false;
    }
    i_pSeen->pItem = &rItem;
    i_pSeen->Id = rItem.Id();
    if ( i_pSeen->Slot != None )
    {
      ZEK::VFlowValueId& rId = pIds[i_pSeen->Slot];
      bSameIds = bSameIds && rId == i_pSeen->Id;
      rId = i_pSeen->Id;
    }
    ++i_pSeen;
  }
  m_bSameIds = bSameIds;
  return i_pSeen == pEnd;
}

const std::vector< ZEK::VFlowCursor >& VItemCache::Entries() const
{
  if ( !std::exchange( m_bEntriesTaken, true ) )
  {
    if ( m_pState )
    {
      m_Range.Entries = RangeOf( { *m_pState, 0, m_Range.Match, m_Range.Key } ).Entries;
    }
    m_Entries.assign( m_Ids.size(), m_Range.EndEntry );
    VWalk Walk( m_Range.Entries, m_Range.Match, m_Range.Key );
    for ( const VSeen& rSeen : m_Seen )
    {
      const ZEK::VFlowCursor Entry( Walk.Next() );
      if ( rSeen.Slot != None )
      {
        m_Entries[rSeen.Slot] = Entry;
      }
    }
  }
  return m_Entries;
}

bool VItemCache::Changed() const
{
  return !m_bSameIds && m_Ids != m_PreviousIds;
}

void VItemCache::ChangedBits( std::vector< bool >& o_rBits ) const
{
  o_rBits.assign( m_Ids.size(), false );
  if ( !Changed() )
  {
    return;
  }
  m_Sorted.assign( m_PreviousIds.begin(), m_PreviousIds.end() );
  std::sort( m_Sorted.begin(), m_Sorted.end(), IdLess );
  for ( std::size_t Slot = 0; Slot < m_Ids.size(); ++Slot )
  {
    o_rBits[Slot] = !std::binary_search( m_Sorted.begin(), m_Sorted.end(), m_Ids[Slot], IdLess );
  }
}

} // namespace Flow2TypesUtils
