// The item's mouse and keys.

#include "VSynced.h"

#include <MoxelGraphics/VCameraGrid.h>
#include <MoxelGraphics/VMoxelScene.h>

#include <CoreGraphics/VCameraController.h>
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

bool VSceneFramebufferObject::Gesture( VGesture i_Gesture )
{
  const bool bMeans = Perform( i_Gesture, *m_pHandCamera );
  m_pSynced->Gestures.push_back( std::move( i_Gesture ) );
  return bMeans;
}

void VSceneFramebufferObject::MouseGesture( int i_Kind, const QMouseEvent& i_rEvent )
{
  if ( !m_Options.CameraView )
  {
    Gesture( { static_cast< VGesture::EKind >( i_Kind ), 0, Ratio(), std::unique_ptr< QEvent >( i_rEvent.clone() ) } );
  }
  else if ( VCameraGrid* const pGrid = Grid() )
  {
    i_Kind == VGesture::EPress  ? static_cast< void >( pGrid->MousePress( i_rEvent, Ratio() ) )
    : i_Kind == VGesture::EMove ? static_cast< void >( pGrid->MouseMove( i_rEvent, Ratio() ) )
                                : pGrid->MouseRelease( i_rEvent );
  }
}

bool VSceneFramebufferObject::AskManipulators(
    const std::function< bool( IManipulator&, std::uint32_t ) >& i_Ask ) const
{
  const auto Ask = [&]( const std::shared_ptr< IManipulator >& i_rpManipulator, std::uint32_t i_Kind )
  {
    return i_rpManipulator && i_rpManipulator->IsShown() && i_Ask( *i_rpManipulator, i_Kind );
  };
  return Ask( m_Manipulators.pObject, ZEK::ESelectObjectManipulator ) ||
         Ask( m_Manipulators.pVolume, ZEK::ESelectVolumeManipulator ) ||
         Ask( m_Manipulators.pHotspot, ZEK::ESelectVolumeManipulator );
}

void VSceneFramebufferObject::SelectHandles( std::uint32_t i_Kind )
{
  const auto pService = m_pScene ? m_pScene->SelectionService() : nullptr;
  if ( !pService )
  {
    return;
  }
  // What the handles act on stays selected.
  ZEK::VSelection Selection = pService->Get( ZEK::ISelectionService::EPrimary );
  std::erase_if( Selection,
                 [&]( const ZEK::VSelectionItem& i_rItem )
                 {
                   return i_rItem.Kind == i_Kind;
                 } );
  ZEK::VSelection Handles;
  pService->Get( ZEK::ISelectionService::ESecondary, { i_Kind }, Handles );
  Selection.insert( Selection.end(), Handles.begin(), Handles.end() );
  pService->Set( ZEK::ISelectionService::EPrimary, std::move( Selection ) );
}

bool VSceneFramebufferObject::OfferPress( const QMouseEvent& i_rEvent )
{
  return AskManipulators(
      [&]( IManipulator& io_rManipulator, std::uint32_t i_Kind )
      {
        const bool bTakes = io_rManipulator.TakesPress( i_rEvent, *m_pHandCamera, Ratio() );
        if ( bTakes )
        {
          SelectHandles( i_Kind );
          io_rManipulator.Press( i_rEvent, *m_pHandCamera, Ratio() );
        }
        return bTakes;
      } );
}

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
  m_bClickPending = false;
  TakeModifiers( i_pEvent->modifiers() );
  if ( OfferPress( *i_pEvent ) )
  {
    // It is the manipulator's until the button is let go.
  }
  else if ( IsBandGesture( *i_pEvent ) )
  {
    m_PickMode = EPickBand;
    m_BandStart = m_Pointer;
  }
  else
  {
    m_bClickPending = i_pEvent->button() == Qt::LeftButton;
    MouseGesture( VGesture::EPress, *i_pEvent );
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
  const bool bTaken = AskManipulators(
      [&]( IManipulator& io_rManipulator, std::uint32_t )
      {
        return io_rManipulator.Move( *i_pEvent, *m_pHandCamera, Ratio() );
      } );
  if ( !bTaken && m_PickMode != EPickBand && !IsBandGesture( *i_pEvent ) )
  {
    m_PickMode = EPickNone;
    MouseGesture( VGesture::EMove, *i_pEvent );
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
  const bool bTaken = AskManipulators(
      [&]( IManipulator& io_rManipulator, std::uint32_t )
      {
        return io_rManipulator.Release( *i_pEvent, *m_pHandCamera, Ratio() );
      } );
  if ( !bTaken )
  {
    MouseGesture( VGesture::ERelease, *i_pEvent );
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
  AskManipulators(
      []( IManipulator& io_rManipulator, std::uint32_t )
      {
        if ( io_rManipulator.IsGrabbed() )
        {
          io_rManipulator.LetGo();
        }
        return false;
      } );
  if ( m_pCameraGrid )
  {
    m_pCameraGrid->EndGesture();
  }
  // A camera that went on with its gesture would jump at the next press.
  const CoreGraphics::VCameraFields& rCamera = m_pHandCamera->Fields();
  if ( rCamera.panning || rCamera.orbiting || rCamera.zooming )
  {
    MouseGesture( VGesture::ERelease, QMouseEvent( QEvent::MouseButtonRelease, m_Pointer, mapToGlobal( m_Pointer ),
                                                   Qt::NoButton, Qt::NoButton, Qt::NoModifier ) );
  }
  update();
}

void VSceneFramebufferObject::mouseDoubleClickEvent( QMouseEvent* i_pEvent )
{
  i_pEvent->accept();
  if ( m_pScene && !m_Options.CameraView )
  {
    SetPreviewCamera( m_pScene->GetSelectedCameraURN() );
    // The first of the two clicks may still wait for its pick.
    m_bPreviewPicked = true;
  }
  else if ( VCameraGrid* const pGrid = Grid() )
  {
    pGrid->DoubleClick( *i_pEvent, Ratio() );
    Refresh();
  }
}

void VSceneFramebufferObject::wheelEvent( QWheelEvent* i_pEvent )
{
  if ( !m_Options.CameraView )
  {
    Gesture( { VGesture::EWheel, 0, Ratio(), std::unique_ptr< QEvent >( i_pEvent->clone() ) } );
  }
  else if ( VCameraGrid* const pGrid = Grid() )
  {
    pGrid->Wheel( *i_pEvent, Ratio() );
  }
  i_pEvent->accept();
  Refresh();
}

void VSceneFramebufferObject::keyPressEvent( QKeyEvent* i_pEvent )
{
  VCameraGrid* const pGrid = Grid();
  const bool bTaken = m_Options.CameraView ? pGrid && pGrid->KeyPress( *i_pEvent )
                                           : Gesture( { VGesture::EKey, i_pEvent->key(), Ratio(), nullptr } );
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
  const bool bGrabbed = AskManipulators(
      []( IManipulator& io_rManipulator, std::uint32_t )
      {
        return io_rManipulator.IsGrabbed();
      } );
  if ( bGrabbed )
  {
    return;
  }
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
