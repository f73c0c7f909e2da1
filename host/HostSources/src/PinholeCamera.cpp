#include <HostSources/CameraCalibrations.h>

#include <algorithm>
#include <cmath>

namespace HostSources
{
namespace
{
using VPoint = VPinholeCamera::VPoint;
using CoreMoxelTypes::D3;

/// A lens-less direction bent by the polynomial, with the derivatives of the map by x and y.
struct VBent
{
  VPoint At;
  std::array< double, 4 > J{};
};

VBent Bend( const std::array< double, 5 >& i_rD, const VPoint& i_rPoint )
{
  const auto& [K1, K2, P1, P2, K3] = i_rD;
  const double X = i_rPoint.x, Y = i_rPoint.y, S = X * X + Y * Y;
  const double Factor = 1 + S * ( K1 + S * ( K2 + S * K3 ) );
  const double Growth = 2 * ( K1 + S * ( 2 * K2 + S * 3 * K3 ) );
  VBent Bent;
  Bent.At = { X * Factor + 2 * P1 * X * Y + P2 * ( S + 2 * X * X ),
              Y * Factor + P1 * ( S + 2 * Y * Y ) + 2 * P2 * X * Y };
  const double Mixed = Growth * X * Y + 2 * P1 * X + 2 * P2 * Y;
  Bent.J = { Factor + Growth * X * X + 2 * P1 * Y + 6 * P2 * X, Mixed, Mixed,
             Factor + Growth * Y * Y + 6 * P1 * Y + 2 * P2 * X };
  return Bent;
}
} // namespace

VPoint VPinholeCamera::ToImage( const VPoint& i_rDirection, bool i_bLens ) const
{
  const VPoint Bent = i_bLens ? Bend( Distortion, i_rDirection ).At : i_rDirection;
  return { Fx * Bent.x + Skew * Bent.y + Cx, Fy * Bent.y + Cy };
}

bool VPinholeCamera::ToDirection( const VPoint& i_rImage, VPoint& o_rDirection ) const
{
  const double WantedY = ( i_rImage.y - Cy ) / Fy;
  const VPoint Wanted{ ( i_rImage.x - Cx - Skew * WantedY ) / Fx, WantedY };
  // From the centre outwards in steps, so that a polynomial that turns back is noticed where it does.
  constexpr int Steps = 4, MostRounds = 30;
  VPoint At;
  for ( int Step = 1; Step <= Steps; ++Step )
  {
    const VPoint Goal{ Wanted.x * Step / Steps, Wanted.y * Step / Steps };
    double Miss = 0;
    for ( int Round = 0; Round < MostRounds; ++Round )
    {
      const VBent Bent = Bend( Distortion, At );
      const double X = Goal.x - Bent.At.x, Y = Goal.y - Bent.At.y;
      const double Determinant = Bent.J[0] * Bent.J[3] - Bent.J[1] * Bent.J[2];
      if ( !( Determinant > 0 && Bent.J[0] + Bent.J[3] > 0 ) )
      {
        return false;
      }
      Miss = std::hypot( X, Y );
      if ( Miss < 1e-13 )
      {
        break;
      }
      At.x += ( Bent.J[3] * X - Bent.J[1] * Y ) / Determinant;
      At.y += ( Bent.J[0] * Y - Bent.J[2] * X ) / Determinant;
    }
    if ( !( Miss < 1e-9 ) )
    {
      return false;
    }
  }
  o_rDirection = At;
  return true;
}

bool VPinholeCamera::Project( const D3& i_rPlace, VPoint& o_rImage ) const
{
  const std::array< double, 9 > R = RotationMatrix( Rotation );
  const auto Row = [&]( std::size_t i_Row )
  {
    return R[3 * i_Row] * i_rPlace.x + R[3 * i_Row + 1] * i_rPlace.y + R[3 * i_Row + 2] * i_rPlace.z;
  };
  const double Z = Row( 2 ) + Translation.z;
  if ( !( Z > 0 ) )
  {
    return false;
  }
  o_rImage = ToImage( { ( Row( 0 ) + Translation.x ) / Z, ( Row( 1 ) + Translation.y ) / Z } );
  return true;
}

std::array< double, 9 > RotationMatrix( const D3& i_rVector )
{
  const double Angle = std::hypot( i_rVector.x, i_rVector.y, i_rVector.z );
  const double Scale = Angle > 0 ? 1 / Angle : 0;
  const double X = i_rVector.x * Scale, Y = i_rVector.y * Scale, Z = i_rVector.z * Scale;
  const double C = std::cos( Angle ), S = std::sin( Angle ), V = 1 - C;
  return { C + V * X * X,     V * X * Y - S * Z, V * X * Z + S * Y, V * X * Y + S * Z, C + V * Y * Y,
           V * Y * Z - S * X, V * X * Z - S * Y, V * Y * Z + S * X, C + V * Z * Z };
}

bool RotationVector( const std::array< double, 9 >& i_rMatrix, D3& o_rVector )
{
  const auto& rM = i_rMatrix;
  constexpr double Crooked = 1e-3;
  const auto Product = [&]( std::size_t i_A, std::size_t i_B )
  {
    return rM[3 * i_A] * rM[3 * i_B] + rM[3 * i_A + 1] * rM[3 * i_B + 1] + rM[3 * i_A + 2] * rM[3 * i_B + 2];
  };
  for ( std::size_t A = 0; A < 3; ++A )
  {
    for ( std::size_t B = 0; B < 3; ++B )
    {
      if ( !( std::abs( Product( A, B ) - ( A == B ? 1 : 0 ) ) < Crooked ) )
      {
        return false;
      }
    }
  }
  const double Determinant = rM[0] * ( rM[4] * rM[8] - rM[5] * rM[7] ) - rM[1] * ( rM[3] * rM[8] - rM[5] * rM[6] ) +
                             rM[2] * ( rM[3] * rM[7] - rM[4] * rM[6] );
  if ( Determinant < 0 )
  {
    return false;
  }
  // The quaternion from its greatest part, which stays exact up to half a turn.
  const std::array< double, 4 > Squares{ 1 + rM[0] - rM[4] - rM[8], 1 - rM[0] + rM[4] - rM[8],
                                         1 - rM[0] - rM[4] + rM[8], 1 + rM[0] + rM[4] + rM[8] };
  const auto Greatest =
      static_cast< std::size_t >( std::max_element( Squares.begin(), Squares.end() ) - Squares.begin() );
  const double XY = rM[1] + rM[3], XZ = rM[2] + rM[6], YZ = rM[5] + rM[7];
  const double WX = rM[7] - rM[5], WY = rM[2] - rM[6], WZ = rM[3] - rM[1];
  const double G = Squares[Greatest];
  std::array< double, 4 > Q = Greatest == 0   ? std::array{ G, XY, XZ, WX }
                              : Greatest == 1 ? std::array{ XY, G, YZ, WY }
                              : Greatest == 2 ? std::array{ XZ, YZ, G, WZ }
                                              : std::array{ WX, WY, WZ, G };
  const double Sign = Q[3] < 0 ? -1 : 1, Length = std::hypot( Q[0], Q[1], Q[2] );
  const double Angle = 2 * std::atan2( Length, std::abs( Q[3] ) );
  const double Scale = Length > 0 ? Sign * Angle / Length : 0;
  o_rVector = { Q[0] * Scale, Q[1] * Scale, Q[2] * Scale };
  return true;
}

} // namespace HostSources
