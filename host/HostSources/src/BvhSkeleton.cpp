#include "BvhSkeleton.h"

#include <algorithm>
#include <cmath>
#include <numbers>

namespace HostSources::Bvh
{
namespace
{
using CoreMoxelTypes::Rigid;

/// w, x, y, z.
using VQuaternion = std::array< double, 4 >;

VQuaternion Times( const VQuaternion& i_rA, const VQuaternion& i_rB )
{
  const auto& [Aw, Ax, Ay, Az] = i_rA;
  const auto& [Bw, Bx, By, Bz] = i_rB;
  return { Aw * Bw - Ax * Bx - Ay * By - Az * Bz, Aw * Bx + Ax * Bw + Ay * Bz - Az * By,
           Aw * By - Ax * Bz + Ay * Bw + Az * Bx, Aw * Bz + Ax * By - Ay * Bx + Az * Bw };
}

/// Of a length of at most pi.
VVector RotationVector( const VQuaternion& i_rTurn )
{
  const double Sign = i_rTurn[0] < 0 ? -1 : 1;
  const double Length = std::sqrt( i_rTurn[1] * i_rTurn[1] + i_rTurn[2] * i_rTurn[2] + i_rTurn[3] * i_rTurn[3] );
  const double Factor = Length > 0 ? Sign * 2 * std::atan2( Length, Sign * i_rTurn[0] ) / Length : 0;
  return { i_rTurn[1] * Factor, i_rTurn[2] * Factor, i_rTurn[3] * Factor };
}

bool HasPosition( const VJoint& i_rJoint )
{
  return std::any_of( i_rJoint.Channels.begin(), i_rJoint.Channels.end(),
                      []( EChannel i_Channel )
                      {
                        return i_Channel < EChannel::Xrotation;
                      } );
}

double LengthOf( const VVector& i_rVector )
{
  return std::hypot( i_rVector[0], i_rVector[1], i_rVector[2] );
}

/// Row-major, with the vector's direction as its first column; no turn for a vector that is too short to have one.
Rigid TurnTo( const VVector& i_rVector )
{
  constexpr double Shortest = 1e-6; // mm
  Rigid Turn;
  const double Length = LengthOf( i_rVector );
  if ( !( Length > Shortest ) )
  {
    return Turn;
  }
  const VVector X{ i_rVector[0] / Length, i_rVector[1] / Length, i_rVector[2] / Length };
  // The axis that is least along the bone gives the others.
  std::size_t Least = 0;
  for ( std::size_t Axis = 1; Axis < 3; ++Axis )
  {
    Least = std::abs( X[Axis] ) < std::abs( X[Least] ) ? Axis : Least;
  }
  VVector Helper{};
  Helper[Least] = 1;
  VVector Y{ Helper[1] * X[2] - Helper[2] * X[1], Helper[2] * X[0] - Helper[0] * X[2],
             Helper[0] * X[1] - Helper[1] * X[0] };
  const double Across = LengthOf( Y );
  for ( double& rValue : Y )
  {
    rValue /= Across;
  }
  const VVector Z{ X[1] * Y[2] - X[2] * Y[1], X[2] * Y[0] - X[0] * Y[2], X[0] * Y[1] - X[1] * Y[0] };
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    Turn.R[3 * Row] = X[Row];
    Turn.R[3 * Row + 1] = Y[Row];
    Turn.R[3 * Row + 2] = Z[Row];
  }
  return Turn;
}

/// The turn back, then the shift: what stands between a parent's turned segment and its child's joint.
Rigid Behind( const Rigid& i_rParentTurn, const VVector& i_rShift )
{
  Rigid Result;
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    Result.T[Row] = 0;
    for ( std::size_t Column = 0; Column < 3; ++Column )
    {
      Result.R[3 * Row + Column] = i_rParentTurn.R[3 * Column + Row];
      Result.T[Row] += i_rParentTurn.R[3 * Column + Row] * i_rShift[Column];
    }
  }
  return Result;
}
} // namespace

CoreMoxelTypes::VSubject SubjectOf( const std::vector< VJoint >& i_rJoints )
{
  std::vector< VVector > Bones( i_rJoints.size() );
  std::vector< bool > Known( i_rJoints.size(), false );
  for ( const VJoint& rJoint : i_rJoints )
  {
    const auto Parent = static_cast< std::size_t >( rJoint.Parent );
    if ( rJoint.Parent >= 0 && !Known[Parent] )
    {
      Bones[Parent] = rJoint.Offset;
      Known[Parent] = true;
    }
  }
  CoreMoxelTypes::VSubject Subject;
  for ( std::size_t Index = 0; Index < i_rJoints.size(); ++Index )
  {
    const VJoint& rJoint = i_rJoints[Index];
    const VVector Bone = Known[Index] ? Bones[Index] : rJoint.End.value_or( VVector{} );
    CoreMoxelTypes::VSegment Segment;
    Segment.Name = rJoint.Name;
    Segment.Parent = rJoint.Parent;
    Segment.Joint = HasPosition( rJoint )     ? CoreMoxelTypes::EJointType::Free
                    : rJoint.Channels.empty() ? CoreMoxelTypes::EJointType::Dummy
                                              : CoreMoxelTypes::EJointType::Ball;
    const Rigid ParentTurn =
        rJoint.Parent < 0 ? Rigid{} : Subject.Segments[static_cast< std::size_t >( rJoint.Parent )].Post;
    const bool bFree = Segment.Joint == CoreMoxelTypes::EJointType::Free;
    Segment.Pre = Behind( ParentTurn, bFree ? VVector{} : rJoint.Offset );
    Segment.Post = TurnTo( Bone );
    Segment.BoneLength = static_cast< float >( LengthOf( Bone ) );
    Subject.Segments.push_back( std::move( Segment ) );
  }
  return Subject;
}

void AppendState( const std::vector< VJoint >& i_rJoints, const double* i_pRow, std::vector< double >& io_rStates )
{
  constexpr double HalfDegree = std::numbers::pi / 360;
  for ( const VJoint& rJoint : i_rJoints )
  {
    VQuaternion Turn{ 1, 0, 0, 0 };
    VVector Place = rJoint.Offset;
    for ( const EChannel Channel : rJoint.Channels )
    {
      const auto Number = static_cast< std::size_t >( Channel );
      if ( Number < 3 )
      {
        Place[Number] = *i_pRow++;
        continue;
      }
      const double Angle = *i_pRow++ * HalfDegree;
      VQuaternion Step{ std::cos( Angle ), 0, 0, 0 };
      Step[Number - 2] = std::sin( Angle );
      Turn = Times( Turn, Step );
    }
    if ( rJoint.Channels.empty() )
    {
      continue;
    }
    const VVector Vector = RotationVector( Turn );
    io_rStates.insert( io_rStates.end(), Vector.begin(), Vector.end() );
    if ( HasPosition( rJoint ) )
    {
      io_rStates.insert( io_rStates.end(), Place.begin(), Place.end() );
    }
  }
}

} // namespace HostSources::Bvh
