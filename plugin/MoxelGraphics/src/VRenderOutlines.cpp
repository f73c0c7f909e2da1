#include <MoxelGraphics/VRenderOutlines.h>

#include "HighlightUnit.h"

#include <MoxelGraphics/VMoxelScene.h>

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

// A strip over the whole frame.
constexpr float Corners[] = { -1, -1, 0, 1, -1, 0, -1, 1, 0, 1, 1, 0 };

const std::array< QVector3D, 4 > Palette = { QVector3D( 0.25f, 0.125f, 0.0f ), QVector3D( 0.0f, 1.0f, 0.0f ),
                                             QVector3D( 1.0f, 0.0f, 0.0f ), QVector3D( 0.0f, 1.0f, 1.0f ) };

VRenderState FlatState( int i_ColourBlend )
{
  VRenderState State;
  State.colourBlend = i_ColourBlend;
  State.alphaBlend = EAlphaBlendKeep;
  State.depthTest = false;
  State.depthWrite = false;
  return State;
}
} // namespace

struct VRenderOutlines::VGl
{
  std::shared_ptr< VShaderProgram > pOutlines;
  std::shared_ptr< VShaderProgram > pAntiAlias;
  VStaticBuffer Quad;
  /// The edge image takes colour and alpha as they are; the frame adds them where their alpha is 0.
  VRenderState EdgeState = FlatState( EColourBlendNone );
  VRenderState BlendState = FlatState( EColourBlendPremultiplied );
  VUniform Mask{ "t_Selection" };
  VUniform Primary{ "u_PrimaryColour" };
  VUniform Preselect{ "u_PreSelectColour" };
  VUniform Edges{ "t_Buffer" };
};

VRenderOutlines::VRenderOutlines( const VMoxelScene& i_rScene )
  : m_rScene( i_rScene )
  , m_pGl( std::make_unique< VGl >() )
{
  m_pGl->pOutlines = i_rScene.Resources()->GetProgram( "Simple", "Outlines" );
  m_pGl->pAntiAlias = i_rScene.Resources()->GetProgram( "Simple", "AntiAlias" );
  m_pGl->Quad.SetContents( std::span( Corners ) );
}

VRenderOutlines::~VRenderOutlines() = default;

QVector3D VRenderOutlines::PreselectColour( int i_Index )
{
  const auto Index = static_cast< std::size_t >( i_Index );
  return Palette[Index < Palette.size() ? Index : 0];
}

void VRenderOutlines::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions&, std::uint32_t i_Pass )
{
  if ( io_rContext.RenderMode() != ERenderModeNormal || i_Pass != ERenderPassOverlay || !m_rScene.IsHighlighted() ||
       !io_rContext.OutlineMask() )
  {
    return;
  }
  QOpenGLFramebufferObject* const pSaved = io_rContext.Framebuffer();
  io_rContext.BindFramebuffer( io_rContext.OutlineMask() );
  const bool bEdges = io_rContext.IsFramebufferComplete() && DrawEdges( io_rContext );
  io_rContext.BindFramebuffer( pSaved );
  if ( bEdges )
  {
    Blend( io_rContext );
  }
}

bool VRenderOutlines::DrawEdges( CoreGraphics::VRenderContext& io_rContext )
{
  VGl& rGl = *m_pGl;
  if ( !io_rContext.UseProgram( rGl.pOutlines ) || !io_rContext.SetVertexBuffer( { &rGl.Quad, &PositionLayout(), 0 } ) )
  {
    return false;
  }
  rGl.Mask.Set( *rGl.pOutlines, HighlightUnit );
  rGl.Primary.Set( *rGl.pOutlines, m_PrimaryColour );
  rGl.Preselect.Set( *rGl.pOutlines, PreselectColour( io_rContext.PreselectColourIndex() ) );
  io_rContext.SetRenderState( rGl.EdgeState );
  io_rContext.DrawArrays( GL_TRIANGLE_STRIP, 4 );
  return true;
}

void VRenderOutlines::Blend( CoreGraphics::VRenderContext& io_rContext )
{
  VGl& rGl = *m_pGl;
  if ( !io_rContext.UseProgram( rGl.pAntiAlias ) ||
       !io_rContext.SetVertexBuffer( { &rGl.Quad, &PositionLayout(), 0 } ) )
  {
    return;
  }
  io_rContext.BindFramebufferTexture( 0, io_rContext.OutlineMask() );
  rGl.Edges.Set( *rGl.pAntiAlias, 0 );
  io_rContext.SetRenderState( rGl.BlendState );
  io_rContext.DrawArrays( GL_TRIANGLE_STRIP, 4 );
  io_rContext.BindTexture( 0, 0 );
}

} // namespace MoxelGraphics
