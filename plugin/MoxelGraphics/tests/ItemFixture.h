#pragma once

#include "TestScene.h"

#include <MoxelGraphics/VSceneFramebufferObject.h>

#include <CoreGraphics/VInteractionMapper.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QDeadlineTimer>
#include <QtCore/QThread>
#include <QtGui/QMouseEvent>
#include <QtQml/QQmlComponent>
#include <QtQml/QQmlEngine>
#include <QtQuickWidgets/QQuickWidget>
#include <QtWidgets/QApplication>

namespace MoxelGraphics
{

inline constexpr QSize Size( 640, 360 );

/// Handles turns of the event loop until the condition holds; false when it does not in 20 s.
template < typename TCondition >
bool Until( TCondition i_Condition )
{
  const QDeadlineTimer Patience( 20000 );
  while ( !i_Condition() && !Patience.hasExpired() )
  {
    QCoreApplication::processEvents( QEventLoop::AllEvents, 20 );
    QCoreApplication::sendPostedEvents( nullptr, QEvent::DeferredDelete );
  }
  return i_Condition();
}

/// One item that shows a test scene, in a widget.
class VItemTest : public testing::Test
{
protected:
  explicit VItemTest( std::shared_ptr< VTestScene > i_pScene = std::make_shared< VTestScene >() )
    : pScene( std::move( i_pScene ) )
  {
    InitShaders();
    CoreGraphics::SetInteractionMapper( std::make_shared< CoreGraphics::VInteractionMapper >() );
    pScene->Change( { { 0, 0, 0, 7 }, { 1500, 300, 900, 7 }, { -900, -1600, 200, 7 } } );
    Component.setData( "import QtQuick\nItem {}", {} );
    auto* pRoot = qobject_cast< QQuickItem* >( Component.create() );
    pItem = new VSceneFramebufferObject( pRoot );
    pItem->setSize( Size );
    pItem->SetScene( pScene.get() );
    pItem->setOption( "ReconstructionScale", 6.0 );
    Widget.setContent( {}, &Component, pRoot );
    Widget.setResizeMode( QQuickWidget::SizeRootObjectToView );
    Widget.resize( Size );
    Widget.show();
    Frames( 3 );
  }
  ~VItemTest() override { CoreGraphics::SetInteractionMapper( nullptr ); }

  quint64 Drawn() const { return pItem->frameReport()["frames"].toULongLong(); }
  /// Lets that many frames be drawn, as the views' timer does.
  void Frames( int i_Count )
  {
    for ( int Frame = 0; Frame < i_Count; ++Frame )
    {
      const quint64 Before = Drawn();
      ASSERT_TRUE( Until(
          [&]
          {
            pItem->update();
            return Drawn() > Before;
          } ) );
    }
  }
  /// Lets everything run out that is still under way.
  void Settle()
  {
    quint64 Last = Drawn();
    for ( int Quiet = 0; Quiet < 10; ++Quiet )
    {
      QCoreApplication::processEvents( QEventLoop::AllEvents, 20 );
      QThread::msleep( 5 );
      Quiet = Drawn() == Last ? Quiet : 0;
      Last = Drawn();
    }
  }
  void Mouse( QEvent::Type i_Type, QPointF i_Place, Qt::MouseButton i_Button, Qt::MouseButtons i_Buttons,
              Qt::KeyboardModifiers i_Modifiers = Qt::NoModifier )
  {
    QMouseEvent Event( i_Type, i_Place, Widget.mapToGlobal( i_Place ), i_Button, i_Buttons, i_Modifiers );
    QCoreApplication::sendEvent( &Widget, &Event );
  }
  void Click( QPointF i_Place, Qt::KeyboardModifiers i_Modifiers = Qt::NoModifier )
  {
    Mouse( QEvent::MouseButtonPress, i_Place, Qt::LeftButton, Qt::LeftButton, i_Modifiers );
    Mouse( QEvent::MouseButtonRelease, i_Place, Qt::LeftButton, Qt::NoButton, i_Modifiers );
    EXPECT_TRUE( Until(
        [&]
        {
          return !pItem->IsPickPending();
        } ) );
    QCoreApplication::processEvents();
  }
  void Press( Qt::Key i_Key )
  {
    QKeyEvent Event( QEvent::KeyPress, i_Key, Qt::NoModifier );
    QCoreApplication::sendEvent( pItem, &Event );
  }
  void Wheel( int i_Delta )
  {
    QWheelEvent Event( { 300, 200 }, Widget.mapToGlobal( QPointF( 300, 200 ) ), {}, { 0, i_Delta }, Qt::NoButton,
                       Qt::NoModifier, Qt::NoScrollPhase, false );
    QCoreApplication::sendEvent( &Widget, &Event );
  }
  void Hover( QPointF i_Place ) { Mouse( QEvent::MouseMove, i_Place, Qt::NoButton, Qt::NoButton ); }
  QPointF Place( std::uint32_t i_Index ) { return ScreenPoint( pScene->Resolver.Points[i_Index], Size ); }
  ZEK::VSelection Selected() { return pScene->pSelection->Get( ZEK::ISelectionService::EPrimary ); }
  ZEK::VSelection Preselected() { return pScene->pSelection->Get( ZEK::ISelectionService::ESecondary ); }

  std::shared_ptr< VTestScene > pScene;
  QQmlEngine Engine;
  QQmlComponent Component{ &Engine };
  QQuickWidget Widget{ &Engine, nullptr };
  VSceneFramebufferObject* pItem = nullptr;
};

} // namespace MoxelGraphics
