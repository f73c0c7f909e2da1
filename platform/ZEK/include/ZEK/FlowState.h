#pragma once

#include <ZEK/Callback.h>
#include <ZEK/FlowTypes.h>
#include <ZEK/Result.h>

#include <map>
#include <memory>
#include <span>
#include <string>
#include <variant>
#include <vector>

namespace ZEK
{

class IFlowState;
class IFlowStateFactoryHandle;
class IFlowStoreHandle;
using VFlowStateRef = VFlowRef< IFlowState >;
using VFlowStateFactoryRef = VFlowRef< IFlowStateFactoryHandle >;
using VFlowStoreRef = VFlowRef< IFlowStoreHandle >;

/// Wall clock and rate of the frame.
struct VFlowInfoA
{
  std::int64_t WallClockNs = 0;
  std::int64_t RateNumerator = 0;
  std::int64_t RateDenominator = 1;
};

/// Timecode of the frame.
struct VFlowInfoB
{
  std::int32_t Hours = 0;
  std::int32_t Minutes = 0;
  std::int32_t Seconds = 0;
  std::int32_t Frames = 0;
  std::int32_t Standard = 0;
};

/// One entry of a state. Entries lie in one array, ascending by tag, then by key, then by insertion.
struct VFlowEntry
{
  VFlowTimeKey Key;
  std::uint32_t Tag = 0;
  IFlowItem* pItem = nullptr; ///< the state holds the reference
};

/// What tells the items of one tag in a state from those in another: where it is the same known one, the same items
/// stand in the same order, each under the key of its state. Slow items, which are in state after state, are then
/// recognised by one comparison.
struct VFlowItemsId
{
  std::uint64_t A = 0, B = 0;

  friend constexpr bool operator==( const VFlowItemsId&, const VFlowItemsId& ) = default;
  constexpr bool IsKnown() const { return A != 0 || B != 0; }
};

/// Steps through the entries of one state without allocation; stable while the state lives.
class VFlowCursor
{
public:
  VFlowCursor() = default;
  explicit VFlowCursor( const VFlowEntry* i_pEntry )
    : m_pEntry( i_pEntry )
  {
  }

  const VFlowEntry& operator*() const { return *m_pEntry; }
  const VFlowEntry* operator->() const { return m_pEntry; }
  VFlowCursor& operator++()
  {
    ++m_pEntry;
    return *this;
  }
  friend bool operator==( const VFlowCursor&, const VFlowCursor& ) = default;

private:
  const VFlowEntry* m_pEntry = nullptr;
};

/// One frame of the system: a reference-counted bag of items, all valid for one time key.
///
/// A state is built by one thread and frozen when it is first put into a cache; from then on it never changes and
/// any thread may read it. A range between two cursors holds the entries of one tag; under a match that is not
/// contiguous in time (`Overlap`) it can hold entries that do not pass, which `FlowTimeMatches` tells.
class IFlowState
{
public:
  virtual const VFlowTimeKey& GetKey() const = 0;
  virtual const VFlowInfoA& GetInfoA() const = 0;
  virtual const VFlowInfoB& GetInfoB() const = 0;
  virtual std::size_t ItemCount() const = 0;
  virtual void ItemsBegin( VFlowCursor& o_rCursor, std::uint32_t i_Tag, EFlowTimeMatch i_Match,
                           const VFlowTimeKey& i_rKey ) const = 0;
  virtual void TagBegin( VFlowCursor& o_rCursor, std::uint32_t i_Tag, EFlowTimeMatch i_Match ) const = 0;
  virtual void ItemsEnd( VFlowCursor& o_rCursor, std::uint32_t i_Tag, EFlowTimeMatch i_Match,
                         const VFlowTimeKey& i_rKey ) const = 0;
  virtual void TagEnd( VFlowCursor& o_rCursor, std::uint32_t i_Tag, EFlowTimeMatch i_Match ) const = 0;
  virtual void EndCursor( VFlowCursor& o_rCursor ) const = 0;
  /// The first entry of the tag that passes the match against the state's own key, or null.
  virtual void FindItem( VFlowItemRef& o_rItem, std::uint32_t i_Tag, EFlowTimeMatch i_Match ) const = 0;
  /// Unknown where an item stands under another key than the state's, or where the maker of states does not tell.
  virtual VFlowItemsId ItemsId( std::uint32_t /*i_Tag*/ ) const { return {}; }
  /// Adds to a state that is being built. An item of the same tag, key and names as an entry replaces that entry.
  /// The item takes the state's key; `AddItemAt` gives it its own.
  virtual void AddItem( const VFlowItemRef& i_rItem ) = 0;
  virtual void AddItemAt( const VFlowItemRef& i_rItem, const VFlowTimeKey& i_rKey ) = 0;
  virtual void CopyItems( const IFlowState& i_rFrom, std::span< const std::uint32_t > i_Tags ) = 0;
  virtual void Merge( const IFlowState& i_rFrom ) = 0;
  virtual VFlowStateFactoryRef GetFactory() const = 0;
  virtual void AddRef() const = 0;
  virtual void Release() const = 0;
  virtual std::int32_t UseCount() const = 0;

protected:
  ~IFlowState() = default;
};

/// Makes empty states. Intrusively counted; copied through `VFlowStateFactoryRef`. Thread: any.
class IFlowStateFactoryHandle
{
public:
  virtual IResult CreateState( VFlowStateRef& o_rState, const VFlowTimeKey& i_rKey, const VFlowInfoA& i_rInfoA,
                               const VFlowInfoB& i_rInfoB ) = 0;
  virtual void AddRef() const = 0;
  virtual void Release() const = 0;

protected:
  ~IFlowStateFactoryHandle() = default;
};

/// Makes items of a given type, with a fresh value id and an empty payload. Thread: any.
class IFlowStoreHandle
{
public:
  virtual void CreateItem( IResult& o_rStatus, const VFlowItemType& i_rType, VFlowItemRef& o_rItem ) = 0;
  virtual void AddRef() const = 0;
  virtual void Release() const = 0;

protected:
  ~IFlowStoreHandle() = default;
};

/// Keys from `First` to `Last`, both included.
struct VFlowTimeRange
{
  VFlowTimeKey First;
  VFlowTimeKey Last;
};

/// A cache of states. Thread: any. Each fetch first releases and nulls what the out state holds.
///
/// Mask 31 selects all item groups. Mode 2 gives the complete state added last (not the one with the greatest
/// key), 0 the oldest, 1 the one at the key. Flags are 0.
class IFlowStateCache
{
public:
  virtual ~IFlowStateCache() = default;
  virtual void GetId( std::uint32_t& o_rId ) const = 0;
  virtual void GetHandle( std::shared_ptr< void >& o_rpHandle ) const { o_rpHandle.reset(); }
  virtual bool IsActive() const { return GetStatus() != 0; }
  virtual std::uint32_t GetStatus() const = 0;
  virtual bool GetFlag() const = 0;
  virtual bool Query( const VFlowTimeKey& i_rKey, std::uint32_t i_Mask, bool i_bFlag ) const = 0;
  virtual bool QueryRange( VFlowTimeRange& io_rRange ) const = 0;
  virtual bool Contains( const VFlowTimeKey& i_rKey, std::uint32_t i_Flags ) const = 0;
  virtual bool FetchWhere( const VFlowTimeKey& i_rKey, VFlowStateRef& o_rState, std::uint32_t i_Mask,
                           std::uint32_t i_Mode, std::uint32_t i_Flags ) = 0;
  virtual bool Fetch( VFlowStateRef& o_rState, std::uint32_t i_Mask, std::uint32_t i_Mode, std::uint32_t i_Flags ) = 0;
  virtual bool QueryKey( const VFlowTimeKey& i_rKey, VFlowTimeKey& o_rKey, const VFlowValueId& i_rValue,
                         std::uint32_t i_Flags ) const = 0;
  virtual bool FetchMany( const VFlowTimeRange& i_rRange, std::vector< VFlowStateRef >& o_rStates,
                          std::uint32_t i_Flags ) = 0;
  virtual bool QueryItems( const VFlowTimeKey& i_rKey, std::span< const std::uint32_t > i_Tags,
                           std::vector< VFlowItemRef >& o_rItems ) const = 0;
  virtual IMultiCallbackPostal< void() >& StatesChanged() = 0; ///< a state was added
  virtual IMultiCallbackPostal< void() >& Notifier2() = 0;     ///< contents were replaced
  virtual IMultiCallbackPostal< void() >& Notifier3() = 0;     ///< the status changed
  virtual IMultiCallbackPostal< void() >& Notifier4() = 0;     ///< static items changed
  virtual IMultiCallbackPostal< void() >& Notifier5() = 0;     ///< names changed
  virtual IMultiCallbackPostal< void() >& Notifier6() = 0;     ///< the cache was emptied
};

/// A cache that can be written to.
class IFlowWritableStateCache : public virtual IFlowStateCache
{
public:
  /// Freezes the state and makes it the newest. Fires `StatesChanged` with no lock held.
  virtual IResult Add( const VFlowStateRef& i_rState ) = 0;
  /// Drops every state and fires `Notifier6`; a seek does this.
  virtual void Clear() = 0;
};

/// Owned by the host. The same name twice gives `AlreadyPresent` and the cache that exists.
class IFlowStateCacheManager
{
public:
  virtual ~IFlowStateCacheManager() = default;
  virtual IResult CreateCache( std::shared_ptr< IFlowWritableStateCache >& o_rpCache, const std::string& i_rName,
                               std::uint32_t i_Flags ) = 0;
  virtual std::shared_ptr< IFlowWritableStateCache > FindCache( const std::string& i_rName ) const = 0;
  virtual std::vector< std::string > Names() const = 0;
};

using VFlowParameter = std::variant< bool, std::int64_t, double, std::string >;
using VFlowParameterMap = std::map< std::string, VFlowParameter >;

/// Derives one state from another. It must not change its input, and may not fail.
class IFlowStateTransform
{
public:
  virtual ~IFlowStateTransform() = default;
  virtual VFlowStateRef& Transform( VFlowStateRef& o_rState, const VFlowStateRef& i_rInput,
                                    const VFlowParameterMap& i_rParameters ) = 0;
};

/// A cache that has items which hold for every frame.
class IFlowStaticItemProvider
{
public:
  virtual ~IFlowStaticItemProvider() = default;
  virtual void GetStaticItems( IResult& o_rStatus, std::vector< VFlowItemRef >& o_rItems ) const = 0;
};

/// Maps a flow type (a tag struct such as `FlowSubject`) to its descriptor and its core type.
template < typename T >
struct FlowValueType;

} // namespace ZEK
