#include "VSceneFramebufferRenderer.h"

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneFrame.h>
#include <MoxelGraphics/VSceneFramebufferObject.h>

#include <CoreGraphics/VCameraController.h>

#include <QtOpenGL/QOpenGLFramebufferObject>
#include <QtQuick/QQuickOpenGLUtils>

namespace MoxelGraphics
{

VSceneFramebufferRenderer::VSceneFramebufferRenderer( bool i_bContinuous )
  : m_bContinuous( i_bContinuous )
{
}

VSceneFramebufferRenderer::~VSceneFramebufferRenderer() = default;

QOpenGLFramebufferObject* VSceneFramebufferRenderer::createFramebufferObject( const QSize& i_rSize )
{
  const bool bFreeView = !m_pFrame || !m_pFrame->Input().Options.CameraView;
  auto pTarget = VSceneFrame::MakeTarget( i_rSize, bFreeView );
  if ( m_pFrame )
  {
    m_pFrame->Resize( i_rSize );
  }
  // Qt takes the target with whatever state it has; an invalid one shows an empty item.
  return pTarget ? pTarget.release() : new QOpenGLFramebufferObject( i_rSize );
}

void VSceneFramebufferRenderer::synchronize( QQuickFramebufferObject* i_pItem )
{
  auto& rItem = static_cast< VSceneFramebufferObject& >( *i_pItem );
  const bool bOtherScene = rItem.m_pScene && ( !m_pFrame || m_pFrame->Scene() != rItem.m_pScene );
  if ( bOtherScene )
  {
    m_pFrame = std::make_unique< VSceneFrame >( rItem.m_pScene, rItem.m_pController );
    rItem.BeginFrames();
    invalidateFramebufferObject();
  }
  else if ( !rItem.m_pScene )
  {
    m_pFrame.reset();
  }
  if ( !m_pFrame )
  {
    rItem.PassGestures();
    return;
  }
  const VSceneOptions& rFormer = m_pFrame->Input().Options;
  const bool bDistorted = rFormer.Show3DOverlay && rFormer.Distort3D;
  const bool bCameraView = rFormer.CameraView;
  rItem.Exchange( *m_pFrame );
  const VSceneOptions& rOptions = m_pFrame->Input().Options;
  if ( bDistorted != ( rOptions.Show3DOverlay && rOptions.Distort3D ) || bCameraView != rOptions.CameraView )
  {
    invalidateFramebufferObject();
  }
}

void VSceneFramebufferRenderer::render()
{
  if ( m_pFrame && m_pFrame->Render( *framebufferObject() ) )
  {
    QQuickOpenGLUtils::resetOpenGLState();
  }
  if ( m_bContinuous )
  {
    update();
  }
}

} // namespace MoxelGraphics
