#include <ComputeCameraModel/VCameraModel.h>
#include <ComputeCameraModel/VRadialDistortion.h>
#include <HostSources/CameraCalibrations.h>

#include <rapidjson/prettywriter.h>
#include <rapidjson/stringbuffer.h>

#include <cmath>
#include <limits>
#include <span>

namespace HostSources
{
namespace
{
using VWriter = rapidjson::PrettyWriter< rapidjson::StringBuffer >;
using ComputeCameraModel::VCameraModel;
using CoreMoxelTypes::VCameraCalibration;

void Number( VWriter& io_rWriter, double i_Value )
{
  std::isfinite( i_Value ) ? io_rWriter.Double( i_Value ) : io_rWriter.Null();
}
void Number( VWriter& io_rWriter, const char* i_pKey, double i_Value )
{
  io_rWriter.Key( i_pKey );
  Number( io_rWriter, i_Value );
}
void Text( VWriter& io_rWriter, const char* i_pKey, const std::string& i_rValue )
{
  io_rWriter.Key( i_pKey );
  io_rWriter.String( i_rValue.c_str(), static_cast< rapidjson::SizeType >( i_rValue.size() ) );
}

/// One line an array: a matrix in four lines is read at a glance, in sixteen it is not.
template < typename TRange >
void Line( VWriter& io_rWriter, const TRange& i_rValues )
{
  io_rWriter.StartArray();
  io_rWriter.SetFormatOptions( rapidjson::kFormatSingleLineArray );
  for ( const auto Value : i_rValues )
  {
    Number( io_rWriter, static_cast< double >( Value ) );
  }
  io_rWriter.EndArray();
  io_rWriter.SetFormatOptions( rapidjson::kFormatDefault );
}
template < typename TRange >
void Line( VWriter& io_rWriter, const char* i_pKey, const TRange& i_rValues )
{
  io_rWriter.Key( i_pKey );
  Line( io_rWriter, i_rValues );
}
void Line( VWriter& io_rWriter, const char* i_pKey, const CoreMoxelTypes::D3& i_rValue )
{
  Line( io_rWriter, i_pKey, std::array{ i_rValue.x, i_rValue.y, i_rValue.z } );
}

/// By rows.
void Matrix( VWriter& io_rWriter, const char* i_pKey, const ZEK::VMatrix4& i_rMatrix )
{
  io_rWriter.Key( i_pKey );
  io_rWriter.StartArray();
  for ( std::size_t Row = 0; Row < 4; ++Row )
  {
    Line( io_rWriter, std::array{ i_rMatrix[Row], i_rMatrix[4 + Row], i_rMatrix[8 + Row], i_rMatrix[12 + Row] } );
  }
  io_rWriter.EndArray();
}
void Matrix( VWriter& io_rWriter, const char* i_pKey, const ComputeCameraModel::VMatrix2& i_rMatrix )
{
  io_rWriter.Key( i_pKey );
  io_rWriter.StartArray();
  Line( io_rWriter, std::span( i_rMatrix ).first( 2 ) );
  Line( io_rWriter, std::span( i_rMatrix ).last( 2 ) );
  io_rWriter.EndArray();
}

void WriteCalibration( VWriter& io_rWriter, const VCameraCalibration& i_rCalibration )
{
  io_rWriter.Key( "calibration" );
  io_rWriter.StartObject();
  Line( io_rWriter, "rotation", i_rCalibration.Rotation );
  Line( io_rWriter, "position", i_rCalibration.Position );
  Number( io_rWriter, "focalLength", i_rCalibration.FocalLength );
  Number( io_rWriter, "aspectRatio", i_rCalibration.AspectRatio );
  Number( io_rWriter, "skew", i_rCalibration.Skew );
  Line( io_rWriter, "principalPoint", std::span( i_rCalibration.PrincipalPoint ) );
  Line( io_rWriter, "distortionCentre", std::span( i_rCalibration.DistortionCentre ) );
  io_rWriter.Key( "radialModel" );
  io_rWriter.Uint( i_rCalibration.RadialModel );
  Line( io_rWriter, "radialParameters", i_rCalibration.RadialParameters );
  io_rWriter.EndObject();
}

void WriteModel( VWriter& io_rWriter, const VCameraModel& i_rModel )
{
  io_rWriter.Key( "model" );
  io_rWriter.StartObject();
  Matrix( io_rWriter, "worldFromCamera", i_rModel.WorldFromCamera );
  Matrix( io_rWriter, "frustumTransform", i_rModel.FrustumTransform );
  Matrix( io_rWriter, "cameraFromWorld", i_rModel.CameraFromWorld );
  Matrix( io_rWriter, "imageTransform", i_rModel.ImageTransform );
  Matrix( io_rWriter, "imageTransformSnapped", i_rModel.ImageTransformSnapped );
  Matrix( io_rWriter, "imageTransformRotated", i_rModel.ImageTransformRotated );
  Line( io_rWriter, "distortionCentre", i_rModel.DistortionCentre );
  Line( io_rWriter, "distortionParameters", i_rModel.DistortionParameters );
  Number( io_rWriter, "roll", static_cast< double >( i_rModel.Roll ) );
  Number( io_rWriter, "snappedRoll", static_cast< double >( i_rModel.SnappedRoll ) );
  Matrix( io_rWriter, "rollRotation", i_rModel.RollRotation );
  Matrix( io_rWriter, "snappedRotation", i_rModel.SnappedRotation );
  io_rWriter.EndObject();
}

/// Distances from the centre of distortion that the lens is defined on; null where there is no limit.
void WriteDomain( VWriter& io_rWriter, const VCameraCalibration& i_rCalibration )
{
  const ComputeCameraModel::VRadialDistortion Lens(
      { i_rCalibration.RadialModel,
        i_rCalibration.RadialParameters,
        { i_rCalibration.DistortionCentre[0], i_rCalibration.DistortionCentre[1] } } );
  const auto Limit = []( double i_Square )
  {
    return i_Square < std::numeric_limits< double >::max() ? std::sqrt( i_Square ) : std::nan( "" );
  };
  io_rWriter.Key( "distortionDomain" );
  io_rWriter.StartObject();
  Number( io_rWriter, "maxRawRadius", Limit( Lens.MaxRawRadiusSq() ) );
  Number( io_rWriter, "maxCorrectedRadius", Limit( Lens.MaxCorrectedRadiusSq() ) );
  io_rWriter.EndObject();
}

void WriteRefit( VWriter& io_rWriter, const VLensRefit& i_rRefit )
{
  io_rWriter.Key( "refit" );
  io_rWriter.StartObject();
  Number( io_rWriter, "residualRms", i_rRefit.Rms );
  Number( io_rWriter, "residualWorst", i_rRefit.Worst );
  Number( io_rWriter, "covered", i_rRefit.Covered );
  io_rWriter.EndObject();
}

void WriteCamera( VWriter& io_rWriter, const VCalibratedCamera& i_rCamera )
{
  io_rWriter.StartObject();
  Text( io_rWriter, "name", i_rCamera.Name );
  Text( io_rWriter, "displayName", i_rCamera.DisplayName );
  Text( io_rWriter, "type", i_rCamera.Hardware.Type );
  io_rWriter.Key( "userId" );
  io_rWriter.Int( i_rCamera.UserId );
  Line( io_rWriter, "sensor", std::array{ i_rCamera.Hardware.SensorWidth, i_rCamera.Hardware.SensorHeight } );
  Number( io_rWriter, "pixelAspect", i_rCamera.Hardware.PixelAspect );
  io_rWriter.Key( "video" );
  io_rWriter.Bool( i_rCamera.Hardware.Video );
  if ( i_rCamera.Calibration )
  {
    WriteCalibration( io_rWriter, *i_rCamera.Calibration );
    VCameraModel Model;
    Model.Set( i_rCamera.Hardware, *i_rCamera.Calibration );
    WriteModel( io_rWriter, Model );
    WriteDomain( io_rWriter, *i_rCamera.Calibration );
  }
  if ( i_rCamera.Pinhole )
  {
    WriteRefit( io_rWriter, i_rCamera.Refit );
  }
  io_rWriter.EndObject();
}
} // namespace

std::string CameraCalibrationsJson( const VCameraCalibrations& i_rCalibrations )
{
  rapidjson::StringBuffer Buffer;
  VWriter Writer( Buffer );
  Writer.SetIndent( ' ', 2 );
  Writer.StartObject();
  Text( Writer, "format", "harrow-cameras" );
  Text( Writer, "file", i_rCalibrations.Name );
  Text( Writer, "from", i_rCalibrations.Format );
  Writer.Key( "cameras" );
  Writer.StartArray();
  for ( const VCalibratedCamera& rCamera : i_rCalibrations.Cameras )
  {
    WriteCamera( Writer, rCamera );
  }
  Writer.EndArray();
  Writer.Key( "notes" );
  Writer.StartArray();
  for ( const std::string& rNote : i_rCalibrations.Notes )
  {
    Writer.String( rNote.c_str(), static_cast< rapidjson::SizeType >( rNote.size() ) );
  }
  Writer.EndArray();
  Writer.EndObject();
  return std::string( Buffer.GetString(), Buffer.GetSize() ) + '\n';
}

} // namespace HostSources
