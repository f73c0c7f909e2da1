#pragma once

#include <Flow2Graphics/IFlowRenderType.h>
#include <Flow2Graphics/VContributions.h>
#include <Flow2Graphics/VFlowRenderCameraProvider.h>

#include <MoxelGraphics/VMoxelScene.h>

#include <memory>
#include <utility>
#include <vector>

namespace Flow2Graphics
{

/// Finds out which cameras see the selected reconstructions and markers, or what the selected cameras contribute to,
/// while somebody watches and when selection or state are other ones. Draws nothing; updated after the provider and
/// after whatever names reconstructions. Thread: render thread.
class VFlowContributions final : public IFlowRenderType
{
public:
  VFlowContributions( MoxelGraphics::VMoxelScene& i_rScene,
                      std::shared_ptr< const VFlowRenderCameraProvider > i_pProvider,
                      std::shared_ptr< VContributions > i_pTo );

  void Update( const ZEK::IFlowState& i_rState ) override;

private:
  struct VTaken
  {
    const VFlowRenderCamera* pCamera = nullptr;
    ZEK::VFlowItemRef Centroids, Assignments, Hardware, Calibration;
    VSensorProjection Projection;
  };
  bool TakeCameras();
  void FindSelected();
  void FindContributors();
  void FillSeenBy();
  void FillRows();
  std::string LabelOf( std::uint32_t i_Reconstruction ) const;

  MoxelGraphics::VMoxelScene& m_rScene;
  std::shared_ptr< const VFlowRenderCameraProvider > m_pProvider;
  std::shared_ptr< VContributions > m_pTo;
  ZEK::VFlowItemRef m_Set, m_Labels;
  std::vector< VTaken > m_Taken; ///< by camera
  std::vector< VContributor > m_Contributors;
  std::vector< std::uint32_t > m_Reconstructions, m_Cameras; ///< selected ones
  std::vector< VContribution > m_Found;
  std::vector< std::pair< bool, double > > m_Worst; ///< by camera: whether it sees the selection, and its error
  VContributionReport m_Report;
  std::uint64_t m_MarksGeneration = 0;
  bool m_bWatched = false, m_bRowsWatched = false;
};

} // namespace Flow2Graphics
