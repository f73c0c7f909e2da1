#include <MoxelGraphics/VRenderReconstructions.h>

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>

namespace MoxelGraphics
{
namespace
{
constexpr std::array< float, 4 > UnlabelledColour{ 1.0f, 0.6275f, 1.0f, 1.0f };
constexpr float UsualRadius = 7.0f;
} // namespace

VRenderReconstructions::VRenderReconstructions( VMoxelScene& i_rScene )
  : m_rScene( i_rScene )
{
  m_Unlabelled.SetColour( UnlabelledColour );
}

VRenderReconstructions::~VRenderReconstructions() = default;

void VRenderReconstructions::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                                     std::uint32_t i_Pass )
{
  VSphereHelper* pHelper = m_rScene.SphereHelper();
  if ( i_Pass != ERenderPassOpaque || !pHelper )
  {
    return;
  }
  const VSphereSizing Sizing{ i_rOptions.ReconstructedRadius ? -1.0f : UsualRadius, i_rOptions.ReconstructionScale };
  if ( i_rOptions.Reconstructions && !m_Unlabelled.IsEmpty() )
  {
    pHelper->Draw( io_rContext, m_rScene, m_Unlabelled, Sizing );
  }
  const VDisplayRecord& rMarkers = i_rOptions.LabellingSubject;
  if ( rMarkers.Enabled && rMarkers.Markers && !m_Labelled.IsEmpty() )
  {
    pHelper->Draw( io_rContext, m_rScene, m_Labelled, Sizing );
  }
}

} // namespace MoxelGraphics
