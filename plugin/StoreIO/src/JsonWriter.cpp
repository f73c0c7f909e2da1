#include "JsonWriter.h"

#include "DocumentKeys.h"

#include <algorithm>
#include <cstdint>
#include <ostream>
#include <vector>

namespace StoreIO
{

using namespace ZEK;

VJsonSink::VJsonSink( std::string& io_rText )
  : m_pText( &io_rText )
  , m_pBlock( std::make_unique_for_overwrite< char[] >( BlockBytes ) )
  , m_pNext( m_pBlock.get() )
  , m_pEnd( m_pNext + BlockBytes )
{
}

VJsonSink::VJsonSink( std::ostream& io_rStream )
  : m_pStream( &io_rStream )
  , m_pBlock( std::make_unique_for_overwrite< char[] >( BlockBytes ) )
  , m_pNext( m_pBlock.get() )
  , m_pEnd( m_pNext + BlockBytes )
{
}

void VJsonSink::Pass( std::string_view i_Text )
{
  if ( m_pText != nullptr )
  {
    m_pText->append( i_Text );
  }
  else
  {
    m_pStream->write( i_Text.data(), static_cast< std::streamsize >( i_Text.size() ) );
  }
}

void VJsonSink::Flush()
{
  Pass( { m_pBlock.get(), m_pNext } );
  m_pNext = m_pBlock.get();
}

void VJsonSink::PutAcross( std::string_view i_Text )
{
  Flush();
  if ( i_Text.size() > BlockBytes )
  {
    Pass( i_Text );
    return;
  }
  Put( i_Text );
}

namespace
{
/// True when no byte of the text is a control character, a quote or a backslash.
bool IsPlain( const char* i_pText, std::size_t i_Size )
{
  constexpr std::uint64_t Ones = 0x0101010101010101;
  constexpr std::uint64_t High = 0x8080808080808080;
  // A byte less than N, for N up to 128, or equal to a given one has its high bit set in these.
  const auto Below = []( std::uint64_t i_Word, std::uint64_t i_Limit )
  {
    return ( i_Word - Ones * i_Limit ) & ~i_Word;
  };
  std::uint64_t Found = 0;
  std::size_t Place = 0;
  for ( ; Place + sizeof( std::uint64_t ) <= i_Size; Place += sizeof( std::uint64_t ) )
  {
    std::uint64_t Word = 0;
    std::memcpy( &Word, i_pText + Place, sizeof( Word ) );
    Found |= Below( Word, 0x20 ) | Below( Word ^ Ones * '"', 1 ) | Below( Word ^ Ones * '\\', 1 );
  }
  bool bPlain = ( Found & High ) == 0;
  for ( ; Place < i_Size; ++Place )
  {
    const auto Byte = static_cast< unsigned char >( i_pText[Place] );
    bPlain = bPlain && Byte >= 0x20 && Byte != '"' && Byte != '\\';
  }
  return bPlain;
}

/// Goes through a value with a stack of its own and tells a writer.
class VJsonWalk
{
public:
  explicit VJsonWalk( VJsonWriter& io_rWriter )
    : m_rWriter( io_rWriter )
  {
  }

  std::size_t Deepest() const { return m_Deepest; }

  bool Run( const rapidjson::Value& i_rValue )
  {
    const std::size_t Floor = m_Open.size();
    bool bGood = Begin( i_rValue );
    while ( bGood && m_Open.size() > Floor )
    {
      bGood = Step();
    }
    return bGood;
  }

private:
  struct VOpen
  {
    const rapidjson::Value* m_pValue;
    rapidjson::SizeType m_Next;
  };

  bool Step()
  {
    VOpen& rTop = m_Open.back();
    const rapidjson::Value& rValue = *rTop.m_pValue;
    if ( rValue.IsObject() )
    {
      if ( rTop.m_Next == rValue.MemberCount() )
      {
        m_Open.pop_back();
        return m_rWriter.EndObject();
      }
      const auto& rMember = *( rValue.MemberBegin() + rTop.m_Next++ );
      return m_rWriter.Key( rMember.name.GetString(), rMember.name.GetStringLength() ) && Begin( rMember.value );
    }
    if ( rTop.m_Next == rValue.Size() )
    {
      m_Open.pop_back();
      return m_rWriter.EndArray();
    }
    return Begin( rValue[rTop.m_Next++] );
  }

  /// Writes a plain value, opens another.
  bool Begin( const rapidjson::Value& i_rValue )
  {
    switch ( i_rValue.GetType() )
    {
    case rapidjson::kNullType:
      return m_rWriter.Null();
    case rapidjson::kFalseType:
    case rapidjson::kTrueType:
      return m_rWriter.Bool( i_rValue.GetBool() );
    case rapidjson::kStringType:
      return m_rWriter.String( i_rValue.GetString(), i_rValue.GetStringLength() );
    case rapidjson::kNumberType:
      return Number( i_rValue );
    default:
      m_Open.push_back( { &i_rValue, 0 } );
      m_Deepest = std::max( m_Deepest, m_Open.size() );
      return i_rValue.IsObject() ? m_rWriter.StartObject() : m_rWriter.StartArray();
    }
  }
  bool Number( const rapidjson::Value& i_rValue )
  {
    if ( i_rValue.IsDouble() )
    {
      return m_rWriter.Double( i_rValue.GetDouble() );
    }
    return i_rValue.IsUint64() ? m_rWriter.Uint64( i_rValue.GetUint64() ) : m_rWriter.Int64( i_rValue.GetInt64() );
  }

  VJsonWriter& m_rWriter;
  std::vector< VOpen > m_Open;
  std::size_t m_Deepest = 0;
};
} // namespace

bool VJsonWriter::String( const char* i_pText, rapidjson::SizeType i_Size )
{
  if ( !IsPlain( i_pText, i_Size ) )
  {
    return rapidjson::Writer< VJsonSink >::String( i_pText, i_Size );
  }
  Prefix( rapidjson::kStringType );
  os_->Put( '"' );
  os_->Put( std::string_view( i_pText, i_Size ) );
  os_->Put( '"' );
  return true;
}

IResult WriteJson( const rapidjson::Value& i_rValue, VJsonSink& io_rSink )
{
  VJsonWriter Writer( io_rSink );
  const bool bWritten = VJsonWalk( Writer ).Run( i_rValue );
  io_rSink.Flush();
  return bWritten ? IResult::Ok : IResult::SerialisationFailure;
}

bool IsReservedKey( std::string_view i_Name )
{
  return i_Name == KeyValue || i_Name == KeyChildren || i_Name == KeyValueProposed;
}

void WriteSchemaMembers( const rapidjson::Value& i_rNode, std::string& o_rJson, std::size_t& o_rDeepest )
{
  o_rJson.clear();
  VJsonSink Sink( o_rJson );
  VJsonWriter Writer( Sink );
  VJsonWalk Walk( Writer );
  Writer.StartObject();
  for ( const auto& rMember : i_rNode.GetObject() )
  {
    if ( !IsReservedKey( TextOf( rMember.name ) ) )
    {
      Writer.Key( rMember.name.GetString(), rMember.name.GetStringLength() );
      // Numbers that were read are finite.
      (void)Walk.Run( rMember.value );
    }
  }
  Writer.EndObject();
  Sink.Flush();
  o_rDeepest = Walk.Deepest();
}

} // namespace StoreIO
