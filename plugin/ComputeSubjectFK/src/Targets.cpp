#include <ComputeSubjectFK/Targets.h>

#include "RotationVector.h"

#include <cmath>

namespace ComputeSubject
{
namespace
{
constexpr double Tolerance = 1e-6;

/// A target's point in the world, less its goal.
void PointError( const VRigidTransform& i_rWorld, const VTargetPose& i_rLocal, const VTargetPose& i_rGoal,
                 double* o_pError )
{
  i_rWorld.Place( i_rLocal.Point, o_pError );
  for ( int Axis = 0; Axis < 3; ++Axis )
  {
    o_pError[Axis] -= i_rGoal.Point[Axis];
  }
}

/// How a target's point moves.
void PointMove( const VRigidTransform& i_rWorld, const VTargetPose& i_rLocal, const double i_Angular[3],
                const double i_LinearAtOrigin[3], double* o_pMove )
{
  double Point[3];
  i_rWorld.Place( i_rLocal.Point, Point );
  Cross( i_Angular, Point, o_pMove );
  for ( int Axis = 0; Axis < 3; ++Axis )
  {
    o_pMove[Axis] += i_LinearAtOrigin[Axis];
  }
}

/// The rotation vector from the goal rotation to the target's.
void RotationError( const VRigidTransform& i_rWorld, const VTargetPose& i_rLocal, const VTargetPose& i_rGoal,
                    double* o_pError )
{
  double Turned[9], GoalTransposed[9], Difference[9];
  Multiply( i_rWorld.m_Rotation, i_rLocal.Rotation, Turned );
  for ( int Index = 0; Index < 9; ++Index )
  {
    GoalTransposed[Index] = i_rGoal.Rotation[Index % 3 * 3 + Index / 3];
  }
  Multiply( Turned, GoalTransposed, Difference );
  VectorFromRotation( Difference, o_pError );
}

void RotationMove( const VRigidTransform& i_rWorld, const VTargetPose& i_rLocal, const VTargetPose& i_rGoal,
                   const double i_Angular[3], double* o_pMove )
{
  double Error[3], Inverse[9];
  RotationError( i_rWorld, i_rLocal, i_rGoal, Error );
  LeftJacobianInverse( Error, Inverse );
  MultiplyVector( Inverse, i_Angular, o_pMove );
}

void Scale( double i_Weight, int i_Rows, double* io_pRows )
{
  for ( int Row = 0; Row < i_Rows; ++Row )
  {
    io_pRows[Row] *= i_Weight;
  }
}

/// Takes away the part along `i_pDirection`, which is of length 1.
void Flatten( const double* i_pDirection, double* io_pVector )
{
  const double Along = Dot( i_pDirection, io_pVector );
  for ( int Axis = 0; Axis < 3; ++Axis )
  {
    io_pVector[Axis] -= Along * i_pDirection[Axis];
  }
}

bool IsFinite( const VTargetPose& i_rPose )
{
  const auto Finite = []( double i_Value )
  {
    return std::isfinite( i_Value );
  };
  return std::all_of( i_rPose.Point, i_rPose.Point + 3, Finite ) &&
         std::all_of( i_rPose.Direction, i_rPose.Direction + 3, Finite ) &&
         std::all_of( i_rPose.Rotation, i_rPose.Rotation + 9, Finite );
}

bool IsProper( const VTargetPose& i_rPose )
{
  VRigidTransform Transform;
  std::copy_n( i_rPose.Rotation, 9, Transform.m_Rotation );
  return std::abs( Dot( i_rPose.Direction, i_rPose.Direction ) - 1 ) <= Tolerance && Transform.IsRotation( Tolerance );
}
} // namespace

void VTargetFKLocalPointToWorldPoint::Residual( const VRigidTransform& i_rWorld, double* o_pResidual ) const
{
  PointError( i_rWorld, Local(), Goal(), o_pResidual );
  Scale( Weight(), 3, o_pResidual );
}
void VTargetFKLocalPointToWorldPoint::Derivative( const VRigidTransform& i_rWorld, const double i_Angular[3],
                                                  const double i_LinearAtOrigin[3], double* o_pDerivative ) const
{
  PointMove( i_rWorld, Local(), i_Angular, i_LinearAtOrigin, o_pDerivative );
  Scale( Weight(), 3, o_pDerivative );
}

void VTargetFKLocalLineToWorldPoint::Residual( const VRigidTransform& i_rWorld, double* o_pResidual ) const
{
  double U[3];
  i_rWorld.Turn( Local().Direction, U );
  PointError( i_rWorld, Local(), Goal(), o_pResidual );
  Flatten( U, o_pResidual );
  Scale( Weight(), 3, o_pResidual );
}
void VTargetFKLocalLineToWorldPoint::Derivative( const VRigidTransform& i_rWorld, const double i_Angular[3],
                                                 const double i_LinearAtOrigin[3], double* o_pDerivative ) const
{
  double U[3], MovedU[3], Error[3];
  i_rWorld.Turn( Local().Direction, U );
  Cross( i_Angular, U, MovedU );
  PointError( i_rWorld, Local(), Goal(), Error );
  PointMove( i_rWorld, Local(), i_Angular, i_LinearAtOrigin, o_pDerivative );
  Flatten( U, o_pDerivative );
  const double Along = Dot( U, Error ), MovedAlong = Dot( MovedU, Error );
  for ( int Axis = 0; Axis < 3; ++Axis )
  {
    o_pDerivative[Axis] -= MovedU[Axis] * Along + U[Axis] * MovedAlong;
  }
  Scale( Weight(), 3, o_pDerivative );
}

void VTargetFKLocalPlaneToWorldPoint::Residual( const VRigidTransform& i_rWorld, double* o_pResidual ) const
{
  double U[3], Error[3];
  i_rWorld.Turn( Local().Direction, U );
  PointError( i_rWorld, Local(), Goal(), Error );
  *o_pResidual = -Weight() * Dot( U, Error );
}
void VTargetFKLocalPlaneToWorldPoint::Derivative( const VRigidTransform& i_rWorld, const double i_Angular[3],
                                                  const double i_LinearAtOrigin[3], double* o_pDerivative ) const
{
  double U[3], MovedU[3], Error[3], Move[3];
  i_rWorld.Turn( Local().Direction, U );
  Cross( i_Angular, U, MovedU );
  PointError( i_rWorld, Local(), Goal(), Error );
  PointMove( i_rWorld, Local(), i_Angular, i_LinearAtOrigin, Move );
  *o_pDerivative = -Weight() * ( Dot( MovedU, Error ) + Dot( U, Move ) );
}

void VTargetFKRigidBody::Residual( const VRigidTransform& i_rWorld, double* o_pResidual ) const
{
  PointError( i_rWorld, Local(), Goal(), o_pResidual );
  RotationError( i_rWorld, Local(), Goal(), o_pResidual + 3 );
  Scale( Weight(), 6, o_pResidual );
}
void VTargetFKRigidBody::Derivative( const VRigidTransform& i_rWorld, const double i_Angular[3],
                                     const double i_LinearAtOrigin[3], double* o_pDerivative ) const
{
  PointMove( i_rWorld, Local(), i_Angular, i_LinearAtOrigin, o_pDerivative );
  RotationMove( i_rWorld, Local(), Goal(), i_Angular, o_pDerivative + 3 );
  Scale( Weight(), 6, o_pDerivative );
}

void VTargetFKLocalRotationToWorldRotation::Residual( const VRigidTransform& i_rWorld, double* o_pResidual ) const
{
  RotationError( i_rWorld, Local(), Goal(), o_pResidual );
  Scale( Weight(), 3, o_pResidual );
}
void VTargetFKLocalRotationToWorldRotation::Derivative( const VRigidTransform& i_rWorld, const double i_Angular[3],
                                                        const double*, double* o_pDerivative ) const
{
  RotationMove( i_rWorld, Local(), Goal(), i_Angular, o_pDerivative );
  Scale( Weight(), 3, o_pDerivative );
}

void VTargetFKLocalDirectionToWorldDirection::Residual( const VRigidTransform& i_rWorld, double* o_pResidual ) const
{
  i_rWorld.Turn( Local().Direction, o_pResidual );
  for ( int Axis = 0; Axis < 3; ++Axis )
  {
    o_pResidual[Axis] -= Goal().Direction[Axis];
  }
  Scale( Weight(), 3, o_pResidual );
}
void VTargetFKLocalDirectionToWorldDirection::Derivative( const VRigidTransform& i_rWorld, const double i_Angular[3],
                                                          const double*, double* o_pDerivative ) const
{
  double U[3];
  i_rWorld.Turn( Local().Direction, U );
  Cross( i_Angular, U, o_pDerivative );
  Scale( Weight(), 3, o_pDerivative );
}

void CheckTargetRecord( const VTargetRecord& i_rRecord, ETargetKind i_Kind )
{
  if ( i_rRecord.Kind != i_Kind )
  {
    throw VConstructionException( "The record is not for this kind of target.", ZEK::IResult::InvalidType );
  }
  if ( !IsFinite( i_rRecord.Local ) || !IsFinite( i_rRecord.Goal ) )
  {
    throw VConstructionException( "The target has numbers that are not finite.", ZEK::IResult::InvalidValue );
  }
  if ( !IsProper( i_rRecord.Local ) || !IsProper( i_rRecord.Goal ) )
  {
    throw VConstructionException( "The target has a direction whose length is not 1, or a rotation that is none.",
                                  ZEK::IResult::InvalidValue );
  }
  if ( !( i_rRecord.Weight >= 0 ) || !std::isfinite( i_rRecord.Weight ) )
  {
    throw VConstructionException( "The target's weight is negative or not finite.", ZEK::IResult::InvalidValue );
  }
}

const ITargetFKFactory& FindTargetFactory( ETargetKind i_Kind )
{
  static const VTargetFKFactory< VTargetFKLocalPointToWorldPoint > Point;
  static const VTargetFKFactory< VTargetFKLocalLineToWorldPoint > Line;
  static const VTargetFKFactory< VTargetFKLocalPlaneToWorldPoint > Plane;
  static const VTargetFKFactory< VTargetFKRigidBody > Body;
  static const VTargetFKFactory< VTargetFKLocalRotationToWorldRotation > Rotation;
  static const VTargetFKFactory< VTargetFKLocalDirectionToWorldDirection > Direction;
  static const ITargetFKFactory* const Factories[] = { &Point, &Line, &Plane, &Body, &Rotation, &Direction };
  const auto Index = static_cast< std::size_t >( i_Kind );
  if ( Index >= std::size( Factories ) )
  {
    throw VConstructionException(
        std::string( "No target has the kind " ).append( std::to_string( Index ) ).append( "." ),
        ZEK::IResult::InvalidType );
  }
  return *Factories[Index];
}

} // namespace ComputeSubject
