#pragma once

#include <ZEK/ValueBytes.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string_view>
#include <type_traits>

namespace ZEK::IO
{

/// Numbers that have bytes of their own.
template < typename T >
concept IPlainNumber = std::integral< T > || std::floating_point< T >;

/// One NaN and no negative zero, so that equal numbers have equal bytes.
template < std::floating_point T >
T CanonicalFloat( T i_Value )
{
  if ( std::isnan( i_Value ) )
  {
    return std::numeric_limits< T >::quiet_NaN();
  }
  return i_Value == T( 0 ) ? T( 0 ) : i_Value;
}

/// Appends to the bytes of a value.
class VByteWriter
{
public:
  explicit VByteWriter( VValueBytes& io_rBytes )
    : m_rBytes( io_rBytes )
  {
  }

  template < IPlainNumber T >
  void Put( T i_Value )
  {
    if constexpr ( std::floating_point< T > )
    {
      i_Value = CanonicalFloat( i_Value );
    }
    std::uint8_t Bytes[sizeof( T )];
    std::memcpy( Bytes, &i_Value, sizeof( T ) );
    if constexpr ( std::endian::native == std::endian::big )
    {
      std::reverse( Bytes, Bytes + sizeof( T ) );
    }
    m_rBytes.Append( Bytes, sizeof( T ) );
  }
  /// As many as a count of 32 bits can tell; the rest is a value that is refused when its bytes grow past that.
  void PutCount( std::size_t i_Count ) { Put( static_cast< std::uint32_t >( i_Count ) ); }
  void PutText( std::string_view i_Text )
  {
    PutCount( i_Text.size() );
    m_rBytes.Append( i_Text.data(), i_Text.size() );
  }
  void PutRaw( const void* i_pBytes, std::size_t i_Size ) { m_rBytes.Append( i_pBytes, i_Size ); }

  std::size_t Size() const { return m_rBytes.Size(); }
  /// Sets a count that was put at `i_Position` before it was known.
  void SetCount( std::size_t i_Position, std::size_t i_Count )
  {
    VValueBytes Count;
    VByteWriter( Count ).PutCount( i_Count );
    std::memcpy( m_rBytes.Data() + i_Position, Count.Data(), Count.Size() );
  }

private:
  VValueBytes& m_rBytes;
};

/// Takes from the bytes of a value, which it does not own. Every operation is false, and takes nothing of use, when
/// too little is left.
class VByteReader
{
public:
  VByteReader( const std::uint8_t* i_pBytes, std::size_t i_Size )
    : m_pNext( i_pBytes )
    , m_pEnd( i_pBytes + i_Size )
  {
  }
  explicit VByteReader( const VValueBytes& i_rBytes )
    : VByteReader( i_rBytes.Data(), i_rBytes.Size() )
  {
  }

  std::size_t Left() const { return static_cast< std::size_t >( m_pEnd - m_pNext ); }

  template < IPlainNumber T >
  requires( !std::same_as< T, bool > ) bool Get( T& o_rValue )
  {
    const std::uint8_t* const pBytes = Take( sizeof( T ) );
    if ( pBytes == nullptr )
    {
      return false;
    }
    std::memcpy( &o_rValue, pBytes, sizeof( T ) );
    if constexpr ( std::endian::native == std::endian::big )
    {
      auto* const pOut = reinterpret_cast< std::uint8_t* >( &o_rValue );
      std::reverse( pOut, pOut + sizeof( T ) );
    }
    return true;
  }
  /// False also for a byte that is neither 0 nor 1.
  bool GetBool( bool& o_rbValue )
  {
    const std::uint8_t* const pByte = Take( 1 );
    if ( pByte == nullptr || *pByte > 1 )
    {
      return false;
    }
    o_rbValue = *pByte != 0;
    return true;
  }
  /// A view of the bytes themselves.
  bool GetText( std::string_view& o_rText )
  {
    std::uint32_t Length = 0;
    if ( !Get( Length ) )
    {
      return false;
    }
    const std::uint8_t* const pText = Take( Length );
    o_rText = pText != nullptr ? std::string_view( reinterpret_cast< const char* >( pText ), Length ) : "";
    return pText != nullptr;
  }
  /// The next bytes, or null.
  const std::uint8_t* Take( std::size_t i_Size )
  {
    if ( i_Size > Left() )
    {
      return nullptr;
    }
    const std::uint8_t* const pBytes = m_pNext;
    m_pNext += i_Size;
    return pBytes;
  }

private:
  const std::uint8_t* m_pNext;
  const std::uint8_t* m_pEnd;
};

} // namespace ZEK::IO
