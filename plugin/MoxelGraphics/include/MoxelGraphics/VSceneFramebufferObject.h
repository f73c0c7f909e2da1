#pragma once

#include <MoxelGraphics/ETracking.h>
#include <MoxelGraphics/IManipulator.h>
#include <MoxelGraphics/VCameraTile.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <ZEK/Selection.h>

#include <QtCore/QList>
#include <QtCore/QPointF>
#include <QtCore/QPointer>
#include <QtCore/QVariantMap>
#include <QtQml/QQmlPropertyMap>
#include <QtQuick/QQuickFramebufferObject>

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace CoreGraphics
{
class VCameraController;
}

namespace MoxelGraphics
{
class VCameraGrid;
class VMoxelScene;
class VSceneFrame;
struct VGesture;
struct VPickResult;

/// The QML item that shows one view of a scene and takes its input. Registered in QML as `SceneFramebufferObject`.
///
/// It is redrawn by its own `update()`; a timer must call that, updating the window alone redraws nothing.
/// Thread: GUI thread; renderer and item meet in `synchronize` alone, and what the renderer found is announced by
/// signals of a later turn.
class VSceneFramebufferObject : public QQuickFramebufferObject
{
  Q_OBJECT
  Q_PROPERTY( QObject* scene READ Scene WRITE SetScene )
  Q_PROPERTY( QObject* cameraGrid READ CameraGrid WRITE SetCameraGrid )
  Q_PROPERTY( QObject* sceneOptions READ SceneOptionsObject NOTIFY SceneOptionsChanged )
  Q_PROPERTY( QString previewCamera READ PreviewCamera WRITE SetPreviewCamera NOTIFY PreviewCameraChanged )
  Q_PROPERTY( int cameraType READ CameraType WRITE SetCameraType )
  Q_PROPERTY( QString toolTipText READ ToolTipText NOTIFY ToolTipTextChanged )
  Q_PROPERTY( QPoint mousePos READ MousePos NOTIFY MouseMoved )
  Q_PROPERTY( bool showCameraNumbers READ ShowCameraNumbers WRITE SetShowCameraNumbers NOTIFY ShowCameraNumbersChanged )
  Q_PROPERTY( QList< QObject* > cameraObjects READ CameraObjects NOTIFY CamerasChanged )
  Q_PROPERTY( QList< QObject* > subjectObjects READ SubjectObjects NOTIFY SubjectsChanged )
  Q_PROPERTY( bool focusSelection READ FocusSelection WRITE SetFocusSelection )
  Q_PROPERTY( MoxelGraphics::ETracking tracking READ Tracking WRITE SetTracking )
  Q_PROPERTY( QString notice READ Notice NOTIFY NoticeChanged )

public:
  explicit VSceneFramebufferObject( QQuickItem* i_pParent = nullptr );
  ~VSceneFramebufferObject() override;

  Renderer* createRenderer() const override;

  QObject* Scene() const;
  /// A `VMoxelScene` held by shared pointer, or null. Anything else is refused.
  void SetScene( QObject* i_pScene );
  QObject* CameraGrid() const;
  /// A `VCameraGrid`, or null in a free view; anything else is refused. The item gives it the scene's cameras, its own
  /// size and the settings that concern it; with the option `CameraView` on it draws the grid's tiles, and the mouse
  /// and the keys are the grid's.
  void SetCameraGrid( QObject* i_pGrid );
  QObject* SceneOptionsObject() const { return m_pOptionsMap; }
  QQmlPropertyMap& OptionsMap() const { return *m_pOptionsMap; }
  const VSceneOptions& Options() const { return m_Options; }
  QString PreviewCamera() const { return m_PreviewCamera; }
  void SetPreviewCamera( const QString& i_rURN );
  int CameraType() const;
  /// The view type of the camera controller: 0 "Perspective" to 6 "Bottom". Others are ignored.
  void SetCameraType( int i_Type );
  QString ToolTipText() const { return m_ToolTipText; }
  QPoint MousePos() const { return m_Pointer.toPoint(); }
  /// True when a document wants the numbers, and while a camera is selected or lies under the pointer.
  bool ShowCameraNumbers() const { return m_bShowCameraNumbers; }
  void SetShowCameraNumbers( bool i_bShow );
  /// `VCameraObject` and `VSubjectObject` of what the last frame showed. An object stays the same for as long as its
  /// camera or subject stays in the list.
  QList< QObject* > CameraObjects() const { return m_CameraObjects; }
  QList< QObject* > SubjectObjects() const { return m_SubjectObjects; }
  bool FocusSelection() const { return false; }
  /// Every true asks once for the selection to be framed; nothing is kept.
  void SetFocusSelection( bool i_bFocus );
  ETracking Tracking() const { return m_Tracking; }
  void SetTracking( ETracking i_Tracking );
  QString Notice() const { return m_Notice; }

  /// The camera as the hand last left it: that of the last frame, and what was done to it since.
  const CoreGraphics::VCameraController& Camera() const { return *m_pHandCamera; }
  /// What lies under the pointer or in the band, as of the last pick that was delivered.
  const ZEK::VSelection& Preselection() const { return m_Preselection; }
  const std::vector< std::string >& PreselectionLabels() const { return m_PreselectionLabels; }
  /// What the last click or band picked, whatever it then did to the selection; `SelectionChanged` announces it.
  const ZEK::VSelection& Picked() const { return m_Picked; }
  const std::vector< std::string >& PickedLabels() const { return m_PickedLabels; }
  /// True while a click or a band waits for its pick; a few frames end that.
  bool IsPickPending() const;

  /// Sets one option as a person would: the map, the record, bindings and the view follow.
  Q_INVOKABLE void setOption( const QString& i_rKey, const QVariant& i_rValue );
  /// Sets all options at once and announces `SceneOptionsChanged`.
  void SetOptions( const VSceneOptions& i_rOptions );
  /// Measures the stages of each frame with glFinish, which slows frames down. Off at first.
  Q_INVOKABLE void setReporting( bool i_bOn ) { m_bReporting = i_bOn; }
  /// Every frame asks for the next. For the next renderer that is made.
  void SetContinuousUpdate( bool i_bOn ) { m_bContinuous = i_bOn; }
  /// "camera", "timings", "draw_calls", "bytes_uploaded", "gl", "frames" of the frame that was drawn before the last
  /// one; "tiles" of a camera view: each with "urn", "rect" (x, y, width, height; item pixels, y down), "viewport" (the
  /// same; device pixels, y up), "view2d", "zoom" and "pan"; "labels" of the preselection, "picked_labels" of the last
  /// commit, "notice".
  Q_INVOKABLE QVariantMap frameReport() const;

public slots:
  void OnFocusChanged();
  void OnSceneOptionsMapChanged( const QString& i_rKey, const QVariant& i_rValue );

signals:
  void SceneOptionsChanged();
  void PreviewCameraChanged();
  void ToolTipTextChanged();
  void MouseMoved();
  void ShowCameraNumbersChanged();
  void CamerasChanged();
  void SubjectsChanged();
  /// Emitted when a pick was committed.
  void SelectionChanged();
  void TrackSelectionChanged();
  void NoticeChanged();

protected:
  void mousePressEvent( QMouseEvent* i_pEvent ) override;
  void mouseMoveEvent( QMouseEvent* i_pEvent ) override;
  void mouseReleaseEvent( QMouseEvent* i_pEvent ) override;
  void mouseUngrabEvent() override;
  void mouseDoubleClickEvent( QMouseEvent* i_pEvent ) override;
  void wheelEvent( QWheelEvent* i_pEvent ) override;
  void keyPressEvent( QKeyEvent* i_pEvent ) override;
  void keyReleaseEvent( QKeyEvent* i_pEvent ) override;
  void hoverEnterEvent( QHoverEvent* i_pEvent ) override;
  void hoverMoveEvent( QHoverEvent* i_pEvent ) override;
  void hoverLeaveEvent( QHoverEvent* i_pEvent ) override;

  bool event( QEvent* i_pEvent ) override;
  void itemChange( ItemChange i_Change, const ItemChangeData& i_rData ) override;
  void geometryChange( const QRectF& i_rNew, const QRectF& i_rOld ) override;
  QSGNode* updatePaintNode( QSGNode* i_pNode, UpdatePaintNodeData* i_pData ) override;

private:
  friend class VSceneFramebufferRenderer;
  struct VSynced;

  double Ratio() const;
  void FollowWindow( QQuickWindow* i_pWindow );
  QSGNode* MakeNode( QSGNode* i_pNode, UpdatePaintNodeData* i_pData );
  /// Does it to the camera that the hand sees, and keeps it for the one that draws. True when it meant something.
  bool Gesture( VGesture i_Gesture );
  void MouseGesture( int i_Kind, const QMouseEvent& i_rEvent );
  /// The grid that the mouse works on; null in a free view.
  VCameraGrid* Grid() const;
  void ResizeGrid();
  void PassGridOptions();
  /// The last thing before the renderer is met.
  void PrepareMeeting();
  QVariantList TilesReport() const;
  /// Each manipulator that is shown, in the order of asking, with its selection kind, until `i_Ask` says true.
  bool AskManipulators( const std::function< bool( IManipulator&, std::uint32_t ) >& i_Ask ) const;
  bool OfferPress( const QMouseEvent& i_rEvent );
  void SelectHandles( std::uint32_t i_Kind );
  void TakeModifiers( Qt::KeyboardModifiers i_Modifiers );
  /// Asks for a frame, and for a second one that brings what the first has picked.
  void Refresh();
  void Change( QString& io_rText, const QString& i_rText, void ( VSceneFramebufferObject::*i_pSignal )() );

  // Sync phase, on the render thread with the GUI thread held.
  void Exchange( VSceneFrame& io_rFrame );
  void BeginFrames();
  void PassGestures();
  void CollectOverlay( const VSceneFrame& i_rFrame );
  void ExchangeTiles( VSceneFrame& io_rFrame );
  void TakeResult( const VSceneFrame& i_rFrame );
  void GiveOrders( VSceneFrame& io_rFrame );
  void FollowTracking();
  void Post( std::function< void() > i_Function );

  /// GUI thread, a later turn: what a pick changes, and what documents draw over the view.
  void ApplyPick( const VPickResult& i_rResult );
  void ApplyOverlay();
  void Preselect( const ZEK::VSelection& i_rSelection, const std::vector< std::string >& i_rLabels );

  std::shared_ptr< VMoxelScene > m_pScene;
  QPointer< VCameraGrid > m_pCameraGrid;
  QMetaObject::Connection m_GridViews;
  double m_GridRatio = 0.0; ///< with which the grid was last sized
  VCameraTilesRef m_Tiles;  ///< of the grid, as the next frame draws them
  QMetaObject::Connection m_BeforeMeeting;
  IManipulatorSource* m_pManipulatorSource = nullptr; ///< the scene, when it is one
  VManipulators m_Manipulators;
  /// Draws, and is touched by this side only while the renderer is met.
  std::shared_ptr< CoreGraphics::VCameraController > m_pController;
  std::unique_ptr< CoreGraphics::VCameraController > m_pHandCamera;
  QQmlPropertyMap* m_pOptionsMap = nullptr;
  VSceneOptions m_Options;
  QString m_PreviewCamera;
  QString m_ToolTipText;
  QString m_Notice;
  QList< QObject* > m_CameraObjects;
  QList< QObject* > m_SubjectObjects;
  bool m_bWantsCameraNumbers = false;
  bool m_bShowCameraNumbers = false;
  bool m_bContinuous = false;
  bool m_bReporting = false;
  bool m_bApiRefused = false;

  QPointF m_Pointer; ///< item pixels, as the next
  QPointF m_PressPoint;
  QPointF m_CommitPoint; ///< where the button was let go: a pick that commits looks there, wherever the pointer is
  QPointF m_BandStart;
  int m_PickMode = EPickNone;
  int m_PreselectColour = 0;
  ZEK::ESelectionEdit m_Edit = ZEK::ESelectionEdit::Replace;
  bool m_bClickPending = false;
  bool m_bPreviewPicked = false; ///< the next commit says which camera is previewed
  bool m_bFollowUp = false;
  bool m_bFocusPending = false;
  ETracking m_Tracking = ETrackNone;
  ZEK::VSelection m_TrackedSelection;

  ZEK::VSelection m_Preselection;
  std::vector< std::string > m_PreselectionLabels;
  ZEK::VSelection m_Picked;
  std::vector< std::string > m_PickedLabels;
  std::unique_ptr< VSynced > m_pSynced;
};

} // namespace MoxelGraphics
