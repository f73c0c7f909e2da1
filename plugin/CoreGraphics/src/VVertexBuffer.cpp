#include <CoreGraphics/VVertexBuffer.h>

#include <QtGui/QOpenGLContext>
#include <QtGui/QOpenGLExtraFunctions>

#include <atomic>
#include <cstring>

namespace CoreGraphics
{
namespace
{
std::atomic< std::uint64_t > s_Serial{ 0 };
std::atomic< std::uint64_t > s_Uploaded{ 0 };

// A ring holds several writes, so that its storage is exchanged once in a few frames only.
constexpr std::size_t WritesPerRing = 4;
constexpr std::size_t SmallestRing = 4096;
// From this size on a write has the whole buffer: fresh memory for several such writes costs more than what it saves.
constexpr std::size_t LargeWrite = 1u << 14;
// Parts begin where any attribute type is aligned, and where mapping is cheap.
constexpr std::size_t PartAlignment = 64;

std::size_t RoundUp( std::size_t i_Bytes )
{
  return ( i_Bytes + PartAlignment - 1 ) / PartAlignment * PartAlignment;
}
} // namespace

std::uint64_t VVertexBuffer::TotalBytesUploaded()
{
  return s_Uploaded.load( std::memory_order_relaxed );
}

void VVertexBuffer::CountBytes( std::size_t i_Bytes )
{
  s_Uploaded.fetch_add( i_Bytes, std::memory_order_relaxed );
}

void VVertexBuffer::CountUpload( std::size_t i_Bytes )
{
  CountBytes( i_Bytes );
  m_Serial = s_Serial.fetch_add( 1, std::memory_order_relaxed ) + 1;
}

void VStaticBuffer::SetContents( std::span< const std::byte > i_Contents )
{
  m_Contents.assign( i_Contents.begin(), i_Contents.end() );
  m_Size = m_Contents.size();
  m_bUploaded = false;
}

bool VStaticBuffer::Bind()
{
  if ( m_Contents.empty() || !QOpenGLContext::currentContext() )
  {
    return false;
  }
  if ( m_bUploaded && m_Buffer.isCreated() )
  {
    return m_Buffer.bind();
  }
  if ( ( !m_Buffer.isCreated() && !m_Buffer.create() ) || !m_Buffer.bind() )
  {
    return false;
  }
  m_Buffer.setUsagePattern( QOpenGLBuffer::StaticDraw );
  m_Buffer.allocate( m_Contents.data(), int( m_Contents.size() ) );
  CountUpload( m_Contents.size() );
  m_bUploaded = true;
  return true;
}

bool VDynamicBuffer::Reserve( std::size_t i_Bytes )
{
  if ( !m_Buffer.isCreated() )
  {
    m_Capacity = 0;
    if ( !m_Buffer.create() )
    {
      return false;
    }
    m_Buffer.setUsagePattern( QOpenGLBuffer::StreamDraw );
  }
  if ( !m_Buffer.bind() )
  {
    return false;
  }
  const std::size_t Wanted = RoundUp( i_Bytes );
  if ( Wanted >= LargeWrite )
  {
    if ( Wanted > m_Capacity )
    {
      m_Capacity = Wanted + Wanted / 4;
      m_Buffer.allocate( int( m_Capacity ) );
    }
    m_Head = 0;
    return true;
  }
  if ( m_Capacity != 0 && m_Head + Wanted <= m_Capacity )
  {
    return true;
  }
  if ( Wanted > m_Capacity / WritesPerRing )
  {
    m_Capacity = std::max( SmallestRing, Wanted * WritesPerRing );
  }
  // New storage under the same name: draws that are pending keep the old one.
  m_Buffer.allocate( int( m_Capacity ) );
  m_Head = 0;
  return true;
}

void* VDynamicBuffer::Map( std::size_t i_Bytes )
{
  constexpr std::size_t Largest = std::size_t( INT32_MAX ) / WritesPerRing - PartAlignment;
  if ( m_bMapped )
  {
    Unmap();
  }
  m_Size = 0;
  if ( i_Bytes == 0 || i_Bytes > Largest || !QOpenGLContext::currentContext() || !Reserve( i_Bytes ) )
  {
    return nullptr;
  }
  // A pending draw keeps what it reads: the driver gives the buffer other memory where there is one.
  const bool bLarge = RoundUp( i_Bytes ) >= LargeWrite;
  void* pMemory = m_Buffer.mapRange( int( m_Head ), int( i_Bytes ),
                                     bLarge ? QOpenGLBuffer::RangeWrite | QOpenGLBuffer::RangeInvalidateBuffer
                                            : QOpenGLBuffer::RangeWrite | QOpenGLBuffer::RangeInvalidate |
                                                  QOpenGLBuffer::RangeUnsynchronized );
  if ( !pMemory )
  {
    m_Capacity = 0; // the storage itself may be missing: ask for it anew next time
    return nullptr;
  }
  m_bMapped = true;
  m_Offset = m_Head;
  m_Size = i_Bytes;
  m_Head = bLarge ? m_Capacity : m_Head + RoundUp( i_Bytes );
  return pMemory;
}

bool VDynamicBuffer::Unmap()
{
  if ( !m_bMapped )
  {
    return false;
  }
  m_bMapped = false;
  if ( !m_Buffer.isCreated() || !m_Buffer.bind() || !m_Buffer.unmap() )
  {
    m_Size = 0;
    return false;
  }
  CountUpload( m_Size );
  return true;
}

bool VDynamicBuffer::Write( std::span< const std::byte > i_Contents )
{
  void* pMemory = Map( i_Contents.size() );
  if ( !pMemory )
  {
    return false;
  }
  std::memcpy( pMemory, i_Contents.data(), i_Contents.size() );
  return Unmap();
}

bool VDynamicBuffer::Bind()
{
  if ( m_bMapped )
  {
    Unmap();
  }
  return m_Size != 0 && m_Buffer.isCreated() && m_Buffer.bind();
}

} // namespace CoreGraphics
