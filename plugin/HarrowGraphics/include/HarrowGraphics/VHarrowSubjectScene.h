#pragma once

#include <Flow2Graphics/VFlowScene.h>
#include <Flow2StateCache/VFlowStateCacheTransform.h>
#include <HarrowPluginInterface/IHarrowServices.h>
#include <ZEK/DispatchCollapser.h>

#include <QtCore/QStringList>

#include <cstdint>
#include <mutex>
#include <optional>
#include <vector>

namespace HarrowGraphics
{

/// What the scene of a window of subjects is made from; services that may be null say so.
struct VHarrowSubjectSceneArguments
{
  std::shared_ptr< HarrowPluginInterface::IRenderResources > pRenderResources;
  std::shared_ptr< HarrowPluginInterface::IStateCacheContext > pContext; ///< may be null
  std::shared_ptr< ZEK::IPostalService > pPostal;
  std::shared_ptr< ZEK::ISelectionService > pSelection;
  std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > pMeshCache; ///< may be null
  ZEK::VFlowStoreRef SubjectFlowContext;
  bool bDeveloperMode = false;
};

/// Which poses subjects stand in, by their place in each subject's list.
struct VSubjectPoses
{
  std::uint32_t Pose = 0;
  std::optional< std::uint32_t > Labelling; ///< of labelled subjects, in place of `Pose`
  std::optional< std::uint32_t > Solving;   ///< of solved subjects, in place of `Pose`

  friend bool operator==( const VSubjectPoses&, const VSubjectPoses& ) = default;
};

/// The scene of one window: the subjects of a context side by side, each in a pose that was asked for, and nothing else
/// of the capture. Thread: as VMoxelScene; poses, names and the report on the GUI thread.
class VHarrowSubjectScene : public Flow2Graphics::VFlowScene
{
  Q_OBJECT
  Q_PROPERTY( QStringList poseNames READ PoseNames NOTIFY PosesChanged )
  Q_PROPERTY( QStringList subjectNames READ SubjectNames NOTIFY PosesChanged )

public:
  explicit VHarrowSubjectScene( VHarrowSubjectSceneArguments i_Arguments );
  ~VHarrowSubjectScene() override;

  /// Connects to the cache and the services.
  void Start() override;
  void SetPoses( const VSubjectPoses& i_rPoses );
  const VSubjectPoses& Poses() const { return m_Poses; }
  /// The names of the poses of the subject that has the most of them. Empty before the first frame.
  const QStringList& PoseNames() const { return m_PoseNames; }
  /// The subjects that stand there.
  const QStringList& SubjectNames() const { return m_SubjectNames; }
  /// Beside what every scene tells "subjectScene": "pose", "labellingPose", "solvingPose", "poses", "subjects", and the
  /// "tags" of what is shown.
  QVariantMap SceneReport() override;
  std::vector< MoxelGraphics::VScenePoint > HomePoints() override;

signals:
  /// Other subjects stand there, or have other poses.
  void PosesChanged();

protected:
  ZEK::VFlowStateRef FetchState() override;

private:
  ZEK::VFlowStateRef Shown() const;
  void TakeShown( const ZEK::VFlowStateRef& i_rState );
  void ReadNames();

  VHarrowSubjectSceneArguments m_Arguments;
  std::shared_ptr< Flow2StateCache::VFlowStateCacheTransform > m_pCache;
  VSubjectPoses m_Poses;
  QStringList m_PoseNames, m_SubjectNames;
  mutable std::mutex m_ShownGuard;
  ZEK::VFlowStateRef m_Shown;                      ///< the state of the last frame
  std::vector< ZEK::VFlowValueId > m_Parametrised; ///< of that state
  std::unique_ptr< ZEK::VDispatchCollapser > m_pStatesChanged;
  std::shared_ptr< ZEK::IMultiCallback< void() > > m_pSelectionChanged;
  std::vector< ZEK::VConnection > m_Connections;
};

} // namespace HarrowGraphics
