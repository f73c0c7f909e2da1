#pragma once

#include <Flow2Graphics/IFlowRenderType.h>
#include <MoxelGraphics/VMoxelScene.h>

#include <memory>
#include <vector>

namespace Flow2Graphics
{

class VContributions;
class VFlowRenderCameraProvider;
class VFlowRenderCameras;

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
  /// "contributions": the rows of the list. Watches it from the first call on.
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
  const std::vector< std::shared_ptr< IFlowRenderType > >& FlowRenderTypes() const { return m_FlowRenderTypes; }

protected:
  /// The newest state; null when there is none. Thread: render thread.
  virtual ZEK::VFlowStateRef FetchState() = 0;

private:
  std::vector< std::shared_ptr< IFlowRenderType > > m_FlowRenderTypes;
  std::shared_ptr< VFlowRenderCameraProvider > m_pCameraProvider;
  std::shared_ptr< VFlowRenderCameras > m_pCameras;
  std::shared_ptr< VContributions > m_pContributions;
  bool m_bReported = false; ///< the report watches
};

} // namespace Flow2Graphics
