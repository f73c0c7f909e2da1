#pragma once

// The vocabulary of a frame of state: keys, values, items, states. The host implements it; the plug-in only calls.

#include <array>
#include <atomic>
#include <compare>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <typeinfo>
#include <utility>

namespace ZEK
{

/// The identity of a state and of each entry in it.
struct VFlowTimeKey
{
  std::int64_t Frame = 0;  ///< position on the clock, in ticks
  std::int64_t Span = 1;   ///< how long it lasts, in ticks; values below 1 count as 1
  std::uint32_t Clock = 0; ///< which time line `Frame` belongs to

  /// By `Clock`, then by `Frame`; `Span` has no part in the order.
  friend constexpr std::strong_ordering operator<=>( const VFlowTimeKey& i_rA, const VFlowTimeKey& i_rB )
  {
    const auto ByClock = i_rA.Clock <=> i_rB.Clock;
    return ByClock != 0 ? ByClock : i_rA.Frame <=> i_rB.Frame;
  }
  friend constexpr bool operator==( const VFlowTimeKey& i_rA, const VFlowTimeKey& i_rB )
  {
    return i_rA.Clock == i_rB.Clock && i_rA.Frame == i_rB.Frame;
  }
};

/// Ticks of all clocks: whole numbers of ticks a frame at every usual camera and video rate.
inline constexpr std::int64_t FlowTicksPerSecond = 270'000'000;

/// The time test of a query, applied to an entry's key against the query key.
enum class EFlowTimeMatch : std::uint32_t
{
  Equal = 0,
  Before = 1,
  BeforeOrAt = 2,
  After = 3,
  AtOrAfter = 4,
  Overlap = 5 ///< same clock and overlapping spans: a slow item is found in every fast frame that it covers
};

/// Inline, because every walk over a state asks it for every entry.
inline bool FlowTimeMatches( EFlowTimeMatch i_Match, const VFlowTimeKey& i_rEntry, const VFlowTimeKey& i_rQuery )
{
  switch ( i_Match )
  {
  case EFlowTimeMatch::Equal:
    return i_rEntry == i_rQuery;
  case EFlowTimeMatch::Before:
    return i_rEntry < i_rQuery;
  case EFlowTimeMatch::BeforeOrAt:
    return i_rEntry <= i_rQuery;
  case EFlowTimeMatch::After:
    return i_rEntry > i_rQuery;
  case EFlowTimeMatch::AtOrAfter:
    return i_rEntry >= i_rQuery;
  case EFlowTimeMatch::Overlap:
    break;
  }
  // Lengths are compared as differences, so that a span up to the greatest number does not overflow a sum.
  const auto Length = []( const VFlowTimeKey& i_rKey )
  {
    return i_rKey.Span > 1 ? static_cast< std::uint64_t >( i_rKey.Span ) : std::uint64_t{ 1 };
  };
  if ( i_rEntry.Clock != i_rQuery.Clock )
  {
    return false;
  }
  const auto EntryFrame = static_cast< std::uint64_t >( i_rEntry.Frame );
  const auto QueryFrame = static_cast< std::uint64_t >( i_rQuery.Frame );
  return i_rEntry.Frame <= i_rQuery.Frame ? QueryFrame - EntryFrame < Length( i_rEntry )
                                          : EntryFrame - QueryFrame < Length( i_rQuery );
}

/// Tells one value from another: equal ids mean equal values, so a consumer may skip all work.
struct VFlowValueId
{
  std::uint32_t Salt = 0; ///< of the process
  std::uint32_t Type = 0; ///< the tag
  std::int64_t Number = 0;

  friend constexpr bool operator==( const VFlowValueId&, const VFlowValueId& ) = default;
  constexpr bool IsNull() const { return Number == 0 && Type == 0 && Salt == 0; }
};

/// The static descriptor of one kind of item. The words are carried as they are.
struct VFlowItemType
{
  const char* Name = "";
  std::uint32_t Tag = 0;
  std::uint32_t Word1 = 0;
  std::uint32_t Word2 = 0;
  std::uint32_t Word3 = 0;
  const char* Description = "";
};

/// Which of a value's names a join uses.
enum EFlowName : std::uint32_t
{
  EFlowNameTarget = 1, ///< address of a parameters item
  EFlowNameDevice = 2, ///< device URN of camera and device items
  EFlowNameObject = 3, ///< object name of subject-like items
  EFlowNameCount = 4
};

/// The polymorphic holder of an item's payload. Immutable once its item is in a shared state.
class IFlowValue
{
public:
  virtual ~IFlowValue() = default;
  /// False when the value has no name under that selector; the text lives as long as the value.
  virtual bool GetName( std::uint32_t i_Selector, std::string_view& o_rName ) const = 0;
  virtual void SetName( std::uint32_t i_Selector, std::string_view i_Name ) = 0;
  virtual const void* Payload() const = 0;
  /// For the maker of the item alone, before anyone else sees it.
  virtual void* MutablePayload() = 0;
  virtual const std::type_info& PayloadType() const = 0;
};

/// A reference-counted entry of a state. Thread: the count is atomic; the rest does not change once shared.
///
/// What a walk over thousands of items reads lies here, in one line of the memory cache, and is read without a call.
class IFlowItem
{
public:
  const VFlowValueId& Id() const { return m_Id; }
  const IFlowValue& Value() const { return *m_pValue; }
  IFlowValue& MutableValue() { return *m_pValue; }
  /// Items of equal numbers have equal names under that selector, whenever they live: no other name has had the
  /// number in this process. Unequal numbers say nothing, and 0 is no number: the value has no name there, or its
  /// maker does not number.
  std::uint32_t NameNumber( std::uint32_t i_Selector ) const
  {
    return i_Selector - 1 < m_NameNumbers.size() ? m_NameNumbers[i_Selector - 1] : 0;
  }
  const void* Payload() const { return m_pPayload; }
  const std::type_info& PayloadType() const { return *m_pPayloadType; }

  void AddRef() const { m_Count.fetch_add( 1, std::memory_order_relaxed ); }
  void Release() const
  {
    if ( m_Count.fetch_sub( 1, std::memory_order_acq_rel ) == 1 )
    {
      const_cast< IFlowItem* >( this )->Destroy();
    }
  }
  std::int32_t UseCount() const { return m_Count.load( std::memory_order_acquire ); }

  virtual ~IFlowItem() = default;

protected:
  IFlowItem() = default;
  IFlowItem( const IFlowItem& ) = delete;
  IFlowItem& operator=( const IFlowItem& ) = delete;

  /// Called when the last reference went: deletes the item or gives it back to its pool.
  virtual void Destroy() = 0;
  /// For the maker, once the value stands.
  void SetValue( IFlowValue& i_rValue )
  {
    m_pValue = &i_rValue;
    m_pPayload = i_rValue.Payload();
    m_pPayloadType = &i_rValue.PayloadType();
  }

  VFlowValueId m_Id;
  std::array< std::uint32_t, EFlowNameCount - 1 > m_NameNumbers{};
  mutable std::atomic< std::int32_t > m_Count{ 0 };

private:
  IFlowValue* m_pValue = nullptr;
  const void* m_pPayload = nullptr;
  const std::type_info* m_pPayloadType = nullptr;
};

/// Holds one reference on an intrusively counted object.
template < typename T >
class VFlowRef
{
public:
  VFlowRef() = default;
  VFlowRef( std::nullptr_t ) {}
  explicit VFlowRef( T* i_pObject )
    : m_pObject( i_pObject )
  {
    if ( m_pObject )
    {
      m_pObject->AddRef();
    }
  }
  VFlowRef( const VFlowRef& i_rOther )
    : VFlowRef( i_rOther.m_pObject )
  {
  }
  VFlowRef( VFlowRef&& io_rOther ) noexcept
    : m_pObject( std::exchange( io_rOther.m_pObject, nullptr ) )
  {
  }
  VFlowRef& operator=( VFlowRef i_Other ) noexcept
  {
    std::swap( m_pObject, i_Other.m_pObject );
    return *this;
  }
  ~VFlowRef() { Reset(); }

  void Reset()
  {
    if ( T* pObject = std::exchange( m_pObject, nullptr ) )
    {
      pObject->Release();
    }
  }
  T* Get() const { return m_pObject; }
  T* operator->() const { return m_pObject; }
  T& operator*() const { return *m_pObject; }
  explicit operator bool() const { return m_pObject != nullptr; }
  friend bool operator==( const VFlowRef& i_rA, const VFlowRef& i_rB ) { return i_rA.m_pObject == i_rB.m_pObject; }

private:
  T* m_pObject = nullptr;
};

using VFlowItemRef = VFlowRef< IFlowItem >;

/// The payload of an item as core type `T`; null when the item is null or holds another type.
template < typename T >
const T* FlowPayload( const IFlowItem* i_pItem )
{
  return i_pItem && i_pItem->PayloadType() == typeid( T ) ? static_cast< const T* >( i_pItem->Payload() ) : nullptr;
}

/// The payload for its maker to fill, before the item is shared.
template < typename T >
T* FlowMutablePayload( IFlowItem* i_pItem )
{
  return i_pItem && i_pItem->PayloadType() == typeid( T )
             ? static_cast< T* >( i_pItem->MutableValue().MutablePayload() )
             : nullptr;
}

} // namespace ZEK
