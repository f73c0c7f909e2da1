#include "ItemFixture.h"
#include "TileFixture.h"

#include <QtOpenGL/QOpenGLDebugLogger>
#include <random>
#include <set>
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

private:
  void Begin()
  {
    QOpenGLContext* const pContext = QOpenGLContext::currentContext();
    if ( !pContext->findChild< QOpenGLDebugLogger* >() )
    {
      auto* const pLogger = new QOpenGLDebugLogger( pContext );
      ASSERT_TRUE( pLogger->initialize() );
      const auto Take = [this]( const QOpenGLDebugMessage& i_rMessage )
      {
        Errors += i_rMessage.type() == QOpenGLDebugMessage::ErrorType ? 1 : 0;
      };
      QObject::connect( pLogger, &QOpenGLDebugLogger::messageLogged, pLogger, Take, Qt::DirectConnection );
      pLogger->enableMessages();
      pLogger->startLogging( QOpenGLDebugLogger::SynchronousLogging );
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

class VWindowLife : public testing::Test
{
protected:
  VWindowLife()
  {
    InitShaders();
    CoreGraphics::SetInteractionMapper( std::make_shared< CoreGraphics::VInteractionMapper >() );
    pScene->Change( { { 0, 0, 0, 7 }, Point } );
  }
  ~VWindowLife() override
  {
    CoreGraphics::SetInteractionMapper( nullptr );
    EXPECT_EQ( Watch.Errors, 0 );
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
  const VScenePoint Point{ 1500, 300, 900, 7 };
  const QPointF Place = ScreenPoint( Point );
  VGlWatch Watch;
  std::shared_ptr< VTestScene > pScene = std::make_shared< VTestScene >();
};
} // namespace

TEST_F( VWindowLife, TwentyWindowsOpenAndCloseAtAnyMomentOfAFrame )
{
  const VSource Source( *pScene );
  std::mt19937 Random( 20 );
  quint64 Longest = 0;
  for ( int Window = 0; Window < 20; ++Window )
  {
    auto pView = std::make_unique< VTestView >( pScene );
    Watch.Follow( *pView );
    const QPointer pItem = pView->pItem;
    pView->show();
    const auto Last = Random() % 40;
    for ( unsigned Turn = 0; Turn < Last; ++Turn )
    {
      pView->Hover( Place );
      if ( Random() % 3 == 0 )
      {
        pView->Click( Place );
      }
      pView->pItem->SetFocusSelection( Random() % 8 == 0 );
      pView->pItem->update();
      Turns( 1, 5 );
      std::this_thread::sleep_for( std::chrono::microseconds( Random() % 4000 ) );
    }
    Longest = std::max( Longest, pView->Drawn() );
    const auto End = Random() % 4; // or the window goes as it is
    if ( End == 0 )
    {
      pView->close();
    }
    else if ( End == 1 )
    {
      delete pView->pItem;
    }
    else if ( End == 2 )
    {
      pView->pItem->SetScene( nullptr );
      pView->pItem->update();
      Turns( 1, 5 );
    }
    pView.reset();
    EXPECT_TRUE( pItem.isNull() );
  }
  EXPECT_GT( Longest, 3u ) << "some of them drew";
  EXPECT_GT( Watch.Starts, 5 );
}

TEST_F( VWindowLife, TwentyLostContextsAreRebuiltAndShowTheSame )
{
  VTestView View( pScene );
  Watch.Follow( View );
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
      View.Click( Place ); // its pick is lost with the context, and taken up again
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
  EXPECT_EQ( View.Selected(), ZEK::VSelection{ Recon( 1 ) } );
  View.Hover( { 600, 40 } );
  pScene->Select( {} );
  ASSERT_TRUE( View.Frames( 3 ) );
  EXPECT_EQ( First, View.grabWindow() );
  View.Click( Place );
  EXPECT_TRUE( View.Selects( { Recon( 1 ) } ) );
  EXPECT_GE( Watch.Starts, 21 );
}

TEST_F( VWindowLife, ViewsOfOneWindowDrawPickAndLoseNoGestureWhileDataArrive )
{
  const VSource Source( *pScene );
  VTestView View( pScene );
  Watch.Follow( View );
  View.show();
  auto* const pSecond = new VSceneFramebufferObject( View.contentItem() );
  View.pItem->setSize( { 320, 360 } );
  pSecond->setSize( { 320, 360 } );
  pSecond->setX( 320 );
  pSecond->SetScene( pScene.get() );
  pSecond->setOption( "ReconstructionScale", 6.0 );
  ASSERT_TRUE( View.Frames( 3 ) );
  EXPECT_EQ( pScene->Initialised, 2 );
  EXPECT_TRUE( qgetenv( "QSG_RENDER_LOOP" ) != "threaded" || pScene->pThread != QThread::currentThread() );
  for ( const double Left : { 0.0, 320.0 } )
  {
    pScene->Select( {} );
    View.Click( ScreenPoint( Point, QSizeF( 320, 360 ) ) + QPointF( Left, 0 ) );
    EXPECT_TRUE( View.Selects( { Recon( 1 ) } ) ) << Left;
  }
  delete pSecond;
  CoreGraphics::VCameraController Expected = View.pItem->Camera();
  View.pMirror = &Expected;
  const QPointF From( 160, 200 );
  std::mt19937 Random( 7 );
  for ( int Turn = 0; Turn < 300; ++Turn )
  {
    View.pItem->setOption( "GlobalAxis", Turn % 2 == 0 );
    const QPointF To( 10 + Random() % 300, 50 + Random() % 250 );
    const Qt::MouseButton Button = Random() % 2 == 0 ? Qt::LeftButton : Qt::RightButton;
    switch ( Random() % 8 )
    {
    case 0:
      Expected.SetViewType( Turn % CoreGraphics::ViewTypeCount );
      View.pItem->SetCameraType( Turn % CoreGraphics::ViewTypeCount );
      break;
    case 1:
    case 2:
    case 3:
      View.Wheel( Random() % 2 == 0 ? 120 : -120 );
      break;
    default:
      View.Mouse( QEvent::MouseButtonPress, From, Button, Button );
      View.Mouse( QEvent::MouseMove, To, Qt::NoButton, Button );
      View.Mouse( QEvent::MouseButtonRelease, To, Button );
    }
    if ( Random() % 3 == 0 )
    {
      View.pItem->update();
      Turns( 1, 5 );
      std::this_thread::sleep_for( std::chrono::microseconds( Random() % 3000 ) );
    }
  }
  ASSERT_TRUE( View.Frames( 30 ) );
  const QVariantMap Drawn = View.pItem->frameReport()["camera"].toMap();
  const CoreGraphics::VCameraFields& rExpected = Expected.Fields();
  EXPECT_EQ( Drawn["viewType"], CoreGraphics::ViewTypeName( rExpected.viewType ) );
  EXPECT_EQ( Drawn["distance"].toFloat(), rExpected.distance );
  EXPECT_EQ( Drawn["azimuth"].toFloat(), rExpected.azimuth );
  EXPECT_EQ( Drawn["tilt"].toFloat(), rExpected.tilt );
  EXPECT_EQ( Drawn["orthoScale"].toFloat(), rExpected.orthoScale );
  EXPECT_EQ( View.pItem->Camera().Fields().centre, rExpected.centre );
  // Framing moves the camera on the render thread.
  pScene->Select( { Recon( 1 ) } );
  View.pItem->SetFocusSelection( true );
  ASSERT_TRUE( View.Frames( 3 ) );
  EXPECT_EQ( View.pItem->Camera().Fields().centre, QVector3D( 1500, 300, 900 ) );
}

// A widget draws on the GUI thread, so that its windows may share a scene whatever the render loop.
TEST_F( VWindowLife, OneSceneOverTwoTopLevelWindowsAndAViewThatMovesBetweenThem )
{
  QWidget Left, Right;
  for ( QWidget* const pTop : { &Left, &Right } )
  {
    pTop->resize( Size );
    pTop->show();
  }
  auto* const pA = new VTestWidget( pScene, &Left );
  auto* const pB = new VTestWidget( pScene, &Right );
  for ( VTestWidget* const pWidget : { pA, pB } )
  {
    Watch.Follow( *pWidget->quickWindow() );
    pWidget->show();
    ASSERT_TRUE( pWidget->Frames( 3 ) );
  }
  const QImage First = pA->grabFramebuffer();
  EXPECT_EQ( First, pB->grabFramebuffer() );
  for ( int Move = 0; Move < 20; ++Move )
  {
    pB->setParent( Move % 2 == 0 ? &Left : &Right );
    pB->show();
    ASSERT_TRUE( pB->Frames( 3 ) ) << Move;
    ASSERT_EQ( First, pB->grabFramebuffer() ) << Move;
  }
  delete pB;
  ASSERT_TRUE( pA->Frames( 3 ) );
  EXPECT_EQ( First, pA->grabFramebuffer() );
  EXPECT_GE( Watch.Starts, 3 );
}

TEST_F( VWindowLife, ACameraViewWhoseCamerasComeAndGoUnderTheHand )
{
  // The cameras change on the thread that draws, tiles on that of the hand.
  const auto pCameras = std::make_shared< VRenderCallback >();
  pCameras->Function = [this, Step = 0]() mutable
  {
    pScene->SetCameraDefinitions( TestCameras( 3 + ++Step / 4 % 3 ) );
  };
  pScene->AddRenderCallback( pCameras );
  const auto pGrid = std::make_shared< VCameraGrid >( false );
  std::set< int > Counts;
  {
    VSource Source( *pScene );
    VTestView Window( pScene );
    Watch.Follow( Window );
    Window.pItem->SetCameraGrid( pGrid.get() );
    Window.pItem->setOption( "CameraView", true );
    Window.show();
    const auto Work = [&, Turn = 0]() mutable
    {
      const QPointF There( 20 + Turn * 7 % 600, 20 + Turn * 11 % 320 );
      ++Turn % 8 == 0 ? Window.Press( There ) : Turn % 8 == 7 ? Window.Release( There ) : Window.Drag( There );
      Window.pItem->setWidth( 400 + Turn % 200 );
      Window.pItem->update();
      Counts.insert( pGrid->Count() );
      return Window.Drawn() > 60 && Counts.size() > 3;
    };
    EXPECT_TRUE( Until( Work ) );
  }
  pCameras->bDone = true;
  pScene->MarkDirty();
  pScene->ProcessPending();
  EXPECT_EQ( Counts, ( std::set< int >{ 0, 3, 4, 5 } ) );
}

} // namespace MoxelGraphics
