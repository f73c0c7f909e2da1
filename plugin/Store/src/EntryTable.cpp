#include "EntryTable.h"

#include <algorithm>
#include <bit>

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
  // Not by recursion: a path may have any number of components.
  std::vector< ZEK::VEntryPath > Missing{ i_rPath };
  VStoreEntry* pParent = nullptr;
  while ( pParent == nullptr )
  {
    ZEK::VEntryPath Parent = Missing.back().Parent();
    pParent = Find( Parent );
    if ( pParent == nullptr )
    {
      Missing.push_back( std::move( Parent ) );
    }
  }
  for ( ; !Missing.empty(); Missing.pop_back() )
  {
    pParent = &Make( Missing.back(), pParent );
  }
  return *pParent;
}

VStoreEntry& VEntryTable::Make( const ZEK::VEntryPath& i_rPath, VStoreEntry* i_pParent )
{
  VStoreEntry& rEntry = m_Entries.emplace_back( i_rPath, i_pParent );
  std::atomic< VStoreEntry* >& rBucket = m_Buckets[BucketOf( i_rPath.Hash() )];
  rEntry.m_pBucketLink.store( rBucket.load( std::memory_order_relaxed ), std::memory_order_relaxed );
  rBucket.store( &rEntry, std::memory_order_release );
  return rEntry;
}

} // namespace Store
