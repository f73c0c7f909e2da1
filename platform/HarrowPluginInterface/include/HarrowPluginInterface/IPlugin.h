#pragma once

#include <cstdint>

namespace HarrowPluginInterface
{

class IHarrowApplication;
class IHarrowWorkspace;

/// What a host sees of a plug-in. Thread: every call comes on the GUI thread.
///
/// The order of calls is CreatePlugin, RegisterGraphicsTypes, CreateWorkspaceContent, ReleaseGraphics, DestroyPlugin.
/// A derived plug-in overrides only what it needs. The order of the operations is binary interface.
class IPlugin
{
public:
  virtual ~IPlugin() = default;
  virtual const char* DisplayName() const { return ""; }
  virtual const char* Description() const { return ""; }
  virtual bool Hook1() { return true; }
  virtual bool Hook2() { return true; }
  virtual bool Hook3() { return true; }
  virtual bool Hook4() { return true; }
  virtual bool Hook5() { return true; }
  /// Publishes types; must precede the loading of any QML document.
  virtual bool RegisterGraphicsTypes( IHarrowApplication& ) { return true; }
  /// Publishes window kinds, commands and menu entries.
  virtual bool CreateWorkspaceContent( IHarrowApplication&, IHarrowWorkspace& ) { return true; }
  virtual bool Hook6() { return true; }
  virtual void ReleaseGraphics() {}
  virtual void Hook7() {}
};

/// The signatures of the three exported functions, by their unmangled names.
using FCreatePlugin = IPlugin* (*)();
using FDestroyPlugin = void ( * )( IPlugin* );
using FPluginBuildRevision = std::uint64_t ( * )();

} // namespace HarrowPluginInterface
