#pragma once

#include <HarrowPluginInterface/IHarrowServices.h>
#include <MoxelGraphics/VSceneFramebufferObject.h>
#include <MoxelQtQuick/VQuickWidget.h>
#include <ZEK/Selection.h>

#include <QtCore/QPointer>
#include <QtCore/QTimer>

#include <memory>
#include <string>

namespace MoxelGraphics
{
class ICameraModelAdditionalDataSource;
class VCameraGrid;
class VCameraGridSelection;
class VMoxelScene;
} // namespace MoxelGraphics

namespace ZEK
{
class ICoreUserPreferencesLayout;
}

namespace HarrowGraphics
{
class VHarrowSubjectScene;

/// The window kinds; they index the root document.
enum EWindowKind : int
{
  EWindowKind3D = 0,
  EWindowKindCameras = 1,
  EWindowKindSubject = 2
};

/// What a scene widget is made from.
struct VSceneWidgetArguments
{
  std::shared_ptr< MoxelGraphics::VMoxelScene > pScene;
  std::shared_ptr< HarrowPluginInterface::IHarrowQuickHost > pQuickHost;
  std::shared_ptr< ZEK::ISelectionService > pSelection;
  std::shared_ptr< ZEK::IPostalService > pPostal;
  std::shared_ptr< HarrowPluginInterface::IWidgetService > pWidgetService;        ///< may be null
  std::shared_ptr< HarrowPluginInterface::IActivityMode > pActivityMode;          ///< may be null
  std::shared_ptr< ZEK::IStore > pStore;                                          ///< may be null
  std::shared_ptr< MoxelGraphics::ICameraModelAdditionalDataSource > pCameraData; ///< may be null
  EWindowKind Kind = EWindowKind3D;
  std::uint32_t FeatureFlags = 0;
  bool bVolumeManipulator = false;
};

/// The widget of one scene window: publishes the scene and the modes to QML, loads the root document, repaints it
/// every 16 ms and carries out the workspace commands of scene windows. Thread: GUI.
class VQMLSceneWidget : public MoxelQtQuick::VQuickWidget
{
  Q_OBJECT
  Q_PROPERTY( bool focusSupported READ focusSupported CONSTANT )
  Q_PROPERTY( bool trackingSupported READ trackingSupported CONSTANT )
  Q_PROPERTY( uint poseIndex READ poseIndex WRITE setPoseIndex NOTIFY PoseIndexChanged )
  Q_PROPERTY( int labellingPoseIndex READ labellingPoseIndex WRITE setLabellingPoseIndex NOTIFY PoseIndexChanged )
  Q_PROPERTY( int solvingPoseIndex READ solvingPoseIndex WRITE setSolvingPoseIndex NOTIFY PoseIndexChanged )

public:
  explicit VQMLSceneWidget( VSceneWidgetArguments i_Arguments );
  ~VQMLSceneWidget() override;

  bool focusSupported() const { return true; }
  bool trackingSupported() const { return m_Arguments.Kind == EWindowKind3D; }
  uint poseIndex() const { return m_PoseIndex; }
  void setPoseIndex( uint i_Index );
  /// Of labelled or solved subjects alone; below 0: they follow `poseIndex`.
  int labellingPoseIndex() const { return m_LabellingPose; }
  void setLabellingPoseIndex( int i_Index );
  int solvingPoseIndex() const { return m_SolvingPose; }
  void setSolvingPoseIndex( int i_Index );
  /// The scene of a window of subjects; null in other windows.
  VHarrowSubjectScene* SubjectScene() const;

  /// The item of the loaded document; null until the document is ready, and when it failed.
  MoxelGraphics::VSceneFramebufferObject* SceneItem() const { return m_pSceneItem; }
  /// The cameras of a camera window, or the one camera that a 3D view shows beside the scene.
  MoxelGraphics::VCameraGrid& CameraGrid() { return *m_pCameraGrid; }
  /// The cameras that are selected, by URN.
  QStringList SelectedCameras() const;
  /// Whether the text was a command of this window kind whose condition held.
  bool ExecuteCommand( const std::string& i_rText );
  /// The path of a drag that can be dropped here: exactly one local file that ends in ".fbx", else empty.
  static QString DroppedMesh( const QMimeData* i_pMimeData );

  /// Of a camera window: each tile with "urn", "userId", "displayType", "sensorWidth", "sensorHeight", "zoom", "panX",
  /// "panY", "rect" of "x", "y", "width", "height", and "centroids", each of "index", "x", "y", "radius"; device pixels
  /// of the view from its top left. Empty in other windows.
  Q_INVOKABLE QVariantList cameraReport() const;

public slots:
  void OnViewSettingsToggled( bool i_bChecked );
  void OnCameraTypeChanged( int i_Index );
  void OnFocus();
  void OnResetZoomClicked();
  void OnPinCamerasToggled( bool i_bChecked );
  /// Masks or unmasks the selected cells of the selected camera.
  void OnMaskPaintClicked();
  void OnMaskEraseClicked();
  void OnMaskEraseAllClicked();
  /// The preference: whether Alt selects and the plain mouse navigates. False without a store.
  bool altToSelect() const;
  bool selectionHasBounds() const;
  bool selectionHasPose() const;
  void setTracking( MoxelGraphics::ETracking i_Tracking );
  MoxelGraphics::ETracking tracking() const;
  /// Repaints the scene: the widget's own repaint would show the last picture again.
  void update();

signals:
  void PoseIndexChanged();
  /// Other devices or mask cells are selected. Only in a camera window.
  void CameraSelectionChanged();

protected:
  void dragEnterEvent( QDragEnterEvent* io_pEvent ) override;
  void dropEvent( QDropEvent* io_pEvent ) override;

private:
  void PublishContext();
  void FindSceneItem();
  void StartCameraWindow();
  void ShowPoses();
  void OnActivityChanged();
  void PaintMask( std::uint8_t i_Value );
  bool ExecuteCameraCommand( const std::string& i_rText );
  bool Execute3DCommand( const std::string& i_rText );
  void ScaleManipulator( float i_Factor );

  VSceneWidgetArguments m_Arguments;
  std::shared_ptr< MoxelGraphics::VCameraGrid > m_pCameraGrid;
  std::unique_ptr< MoxelGraphics::VCameraGridSelection > m_pGridSelection; ///< of a camera window
  std::shared_ptr< ZEK::ICoreUserPreferencesLayout > m_pPreferences;       ///< null without a store
  QTimer m_UpdateTimer;
  QPointer< MoxelGraphics::VSceneFramebufferObject > m_pSceneItem;
  uint m_PoseIndex = 0;
  int m_LabellingPose = -1;
  int m_SolvingPose = -1;
  ZEK::VConnection m_ActivityConnection;
  std::shared_ptr< ZEK::IMultiCallback< void() > > m_pCameraSelection;
  ZEK::VConnection m_SelectionConnection;
};

} // namespace HarrowGraphics
