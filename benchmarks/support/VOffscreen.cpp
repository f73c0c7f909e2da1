#include "VOffscreen.h"

#include <cstdio>
#include <cstdlib>

namespace BenchSupport
{

VOffscreen::VOffscreen( int i_Width, int i_Height )
{
  QSurfaceFormat Format;
  Format.setVersion( 4, 3 );
  Format.setProfile( QSurfaceFormat::CoreProfile );
  Format.setDepthBufferSize( 24 );
  m_Surface.setFormat( Format );
  m_Surface.create();
  m_Context.setFormat( Format );
  if ( !m_Context.create() || !m_Context.makeCurrent( &m_Surface ) )
  {
    std::fprintf( stderr, "no OpenGL context\n" );
    std::exit( 1 );
  }
  m_pTarget = std::make_unique< QOpenGLFramebufferObject >( i_Width, i_Height, QOpenGLFramebufferObject::Depth );
}

} // namespace BenchSupport
