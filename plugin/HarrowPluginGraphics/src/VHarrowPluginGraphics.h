#pragma once

#include <HarrowPluginInterface/IPlugin.h>

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
};

} // namespace HarrowPluginGraphics
