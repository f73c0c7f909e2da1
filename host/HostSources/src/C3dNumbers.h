#pragma once

// The three ways in which C3D files write numbers: Intel (little-endian, IEEE), DEC (little-endian integers, VAX F
// floating point) and MIPS (big-endian, IEEE).

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

namespace HostSources::C3d
{

enum class EForm : std::uint8_t
{
  Intel = 84,
  Dec = 85,
  Mips = 86
};

inline const char* FormName( EForm i_Form )
{
  return i_Form == EForm::Dec ? "DEC" : i_Form == EForm::Mips ? "MIPS" : "Intel";
}

template < EForm Form >
std::uint16_t LoadU16( const std::byte* i_pBytes )
{
  std::uint16_t Word;
  std::memcpy( &Word, i_pBytes, sizeof( Word ) );
  return Form == EForm::Mips ? static_cast< std::uint16_t >( Word << 8 | Word >> 8 ) : Word;
}

/// A VAX F number has its sign and exponent in the first word and an exponent two greater than IEEE's. Exponent 0 is
/// zero, and with the sign set a reserved operand, which is no number.
inline float VaxToIeee( std::uint32_t i_Word )
{
  const std::uint32_t Bits = i_Word << 16 | i_Word >> 16;
  const std::uint32_t Exponent = Bits >> 23 & 0xFFu;
  if ( Exponent == 0 )
  {
    return Bits >> 31 ? std::bit_cast< float >( 0x7FC00000u ) : 0.0f;
  }
  // 255 means 2^126 here, not infinity, so the exponent is lowered before the bits count as IEEE.
  return Exponent > 2 ? std::bit_cast< float >( Bits - ( 2u << 23 ) ) : 0.0f;
}

template < EForm Form >
float LoadFloat( const std::byte* i_pBytes )
{
  std::uint32_t Word;
  std::memcpy( &Word, i_pBytes, sizeof( Word ) );
  if constexpr ( Form == EForm::Dec )
  {
    return VaxToIeee( Word );
  }
  else if constexpr ( Form == EForm::Mips )
  {
    return std::bit_cast< float >( __builtin_bswap32( Word ) );
  }
  else
  {
    return std::bit_cast< float >( Word );
  }
}

inline std::uint16_t LoadU16( EForm i_Form, const std::byte* i_pBytes )
{
  return i_Form == EForm::Mips ? LoadU16< EForm::Mips >( i_pBytes ) : LoadU16< EForm::Intel >( i_pBytes );
}

inline float LoadFloat( EForm i_Form, const std::byte* i_pBytes )
{
  switch ( i_Form )
  {
  case EForm::Dec:
    return LoadFloat< EForm::Dec >( i_pBytes );
  case EForm::Mips:
    return LoadFloat< EForm::Mips >( i_pBytes );
  default:
    return LoadFloat< EForm::Intel >( i_pBytes );
  }
}

/// Turns words of the file into numbers of the machine, in loops that a compiler turns into vector code.
void LoadWords( EForm i_Form, bool i_bFloat, const std::byte* i_pBytes, std::size_t i_Count, float* o_pWords );

} // namespace HostSources::C3d
