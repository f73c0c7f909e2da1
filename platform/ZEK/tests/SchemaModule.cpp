#include "SchemaModule.h"

#include <ZEK/Serialiser.h>

extern "C" __attribute__( ( visibility( "default" ) ) ) const ZEK::IO::ISchema* SchemaOfModule( bool i_bPod )
{
  using VPairs = std::vector< std::pair< std::int32_t, std::string > >;
  return i_bPod ? ZEK::IO::VSerialiser< float >::Schema() : ZEK::IO::VSerialiser< VPairs >::Schema();
}
