#pragma once

#include <CoreMoxelTypes/Camera.h>
#include <ZEK/RenderCamera.h>

#include <array>

namespace ComputeCameraModel
{

/// 2 by 2, row-major.
using VMatrix2 = std::array< float, 4 >;

inline constexpr ZEK::VMatrix4 Identity4{ 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1 };

/// How one camera sees the world, as views draw with it. A plain value.
///
/// Image transforms take homogeneous points of the view (x right, y up, z backwards, of `CameraFromWorld`) to the image
/// as a part of the sensor's width and height, (0, 0) its top left corner, and are scaled so that the image keeps unit
/// area. Their lens is free of distortion.
struct VCameraModel
{
  ZEK::VMatrix4 WorldFromCamera = Identity4;  ///< x right, y down, z forward of the camera; mm
  ZEK::VMatrix4 FrustumTransform = Identity4; ///< places the drawn frustum, which is 500 mm long whatever the lens
  ZEK::VMatrix4 CameraFromWorld = Identity4;  ///< the view matrix
  ZEK::VMatrix4 ImageTransform = Identity4;
  ZEK::VMatrix4 ImageTransformSnapped = Identity4; ///< turned by `SnappedRoll` about the centre of distortion
  ZEK::VMatrix4 ImageTransformRotated = Identity4; ///< turned by `Roll`
  std::array< float, 2 > DistortionCentre{};       ///< sensor pixels; (0, 0) means no distortion
  std::array< float, 3 > DistortionParameters{};   ///< `K1`, `K2`, `K3`: 1/px^2, 1/px^4, 1/px^6
  float Roll = 0;        ///< how far the image must turn for world +z to be up on the screen, rad
  float SnappedRoll = 0; ///< to quarter turns
  VMatrix2 RollRotation{ 1, 0, 0, 1 }, RollInverse{ 1, 0, 0, 1 };
  VMatrix2 SnappedRotation{ 1, 0, 0, 1 }, SnappedInverse{ 1, 0, 0, 1 };

  /// The one rule by which a camera reaches a scene. A camera that looks straight along world z keeps its roll; a
  /// radial model above 1 keeps the distortion; parameters that are missing count as 0. Nonsense in gives matrices that
  /// are not finite.
  void Set( const CoreMoxelTypes::VCameraHardware& i_rHardware,
            const CoreMoxelTypes::VCameraCalibration& i_rCalibration );
  /// Leaves everything alone for the roll that is there.
  void SetRoll( float i_Roll );
  /// Whether every number is one.
  bool IsFinite() const;
};

/// Whether a calibration has a radial model and a focal length that a view can use.
inline bool IsUsable( const CoreMoxelTypes::VCameraCalibration& i_rCalibration )
{
  return i_rCalibration.RadialModel <= 1 && i_rCalibration.FocalLength > 0;
}

} // namespace ComputeCameraModel
