#pragma once

#include <ZEK/TextError.h>

#include <charconv>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <utility>

namespace ZEK::IO
{

/// Walks a JSON text token by token for readers that know what must come. Every operation passes over white space
/// first; one that is false leaves `Error` telling what was expected where, and then the reader gives up.
class VJsonCursor
{
public:
  explicit VJsonCursor( std::string_view i_Text )
    : m_Text( i_Text )
  {
  }

  const VTextError& Error() const { return m_Error; }
  /// Where the next token begins.
  std::size_t Position()
  {
    SkipSpace();
    return m_Position;
  }

  /// Always false, for `return`.
  bool FailAt( std::size_t i_Position, std::string i_Message );
  bool Fail( std::string i_Message ) { return FailAt( Position(), std::move( i_Message ) ); }

  /// Passes the character if it is next.
  bool Take( char i_Character );
  bool Peek( char i_Character ) { return Position() < m_Text.size() && m_Text[m_Position] == i_Character; }
  bool Expect( char i_Character, const char* i_pMessage ) { return Take( i_Character ) || Fail( i_pMessage ); }
  bool End() { return Position() == m_Text.size() || Fail( "unexpected text after the end" ); }

  bool Bool( bool& o_rbValue );
  bool String( std::string& o_rText );
  template < std::integral T >
  bool Integer( T& o_rValue )
  {
    const std::size_t Start = Position();
    std::string_view Token;
    if ( !NumberToken( Token ) )
    {
      return false;
    }
    const std::errc Code = std::from_chars( Token.data(), Token.data() + Token.size(), o_rValue ).ec;
    if ( Token.find_first_of( ".eE" ) != std::string_view::npos )
    {
      return FailAt( Start, "expected a whole number" );
    }
    return Code == std::errc() || FailAt( Start, "number out of range" );
  }
  template < std::floating_point T >
  bool Float( T& o_rValue )
  {
    const std::size_t Start = Position();
    std::string_view Token;
    return NumberToken( Token ) &&
           ( std::from_chars( Token.data(), Token.data() + Token.size(), o_rValue ).ec == std::errc() ||
             FailAt( Start, "number out of range" ) );
  }
  /// Passes any value, however deep.
  bool SkipValue();

  /// Calls `i_rMember( Name, Position )` behind each colon; it reads the value.
  template < typename TMember >
  bool Object( const TMember& i_rMember )
  {
    if ( !Expect( '{', "expected '{'" ) )
    {
      return false;
    }
    if ( Take( '}' ) )
    {
      return true;
    }
    std::string Name;
    do
    {
      const std::size_t Start = Position();
      if ( !String( Name ) || !Expect( ':', "expected ':'" ) || !i_rMember( Name, Start ) )
      {
        return false;
      }
    } while ( Take( ',' ) );
    return Expect( '}', "expected ',' or '}'" );
  }
  /// Calls `i_rElement()` at each element; it reads it.
  template < typename TElement >
  bool Array( const TElement& i_rElement )
  {
    if ( !Expect( '[', "expected '['" ) )
    {
      return false;
    }
    if ( Take( ']' ) )
    {
      return true;
    }
    do
    {
      if ( !i_rElement() )
      {
        return false;
      }
    } while ( Take( ',' ) );
    return Expect( ']', "expected ',' or ']'" );
  }

private:
  void SkipSpace();
  bool TakeWord( std::string_view i_Word );
  bool NumberToken( std::string_view& o_rToken );
  bool Escape( std::string& io_rText );
  bool HexDigits( std::uint32_t& o_rUnit );
  bool Digits();

  std::string_view m_Text;
  std::size_t m_Position = 0;
  VTextError m_Error;
};

/// Appends a text in quotes; bytes that are not UTF-8 stand as they are.
void AppendJsonString( std::string_view i_Text, std::string& io_rJson );

} // namespace ZEK::IO
