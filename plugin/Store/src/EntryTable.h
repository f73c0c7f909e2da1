#pragma once

#include "Entry.h"

#include <ZEK/EntryPath.h>

#include <atomic>
#include <cstddef>
#include <deque>
#include <string_view>
#include <vector>

namespace Store
{

/// All entries of a store by path, in a chained hash table that never grows. Looking up takes no lock and may run
/// while another thread adds: an entry is complete before it is linked, and is freed with the table only.
class VEntryTable
{
public:
  explicit VEntryTable( std::size_t i_BucketCount );

  VStoreEntry& Root() { return m_Entries.front(); }
  const VStoreEntry& Root() const { return m_Entries.front(); }
  /// Null when there is no handle yet. Thread: any.
  VStoreEntry* Find( const ZEK::VEntryPath& i_rPath ) const;
  /// Makes the entry and its missing parents. The caller holds the store mutex.
  VStoreEntry& FindOrMake( const ZEK::VEntryPath& i_rPath );
  std::size_t Count() const { return m_Entries.size(); }

private:
  std::size_t BucketOf( std::uint64_t i_Hash ) const
  {
    return static_cast< std::size_t >( m_bPowerOfTwo ? i_Hash & ( m_Buckets.size() - 1 ) : i_Hash % m_Buckets.size() );
  }
  VStoreEntry& Make( ZEK::VEntryPath i_Path, VStoreEntry* i_pParent );

  std::vector< std::atomic< VStoreEntry* > > m_Buckets;
  bool m_bPowerOfTwo;
  std::deque< VStoreEntry > m_Entries;  ///< in the order of their making
  VStoreEntry* m_pLastParent = nullptr; ///< of the entry made last; store mutex
};

} // namespace Store
