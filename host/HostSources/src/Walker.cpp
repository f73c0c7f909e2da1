#include "Walker.h"

#include <algorithm>

namespace HostSources::Simulation
{
namespace
{

constexpr double StanceShare = 0.6; // of a stride, during which a foot is down
constexpr double Landing = -0.28, Leaving = 0.75;

double Smooth( double i_Share )
{
  const double T = std::clamp( i_Share, 0.0, 1.0 );
  return T * T * ( 3 - 2 * T );
}

/// Nose-down angle of the sole: it lands on the heel, lies flat, and leaves from the ball.
double SolePitch( double i_Stride )
{
  if ( i_Stride < StanceShare )
  {
    return Landing * ( 1 - Smooth( i_Stride / 0.1 ) ) +
           Leaving * Smooth( ( i_Stride - 0.36 ) / ( StanceShare - 0.36 ) );
  }
  return Leaving + ( Landing - Leaving ) * Smooth( ( i_Stride - StanceShare ) / ( 0.9 - StanceShare ) );
}

/// The toes stay on the floor while the heel rises, and come straight in the air.
double ToesBend( double i_Stride, double i_Pitch )
{
  const double Straight = i_Stride < StanceShare ? 0 : Smooth( ( i_Stride - StanceShare ) / 0.15 );
  return std::max( 0.0, i_Pitch ) * ( 1 - Straight ) + 0.12 * Straight * Smooth( ( 1 - i_Stride ) / 0.1 );
}

/// Pitched about the heel's edge or about the joint of the toes, whichever stays on the floor.
VFrame SoleAt( const VFrame& i_rFlat, double i_Pitch, double i_Scale )
{
  const D3 Pivot = ( i_Pitch > 0 ? D3{ 0, 0, ToeJointHeight } : D3{ -BallToHeel, 0, 0 } ) * i_Scale;
  VFrame Sole = Pitched( i_rFlat, i_Pitch );
  Sole.Origin = i_rFlat.Point( Pivot.x, Pivot.y, Pivot.z ) - Sole.X * Pivot.x - Sole.Z * Pivot.z;
  return Sole;
}

VFootLoad LoadOf( const VWalkerStyle& i_rStyle, const VWalkerFoot& i_rFoot )
{
  VFootLoad Load;
  Load.bDown = i_rFoot.Stride < StanceShare;
  if ( Load.bDown )
  {
    const double Share = i_rFoot.Stride / StanceShare;
    const double Weight = i_rStyle.MassKg * 9.81;
    const D3 Forward = Unit( { i_rFoot.Frame.X.x, i_rFoot.Frame.X.y, 0 } );
    Load.Centre = i_rFoot.Place + Forward * ( ( -BallToHeel + 215 * Share ) * i_rStyle.Scale );
    Load.Centre.z = 0;
    // Braking first, then pushing off; two humps with a trough between them.
    Load.Force = Forward * ( -0.18 * Weight * std::sin( 2 * Pi * Share ) );
    Load.Force.z = Weight * ( 1.25 * std::sin( Pi * Share ) + 0.3 * std::sin( 3 * Pi * Share ) );
  }
  return Load;
}

} // namespace

VFrame PathAt( const VWalkerStyle& i_rStyle, double i_Seconds )
{
  const double Angle = i_rStyle.Start + i_rStyle.Direction * i_Seconds * i_rStyle.Speed / i_rStyle.Radius;
  const double C = std::cos( Angle ), S = std::sin( Angle );
  const D3 Forward{ -S * i_rStyle.Direction, C * i_rStyle.Direction, 0 };
  return { { C * i_rStyle.Radius, S * i_rStyle.Radius, 0 }, Forward, { -Forward.y, Forward.x, 0 }, { 0, 0, 1 } };
}

VWalkerFoot FootAt( const VWalkerStyle& i_rStyle, double i_Seconds, int i_Side )
{
  const double Offset = i_Side > 0 ? 0.0 : 0.5;
  const double Strides = i_rStyle.Cadence * i_Seconds + i_rStyle.Phase + Offset;
  const double Whole = std::floor( Strides );
  VWalkerFoot Foot;
  Foot.Stride = Strides - Whole;
  // Where the sole stands in a stride: beside the path, where the body is in the middle of the stance.
  const auto Plant = [&]( double i_Stride )
  {
    const double Middle = ( i_Stride + StanceShare / 2 - i_rStyle.Phase - Offset ) / i_rStyle.Cadence;
    VFrame Frame = PathAt( i_rStyle, Middle );
    Frame.Origin = Frame.Point( 55 * i_rStyle.Scale, i_Side * 85 * i_rStyle.Scale, 0 );
    return Yawed( Frame, i_Side * 0.12 );
  };
  VFrame Flat = Plant( Whole );
  if ( Foot.Stride > StanceShare )
  {
    const double Share = ( Foot.Stride - StanceShare ) / ( 1 - StanceShare );
    const VFrame Next = Plant( Whole + 1 );
    const double Way = Smooth( Share );
    Flat.Origin = Flat.Origin * ( 1 - Way ) + Next.Origin * Way;
    Flat.X = Unit( Flat.X * ( 1 - Way ) + Next.X * Way );
    Flat.Y = Cross( Flat.Z, Flat.X );
    Flat.Origin.z = 55 * std::sin( Pi * Share ) * i_rStyle.Scale;
  }
  const double Pitch = SolePitch( Foot.Stride );
  Foot.Place = Flat.Origin;
  Foot.Frame = SoleAt( Flat, Pitch, i_rStyle.Scale );
  Foot.Toes = ToesBend( Foot.Stride, Pitch );
  return Foot;
}

void LoadFeet( const VWalkerStyle& i_rStyle, double i_Seconds, std::array< VFootLoad, 2 >& o_rFeet )
{
  o_rFeet = { LoadOf( i_rStyle, FootAt( i_rStyle, i_Seconds, 1 ) ),
              LoadOf( i_rStyle, FootAt( i_rStyle, i_Seconds, -1 ) ) };
}

} // namespace HostSources::Simulation
