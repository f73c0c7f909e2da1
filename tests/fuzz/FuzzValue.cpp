#include "FuzzRequire.h"

#include <ZEK/TypedValueText.h>

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

using namespace ZEK;
using FuzzCheck::Require;

/// A schema, a line feed, and what is taken once as the text and once as the bytes of a value.
extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  const std::string_view Text( reinterpret_cast< const char* >( i_pData ), i_Size );
  const std::size_t Line = Text.find( '\n' );
  const IO::ISchema* pSchema = nullptr;
  if ( Line == std::string_view::npos || IO::SchemaFromJson( Text.substr( 0, Line ), pSchema ).IsError() )
  {
    return 0;
  }
  const std::string_view Rest = Text.substr( Line + 1 );
  VTypedValue Value;
  IO::VTextError Error;
  std::string Written;
  if ( IO::ValueFromText( pSchema, Rest, Value, &Error ) )
  {
    VTypedValue Again;
    Require( !Value.IsEmpty() && IO::IsWellFormed( Value ), "a text gives a value of the schema" );
    Require( IO::ValueToText( Value, Written ) && IO::ValueFromText( pSchema, Written, Again ) && Again == Value,
             "a value comes back from its text" );
  }
  else
  {
    Require( Value.IsEmpty() && Error.m_Position <= Rest.size(), "a failure gives no value, and a place" );
  }
  const VTypedValue Raw( pSchema, IO::VValueBytes( Rest.data(), Rest.size() ) );
  const bool bWritten = IO::ValueToText( Raw, Written );
  Require( !bWritten || IO::IsWellFormed( Raw ), "only a value has a text" );
  Require( !bWritten || IO::ValueFromText( pSchema, Written, Value ), "a text of bytes can be read" );
  return 0;
}
