#pragma once

#include <Flow2Graphics/VFlowSubjectSceneArrangement.h>

#include <ZEK/FlowState.h>

#include <cstdint>
#include <limits>
#include <memory>
#include <vector>

namespace Flow2Graphics
{

/// Makes of a live state one that holds what a view of subjects draws: their structure and settings, each in the pose
/// that was asked for and at its place in an arrangement, and the floor under them. Nothing else of the live state
/// passes.
///
/// Parameters are texts: "PoseIndex", and "LabellingPoseIndex" and "SolvingPoseIndex" for one of the two kinds, which
/// else follow the first. What is no number gives the default, which is 0; a pose that a subject does not have gives
/// its neutral one, all joint numbers 0. Thread: one at a time.
class VFlowSubjectSceneTransform final : public ZEK::IFlowStateTransform
{
public:
  explicit VFlowSubjectSceneTransform( ZEK::VFlowStoreRef i_Store );
  ~VFlowSubjectSceneTransform() override;

  /// Null when there is no memory for a state.
  ZEK::VFlowStateRef& Transform( ZEK::VFlowStateRef& o_rState, const ZEK::VFlowStateRef& i_rInput,
                                 const ZEK::VFlowParameterMap& i_rParameters ) override;

private:
  /// What was posed of one kind, by slot of the join.
  struct VPoseRecord
  {
    std::int32_t PoseIndex = std::numeric_limits< std::int32_t >::min();
    bool bYUp = false;
    std::vector< ZEK::VFlowItemRef > Sources;
    std::vector< ZEK::VFlowItemRef > Posed; ///< null: the source cannot be posed
    std::vector< VSubjectPlace > Places;

    void SetPose( std::int32_t i_Index );
  };

  template < typename TParametrised, typename TDynamics >
  void ApplyPose( VPoseRecord& io_rRecord, bool i_bYUp, ZEK::IFlowState& io_rState );
  /// Brings the record to the slots of the join, as `m_Sources` has them; what was posed moves to its slot.
  void TakeSources( VPoseRecord& io_rRecord );
  ZEK::VFlowItemRef Posed( const ZEK::VFlowItemType& i_rType, const ZEK::IFlowItem& i_rSource,
                           const VPoseRecord& i_rRecord, const VSubjectPlace& i_rPlace ) const;
  void UpdateVolume();

  ZEK::VFlowStoreRef m_StoreHandle;
  std::shared_ptr< Flow2TypesUtils::VTaggedCoreTypeExtractor > m_pExtractor;
  std::shared_ptr< VFlowSubjectSceneArrangement > m_pArrangement;
  VPoseRecord m_LabellingPose, m_SolvingPose;
  std::vector< ZEK::VFlowItemRef > m_Sources; ///< during a transform
  ZEK::VFlowItemRef m_Volume;
};

} // namespace Flow2Graphics
