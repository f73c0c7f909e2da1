#pragma once

namespace ComputeSubject
{

/// Shorter rotation vectors do not turn at all.
inline constexpr double LeastRotation = 2.220446049250313e-15;

/// The rotation about `i_pVector` by its length, row by row.
void RotationFromVector( const double* i_pVector, double* o_pRotation );
/// The rotation vector of a length in [0, pi]. At pi the axis is the one whose largest component is positive.
void VectorFromRotation( const double* i_pRotation, double* o_pVector );
/// Scales a rotation vector that is longer than pi to the same rotation of at most pi.
void NormaliseVector( double* io_pVector );
/// How the world turns as the components of a rotation vector grow: the columns are angular velocities.
void LeftJacobian( const double* i_pVector, double* o_pMatrix );
/// Its inverse, for vectors of a length in [0, pi].
void LeftJacobianInverse( const double* i_pVector, double* o_pMatrix );

void Cross( const double* i_pA, const double* i_pB, double* o_pProduct );
double Dot( const double* i_pA, const double* i_pB );
/// 3 by 3, row-major. The product must not be one of the factors.
void Multiply( const double* i_pA, const double* i_pB, double* o_pProduct );
void MultiplyVector( const double* i_pMatrix, const double* i_pVector, double* o_pProduct );

} // namespace ComputeSubject
