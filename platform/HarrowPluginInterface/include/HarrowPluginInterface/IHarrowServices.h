#pragma once

// The smaller services that a host hands to a plug-in. Thread: GUI, unless a comment says otherwise.

#include <ZEK/Callback.h>
#include <ZEK/FlowState.h>

#include <QtCore/QString>
#include <QtCore/QVariant>
#include <QtGui/QColor>

#include <cstdint>
#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <vector>

class QQmlEngine;

namespace ZEK
{
class IStore;
}

namespace HarrowPluginInterface
{
struct VMeshScene;

/// Application modes; opaque but for the bits that are named here.
enum EHarrowFeatureFlags : std::uint32_t
{
  EFeatureObjects = 0x0001,
  EFeaturePropFolder = 0x0002,
  EFeatureTrackingSubjects = 0x0004,
  EFeatureSubjects = 0x0008,
  EFeatureProps = 0x0010,
  EFeatureSceneMeshes = 0x1000,
  EFeatureLiveSubjects = 0x4000,
  EFeatureSolving = 0x10000,
  EFeatureRetargeting = 0x20000
};

class IFeatureFlagSource
{
public:
  virtual ~IFeatureFlagSource() = default;
  virtual QString ProfileName() const = 0;
  virtual ZEK::IMultiCallback< void() >& FlagsChanged() = 0;
  virtual void GetFlags( std::uint32_t& o_rFlags ) const = 0;
};

/// The activity that the operator is in, such as "Live", "Playback" or "Camera Calibration".
class IActivityMode
{
public:
  virtual ~IActivityMode() = default;
  virtual std::string Name() const = 0;
  virtual ZEK::IMultiCallback< void() >& Changed() = 0;
};

/// One context: a name and the cache its windows draw from.
class IStateCacheContext
{
public:
  virtual ~IStateCacheContext() = default;
  virtual std::string Name() const = 0;
  virtual std::shared_ptr< ZEK::IFlowStateCache > Cache() const = 0;
};

class IContextRegistry
{
public:
  virtual ~IContextRegistry() = default;
  /// Null when no context has that name.
  virtual std::shared_ptr< IStateCacheContext > Find( const std::string& i_rName ) const = 0;
  virtual std::vector< std::string > Names() const = 0;
};

/// Where playback stands within its range.
class IPlaybackRange
{
public:
  virtual ~IPlaybackRange() = default;
  /// False when nothing is played back or the view is live; the range then does not matter.
  virtual bool IsPlayback() const = 0;
  virtual std::int64_t RangeBegin() const = 0; ///< ticks, included
  virtual std::int64_t RangeEnd() const = 0;   ///< ticks, included
  virtual std::int64_t CurrentTick() const = 0;
  virtual ZEK::IMultiCallback< void() >& Changed() = 0;
};

/// Gives further services of a scene; the plug-in calls the ninth operation alone.
class ISceneServices
{
public:
  virtual ~ISceneServices() = default;
  virtual void Reserved1() {}
  virtual void Reserved2() {}
  virtual void Reserved3() {}
  virtual void Reserved4() {}
  virtual void Reserved5() {}
  virtual void Reserved6() {}
  virtual void Reserved7() {}
  virtual std::shared_ptr< IPlaybackRange > PlaybackRange() const = 0;
};

/// Answers what no view can know of a camera; null is accepted and gives English texts.
class ICameraDataSourceContext
{
public:
  virtual ~ICameraDataSourceContext() = default;
  virtual QString TemperatureUnit() const = 0;
  virtual QString WarningText( std::uint32_t i_Flag ) const = 0;
  virtual QString Terminology( const QString& i_rKey ) const = 0;
};

/// A manipulator's switch.
class IManipulatorSwitch
{
public:
  virtual ~IManipulatorSwitch() = default;
  virtual bool IsShown() const = 0;
  virtual void SetShown( bool i_bShown ) = 0;
  virtual ZEK::IMultiCallback< void() >& Changed() = 0;
};

/// What a scene widget asks of the host.
class IWidgetService
{
public:
  virtual ~IWidgetService() = default;
  virtual void SetMaskCells( const std::string& i_rURN, const std::vector< std::uint32_t >& i_rCells,
                             std::uint8_t i_Value ) = 0;
  virtual void ClearMask( const std::string& i_rURN ) = 0;
  virtual bool CanImportSceneMesh( const std::filesystem::path& i_rPath ) const = 0;
  virtual void ImportSceneMesh( const std::filesystem::path& i_rPath ) = 0;
};

/// Rendering resources shared by all scenes: where shader sources are looked for before the built-in ones.
class IRenderResources
{
public:
  virtual ~IRenderResources() = default;
  /// Folders that hold VertexShaders/ and FragmentShaders/; the first that has a file wins. Thread: any.
  virtual std::vector< std::filesystem::path > OverrideFolders() const = 0;
  /// Grows with each reload request; a scene that sees a new number reads its sources again. Thread: any.
  virtual std::uint64_t Generation() const = 0;
  virtual void Reload() = 0;
  virtual ZEK::IMultiCallback< void() >& ReloadRequested() = 0;
};

/// Finds meshes by name and loads them on its own thread.
class VMeshSceneCache
{
public:
  virtual ~VMeshSceneCache() = default;
  /// Where the meshes of a category are looked for; the first folder that has the file wins. What failed so far is
  /// tried again.
  virtual void SetSearchFolders( const std::string& i_rCategory, std::vector< std::filesystem::path > i_Folders ) = 0;
  /// Fires when meshes came or may have become others, on the loader's thread or that of `SetSearchFolders`.
  virtual ZEK::IMultiCallback< void() >& Changed() = 0;
  /// The mesh of that file name, which may hold folders below a search folder. Null when it is not there: not yet, if
  /// it is found and can be read, and `Changed` then tells. Never waits for a file. Thread: any.
  virtual std::shared_ptr< const VMeshScene > Request( const std::string& i_rCategory, const std::string& i_rName ) = 0;
  /// Whether the file is there and its name is that of a format that can be read. Thread: any.
  virtual bool CanRead( const std::filesystem::path& i_rPath ) const = 0;
};

class IKeyedCommands
{
public:
  virtual ~IKeyedCommands() = default;
  virtual void AddCommand( const QString& i_rGroup, const QString& i_rText, std::function< void() > i_Callback,
                           const QString& i_rDefaultKey ) = 0;
};

/// The registries of keyed commands and of menu actions.
class ICommandRegistry
{
public:
  virtual ~ICommandRegistry() = default;
  virtual void AddAction( const std::vector< QString >& i_rMenuPath, std::function< void() > i_Callback,
                          const std::vector< QString >& i_rIcons, const QString& i_rToolTip ) = 0;
  virtual std::shared_ptr< IKeyedCommands > KeyedCommands() const = 0;
};

/// The one QML engine of the host, and its theme. The engine outlives every window.
class IHarrowQuickHost
{
public:
  enum EThemeColour
  {
    EThemeWindow,
    EThemeText,
    EThemeAccent,
    EThemePrimary
  };

  virtual ~IHarrowQuickHost() = default;
  virtual QQmlEngine* Engine() const = 0;
  virtual QColor ThemeColour( EThemeColour i_Colour ) const = 0;
  virtual ZEK::IMultiCallback< void() >& ThemeChanged() = 0;
};

} // namespace HarrowPluginInterface
