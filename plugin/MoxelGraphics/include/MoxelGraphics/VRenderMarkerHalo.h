#pragma once

#include <MoxelGraphics/IRenderType.h>
#include <MoxelGraphics/VSubjectGroup.h>

#include <array>
#include <memory>
#include <vector>

namespace MoxelGraphics
{
class VMoxelScene;

/// A ring that faces the eye, about the marker that is the current item. With the option `ActiveLabelHalo`.
class VRenderMarkerHalo : public IRenderType
{
public:
  using VGroups = std::array< const VSubjectGroup*, 4 >;

  /// The scene owns this object.
  explicit VRenderMarkerHalo( VMoxelScene& i_rScene );
  ~VRenderMarkerHalo() override;

  /// Rigid object, subject, prop, solving; any may be null. They outlive this object's last draw.
  void SetGroups( const VGroups& i_rGroups ) { m_Groups = i_rGroups; }

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

private:
  struct VGl;
  VMoxelScene& m_rScene;
  VGroups m_Groups{};
  std::vector< VScenePoint > m_Places;
  std::unique_ptr< VGl > m_pGl;
};

} // namespace MoxelGraphics
