#include "LeafCodec.h"

#include "JsonWriter.h"

#include <ZEK/ByteCodec.h>
#include <ZEK/TypedValueText.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <string_view>
#include <utility>

namespace StoreIO
{

using namespace ZEK;
using IO::EType;

namespace
{
constexpr double TwoTo63 = 9223372036854775808.0;
constexpr double TwoTo64 = 18446744073709551616.0;

/// A number modulo 2^64, towards zero.
std::uint64_t WholeNumber( const rapidjson::Value& i_rLeaf )
{
  if ( i_rLeaf.IsUint64() )
  {
    return i_rLeaf.GetUint64();
  }
  if ( i_rLeaf.IsInt64() )
  {
    return static_cast< std::uint64_t >( i_rLeaf.GetInt64() );
  }
  const double Value = i_rLeaf.IsDouble() ? i_rLeaf.GetDouble() : 0;
  if ( std::abs( Value ) < TwoTo63 )
  {
    return static_cast< std::uint64_t >( static_cast< std::int64_t >( Value ) );
  }
  const auto Rest = static_cast< std::uint64_t >( std::fmod( std::abs( Value ), TwoTo64 ) );
  return Value < 0 ? 0 - Rest : Rest;
}

double FloatNumber( const rapidjson::Value& i_rLeaf )
{
  if ( i_rLeaf.IsDouble() )
  {
    return i_rLeaf.GetDouble();
  }
  return i_rLeaf.IsUint64()  ? static_cast< double >( i_rLeaf.GetUint64() )
         : i_rLeaf.IsInt64() ? static_cast< double >( i_rLeaf.GetInt64() )
                             : 0;
}

/// The greatest float for what would not be finite: it could not be written again.
float NarrowFloat( double i_Value )
{
  constexpr double Greatest = std::numeric_limits< float >::max();
  return static_cast< float >( std::abs( i_Value ) <= Greatest ? i_Value : std::copysign( Greatest, i_Value ) );
}

template < typename T >
void PutWhole( const rapidjson::Value& i_rLeaf, IO::VByteWriter& io_rWriter )
{
  io_rWriter.Put( static_cast< T >( WholeNumber( i_rLeaf ) ) );
}

template < typename T >
bool HoldsWhole( const rapidjson::Value& i_rLeaf )
{
  if ( i_rLeaf.IsUint64() )
  {
    return i_rLeaf.GetUint64() <= static_cast< std::uint64_t >( std::numeric_limits< T >::max() );
  }
  return i_rLeaf.IsInt64() && std::in_range< T >( i_rLeaf.GetInt64() );
}

/// False for a type that has its value in a text.
bool HoldsNumber( EType i_Type, const rapidjson::Value& i_rLeaf )
{
  switch ( i_Type )
  {
  case EType::Int8:
    return HoldsWhole< std::int8_t >( i_rLeaf );
  case EType::Int16:
    return HoldsWhole< std::int16_t >( i_rLeaf );
  case EType::Int32:
    return HoldsWhole< std::int32_t >( i_rLeaf );
  case EType::Int64:
    return HoldsWhole< std::int64_t >( i_rLeaf );
  case EType::UInt8:
    return HoldsWhole< std::uint8_t >( i_rLeaf );
  case EType::UInt16:
    return HoldsWhole< std::uint16_t >( i_rLeaf );
  case EType::UInt32:
    return HoldsWhole< std::uint32_t >( i_rLeaf );
  case EType::UInt64:
    return HoldsWhole< std::uint64_t >( i_rLeaf );
  case EType::Float32:
    return std::abs( FloatNumber( i_rLeaf ) ) <= std::numeric_limits< float >::max();
  default:
    return i_Type == EType::Float64;
  }
}

template < typename T >
bool TellNumber( IO::VByteReader& io_rBytes, rapidjson::Document& io_rDocument )
{
  T Value = 0;
  if ( !io_rBytes.Get( Value ) || io_rBytes.Left() != 0 )
  {
    return false;
  }
  if constexpr ( std::floating_point< T > )
  {
    return io_rDocument.Double( static_cast< double >( Value ) );
  }
  else if constexpr ( std::is_signed_v< T > )
  {
    return io_rDocument.Int64( Value );
  }
  else
  {
    return io_rDocument.Uint64( Value );
  }
}

bool TellText( std::string_view i_Text, rapidjson::Document& io_rDocument )
{
  return io_rDocument.String( i_Text.data(), static_cast< rapidjson::SizeType >( i_Text.size() ), true );
}
} // namespace

VTypedValue DecodeLeaf( const IO::ISchema* i_pSchema, const rapidjson::Value& i_rLeaf )
{
  VTypedValue Value( i_pSchema, {} );
  IO::VByteWriter Writer( Value.m_Data );
  switch ( i_pSchema->m_Type )
  {
  case EType::Bool:
    Writer.Put( static_cast< std::uint8_t >( i_rLeaf.IsTrue() ) );
    break;
  case EType::Int8:
  case EType::UInt8:
    PutWhole< std::uint8_t >( i_rLeaf, Writer );
    break;
  case EType::Int16:
  case EType::UInt16:
    PutWhole< std::uint16_t >( i_rLeaf, Writer );
    break;
  case EType::Int32:
  case EType::UInt32:
    PutWhole< std::uint32_t >( i_rLeaf, Writer );
    break;
  case EType::Int64:
  case EType::UInt64:
    PutWhole< std::uint64_t >( i_rLeaf, Writer );
    break;
  case EType::Float32:
    Writer.Put( NarrowFloat( FloatNumber( i_rLeaf ) ) );
    break;
  case EType::Float64:
    Writer.Put( FloatNumber( i_rLeaf ) );
    break;
  case EType::String:
    if ( i_rLeaf.IsString() )
    {
      Writer.PutText( TextOf( i_rLeaf ) );
    }
    break;
  default:
    if ( i_rLeaf.IsString() )
    {
      (void)IO::ValueFromText( i_pSchema, TextOf( i_rLeaf ), Value );
    }
  }
  return Value;
}

const char* LeafRemark( EType i_Type, const rapidjson::Value& i_rLeaf )
{
  if ( i_Type == EType::Bool )
  {
    return i_rLeaf.IsBool() ? nullptr : "is neither true nor false";
  }
  if ( i_Type < EType::Int8 || i_Type > EType::Float64 )
  {
    return nullptr;
  }
  if ( !i_rLeaf.IsNumber() )
  {
    return "is not a number";
  }
  return HoldsNumber( i_Type, i_rLeaf ) ? nullptr : "does not fit its type";
}

bool EncodeLeaf( const VTypedValue& i_rValue, rapidjson::Document& io_rDocument, std::string& io_rText )
{
  IO::VByteReader Bytes( i_rValue.m_Data );
  bool bBool = false;
  std::string_view Text;
  switch ( i_rValue.Schema()->m_Type )
  {
  case EType::Bool:
    return Bytes.GetBool( bBool ) && Bytes.Left() == 0 && io_rDocument.Bool( bBool );
  case EType::Int8:
    return TellNumber< std::int8_t >( Bytes, io_rDocument );
  case EType::Int16:
    return TellNumber< std::int16_t >( Bytes, io_rDocument );
  case EType::Int32:
    return TellNumber< std::int32_t >( Bytes, io_rDocument );
  case EType::Int64:
    return TellNumber< std::int64_t >( Bytes, io_rDocument );
  case EType::UInt8:
    return TellNumber< std::uint8_t >( Bytes, io_rDocument );
  case EType::UInt16:
    return TellNumber< std::uint16_t >( Bytes, io_rDocument );
  case EType::UInt32:
    return TellNumber< std::uint32_t >( Bytes, io_rDocument );
  case EType::UInt64:
    return TellNumber< std::uint64_t >( Bytes, io_rDocument );
  case EType::Float32:
    return TellNumber< float >( Bytes, io_rDocument );
  case EType::Float64:
    return TellNumber< double >( Bytes, io_rDocument );
  case EType::String:
    return Bytes.GetText( Text ) && Bytes.Left() == 0 && TellText( Text, io_rDocument );
  default:
    return IO::ValueToText( i_rValue, io_rText ) && TellText( io_rText, io_rDocument );
  }
}

} // namespace StoreIO
