#include <HostWindow/MainWindow.h>

#include <ZEK/Serialiser.h>

#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QElapsedTimer>
#include <QtCore/QMimeData>
#include <QtCore/QThread>
#include <QtGui/QDropEvent>
#include <QtQml/QQmlComponent>
#include <QtWidgets/QMenu>
#include <QtWidgets/QMenuBar>
#include <QtWidgets/QStatusBar>

#include <gmock/gmock.h>

#include <fstream>

using namespace HostWindow;
using HarrowPluginInterface::VWindowFrameContent;

namespace
{
/// Stands for what a plug-in gives: a view, a state that is kept, and one command.
class VFakeContent : public VWindowFrameContent,
                     public HarrowPluginInterface::IHarrowWindowPersist,
                     public HarrowPluginInterface::IHarrowExecuteCommand
{
public:
  explicit VFakeContent( std::string i_Context )
    : Context( std::move( i_Context ) )
  {
  }
  void SaveState( HarrowPluginInterface::IStateWriter& io_rWriter, const QString& ) override
  {
    io_rWriter.Write( "Mark", Mark );
  }
  void RestoreState( const HarrowPluginInterface::IStateReader& i_rReader, const QString& ) override
  {
    QVariant Value;
    if ( i_rReader.Read( "Mark", QMetaType( QMetaType::Int ), Value ).IsOk() )
    {
      Mark = Value.toInt();
    }
  }
  bool ExecuteCommand( const std::string& i_rText ) override
  {
    Commands.push_back( i_rText );
    return i_rText == "Workspace3d:Known";
  }

  std::string Context;
  int Mark = 0;
  std::vector< std::string > Commands;
};

class VFakeFactory : public HarrowPluginInterface::IWorkspaceContentFactory
{
public:
  void Create( std::shared_ptr< VWindowFrameContent >& o_rpContent,
               const std::shared_ptr< HarrowPluginInterface::IStateCacheContext >& i_rpContext,
               const QPointer< QWidget >& i_rpToolbar ) override
  {
    EXPECT_TRUE( i_rpToolbar && i_rpToolbar->layout() ) << "a window's tools need a place";
    const auto pContent = std::make_shared< VFakeContent >( i_rpContext->Name() );
    Made.push_back( pContent );
    o_rpContent = pContent;
  }
  std::size_t Alive() const
  {
    return static_cast< std::size_t >( std::count_if( Made.begin(), Made.end(),
                                                      []( const std::weak_ptr< VFakeContent >& i_rpContent )
                                                      {
                                                        return !i_rpContent.expired();
                                                      } ) );
  }
  VFakeContent& Newest() const { return *Made.back().lock(); }

  std::vector< std::weak_ptr< VFakeContent > > Made;
};

bool SpinUntil( const std::function< bool() >& i_rDone )
{
  QElapsedTimer Timer;
  Timer.start();
  while ( !i_rDone() && Timer.elapsed() < 20'000 )
  {
    QCoreApplication::processEvents( QEventLoop::AllEvents, 10 );
    QCoreApplication::sendPostedEvents( nullptr, QEvent::DeferredDelete );
  }
  return i_rDone();
}

QString WriteTrc( const TestSupport::VTemporaryDir& i_rFolder, const char* i_pName )
{
  const auto Path = i_rFolder.Path() / i_pName;
  std::ofstream( Path ) << "PathFileType\t4\t(X/Y/Z)\tsmall.trc\n"
                           "DataRate\tCameraRate\tNumFrames\tNumMarkers\tUnits\tOrigDataRate\tOrigDataStartFrame\t"
                           "OrigNumFrames\n"
                           "50\t50\t3\t1\tmm\t50\t1\t3\n"
                           "Frame#\tTime\tLeft\t\t\n"
                           "\t\tX1\tY1\tZ1\n"
                           "\n"
                           "11\t0.00\t100\t200\t300\n"
                           "12\t0.02\t101\t201\t301\n"
                           "13\t0.04\t102\t202\t302\n";
  return QString::fromStdString( Path.string() );
}

class MainWindow : public testing::Test
{
protected:
  void SetUp() override
  {
    qputenv( "XDG_CONFIG_HOME", m_Folder.Path().c_str() );
    qputenv( "XDG_DATA_HOME", m_Folder.Path().c_str() );
    Begin();
  }
  void TearDown() override { End(); }

  void Begin()
  {
    m_pSession = std::make_unique< VSession >( VCommonOptions() );
    m_pFactory = std::make_shared< VFakeFactory >();
    m_pSession->Host().Factories()->AddFactory( "3D View", m_pFactory );
    m_pSession->GoLive();
    m_pWindow = std::make_unique< VMainWindow >( *m_pSession );
    m_pWindow->show();
  }
  void End()
  {
    m_pWindow.reset();
    EXPECT_EQ( m_pFactory->Alive(), 0u );
    m_pSession.reset();
  }

  void Prefer( const char* i_pName, bool i_bOn )
  {
    ZEK::IStore& rStore = *m_pSession->Host().Store();
    const ZEK::VStoreWriteScope Scope( rStore );
    const auto pEntry = rStore.GetEntry( std::string( "Preferences/Core/" ).append( i_pName ) );
    ASSERT_EQ( Scope->SetValue( pEntry, ZEK::IO::MakeValue( i_bOn ) ), ZEK::IResult::Ok );
  }

  TestSupport::VTemporaryDir m_Folder;
  std::unique_ptr< VSession > m_pSession;
  std::shared_ptr< VFakeFactory > m_pFactory;
  std::unique_ptr< VMainWindow > m_pWindow;
};
} // namespace

TEST_F( MainWindow, BeginsLiveWithOneViewAndFramesArrive )
{
  ASSERT_EQ( m_pWindow->Windows().size(), 1u );
  EXPECT_EQ( m_pFactory->Newest().Context, "Live" );
  EXPECT_EQ( m_pSession->Host().Activity()->Name(), "Live" );
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return m_pSession->ShownFrame() > 2;
      } ) );
  m_pSession->SetSeen( false );
  const std::int64_t Frame = m_pSession->ShownFrame();
  QThread::msleep( 100 );
  EXPECT_EQ( m_pSession->ShownFrame(), Frame ) << "a window that nobody sees gets no frames";
}

TEST_F( MainWindow, ARecordingTurnsTheViewsToPlaybackAndKeepsTheirState )
{
  Prefer( "StartPlayingAutomatically", true );
  m_pFactory->Newest().Mark = 42;
  m_pWindow->OpenFiles( { WriteTrc( m_Folder, "a.trc" ) } );
  ASSERT_TRUE( SpinUntil(
      [&]
      {
        return m_pSession->HasRecording();
      } ) );
  EXPECT_EQ( m_pFactory->Newest().Context, "Playback" );
  EXPECT_EQ( m_pFactory->Newest().Mark, 42 );
  EXPECT_EQ( m_pFactory->Alive(), 1u );
  EXPECT_EQ( m_pSession->Host().Activity()->Name(), "Playback" );
  EXPECT_THAT( m_pSession->Host().Preferences().RecentFiles().value( 0 ).toStdString(), testing::EndsWith( "a.trc" ) );
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return m_pSession->ShownFrame() == 2 && !m_pSession->Clock().IsPlaying();
      } ) )
      << "it plays to its end";
  auto* pFrame = m_pWindow->findChild< QLabel* >( "Frame" );
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return pFrame->text().contains( "13" );
      } ) )
      << pFrame->text().toStdString();
  m_pSession->GoLive();
  EXPECT_EQ( m_pFactory->Newest().Context, "Live" );
  EXPECT_EQ( m_pFactory->Newest().Mark, 42 );
}

TEST_F( MainWindow, ContextsOfThePlugInAreShownFromTheWindowMenuUntilTheCaptureIs )
{
  const auto Choose = [&]
  {
    QMenu* pMenu = nullptr;
    for ( QAction* pAction : m_pWindow->menuBar()->actions() )
    {
      pMenu = pAction->text() == "&Window" ? pAction->menu() : pMenu;
    }
    emit pMenu->aboutToShow();
    for ( QAction* pAction : pMenu->actions() )
    {
      if ( pAction->text() == "Show Made && Shown" )
      {
        pAction->trigger();
        return true;
      }
    }
    return false;
  };
  EXPECT_FALSE( Choose() );
  std::shared_ptr< ZEK::IFlowWritableStateCache > pCache;
  ASSERT_EQ( m_pSession->Host().CacheManager()->CreateCache( pCache, "Made & Shown", 0 ), ZEK::IResult::Ok );
  ASSERT_TRUE( Choose() );
  EXPECT_EQ( m_pFactory->Newest().Context, "Made & Shown" );
  ASSERT_TRUE( Choose() );
  EXPECT_EQ( m_pFactory->Newest().Context, "Live" );
  ASSERT_TRUE( Choose() );
  m_pSession->GoLive();
  EXPECT_EQ( m_pFactory->Newest().Context, "Live" );
  EXPECT_EQ( m_pFactory->Alive(), 1u );
}

TEST_F( MainWindow, ARecordingWaitsWhereTheOperatorWantsItTo )
{
  Prefer( "EnableAutoContextSwitch", false );
  m_pWindow->OpenFiles( { WriteTrc( m_Folder, "a.trc" ) } );
  ASSERT_TRUE( SpinUntil(
      [&]
      {
        return m_pSession->HasRecording();
      } ) );
  EXPECT_TRUE( m_pSession->IsLive() );
  EXPECT_EQ( m_pFactory->Newest().Context, "Live" );
  EXPECT_TRUE( m_pWindow->statusBar()->currentMessage().contains( "a.trc" ) );
  const std::int64_t Frame = m_pSession->ShownFrame();
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return m_pSession->ShownFrame() > Frame;
      } ) )
      << "the live capture goes on";
  m_pSession->GoPlayback();
  EXPECT_EQ( m_pFactory->Newest().Context, "Playback" );
  EXPECT_EQ( m_pSession->ShownFrame(), 0 );
  EXPECT_FALSE( m_pSession->Clock().IsPlaying() );
}

TEST_F( MainWindow, AFileThatCannotBeReadLeavesEverythingAndSaysSo )
{
  const QString Good = WriteTrc( m_Folder, "good.trc" );
  const auto Bad = m_Folder.Path() / "bad.c3d";
  std::ofstream( Bad ) << "no recording";
  m_pWindow->OpenFiles( { QString::fromStdString( Bad.string() ) } );
  ASSERT_TRUE( SpinUntil(
      [&]
      {
        return m_pWindow->Messages().isVisible();
      } ) );
  EXPECT_TRUE( m_pWindow->Messages().Text().contains( "bad.c3d" ) );
  EXPECT_FALSE( m_pSession->HasRecording() );
  EXPECT_TRUE( m_pSession->IsLive() );
  // In a list, what cannot be read is passed over.
  m_pWindow->OpenFiles( { QString::fromStdString( Bad.string() ), Good } );
  ASSERT_TRUE( SpinUntil(
      [&]
      {
        return m_pSession->HasRecording();
      } ) );
  EXPECT_EQ( m_pSession->Source()->Name(), "good.trc" );
  EXPECT_TRUE( m_pWindow->Messages().isVisible() ) << "the failure is still to be read";
}

TEST_F( MainWindow, WindowsMayCloseWhileStatesArrive )
{
  for ( int i = 0; i < 20; ++i )
  {
    VWorkspaceDock* pDock = m_pWindow->AddWindow( "3D View" );
    ASSERT_NE( pDock, nullptr );
    QCoreApplication::processEvents();
    pDock->close();
  }
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return m_pFactory->Alive() == 1;
      } ) );
  EXPECT_EQ( m_pWindow->Windows().size(), 1u );
  EXPECT_EQ( m_pWindow->AddWindow( "5D View" ), nullptr );
}

TEST_F( MainWindow, TheLayoutComesBackAtTheNextStart )
{
  m_pFactory->Newest().Mark = 7;
  m_pWindow->AddWindow( "3D View" );
  m_pFactory->Newest().Mark = 9;
  m_pWindow->resize( 901, 703 );
  m_pWindow->close();
  End();
  Begin();
  ASSERT_EQ( m_pFactory->Made.size(), 2u );
  EXPECT_EQ( m_pFactory->Made[0].lock()->Mark, 7 );
  EXPECT_EQ( m_pFactory->Made[1].lock()->Mark, 9 );
  EXPECT_EQ( m_pWindow->size(), QSize( 901, 703 ) );
}

TEST_F( MainWindow, SettingsComeBackAndOnesThatCouldNotBeReadAreKeptAndTold )
{
  const auto Path = HostServices::SettingsPath();
  const auto AltToSelect = [&]
  {
    ZEK::IStore& rStore = *m_pSession->Host().Store();
    const ZEK::VStoreReadScope Scope( rStore );
    return Scope->VerifiedValue( rStore.GetEntry( "Preferences/Core/AltToSelect" ) ) == ZEK::IO::MakeValue( true );
  };
  // Earlier versions kept it elsewhere.
  m_pSession->Host().Preferences().SetValue( "altToSelect", false );
  ASSERT_TRUE( m_pSession->Host().Preferences().Save().IsOk() );
  std::ofstream( Path ) << "{ broken";
  End();
  Begin();
  EXPECT_FALSE( AltToSelect() );
  ASSERT_TRUE( m_pSession->Host().Settings().StartSaving().IsOk() );
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return m_pWindow->Messages().isVisible() && m_pWindow->Messages().Text().contains( "The file is kept as" );
      } ) )
      << m_pWindow->Messages().Text().toStdString();
  EXPECT_FALSE( std::filesystem::exists( Path ) );
  for ( QAction* pAction : m_pWindow->findChildren< QAction* >() )
  {
    if ( pAction->text() == "&Save Settings" )
    {
      pAction->trigger();
    }
  }
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return std::filesystem::exists( Path );
      } ) );
  Prefer( "AltToSelect", true );
  End();
  Begin();
  EXPECT_TRUE( AltToSelect() ) << "what was saved holds against what was kept elsewhere";
  EXPECT_TRUE( m_pSession->Host().Preferences().Value( "altToSelect" ).isUndefined() );
}

TEST_F( MainWindow, TheStatusLineNamesWhatIsUnderThePointerBeforeWhatIsSelected )
{
  auto* pLabel = m_pWindow->findChild< QLabel* >( "Selection" );
  auto& rSelection = *m_pSession->Host().Selection();
  using ZEK::ISelectionService;
  rSelection.Set( ISelectionService::EPrimary,
                  { { ZEK::ESelectMarker, "Ada:C7", 1, 3 }, { ZEK::ESelectMarker, "Ada:LFHD", 1, 4 } } );
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return pLabel->text() == "Selected: Ada:LFHD and 1 more";
      } ) )
      << pLabel->text().toStdString();
  rSelection.Set( ISelectionService::ESecondary, { { ZEK::ESelectReconstruction, "", 0, 12 } } );
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return pLabel->text() == "reconstruction 12";
      } ) )
      << pLabel->text().toStdString();
  rSelection.Set( ISelectionService::ESecondary, {} );
  rSelection.Set( ISelectionService::EPrimary, {} );
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return pLabel->text() == "Nothing selected";
      } ) )
      << pLabel->text().toStdString();
}

TEST_F( MainWindow, CommandsGoToTheWindowFirstAndThenToTheProgram )
{
  int Calls = 0;
  m_pSession->Host().Commands()->KeyedCommands()->AddCommand(
      "Workspace3d", "Toggle",
      [&]
      {
        ++Calls;
      },
      "M" );
  EXPECT_TRUE( m_pWindow->ExecuteCommand( "Workspace3d:Known" ) );
  EXPECT_EQ( Calls, 0 );
  EXPECT_TRUE( m_pWindow->ExecuteCommand( "Workspace3d:Toggle" ) );
  EXPECT_EQ( Calls, 1 );
  EXPECT_FALSE( m_pWindow->ExecuteCommand( "Workspace3d:Nothing" ) );
  EXPECT_THAT( m_pFactory->Newest().Commands,
               testing::ElementsAre( "Workspace3d:Known", "Workspace3d:Toggle", "Workspace3d:Nothing" ) );
}

TEST_F( MainWindow, RecordingsCanBeDroppedAndOtherFilesCannot )
{
  const auto Drop = [&]( const QString& i_rPath )
  {
    QMimeData Data;
    Data.setUrls( { QUrl::fromLocalFile( i_rPath ) } );
    QDragEnterEvent Enter( QPoint( 5, 5 ), Qt::CopyAction, &Data, Qt::LeftButton, Qt::NoModifier );
    Enter.ignore();
    QCoreApplication::sendEvent( m_pWindow.get(), &Enter );
    if ( Enter.isAccepted() )
    {
      QDropEvent Event( QPointF( 5, 5 ), Qt::CopyAction, &Data, Qt::LeftButton, Qt::NoModifier );
      QCoreApplication::sendEvent( m_pWindow.get(), &Event );
    }
    return Enter.isAccepted();
  };
  EXPECT_FALSE( Drop( "/mesh.fbx" ) );
  EXPECT_TRUE( Drop( WriteTrc( m_Folder, "dropped.TRC" ) ) );
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return m_pSession->HasRecording();
      } ) );
  EXPECT_TRUE( Drop( "/missing.BVH" ) );
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return m_pWindow->Messages().Text().contains( "missing.BVH" );
      } ) );
}

TEST( Session, ShowsTheFrameNearestToATimeAndTakesTheUpAxisGiven )
{
  const TestSupport::VTemporaryDir Folder;
  qputenv( "XDG_CONFIG_HOME", Folder.Path().c_str() );
  VCommonOptions Options;
  Options.Up = HostSources::EUpAxis::Y;
  VSession Session( Options );
  Session.SetSeen( false );
  std::int64_t Index = -1;
  EXPECT_EQ( Session.ShowStill( 1, Index ), ZEK::IResult::NotAvailable ) << "there is no source yet";
  Session.GoLive();
  EXPECT_EQ( Session.Source()->UpAxis(), HostSources::EUpAxis::Y );
  ASSERT_TRUE( Session.ShowStill( 1.004, Index ).IsOk() );
  EXPECT_EQ( Index, 120 );
  ZEK::VFlowStateRef State;
  ASSERT_TRUE( Session.Context()->Cache()->Fetch( State, 31, 2, 0 ) );
  ASSERT_TRUE( State );
  EXPECT_EQ( State->GetKey().Frame, 120 * Session.Source()->TicksPerFrame() );
}

TEST( Session, PlaybackHasWhatLiesAroundTheFrameItShows )
{
  const TestSupport::VTemporaryDir Folder;
  qputenv( "XDG_CONFIG_HOME", Folder.Path().c_str() );
  VSession Session( {} );
  const auto pRecording = std::make_shared< HostSources::VRecording >();
  pRecording->FrameCount = 1000;
  pRecording->Labels = pRecording->FileLabels = { "a" };
  pRecording->Points.resize( 1000 );
  Session.OpenRecording( pRecording );
  Session.Clock().Play();
  EXPECT_TRUE( SpinUntil(
      [&]
      {
        return Session.ShownFrame() > 20;
      } ) );
  for ( const std::int64_t Paused : { std::int64_t( -1 ), std::int64_t( 500 ), std::int64_t( 499 ) } )
  {
    Session.Clock().Pause();
    Paused < 0 ? void() : Session.Clock().SeekFrame( Paused );
    const std::int64_t Ticks = Session.Source()->TicksPerFrame(), Shown = Session.ShownFrame();
    const auto pCache = Session.Context()->Cache();
    std::vector< ZEK::VFlowStateRef > Ahead;
    ZEK::VFlowStateRef State;
    EXPECT_TRUE( SpinUntil(
        [&]
        {
          pCache->Fetch( State, 31, 2, 0 );
          pCache->FetchMany( { { ( Shown + 1 ) * Ticks, 1, 2 }, { ( Shown + 60 ) * Ticks, Ticks, 2 } }, Ahead, 0 );
          return State && State->GetKey().Frame == Shown * Ticks && Ahead.size() == 60;
        } ) )
        << Shown << ' ' << Ahead.size();
  }
}
