#pragma once

#include "FlowTestScene.h"

#include <CoreGraphics/ShaderResources.h>
#include <CoreGraphics/VCameraController.h>
#include <MoxelGraphics/VSceneFrame.h>

#include <QtGui/QImage>
#include <QtGui/QOffscreenSurface>
#include <QtGui/QOpenGLContext>
#include <QtOpenGL/QOpenGLFramebufferObject>

#include <gtest/gtest.h>

namespace FlowTest
{

/// A view of a scene in a context of its own.
class VFrame
{
public:
  explicit VFrame( std::shared_ptr< VScene > i_pScene, QSize i_Size = { 480, 270 } )
    : m_Size( i_Size )
  {
    CoreGraphics::InitBasicShaderResources();
    CoreGraphics::InitSceneShaderResources();
    m_Surface.create();
    m_Context.setShareContext( QOpenGLContext::globalShareContext() );
    EXPECT_TRUE( m_Context.create() && m_Context.makeCurrent( &m_Surface ) );
    m_pTarget = MoxelGraphics::VSceneFrame::MakeTarget( m_Size, false );
    m_pFrame = std::make_unique< MoxelGraphics::VSceneFrame >( std::move( i_pScene ),
                                                               std::make_shared< CoreGraphics::VCameraController >() );
    m_pFrame->Resize( m_Size );
  }
  ~VFrame() { m_pFrame.reset(); }

  MoxelGraphics::VSceneFrame& Frame() { return *m_pFrame; }
  QImage Draw()
  {
    m_pTarget->bind();
    EXPECT_TRUE( m_pFrame->Render( *m_pTarget ) );
    return m_pTarget->toImage();
  }
  /// Where the view shows a place, in pixels from the top left.
  QPointF Screen( const QVector3D& i_rPlace ) const
  {
    const CoreGraphics::VCameraFields& rCamera = m_pFrame->Controller().Fields();
    const QVector3D Clip = ( rCamera.projection * rCamera.view ).map( i_rPlace );
    return { ( static_cast< qreal >( Clip.x() ) + 1 ) * m_Size.width() / 2,
             ( 1 - static_cast< qreal >( Clip.y() ) ) * m_Size.height() / 2 };
  }

private:
  QSize m_Size;
  QOffscreenSurface m_Surface;
  QOpenGLContext m_Context;
  std::unique_ptr< QOpenGLFramebufferObject > m_pTarget;
  std::unique_ptr< MoxelGraphics::VSceneFrame > m_pFrame;
};

} // namespace FlowTest
