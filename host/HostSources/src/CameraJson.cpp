#include "CameraTables.h"
#include "ReaderSupport.h"

#include <rapidjson/document.h>
#include <rapidjson/error/en.h>

#include <cmath>

namespace HostSources
{
namespace
{
constexpr const char* FormatName = "harrow-cameras";
constexpr unsigned Flags = rapidjson::kParseFullPrecisionFlag | rapidjson::kParseIterativeFlag |
                           rapidjson::kParseNanAndInfFlag | rapidjson::kParseValidateEncodingFlag;

using VJson = rapidjson::Value;

const VJson* Find( const VJson& i_rObject, const char* i_pKey )
{
  const auto It = i_rObject.FindMember( i_pKey );
  return It == i_rObject.MemberEnd() ? nullptr : &It->value;
}

std::string Text( const VJson& i_rObject, const char* i_pKey )
{
  const VJson* const pValue = Find( i_rObject, i_pKey );
  return pValue && pValue->IsString() ? ToUtf8( { pValue->GetString(), pValue->GetStringLength() } ) : std::string();
}

double Number( const VJson& i_rObject, const char* i_pKey, double i_Default )
{
  const VJson* const pValue = Find( i_rObject, i_pKey );
  return !pValue ? i_Default : pValue->IsNumber() ? pValue->GetDouble() : std::nan( "" );
}

/// What is no number is NaN, which nobody takes for a calibration.
std::vector< double > Numbers( const VJson& i_rObject, const char* i_pKey )
{
  std::vector< double > Values;
  if ( const VJson* const pArray = Find( i_rObject, i_pKey ); pArray && pArray->IsArray() )
  {
    for ( const VJson& rElement : pArray->GetArray() )
    {
      Values.push_back( rElement.IsNumber() ? rElement.GetDouble() : std::nan( "" ) );
    }
  }
  return Values;
}

bool AllFinite( const std::vector< double >& i_rValues )
{
  double Sum = 0;
  for ( const double Value : i_rValues )
  {
    Sum += 0 * Value;
  }
  return Sum == 0;
}

/// An empty text when the calibration is of use, else what is wrong.
std::string ReadCalibration( const VJson& i_rObject, CoreMoxelTypes::VCameraCalibration& o_rCalibration )
{
  const auto Rotation = Numbers( i_rObject, "rotation" ), Position = Numbers( i_rObject, "position" ),
             Principal = Numbers( i_rObject, "principalPoint" ), Centre = Numbers( i_rObject, "distortionCentre" );
  const double Model = Number( i_rObject, "radialModel", 0 );
  const double Focal = Number( i_rObject, "focalLength", 0 );
  const double Skew = Number( i_rObject, "skew", 0 ), Aspect = Number( i_rObject, "aspectRatio", 1 );
  auto Parameters = Numbers( i_rObject, "radialParameters" );
  if ( Model != 0 && Model != 1 )
  {
    return "its radial model is neither 0 nor 1";
  }
  const std::size_t Count = Model == 0 ? 2 : 3;
  if ( Parameters.size() != Count )
  {
    return "its radial model has " + std::to_string( Count ) + " parameters, and there are " +
           std::to_string( Parameters.size() );
  }
  if ( Rotation.size() != 3 || Position.size() != 3 || Principal.size() != 2 || Centre.size() != 2 )
  {
    return "its rotation and position are not three numbers each, or its principal point and centre of distortion not "
           "two";
  }
  if ( !AllFinite( Rotation ) || !AllFinite( Position ) || !AllFinite( Principal ) || !AllFinite( Centre ) ||
       !AllFinite( Parameters ) || !AllFinite( { Focal, Skew, Aspect } ) )
  {
    return "a number of its calibration is not finite";
  }
  if ( !( Focal > 0 ) || !( Aspect > 0 ) )
  {
    return "its focal length or its aspect ratio is not above 0";
  }
  o_rCalibration.Rotation = { Rotation[0], Rotation[1], Rotation[2] };
  o_rCalibration.Position = { Position[0], Position[1], Position[2] };
  std::copy( Principal.begin(), Principal.end(), o_rCalibration.PrincipalPoint );
  std::copy( Centre.begin(), Centre.end(), o_rCalibration.DistortionCentre );
  o_rCalibration.RadialModel = static_cast< std::uint32_t >( Model );
  o_rCalibration.RadialParameters = std::move( Parameters );
  o_rCalibration.FocalLength = Focal;
  o_rCalibration.Skew = Skew;
  o_rCalibration.AspectRatio = Aspect;
  return {};
}

void ReadCamera( const VJson& i_rObject, VCameraCalibrations& io_rCalibrations )
{
  VCalibratedCamera Camera;
  Camera.Name = Text( i_rObject, "name" );
  Camera.DisplayName = Text( i_rObject, "displayName" );
  const auto Sensor = Numbers( i_rObject, "sensor" );
  const auto IsSide = []( double i_Side )
  {
    return i_Side >= 1 && i_Side <= LargestSensor;
  };
  if ( Sensor.size() != 2 || !IsSide( Sensor[0] ) || !IsSide( Sensor[1] ) )
  {
    NoteLeftOut( Camera.Name, "its sensor is not two numbers of pixels", io_rCalibrations );
    return;
  }
  const double Aspect = Number( i_rObject, "pixelAspect", 1 );
  if ( !( Aspect > 0 && Aspect <= LargestSensor ) )
  {
    NoteLeftOut( Camera.Name, "its pixel aspect is no ratio", io_rCalibrations );
    return;
  }
  Camera.Hardware.SensorWidth = static_cast< std::uint32_t >( Sensor[0] );
  Camera.Hardware.SensorHeight = static_cast< std::uint32_t >( Sensor[1] );
  Camera.Hardware.PixelAspect = Aspect;
  Camera.Hardware.Type = Text( i_rObject, "type" );
  const VJson* const pVideo = Find( i_rObject, "video" );
  Camera.Hardware.Video = pVideo && pVideo->IsBool() && pVideo->GetBool();
  const double UserId = Number( i_rObject, "userId", -1 );
  Camera.UserId = std::abs( UserId ) < 1e9 ? static_cast< std::int32_t >( UserId ) : -1;
  const VJson* const pCalibration = Find( i_rObject, "calibration" );
  CoreMoxelTypes::VCameraCalibration Calibration;
  const std::string Reason = pCalibration && pCalibration->IsObject() ? ReadCalibration( *pCalibration, Calibration )
                                                                      : std::string( "it has none" );
  if ( Reason.empty() )
  {
    Camera.Calibration = std::move( Calibration );
  }
  else
  {
    NoteUncalibrated( Camera.Name, Reason, io_rCalibrations );
  }
  io_rCalibrations.Cameras.push_back( std::move( Camera ) );
}
} // namespace

bool ReadCameraJson( std::string_view i_Text, VCameraCalibrations& o_rCalibrations, std::string& o_rMessage )
{
  rapidjson::Document Document;
  Document.Parse< Flags >( i_Text.data(), i_Text.size() );
  if ( Document.HasParseError() )
  {
    o_rMessage = "byte offset " + std::to_string( Document.GetErrorOffset() ) + ": " +
                 rapidjson::GetParseError_En( Document.GetParseError() );
    return false;
  }
  const VJson* const pCameras = Document.IsObject() ? Find( Document, "cameras" ) : nullptr;
  if ( !pCameras || !pCameras->IsArray() || Text( Document, "format" ) != FormatName )
  {
    o_rMessage =
        std::string( "expected an object whose \"format\" is \"" ).append( FormatName ) + "\", with a list \"cameras\"";
    return false;
  }
  o_rCalibrations.Format = "JSON";
  for ( const VJson& rCamera : pCameras->GetArray() )
  {
    if ( rCamera.IsObject() )
    {
      ReadCamera( rCamera, o_rCalibrations );
    }
    else
    {
      NoteLeftOut( {}, "it is no object", o_rCalibrations );
    }
  }
  return true;
}

} // namespace HostSources
