#pragma once

#include <Flow2StateCache/VFlowStateStash.h>

#include <ZEK/FlowState.h>

#include <cstdint>
#include <memory>
#include <mutex>
#include <span>
#include <vector>

namespace Flow2StateCache
{

using ZEK::IFlowStaticItemProvider;

/// A cache whose states have gone through a transform: it stands between a source and a view. It remembers the last ten
/// inputs and outputs, so that drawing a frame again does not transform it again, and forwards all else to the source.
///
/// Thread: any; one lock serialises the operations and covers the calls to the source and the transform. Notifiers fire
/// outside the lock, on the thread that fired the source's. The owner alone sets source, transform and parameters, the
/// transform straight after the source.
class VFlowStateCacheTransform final : public ZEK::IFlowStateCache, public IFlowStaticItemProvider
{
public:
  static constexpr std::size_t StashCapacity = 10;

  VFlowStateCacheTransform();
  ~VFlowStateCacheTransform() override;
  VFlowStateCacheTransform( const VFlowStateCacheTransform& ) = delete;
  VFlowStateCacheTransform& operator=( const VFlowStateCacheTransform& ) = delete;

  /// May be null. Fires `Notifier6`, `Notifier4`, `Notifier3`, `StatesChanged` and `Notifier2`.
  void SetSource( std::shared_ptr< ZEK::IFlowStateCache > i_pSource );
  /// Its results keep the keys of their inputs. Fires `StatesChanged` and `Notifier2`.
  void SetTransform( std::shared_ptr< ZEK::IFlowStateTransform > i_pTransform );
  /// What the transform is given from now on. Reaches a view as a new frame would: fires `StatesChanged` and
  /// `Notifier2`.
  void SetParameters( const ZEK::VFlowParameterMap& i_rParameters );

  // Without a source: id 0, status 2, flag true, all else false.
  void GetId( std::uint32_t& o_rId ) const override;
  std::uint32_t GetStatus() const override;
  bool GetFlag() const override;
  bool Query( const ZEK::VFlowTimeKey& i_rKey, std::uint32_t i_Mask, bool i_bFlag ) const override;
  bool QueryRange( ZEK::VFlowTimeRange& io_rRange ) const override;
  bool Contains( const ZEK::VFlowTimeKey& i_rKey, std::uint32_t i_Flags ) const override;
  bool QueryKey( const ZEK::VFlowTimeKey& i_rKey, ZEK::VFlowTimeKey& o_rKey, const ZEK::VFlowValueId& i_rValue,
                 std::uint32_t i_Flags ) const override;
  bool QueryItems( const ZEK::VFlowTimeKey& i_rKey, std::span< const std::uint32_t > i_Tags,
                   std::vector< ZEK::VFlowItemRef >& o_rItems ) const override;

  /// True with null while the source has no state. The same state object under the same key is transformed once.
  bool Fetch( ZEK::VFlowStateRef& o_rState, std::uint32_t i_Mask, std::uint32_t i_Mode,
              std::uint32_t i_Flags ) override;
  bool FetchWhere( const ZEK::VFlowTimeKey& i_rKey, ZEK::VFlowStateRef& o_rState, std::uint32_t i_Mask,
                   std::uint32_t i_Mode, std::uint32_t i_Flags ) override;
  /// Transforms every state afresh.
  bool FetchMany( const ZEK::VFlowTimeRange& i_rRange, std::vector< ZEK::VFlowStateRef >& o_rStates,
                  std::uint32_t i_Flags ) override;

  // Each fires when the source's of the same name does, with one exception that stays: the source's `Notifier5` fires
  // `Notifier6`, and `Notifier5` never fires.
  ZEK::IMultiCallbackPostal< void() >& StatesChanged() override;
  ZEK::IMultiCallbackPostal< void() >& Notifier2() override;
  ZEK::IMultiCallbackPostal< void() >& Notifier3() override;
  ZEK::IMultiCallbackPostal< void() >& Notifier4() override;
  ZEK::IMultiCallbackPostal< void() >& Notifier5() override;
  ZEK::IMultiCallbackPostal< void() >& Notifier6() override;

  /// The source's, as of `SetSource` or of the last time that its `Notifier4` fired. The status is always `Ok`.
  void GetStaticItems( ZEK::IResult& o_rStatus, std::vector< ZEK::VFlowItemRef >& o_rItems ) const override;

private:
  struct VNotifiers;

  void ConnectSource();
  void CopyStaticItems() const;
  void ClearStashes();
  void FireFrame();
  ZEK::VFlowStateRef Transformed( const ZEK::VFlowStateRef& i_rInput );
  ZEK::VFlowStateRef FromStash( const ZEK::VFlowStateRef& i_rInput );

  mutable std::mutex m_Guard;
  std::shared_ptr< ZEK::IFlowStateCache > m_pSource;
  std::shared_ptr< ZEK::IFlowStateTransform > m_pTransform;
  ZEK::VFlowParameterMap m_Parameters;
  VFlowStateStash m_InputStash{ StashCapacity };
  VFlowStateStash m_OutputStash{ StashCapacity };
  mutable std::vector< ZEK::VFlowItemRef > m_StaticItems;
  /// Shared with the forwarders: one that still runs when its connection goes does not meet a dead notifier.
  const std::shared_ptr< VNotifiers > m_pNotifiers;
  std::vector< ZEK::VConnection > m_Connections;
};

} // namespace Flow2StateCache
