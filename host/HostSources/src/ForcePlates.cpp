#include "ForcePlates.h"

#include "VectorMath.h"

#include <algorithm>
#include <cmath>

namespace HostSources::C3d
{
namespace
{
using VSix = std::array< double, 6 >;

/// Below this load a centre of pressure is noise.
constexpr double LeastLoad = 5; // N

/// False for a vector that has no direction.
bool Normalise( D3& io_rA )
{
  const double Size = Length( io_rA );
  if ( !( Size > 1e-6 ) || !std::isfinite( Size ) )
  {
    return false;
  }
  io_rA = io_rA * ( 1 / Size );
  return true;
}
D3 Rotate( const CoreMoxelTypes::Rigid& i_rPose, const D3& i_rV )
{
  const double* pR = i_rPose.R;
  return { pR[0] * i_rV.x + pR[1] * i_rV.y + pR[2] * i_rV.z, pR[3] * i_rV.x + pR[4] * i_rV.y + pR[5] * i_rV.z,
           pR[6] * i_rV.x + pR[7] * i_rV.y + pR[8] * i_rV.z };
}

/// x from the middle of c2 c3 to the middle of c1 c4, y from the middle of c3 c4 to the middle of c1 c2, z = x cross y.
bool FindPose( VForcePlate& io_rPlate )
{
  const D3* pC = io_rPlate.Corners;
  D3 X = ( pC[0] + pC[3] - pC[1] - pC[2] ) * 0.5;
  D3 Y = ( pC[0] + pC[1] - pC[2] - pC[3] ) * 0.5;
  D3 Z = Cross( X, Y );
  if ( !Normalise( X ) || !Normalise( Z ) )
  {
    return false;
  }
  Y = Cross( Z, X );
  const D3 Middle = ( pC[0] + pC[1] + pC[2] + pC[3] ) * 0.25;
  io_rPlate.Pose = { { X.x, Y.x, Z.x, X.y, Y.y, Z.y, X.z, Y.z, Z.z }, { Middle.x, Middle.y, Middle.z } };
  return true;
}

/// Where the sensors lie, seen from the middle of the surface. They always lie below it, and where the file's vector
/// points the other way, all of it does.
D3 SensorOf( const VForcePlate& i_rPlate )
{
  const D3& rO = i_rPlate.Origin;
  const double Sign = rO.z > 0 ? -1 : 1;
  switch ( i_rPlate.Type )
  {
  case 1:
    return {};
  case 3: // x and y are the offsets of the corner sensors
    return { 0, 0, std::abs( rO.z ) };
  default:
    return { Sign * rO.x, Sign * rO.y, std::abs( rO.z ) };
  }
}

/// What turns a plate's channels into a force and its moment about the middle of the surface, in plate axes.
struct VPlateMaker
{
  const VRecording& rRecording;
  VForcePlate& rPlate;
  VSix Unit{ 1, 1, 1, 1, 1, 1 }; ///< to N, mm and N mm
  std::array< double, 8 > Baseline{};
  std::array< double, 36 > Calibration{}; ///< by columns

  double Channel( std::size_t i_Sample, std::size_t i_Channel ) const
  {
    return static_cast< double >(
               rRecording.Analog[i_Sample * rRecording.AnalogChannels.size() + rPlate.Channels[i_Channel]] ) -
           Baseline[i_Channel];
  }
  std::size_t SampleCount() const { return rRecording.Analog.size() / rRecording.AnalogChannels.size(); }

  void TakeBaseline( std::size_t i_First, std::size_t i_Last );
  void Sample( std::size_t i_Sample, D3& o_rForce, D3& o_rMoment ) const;
  VSix Outputs( std::size_t i_Sample ) const;
};

/// The mean of the analog samples from `i_First` to `i_Last`, counted from 1, in which nobody stood on the plate; 0 to
/// 0 for none.
void VPlateMaker::TakeBaseline( std::size_t i_First, std::size_t i_Last )
{
  const std::size_t End = std::min( i_Last, SampleCount() );
  if ( i_First < 1 || i_First > End )
  {
    return;
  }
  const std::size_t Begin = i_First - 1;
  std::array< double, 8 > Sum{};
  for ( std::size_t Index = Begin; Index < End; ++Index )
  {
    for ( std::size_t Column = 0; Column < rPlate.Channels.size(); ++Column )
    {
      Sum[Column] += Channel( Index, Column );
    }
  }
  for ( std::size_t Column = 0; Column < Sum.size(); ++Column )
  {
    const double Mean = Sum[Column] / static_cast< double >( End - Begin );
    Baseline[Column] = std::isfinite( Mean ) ? Mean : 0;
  }
}

/// Six outputs: Fx Fy Fz Mx My Mz about the sensors' origin, or Fx Fy Fz Px Py Tz of a plate of type 1.
VSix VPlateMaker::Outputs( std::size_t i_Sample ) const
{
  std::array< double, 8 > Raw{};
  for ( std::size_t Column = 0; Column < rPlate.Channels.size(); ++Column )
  {
    Raw[Column] = Channel( i_Sample, Column );
  }
  VSix Out{};
  if ( rPlate.Type == 4 )
  {
    for ( std::size_t Column = 0; Column < 6; ++Column )
    {
      for ( std::size_t Row = 0; Row < 6; ++Row )
      {
        Out[Row] += Calibration[Column * 6 + Row] * Raw[Column];
      }
    }
  }
  else if ( rPlate.Type == 3 )
  {
    // Shear sensors 12, 34, 14, 23, then the vertical sensors of the four corners, `Origin` being their offsets.
    const auto& [X12, X34, Y14, Y23, Z1, Z2, Z3, Z4] = Raw;
    const double A = rPlate.Origin.x, B = rPlate.Origin.y;
    Out = { X12 + X34,
            Y14 + Y23,
            Z1 + Z2 + Z3 + Z4,
            B * ( Z1 + Z2 - Z3 - Z4 ),
            A * ( Z2 + Z3 - Z1 - Z4 ),
            B * ( X34 - X12 ) + A * ( Y14 - Y23 ) };
  }
  else
  {
    std::copy_n( Raw.begin(), 6, Out.begin() );
  }
  for ( std::size_t Row = 0; Row < 6; ++Row )
  {
    Out[Row] *= Unit[Row];
  }
  return Out;
}

void VPlateMaker::Sample( std::size_t i_Sample, D3& o_rForce, D3& o_rMoment ) const
{
  const VSix Out = Outputs( i_Sample );
  o_rForce = { Out[0], Out[1], Out[2] };
  if ( rPlate.Type == 1 )
  {
    o_rMoment = Cross( { Out[3], Out[4], 0 }, o_rForce ) + D3{ 0, 0, Out[5] };
    return;
  }
  o_rMoment = Cross( rPlate.Sensor, o_rForce ) + D3{ Out[3], Out[4], Out[5] };
}

/// +1 where the file holds the force on the body, -1 where it holds the force on the plate: a body can only push.
/// z points into the plate, unless the corners stand in the wrong order and it points up.
double SignOfForce( const VPlateMaker& i_rMaker )
{
  double Greatest = 0;
  D3 Force, Moment;
  for ( std::size_t Index = 0; Index < i_rMaker.SampleCount(); ++Index )
  {
    i_rMaker.Sample( Index, Force, Moment );
    if ( std::abs( Force.z ) > std::abs( Greatest ) )
    {
      Greatest = Force.z;
    }
  }
  const double* pR = i_rMaker.rPlate.Pose.R;
  const double Upward = i_rMaker.rRecording.UpAxis == EUpAxis::Y ? pR[5] : pR[8];
  return Greatest * ( Upward > 0.5 ? -1 : 1 ) > 0 ? -1 : 1;
}

void MakeWrenches( VPlateMaker& io_rMaker )
{
  VForcePlate& rPlate = io_rMaker.rPlate;
  const double Sign = SignOfForce( io_rMaker );
  const D3 Middle{ rPlate.Pose.T[0], rPlate.Pose.T[1], rPlate.Pose.T[2] };
  rPlate.Wrench.resize( io_rMaker.SampleCount() );
  for ( std::size_t Index = 0; Index < rPlate.Wrench.size(); ++Index )
  {
    D3 Force, Moment;
    io_rMaker.Sample( Index, Force, Moment );
    D3 Centre{ std::nan( "" ), std::nan( "" ), std::nan( "" ) };
    if ( std::abs( Force.z ) >= LeastLoad )
    {
      Centre = Middle + Rotate( rPlate.Pose, { -Moment.y / Force.z, Moment.x / Force.z, 0 } );
    }
    const D3 F = Rotate( rPlate.Pose, Force * Sign ), M = Rotate( rPlate.Pose, Moment * Sign );
    const std::array< double, 9 > Values{ F.x, F.y, F.z, M.x, M.y, M.z, Centre.x, Centre.y, Centre.z };
    std::transform( Values.begin(), Values.end(), rPlate.Wrench[Index].begin(),
                    []( double i_Value )
                    {
                      return static_cast< float >( i_Value );
                    } );
  }
}

/// Newton metres and the like to N mm, by the channel's own unit, or the points' where it names none.
double MomentUnit( const std::string& i_rUnit, double i_PointUnit )
{
  std::string Letters;
  for ( const char Character : i_rUnit )
  {
    if ( ( Character >= 'a' && Character <= 'z' ) || ( Character >= 'A' && Character <= 'Z' ) )
    {
      Letters += static_cast< char >( Character | 0x20 );
    }
  }
  return Letters == "nmm" ? 1 : Letters == "ncm" ? 10 : Letters == "nm" ? 1000 : i_PointUnit;
}

void FindUnits( VPlateMaker& io_rMaker )
{
  const VRecording& rRecording = io_rMaker.rRecording;
  const VForcePlate& rPlate = io_rMaker.rPlate;
  const auto UnitOf = [&]( std::size_t i_Channel ) -> const std::string&
  {
    return rRecording.AnalogChannels[rPlate.Channels[i_Channel]].Unit;
  };
  if ( rPlate.Type == 1 )
  {
    io_rMaker.Unit[3] = io_rMaker.Unit[4] = rRecording.UnitScale;
    io_rMaker.Unit[5] = MomentUnit( UnitOf( 5 ), rRecording.UnitScale );
  }
  else if ( rPlate.Type == 2 || rPlate.Type == 4 )
  {
    for ( std::size_t Row = 3; Row < 6; ++Row )
    {
      io_rMaker.Unit[Row] = MomentUnit( UnitOf( Row ), rRecording.UnitScale );
    }
  }
}

D3 ReadVector( const std::vector< double >& i_rNumbers, std::size_t i_Index, double i_Scale )
{
  const auto At = [&]( std::size_t i_Offset )
  {
    const double Value = i_Index + i_Offset < i_rNumbers.size() ? i_rNumbers[i_Index + i_Offset] : 0;
    return std::isfinite( Value ) ? Value * i_Scale : 0;
  };
  return { At( 0 ), At( 1 ), At( 2 ) };
}

/// The plate's channels as indices from 0; empty, with a note, when one of them is not there.
std::vector< std::uint32_t > ReadChannels( const VParameters& i_rParameters, std::size_t i_Plate,
                                           const VForcePlate& i_rPlate, VRecording& io_rRecording )
{
  const VParameters::VParameter* pChannel = i_rParameters.Find( "FORCE_PLATFORM", "CHANNEL" );
  const std::size_t Needed = i_rPlate.Type == 3 ? 8 : 6;
  const std::size_t Stride = pChannel ? pChannel->Dimension( 0 ) : 0;
  std::vector< std::uint32_t > Channels;
  for ( std::size_t Index = 0; Index < Needed && Stride >= Needed; ++Index )
  {
    const double Number = i_rParameters.Number( *pChannel, i_Plate * Stride + Index, true );
    if ( !( Number >= 1 && Number <= static_cast< double >( io_rRecording.AnalogChannels.size() ) ) )
    {
      break;
    }
    Channels.push_back( static_cast< std::uint32_t >( Number ) - 1 );
  }
  if ( Channels.size() < Needed )
  {
    io_rRecording.Notes.push_back( i_rPlate.Name + ": expected " + std::to_string( Needed ) +
                                   " analog channels in FORCE_PLATFORM:CHANNEL, found " +
                                   std::to_string( Channels.size() ) + "; the plate has no samples." );
    Channels.clear();
  }
  return Channels;
}

bool TakeCalibration( const std::vector< double >& i_rMatrices, std::size_t i_Plate, VPlateMaker& io_rMaker )
{
  if ( i_rMatrices.size() < ( i_Plate + 1 ) * 36 )
  {
    return false;
  }
  std::copy_n( i_rMatrices.begin() + static_cast< std::ptrdiff_t >( i_Plate * 36 ), 36, io_rMaker.Calibration.begin() );
  return std::all_of( io_rMaker.Calibration.begin(), io_rMaker.Calibration.end(),
                      []( double i_Value )
                      {
                        return std::isfinite( i_Value );
                      } );
}

void ReadSamples( const VParameters& i_rParameters, const std::vector< double >& i_rMatrices, std::size_t i_Plate,
                  VForcePlate& io_rPlate, VRecording& io_rRecording )
{
  if ( io_rPlate.Type < 1 || io_rPlate.Type > 4 )
  {
    io_rRecording.Notes.push_back( io_rPlate.Name + ": expected a plate of type 1 to 4, found type " +
                                   std::to_string( io_rPlate.Type ) + "; the plate has no samples." );
    return;
  }
  // Channels may be shared, yet no file needs as many plates as channels; a damaged one could ask for any memory.
  if ( i_Plate > 0 && i_Plate >= io_rRecording.AnalogChannels.size() )
  {
    io_rRecording.Notes.push_back( io_rPlate.Name + ": expected more analog channels than force plates, found " +
                                   std::to_string( io_rRecording.AnalogChannels.size() ) +
                                   "; the plate has no samples." );
    return;
  }
  io_rPlate.Channels = ReadChannels( i_rParameters, i_Plate, io_rPlate, io_rRecording );
  if ( io_rPlate.Channels.empty() || io_rRecording.Analog.empty() )
  {
    return;
  }
  VPlateMaker Maker{ io_rRecording, io_rPlate };
  if ( io_rPlate.Type == 4 && !TakeCalibration( i_rMatrices, i_Plate, Maker ) )
  {
    io_rRecording.Notes.push_back( io_rPlate.Name +
                                   ": expected a matrix in FORCE_PLATFORM:CAL_MATRIX; the plate has no samples." );
    return;
  }
  FindUnits( Maker );
  Maker.TakeBaseline( i_rParameters.Count( "FORCE_PLATFORM", "ZERO", 0, 0 ),
                      i_rParameters.Count( "FORCE_PLATFORM", "ZERO", 0, 1 ) );
  MakeWrenches( Maker );
}
} // namespace

void ReadForcePlates( const VParameters& i_rParameters, VRecording& io_rRecording )
{
  const std::vector< double > Types = i_rParameters.Numbers( "FORCE_PLATFORM", "TYPE" );
  const std::vector< double > Corners = i_rParameters.Numbers( "FORCE_PLATFORM", "CORNERS" );
  const std::vector< double > Origins = i_rParameters.Numbers( "FORCE_PLATFORM", "ORIGIN" );
  const std::vector< double > Matrices = i_rParameters.Numbers( "FORCE_PLATFORM", "CAL_MATRIX" );
  // USED is missing from some files that do have plates.
  const std::size_t Used = i_rParameters.Count( "FORCE_PLATFORM", "USED", Types.size() );
  const std::size_t Count = std::min( { Used, Types.size(), Corners.size() / 12 } );
  io_rRecording.ForcePlates.reserve( Count );
  for ( std::size_t Index = 0; Index < Count; ++Index )
  {
    VForcePlate Plate;
    Plate.Name = "Force plate " + std::to_string( Index + 1 );
    Plate.Type = Types[Index] >= 0 && Types[Index] < 1e6 ? static_cast< std::uint32_t >( Types[Index] ) : 0;
    for ( std::size_t Corner = 0; Corner < 4; ++Corner )
    {
      Plate.Corners[Corner] = ReadVector( Corners, Index * 12 + Corner * 3, io_rRecording.UnitScale );
    }
    Plate.Origin = ReadVector( Origins, Index * 3, io_rRecording.UnitScale );
    Plate.Sensor = SensorOf( Plate );
    if ( !FindPose( Plate ) )
    {
      io_rRecording.Notes.push_back( Plate.Name + ": expected four corners in FORCE_PLATFORM:CORNERS that span a " +
                                     "rectangle; the plate is left out." );
      continue;
    }
    ReadSamples( i_rParameters, Matrices, Index, Plate, io_rRecording );
    io_rRecording.ForcePlates.push_back( std::move( Plate ) );
  }
}

} // namespace HostSources::C3d
