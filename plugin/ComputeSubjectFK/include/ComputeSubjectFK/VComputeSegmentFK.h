#pragma once

#include <ComputeSubjectFK/IJointFK.h>

namespace ComputeSubject
{

/// A bone: its joint and where that puts it. Alone it works its transforms out as its state is loaded; in a subject it
/// is a view of the subject's arrays. With W the world pose, M = W(parent) Pre, J the moving part: W = M J Post.
class VComputeSegmentFK
{
public:
  /// A null parent makes a root.
  VComputeSegmentFK( std::shared_ptr< const VComputeSegmentFK > i_pParent, std::unique_ptr< IJointFK > i_pJoint );

  /// Takes the joint's numbers, moves on behind them and works the transforms out from the parent's.
  void LoadState( ConstStateIterator& io_rState );
  /// 1 for a root.
  std::size_t TreeDepth() const { return m_Depth; }
  const IJointFK& Joint() const { return *m_pJoint; }
  const std::shared_ptr< const VComputeSegmentFK >& Parent() const { return m_pParent; }
  VRigidTransform FixedTransform() const;   ///< M, from where the parent is now
  VRigidTransform JointTransform() const;   ///< J
  const VRigidTransform& Transform() const; ///< M J
  VRigidTransform WorldTransform() const;   ///< M J Post
  /// A copy that hangs on `i_pParent`, which is null or the copy of the parent, with a state of its own.
  std::shared_ptr< VComputeSegmentFK > CloneOn( std::shared_ptr< const VComputeSegmentFK > i_pParent ) const;
  /// From now on state and result are what stands there. Both belong to the caller and must stay.
  void View( const double* i_pState, const VRigidTransform* i_pResult );

private:
  std::shared_ptr< const VComputeSegmentFK > m_pParent;
  std::size_t m_Depth = 1;
  std::unique_ptr< IJointFK > m_pJoint;
  VRigidTransform m_Result;
  const VRigidTransform* m_pViewed = nullptr;
};

} // namespace ComputeSubject
