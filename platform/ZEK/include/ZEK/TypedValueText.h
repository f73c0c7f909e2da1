#pragma once

#include <ZEK/Export.h>
#include <ZEK/TextError.h>
#include <ZEK/TypedValue.h>

#include <compare>
#include <cstdint>
#include <string>
#include <string_view>

namespace ZEK::IO
{

/// The text of a value: compact JSON. An Array, List or Tuple is `[1,2,3]`, a NamedTuple `{"Name":"x","Count":2}`
/// in the order of the schema; numbers have the shortest form that reads back; an Enum is its name, in quotes
/// inside a container and bare alone, or its number when no name has it. Bytes of a String that are not UTF-8
/// stand as they are.
///
/// False, with an empty text, for a value without bytes or with bytes that do not fit its schema, and for one that
/// holds a number that is not finite.
ZEK_API bool ValueToText( const VTypedValue& i_rValue, std::string& o_rText );

/// Reads that form back, with white space between tokens and the members of a NamedTuple in any order. Whole numbers
/// must be in range, and floating numbers neither so great nor so small that the type cannot hold them; counts of
/// Array and Tuple must be right and every member of a NamedTuple be there once.
///
/// False, with a value that is of the schema and has no bytes, for anything else; the error tells the place.
ZEK_API bool ValueFromText( const ISchema* i_pSchema, std::string_view i_Text, VTypedValue& o_rValue,
                            VTextError* o_pError = nullptr );

/// A version as settings files carry it.
struct VVersion
{
  std::uint32_t m_Major = 0;
  std::uint32_t m_Minor = 0;
  friend auto operator<=>( const VVersion&, const VVersion& ) = default;
};

/// "3.0"
ZEK_API std::string VersionToText( VVersion i_Version );
/// Takes two decimal numbers with a point between them and nothing else.
ZEK_API bool VersionFromText( std::string_view i_Text, VVersion& o_rVersion );

} // namespace ZEK::IO
