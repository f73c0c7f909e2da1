#pragma once

#include <HostFlow/VFlowFramework.h>

#include <mutex>
#include <utility>
#include <vector>

namespace HostFlow
{

/// The ring of states behind every cache.
class VStateCache final : public IHostStateCache
{
public:
  explicit VStateCache( std::size_t i_Ring );
  ~VStateCache() override;

  void GetId( std::uint32_t& o_rId ) const override { o_rId = m_Id; }
  std::uint32_t GetStatus() const override;
  bool GetFlag() const override { return true; }
  bool Query( const ZEK::VFlowTimeKey& i_rKey, std::uint32_t i_Mask, bool i_bFlag ) const override;
  bool QueryRange( ZEK::VFlowTimeRange& io_rRange ) const override;
  bool Contains( const ZEK::VFlowTimeKey& i_rKey, std::uint32_t i_Flags ) const override;
  bool FetchWhere( const ZEK::VFlowTimeKey& i_rKey, ZEK::VFlowStateRef& o_rState, std::uint32_t i_Mask,
                   std::uint32_t i_Mode, std::uint32_t i_Flags ) override;
  bool Fetch( ZEK::VFlowStateRef& o_rState, std::uint32_t i_Mask, std::uint32_t i_Mode,
              std::uint32_t i_Flags ) override;
  bool QueryKey( const ZEK::VFlowTimeKey& i_rKey, ZEK::VFlowTimeKey& o_rKey, const ZEK::VFlowValueId& i_rValue,
                 std::uint32_t i_Flags ) const override;
  bool FetchMany( const ZEK::VFlowTimeRange& i_rRange, std::vector< ZEK::VFlowStateRef >& o_rStates,
                  std::uint32_t i_Flags ) override;
  bool QueryItems( const ZEK::VFlowTimeKey& i_rKey, std::span< const std::uint32_t > i_Tags,
                   std::vector< ZEK::VFlowItemRef >& o_rItems ) const override;
  ZEK::IMultiCallbackPostal< void() >& StatesChanged() override { return m_StatesChanged; }
  ZEK::IMultiCallbackPostal< void() >& Notifier2() override { return m_Notifier2; }
  ZEK::IMultiCallbackPostal< void() >& Notifier3() override { return m_Notifier3; }
  ZEK::IMultiCallbackPostal< void() >& Notifier4() override { return m_Notifier4; }
  ZEK::IMultiCallbackPostal< void() >& Notifier5() override { return m_Notifier5; }
  ZEK::IMultiCallbackPostal< void() >& Notifier6() override { return m_Notifier6; }

  ZEK::IResult Add( const ZEK::VFlowStateRef& i_rState ) override;
  void Clear() override;

  void SetStaticItems( std::vector< ZEK::VFlowItemRef > i_Items ) override;
  void SetStatus( std::uint32_t i_Status ) override;
  void NamesChanged() override { m_Notifier5.Fire(); }
  void SetAround( std::vector< ZEK::VFlowStateRef >& io_rStates, bool i_bTell ) override;
  void GetStaticItems( ZEK::IResult& o_rStatus, std::vector< ZEK::VFlowItemRef >& o_rItems ) const override;

private:
  /// The key lies beside the state, so that a search by key stays out of the states.
  struct VPlace
  {
    ZEK::VFlowTimeKey Key;
    ZEK::VFlowStateRef State;
  };

  VPlace& At( std::size_t i_Age ) { return m_Ring[( m_First + i_Age ) % m_Ring.size()]; }
  const VPlace& At( std::size_t i_Age ) const { return m_Ring[( m_First + i_Age ) % m_Ring.size()]; }
  const VPlace* Find( const ZEK::VFlowTimeKey& i_rKey, bool i_bOldest ) const;
  bool Put( ZEK::VFlowStateRef& io_rState );

  const std::uint32_t m_Id;
  mutable std::mutex m_Guard;
  std::vector< VPlace > m_Ring;
  std::size_t m_First = 0;
  std::size_t m_Count = 0;
  std::vector< ZEK::VFlowStateRef > m_Around;
  std::uint32_t m_Status = 1;
  std::vector< ZEK::VFlowItemRef > m_StaticItems;
  ZEK::VMultiCallback< void() > m_StatesChanged;
  ZEK::VMultiCallback< void() > m_Notifier2;
  ZEK::VMultiCallback< void() > m_Notifier3;
  ZEK::VMultiCallback< void() > m_Notifier4;
  ZEK::VMultiCallback< void() > m_Notifier5;
  ZEK::VMultiCallback< void() > m_Notifier6;
};

} // namespace HostFlow
