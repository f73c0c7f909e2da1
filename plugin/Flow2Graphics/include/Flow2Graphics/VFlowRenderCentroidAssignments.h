#pragma once

#include <Flow2Graphics/IFlowRenderType.h>
#include <Flow2Graphics/VFlowRenderCameraProvider.h>

#include <MoxelGraphics/VRenderCentroidAssignments.h>

#include <memory>
#include <vector>

namespace Flow2Graphics
{

/// Feeds the centroids of calibrated cameras that were assigned to reconstructions of the frame. A labelled
/// reconstruction counts as selected when its marker is. Updated after the provider. While the lines are off an update
/// only holds what came.
class VFlowRenderCentroidAssignments : public MoxelGraphics::VRenderCentroidAssignments, public IFlowRenderType
{
public:
  VFlowRenderCentroidAssignments( MoxelGraphics::VMoxelScene& i_rScene,
                                  std::shared_ptr< const VFlowRenderCameraProvider > i_pProvider );

  void Update( const ZEK::IFlowState& i_rState ) override;

protected:
  void FillRecords() override;

private:
  struct VTaken
  {
    ZEK::VFlowItemRef Assignments;
    std::int32_t ChangeCount = -1;
    const VFlowRenderCamera* pCamera = nullptr;
  };
  bool TakeCameras();
  void FillCameras();
  void FillReconstructions();

  MoxelGraphics::VMoxelScene& m_rScene;
  std::shared_ptr< const VFlowRenderCameraProvider > m_pProvider;
  ZEK::VFlowItemRef m_Set, m_Labels;
  std::vector< VTaken > m_Taken; ///< by camera
  std::vector< MoxelGraphics::VAssignedReconstruction > m_Reconstructions;
  std::uint64_t m_MarksGeneration = 0, m_CamerasGeneration = 0;
  bool m_bCamerasStale = false; ///< what is held differs from the records
  bool m_bReconstructionsStale = false;
};

} // namespace Flow2Graphics
