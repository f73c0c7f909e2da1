#pragma once

#include <cstdint>
#include <string_view>

namespace CoreGraphics
{

constexpr std::uint32_t RotateLeft( std::uint32_t i_Value, int i_Bits )
{
  return ( i_Value << i_Bits ) | ( i_Value >> ( 32 - i_Bits ) );
}

constexpr std::uint32_t MurmurMix( std::uint32_t i_Block )
{
  return RotateLeft( i_Block * 0xcc9e2d51u, 15 ) * 0x1b873593u;
}

/// MurmurHash3, the 32-bit form for x86.
constexpr std::uint32_t MurmurHash3( std::string_view i_Text, std::uint32_t i_Seed = 0 )
{
  const auto Byte = [&]( std::size_t i_Index )
  {
    return std::uint32_t( static_cast< unsigned char >( i_Text[i_Index] ) );
  };
  std::uint32_t Hash = i_Seed;
  std::size_t Index = 0;
  for ( ; Index + 4 <= i_Text.size(); Index += 4 )
  {
    Hash ^= MurmurMix( Byte( Index ) | Byte( Index + 1 ) << 8 | Byte( Index + 2 ) << 16 | Byte( Index + 3 ) << 24 );
    Hash = RotateLeft( Hash, 13 ) * 5 + 0xe6546b64u;
  }
  std::uint32_t Tail = 0;
  for ( std::size_t Rest = i_Text.size(); Rest > Index; --Rest )
  {
    Tail = Tail << 8 | Byte( Rest - 1 );
  }
  Hash ^= MurmurMix( Tail );
  Hash ^= std::uint32_t( i_Text.size() );
  Hash = ( Hash ^ Hash >> 16 ) * 0x85ebca6bu;
  Hash = ( Hash ^ Hash >> 13 ) * 0xc2b2ae35u;
  return Hash ^ Hash >> 16;
}

} // namespace CoreGraphics
