#pragma once

#include "VStateBuilder.h"

#include <ZEK/FlowState.h>

#include <atomic>
#include <memory>
#include <mutex>
#include <vector>

namespace HostFlow
{

/// The one implementation of a state. It collects entries in a borrowed builder and puts them in order at the first
/// question or at its freezing, whichever comes first.
class VFlowState final : public ZEK::IFlowState
{
public:
  virtual ~VFlowState() = default; // only the pool ends one
  static ZEK::VFlowStateRef Make( const ZEK::VFlowTimeKey& i_rKey, const ZEK::VFlowInfoA& i_rInfoA,
                                  const ZEK::VFlowInfoB& i_rInfoB );
  static void TrimPool();
  /// The states there are, in use or not.
  static std::size_t Count();

  /// From now on the state does not change.
  void Freeze() const;

  const ZEK::VFlowTimeKey& GetKey() const override { return m_Key; }
  const ZEK::VFlowInfoA& GetInfoA() const override { return m_InfoA; }
  const ZEK::VFlowInfoB& GetInfoB() const override { return m_InfoB; }
  std::size_t ItemCount() const override { return m_Count; }
  void ItemsBegin( ZEK::VFlowCursor& o_rCursor, std::uint32_t i_Tag, ZEK::EFlowTimeMatch i_Match,
                   const ZEK::VFlowTimeKey& i_rKey ) const override;
  void TagBegin( ZEK::VFlowCursor& o_rCursor, std::uint32_t i_Tag, ZEK::EFlowTimeMatch i_Match ) const override;
  void ItemsEnd( ZEK::VFlowCursor& o_rCursor, std::uint32_t i_Tag, ZEK::EFlowTimeMatch i_Match,
                 const ZEK::VFlowTimeKey& i_rKey ) const override;
  void TagEnd( ZEK::VFlowCursor& o_rCursor, std::uint32_t i_Tag, ZEK::EFlowTimeMatch i_Match ) const override;
  void EndCursor( ZEK::VFlowCursor& o_rCursor ) const override;
  void FindItem( ZEK::VFlowItemRef& o_rItem, std::uint32_t i_Tag, ZEK::EFlowTimeMatch i_Match ) const override;
  ZEK::VFlowItemsId ItemsId( std::uint32_t i_Tag ) const override;
  void AddItem( const ZEK::VFlowItemRef& i_rItem ) override { AddItemAt( i_rItem, m_Key ); }
  void AddItemAt( const ZEK::VFlowItemRef& i_rItem, const ZEK::VFlowTimeKey& i_rKey ) override;
  void CopyItems( const ZEK::IFlowState& i_rFrom, std::span< const std::uint32_t > i_Tags ) override;
  void Merge( const ZEK::IFlowState& i_rFrom ) override;
  ZEK::VFlowStateFactoryRef GetFactory() const override;
  void AddRef() const override { m_Uses.fetch_add( 1, std::memory_order_relaxed ); }
  void Release() const override;
  std::int32_t UseCount() const override { return m_Uses.load( std::memory_order_acquire ); }

  VFlowState* pNextFree = nullptr;

private:
  struct VSpan
  {
    const ZEK::VFlowEntry* pFirst;
    const ZEK::VFlowEntry* pLast;
  };

  bool Open();
  void Put( const ZEK::VFlowTimeKey& i_rKey, ZEK::IFlowItem& i_rItem );
  void Settle() const;
  const VTagRange* FindTag( std::uint32_t i_Tag ) const;
  VSpan TagSpan( std::uint32_t i_Tag ) const;
  VSpan Range( std::uint32_t i_Tag, ZEK::EFlowTimeMatch i_Match, const ZEK::VFlowTimeKey& i_rKey ) const;
  void Recycle();

  ZEK::VFlowTimeKey m_Key;
  ZEK::VFlowInfoA m_InfoA;
  ZEK::VFlowInfoB m_InfoB;
  mutable std::atomic< std::int32_t > m_Uses{ 0 };
  mutable std::atomic< bool > m_bFrozen{ false };
  mutable std::atomic< bool > m_bSettled{ true }; ///< false while entries lie in the builder
  std::size_t m_Count = 0;
  mutable std::mutex m_SettleGuard;
  mutable std::unique_ptr< VStateBuilder > m_pBuilder;
  mutable std::vector< ZEK::VFlowEntry > m_Entries;
  mutable std::vector< VTagRange > m_Tags;
};

} // namespace HostFlow
