#pragma once

#include <QtCore/QPointer>
#include <QtGui/QOpenGLContextGroup>
#include <QtGui/qopengl.h>

namespace CoreGraphics
{
class VRenderContext;
}

namespace MoxelGraphics
{

/// One cell of the floor's grid: a frame of light on black, with mipmaps. Lives in the share group that it was made
/// in and is made again where that group has died. Thread: render thread with a context current.
class VGridTexture
{
public:
  VGridTexture() = default;
  ~VGridTexture();
  VGridTexture( const VGridTexture& ) = delete;
  VGridTexture& operator=( const VGridTexture& ) = delete;

  GLuint Id( CoreGraphics::VRenderContext& io_rContext );

private:
  void Make( CoreGraphics::VRenderContext& io_rContext );

  GLuint m_Id = 0;
  QPointer< QOpenGLContextGroup > m_pGroup;
};

} // namespace MoxelGraphics
