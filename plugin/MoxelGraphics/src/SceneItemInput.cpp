// The item's mouse and keys.

#include "VSynced.h"

#include <MoxelGraphics/VMoxelScene.h>

#include <CoreGraphics/VInteractionMapper.h>

#include <QtGui/QHoverEvent>
#include <QtGui/QKeyEvent>
#include <QtGui/QMouseEvent>
#include <QtGui/QWheelEvent>

namespace MoxelGraphics
{
namespace
{
/// Movements up to this many item pixels are a hand that shakes while it clicks.
constexpr double DragDistance = 3.0;

bool IsBandGesture( const QMouseEvent& i_rEvent )
{
  return CoreGraphics::IsInteraction( CoreGraphics::EInteractionBand, static_cast< int >( i_rEvent.buttons() ),
                                      static_cast< int >( i_rEvent.modifiers() ) );
}
} // namespace

void VSceneFramebufferObject::TakeModifiers( Qt::KeyboardModifiers i_Modifiers )
{
  const bool bShift = i_Modifiers.testFlag( Qt::ShiftModifier );
  const bool bControl = i_Modifiers.testFlag( Qt::ControlModifier );
  const int Colour = bShift && bControl ? 2 : bShift ? 1 : bControl ? 3 : 0;
  if ( Colour != m_PreselectColour )
  {
    m_PreselectColour = Colour;
    update();
  }
  constexpr ZEK::ESelectionEdit Edits[] = { ZEK::ESelectionEdit::Replace, ZEK::ESelectionEdit::Add,
                                            ZEK::ESelectionEdit::Remove, ZEK::ESelectionEdit::Toggle };
  // A click that waits for its pick keeps the modifiers that it was made with.
  if ( !IsPickPending() )
  {
    m_Edit = Edits[m_PreselectColour];
  }
}

void VSceneFramebufferObject::mousePressEvent( QMouseEvent* i_pEvent )
{
  forceActiveFocus( Qt::MouseFocusReason );
  m_Pointer = m_PressPoint = i_pEvent->position();
  m_PickMode = EPickNone;
  TakeModifiers( i_pEvent->modifiers() );
  if ( IsBandGesture( *i_pEvent ) )
  {
    m_PickMode = EPickBand;
    m_BandStart = m_Pointer;
    m_bClickPending = false;
  }
  else
  {
    m_bClickPending = i_pEvent->button() == Qt::LeftButton;
    if ( !m_Options.CameraView )
    {
      const std::lock_guard Lock( *m_pCameraGuard );
      m_pController->OnMousePress( *i_pEvent, Ratio() );
    }
  }
  i_pEvent->accept();
  Refresh();
}

void VSceneFramebufferObject::mouseMoveEvent( QMouseEvent* i_pEvent )
{
  m_Pointer = i_pEvent->position();
  TakeModifiers( i_pEvent->modifiers() );
  const QPointF Way = m_Pointer - m_PressPoint;
  if ( std::hypot( Way.x(), Way.y() ) > DragDistance )
  {
    m_bClickPending = false;
  }
  if ( m_PickMode != EPickBand && !IsBandGesture( *i_pEvent ) )
  {
    m_PickMode = EPickNone;
    if ( !m_Options.CameraView )
    {
      const std::lock_guard Lock( *m_pCameraGuard );
      m_pController->OnMouseMove( *i_pEvent, Ratio() );
    }
  }
  i_pEvent->accept();
  emit MouseMoved();
  Refresh();
}

void VSceneFramebufferObject::mouseReleaseEvent( QMouseEvent* i_pEvent )
{
  m_Pointer = i_pEvent->position();
  TakeModifiers( i_pEvent->modifiers() );
  if ( m_PickMode == EPickBand || m_bClickPending )
  {
    m_CommitPoint = m_Pointer;
    m_PickMode = m_PickMode == EPickBand ? EPickBandDone : EPickClick;
  }
  m_bClickPending = false;
  if ( !m_Options.CameraView )
  {
    const std::lock_guard Lock( *m_pCameraGuard );
    m_pController->OnMouseRelease( *i_pEvent, Ratio() );
  }
  i_pEvent->accept();
  Refresh();
}

void VSceneFramebufferObject::mouseUngrabEvent()
{
  // Somebody took the mouse away in the middle of a gesture: nothing of it counts.
  m_bClickPending = false;
  if ( m_PickMode == EPickBand )
  {
    m_PickMode = EPickNone;
  }
  update();
}

void VSceneFramebufferObject::mouseDoubleClickEvent( QMouseEvent* i_pEvent )
{
  i_pEvent->accept();
  if ( m_pScene && !m_Options.CameraView )
  {
    SetPreviewCamera( m_pScene->GetSelectedCameraURN() );
  }
}

void VSceneFramebufferObject::wheelEvent( QWheelEvent* i_pEvent )
{
  if ( !m_Options.CameraView )
  {
    const std::lock_guard Lock( *m_pCameraGuard );
    m_pController->OnWheel( *i_pEvent );
  }
  i_pEvent->accept();
  Refresh();
}

void VSceneFramebufferObject::keyPressEvent( QKeyEvent* i_pEvent )
{
  bool bTaken = false;
  if ( !m_Options.CameraView )
  {
    const std::lock_guard Lock( *m_pCameraGuard );
    bTaken = m_pController->OnKeyPress( i_pEvent->key() );
  }
  TakeModifiers( i_pEvent->modifiers() );
  i_pEvent->setAccepted( bTaken );
  Refresh();
}

void VSceneFramebufferObject::keyReleaseEvent( QKeyEvent* i_pEvent )
{
  TakeModifiers( i_pEvent->modifiers() );
  i_pEvent->ignore();
  update();
}

void VSceneFramebufferObject::hoverEnterEvent( QHoverEvent* i_pEvent )
{
  hoverMoveEvent( i_pEvent );
}

void VSceneFramebufferObject::hoverMoveEvent( QHoverEvent* i_pEvent )
{
  TakeModifiers( i_pEvent->modifiers() );
  // Qt repeats the event after each frame; answering that with a frame would never end.
  if ( m_PickMode == EPickHover && m_Pointer == i_pEvent->position() )
  {
    return;
  }
  m_Pointer = i_pEvent->position();
  if ( !IsPickPending() )
  {
    m_PickMode = EPickHover;
  }
  emit MouseMoved();
  Refresh();
}

void VSceneFramebufferObject::hoverLeaveEvent( QHoverEvent* i_pEvent )
{
  TakeModifiers( i_pEvent->modifiers() );
  if ( !IsPickPending() )
  {
    m_PickMode = EPickNone;
  }
  // Nothing lies under a pointer that is gone. What somebody else preselected meanwhile stays.
  const auto pService = m_pScene ? m_pScene->SelectionService() : nullptr;
  if ( !pService || pService->Get( ZEK::ISelectionService::ESecondary ) == m_Preselection )
  {
    Preselect( {}, {} );
  }
  m_pSynced->bPreselected = false;
  update();
}

} // namespace MoxelGraphics
