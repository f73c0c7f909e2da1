#include "RandomTrees.h"

#include "RotationVector.h"

#include <ComputeSubjectFK/Joints.h>

#include <gtest/gtest.h>

#include <limits>
#include <numbers>

using namespace ComputeSubject;

namespace
{
constexpr double Pi = std::numbers::pi;

VRigidTransform Moved( EJointType i_Type, std::vector< double > i_State )
{
  const std::unique_ptr< IJointFK > pJoint =
      FindJointFactory( i_Type ).Create( { i_Type, VRigidTransform::Identity(), VRigidTransform::Identity() } );
  EXPECT_EQ( pJoint->DegreesOfFreedom(), i_State.size() );
  ConstStateIterator It = i_State.cbegin();
  pJoint->LoadState( It );
  EXPECT_EQ( It, i_State.cend() );
  VRigidTransform Result;
  pJoint->ComputeTransform( Result );
  return Result;
}

std::vector< double > Normalised( EJointType i_Type, std::vector< double > i_State )
{
  const std::unique_ptr< IJointFK > pJoint =
      FindJointFactory( i_Type ).Create( { i_Type, VRigidTransform::Identity(), VRigidTransform::Identity() } );
  StateIterator It = i_State.begin();
  pJoint->NormaliseState( It );
  EXPECT_EQ( It, i_State.end() );
  return i_State;
}

void ExpectRotation( const VRigidTransform& i_rSeen, std::array< double, 9 > i_Expected )
{
  for ( std::size_t Index = 0; Index < 9; ++Index )
  {
    EXPECT_NEAR( i_rSeen.m_Rotation[Index], i_Expected[Index], 1e-15 ) << Index;
  }
}
} // namespace

TEST( Joints, MovingPartsAreThoseOfTheirKind )
{
  ExpectRotation( Moved( EJointType::Hinge, { Pi / 2 } ), { 0, -1, 0, 1, 0, 0, 0, 0, 1 } );
  ExpectRotation( Moved( EJointType::HardySpicer, { Pi / 2, Pi / 2 } ), { 0, -1, 0, 0, 0, 1, -1, 0, 0 } );
  ExpectRotation( Moved( EJointType::Ball, { 0, Pi / 2, 0 } ), { 0, 0, 1, 0, 1, 0, -1, 0, 0 } );
  ExpectRotation( Moved( EJointType::Free, { Pi / 2, 0, 0, 4, 5, 6 } ), { 1, 0, 0, 0, 0, -1, 0, 1, 0 } );
  EXPECT_EQ( Moved( EJointType::Ball, { 0, 0, 0 } ), VRigidTransform::Identity() );
  EXPECT_EQ( Moved( EJointType::Dummy, {} ), VRigidTransform::Identity() );
  VRigidTransform Slid = VRigidTransform::Identity();
  Slid.m_Translation[2] = -7;
  EXPECT_EQ( Moved( EJointType::Slider, { -7 } ), Slid );
}

TEST( Joints, TheShortestRotationVectorsDoNotTurn )
{
  const double Below = std::nextafter( LeastRotation, 0.0 );
  EXPECT_EQ( Moved( EJointType::Ball, { 0, Below, 0 } ), VRigidTransform::Identity() );
  EXPECT_EQ( Moved( EJointType::Ball, { 0, LeastRotation, 0 } ).m_Rotation[2], LeastRotation );
}

TEST( Joints, NormalisingKeepsTheRotation )
{
  using V = std::vector< double >;
  EXPECT_NEAR( std::abs( Normalised( EJointType::Hinge, { 3 * Pi } )[0] ), Pi, 1e-15 );
  EXPECT_NEAR( Normalised( EJointType::HardySpicer, { 7, -7 } )[0], 7 - 2 * Pi, 1e-15 );
  EXPECT_NEAR( Normalised( EJointType::HardySpicer, { 7, -7 } )[1], 2 * Pi - 7, 1e-15 );
  EXPECT_EQ( Normalised( EJointType::Slider, { 700 } ), V{ 700 } );
  EXPECT_EQ( Normalised( EJointType::Dummy, {} ), V{} );
  // At most pi stays bit for bit; the next number is turned about to the other side.
  EXPECT_EQ( Normalised( EJointType::Ball, { 0, Pi, 0 } ), ( V{ 0, Pi, 0 } ) );
  const double Above = std::nextafter( Pi, 4.0 );
  EXPECT_NEAR( Normalised( EJointType::Ball, { 0, Above, 0 } )[1], Above - 2 * Pi, 1e-15 );
  EXPECT_NEAR( Normalised( EJointType::Ball, { 2 * Pi, 0, 0 } )[0], 0, 1e-15 );
  const V Free = Normalised( EJointType::Free, { 0, 0, -5, 40, 50, 60 } );
  EXPECT_NEAR( Free[2], 2 * Pi - 5, 1e-15 );
  EXPECT_EQ( ( V{ Free[3], Free[4], Free[5] } ), ( V{ 40, 50, 60 } ) );
  VRandom Random( 2 );
  for ( int Round = 0; Round < 200; ++Round )
  {
    const V Before{ Random.In( -20, 20 ), Random.In( -20, 20 ), Random.In( -20, 20 ) };
    const V After = Normalised( EJointType::Ball, Before );
    EXPECT_LE( std::hypot( After[0], After[1], After[2] ), Pi );
    EXPECT_LE( LargestDifference( MatrixOf( Moved( EJointType::Ball, Before ) ),
                                  MatrixOf( Moved( EJointType::Ball, After ) ) ),
               1e-12 );
  }
  EXPECT_TRUE( std::isnan( Normalised( EJointType::Ball, { NAN, 0, 0 } )[0] ) );
}

TEST( Joints, LogarithmUndoesTheRotationUpToHalfATurn )
{
  VRandom Random( 3 );
  for ( const double Length : { 0.0, 1e-12, 1e-5, 0.5, 2.0, 3.0, Pi - 1e-6, Pi - 1e-9, Pi } )
  {
    for ( int Round = 0; Round < 40; ++Round )
    {
      double Vector[3] = { Random.In( -1, 1 ), Random.In( -1, 1 ), Random.In( -1, 1 ) };
      const double Scale = Length / std::hypot( Vector[0], Vector[1], Vector[2] );
      for ( double& rValue : Vector )
      {
        rValue *= Scale;
      }
      double Rotation[9], Back[3], Again[9];
      RotationFromVector( Vector, Rotation );
      VectorFromRotation( Rotation, Back );
      RotationFromVector( Back, Again );
      EXPECT_LE( std::hypot( Back[0], Back[1], Back[2] ), Pi * ( 1 + 1e-15 ) );
      for ( std::size_t Index = 0; Index < 9; ++Index )
      {
        EXPECT_NEAR( Again[Index], Rotation[Index], 4e-15 ) << "length " << Length;
      }
      for ( std::size_t Axis = 0; Axis < 3 && Length < 3; ++Axis )
      {
        EXPECT_NEAR( Back[Axis], Vector[Axis], 1e-15 + 1e-14 * Length ) << "length " << Length;
      }
    }
  }
}

TEST( Joints, AFactoryMakesItsOwnKindOnly )
{
  EXPECT_THROW( VJointFKFactory< VJointFKHinge >().Create( {} ), VConstructionException ) << "a record of a Dummy";
}
