#include <Flow2TypesUtils/TaggedItemCache.h>

#include "NameTable.h"

#include <algorithm>
#include <tuple>

namespace Flow2TypesUtils
{
namespace
{
bool IdLess( const ZEK::VFlowValueId& i_rLeft, const ZEK::VFlowValueId& i_rRight )
{
  return std::tie( i_rLeft.Salt, i_rLeft.Type, i_rLeft.Number ) <
         std::tie( i_rRight.Salt, i_rRight.Type, i_rRight.Number );
}

/// Asks for memory that is read a little later.
void FetchAhead( const void* i_pMemory )
{
  __builtin_prefetch( i_pMemory );
}

/// The time test of one query. Most entries of a tag share their key, so the last answer is kept.
class VTimeTest
{
public:
  explicit VTimeTest( const VJoinQuery& i_rQuery )
    : m_rQuery( i_rQuery )
  {
  }
  bool Passes( const ZEK::VFlowTimeKey& i_rKey )
  {
    if ( !( i_rKey == m_Last && i_rKey.Span == m_Last.Span && m_bKnown ) )
    {
      m_Last = i_rKey;
      m_bKnown = true;
      m_bPasses = ZEK::FlowTimeMatches( m_rQuery.Match, i_rKey, m_rQuery.Key );
    }
    return m_bPasses;
  }

private:
  const VJoinQuery& m_rQuery;
  ZEK::VFlowTimeKey m_Last;
  bool m_bKnown = false;
  bool m_bPasses = false;
};
} // namespace

VItemCache::VItemCache( std::uint32_t i_Tag, ETagRequirement i_Requirement )
  : m_Tag( i_Tag )
  , m_Requirement( i_Requirement )
{
}

VItemCache::~VItemCache() = default;

bool VItemCache::Collect( const VJoinQuery& i_rQuery, std::uint32_t i_CacheNumber, VNameTable& io_rTable,
                          bool& o_rbRequired )
{
  bool bAnyHit = false;
  VTimeTest Time( i_rQuery );
  ZEK::VFlowCursor It, End;
  i_rQuery.rState.ItemsBegin( It, m_Tag, i_rQuery.Match, i_rQuery.Key );
  i_rQuery.rState.ItemsEnd( End, m_Tag, i_rQuery.Match, i_rQuery.Key );
  for ( ; It != End; ++It )
  {
    if ( !Time.Passes( It->Key ) )
    {
      continue;
    }
    VSeen Seen{ It->pItem->Id(), It->pItem, None, None };
    std::string_view Name;
    if ( It->pItem->Value().GetName( i_rQuery.NameSelector, Name ) )
    {
      Seen.Row = io_rTable.RowOf( Name );
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
    m_SeenEntries.push_back( It );
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
  m_bValuesTaken = false;
  m_EndEntry = i_EndEntry;
  m_Entries.assign( Count, i_EndEntry );
  m_Ids.assign( Count, {} );
  m_Holes.clear();
  std::size_t Filled = 0;
  for ( std::size_t Index = 0; Index < m_Seen.size(); ++Index )
  {
    VSeen& rSeen = m_Seen[Index];
    rSeen.Slot = rSeen.Slot == None ? None : io_rTable.Row( rSeen.Slot ).Index;
    if ( rSeen.Slot != None )
    {
      ++Filled;
      m_Entries[rSeen.Slot] = m_SeenEntries[Index];
      m_Ids[rSeen.Slot] = rSeen.Id;
    }
  }
  for ( std::uint32_t Slot = 0; Filled != Count && Slot < Count; ++Slot )
  {
    if ( m_Entries[Slot] == i_EndEntry )
    {
      m_Holes.push_back( Slot );
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
  m_Entries.clear();
  m_bValuesTaken = false;
  m_Seen.clear();
  m_SeenEntries.clear();
  m_Holes.clear();
}

bool VItemCache::Keep( const VJoinQuery& i_rQuery, VNameTable& io_rTable )
{
  VSeen* pSeen = m_Seen.data();
  VSeen* const pEnd = pSeen + m_Seen.size();
  ZEK::VFlowCursor* const pEntries = m_Entries.data();
  VTimeTest Time( i_rQuery );
  ZEK::VFlowCursor It, End;
  i_rQuery.rState.ItemsBegin( It, m_Tag, i_rQuery.Match, i_rQuery.Key );
  i_rQuery.rState.ItemsEnd( End, m_Tag, i_rQuery.Match, i_rQuery.Key );
  m_Others.clear();
  for ( ; It != End; ++It )
  {
    if ( !Time.Passes( It->Key ) )
    {
      continue;
    }
    if ( pSeen == pEnd )
    {
      return false;
    }
    // An item at the same place in memory with the same id is the same item.
    const ZEK::IFlowItem* pItem = It->pItem;
    if ( pItem != pSeen->pItem || !( pItem->Id() == pSeen->Id ) )
    {
      FetchAhead( pItem );
      FetchAhead( reinterpret_cast< const char* >( pItem ) + 64 ); // where a name may begin
      m_Others.push_back( { pSeen, pItem, {}, false } );
    }
    if ( pSeen->Slot != None )
    {
      pEntries[pSeen->Slot] = It;
    }
    ++pSeen;
  }
  return pSeen == pEnd && ( m_Others.empty() || TakeOthers( i_rQuery.NameSelector, io_rTable ) );
}

bool VItemCache::TakeOthers( std::uint32_t i_NameSelector, VNameTable& io_rTable )
{
  // Items and names lie all over the memory: what a round needs is on its way while the one before goes through all.
  for ( VOther& rOther : m_Others )
  {
    rOther.bName = rOther.pItem->Value().GetName( i_NameSelector, rOther.Name );
    FetchAhead( rOther.Name.data() );
  }
  for ( const VOther& rOther : m_Others )
  {
    VSeen& rSeen = *rOther.pSeen;
    rSeen.pItem = rOther.pItem;
    m_bValuesTaken = m_bValuesTaken && rSeen.Slot == None;
    const ZEK::VFlowValueId& rId = rOther.pItem->Id();
    if ( rId == rSeen.Id )
    {
      continue;
    }
    if ( rOther.bName != ( rSeen.Row != None ) || ( rOther.bName && io_rTable.Row( rSeen.Row ).Name != rOther.Name ) )
    {
      return false;
    }
    rSeen.Id = rId;
    if ( rSeen.Slot != None )
    {
      if ( m_bSameIds )
      {
        m_PreviousIds.assign( m_Ids.begin(), m_Ids.end() );
        m_bSameIds = false;
      }
      m_Ids[rSeen.Slot] = rId;
    }
  }
  return true;
}

void VItemCache::Renew( ZEK::VFlowCursor i_EndEntry )
{
  for ( const std::uint32_t Slot : m_Holes )
  {
    m_Entries[Slot] = i_EndEntry;
  }
  m_EndEntry = i_EndEntry;
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
