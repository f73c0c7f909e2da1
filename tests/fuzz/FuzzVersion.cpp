#include "FuzzRequire.h"

#include <ZEK/TypedValueText.h>

#include <cstddef>
#include <cstdint>
#include <string_view>

using namespace ZEK;

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  IO::VVersion Version{ 7, 7 };
  IO::VVersion Again;
  if ( IO::VersionFromText( { reinterpret_cast< const char* >( i_pData ), i_Size }, Version ) )
  {
    FuzzCheck::Require( IO::VersionFromText( IO::VersionToText( Version ), Again ) && Again == Version,
                        "a version comes back from its text" );
  }
  else
  {
    FuzzCheck::Require( Version == IO::VVersion{ 7, 7 }, "a failure leaves the version" );
  }
  return 0;
}
