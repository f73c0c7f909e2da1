#pragma once

#include <Flow2Graphics/ISubjectSelectionMaker.h>
#include <Flow2Graphics/SubjectTypes.h>

namespace Flow2Graphics
{

/// The maker of a group by the types of its items; there is one for each of the six in SubjectTypes.h.
template < typename Types >
class VSubjectSelectionMaker final : public ISubjectSelectionMaker
{
public:
  void AddCaches( VExtractor& io_rExtractor ) const override;
  bool StructureChanged( const VExtractor& i_rExtractor ) const override;
  bool MotionChanged( const VExtractor& i_rExtractor ) const override;
  ESubjectFit Structure( const VExtractor& i_rExtractor, std::size_t i_Slot,
                         VSubjectStructure& o_rStructure ) const override;
  void Motion( const VExtractor& i_rExtractor, std::size_t i_Slot, VSubjectMotion& o_rMotion ) const override;
  std::uint32_t ObjectKind() const override;
  std::uint32_t BoneKind() const override;
  const char* MeshCategory() const override { return Types::MeshCategory; }
};

extern template class VSubjectSelectionMaker< VFlowSubjectTypes >;
extern template class VSubjectSelectionMaker< VFlowSubjectForSolvingTypes >;
extern template class VSubjectSelectionMaker< VFlowSubjectForRetargetingTypes >;
extern template class VSubjectSelectionMaker< VFlowRigidObjectTypes >;
extern template class VSubjectSelectionMaker< VFlowPropTypes >;
extern template class VSubjectSelectionMaker< VFlowSceneMeshTypes >;

} // namespace Flow2Graphics
