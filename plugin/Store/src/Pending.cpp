#include "Pending.h"

namespace Store
{

using namespace ZEK;

std::uint32_t OverlaidFlags( const VStoreEntry* i_pEntry )
{
  if ( i_pEntry == nullptr || i_pEntry->m_pChange == nullptr )
  {
    return Committed< VEntryValues >( i_pEntry ).m_Flags;
  }
  const VEntryChange& rChange = *i_pEntry->m_pChange;
  const auto Mask = static_cast< std::uint32_t >( rChange.m_Mask & EAllStoreFlags );
  const std::uint32_t Old = IsReplaced( *i_pEntry ) ? 0 : Committed< VEntryValues >( i_pEntry ).m_Flags;
  return ( Old & ~Mask ) | ( rChange.m_Values.m_Flags & Mask );
}

const IO::ISchema* OverlaidSchema( const VStoreEntry* i_pEntry )
{
  const IO::ISchema* pSchema = nullptr;
  if ( i_pEntry != nullptr )
  {
    if ( i_pEntry->m_pChange != nullptr )
    {
      pSchema = i_pEntry->m_pChange->m_pSchema;
    }
    if ( pSchema == nullptr && !IsReplaced( *i_pEntry ) )
    {
      pSchema = i_pEntry->m_pSchema;
    }
  }
  return pSchema != nullptr ? pSchema : IO::GetUniquePodSchema( IO::EType::Void );
}

namespace
{
/// Most records never have any, and are not looked at as far as that.
void ClearChoices( VEntryChange& io_rChange )
{
  if ( io_rChange.m_bChoices )
  {
    io_rChange.m_bChoices = false;
    io_rChange.Presentation().m_Choices.clear();
    io_rChange.Presentation().m_ChoiceTexts.clear();
    io_rChange.Presentation().m_ChoiceToolTips.clear();
  }
}
} // namespace

VEntryChange& VPending::TakeNext()
{
  if ( !m_Free.empty() )
  {
    VEntryChange& rChange = *m_Free.back();
    m_Free.pop_back();
    return rChange;
  }
  if ( m_pNext == m_pEnd )
  {
    if ( m_UsedBlocks == m_Blocks.size() )
    {
      m_Blocks.push_back( std::make_unique< VEntryChange[] >( BlockSize ) );
    }
    m_pNext = m_Blocks[m_UsedBlocks++].get();
    m_pEnd = m_pNext + BlockSize;
  }
  return *m_pNext++;
}

VEntryChange& VPending::Take( std::uint64_t i_Mask )
{
  VEntryChange& rChange = TakeNext();
  ++m_InUse;
  rChange.m_Mask = i_Mask;
  rChange.m_pSchema = nullptr;
  if ( rChange.m_bParent )
  {
    rChange.m_bParent = false;
    rChange.m_Children.Clear();
  }
  ClearChoices( rChange );
  return rChange;
}

void VPending::Release( VStoreEntry& io_rEntry )
{
#ifndef NDEBUG
  // A field that is read past its mask shows at once.
  io_rEntry.m_pChange->m_Values.m_Flags = ~std::uint32_t( 0 );
  io_rEntry.m_pChange->m_Values.m_Verified = IO::VTypedValue( nullptr, IO::VValueBytes( "stale", 5 ) );
  io_rEntry.m_pChange->m_Values.m_Proposed = io_rEntry.m_pChange->m_Values.m_Verified;
  io_rEntry.m_pChange->m_Values.m_Default = io_rEntry.m_pChange->m_Values.m_Verified;
  io_rEntry.m_pChange->Presentation().m_Text = "stale";
  io_rEntry.m_pChange->Extras().m_OptionalText = "stale";
  io_rEntry.m_pChange->Extras().m_Number1 = ~std::uint32_t( 0 );
#endif
  io_rEntry.m_pChange = nullptr;
  --m_InUse;
}

void VPending::ReleaseAll()
{
  m_UsedBlocks = 0;
  m_pNext = nullptr;
  m_pEnd = nullptr;
  m_Free.clear();
}

void VPending::GiveBack( VStoreEntry& io_rEntry )
{
  m_Free.push_back( io_rEntry.m_pChange );
  Release( io_rEntry );
}

VEntryChange& VPending::Acquire( VStoreEntry& io_rEntry )
{
  VStoreEntry* pEntry = &io_rEntry;
  // Up to the first entry that has a record, each new one then stands in the list of its parent.
  for ( VStoreEntry* pBelow = nullptr; pEntry != nullptr; pBelow = pEntry, pEntry = pEntry->m_pParent )
  {
    const bool bHad = pEntry->m_pChange != nullptr;
    if ( !bHad )
    {
      pEntry->m_pChange = &Take( pEntry->m_pState ? 0 : std::uint64_t( EAdded ) );
    }
    if ( pBelow != nullptr )
    {
      pEntry->m_pChange->m_bParent = true;
      pEntry->m_pChange->m_Children.Add( *pBelow );
    }
    if ( bHad )
    {
      break;
    }
  }
  return *io_rEntry.m_pChange;
}

VEntryChange& VPending::ObtainForWrite( VStoreEntry& io_rEntry )
{
  VEntryChange& rChange = Acquire( io_rEntry );
  if ( ( rChange.m_Mask & ERemoved ) != 0 || !io_rEntry.m_pState )
  {
    rChange.m_Mask = ( rChange.m_Mask & ~ERemoved ) | EAdded;
    for ( VStoreEntry* pParent = io_rEntry.m_pParent; pParent != nullptr && IsReplaced( *pParent );
          pParent = pParent->m_pParent )
    {
      pParent->m_pChange->m_Mask = ( pParent->m_pChange->m_Mask & ~ERemoved ) | EAdded;
    }
  }
  return rChange;
}

IResult VPending::Remove( VStoreEntry& io_rEntry, bool i_bForce )
{
  if ( !IsThere( io_rEntry ) )
  {
    return IResult::NotFound;
  }
  // What was made in this scope goes without a trace, as nobody else has seen it.
  if ( io_rEntry.m_pChange != nullptr )
  {
    ReleaseUnlessOld( *io_rEntry.m_pChange );
    io_rEntry.m_pChange->m_Children.Clear();
  }
  if ( io_rEntry.m_pState )
  {
    MarkRemoved( io_rEntry, i_bForce );
    return IResult::Ok;
  }
  // Without a state; parents that hold nothing else were only there for it.
  for ( VStoreEntry* pEntry = &io_rEntry; pEntry != nullptr; pEntry = pEntry->m_pParent )
  {
    Unlink( *pEntry );
    const VEntryChange* const pParent = pEntry->m_pParent != nullptr ? pEntry->m_pParent->m_pChange : nullptr;
    if ( pParent == nullptr || !pParent->m_Children.IsEmpty() || pParent->m_Mask != 0 )
    {
      break;
    }
  }
  return IResult::Ok;
}

/// Below the record: those without a state go, the others keep no children.
void VPending::ReleaseUnlessOld( const VEntryChange& i_rChange )
{
  std::vector< VStoreEntry* > Left;
  const auto Append = [&Left]( const VEntryChange& i_rParent )
  {
    for ( const VPendingChild& rChild : i_rParent.m_Children.Items() )
    {
      if ( rChild.m_pEntry != nullptr )
      {
        Left.push_back( rChild.m_pEntry );
      }
    }
  };
  Append( i_rChange );
  while ( !Left.empty() )
  {
    VStoreEntry& rEntry = *Left.back();
    Left.pop_back();
    Append( *rEntry.m_pChange );
    rEntry.m_pChange->m_Children.Clear();
    if ( !rEntry.m_pState )
    {
      GiveBack( rEntry );
    }
  }
}

void VPending::MarkRemoved( VStoreEntry& io_rEntry, bool i_bForce )
{
  Acquire( io_rEntry );
  std::vector< VStoreEntry* > Left{ &io_rEntry };
  while ( !Left.empty() )
  {
    VStoreEntry& rEntry = *Left.back();
    Left.pop_back();
    VEntryChange& rChange = *rEntry.m_pChange;
    rChange.m_Mask = ( rChange.m_Mask & ChangeMask::Kept ) | ERemoved | ( i_bForce ? std::uint64_t( EForce ) : 0 );
    rChange.m_pSchema = nullptr;
    // Should the entry be written again, its lists are not filled from here or from the state.
    ClearChoices( rChange );
    const std::vector< VStoreEntry* >& rChildren = rEntry.m_pState->m_Children;
    for ( VStoreEntry* const pChild : rChildren )
    {
      if ( pChild->m_pChange == nullptr )
      {
        pChild->m_pChange = &Take( 0 );
      }
    }
    rChange.m_bParent = true;
    rChange.m_Children.Assign( rChildren );
    Left.insert( Left.end(), rChildren.begin(), rChildren.end() );
  }
}

void VPending::Unlink( VStoreEntry& io_rEntry )
{
  if ( io_rEntry.m_pParent != nullptr && io_rEntry.m_pParent->m_pChange != nullptr )
  {
    io_rEntry.m_pParent->m_pChange->m_Children.Remove( io_rEntry );
  }
  GiveBack( io_rEntry );
}

} // namespace Store
