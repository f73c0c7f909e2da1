#pragma once

#include <ZEK/Export.h>

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace ZEK::IO
{

/// The bytes of a value. Up to 16 of them lie in the object itself, so that numbers, vectors of numbers and short
/// strings cost no allocation. More than 2^32 - 1 bytes are refused with `std::length_error`.
class VValueBytes
{
public:
  static constexpr std::uint32_t InlineCapacity = 16;

  VValueBytes() = default;
  VValueBytes( const void* i_pBytes, std::size_t i_Size ) { Append( i_pBytes, i_Size ); }
  VValueBytes( const VValueBytes& i_rOther )
    : VValueBytes( i_rOther.Data(), i_rOther.m_Size )
  {
  }
  VValueBytes( VValueBytes&& io_rOther ) noexcept { Take( io_rOther ); }
  VValueBytes& operator=( const VValueBytes& i_rOther )
  {
    if ( this != &i_rOther )
    {
      m_Size = 0;
      Append( i_rOther.Data(), i_rOther.m_Size );
    }
    return *this;
  }
  VValueBytes& operator=( VValueBytes&& io_rOther ) noexcept
  {
    if ( this != &io_rOther )
    {
      Free();
      Take( io_rOther );
    }
    return *this;
  }
  ~VValueBytes() { Free(); }

  const std::uint8_t* Data() const { return IsInline() ? m_Inline : m_pHeap; }
  std::uint8_t* Data() { return IsInline() ? m_Inline : m_pHeap; }
  std::size_t Size() const { return m_Size; }
  bool IsEmpty() const { return m_Size == 0; }
  const std::uint8_t* begin() const { return Data(); }
  const std::uint8_t* end() const { return Data() + m_Size; }
  /// The bytes outside the object: 0 for a value that lies in it.
  std::size_t HeapBytes() const { return IsInline() ? 0 : m_Capacity; }

  /// Keeps the memory.
  void Clear() { m_Size = 0; }
  /// The bytes may not lie in this object.
  void Append( const void* i_pBytes, std::size_t i_Size )
  {
    if ( i_Size > m_Capacity - m_Size )
    {
      Grow( i_Size );
    }
    if ( i_Size != 0 )
    {
      std::memcpy( Data() + m_Size, i_pBytes, i_Size );
      m_Size += static_cast< std::uint32_t >( i_Size );
    }
  }

  friend bool operator==( const VValueBytes& i_rA, const VValueBytes& i_rB )
  {
    return i_rA.m_Size == i_rB.m_Size && std::memcmp( i_rA.Data(), i_rB.Data(), i_rA.m_Size ) == 0;
  }

private:
  bool IsInline() const { return m_Capacity == InlineCapacity; }
  void Free()
  {
    if ( !IsInline() )
    {
      delete[] m_pHeap;
    }
  }
  /// Leaves the other empty; own memory must be free.
  void Take( VValueBytes& io_rOther ) noexcept
  {
    m_Size = io_rOther.m_Size;
    m_Capacity = io_rOther.m_Capacity;
    std::memcpy( m_Inline, io_rOther.m_Inline, InlineCapacity );
    io_rOther.m_Size = 0;
    io_rOther.m_Capacity = InlineCapacity;
  }
  ZEK_API void Grow( std::size_t i_More );

  std::uint32_t m_Size = 0;
  std::uint32_t m_Capacity = InlineCapacity; ///< that value exactly while the bytes lie in the object
  union
  {
    std::uint8_t m_Inline[InlineCapacity] = {};
    std::uint8_t* m_pHeap;
  };
};

} // namespace ZEK::IO
