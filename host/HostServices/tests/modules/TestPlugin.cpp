// A plug-in that tells the log what is asked of it. Built several times, with a fault each.

#include <HarrowPluginInterface/IHarrowApplication.h>
#include <HarrowPluginInterface/IHarrowWorkspace.h>
#include <HarrowPluginInterface/IPlugin.h>

#include <ZEK/Log.h>

#include <stdexcept>
#include <string_view>

namespace
{
#if defined( HARROW_TEST_FAULT )
constexpr std::string_view Fault = HARROW_TEST_FAULT;
#else
constexpr std::string_view Fault;
#endif
constexpr bool bFails = Fault == "fails", bThrows = Fault == "throws", bUnmade = Fault == "unmade";

void Say( const char* i_pText )
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "TestPlugin" );
  ZEK::Log( rCategory, ZEK::ELogDetail, "%1%", i_pText );
}

class VTestFactory final : public HarrowPluginInterface::IWorkspaceContentFactory
{
public:
  ~VTestFactory() override { Say( "factory gone" ); }
  void Create( std::shared_ptr< HarrowPluginInterface::VWindowFrameContent >&,
               const std::shared_ptr< HarrowPluginInterface::IStateCacheContext >&,
               const QPointer< QWidget >& ) override
  {
  }
};

class VTestPlugin final : public HarrowPluginInterface::IPlugin
{
public:
  ~VTestPlugin() override { Say( "destroyed" ); }

  bool RegisterGraphicsTypes( HarrowPluginInterface::IHarrowApplication& ) override
  {
    Say( "types" );
    return !bFails;
  }

  bool CreateWorkspaceContent( HarrowPluginInterface::IHarrowApplication&,
                               HarrowPluginInterface::IHarrowWorkspace& i_rWorkspace ) override
  {
    Say( "content" );
    i_rWorkspace.ContentFactories()->AddFactory( "Test View", std::make_shared< VTestFactory >() );
    return bThrows ? throw std::runtime_error( "no folder" ) : true;
  }

  void ReleaseGraphics() override { Say( "released" ); }
};
} // namespace

#define HARROW_TEST_EXPORT extern "C" __attribute__( ( visibility( "default" ) ) )

#if !defined( HARROW_TEST_BARE )
HARROW_TEST_EXPORT HarrowPluginInterface::IPlugin* CreatePlugin()
{
  return bUnmade ? throw std::runtime_error( "no memory" ) : new VTestPlugin;
}

HARROW_TEST_EXPORT std::uint64_t PluginBuildRevision()
{
  return HARROW_TEST_REVISION;
}

#if !defined( HARROW_TEST_NO_DESTROY )
HARROW_TEST_EXPORT void DestroyPlugin( HarrowPluginInterface::IPlugin* i_pPlugin )
{
  delete i_pPlugin;
}
#endif
#endif
