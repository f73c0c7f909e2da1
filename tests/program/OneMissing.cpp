// A plug-in that lacks its revision.
#include <HarrowPluginInterface/IPlugin.h>

extern "C" __attribute__( ( visibility( "default" ) ) ) HarrowPluginInterface::IPlugin* CreatePlugin()
{
  return new HarrowPluginInterface::IPlugin;
}

extern "C" __attribute__( ( visibility( "default" ) ) ) void DestroyPlugin( HarrowPluginInterface::IPlugin* i_pPlugin )
{
  delete i_pPlugin;
}
