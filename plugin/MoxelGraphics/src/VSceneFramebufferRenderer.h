#pragma once

#include <QtCore/QPointer>
#include <QtQuick/QQuickFramebufferObject>
#include <QtQuick/QQuickWindow>

#include <memory>

namespace MoxelGraphics
{
class VSceneFrame;

/// The half of the item that lives on the render thread: makes the framebuffer, meets the item in `synchronize`,
/// and lets the frame draw.
class VSceneFramebufferRenderer : public QQuickFramebufferObject::Renderer
{
public:
  explicit VSceneFramebufferRenderer( bool i_bContinuous );
  ~VSceneFramebufferRenderer() override;

  QOpenGLFramebufferObject* createFramebufferObject( const QSize& i_rSize ) override;
  void render() override;
  void synchronize( QQuickFramebufferObject* i_pItem ) override;

private:
  std::unique_ptr< VSceneFrame > m_pFrame;
  bool m_bContinuous;
};

} // namespace MoxelGraphics
