#pragma once

#include <HostServices/VActivityMode.h>
#include <HostServices/VCommandRegistry.h>
#include <HostServices/VContentFactories.h>
#include <HostServices/VContextRegistry.h>
#include <HostServices/VFeatureFlags.h>
#include <HostServices/VPaths.h>
#include <HostServices/VPlaybackClock.h>
#include <HostServices/VPostalService.h>
#include <HostServices/VPreferenceEditor.h>
#include <HostServices/VPreferencesFile.h>
#include <HostServices/VQuickHost.h>
#include <HostServices/VRenderResources.h>
#include <HostServices/VSelectionService.h>
#include <HostServices/VSettingsFile.h>
#include <HostServices/VUndoStack.h>

#include <HarrowPluginInterface/IHarrowApplication.h>
#include <HarrowPluginInterface/IHarrowWorkspace.h>

namespace HostServices
{

struct VHostOptions
{
  std::filesystem::path ContentRoot = {}; ///< empty: the application's data folder
  std::filesystem::path UserRoot = {};    ///< empty: the application's data folder
  std::filesystem::path Preferences = {}; ///< empty: "preferences.json" in the application's configuration folder
  QString FeatureFlags = {}; ///< a profile's name or a word; empty: "subjects". A bad text is logged at level 3
  bool bDeveloperMode = false;
  std::vector< std::filesystem::path > ShaderOverrideFolders = {};
  std::size_t RingSize = 512;             ///< states that a cache keeps
  VPlaybackClock::VTimeFunction Now = {}; ///< of the playback clock; empty: the steady clock
};

/// The settings file of a host with these options: "settings.json" beside the file of its preferences.
std::filesystem::path SettingsPath( const VHostOptions& i_rOptions = {} );

/// Everything that the stand-alone host hands to a plug-in, made in the right order and given up in the reverse one.
///
/// Made after the application object and destroyed before it. Windows and the plug-in object must be gone before
/// (`ReleasePluginContent` gives up what the plug-in published). Thread: GUI.
class VHost
{
public:
  explicit VHost( const VHostOptions& i_rOptions = {} );
  ~VHost();
  VHost( const VHost& ) = delete;
  VHost& operator=( const VHost& ) = delete;

  HarrowPluginInterface::IHarrowApplication& Application();
  HarrowPluginInterface::IHarrowWorkspace& Workspace();

  const std::shared_ptr< VPostalService >& Postal() const;
  const std::shared_ptr< VSelectionService >& Selection() const;
  const std::shared_ptr< VActivityMode >& Activity() const;
  const std::shared_ptr< VFeatureFlags >& Features() const;
  const std::shared_ptr< VPlaybackClock >& Playback() const;
  const std::shared_ptr< VContextRegistry >& Contexts() const;
  const std::shared_ptr< VPaths >& Paths() const;
  const std::shared_ptr< VCommandRegistry >& Commands() const;
  const std::shared_ptr< VContentFactories >& Factories() const;
  const std::shared_ptr< VRenderResources >& Resources() const;
  const std::shared_ptr< VQuickHost >& Quick() const;
  VPreferencesFile& Preferences();
  VUndoStack& Undo();
  /// The settings, as they were read from the settings file, with the entries of all preferences. Shut down after
  /// everything else, as this object ends.
  const std::shared_ptr< ZEK::IStore >& Store() const;
  VPreferenceEditor& PreferenceEditor();
  /// Keeps the settings only after `StartSaving`: a program that takes pictures leaves the user's file alone. What is
  /// not saved when this object ends is saved then.
  VSettingsFile& Settings();
  ZEK::VFlowStateFactoryRef StateFactory() const;
  ZEK::VFlowStoreRef ItemStore() const;
  const std::shared_ptr< ZEK::IFlowStateCacheManager >& CacheManager() const;

  /// Null is what a plug-in gets until one is set; set before the plug-in makes its content.
  void SetWidgetService( std::shared_ptr< HarrowPluginInterface::IWidgetService > i_pService );
  void SetMeshCache( std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > i_pCache );

  /// Drops factories, commands and menu entries: after the windows are closed, before the plug-in is destroyed.
  void ReleasePluginContent();

private:
  struct VState;
  std::unique_ptr< VState > m_pState;
};

} // namespace HostServices
