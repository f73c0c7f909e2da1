#include "FuzzRequire.h"

#include <ZEK/Schema.h>

#include <cstddef>
#include <cstdint>
#include <string_view>

using namespace ZEK;
using FuzzCheck::Require;

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  const IO::ISchema* pSchema = nullptr;
  IO::VTextError Error;
  if ( IO::SchemaFromJson( { reinterpret_cast< const char* >( i_pData ), i_Size }, pSchema, &Error ).IsError() )
  {
    Require( pSchema == nullptr, "a failure gives no schema" );
    Require( !Error.m_Message.empty() && Error.m_Position <= i_Size, "a failure has a reason and a place" );
    return 0;
  }
  const IO::ISchema* pAgain = nullptr;
  Require( IO::SchemaFromJson( IO::SchemaToJson( pSchema ), pAgain ) == IResult::Ok && pAgain == pSchema,
           "the text of a schema is that schema" );
  return 0;
}
