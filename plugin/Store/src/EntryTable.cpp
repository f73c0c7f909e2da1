#include "EntryTable.h"

#include <algorithm>
#include <bit>
#include <utility>

namespace Store
{

VEntryTable::VEntryTable( std::size_t i_BucketCount )
  : m_Buckets( std::max< std::size_t >( i_BucketCount, 1 ) )
  , m_bPowerOfTwo( std::has_single_bit( m_Buckets.size() ) )
{
  Make( ZEK::VEntryPath(), nullptr );
}

VStoreEntry* VEntryTable::Find( const ZEK::VEntryPath& i_rPath ) const
{
  VStoreEntry* pEntry = m_Buckets[BucketOf( i_rPath.Hash() )].load( std::memory_order_acquire );
  while ( pEntry != nullptr && !( pEntry->m_Path == i_rPath ) )
  {
    pEntry = pEntry->m_pBucketLink.load( std::memory_order_acquire );
  }
  return pEntry;
}

VStoreEntry& VEntryTable::FindOrMake( const ZEK::VEntryPath& i_rPath )
{
  if ( VStoreEntry* const pEntry = Find( i_rPath ) )
  {
    return *pEntry;
  }
  // Siblings are often made one after the other.
  const std::size_t Leaf = i_rPath.LeafPosition();
  if ( m_pLastParent != nullptr && Leaf != 0 &&
       std::string_view( i_rPath.Text() ).substr( 0, Leaf - 1 ) == m_pLastParent->m_Path.Text() )
  {
    return Make( i_rPath, m_pLastParent );
  }
  // Not by recursion: a path may have any number of components. Only the sizes of what is missing are kept, as the
  // texts together may be large.
  std::vector< std::size_t > Missing{ i_rPath.Text().size() };
  ZEK::VEntryPath Parent = i_rPath.Parent();
  VStoreEntry* pParent = Find( Parent );
  while ( pParent == nullptr )
  {
    Missing.push_back( Parent.Text().size() );
    Parent = Parent.Parent();
    pParent = Find( Parent );
  }
  for ( ; !Missing.empty(); Missing.pop_back() )
  {
    m_pLastParent = pParent;
    pParent = &( Missing.size() == 1 ? Make( i_rPath, pParent )
                                     : Make( i_rPath.Text().substr( 0, Missing.back() ), pParent ) );
  }
  return *pParent;
}

VStoreEntry& VEntryTable::Make( ZEK::VEntryPath i_Path, VStoreEntry* i_pParent )
{
  VStoreEntry& rEntry = m_Entries.emplace_back( std::move( i_Path ), i_pParent );
  std::atomic< VStoreEntry* >& rBucket = m_Buckets[BucketOf( rEntry.m_Path.Hash() )];
  rEntry.m_pBucketLink.store( rBucket.load( std::memory_order_relaxed ), std::memory_order_relaxed );
  rBucket.store( &rEntry, std::memory_order_release );
  return rEntry;
}

} // namespace Store
