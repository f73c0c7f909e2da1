#pragma once

#include <ZEK/Log.h>

namespace MoxelGraphics
{

inline const ZEK::VLogCategory& LogCategory()
{
  static const ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "MoxelGraphics" );
  return rCategory;
}

} // namespace MoxelGraphics
