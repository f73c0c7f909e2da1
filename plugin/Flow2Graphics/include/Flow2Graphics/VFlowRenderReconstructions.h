#pragma once

#include <Flow2Graphics/IFlowRenderType.h>
#include <Flow2Graphics/UnlabelledPoints.h>

#include <MoxelGraphics/VRenderReconstructions.h>

#include <memory>

namespace Flow2Graphics
{

class VFlowRenderSubjects;

/// Feeds the reconstructions of the frame that no subject takes for a marker. A state without a reconstruction set
/// shows none. While residuals are shown, those that subjects took are drawn too, over their markers.
///
/// Cost: linear in the points of a frame whose set or labels changed; a few comparisons otherwise.
class VFlowRenderReconstructions : public MoxelGraphics::VRenderReconstructions, public IFlowRenderType
{
public:
  VFlowRenderReconstructions( MoxelGraphics::VMoxelScene& i_rScene,
                              std::shared_ptr< VFlowRenderSubjects > i_pSubjects );

  void Update( const ZEK::IFlowState& i_rState ) override;

  const VUnlabelledPoints& UnlabelledPoints() const { return m_UnlabelledPoints; }

protected:
  void FillLabelled( const MoxelGraphics::VSceneOptions& i_rOptions,
                     MoxelGraphics::VSphereSizing& io_rSizing ) override;
  bool HasLabelled() const override;
  void FillResiduals() override;

private:
  void Rebuild();
  void GiveIds();

  std::shared_ptr< VFlowRenderSubjects > m_pSubjects;
  ZEK::VFlowItemRef m_Set;
  std::uint64_t m_TakenGeneration = 0;
  VUnlabelledPoints m_UnlabelledPoints;
  std::vector< std::uint8_t > m_UnlabelledFlags;
  std::vector< MoxelGraphics::VScenePoint > m_LabelledPoints;
  std::vector< float > m_LabelledResiduals;
  std::vector< float > m_Residuals; ///< of the points without a label
  bool m_bLabelledStale = true;
  bool m_bResidualsStale = true;
  bool m_bLabelledShown = false;
};

} // namespace Flow2Graphics
