#include <HostWindow/MainWindow.h>

#include <TestSupport/Paths.h>

#include <QtCore/QElapsedTimer>
#include <QtTest/QTest>
#include <QtWidgets/QAbstractButton>
#include <QtWidgets/QDialog>

#include <gtest/gtest.h>

using namespace HostWindow;

namespace
{
bool SpinUntil( const std::function< bool() >& i_rDone )
{
  QElapsedTimer Timer;
  Timer.start();
  while ( !i_rDone() && Timer.elapsed() < 60'000 )
  {
    QCoreApplication::processEvents( QEventLoop::AllEvents, 10 );
  }
  return i_rDone();
}

/// A main window with the real module, on a live capture that stands still.
class AltToSelect : public testing::Test
{
protected:
  void SetUp() override
  {
    qputenv( "XDG_CONFIG_HOME", m_Folder.Path().c_str() );
    qputenv( "XDG_DATA_HOME", m_Folder.Path().c_str() );
    m_pSession = std::make_unique< VSession >( VCommonOptions() );
    ASSERT_EQ( m_pSession->StartPlugin(), "" );
    m_pSession->GoLive();
    m_pWindow = std::make_unique< VMainWindow >( *m_pSession );
    // Small pictures, for a renderer without a graphics card.
    m_pWindow->resize( 420, 420 );
    m_pWindow->show();
    ASSERT_TRUE( QTest::qWaitForWindowExposed( m_pWindow.get() ) );
    m_View = m_pWindow->Windows().at( 0 )->View();
    ASSERT_TRUE( SpinUntil(
        [this]
        {
          return m_View.Item() && m_View.Frames() > 3 && m_pSession->ShownFrame() > 3;
        } ) );
    m_pSession->SetSeen( false );
    Settle();
  }
  void TearDown() override
  {
    m_pWindow.reset();
    m_pSession.reset();
  }

  /// Enough frames to draw a pick, take its result, and show it.
  void Settle()
  {
    const qint64 Goal = m_View.Frames() + 6;
    EXPECT_TRUE( SpinUntil(
        [&]
        {
          return m_View.Frames() >= Goal;
        } ) );
  }
  QVariant Camera() const { return m_View.FrameReport().value( "camera" ); }
  std::size_t Selected() const
  {
    return m_pSession->Host().Selection()->Get( ZEK::ISelectionService::EPrimary ).size();
  }
  /// Across most of the view with the left button, by what the window system says to the window.
  void Drag( Qt::KeyboardModifiers i_Modifiers )
  {
    QQuickWidget* const pWidget = m_View.Widget();
    QWindow* const pHandle = m_pWindow->windowHandle();
    const auto At = [&]( double i_Share )
    {
      return pWidget->mapTo( m_pWindow.get(), QPointF( pWidget->width(), pWidget->height() ) * i_Share ).toPoint();
    };
    QTest::mouseMove( pHandle, At( 0.06 ) );
    QTest::mousePress( pHandle, Qt::LeftButton, i_Modifiers, At( 0.06 ) );
    for ( const double Share : { 0.2, 0.4, 0.6, 0.8, 0.94 } )
    {
      QTest::mouseMove( pHandle, At( Share ) );
      QTest::qWait( 30 );
    }
    QTest::mouseRelease( pHandle, Qt::LeftButton, i_Modifiers, At( 0.94 ) );
    Settle();
  }
  /// What a plain drag, and one with Alt, do now; nothing is selected afterwards.
  void ExpectPlainDragNavigates( bool i_bNavigates )
  {
    for ( const Qt::KeyboardModifiers Modifiers : { Qt::NoModifier, Qt::AltModifier } )
    {
      const bool bNavigates = ( Modifiers == Qt::NoModifier ) == i_bNavigates;
      const QVariant Before = Camera();
      Drag( Modifiers );
      EXPECT_EQ( Camera() != Before, bNavigates ) << "with Alt: " << ( Modifiers == Qt::AltModifier );
      EXPECT_EQ( Selected() > 0, !bNavigates ) << "with Alt: " << ( Modifiers == Qt::AltModifier );
      m_pSession->Host().Selection()->Set( ZEK::ISelectionService::EPrimary, {} );
      Settle();
    }
  }

  TestSupport::VTemporaryDir m_Folder;
  std::unique_ptr< VSession > m_pSession;
  std::unique_ptr< VMainWindow > m_pWindow;
  VSceneView m_View;
};
} // namespace

TEST_F( AltToSelect, SwitchedInThePreferencesHoldsFromTheNextMouseEventOn )
{
  ExpectPlainDragNavigates( true );

  m_pWindow->ShowPreferences();
  auto* const pPreferences = m_pWindow->findChild< QDialog* >( "Preferences" );
  ASSERT_TRUE( pPreferences && QTest::qWaitForWindowExposed( pPreferences ) );
  auto* const pField = pPreferences->findChild< QWidget* >( "Preferences/Core/AltToSelect" );
  auto* const pBox = qobject_cast< QAbstractButton* >( pField->focusProxy() );
  ASSERT_TRUE( pBox && pBox->isChecked() );
  QTest::mouseClick( pPreferences->windowHandle(), Qt::LeftButton, {},
                     pBox->mapTo( pPreferences, QPoint( 8, pBox->height() / 2 ) ) );
  EXPECT_FALSE( pBox->isChecked() );
  ExpectPlainDragNavigates( false );
  EXPECT_TRUE( m_pWindow->findChild< QLabel* >( "Gestures" )->text().startsWith( "Alt+drag: orbit" ) );

  m_pWindow->activateWindow();
  ASSERT_TRUE( QTest::qWaitForWindowActive( m_pWindow.get() ) );
  QTest::keyClick( m_pWindow->windowHandle(), Qt::Key_Z, Qt::ControlModifier );
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return pBox->isChecked();
      } ) );
  ExpectPlainDragNavigates( true );
}
