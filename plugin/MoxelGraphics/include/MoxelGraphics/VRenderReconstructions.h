#pragma once

#include <MoxelGraphics/IRenderType.h>
#include <MoxelGraphics/VSphereHelper.h>

#include <cstdint>
#include <span>

namespace MoxelGraphics
{
class VMoxelScene;

/// Reconstructed points: those without a label as spheres of one colour, and those that have one as spheres each of
/// its own colour. Geometry and ids are set apart: ids anew with every state, geometry when it changed.
class VRenderReconstructions : public IRenderType
{
public:
  /// The scene owns this object.
  explicit VRenderReconstructions( VMoxelScene& i_rScene );
  ~VRenderReconstructions() override;

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

  /// The points without a label. See VSphereBatch for what the setters take.
  void SetReconstructions( std::span< const VScenePoint > i_Points ) { m_Unlabelled.SetSpheres( i_Points ); }
  void SetReconstructionIds( std::uint32_t i_FirstId, std::span< const std::uint8_t > i_Flags )
  {
    m_Unlabelled.SetIds( i_FirstId, i_Flags );
  }

  /// The points with a label, each with a colour 0xAABBGGRR.
  void SetLabelled( std::span< const VScenePoint > i_Points ) { m_Labelled.SetSpheres( i_Points ); }
  void SetLabelledColours( std::span< const std::uint32_t > i_Colours ) { m_Labelled.SetColours( i_Colours ); }
  void SetLabelledIds( std::uint32_t i_FirstId, std::span< const std::uint8_t > i_Flags )
  {
    m_Labelled.SetIds( i_FirstId, i_Flags );
  }

  const VSphereBatch& Unlabelled() const { return m_Unlabelled; }
  const VSphereBatch& Labelled() const { return m_Labelled; }

protected:
  VMoxelScene& m_rScene;

private:
  VSphereBatch m_Unlabelled;
  VSphereBatch m_Labelled;
};

} // namespace MoxelGraphics
