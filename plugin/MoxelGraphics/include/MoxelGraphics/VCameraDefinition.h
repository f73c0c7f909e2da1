#pragma once

#include <array>
#include <cstdint>
#include <string>

namespace MoxelGraphics
{

/// What views need to know of a camera to lay it out, name it and sort it. Sorted by URN.
struct VCameraDefinition
{
  std::string DeviceURN;
  std::string DisplayType;
  std::int32_t UserId = -1;
  bool bCalibrated = false;
  bool bVideo = false;
  std::array< float, 3 > Position{}; ///< mm, world
  double PixelAspect = 1.0;
  std::int32_t ImageWidth = 0; ///< px
  std::int32_t ImageHeight = 0;
  /// 2 by 2, row-major: how the image stands on screen in its mounted orientation, and snapped to quarter turns.
  std::array< float, 4 > Rotation{ 1, 0, 0, 1 };
  std::array< float, 4 > SnappedRotation{ 1, 0, 0, 1 };

  friend bool operator==( const VCameraDefinition&, const VCameraDefinition& ) = default;
};

} // namespace MoxelGraphics
