#pragma once

#include <MoxelGraphics/IRenderType.h>

#include <QtGui/QVector3D>
#include <QtGui/QVector4D>

#include <memory>

namespace MoxelGraphics
{
class VMoxelScene;

/// Turns the highlight mask on texture unit 7 into the look of what is selected and preselected: a fill, an edge, and
/// hatching for the current item. Stands on the scene's post list; does nothing in a view whose mask is empty.
class VRenderOutlines : public IRenderType
{
public:
  /// The scene owns this object.
  explicit VRenderOutlines( const VMoxelScene& i_rScene );
  ~VRenderOutlines() override;

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

  /// Red, green, blue, alpha of the current item's hatching and edge, 0 to 1.
  const QVector4D& PrimaryColour() const { return m_PrimaryColour; }
  void SetPrimaryColour( const QVector4D& i_rColour ) { m_PrimaryColour = i_rColour; }

  /// The fill of what is preselected, by `VRenderContext::PreselectColourIndex`; that of 0 for any other number.
  static QVector3D PreselectColour( int i_Index );

private:
  struct VGl;
  bool DrawEdges( CoreGraphics::VRenderContext& io_rContext );
  void Blend( CoreGraphics::VRenderContext& io_rContext );

  const VMoxelScene& m_rScene;
  QVector4D m_PrimaryColour{ 231.0f / 255.0f, 101.0f / 255.0f, 0.0f, 1.0f };
  std::unique_ptr< VGl > m_pGl;
};

} // namespace MoxelGraphics
