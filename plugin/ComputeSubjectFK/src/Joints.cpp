#include <ComputeSubjectFK/Joints.h>

#include "RotationVector.h"

#include <cmath>

namespace ComputeSubject
{
namespace
{
constexpr double RotationTolerance = 1e-6;

void SetIdentity( VRigidTransform& o_rTransform )
{
  std::copy_n( VRigidTransform::Identity().m_Rotation, 9, o_rTransform.m_Rotation );
}

void Wrap( double& io_rAngle )
{
  io_rAngle = std::atan2( std::sin( io_rAngle ), std::cos( io_rAngle ) );
}

void TakeColumn( const double* i_pRotation, int i_Column, double* o_pVector )
{
  for ( int Row = 0; Row < 3; ++Row )
  {
    o_pVector[Row] = i_pRotation[3 * Row + i_Column];
  }
}

/// Those of a rotation vector, about `i_pOrigin`.
void RotationAxes( const double* i_pVector, const VRigidTransform& i_rFixed, const double* i_pOrigin,
                   VJointAxis* o_pAxes )
{
  double Local[9], World[9];
  LeftJacobian( i_pVector, Local );
  Multiply( i_rFixed.m_Rotation, Local, World );
  for ( int Axis = 0; Axis < 3; ++Axis )
  {
    o_pAxes[Axis] = {};
    TakeColumn( World, Axis, o_pAxes[Axis].Angular );
    std::copy_n( i_pOrigin, 3, o_pAxes[Axis].Origin );
  }
}

VJointAxis TurnAxis( const VRigidTransform& i_rFixed, const double i_Local[3] )
{
  VJointAxis Axis;
  i_rFixed.Turn( i_Local, Axis.Angular );
  std::copy_n( i_rFixed.m_Translation, 3, Axis.Origin );
  return Axis;
}
} // namespace

void VJointFKFree::ComputeTransform( VRigidTransform& o_rTransform ) const
{
  RotationFromVector( State(), o_rTransform.m_Rotation );
  std::copy_n( State() + 3, 3, o_rTransform.m_Translation );
}
void VJointFKFree::NormaliseState( StateIterator& io_rState ) const
{
  NormaliseVector( &*io_rState );
  io_rState += 6;
}
void VJointFKFree::ComputeAxes( const VRigidTransform& i_rFixed, VJointAxis* o_pAxes ) const
{
  double Origin[3];
  i_rFixed.Place( State() + 3, Origin );
  RotationAxes( State(), i_rFixed, Origin, o_pAxes );
  for ( int Axis = 0; Axis < 3; ++Axis )
  {
    o_pAxes[3 + Axis] = {};
    TakeColumn( i_rFixed.m_Rotation, Axis, o_pAxes[3 + Axis].Linear );
  }
}

void VJointFKBall::ComputeTransform( VRigidTransform& o_rTransform ) const
{
  RotationFromVector( State(), o_rTransform.m_Rotation );
  std::fill_n( o_rTransform.m_Translation, 3, 0.0 );
}
void VJointFKBall::NormaliseState( StateIterator& io_rState ) const
{
  NormaliseVector( &*io_rState );
  io_rState += 3;
}
void VJointFKBall::ComputeAxes( const VRigidTransform& i_rFixed, VJointAxis* o_pAxes ) const
{
  RotationAxes( State(), i_rFixed, i_rFixed.m_Translation, o_pAxes );
}

void VJointFKHardySpicer::ComputeTransform( VRigidTransform& o_rTransform ) const
{
  const double Sa = std::sin( State()[0] ), Ca = std::cos( State()[0] );
  const double Sb = std::sin( State()[1] ), Cb = std::cos( State()[1] );
  const double Rotation[9] = { Ca * Cb, -Sa, Ca * Sb, Sa * Cb, Ca, Sa * Sb, -Sb, 0, Cb };
  std::copy_n( Rotation, 9, o_rTransform.m_Rotation );
}
void VJointFKHardySpicer::NormaliseState( StateIterator& io_rState ) const
{
  Wrap( *io_rState++ );
  Wrap( *io_rState++ );
}
void VJointFKHardySpicer::ComputeAxes( const VRigidTransform& i_rFixed, VJointAxis* o_pAxes ) const
{
  const double Z[3] = { 0, 0, 1 }, TurnedY[3] = { -std::sin( State()[0] ), std::cos( State()[0] ), 0 };
  o_pAxes[0] = TurnAxis( i_rFixed, Z );
  o_pAxes[1] = TurnAxis( i_rFixed, TurnedY );
}

void VJointFKHinge::ComputeTransform( VRigidTransform& o_rTransform ) const
{
  const double S = std::sin( *State() ), C = std::cos( *State() );
  const double Rotation[9] = { C, -S, 0, S, C, 0, 0, 0, 1 };
  std::copy_n( Rotation, 9, o_rTransform.m_Rotation );
}
void VJointFKHinge::NormaliseState( StateIterator& io_rState ) const
{
  Wrap( *io_rState++ );
}
void VJointFKHinge::ComputeAxes( const VRigidTransform& i_rFixed, VJointAxis* o_pAxes ) const
{
  const double Z[3] = { 0, 0, 1 };
  o_pAxes[0] = TurnAxis( i_rFixed, Z );
}

void VJointFKSlider::ComputeTransform( VRigidTransform& o_rTransform ) const
{
  SetIdentity( o_rTransform );
  o_rTransform.m_Translation[0] = o_rTransform.m_Translation[1] = 0;
  o_rTransform.m_Translation[2] = *State();
}
void VJointFKSlider::NormaliseState( StateIterator& io_rState ) const
{
  ++io_rState;
}
void VJointFKSlider::ComputeAxes( const VRigidTransform& i_rFixed, VJointAxis* o_pAxes ) const
{
  o_pAxes[0] = {};
  TakeColumn( i_rFixed.m_Rotation, 2, o_pAxes[0].Linear );
}

void VJointFKDummy::ComputeTransform( VRigidTransform& o_rTransform ) const
{
  SetIdentity( o_rTransform );
}
void VJointFKDummy::NormaliseState( StateIterator& ) const {}
void VJointFKDummy::ComputeAxes( const VRigidTransform&, VJointAxis* ) const {}

void CheckJointRecord( const VJointRecord& i_rRecord, EJointType i_Type )
{
  if ( i_rRecord.m_Type != i_Type )
  {
    throw VConstructionException( "The record is not for this type of joint.", ZEK::IResult::InvalidType );
  }
  for ( const VRigidTransform* pFixed : { &i_rRecord.m_Pre, &i_rRecord.m_Post } )
  {
    if ( !pFixed->IsFinite() )
    {
      throw VConstructionException( "A fixed transform of the joint has numbers that are not finite.",
                                    ZEK::IResult::InvalidValue );
    }
    if ( !pFixed->IsRotation( RotationTolerance ) )
    {
      throw VConstructionException( "A fixed transform of the joint is not a rotation and a translation.",
                                    ZEK::IResult::InvalidValue );
    }
  }
}

const IJointFKFactory& FindJointFactory( EJointType i_Type )
{
  static const VJointFKFactory< VJointFKFree > Free;
  static const VJointFKFactory< VJointFKBall > Ball;
  static const VJointFKFactory< VJointFKHardySpicer > HardySpicer;
  static const VJointFKFactory< VJointFKHinge > Hinge;
  static const VJointFKFactory< VJointFKSlider > Slider;
  static const VJointFKFactory< VJointFKDummy > Dummy;
  static const IJointFKFactory* const Factories[] = { &Free, &Ball, &HardySpicer, &Hinge, &Slider, &Dummy };
  const auto Index = static_cast< std::size_t >( i_Type );
  if ( Index >= std::size( Factories ) )
  {
    throw VConstructionException(
        std::string( "No joint has the type " ).append( std::to_string( Index ) ).append( "." ),
        ZEK::IResult::InvalidType );
  }
  return *Factories[Index];
}

} // namespace ComputeSubject
