#pragma once

#include <ZEK/Log.h>

namespace Store
{

inline const ZEK::VLogCategory& StoreCategory()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Store" );
  return rCategory;
}

} // namespace Store
