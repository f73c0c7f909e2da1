#pragma once

#include <HarrowPluginInterface/IHarrowServices.h>
#include <HarrowPluginInterface/IWorkspaceContent.h>

namespace HarrowPluginInterface
{

/// The host's windows as a plug-in sees them.
class IHarrowWorkspace
{
public:
  virtual ~IHarrowWorkspace() = default;
  virtual std::shared_ptr< IHarrowQuickHost > QuickHost() = 0;
  virtual std::shared_ptr< ICommandRegistry > Commands() = 0;
  virtual std::shared_ptr< IContentFactories > ContentFactories() = 0;
  virtual std::shared_ptr< IRenderResources > RenderResources() = 0;
  virtual std::shared_ptr< VMeshSceneCache > MeshCache() = 0; ///< may be null
  virtual std::shared_ptr< ZEK::IPostalService > Dispatcher() = 0;
};

} // namespace HarrowPluginInterface
