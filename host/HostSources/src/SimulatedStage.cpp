#include "SimulatedStage.h"

#include <CoreMoxelTypes/Parameters.h>

#include <algorithm>
#include <iterator>
#include <limits>
#include <string>

using namespace CoreMoxelTypes;

namespace HostSources::Simulation
{
namespace
{

constexpr double PlateHalf = 300; // mm

/// Circles that people share: how many fit, and how fast they all go.
struct VCircle
{
  std::uint32_t Places;
  double Radius, Speed, Cadence, Direction;
};
constexpr VCircle Circles[] = { { 8, 2000, 1050, 0.92, 1 }, { 5, 1150, 900, 0.88, -1 }, { 3, 420, 330, 0.7, 1 } };

/// On the outer circle, so that a step of a passer-by falls on each.
D3 PlateMiddle( std::size_t i_Plate )
{
  return { Circles[0].Radius, i_Plate == 0 ? -PlateHalf - 10 : PlateHalf + 10, 0 };
}

bool IsOnPlate( std::size_t i_Plate, const D3& i_rPoint )
{
  const D3 Away = i_rPoint - PlateMiddle( i_Plate );
  return std::abs( Away.x ) <= PlateHalf && std::abs( Away.y ) <= PlateHalf;
}

VHash HashOf( const VSimulatedCaptureOptions& i_rOptions, std::uint32_t i_Performer )
{
  return VHash( i_rOptions.Seed ).With( 0x5747 ).With( i_Performer );
}

} // namespace

VWalkerStyle PerformerStyle( const VSimulatedCaptureOptions& i_rOptions, std::uint32_t i_Performer )
{
  std::uint32_t First = 0;
  const VCircle* pCircle = Circles;
  while ( i_Performer - First >= pCircle->Places && pCircle + 1 != std::end( Circles ) )
  {
    First += pCircle->Places;
    ++pCircle;
  }
  const std::uint32_t Sharing = std::min( pCircle->Places, i_rOptions.Performers - First );
  const VHash Hash = HashOf( i_rOptions, i_Performer );
  VWalkerStyle Style;
  Style.Radius = pCircle->Radius;
  Style.Speed = pCircle->Speed;
  Style.Cadence = pCircle->Cadence;
  Style.Direction = pCircle->Direction;
  Style.Start = 2 * Pi * ( i_Performer - First ) / Sharing - 0.6;
  Style.Phase = Hash.Uniform();
  Style.Scale = 0.95 + 0.09 * Hash.With( 1 ).Uniform();
  Style.MassKg = 75 * Style.Scale * Style.Scale * ( 0.9 + 0.2 * Hash.With( 2 ).Uniform() );
  return Style;
}

VBodyShape PerformerShape( const VSimulatedCaptureOptions& i_rOptions, std::uint32_t i_Performer )
{
  VBodyShape Shape = ShapeScaled( PerformerStyle( i_rOptions, i_Performer ).Scale );
  Shape.Breadth *= 0.95 + 0.1 * HashOf( i_rOptions, i_Performer ).With( 3 ).Uniform();
  return Shape;
}

void FillCamera( std::uint32_t i_Camera, std::uint32_t i_Count, double i_RateHz, VCameraHardware& o_rHardware,
                 VCameraCalibration& o_rCalibration )
{
  o_rHardware.Name = "Camera " + std::to_string( i_Camera + 1 );
  o_rHardware.Type = "Simulated";
  o_rHardware.DefaultDisplayType = "Simulated 1.3";
  o_rHardware.SensorWidth = 1280;
  o_rHardware.SensorHeight = 1024;
  o_rHardware.MaxRateHz = static_cast< f32 >( i_RateHz );

  // Tiers of up to 24 stand above each other, each turned against the one below.
  const std::uint32_t Tiers = ( i_Count + 23 ) / 24;
  const std::uint32_t Tier = i_Camera % Tiers, Place = i_Camera / Tiers;
  const std::uint32_t InTier = ( i_Count + Tiers - 1 - Tier ) / Tiers;
  const double Angle = 2 * Pi * ( Place + 0.5 * Tier / Tiers ) / InTier;
  const double Height = 2300 + 350.0 * Tier + ( Place % 2 ? 600 : 0 );
  const D3 Position{ 4800 * std::cos( Angle ), 4800 * std::sin( Angle ), Height };
  const D3 Forward = Unit( D3{ 0, 0, 900 } - Position );
  const D3 Right = Unit( Cross( Forward, D3{ 0, 0, 1 } ) );
  o_rCalibration.Rotation = RotationVector( Right, Cross( Forward, Right ), Forward );
  o_rCalibration.Position = Position;
  o_rCalibration.PrincipalPoint[0] = 639.5;
  o_rCalibration.PrincipalPoint[1] = 511.5;
  o_rCalibration.FocalLength = 950;
  // Wide lenses bulge by some ten pixels in the corners, no two alike, and their centre is not the sensor's.
  o_rCalibration.DistortionCentre[0] = 639.5 + 1.5 * ( i_Camera % 7 ) - 4.5;
  o_rCalibration.DistortionCentre[1] = 511.5 + 1.5 * ( i_Camera % 5 ) - 3;
  o_rCalibration.RadialModel = i_Camera % 2;
  o_rCalibration.RadialParameters = { 2.5e-8 + 1.0e-9 * ( i_Camera % 11 ), 2.0e-15 };
  if ( o_rCalibration.RadialModel == 1 )
  {
    o_rCalibration.RadialParameters.push_back( -1.0e-21 );
  }
}

void FillPlate( std::size_t i_Plate, VDevice& o_rDevice )
{
  o_rDevice.Name = "Plate " + std::to_string( i_Plate + 1 );
  o_rDevice.Kind = VDevice::ForcePlate;
  const D3 Middle = PlateMiddle( i_Plate );
  constexpr double Signs[4][2] = { { 1, 1 }, { -1, 1 }, { -1, -1 }, { 1, -1 } };
  for ( std::size_t Corner = 0; Corner < 4; ++Corner )
  {
    o_rDevice.Corners[Corner] = Middle + D3{ Signs[Corner][0], Signs[Corner][1], 0 } * PlateHalf;
  }
}

void FillVolume( VParametersItem& o_rParameters )
{
  constexpr double Half = FloorHalf - 200, Height = 2400;
  constexpr double Corners[] = { -Half, -Half, 0, Half, Half, Height };
  o_rParameters.Target = ReconstructionTarget;
  for ( std::size_t Index = 0; Index < ReconstructionVolumeNames.size(); ++Index )
  {
    o_rParameters.Values[ReconstructionVolumeNames[Index]] = Corners[Index];
  }
}

std::array< float, 9 > PlateWrench( std::size_t i_Plate, const std::vector< VFootLoad >& i_rLoads )
{
  D3 Force, Moment, Centre;
  for ( const VFootLoad& rLoad : i_rLoads )
  {
    if ( rLoad.bDown && IsOnPlate( i_Plate, rLoad.Centre ) )
    {
      Force = Force + rLoad.Force;
      Moment = Moment + Cross( rLoad.Centre - PlateMiddle( i_Plate ), rLoad.Force );
      Centre = Centre + rLoad.Centre * rLoad.Force.z;
    }
  }
  // As with a true plate, a force too small to tell its place has none.
  const bool bFelt = Force.z > 10;
  const double None = std::numeric_limits< double >::quiet_NaN();
  Centre = bFelt ? Centre * ( 1 / Force.z ) : D3{ None, None, None };
  return { static_cast< float >( Force.x ),  static_cast< float >( Force.y ),  static_cast< float >( Force.z ),
           static_cast< float >( Moment.x ), static_cast< float >( Moment.y ), static_cast< float >( Moment.z ),
           static_cast< float >( Centre.x ), static_cast< float >( Centre.y ), static_cast< float >( Centre.z ) };
}

} // namespace HostSources::Simulation
