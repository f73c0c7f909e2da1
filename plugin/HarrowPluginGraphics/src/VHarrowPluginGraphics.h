#pragma once

#include <HarrowPluginInterface/IPlugin.h>
#include <ZEK/Shared.h>

#include <memory>

namespace Flow2Graphics
{
class VStressTest;
}
namespace HarrowPluginInterface
{
class ICommandRegistry;
}

namespace HarrowPluginGraphics
{

/// The plug-in object: publishes the types, the window kinds and the menu entries.
class VHarrowPluginGraphics final : public HarrowPluginInterface::IPlugin
{
public:
  bool RegisterGraphicsTypes( HarrowPluginInterface::IHarrowApplication& io_rApplication ) override;
  bool CreateWorkspaceContent( HarrowPluginInterface::IHarrowApplication& io_rApplication,
                               HarrowPluginInterface::IHarrowWorkspace& io_rWorkspace ) override;
  void ReleaseGraphics() override;

private:
  void AddTestCaches( HarrowPluginInterface::IHarrowApplication& io_rApplication,
                      HarrowPluginInterface::ICommandRegistry& io_rCommands );

  std::shared_ptr< ZEK::VShared > m_pFolderWatcher;            ///< none without a mesh cache
  std::shared_ptr< Flow2Graphics::VStressTest > m_pStressTest; ///< in developer mode only
};

} // namespace HarrowPluginGraphics
