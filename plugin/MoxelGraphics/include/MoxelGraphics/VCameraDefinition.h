#pragma once

#include <array>
#include <cstdint>
#include <string>

namespace MoxelGraphics
{

/// What views need to know of a camera to lay it out, name it and sort it. `StandsBefore` is their order.
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

/// Optical cameras before video, then by number, those without one last, then by the bytes of the URN.
inline bool StandsBefore( const VCameraDefinition& i_rA, const VCameraDefinition& i_rB )
{
  const auto Number = []( const VCameraDefinition& i_rCamera )
  {
    return static_cast< std::uint32_t >( i_rCamera.UserId );
  };
  return i_rA.bVideo != i_rB.bVideo         ? i_rB.bVideo
         : Number( i_rA ) != Number( i_rB ) ? Number( i_rA ) < Number( i_rB )
                                            : i_rA.DeviceURN < i_rB.DeviceURN;
}

} // namespace MoxelGraphics
