#include "Resolve.h"

#include "Pending.h"

#include <ZEK/StoreFlags.h>

namespace Store
{
namespace
{
using ZEK::ChangeMask::Replaced;
using VRest = std::optional< std::string_view >;
using VFound = std::vector< VStoreEntry* >;

void WalkCommitted( VStoreEntry& i_rEntry, VRest i_Rest, VFound& io_rFound )
{
  if ( !i_rEntry.m_pState )
  {
    return;
  }
  if ( !i_Rest )
  {
    io_rFound.push_back( &i_rEntry );
    return;
  }
  const VFound& rChildren = i_rEntry.m_pState->m_Children;
  const std::string_view Name = TakeComponent( i_Rest );
  const VChildRange Range = Name == "*" ? VChildRange{ rChildren.data(), rChildren.data() + rChildren.size() }
                                        : FindChildren( rChildren, Name );
  for ( VStoreEntry* const pChild : Range )
  {
    WalkCommitted( *pChild, i_Rest, io_rFound );
  }
}

/// An entry whose pending record has a bit of `i_Skip` ends its branch.
void WalkOverlaid( VStoreEntry& i_rEntry, VRest i_Rest, std::uint64_t i_Skip, VFound& io_rFound )
{
  VEntryChange* const pChange = i_rEntry.m_pChange;
  if ( pChange != nullptr && ( pChange->m_Mask & i_Skip ) != 0 )
  {
    return;
  }
  if ( !i_Rest )
  {
    io_rFound.push_back( &i_rEntry );
    return;
  }
  static const VFound None;
  const VFound& rCommitted = i_rEntry.m_pState ? i_rEntry.m_pState->m_Children : None;
  const VFound& rPending = pChange != nullptr ? pChange->m_Children.Sorted() : None;
  const std::string_view Name = TakeComponent( i_Rest );
  if ( Name == "*" )
  {
    // Entries that are added again are in both lists, and are visited in the second.
    for ( VStoreEntry* const pChild : rCommitted )
    {
      WalkOverlaid( *pChild, i_Rest, Replaced, io_rFound );
    }
    for ( VStoreEntry* const pChild : rPending )
    {
      if ( ( pChild->m_pChange->m_Mask & ZEK::EAdded ) != 0 )
      {
        WalkOverlaid( *pChild, i_Rest, ZEK::ERemoved, io_rFound );
      }
    }
    return;
  }
  for ( VStoreEntry* const pChild : FindChildren( rCommitted, Name ) )
  {
    WalkOverlaid( *pChild, i_Rest, ZEK::ERemoved, io_rFound );
  }
  for ( VStoreEntry* const pChild : FindChildren( rPending, Name ) )
  {
    if ( !pChild->m_pState )
    {
      WalkOverlaid( *pChild, i_Rest, ZEK::ERemoved, io_rFound );
    }
  }
}
} // namespace

bool IsPattern( const ZEK::VEntryPath& i_rPath )
{
  if ( i_rPath.HasWildcard() )
  {
    for ( VRest Rest = i_rPath.Text(); Rest; )
    {
      if ( TakeComponent( Rest ) == "*" )
      {
        return true;
      }
    }
  }
  return false;
}

std::string_view TakeComponent( VRest& io_rRest )
{
  const std::string_view Text = *io_rRest;
  const std::size_t Slash = Text.find( '/' );
  if ( Slash == std::string_view::npos )
  {
    io_rRest.reset();
    return Text;
  }
  io_rRest = Text.substr( Slash + 1 );
  return Text.substr( 0, Slash );
}

std::vector< VStoreEntry* > FindCommitted( const VEntryTable& i_rTable, const ZEK::VEntryPath& i_rPath )
{
  VFound Found;
  if ( IsPattern( i_rPath ) )
  {
    WalkCommitted( const_cast< VStoreEntry& >( i_rTable.Root() ), i_rPath.Text(), Found );
  }
  else if ( VStoreEntry* const pEntry = i_rTable.Find( i_rPath ); pEntry != nullptr && pEntry->m_pState )
  {
    Found.push_back( pEntry );
  }
  return Found;
}

std::vector< VStoreEntry* > FindOverlaid( const VEntryTable& i_rTable, const ZEK::VEntryPath& i_rPath )
{
  VFound Found;
  if ( IsPattern( i_rPath ) )
  {
    WalkOverlaid( const_cast< VStoreEntry& >( i_rTable.Root() ), i_rPath.Text(), ZEK::ERemoved, Found );
  }
  else if ( VStoreEntry* const pEntry = i_rTable.Find( i_rPath ); pEntry != nullptr && IsThere( *pEntry ) )
  {
    Found.push_back( pEntry );
  }
  return Found;
}

} // namespace Store
