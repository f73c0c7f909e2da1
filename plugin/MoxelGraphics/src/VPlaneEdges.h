#pragma once

#include "VHeldBuffer.h"

#include <CoreGraphics/VRenderState.h>
#include <CoreGraphics/VShaderProgram.h>
#include <MoxelGraphics/VRenderCameras.h>

namespace MoxelGraphics
{

/// The edges of what calibrated cameras see, on the far faces of their frustums in the 3D view: a line through each row
/// of a blob, one draw a camera.
class VPlaneEdges
{
public:
  explicit VPlaneEdges( const VMoxelScene& i_rScene );

  /// By the cameras' numbers, with pictures as of `VRenderCameras::SetPictures`. Edges are read in the call.
  void Take( const std::vector< ZEK::VRenderCameraRef >& i_rCameras, std::span< const VCameraPictures > i_Pictures );
  void Draw( CoreGraphics::VRenderContext& io_rContext );

private:
  struct VPart
  {
    ZEK::VRenderCameraRef pCamera;
    std::size_t First = 0, Count = 0; ///< vertices
  };
  struct VTaken
  {
    std::uint64_t Generation = 0;
    std::int32_t ChangeCount = 0;

    friend bool operator==( const VTaken&, const VTaken& ) = default;
  };

  std::vector< VTaken > m_Taken;
  std::vector< VPart > m_Parts;
  std::vector< float > m_Vertices; ///< x and y, sensor pixels that are corrected for the lens
  std::uint64_t m_Generation = 1;
  VHeldBuffer m_Buffer;
  std::shared_ptr< CoreGraphics::VShaderProgram > m_pProgram;
  CoreGraphics::VUniform m_Transform{ "u_ModelTransform" }, m_Sensor{ "u_SensorSize" };
  CoreGraphics::VUniform m_OffsetScale{ "u_SensorImageOffsetScale" };
  CoreGraphics::VRenderState m_State;
};

} // namespace MoxelGraphics
