#include <HarrowGraphics/VQMLSceneWidget.h>

#include <MoxelGraphics/VCameraGrid.h>
#include <MoxelGraphics/VCameraGridSelection.h>
#include <MoxelGraphics/VMoxelScene.h>
#include <ZEK/CoreUserPreferences.h>

#include <QtCore/QMimeData>
#include <QtGui/QDragEnterEvent>
#include <QtGui/QDropEvent>
#include <QtQuick/QQuickItem>

#include <algorithm>
#include <array>

// Resources of a static library are registered by a call from outside any namespace.
static void InitSceneDocuments()
{
  Q_INIT_RESOURCE( SceneDocuments );
}

namespace HarrowGraphics
{
namespace
{
using HarrowPluginInterface::EFeatureLiveSubjects;
using HarrowPluginInterface::EFeatureProps;
using HarrowPluginInterface::EFeatureSceneMeshes;
using HarrowPluginInterface::EFeatureSubjects;
using HarrowPluginInterface::EFeatureTrackingSubjects;
using MoxelGraphics::ETracking;

constexpr std::array Documents{ "qrc:/3DScene.qml", "qrc:/2DScene.qml", "qrc:/Subject2.qml" };
constexpr int UpdateMilliseconds = 16;
constexpr float ManipulatorStep = 1.25F;
constexpr float SmallestManipulator = 0.1F;
constexpr float LargestManipulator = 10.0F;
} // namespace

VQMLSceneWidget::VQMLSceneWidget( VSceneWidgetArguments i_Arguments )
  : VQuickWidget( i_Arguments.pQuickHost )
  , m_Arguments( std::move( i_Arguments ) )
  , m_pCameraGrid( ZEK::MakeShared< MoxelGraphics::VCameraGrid >( m_Arguments.Kind == EWindowKind3D ) )
{
  if ( m_Arguments.pStore )
  {
    m_pPreferences = std::make_shared< ZEK::ICoreUserPreferencesLayout >( m_Arguments.pStore );
  }
  m_pCameraGrid->SetAdditionalDataSource( m_Arguments.pCameraData, m_Arguments.pPostal );
  InitSceneDocuments();
  PublishContext();
  connect( this, &QQuickWidget::statusChanged, this, &VQMLSceneWidget::FindSceneItem );
  setResizeMode( SizeRootObjectToView );
  setFocusPolicy( Qt::StrongFocus );
  setMouseTracking( true );
  LoadDocument( QUrl( Documents.at( static_cast< std::size_t >( m_Arguments.Kind ) ) ) );

  m_UpdateTimer.setTimerType( Qt::PreciseTimer );
  connect( &m_UpdateTimer, &QTimer::timeout, this, &VQMLSceneWidget::update );
  m_UpdateTimer.start( UpdateMilliseconds );
  setAcceptDrops( true );

  if ( m_Arguments.Kind == EWindowKindCameras )
  {
    StartCameraWindow();
  }
}

VQMLSceneWidget::~VQMLSceneWidget()
{
  CloseDocument();
}

void VQMLSceneWidget::PublishContext()
{
  const std::uint32_t Flags = m_Arguments.FeatureFlags;
  const auto Has = [Flags]( std::uint32_t i_Bits )
  {
    return ( Flags & i_Bits ) != 0;
  };
  SetContextObject( "contextFlowScene", m_Arguments.pScene.get() );
  SetContextObject( "contextCameraGrid", m_pCameraGrid.get() );
  SetContextProperty( "contextCameraType", 0 );
  SetContextProperty( "contextFocusSelection", false );
  SetContextProperty( "contextMissingMarkersEnabled", Has( EFeatureSubjects | EFeatureLiveSubjects ) );
  SetContextProperty( "contextReconstructionVolumeEnabled", m_Arguments.bVolumeManipulator );
  SetContextProperty( "contextSceneMeshEnabled", Has( EFeatureSceneMeshes ) );
  SetContextProperty( "contextSubjectCalibrationEnabled", Has( EFeatureSubjects ) );
  SetContextProperty( "contextSubjectNoun", Has( EFeatureTrackingSubjects | EFeatureSubjects | EFeatureLiveSubjects )
                                                ? "Subject"
                                                : "Object" );
  SetContextProperty( "contextRigidObjectNoun", Has( EFeatureProps ) ? "Prop" : "Object" );
  setTracking( ETracking::ETrackNone );
  SetContextProperty( "contextViewSettingsEnabled", false );
  SetContextProperty( "contextShowCalibrationFeedbackEnabled", Has( EFeatureSubjects ) );
  SetContextProperty( "contextThemeWindow",
                      QuickHost()->ThemeColour( HarrowPluginInterface::IHarrowQuickHost::EThemeWindow ) );
}

void VQMLSceneWidget::FindSceneItem()
{
  QQuickItem* const pRoot = rootObject();
  m_pSceneItem = pRoot ? pRoot->findChild< MoxelGraphics::VSceneFramebufferObject* >( "sceneFBO" ) : nullptr;
}

void VQMLSceneWidget::update()
{
  if ( QQuickItem* const pRoot = rootObject() )
  {
    for ( auto* const pItem : pRoot->findChildren< MoxelGraphics::VSceneFramebufferObject* >() )
    {
      pItem->update();
    }
  }
  QQuickWidget::update();
}

void VQMLSceneWidget::OnViewSettingsToggled( bool i_bChecked )
{
  SetContextProperty( "contextViewSettingsEnabled", i_bChecked );
}

void VQMLSceneWidget::OnCameraTypeChanged( int i_Index )
{
  SetContextProperty( "contextCameraType", i_Index );
}

void VQMLSceneWidget::OnFocus()
{
  SetContextProperty( "contextFocusSelection", true );
}

bool VQMLSceneWidget::altToSelect() const
{
  bool bAltSelects = false;
  if ( m_pPreferences )
  {
    (void)m_pPreferences->AltToSelect().Read( bAltSelects );
  }
  return bAltSelects;
}

bool VQMLSceneWidget::selectionHasBounds() const
{
  return !m_Arguments.pScene->GetSelectionPositions( m_Arguments.pSelection->Get( ZEK::ISelectionService::EPrimary ) )
              .empty();
}

bool VQMLSceneWidget::selectionHasPose() const
{
  MoxelGraphics::VScenePose Pose;
  return m_Arguments.pScene->GetSelectionPose( m_Arguments.pSelection->Get( ZEK::ISelectionService::EPrimary ), Pose );
}

void VQMLSceneWidget::setTracking( ETracking i_Tracking )
{
  SetContextProperty( "contextTracking", QVariant::fromValue( i_Tracking ) );
}

ETracking VQMLSceneWidget::tracking() const
{
  return ContextProperty( "contextTracking" ).value< ETracking >();
}

void VQMLSceneWidget::ScaleManipulator( float i_Factor )
{
  if ( m_pSceneItem )
  {
    const float Scale = m_pSceneItem->Options().ManipulatorScale * i_Factor;
    m_pSceneItem->setOption( "ManipulatorScale", std::clamp( Scale, SmallestManipulator, LargestManipulator ) );
  }
}

bool VQMLSceneWidget::ExecuteCommand( const std::string& i_rText )
{
  const bool b3D = m_Arguments.Kind == EWindowKind3D;
  if ( i_rText == "Workspace3d:FrameSelected" && m_Arguments.Kind != EWindowKindCameras )
  {
    if ( !selectionHasBounds() || tracking() == ETracking::ELockCurrent )
    {
      return false;
    }
    OnFocus();
    return true;
  }
  if ( m_Arguments.Kind == EWindowKindCameras )
  {
    return ExecuteCameraCommand( i_rText );
  }
  return b3D && Execute3DCommand( i_rText );
}

bool VQMLSceneWidget::Execute3DCommand( const std::string& i_rText )
{
  const auto Track = [this]( ETracking i_Tracking, bool i_bCondition )
  {
    if ( i_bCondition )
    {
      // Chosen once more, it is about what is selected now.
      setTracking( ETracking::ETrackNone );
      setTracking( i_Tracking );
    }
    return i_bCondition;
  };
  if ( i_rText == "Workspace3d:TrackSelection" )
  {
    return Track( ETracking::ETrackSelection, true );
  }
  if ( i_rText == "Workspace3d:TrackObjects" )
  {
    return Track( ETracking::ETrackCurrent, selectionHasBounds() );
  }
  if ( i_rText == "Workspace3d:NoTracking" )
  {
    return Track( ETracking::ETrackNone, true );
  }
  if ( i_rText == "Workspace3d:TrackingLock" )
  {
    return Track( ETracking::ELockCurrent, selectionHasPose() );
  }
  if ( i_rText == "Workspace3d:ScaleUpManipulator" || i_rText == "Workspace3d:ScaleDownManipulator" )
  {
    ScaleManipulator( i_rText.ends_with( "UpManipulator" ) ? ManipulatorStep : 1 / ManipulatorStep );
    return true;
  }
  if ( i_rText == "Workspace3d:ToggleSelectedMarkerCount" )
  {
    if ( m_pSceneItem )
    {
      m_pSceneItem->setOption( "SelectedReconCount", !m_pSceneItem->Options().SelectedReconCount );
    }
    return true;
  }
  return false;
}

QString VQMLSceneWidget::DroppedMesh( const QMimeData* i_pMimeData )
{
  const QList< QUrl > Urls = i_pMimeData ? i_pMimeData->urls() : QList< QUrl >();
  if ( Urls.size() != 1 || !Urls.front().isLocalFile() )
  {
    return {};
  }
  const QString Path = Urls.front().toLocalFile();
  return Path.endsWith( ".fbx", Qt::CaseInsensitive ) ? Path : QString();
}

void VQMLSceneWidget::dragEnterEvent( QDragEnterEvent* io_pEvent )
{
  const QString Path = DroppedMesh( io_pEvent->mimeData() );
  const auto& rpService = m_Arguments.pWidgetService;
  if ( !Path.isEmpty() && rpService && rpService->CanImportSceneMesh( Path.toStdString() ) )
  {
    io_pEvent->acceptProposedAction();
    return;
  }
  io_pEvent->ignore();
}

void VQMLSceneWidget::dropEvent( QDropEvent* io_pEvent )
{
  const QString Path = DroppedMesh( io_pEvent->mimeData() );
  if ( !Path.isEmpty() && m_Arguments.pWidgetService )
  {
    m_Arguments.pWidgetService->ImportSceneMesh( Path.toStdString() );
    io_pEvent->acceptProposedAction();
  }
}

} // namespace HarrowGraphics
