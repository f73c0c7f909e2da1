#pragma once

#include <Flow2Graphics/VFlowRenderSubject.h>

#include <array>
#include <memory>
#include <span>
#include <vector>

namespace MoxelGraphics
{
class IRenderType;
class VMoxelScene;
class VRenderSubjectDynamics;
class VRenderSubjectMarkers;
} // namespace MoxelGraphics

namespace Flow2Graphics
{

/// The groups in the order in which they are held.
enum EFlowSubjectGroup : std::uint32_t
{
  EGroupSubject,
  EGroupSolving,
  EGroupRetargeting,
  EGroupRigidObject,
  EGroupProp,
  EGroupSceneMesh,
  EGroupCount
};

/// Feeds everything that is a subject: six groups of data, and what draws them.
///
/// Labels say which reconstructions are markers: those of the frame, and for solving the set of its own where there is
/// one. The first label of a marker counts, and a reconstruction is one marker of a group at most. A frame without
/// reconstructions shows the markers of the models that are visible.
class VFlowRenderSubjects : public IFlowRenderType
{
public:
  /// The scene owns this object.
  explicit VFlowRenderSubjects( MoxelGraphics::VMoxelScene& i_rScene );
  ~VFlowRenderSubjects() override;

  void UpdateFromState( const ZEK::IFlowState& i_rState, const VSubjectChanges& i_rChanges ) override;
  /// What of an update needs no ids; for types that come before this one and need its answers. Done once an update.
  void TakeState( const ZEK::IFlowState& i_rState );

  /// All six groups are made anew in the next update. Thread: any.
  void MarkDirty();
  /// What draws the groups, in the order of drawing; the lines of the centroids come last.
  std::vector< std::shared_ptr< MoxelGraphics::IRenderType > > RenderTypes() const;
  void SetAssignments( std::shared_ptr< MoxelGraphics::IRenderType > i_pAssignments );

  const VFlowRenderSubject& Group( EFlowSubjectGroup i_Group ) const { return *m_Groups[i_Group]; }
  MoxelGraphics::VRenderSubjectMarkers& Markers() { return *m_pMarkers; }
  MoxelGraphics::VRenderSubjectDynamics& Dynamics() { return *m_pDynamics; }

  /// By index in the frame's reconstructions: not 0 where a marker of any group stands.
  std::span< const std::uint8_t > TakenReconstructions() const { return m_Taken; }
  /// Grows when they became others.
  std::uint64_t TakenGeneration() const { return m_TakenGeneration; }

private:
  void TakeSets( const ZEK::IFlowState& i_rState );
  void CollectTaken();

  MoxelGraphics::VMoxelScene& m_rScene;
  std::array< std::unique_ptr< VFlowRenderSubject >, EGroupCount > m_Groups;
  std::shared_ptr< MoxelGraphics::VRenderSubjectMarkers > m_pMarkers;
  std::shared_ptr< MoxelGraphics::VRenderSubjectDynamics > m_pDynamics;
  std::shared_ptr< MoxelGraphics::IRenderType > m_pAssignments;
  ZEK::VFlowItemRef m_Set, m_Labels, m_SolvingSet, m_SolvingLabels;
  VLabelledSet m_Main, m_Solving;
  bool m_bSolvingOwn = false; ///< solving has a set of its own
  std::vector< std::uint8_t > m_Taken, m_Found;
  std::uint64_t m_TakenGeneration = 1;
  bool m_bTaken = false; ///< `TakeState` ran for the update that is on
};

} // namespace Flow2Graphics
