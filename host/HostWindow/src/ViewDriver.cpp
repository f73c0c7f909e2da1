#include <HostWindow/ViewDriver.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QElapsedTimer>
#include <QtCore/QThread>
#include <QtGui/QKeyEvent>
#include <QtGui/QMouseEvent>
#include <QtGui/QWheelEvent>

namespace HostWindow
{
namespace
{
// One frame hands the pick to the renderer and runs it, the next one commits its result, and the one after shows it.
constexpr int FramesForPick = 4;
constexpr int FramesForChange = 2;
constexpr int DragSteps = 8;

constexpr Qt::MouseButton ButtonsInOrder[] = { Qt::LeftButton, Qt::RightButton, Qt::MiddleButton };
} // namespace

QString VViewDriver::Perform( const VViewAction& i_rAction )
{
  if ( !m_View.Item() )
  {
    return m_View.LoadErrors();
  }
  m_Modifiers = i_rAction.Modifiers;
  return std::visit(
      [this]( const auto& i_rWhat )
      {
        return Do( i_rWhat );
      },
      i_rAction.What );
}

bool VViewDriver::WaitFrames( int i_Count )
{
  const qint64 Goal = m_View.Frames() + i_Count;
  QElapsedTimer Timer;
  Timer.start();
  while ( m_View.Frames() < Goal )
  {
    if ( Timer.elapsed() > 30'000 )
    {
      return false;
    }
    QCoreApplication::processEvents( QEventLoop::AllEvents, 20 );
    QCoreApplication::sendPostedEvents( nullptr, QEvent::DeferredDelete );
    QThread::usleep( 500 );
  }
  return true;
}

QString VViewDriver::CheckInside( QPointF i_At ) const
{
  const QSizeF Size = m_View.Item()->size();
  if ( i_At.x() >= 0 && i_At.y() >= 0 && i_At.x() < Size.width() && i_At.y() < Size.height() )
  {
    return {};
  }
  return QString( "the point %1,%2 lies outside the view of %3x%4" )
      .arg( i_At.x() )
      .arg( i_At.y() )
      .arg( Size.width() )
      .arg( Size.height() );
}

void VViewDriver::Send( QEvent::Type i_Type, QPointF i_At, Qt::MouseButton i_Button, Qt::MouseButtons i_Buttons )
{
  QQuickWidget* pWidget = m_View.Widget();
  const QPointF Local = m_View.Item()->mapToScene( i_At );
  QMouseEvent Event( i_Type, Local, pWidget->mapToGlobal( Local ), i_Button, i_Buttons, m_Modifiers );
  QCoreApplication::sendEvent( pWidget, &Event );
}

void VViewDriver::DragBetween( QPointF i_From, QPointF i_To, Qt::MouseButtons i_Buttons )
{
  Send( QEvent::MouseMove, i_From, Qt::NoButton, Qt::NoButton );
  Qt::MouseButtons Down = Qt::NoButton;
  for ( const Qt::MouseButton Button : ButtonsInOrder )
  {
    if ( i_Buttons & Button )
    {
      Down |= Button;
      Send( QEvent::MouseButtonPress, i_From, Button, Down );
    }
  }
  for ( int Step = 1; Step <= DragSteps; ++Step )
  {
    const double Share = static_cast< double >( Step ) / DragSteps;
    Send( QEvent::MouseMove, i_From + ( i_To - i_From ) * Share, Qt::NoButton, Down );
    WaitFrames( 1 );
  }
  for ( const Qt::MouseButton Button : ButtonsInOrder )
  {
    if ( i_Buttons & Button )
    {
      Down &= ~Qt::MouseButtons( Button );
      Send( QEvent::MouseButtonRelease, i_To, Button, Down );
    }
  }
}

QString VViewDriver::Do( const VClickAction& i_rClick )
{
  const QString Wrong = CheckInside( i_rClick.At );
  if ( !Wrong.isEmpty() )
  {
    return Wrong;
  }
  Send( QEvent::MouseMove, i_rClick.At, Qt::NoButton, Qt::NoButton );
  Send( QEvent::MouseButtonPress, i_rClick.At, Qt::LeftButton, Qt::LeftButton );
  Send( QEvent::MouseButtonRelease, i_rClick.At, Qt::LeftButton, Qt::NoButton );
  if ( i_rClick.bDouble )
  {
    Send( QEvent::MouseButtonDblClick, i_rClick.At, Qt::LeftButton, Qt::LeftButton );
    Send( QEvent::MouseButtonRelease, i_rClick.At, Qt::LeftButton, Qt::NoButton );
  }
  return WaitFrames( FramesForPick ) ? QString() : "the view does not draw";
}

QString VViewDriver::Do( const VBandAction& i_rBand )
{
  for ( const QPointF& rPoint : { i_rBand.From, i_rBand.To } )
  {
    const QString Wrong = CheckInside( rPoint );
    if ( !Wrong.isEmpty() )
    {
      return Wrong;
    }
  }
  // Alt asks for selection unless the user swapped the two.
  const Qt::KeyboardModifiers Given = m_Modifiers;
  bool bAltSelects = true;
  QMetaObject::invokeMethod( m_View.Widget(), "altToSelect", Q_RETURN_ARG( bool, bAltSelects ) );
  m_Modifiers.setFlag( Qt::AltModifier, bAltSelects );
  DragBetween( i_rBand.From, i_rBand.To, Qt::LeftButton );
  m_Modifiers = Given;
  return WaitFrames( FramesForPick ) ? QString() : "the view does not draw";
}

QString VViewDriver::Do( const VHoverAction& i_rHover )
{
  const QString Wrong = CheckInside( i_rHover.At );
  if ( !Wrong.isEmpty() )
  {
    return Wrong;
  }
  Send( QEvent::MouseMove, i_rHover.At, Qt::NoButton, Qt::NoButton );
  return WaitFrames( FramesForPick ) ? QString() : "the view does not draw";
}

QString VViewDriver::Do( const VDragAction& i_rDrag )
{
  DragBetween( i_rDrag.From, i_rDrag.To, i_rDrag.Buttons );
  return WaitFrames( FramesForChange ) ? QString() : "the view does not draw";
}

QString VViewDriver::Do( const VWheelAction& i_rWheel )
{
  QQuickWidget* pWidget = m_View.Widget();
  const QPointF Local = m_View.Item()->mapToScene( i_rWheel.At );
  QWheelEvent Event( Local, pWidget->mapToGlobal( Local ), QPoint(), QPoint( 0, i_rWheel.Delta ), Qt::NoButton,
                     m_Modifiers, Qt::NoScrollPhase, false );
  QCoreApplication::sendEvent( pWidget, &Event );
  return WaitFrames( FramesForChange ) ? QString() : "the view does not draw";
}

QString VViewDriver::Do( const VKeyAction& i_rKey )
{
  m_View.Item()->forceActiveFocus( Qt::OtherFocusReason );
  for ( const QEvent::Type Type : { QEvent::KeyPress, QEvent::KeyRelease } )
  {
    QKeyEvent Event( Type, i_rKey.Key, m_Modifiers );
    QCoreApplication::sendEvent( m_View.Widget(), &Event );
  }
  return WaitFrames( FramesForChange ) ? QString() : "the view does not draw";
}

QString VViewDriver::Do( const VViewTypeAction& i_rType )
{
  m_View.SetViewType( i_rType.Index );
  return WaitFrames( FramesForChange ) ? QString() : "the view does not draw";
}

QString VViewDriver::Do( const VSetAction& i_rSet )
{
  if ( !m_View.SetOption( i_rSet.Key, i_rSet.Value ) )
  {
    return QString( "the view has no option \"%1\"; the nearest are %2" )
        .arg( i_rSet.Key, Nearest( i_rSet.Key, m_View.OptionKeys() ).join( ", " ) );
  }
  return WaitFrames( FramesForChange ) ? QString() : "the view does not draw";
}

QString VViewDriver::Do( const VSelectAction& i_rSelect )
{
  using ZEK::ESelectionEdit;
  const bool bShift = m_Modifiers.testFlag( Qt::ShiftModifier );
  const bool bControl = m_Modifiers.testFlag( Qt::ControlModifier );
  const ESelectionEdit Edit = bShift && bControl ? ESelectionEdit::Remove
                              : bShift           ? ESelectionEdit::Add
                              : bControl         ? ESelectionEdit::Toggle
                                                 : ESelectionEdit::Replace;
  ZEK::VSelection Picked;
  if ( !i_rSelect.Item.empty() )
  {
    Picked.push_back( m_pSelection->FromName( i_rSelect.Item ) );
    if ( Picked.back().Kind == ZEK::ESelectNone )
    {
      return "this is no text of an item; one is \"@marker/1/4/Walker:LFHD\", and a camera's is its URN";
    }
  }
  m_pSelection->Set( ZEK::ISelectionService::EPrimary,
                     ZEK::EditSelection( m_pSelection->Get( ZEK::ISelectionService::EPrimary ), Picked, Edit ) );
  return WaitFrames( FramesForChange ) ? QString() : "the view does not draw";
}

QString VViewDriver::Do( const VCommandAction& i_rCommand )
{
  if ( !m_View.ExecuteCommand( i_rCommand.Text ) )
  {
    return "the view knows no such command, or what the command is about is not selected";
  }
  return WaitFrames( FramesForChange ) ? QString() : "the view does not draw";
}

} // namespace HostWindow
