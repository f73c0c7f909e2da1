#include <MoxelGraphics/VRenderMarkerTrails.h>

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

constexpr float Width = 1.75F; // item pixels

// Every place is the start of a stretch to the next one: the same buffer, read twice.
const VVertexLayout StartLayout( sizeof( VTrailPoint ), 1,
                                 { { EAttributeStickA, 4, GL_FLOAT, false, 0 },
                                   { EAttributeModelColour, 4, GL_UNSIGNED_BYTE, true, 16 } } );
const VVertexLayout EndLayout( sizeof( VTrailPoint ), 1, { { EAttributeStickB, 4, GL_FLOAT, false, 0 } } );
static_assert( sizeof( VTrailPoint ) == 20 );

constexpr float Ribbon[] = { 0, -1, 0, 0, 1, 0, 1, -1, 0, 1, 1, 0 };
} // namespace

struct VRenderMarkerTrails::VGl
{
  std::shared_ptr< VShaderProgram > pProgram;
  VStaticBuffer Corners;
  VDynamicBuffer Points;
  std::uint64_t Held = 0; ///< generation of the points in the buffer
  VRenderState State;
  VUniform Width{ "u_PointSize" };
};

VRenderMarkerTrails::VRenderMarkerTrails( VMoxelScene& i_rScene )
  : m_rScene( i_rScene )
  , m_pGl( std::make_unique< VGl >() )
{
  m_pGl->pProgram = i_rScene.Resources()->GetProgram( "MarkerTrail", "Colour", EFormInstanced );
  m_pGl->Corners.SetContents( std::span( Ribbon ) );
  m_pGl->State.colourBlend = EColourBlendAlpha;
  m_pGl->State.depthFunction = EDepthLessOrEqual;
  m_pGl->State.depthWrite = false;
}

VRenderMarkerTrails::~VRenderMarkerTrails() = default;

void VRenderMarkerTrails::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                                  std::uint32_t i_Pass )
{
  if ( !i_rOptions.MarkerTrails || i_Pass != ERenderPassTranslucent || io_rContext.RenderMode() != ERenderModeNormal ||
       i_rOptions.CameraView || !i_rOptions.OverlayCamera.isEmpty() )
  {
    return;
  }
  m_Generation += FillTrails( i_rOptions ) ? 1 : 0;
  VGl& rGl = *m_pGl;
  if ( m_Points.size() < 2 )
  {
    return;
  }
  if ( rGl.Held != m_Generation || !rGl.Points.Bind() )
  {
    rGl.Held = rGl.Points.Write( std::span( std::as_const( m_Points ) ) ) ? m_Generation : 0;
  }
  if ( rGl.Held == 0 || !io_rContext.UseProgram( rGl.pProgram ) )
  {
    return;
  }
  const VVertexStream Streams[] = { { &rGl.Corners, &PositionLayout(), 0 },
                                    { &rGl.Points, &StartLayout, 0 },
                                    { &rGl.Points, &EndLayout, sizeof( VTrailPoint ) } };
  if ( !io_rContext.SetVertexStreams( Streams ) )
  {
    return;
  }
  io_rContext.SetRenderState( rGl.State );
  rGl.Width.Set( *rGl.pProgram, Width * io_rContext.PixelRatio() );
  io_rContext.DrawArraysInstanced( GL_TRIANGLE_STRIP, 4, static_cast< int >( m_Points.size() - 1 ) );
}

} // namespace MoxelGraphics
