// The item's side of the meeting with its renderer, and what a pick does afterwards.

#include "VSynced.h"

#include <MoxelGraphics/VMoxelScene.h>

#include <QtQuick/QQuickWindow>

#include <cmath>

namespace MoxelGraphics
{
namespace
{
constexpr std::size_t ToolTipLines = 20;

bool IsDevice( const ZEK::VSelectionItem& i_rItem )
{
  return i_rItem.Kind == ZEK::ESelectDevice;
}

QPoint DevicePoint( const QPointF& i_rPoint, double i_Ratio )
{
  return { static_cast< int >( std::round( i_rPoint.x() * i_Ratio ) ),
           static_cast< int >( std::round( i_rPoint.y() * i_Ratio ) ) };
}

QString ToolTip( const std::vector< std::string >& i_rLabels )
{
  QStringList Lines;
  for ( const std::string& rLabel : i_rLabels )
  {
    Lines.append( static_cast< std::size_t >( Lines.size() ) < ToolTipLines
                      ? QString::fromStdString( rLabel ).toHtmlEscaped()
                      : QStringLiteral( "…" ) );
    if ( static_cast< std::size_t >( Lines.size() ) > ToolTipLines )
    {
      break;
    }
  }
  return Lines.join( QStringLiteral( "<br>" ) );
}
} // namespace

double VSceneFramebufferObject::Ratio() const
{
  return window() ? window()->effectiveDevicePixelRatio() : 1.0;
}

void VSceneFramebufferObject::Post( std::function< void() > i_Function )
{
  QMetaObject::invokeMethod( this, std::move( i_Function ), Qt::QueuedConnection );
}

void VSceneFramebufferObject::Refresh()
{
  m_bFollowUp = true;
  update();
}

void VSceneFramebufferObject::PassGestures()
{
  for ( const VGesture& rGesture : m_pSynced->Gestures )
  {
    Perform( rGesture, *m_pController );
  }
  m_pSynced->Gestures.clear();
}

void VSceneFramebufferObject::BeginFrames()
{
  m_pSynced->Serial = 0;
  // What the former renderer did not come to do.
  m_bFocusPending = m_bFocusPending || m_pSynced->bFitUnderWay;
}

void VSceneFramebufferObject::CollectOverlay( const VSceneFrame& i_rFrame )
{
  // Before the first frame there is no camera that anything could be seen with.
  const bool bDrawn = i_rFrame.Figures().Frames > 0;
  if ( bDrawn && m_pSynced->Overlay.Collect( *m_pScene, m_pController->Fields(), size() ) &&
       !std::exchange( m_pSynced->bOverlayPosted, true ) )
  {
    Post(
        [this]
        {
          ApplyOverlay();
        } );
  }
}

void VSceneFramebufferObject::ApplyOverlay()
{
  m_pSynced->bOverlayPosted = false;
  if ( UpdateCameraObjects( m_CameraObjects, m_pSynced->Overlay.Cameras(), *this ) )
  {
    emit CamerasChanged();
  }
  if ( UpdateSubjectObjects( m_SubjectObjects, m_pSynced->SubjectKeys, m_pSynced->Overlay.Subjects(), *this ) )
  {
    emit SubjectsChanged();
  }
  SetShowCameraNumbers( m_bWantsCameraNumbers );
}

void VSceneFramebufferObject::Exchange( VSceneFrame& io_rFrame )
{
  m_pSynced->Camera = m_pController->Fields();
  CollectOverlay( io_rFrame );
  PassGestures();
  TakeResult( io_rFrame );
  ExchangeTiles( io_rFrame );
  GiveOrders( io_rFrame );
  *m_pHandCamera = *m_pController;
  if ( m_pManipulatorSource )
  {
    m_Manipulators = m_pManipulatorSource->Manipulators();
  }
  m_pSynced->Figures = io_rFrame.Figures();
  m_pSynced->Gl = io_rFrame.Gl();
  if ( m_pSynced->Notice != io_rFrame.Notice() )
  {
    m_pSynced->Notice = io_rFrame.Notice();
    Post(
        [this, Notice = m_pSynced->Notice]
        {
          Change( m_Notice, Notice, &VSceneFramebufferObject::NoticeChanged );
        } );
  }
}

void VSceneFramebufferObject::TakeResult( const VSceneFrame& i_rFrame )
{
  const VPickResult& rResult = i_rFrame.Result();
  if ( rResult.Mode < 0 || rResult.Serial == m_pSynced->Serial )
  {
    // A view that cannot draw answers no pick; asking on would keep it busy for ever.
    constexpr int Patience = 3;
    if ( IsPickPending() && ++m_pSynced->Unanswered > Patience )
    {
      m_PickMode = EPickNone;
    }
    return;
  }
  m_pSynced->Unanswered = 0;
  m_pSynced->Serial = rResult.Serial;
  const bool bCommit = rResult.Mode == EPickClick || rResult.Mode == EPickBandDone;
  const bool bSame = !bCommit && m_pSynced->bPreselected && rResult.Selection == m_pSynced->Selection &&
                     rResult.Labels == m_pSynced->Labels;
  if ( bSame )
  {
    return;
  }
  if ( bCommit && m_PickMode == rResult.Mode )
  {
    m_PickMode = EPickNone;
  }
  m_pSynced->Selection = rResult.Selection;
  m_pSynced->Labels = rResult.Labels;
  m_pSynced->bPreselected = !bCommit;
  Post(
      [this, Result = rResult]
      {
        ApplyPick( Result );
      } );
}

void VSceneFramebufferObject::GiveOrders( VSceneFrame& io_rFrame )
{
  VFrameInput& rInput = io_rFrame.Input();
  const double DeviceRatio = Ratio();
  const bool bCommits = IsPickPending();
  rInput.bVisible = isVisible();
  rInput.bReporting = m_bReporting;
  rInput.Options = m_Options;
  rInput.Pointer = DevicePoint( bCommits ? m_CommitPoint : m_Pointer, DeviceRatio );
  rInput.BandStart = DevicePoint( m_BandStart, DeviceRatio );
  rInput.PickMode = m_PickMode;
  rInput.Edit = m_Edit;
  rInput.PreselectColour = m_PreselectColour;
  rInput.PixelRatio = static_cast< float >( DeviceRatio );
  FollowTracking();
  m_pSynced->bFitUnderWay = rInput.bFit || m_bFocusPending;
  if ( m_bFocusPending )
  {
    m_bFocusPending = false;
    m_TrackedSelection = m_pScene->GetSelection();
    rInput.bFit = true;
    Post(
        [this]
        {
          emit TrackSelectionChanged();
        } );
  }
  rInput.Tracking = m_Tracking;
  rInput.TrackedSelection = m_TrackedSelection;
  // What this frame picks is fetched by the next one.
  if ( m_PickMode != EPickNone && ( m_bFollowUp || bCommits ) )
  {
    Post(
        [this]
        {
          update();
        } );
  }
  m_bFollowUp = false;
}

void VSceneFramebufferObject::FollowTracking()
{
  ETracking& rFormer = m_pSynced->Tracking;
  if ( m_Tracking == rFormer )
  {
    return;
  }
  if ( rFormer == ELockCurrent || m_Tracking == ELockCurrent )
  {
    m_pController->Reset( m_Tracking == ELockCurrent );
  }
  rFormer = m_Tracking;
}

void VSceneFramebufferObject::ApplyPick( const VPickResult& i_rResult )
{
  const auto pService = m_pScene ? m_pScene->SelectionService() : nullptr;
  if ( i_rResult.Mode == EPickHover || i_rResult.Mode == EPickBand )
  {
    // The pointer may have left, or a drag begun, since that frame.
    if ( m_PickMode != EPickNone )
    {
      Preselect( i_rResult.Selection, i_rResult.Labels );
    }
    return;
  }
  Preselect( {}, {} );
  m_Picked = i_rResult.Selection;
  m_PickedLabels = i_rResult.Labels;
  if ( pService )
  {
    const ZEK::VSelection Former = pService->Get( ZEK::ISelectionService::EPrimary );
    ZEK::VSelection Selection = ZEK::EditSelection( Former, i_rResult.Selection, i_rResult.Edit );
    // The selected cameras are those that a camera view shows: what is picked in their images leaves them selected.
    if ( m_Options.CameraView && !std::any_of( i_rResult.Selection.begin(), i_rResult.Selection.end(), IsDevice ) )
    {
      std::erase_if( Selection, IsDevice );
      std::copy_if( Former.begin(), Former.end(), std::inserter( Selection, Selection.begin() ), IsDevice );
    }
    pService->Set( ZEK::ISelectionService::EPrimary, std::move( Selection ) );
  }
  const bool bPreview = std::exchange( m_bPreviewPicked, false );
  if ( const QString URN = bPreview && m_pScene ? m_pScene->GetSelectedCameraURN() : QString(); !URN.isEmpty() )
  {
    SetPreviewCamera( URN );
  }
  emit SelectionChanged();
  update();
}

void VSceneFramebufferObject::Preselect( const ZEK::VSelection& i_rSelection,
                                         const std::vector< std::string >& i_rLabels )
{
  m_PreselectionLabels = i_rLabels;
  const bool bChanged = m_Preselection != i_rSelection;
  m_Preselection = i_rSelection;
  Change( m_ToolTipText, ToolTip( i_rLabels ), &VSceneFramebufferObject::ToolTipTextChanged );
  if ( bChanged )
  {
    if ( m_pScene && m_pScene->SelectionService() )
    {
      m_pScene->SelectionService()->Set( ZEK::ISelectionService::ESecondary, i_rSelection );
    }
    update();
  }
}

} // namespace MoxelGraphics
