#pragma once

#include <memory>

class QOffscreenSurface;

namespace MoxelGraphics
{

/// Makes sure, as far as the thread allows, that an OpenGL context is current while it lives, so that objects of a
/// scene can be freed where no view is being drawn. An already current context stays.
class VGlobalContext
{
public:
  VGlobalContext();
  ~VGlobalContext();
  VGlobalContext( const VGlobalContext& ) = delete;
  VGlobalContext& operator=( const VGlobalContext& ) = delete;

private:
  std::unique_ptr< QOffscreenSurface > m_pSurface;
};

} // namespace MoxelGraphics
