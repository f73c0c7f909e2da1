#include "Resolve.h"

#include "Pending.h"

#include <ZEK/StoreFlags.h>

#include <algorithm>
#include <span>

namespace Store
{
namespace
{
using ZEK::ChangeMask::Replaced;
using VRest = std::optional< std::string_view >;
using VFound = std::vector< VStoreEntry* >;

/// A place that a walk has still to go to.
struct VPlace
{
  VStoreEntry* m_pEntry;
  VRest m_Rest;
  std::uint64_t m_Skip; ///< an entry whose pending record has one of these bits ends its branch
};
using VPlaces = std::vector< VPlace >;

VFound WalkCommitted( VStoreEntry& i_rRoot, VRest i_Rest )
{
  VFound Found;
  VPlaces Left{ { &i_rRoot, i_Rest, 0 } };
  while ( !Left.empty() )
  {
    VPlace Place = Left.back();
    Left.pop_back();
    if ( !Place.m_pEntry->m_pState )
    {
      continue;
    }
    if ( !Place.m_Rest )
    {
      Found.push_back( Place.m_pEntry );
      continue;
    }
    const VFound& rChildren = Place.m_pEntry->m_pState->m_Children;
    const std::string_view Name = TakeComponent( Place.m_Rest );
    const std::span< VStoreEntry* const > Next = Name == "*" ? rChildren : FindChildren( rChildren, Name );
    // The first is the next.
    for ( std::size_t Child = Next.size(); Child-- != 0; )
    {
      Left.push_back( { Next[Child], Place.m_Rest, 0 } );
    }
  }
  return Found;
}

void AppendOverlaid( const VPlace& i_rFrom, std::string_view i_Name, VPlaces& io_rLeft )
{
  static const VFound NoneCommitted;
  static const std::vector< VPendingChild > NonePending;
  const VStoreEntry& rEntry = *i_rFrom.m_pEntry;
  const VFound& rCommitted = rEntry.m_pState ? rEntry.m_pState->m_Children : NoneCommitted;
  const auto& rPending = rEntry.m_pChange != nullptr ? rEntry.m_pChange->m_Children.Sorted() : NonePending;
  if ( i_Name == "*" )
  {
    // Entries that are added again are in both lists, and are visited in the second.
    for ( VStoreEntry* const pChild : rCommitted )
    {
      io_rLeft.push_back( { pChild, i_rFrom.m_Rest, Replaced } );
    }
    for ( const VPendingChild& rChild : rPending )
    {
      if ( ( rChild.m_pEntry->m_pChange->m_Mask & ZEK::EAdded ) != 0 )
      {
        io_rLeft.push_back( { rChild.m_pEntry, i_rFrom.m_Rest, ZEK::ERemoved } );
      }
    }
    return;
  }
  for ( VStoreEntry* const pChild : FindChildren( rCommitted, i_Name ) )
  {
    io_rLeft.push_back( { pChild, i_rFrom.m_Rest, ZEK::ERemoved } );
  }
  for ( const VPendingChild& rChild : FindChildren( rPending, i_Name ) )
  {
    if ( !rChild.m_pEntry->m_pState )
    {
      io_rLeft.push_back( { rChild.m_pEntry, i_rFrom.m_Rest, ZEK::ERemoved } );
    }
  }
}

VFound WalkOverlaid( VStoreEntry& i_rRoot, VRest i_Rest )
{
  VFound Found;
  VPlaces Left{ { &i_rRoot, i_Rest, ZEK::ERemoved } };
  while ( !Left.empty() )
  {
    VPlace Place = Left.back();
    Left.pop_back();
    const VEntryChange* const pChange = Place.m_pEntry->m_pChange;
    if ( pChange != nullptr && ( pChange->m_Mask & Place.m_Skip ) != 0 )
    {
      continue;
    }
    if ( !Place.m_Rest )
    {
      Found.push_back( Place.m_pEntry );
      continue;
    }
    const std::string_view Name = TakeComponent( Place.m_Rest );
    const auto Old = static_cast< std::ptrdiff_t >( Left.size() );
    AppendOverlaid( Place, Name, Left );
    std::reverse( Left.begin() + Old, Left.end() );
  }
  return Found;
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
  if ( IsPattern( i_rPath ) )
  {
    return WalkCommitted( const_cast< VStoreEntry& >( i_rTable.Root() ), i_rPath.Text() );
  }
  VFound Found;
  if ( VStoreEntry* const pEntry = i_rTable.Find( i_rPath ); pEntry != nullptr && pEntry->m_pState )
  {
    Found.push_back( pEntry );
  }
  return Found;
}

std::vector< VStoreEntry* > FindOverlaid( const VEntryTable& i_rTable, const ZEK::VEntryPath& i_rPath )
{
  if ( IsPattern( i_rPath ) )
  {
    return WalkOverlaid( const_cast< VStoreEntry& >( i_rTable.Root() ), i_rPath.Text() );
  }
  VFound Found;
  if ( VStoreEntry* const pEntry = i_rTable.Find( i_rPath ); pEntry != nullptr && IsThere( *pEntry ) )
  {
    Found.push_back( pEntry );
  }
  return Found;
}

} // namespace Store
