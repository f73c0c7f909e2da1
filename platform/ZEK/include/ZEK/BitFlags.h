#pragma once

#include <cstdint>

namespace ZEK
{

/// A word of flags whose bits `E` names.
template < typename E >
class IBitFlags
{
public:
  constexpr IBitFlags( std::uint64_t i_Bits = 0 )
    : m_Bits( i_Bits )
  {
  }

  constexpr std::uint64_t Bits() const { return m_Bits; }
  /// True when any bit of the mask is set.
  constexpr bool Has( std::uint64_t i_Mask ) const { return ( m_Bits & i_Mask ) != 0; }
  friend constexpr bool operator==( IBitFlags i_A, IBitFlags i_B ) = default;

private:
  std::uint64_t m_Bits;
};

} // namespace ZEK
