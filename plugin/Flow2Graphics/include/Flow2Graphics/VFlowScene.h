#pragma once

#include <Flow2Graphics/IFlowRenderType.h>
#include <MoxelGraphics/VMoxelScene.h>

#include <atomic>
#include <memory>
#include <mutex>
#include <vector>

namespace Flow2Graphics
{

class VContributions;
class VFlowRenderCameraProvider;
class VFlowRenderCameras;
class VFlowRenderSubjects;

/// A scene that draws frames of state. A derived scene decides where the states come from: it calls `MarkDirty` when
/// there is something new, and answers `FetchState`.
///
/// Thread: as VMoxelScene. The render types are made in the first frame and live as long as the scene.
class VFlowScene : public MoxelGraphics::VMoxelScene
{
  Q_OBJECT
  Q_PROPERTY( QObject* contributions READ ContributionsObject CONSTANT )

public:
  VFlowScene( std::shared_ptr< HarrowPluginInterface::IRenderResources > i_pRenderResources,
              std::shared_ptr< ZEK::ISelectionService > i_pSelectionService,
              std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > i_pMeshCache,
              std::shared_ptr< ZEK::IPostalService > i_pPostalService, bool i_bDeveloperMode );
  ~VFlowScene() override;

  /// Which cameras see the selection; never null. Thread: GUI.
  const std::shared_ptr< VContributions >& Contributions() const { return m_pContributions; }
  QObject* ContributionsObject() const;
  /// "contributions": the rows of the list, watched from the first call on. "subjects": by display record and kind of
  /// subject, who is there and how much of each was drawn.
  QVariantMap SceneReport() override;

  /// Makes the render types in their fixed order; does nothing when they exist.
  void CreateRenderTypes();
  /// Hands one frame of state to every flow render type. Thread: render thread.
  void UpdateFromState( const ZEK::IFlowState& i_rState, const VSubjectChanges& i_rChanges );

  void Initialise( CoreGraphics::VRenderContext& io_rContext ) override;
  bool ProcessPending() override;
  std::vector< MoxelGraphics::VScenePoint > GetSelectionPositions( const ZEK::VSelection& i_rSelection ) override;
  bool GetSelectionPose( const ZEK::VSelection& i_rSelection, MoxelGraphics::VScenePose& o_rPose ) override;
  ZEK::VSelection ResolveIds( std::span< const std::uint32_t > i_Ids, std::vector< std::string >& o_rLabels ) override;
  QString GetSelectedCameraURN() override;
  void SelectDevice( const QString& i_rName, bool i_bPreselect ) override;

  /// The ids of the items that have one in the present state, in the order of the selection.
  std::vector< std::uint32_t > SelectionItemsToIds( const ZEK::VSelection& i_rSelection );
  bool SelectionItemToPick( const ZEK::VSelection& i_rSelection, MoxelGraphics::VScenePose& o_rPick )
  {
    return GetSelectionPose( i_rSelection, o_rPick );
  }
  ZEK::VSelection IdsToSelection( std::span< const std::uint32_t > i_Ids, std::vector< std::string >& o_rNames )
  {
    return ResolveIds( i_Ids, o_rNames );
  }
  QString SelectedName() { return GetSelectedCameraURN(); }
  void SelectByName( const QString& i_rName, bool i_bPreselect ) { SelectDevice( i_rName, i_bPreselect ); }

  /// The cameras of the present state; null before the render types are made.
  const std::shared_ptr< VFlowRenderCameraProvider >& CameraProvider() const { return m_pCameraProvider; }
  /// What draws them; null before the render types are made.
  const std::shared_ptr< VFlowRenderCameras >& Cameras() const { return m_pCameras; }
  /// The subjects of it; null before the render types are made. Thread: any.
  std::shared_ptr< VFlowRenderSubjects > Subjects() const;
  const std::vector< std::shared_ptr< IFlowRenderType > >& FlowRenderTypes() const { return m_FlowRenderTypes; }
  /// How often it was looked for a state so far, also where that was the one that is shown already.
  std::uint64_t Looks() const { return m_Looks; }
  /// The states that are kept of a stretch of time, in any order; none where nothing is kept. Thread: render thread.
  virtual void FetchAround( const ZEK::VFlowTimeRange& /*i_rRange*/, std::vector< ZEK::VFlowStateRef >& o_rStates )
  {
    o_rStates.clear();
  }

protected:
  /// The newest state; null when there is none. Thread: render thread.
  virtual ZEK::VFlowStateRef FetchState() = 0;
  /// As `MarkDirty`, and the next frame takes its state even if it has taken that one before. Thread: any.
  void MarkStale();

private:
  void UpdateUnlessTaken( const ZEK::VFlowStateRef& i_rState );
  void ConnectMeshCache();

  std::vector< std::shared_ptr< IFlowRenderType > > m_FlowRenderTypes;
  std::shared_ptr< VFlowRenderCameraProvider > m_pCameraProvider;
  std::shared_ptr< VFlowRenderCameras > m_pCameras;
  std::shared_ptr< VContributions > m_pContributions;
  bool m_bReported = false; ///< the report watches
  mutable std::mutex m_SubjectsGuard;
  std::shared_ptr< VFlowRenderSubjects > m_pSubjects;
  ZEK::VConnection m_MeshCacheChanged;
  // What the types hold; the state is kept so that no other can be taken for it.
  std::uint64_t m_Looks = 0;
  ZEK::VFlowStateRef m_TakenState;
  std::uint64_t m_TakenSelection = 0;
  std::atomic< bool > m_bStale{ true };
};

} // namespace Flow2Graphics
