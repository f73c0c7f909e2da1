#include "JsonCursor.h"
#include "SchemaRegistry.h"

#include <ZEK/ByteCodec.h>
#include <ZEK/TypedValueText.h>

#include <charconv>
#include <cmath>
#include <concepts>
#include <string_view>
#include <utility>

namespace ZEK::IO
{
namespace
{
/// Where an Enum stands: its name is bare alone, and in quotes inside a container.
enum class EPlace
{
  Alone,
  Inside
};

class VValueTextWriter
{
public:
  VValueTextWriter( VByteReader& io_rReader, std::string& io_rText )
    : m_rReader( io_rReader )
    , m_rText( io_rText )
  {
  }

  bool Write( const ISchema& i_rSchema, EPlace i_Place, std::uint32_t i_Nesting )
  {
    if ( i_Nesting > MaximumNesting )
    {
      return false;
    }
    bool bBool = false;
    std::string_view Text;
    switch ( i_rSchema.m_Type )
    {
    case EType::Void:
      return false;
    case EType::Bool:
      return m_rReader.GetBool( bBool ) && Append( bBool ? "true" : "false" );
    case EType::Int8:
      return Number< std::int8_t >();
    case EType::Int16:
      return Number< std::int16_t >();
    case EType::Int32:
      return Number< std::int32_t >();
    case EType::Int64:
      return Number< std::int64_t >();
    case EType::UInt8:
      return Number< std::uint8_t >();
    case EType::UInt16:
      return Number< std::uint16_t >();
    case EType::UInt32:
      return Number< std::uint32_t >();
    case EType::UInt64:
      return Number< std::uint64_t >();
    case EType::Float32:
      return Number< float >();
    case EType::Float64:
      return Number< double >();
    case EType::String:
      if ( !m_rReader.GetText( Text ) )
      {
        return false;
      }
      AppendJsonString( Text, m_rText );
      return true;
    case EType::Enum8:
      return Enum< std::int8_t >( i_rSchema, i_Place );
    case EType::Enum16:
      return Enum< std::int16_t >( i_rSchema, i_Place );
    case EType::Enum32:
      return Enum< std::int32_t >( i_rSchema, i_Place );
    default:
      return Container( i_rSchema, i_Nesting + 1 );
    }
  }

private:
  bool Append( std::string_view i_Text )
  {
    m_rText += i_Text;
    return true;
  }
  template < IPlainNumber T >
  bool AppendNumber( T i_Value )
  {
    // The shortest form of a double that reads back has at most 24 characters.
    char Text[32];
    const auto Result = std::to_chars( Text, Text + sizeof( Text ), i_Value );
    return Append( { Text, static_cast< std::size_t >( Result.ptr - Text ) } );
  }
  template < IPlainNumber T >
  bool Number()
  {
    T Value = 0;
    if ( !m_rReader.Get( Value ) )
    {
      return false;
    }
    if constexpr ( std::floating_point< T > )
    {
      if ( !std::isfinite( Value ) )
      {
        return false;
      }
    }
    return AppendNumber( Value );
  }
  template < std::integral T >
  bool Enum( const ISchema& i_rSchema, EPlace i_Place )
  {
    T Value = 0;
    if ( !m_rReader.Get( Value ) )
    {
      return false;
    }
    for ( const auto& [rName, Named] : i_rSchema.m_EnumValues )
    {
      if ( Named == Value && i_Place == EPlace::Alone )
      {
        return Append( rName );
      }
      if ( Named == Value )
      {
        AppendJsonString( rName, m_rText );
        return true;
      }
    }
    return AppendNumber( Value );
  }

  bool Container( const ISchema& i_rSchema, std::uint32_t i_Nesting )
  {
    if ( i_rSchema.m_Type == EType::Tuple || i_rSchema.m_Type == EType::NamedTuple )
    {
      return Members( i_rSchema, i_Nesting );
    }
    std::uint32_t Count = i_rSchema.m_Count;
    if ( i_rSchema.m_Type == EType::List && !m_rReader.Get( Count ) )
    {
      return false;
    }
    m_rText += '[';
    for ( std::uint32_t Index = 0; Index < Count; ++Index )
    {
      m_rText.append( Index != 0 ? "," : "" );
      if ( !Write( *i_rSchema.m_SubSchemas.front().second, EPlace::Inside, i_Nesting ) )
      {
        return false;
      }
    }
    return Append( "]" );
  }

  bool Members( const ISchema& i_rSchema, std::uint32_t i_Nesting )
  {
    const bool bNamed = i_rSchema.m_Type == EType::NamedTuple;
    char Separator = bNamed ? '{' : '[';
    for ( const auto& [rName, pSub] : i_rSchema.m_SubSchemas )
    {
      m_rText += std::exchange( Separator, ',' );
      if ( bNamed )
      {
        AppendJsonString( rName, m_rText );
        m_rText += ':';
      }
      if ( !Write( *pSub, EPlace::Inside, i_Nesting ) )
      {
        return false;
      }
    }
    return Append( bNamed ? "}" : "]" );
  }

  VByteReader& m_rReader;
  std::string& m_rText;
};
} // namespace

bool ValueToText( const VTypedValue& i_rValue, std::string& o_rText )
{
  o_rText.clear();
  VByteReader Reader( i_rValue.m_Data );
  if ( VValueTextWriter( Reader, o_rText ).Write( *i_rValue.Schema(), EPlace::Alone, 0 ) && Reader.Left() == 0 )
  {
    return true;
  }
  o_rText.clear();
  return false;
}

std::string VersionToText( VVersion i_Version )
{
  return std::to_string( i_Version.m_Major ) + '.' + std::to_string( i_Version.m_Minor );
}

bool VersionFromText( std::string_view i_Text, VVersion& o_rVersion )
{
  const char* const pEnd = i_Text.data() + i_Text.size();
  VVersion Version;
  const auto Major = std::from_chars( i_Text.data(), pEnd, Version.m_Major );
  if ( Major.ec != std::errc() || Major.ptr == pEnd || *Major.ptr != '.' )
  {
    return false;
  }
  const auto Minor = std::from_chars( Major.ptr + 1, pEnd, Version.m_Minor );
  if ( Minor.ec != std::errc() || Minor.ptr != pEnd )
  {
    return false;
  }
  o_rVersion = Version;
  return true;
}

} // namespace ZEK::IO
