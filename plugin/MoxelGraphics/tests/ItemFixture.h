#pragma once

#include "TestScene.h"

#include <MoxelGraphics/VSceneFramebufferObject.h>

#include <CoreGraphics/VInteractionMapper.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QDeadlineTimer>
#include <QtGui/QMouseEvent>
#include <QtQml/QQmlComponent>
#include <QtQml/QQmlEngine>
#include <QtQuick/QQuickView>
#include <QtQuickWidgets/QQuickWidget>
#include <QtWidgets/QApplication>

namespace MoxelGraphics
{

inline void Turns( int i_Count, int i_Ms = 10 )
{
  for ( int Turn = 0; Turn < i_Count; ++Turn )
  {
    QCoreApplication::processEvents( QEventLoop::AllEvents, i_Ms );
  }
}

/// Handles turns of the event loop until the condition holds; false when it does not in 20 s.
template < typename TCondition >
bool Until( TCondition i_Condition )
{
  const QDeadlineTimer Patience( 20000 );
  while ( !i_Condition() && !Patience.hasExpired() )
  {
    Turns( 1, 20 );
    QCoreApplication::sendPostedEvents( nullptr, QEvent::DeferredDelete );
  }
  return i_Condition();
}

/// Counts what a signal announces from now on.
template < typename TSignal >
std::shared_ptr< int > Counted( VSceneFramebufferObject* i_pItem, TSignal i_Signal )
{
  const auto pCount = std::make_shared< int >( 0 );
  QObject::connect( i_pItem, i_Signal,
                    [pCount]
                    {
                      ++*pCount;
                    } );
  return pCount;
}

/// A window or a widget that shows a test scene in one item.
template < typename TWindow >
class VShown : public TWindow
{
public:
  template < typename... TArguments >
  explicit VShown( const std::shared_ptr< VTestScene >& i_rpScene, TArguments... i_Arguments )
    : TWindow( i_Arguments... )
    , m_rScene( *i_rpScene )
  {
    if constexpr ( std::is_base_of_v< QQuickWidget, TWindow > )
    {
      auto* const pComponent = new QQmlComponent( this->engine(), this );
      pComponent->setData( "import QtQuick\nItem {}", {} );
      auto* const pRoot = qobject_cast< QQuickItem* >( pComponent->create() );
      pItem = new VSceneFramebufferObject( pRoot );
      this->setContent( {}, pComponent, pRoot );
      this->setResizeMode( QQuickWidget::SizeRootObjectToView );
    }
    else
    {
      pItem = new VSceneFramebufferObject( this->contentItem() );
    }
    pItem->setSize( Size );
    pItem->SetScene( i_rpScene.get() );
    pItem->setOption( "ReconstructionScale", 6.0 );
    this->resize( Size );
  }

  void Mouse( QEvent::Type i_Type, QPointF i_Place, Qt::MouseButton i_Button = Qt::NoButton,
              Qt::MouseButtons i_Buttons = Qt::NoButton, Qt::KeyboardModifiers i_Modifiers = Qt::NoModifier )
  {
    QMouseEvent Event( i_Type, i_Place, this->mapToGlobal( i_Place ), i_Button, i_Buttons, i_Modifiers );
    QCoreApplication::sendEvent( this, &Event );
    if ( pMirror )
    {
      const double Ratio = pItem->window()->effectiveDevicePixelRatio();
      i_Type == QEvent::MouseButtonPress     ? pMirror->OnMousePress( Event, Ratio )
      : i_Type == QEvent::MouseButtonRelease ? pMirror->OnMouseRelease( Event, Ratio )
                                             : pMirror->OnMouseMove( Event, Ratio );
    }
  }
  void Press( QPointF i_Place, Qt::KeyboardModifiers i_Modifiers = Qt::NoModifier )
  {
    Mouse( QEvent::MouseButtonPress, i_Place, Qt::LeftButton, Qt::LeftButton, i_Modifiers );
  }
  void Drag( QPointF i_Place, Qt::KeyboardModifiers i_Modifiers = Qt::NoModifier )
  {
    Mouse( QEvent::MouseMove, i_Place, Qt::NoButton, Qt::LeftButton, i_Modifiers );
  }
  void Release( QPointF i_Place, Qt::KeyboardModifiers i_Modifiers = Qt::NoModifier )
  {
    Mouse( QEvent::MouseButtonRelease, i_Place, Qt::LeftButton, Qt::NoButton, i_Modifiers );
  }
  void Click( QPointF i_Place, Qt::KeyboardModifiers i_Modifiers = Qt::NoModifier )
  {
    Press( i_Place, i_Modifiers );
    Release( i_Place, i_Modifiers );
  }
  void Hover( QPointF i_Place ) { Mouse( QEvent::MouseMove, i_Place ); }
  void Wheel( int i_Delta )
  {
    const QPointF Place( 150, 200 );
    QWheelEvent Event( Place, this->mapToGlobal( Place ), {}, { 0, i_Delta }, Qt::NoButton, Qt::NoModifier,
                       Qt::NoScrollPhase, false );
    QCoreApplication::sendEvent( this, &Event );
    if ( pMirror )
    {
      pMirror->OnWheel( Event );
    }
  }

  quint64 Drawn() const { return pItem->frameReport()["frames"].toULongLong(); }
  /// Lets that many frames be drawn, as the views' timer does; perhaps by a new renderer.
  bool Frames( int i_Count )
  {
    const quint64 Goal = Drawn() + static_cast< quint64 >( i_Count );
    return Until(
        [&]
        {
          pItem->update();
          return Drawn() >= Goal;
        } );
  }
  /// Whether before long that is selected.
  bool Selects( const ZEK::VSelection& i_rWanted ) { return Comes( ZEK::ISelectionService::EPrimary, i_rWanted ); }
  bool Preselects( const ZEK::VSelection& i_rWanted ) { return Comes( ZEK::ISelectionService::ESecondary, i_rWanted ); }
  ZEK::VSelection Selected() const { return m_rScene.pSelection->Get( ZEK::ISelectionService::EPrimary ); }
  ZEK::VSelection Preselected() const { return m_rScene.pSelection->Get( ZEK::ISelectionService::ESecondary ); }

  VSceneFramebufferObject* pItem = nullptr;
  CoreGraphics::VCameraController* pMirror = nullptr; ///< takes the same gestures

private:
  bool Comes( ZEK::ISelectionService::ESet i_Set, const ZEK::VSelection& i_rWanted )
  {
    return Until(
        [&]
        {
          return m_rScene.pSelection->Get( i_Set ) == i_rWanted;
        } );
  }

  VTestScene& m_rScene;
};
using VTestWidget = VShown< QQuickWidget >;
using VTestView = VShown< QQuickView >;

/// A scene of three points in a widget.
class VItemTest : public testing::Test
{
protected:
  explicit VItemTest( std::shared_ptr< VTestScene > i_pScene = std::make_shared< VTestScene >() )
    : pScene( std::move( i_pScene ) )
  {
    InitShaders();
    CoreGraphics::SetInteractionMapper( std::make_shared< CoreGraphics::VInteractionMapper >() );
    pScene->Change( { { 0, 0, 0, 7 }, { 1500, 300, 900, 7 }, { -900, -1600, 200, 7 } } );
    pWidget = std::make_unique< VTestWidget >( pScene );
    pItem = pWidget->pItem;
    pWidget->show();
    Frames( 3 );
  }
  ~VItemTest() override { CoreGraphics::SetInteractionMapper( nullptr ); }

  void Frames( int i_Count ) { ASSERT_TRUE( pWidget->Frames( i_Count ) ); }
  quint64 Drawn() const { return pWidget->Drawn(); }
  /// Lets everything run out that is still under way.
  void Settle()
  {
    quint64 Last = Drawn();
    for ( int Quiet = 0; Quiet < 10; ++Quiet )
    {
      Turns( 1, 20 );
      QThread::msleep( 5 );
      Quiet = Drawn() == Last ? Quiet : 0;
      Last = Drawn();
    }
  }
  /// Clicks, and waits for the pick.
  void Click( QPointF i_Place, Qt::KeyboardModifiers i_Modifiers = Qt::NoModifier )
  {
    pWidget->Click( i_Place, i_Modifiers );
    EXPECT_TRUE( Until(
        [&]
        {
          return !pItem->IsPickPending();
        } ) );
    QCoreApplication::processEvents();
  }
  bool Key( Qt::Key i_Key )
  {
    QKeyEvent Event( QEvent::KeyPress, i_Key, Qt::NoModifier );
    QCoreApplication::sendEvent( pItem, &Event );
    return Event.isAccepted();
  }
  QPointF Place( std::uint32_t i_Index ) { return ScreenPoint( pScene->Resolver.Points[i_Index] ); }
  const CoreGraphics::VCameraFields& Camera() { return pItem->Camera().Fields(); }

  const QPointF Empty{ 600, 40 }; ///< where no point is
  std::shared_ptr< VTestScene > pScene;
  std::unique_ptr< VTestWidget > pWidget;
  VSceneFramebufferObject* pItem = nullptr;
};

} // namespace MoxelGraphics
