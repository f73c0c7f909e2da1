#pragma once

#include <cstdint>
#include <vector>

class QRect;

namespace CoreGraphics
{
class VRenderContext;
}
namespace ZEK
{
class IRenderCameraProvider;
}

namespace MoxelGraphics
{
struct VSceneOptions;

/// Appends the ids of the centroids of the camera that the context's tile shows (`VSceneOptions::OverlayCamera`) and
/// whose centres lie in the rectangle, bounds included: by computation, as the programs place them. `i_rRect` is in
/// pixels of the context's frame, y up, from its left to its right edge. Nothing while no camera is shown or centroids
/// are off.
void PickCentroidsInRect( const ZEK::IRenderCameraProvider& i_rProvider, const CoreGraphics::VRenderContext& i_rContext,
                          const VSceneOptions& i_rOptions, const QRect& i_rRect,
                          std::vector< std::uint32_t >& io_rIds );

} // namespace MoxelGraphics
