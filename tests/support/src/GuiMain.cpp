#include <TestSupport/LogGuard.h>

#include <QtGui/QSurfaceFormat>
#include <QtQuick/QQuickWindow>
#include <QtWidgets/QApplication>

#include <gtest/gtest.h>

// The same surface and sharing that the host asks for, before the application object exists.
int main( int i_Count, char** i_ppArguments )
{
  testing::InitGoogleTest( &i_Count, i_ppArguments );
  QCoreApplication::setAttribute( Qt::AA_ShareOpenGLContexts );
  QSurfaceFormat Format;
  Format.setVersion( 4, 3 );
  Format.setProfile( QSurfaceFormat::CoreProfile );
  Format.setDepthBufferSize( 24 );
  Format.setStencilBufferSize( 8 );
  QSurfaceFormat::setDefaultFormat( Format );
  QQuickWindow::setGraphicsApi( QSGRendererInterface::OpenGL );
  QApplication Application( i_Count, i_ppArguments );
  TestSupport::InstallLogGuard();
  return RUN_ALL_TESTS();
}
