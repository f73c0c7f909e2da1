#pragma once

#include <ZEK/Log.h>

namespace HostMeshes
{

inline const ZEK::VLogCategory& MeshLog()
{
  static const ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Meshes" );
  return rCategory;
}

} // namespace HostMeshes
