#include <MoxelGraphics/VRenderReconstructions.h>

#include "Residuals.h"

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>

#include <QtGui/QPainter>

#include <cmath>

namespace MoxelGraphics
{
namespace
{
constexpr std::array< float, 4 > UnlabelledColour{ 1.0f, 0.6275f, 1.0f, 1.0f };
constexpr float UsualRadius = 7.0f;
constexpr float LegendMargin = 12.0f; // item pixels

VSphereSizing Sizing( const VSceneOptions& i_rOptions )
{
  const float Scale = i_rOptions.ReconstructionScale;
  return { i_rOptions.ReconstructedRadius ? -1.0f : UsualRadius, Scale > 0 && std::isfinite( Scale ) ? Scale : 1.0f };
}
} // namespace

struct VRenderReconstructions::VLegend
{
  QImage Image;
  float PixelRatio = 0;
};

VRenderReconstructions::VRenderReconstructions( VMoxelScene& i_rScene )
  : m_rScene( i_rScene )
  , m_pLegend( std::make_unique< VLegend >() )
{
  m_Unlabelled.Spheres.SetColour( UnlabelledColour );
}

VRenderReconstructions::~VRenderReconstructions() = default;

void VRenderReconstructions::Set( VPoints& io_rPoints, std::span< const VScenePoint > i_Points )
{
  io_rPoints.Spheres.SetSpheres( i_Points );
  io_rPoints.bColoursSet = false;
}

void VRenderReconstructions::SetResiduals( VPoints& io_rPoints, std::span< const float > i_Residuals )
{
  io_rPoints.Residuals.assign( i_Residuals.begin(), i_Residuals.end() );
  io_rPoints.bColoursSet = false;
}

void VRenderReconstructions::SetLabelledColours( std::span< const std::uint32_t > i_Colours )
{
  m_Labelled.Colours.assign( i_Colours.begin(), i_Colours.end() );
  m_Labelled.bColoursSet = false;
}

void VRenderReconstructions::ApplyColours( VPoints& io_rPoints, bool i_bByResidual )
{
  if ( io_rPoints.bColoursSet && io_rPoints.bByResidual == i_bByResidual )
  {
    return;
  }
  io_rPoints.bColoursSet = true;
  io_rPoints.bByResidual = i_bByResidual;
  if ( i_bByResidual )
  {
    m_ResidualColours.resize( io_rPoints.Spheres.Count() );
    for ( std::size_t Index = 0; Index < m_ResidualColours.size(); ++Index )
    {
      m_ResidualColours[Index] =
          ResidualColour( Index < io_rPoints.Residuals.size() ? io_rPoints.Residuals[Index] : 0.0f );
    }
    io_rPoints.Spheres.SetColours( m_ResidualColours );
  }
  else if ( &io_rPoints == &m_Labelled )
  {
    io_rPoints.Spheres.SetColours( io_rPoints.Colours );
  }
  else
  {
    io_rPoints.Spheres.SetColour( UnlabelledColour );
  }
}

void VRenderReconstructions::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                                     std::uint32_t i_Pass )
{
  VSphereHelper* pHelper = m_rScene.SphereHelper();
  if ( i_Pass != ERenderPassOpaque || !pHelper )
  {
    return;
  }
  VSphereSizing Sizes = Sizing( i_rOptions );
  const auto Draw = [&]( VPoints& io_rPoints )
  {
    if ( io_rPoints.Spheres.IsEmpty() )
    {
      return;
    }
    if ( io_rContext.RenderMode() == ERenderModeNormal )
    {
      ApplyColours( io_rPoints, i_rOptions.ReconstructionResiduals );
    }
    pHelper->Draw( io_rContext, m_rScene, io_rPoints.Spheres, Sizes );
  };
  if ( i_rOptions.Reconstructions )
  {
    if ( i_rOptions.ReconstructionResiduals )
    {
      FillResiduals();
    }
    Draw( m_Unlabelled );
  }
  const VDisplayRecord& rMarkers = i_rOptions.LabellingSubject;
  if ( rMarkers.Enabled && rMarkers.Markers )
  {
    FillLabelled( i_rOptions, Sizes );
    Draw( m_Labelled );
  }
}

bool VRenderReconstructions::WantsPaint( const VSceneOptions& i_rOptions ) const
{
  return i_rOptions.ReconstructionResiduals && !i_rOptions.CameraView && i_rOptions.OverlayCamera.isEmpty() &&
         ( !m_Unlabelled.Spheres.IsEmpty() || HasLabelled() );
}

void VRenderReconstructions::Paint( QPainter& io_rPainter, CoreGraphics::VRenderContext& io_rContext,
                                    const VSceneOptions& i_rOptions )
{
  if ( !WantsPaint( i_rOptions ) )
  {
    return;
  }
  const float Ratio = io_rContext.PixelRatio();
  if ( m_pLegend->PixelRatio != Ratio )
  {
    m_pLegend->Image = MakeResidualLegend( Ratio );
    m_pLegend->PixelRatio = Ratio;
  }
  const QSize Free = io_rContext.FrameSize() - m_pLegend->Image.size();
  const int Margin = static_cast< int >( std::lround( LegendMargin * Ratio ) );
  io_rPainter.drawImage( QPoint( Free.width() - Margin, Free.height() - Margin ), m_pLegend->Image );
}

} // namespace MoxelGraphics
