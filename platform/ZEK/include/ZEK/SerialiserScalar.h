#pragma once

#include <ZEK/ByteCodec.h>
#include <ZEK/Export.h>
#include <ZEK/Schema.h>

#include <concepts>
#include <cstdint>
#include <string>
#include <string_view>

namespace ZEK::IO
{

/// How values of the C++ type `T` are stored: `static const ISchema* Schema()`, `static void Write( const T&,
/// VByteWriter& )` and `static bool Read( VByteReader&, T& )`. `Read` is false for bytes that are no value of the
/// schema. Enums and structs specialise it, see SerialiserRecord.h.
template < typename T >
struct VSerialiser;

/// The integer types that are numbers, characters left out.
template < typename T >
concept IStoredInteger =
    std::integral< T > && !std::same_as< T, bool > && !std::same_as< T, char > && !std::same_as< T, wchar_t > &&
    !std::same_as< T, char8_t > && !std::same_as< T, char16_t > && !std::same_as< T, char32_t >;
template < typename T >
concept IStoredNumber = IStoredInteger< T > || std::same_as< T, float > || std::same_as< T, double >;

/// The schema type of a number.
template < IStoredNumber T >
constexpr EType NumberType()
{
  if constexpr ( std::floating_point< T > )
  {
    return sizeof( T ) == 4 ? EType::Float32 : EType::Float64;
  }
  else
  {
    constexpr EType First = std::is_signed_v< T > ? EType::Int8 : EType::UInt8;
    return static_cast< EType >( static_cast< int >( First ) + std::countr_zero( sizeof( T ) ) );
  }
}

template < EType Type >
const ISchema* PodSchema()
{
  static const ISchema* const pSchema = GetUniquePodSchema( Type );
  return pSchema;
}

template <>
struct VSerialiser< bool >
{
  static const ISchema* Schema() { return PodSchema< EType::Bool >(); }
  static void Write( bool i_bValue, VByteWriter& io_rWriter ) { io_rWriter.Put( std::uint8_t( i_bValue ? 1 : 0 ) ); }
  static bool Read( VByteReader& io_rReader, bool& o_rbValue ) { return io_rReader.GetBool( o_rbValue ); }
};

template < IStoredNumber T >
struct VSerialiser< T >
{
  static const ISchema* Schema() { return PodSchema< NumberType< T >() >(); }
  static void Write( T i_Value, VByteWriter& io_rWriter ) { io_rWriter.Put( i_Value ); }
  static bool Read( VByteReader& io_rReader, T& o_rValue ) { return io_rReader.Get( o_rValue ); }
};

template <>
struct VSerialiser< std::string >
{
  static const ISchema* Schema() { return PodSchema< EType::String >(); }
  static void Write( std::string_view i_Value, VByteWriter& io_rWriter ) { io_rWriter.PutText( i_Value ); }
  static bool Read( VByteReader& io_rReader, std::string& o_rValue )
  {
    std::string_view Text;
    const bool bRead = io_rReader.GetText( Text );
    o_rValue.assign( Text );
    return bRead;
  }
};

/// U+FFFD stands for what has no form in UTF-8.
ZEK_API std::string WideToUtf8( std::wstring_view i_Text );
/// U+FFFD stands for every byte that is not part of a character.
ZEK_API std::wstring Utf8ToWide( std::string_view i_Text );

/// A String in UTF-8.
template <>
struct VSerialiser< std::wstring >
{
  static const ISchema* Schema() { return PodSchema< EType::String >(); }
  static void Write( std::wstring_view i_Value, VByteWriter& io_rWriter )
  {
    io_rWriter.PutText( WideToUtf8( i_Value ) );
  }
  static bool Read( VByteReader& io_rReader, std::wstring& o_rValue )
  {
    std::string_view Text;
    const bool bRead = io_rReader.GetText( Text );
    o_rValue = Utf8ToWide( Text );
    return bRead;
  }
};

} // namespace ZEK::IO
