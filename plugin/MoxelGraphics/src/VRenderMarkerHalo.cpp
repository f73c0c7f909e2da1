#include <MoxelGraphics/VRenderMarkerHalo.h>

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

#include <algorithm>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

constexpr float RingInSquare = 0.2F; ///< the ring's radius in the square that the program draws
constexpr float Reach = 0.32F;       ///< of the square: the ring with its soft edge
constexpr float RingRadius = 60;     // mm
constexpr float SmallestRing = 9;    // item pixels
constexpr float Colour[] = { 231 / 255.0F, 101 / 255.0F, 0, 0.9F };

// The program's square lies in x and z.
constexpr float Square[] = { -Reach, 0, -Reach, -Reach, 0, Reach, Reach, 0, -Reach, Reach, 0, Reach };

struct VRing
{
  float Matrix[16];
  float Colour[4];
};
const VVertexLayout RingLayout( sizeof( VRing ), 1,
                                { { EAttributeModelTransform, 16, GL_FLOAT, false, 0 },
                                  { EAttributeModelColour, 4, GL_FLOAT, false, 64 } } );

/// A ring about a place, facing the eye of the view.
VRing MakeRing( CoreGraphics::VRenderContext& io_rContext, const VScenePoint& i_rPlace )
{
  const QMatrix4x4& rView = io_rContext.View();
  const float W = QVector4D::dotProduct( io_rContext.ViewProjection().row( 3 ),
                                         QVector4D( i_rPlace.X, i_rPlace.Y, i_rPlace.Z, 1 ) );
  const float PixelsAtOne =
      io_rContext.Projection()( 1, 1 ) * static_cast< float >( io_rContext.Viewport().height() ) / 2;
  const float Smallest = SmallestRing * io_rContext.PixelRatio() * std::max( W, 0.0F ) / std::max( PixelsAtOne, 1e-6F );
  const float Scale = std::max( RingRadius, Smallest ) / RingInSquare;
  VRing Ring{ {}, { Colour[0], Colour[1], Colour[2], Colour[3] } };
  for ( int Axis = 0; Axis < 3; ++Axis )
  {
    Ring.Matrix[Axis] = rView( 0, Axis ) * Scale;     // x along the view's right
    Ring.Matrix[4 + Axis] = rView( 2, Axis ) * Scale; // y towards the eye
    Ring.Matrix[8 + Axis] = rView( 1, Axis ) * Scale; // z along the view's up
  }
  Ring.Matrix[12] = i_rPlace.X;
  Ring.Matrix[13] = i_rPlace.Y;
  Ring.Matrix[14] = i_rPlace.Z;
  Ring.Matrix[15] = 1;
  return Ring;
}

void AddCurrent( const VSubjectGroup& i_rGroup, std::vector< VScenePoint >& io_rPlaces )
{
  const std::vector< std::uint8_t >& rFlags = i_rGroup.MarkerIds.Flags;
  for ( std::size_t Index = 0; Index < std::min( rFlags.size(), i_rGroup.Markers.size() ); ++Index )
  {
    const VScenePoint& rPlace = i_rGroup.Markers[Index];
    if ( ( rFlags[Index] & EInstancePrimary ) != 0 && std::isfinite( rPlace.X + rPlace.Y + rPlace.Z ) )
    {
      io_rPlaces.push_back( rPlace );
    }
  }
}
} // namespace

struct VRenderMarkerHalo::VGl
{
  std::shared_ptr< VShaderProgram > pProgram;
  VStaticBuffer Corners;
  VDynamicBuffer Rings;
  VRenderState State;
};

VRenderMarkerHalo::VRenderMarkerHalo( VMoxelScene& i_rScene )
  : m_rScene( i_rScene )
  , m_pGl( std::make_unique< VGl >() )
{
  m_pGl->pProgram = i_rScene.Resources()->GetProgram( "Billboard", "ActiveLabelHalo", EFormInstanced );
  m_pGl->Corners.SetContents( std::span( Square ) );
  m_pGl->State.colourBlend = EColourBlendPremultiplied;
  m_pGl->State.depthTest = false;
  m_pGl->State.depthWrite = false;
}

VRenderMarkerHalo::~VRenderMarkerHalo() = default;

void VRenderMarkerHalo::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                                std::uint32_t i_Pass )
{
  if ( !i_rOptions.ActiveLabelHalo || i_Pass != ERenderPassOverlay || io_rContext.RenderMode() != ERenderModeNormal ||
       i_rOptions.CameraView || !i_rOptions.Show3DOverlay || !i_rOptions.OverlayCamera.isEmpty() )
  {
    return;
  }
  m_Places.clear();
  const VDisplayRecord* const Blocks[] = { &i_rOptions.PropSubject, &i_rOptions.LabellingSubject,
                                           &i_rOptions.PropSubject, &i_rOptions.SolvingSubject };
  for ( std::size_t Group = 0; Group < m_Groups.size(); ++Group )
  {
    if ( m_Groups[Group] && Blocks[Group]->Enabled && Blocks[Group]->Markers )
    {
      AddCurrent( *m_Groups[Group], m_Places );
    }
  }
  auto* pRing = static_cast< VRing* >( m_pGl->Rings.Map( m_Places.size() * sizeof( VRing ) ) );
  if ( !pRing )
  {
    return; // nothing is current, or there is no memory
  }
  for ( const VScenePoint& rPlace : m_Places )
  {
    *pRing++ = MakeRing( io_rContext, rPlace );
  }
  const bool bWritten = m_pGl->Rings.Unmap();
  const VVertexStream Streams[] = { { &m_pGl->Corners, &PositionLayout(), 0 }, { &m_pGl->Rings, &RingLayout, 0 } };
  if ( bWritten && io_rContext.UseProgram( m_pGl->pProgram ) && io_rContext.SetVertexStreams( Streams ) )
  {
    io_rContext.SetRenderState( m_pGl->State );
    io_rContext.DrawArraysInstanced( GL_TRIANGLE_STRIP, 4, static_cast< int >( m_Places.size() ) );
  }
}

} // namespace MoxelGraphics
