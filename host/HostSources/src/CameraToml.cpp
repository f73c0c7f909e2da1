#include "CameraTables.h"
#include "ReaderSupport.h"
#include "TomlText.h"

#include <algorithm>
#include <charconv>
#include <cmath>

namespace HostSources
{
namespace
{
constexpr double MmOfMetre = 1000;

/// The numbers of an array, and of arrays in it, one after the other; false when something else is there.
bool Flatten( const VTomlValue* i_pValue, std::vector< double >& io_rNumbers )
{
  const VTomlArray* const pArray = i_pValue ? i_pValue->Array() : nullptr;
  if ( !pArray )
  {
    return false;
  }
  for ( const VTomlValue& rElement : *pArray )
  {
    if ( const double* const pNumber = rElement.Number() )
    {
      io_rNumbers.push_back( *pNumber );
    }
    else if ( !Flatten( &rElement, io_rNumbers ) )
    {
      return false;
    }
  }
  return true;
}

std::vector< double > Numbers( const VTomlTable& i_rTable, const char* i_pKey )
{
  std::vector< double > Values;
  return Flatten( i_rTable.Find( i_pKey ), Values ) ? Values : std::vector< double >();
}

bool ReadRotation( const std::vector< double >& i_rNumbers, CoreMoxelTypes::D3& o_rVector )
{
  if ( i_rNumbers.size() == 3 )
  {
    o_rVector = { i_rNumbers[0], i_rNumbers[1], i_rNumbers[2] };
    return true;
  }
  std::array< double, 9 > Matrix{};
  if ( i_rNumbers.size() != Matrix.size() )
  {
    return false;
  }
  std::copy( i_rNumbers.begin(), i_rNumbers.end(), Matrix.begin() );
  return RotationVector( Matrix, o_rVector );
}

/// The pinhole of a table; an empty text when it is complete, else what is wrong.
std::string ReadPinhole( const VTomlTable& i_rTable, VPinholeCamera& o_rPinhole )
{
  const auto Matrix = Numbers( i_rTable, "matrix" ), Lens = Numbers( i_rTable, "distortions" ),
             Translation = Numbers( i_rTable, "translation" );
  const VTomlValue* const pFisheye = i_rTable.Find( "fisheye" );
  if ( pFisheye && pFisheye->Flag() && *pFisheye->Flag() )
  {
    return "its lens is a fisheye, which is a model of its own";
  }
  if ( Matrix.size() != 9 )
  {
    return "its matrix has not 3 by 3 numbers";
  }
  if ( Matrix[3] != 0 || Matrix[6] != 0 || Matrix[7] != 0 || Matrix[8] != 1 )
  {
    return "its matrix is none of a pinhole";
  }
  if ( !Lens.empty() && Lens.size() != 4 && Lens.size() != 5 )
  {
    return "its distortions are " + std::to_string( Lens.size() ) + " numbers, not 4 or 5";
  }
  if ( Translation.size() != 3 )
  {
    return "its translation has not 3 numbers";
  }
  if ( !ReadRotation( Numbers( i_rTable, "rotation" ), o_rPinhole.Rotation ) )
  {
    return "its rotation is neither a vector nor a rotation matrix";
  }
  o_rPinhole.Fx = Matrix[0];
  o_rPinhole.Skew = Matrix[1];
  o_rPinhole.Cx = Matrix[2];
  o_rPinhole.Fy = Matrix[4];
  o_rPinhole.Cy = Matrix[5];
  std::copy( Lens.begin(), Lens.end(), o_rPinhole.Distortion.begin() );
  o_rPinhole.Translation = { MmOfMetre * Translation[0], MmOfMetre * Translation[1], MmOfMetre * Translation[2] };
  return {};
}

/// The number at the end of a name; -1 without one.
std::int32_t TrailingNumber( const std::string& i_rName )
{
  const std::size_t Begin = i_rName.find_last_not_of( "0123456789" ) + 1;
  std::int32_t Value = -1;
  const auto Read = std::from_chars( i_rName.data() + Begin, i_rName.data() + i_rName.size(), Value );
  return Read.ec == std::errc() ? Value : -1;
}

void ReadTable( const VTomlTable& i_rTable, VCameraCalibrations& io_rCalibrations )
{
  VCalibratedCamera Camera;
  const VTomlValue* const pName = i_rTable.Find( "name" );
  Camera.Name = ToUtf8( pName && pName->Text() ? *pName->Text() : i_rTable.Name );
  Camera.UserId = TrailingNumber( Camera.Name );
  const VTomlValue* const pId = i_rTable.Find( "cam_id" );
  if ( const double* const pNumber = pId ? pId->Number() : nullptr; pNumber && std::abs( *pNumber ) < 1e9 )
  {
    Camera.UserId = static_cast< std::int32_t >( *pNumber );
  }
  // A name that is a number alone says little on a screen.
  if ( !Camera.Name.empty() && Camera.Name.find_first_not_of( "0123456789" ) == std::string::npos )
  {
    Camera.Name.insert( 0, "cam_" );
  }
  Camera.DisplayName = Camera.Name;
  const auto Size = Numbers( i_rTable, "size" );
  const auto IsSide = []( double i_Side )
  {
    return i_Side >= 1 && i_Side <= LargestSensor;
  };
  if ( Size.size() != 2 || !IsSide( Size[0] ) || !IsSide( Size[1] ) )
  {
    NoteLeftOut( Camera.Name, "its size is not that of a sensor", io_rCalibrations );
    return;
  }
  Camera.Hardware.SensorWidth = static_cast< std::uint32_t >( Size[0] );
  Camera.Hardware.SensorHeight = static_cast< std::uint32_t >( Size[1] );
  VPinholeCamera Pinhole;
  std::string Reason = ReadPinhole( i_rTable, Pinhole );
  if ( !Reason.empty() || !ConvertPinhole( Pinhole, Camera, Reason ) )
  {
    NoteUncalibrated( Camera.Name, Reason, io_rCalibrations );
  }
  io_rCalibrations.Cameras.push_back( std::move( Camera ) );
}
} // namespace

bool ReadCameraToml( std::string_view i_Text, VCameraCalibrations& o_rCalibrations, std::string& o_rMessage )
{
  std::vector< VTomlTable > Tables;
  if ( !ReadToml( i_Text, Tables, o_rMessage ) )
  {
    return false;
  }
  o_rCalibrations.Format = "TOML";
  for ( const VTomlTable& rTable : Tables )
  {
    // Other tables tell of the whole, not of a camera.
    if ( rTable.Find( "matrix" ) || ( rTable.Find( "size" ) && rTable.Find( "rotation" ) ) )
    {
      ReadTable( rTable, o_rCalibrations );
    }
  }
  if ( o_rCalibrations.Cameras.empty() )
  {
    o_rMessage = o_rCalibrations.Notes.empty() ? "expected tables of cameras, each with size, matrix, rotation and "
                                                 "translation, found none"
                                               : o_rCalibrations.Notes.front();
    return false;
  }
  return true;
}

} // namespace HostSources
