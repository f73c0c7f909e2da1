#pragma once

#include <QtCore/QPointer>
#include <QtGui/QOpenGLContextGroup>
#include <QtGui/qopengl.h>

#include <cstddef>
#include <cstdint>

namespace CoreGraphics
{
class VRenderContext;
}

namespace MoxelGraphics
{

/// What a texel is made of: so many bytes.
enum class ETexel : std::uint8_t
{
  R8 = 1,
  RG8 = 2,
  RGBA8 = 4
};

/// Pixels of an image that is written again and again; without mipmaps, its rims go on outside. Lives in the share
/// group that it was written in. Thread: render thread with a context current.
class VTexture
{
public:
  VTexture() = default;
  ~VTexture();
  VTexture( const VTexture& ) = delete;
  VTexture& operator=( const VTexture& ) = delete;

  /// Rows of `i_Stride` bytes; of the last one only the texels are read. False, with nothing written, for a size that
  /// the device does not take.
  bool Write( CoreGraphics::VRenderContext& io_rContext, ETexel i_Texel, int i_Width, int i_Height,
              const std::uint8_t* i_pData, std::size_t i_Stride );
  /// Whether there is something to be read in the context's share group.
  bool IsThere( const CoreGraphics::VRenderContext& i_rContext ) const;
  void Bind( CoreGraphics::VRenderContext& io_rContext, int i_Unit ) const;
  void Free();

private:
  bool Make( CoreGraphics::VRenderContext& io_rContext, ETexel i_Texel, int i_Width, int i_Height );

  GLuint m_Id = 0;
  QPointer< QOpenGLContextGroup > m_pGroup;
  ETexel m_Texel = ETexel::R8;
  int m_Width = 0, m_Height = 0;
};

} // namespace MoxelGraphics
