#pragma once

#include "../support/VOffscreen.h"

#include <Flow2Graphics/VFlowScene.h>
#include <MoxelGraphics/VCameraTile.h>
#include <ZEK/FlowState.h>

#include <memory>
#include <string>
#include <vector>

namespace CameraGridBench
{

inline constexpr int Width = 1280, Height = 720, SensorWidth = 1280, SensorHeight = 720, FrameCount = 8;

/// How much every camera sees in every frame.
struct VWorkload
{
  int Cameras = 128;
  int Centroids = 128; ///< of 1 to 8 pixels radius
  int Blobs = 10;      ///< of 1 to 128 pixels a side
  bool bLens = false;  ///< the cameras are calibrated, and their data corrected for the lens
};

using BenchSupport::VOffscreen;

std::string CameraName( int i_Camera );

/// As many tiles in the frame, in the rows that waste the least of it, images fitted at nine tenths.
MoxelGraphics::VCameraTilesRef MakeTiles( int i_Cameras );

/// Frames of state whose centroids and blobs are new in each, and the scene that draws them through its real path.
class VCameraScene : public Flow2Graphics::VFlowScene
{
public:
  explicit VCameraScene( const VWorkload& i_rWorkload );

  void Show( int i_Frame )
  {
    m_Newest = m_States[static_cast< std::size_t >( i_Frame % FrameCount )];
    MarkDirty();
  }

protected:
  ZEK::VFlowStateRef FetchState() override { return m_Newest; }

private:
  std::vector< ZEK::VFlowStateRef > m_States;
  ZEK::VFlowStateRef m_Newest;
};

} // namespace CameraGridBench
