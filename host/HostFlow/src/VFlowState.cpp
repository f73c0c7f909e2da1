#include "VFlowState.h"

#include <HostFlow/VFlowFramework.h>

#include <ZEK/DebugServices.h>

#include <algorithm>
#include <limits>

using namespace ZEK;

namespace HostFlow
{
namespace
{

struct VStatePool
{
  std::mutex Guard;
  VFreeList< VFlowState > Free;
  std::size_t Made = 0; ///< and not ended
};

VStatePool& Pool()
{
  // Never destroyed, as the pools of items.
  static VStatePool& rPool = *new VStatePool;
  return rPool;
}

} // namespace

VFlowStateRef VFlowState::Make( const VFlowTimeKey& i_rKey, const VFlowInfoA& i_rInfoA, const VFlowInfoB& i_rInfoB )
{
  VFlowState* pState = nullptr;
  {
    const std::lock_guard Lock( Pool().Guard );
    pState = Pool().Free.Take();
    if ( !pState )
    {
      pState = new VFlowState;
      ++Pool().Made;
    }
  }
  pState->m_Key = i_rKey;
  pState->m_InfoA = i_rInfoA;
  pState->m_InfoB = i_rInfoB;
  return VFlowStateRef( pState );
}

void VFlowState::TrimPool()
{
  const std::lock_guard Lock( Pool().Guard );
  while ( const VFlowState* pState = Pool().Free.Take() )
  {
    delete pState;
    --Pool().Made;
  }
}

std::size_t VFlowState::Count()
{
  const std::lock_guard Lock( Pool().Guard );
  return Pool().Made;
}

void VFlowState::Release() const
{
  if ( m_Uses.fetch_sub( 1, std::memory_order_acq_rel ) == 1 )
  {
    const_cast< VFlowState* >( this )->Recycle();
  }
}

void VFlowState::Recycle()
{
  if ( m_pBuilder )
  {
    // The references are the builder's, even where a lack of memory left copies of its entries behind.
    VStateBuilder::GiveBack( std::move( m_pBuilder ) );
  }
  else
  {
    for ( const VFlowEntry& rEntry : m_Entries )
    {
      rEntry.pItem->Release();
    }
  }
  m_Entries.clear();
  m_Tags.clear();
  m_Count = 0;
  m_bFrozen.store( false, std::memory_order_relaxed );
  m_bSettled.store( true, std::memory_order_relaxed );
  Pool().Free.GiveBack( *this );
}

void VFlowState::Freeze() const
{
  Settle();
  m_bFrozen.store( true, std::memory_order_release );
}

void VFlowState::Settle() const
{
  if ( m_bSettled.load( std::memory_order_acquire ) )
  {
    return;
  }
  // Two readers may be the first at once.
  const std::lock_guard Lock( m_SettleGuard );
  if ( !m_bSettled.load( std::memory_order_relaxed ) )
  {
    m_pBuilder->Settle( m_Key, m_Entries, m_Tags );
    VStateBuilder::GiveBack( std::move( m_pBuilder ) );
    m_bSettled.store( true, std::memory_order_release );
  }
}

bool VFlowState::Open()
{
  const bool bFrozen = m_bFrozen.load( std::memory_order_acquire );
  if ( !DebugServices::Check( !bFrozen, "!m_bFrozen", __FILE__, __LINE__ ) )
  {
    return false;
  }
  if ( !m_pBuilder )
  {
    m_pBuilder = VStateBuilder::Take();
    m_pBuilder->Load( m_Entries );
    m_Tags.clear();
    m_bSettled.store( false, std::memory_order_relaxed );
  }
  return true;
}

void VFlowState::Put( const VFlowTimeKey& i_rKey, IFlowItem& i_rItem )
{
  m_pBuilder->Add( i_rKey, i_rItem );
  m_Count = m_pBuilder->Count();
}

void VFlowState::AddItemAt( const VFlowItemRef& i_rItem, const VFlowTimeKey& i_rKey )
{
  if ( DebugServices::Check( i_rItem.Get() != nullptr, "i_rItem", __FILE__, __LINE__ ) && Open() )
  {
    Put( i_rKey, *i_rItem );
  }
}

void VFlowState::CopyItems( const IFlowState& i_rFrom, std::span< const std::uint32_t > i_Tags )
{
  if ( &i_rFrom == this || !Open() )
  {
    return;
  }
  constexpr VFlowTimeKey Earliest{ std::numeric_limits< std::int64_t >::min(), 1, 0 };
  for ( const std::uint32_t Tag : i_Tags )
  {
    VFlowCursor It, End;
    i_rFrom.ItemsBegin( It, Tag, EFlowTimeMatch::AtOrAfter, Earliest );
    i_rFrom.ItemsEnd( End, Tag, EFlowTimeMatch::AtOrAfter, Earliest );
    for ( ; It != End; ++It )
    {
      Put( It->Key, *It->pItem );
    }
  }
}

void VFlowState::Merge( const IFlowState& i_rFrom )
{
  // The interface names no first entry of all tags, so this works among states of this framework.
  const auto* pFrom = dynamic_cast< const VFlowState* >( &i_rFrom );
  if ( pFrom == this || !DebugServices::Check( pFrom != nullptr, "pFrom", __FILE__, __LINE__ ) || !Open() )
  {
    return;
  }
  pFrom->Settle();
  for ( const VFlowEntry& rEntry : pFrom->m_Entries )
  {
    Put( rEntry.Key, *rEntry.pItem );
  }
}

VFlowStateFactoryRef VFlowState::GetFactory() const
{
  return MakeStateFactory();
}

const VTagRange* VFlowState::FindTag( std::uint32_t i_Tag ) const
{
  Settle();
  const auto Found = std::lower_bound( m_Tags.begin(), m_Tags.end(), i_Tag,
                                       []( const VTagRange& i_rRange, std::uint32_t i_Sought )
                                       {
                                         return i_rRange.Tag < i_Sought;
                                       } );
  return Found != m_Tags.end() && Found->Tag == i_Tag ? &*Found : nullptr;
}

VFlowState::VSpan VFlowState::TagSpan( std::uint32_t i_Tag ) const
{
  const VTagRange* const pTag = FindTag( i_Tag );
  const VFlowEntry* const pEntries = m_Entries.data();
  return pTag ? VSpan{ pEntries + pTag->First, pEntries + pTag->Last }
              : VSpan{ pEntries + m_Entries.size(), pEntries + m_Entries.size() };
}

VFlowItemsId VFlowState::ItemsId( std::uint32_t i_Tag ) const
{
  constexpr VFlowItemsId NoItems{ 1, 0 };
  const VTagRange* const pTag = FindTag( i_Tag );
  return pTag ? pTag->Id : NoItems;
}

VFlowState::VSpan VFlowState::Range( std::uint32_t i_Tag, EFlowTimeMatch i_Match, const VFlowTimeKey& i_rKey ) const
{
  VSpan Span = TagSpan( i_Tag );
  const auto Lower = [&]
  {
    return std::lower_bound( Span.pFirst, Span.pLast, i_rKey,
                             []( const VFlowEntry& i_rEntry, const VFlowTimeKey& i_rSought )
                             {
                               return i_rEntry.Key < i_rSought;
                             } );
  };
  const auto Upper = [&]
  {
    return std::upper_bound( Span.pFirst, Span.pLast, i_rKey,
                             []( const VFlowTimeKey& i_rSought, const VFlowEntry& i_rEntry )
                             {
                               return i_rSought < i_rEntry.Key;
                             } );
  };
  switch ( i_Match )
  {
  case EFlowTimeMatch::Equal:
    return { Lower(), Upper() };
  case EFlowTimeMatch::Before:
    return { Span.pFirst, Lower() };
  case EFlowTimeMatch::BeforeOrAt:
    return { Span.pFirst, Upper() };
  case EFlowTimeMatch::After:
    return { Upper(), Span.pLast };
  case EFlowTimeMatch::AtOrAfter:
    return { Lower(), Span.pLast };
  case EFlowTimeMatch::Overlap:
    break;
  }
  // Entries of any span lie between; the range begins and ends with one that passes, or is empty.
  while ( Span.pFirst != Span.pLast && !FlowTimeMatches( EFlowTimeMatch::Overlap, Span.pFirst->Key, i_rKey ) )
  {
    ++Span.pFirst;
  }
  while ( Span.pLast != Span.pFirst && !FlowTimeMatches( EFlowTimeMatch::Overlap, Span.pLast[-1].Key, i_rKey ) )
  {
    --Span.pLast;
  }
  return Span;
}

void VFlowState::ItemsBegin( VFlowCursor& o_rCursor, std::uint32_t i_Tag, EFlowTimeMatch i_Match,
                             const VFlowTimeKey& i_rKey ) const
{
  o_rCursor = VFlowCursor( Range( i_Tag, i_Match, i_rKey ).pFirst );
}

void VFlowState::TagBegin( VFlowCursor& o_rCursor, std::uint32_t i_Tag, EFlowTimeMatch i_Match ) const
{
  ItemsBegin( o_rCursor, i_Tag, i_Match, m_Key );
}

void VFlowState::ItemsEnd( VFlowCursor& o_rCursor, std::uint32_t i_Tag, EFlowTimeMatch i_Match,
                           const VFlowTimeKey& i_rKey ) const
{
  o_rCursor = VFlowCursor( Range( i_Tag, i_Match, i_rKey ).pLast );
}

void VFlowState::TagEnd( VFlowCursor& o_rCursor, std::uint32_t i_Tag, EFlowTimeMatch i_Match ) const
{
  ItemsEnd( o_rCursor, i_Tag, i_Match, m_Key );
}

void VFlowState::EndCursor( VFlowCursor& o_rCursor ) const
{
  Settle();
  o_rCursor = VFlowCursor( m_Entries.data() + m_Entries.size() );
}

void VFlowState::FindItem( VFlowItemRef& o_rItem, std::uint32_t i_Tag, EFlowTimeMatch i_Match ) const
{
  const VSpan Found = Range( i_Tag, i_Match, m_Key );
  o_rItem = Found.pFirst != Found.pLast ? VFlowItemRef( Found.pFirst->pItem ) : VFlowItemRef();
}

} // namespace HostFlow
