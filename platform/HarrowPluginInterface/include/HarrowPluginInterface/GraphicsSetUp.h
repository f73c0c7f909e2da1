#pragma once

#include <QtCore/QCoreApplication>
#include <QtGui/QSurfaceFormat>
#include <QtQuick/QQuickWindow>

namespace HarrowPluginInterface
{

/// What the module's views need of a host: contexts that share, OpenGL 4.3 with depth and stencil, and Qt Quick that
/// draws with it. Call it before the application object exists; link Qt6::Quick.
inline void SetUpGraphics( bool i_bCoreProfile = true )
{
  QCoreApplication::setAttribute( Qt::AA_ShareOpenGLContexts );
  QSurfaceFormat Format;
  if ( i_bCoreProfile )
  {
    Format.setVersion( 4, 3 );
    Format.setProfile( QSurfaceFormat::CoreProfile );
  }
  Format.setDepthBufferSize( 24 );
  Format.setStencilBufferSize( 8 );
  QSurfaceFormat::setDefaultFormat( Format );
  QQuickWindow::setGraphicsApi( QSGRendererInterface::OpenGL );
}

} // namespace HarrowPluginInterface
