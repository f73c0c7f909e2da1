#pragma once

#include <MoxelGraphics/IRenderType.h>
#include <MoxelGraphics/VSphereHelper.h>

#include <cstdint>
#include <memory>
#include <span>
#include <vector>

namespace MoxelGraphics
{
class VMoxelScene;

/// Reconstructed points: those without a label as spheres of one colour, and those that have one as spheres each of
/// its own colour; or, with the option `ReconstructionResiduals`, all by how well the cameras agree on them, with a
/// legend. Geometry and ids are set apart: ids anew with every state, geometry when it changed.
class VRenderReconstructions : public IRenderType
{
public:
  /// The scene owns this object.
  explicit VRenderReconstructions( VMoxelScene& i_rScene );
  ~VRenderReconstructions() override;

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;
  void Paint( QPainter& io_rPainter, CoreGraphics::VRenderContext& io_rContext,
              const VSceneOptions& i_rOptions ) override;
  bool WantsPaint( const VSceneOptions& i_rOptions ) const override;

  /// The points without a label. See VSphereBatch for what the setters take.
  void SetReconstructions( std::span< const VScenePoint > i_Points ) { Set( m_Unlabelled, i_Points ); }
  void SetReconstructionIds( std::uint32_t i_FirstId, std::span< const std::uint8_t > i_Flags )
  {
    m_Unlabelled.Spheres.SetIds( i_FirstId, i_Flags );
  }
  /// In mm, one a point; 0 for a point that has none. Set after the points.
  void SetResiduals( std::span< const float > i_Residuals ) { SetResiduals( m_Unlabelled, i_Residuals ); }

  /// The points with a label, each with a colour 0xAABBGGRR.
  void SetLabelled( std::span< const VScenePoint > i_Points ) { Set( m_Labelled, i_Points ); }
  void SetLabelledColours( std::span< const std::uint32_t > i_Colours );
  void SetLabelledIds( std::uint32_t i_FirstId, std::span< const std::uint8_t > i_Flags )
  {
    m_Labelled.Spheres.SetIds( i_FirstId, i_Flags );
  }
  void SetLabelledResiduals( std::span< const float > i_Residuals ) { SetResiduals( m_Labelled, i_Residuals ); }

  const VSphereBatch& Unlabelled() const { return m_Unlabelled.Spheres; }
  const VSphereBatch& Labelled() const { return m_Labelled.Spheres; }

protected:
  /// Called before the points with a label are drawn: the place to set them by what is shown, and how they are sized.
  virtual void FillLabelled( const VSceneOptions& /*i_rOptions*/, VSphereSizing& /*io_rSizing*/ ) {}
  /// Called before residuals are shown: the place to set those of the points without a label.
  virtual void FillResiduals() {}
  /// Whether there are points with a label, set or not.
  virtual bool HasLabelled() const { return !m_Labelled.Spheres.IsEmpty(); }

  VMoxelScene& m_rScene;

private:
  /// Points, with the colours of both manners; the batch holds those that were drawn last.
  struct VPoints
  {
    VSphereBatch Spheres;
    std::vector< std::uint32_t > Colours; ///< empty: one for all
    std::vector< float > Residuals;
    bool bColoursSet = false;
    bool bByResidual = false;
  };
  struct VLegend;
  static void Set( VPoints& io_rPoints, std::span< const VScenePoint > i_Points );
  static void SetResiduals( VPoints& io_rPoints, std::span< const float > i_Residuals );
  void ApplyColours( VPoints& io_rPoints, bool i_bByResidual );

  VPoints m_Unlabelled;
  VPoints m_Labelled;
  std::vector< std::uint32_t > m_ResidualColours;
  std::unique_ptr< VLegend > m_pLegend;
};

} // namespace MoxelGraphics
