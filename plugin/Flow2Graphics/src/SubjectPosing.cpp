#include "SubjectPosing.h"

#include <ComputeSubjectFK/VComputeSubjectFK.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <memory>
#include <span>

namespace Flow2Graphics
{
namespace
{
using ComputeSubject::VComputeSubjectFK;
using ComputeSubject::VRigidTransform;

constexpr double NotThere = std::numeric_limits< double >::quiet_NaN();
constexpr double DeepBelowTheFloor = 100; // mm; less is how feet stand in a recording
constexpr double LongestReach = 1e5;      // mm

struct VStanding
{
  std::unique_ptr< VComputeSubjectFK > pSubject;
  std::vector< std::array< double, 3 > > Markers;
  VSubjectPlace Root;
};

bool AllFinite( std::span< const double > i_Numbers )
{
  return std::all_of( i_Numbers.begin(), i_Numbers.end(),
                      []( double i_Number )
                      {
                        return std::isfinite( i_Number );
                      } );
}

/// Where the bone ends that starts at the transform.
std::array< double, 3 > EndOf( const VRigidTransform& i_rBone, float i_Length )
{
  const double Along[3] = { static_cast< double >( i_Length ), 0, 0 };
  std::array< double, 3 > End{};
  i_rBone.Place( Along, End.data() );
  return End;
}

bool Build( const CoreMoxelTypes::VSubjectParametrised& i_rSubject, VStanding& o_rStanding, std::string& o_rMessage )
{
  return VComputeSubjectFK::Build( i_rSubject.Base, o_rStanding.pSubject, o_rMessage ).IsOk();
}

void Stand( const CoreMoxelTypes::VSubjectParametrised& i_rSubject, std::span< const double > i_State,
            VStanding& io_rStanding )
{
  VComputeSubjectFK& rSubject = *io_rStanding.pSubject;
  (void)rSubject.LoadState( i_State );
  io_rStanding.Markers.assign( i_rSubject.Base.Markers.size(), { NotThere, NotThere, NotThere } );
  (void)rSubject.Positions( io_rStanding.Markers );
  if ( rSubject.SegmentCount() != 0 )
  {
    const double* const pRoot = rSubject.WorldTransforms().front().m_Translation;
    io_rStanding.Root = { pRoot[0], pRoot[1] };
  }
}

/// The pose that was asked for, else the neutral one.
std::vector< double > StateOf( const CoreMoxelTypes::VSubjectParametrised& i_rSubject, std::int32_t i_Pose,
                               std::size_t i_Size, std::string& o_rMessage )
{
  if ( i_Pose < 0 || static_cast< std::size_t >( i_Pose ) >= i_rSubject.Poses.size() )
  {
    return std::vector< double >( i_Size );
  }
  const std::vector< double >& rPose = i_rSubject.Poses[static_cast< std::size_t >( i_Pose )];
  if ( rPose.size() == i_Size && AllFinite( rPose ) )
  {
    return rPose;
  }
  const std::string Fault = rPose.size() == i_Size ? std::string( "has numbers that are not finite" )
                                                   : std::string( "has " )
                                                         .append( std::to_string( rPose.size() ) )
                                                         .append( " numbers, its joints need " )
                                                         .append( std::to_string( i_Size ) );
  o_rMessage = std::string( "Pose " ).append( std::to_string( i_Pose ) ).append( " of subject \"" );
  o_rMessage.append( i_rSubject.Base.Name ).append( "\" " ).append( Fault ).append( "; the neutral one is shown." );
  return std::vector< double >( i_Size );
}

double LiftOf( const CoreMoxelTypes::VSubject& i_rStructure, const VStanding& i_rStanding )
{
  double Lowest = std::numeric_limits< double >::infinity();
  const auto Bones = i_rStanding.pSubject->WorldTransforms();
  for ( std::size_t Index = 0; Index < Bones.size(); ++Index )
  {
    const double End = EndOf( Bones[Index], i_rStructure.Segments[Index].BoneLength )[2];
    Lowest = std::fmin( Lowest, std::fmin( Bones[Index].m_Translation[2], End ) );
  }
  return std::isfinite( Lowest ) && Lowest < -DeepBelowTheFloor ? -Lowest : 0;
}

/// From where the pose has the subject to where it is to stand.
VRigidTransform MoveTo( const VStanding& i_rStanding, const VSubjectPlace& i_rPlace, double i_Lift, bool i_bYUp )
{
  VRigidTransform Move = VRigidTransform::Identity();
  Move.m_Translation[0] = i_rPlace.X - i_rStanding.Root.X;
  Move.m_Translation[1] = i_rPlace.Y - i_rStanding.Root.Y;
  Move.m_Translation[2] = i_Lift;
  if ( !i_bYUp )
  {
    return Move;
  }
  VRigidTransform Turn; // by -90 degrees about x
  Turn.m_Rotation[0] = 1;
  Turn.m_Rotation[5] = 1;
  Turn.m_Rotation[7] = -1;
  return Turn * Move;
}
} // namespace

bool PoseSubject( const CoreMoxelTypes::VSubjectParametrised& i_rSubject, std::int32_t i_Pose,
                  const VSubjectPlace& i_rPlace, bool i_bYUp, CoreMoxelTypes::VSubjectDynamicParameters& o_rPosed,
                  std::string& o_rMessage )
{
  o_rMessage.clear();
  VStanding Standing;
  if ( !Build( i_rSubject, Standing, o_rMessage ) )
  {
    return false;
  }
  o_rPosed.JointState = StateOf( i_rSubject, i_Pose, Standing.pSubject->StateSize(), o_rMessage );
  Stand( i_rSubject, o_rPosed.JointState, Standing );
  const VRigidTransform Move = MoveTo( Standing, i_rPlace, LiftOf( i_rSubject.Base, Standing ), i_bYUp );
  o_rPosed.Segments.clear();
  for ( const VRigidTransform& rBone : Standing.pSubject->WorldTransforms() )
  {
    o_rPosed.Segments.push_back( ( Move * rBone ).ToRigid() );
  }
  o_rPosed.SegmentHealth.assign( o_rPosed.Segments.size(), 1 );
  o_rPosed.MarkerPositions.clear();
  for ( const std::array< double, 3 >& rMarker : Standing.Markers )
  {
    double World[3];
    Move.Place( rMarker.data(), World );
    o_rPosed.MarkerPositions.push_back( { World[0], World[1], World[2] } );
  }
  o_rPosed.MarkerVisible.assign( o_rPosed.MarkerPositions.size(), 1 );
  return true;
}

double NeutralReach( const CoreMoxelTypes::VSubjectParametrised& i_rSubject )
{
  VStanding Standing;
  std::string Ignored;
  if ( !Build( i_rSubject, Standing, Ignored ) )
  {
    return -1;
  }
  Stand( i_rSubject, std::vector< double >( Standing.pSubject->StateSize() ), Standing );
  double Reach = 0;
  const auto Add = [&]( const double* i_pPoint )
  {
    const double Own = std::max( std::abs( i_pPoint[0] - Standing.Root.X ), std::abs( i_pPoint[1] - Standing.Root.Y ) );
    Reach = std::isfinite( Own ) ? std::max( Reach, Own ) : Reach;
  };
  const auto Bones = Standing.pSubject->WorldTransforms();
  for ( std::size_t Index = 0; Index < Bones.size(); ++Index )
  {
    Add( Bones[Index].m_Translation );
    Add( EndOf( Bones[Index], i_rSubject.Base.Segments[Index].BoneLength ).data() );
  }
  for ( const std::array< double, 3 >& rMarker : Standing.Markers )
  {
    Add( rMarker.data() );
  }
  return std::min( Reach, LongestReach );
}

} // namespace Flow2Graphics
