#pragma once

#include <QtOpenGL/QOpenGLBuffer>

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace CoreGraphics
{

/// A buffer object that draws read. It may be used from every context of its share group, one at a time.
/// Thread: render thread with a context current; the destructor may run anywhere, the object is then freed later.
class VVertexBuffer
{
public:
  virtual ~VVertexBuffer() = default;
  VVertexBuffer( const VVertexBuffer& ) = delete;
  VVertexBuffer& operator=( const VVertexBuffer& ) = delete;

  /// Binds the buffer to its target, with its contents. False when it has none, or they could not be uploaded.
  virtual bool Bind() = 0;
  /// Where the contents begin in the buffer object.
  std::size_t Offset() const { return m_Offset; }
  /// Bytes of contents.
  std::size_t Size() const { return m_Size; }
  /// Changes with the contents; no two buffers of the process ever have the same.
  std::uint64_t Serial() const { return m_Serial; }

  /// The buffer object; 0 when there is none.
  GLuint Id() const { return m_Buffer.bufferId(); }

  /// Bytes written to buffers by this process so far.
  static std::uint64_t TotalBytesUploaded();
  /// Counts what was written past this class.
  static void CountBytes( std::size_t i_Bytes );

protected:
  explicit VVertexBuffer( QOpenGLBuffer::Type i_Type )
    : m_Buffer( i_Type )
  {
  }
  void CountUpload( std::size_t i_Bytes );

  QOpenGLBuffer m_Buffer;
  std::size_t m_Offset = 0;
  std::size_t m_Size = 0;
  std::uint64_t m_Serial = 0;
};

/// Contents that are given once. They are kept, so that the buffer can be made again in a new share group.
class VStaticBuffer final : public VVertexBuffer
{
public:
  explicit VStaticBuffer( QOpenGLBuffer::Type i_Type = QOpenGLBuffer::VertexBuffer )
    : VVertexBuffer( i_Type )
  {
  }
  /// Takes a copy; it is uploaded by the next `Bind`. Needs no context.
  void SetContents( std::span< const std::byte > i_Contents );
  template < typename T, std::size_t N >
  void SetContents( std::span< T, N > i_Contents )
  {
    SetContents( std::span< const std::byte >( std::as_bytes( i_Contents ) ) );
  }
  bool Bind() override;

private:
  std::vector< std::byte > m_Contents;
  bool m_bUploaded = false;
};

/// Contents that change often. Each write goes to a fresh part of a ring, which is never one that a pending draw
/// may still read; when the ring is full its storage is exchanged. No write waits for the device.
class VDynamicBuffer final : public VVertexBuffer
{
public:
  explicit VDynamicBuffer( QOpenGLBuffer::Type i_Type = QOpenGLBuffer::VertexBuffer )
    : VVertexBuffer( i_Type )
  {
  }
  /// Memory for new contents of that many bytes, to be written whole and in order; the former contents are gone.
  /// Null for 0 bytes, with no context current, or out of memory: there are then no contents. Must be followed by
  /// `Unmap` before any draw.
  void* Map( std::size_t i_Bytes );
  /// False when the contents were lost: write them again.
  bool Unmap();
  /// `Map`, copy, `Unmap`. An empty span leaves no contents.
  bool Write( std::span< const std::byte > i_Contents );
  template < typename T, std::size_t N >
  bool Write( std::span< T, N > i_Contents )
  {
    return Write( std::span< const std::byte >( std::as_bytes( i_Contents ) ) );
  }
  /// False also when the share group died since the last write; write again then.
  bool Bind() override;

private:
  bool Reserve( std::size_t i_Bytes );

  std::size_t m_Capacity = 0;
  std::size_t m_Head = 0;
  bool m_bMapped = false;
};

} // namespace CoreGraphics
