#include "SettingsValue.h"

#include <ZEK/ByteCodec.h>
#include <ZEK/TypedValueText.h>

#include <cstdint>

namespace HostSettings
{

using namespace ZEK;
using IO::EType;

namespace
{
bool Fits( EType i_Type, std::string_view i_Text )
{
  VTypedValue Value;
  // White space around a number makes it a text.
  return !i_Text.empty() && i_Text.find_first_of( " \t\r\n" ) == std::string_view::npos &&
         IO::ValueFromText( IO::GetUniquePodSchema( i_Type ), i_Text, Value );
}
} // namespace

const IO::ISchema* SchemaByForm( std::string_view i_Text )
{
  for ( const EType Type : { EType::Bool, EType::Int32, EType::Float64 } )
  {
    if ( Fits( Type, i_Text ) )
    {
      return IO::GetUniquePodSchema( Type );
    }
  }
  return IO::GetUniquePodSchema( EType::String );
}

const IO::ISchema* SchemaByName( const std::string& i_rName )
{
  EType Type = EType::Void;
  const IO::ISchema* pSchema = nullptr;
  if ( IO::TypeFromName( i_rName, Type ) )
  {
    return Type != EType::Void ? IO::GetUniquePodSchema( Type ) : nullptr;
  }
  (void)IO::SchemaFromJson( i_rName, pSchema );
  return pSchema;
}

bool BareText( const VTypedValue& i_rValue, std::string& o_rText )
{
  if ( i_rValue.Schema()->m_Type != EType::String )
  {
    return IO::ValueToText( i_rValue, o_rText );
  }
  std::string_view Text;
  const bool bRead = IO::VByteReader( i_rValue.m_Data ).GetText( Text );
  o_rText = Text;
  return bRead;
}

bool FromBareText( const IO::ISchema* i_pSchema, std::string_view i_Text, VTypedValue& o_rValue, std::string& o_rError )
{
  if ( i_pSchema->m_Type == EType::String )
  {
    o_rValue = VTypedValue( i_pSchema, {} );
    IO::VByteWriter( o_rValue.m_Data ).PutText( i_Text );
    return true;
  }
  IO::VTextError Error;
  const bool bRead = IO::ValueFromText( i_pSchema, i_Text, o_rValue, &Error );
  o_rError = bRead ? "" : Error.Text();
  return bRead;
}

} // namespace HostSettings
