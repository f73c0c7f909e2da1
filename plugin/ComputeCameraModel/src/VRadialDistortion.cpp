#include <ComputeCameraModel/VRadialDistortion.h>

#include <ZEK/DebugServices.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <utility>

namespace ComputeCameraModel
{
namespace
{
constexpr double NoLimit = std::numeric_limits< double >::max();
constexpr double FirstStep = 0.2; // of the centre's distance from the corner
constexpr double LastStep = 40;
constexpr double StepFactor = 1.05;
constexpr double StepBackSq = 0.9070294784580498; // 1 / 1.05^2
constexpr double AtCentreSq = 1e-12;              // px^2
constexpr double CloseEnough = 5e-13;             // px
constexpr int MostRounds = 20;
constexpr double CurvedFrom = 1e-6;

/// P and its derivatives at a distance.
struct VPolynomial
{
  const std::array< double, 3 >& rK;

  double Value( double i_X ) const
  {
    const double S = i_X * i_X;
    return i_X * ( 1 + S * ( rK[0] + S * ( rK[1] + S * rK[2] ) ) );
  }
  double SlopeAtSq( double i_S ) const { return 1 + i_S * ( 3 * rK[0] + i_S * ( 5 * rK[1] + i_S * 7 * rK[2] ) ); }
  double Slope( double i_X ) const { return SlopeAtSq( i_X * i_X ); }
  double Curve( double i_X ) const
  {
    const double S = i_X * i_X;
    return i_X * ( 6 * rK[0] + S * ( 20 * rK[1] + S * 42 * rK[2] ) );
  }
};
} // namespace

VRadialDistortion::VRadialDistortion( VLensCalibration i_LensCalibration )
  : m_LensCalibration( std::move( i_LensCalibration ) )
{
  static constexpr std::array< std::size_t, 3 > ParametersOfModel{ 2, 3, 0 };
  const auto& m_RadialParameters = m_LensCalibration.m_RadialParameters;
  bool bGood = DebugServices::Check( m_LensCalibration.Model < ParametersOfModel.size(), "Bad Radial Model", __FILE__,
                                     __LINE__ );
  if ( bGood )
  {
    m_NumParameters = ParametersOfModel[m_LensCalibration.Model];
    bGood =
        DebugServices::Check( m_RadialParameters.size() == m_NumParameters,
                              "m_LensCalibration.m_RadialParameters.size() == m_NumParameters", __FILE__, __LINE__ );
  }
  const VImagePoint& rCentre = m_LensCalibration.Centre;
  if ( bGood && ( rCentre.x != 0 || rCentre.y != 0 ) )
  {
    std::copy( m_RadialParameters.begin(), m_RadialParameters.end(), m_K.begin() );
  }
  m_bDistorting = m_K != std::array< double, 3 >{};
  FindDomain();
}

void VRadialDistortion::FindDomain()
{
  if ( !std::isfinite( m_K[0] + m_K[1] + m_K[2] ) )
  {
    return;
  }
  if ( std::none_of( m_K.begin(), m_K.end(),
                     []( double i_K )
                     {
                       return i_K < 0;
                     } ) )
  {
    m_MaxRawRadiusSq = NoLimit;
    m_MaxCorrectedRadiusSq = NoLimit;
    return;
  }
  const double Reach = std::hypot( m_LensCalibration.Centre.x, m_LensCalibration.Centre.y );
  const VPolynomial P{ m_K };
  double Radius = FirstStep * Reach;
  double Last = Radius;
  bool bFolds = false;
  for ( ; Radius < LastStep * Reach && !bFolds; Radius *= StepFactor )
  {
    Last = Radius;
    bFolds = P.Slope( Radius ) < 0;
  }
  m_MaxRawRadiusSq = Last * Last * ( bFolds ? StepBackSq : 1 );
  LimitToFirstFold();
  const double Limit = P.Value( std::sqrt( m_MaxRawRadiusSq ) );
  m_MaxCorrectedRadiusSq = Limit * Limit;
}

/// The steps can stride over a fold, and begin beyond one.
void VRadialDistortion::LimitToFirstFold()
{
  const VPolynomial P{ m_K };
  // Where the slope, a cubic in the squared radius, can turn: the roots of its derivative.
  const double A = 21 * m_K[2], B = 5 * m_K[1], C = 3 * m_K[0]; // A s^2 + 2 B s + C
  const double Root = std::sqrt( std::max( B * B - A * C, 0.0 ) );
  std::array< double, 4 > Turns{ A != 0 ? ( -B - Root ) / A : 0, A != 0 ? ( -B + Root ) / A : 0,
                                 B != 0 ? -C / ( 2 * B ) : 0, m_MaxRawRadiusSq };
  std::sort( Turns.begin(), Turns.end() );
  double Rising = 0;
  for ( const double Turn : Turns )
  {
    if ( !( Turn > 0 && Turn <= m_MaxRawRadiusSq ) )
    {
      continue;
    }
    if ( P.SlopeAtSq( Turn ) > 0 )
    {
      Rising = Turn;
      continue;
    }
    double Falling = Turn;
    for ( double Middle = 0; Middle = ( Rising + Falling ) / 2, Middle > Rising && Middle < Falling; )
    {
      ( P.SlopeAtSq( Middle ) > 0 ? Rising : Falling ) = Middle;
    }
    m_MaxRawRadiusSq = Rising * StepBackSq;
    return;
  }
}

double VRadialDistortion::Slope( double i_RawRadius ) const
{
  return VPolynomial{ m_K }.Slope( i_RawRadius );
}

bool VRadialDistortion::Correct( const VImagePoint& i_rRaw, VImagePoint& o_rCorrected ) const
{
  const VImagePoint& rCentre = m_LensCalibration.Centre;
  if ( !m_bDistorting )
  {
    o_rCorrected = i_rRaw;
    return true;
  }
  const double X = i_rRaw.x - rCentre.x, Y = i_rRaw.y - rCentre.y;
  const double RadiusSq = X * X + Y * Y;
  if ( !( RadiusSq <= m_MaxRawRadiusSq ) )
  {
    return false;
  }
  const double Factor = Scale( RadiusSq );
  o_rCorrected = { rCentre.x + X * Factor, rCentre.y + Y * Factor };
  return true;
}

bool VRadialDistortion::Distort( const VImagePoint& i_rCorrected, VImagePoint& o_rRaw ) const
{
  const VImagePoint& rCentre = m_LensCalibration.Centre;
  if ( !m_bDistorting )
  {
    o_rRaw = i_rCorrected;
    return true;
  }
  const double X = i_rCorrected.x - rCentre.x, Y = i_rCorrected.y - rCentre.y;
  const double DistanceSq = X * X + Y * Y;
  if ( DistanceSq < AtCentreSq )
  {
    o_rRaw = rCentre;
    return true;
  }
  if ( !( DistanceSq <= m_MaxCorrectedRadiusSq ) )
  {
    return false;
  }
  const double Distance = std::sqrt( DistanceSq );
  const double Factor = Solve( Distance ) / Distance;
  o_rRaw = { rCentre.x + X * Factor, rCentre.y + Y * Factor };
  return true;
}

double VRadialDistortion::Solve( double i_Distance ) const
{
  const VPolynomial P{ m_K };
  double X = i_Distance;
  double LastStepSize = NoLimit;
  for ( int Round = 0; Round < MostRounds; ++Round )
  {
    const double F = P.Value( X ) - i_Distance;
    if ( std::abs( F ) < CloseEnough )
    {
      return X;
    }
    const double G = P.Slope( X ), H = P.Curve( X );
    const double Before = X;
    if ( std::abs( 2 * F * H ) >= CurvedFrom * G * G )
    {
      X += ( std::sqrt( std::max( G * G - 2 * F * H, 0.0 ) ) - std::abs( G ) ) / H;
    }
    else
    {
      X -= F / G;
    }
    LastStepSize = std::abs( X - Before );
  }
  // Far out the numbers are too coarse for the test above, although the place is found.
  constexpr double Coarse = 1e-14;
  return LastStepSize <= Coarse * X && X * X <= m_MaxRawRadiusSq ? X : SolveByHalves( i_Distance );
}

/// For what the rounds do not reach: P rises all the way, so that the place can be closed in.
double VRadialDistortion::SolveByHalves( double i_Distance ) const
{
  const VPolynomial P{ m_K };
  double Low = 0;
  // Without a limit no parameter is negative, and P lies above its argument.
  double High = m_MaxRawRadiusSq == NoLimit ? i_Distance : std::sqrt( m_MaxRawRadiusSq );
  for ( double Middle = 0; Middle = ( Low + High ) / 2, Middle > Low && Middle < High; )
  {
    ( P.Value( Middle ) < i_Distance ? Low : High ) = Middle;
  }
  return High;
}

VRadialDistortionJacobian::VJacobian VRadialDistortionJacobian::AtRaw( const VImagePoint& i_rRaw ) const
{
  const double X = i_rRaw.x - LensCalibration().Centre.x, Y = i_rRaw.y - LensCalibration().Centre.y;
  const double S = X * X + Y * Y;
  const double Growth = 2 * ( m_K[0] + S * ( 2 * m_K[1] + S * 3 * m_K[2] ) );
  const double Factor = Scale( S );
  return { Factor + Growth * X * X, Growth * X * Y, Growth * X * Y, Factor + Growth * Y * Y };
}

bool VRadialDistortionJacobian::Correct( const VImagePoint& i_rRaw, VImagePoint& o_rCorrected,
                                         VJacobian& o_rJacobian ) const
{
  const VImagePoint Raw = i_rRaw;
  if ( !Correct( Raw, o_rCorrected ) )
  {
    return false;
  }
  o_rJacobian = IsDistorting() ? AtRaw( Raw ) : VJacobian{ 1, 0, 0, 1 };
  return true;
}

bool VRadialDistortionJacobian::Distort( const VImagePoint& i_rCorrected, VImagePoint& o_rRaw,
                                         VJacobian& o_rJacobian ) const
{
  if ( !Distort( i_rCorrected, o_rRaw ) )
  {
    return false;
  }
  o_rJacobian = { 1, 0, 0, 1 };
  if ( IsDistorting() )
  {
    const VJacobian J = AtRaw( o_rRaw );
    const double Determinant = J[0] * J[3] - J[1] * J[2];
    o_rJacobian = { J[3] / Determinant, -J[1] / Determinant, -J[2] / Determinant, J[0] / Determinant };
  }
  return true;
}

} // namespace ComputeCameraModel
