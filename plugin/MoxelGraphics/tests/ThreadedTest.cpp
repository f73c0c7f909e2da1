#include "TestScene.h"

#include <MoxelGraphics/VSceneFramebufferObject.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QDeadlineTimer>
#include <QtCore/QThread>
#include <QtGui/QMouseEvent>
#include <QtGui/QWheelEvent>
#include <QtQuick/QQuickView>

#include <thread>

namespace MoxelGraphics
{
namespace
{
/// Notes the threads on which it is asked to draw.
class VThreadedScene final : public VTestScene
{
public:
  bool ProcessPending() override
  {
    pThread = QThread::currentThread();
    return VTestScene::ProcessPending();
  }
  std::atomic< QThread* > pThread{ nullptr };
};
} // namespace

// Run with QSG_RENDER_LOOP=threaded, and once more under a thread sanitizer.
TEST( ThreadedView, DrawsAndPicksWhileDataArrive )
{
  if ( qgetenv( "QSG_RENDER_LOOP" ) != "threaded" )
  {
    GTEST_SKIP() << "the threaded render loop was not asked for";
  }
  InitShaders();
  const auto pScene = std::make_shared< VThreadedScene >();
  std::atomic< bool > bStop{ false };
  std::thread Source(
      [&]
      {
        for ( int Step = 0; !bStop; ++Step )
        {
          pScene->Change( { { static_cast< float >( Step % 100 ), 0, 0, 7 }, { 1500, 300, 900, 7 } } );
          std::this_thread::sleep_for( std::chrono::milliseconds( 3 ) );
        }
      } );
  {
    QQuickView View;
    auto* pItem = new VSceneFramebufferObject( View.contentItem() );
    pItem->setSize( { 640, 360 } );
    pItem->SetScene( pScene.get() );
    pItem->setOption( "ReconstructionScale", 6.0 );
    View.resize( 640, 360 );
    View.show();
    const QPointF Place = ScreenPoint( { 1500, 300, 900, 7 }, { 640, 360 } );
    const QDeadlineTimer Patience( 60000 );
    bool bPicked = false; // framing moves the camera, after which the clicks hit nothing
    QObject::connect( pItem, &VSceneFramebufferObject::SelectionChanged,
                      [&]
                      {
                        bPicked = bPicked || pItem->Picked() == ZEK::VSelection{ Recon( 1 ) };
                      } );
    const auto Enough = [&]
    {
      return pItem->frameReport()["frames"].toInt() >= 30 && bPicked;
    };
    for ( int Turn = 0; ( Turn < 100 || !Enough() ) && !Patience.hasExpired(); ++Turn )
    {
      const auto Type = Turn % 4 == 0   ? QEvent::MouseButtonPress
                        : Turn % 4 == 1 ? QEvent::MouseButtonRelease
                                        : QEvent::MouseMove;
      QMouseEvent Event( Type, Place, View.mapToGlobal( Place ), Turn % 4 < 2 ? Qt::LeftButton : Qt::NoButton,
                         Turn % 4 == 0 ? Qt::LeftButton : Qt::NoButton, Qt::NoModifier );
      QCoreApplication::sendEvent( &View, &Event );
      if ( Turn > 40 )
      {
        QWheelEvent Wheel( Place, View.mapToGlobal( Place ), {}, { 0, Turn % 2 == 0 ? 120 : -120 }, Qt::NoButton,
                           Qt::NoModifier, Qt::NoScrollPhase, false );
        QCoreApplication::sendEvent( &View, &Wheel );
      }
      pItem->setOption( "GlobalAxis", Turn % 2 == 0 );
      pItem->setProperty( "focusSelection", Turn == 30 );
      pItem->update();
      for ( int Wait = 0; Wait < 5; ++Wait )
      {
        QCoreApplication::processEvents( QEventLoop::AllEvents, 10 );
        std::this_thread::sleep_for( std::chrono::milliseconds( 2 ) );
      }
    }
    EXPECT_TRUE( Enough() );
  }
  bStop = true;
  Source.join();
  ASSERT_NE( pScene->pThread, nullptr );
  EXPECT_NE( pScene->pThread, QThread::currentThread() );
}

} // namespace MoxelGraphics
