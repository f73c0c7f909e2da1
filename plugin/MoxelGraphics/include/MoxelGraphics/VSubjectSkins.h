#pragma once

#include <MoxelGraphics/VSubjectGroup.h>

#include <cstddef>
#include <memory>

namespace CoreGraphics
{
class VRenderContext;
}

namespace MoxelGraphics
{
class VMoxelScene;

/// Draws the meshes that subjects wear, of all groups. Meshes are asked of the scene's cache by name, lie on the
/// device once however many subjects wear them, and are skinned there; on the processor where a mesh has more bones
/// than the program takes, or the device has too few uniforms.
///
/// A mesh follows a subject by the names of its bones: a namespace ("name:") is left out and case does not matter. Its
/// joints must have the axes of the subject's bones. A bone of the mesh that the subject does not have moves with its
/// nearest parent that it has; a mesh that shares no bone with its subject is not drawn, which the log says once.
///
/// Thread: render thread, with the view's context current.
class VSubjectSkins
{
public:
  static constexpr std::size_t GroupCount = 6;

  /// What the last `Draw` of a group did.
  struct VCounts
  {
    std::uint32_t Drawn = 0;     ///< records whose mesh was drawn
    std::uint32_t Waiting = 0;   ///< records whose mesh is not there
    std::uint32_t Unmatched = 0; ///< records that share no bone with their mesh
    std::uint32_t OnCpu = 0;     ///< of those drawn, skinned on the processor
  };

  explicit VSubjectSkins( VMoxelScene& i_rScene );
  ~VSubjectSkins();

  /// The skins of one group, in the look of the context's render mode. `i_Index` is the group's place, below
  /// `GroupCount`: what is worked out from a group is kept by it until the group's generations move.
  /// Without `i_bHighlightCurrent` the current subject looks merely selected.
  void Draw( CoreGraphics::VRenderContext& io_rContext, const VSubjectGroup& i_rGroup, std::size_t i_Index,
             bool i_bXRay, bool i_bHighlightCurrent = true );
  /// Parts of a skin go red as their bones lose health.
  void SetHighlightMissing( bool i_bOn );
  const VCounts& Counts( std::size_t i_Index ) const;

private:
  struct VState;
  std::unique_ptr< VState > m_pState;
};

} // namespace MoxelGraphics
