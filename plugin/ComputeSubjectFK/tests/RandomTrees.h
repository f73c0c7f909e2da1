#pragma once

#include <ComputeSubjectFK/VComputeSubjectFK.h>

#include <array>
#include <cmath>
#include <random>

// Random trees, and their poses by another way: products of 4 by 4 matrices with turns from quaternions.
namespace ComputeSubject
{

using VMatrix = std::array< double, 16 >;
inline constexpr VMatrix Unit{ 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1 };

inline VMatrix Times( const VMatrix& i_rA, const VMatrix& i_rB )
{
  VMatrix Product{};
  for ( std::size_t Index = 0; Index < 64; ++Index )
  {
    Product[Index / 16 * 4 + Index % 4] += i_rA[Index / 16 * 4 + Index / 4 % 4] * i_rB[Index / 4 % 4 * 4 + Index % 4];
  }
  return Product;
}

inline VMatrix MatrixOf( const VRigidTransform& i_rTransform )
{
  const double *R = i_rTransform.m_Rotation, *T = i_rTransform.m_Translation;
  return { R[0], R[1], R[2], T[0], R[3], R[4], R[5], T[1], R[6], R[7], R[8], T[2], 0, 0, 0, 1 };
}

inline VMatrix Shift( double i_X, double i_Y, double i_Z )
{
  return { 1, 0, 0, i_X, 0, 1, 0, i_Y, 0, 0, 1, i_Z, 0, 0, 0, 1 };
}

/// About the direction of the vector by its length.
inline VMatrix TurnBy( double i_X, double i_Y, double i_Z )
{
  const double N = std::hypot( i_X, i_Y, i_Z ), S = N > 0 ? std::sin( N / 2 ) / N : 0.5, W = std::cos( N / 2 );
  const double X = i_X * S, Y = i_Y * S, Z = i_Z * S;
  return { 1 - 2 * ( Y * Y + Z * Z ),
           2 * ( X * Y - W * Z ),
           2 * ( X * Z + W * Y ),
           0,
           2 * ( X * Y + W * Z ),
           1 - 2 * ( X * X + Z * Z ),
           2 * ( Y * Z - W * X ),
           0,
           2 * ( X * Z - W * Y ),
           2 * ( Y * Z + W * X ),
           1 - 2 * ( X * X + Y * Y ),
           0,
           0,
           0,
           0,
           1 };
}

inline VMatrix MovingPart( EJointType i_Type, const double* q )
{
  switch ( i_Type )
  {
  case EJointType::Free:
    return Times( Shift( q[3], q[4], q[5] ), TurnBy( q[0], q[1], q[2] ) );
  case EJointType::Ball:
    return TurnBy( q[0], q[1], q[2] );
  case EJointType::HardySpicer:
    return Times( TurnBy( 0, 0, q[0] ), TurnBy( 0, q[1], 0 ) );
  case EJointType::Hinge:
    return TurnBy( 0, 0, q[0] );
  case EJointType::Slider:
    return Shift( 0, 0, q[0] );
  default:
    return Unit;
  }
}

inline double LargestDifference( const VMatrix& i_rA, const VMatrix& i_rB )
{
  double Largest = 0;
  for ( std::size_t Index = 0; Index < 16; ++Index )
  {
    const double Difference = std::abs( i_rA[Index] - i_rB[Index] );
    Largest = Difference <= Largest ? Largest : Difference; // what is no number counts as large
  }
  return Largest;
}

class VRandom
{
public:
  explicit VRandom( std::uint32_t i_Seed )
    : m_Random( i_Seed )
  {
  }
  double In( double i_Low, double i_High ) { return std::uniform_real_distribution( i_Low, i_High )( m_Random ); }
  std::size_t Below( std::size_t i_End )
  {
    return std::uniform_int_distribution< std::size_t >( 0, i_End - 1 )( m_Random );
  }
  VRigidTransform Rigid( double i_Reach )
  {
    const VMatrix Turn = TurnBy( In( -2, 2 ), In( -2, 2 ), In( -2, 2 ) );
    VRigidTransform Result;
    for ( std::size_t Index = 0; Index < 9; ++Index )
    {
      Result.m_Rotation[Index] = Turn[Index / 3 * 4 + Index % 3];
    }
    for ( double& rValue : Result.m_Translation )
    {
      rValue = In( -i_Reach, i_Reach );
    }
    return Result;
  }

private:
  std::mt19937 m_Random;
};

struct VRandomTree
{
  std::vector< VJointRecord > Joints;
  std::vector< std::size_t > Parents;
  VComputeSubjectFK Subject;

  /// Joints of all kinds in turn or of random ones; lengths of about a metre in all.
  VRandomTree( VRandom& io_rRandom, std::size_t i_Segments, bool i_bPosts )
  {
    const double Reach = 100;
    for ( std::size_t Index = 0; Index < i_Segments; ++Index )
    {
      VJointRecord Joint;
      Joint.m_Type = static_cast< EJointType >( Index < 6 ? Index : io_rRandom.Below( 6 ) );
      Joint.m_Pre = io_rRandom.Rigid( Reach );
      if ( i_bPosts && Index % 3 != 0 )
      {
        Joint.m_Post = io_rRandom.Rigid( Reach );
      }
      // One tree, of a few long branches.
      Parents.push_back( Index == 0 ? VComputeSubjectFK::NoParent
                                    : Index - 1 - io_rRandom.Below( std::min< std::size_t >( Index, 4 ) ) );
      Joints.push_back( Joint );
      Subject.AddSegment( Parents.back(), Joint );
    }
  }

  /// Turns of a length up to `i_Turn`, a few of them none at all.
  std::vector< double > RandomState( VRandom& io_rRandom, double i_Turn ) const
  {
    std::vector< double > State( Subject.StateSize() );
    for ( double& rValue : State )
    {
      rValue = io_rRandom.In( -i_Turn, i_Turn ) / std::sqrt( 3.0 );
    }
    for ( std::size_t Index = 0; Index < Joints.size(); ++Index )
    {
      const IJointFK& rJoint = Subject.Segment( Index ).Joint();
      if ( io_rRandom.Below( 5 ) == 0 )
      {
        std::fill_n( State.begin() + static_cast< std::ptrdiff_t >( Subject.FirstDegree( Index ) ),
                     rJoint.DegreesOfFreedom(), 0.0 );
      }
    }
    return State;
  }

  /// By segment.
  std::vector< VMatrix > Worlds( const std::vector< double >& i_rState,
                                 std::vector< VMatrix >* o_pResults = nullptr ) const
  {
    std::vector< VMatrix > Worlds;
    for ( std::size_t Index = 0; Index < Joints.size(); ++Index )
    {
      const VMatrix Parent = Parents[Index] == VComputeSubjectFK::NoParent ? Unit : Worlds[Parents[Index]];
      const VMatrix Moving = MovingPart( Joints[Index].m_Type, i_rState.data() + Subject.FirstDegree( Index ) );
      const VMatrix Result = Times( Times( Parent, MatrixOf( Joints[Index].m_Pre ) ), Moving );
      Worlds.push_back( Times( Result, MatrixOf( Joints[Index].m_Post ) ) );
      if ( o_pResults )
      {
        o_pResults->push_back( Result );
      }
    }
    return Worlds;
  }
};

} // namespace ComputeSubject
