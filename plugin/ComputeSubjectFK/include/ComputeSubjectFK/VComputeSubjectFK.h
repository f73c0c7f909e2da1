#pragma once

#include <ComputeSubjectFK/ITargetFK.h>
#include <ComputeSubjectFK/VComputeSegmentFK.h>
#include <CoreMoxelTypes/Subject.h>

#include <array>
#include <span>

namespace ComputeSubject
{
class VPosePlan;

/// The bones of a subject, from its joint state to their poses in the world. Lengths in mm, angles in rad.
///
/// The state is the numbers of all joints in the order of the segments, which stand parent first. Poses are worked out
/// over flat arrays by joint kind; segments and joints are views of them. Thread: one at a time, as a container; `Pose`
/// and all that is const from several.
class VComputeSubjectFK
{
public:
  static constexpr std::size_t NoParent = ~std::size_t( 0 );

  VComputeSubjectFK();
  ~VComputeSubjectFK();
  VComputeSubjectFK( const VComputeSubjectFK& ) = delete;
  VComputeSubjectFK& operator=( const VComputeSubjectFK& ) = delete;

  /// Through the factories, with a target on a point for each marker that has a segment; the target's `MarkerIdx` is
  /// the place of the marker. Throws `VConstructionException`; see `AddSegment` and the factories.
  static std::unique_ptr< VComputeSubjectFK > Build( const CoreMoxelTypes::VSubject& i_rSubject );
  /// The same, with the failure as a code and a sentence; then `o_rpSubject` is null.
  static ZEK::IResult Build( const CoreMoxelTypes::VSubject& i_rSubject,
                             std::unique_ptr< VComputeSubjectFK >& o_rpSubject, std::string& o_rMessage );

  /// The new segment's index. Its state is zeros. `NoParent` makes a root. Throws `VConstructionException` for a joint
  /// that no factory serves and for a parent that is not there yet (`InvalidIndex`); then nothing has changed.
  std::size_t AddSegment( std::size_t i_Parent, const VJointRecord& i_rJoint );
  /// Throws `VConstructionException` (`InvalidIndex`) for a segment that is not there, (`InvalidPointer`) for null.
  void AddTarget( std::unique_ptr< ITargetFK > i_pTarget );

  std::size_t SegmentCount() const { return m_SegmentTree.size(); }
  std::size_t TargetCount() const { return m_Targets.size(); }
  std::size_t StateSize() const { return m_State.size(); }
  const VComputeSegmentFK& Segment( std::size_t i_Index ) const { return *m_SegmentTree[i_Index]; }
  /// `NoParent` for a root.
  std::size_t ParentOf( std::size_t i_Index ) const { return m_Parents[i_Index]; }
  /// The place in the state of the first number of a segment's joint.
  std::size_t FirstDegree( std::size_t i_Index ) const { return m_FirstDegrees[i_Index]; }
  ITargetFK& Target( std::size_t i_Index ) { return *m_Targets[i_Index]; }
  const ITargetFK& Target( std::size_t i_Index ) const { return *m_Targets[i_Index]; }

  /// Takes a state and works the poses out. `InvalidArgument` and no change unless it has `StateSize` numbers;
  /// `OkButPartial` when some are not finite: then neither is what hangs on their joints.
  ZEK::IResult LoadState( std::span< const double > i_State );
  const std::vector< double >& State() const { return m_State; }
  /// Through the joints, one after the other.
  void CopyState( std::vector< double >& o_rState ) const;
  /// `InvalidArgument` and no change unless it has `StateSize` numbers.
  ZEK::IResult NormaliseState( std::vector< double >& io_rState ) const;
  /// Poses in the world, by segment.
  std::span< const VRigidTransform > WorldTransforms() const { return m_bPosts ? m_Worlds : m_Results; }
  /// World poses of many states, which stand one behind the other, without taking any of them. `InvalidArgument` and
  /// nothing written unless there are `i_Count` states and places for as many times `SegmentCount` poses.
  ZEK::IResult Pose( std::span< const double > i_States, std::size_t i_Count,
                     std::span< VRigidTransform > o_Poses ) const;

  /// Writes where the point targets are now, each at its `MarkerIdx`. Those whose index is past the end are left out,
  /// and the result is then `OkButPartial`.
  ZEK::IResult Positions( std::vector< std::array< double, 3 > >& io_rPositions ) const;
  std::size_t ResidualCount() const { return m_ResidualCount; }
  /// The rows of all targets in their order.
  void Residuals( std::vector< double >& o_rResiduals ) const;
  /// Row-major, `ResidualCount` by `StateSize`.
  void Jacobian( std::vector< double >& o_rRowMajor ) const;

  /// An independent copy: segments, targets and state.
  std::unique_ptr< VComputeSubjectFK > Clone() const;

private:
  void Append( std::size_t i_Parent, std::shared_ptr< VComputeSegmentFK > i_pSegment );

  std::vector< std::shared_ptr< VComputeSegmentFK > > m_SegmentTree;
  std::vector< std::unique_ptr< ITargetFK > > m_Targets;
  std::vector< std::size_t > m_Parents, m_FirstDegrees;
  std::vector< double > m_State;
  std::vector< VRigidTransform > m_Results, m_Worlds;
  std::unique_ptr< VPosePlan > m_pPlan;
  const double* m_pViewedState = nullptr;
  const VRigidTransform* m_pViewedResults = nullptr;
  std::size_t m_ResidualCount = 0;
  bool m_bPosts = false;
};

} // namespace ComputeSubject
