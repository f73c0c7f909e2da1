#include <MoxelGraphics/VRenderAxis.h>

#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

struct VAxisVertex
{
  float Position[3];
  std::uint8_t Colour[4];
};

const VVertexLayout AxisLayout( sizeof( VAxisVertex ), 0,
                                { { EAttributePosition, 3, GL_FLOAT, false, 0 },
                                  { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 12 } } );

constexpr float Length = 0.8f; // of half the square's side
constexpr VAxisVertex Vertices[] = {
    { { 0, 0, 0 }, { 230, 51, 51, 255 } },  { { Length, 0, 0 }, { 230, 51, 51, 255 } },
    { { 0, 0, 0 }, { 51, 204, 51, 255 } },  { { 0, Length, 0 }, { 51, 204, 51, 255 } },
    { { 0, 0, 0 }, { 77, 102, 255, 255 } }, { { 0, 0, Length }, { 77, 102, 255, 255 } },
};
} // namespace

struct VRenderAxis::VGl
{
  std::shared_ptr< VShaderProgram > pProgram;
  VStaticBuffer Lines;
  VRenderState State;
};

VRenderAxis::VRenderAxis( std::shared_ptr< CoreGraphics::VResources > i_pResources )
  : m_pGl( std::make_unique< VGl >() )
{
  m_pGl->pProgram = i_pResources->GetProgram( "ScreenSpaceAxis", "Colour" );
  m_pGl->Lines.SetContents( std::span( Vertices ) );
  // The view's depth is not that of the gizmo: its three lines are few enough to need none.
  m_pGl->State.depthTest = false;
  m_pGl->State.depthWrite = false;
}

VRenderAxis::~VRenderAxis() = default;

QRect VRenderAxis::Square( const QRect& i_rViewport )
{
  const int Side = std::min( 100, std::min( i_rViewport.width(), i_rViewport.height() ) / 4 );
  return { i_rViewport.left(), i_rViewport.top(), Side, Side };
}

void VRenderAxis::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                          std::uint32_t i_Pass )
{
  if ( io_rContext.RenderMode() != ERenderModeNormal || i_Pass != ERenderPassOverlay || !i_rOptions.GlobalAxis ||
       !i_rOptions.OverlayCamera.isEmpty() )
  {
    return;
  }
  const QRect Viewport = io_rContext.Viewport();
  io_rContext.SetViewport( Square( Viewport ) );
  if ( io_rContext.UseProgram( m_pGl->pProgram ) && io_rContext.SetVertexBuffer( { &m_pGl->Lines, &AxisLayout, 0 } ) )
  {
    io_rContext.SetRenderState( m_pGl->State );
    io_rContext.DrawArrays( GL_LINES, 6 );
  }
  io_rContext.SetViewport( Viewport );
}

} // namespace MoxelGraphics
