#pragma once

#include "Delivery.h"
#include "EntryTable.h"
#include "HandlerRegistry.h"
#include "Pending.h"

#include <ZEK/TypedId.h>

#include <cstdint>

namespace Store
{

/// A pair of `QueueChangeNotification`, or with no flags of `QueueVerificationCheck`.
struct VQueuedRequest
{
  ZEK::VEntryPatternSet m_Set;
  std::uint64_t m_Flags = 0;
};

/// Brings the pending records of a scope into the committed tree, and finds which handlers hear of it. Lives for one
/// commit, under the store mutex, while no reader is inside.
///
/// An entry's flags hold those of its children, Added and Removed moved on to their child and descendant forms; so do
/// its handlers' flags and its stamps.
class VMerge
{
public:
  VMerge( const VHandlerRegistry& i_rRegistry, VPending& io_rPending, VDelivery& io_rDelivery, ZEK::ChangeId i_Id )
    : m_rRegistry( i_rRegistry )
    , m_rPending( io_rPending )
    , m_rDelivery( io_rDelivery )
    , m_Id( i_Id )
  {
  }

  /// Merges all entries that have records, from the root on, and gives the records back.
  void MergeFrom( VStoreEntry& io_rRoot );
  /// Once all is merged.
  void Expand( const VEntryTable& i_rTable, const VQueuedRequest& i_rRequest );

private:
  void Begin( VStoreEntry& io_rEntry );
  VStoreEntry* MergeLeaves( VEntryChange& io_rParent );
  void End( VStoreEntry& io_rEntry );
  void MakeState( VStoreEntry& io_rEntry, std::uint64_t& io_rFlags );
  void Apply( VStoreEntry& io_rEntry, VEntryChange& io_rChange, std::uint64_t i_Mask, std::uint64_t& io_rFlags );
  void Stamp( VStoreEntry& io_rEntry, std::uint64_t i_Flags ) const;
  void Touch( const VHandlerList& i_rHandlers, std::uint64_t i_Flags );
  void TouchSubtree( const VStoreEntry& i_rEntry, std::uint64_t i_Flags );

  const VHandlerRegistry& m_rRegistry;
  VPending& m_rPending;
  VDelivery& m_rDelivery;
  ZEK::ChangeId m_Id;
};

} // namespace Store
