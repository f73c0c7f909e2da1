#include "VHarrowPluginGraphics.h"

#include <new>

namespace
{
constexpr std::uint64_t BuildRevision = 155050;
}

extern "C"
{
  __attribute__( ( visibility( "default" ) ) ) HarrowPluginInterface::IPlugin* CreatePlugin()
  {
    return new ( std::nothrow ) HarrowPluginGraphics::VHarrowPluginGraphics;
  }

  __attribute__( ( visibility( "default" ) ) ) void DestroyPlugin( HarrowPluginInterface::IPlugin* i_pPlugin )
  {
    delete i_pPlugin;
  }

  __attribute__( ( visibility( "default" ) ) ) std::uint64_t PluginBuildRevision()
  {
    return BuildRevision;
  }
}
