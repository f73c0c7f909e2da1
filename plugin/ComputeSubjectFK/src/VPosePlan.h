#pragma once

#include "PoseData.h"

#include <ComputeSubjectFK/IJointFK.h>

#include <vector>

namespace ComputeSubject
{

/// A tree of joints as flat arrays by kind, grown a segment at a time.
class VPosePlan
{
public:
  /// `i_Parent` is -1 for a root, `i_State` the place of the joint's first number, `i_rFixed` Post(parent) Pre.
  void Append( EJointType i_Type, std::int32_t i_Parent, std::uint32_t i_State, const VRigidTransform& i_rFixed,
               const VRigidTransform& i_rPost );
  bool HasPosts() const { return !m_Posts.empty(); }
  /// Results of all segments, without their Post.
  void Pose( const double* i_pState, VRigidTransform* o_pResults ) const;
  /// From results to poses in the world; in place is fine.
  void ApplyPosts( const VRigidTransform* i_pResults, VRigidTransform* o_pWorlds ) const;

  VPoseTree Tree() const;

private:
  struct VPost
  {
    std::size_t Segment;
    VRigidTransform Transform;
  };
  std::vector< VPoseBlock > m_Blocks[EPoseKinds];
  std::size_t m_Counts[EPoseKinds] = {};
  std::vector< VPoseStill > m_Stills;
  std::vector< std::int32_t > m_Parents;
  std::vector< VPost > m_Posts;
};

/// The loops for this processor.
VPoseFunction BestPose();
bool HasAvx2();

} // namespace ComputeSubject
