#include <HostServices/VHost.h>

#include <HostServices/VUserPreferences.h>

#include <HostFlow/VFlowFramework.h>
#include <Store/Store.h>

#include <ZEK/Log.h>

#include <QtCore/QStandardPaths>

namespace HostServices
{
namespace
{
/// About the number of settings to come.
constexpr std::size_t StoreBuckets = 4096;

std::filesystem::path PreferencesPath( const VHostOptions& i_rOptions )
{
  if ( !i_rOptions.Preferences.empty() )
  {
    return i_rOptions.Preferences;
  }
  const std::filesystem::path Folder =
      QStandardPaths::writableLocation( QStandardPaths::AppConfigLocation ).toStdU16String();
  return Folder / "preferences.json";
}

std::shared_ptr< VFeatureFlags > MakeFeatures( const QString& i_rText )
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Host" );
  auto pFeatures = std::make_shared< VFeatureFlags >();
  if ( !i_rText.isEmpty() && pFeatures->SetFromText( i_rText ).IsError() )
  {
    ZEK::Log( rCategory, ZEK::ELogWarning, "Feature flags \"%1%\" are neither a profile (%2%) nor a word",
              i_rText.toStdString(), VFeatureFlags::ProfileNames().join( QStringLiteral( ", " ) ).toStdString() );
  }
  return pFeatures;
}
} // namespace

std::filesystem::path SettingsPath( const VHostOptions& i_rOptions )
{
  return PreferencesPath( i_rOptions ).parent_path() / "settings.json";
}

struct VHost::VState final : public HarrowPluginInterface::IHarrowApplication,
                             public HarrowPluginInterface::IHarrowWorkspace
{
  explicit VState( const VHostOptions& i_rOptions )
    : bDeveloperMode( i_rOptions.bDeveloperMode )
    , Settings( pStore, SettingsPath( i_rOptions ) )
    , Preferences( PreferencesPath( i_rOptions ) )
    , pPaths( std::make_shared< VPaths >( i_rOptions.ContentRoot, i_rOptions.UserRoot ) )
    , pFeatures( MakeFeatures( i_rOptions.FeatureFlags ) )
    , pCaches( HostFlow::MakeCacheManager( i_rOptions.RingSize ) )
    , pContexts( std::make_shared< VContextRegistry >( pCaches ) )
    , pClock( std::make_shared< VPlaybackClock >( i_rOptions.Now ) )
    , pScene( std::make_shared< VSceneServices >( pClock ) )
    , pResources( std::make_shared< VRenderResources >( i_rOptions.ShaderOverrideFolders ) )
  {
  }

  // What a plug-in asks the application for; what this host does not have is null.
  std::shared_ptr< HarrowPluginInterface::IHarrowPaths > Paths() override { return pPaths; }
  std::shared_ptr< ZEK::IStore > Store() override { return pStore; }
  std::shared_ptr< HarrowPluginInterface::IWidgetService > WidgetService() override { return pWidgets; }
  std::shared_ptr< ZEK::IPostalService > PostalService() override { return pPostal; }
  ZEK::VFlowStoreRef SubjectFlowContext() override { return ItemStore; }
  ZEK::VFlowStateFactoryRef TestPatternSink() override { return StateFactory; }
  std::shared_ptr< HarrowPluginInterface::IActivityMode > ActivityMode() override { return pActivity; }
  std::shared_ptr< ZEK::ISelectionService > Selection() override { return pSelection; }
  std::shared_ptr< ZEK::IFlowStateCacheManager > StateCacheRegistry() override { return pCaches; }
  std::shared_ptr< void > SubjectPresetsSource() override { return nullptr; }
  std::shared_ptr< HarrowPluginInterface::ICameraDataSourceContext > CameraDataSourceContext() override
  {
    return nullptr;
  }
  std::shared_ptr< HarrowPluginInterface::IContextRegistry > ContextRegistry() override { return pContexts; }
  std::shared_ptr< HarrowPluginInterface::IManipulatorSwitch > ObjectManipulator() override { return nullptr; }
  std::shared_ptr< HarrowPluginInterface::IManipulatorSwitch > VolumeManipulator() override { return nullptr; }
  std::shared_ptr< HarrowPluginInterface::ISceneServices > SceneServices() override { return pScene; }
  std::shared_ptr< void > PresetsExtraSource() override { return nullptr; }
  bool DeveloperMode() const override { return bDeveloperMode; }
  std::shared_ptr< HarrowPluginInterface::IFeatureFlagSource > FeatureFlagSource() override { return pFeatures; }

  // What it asks the workspace for.
  std::shared_ptr< HarrowPluginInterface::IHarrowQuickHost > QuickHost() override { return pQuick; }
  std::shared_ptr< HarrowPluginInterface::ICommandRegistry > Commands() override { return pCommands; }
  std::shared_ptr< HarrowPluginInterface::IContentFactories > ContentFactories() override { return pFactories; }
  std::shared_ptr< HarrowPluginInterface::IRenderResources > RenderResources() override { return pResources; }
  std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > MeshCache() override { return pMeshes; }
  std::shared_ptr< ZEK::IPostalService > Dispatcher() override { return pPostal; }

  const bool bDeveloperMode;
  const std::shared_ptr< VPostalService > pPostal = std::make_shared< VPostalService >();
  const std::shared_ptr< ZEK::IStore > pStore = ::Store::CreateStore( pPostal, StoreBuckets );
  VSettingsFile Settings;
  VPreferencesFile Preferences;
  const std::shared_ptr< VPaths > pPaths;
  const std::shared_ptr< VFeatureFlags > pFeatures;
  const std::shared_ptr< VActivityMode > pActivity = std::make_shared< VActivityMode >();
  const std::shared_ptr< VSelectionService > pSelection = std::make_shared< VSelectionService >();
  const ZEK::VFlowStateFactoryRef StateFactory = HostFlow::MakeStateFactory();
  const ZEK::VFlowStoreRef ItemStore = HostFlow::MakeItemStore();
  const std::shared_ptr< ZEK::IFlowStateCacheManager > pCaches;
  const std::shared_ptr< VContextRegistry > pContexts;
  const std::shared_ptr< VPlaybackClock > pClock;
  const std::shared_ptr< VSceneServices > pScene;
  const std::shared_ptr< VRenderResources > pResources;
  const std::shared_ptr< VQuickHost > pQuick = std::make_shared< VQuickHost >();
  const std::shared_ptr< VCommandRegistry > pCommands = std::make_shared< VCommandRegistry >();
  const std::shared_ptr< VContentFactories > pFactories = std::make_shared< VContentFactories >();
  std::shared_ptr< HarrowPluginInterface::IWidgetService > pWidgets;
  std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > pMeshes;
  VUndoStack Undo;
  VPreferenceEditor Editor{ pStore, Undo };
};

VHost::VHost( const VHostOptions& i_rOptions )
  : m_pState( std::make_unique< VState >( i_rOptions ) )
{
  // What was saved is there first, so that it counts as set and a default of today does not take its place.
  (void)m_pState->Settings.Load(
      [this]
      {
        (void)DeclareUserPreferences( *m_pState->pStore );
      } );
}

VHost::~VHost()
{
  ReleasePluginContent();
  (void)m_pState->Settings.Finish();
  // Objects of the plug-in may hold references to services beyond this point; these answer, and do nothing.
  m_pState->pPostal->Close();
  m_pState->pQuick->Shutdown();
  (void)m_pState->pStore->Shutdown();
}

HarrowPluginInterface::IHarrowApplication& VHost::Application()
{
  return *m_pState;
}

HarrowPluginInterface::IHarrowWorkspace& VHost::Workspace()
{
  return *m_pState;
}

const std::shared_ptr< VPostalService >& VHost::Postal() const
{
  return m_pState->pPostal;
}

const std::shared_ptr< VSelectionService >& VHost::Selection() const
{
  return m_pState->pSelection;
}

const std::shared_ptr< VActivityMode >& VHost::Activity() const
{
  return m_pState->pActivity;
}

const std::shared_ptr< VFeatureFlags >& VHost::Features() const
{
  return m_pState->pFeatures;
}

const std::shared_ptr< VPlaybackClock >& VHost::Playback() const
{
  return m_pState->pClock;
}

const std::shared_ptr< VContextRegistry >& VHost::Contexts() const
{
  return m_pState->pContexts;
}

const std::shared_ptr< VPaths >& VHost::Paths() const
{
  return m_pState->pPaths;
}

const std::shared_ptr< VCommandRegistry >& VHost::Commands() const
{
  return m_pState->pCommands;
}

const std::shared_ptr< VContentFactories >& VHost::Factories() const
{
  return m_pState->pFactories;
}

const std::shared_ptr< VRenderResources >& VHost::Resources() const
{
  return m_pState->pResources;
}

const std::shared_ptr< VQuickHost >& VHost::Quick() const
{
  return m_pState->pQuick;
}

VPreferencesFile& VHost::Preferences()
{
  return m_pState->Preferences;
}

VUndoStack& VHost::Undo()
{
  return m_pState->Undo;
}

const std::shared_ptr< ZEK::IStore >& VHost::Store() const
{
  return m_pState->pStore;
}

VPreferenceEditor& VHost::PreferenceEditor()
{
  return m_pState->Editor;
}

VSettingsFile& VHost::Settings()
{
  return m_pState->Settings;
}

ZEK::VFlowStateFactoryRef VHost::StateFactory() const
{
  return m_pState->StateFactory;
}

ZEK::VFlowStoreRef VHost::ItemStore() const
{
  return m_pState->ItemStore;
}

const std::shared_ptr< ZEK::IFlowStateCacheManager >& VHost::CacheManager() const
{
  return m_pState->pCaches;
}

void VHost::SetWidgetService( std::shared_ptr< HarrowPluginInterface::IWidgetService > i_pService )
{
  m_pState->pWidgets = std::move( i_pService );
}

void VHost::SetMeshCache( std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > i_pCache )
{
  m_pState->pMeshes = std::move( i_pCache );
}

void VHost::ReleasePluginContent()
{
  m_pState->Undo.Stack().clear();
  m_pState->pCommands->Clear();
  m_pState->pFactories->Clear();
}

} // namespace HostServices
