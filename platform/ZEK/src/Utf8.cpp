#include "Utf8.h"

#include <ZEK/SerialiserScalar.h>

#include <bit>

namespace ZEK::IO
{
namespace
{
constexpr bool IsCharacter( std::uint32_t i_Character )
{
  return i_Character < 0xd800 || ( i_Character > 0xdfff && i_Character <= 0x10ffff );
}
} // namespace

void AppendUtf8( std::uint32_t i_Character, std::string& io_rText )
{
  const std::uint32_t Character = IsCharacter( i_Character ) ? i_Character : ReplacementCharacter;
  const auto Tail = [&io_rText, Character]( int i_Shift )
  {
    io_rText += static_cast< char >( 0x80 | ( ( Character >> i_Shift ) & 0x3f ) );
  };
  if ( Character < 0x80 )
  {
    io_rText += static_cast< char >( Character );
    return;
  }
  if ( Character < 0x800 )
  {
    io_rText += static_cast< char >( 0xc0 | ( Character >> 6 ) );
  }
  else if ( Character < 0x10000 )
  {
    io_rText += static_cast< char >( 0xe0 | ( Character >> 12 ) );
    Tail( 6 );
  }
  else
  {
    io_rText += static_cast< char >( 0xf0 | ( Character >> 18 ) );
    Tail( 12 );
    Tail( 6 );
  }
  Tail( 0 );
}

bool TakeUtf8( std::string_view& io_rText, std::uint32_t& o_rCharacter )
{
  const auto First = static_cast< std::uint8_t >( io_rText.front() );
  const int Ones = std::countl_one( First );
  if ( Ones == 0 )
  {
    o_rCharacter = First;
    io_rText.remove_prefix( 1 );
    return true;
  }
  const auto Length = static_cast< std::size_t >( Ones );
  bool bGood = Length >= 2 && Length <= 4 && Length <= io_rText.size();
  std::uint32_t Character = First & ( 0x7fu >> Ones );
  for ( std::size_t Index = 1; bGood && Index < Length; ++Index )
  {
    const auto Byte = static_cast< std::uint8_t >( io_rText[Index] );
    bGood = ( Byte & 0xc0 ) == 0x80;
    Character = Character << 6 | ( Byte & 0x3fu );
  }
  // A character has one form: longer ones of small numbers are refused.
  constexpr std::uint32_t Least[] = { 0, 0, 0x80, 0x800, 0x10000 };
  bGood = bGood && IsCharacter( Character ) && Character >= Least[Length];
  o_rCharacter = bGood ? Character : ReplacementCharacter;
  io_rText.remove_prefix( bGood ? Length : 1 );
  return bGood;
}

std::string WideToUtf8( std::wstring_view i_Text )
{
  std::string Text;
  for ( std::size_t Index = 0; Index < i_Text.size(); ++Index )
  {
    auto Character = static_cast< std::uint32_t >( i_Text[Index] );
    if constexpr ( sizeof( wchar_t ) == 2 )
    {
      const std::uint32_t Next = Index + 1 < i_Text.size() ? static_cast< std::uint32_t >( i_Text[Index + 1] ) : 0;
      if ( ( Character & 0xfc00 ) == 0xd800 && ( Next & 0xfc00 ) == 0xdc00 )
      {
        Character = 0x10000 + ( ( Character & 0x3ff ) << 10 ) + ( Next & 0x3ff );
        ++Index;
      }
    }
    AppendUtf8( Character, Text );
  }
  return Text;
}

std::wstring Utf8ToWide( std::string_view i_Text )
{
  std::wstring Text;
  while ( !i_Text.empty() )
  {
    std::uint32_t Character = 0;
    TakeUtf8( i_Text, Character );
    if ( sizeof( wchar_t ) == 2 && Character > 0xffff )
    {
      Text += static_cast< wchar_t >( 0xd800 + ( ( Character - 0x10000 ) >> 10 ) );
      Character = 0xdc00 + ( Character & 0x3ff );
    }
    Text += static_cast< wchar_t >( Character );
  }
  return Text;
}

} // namespace ZEK::IO
