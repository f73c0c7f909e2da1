#pragma once

#include <ZEK/Result.h>

#include <rapidjson/document.h>
#include <rapidjson/writer.h>

#include <cstddef>
#include <cstring>
#include <iosfwd>
#include <memory>
#include <string>
#include <string_view>

namespace StoreIO
{

/// Where JSON text goes to: a stream as RapidJSON wants one, with a block of its own before the string or stream.
class VJsonSink
{
public:
  using Ch = char;

  explicit VJsonSink( std::string& io_rText );
  explicit VJsonSink( std::ostream& io_rStream );

  void Put( char i_Character )
  {
    if ( m_pNext == m_pEnd )
    {
      Flush();
    }
    *m_pNext++ = i_Character;
  }
  void Put( std::string_view i_Text )
  {
    if ( i_Text.size() > static_cast< std::size_t >( m_pEnd - m_pNext ) )
    {
      PutAcross( i_Text );
      return;
    }
    std::memcpy( m_pNext, i_Text.data(), i_Text.size() );
    m_pNext += i_Text.size();
  }
  void Flush();

private:
  static constexpr std::size_t BlockBytes = 16 * 1024;

  void PutAcross( std::string_view i_Text );
  void Pass( std::string_view i_Text );

  std::string* m_pText = nullptr;
  std::ostream* m_pStream = nullptr;
  std::unique_ptr< char[] > m_pBlock;
  char* m_pNext;
  char* m_pEnd;
};

/// RapidJSON's writer, faster for text that needs no escapes.
class VJsonWriter : public rapidjson::Writer< VJsonSink >
{
public:
  explicit VJsonWriter( VJsonSink& io_rSink )
    : rapidjson::Writer< VJsonSink >( io_rSink )
  {
  }

  bool String( const char* i_pText, rapidjson::SizeType i_Size );
  bool Key( const char* i_pText, rapidjson::SizeType i_Size ) { return String( i_pText, i_Size ); }
};

/// Appends a value as compact JSON, however deep it is. `SerialisationFailure` for a number that is not finite.
ZEK::IResult WriteJson( const rapidjson::Value& i_rValue, VJsonSink& io_rSink );

/// The schema in a node as JSON: all members but the reserved ones. `o_rDeepest` is the number of brackets open at
/// once inside.
void WriteSchemaMembers( const rapidjson::Value& i_rNode, std::string& o_rJson, std::size_t& o_rDeepest );

/// True for the member names of a node that do not belong to its schema.
bool IsReservedKey( std::string_view i_Name );

inline std::string_view TextOf( const rapidjson::Value& i_rString )
{
  return { i_rString.GetString(), i_rString.GetStringLength() };
}

} // namespace StoreIO
