#include <MoxelGraphics/VSceneFramebufferObject.h>

#include "HandOver.h"
#include "Log.h"
#include "VSceneFramebufferRenderer.h"
#include "VSynced.h"

#include <MoxelGraphics/VCameraGrid.h>
#include <MoxelGraphics/VMoxelScene.h>

#include <CoreGraphics/VCameraController.h>

#include <cmath>

namespace MoxelGraphics
{
namespace
{
QVariantList Numbers( const QVector3D& i_rVector )
{
  return { i_rVector.x(), i_rVector.y(), i_rVector.z() };
}

QVariantList Numbers( const QMatrix4x4& i_rMatrix )
{
  QVariantList List;
  for ( int Row = 0; Row < 4; ++Row )
  {
    for ( int Column = 0; Column < 4; ++Column )
    {
      List.append( i_rMatrix( Row, Column ) );
    }
  }
  return List;
}

QVariantMap CameraReport( const CoreGraphics::VCameraFields& i_rFields )
{
  return { { "projection", Numbers( i_rFields.projection ) },
           { "view", Numbers( i_rFields.view ) },
           { "lockPose", Numbers( i_rFields.lockPose ) },
           { "nearPlane", i_rFields.nearPlane },
           { "farPlane", i_rFields.farPlane },
           { "fieldOfView", i_rFields.fieldOfView },
           { "tilt", i_rFields.tilt },
           { "azimuth", i_rFields.azimuth },
           { "distance", i_rFields.distance },
           { "orthoScale", i_rFields.orthoScale },
           { "centre", Numbers( i_rFields.centre ) },
           { "viewportSize", QVariantList{ i_rFields.viewportSize.width(), i_rFields.viewportSize.height() } },
           { "lastPosition", QVariantList{ i_rFields.lastPosition.x(), i_rFields.lastPosition.y() } },
           { "panning", i_rFields.panning },
           { "orbiting", i_rFields.orbiting },
           { "zooming", i_rFields.zooming },
           { "yUp", i_rFields.yUp },
           { "viewType", QString::fromLatin1( CoreGraphics::ViewTypeName( i_rFields.viewType ) ) } };
}

QStringList Texts( const std::vector< std::string >& i_rTexts )
{
  QStringList List;
  for ( const std::string& rText : i_rTexts )
  {
    List.append( QString::fromStdString( rText ) );
  }
  return List;
}
} // namespace

VSceneFramebufferObject::VSceneFramebufferObject( QQuickItem* i_pParent )
  : QQuickFramebufferObject( i_pParent )
  , m_pController( std::make_shared< CoreGraphics::VCameraController >() )
  , m_pHandCamera( std::make_unique< CoreGraphics::VCameraController >() )
  , m_pOptionsMap( new QQmlPropertyMap( this ) )
  , m_pSynced( std::make_unique< VSynced >() )
{
  // Rows of the target run from the bottom, those of the item from the top.
  setMirrorVertically( true );
  setAcceptedMouseButtons( Qt::AllButtons );
  setAcceptHoverEvents( true );
  setFlag( ItemAcceptsInputMethod, false );
  WriteSceneOptions( m_Options, *m_pOptionsMap );
  connect( m_pOptionsMap, &QQmlPropertyMap::valueChanged, this, &VSceneFramebufferObject::OnSceneOptionsMapChanged );
  FollowWindow( window() );
}

VSceneFramebufferObject::~VSceneFramebufferObject() = default;

void VSceneFramebufferObject::FollowWindow( QQuickWindow* i_pWindow )
{
  // The last thing that the GUI thread does before it is held for the renderers of a window.
  disconnect( m_BeforeMeeting );
  m_BeforeMeeting = i_pWindow ? connect(
                                    i_pWindow, &QQuickWindow::afterAnimating, this,
                                    [this]
                                    {
                                      PrepareMeeting();
                                    },
                                    Qt::DirectConnection )
                              : QMetaObject::Connection();
}

void VSceneFramebufferObject::itemChange( ItemChange i_Change, const ItemChangeData& i_rData )
{
  if ( i_Change == ItemSceneChange )
  {
    FollowWindow( i_rData.window );
  }
  if ( i_Change == ItemSceneChange || i_Change == ItemDevicePixelRatioHasChanged )
  {
    ResizeGrid();
  }
  QQuickFramebufferObject::itemChange( i_Change, i_rData );
}

bool VSceneFramebufferObject::event( QEvent* i_pEvent )
{
  // An event may end the item; the place is then no more than a number.
  const void* const pPlace = this;
  TakeOver( pPlace );
  const bool bTaken = QQuickFramebufferObject::event( i_pEvent );
  HandOver( pPlace );
  return bTaken;
}

QQuickFramebufferObject::Renderer* VSceneFramebufferObject::createRenderer() const
{
  return new VSceneFramebufferRenderer( m_bContinuous );
}

bool VSceneFramebufferObject::IsPickPending() const
{
  TakeOver( this );
  return m_PickMode == EPickClick || m_PickMode == EPickBandDone;
}

QSGNode* VSceneFramebufferObject::updatePaintNode( QSGNode* i_pNode, UpdatePaintNodeData* i_pData )
{
  TakeOver( this );
  QSGNode* const pNode = MakeNode( i_pNode, i_pData );
  HandOver( this );
  return pNode;
}

QSGNode* VSceneFramebufferObject::MakeNode( QSGNode* i_pNode, UpdatePaintNodeData* i_pData )
{
  const auto Api = window()->rendererInterface()->graphicsApi();
  if ( Api == QSGRendererInterface::OpenGL )
  {
    return QQuickFramebufferObject::updatePaintNode( i_pNode, i_pData );
  }
  if ( !m_bApiRefused )
  {
    m_bApiRefused = true;
    ZEK::Log( LogCategory(), ZEK::ELogFailure, "3D views need Qt Quick to draw with OpenGL; it draws with API %1%",
              static_cast< int >( Api ) );
    Post(
        [this]
        {
          Change( m_Notice, QStringLiteral( "3D views need Qt Quick to draw with OpenGL" ),
                  &VSceneFramebufferObject::NoticeChanged );
        } );
  }
  delete i_pNode;
  return nullptr;
}

QObject* VSceneFramebufferObject::Scene() const
{
  return m_pScene.get();
}

void VSceneFramebufferObject::SetScene( QObject* i_pScene )
{
  auto* pScene = qobject_cast< VMoxelScene* >( i_pScene );
  std::shared_ptr< VMoxelScene > pShared;
  if ( pScene )
  {
    pShared = std::static_pointer_cast< VMoxelScene >( pScene->weak_from_this().lock() );
  }
  if ( i_pScene && !pShared )
  {
    ZEK::Log( LogCategory(), ZEK::ELogFailure, "The scene of a view must be a VMoxelScene held by shared pointer" );
    return;
  }
  m_pScene = std::move( pShared );
  m_pManipulatorSource = dynamic_cast< IManipulatorSource* >( m_pScene.get() );
  m_Manipulators = {};
  m_pSynced->CameraGeneration = VSynced::NoGeneration;
  update();
}

void VSceneFramebufferObject::SetPreviewCamera( const QString& i_rURN )
{
  Change( m_PreviewCamera, i_rURN, &VSceneFramebufferObject::PreviewCameraChanged );
  if ( m_pCameraGrid && !i_rURN.isEmpty() )
  {
    m_pCameraGrid->SetShownCameras( { i_rURN } );
  }
  update();
}

int VSceneFramebufferObject::CameraType() const
{
  return m_pHandCamera->GetViewType();
}

void VSceneFramebufferObject::SetCameraType( int i_Type )
{
  Gesture( { VGesture::EViewType, i_Type, 1.0, nullptr } );
  update();
}

void VSceneFramebufferObject::SetShowCameraNumbers( bool i_bShow )
{
  m_bWantsCameraNumbers = i_bShow;
  const bool bShow = i_bShow || m_pSynced->Overlay.IsCameraHeld();
  if ( bShow != m_bShowCameraNumbers )
  {
    m_bShowCameraNumbers = bShow;
    emit ShowCameraNumbersChanged();
  }
}

void VSceneFramebufferObject::SetFocusSelection( bool i_bFocus )
{
  if ( i_bFocus )
  {
    OnFocusChanged();
  }
}

void VSceneFramebufferObject::OnFocusChanged()
{
  m_bFocusPending = true;
  update();
}

void VSceneFramebufferObject::SetTracking( ETracking i_Tracking )
{
  if ( i_Tracking == m_Tracking || i_Tracking < ETrackNone || i_Tracking > ELockCurrent )
  {
    return;
  }
  m_Tracking = i_Tracking;
  if ( m_pScene && ( i_Tracking == ETrackCurrent || i_Tracking == ELockCurrent ) )
  {
    m_TrackedSelection = m_pScene->GetSelection();
    emit TrackSelectionChanged();
  }
  update();
}

void VSceneFramebufferObject::Change( QString& io_rText, const QString& i_rText,
                                      void ( VSceneFramebufferObject::*i_pSignal )() )
{
  if ( io_rText != i_rText )
  {
    io_rText = i_rText;
    emit( this->*i_pSignal )();
  }
}

void VSceneFramebufferObject::setOption( const QString& i_rKey, const QVariant& i_rValue )
{
  m_pOptionsMap->insert( i_rKey, i_rValue );
  OnSceneOptionsMapChanged( i_rKey, i_rValue );
}

void VSceneFramebufferObject::SetOptions( const VSceneOptions& i_rOptions )
{
  const bool bOtherAxis = i_rOptions.YUp != m_Options.YUp;
  m_Options = i_rOptions;
  WriteSceneOptions( m_Options, *m_pOptionsMap );
  PassGridOptions();
  if ( m_pScene && bOtherAxis )
  {
    m_pScene->SetYUp( m_Options.YUp );
  }
  emit SceneOptionsChanged();
  update();
}

void VSceneFramebufferObject::OnSceneOptionsMapChanged( const QString& i_rKey, const QVariant& )
{
  TakeOver( this );
  ReadSceneOptions( *m_pOptionsMap, m_Options );
  PassGridOptions();
  if ( m_pScene && i_rKey == QLatin1String( "YUp" ) )
  {
    m_pScene->SetYUp( m_Options.YUp );
  }
  update();
}

QVariantMap VSceneFramebufferObject::frameReport() const
{
  TakeOver( this );
  const VFrameFigures& rFigures = m_pSynced->Figures;
  QVariantMap Report{ { "camera", CameraReport( m_pSynced->Camera ) },
                      { "timings", QVariantMap{ { "update_ms", rFigures.UpdateMs },
                                                { "select_ms", rFigures.SelectMs },
                                                { "highlight_ms", rFigures.HighlightMs },
                                                { "draw_ms", rFigures.DrawMs } } },
                      { "draw_calls", QVariant::fromValue( rFigures.DrawCalls ) },
                      { "bytes_uploaded", QVariant::fromValue( rFigures.BytesUploaded ) },
                      { "gl", m_pSynced->Gl },
                      { "frames", QVariant::fromValue( rFigures.Frames ) },
                      { "tiles", TilesReport() },
                      { "labels", Texts( m_PreselectionLabels ) },
                      { "picked_labels", Texts( m_PickedLabels ) },
                      { "notice", m_Notice } };
  HandOver( this );
  if ( m_pScene )
  {
    Report.insert( m_pScene->SceneReport() );
  }
  return Report;
}

} // namespace MoxelGraphics
