#pragma once

#include <QtCore/QVariantList>

namespace MoxelGraphics
{
class VCameraGrid;
struct VSceneOptions;
} // namespace MoxelGraphics

namespace ZEK
{
class IRenderCameraProvider;
}

namespace HarrowGraphics
{

/// Where each tile of a camera view stands and where it shows the camera's centroids, in pixels of the frame from its
/// top left. Thread: GUI, which must be the one that draws.
QVariantList CameraReport( const MoxelGraphics::VCameraGrid& i_rGrid, const ZEK::IRenderCameraProvider& i_rCameras,
                           const MoxelGraphics::VSceneOptions& i_rOptions );

} // namespace HarrowGraphics
