#pragma once

#include "Entry.h"

#include <ZEK/Result.h>
#include <ZEK/StoreFlags.h>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

namespace Store
{

/// True for an entry that the open write scope sees.
inline bool IsThere( const VStoreEntry& i_rEntry )
{
  return i_rEntry.m_pChange != nullptr ? ( i_rEntry.m_pChange->m_Mask & ZEK::ERemoved ) == 0
                                       : i_rEntry.m_pState != nullptr;
}

/// The committed fields of the entry do not count in the open write scope.
inline bool IsReplaced( const VStoreEntry& i_rEntry )
{
  return i_rEntry.m_pChange != nullptr && ( i_rEntry.m_pChange->m_Mask & ZEK::ChangeMask::Replaced ) != 0;
}

/// The fields of a group that the open write scope sees, for one bit of the mask. Null reads as empty.
template < typename TGroup >
const TGroup& Overlaid( const VStoreEntry* i_pEntry, std::uint64_t i_Bit )
{
  const VEntryChange* const pChange = i_pEntry != nullptr ? i_pEntry->m_pChange : nullptr;
  if ( pChange != nullptr )
  {
    if ( ( pChange->m_Mask & i_Bit ) != 0 )
    {
      return PendingGroup( *pChange, static_cast< const TGroup* >( nullptr ) );
    }
    if ( ( pChange->m_Mask & ZEK::ChangeMask::Replaced ) != 0 )
    {
      return EmptyGroup< TGroup >();
    }
  }
  return Committed< TGroup >( i_pEntry );
}

/// The flag word that the open write scope sees.
std::uint32_t OverlaidFlags( const VStoreEntry* i_pEntry );
/// The schema that the open write scope sees; Void without one, never null.
const ZEK::IO::ISchema* OverlaidSchema( const VStoreEntry* i_pEntry );

/// The pending records of a store, and how they come and go. Thread: that of the write scope; the commit, under the
/// store mutex.
///
/// An entry has a record exactly when it stands in the pending children of its parent, and then its parents have
/// records too.
class VPending
{
public:
  /// For a write: an entry that was removed, or whose parents were, is there again from now on.
  VEntryChange& ObtainForWrite( VStoreEntry& io_rEntry );
  /// Removes the entry and all below it. `NotFound` when the scope does not see it.
  ZEK::IResult Remove( VStoreEntry& io_rEntry, bool i_bForce );
  /// The merge is through with the record of this entry.
  void Release( VStoreEntry& io_rEntry );
  /// The merge is through with all entries: records are taken from the first again, in the order of their memory.
  void ReleaseAll();
  /// The number of records in use.
  std::size_t InUse() const { return m_InUse; }

private:
  static constexpr std::size_t BlockSize = 32;

  VEntryChange& Acquire( VStoreEntry& io_rEntry );
  VEntryChange& Take( std::uint64_t i_Mask );
  void GiveBack( VStoreEntry& io_rEntry );
  void MarkRemoved( VStoreEntry& io_rEntry, bool i_bForce );
  void ReleaseUnlessOld( const VEntryChange& i_rChange );
  void Unlink( VStoreEntry& io_rEntry );

  VEntryChange& TakeNext();

  std::vector< std::unique_ptr< VEntryChange[] > > m_Blocks;
  std::size_t m_UsedBlocks = 0;
  VEntryChange* m_pNext = nullptr; ///< not taken yet, as those up to the end of its block
  VEntryChange* m_pEnd = nullptr;
  std::vector< VEntryChange* > m_Free; ///< taken and given back within the scope
  std::size_t m_InUse = 0;
};

} // namespace Store
