#pragma once

#include <MoxelGraphics/IRenderType.h>

#include <array>
#include <memory>

namespace CoreGraphics
{
class VResources;
}

namespace MoxelGraphics
{

/// The volume in which points are reconstructed: the edges of a box, and its walls as a veil. The face on the floor is
/// left out.
class VRenderReconstructionVolume : public IRenderType
{
public:
  explicit VRenderReconstructionVolume( std::shared_ptr< CoreGraphics::VResources > i_pResources );
  ~VRenderReconstructionVolume() override;

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

  /// Two opposite corners, mm. Corners that are not finite or span no volume show nothing.
  void SetVolume( const std::array< float, 3 >& i_rCorner, const std::array< float, 3 >& i_rOpposite );
  bool IsShown() const { return m_bShown; }
  const std::array< float, 3 >& Minimum() const { return m_Minimum; }
  const std::array< float, 3 >& Maximum() const { return m_Maximum; }

private:
  struct VGl;
  std::unique_ptr< VGl > m_pGl;
  std::array< float, 3 > m_Minimum{}, m_Maximum{};
  bool m_bShown = false;
};

} // namespace MoxelGraphics
