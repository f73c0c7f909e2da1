#include "JsonCursor.h"

#include "Utf8.h"

#include <utility>
#include <vector>

namespace ZEK::IO
{

bool VJsonCursor::FailAt( std::size_t i_Position, std::string i_Message )
{
  m_Error = { i_Position, std::move( i_Message ) };
  return false;
}

void VJsonCursor::SkipSpace()
{
  while ( m_Position < m_Text.size() && std::string_view( " \t\n\r" ).find( m_Text[m_Position] ) != std::string::npos )
  {
    ++m_Position;
  }
}

bool VJsonCursor::Take( char i_Character )
{
  const bool bNext = Peek( i_Character );
  m_Position += bNext ? 1 : 0;
  return bNext;
}

bool VJsonCursor::TakeWord( std::string_view i_Word )
{
  SkipSpace();
  const bool bNext = m_Text.substr( m_Position, i_Word.size() ) == i_Word;
  m_Position += bNext ? i_Word.size() : 0;
  return bNext;
}

bool VJsonCursor::Bool( bool& o_rbValue )
{
  o_rbValue = TakeWord( "true" );
  return o_rbValue || TakeWord( "false" ) || Fail( "expected true or false" );
}

bool VJsonCursor::Digits()
{
  const std::size_t Start = m_Position;
  while ( m_Position < m_Text.size() && m_Text[m_Position] >= '0' && m_Text[m_Position] <= '9' )
  {
    ++m_Position;
  }
  return m_Position > Start;
}

bool VJsonCursor::NumberToken( std::string_view& o_rToken )
{
  const std::size_t Start = Position();
  const auto TakeOne = [this]( std::string_view i_Any )
  {
    const bool bNext = m_Position < m_Text.size() && i_Any.find( m_Text[m_Position] ) != std::string_view::npos;
    m_Position += bNext ? 1 : 0;
    return bNext;
  };
  TakeOne( "-" );
  // A leading zero stands alone.
  bool bGood = TakeOne( "0" ) || Digits();
  bGood = bGood && ( !TakeOne( "." ) || Digits() );
  if ( bGood && TakeOne( "eE" ) )
  {
    TakeOne( "+-" );
    bGood = Digits();
  }
  o_rToken = m_Text.substr( Start, m_Position - Start );
  return bGood || FailAt( Start, "expected a number" );
}

bool VJsonCursor::HexDigits( std::uint32_t& o_rUnit )
{
  const std::string_view Token = m_Text.substr( m_Position, 4 );
  const auto [pEnd, Code] = std::from_chars( Token.data(), Token.data() + Token.size(), o_rUnit, 16 );
  if ( Code != std::errc() || pEnd != Token.data() + 4 )
  {
    return FailAt( m_Position, "expected four hexadecimal digits" );
  }
  m_Position += 4;
  return true;
}

/// Behind the backslash.
bool VJsonCursor::Escape( std::string& io_rText )
{
  const std::size_t Start = m_Position - 1;
  const char Letter = m_Position < m_Text.size() ? m_Text[m_Position++] : '\0';
  constexpr std::string_view Letters = "\"\\/bfnrt";
  if ( const std::size_t Index = Letters.find( Letter ); Index != std::string_view::npos )
  {
    io_rText += "\"\\/\b\f\n\r\t"[Index];
    return true;
  }
  std::uint32_t Unit = 0;
  if ( Letter != 'u' )
  {
    return FailAt( Start, "unknown escape" );
  }
  if ( !HexDigits( Unit ) )
  {
    return false;
  }
  if ( ( Unit & 0xf800 ) == 0xd800 )
  {
    std::uint32_t Low = 0;
    const bool bPair = Unit < 0xdc00 && m_Text.substr( m_Position, 2 ) == "\\u";
    m_Position += bPair ? 2 : 0;
    if ( bPair && !HexDigits( Low ) )
    {
      return false;
    }
    if ( ( Low & 0xfc00 ) != 0xdc00 )
    {
      return FailAt( Start, "half a surrogate pair" );
    }
    Unit = 0x10000 + ( ( Unit & 0x3ff ) << 10 ) + ( Low & 0x3ff );
  }
  AppendUtf8( Unit, io_rText );
  return true;
}

bool VJsonCursor::String( std::string& o_rText )
{
  o_rText.clear();
  const std::size_t Start = Position();
  if ( !Expect( '"', "expected a string" ) )
  {
    return false;
  }
  while ( m_Position < m_Text.size() )
  {
    const char Character = m_Text[m_Position++];
    if ( Character == '"' )
    {
      return true;
    }
    if ( static_cast< unsigned char >( Character ) < 0x20 )
    {
      return FailAt( m_Position - 1, "control character in a string" );
    }
    if ( Character != '\\' )
    {
      o_rText += Character;
    }
    else if ( !Escape( o_rText ) )
    {
      return false;
    }
  }
  return FailAt( Start, "the string does not end" );
}

bool VJsonCursor::SkipValue()
{
  std::vector< char > Closers;
  std::string Name;
  const auto Key = [this, &Name]
  {
    return String( Name ) && Expect( ':', "expected ':'" );
  };
  while ( true )
  {
    bool bOpened = false;
    if ( Take( '{' ) )
    {
      Closers.push_back( '}' );
      bOpened = !Peek( '}' );
      if ( bOpened && !Key() )
      {
        return false;
      }
    }
    else if ( Take( '[' ) )
    {
      Closers.push_back( ']' );
      bOpened = !Peek( ']' );
    }
    else if ( std::string_view Token; Peek( '"' ) ? !String( Name )
                                                  : !TakeWord( "true" ) && !TakeWord( "false" ) &&
                                                        !TakeWord( "null" ) && !NumberToken( Token ) )
    {
      return false;
    }
    if ( bOpened )
    {
      continue;
    }
    while ( !Closers.empty() && Take( Closers.back() ) )
    {
      Closers.pop_back();
    }
    if ( Closers.empty() )
    {
      return true;
    }
    if ( !Expect( ',', "expected ',' or the end of what is open" ) || ( Closers.back() == '}' && !Key() ) )
    {
      return false;
    }
  }
}

void AppendJsonString( std::string_view i_Text, std::string& io_rJson )
{
  constexpr std::string_view Special = "\"\\\b\f\n\r\t";
  io_rJson += '"';
  for ( const char Character : i_Text )
  {
    const auto Byte = static_cast< unsigned char >( Character );
    if ( const std::size_t Index = Special.find( Character ); Index != std::string_view::npos )
    {
      io_rJson += '\\';
      io_rJson += "\"\\bfnrt"[Index];
    }
    else if ( Byte < 0x20 )
    {
      io_rJson += "\\u00";
      io_rJson += Byte < 0x10 ? '0' : '1';
      io_rJson += "0123456789abcdef"[Byte & 0xf];
    }
    else
    {
      io_rJson += Character;
    }
  }
  io_rJson += '"';
}

} // namespace ZEK::IO
