#pragma once

#include <Flow2Graphics/IFlowRenderType.h>
#include <Flow2Graphics/LabelledPoints.h>

#include <Flow2TypesUtils/TaggedCoreTypeExtractor.h>
#include <MoxelGraphics/VRenderReconstructions.h>

namespace Flow2Graphics
{

/// Feeds the reconstructions of the frame, split into those that the label set names and the rest. A state without a
/// reconstruction set shows none.
///
/// Cost: linear in the points of a frame whose set or labels changed; a few comparisons otherwise.
class VFlowRenderReconstructions : public MoxelGraphics::VRenderReconstructions, public IFlowRenderType
{
public:
  explicit VFlowRenderReconstructions( MoxelGraphics::VMoxelScene& i_rScene );

  void Update( const ZEK::IFlowState& i_rState ) override;

  const VUnlabelledPoints& UnlabelledPoints() const { return m_UnlabelledPoints; }
  const VLabelledPoints& LabelledPoints() const { return m_LabelledPoints; }

private:
  bool TakeItems( const ZEK::IFlowState& i_rState );
  bool TakeSubjects( const ZEK::IFlowState& i_rState );
  void Rebuild();
  void GiveIds();

  Flow2TypesUtils::VTaggedCoreTypeExtractor m_Subjects;
  std::vector< ZEK::VFlowItemRef > m_SubjectItems, m_DataItems; ///< by slot, while subjects are taken
  ZEK::VFlowItemRef m_Set;
  ZEK::VFlowItemRef m_Labels;
  VUnlabelledPoints m_UnlabelledPoints;
  VLabelledPoints m_LabelledPoints;
  std::vector< std::uint8_t > m_bLabelled; ///< by index in the set
  std::vector< std::uint8_t > m_UnlabelledFlags;
  std::vector< std::uint8_t > m_LabelledFlags;
};

} // namespace Flow2Graphics
