#include "SchemaRegistry.h"

#include <ZEK/ByteCodec.h>
#include <ZEK/TypedValue.h>

#include <string_view>

namespace ZEK::IO
{
namespace
{
bool Pass( const ISchema& i_rSchema, VByteReader& io_rReader, std::uint32_t i_Nesting )
{
  const auto Bytes = [&io_rReader]( std::size_t i_Size )
  {
    return io_rReader.Take( i_Size ) != nullptr;
  };
  const auto Elements = [&]( std::uint32_t i_Count )
  {
    for ( std::uint32_t Index = 0; Index < i_Count; ++Index )
    {
      if ( !Pass( *i_rSchema.m_SubSchemas.front().second, io_rReader, i_Nesting + 1 ) )
      {
        return false;
      }
    }
    return true;
  };
  if ( i_Nesting > MaximumNesting )
  {
    return false;
  }
  bool bBool = false;
  std::uint32_t Count = 0;
  std::string_view Text;
  switch ( i_rSchema.m_Type )
  {
  case EType::Void:
    return true;
  case EType::Bool:
    return io_rReader.GetBool( bBool );
  case EType::Int8:
  case EType::UInt8:
  case EType::Enum8:
    return Bytes( 1 );
  case EType::Int16:
  case EType::UInt16:
  case EType::Enum16:
    return Bytes( 2 );
  case EType::Int32:
  case EType::UInt32:
  case EType::Float32:
  case EType::Enum32:
    return Bytes( 4 );
  case EType::Int64:
  case EType::UInt64:
  case EType::Float64:
    return Bytes( 8 );
  case EType::String:
    return io_rReader.GetText( Text );
  case EType::Array:
    return Elements( i_rSchema.m_Count );
  case EType::List:
    return io_rReader.Get( Count ) && Elements( Count );
  case EType::Tuple:
  case EType::NamedTuple:
    break;
  }
  for ( const auto& rSub : i_rSchema.m_SubSchemas )
  {
    if ( !Pass( *rSub.second, io_rReader, i_Nesting + 1 ) )
    {
      return false;
    }
  }
  return true;
}
} // namespace

bool IsWellFormed( const VTypedValue& i_rValue )
{
  VByteReader Reader( i_rValue.m_Data );
  return Pass( *i_rValue.Schema(), Reader, 0 ) && Reader.Left() == 0;
}

} // namespace ZEK::IO
