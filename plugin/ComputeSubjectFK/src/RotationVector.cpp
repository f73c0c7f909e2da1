#include "RotationVector.h"

#include <ComputeSubjectFK/VRigidTransform.h>

#include <cmath>
#include <numbers>

namespace ComputeSubject
{
namespace
{
/// I + a [v]x + b [v]x².
void Series( const double* i_pV, double i_A, double i_B, double* o_pMatrix )
{
  const double X = i_pV[0], Y = i_pV[1], Z = i_pV[2];
  const double Square = X * X + Y * Y + Z * Z;
  const double Skew[9] = { 0, -Z, Y, Z, 0, -X, -Y, X, 0 };
  for ( int Row = 0; Row < 3; ++Row )
  {
    for ( int Column = 0; Column < 3; ++Column )
    {
      const double One = Row == Column ? 1 : 0;
      const double Squared = i_pV[Row] * i_pV[Column] - One * Square;
      o_pMatrix[3 * Row + Column] = One + i_A * Skew[3 * Row + Column] + i_B * Squared;
    }
  }
}
} // namespace

void RotationFromVector( const double* i_pVector, double* o_pRotation )
{
  const double N = std::sqrt( Dot( i_pVector, i_pVector ) );
  if ( N < LeastRotation )
  {
    std::copy_n( VRigidTransform::Identity().m_Rotation, 9, o_pRotation );
    return;
  }
  const double X = i_pVector[0] / N, Y = i_pVector[1] / N, Z = i_pVector[2] / N;
  const double S = std::sin( N ), C = std::cos( N ), D = 1 - C;
  const double Rotation[9] = { D * X * X + C,     D * X * Y - S * Z, D * X * Z + S * Y,
                               D * Y * X + S * Z, D * Y * Y + C,     D * Y * Z - S * X,
                               D * Z * X - S * Y, D * Z * Y + S * X, D * Z * Z + C };
  std::copy_n( Rotation, 9, o_pRotation );
}

void VectorFromRotation( const double* i_pRotation, double* o_pVector )
{
  // Through the quaternion, from its largest component: exact near no turn and near half a turn alike.
  const double* R = i_pRotation;
  const double Squares[4] = { 1 + R[0] - R[4] - R[8], 1 - R[0] + R[4] - R[8], 1 - R[0] - R[4] + R[8],
                              1 + R[0] + R[4] + R[8] };
  const double Sums[3] = { R[5] + R[7], R[2] + R[6], R[1] + R[3] };
  const double Differences[3] = { R[7] - R[5], R[2] - R[6], R[3] - R[1] };
  double W = Squares[3];
  const int Largest = static_cast< int >( std::max_element( Squares, Squares + 4 ) - Squares );
  if ( Largest == 3 )
  {
    std::copy_n( Differences, 3, o_pVector );
  }
  else
  {
    for ( int Axis = 0; Axis < 3; ++Axis )
    {
      o_pVector[Axis] = Axis == Largest ? Squares[Axis] : Sums[3 - Axis - Largest];
    }
    W = Differences[Largest];
  }
  if ( W < 0 )
  {
    W = -W;
    for ( int Axis = 0; Axis < 3; ++Axis )
    {
      o_pVector[Axis] = -o_pVector[Axis];
    }
  }
  const double Length = std::sqrt( Dot( o_pVector, o_pVector ) );
  const double Factor = Length > 0 ? 2 * std::atan2( Length, W ) / Length : 0;
  for ( int Axis = 0; Axis < 3; ++Axis )
  {
    o_pVector[Axis] *= Factor;
  }
}

void NormaliseVector( double* io_pVector )
{
  const double N = std::sqrt( Dot( io_pVector, io_pVector ) );
  if ( N > std::numbers::pi )
  {
    const double Factor = std::atan2( std::sin( N ), std::cos( N ) ) / N;
    for ( int Axis = 0; Axis < 3; ++Axis )
    {
      io_pVector[Axis] *= Factor;
    }
  }
}

void LeftJacobian( const double* i_pVector, double* o_pMatrix )
{
  constexpr double Small = 1e-4;
  const double Square = Dot( i_pVector, i_pVector ), N = std::sqrt( Square );
  if ( N < Small )
  {
    Series( i_pVector, 0.5 - Square / 24, 1.0 / 6 - Square / 120, o_pMatrix );
    return;
  }
  // Half the angle for 1 - cos, which loses its digits otherwise.
  const double S = std::sin( N / 2 );
  Series( i_pVector, 2 * S * S / Square, ( N - std::sin( N ) ) / ( Square * N ), o_pMatrix );
}

void LeftJacobianInverse( const double* i_pVector, double* o_pMatrix )
{
  constexpr double Small = 1e-3;
  const double Square = Dot( i_pVector, i_pVector ), N = std::sqrt( Square );
  const double Factor =
      N < Small ? 1.0 / 12 + Square / 720 : 1 / Square - std::cos( N / 2 ) / ( 2 * N * std::sin( N / 2 ) );
  Series( i_pVector, -0.5, Factor, o_pMatrix );
}

void Cross( const double* i_pA, const double* i_pB, double* o_pProduct )
{
  o_pProduct[0] = i_pA[1] * i_pB[2] - i_pA[2] * i_pB[1];
  o_pProduct[1] = i_pA[2] * i_pB[0] - i_pA[0] * i_pB[2];
  o_pProduct[2] = i_pA[0] * i_pB[1] - i_pA[1] * i_pB[0];
}

double Dot( const double* i_pA, const double* i_pB )
{
  return i_pA[0] * i_pB[0] + i_pA[1] * i_pB[1] + i_pA[2] * i_pB[2];
}

void Multiply( const double* i_pA, const double* i_pB, double* o_pProduct )
{
  for ( int Row = 0; Row < 3; ++Row )
  {
    const double* pRow = i_pA + 3 * Row;
    for ( int Column = 0; Column < 3; ++Column )
    {
      o_pProduct[3 * Row + Column] = pRow[0] * i_pB[Column] + pRow[1] * i_pB[3 + Column] + pRow[2] * i_pB[6 + Column];
    }
  }
}

void MultiplyVector( const double* i_pMatrix, const double* i_pVector, double* o_pProduct )
{
  for ( int Row = 0; Row < 3; ++Row )
  {
    o_pProduct[Row] = Dot( i_pMatrix + 3 * Row, i_pVector );
  }
}

bool VRigidTransform::IsFinite() const
{
  const auto Finite = []( double i_Value )
  {
    return std::isfinite( i_Value );
  };
  return std::all_of( m_Rotation, m_Rotation + 9, Finite ) && std::all_of( m_Translation, m_Translation + 3, Finite );
}

bool VRigidTransform::IsRotation( double i_Tolerance ) const
{
  const double* R = m_Rotation;
  for ( int Row = 0; Row < 3; ++Row )
  {
    for ( int Other = Row; Other < 3; ++Other )
    {
      const double Off = Dot( R + 3 * Row, R + 3 * Other ) - ( Row == Other ? 1 : 0 );
      if ( !( std::abs( Off ) <= i_Tolerance ) )
      {
        return false;
      }
    }
  }
  double Normal[3];
  Cross( R, R + 3, Normal );
  return Dot( Normal, R + 6 ) > 0;
}

} // namespace ComputeSubject
