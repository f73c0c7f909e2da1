#pragma once

#include "../support/VOffscreen.h"

#include <CoreGraphics/VCameraController.h>
#include <Flow2Graphics/VFlowScene.h>
#include <MoxelGraphics/VSceneFrame.h>
#include <ZEK/FlowState.h>

#include <memory>
#include <vector>

namespace SceneBench
{

inline constexpr int Width = 1280;
inline constexpr int Height = 720;
inline constexpr int FrameCount = 60;

using BenchSupport::VOffscreen;

/// So many reconstructions, of radius 7 mm, and behind them so many of radius 9.
struct VPopulation
{
  std::size_t Small = 0;
  std::size_t Large = 0;
  std::size_t Count() const { return Small + Large; }
};

/// Reconstruction `i_Index` in frame `i_Frame`, mm: on circles through the volume.
MoxelGraphics::VScenePoint PointAt( std::size_t i_Index, const VPopulation& i_rPopulation, int i_Frame );

/// Frames of state that hold only moving reconstructions, and the scene that draws them through its real path.
class VReconstructionScene : public Flow2Graphics::VFlowScene
{
public:
  explicit VReconstructionScene( const VPopulation& i_rPopulation );

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

/// The least that draws the same spheres: one mapped buffer and one instanced draw, over a cleared target.
class VSphereFloor
{
public:
  explicit VSphereFloor( std::size_t i_Count );
  ~VSphereFloor();
  void Draw( int i_Frame );

private:
  struct VGl;
  std::unique_ptr< VGl > m_pGl;
};

} // namespace SceneBench
