#include "VGlobalContext.h"

#include <QtCore/QThread>
#include <QtGui/QGuiApplication>
#include <QtGui/QOffscreenSurface>
#include <QtGui/QOpenGLContext>

namespace MoxelGraphics
{

VGlobalContext::VGlobalContext()
{
  QOpenGLContext* pShared = QOpenGLContext::globalShareContext();
  const bool bHere = pShared && qGuiApp && pShared->thread() == QThread::currentThread() &&
                     qGuiApp->thread() == QThread::currentThread();
  if ( QOpenGLContext::currentContext() || !bHere )
  {
    return;
  }
  m_pSurface = std::make_unique< QOffscreenSurface >();
  m_pSurface->setFormat( pShared->format() );
  m_pSurface->create();
  if ( !pShared->makeCurrent( m_pSurface.get() ) )
  {
    m_pSurface.reset();
  }
}

VGlobalContext::~VGlobalContext()
{
  if ( m_pSurface )
  {
    QOpenGLContext::globalShareContext()->doneCurrent();
  }
}

} // namespace MoxelGraphics
