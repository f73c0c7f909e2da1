#pragma once

#include <MoxelGraphics/IRenderType.h>

#include <memory>

class QRect;

namespace CoreGraphics
{
class VResources;
}

namespace MoxelGraphics
{

/// The axis gizmo in the corner of a free view: x red, y green, z blue.
class VRenderAxis : public IRenderType
{
public:
  explicit VRenderAxis( std::shared_ptr< CoreGraphics::VResources > i_pResources );
  ~VRenderAxis() override;

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

  /// The square that the gizmo takes at the corner of a viewport.
  static QRect Square( const QRect& i_rViewport );

private:
  struct VGl;
  std::unique_ptr< VGl > m_pGl;
};

} // namespace MoxelGraphics
