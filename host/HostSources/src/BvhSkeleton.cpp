#include "BvhSkeleton.h"

#include <algorithm>
#include <numbers>

namespace HostSources::Bvh
{
namespace
{
using CoreMoxelTypes::Rigid;

bool HasPosition( const VJoint& i_rJoint )
{
  return std::any_of( i_rJoint.Channels.begin(), i_rJoint.Channels.end(),
                      []( EChannel i_Channel )
                      {
                        return i_Channel < EChannel::Xrotation;
                      } );
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
    // Back from the parent's turned segment, then the shift, so that a state of zeros is the figure as it is drawn up.
    Segment.Pre = Inverse( ParentTurn ) * RigidOf( { 1, 0, 0, 0 }, rJoint.Offset );
    Segment.Post = TurnTo( Bone );
    Segment.BoneLength = static_cast< float >( LengthOf( Bone ) );
    Subject.Segments.push_back( std::move( Segment ) );
  }
  return Subject;
}

void AppendState( const std::vector< VJoint >& i_rJoints, const double* i_pRow, std::vector< double >& io_rStates )
{
  constexpr double Degree = std::numbers::pi / 180;
  for ( const VJoint& rJoint : i_rJoints )
  {
    VQuaternion Turn{ 1, 0, 0, 0 };
    VVector Shift{};
    for ( const EChannel Channel : rJoint.Channels )
    {
      const auto Number = static_cast< std::size_t >( Channel );
      if ( Number < 3 )
      {
        Shift[Number] = *i_pRow++ - rJoint.Offset[Number];
        continue;
      }
      VVector Axis{};
      Axis[Number - 3] = 1;
      Turn = Turn * TurnAbout( Axis, *i_pRow++ * Degree );
    }
    if ( rJoint.Channels.empty() )
    {
      continue;
    }
    const VVector Vector = RotationVector( Turn );
    io_rStates.insert( io_rStates.end(), Vector.begin(), Vector.end() );
    if ( HasPosition( rJoint ) )
    {
      io_rStates.insert( io_rStates.end(), Shift.begin(), Shift.end() );
    }
  }
}

} // namespace HostSources::Bvh
