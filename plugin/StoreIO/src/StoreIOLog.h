#pragma once

#include <ZEK/Log.h>

#include <string>
#include <vector>

namespace StoreIO
{

inline const ZEK::VLogCategory& LogCategory()
{
  static const ZEK::VLogCategory& s_rCategory = ZEK::GlobalLog().Category( "StoreIO" );
  return s_rCategory;
}

inline void LogFailures( const std::vector< std::string >& i_rTexts )
{
  for ( const std::string& rText : i_rTexts )
  {
    ZEK::Log( LogCategory(), ZEK::ELogFailure, "%1%", rText );
  }
}

} // namespace StoreIO
