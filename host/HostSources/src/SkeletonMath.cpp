#include "SkeletonMath.h"

#include "UpAxis.h"

#include <ComputeSubjectFK/VComputeSubjectFK.h>

#include <cmath>

namespace HostSources
{
using CoreMoxelTypes::Rigid;

VQuaternion operator*( const VQuaternion& i_rA, const VQuaternion& i_rB )
{
  const auto& [Aw, Ax, Ay, Az] = i_rA;
  const auto& [Bw, Bx, By, Bz] = i_rB;
  return { Aw * Bw - Ax * Bx - Ay * By - Az * Bz, Aw * Bx + Ax * Bw + Ay * Bz - Az * By,
           Aw * By - Ax * Bz + Ay * Bw + Az * Bx, Aw * Bz + Ax * By - Ay * Bx + Az * Bw };
}

VQuaternion TurnAbout( const VVector& i_rAxis, double i_Angle )
{
  const double Sine = std::sin( i_Angle / 2 );
  return { std::cos( i_Angle / 2 ), i_rAxis[0] * Sine, i_rAxis[1] * Sine, i_rAxis[2] * Sine };
}

VVector RotationVector( const VQuaternion& i_rTurn )
{
  const double Sign = i_rTurn[0] < 0 ? -1 : 1;
  const double Length = std::sqrt( i_rTurn[1] * i_rTurn[1] + i_rTurn[2] * i_rTurn[2] + i_rTurn[3] * i_rTurn[3] );
  const double Factor = Length > 0 ? Sign * 2 * std::atan2( Length, Sign * i_rTurn[0] ) / Length : 0;
  return { i_rTurn[1] * Factor, i_rTurn[2] * Factor, i_rTurn[3] * Factor };
}

Rigid RigidOf( const VQuaternion& i_rTurn, const VVector& i_rShift )
{
  const auto& [w, x, y, z] = i_rTurn;
  return { { 1 - 2 * ( y * y + z * z ), 2 * ( x * y - w * z ), 2 * ( x * z + w * y ), 2 * ( x * y + w * z ),
             1 - 2 * ( x * x + z * z ), 2 * ( y * z - w * x ), 2 * ( x * z - w * y ), 2 * ( y * z + w * x ),
             1 - 2 * ( x * x + y * y ) },
           { i_rShift[0], i_rShift[1], i_rShift[2] } };
}

Rigid operator*( const Rigid& i_rA, const Rigid& i_rB )
{
  return ( ComputeSubject::VRigidTransform::From( i_rA ) * ComputeSubject::VRigidTransform::From( i_rB ) ).ToRigid();
}

Rigid Inverse( const Rigid& i_rRigid )
{
  Rigid Result;
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    Result.T[Row] = 0;
    for ( std::size_t Column = 0; Column < 3; ++Column )
    {
      Result.R[3 * Row + Column] = i_rRigid.R[3 * Column + Row];
      Result.T[Row] -= i_rRigid.R[3 * Column + Row] * i_rRigid.T[Column];
    }
  }
  return Result;
}

double LengthOf( const VVector& i_rVector )
{
  return std::hypot( i_rVector[0], i_rVector[1], i_rVector[2] );
}

Rigid TurnTo( const VVector& i_rVector )
{
  Rigid Turn;
  const double Length = LengthOf( i_rVector );
  if ( !( Length > ShortestBone ) )
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

bool HasRoomForPoses( std::size_t i_Poses, std::size_t i_StateSize, std::size_t i_TextSize, std::string& o_rMessage )
{
  constexpr double Mebibyte = 1024.0 * 1024.0, MostPerByte = 16, LeastMost = 64 * Mebibyte;
  const double Needed = static_cast< double >( i_Poses ) * static_cast< double >( i_StateSize ) * sizeof( double );
  if ( Needed <= MostPerByte * static_cast< double >( i_TextSize ) + LeastMost )
  {
    return true;
  }
  o_rMessage = std::string( "expected poses in proportion to the file, found some that need " )
                   .append( std::to_string( static_cast< std::uint64_t >( Needed / Mebibyte ) ) )
                   .append( " MiB of memory" );
  return false;
}

void AddToBounds( const VRecordingSkeleton& i_rSkeleton, VRecording& io_rRecording )
{
  constexpr std::size_t MostPoses = 4'000'000;
  std::string Message;
  std::unique_ptr< ComputeSubject::VComputeSubjectFK > pSubject;
  if ( ComputeSubject::VComputeSubjectFK::Build( i_rSkeleton.Subject, pSubject, Message ).IsError() )
  {
    io_rRecording.Notes.push_back( std::move( Message ) );
    return;
  }
  const auto Frames = static_cast< std::size_t >( io_rRecording.FrameCount );
  const std::size_t Stride = 1 + Frames * i_rSkeleton.Subject.Segments.size() / MostPoses;
  for ( std::size_t Frame = 0; Frame < Frames; Frame += Stride )
  {
    if ( pSubject->LoadState( i_rSkeleton.State( static_cast< std::int64_t >( Frame ) ) ).IsError() )
    {
      return;
    }
    for ( const ComputeSubject::VRigidTransform& rPose : pSubject->WorldTransforms() )
    {
      const double* T = rPose.m_Translation;
      const VRecordingPoint Point{ static_cast< float >( T[0] ), static_cast< float >( T[1] ),
                                   static_cast< float >( T[2] ), 0 };
      AddToBounds( io_rRecording.Bounds, { &Point, 1 } );
    }
  }
}

} // namespace HostSources
