#include "JsonText.h"

#include "DocumentKeys.h"

#include <StoreIO/StoreJson.h>

#include <rapidjson/error/en.h>
#include <rapidjson/reader.h>

#include <algorithm>
#include <charconv>
#include <cstdint>
#include <cstring>
#include <istream>
#include <limits>

namespace StoreIO
{

using namespace ZEK;

std::size_t MaximumBrackets()
{
  return 1 + 2 * MaximumComponents + SchemaBrackets;
}

namespace
{
/// True for a number whose first digit other than 0 stands left of the decimal point, once the exponent is applied.
bool IsGreat( std::string_view i_Number )
{
  const std::size_t Exponent = i_Number.find_first_of( "eE" );
  const std::string_view Digits = i_Number.substr( 0, Exponent );
  const std::size_t Point = std::min( Digits.find( '.' ), Digits.size() );
  const std::size_t First = std::min( Digits.find_first_of( "123456789" ), Digits.size() );
  std::int64_t Power = static_cast< std::int64_t >( Point ) - static_cast< std::int64_t >( First );
  if ( Exponent != std::string_view::npos )
  {
    std::string_view Text = i_Number.substr( Exponent + 1 );
    Text.remove_prefix( Text.front() == '+' ? 1 : 0 );
    std::int32_t Value = 0;
    if ( std::from_chars( Text.data(), Text.data() + Text.size(), Value ).ec != std::errc() )
    {
      return Text.front() != '-';
    }
    Power += Value;
  }
  return Power > 0;
}

/// Fills the document, counts what is open, and converts numbers.
class VDocumentFiller
{
public:
  explicit VDocumentFiller( rapidjson::Document& o_rDocument )
    : m_rDocument( o_rDocument )
  {
  }

  /// Why it ended the parse; null when it did not.
  const char* Complaint() const { return m_pComplaint; }

  bool Null() { return m_rDocument.Null(); }
  bool Bool( bool i_bValue ) { return m_rDocument.Bool( i_bValue ); }
  bool String( const char* i_pText, rapidjson::SizeType i_Size, bool )
  {
    return m_rDocument.String( i_pText, i_Size, false );
  }
  bool Key( const char* i_pText, rapidjson::SizeType i_Size, bool )
  {
    return m_rDocument.String( i_pText, i_Size, false );
  }
  bool StartObject() { return Enter() && m_rDocument.StartObject(); }
  bool EndObject( rapidjson::SizeType i_Count )
  {
    --m_Open;
    return m_rDocument.EndObject( i_Count );
  }
  bool StartArray() { return Enter() && m_rDocument.StartArray(); }
  bool EndArray( rapidjson::SizeType i_Count )
  {
    --m_Open;
    return m_rDocument.EndArray( i_Count );
  }
  /// All numbers come here, as they stand in the text.
  bool RawNumber( const char* i_pText, rapidjson::SizeType i_Size, bool )
  {
    const char* const pEnd = i_pText + i_Size;
    const bool bMinus = *i_pText == '-';
    std::int64_t Signed = 0;
    std::uint64_t Unsigned = 0;
    const auto Result = bMinus ? std::from_chars( i_pText, pEnd, Signed ) : std::from_chars( i_pText, pEnd, Unsigned );
    if ( Result.ec != std::errc() || Result.ptr != pEnd )
    {
      return Float( i_pText, pEnd );
    }
    return bMinus ? m_rDocument.Int64( Signed ) : m_rDocument.Uint64( Unsigned );
  }
  // Not called while numbers come as text, but the parser wants to see them.
  bool Int( int i_Value ) { return m_rDocument.Int( i_Value ); }
  bool Uint( unsigned i_Value ) { return m_rDocument.Uint( i_Value ); }
  bool Int64( std::int64_t i_Value ) { return m_rDocument.Int64( i_Value ); }
  bool Uint64( std::uint64_t i_Value ) { return m_rDocument.Uint64( i_Value ); }
  bool Double( double i_Value ) { return m_rDocument.Double( i_Value ); }

private:
  bool Enter()
  {
    static const std::size_t s_Maximum = MaximumBrackets();
    return ++m_Open <= s_Maximum || Fail( "Nested too deep." );
  }
  bool Fail( const char* i_pComplaint )
  {
    m_pComplaint = i_pComplaint;
    return false;
  }
  bool Float( const char* i_pText, const char* i_pEnd )
  {
    double Value = 0;
    if ( std::from_chars( i_pText, i_pEnd, Value ).ec == std::errc::result_out_of_range )
    {
      // Too small is 0, or the sign of it.
      Value = 0;
      if ( IsGreat( { i_pText, i_pEnd } ) )
      {
        return Fail( "Number too big to be stored in double." );
      }
    }
    return m_rDocument.Double( Value );
  }

  rapidjson::Document& m_rDocument;
  std::size_t m_Open = 0;
  const char* m_pComplaint = nullptr;
};
} // namespace

VJsonText::VJsonText()
  : m_pPool( std::make_unique< VJsonPool >( PoolChunkBytes ) )
  , m_Document( m_pPool.get(), ParseStackBytes )
{
}

void VJsonText::Clear()
{
  m_Document.SetNull();
  m_pPool->Clear();
  m_pText.reset();
  m_Size = 0;
  m_Capacity = 0;
  m_Error.clear();
}

void VJsonText::Refuse( std::string i_Error )
{
  Clear();
  m_Error = std::move( i_Error );
}

/// Keeps what is there; the zero byte behind the text has a place of its own.
void VJsonText::Reserve( std::size_t i_Capacity )
{
  auto pText = std::make_unique_for_overwrite< char[] >( i_Capacity + 1 );
  if ( m_Size != 0 )
  {
    std::memcpy( pText.get(), m_pText.get(), m_Size );
  }
  m_pText = std::move( pText );
  m_Capacity = i_Capacity;
}

IResult VJsonText::ReadText( std::string_view i_Text )
{
  Clear();
  Reserve( i_Text.size() );
  std::copy( i_Text.begin(), i_Text.end(), m_pText.get() );
  m_Size = i_Text.size();
  return Parse();
}

IResult VJsonText::ReadStream( std::istream& io_rStream )
{
  Clear();
  const bool bReadable = !io_rStream.fail();
  // The size, where the stream knows it, saves growing.
  const std::istream::pos_type Start = io_rStream.tellg();
  if ( Start != std::istream::pos_type( -1 ) && io_rStream.seekg( 0, std::ios::end ) )
  {
    const std::streamoff Length = io_rStream.tellg() - Start;
    io_rStream.seekg( Start );
    Reserve( Length > 0 ? static_cast< std::size_t >( Length ) + 1 : 0 );
  }
  io_rStream.clear( io_rStream.rdstate() & ~std::ios::failbit );
  while ( bReadable && io_rStream.good() )
  {
    if ( m_Size == m_Capacity )
    {
      Reserve( std::max< std::size_t >( PoolChunkBytes, m_Capacity * 2 ) );
    }
    io_rStream.read( m_pText.get() + m_Size, static_cast< std::streamsize >( m_Capacity - m_Size ) );
    m_Size += static_cast< std::size_t >( io_rStream.gcount() );
  }
  if ( !bReadable || io_rStream.bad() || !io_rStream.eof() )
  {
    Refuse( "The text cannot be read." );
    return IResult::FileIOFailure;
  }
  if ( m_pText == nullptr )
  {
    Reserve( 0 );
  }
  return Parse();
}

IResult VJsonText::Parse()
{
  constexpr std::string_view Mark = "\xef\xbb\xbf";
  m_pText[m_Size] = '\0';
  const std::size_t Begin = std::string_view( m_pText.get(), m_Size ).starts_with( Mark ) ? Mark.size() : 0;
  if ( m_Size > std::numeric_limits< rapidjson::SizeType >::max() )
  {
    Refuse( "The text is longer than 4 GiB." );
    return IResult::InvalidFormat;
  }
  rapidjson::InsituStringStream Stream( m_pText.get() + Begin );
  rapidjson::ParseResult Result;
  VDocumentFiller Filler( m_Document );
  auto Parser = [&]( rapidjson::Document& )
  {
    constexpr unsigned Flags =
        rapidjson::kParseInsituFlag | rapidjson::kParseIterativeFlag | rapidjson::kParseNumbersAsStringsFlag;
    rapidjson::Reader Reader( nullptr, ParseStackBytes );
    Result = Reader.Parse< Flags >( Stream, Filler );
    return !Result.IsError();
  };
  m_Document.Populate( Parser );
  const std::size_t Left = m_Size - Begin - ( Result.IsError() ? 0 : Stream.Tell() );
  if ( !Result.IsError() && Left == 0 )
  {
    return IResult::Ok;
  }
  // A zero byte looks like the end of the text to the parser.
  const std::string Why = !Result.IsError()               ? "A zero byte stands behind the document."
                          : Filler.Complaint() != nullptr ? Filler.Complaint()
                                                          : rapidjson::GetParseError_En( Result.Code() );
  Refuse( Why + Place( Begin + ( Result.IsError() ? Result.Offset() : Stream.Tell() ) ) );
  return IResult::InvalidFormat;
}

std::string VJsonText::Place( std::size_t i_Offset ) const
{
  const std::string_view Before( m_pText.get(), std::min( i_Offset, m_Size ) );
  const auto Lines = std::count( Before.begin(), Before.end(), '\n' );
  const std::size_t LineBegin = Before.rfind( '\n' ) + 1;
  return " at line " + std::to_string( Lines + 1 ) + ", column " + std::to_string( Before.size() - LineBegin + 1 );
}

} // namespace StoreIO
