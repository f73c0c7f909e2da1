#include <Flow2TypesUtils/TaggedItemCache.h>

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

/// Calls back with each entry of the tag that passes the time test, until the callback says false.
template < typename TCallback >
bool ForEntries( const VJoinQuery& i_rQuery, std::uint32_t i_Tag, TCallback i_Callback )
{
  ZEK::VFlowCursor It, End;
  i_rQuery.rState.ItemsBegin( It, i_Tag, i_rQuery.Match, i_rQuery.Key );
  i_rQuery.rState.ItemsEnd( End, i_Tag, i_rQuery.Match, i_rQuery.Key );
  for ( ; It != End; ++It )
  {
    if ( ZEK::FlowTimeMatches( i_rQuery.Match, It->Key, i_rQuery.Key ) && !i_Callback( It ) )
    {
      return false;
    }
  }
  return true;
}
} // namespace

VItemCache::VItemCache( std::uint32_t i_Tag, ETagRequirement i_Requirement )
  : m_Tag( i_Tag )
  , m_Requirement( i_Requirement )
{
}

VItemCache::~VItemCache() = default;

bool VItemCache::Collect( const VJoinQuery& i_rQuery, std::uint32_t i_CacheNumber, IJoinRows& io_rRows,
                          bool& o_rbRequired )
{
  bool bAnyHit = false;
  ForEntries( i_rQuery, m_Tag,
              [&]( const ZEK::VFlowCursor& i_rEntry )
              {
                VSeen Seen{ i_rEntry->pItem->Id(), i_rEntry->pItem, VJoinRow::None, VJoinRow::None };
                std::string_view Name;
                if ( i_rEntry->pItem->Value().GetName( i_rQuery.NameSelector, Name ) )
                {
                  Seen.Row = io_rRows.RowOf( Name );
                  VJoinRow& rRow = io_rRows.Row( Seen.Row );
                  if ( rRow.LastCache != i_CacheNumber )
                  {
                    rRow.LastCache = i_CacheNumber;
                    rRow.HitCount += m_Requirement == ETagRequirement::Optional ? 0 : 1;
                    Seen.Slot = Seen.Row; // the row's slot is known when all tags are counted
                    bAnyHit = true;
                  }
                }
                m_Seen.push_back( Seen );
                m_SeenEntries.push_back( i_rEntry );
                return true;
              } );
  o_rbRequired =
      m_Requirement == ETagRequirement::Required || ( m_Requirement != ETagRequirement::Optional && bAnyHit );
  return bAnyHit || m_Requirement != ETagRequirement::Required;
}

void VItemCache::Resize( std::size_t i_Count, ZEK::VFlowCursor i_EndEntry, IJoinRows& io_rRows )
{
  const bool bAnyHit = std::any_of( m_Seen.begin(), m_Seen.end(),
                                    []( const VSeen& i_rSeen )
                                    {
                                      return i_rSeen.Slot != VJoinRow::None;
                                    } );
  const std::size_t Count = m_Requirement == ETagRequirement::RequiredIfAny && !bAnyHit ? 0 : i_Count;
  ResizeValues( Count );
  m_Entries.assign( Count, i_EndEntry );
  m_Ids.assign( Count, {} );
  m_Holes.clear();
  std::size_t Filled = 0;
  for ( std::size_t Index = 0; Index < m_Seen.size(); ++Index )
  {
    VSeen& rSeen = m_Seen[Index];
    rSeen.Slot = rSeen.Slot == VJoinRow::None ? VJoinRow::None : io_rRows.Row( rSeen.Slot ).Index;
    if ( rSeen.Slot != VJoinRow::None )
    {
      ++Filled;
      m_Entries[rSeen.Slot] = m_SeenEntries[Index];
      m_Ids[rSeen.Slot] = rSeen.Id;
      TakeValue( rSeen.Slot, rSeen.pItem );
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
  ResizeValues( 0 );
  m_Seen.clear();
  m_SeenEntries.clear();
  m_Holes.clear();
}

bool VItemCache::Keep( const VJoinQuery& i_rQuery, IJoinRows& io_rRows )
{
  VSeen* pSeen = m_Seen.data();
  VSeen* const pEnd = pSeen + m_Seen.size();
  const bool bSame =
      ForEntries( i_rQuery, m_Tag,
                  [&]( const ZEK::VFlowCursor& i_rEntry )
                  {
                    return pSeen != pEnd && KeepEntry( *pSeen++, i_rEntry, i_rQuery.NameSelector, io_rRows );
                  } );
  return bSame && pSeen == pEnd;
}

inline bool VItemCache::KeepEntry( VSeen& io_rSeen, const ZEK::VFlowCursor& i_rEntry, std::uint32_t i_NameSelector,
                                   IJoinRows& io_rRows )
{
  const ZEK::IFlowItem* pItem = i_rEntry->pItem;
  const bool bSlot = io_rSeen.Slot != VJoinRow::None;
  // An item at the same place in memory with the same id is the same item.
  if ( pItem->Id() == io_rSeen.Id && pItem == io_rSeen.pItem )
  {
    if ( bSlot )
    {
      m_Entries[io_rSeen.Slot] = i_rEntry;
    }
    return true;
  }
  if ( !( pItem->Id() == io_rSeen.Id ) )
  {
    std::string_view Name;
    const bool bName = pItem->Value().GetName( i_NameSelector, Name );
    if ( bName != ( io_rSeen.Row != VJoinRow::None ) || ( bName && io_rRows.Row( io_rSeen.Row ).Name != Name ) )
    {
      return false;
    }
    io_rSeen.Id = pItem->Id();
    if ( bSlot )
    {
      if ( m_bSameIds )
      {
        m_PreviousIds.assign( m_Ids.begin(), m_Ids.end() );
        m_bSameIds = false;
      }
      m_Ids[io_rSeen.Slot] = io_rSeen.Id;
    }
  }
  io_rSeen.pItem = pItem;
  if ( bSlot )
  {
    m_Entries[io_rSeen.Slot] = i_rEntry;
    TakeValue( io_rSeen.Slot, pItem );
  }
  return true;
}

void VItemCache::Renew( ZEK::VFlowCursor i_EndEntry )
{
  for ( const std::uint32_t Slot : m_Holes )
  {
    m_Entries[Slot] = i_EndEntry;
  }
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
