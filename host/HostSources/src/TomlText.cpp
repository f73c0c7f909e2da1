#include "TomlText.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <limits>

namespace HostSources
{
namespace
{
constexpr int DeepestArray = 32;

bool IsBare( char i_Letter )
{
  return ( i_Letter >= 'a' && i_Letter <= 'z' ) || ( i_Letter >= 'A' && i_Letter <= 'Z' ) ||
         ( i_Letter >= '0' && i_Letter <= '9' ) || i_Letter == '_' || i_Letter == '-';
}

/// A TOML number: with underscores, a sign, or as a word.
bool ReadNumber( std::string i_Text, double& o_rNumber )
{
  std::erase( i_Text, '_' );
  const bool bSign = i_Text.starts_with( '+' ) || i_Text.starts_with( '-' );
  const double Sign = i_Text.starts_with( '-' ) ? -1 : 1;
  const std::string_view Digits = std::string_view( i_Text ).substr( bSign ? 1 : 0 );
  if ( Digits == "inf" || Digits == "nan" )
  {
    o_rNumber = Digits == "inf" ? Sign * std::numeric_limits< double >::infinity() : std::nan( "" );
    return true;
  }
  const bool bHex = Digits.starts_with( "0x" );
  const char* const pBegin = Digits.data() + ( bHex ? 2 : 0 );
  const char* const pEnd = Digits.data() + Digits.size();
  if ( pBegin == pEnd || !( bHex || ( *pBegin >= '0' && *pBegin <= '9' ) || *pBegin == '.' ) )
  {
    return false;
  }
  const auto Read =
      std::from_chars( pBegin, pEnd, o_rNumber, bHex ? std::chars_format::hex : std::chars_format::general );
  o_rNumber *= Sign;
  return Read.ptr == pEnd && Read.ec == std::errc();
}

class VTomlParser
{
public:
  explicit VTomlParser( std::string_view i_Text )
    : m_Text( i_Text )
  {
  }

  bool Read( std::vector< VTomlTable >& o_rTables )
  {
    o_rTables.assign( 1, {} );
    for ( SkipAll(); m_At < m_Text.size(); SkipAll() )
    {
      if ( !( Peek() == '[' ? ReadHeader( o_rTables ) : ReadPair( o_rTables.back().Values ) ) )
      {
        return false;
      }
      SkipBlanks();
      if ( m_At < m_Text.size() && Peek() != '\n' )
      {
        return Fail( "expected the end of the line" );
      }
    }
    return true;
  }
  std::string Message() const { return "line " + std::to_string( m_Line ) + ": " + m_pMessage; }

private:
  char Peek() const { return m_At < m_Text.size() ? m_Text[m_At] : '\0'; }
  bool Fail( const char* i_pMessage )
  {
    m_pMessage = i_pMessage;
    return false;
  }
  bool Expect( char i_Letter, const char* i_pMessage )
  {
    if ( m_At >= m_Text.size() || m_Text[m_At] != i_Letter )
    {
      return Fail( i_pMessage );
    }
    ++m_At;
    return true;
  }
  /// Blanks and a comment, up to the end of the line.
  void SkipBlanks()
  {
    while ( Peek() == ' ' || Peek() == '\t' || Peek() == '\r' )
    {
      ++m_At;
    }
    if ( Peek() == '#' )
    {
      m_At = std::min( m_Text.find( '\n', m_At ), m_Text.size() );
    }
  }
  void SkipAll()
  {
    for ( SkipBlanks(); Peek() == '\n'; SkipBlanks() )
    {
      ++m_At;
      ++m_Line;
    }
  }

  /// Parts with points between them; the last one stays.
  bool ReadKey( std::string& o_rKey )
  {
    for ( ;; )
    {
      SkipBlanks();
      if ( Peek() == '"' || Peek() == '\'' )
      {
        if ( !ReadString( o_rKey ) )
        {
          return false;
        }
      }
      else
      {
        const std::size_t Begin = m_At;
        while ( IsBare( Peek() ) )
        {
          ++m_At;
        }
        o_rKey = m_Text.substr( Begin, m_At - Begin );
        if ( o_rKey.empty() )
        {
          return Fail( "expected a key" );
        }
      }
      SkipBlanks();
      if ( Peek() != '.' )
      {
        return true;
      }
      ++m_At;
    }
  }

  bool ReadHeader( std::vector< VTomlTable >& io_rTables )
  {
    ++m_At;
    const bool bList = Peek() == '[';
    m_At += bList ? 1 : 0;
    VTomlTable Table;
    Table.Line = m_Line;
    if ( !ReadKey( Table.Name ) || !Expect( ']', "expected ] after the table's name" ) ||
         ( bList && !Expect( ']', "expected ]] after the table's name" ) ) )
    {
      return false;
    }
    io_rTables.push_back( std::move( Table ) );
    return true;
  }

  bool ReadPair( std::vector< std::pair< std::string, VTomlValue > >& io_rValues )
  {
    std::string Key;
    VTomlValue Value;
    if ( !ReadKey( Key ) || !Expect( '=', "expected = after a key" ) )
    {
      return false;
    }
    SkipBlanks();
    if ( !ReadValue( Value, 0 ) )
    {
      return false;
    }
    io_rValues.emplace_back( std::move( Key ), std::move( Value ) );
    return true;
  }

  bool ReadValue( VTomlValue& o_rValue, int i_Depth )
  {
    if ( Peek() == '[' || Peek() == '{' )
    {
      return i_Depth < DeepestArray ? ReadArray( o_rValue, i_Depth ) : Fail( "arrays too deep in one another" );
    }
    if ( Peek() == '"' || Peek() == '\'' )
    {
      return ReadString( o_rValue.Value.emplace< std::string >() );
    }
    const std::size_t Begin = m_At;
    while ( IsBare( Peek() ) || Peek() == '.' || Peek() == '+' || Peek() == ':' )
    {
      ++m_At;
    }
    const std::string Word( m_Text.substr( Begin, m_At - Begin ) );
    double Number = 0;
    if ( Word == "true" || Word == "false" )
    {
      o_rValue.Value = Word == "true";
    }
    else if ( ReadNumber( Word, Number ) )
    {
      o_rValue.Value = Number;
    }
    else if ( Word.size() >= 8 && ( Word.find( '-' ) != std::string::npos || Word.find( ':' ) != std::string::npos ) &&
              Word[0] >= '0' && Word[0] <= '9' )
    {
      o_rValue.Value = Word;
    }
    else
    {
      return Fail( "expected a value" );
    }
    return true;
  }

  bool ReadArray( VTomlValue& o_rValue, int i_Depth )
  {
    const bool bTable = m_Text[m_At++] == '{';
    const char End = bTable ? '}' : ']';
    VTomlArray& rArray = o_rValue.Value.emplace< VTomlArray >();
    for ( SkipAll(); Peek() != End; SkipAll() )
    {
      std::string Key;
      if ( bTable && ( !ReadKey( Key ) || !Expect( '=', "expected = after a key" ) ) )
      {
        return false;
      }
      SkipBlanks();
      if ( !ReadValue( rArray.emplace_back(), i_Depth + 1 ) )
      {
        return false;
      }
      SkipAll();
      if ( Peek() == ',' )
      {
        ++m_At;
      }
      else if ( Peek() != End )
      {
        return Fail( "expected , or the end of the array" );
      }
    }
    ++m_At;
    return true;
  }

  bool ReadString( std::string& o_rText )
  {
    o_rText.clear();
    const char Quote = m_Text[m_At];
    const std::string Long( 3, Quote );
    const bool bLong = m_Text.substr( m_At, 3 ) == Long;
    m_At += bLong ? 3 : 1;
    while ( m_At < m_Text.size() )
    {
      if ( bLong ? m_Text.substr( m_At, 3 ) == Long : m_Text[m_At] == Quote )
      {
        m_At += bLong ? 3 : 1;
        return true;
      }
      if ( m_Text[m_At] == '\n' )
      {
        if ( !bLong )
        {
          break;
        }
        ++m_Line;
      }
      if ( Quote == '"' && m_Text[m_At] == '\\' && m_At + 1 < m_Text.size() )
      {
        ++m_At;
        const std::size_t Which = std::string_view( "nrt" ).find( m_Text[m_At] );
        o_rText += Which == std::string_view::npos ? m_Text[m_At] : "\n\r\t"[Which];
      }
      else
      {
        o_rText += m_Text[m_At];
      }
      ++m_At;
    }
    return Fail( "a text without an end" );
  }

  std::string_view m_Text;
  std::size_t m_At = 0;
  std::size_t m_Line = 1;
  const char* m_pMessage = "";
};
} // namespace

const VTomlValue* VTomlTable::Find( std::string_view i_Key ) const
{
  const auto It = std::find_if( Values.begin(), Values.end(),
                                [&]( const auto& i_rPair )
                                {
                                  return i_rPair.first == i_Key;
                                } );
  return It == Values.end() ? nullptr : &It->second;
}

bool ReadToml( std::string_view i_Text, std::vector< VTomlTable >& o_rTables, std::string& o_rMessage )
{
  VTomlParser Parser( i_Text );
  if ( Parser.Read( o_rTables ) )
  {
    return true;
  }
  o_rMessage = Parser.Message();
  return false;
}

} // namespace HostSources
