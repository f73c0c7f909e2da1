#include "Merge.h"

#include "HandlerCallback.h"
#include "Resolve.h"

#include <ZEK/DebugServices.h>
#include <ZEK/StoreFlags.h>

#include <algorithm>
#include <span>
#include <utility>
#include <vector>

namespace Store
{

using namespace ZEK;

namespace
{
/// Any bit that comes with a field, or stands for entries that come and go.
constexpr std::uint64_t TakesSchema = 0x12000007070000;
constexpr std::uint64_t MakesVerification = EChangeVerified | EChangeProposed | EVerifyRequired;

std::uint64_t Promote( std::uint64_t i_Flags )
{
  return ( ( i_Flags & ChangeMask::Promotion ) * 2 ) | ( i_Flags & ~ChangeMask::Promotion );
}

bool IsVerificationPending( const VEntryValues& i_rValues )
{
  return ( i_rValues.m_Flags & EVerifyRequired ) != 0 && i_rValues.m_Verified != i_rValues.m_Proposed;
}

/// One field: told when it differs, or when the scope wants everything told.
template < typename T >
void ApplyField( std::uint64_t i_Bit, std::uint64_t i_Mask, T& io_rOld, T& io_rNew, std::uint64_t& io_rFlags )
{
  if ( ( i_Mask & i_Bit ) == 0 )
  {
    return;
  }
  if ( io_rOld != io_rNew )
  {
    io_rOld = std::move( io_rNew );
    io_rFlags |= i_Bit;
  }
  else if ( ( i_Mask & EForce ) != 0 )
  {
    io_rFlags |= i_Bit;
  }
}

template < typename TGroup >
TGroup& Ensure( std::unique_ptr< TGroup >& io_rpGroup )
{
  if ( !io_rpGroup )
  {
    io_rpGroup = std::make_unique< TGroup >();
  }
  return *io_rpGroup;
}

void ApplyValues( VEntryValues& io_rOld, VEntryValues& io_rNew, std::uint64_t i_Mask, std::uint64_t& io_rFlags )
{
  ApplyField( EChangeVerified, i_Mask, io_rOld.m_Verified, io_rNew.m_Verified, io_rFlags );
  ApplyField( EChangeProposed, i_Mask, io_rOld.m_Proposed, io_rNew.m_Proposed, io_rFlags );
  ApplyField( EChangeDefault, i_Mask, io_rOld.m_Default, io_rNew.m_Default, io_rFlags );
  const auto Mask = static_cast< std::uint32_t >( i_Mask & EAllStoreFlags );
  io_rFlags |= ( i_Mask & EForce ) != 0 ? i_Mask & ChangeMask::Values : ( io_rOld.m_Flags ^ io_rNew.m_Flags ) & Mask;
  io_rOld.m_Flags = ( io_rOld.m_Flags & ~Mask ) | ( io_rNew.m_Flags & Mask );
  // The flags may come from below: then an entry that waits is told of again.
  if ( ( io_rFlags & MakesVerification ) != 0 && IsVerificationPending( io_rOld ) )
  {
    io_rFlags |= EVerificationNeeded;
  }
}

void ApplyPresentation( VEntryPresentation& io_rOld, VEntryPresentation& io_rNew, std::uint64_t i_Mask,
                        std::uint64_t& io_rFlags )
{
  if ( ( i_Mask & EChangeChoices ) != 0 && io_rOld.m_Choices.empty() != io_rNew.m_Choices.empty() )
  {
    io_rFlags |= EChangeHasChoices;
  }
  ApplyField( EChangeMinimum, i_Mask, io_rOld.m_Minimum, io_rNew.m_Minimum, io_rFlags );
  ApplyField( EChangeMaximum, i_Mask, io_rOld.m_Maximum, io_rNew.m_Maximum, io_rFlags );
  ApplyField( EChangeChoices, i_Mask, io_rOld.m_Choices, io_rNew.m_Choices, io_rFlags );
  ApplyField( EChangeChoiceTexts, i_Mask, io_rOld.m_ChoiceTexts, io_rNew.m_ChoiceTexts, io_rFlags );
  ApplyField( EChangeChoiceToolTips, i_Mask, io_rOld.m_ChoiceToolTips, io_rNew.m_ChoiceToolTips, io_rFlags );
  ApplyField( EChangePresentationText, i_Mask, io_rOld.m_Text, io_rNew.m_Text, io_rFlags );
}

void ApplyExtras( VEntryExtras& io_rOld, VEntryExtras& io_rNew, std::uint64_t i_Mask, std::uint64_t& io_rFlags )
{
  ApplyField( EChangeOptionalText, i_Mask, io_rOld.m_OptionalText, io_rNew.m_OptionalText, io_rFlags );
  ApplyField( EChangeExtraText1, i_Mask, io_rOld.m_Text1, io_rNew.m_Text1, io_rFlags );
  ApplyField( EChangeExtraText2, i_Mask, io_rOld.m_Text2, io_rNew.m_Text2, io_rFlags );
  ApplyField( EChangeExtraText3, i_Mask, io_rOld.m_Text3, io_rNew.m_Text3, io_rFlags );
  ApplyField( EChangeExtraNumber1, i_Mask, io_rOld.m_Number1, io_rNew.m_Number1, io_rFlags );
  ApplyField( EChangeExtraNumber2, i_Mask, io_rOld.m_Number2, io_rNew.m_Number2, io_rFlags );
  ApplyField( EChangeAttributes, i_Mask, io_rOld.m_Attributes, io_rNew.m_Attributes, io_rFlags );
}

void ApplyFields( VStoreEntry& io_rEntry, VEntryChange& io_rChange, std::uint64_t i_Mask, std::uint64_t& io_rFlags )
{
  // Before the fields are looked at: a new entry may have a schema and nothing else.
  if ( ( i_Mask & TakesSchema ) != 0 && io_rChange.m_pSchema != nullptr )
  {
    io_rEntry.m_pSchema = io_rChange.m_pSchema;
  }
  if ( ( i_Mask & ChangeMask::Values ) != 0 )
  {
    ApplyValues( io_rEntry.m_Values, io_rChange.m_Values, i_Mask, io_rFlags );
  }
  if ( ( i_Mask & ChangeMask::Presentation ) != 0 )
  {
    ApplyPresentation( Ensure( io_rEntry.m_pState->m_pPresentation ), io_rChange.Presentation(), i_Mask, io_rFlags );
  }
  if ( ( i_Mask & ChangeMask::Extras ) != 0 )
  {
    ApplyExtras( Ensure( io_rEntry.m_pState->m_pExtras ), io_rChange.Extras(), i_Mask, io_rFlags );
  }
}

/// Siblings lie apart, so that the commit of many entries mostly waits for memory: asks for what comes soon.
void FetchAhead( const VPendingChildren& i_rChildren )
{
  constexpr std::size_t Far = 6, Near = 2;
  if ( const VStoreEntry* const pFar = i_rChildren.Ahead( Far ) )
  {
    __builtin_prefetch( &pFar->m_LeafKey );
    __builtin_prefetch( &pFar->m_pChange );
    __builtin_prefetch( &pFar->m_Changes );
  }
  if ( const VStoreEntry* const pNear = i_rChildren.Ahead( Near ) )
  {
    __builtin_prefetch( pNear->m_pChange );
    __builtin_prefetch( &pNear->m_pChange->m_pSchema );
  }
}

/// Brings children that came or went into a list in child order. Few of them are moved in one by one, many by one
/// pass over the whole list.
void UpdateChildren( std::vector< VStoreEntry* >& io_rChildren, std::span< const VPendingChild > i_Moved )
{
  constexpr std::size_t Few = 8;
  std::vector< VStoreEntry* > Added;
  std::vector< VStoreEntry* > Gone;
  for ( const VPendingChild& rChild : i_Moved )
  {
    ( rChild.m_pEntry->m_pState ? Added : Gone ).push_back( rChild.m_pEntry );
  }
  if ( Gone.size() > Few )
  {
    std::erase_if( io_rChildren,
                   []( const VStoreEntry* i_pChild )
                   {
                     return !i_pChild->m_pState;
                   } );
  }
  else
  {
    for ( VStoreEntry* const pChild : Gone )
    {
      io_rChildren.erase( std::lower_bound( io_rChildren.begin(), io_rChildren.end(), pChild, ChildLess ) );
    }
  }
  if ( Added.size() > Few )
  {
    const auto Old = static_cast< std::ptrdiff_t >( io_rChildren.size() );
    io_rChildren.insert( io_rChildren.end(), Added.begin(), Added.end() );
    std::inplace_merge( io_rChildren.begin(), io_rChildren.begin() + Old, io_rChildren.end(), ChildLess );
    return;
  }
  for ( VStoreEntry* const pChild : Added )
  {
    io_rChildren.insert( std::lower_bound( io_rChildren.begin(), io_rChildren.end(), pChild, ChildLess ), pChild );
  }
}
} // namespace

void VMerge::MergeFrom( VStoreEntry& io_rRoot )
{
  // Children first, by the records and not by recursion: a path may have any number of components.
  VStoreEntry* pEntry = &io_rRoot;
  Begin( *pEntry );
  for ( ;; )
  {
    VEntryChange& rChange = *pEntry->m_pChange;
    if ( VStoreEntry* const pChild = MergeLeaves( rChange ) )
    {
      pEntry = pChild;
      continue;
    }
    if ( !rChange.m_Children.Moved().empty() )
    {
      UpdateChildren( pEntry->m_pState->m_Children, rChange.m_Children.Moved() );
    }
    End( *pEntry );
    if ( pEntry == &io_rRoot )
    {
      break;
    }
    pEntry = pEntry->m_pParent;
  }
  m_rPending.ReleaseAll();
}

/// Merges the next children of the record. Returns the first that has pending children itself and has only begun;
/// null at the end.
VStoreEntry* VMerge::MergeLeaves( VEntryChange& io_rParent )
{
  while ( VStoreEntry* const pChild = io_rParent.m_Children.Next() )
  {
    FetchAhead( io_rParent.m_Children );
    Begin( *pChild );
    if ( pChild->m_pChange->m_bParent )
    {
      return pChild;
    }
    End( *pChild );
  }
  return nullptr;
}

void VMerge::Begin( VStoreEntry& io_rEntry )
{
  VEntryChange& rChange = *io_rEntry.m_pChange;
  DebugServices::Check( ( rChange.m_Mask & ChangeMask::Replaced ) != ChangeMask::Replaced, "Added or Removed", __FILE__,
                        __LINE__ );
  rChange.m_bWasThere = io_rEntry.m_pState != nullptr;
  rChange.m_Told = 0;
  if ( ( rChange.m_Mask & EAdded ) != 0 )
  {
    MakeState( io_rEntry, rChange.m_Told );
  }
  if ( rChange.m_bParent )
  {
    rChange.m_Children.Sorted();
  }
}

void VMerge::End( VStoreEntry& io_rEntry )
{
  VEntryChange& rChange = *io_rEntry.m_pChange;
  Apply( io_rEntry, rChange, rChange.m_Mask, rChange.m_Told );
  Touch( io_rEntry.m_Handlers, rChange.m_Told );
  if ( ( rChange.m_Mask & ERemoved ) != 0 )
  {
    io_rEntry.EndState();
  }
  if ( io_rEntry.m_pParent != nullptr )
  {
    VEntryChange& rParent = *io_rEntry.m_pParent->m_pChange;
    rParent.m_Told |= Promote( rChange.m_Told );
    if ( rChange.m_bWasThere != ( io_rEntry.m_pState != nullptr ) )
    {
      rParent.m_Children.KeepMoved( io_rEntry );
    }
  }
  m_rPending.Release( io_rEntry );
}

void VMerge::MakeState( VStoreEntry& io_rEntry, std::uint64_t& io_rFlags )
{
  const VEntryChange& rChange = *io_rEntry.m_pChange;
  if ( !io_rEntry.m_pState )
  {
    io_rEntry.m_pState = std::make_unique< VEntryState >();
    m_rRegistry.Match( io_rEntry );
    io_rFlags |= EAdded;
    return;
  }
  // Removed and added again: what the scope did not set is gone.
  VEntryState& rState = *io_rEntry.m_pState;
  io_rEntry.m_pSchema = rChange.m_pSchema;
  std::uint64_t Cleared = ~rChange.m_Mask & ChangeMask::Fields;
  Cleared &= rState.m_pPresentation ? ~std::uint64_t( 0 ) : ~ChangeMask::Presentation;
  Cleared &= rState.m_pExtras ? ~std::uint64_t( 0 ) : ~ChangeMask::Extras;
  VEntryChange Empty;
  Apply( io_rEntry, Empty, Cleared, io_rFlags );
  io_rFlags |= ( rChange.m_Mask & EReAdd ) != 0 ? std::uint64_t( EAdded ) : 0;
}

void VMerge::Apply( VStoreEntry& io_rEntry, VEntryChange& io_rChange, std::uint64_t i_Mask, std::uint64_t& io_rFlags )
{
  if ( ( i_Mask & ERemoved ) != 0 )
  {
    io_rFlags |= ERemoved;
    Touch( io_rEntry.m_PatternHandlers, io_rFlags );
    return;
  }
  // Most parents hold nothing of their own.
  if ( i_Mask != 0 )
  {
    ApplyFields( io_rEntry, io_rChange, i_Mask, io_rFlags );
    io_rFlags |= i_Mask & ChangeMask::Kept;
  }
  Stamp( io_rEntry, io_rFlags );
  Touch( io_rEntry.m_PatternHandlers, io_rFlags );
}

void VMerge::Stamp( VStoreEntry& io_rEntry, std::uint64_t i_Flags ) const
{
  VChangeIds& rChanges = io_rEntry.m_Changes;
  if ( ( i_Flags & EChangeVerified ) != 0 )
  {
    rChanges.m_Verified = m_Id;
  }
  // Most changes are of nothing else.
  if ( ( i_Flags & ~std::uint64_t( EChangeVerified ) ) == 0 )
  {
    return;
  }
  const auto StampIf = [this, i_Flags]( ChangeId& io_rStamp, std::uint64_t i_Mask )
  {
    if ( ( i_Flags & i_Mask ) != 0 )
    {
      io_rStamp = m_Id;
    }
  };
  StampIf( rChanges.m_Proposed, EChangeProposed );
  StampIf( rChanges.m_Other, ~std::uint64_t( EChangeVerified | EChangeProposed ) );
  StampIf( rChanges.m_Child, ChangeMask::ChildStamp );
  StampIf( rChanges.m_Descendant, ChangeMask::DescendantStamp );
}

void VMerge::Touch( const VHandlerList& i_rHandlers, std::uint64_t i_Flags )
{
  for ( VHandlerCallback* const pHandler : i_rHandlers )
  {
    pHandler->Touch( i_Flags, m_rDelivery );
  }
}

void VMerge::Expand( const VEntryTable& i_rTable, const VQueuedRequest& i_rRequest )
{
  std::vector< VStoreEntry* > Entries = i_rRequest.m_Set.m_Handles;
  for ( const VEntryPath& rPath : i_rRequest.m_Set.m_Paths )
  {
    const std::vector< VStoreEntry* > Found = FindCommitted( i_rTable, rPath );
    Entries.insert( Entries.end(), Found.begin(), Found.end() );
  }
  for ( const VStoreEntry* const pEntry : Entries )
  {
    if ( pEntry != nullptr )
    {
      TouchSubtree( *pEntry, i_rRequest.m_Flags );
    }
  }
}

void VMerge::TouchSubtree( const VStoreEntry& i_rEntry, std::uint64_t i_Flags )
{
  std::vector< const VStoreEntry* > Left{ &i_rEntry };
  while ( !Left.empty() )
  {
    const VStoreEntry& rEntry = *Left.back();
    Left.pop_back();
    std::uint64_t Flags = i_Flags;
    if ( Flags == 0 && IsVerificationPending( rEntry.m_Values ) )
    {
      Flags = EVerificationNeeded;
    }
    if ( rEntry.m_pState )
    {
      Touch( rEntry.m_PatternHandlers, Flags );
      // The first child is the next.
      Left.insert( Left.end(), rEntry.m_pState->m_Children.rbegin(), rEntry.m_pState->m_Children.rend() );
    }
    Touch( rEntry.m_Handlers, Flags );
  }
}

} // namespace Store
