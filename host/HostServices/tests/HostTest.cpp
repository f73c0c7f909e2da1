#include <HostServices/VHost.h>
#include <HostServices/VPluginModule.h>

#include <TestSupport/Calls.h>
#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>
#include <ZEK/Serialiser.h>

#include <QtCore/QCoreApplication>
#include <QtQml/QQmlComponent>
#include <QtQml/QQmlEngine>

#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>

using HostServices::VHost;
using HostServices::VPluginModule;

namespace
{
class Host : public testing::Test
{
protected:
  HostServices::VHostOptions Options() const
  {
    HostServices::VHostOptions Result;
    Result.ContentRoot = m_Folder.Path();
    Result.UserRoot = m_Folder.Path();
    Result.Preferences = m_Folder.Path() / "preferences.json";
    Result.RingSize = 4;
    return Result;
  }

  static std::filesystem::path Module( const char* i_pName )
  {
    return std::filesystem::path( HARROW_TEST_MODULES ) / ( std::string( i_pName ) + ".mpm" );
  }

  static std::vector< std::string > Said() { return TestSupport::LogTexts( "TestPlugin", ZEK::ELogDetail ); }

  TestSupport::VTemporaryDir m_Folder;
};
using PluginModule = Host;
} // namespace

TEST_F( Host, OffersContextsOverItsCaches )
{
  VHost Each( Options() );
  auto pContexts = Each.Application().ContextRegistry();
  const auto pLive = pContexts->Find( "Live" );
  const auto pPlayback = pContexts->Find( "Playback" );
  ASSERT_TRUE( pLive && pPlayback );
  EXPECT_EQ( pLive, pContexts->Find( "Live" ) ) << "a context stays the same object";
  EXPECT_EQ( pLive->Cache(), Each.Contexts()->LiveCache() );
  EXPECT_NE( pLive->Cache(), pPlayback->Cache() );
  EXPECT_FALSE( pContexts->Find( "Elsewhere" ) );
  // A cache that the plug-in makes for itself can be looked at like the others.
  std::shared_ptr< ZEK::IFlowWritableStateCache > pOwn;
  ASSERT_TRUE( Each.Application().StateCacheRegistry()->CreateCache( pOwn, "[DEV] Test Pattern", 0 ).IsOk() );
  ASSERT_TRUE( pContexts->Find( "[DEV] Test Pattern" ) );
  EXPECT_EQ( pContexts->Names(), ( std::vector< std::string >{ "Live", "Playback", "[DEV] Test Pattern" } ) );

  ZEK::VFlowStateRef State;
  ASSERT_TRUE( Each.Application().TestPatternSink()->CreateState( State, { .Frame = 7 }, {}, {} ).IsOk() );
  ASSERT_TRUE( Each.Contexts()->LiveCache()->Add( State ).IsOk() );
  ZEK::VFlowStateRef Fetched;
  ASSERT_TRUE( pLive->Cache()->Fetch( Fetched, 31, 2, 0 ) );
  EXPECT_EQ( Fetched->GetKey().Frame, 7 );
}

TEST_F( Host, KeepsSettingsOfAProgramThatSavesThem )
{
  const auto Path = HostServices::SettingsPath( Options() );
  EXPECT_EQ( Path, m_Folder.Path() / "settings.json" );
  for ( const bool bSaves : { false, true } )
  {
    VHost Each( Options() );
    ASSERT_TRUE( !bSaves || Each.Settings().StartSaving().IsOk() );
    QString Why;
    const auto pEntry = Each.Store()->GetEntry( "Preferences/Core/AltToSelect" );
    ASSERT_EQ( Each.PreferenceEditor().Set( pEntry, ZEK::IO::MakeValue( false ), Why ), ZEK::IResult::Ok );
    EXPECT_FALSE( std::filesystem::exists( Path ) );
  }
  ASSERT_TRUE( std::filesystem::exists( Path ) );
  VHost Each( Options() );
  const ZEK::VStoreReadScope Scope( *Each.Store() );
  const auto pEntry = Each.Store()->GetEntry( "Preferences/Core/AltToSelect" );
  EXPECT_EQ( Scope->VerifiedValue( pEntry ), ZEK::IO::MakeValue( false ) );
  EXPECT_EQ( Scope->DefaultValue( pEntry ), ZEK::IO::MakeValue( true ) );
}

TEST_F( Host, FeatureFlagsTakeProfilesAndWords )
{
  auto WithFlags = Options();
  WithFlags.FeatureFlags = QStringLiteral( "0x1004" );
  VHost Each( WithFlags );
  std::uint32_t Flags = 0;
  Each.Application().FeatureFlagSource()->GetFlags( Flags );
  EXPECT_EQ( Flags, 0x1004u );
  EXPECT_EQ( Each.Features()->ProfileName(), QStringLiteral( "custom" ) );
  TestSupport::VCalls Changes( Each.Features()->FlagsChanged() );
  EXPECT_TRUE( Each.Features()->SetFromText( QStringLiteral( "Objects" ) ).IsOk() );
  EXPECT_TRUE( Each.Features()->SetFromText( QStringLiteral( "objects" ) ).IsOk() );
  EXPECT_EQ( Each.Features()->Flags(), ( 1u << 0 ) | ( 1u << 1 ) | ( 1u << 4 ) | ( 1u << 12 ) );
  for ( const char* pBad : { "", "0x", "0x0x10", "0x1ffffffff", "-1", "1.5", "subject" } )
  {
    EXPECT_EQ( Each.Features()->SetFromText( QString::fromLatin1( pBad ) ), ZEK::IResult::InvalidValue ) << pBad;
  }
  EXPECT_EQ( Changes.Count(), 1 );
  WithFlags.FeatureFlags = QStringLiteral( "nonsense" );
  const VHost Bad( WithFlags );
  EXPECT_EQ( Bad.Features()->Flags(),
             ( 1u << 2 ) | ( 1u << 3 ) | ( 1u << 4 ) | ( 1u << 12 ) | ( 1u << 14 ) | ( 1u << 16 ) | ( 1u << 17 ) );
  EXPECT_EQ( TestSupport::LogTexts( "Host", ZEK::ELogWarning ).size(), 1u );
}

TEST_F( Host, CommandsAreFoundByTextAndReplacedByName )
{
  VHost Each( Options() );
  auto pCommands = Each.Workspace().Commands();
  TestSupport::VCalls Changes( Each.Commands()->Changed() );
  std::string Ran;
  const auto Run = [&]( const char* i_pText )
  {
    return [&Ran, i_pText]
    {
      Ran += i_pText;
    };
  };
  pCommands->KeyedCommands()->AddCommand( "Workspace3d", "Toggle Object Manipulator", Run( "a" ), "M" );
  pCommands->AddAction( { "&Developer", "Reload &Shaders" }, Run( "b" ), {}, "" );
  pCommands->AddAction( { "&Developer", "Salt && Pepper" }, Run( "c" ), {}, "" );
  pCommands->AddAction( { "Developer", "&Reload Shaders" }, Run( "d" ), {}, "again" );
  pCommands->AddAction( {}, Run( "x" ), {}, "" );
  pCommands->AddAction( { "Developer", "Empty" }, {}, {}, "" );
  EXPECT_EQ( Changes.Count(), 4 );
  EXPECT_EQ( Each.Commands()->Names(), ( QStringList{ "Workspace3d:Toggle Object Manipulator",
                                                      "Developer/Reload Shaders", "Developer/Salt & Pepper" } ) );
  EXPECT_TRUE( Each.Commands()->Execute( QStringLiteral( "Developer/Reload Shaders" ) ) );
  EXPECT_TRUE( Each.Commands()->Execute( QStringLiteral( "Workspace3d:Toggle Object Manipulator" ) ) );
  EXPECT_FALSE( Each.Commands()->Execute( QStringLiteral( "Workspace3d:FrameSelected" ) ) );
  EXPECT_EQ( Ran, "da" );
  // A command may take the whole registry away while it runs.
  pCommands->AddAction(
      { "Clear" },
      [&]
      {
        Each.ReleasePluginContent();
        Ran += "!";
      },
      {}, "" );
  EXPECT_TRUE( Each.Commands()->Execute( QStringLiteral( "Clear" ) ) );
  EXPECT_EQ( Ran, "da!" );
  EXPECT_TRUE( Each.Commands()->Names().isEmpty() );
}

TEST_F( Host, QmlWarningsAreLoggedOnceEach )
{
  VHost Each( Options() );
  auto pQuick = Each.Workspace().QuickHost();
  const QByteArray Document = "import QtQml\nQtObject { property int a: missing.value; property int b: other.value }";
  for ( int Round = 0; Round < 3; ++Round )
  {
    QQmlComponent Component( pQuick->Engine() );
    Component.setData( Document, QUrl( QStringLiteral( "qrc:/bad.qml" ) ) );
    const std::unique_ptr< QObject > pObject( Component.create() );
    ASSERT_TRUE( pObject );
  }
  const auto Texts = TestSupport::LogTexts( "Qml", ZEK::ELogWarning );
  ASSERT_EQ( Texts.size(), 2u );
  EXPECT_NE( ( Texts[0] + Texts[1] ).find( "missing is not defined" ), std::string::npos );
}

TEST_F( Host, ServicesThatOutliveItAreHarmless )
{
  auto pEach = std::make_unique< VHost >( Options() );
  auto pQuick = pEach->Workspace().QuickHost();
  auto pPostal = pEach->Application().PostalService();
  auto pResources = pEach->Workspace().RenderResources();
  auto pRange = pEach->Application().SceneServices()->PlaybackRange();
  bool bUndone = false;
  pEach->Undo().Push(
      QStringLiteral( "Move origin: %1" ).arg( "A" ), [] {},
      [&]
      {
        bUndone = true;
      } );
  EXPECT_EQ( pEach->Undo().Stack().undoText(), QStringLiteral( "Move origin: A" ) );
  pEach->Undo().Undo();
  EXPECT_TRUE( bUndone );
  const auto Before = pResources->Generation();
  pEach.reset();
  EXPECT_EQ( pQuick->Engine(), nullptr );
  pPostal->Post(
      []
      {
        ADD_FAILURE() << "ran without a host";
      } );
  QCoreApplication::processEvents();
  pResources->Reload();
  EXPECT_EQ( pResources->Generation(), Before + 1 );
  EXPECT_FALSE( pRange->IsPlayback() );
}

TEST_F( PluginModule, IsTakenThroughItsLifeInOrder )
{
  VHost Each( Options() );
  std::vector< std::string > Expected;
  for ( int Round = 0; Round < 3; ++Round )
  {
    Expected.insert( Expected.end(), { "types", "content", "released", "factory gone", "destroyed" } );
    VPluginModule Plugin;
    ASSERT_TRUE( Plugin.Start( Module( "TestPlugin" ), Each ).IsOk() ) << Plugin.Error();
    EXPECT_EQ( Plugin.Revision(), HostServices::ExpectedPluginRevision );
    EXPECT_EQ( Plugin.DisplayName(), "TestPlugin.mpm" ) << "a plug-in without a name bears its file's";
    EXPECT_EQ( Each.Factories()->Names(), std::vector< std::string >{ "Test View" } );
  }
  EXPECT_TRUE( Each.Factories()->Names().empty() );
  EXPECT_EQ( Said(), Expected ) << "the factories go before the plug-in";
  EXPECT_TRUE( TestSupport::LogTexts( "PluginModule", ZEK::ELogWarning ).empty() );
}

TEST_F( PluginModule, StepsOutOfTurnDoNothing )
{
  VHost Each( Options() );
  VPluginModule Plugin;
  constexpr auto NotPermitted = ZEK::IResult::NotPermitted;
  EXPECT_EQ( Plugin.RegisterTypes( Each ), NotPermitted );
  EXPECT_EQ( Plugin.Release(), NotPermitted );
  EXPECT_EQ( Plugin.Destroy(), NotPermitted );
  EXPECT_EQ( Plugin.UnloadCode(), NotPermitted );
  ASSERT_TRUE( Plugin.Load( Module( "TestPlugin" ) ).IsOk() );
  EXPECT_EQ( Plugin.Load( Module( "TestPlugin" ) ), NotPermitted );
  EXPECT_EQ( Plugin.CreateContent( Each ), NotPermitted );
  EXPECT_TRUE( Said().empty() );
  ASSERT_TRUE( Plugin.RegisterTypes( Each ).IsOk() );
  EXPECT_EQ( Plugin.Destroy(), NotPermitted );
  ASSERT_TRUE( Plugin.Release().IsOk() );
  EXPECT_EQ( Plugin.CreateContent( Each ), NotPermitted );
  EXPECT_FALSE( Plugin.Error().empty() );
  ASSERT_TRUE( Plugin.Destroy().IsOk() );
  EXPECT_EQ( Plugin.Plugin(), nullptr );
  EXPECT_EQ( Said(), ( std::vector< std::string >{ "types", "released", "destroyed" } ) );
}

TEST_F( PluginModule, WhatIsNoPluginIsRefusedWithItsReason )
{
  const auto Text = m_Folder.Path() / "text.mpm";
  std::ofstream( Text ) << "no library at all";
  struct VCase
  {
    std::filesystem::path File;
    ZEK::IResult Result;
    const char* pReason;
  };
  for ( const VCase& rCase :
        { VCase{ m_Folder.Path() / "absent.mpm", ZEK::IResult::FileNotFound, "absent.mpm" },
          { m_Folder.Path(), ZEK::IResult::FileNotFound, "There is no plug-in module" },
          { Text, ZEK::IResult::InvalidFormat, "text.mpm" },
          { Module( "TestPluginBare" ), ZEK::IResult::NotFound, "no export CreatePlugin" },
          { Module( "TestPluginNoDestroy" ), ZEK::IResult::NotFound, "no export DestroyPlugin" } } )
  {
    VPluginModule Plugin;
    EXPECT_EQ( Plugin.Load( rCase.File ), rCase.Result );
    EXPECT_NE( Plugin.Error().find( rCase.pReason ), std::string::npos ) << Plugin.Error();
    EXPECT_EQ( Plugin.Stage(), VPluginModule::ENone );
  }
  EXPECT_TRUE( Said().empty() ) << "no plug-in was made that could not be destroyed";
}

TEST_F( PluginModule, AFaultyPluginIsReportedAndStillReleased )
{
  VHost Each( Options() );
  struct VCase
  {
    const char* pModule;
    ZEK::IResult Result;
    const char* pReason;
    std::vector< std::string > Said;
  };
  std::vector< std::string > All;
  for ( const VCase& rCase :
        { VCase{
              "TestPluginFails", ZEK::IResult::Failed, "RegisterGraphicsTypes", { "types", "released", "destroyed" } },
          { "TestPluginThrows",
            ZEK::IResult::FailedWithException,
            "CreateWorkspaceContent: no folder",
            { "types", "content", "released", "factory gone", "destroyed" } },
          { "TestPluginUnmade", ZEK::IResult::FailedWithException, "CreatePlugin: no memory", {} } } )
  {
    {
      VPluginModule Plugin;
      EXPECT_EQ( Plugin.Start( Module( rCase.pModule ), Each ), rCase.Result );
      EXPECT_NE( Plugin.Error().find( rCase.pReason ), std::string::npos ) << Plugin.Error();
    }
    All.insert( All.end(), rCase.Said.begin(), rCase.Said.end() );
    EXPECT_EQ( Said(), All );
  }
  EXPECT_TRUE( Each.Factories()->Names().empty() );
  // One of them also has another revision, which alone is no reason to refuse it.
  const auto Warnings = TestSupport::LogTexts( "PluginModule", ZEK::ELogWarning );
  ASSERT_EQ( Warnings.size(), 1u );
  EXPECT_NE( Warnings[0].find( "revision 7, expected was 155050" ), std::string::npos );
}

TEST_F( PluginModule, IsSearchedBesideTheProgramUnlessTheEnvironmentNamesIt )
{
  unsetenv( "HARROW_PLUGIN" );
  const auto Paths = VPluginModule::SearchPaths();
  const std::filesystem::path Prefix =
      std::filesystem::path( QCoreApplication::applicationDirPath().toStdString() ).parent_path();
  EXPECT_EQ( Paths.front(), Prefix / "lib" / "harrow" / "HarrowPluginGraphics.mpm" );
  EXPECT_EQ( Paths.back(), Prefix / "lib" / "HarrowPluginGraphics.mpm" );
  setenv( "HARROW_PLUGIN", "/some/where.mpm", 1 );
  EXPECT_EQ( VPluginModule::DefaultPath(), "/some/where.mpm" ) << "no silent fall back when it is missing";
  unsetenv( "HARROW_PLUGIN" );
}
