#include "JsonCursor.h"
#include "SchemaRegistry.h"

#include <ZEK/ByteCodec.h>
#include <ZEK/TypedValueText.h>

#include <concepts>
#include <string_view>
#include <utility>
#include <vector>

namespace ZEK::IO
{
namespace
{
/// Reads the text of a value along its schema, which also bounds how deep it goes.
class VValueParser
{
public:
  explicit VValueParser( std::string_view i_Text )
    : m_Cursor( i_Text )
    , m_Text( i_Text )
  {
  }

  bool Parse( const ISchema& i_rSchema, VValueBytes& o_rBytes, VTextError* o_pError )
  {
    VByteWriter Writer( o_rBytes );
    if ( ( IsEnum( i_rSchema.m_Type ) && BareEnum( i_rSchema, Writer ) ) ||
         ( Value( i_rSchema, Writer, 0 ) && m_Cursor.End() ) )
    {
      return true;
    }
    if ( o_pError != nullptr )
    {
      *o_pError = m_Cursor.Error();
    }
    return false;
  }

private:
  bool Value( const ISchema& i_rSchema, VByteWriter& io_rWriter, std::uint32_t i_Nesting )
  {
    std::string Text;
    bool bBool = false;
    switch ( i_rSchema.m_Type )
    {
    case EType::Void:
      return m_Cursor.Fail( "Void has no text" );
    case EType::Bool:
      if ( !m_Cursor.Bool( bBool ) )
      {
        return false;
      }
      io_rWriter.Put( static_cast< std::uint8_t >( bBool ) );
      return true;
    case EType::Int8:
      return Integer< std::int8_t >( io_rWriter );
    case EType::Int16:
      return Integer< std::int16_t >( io_rWriter );
    case EType::Int32:
      return Integer< std::int32_t >( io_rWriter );
    case EType::Int64:
      return Integer< std::int64_t >( io_rWriter );
    case EType::UInt8:
      return Integer< std::uint8_t >( io_rWriter );
    case EType::UInt16:
      return Integer< std::uint16_t >( io_rWriter );
    case EType::UInt32:
      return Integer< std::uint32_t >( io_rWriter );
    case EType::UInt64:
      return Integer< std::uint64_t >( io_rWriter );
    case EType::Float32:
      return Float< float >( io_rWriter );
    case EType::Float64:
      return Float< double >( io_rWriter );
    case EType::String:
      if ( !m_Cursor.String( Text ) )
      {
        return false;
      }
      io_rWriter.PutText( Text );
      return true;
    case EType::Enum8:
    case EType::Enum16:
    case EType::Enum32:
      return Enum( i_rSchema, io_rWriter );
    default:
      return i_Nesting < MaximumNesting ? Container( i_rSchema, io_rWriter, i_Nesting + 1 )
                                        : m_Cursor.Fail( "nested too deep" );
    }
  }

  template < std::integral T >
  bool Integer( VByteWriter& io_rWriter )
  {
    T Value = 0;
    const bool bRead = m_Cursor.Integer( Value );
    io_rWriter.Put( Value );
    return bRead;
  }
  template < std::floating_point T >
  bool Float( VByteWriter& io_rWriter )
  {
    T Value = 0;
    const bool bRead = m_Cursor.Float( Value );
    io_rWriter.Put( Value );
    return bRead;
  }

  static bool PutEnum( const ISchema& i_rSchema, std::string_view i_Name, VByteWriter& io_rWriter )
  {
    for ( const auto& [rName, Value] : i_rSchema.m_EnumValues )
    {
      if ( rName == i_Name )
      {
        PutEnumNumber( i_rSchema.m_Type, Value, io_rWriter );
        return true;
      }
    }
    return false;
  }
  static void PutEnumNumber( EType i_Type, std::int64_t i_Value, VByteWriter& io_rWriter )
  {
    if ( i_Type == EType::Enum8 )
    {
      io_rWriter.Put( static_cast< std::int8_t >( i_Value ) );
    }
    else if ( i_Type == EType::Enum16 )
    {
      io_rWriter.Put( static_cast< std::int16_t >( i_Value ) );
    }
    else
    {
      io_rWriter.Put( static_cast< std::int32_t >( i_Value ) );
    }
  }

  /// The whole text is a name, as it stands or within white space.
  bool BareEnum( const ISchema& i_rSchema, VByteWriter& io_rWriter ) const
  {
    constexpr std::string_view Space = " \t\n\r";
    const std::size_t First = m_Text.find_first_not_of( Space );
    return PutEnum( i_rSchema, m_Text, io_rWriter ) ||
           ( First != std::string_view::npos &&
             PutEnum( i_rSchema, m_Text.substr( First, m_Text.find_last_not_of( Space ) + 1 - First ), io_rWriter ) );
  }
  bool Enum( const ISchema& i_rSchema, VByteWriter& io_rWriter )
  {
    const std::size_t Start = m_Cursor.Position();
    if ( m_Cursor.Peek( '"' ) )
    {
      std::string Name;
      return m_Cursor.String( Name ) &&
             ( PutEnum( i_rSchema, Name, io_rWriter ) || m_Cursor.FailAt( Start, "no such name in the Enum" ) );
    }
    if ( i_rSchema.m_Type == EType::Enum8 )
    {
      return Integer< std::int8_t >( io_rWriter );
    }
    return i_rSchema.m_Type == EType::Enum16 ? Integer< std::int16_t >( io_rWriter )
                                             : Integer< std::int32_t >( io_rWriter );
  }

  bool Container( const ISchema& i_rSchema, VByteWriter& io_rWriter, std::uint32_t i_Nesting )
  {
    if ( i_rSchema.m_Type == EType::NamedTuple )
    {
      return NamedTuple( i_rSchema, io_rWriter, i_Nesting );
    }
    const bool bList = i_rSchema.m_Type == EType::List;
    const bool bTuple = i_rSchema.m_Type == EType::Tuple;
    const std::size_t Expected = bTuple ? i_rSchema.m_SubSchemas.size() : i_rSchema.m_Count;
    const std::size_t CountAt = io_rWriter.Size();
    if ( bList )
    {
      io_rWriter.PutCount( 0 );
    }
    std::size_t Count = 0;
    const auto Element = [&]
    {
      if ( !bList && Count == Expected )
      {
        return m_Cursor.Fail( "more elements than " + std::to_string( Expected ) );
      }
      const ISchema& rSub = *i_rSchema.m_SubSchemas[bTuple ? Count : 0].second;
      ++Count;
      return Value( rSub, io_rWriter, i_Nesting );
    };
    const std::size_t Start = m_Cursor.Position();
    if ( !m_Cursor.Array( Element ) )
    {
      return false;
    }
    if ( bList )
    {
      io_rWriter.SetCount( CountAt, Count );
      return true;
    }
    return Count == Expected || m_Cursor.FailAt( Start, "fewer elements than " + std::to_string( Expected ) );
  }

  bool NamedTuple( const ISchema& i_rSchema, VByteWriter& io_rWriter, std::uint32_t i_Nesting )
  {
    const auto& rSubs = i_rSchema.m_SubSchemas;
    // Members may come in any order and are put in that of the schema; one that was read has bytes.
    std::vector< VValueBytes > Members( rSubs.size() );
    std::size_t Next = 0;
    const auto Member = [&]( const std::string& i_rName, std::size_t i_Position )
    {
      std::size_t Index = Next;
      if ( Index >= rSubs.size() || rSubs[Index].first != i_rName )
      {
        Index = 0;
        while ( Index < rSubs.size() && rSubs[Index].first != i_rName )
        {
          ++Index;
        }
      }
      if ( Index == rSubs.size() )
      {
        return m_Cursor.FailAt( i_Position, "no such member in the NamedTuple" );
      }
      if ( !Members[Index].IsEmpty() )
      {
        return m_Cursor.FailAt( i_Position, "member given twice" );
      }
      Next = Index + 1;
      VByteWriter Writer( Members[Index] );
      return Value( *rSubs[Index].second, Writer, i_Nesting );
    };
    const std::size_t Start = m_Cursor.Position();
    if ( !m_Cursor.Object( Member ) )
    {
      return false;
    }
    for ( std::size_t Index = 0; Index < rSubs.size(); ++Index )
    {
      if ( Members[Index].IsEmpty() )
      {
        return m_Cursor.FailAt( Start, "the member \"" + rSubs[Index].first + "\" is missing" );
      }
      io_rWriter.PutRaw( Members[Index].Data(), Members[Index].Size() );
    }
    return true;
  }

  VJsonCursor m_Cursor;
  std::string_view m_Text;
};
} // namespace

bool ValueFromText( const ISchema* i_pSchema, std::string_view i_Text, VTypedValue& o_rValue, VTextError* o_pError )
{
  o_rValue.m_pSchema = i_pSchema;
  o_rValue.m_Data.Clear();
  const bool bRead = VValueParser( i_Text ).Parse( *o_rValue.Schema(), o_rValue.m_Data, o_pError );
  if ( !bRead )
  {
    o_rValue.m_Data.Clear();
  }
  return bRead;
}

} // namespace ZEK::IO
