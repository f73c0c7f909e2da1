#pragma once

#include <HarrowPluginInterface/IHarrowServices.h>

#include <ZEK/FlowState.h>
#include <ZEK/Selection.h>

namespace HarrowPluginInterface
{

/// Kinds of content folder.
enum EHarrowFolderKind : std::uint32_t
{
  EFolderSubjects = 0x8000,
  EFolderProps = 0x10000,
  EFolderTrackingSubjects = 0x20000,
  EFolderRetargetSubjects = 0x40000,
  EFolderSceneMeshes = 0x80000
};

class IHarrowPaths
{
public:
  virtual ~IHarrowPaths() = default;
  /// Folders of one content kind, most general first; at least one entry for a kind of EHarrowFolderKind.
  virtual std::vector< std::wstring >& FoldersOfKind( std::vector< std::wstring >& o_rFolders,
                                                      std::uint32_t i_KindMask ) const = 0;
  /// The folder under which "Geometry" lies.
  virtual std::wstring BaseFolder() const = 0;
};

/// The application as a plug-in sees it. Services that may be null say so.
class IHarrowApplication
{
public:
  virtual ~IHarrowApplication() = default;
  virtual std::shared_ptr< IHarrowPaths > Paths() = 0;
  /// Null in a host without settings.
  virtual std::shared_ptr< ZEK::IStore > Store() = 0;
  virtual std::shared_ptr< IWidgetService > WidgetService() = 0; ///< may be null
  virtual std::shared_ptr< ZEK::IPostalService > PostalService() = 0;
  virtual ZEK::VFlowStoreRef SubjectFlowContext() = 0;
  virtual ZEK::VFlowStateFactoryRef TestPatternSink() = 0;
  virtual std::shared_ptr< IActivityMode > ActivityMode() = 0;
  virtual std::shared_ptr< ZEK::ISelectionService > Selection() = 0;
  virtual std::shared_ptr< ZEK::IFlowStateCacheManager > StateCacheRegistry() = 0;
  virtual std::shared_ptr< void > SubjectPresetsSource() = 0;                        ///< may be null
  virtual std::shared_ptr< ICameraDataSourceContext > CameraDataSourceContext() = 0; ///< may be null
  virtual std::shared_ptr< IContextRegistry > ContextRegistry() = 0;
  virtual std::shared_ptr< IManipulatorSwitch > ObjectManipulator() = 0; ///< may be null
  virtual std::shared_ptr< IManipulatorSwitch > VolumeManipulator() = 0; ///< may be null
  virtual std::shared_ptr< ISceneServices > SceneServices() = 0;
  virtual std::shared_ptr< void > PresetsExtraSource() = 0; ///< may be null
  virtual bool DeveloperMode() const = 0;
  virtual std::shared_ptr< IFeatureFlagSource > FeatureFlagSource() = 0;
};

} // namespace HarrowPluginInterface
