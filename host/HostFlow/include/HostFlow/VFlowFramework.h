#pragma once

// The flow framework: what makes, orders, shares and keeps the frames of state that the interfaces of ZEK describe.

#include <ZEK/FlowState.h>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

namespace HostFlow
{

inline constexpr std::size_t DefaultRing = 512;
/// The states that a cache made with `ZEK::EFlowCacheWatchedLive` keeps at most.
inline constexpr std::size_t LiveRing = 4;

/// A cache as its owner sees it: what a writer does, and what only the host may set.
///
/// The ring keeps the states added last; the oldest leaves when it is full. A state whose key equals that of the
/// newest takes its place and fires `Notifier2` before `StatesChanged`. `Fetch` answers mode 2 with the state added
/// last and mode 0 with the oldest, true with a null state while the ring is empty; mode 1 needs a key and gives
/// false, as do a mask of 0 and other modes. `FetchWhere` looks for the state of that key, else for one whose span
/// covers it, newest first in modes 1 and 2; false when there is none. The queries give false.
/// Thread: any. Notifiers fire with no lock held.
class IHostStateCache : public virtual ZEK::IFlowWritableStateCache, public ZEK::IFlowStaticItemProvider
{
public:
  /// Items that hold for every frame. Fires `Notifier4`.
  virtual void SetStaticItems( std::vector< ZEK::VFlowItemRef > i_Items ) = 0;
  /// 0 is inactive; 1 at first. Fires `Notifier3` on a change.
  virtual void SetStatus( std::uint32_t i_Status ) = 0;
  /// Fires `Notifier5`: objects of the frames to come have other names.
  virtual void NamesChanged() = 0;
  /// States for those who look around the newest: `FetchMany` finds them behind those of the ring, nothing else does,
  /// and what is newest or oldest stays what it was. They take the place of the former ones, which the argument has
  /// then; `Clear` drops them. `i_bTell` fires `StatesChanged`. Null states are not allowed.
  virtual void SetAround( std::vector< ZEK::VFlowStateRef >& io_rStates, bool i_bTell ) = 0;
};

/// Makes states. Pooled: a state that goes away leaves its memory to the next. Handles of all calls share one pool.
///
/// A state is built by one thread and frozen by its first cache. Adding to a frozen state, and adding null, is an
/// assertion and changes nothing. A state that nobody froze may be read by several threads once it is complete.
ZEK::VFlowStateFactoryRef MakeStateFactory();

/// Makes items of every kind in `CoreMoxelTypes::VAllFlowTypes`; another tag gives `InvalidType` and null. Pooled:
/// payload and names are empty, but vectors of the frequent kinds keep the room that a former payload had.
/// A name set to "" counts as no name.
ZEK::VFlowStoreRef MakeItemStore();

/// A cache on its own, without a manager. A ring below 1 counts as 1.
std::shared_ptr< IHostStateCache > MakeCache( std::size_t i_Ring = DefaultRing );

/// Its caches are `IHostStateCache`s of that ring. An empty name gives `InvalidName`. Thread: any.
std::shared_ptr< ZEK::IFlowStateCacheManager > MakeCacheManager( std::size_t i_Ring = DefaultRing );

/// What is there, in use or waiting for its next use; it grows with what is in use at once, not with time.
struct VPoolFigures
{
  std::size_t Items = 0;
  std::size_t States = 0;
  std::size_t Names = 0;
};
VPoolFigures CountPools();

/// Gives back to the system the memory that pooled items and states keep for the next. Every cache does this when it
/// goes away; a source that was large does it when it closes. Thread: any.
void TrimPools();

} // namespace HostFlow
