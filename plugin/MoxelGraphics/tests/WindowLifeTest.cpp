#include "ItemFixture.h"

#include <QtOpenGL/QOpenGLDebugLogger>
#include <QtQuick/QQuickView>

#include <mutex>
#include <random>
#include <thread>

// Run once as it is, and once with QSG_RENDER_LOOP=threaded; that again under a thread sanitizer.

namespace MoxelGraphics
{
namespace
{
/// Counts what OpenGL calls errors in the contexts of windows.
class VGlWatch
{
public:
  void Follow( QQuickWindow& i_rWindow )
  {
    QObject::connect(
        &i_rWindow, &QQuickWindow::sceneGraphInitialized, &i_rWindow,
        [this]
        {
          Begin();
        },
        Qt::DirectConnection );
  }
  std::atomic< int > Starts{ 0 }; ///< of a scene graph, in a context that may be new
  std::atomic< int > Errors{ 0 };
  std::atomic< int > Provoked{ 0 };
  std::string LastText()
  {
    const std::lock_guard Lock( m_Guard );
    return m_Text;
  }

private:
  void Begin()
  {
    QOpenGLContext* const pContext = QOpenGLContext::currentContext();
    if ( !pContext->findChild< QOpenGLDebugLogger* >() )
    {
      Listen( *pContext );
    }
    // An error of our own shows that one would be seen.
    const int Before = Errors;
    pContext->functions()->glEnable( 0xFFFF );
    while ( pContext->functions()->glGetError() != GL_NO_ERROR )
    {
    }
    Provoked += Errors - Before;
    Errors = Before;
    ++Starts;
  }

  void Listen( QOpenGLContext& io_rContext )
  {
    auto* const pLogger = new QOpenGLDebugLogger( &io_rContext );
    ASSERT_TRUE( pLogger->initialize() );
    QObject::connect(
        pLogger, &QOpenGLDebugLogger::messageLogged, pLogger,
        [this]( const QOpenGLDebugMessage& i_rMessage )
        {
          if ( i_rMessage.type() == QOpenGLDebugMessage::ErrorType )
          {
            const std::lock_guard Lock( m_Guard );
            m_Text = i_rMessage.message().toStdString();
            ++Errors;
          }
        },
        Qt::DirectConnection );
    pLogger->enableMessages();
    pLogger->startLogging( QOpenGLDebugLogger::SynchronousLogging );
  }

  std::mutex m_Guard;
  std::string m_Text;
};

/// Points that move on a thread of their own.
class VSource
{
public:
  explicit VSource( VTestScene& io_rScene )
    : m_Thread(
          [this, &io_rScene]
          {
            for ( int Step = 0; !m_bStop; ++Step )
            {
              io_rScene.Change( { { static_cast< float >( Step % 100 ), 0, 0, 7 }, { 1500, 300, 900, 7 } } );
              std::this_thread::sleep_for( std::chrono::milliseconds( 3 ) );
            }
          } )
  {
  }
  ~VSource()
  {
    m_bStop = true;
    m_Thread.join();
  }

private:
  std::atomic< bool > m_bStop{ false };
  std::thread m_Thread;
};

class VView : public QQuickView
{
public:
  VView( const std::shared_ptr< VTestScene >& i_rpScene, VGlWatch& io_rWatch )
    : pItem( new VSceneFramebufferObject( contentItem() ) )
  {
    io_rWatch.Follow( *this );
    pItem->setSize( Size );
    pItem->SetScene( i_rpScene.get() );
    pItem->setOption( "ReconstructionScale", 6.0 );
    resize( Size );
  }
  void Mouse( QEvent::Type i_Type, QPointF i_Place, Qt::MouseButton i_Button, Qt::MouseButtons i_Buttons )
  {
    QMouseEvent Event( i_Type, i_Place, mapToGlobal( i_Place ), i_Button, i_Buttons, Qt::NoModifier );
    QCoreApplication::sendEvent( this, &Event );
  }
  void Click( QPointF i_Place )
  {
    Mouse( QEvent::MouseButtonPress, i_Place, Qt::LeftButton, Qt::LeftButton );
    Mouse( QEvent::MouseButtonRelease, i_Place, Qt::LeftButton, Qt::NoButton );
  }
  int Drawn() const { return pItem->frameReport()["frames"].toInt(); }
  /// Draws that many frames of a renderer, which may be a new one.
  bool Frames( int i_Count )
  {
    const int Goal = Drawn() + i_Count;
    return Until(
        [&]
        {
          pItem->update();
          return Drawn() >= Goal;
        } );
  }

  VSceneFramebufferObject* pItem;
};

class VWindowLife : public testing::Test
{
protected:
  VWindowLife()
  {
    InitShaders();
    CoreGraphics::SetInteractionMapper( std::make_shared< CoreGraphics::VInteractionMapper >() );
    pScene->Change( { { 0, 0, 0, 7 }, { 1500, 300, 900, 7 } } );
  }
  ~VWindowLife() override
  {
    CoreGraphics::SetInteractionMapper( nullptr );
    EXPECT_EQ( Watch.Errors, 0 ) << Watch.LastText();
    EXPECT_EQ( Watch.Provoked, Watch.Starts ) << "errors would have gone unseen";
    // Views, frames and what they posted hold the scene; it holds everything that is drawn.
    EXPECT_TRUE( Until(
        [&]
        {
          return pScene.use_count() == 1;
        } ) )
        << pScene.use_count();
    const std::weak_ptr pRecons = pScene->pRecons;
    const std::weak_ptr pResources = pScene->Resources();
    pScene.reset();
    EXPECT_TRUE( pRecons.expired() );
    EXPECT_TRUE( pResources.expired() );
  }
  QPointF Place() const { return ScreenPoint( { 1500, 300, 900, 7 }, Size ); }
  ZEK::VSelection Selected() { return pScene->pSelection->Get( ZEK::ISelectionService::EPrimary ); }
  bool Picks( VView& io_rView )
  {
    pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, {} );
    io_rView.Click( Place() );
    return Until(
        [&]
        {
          return Selected() == ZEK::VSelection{ Recon( 1 ) };
        } );
  }

  VGlWatch Watch;
  std::shared_ptr< VTestScene > pScene = std::make_shared< VTestScene >();
};
} // namespace

TEST_F( VWindowLife, TwentyWindowsOpenAndCloseAtAnyMomentOfAFrame )
{
  const VSource Source( *pScene );
  std::mt19937 Random( 20 );
  int Longest = 0;
  for ( int Window = 0; Window < 20; ++Window )
  {
    auto pView = std::make_unique< VView >( pScene, Watch );
    const QPointer pItem = pView->pItem;
    pView->show();
    const int Turns = static_cast< int >( Random() % 40 );
    for ( int Turn = 0; Turn < Turns; ++Turn )
    {
      pView->Mouse( QEvent::MouseMove, Place(), Qt::NoButton, Qt::NoButton );
      if ( Random() % 3 == 0 )
      {
        pView->Click( Place() );
      }
      pView->pItem->SetFocusSelection( Random() % 8 == 0 );
      pView->pItem->update();
      QCoreApplication::processEvents( QEventLoop::AllEvents, 5 );
      std::this_thread::sleep_for( std::chrono::microseconds( Random() % 4000 ) );
    }
    Longest = std::max( Longest, pView->Drawn() );
    switch ( Random() % 4 )
    {
    case 0:
      pView->close();
      break;
    case 1:
      delete pView->pItem;
      pView->pItem = nullptr;
      break;
    case 2:
      pView->pItem->SetScene( nullptr );
      pView->pItem->update();
      QCoreApplication::processEvents( QEventLoop::AllEvents, 5 );
      break;
    default:
      break;
    }
    pView.reset();
    EXPECT_TRUE( pItem.isNull() );
  }
  EXPECT_GT( Longest, 3 ) << "some of them drew";
  EXPECT_GT( Watch.Starts, 5 );
}

TEST_F( VWindowLife, TwentyLostContextsAreRebuiltAndShowTheSame )
{
  VView View( pScene, Watch );
  View.setPersistentGraphics( false );
  View.setPersistentSceneGraph( false );
  View.show();
  ASSERT_TRUE( View.Frames( 3 ) );
  const QImage First = View.grabWindow();
  ASSERT_FALSE( First.isNull() );
  for ( int Loss = 0; Loss < 20; ++Loss )
  {
    SCOPED_TRACE( Loss );
    if ( Loss % 2 == 0 )
    {
      View.Click( Place() ); // its pick is lost with the context, and taken up again
    }
    const int Before = Watch.Starts;
    View.hide();
    View.releaseResources();
    QCoreApplication::processEvents();
    if ( View.isSceneGraphInitialized() )
    {
      ASSERT_NE( qgetenv( "QSG_RENDER_LOOP" ), "threaded" );
      GTEST_SKIP() << "this render loop keeps the graphics of hidden windows";
    }
    View.show();
    ASSERT_TRUE( Until(
        [&]
        {
          View.pItem->update();
          return Watch.Starts > Before && !View.pItem->IsPickPending();
        } ) );
    ASSERT_TRUE( View.Frames( 2 ) );
  }
  EXPECT_EQ( Selected(), ZEK::VSelection{ Recon( 1 ) } );
  View.Mouse( QEvent::MouseMove, { 600, 40 }, Qt::NoButton, Qt::NoButton );
  pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, {} );
  ASSERT_TRUE( View.Frames( 3 ) );
  const QImage Last = View.grabWindow();
  EXPECT_EQ( First, Last );
  EXPECT_TRUE( Picks( View ) );
  EXPECT_GE( Watch.Starts, 21 );
}

TEST_F( VWindowLife, NoGestureIsLostWhereverItFallsBetweenFrames )
{
  const VSource Source( *pScene );
  VView View( pScene, Watch );
  View.show();
  ASSERT_TRUE( View.Frames( 3 ) );
  CoreGraphics::VCameraController Expected = View.pItem->Camera();
  std::mt19937 Random( 7 );
  for ( int Turn = 0; Turn < 300; ++Turn )
  {
    if ( Random() % 2 == 0 )
    {
      const int Delta = Random() % 2 == 0 ? 120 : -120;
      QWheelEvent Wheel( Place(), View.mapToGlobal( Place() ), {}, { 0, Delta }, Qt::NoButton, Qt::NoModifier,
                         Qt::NoScrollPhase, false );
      QCoreApplication::sendEvent( &View, &Wheel );
      Expected.OnWheel( Wheel );
    }
    else
    {
      const QPointF To( 100 + Random() % 400, 50 + Random() % 250 );
      const auto Both =
          [&]( QEvent::Type i_Type, QPointF i_Place, Qt::MouseButton i_Button, Qt::MouseButtons i_Buttons, auto i_pDo )
      {
        View.Mouse( i_Type, i_Place, i_Button, i_Buttons );
        const QMouseEvent Event( i_Type, i_Place, i_Place, i_Button, i_Buttons, Qt::NoModifier );
        ( Expected.*i_pDo )( Event, View.effectiveDevicePixelRatio() );
      };
      using CoreGraphics::VCameraController;
      Both( QEvent::MouseButtonPress, Place(), Qt::LeftButton, Qt::LeftButton, &VCameraController::OnMousePress );
      Both( QEvent::MouseMove, To, Qt::NoButton, Qt::LeftButton, &VCameraController::OnMouseMove );
      Both( QEvent::MouseButtonRelease, To, Qt::LeftButton, Qt::NoButton, &VCameraController::OnMouseRelease );
    }
    if ( Random() % 3 == 0 )
    {
      View.pItem->update();
      QCoreApplication::processEvents( QEventLoop::AllEvents, 5 );
      std::this_thread::sleep_for( std::chrono::microseconds( Random() % 3000 ) );
    }
  }
  ASSERT_TRUE( View.Frames( 2 ) );
  const QVariantMap Drawn = View.pItem->frameReport()["camera"].toMap();
  EXPECT_EQ( Drawn["distance"].toFloat(), Expected.Fields().distance );
  EXPECT_EQ( Drawn["azimuth"].toFloat(), Expected.Fields().azimuth );
  EXPECT_EQ( Drawn["tilt"].toFloat(), Expected.Fields().tilt );
}

TEST_F( VWindowLife, TwoViewsOfOneWindowShareAScene )
{
  VView View( pScene, Watch );
  auto* const pSecond = new VSceneFramebufferObject( View.contentItem() );
  View.pItem->setSize( { 320, 360 } );
  pSecond->setSize( { 320, 360 } );
  pSecond->setX( 320 );
  pSecond->SetScene( pScene.get() );
  pSecond->setOption( "ReconstructionScale", 6.0 );
  View.show();
  ASSERT_TRUE( View.Frames( 3 ) );
  const auto Drawn = [&]
  {
    pSecond->update();
    return pSecond->frameReport()["frames"].toInt() >= 3;
  };
  ASSERT_TRUE( Until( Drawn ) );
  EXPECT_EQ( pScene->Initialised, 2 );
  const QImage Image = View.grabWindow();
  const QSize Half( Image.width() / 2, Image.height() );
  EXPECT_EQ( Image.copy( QRect( QPoint( 0, 0 ), Half ) ),
             Image.copy( QRect( QPoint( Image.width() - Half.width(), 0 ), Half ) ) );
  const QPointF There = ScreenPoint( { 1500, 300, 900, 7 }, QSizeF( 320, 360 ) );
  for ( const double Left : { 0.0, 320.0 } )
  {
    pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, {} );
    View.Click( There + QPointF( Left, 0 ) );
    EXPECT_TRUE( Until(
        [&]
        {
          return Selected() == ZEK::VSelection{ Recon( 1 ) };
        } ) )
        << Left;
  }
  delete pSecond;
  EXPECT_TRUE( View.Frames( 3 ) ) << "the other goes on";
}

// A widget draws on the GUI thread, so that its windows may share a scene whatever the render loop.
TEST_F( VWindowLife, OneSceneOverTwoTopLevelWindowsAndAViewThatMovesBetweenThem )
{
  QWidget Left, Right;
  QQmlEngine Engine;
  QQmlComponent Component( &Engine );
  Component.setData( "import QtQuick\nItem {}", {} );
  struct VOne
  {
    QQuickWidget* pWidget;
    VSceneFramebufferObject* pItem;
  };
  const auto Make = [&]( QWidget& io_rTop )
  {
    auto* const pWidget = new QQuickWidget( &Engine, &io_rTop );
    Watch.Follow( *pWidget->quickWindow() );
    auto* const pRoot = qobject_cast< QQuickItem* >( Component.create() );
    auto* const pItem = new VSceneFramebufferObject( pRoot );
    pItem->setSize( Size );
    pItem->SetScene( pScene.get() );
    pItem->setOption( "ReconstructionScale", 6.0 );
    pWidget->setContent( {}, &Component, pRoot );
    pWidget->setResizeMode( QQuickWidget::SizeRootObjectToView );
    pWidget->resize( Size );
    io_rTop.resize( Size );
    io_rTop.show();
    return VOne{ pWidget, pItem };
  };
  const auto Draws = [&]( const VOne& i_rOne )
  {
    const int Before = i_rOne.pItem->frameReport()["frames"].toInt();
    return Until(
        [&]
        {
          i_rOne.pItem->update();
          const int Now = i_rOne.pItem->frameReport()["frames"].toInt();
          return Now >= 3 && Now != Before;
        } );
  };
  const VOne A = Make( Left );
  VOne B = Make( Right );
  ASSERT_TRUE( Draws( A ) && Draws( B ) );
  const QImage First = A.pWidget->grabFramebuffer();
  EXPECT_EQ( First, B.pWidget->grabFramebuffer() );
  for ( int Move = 0; Move < 20; ++Move )
  {
    QWidget& rTop = Move % 2 == 0 ? Left : Right;
    B.pWidget->setParent( &rTop );
    B.pWidget->show();
    ASSERT_TRUE( Draws( B ) ) << Move;
    ASSERT_EQ( First, B.pWidget->grabFramebuffer() ) << Move;
  }
  delete B.pWidget;
  ASSERT_TRUE( Draws( A ) );
  EXPECT_EQ( First, A.pWidget->grabFramebuffer() );
  EXPECT_GE( Watch.Starts, 3 );
}

} // namespace MoxelGraphics
