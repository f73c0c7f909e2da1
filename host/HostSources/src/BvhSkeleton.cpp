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

/// Which joint's shift each joint's own bone follows; -1 where no joint below is away from it.
std::vector< std::int32_t > BoneEnds( const std::vector< VJoint >& i_rJoints )
{
  std::vector< std::int32_t > Ends( i_rJoints.size(), -1 );
  for ( std::size_t Index = 0; Index < i_rJoints.size(); ++Index )
  {
    const VJoint& rJoint = i_rJoints[Index];
    if ( rJoint.Parent >= 0 && LengthOf( rJoint.Offset ) > ShortestBone )
    {
      std::int32_t& rEnd = Ends[static_cast< std::size_t >( rJoint.Parent )];
      rEnd = rEnd < 0 ? static_cast< std::int32_t >( Index ) : rEnd;
    }
  }
  return Ends;
}

/// The bones to joints that are not at the end of their parent's own one.
void AddFurtherBones( const std::vector< VJoint >& i_rJoints, const std::vector< std::int32_t >& i_rEnds,
                      CoreMoxelTypes::VSubject& io_rSubject )
{
  for ( std::size_t Index = 0; Index < i_rJoints.size(); ++Index )
  {
    const VJoint& rJoint = i_rJoints[Index];
    const double Length = LengthOf( rJoint.Offset );
    if ( rJoint.Parent < 0 || !( Length > ShortestBone ) ||
         i_rEnds[static_cast< std::size_t >( rJoint.Parent )] == static_cast< std::int32_t >( Index ) )
    {
      continue;
    }
    const CoreMoxelTypes::VSegment& rParent = io_rSubject.Segments[static_cast< std::size_t >( rJoint.Parent )];
    CoreMoxelTypes::VSegment Bone;
    Bone.Name = std::string( rParent.Name ).append( " to " ).append( rJoint.Name );
    Bone.Parent = rJoint.Parent;
    Bone.Joint = CoreMoxelTypes::EJointType::Dummy;
    Bone.Pre = Inverse( rParent.Post ) * TurnTo( rJoint.Offset );
    Bone.BoneLength = static_cast< float >( Length );
    io_rSubject.Segments.push_back( std::move( Bone ) );
  }
}

} // namespace

CoreMoxelTypes::VSubject SubjectOf( const std::vector< VJoint >& i_rJoints )
{
  const std::vector< std::int32_t > Ends = BoneEnds( i_rJoints );
  CoreMoxelTypes::VSubject Subject;
  for ( std::size_t Index = 0; Index < i_rJoints.size(); ++Index )
  {
    const VJoint& rJoint = i_rJoints[Index];
    const VVector Bone = Ends[Index] < 0 ? rJoint.End.value_or( VVector{} )
                                         : i_rJoints[static_cast< std::size_t >( Ends[Index] )].Offset;
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
  AddFurtherBones( i_rJoints, Ends, Subject );
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
