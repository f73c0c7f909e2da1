#pragma once

#include <ZEK/FlowState.h>

#include <QtCore/QTimer>

#include <cstdint>
#include <memory>
#include <vector>

namespace Flow2Graphics
{

struct VTestCamera;

/// Drives caches, feeds and views without a capture system: 128 cameras with new centroids and greyscale blobs in every
/// tick, as large as a sensor gives them. For developers. Thread: the one that made it, which must run an event loop.
class VStressTest
{
public:
  static constexpr const char* CacheName = "[DEV] Stress Test";
  static constexpr int CameraCount = 128;

  VStressTest( std::weak_ptr< ZEK::IFlowStateCacheManager > i_pManager, ZEK::VFlowStateFactoryRef i_Factory,
               ZEK::VFlowStoreRef i_Store );
  ~VStressTest();
  VStressTest( const VStressTest& ) = delete;
  VStressTest& operator=( const VStressTest& ) = delete;

  /// Makes the cache where there is none, and starts the timer. A failure is logged.
  ZEK::IResult Start();
  void Stop();
  bool IsRunning() const { return m_Timer.isActive(); }

  /// Adds one frame to the cache; what the timer does. `NotSet` before the first start; a failure stops the timer.
  ZEK::IResult Tick();

private:
  ZEK::IResult MakeCameras();
  ZEK::IResult AddFrame( ZEK::IFlowWritableStateCache& io_rCache );
  ZEK::IResult AddCamera( ZEK::IFlowState& io_rState, const VTestCamera& i_rCamera );
  /// Of the numbers from 0 to `i_Most`.
  std::uint32_t Draw( std::uint32_t i_Most );
  std::uint64_t NextRandom();
  void FillBlobs( ZEK::IFlowItem& io_rItem );
  void FillCentroids( ZEK::IFlowItem& io_rItem );

  const std::weak_ptr< ZEK::IFlowStateCacheManager > m_pManager;
  const ZEK::VFlowStateFactoryRef m_Factory;
  const ZEK::VFlowStoreRef m_Store;
  std::weak_ptr< ZEK::IFlowWritableStateCache > m_pCache;
  std::vector< VTestCamera > m_Cameras;
  std::uint64_t m_Random = 0x2545f4914f6cdd1du;
  QTimer m_Timer;
};

} // namespace Flow2Graphics
