#pragma once

#include <QtGui/QOffscreenSurface>
#include <QtGui/QOpenGLContext>
#include <QtOpenGL/QOpenGLFramebufferObject>

#include <memory>

namespace BenchSupport
{

/// A current 4.3 core context without a window, and a target without samples. Ends the program where there is none.
class VOffscreen
{
public:
  VOffscreen( int i_Width, int i_Height );
  QOpenGLFramebufferObject& Target() { return *m_pTarget; }

private:
  QOffscreenSurface m_Surface;
  QOpenGLContext m_Context;
  std::unique_ptr< QOpenGLFramebufferObject > m_pTarget;
};

} // namespace BenchSupport
