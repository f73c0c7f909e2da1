// Plates are loaded with a known force at a known place; what their sensors would say is worked out from the mechanics,
// and the reader must find force and place again.

#include "ReadHelpers.h"

#include <cmath>

namespace HostSources
{
namespace
{
using C3dWriter::EForm;
using C3dWriter::VFile;

/// In plate axes, x and y along the surface, z down, from the middle of the surface: force, place, twist about z.
struct VLoad
{
  double Fx = 0, Fy = 0, Fz = 0, Px = 0, Py = 0, Tz = 0;
};
const VLoad Walking{ 40, -25, -800, 60, -110, 900 };

/// Where the sensors of types 2 and 4 lie, from the middle of the surface; those of type 3 lie right below it.
constexpr double SensorX = 3, SensorY = -5, Depth = 40;
constexpr double SensorA = 200, SensorB = 250;

/// Moment of the load about a point, given from the middle of the surface.
std::array< double, 3 > MomentAt( const VLoad& i_rLoad, double i_X, double i_Y, double i_Z )
{
  const double X = i_rLoad.Px - i_X, Y = i_rLoad.Py - i_Y, Z = -i_Z; // the lever
  return { Y * i_rLoad.Fz - Z * i_rLoad.Fy, Z * i_rLoad.Fx - X * i_rLoad.Fz,
           X * i_rLoad.Fy - Y * i_rLoad.Fx + i_rLoad.Tz };
}

std::vector< double > SensorsOf( int i_Type, const VLoad& i_rLoad )
{
  const VLoad& rL = i_rLoad;
  const auto M = i_Type == 3 ? MomentAt( rL, 0, 0, Depth ) : MomentAt( rL, SensorX, SensorY, Depth );
  if ( i_Type == 1 )
  {
    return { rL.Fx, rL.Fy, rL.Fz, rL.Px, rL.Py, rL.Tz };
  }
  if ( i_Type == 3 )
  {
    // Corner sensors at (±A, ±B): 1 (A, B), 2 (-A, B), 3 (-A, -B), 4 (A, -B); Mx = sum y Fz, My = -sum x Fz.
    const double Sum = rL.Fz / 4, X = -M[1] / SensorA / 4, Y = M[0] / SensorB / 4;
    // Mz = sum x Fy - y Fx, put on the sensors along x alone: X12 lies at y = B, X34 at y = -B.
    const double Turn = M[2] / SensorB / 2;
    return { rL.Fx / 2 - Turn, rL.Fx / 2 + Turn, rL.Fy / 2,   rL.Fy / 2,
             Sum + X + Y,      Sum - X + Y,      Sum - X - Y, Sum + X - Y };
  }
  return { rL.Fx, rL.Fy, rL.Fz, M[0], M[1], M[2] };
}

/// A plate of 600 by 400 mm in a floor with z up. Its x axis is the world's y, so that a mixed-up axis shows.
VFile PlateFile( int i_Type, const std::vector< std::vector< double > >& i_rSamples )
{
  VFile File;
  File.Channels = i_rSamples[0].size();
  File.PerFrame = 1;
  File.Frames = i_rSamples;
  const auto Type = static_cast< double >( i_Type );
  std::vector< double > Channels;
  for ( std::size_t Index = 0; Index < File.Channels; ++Index )
  {
    Channels.push_back( static_cast< double >( Index + 1 ) );
  }
  const double OriginX = i_Type == 3 ? SensorA : SensorX, OriginY = i_Type == 3 ? SensorB : SensorY;
  File.SetParameter( { "FORCE_PLATFORM", "USED", 2, {}, { 1 }, {} } );
  File.SetParameter( { "FORCE_PLATFORM", "TYPE", 2, { 1 }, { Type }, {} } );
  File.SetParameter( { "FORCE_PLATFORM",
                       "CORNERS",
                       4,
                       { 3, 4, 1 },
                       { 1200, 2300, 0, 1200, 1700, 0, 800, 1700, 0, 800, 2300, 0 },
                       {} } );
  File.SetParameter( { "FORCE_PLATFORM", "ORIGIN", 4, { 3, 1 }, { OriginX, OriginY, -Depth }, {} } );
  File.SetParameter(
      { "FORCE_PLATFORM", "CHANNEL", 2, { static_cast< std::uint8_t >( Channels.size() ), 1 }, Channels, {} } );
  return File;
}

void ExpectLoad( const VRecording& i_rRecording, std::size_t i_Sample, const VLoad& i_rLoad )
{
  ASSERT_EQ( i_rRecording.ForcePlates.size(), 1u );
  const VForcePlate& rPlate = i_rRecording.ForcePlates[0];
  ASSERT_GT( rPlate.Wrench.size(), i_Sample );
  const auto& rW = rPlate.Wrench[i_Sample];
  const double* pR = rPlate.Pose.R;
  const auto World = [&]( std::size_t i_Row, double i_X, double i_Y, double i_Z )
  {
    return pR[3 * i_Row] * i_X + pR[3 * i_Row + 1] * i_Y + pR[3 * i_Row + 2] * i_Z;
  };
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    EXPECT_NEAR( static_cast< double >( rW[Row] ), World( Row, i_rLoad.Fx, i_rLoad.Fy, i_rLoad.Fz ), 0.01 );
    EXPECT_NEAR( static_cast< double >( rW[6 + Row] ), rPlate.Pose.T[Row] + World( Row, i_rLoad.Px, i_rLoad.Py, 0 ),
                 0.01 );
    const auto M = MomentAt( i_rLoad, 0, 0, 0 );
    EXPECT_NEAR( static_cast< double >( rW[3 + Row] ), World( Row, M[0], M[1], M[2] ), 1 );
  }
}
} // namespace

TEST( ForcePlates, AxesComeFromTheCorners )
{
  const VRecording R = MustReadC3d( PlateFile( 2, { SensorsOf( 2, Walking ) } ) );
  ASSERT_EQ( R.ForcePlates.size(), 1u );
  const CoreMoxelTypes::Rigid& rPose = R.ForcePlates[0].Pose;
  const std::array< double, 9 > Expected{ 0, 1, 0, 1, 0, 0, 0, 0, -1 };
  for ( std::size_t Index = 0; Index < Expected.size(); ++Index )
  {
    EXPECT_NEAR( rPose.R[Index], Expected[Index], 1e-9 ) << Index;
  }
  EXPECT_NEAR( rPose.T[0], 1000, 1e-9 );
  EXPECT_NEAR( rPose.T[1], 2000, 1e-9 );
}

class ForcePlateTypes : public testing::TestWithParam< int >
{
};

TEST_P( ForcePlateTypes, ForceAndPlaceAreFoundAgain )
{
  VLoad Heavy = Walking, Light = Walking;
  Heavy.Fz = -1000;
  Light = { 0, 0, -2, 10, 10, 0 };
  VFile File = PlateFile( GetParam(), { SensorsOf( GetParam(), Walking ), SensorsOf( GetParam(), Heavy ),
                                        SensorsOf( GetParam(), Light ) } );
  const VRecording R = MustReadC3d( File );
  ExpectLoad( R, 0, Walking );
  ExpectLoad( R, 1, Heavy );
  EXPECT_TRUE( std::isnan( R.ForcePlates[0].Wrench[2][6] ) ) << "2 N have no centre of pressure";
}

TEST_P( ForcePlateTypes, ForceOnThePlateIsTurnedIntoForceOnTheBody )
{
  std::vector< double > Opposite = SensorsOf( GetParam(), Walking );
  for ( std::size_t Index = 0; Index < Opposite.size(); ++Index )
  {
    const bool bPlace = GetParam() == 1 && ( Index == 3 || Index == 4 );
    Opposite[Index] *= bPlace ? 1 : -1;
  }
  ExpectLoad( MustReadC3d( PlateFile( GetParam(), { Opposite } ) ), 0, Walking );
}

INSTANTIATE_TEST_SUITE_P( Types, ForcePlateTypes, testing::Values( 1, 2, 3 ) );

TEST( ForcePlates, AnOriginOrCornersTheOtherWayRound )
{
  const auto With = []( const char* i_pName, std::vector< double > i_Numbers )
  {
    VFile File = PlateFile( 2, { SensorsOf( 2, Walking ) } );
    for ( C3dWriter::VParameter& rParameter : File.Extra )
    {
      if ( rParameter.Name == i_pName )
      {
        rParameter.Numbers = i_Numbers;
      }
    }
    return MustReadC3d( File );
  };
  ExpectLoad( With( "ORIGIN", { -SensorX, -SensorY, Depth } ), 0, Walking );
  const VRecording R = With( "CORNERS", { 1200, 2300, 0, 800, 2300, 0, 800, 1700, 0, 1200, 1700, 0 } );
  ASSERT_EQ( R.ForcePlates.size(), 1u );
  EXPECT_NEAR( static_cast< double >( R.ForcePlates[0].Wrench[0][2] ), 800, 0.01 ) << "the force still points up";
}

TEST( ForcePlates, Type4GoesThroughItsMatrixAndBaseline )
{
  // Sensor readings are the load divided by a gain, plus an offset that the unloaded samples show.
  const std::array< double, 6 > Gain{ 2, 4, 5, 200, 300, 100 };
  const std::array< double, 6 > Offset{ 1, -2, 3, -4, 5, -6 };
  std::vector< double > Matrix( 36 );
  std::vector< double > Loaded = SensorsOf( 4, Walking ), Empty( 6 );
  for ( std::size_t Index = 0; Index < 6; ++Index )
  {
    Matrix[7 * Index] = Gain[Index];
    Loaded[Index] /= Gain[Index];
  }
  // Sensor 3 also feels a quarter of sensor 1: element (row 1, column 3), columns one after another.
  Matrix[2 * 6 + 0] = 0.25;
  Loaded[0] -= 0.25 * Loaded[2] / Gain[0];
  for ( std::size_t Index = 0; Index < 6; ++Index )
  {
    Loaded[Index] += Offset[Index];
    Empty[Index] = Offset[Index];
  }
  VFile File = PlateFile( 4, { Loaded, Empty, Empty, Loaded } );
  File.SetParameter( { "FORCE_PLATFORM", "CAL_MATRIX", 4, { 6, 6, 1 }, Matrix, {} } );
  File.SetParameter( { "FORCE_PLATFORM", "ZERO", 2, { 2 }, { 2, 3 }, {} } );
  const VRecording R = MustReadC3d( File );
  ExpectLoad( R, 0, Walking );
  ExpectLoad( R, 3, Walking );
  EXPECT_NEAR( static_cast< double >( R.ForcePlates[0].Wrench[1][2] ), 0, 1e-3 );
}

TEST( ForcePlates, MomentsInNewtonMetres )
{
  std::vector< double > Sensors = SensorsOf( 2, Walking );
  for ( std::size_t Index = 3; Index < 6; ++Index )
  {
    Sensors[Index] /= 1000;
  }
  VFile File = PlateFile( 2, { Sensors } );
  File.SetParameter( { "ANALOG", "UNITS", -1, { 3, 6 }, {}, { "N  ", "N  ", "N  ", "N.m", "N m", "Nm " } } );
  ExpectLoad( MustReadC3d( File ), 0, Walking );
}

TEST( ForcePlates, WhatDoesNotFitIsNotedAndLeftOut )
{
  const auto With = []( C3dWriter::VParameter i_Parameter )
  {
    VFile File = PlateFile( 2, { SensorsOf( 2, Walking ) } );
    std::erase_if( File.Extra,
                   [&]( const C3dWriter::VParameter& i_rOther )
                   {
                     return i_rOther.Name == i_Parameter.Name;
                   } );
    File.SetParameter( std::move( i_Parameter ) );
    return MustReadC3d( File );
  };
  struct VCase
  {
    C3dWriter::VParameter Parameter;
    std::size_t Plates;
    const char* pNote; ///< null where the plate has its samples
  };
  for ( const VCase& rCase :
        { VCase{ { "FORCE_PLATFORM", "CHANNEL", 2, { 6, 1 }, { 1, 2, 3, 4, 5, 99 }, {} }, 1, "FORCE_PLATFORM:CHANNEL" },
          { { "FORCE_PLATFORM", "TYPE", 2, { 1 }, { 21 }, {} }, 1, "found type 21" },
          { { "FORCE_PLATFORM", "TYPE", 2, { 1 }, { 4 }, {} }, 1, "FORCE_PLATFORM:CAL_MATRIX" },
          { { "FORCE_PLATFORM", "CORNERS", 4, { 3, 4, 1 }, std::vector< double >( 12, 1.0 ), {} },
            0,
            "FORCE_PLATFORM:CORNERS" },
          { { "FORCE_PLATFORM", "USED", 2, {}, { 40 }, {} }, 1, nullptr } } )
  {
    const VRecording R = With( rCase.Parameter );
    ASSERT_EQ( R.ForcePlates.size(), rCase.Plates );
    EXPECT_EQ( R.Notes.size(), rCase.pNote ? 1u : 0u );
    EXPECT_TRUE( !rCase.pNote || R.Notes.at( 0 ).find( rCase.pNote ) != std::string::npos ) << rCase.pNote;
    EXPECT_TRUE( R.ForcePlates.empty() || R.ForcePlates[0].Wrench.empty() == ( rCase.pNote != nullptr ) );
  }
}

TEST( ForcePlates, AreNoMoreThanTheirChannels )
{
  VFile File;
  File.Channels = 6;
  File.PerFrame = 1;
  File.Frames = { SensorsOf( 2, Walking ) };
  std::vector< double > Corners, Channels;
  for ( int Plate = 0; Plate < 8; ++Plate )
  {
    Corners.insert( Corners.end(), { 1, 1, 0, 1, 0, 0, 0, 0, 0, 0, 1, 0 } );
    Channels.insert( Channels.end(), { 1, 2, 3, 4, 5, 6 } );
  }
  File.SetParameter( { "FORCE_PLATFORM", "TYPE", 2, { 8 }, std::vector< double >( 8, 2.0 ), {} } );
  File.SetParameter( { "FORCE_PLATFORM", "CORNERS", 4, { 3, 4, 8 }, Corners, {} } );
  File.SetParameter( { "FORCE_PLATFORM", "CHANNEL", 2, { 6, 8 }, Channels, {} } );
  const VRecording R = MustReadC3d( File );
  ASSERT_EQ( R.ForcePlates.size(), 8u );
  EXPECT_EQ( R.ForcePlates[5].Wrench.size(), 1u );
  EXPECT_TRUE( R.ForcePlates[6].Wrench.empty() && R.ForcePlates[7].Wrench.empty() );
  EXPECT_THAT( R.Notes, testing::Each( testing::HasSubstr( "expected more analog channels than force plates" ) ) );
}

} // namespace HostSources
