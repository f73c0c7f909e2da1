#pragma once

#include <CoreGraphics/VVertexBuffer.h>

#include <QtCore/QPointer>
#include <QtGui/QOpenGLContextGroup>
#include <QtGui/qopengl.h>

#include <cstddef>
#include <vector>

namespace CoreGraphics
{
class VRenderContext;

enum ETexelFormat
{
  ETexelByte,  ///< one channel, 0 to 1
  ETexelWords, ///< two unsigned 32-bit words
  ETexelFloats ///< four floats
};

/// A table that programs read by index: a buffer of texels, or a 2D texture of `Width` columns where the context has no
/// texture buffers or the table is beyond what they hold. The programs of the two are not the same: see `IsBuffer`.
/// Thread: render thread with a context current; the destructor may run anywhere.
class VTexelBuffer
{
public:
  /// Columns of the 2D form; every device has as many.
  static constexpr int Width = 2048;

  explicit VTexelBuffer( ETexelFormat i_Format )
    : m_Format( i_Format )
  {
  }
  ~VTexelBuffer();
  VTexelBuffer( const VTexelBuffer& ) = delete;
  VTexelBuffer& operator=( const VTexelBuffer& ) = delete;

  /// Memory for a new table of that many bytes, whole texels, to be written whole; the former one is gone. Without
  /// `i_bBuffer` it is a 2D texture. Null for 0 bytes, or for more than the device holds. `Unmap` must follow.
  void* Map( VRenderContext& io_rContext, std::size_t i_Bytes, bool i_bBuffer );
  /// False when the contents were lost.
  bool Unmap( VRenderContext& io_rContext );
  /// Binds the texture to the unit, which becomes the active one. False when there are no contents; write again then.
  bool Bind( VRenderContext& io_rContext, int i_Unit );

  /// Whether a table of that size can be a texture buffer.
  static bool Fits( const VRenderContext& i_rContext, ETexelFormat i_Format, std::size_t i_Bytes );
  /// The bytes of the largest table that can be a 2D texture.
  static std::size_t MostTextureBytes( VRenderContext& io_rContext, ETexelFormat i_Format );
  bool IsBuffer() const { return m_bBuffer; }
  /// The index of the table's first texel.
  int First() const;

private:
  bool MakeTexture( VRenderContext& io_rContext );
  bool IsAlive( const VRenderContext& i_rContext ) const;
  void Release();

  ETexelFormat m_Format;
  VDynamicBuffer m_Buffer;
  std::vector< std::byte > m_Texels; ///< of the 2D form, while it is mapped
  std::size_t m_Rows = 0;
  GLuint m_Texture = 0;
  GLuint m_Attached = 0; ///< the buffer object that the texture reads
  QPointer< QOpenGLContextGroup > m_pGroup;
  bool m_bBuffer = false;
  bool m_bFilled = false;
};

} // namespace CoreGraphics
