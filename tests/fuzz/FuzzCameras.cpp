#include "FuzzRequire.h"

#include <HostSources/CameraCalibrations.h>

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <set>
#include <string>

using namespace HostSources;
using FuzzCheck::Require;

namespace
{
bool IsFinite( const CoreMoxelTypes::D3& i_rVector )
{
  return std::isfinite( i_rVector.x ) && std::isfinite( i_rVector.y ) && std::isfinite( i_rVector.z );
}

bool IsFinite( const double ( &i_rPair )[2] )
{
  return std::isfinite( i_rPair[0] ) && std::isfinite( i_rPair[1] );
}

void CheckCalibration( const CoreMoxelTypes::VCameraCalibration& i_rCalibration )
{
  Require( i_rCalibration.FocalLength > 0 && std::isfinite( i_rCalibration.FocalLength ), "a focal length is usable" );
  Require( i_rCalibration.AspectRatio > 0 && std::isfinite( i_rCalibration.AspectRatio ), "an aspect ratio is usable" );
  Require( IsFinite( i_rCalibration.Rotation ) && IsFinite( i_rCalibration.Position ), "a pose is finite" );
  Require( IsFinite( i_rCalibration.PrincipalPoint ) && IsFinite( i_rCalibration.DistortionCentre ) &&
               std::isfinite( i_rCalibration.Skew ),
           "an image is finite" );
  Require( i_rCalibration.RadialModel <= 1 && i_rCalibration.RadialParameters.size() == 2 + i_rCalibration.RadialModel,
           "a lens has the numbers of its model" );
  for ( const double Parameter : i_rCalibration.RadialParameters )
  {
    Require( std::isfinite( Parameter ), "a lens is finite" );
  }
}

void CheckCameras( const VCameraCalibrations& i_rCalibrations )
{
  std::set< std::string > Names;
  for ( const VCalibratedCamera& rCamera : i_rCalibrations.Cameras )
  {
    Require( !rCamera.Name.empty() && Names.insert( rCamera.Name ).second, "cameras are told apart by their names" );
    const auto& rHardware = rCamera.Hardware;
    Require( rHardware.SensorWidth >= 1 && rHardware.SensorWidth <= 65535 && rHardware.SensorHeight >= 1 &&
                 rHardware.SensorHeight <= 65535 && rHardware.PixelAspect > 0,
             "a sensor has a size" );
    if ( rCamera.Calibration )
    {
      CheckCalibration( *rCamera.Calibration );
    }
  }
}

/// The report of what was read is a calibration file itself.
void CheckReport( const VCameraCalibrations& i_rCalibrations )
{
  VCameraCalibrations Again;
  std::string Message;
  const std::string Report = CameraCalibrationsJson( i_rCalibrations );
  Require( ReadCameraCalibrations( Report, "report.json", Again, Message ).IsOk(), "a report can be read" );
  Require( Again.Cameras.size() == i_rCalibrations.Cameras.size(), "a report has every camera" );
  for ( std::size_t Index = 0; Index < Again.Cameras.size(); ++Index )
  {
    const VCalibratedCamera &rA = i_rCalibrations.Cameras[Index], &rB = Again.Cameras[Index];
    Require( rA.Name == rB.Name && rA.UserId == rB.UserId && rA.Hardware.SensorWidth == rB.Hardware.SensorWidth &&
                 rA.Hardware.Video == rB.Hardware.Video,
             "a report has a camera as it was" );
    Require( rA.Calibration.has_value() == rB.Calibration.has_value(), "a report has every calibration" );
    Require( !rA.Calibration || ( rA.Calibration->FocalLength == rB.Calibration->FocalLength &&
                                  rA.Calibration->Position.x == rB.Calibration->Position.x &&
                                  rA.Calibration->RadialParameters == rB.Calibration->RadialParameters ),
             "a report loses no digit" );
  }
}
} // namespace

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  const std::string Name = "input";
  VCameraCalibrations Calibrations;
  std::string Message;
  const ZEK::IResult Result = ReadCameraCalibrations(
      std::string_view( reinterpret_cast< const char* >( i_pData ), i_Size ), Name, Calibrations, Message );
  if ( Result.IsError() )
  {
    Require( Message.starts_with( Name + ": " ) && Message.size() > Name.size() + 2, "a failure says where and what" );
    Require( Calibrations.Cameras.empty() && Calibrations.Notes.empty(), "a failure leaves nothing" );
    return 0;
  }
  Require( Message.empty(), "a success has no message" );
  Require( ( Result == ZEK::IResult::Ok ) == Calibrations.Notes.empty(), "what is not right has a note" );
  CheckCameras( Calibrations );
  CheckReport( Calibrations );
  return 0;
}
