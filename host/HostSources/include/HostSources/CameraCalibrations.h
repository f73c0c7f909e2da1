#pragma once

#include <CoreMoxelTypes/Camera.h>
#include <ZEK/Result.h>

#include <array>
#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace HostSources
{

/// A camera as toolkits of computer vision describe it: a pinhole with a polynomial lens. Pixel (0, 0) is the centre of
/// the top left pixel; x right, y down, z forward.
struct VPinholeCamera
{
  double Fx = 0, Fy = 0, Cx = 0, Cy = 0, Skew = 0; ///< px
  std::array< double, 5 > Distortion{};            ///< k1, k2, p1, p2, k3
  CoreMoxelTypes::D3 Rotation;                     ///< world to camera, angle times axis, rad
  CoreMoxelTypes::D3 Translation;                  ///< mm; a point p of the world is R p + t in the camera

  struct VPoint
  {
    double x = 0, y = 0;
  };
  /// From a direction (x / z, y / z) to the raw image; with `i_bLens` false to the image of a perfect lens.
  VPoint ToImage( const VPoint& i_rDirection, bool i_bLens = true ) const;
  /// The reverse for the real lens; false where the polynomial has turned back.
  bool ToDirection( const VPoint& i_rImage, VPoint& o_rDirection ) const;
  /// Of a place in the world, mm; false behind the camera.
  bool Project( const CoreMoxelTypes::D3& i_rPlace, VPoint& o_rImage ) const;
};

/// How well the lens of a pinhole camera could be told in this system's own terms: distances in the raw image.
struct VLensRefit
{
  double Rms = 0, Worst = 0; ///< px
  double Covered = 1;        ///< part of the sensor on which both lenses are defined
};

/// One camera of a calibration file.
struct VCalibratedCamera
{
  std::string Name; ///< its device URN
  std::string DisplayName;
  std::int32_t UserId = -1;
  CoreMoxelTypes::VCameraHardware Hardware;
  /// Absent where the file's is of no use; the notes then say why.
  std::optional< CoreMoxelTypes::VCameraCalibration > Calibration;
  std::optional< VPinholeCamera > Pinhole; ///< what the calibration was converted from
  VLensRefit Refit;
};

struct VCameraCalibrations
{
  std::string Name;   ///< of the file
  std::string Format; ///< "TOML" or "JSON"
  std::vector< VCalibratedCamera > Cameras;
  std::vector< std::string > Notes; ///< what was odd, as sentences
};

/// Reads a calibration file; what it is, is told by its content. Lengths of a TOML file are metres.
///
/// `OkButPartial` when a camera, or its calibration, could not be used: the notes say which and why. A failure leaves
/// nothing and says in `o_rMessage` which file it was and what was wrong: `FileNotFound`, `FileIOFailure`,
/// `InvalidFormat`, `AllocationFailure`. Thread: any.
ZEK::IResult ReadCameraCalibrations( const std::filesystem::path& i_rPath, VCameraCalibrations& o_rCalibrations,
                                     std::string& o_rMessage );
/// The same from text; `i_rName` is the file's name in messages.
ZEK::IResult ReadCameraCalibrations( std::string_view i_Text, const std::string& i_rName,
                                     VCameraCalibrations& o_rCalibrations, std::string& o_rMessage );

/// False, with a reason, for numbers that make no camera. The sensor's size has to be in `io_rCamera`, which gets
/// calibration, pinhole and refit.
bool ConvertPinhole( const VPinholeCamera& i_rPinhole, VCalibratedCamera& io_rCamera, std::string& o_rReason );

/// The angle-axis vector of a rotation, row-major; false for a matrix that is none.
bool RotationVector( const std::array< double, 9 >& i_rMatrix, CoreMoxelTypes::D3& o_rVector );
/// Row-major.
std::array< double, 9 > RotationMatrix( const CoreMoxelTypes::D3& i_rVector );

/// One JSON object that tells all of the cameras and of the models that views draw them with; it can be read again.
/// Numbers that are not finite become null.
std::string CameraCalibrationsJson( const VCameraCalibrations& i_rCalibrations );

} // namespace HostSources
