#pragma once

#include <ZEK/Log.h>

namespace CoreGraphics
{

inline ZEK::VLogCategory& GraphicsLog()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "CoreGraphics" );
  return rCategory;
}

} // namespace CoreGraphics
