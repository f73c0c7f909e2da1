#include "VHarrowPluginGraphics.h"

#include <CoreGraphics/VHarrowInteractionMapper.h>
#include <HarrowPluginInterface/IHarrowApplication.h>
#include <HostServices/VHost.h>
#include <Store/Store.h>
#include <TestSupport/LogGuard.h>
#include <ZEK/CoreUserPreferences.h>

#include <gtest/gtest.h>

#include <map>

namespace
{
using namespace HarrowPluginInterface;
using ZEK::ECoreFolder;

/// Two folders of each kind, named by its number; none of the kind that is missing.
class VTestPaths final : public IHarrowPaths
{
public:
  std::vector< std::wstring >& FoldersOfKind( std::vector< std::wstring >& o_rFolders,
                                              std::uint32_t i_KindMask ) const override
  {
    o_rFolders.clear();
    if ( i_KindMask != m_Missing )
    {
      o_rFolders = { L"/general/" + std::to_wstring( i_KindMask ), L"/own/" + std::to_wstring( i_KindMask ) };
    }
    return o_rFolders;
  }
  std::wstring BaseFolder() const override { return L"/base"; }

  std::uint32_t m_Missing = 0;
};

/// Keeps what it is told.
class VTestMeshes final : public VMeshSceneCache
{
public:
  void SetSearchFolders( const std::string& i_rCategory, std::vector< std::filesystem::path > i_Folders ) override
  {
    std::string Text;
    for ( const std::filesystem::path& rFolder : i_Folders )
    {
      Text.append( Text.empty() ? "" : ";" ).append( rFolder.string() );
    }
    m_Folders[i_rCategory] = Text;
    ++m_Calls;
  }
  ZEK::IMultiCallback< void() >& Changed() override { return m_Changed; }
  std::shared_ptr< const VMeshScene > Request( const std::string&, const std::string& ) override { return nullptr; }
  bool CanRead( const std::filesystem::path& ) const override { return false; }

  std::map< std::string, std::string > m_Folders;
  int m_Calls = 0;

private:
  ZEK::VMultiCallback< void() > m_Changed;
};

/// The application of the host with another store and other folders.
struct VTestApplication final : public IHarrowApplication
{
  explicit VTestApplication( IHarrowApplication& i_rHost )
    : rHost( i_rHost )
  {
  }
  std::shared_ptr< IHarrowPaths > Paths() override { return pPaths; }
  std::shared_ptr< ZEK::IStore > Store() override { return pStore; }
  std::shared_ptr< IWidgetService > WidgetService() override { return rHost.WidgetService(); }
  std::shared_ptr< ZEK::IPostalService > PostalService() override { return rHost.PostalService(); }
  ZEK::VFlowStoreRef SubjectFlowContext() override { return rHost.SubjectFlowContext(); }
  ZEK::VFlowStateFactoryRef TestPatternSink() override { return rHost.TestPatternSink(); }
  std::shared_ptr< IActivityMode > ActivityMode() override { return rHost.ActivityMode(); }
  std::shared_ptr< ZEK::ISelectionService > Selection() override { return rHost.Selection(); }
  std::shared_ptr< ZEK::IFlowStateCacheManager > StateCacheRegistry() override { return rHost.StateCacheRegistry(); }
  std::shared_ptr< void > SubjectPresetsSource() override { return rHost.SubjectPresetsSource(); }
  std::shared_ptr< ICameraDataSourceContext > CameraDataSourceContext() override
  {
    return rHost.CameraDataSourceContext();
  }
  std::shared_ptr< IContextRegistry > ContextRegistry() override { return rHost.ContextRegistry(); }
  std::shared_ptr< IManipulatorSwitch > ObjectManipulator() override { return rHost.ObjectManipulator(); }
  std::shared_ptr< IManipulatorSwitch > VolumeManipulator() override { return rHost.VolumeManipulator(); }
  std::shared_ptr< ISceneServices > SceneServices() override { return rHost.SceneServices(); }
  std::shared_ptr< void > PresetsExtraSource() override { return rHost.PresetsExtraSource(); }
  bool DeveloperMode() const override { return rHost.DeveloperMode(); }
  std::shared_ptr< IFeatureFlagSource > FeatureFlagSource() override { return rHost.FeatureFlagSource(); }

  IHarrowApplication& rHost;
  std::shared_ptr< VTestPaths > pPaths = std::make_shared< VTestPaths >();
  std::shared_ptr< ZEK::IStore > pStore = Store::CreateStore( nullptr, 64 );
};

class Plugin : public testing::Test
{
protected:
  Plugin()
  {
    Host.SetMeshCache( pMeshes );
    ZEK::VStoreWriteScope Scope( *Application.pStore );
    (void)ZEK::DeclareCoreUserPreferences( *Scope );
  }
  /// The plug-in goes before the host's registries, as a host does it.
  ~Plugin() override { Host.ReleasePluginContent(); }

  template < typename TPreference, typename TValue >
  void Set( const TPreference& i_rPreference, const TValue& i_rValue )
  {
    ZEK::VStoreWriteScope Scope( *Application.pStore );
    EXPECT_TRUE( Scope->SetValue( i_rPreference.Entry(), ZEK::IO::MakeValue( i_rValue ) ).IsOk() );
  }
  void Choose( ECoreFolder i_Folder, const std::string& i_rPath ) { Set( Layout.Folder( i_Folder ), i_rPath ); }
  void Remove( ECoreFolder i_Folder )
  {
    ZEK::VStoreWriteScope Scope( *Application.pStore );
    EXPECT_TRUE( Scope->RemoveEntry( Layout.Folder( i_Folder ).Entry() ).IsOk() );
  }
  bool CreateContent() { return Object.CreateWorkspaceContent( Application, Host.Workspace() ); }
  /// What the failure to create the content says.
  std::string Failure()
  {
    try
    {
      CreateContent();
    }
    catch ( const std::exception& rError )
    {
      return rError.what();
    }
    return {};
  }
  void Deliver() { EXPECT_TRUE( Host.Postal()->DrainForTest() ); }

  HostServices::VHost Host;
  const std::shared_ptr< VTestMeshes > pMeshes = std::make_shared< VTestMeshes >();
  VTestApplication Application{ Host.Application() };
  const ZEK::ICoreUserPreferencesLayout Layout{ Application.pStore };
  HarrowPluginGraphics::VHarrowPluginGraphics Object;
};
} // namespace

TEST_F( Plugin, TheModesOfTheHostDecideWhichMeshesAreLookedForWhere )
{
  Choose( ECoreFolder::Skins, "/skins/\xc3\xa9" );
  Choose( ECoreFolder::PropMeshes, "/props" );
  struct VCase
  {
    std::uint32_t Flags;
    std::map< std::string, std::string > Folders;
  };
  const std::string Base = "/base/Geometry", Skins = ";/skins/\xc3\xa9", Prop = "/own/65536;/props";
  const VCase Cases[] = {
      { 0, { { "Subject", Base + Skins } } },
      { 0x8, { { "Subject", Base + ";/own/32768" + Skins } } },
      { 0x4, { { "Subject", Base + ";/own/131072;/own/262144" + Skins } } },
      { 0xc, { { "Subject", Base + ";/own/32768;/own/131072;/own/262144" + Skins } } },
      { 0x1, { { "Subject", Base + Skins }, { "Prop", Prop } } },
      { 0x2, { { "Subject", Base + Skins }, { "Prop", Prop } } },
      { 0x10, { { "Subject", Base + Skins }, { "Prop", Prop } } },
      { 0x1000, { { "Subject", Base + Skins }, { "SceneMesh", "/own/524288" } } },
      { 0xffffefe0, { { "Subject", Base + Skins } } },
  };
  for ( const VCase& rCase : Cases )
  {
    pMeshes->m_Folders.clear();
    Host.Features()->SetFlags( rCase.Flags );
    EXPECT_TRUE( CreateContent() );
    EXPECT_EQ( pMeshes->m_Folders, rCase.Folders ) << std::hex << rCase.Flags;
  }
}

TEST_F( Plugin, FoldersFollowThePreferencesUntilTheGraphicsAreReleased )
{
  Host.Features()->SetFlags( 0x1011 );
  EXPECT_TRUE( CreateContent() );
  EXPECT_TRUE( CreateContent() ) << "again, and the first watcher is gone";
  EXPECT_EQ( Application.pStore->HandlerCount(), 3u );
  const std::map< std::string, std::string > Bases = {
      { "Subject", "/base/Geometry" }, { "Prop", "/own/65536" }, { "SceneMesh", "/own/524288" } };
  EXPECT_EQ( pMeshes->m_Folders, Bases );
  pMeshes->m_Calls = 0;
  for ( const auto& [Folder, Category] :
        { std::pair( ECoreFolder::Skins, "Subject" ), std::pair( ECoreFolder::PropMeshes, "Prop" ),
          std::pair( ECoreFolder::SceneMeshes, "SceneMesh" ) } )
  {
    auto Wanted = Bases;
    Wanted[Category] += ";/chosen";
    Choose( Folder, "/first" );
    Choose( Folder, "/chosen" );
    EXPECT_EQ( pMeshes->m_Folders, Bases ) << "it changes on the thread of the service";
    Deliver();
    EXPECT_EQ( pMeshes->m_Folders, Wanted );
    Choose( Folder, "" );
    Deliver();
    EXPECT_EQ( pMeshes->m_Folders, Bases );
  }
  EXPECT_EQ( pMeshes->m_Calls, 6 ) << "the newest of several changes alone, and only of its own kind";
  Choose( ECoreFolder::Props, "/elsewhere" );
  Deliver();
  EXPECT_EQ( pMeshes->m_Calls, 6 );
  Choose( ECoreFolder::Skins, "/late" );
  Object.ReleaseGraphics();
  Deliver();
  Choose( ECoreFolder::Skins, "/later" );
  Deliver();
  EXPECT_EQ( pMeshes->m_Calls, 6 );
  EXPECT_EQ( Application.pStore->HandlerCount(), 0u );
}

TEST_F( Plugin, AFolderThatCannotBeReadIsTheHostsToHear )
{
  Choose( ECoreFolder::Skins, "/skins" );
  Host.Features()->SetFlags( 0x11 );
  Application.pPaths->m_Missing = EFolderProps;
  EXPECT_EQ( Failure(), "There is no content folder of kind 65536" );
  Application.pPaths->m_Missing = 0;
  Remove( ECoreFolder::PropMeshes );
  EXPECT_EQ( Failure(), "Store entry 'Preferences/Core/Folders/FolderPropMeshes' does not exist." );
  EXPECT_TRUE( Host.Factories()->Names().empty() ) << "nothing is published after the failure";
  Set( Layout.Folder( ECoreFolder::PropMeshes ), 5 );
  const std::string WrongType = "Failed getting value for store entry 'Preferences/Core/Folders/FolderPropMeshes': the "
                                "requested value type does not match the store value type.";
  EXPECT_EQ( Failure(), WrongType );
  {
    ZEK::VStoreWriteScope Scope( *Application.pStore );
    EXPECT_TRUE( Scope->RemoveEntry( Layout.Folder( ECoreFolder::PropMeshes ).Entry() ).IsOk() );
    Scope->SetFlag( Layout.Folder( ECoreFolder::PropMeshes ).Entry(), ZEK::EPersistent );
  }
  EXPECT_EQ( Failure(), "Store entry 'Preferences/Core/Folders/FolderPropMeshes' has no value." );
  EXPECT_EQ( Application.pStore->HandlerCount(), 0u );
  Choose( ECoreFolder::PropMeshes, "/props" );
  EXPECT_EQ( Failure(), "" );
  // Later it comes out of the posted function; the folders stay as they were.
  const auto Before = pMeshes->m_Folders;
  Remove( ECoreFolder::PropMeshes );
  Set( Layout.Folder( ECoreFolder::PropMeshes ), 5 );
  TestSupport::ExpectFailureLine( "A posted function failed: " + WrongType );
  Deliver();
  EXPECT_EQ( pMeshes->m_Folders, Before );
}

TEST_F( Plugin, AHostWithoutAStoreOrAMeshCacheIsServed )
{
  Application.pStore = nullptr;
  Host.Features()->SetFlags( 0x1000 );
  EXPECT_TRUE( Object.RegisterGraphicsTypes( Application ) );
  EXPECT_TRUE( CreateContent() );
  EXPECT_EQ( pMeshes->m_Folders, ( std::map< std::string, std::string >{ { "Subject", "/base/Geometry" },
                                                                         { "SceneMesh", "/own/524288" } } ) );
  EXPECT_TRUE( CoreGraphics::IsInteraction( CoreGraphics::EInteractionOrbit, Qt::LeftButton, Qt::NoModifier ) );
  Object.ReleaseGraphics();
  Host.SetMeshCache( nullptr );
  EXPECT_TRUE( CreateContent() );
  EXPECT_EQ( pMeshes->m_Calls, 2 );
}

TEST_F( Plugin, TheMapperOfTheProcessFollowsTheStoreFromRegistrationToRelease )
{
  const auto Selects = []
  {
    return CoreGraphics::IsInteraction( CoreGraphics::EInteractionBand, Qt::LeftButton, Qt::NoModifier );
  };
  EXPECT_TRUE( Object.RegisterGraphicsTypes( Application ) );
  const std::weak_ptr pFirst = CoreGraphics::InteractionMapper();
  EXPECT_FALSE( Selects() );
  Set( Layout.AltToSelect(), false );
  Deliver();
  EXPECT_TRUE( Selects() );
  EXPECT_TRUE( Object.RegisterGraphicsTypes( Application ) );
  EXPECT_TRUE( pFirst.expired() ) << "a second registration replaces it";
  EXPECT_TRUE( Selects() );
  Set( Layout.AltToSelect(), true );
  Object.ReleaseGraphics();
  Deliver();
  EXPECT_EQ( CoreGraphics::InteractionMapper(), nullptr );
  EXPECT_EQ( Application.pStore->HandlerCount(), 0u );
}
