#pragma once

#include <Flow2Graphics/VFlowScene.h>
#include <HarrowPluginInterface/IHarrowApplication.h>
#include <ZEK/DispatchCollapser.h>

#include <vector>

namespace HarrowGraphics
{

/// What a scene of a context is made from; services that may be null say so.
struct VHarrowSceneArguments
{
  std::shared_ptr< HarrowPluginInterface::IRenderResources > pRenderResources;
  std::shared_ptr< ZEK::ISelectionService > pSelection;
  std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > pMeshCache; ///< may be null
  std::shared_ptr< ZEK::IPostalService > pPostal;
  bool bDeveloperMode = false;
  std::shared_ptr< HarrowPluginInterface::IStateCacheContext > pContext;
  std::shared_ptr< HarrowPluginInterface::IActivityMode > pActivityMode;           ///< may be null
  std::shared_ptr< HarrowPluginInterface::IManipulatorSwitch > pVolumeManipulator; ///< may be null
  std::shared_ptr< HarrowPluginInterface::IPlaybackRange > pPlaybackRange;         ///< may be null
};

/// The scene of one context, shared by its 3D views and its camera grids: shows the newest state of the context's
/// cache. Thread: as VMoxelScene.
class VHarrowScene : public Flow2Graphics::VFlowScene
{
  Q_OBJECT
  Q_PROPERTY( bool currentTimeWithinRange READ currentTimeWithinRange NOTIFY CurrentTimeWithinRangeChanged )

public:
  explicit VHarrowScene( VHarrowSceneArguments i_Arguments );
  ~VHarrowScene() override;

  /// Connects to the cache and the services.
  void Start() override;
  /// Brings the render types up to date when there is something new. Thread: render thread.
  void Update() { ProcessPending(); }
  /// True unless something is played back and its time lies outside the range.
  bool currentTimeWithinRange() const { return m_bWithinRange; }
  /// What the context's cache has of it.
  void FetchAround( const ZEK::VFlowTimeRange& i_rRange, std::vector< ZEK::VFlowStateRef >& o_rStates ) override;

signals:
  void CurrentTimeWithinRangeChanged();

protected:
  ZEK::VFlowStateRef FetchState() override;

private:
  void OnPlaybackChanged();

  VHarrowSceneArguments m_Arguments;
  std::shared_ptr< ZEK::IFlowStateCache > m_pCache;
  std::unique_ptr< ZEK::VDispatchCollapser > m_pStatesChanged;
  bool m_bWithinRange = true;
  std::shared_ptr< ZEK::IMultiCallback< void() > > m_pSelectionChanged;
  std::vector< ZEK::VConnection > m_Connections;
};

} // namespace HarrowGraphics
