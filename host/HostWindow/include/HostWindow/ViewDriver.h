#pragma once

#include <HostWindow/SceneView.h>
#include <HostWindow/ViewAction.h>

#include <ZEK/Selection.h>

namespace HostWindow
{

/// Does to a view what a hand would do, by events that go the way of every other event, and lets the view draw the
/// frames that a pick and its commit need. Thread: GUI; runs the event loop.
class VViewDriver
{
public:
  VViewDriver( VSceneView i_View, std::shared_ptr< ZEK::ISelectionService > i_pSelection )
    : m_View( std::move( i_View ) )
    , m_pSelection( std::move( i_pSelection ) )
  {
  }

  /// An empty text means success, anything else says why the action could not be done.
  QString Perform( const VViewAction& i_rAction );
  /// Returns once so many more frames were drawn; false when that does not happen in half a minute.
  bool WaitFrames( int i_Count );
  VSceneView& View() { return m_View; }

private:
  QString Do( const VClickAction& i_rClick );
  QString Do( const VBandAction& i_rBand );
  QString Do( const VHoverAction& i_rHover );
  QString Do( const VDragAction& i_rDrag );
  QString Do( const VWheelAction& i_rWheel );
  QString Do( const VKeyAction& i_rKey );
  QString Do( const VViewTypeAction& i_rType );
  QString Do( const VSetAction& i_rSet );
  QString Do( const VSelectAction& i_rSelect );
  QString Do( const VCommandAction& i_rCommand );

  QString CheckInside( QPointF i_At ) const;
  void Send( QEvent::Type i_Type, QPointF i_At, Qt::MouseButton i_Button, Qt::MouseButtons i_Buttons );
  /// Presses, moves in steps and releases.
  void DragBetween( QPointF i_From, QPointF i_To, Qt::MouseButtons i_Buttons );

  VSceneView m_View;
  std::shared_ptr< ZEK::ISelectionService > m_pSelection;
  Qt::KeyboardModifiers m_Modifiers = Qt::NoModifier;
};

} // namespace HostWindow
