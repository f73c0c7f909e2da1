#include "SimulatedStage.h"

#include <CoreMoxelTypes/Parameters.h>

#include <algorithm>
#include <iterator>
#include <limits>

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

/// The angle-axis vector of a rotation given by its rows.
D3 RotationVector( const D3& i_rX, const D3& i_rY, const D3& i_rZ )
{
  // By way of the quaternion part that is greatest, which holds up to half a turn.
  const double Trace = i_rX.x + i_rY.y + i_rZ.z;
  double Q[4] = { 1 + Trace, 1 + i_rX.x - i_rY.y - i_rZ.z, 1 - i_rX.x + i_rY.y - i_rZ.z, 1 - i_rX.x - i_rY.y + i_rZ.z };
  const D3 Skew{ i_rZ.y - i_rY.z, i_rX.z - i_rZ.x, i_rY.x - i_rX.y };
  const double XY = i_rX.y + i_rY.x, XZ = i_rX.z + i_rZ.x, YZ = i_rY.z + i_rZ.y;
  const double Rows[4][4] = {
      { Q[0], Skew.x, Skew.y, Skew.z }, { Skew.x, Q[1], XY, XZ }, { Skew.y, XY, Q[2], YZ }, { Skew.z, XZ, YZ, Q[3] } };
  const auto Best = std::max_element( std::begin( Q ), std::end( Q ) ) - std::begin( Q );
  const double* pRow = Rows[Best];
  const double Sign = pRow[0] < 0 ? -1 : 1;
  const D3 Axis{ Sign * pRow[1], Sign * pRow[2], Sign * pRow[3] };
  const double Sine = Length( Axis );
  return Sine > 0 ? Axis * ( 2 * std::atan2( Sine, Sign * pRow[0] ) / Sine ) : D3{};
}

u32 Mixed( u32 i_Colour, u32 i_Towards, double i_Share )
{
  u32 Result = 0xFF000000u;
  for ( const int Shift : { 0, 8, 16 } )
  {
    const double From = ( i_Colour >> Shift ) & 0xFF, To = ( i_Towards >> Shift ) & 0xFF;
    Result |= static_cast< u32 >( From + ( To - From ) * i_Share + 0.5 ) << Shift;
  }
  return Result;
}

} // namespace

std::uint32_t PerformerColour( std::uint32_t i_Performer )
{
  constexpr u32 Colours[] = { 0xFF4FB4FFu, 0xFFFFB84Fu, 0xFF7ED957u, 0xFFC77DFFu,
                              0xFF5CE1E6u, 0xFF6B6BFFu, 0xFFE6C229u, 0xFFB0B0B0u };
  return Colours[i_Performer % std::size( Colours )];
}

std::string PerformerName( std::uint32_t i_Performer )
{
  static constexpr const char* Names[] = { "Ada", "Ben", "Cleo", "Dan", "Eve", "Finn", "Gil",  "Hana",
                                           "Ivo", "Joy", "Kai",  "Lea", "Max", "Nora", "Olaf", "Pia" };
  return i_Performer < std::size( Names ) ? Names[i_Performer] : "Performer " + std::to_string( i_Performer + 1 );
}

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
  const VHash Hash = VHash( i_rOptions.Seed ).With( 0x5747 ).With( i_Performer );
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

void FillSubject( std::uint32_t i_Performer, VSubject& o_rSubject )
{
  o_rSubject.Id = i_Performer + 1;
  o_rSubject.Name = PerformerName( i_Performer );
  for ( const char* pName : WalkerMarkerNames() )
  {
    VMarker& rMarker = o_rSubject.Markers.emplace_back();
    rMarker.Id = static_cast< u32 >( o_rSubject.Markers.size() - 1 );
    rMarker.Name = pName;
    rMarker.Radius = 7;
  }
}

void FillColours( std::uint32_t i_Performer, VSubjectApplicationData& o_rData )
{
  const u32 Colour = PerformerColour( i_Performer );
  for ( const std::string_view Name : WalkerMarkerNames() )
  {
    // Left lighter, right darker: which way a person faces can be seen.
    o_rData.MarkerColours.push_back( Name[0] == 'L'   ? Mixed( Colour, 0xFFFFFFFFu, 0.35 )
                                     : Name[0] == 'R' ? Mixed( Colour, 0xFF000000u, 0.3 )
                                                      : Colour );
  }
  for ( const auto& rStick : WalkerSticks() )
  {
    o_rData.Sticks.push_back(
        { rStick[0], rStick[1], o_rData.MarkerColours[rStick[0]], o_rData.MarkerColours[rStick[1]] } );
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

void PoseObjects( double i_Seconds, std::array< D3, ObjectMarkers >& o_rMarkers )
{
  VFrame Prop;
  Prop.Origin = { -2450, -2450, 900 };
  Prop = Yawed( Prop, 0.4 * i_Seconds );
  constexpr D3 PropPoints[] = { { 0, 0, 0 }, { 160, 0, 0 }, { 0, 90, 20 }, { -70, -60, 40 }, { 60, -40, 120 } };
  VFrame Wand = Pitched( Yawed( {}, 0.8 * std::sin( 1.3 * i_Seconds ) ), 0.9 * std::sin( 2.1 * i_Seconds ) );
  Wand.Origin = { 2400 + 120 * std::sin( 1.7 * i_Seconds ), -2400 + 120 * std::cos( 1.1 * i_Seconds ),
                  1200 + 250 * std::sin( 0.9 * i_Seconds ) };
  constexpr D3 WandPoints[] = { { 0, 0, 0 }, { 0, 120, 0 }, { 0, -240, 0 }, { 180, 0, 0 }, { 360, 0, 0 } };
  auto* pNext = o_rMarkers.data();
  for ( const D3& rPoint : PropPoints )
  {
    *pNext++ = Prop.Point( rPoint.x, rPoint.y, rPoint.z );
  }
  for ( const D3& rPoint : WandPoints )
  {
    *pNext++ = Wand.Point( rPoint.x, rPoint.y, rPoint.z );
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
