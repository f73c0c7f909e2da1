#include <ZEK/ValueBytes.h>

#include <algorithm>
#include <limits>
#include <stdexcept>

namespace ZEK::IO
{

void VValueBytes::Grow( std::size_t i_More )
{
  constexpr std::uint64_t Most = std::numeric_limits< std::uint32_t >::max();
  if ( i_More > Most - m_Size )
  {
    throw std::length_error( "a value is limited to 2^32 - 1 bytes" );
  }
  // Above the inline capacity by being grown, so that the capacity still tells where the bytes lie.
  const std::uint64_t Capacity =
      std::min( std::max( std::uint64_t{ m_Size } + i_More, std::uint64_t{ m_Capacity } * 2 ), Most );
  auto* const pHeap = new std::uint8_t[Capacity];
  std::memcpy( pHeap, Data(), m_Size );
  Free();
  m_pHeap = pHeap;
  m_Capacity = static_cast< std::uint32_t >( Capacity );
}

} // namespace ZEK::IO
