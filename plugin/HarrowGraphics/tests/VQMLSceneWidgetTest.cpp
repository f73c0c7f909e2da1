#include <HarrowGraphics/VHarrowScene.h>
#include <HarrowGraphics/VQMLSceneWidget.h>
#include <HarrowGraphics/VSceneManager.h>
#include <HarrowGraphics/VSceneWindowContent.h>
#include <HarrowGraphics/VSceneWindowContentFactory.h>

#include <HostServices/VHost.h>
#include <HostServices/VStateJson.h>
#include <TestSupport/LogGuard.h>
#include <ZEK/CoreUserPreferences.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QElapsedTimer>
#include <QtCore/QMimeData>
#include <QtQml/QQmlContext>
#include <QtQml/QQmlEngine>
#include <QtQml/QQmlPropertyMap>
#include <QtWidgets/QComboBox>
#include <QtWidgets/QVBoxLayout>

#include <gtest/gtest.h>

namespace
{
using HarrowGraphics::VHarrowScene;
using HarrowGraphics::VSceneWindowContent;

class SceneWindow : public testing::Test
{
protected:
  SceneWindow()
  {
    [[maybe_unused]] static const int Registered =
        qmlRegisterType< MoxelGraphics::VSceneFramebufferObject >( "Flow2Graphics", 1, 0, "SceneFramebufferObject" );
    pManager = std::make_shared< HarrowGraphics::VSceneManager >( Host.Application(), Host.Workspace() );
    pFactory = std::make_shared< HarrowGraphics::VSceneWindowContentFactory >(
        Host.Application(), Host.Workspace(), "3D View", pManager, HarrowGraphics::EWindowKind3D );
    Toolbar.setLayout( new QVBoxLayout );
  }

  std::shared_ptr< VSceneWindowContent > Open( const std::string& i_rContext = "Live" )
  {
    std::shared_ptr< HarrowPluginInterface::VWindowFrameContent > pContent;
    pFactory->Create( pContent, Host.Contexts()->Find( i_rContext ), &Toolbar );
    return std::dynamic_pointer_cast< VSceneWindowContent >( pContent );
  }

  HostServices::VHost Host;
  QWidget Toolbar;
  std::shared_ptr< HarrowGraphics::VSceneManager > pManager;
  std::shared_ptr< HarrowGraphics::VSceneWindowContentFactory > pFactory;
};
} // namespace

TEST_F( SceneWindow, WindowsOfOneContextShareTheSceneAndOthersDoNot )
{
  const auto pA = Open();
  const auto pB = Open();
  const auto pC = Open( "Playback" );
  const auto Scene = []( VSceneWindowContent& i_r )
  {
    return i_r.SceneWidget().SceneItem()->Scene();
  };
  ASSERT_NE( pA->SceneWidget().SceneItem(), nullptr );
  EXPECT_EQ( Scene( *pA ), Scene( *pB ) );
  EXPECT_NE( Scene( *pA ), Scene( *pC ) );
}

TEST_F( SceneWindow, AContextThatTheHostDoesNotKnowIsMisuse )
{
  const TestSupport::VAssertRecorder Recorder;
  EXPECT_EQ( pManager->ForContextName( "Nowhere" ).pScene, nullptr );
  EXPECT_EQ( Recorder.Expressions(), std::vector< std::string >{ "pStateCacheContext" } );
  EXPECT_EQ( TestSupport::LogTexts( "SceneManager", 6 ),
             std::vector< std::string >{ "Create scene for context Nowhere" } );
}

TEST_F( SceneWindow, TheToolbarComboTurnsTheViewAndGoesWithTheWindow )
{
  auto pContent = Open();
  auto* const pCombo = Toolbar.findChild< QComboBox* >( "CameraType" );
  ASSERT_NE( pCombo, nullptr );
  pCombo->setCurrentText( "Top" );
  EXPECT_EQ( pContent->SceneWidget().SceneItem()->CameraType(), 5 );
  pContent.reset();
  EXPECT_EQ( Toolbar.findChild< QComboBox* >(), nullptr );
}

TEST_F( SceneWindow, TheTimerAloneKeepsAShownViewDrawing )
{
  const auto pContent = Open();
  const auto Frames = [&]
  {
    return pContent->SceneWidget().SceneItem()->frameReport()["frames"].toULongLong();
  };
  const auto DrawsMore = [&]( qint64 i_LimitMs )
  {
    const quint64 Before = Frames();
    QElapsedTimer Timer;
    for ( Timer.start(); Timer.elapsed() < i_LimitMs && Frames() < Before + 3; )
    {
      QCoreApplication::processEvents( QEventLoop::AllEvents, 10 );
    }
    return Frames() >= Before + 3;
  };
  pContent->resize( 160, 120 );
  pContent->show();
  EXPECT_TRUE( DrawsMore( 20000 ) );
  pContent->hide();
  QCoreApplication::processEvents();
  EXPECT_FALSE( DrawsMore( 300 ) ) << "a hidden view draws nothing";
}

TEST_F( SceneWindow, CommandsAnswerForTheirConditions )
{
  const auto pContent = Open();
  auto& rWidget = pContent->SceneWidget();
  EXPECT_FALSE( pContent->ExecuteCommand( "Workspace3d:TrackObjects" ) );
  EXPECT_EQ( rWidget.tracking(), MoxelGraphics::ETrackNone );
  EXPECT_FALSE( pContent->ExecuteCommand( "Workspace3d:FrameSelected" ) );
  EXPECT_FALSE( pContent->ExecuteCommand( "Workspace3d:TrackingLock" ) );
  EXPECT_FALSE( pContent->ExecuteCommand( "Workspace3d:NoTracking " ) );
  EXPECT_FALSE( pContent->ExecuteCommand( "WorkspaceCamera:ResetZoom" ) );
  EXPECT_TRUE( pContent->ExecuteCommand( "Workspace3d:TrackSelection" ) );
  EXPECT_EQ( rWidget.tracking(), MoxelGraphics::ETrackSelection );
  EXPECT_EQ( rWidget.SceneItem()->Tracking(), MoxelGraphics::ETrackSelection );
  int Taken = 0;
  QObject::connect( rWidget.SceneItem(), &MoxelGraphics::VSceneFramebufferObject::TrackSelectionChanged,
                    [&]
                    {
                      ++Taken;
                    } );
  rWidget.setTracking( MoxelGraphics::ETrackCurrent );
  EXPECT_EQ( Taken, 1 );
  EXPECT_TRUE( pContent->ExecuteCommand( "Workspace3d:NoTracking" ) );
  EXPECT_EQ( rWidget.SceneItem()->Tracking(), MoxelGraphics::ETrackNone );
  for ( int Index = 0; Index < 20; ++Index )
  {
    EXPECT_TRUE( pContent->ExecuteCommand( "Workspace3d:ScaleUpManipulator" ) );
  }
  EXPECT_FLOAT_EQ( rWidget.SceneItem()->Options().ManipulatorScale, 10.0F );
  EXPECT_TRUE( pContent->ExecuteCommand( "Workspace3d:ToggleSelectedMarkerCount" ) );
  EXPECT_TRUE( rWidget.SceneItem()->Options().SelectedReconCount );
}

TEST_F( SceneWindow, AltToSelectIsThePreferenceOfTheStore )
{
  const ZEK::ICoreUserPreferencesLayout Layout( Host.Application().Store() );
  const auto pContent = Open();
  auto& rWidget = pContent->SceneWidget();
  EXPECT_TRUE( rWidget.altToSelect() );
  {
    ZEK::VStoreWriteScope Scope( *Layout.Store() );
    ASSERT_TRUE( Scope->SetValue( Layout.AltToSelect().Entry(), ZEK::IO::MakeValue( false ) ).IsOk() );
  }
  EXPECT_FALSE( rWidget.altToSelect() );
  HarrowGraphics::VSceneWidgetArguments Arguments;
  Arguments.pScene = pManager->ForContext( Host.Contexts()->Find( "Live" ) ).pScene;
  Arguments.pQuickHost = Host.Workspace().QuickHost();
  Arguments.pSelection = Host.Selection();
  HarrowGraphics::VQMLSceneWidget Alone( Arguments );
  EXPECT_FALSE( Alone.altToSelect() ) << "there is no layout without a store";
}

TEST_F( SceneWindow, OptionsSurviveSavingAndOddOnesAreLeftOut )
{
  QJsonObject Saved;
  {
    const auto pContent = Open();
    auto* const pItem = pContent->SceneWidget().SceneItem();
    pItem->setOption( "FloorGrid", false );
    pItem->setOption( "PropSubject-Axes", true );
    pItem->setOption( "ReconstructionScale", 2.5F );
    HostServices::VStateJsonWriter Writer;
    pContent->SaveState( Writer, "View" );
    Saved = Writer.Object();
  }
  QJsonObject Options = Saved["ViewOptions"].toObject();
  ASSERT_FALSE( Options.isEmpty() );
  EXPECT_EQ( Options["PropSubject"].toObject()["Axes"], true );
  Options["Cameras"] = "not a bool";
  Options["ContributionsType"] = 99;
  Options["FloorGridSize"] = QJsonValue();
  Options.remove( "GlobalAxis" );
  Options.remove( "SolvingSubject" );
  Options["Stranger"] = 5;
  Saved["ViewOptions"] = Options;
  const auto pContent = Open();
  auto* const pItem = pContent->SceneWidget().SceneItem();
  for ( const char* pKey : { "GlobalAxis", "Cameras" } )
  {
    pItem->setOption( pKey, false );
  }
  pItem->setOption( "SolvingSubject-Axes", true );
  pItem->setOption( "ContributionsType", 2 );
  pItem->setOption( "CameraView", true );
  pContent->RestoreState( HostServices::VStateJsonReader( Saved ), "View" );
  MoxelGraphics::VSceneOptions Expected;
  Expected.FloorGrid = false;
  Expected.PropSubject.Axes = true;
  Expected.ReconstructionScale = 2.5F;
  Expected.BackgroundColorRGB = Options["BackgroundColorRGB"].toInt();
  EXPECT_TRUE( pItem->Options() == Expected ) << "what the state lacks or spoils is as in a new view, whatever it was";
  EXPECT_FALSE( pItem->OptionsMap().value( "CameraView" ).toBool() );
  EXPECT_EQ( TestSupport::LogTexts( "HarrowGraphics", 3 ).size(), 3u );
  EXPECT_FALSE( pItem->OptionsMap().contains( "Stranger" ) );
}

TEST( VQMLSceneWidget, OnlyASingleLocalMeshFileCanBeDropped )
{
  using HarrowGraphics::VQMLSceneWidget;
  const auto Drop = []( const QList< QUrl >& i_rUrls )
  {
    QMimeData Data;
    Data.setUrls( i_rUrls );
    return VQMLSceneWidget::DroppedMesh( &Data );
  };
  EXPECT_EQ( Drop( { QUrl( "file:///a/B.FBX" ) } ), "/a/B.FBX" );
  EXPECT_EQ( Drop( { QUrl( "file:///a.fbx" ), QUrl( "file:///b.fbx" ) } ), "" );
  EXPECT_EQ( Drop( { QUrl( "http://host/a.fbx" ) } ), "" );
  EXPECT_EQ( Drop( { QUrl( "file:///a.obj" ) } ), "" );
  EXPECT_EQ( VQMLSceneWidget::DroppedMesh( nullptr ), "" );
}
