#include "ItemFixture.h"

#include <TestSupport/LogGuard.h>

#include <QtCore/QVersionNumber>
#include <QtQuick/QQuickWindow>

namespace MoxelGraphics
{

TEST_F( VItemTest, ThePictureStandsUpright )
{
  pScene->pCorner->bShown = true;
  Frames( 2 );
  const QImage Image = Widget.grabFramebuffer();
  ASSERT_GE( Image.width(), Size.width() );
  const QRgb Red = QColor( Qt::red ).rgb();
  EXPECT_EQ( Image.pixel( 4, Image.height() - 5 ) | 0xFF000000, Red );
  EXPECT_NE( Image.pixel( 4, 4 ) | 0xFF000000, Red );
  EXPECT_NE( Image.pixel( Image.width() - 5, Image.height() - 5 ) | 0xFF000000, Red );
}

TEST_F( VItemTest, OnlyTheItemsOwnUpdateDrawsAFrame )
{
  Frames( 1 );
  Settle();
  // Figures are taken when the next frame begins, so a frame shows in the report one update later.
  const quint64 Before = Drawn();
  for ( int Turn = 0; Turn < 10; ++Turn )
  {
    Widget.update();
    QCoreApplication::processEvents( QEventLoop::AllEvents, 10 );
  }
  EXPECT_EQ( Drawn(), Before );
  Frames( 2 );
  EXPECT_GE( Drawn(), Before + 2 );
}

TEST_F( VItemTest, AClickWithinOneTurnIsCommitted )
{
  int Announced = 0;
  QObject::connect( pItem, &VSceneFramebufferObject::SelectionChanged,
                    [&]
                    {
                      ++Announced;
                    } );
  Click( Place( 1 ) );
  EXPECT_EQ( Selected(), ZEK::VSelection{ Recon( 1 ) } );
  EXPECT_EQ( pItem->PickedLabels(), std::vector< std::string >{ "point 1" } );
  EXPECT_EQ( Announced, 1 );
  // The commit stands even when the pointer is gone before the frame that picks.
  Mouse( QEvent::MouseButtonPress, Place( 2 ), Qt::LeftButton, Qt::LeftButton );
  Mouse( QEvent::MouseButtonRelease, Place( 2 ), Qt::LeftButton, Qt::NoButton );
  Hover( { 600, 40 } );
  ASSERT_TRUE( Until(
      [&]
      {
        return Announced == 2;
      } ) );
  EXPECT_EQ( Selected(), ZEK::VSelection{ Recon( 2 ) } );
}

TEST_F( VItemTest, ModifiersSayWhatAClickDoesToTheSelection )
{
  const QPointF Empty( 600, 40 );
  Click( Place( 0 ) );
  Click( Place( 1 ), Qt::ShiftModifier );
  EXPECT_EQ( Selected(), ( ZEK::VSelection{ Recon( 0 ), Recon( 1 ) } ) );
  Click( Place( 0 ), Qt::ControlModifier );
  EXPECT_EQ( Selected(), ZEK::VSelection{ Recon( 1 ) } );
  Click( Place( 0 ), Qt::ControlModifier );
  EXPECT_EQ( Selected(), ( ZEK::VSelection{ Recon( 1 ), Recon( 0 ) } ) );
  Click( Place( 1 ), Qt::ShiftModifier | Qt::ControlModifier );
  EXPECT_EQ( Selected(), ZEK::VSelection{ Recon( 0 ) } );
  Click( Empty, Qt::ShiftModifier );
  Click( Empty, Qt::ControlModifier );
  EXPECT_EQ( Selected(), ZEK::VSelection{ Recon( 0 ) } );
  Click( Place( 2 ) );
  EXPECT_EQ( Selected(), ZEK::VSelection{ Recon( 2 ) } );
  Click( Empty );
  EXPECT_TRUE( Selected().empty() );
}

TEST_F( VItemTest, ADragIsNoClickAndAShakingHandIs )
{
  const float Azimuth = pItem->Camera().Fields().azimuth;
  Mouse( QEvent::MouseButtonPress, Place( 0 ), Qt::LeftButton, Qt::LeftButton );
  Mouse( QEvent::MouseMove, Place( 0 ) + QPointF( 10, 0 ), Qt::NoButton, Qt::LeftButton );
  EXPECT_NE( pItem->Camera().Fields().azimuth, Azimuth );
  Mouse( QEvent::MouseMove, Place( 0 ), Qt::NoButton, Qt::LeftButton );
  Mouse( QEvent::MouseButtonRelease, Place( 0 ), Qt::LeftButton, Qt::NoButton );
  EXPECT_FALSE( pItem->IsPickPending() );
  Mouse( QEvent::MouseButtonPress, Place( 0 ), Qt::LeftButton, Qt::LeftButton );
  Mouse( QEvent::MouseMove, Place( 0 ) + QPointF( 2, 0 ), Qt::NoButton, Qt::LeftButton );
  Mouse( QEvent::MouseMove, Place( 0 ), Qt::NoButton, Qt::LeftButton );
  Mouse( QEvent::MouseButtonRelease, Place( 0 ), Qt::LeftButton, Qt::NoButton );
  EXPECT_TRUE( pItem->IsPickPending() );
  ASSERT_TRUE( Until(
      [&]
      {
        return Selected() == ZEK::VSelection{ Recon( 0 ) };
      } ) );
}

TEST_F( VItemTest, HoverShowsTheLabelAndLeavesNoTrace )
{
  QStringList Tips;
  QObject::connect( pItem, &VSceneFramebufferObject::ToolTipTextChanged,
                    [&]
                    {
                      Tips.append( pItem->ToolTipText() );
                    } );
  Hover( Place( 1 ) );
  ASSERT_TRUE( Until(
      [&]
      {
        return !Tips.isEmpty();
      } ) );
  EXPECT_EQ( pItem->ToolTipText(), "point 1" );
  EXPECT_EQ( Preselected(), ZEK::VSelection{ Recon( 1 ) } );
  EXPECT_TRUE( Selected().empty() );
  Frames( 2 );
  EXPECT_EQ( pItem->frameReport()["labels"].toStringList(), QStringList{ "point 1" } );
  // Moving off what was hovered empties the preselection, and a click does.
  Hover( { 600, 40 } );
  ASSERT_TRUE( Until(
      [&]
      {
        return Preselected().empty();
      } ) );
  Hover( Place( 0 ) );
  ASSERT_TRUE( Until(
      [&]
      {
        return !Preselected().empty();
      } ) );
  const auto Before = Tips.size();
  Click( Place( 0 ) );
  // The pointer still lies over the point, so that the next hover may have brought the name back by now.
  EXPECT_TRUE( Tips.mid( Before ).contains( QString() ) );
}

TEST_F( VItemTest, AHoveringPointerDoesNotKeepTheViewBusy )
{
  Hover( Place( 1 ) );
  ASSERT_TRUE( Until(
      [&]
      {
        return !Preselected().empty();
      } ) );
  Settle();
  const quint64 Before = Drawn();
  for ( int Turn = 0; Turn < 20; ++Turn )
  {
    QCoreApplication::processEvents( QEventLoop::AllEvents, 10 );
  }
  EXPECT_EQ( Drawn(), Before );
}

TEST_F( VItemTest, AltDrawsABand )
{
  const QPointF From = Place( 2 ) - QPointF( 30, 30 ), To = Place( 2 ) + QPointF( 30, 30 );
  Mouse( QEvent::MouseButtonPress, From, Qt::LeftButton, Qt::LeftButton, Qt::AltModifier );
  Mouse( QEvent::MouseMove, To, Qt::NoButton, Qt::LeftButton, Qt::AltModifier );
  ASSERT_TRUE( Until(
      [&]
      {
        return Preselected() == ZEK::VSelection{ Recon( 2 ) };
      } ) );
  Frames( 1 );
  // The band's edge is drawn in its colour, its inside tints what lies below.
  const QImage Image = Widget.grabFramebuffer();
  const double Ratio = Widget.devicePixelRatioF();
  const QPoint Edge = ( QPointF( From.x() + 30, From.y() ) * Ratio ).toPoint();
  int Orange = 0;
  for ( int Row = -2; Row <= 2; ++Row )
  {
    const QRgb Seen = Image.pixel( Edge + QPoint( 0, Row ) );
    Orange = std::max( Orange, qRed( Seen ) - qBlue( Seen ) );
  }
  EXPECT_GT( Orange, 80 );
  Mouse( QEvent::MouseButtonRelease, To, Qt::LeftButton, Qt::NoButton, Qt::AltModifier );
  ASSERT_TRUE( Until(
      [&]
      {
        return Selected() == ZEK::VSelection{ Recon( 2 ) };
      } ) );
  EXPECT_TRUE( Preselected().empty() );
  // Press, move and release before any frame: the band begins where the press was.
  Mouse( QEvent::MouseButtonPress, { 1, 1 }, Qt::LeftButton, Qt::LeftButton, Qt::AltModifier );
  Mouse( QEvent::MouseMove, { 639, 359 }, Qt::NoButton, Qt::LeftButton, Qt::AltModifier );
  Mouse( QEvent::MouseButtonRelease, { 639, 359 }, Qt::LeftButton, Qt::NoButton, Qt::AltModifier );
  ASSERT_TRUE( Until(
      [&]
      {
        return Selected().size() == 3;
      } ) );
}

TEST_F( VItemTest, OptionsReachTheViewFromBothSides )
{
  pItem->setOption( "YUp", true );
  EXPECT_TRUE( pScene->YUp() );
  EXPECT_TRUE( pItem->OptionsMap().value( "YUp" ).toBool() );
  pItem->setOption( "ReconstructionScale", "huge" );
  EXPECT_EQ( pItem->Options().ReconstructionScale, 6.0f );
  EXPECT_EQ( pItem->OptionsMap().value( "ReconstructionScale" ).toFloat(), 6.0f );
  // A document writes to the map, also keys that nobody knows.
  QQmlComponent Writer( &Engine );
  Writer.setData( "import QtQuick\nItem { property QtObject options\n"
                  "function go() { options['3D'] = false; options['PropSubject-Axes'] = true; options.Show3D = true }}",
                  {} );
  const std::unique_ptr< QObject > pWriter( Writer.create() );
  pWriter->setProperty( "options", QVariant::fromValue( pItem->SceneOptionsObject() ) );
  QMetaObject::invokeMethod( pWriter.get(), "go" );
  EXPECT_FALSE( pItem->Options().Show3DOverlay );
  EXPECT_TRUE( pItem->Options().PropSubject.Axes );
}

TEST_F( VItemTest, FramingTwiceFramesTwice )
{
  pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, { Recon( 1 ) } );
  for ( int Time = 0; Time < 2; ++Time )
  {
    Press( Qt::Key_Home );
    ASSERT_EQ( pItem->Camera().Fields().centre.x(), 0 );
    pItem->setProperty( "focusSelection", true );
    Frames( 2 );
    EXPECT_EQ( pItem->Camera().Fields().centre, QVector3D( 1500, 300, 900 ) );
  }
}

TEST_F( VItemTest, KeysAndWheelMoveTheCamera )
{
  Wheel( 120 );
  EXPECT_NEAR( pItem->Camera().Fields().distance, 6300, 1 );
  pItem->forceActiveFocus();
  QKeyEvent Key( QEvent::KeyPress, Qt::Key_Home, Qt::NoModifier );
  QCoreApplication::sendEvent( pItem, &Key );
  EXPECT_TRUE( Key.isAccepted() );
  EXPECT_NEAR( pItem->Camera().Fields().distance, 7000, 1 );
  QKeyEvent Other( QEvent::KeyPress, Qt::Key_F7, Qt::NoModifier );
  QCoreApplication::sendEvent( pItem, &Other );
  EXPECT_FALSE( Other.isAccepted() );
}

TEST_F( VItemTest, HiddenAndShownAgain )
{
  Frames( 1 );
  pItem->setVisible( false );
  QCoreApplication::processEvents();
  const quint64 Before = Drawn();
  pScene->MarkDirty();
  for ( int Turn = 0; Turn < 5; ++Turn )
  {
    pItem->update();
    QCoreApplication::processEvents( QEventLoop::AllEvents, 20 );
  }
  EXPECT_LE( Drawn(), Before + 1 );
  EXPECT_TRUE( pScene->IsPending() );
  pItem->setVisible( true );
  pItem->setSize( { 0, 0 } );
  for ( int Turn = 0; Turn < 5; ++Turn )
  {
    pItem->update();
    QCoreApplication::processEvents( QEventLoop::AllEvents, 20 );
  }
  pItem->setSize( Size );
  Frames( 2 );
  EXPECT_FALSE( pScene->IsPending() );
}

TEST_F( VItemTest, TheReportTellsOfTheFrame )
{
  pItem->setReporting( true );
  pItem->SetCameraType( CoreGraphics::EViewLeft );
  Frames( 3 );
  const QVariantMap Report = pItem->frameReport();
  EXPECT_EQ( Report["camera"].toMap()["viewType"], "Left" );
  const QVariantMap Gl = Report["gl"].toMap();
  EXPECT_EQ( Gl["profile"], "core" );
  EXPECT_EQ( Gl["width"].toInt(), std::lround( Size.width() * Widget.devicePixelRatioF() ) );
  EXPECT_FALSE( Gl["renderer"].toString().isEmpty() );
  EXPECT_GT( Report["timings"].toMap()["draw_ms"].toDouble(), 0.0 );
  EXPECT_GT( Report["draw_calls"].toInt(), 3 );
  // Run with MESA_GL_VERSION_OVERRIDE=3.3 as well: the view then says that it draws below its minimum.
  const bool bGoodEnough = QVersionNumber::fromString( Gl["version"].toString() ) >= QVersionNumber( 4, 3 );
  EXPECT_EQ( Report["notice"].toString().isEmpty(), bGoodEnough ) << Gl["version"].toString().toStdString();
  EXPECT_EQ( pItem->Notice(), Report["notice"].toString() );
}

TEST_F( VItemTest, AWindowThatClosesWhileAPickIsUnderWay )
{
  Mouse( QEvent::MouseButtonPress, Place( 0 ), Qt::LeftButton, Qt::LeftButton );
  Mouse( QEvent::MouseButtonRelease, Place( 0 ), Qt::LeftButton, Qt::NoButton );
  Widget.grabFramebuffer();
  delete pItem;
  pItem = nullptr;
  pScene->MarkDirty();
  for ( int Turn = 0; Turn < 5; ++Turn )
  {
    QCoreApplication::processEvents( QEventLoop::AllEvents, 10 );
  }
  EXPECT_EQ( pScene.use_count(), 1 );
}

// Run with QT_QUICK_BACKEND=software.
TEST( SoftwareView, SaysThatItCannotDraw )
{
  if ( qgetenv( "QT_QUICK_BACKEND" ) != "software" )
  {
    GTEST_SKIP() << "Qt Quick draws with OpenGL here";
  }
  const auto pScene = std::make_shared< VTestScene >();
  QQuickWindow Window;
  VSceneFramebufferObject Item( Window.contentItem() );
  Item.setSize( Size );
  Item.SetScene( pScene.get() );
  Window.resize( Size );
  Window.show();
  const QDeadlineTimer Patience( 20000 );
  while ( Item.Notice().isEmpty() && !Patience.hasExpired() )
  {
    Item.update();
    QCoreApplication::processEvents( QEventLoop::AllEvents, 20 );
  }
  EXPECT_FALSE( Item.Notice().isEmpty() );
  for ( int Turn = 0; Turn < 5; ++Turn )
  {
    Item.update();
    QCoreApplication::processEvents( QEventLoop::AllEvents, 20 );
  }
  const auto Lines = TestSupport::LogTexts( "MoxelGraphics", ZEK::ELogFailure );
  ASSERT_EQ( Lines.size(), 1u );
  TestSupport::ExpectFailureLine( Lines.front() );
}

TEST( SceneItem, WhatIsNoSceneIsRefused )
{
  VSceneFramebufferObject Item;
  QObject Stranger;
  TestSupport::ExpectFailureLine( "The scene of a view must be a VMoxelScene held by shared pointer" );
  Item.SetScene( &Stranger );
  EXPECT_EQ( Item.Scene(), nullptr );
  EXPECT_TRUE( Item.mirrorVertically() );
}

} // namespace MoxelGraphics
