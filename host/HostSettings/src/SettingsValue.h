#pragma once

#include <ZEK/Result.h>
#include <ZEK/TypedValue.h>

#include <optional>
#include <string>
#include <string_view>

namespace HostSettings
{

/// Bool, Int32, Float64 or String by the form of the text.
const ZEK::IO::ISchema* SchemaByForm( std::string_view i_Text );
/// A type's name, or a schema as JSON; null for anything else.
const ZEK::IO::ISchema* SchemaByName( const std::string& i_rName );

/// The text of a value with a String as it stands; of another type as documents have it.
bool BareText( const ZEK::VTypedValue& i_rValue, std::string& o_rText );
bool FromBareText( const ZEK::IO::ISchema* i_pSchema, std::string_view i_Text, ZEK::VTypedValue& o_rValue,
                   std::string& o_rError );

} // namespace HostSettings
