#pragma once

#include <HarrowPluginInterface/IPlugin.h>
#include <ZEK/Shared.h>

#include <memory>

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
  std::shared_ptr< ZEK::VShared > m_pFolderWatcher; ///< none without a mesh cache
};

} // namespace HarrowPluginGraphics
