#include <MoxelGraphics/VRenderFloorGrid.h>

#include "VGridTexture.h"

#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

// A fan, and as a loop the border.
constexpr float Corners[] = { 0, 0, 0, 1, 0, 0, 1, 1, 0, 0, 1, 0 };
const QVector4D BorderColour( 0.5f, 0.5f, 0.5f, 1.0f );
constexpr int CrossHalfWidth = 10;  // mm
constexpr float HalfMetre = 500.0F; // mm
constexpr float LargestSize = 1e5F; // m

QVector4D Extents( const std::array< int, 4 >& i_rExtents )
{
  return { static_cast< float >( i_rExtents[0] ), static_cast< float >( i_rExtents[1] ),
           static_cast< float >( i_rExtents[2] ), static_cast< float >( i_rExtents[3] ) };
}
} // namespace

struct VRenderFloorGrid::VGl
{
  std::shared_ptr< VShaderProgram > pGrid;
  std::shared_ptr< VShaderProgram > pPlain;
  VStaticBuffer Quad;
  VGridTexture Texture;
  VTextureSampling Sampling;
  VRenderState GridState;
  VRenderState BorderState;
  VUniform GridExtents{ "u_Extents" };
  VUniform PlainExtents{ "u_Extents" };
  VUniform Spacings{ "u_GridSpacings" };
  VUniform Unit{ "t_Texture" };
  VUniform Colour{ "u_Colour" };
};

VRenderFloorGrid::VRenderFloorGrid( std::shared_ptr< CoreGraphics::VResources > i_pResources )
  : m_pGl( std::make_unique< VGl >() )
{
  m_pGl->pGrid = i_pResources->GetProgram( "FloorGrid", "FloorGrid" );
  m_pGl->pPlain = i_pResources->GetProgram( "FloorGrid", "UniformColour" );
  m_pGl->Quad.SetContents( std::span( Corners ) );
  // One texture is one cell, repeated over the floor.
  m_pGl->Sampling.clampS = false;
  m_pGl->Sampling.clampT = false;
  m_pGl->BorderState.depthWrite = false;
}

VRenderFloorGrid::~VRenderFloorGrid() = default;

void VRenderFloorGrid::SetExtents( const std::array< int, 4 >& i_rExtents )
{
  if ( i_rExtents[0] < i_rExtents[2] && i_rExtents[1] < i_rExtents[3] )
  {
    m_Extents = i_rExtents;
    m_bOwnExtents = true;
  }
}

void VRenderFloorGrid::FollowOptions( const VSceneOptions& i_rOptions )
{
  const float Size = i_rOptions.FloorGridSize;
  if ( !m_bOwnExtents && Size > 0 && Size < LargestSize )
  {
    const int Half = static_cast< int >( std::lround( Size * HalfMetre ) );
    m_Extents = { -Half, -Half, Half, Half };
  }
}

void VRenderFloorGrid::SetSpacing( float i_Spacing, int i_Subdivision )
{
  m_Spacing = i_Spacing > 0 && std::isfinite( i_Spacing ) ? i_Spacing : m_Spacing;
  m_Subdivision = i_Subdivision > 0 ? i_Subdivision : m_Subdivision;
}

void VRenderFloorGrid::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                               std::uint32_t i_Pass )
{
  const bool bTranslucent = i_rOptions.FloorGridIsTranslucent;
  if ( io_rContext.RenderMode() != ERenderModeNormal || !i_rOptions.FloorGrid ||
       i_Pass != ( bTranslucent ? ERenderPassTranslucent : ERenderPassOpaque ) )
  {
    return;
  }
  FollowOptions( i_rOptions );
  RenderGrid( io_rContext, bTranslucent );
  RenderBorder( io_rContext, bTranslucent );
}

void VRenderFloorGrid::RenderGrid( CoreGraphics::VRenderContext& io_rContext, bool i_bTranslucent )
{
  VGl& rGl = *m_pGl;
  if ( !io_rContext.UseProgram( rGl.pGrid ) || !io_rContext.SetVertexBuffer( { &rGl.Quad, &PositionLayout(), 0 } ) )
  {
    return;
  }
  rGl.GridState.colourBlend = i_bTranslucent ? EColourBlendAlpha : EColourBlendNone;
  rGl.GridState.depthWrite = !i_bTranslucent;
  io_rContext.SetRenderState( rGl.GridState );
  io_rContext.BindTexture( 0, rGl.Texture.Id( io_rContext ) );
  io_rContext.SetTextureSampling( rGl.Sampling );
  rGl.Unit.Set( *rGl.pGrid, 0 );
  rGl.Spacings.Set( *rGl.pGrid, QVector2D( m_Spacing, m_Spacing / static_cast< float >( m_Subdivision ) ) );
  rGl.GridExtents.Set( *rGl.pGrid, Extents( m_Extents ) );
  io_rContext.DrawArrays( GL_TRIANGLE_FAN, 4 );
}

void VRenderFloorGrid::RenderBorder( CoreGraphics::VRenderContext& io_rContext, bool i_bTranslucent )
{
  VGl& rGl = *m_pGl;
  if ( !io_rContext.UseProgram( rGl.pPlain ) || !io_rContext.SetVertexBuffer( { &rGl.Quad, &PositionLayout(), 0 } ) )
  {
    return;
  }
  // Border and cross lie in the plane of the grid and would flicker against its depth. A translucent grid leaves
  // none; an opaque one is drawn before all else, so that they need no test.
  rGl.BorderState.depthTest = i_bTranslucent;
  io_rContext.SetRenderState( rGl.BorderState );
  rGl.Colour.Set( *rGl.pPlain, BorderColour );
  const auto Draw = [&]( GLenum i_Mode, const std::array< int, 4 >& i_rExtents )
  {
    rGl.PlainExtents.Set( *rGl.pPlain, Extents( i_rExtents ) );
    io_rContext.DrawArrays( i_Mode, 4 );
  };
  Draw( GL_LINE_LOOP, m_Extents );
  Draw( GL_TRIANGLE_FAN, { m_Extents[0], -CrossHalfWidth, m_Extents[2], CrossHalfWidth } );
  Draw( GL_TRIANGLE_FAN, { -CrossHalfWidth, m_Extents[1], CrossHalfWidth, m_Extents[3] } );
}

} // namespace MoxelGraphics
