#include "ItemFixture.h"

#include <TestSupport/LogGuard.h>

#include <QtCore/QVersionNumber>

namespace MoxelGraphics
{

TEST_F( VItemTest, ThePictureStandsUpright )
{
  pScene->pExtra->Function = DrawCorner;
  Frames( 2 );
  const QImage Image = pWidget->grabFramebuffer();
  ASSERT_GE( Image.width(), Size.width() );
  const QRgb Red = QColor( Qt::red ).rgb();
  EXPECT_EQ( Image.pixel( 4, Image.height() - 5 ) | 0xFF000000, Red );
  EXPECT_NE( Image.pixel( 4, 4 ) | 0xFF000000, Red );
  EXPECT_NE( Image.pixel( Image.width() - 5, Image.height() - 5 ) | 0xFF000000, Red );
}

TEST_F( VItemTest, OnlyTheItemsOwnUpdateDrawsAFrame )
{
  // Nor does a pointer that hovers keep the view busy.
  pWidget->Hover( Place( 1 ) );
  ASSERT_TRUE( pWidget->Preselects( { Recon( 1 ) } ) );
  Frames( 1 );
  Settle();
  const quint64 Before = Drawn();
  for ( int Turn = 0; Turn < 10; ++Turn )
  {
    pWidget->update();
    Turns( 1 );
  }
  EXPECT_EQ( Drawn(), Before );
  Frames( 2 );
}

TEST_F( VItemTest, AClickWithinOneTurnIsCommitted )
{
  const auto pAnnounced = Counted( pItem, &VSceneFramebufferObject::SelectionChanged );
  Click( Place( 1 ) );
  EXPECT_EQ( pWidget->Selected(), ZEK::VSelection{ Recon( 1 ) } );
  EXPECT_EQ( pItem->PickedLabels(), std::vector< std::string >{ "point 1" } );
  EXPECT_EQ( *pAnnounced, 1 );
  // The commit stands even when the pointer is gone before the frame that picks.
  pWidget->Click( Place( 2 ) );
  pWidget->Hover( Empty );
  EXPECT_TRUE( pWidget->Selects( { Recon( 2 ) } ) );
  EXPECT_EQ( *pAnnounced, 2 );
}

TEST_F( VItemTest, ModifiersSayWhatAClickDoesToTheSelection )
{
  const auto Shift = Qt::ShiftModifier, Control = Qt::ControlModifier;
  struct VCase
  {
    QPointF Place;
    Qt::KeyboardModifiers Modifiers;
    ZEK::VSelection Selected;
  };
  const VCase Cases[] = {
      { Place( 0 ), {}, { Recon( 0 ) } },
      { Place( 1 ), Shift, { Recon( 0 ), Recon( 1 ) } },
      { Place( 0 ), Control, { Recon( 1 ) } },
      { Place( 0 ), Control, { Recon( 1 ), Recon( 0 ) } },
      { Place( 1 ), Shift | Control, { Recon( 0 ) } },
      { Empty, Shift, { Recon( 0 ) } },
      { Empty, Control, { Recon( 0 ) } },
      { Place( 2 ), {}, { Recon( 2 ) } },
      { Empty, {}, {} },
  };
  for ( const VCase& rCase : Cases )
  {
    Click( rCase.Place, rCase.Modifiers );
    EXPECT_EQ( pWidget->Selected(), rCase.Selected ) << "click " << &rCase - Cases;
  }
}

TEST_F( VItemTest, ADragIsNoClickAndAShakingHandIs )
{
  const float Azimuth = Camera().azimuth;
  pWidget->Press( Place( 0 ) );
  pWidget->Drag( Place( 0 ) + QPointF( 10, 0 ) );
  EXPECT_NE( Camera().azimuth, Azimuth );
  pWidget->Drag( Place( 0 ) );
  pWidget->Release( Place( 0 ) );
  EXPECT_FALSE( pItem->IsPickPending() );
  pWidget->Press( Place( 0 ) );
  pWidget->Drag( Place( 0 ) + QPointF( 2, 0 ) );
  pWidget->Drag( Place( 0 ) );
  pWidget->Release( Place( 0 ) );
  EXPECT_TRUE( pItem->IsPickPending() );
  EXPECT_TRUE( pWidget->Selects( { Recon( 0 ) } ) );
}

TEST_F( VItemTest, HoverShowsTheLabelAndLeavesNoTrace )
{
  const auto pTips = Counted( pItem, &VSceneFramebufferObject::ToolTipTextChanged );
  pWidget->Hover( Place( 1 ) );
  ASSERT_TRUE( pWidget->Preselects( { Recon( 1 ) } ) );
  Frames( 2 );
  EXPECT_EQ( pItem->ToolTipText(), "point 1" );
  EXPECT_EQ( *pTips, 1 );
  EXPECT_TRUE( pWidget->Selected().empty() );
  EXPECT_EQ( pItem->frameReport()["labels"].toStringList(), QStringList{ "point 1" } );
  pWidget->Hover( Empty );
  EXPECT_TRUE( pWidget->Preselects( {} ) );
  pWidget->Hover( Place( 0 ) );
  ASSERT_TRUE( pWidget->Preselects( { Recon( 0 ) } ) );
  // A click takes the name away. The pointer still lies over the point, so that the next hover may bring it back.
  bool bGone = false;
  QObject::connect( pItem, &VSceneFramebufferObject::ToolTipTextChanged,
                    [&]
                    {
                      bGone = bGone || pItem->ToolTipText().isEmpty();
                    } );
  Click( Place( 0 ) );
  EXPECT_TRUE( bGone );
}

TEST_F( VItemTest, AltDrawsABand )
{
  const QPointF From = Place( 2 ) - QPointF( 30, 30 ), To = Place( 2 ) + QPointF( 30, 30 );
  pWidget->Press( From, Qt::AltModifier );
  pWidget->Drag( To, Qt::AltModifier );
  ASSERT_TRUE( pWidget->Preselects( { Recon( 2 ) } ) );
  Frames( 1 );
  // The band's edge is drawn in its colour, its inside tints what lies below.
  const QImage Image = pWidget->grabFramebuffer();
  const QPoint Edge = ( QPointF( From.x() + 30, From.y() ) * pWidget->devicePixelRatioF() ).toPoint();
  int Orange = 0;
  for ( int Row = -2; Row <= 2; ++Row )
  {
    const QRgb Seen = Image.pixel( Edge + QPoint( 0, Row ) );
    Orange = std::max( Orange, qRed( Seen ) - qBlue( Seen ) );
  }
  EXPECT_GT( Orange, 80 );
  pWidget->Release( To, Qt::AltModifier );
  EXPECT_TRUE( pWidget->Selects( { Recon( 2 ) } ) );
  EXPECT_TRUE( pWidget->Preselected().empty() );
  // Press, move and release before any frame: the band begins where the press was.
  pWidget->Press( { 1, 1 }, Qt::AltModifier );
  pWidget->Drag( { 639, 359 }, Qt::AltModifier );
  pWidget->Release( { 639, 359 }, Qt::AltModifier );
  EXPECT_TRUE( Until(
      [&]
      {
        return pWidget->Selected().size() == 3;
      } ) );
}

TEST_F( VItemTest, OptionsReachTheViewFromAllSides )
{
  pItem->setOption( "YUp", true );
  EXPECT_TRUE( pScene->YUp() );
  EXPECT_TRUE( pItem->OptionsMap().value( "YUp" ).toBool() );
  pItem->setOption( "ReconstructionScale", "huge" );
  EXPECT_EQ( pItem->Options().ReconstructionScale, 6.0f );
  EXPECT_EQ( pItem->OptionsMap().value( "ReconstructionScale" ).toFloat(), 6.0f );
  // A document writes to the map, also keys that nobody knows.
  QQmlComponent Writer( pWidget->engine() );
  Writer.setData( "import QtQuick\nItem { property QtObject options\n"
                  "function go() { options['3D'] = false; options['PropSubject-Axes'] = true; options.Show3D = true }}",
                  {} );
  const std::unique_ptr< QObject > pWriter( Writer.create() );
  pWriter->setProperty( "options", QVariant::fromValue( pItem->SceneOptionsObject() ) );
  QMetaObject::invokeMethod( pWriter.get(), "go" );
  EXPECT_FALSE( pItem->Options().Show3DOverlay );
  EXPECT_TRUE( pItem->Options().PropSubject.Axes );
  // Taken as a whole they are announced once.
  const auto pAnnounced = Counted( pItem, &VSceneFramebufferObject::SceneOptionsChanged );
  VSceneOptions Whole;
  Whole.SceneMesh.SkinXRay = true;
  pItem->SetOptions( Whole );
  EXPECT_EQ( *pAnnounced, 1 );
  EXPECT_TRUE( pItem->Options() == Whole );
  EXPECT_TRUE( pItem->OptionsMap().value( "SceneMesh-SkinXRay" ).toBool() );
  EXPECT_EQ( pItem->OptionsMap().value( "ReconstructionScale" ).toFloat(), 1.0f );
  EXPECT_FALSE( pScene->YUp() );
}

TEST_F( VItemTest, KeysWheelAndFramingMoveTheCamera )
{
  pWidget->Wheel( 120 );
  EXPECT_NEAR( Camera().distance, 6300, 1 );
  pItem->forceActiveFocus();
  EXPECT_TRUE( Key( Qt::Key_Home ) );
  EXPECT_NEAR( Camera().distance, 7000, 1 );
  EXPECT_FALSE( Key( Qt::Key_F7 ) );
  pScene->Select( { Recon( 1 ) } );
  for ( int Time = 0; Time < 2; ++Time )
  {
    Key( Qt::Key_Home );
    ASSERT_EQ( Camera().centre.x(), 0 );
    pItem->setProperty( "focusSelection", true );
    Frames( 2 );
    EXPECT_EQ( Camera().centre, QVector3D( 1500, 300, 900 ) );
    EXPECT_LT( Camera().distance, 1000 );
  }
}

TEST_F( VItemTest, HiddenAndShownAgain )
{
  const auto Update = [&]
  {
    for ( int Turn = 0; Turn < 5; ++Turn )
    {
      pItem->update();
      Turns( 1, 20 );
    }
  };
  pItem->setVisible( false );
  Turns( 1 );
  const quint64 Before = Drawn();
  pScene->MarkDirty();
  Update();
  EXPECT_LE( Drawn(), Before + 1 );
  pItem->SetCameraType( CoreGraphics::EViewLeft ); // nobody sees it, and it is kept
  EXPECT_TRUE( pScene->IsPending() );
  pItem->setVisible( true );
  pItem->setSize( { 0, 0 } );
  Update();
  pItem->setSize( Size );
  Frames( 2 );
  EXPECT_FALSE( pScene->IsPending() );
  EXPECT_EQ( pItem->frameReport()["camera"].toMap()["viewType"], "Left" );
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
  EXPECT_EQ( Gl["width"].toInt(), std::lround( Size.width() * pWidget->devicePixelRatioF() ) );
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
  pWidget->Click( Place( 0 ) );
  pWidget->grabFramebuffer();
  delete std::exchange( pItem, nullptr );
  pScene->MarkDirty();
  Turns( 5 );
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
  VTestView Window( pScene );
  Window.show();
  EXPECT_TRUE( Until(
      [&]
      {
        Window.pItem->update();
        return !Window.pItem->Notice().isEmpty();
      } ) );
  Window.pItem->update();
  Turns( 5, 20 );
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
