#include <MoxelGraphics/VSphereHelper.h>

#include "VPickWindow.h"
#include "VSphereBatchGl.h"

#include <MoxelGraphics/VMoxelScene.h>

#include <CoreGraphics/VMesh.h>
#include <CoreGraphics/VProgramPair.h>
#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

const VVertexLayout SphereLayout( sizeof( VScenePoint ), 1, { { EAttributeReconPosAndSize, 4, GL_FLOAT, false, 0 } } );
const VVertexLayout ColourLayout( 4, 1, { { EAttributeModelColour, 4, GL_UNSIGNED_BYTE, true, 0 } } );
const VVertexLayout FlagsLayout( 1, 1, { { EAttributeInstanceFlags, 1, GL_UNSIGNED_BYTE, false, 0 } } );

// The same buffers, a vertex a sphere.
const VVertexLayout PointLayout( sizeof( VScenePoint ), 0, { { EAttributePosition, 4, GL_FLOAT, false, 0 } } );
const VVertexLayout PointColourLayout( 4, 0, { { EAttributeModelColour, 4, GL_UNSIGNED_BYTE, true, 0 } } );
const VVertexLayout PointFlagsLayout( 1, 0, { { EAttributeInstanceFlags, 1, GL_UNSIGNED_BYTE, false, 0 } } );

// What a pick gathered, an instance or a vertex a sphere.
const VVertexLayout PickedLayout( sizeof( VPickedSphere ), 1,
                                  { { EAttributeReconPosAndSize, 4, GL_FLOAT, false, 0 },
                                    { EAttributeInstanceFlags, 1, GL_UNSIGNED_INT, false, sizeof( VScenePoint ) } } );
const VVertexLayout
    PickedPointLayout( sizeof( VPickedSphere ), 0,
                       { { EAttributePosition, 4, GL_FLOAT, false, 0 },
                         { EAttributeInstanceFlags, 1, GL_UNSIGNED_INT, false, sizeof( VScenePoint ) } } );

/// Gathered at a time: the flags' upper bits count up to here, and a float holds them exactly.
constexpr std::uint32_t GatherBlock = 0x4000;

/// A batch of up to so many spheres gets the fine mesh when one sphere deserves it, a larger one when an eighth does:
/// all spheres of a batch share one mesh, so that they stay one draw.
constexpr std::size_t SmallBatch = 2000;
/// From so many spheres on, points take the place of meshes as soon as they cover the same pixels; fewer are drawn
/// round until they are smaller still.
constexpr std::size_t ManySpheres = 500;

VRenderState SphereState()
{
  VRenderState State;
  State.cullMode = ECullBack;
  State.depthFunction = EDepthLessOrEqual;
  return State;
}
} // namespace

struct VSphereHelper::VGl
{
  VInstancedProgramPair Programs;
  VInstancedProgramPair Points;
  VMesh Fine = MakeSphereMesh( 2 );
  VMesh Coarse = MakeSphereMesh( 1 );
  VMesh Rough = MakeSphereMesh( 0 );
  VDynamicBuffer Picked;
  VRenderState State = SphereState();

  /// Null for points, which do for radii below `i_PointPixels`.
  VMesh* MeshFor( const VSphereExtent& i_rExtent, std::size_t i_Count, float i_PointPixels )
  {
    if ( i_rExtent.FineCount > 0 && ( i_Count <= SmallBatch || i_rExtent.FineCount >= i_Count / 8 ) )
    {
      return &Fine;
    }
    return i_rExtent.Largest < i_PointPixels ? nullptr : i_rExtent.Largest < RoughPixels ? &Rough : &Coarse;
  }
};

VSphereHelper::VSphereHelper( std::shared_ptr< CoreGraphics::VResources > i_pResources )
  : m_pResources( std::move( i_pResources ) )
  , m_pGl( std::make_unique< VGl >() )
{
  m_pGl->Programs.Load( *m_pResources, "Sphere", "SimpleLighting" );
  m_pGl->Points.LoadPoints( *m_pResources, "SpherePoint", "SimpleLighting" );
}

VSphereHelper::~VSphereHelper() = default;

void VSphereHelper::Clear()
{
  m_Drawn.clear();
}

void VSphereHelper::Remember( bool i_bOn )
{
  m_bRemembering = i_bOn;
}

void VSphereHelper::Draw( CoreGraphics::VRenderContext& io_rContext, const VMoxelScene& i_rScene,
                          VSphereBatch& io_rBatch, const VSphereSizing& i_rSizing )
{
  const int Mode = io_rContext.RenderMode();
  const bool bVisible = Mode == ERenderModeNormal;
  const bool bNothing = io_rBatch.IsEmpty() || ( !bVisible && io_rBatch.FirstId() == 0 ) ||
                        ( Mode == ERenderModeHighlight && !io_rBatch.AnyMarked() );
  if ( bNothing )
  {
    return;
  }
  if ( Mode == ERenderModeSelection )
  {
    DrawPicked( io_rContext, i_rScene, io_rBatch, i_rSizing );
    return;
  }
  // In the highlight mask only the stretch that holds all marked spheres is drawn.
  const std::uint32_t First = bVisible ? 0 : io_rBatch.m_MarkedBegin;
  const std::uint32_t End = bVisible ? static_cast< std::uint32_t >( io_rBatch.Count() ) : io_rBatch.m_MarkedEnd;
  const float PointPixels = io_rBatch.Count() < ManySpheres ? CoarsePixels : SmallestPixels;
  VMesh* pMesh =
      m_pGl->MeshFor( io_rBatch.Extent( io_rContext, i_rSizing, PointPixels ), io_rBatch.Count(), PointPixels );
  VInstancedProgramPair& rPrograms = pMesh ? m_pGl->Programs : m_pGl->Points;
  if ( !rPrograms.Use( io_rContext, io_rBatch.FirstId() == 0 ? 0 : io_rBatch.FirstId() + First ) )
  {
    return;
  }
  if ( !io_rBatch.m_pGl )
  {
    io_rBatch.m_pGl = std::make_unique< VSphereBatch::VGl >();
  }
  // A second attempt writes everything again: the buffers may have died with the windows that shared them.
  if ( !Feed( io_rContext, io_rBatch, i_rSizing, pMesh, First ) )
  {
    io_rBatch.m_pGl->Forget();
    if ( !Feed( io_rContext, io_rBatch, i_rSizing, pMesh, First ) )
    {
      return;
    }
  }
  io_rContext.SetRenderState( m_pGl->State );
  if ( pMesh )
  {
    io_rContext.DrawElementsInstanced( GL_TRIANGLES, *pMesh, static_cast< int >( End - First ) );
  }
  else
  {
    io_rContext.DrawArrays( GL_POINTS, static_cast< int >( End - First ) );
  }
}

void VSphereHelper::DrawPicked( CoreGraphics::VRenderContext& io_rContext, const VMoxelScene& i_rScene,
                                VSphereBatch& io_rBatch, const VSphereSizing& i_rSizing )
{
  if ( m_bRemembering )
  {
    m_Drawn.push_back( { &io_rBatch, io_rContext.ViewProjection(), i_rSizing } );
  }
  const VPickWindow Window( io_rContext );
  const auto Count = static_cast< std::uint32_t >( io_rBatch.Count() );
  for ( std::uint32_t First = 0; First < Count; First += GatherBlock )
  {
    m_Picked.clear();
    const std::uint32_t End = std::min( First + GatherBlock, Count );
    const VSphereExtent Extent = io_rBatch.Gather( Window, i_rSizing, i_rScene, First, End, m_Picked );
    if ( !m_Picked.empty() )
    {
      DrawGathered( io_rContext, io_rBatch.FirstId() + First, Extent );
    }
  }
}

void VSphereHelper::DrawGathered( CoreGraphics::VRenderContext& io_rContext, std::uint32_t i_FirstId,
                                  const VSphereExtent& i_rExtent )
{
  // A point covers what the smallest sphere does.
  VMesh* pMesh = m_pGl->MeshFor( i_rExtent, m_Picked.size(), SmallestPixels );
  VInstancedProgramPair& rPrograms = pMesh ? m_pGl->Programs : m_pGl->Points;
  if ( !rPrograms.Use( io_rContext, i_FirstId ) || !m_pGl->Picked.Write( std::span( m_Picked ) ) )
  {
    return;
  }
  std::array< VVertexStream, 2 > Streams;
  std::size_t Count = 0;
  Streams[Count++] = { &m_pGl->Picked, pMesh ? &PickedLayout : &PickedPointLayout, 0 };
  if ( pMesh )
  {
    Streams[Count++] = pMesh->Stream();
  }
  if ( !io_rContext.SetVertexStreams( std::span( Streams ).first( Count ) ) )
  {
    return;
  }
  io_rContext.SetRenderState( m_pGl->State );
  const auto Spheres = static_cast< int >( m_Picked.size() );
  pMesh ? io_rContext.DrawElementsInstanced( GL_TRIANGLES, *pMesh, Spheres )
        : io_rContext.DrawArrays( GL_POINTS, Spheres );
}

bool VSphereHelper::Feed( CoreGraphics::VRenderContext& io_rContext, VSphereBatch& io_rBatch,
                          const VSphereSizing& i_rSizing, CoreGraphics::VMesh* i_pMesh, std::uint32_t i_First )
{
  VSphereBatch::VGl& rGl = *io_rBatch.m_pGl;
  if ( !io_rBatch.UploadSpheres( i_rSizing ) )
  {
    return false;
  }
  std::array< VVertexStream, 3 > Streams;
  std::size_t Count = 0;
  if ( i_pMesh )
  {
    Streams[Count++] = i_pMesh->Stream();
  }
  Streams[Count++] = { &rGl.Spheres, i_pMesh ? &SphereLayout : &PointLayout, i_First * sizeof( VScenePoint ) };
  const bool bVisible = io_rContext.RenderMode() == ERenderModeNormal;
  if ( !bVisible )
  {
    if ( !io_rBatch.UploadFlags() )
    {
      return false;
    }
    Streams[Count++] = { &rGl.Flags, i_pMesh ? &FlagsLayout : &PointFlagsLayout, i_First };
  }
  else if ( !io_rBatch.m_Colours.empty() )
  {
    if ( !io_rBatch.UploadColours() )
    {
      return false;
    }
    Streams[Count++] = { &rGl.Colours, i_pMesh ? &ColourLayout : &PointColourLayout, 0 };
  }
  if ( !io_rContext.SetVertexStreams( std::span( Streams ).first( Count ) ) )
  {
    return false;
  }
  if ( bVisible && io_rBatch.m_Colours.empty() )
  {
    const auto& rColour = io_rBatch.m_Colour;
    io_rContext.SetConstantAttribute( EAttributeModelColour, { rColour[0], rColour[1], rColour[2], rColour[3] } );
  }
  return true;
}

void VSphereHelper::PickInRect( const CoreGraphics::VRenderContext& i_rContext, const QRect& i_rRect,
                                std::vector< std::uint32_t >& io_rIds ) const
{
  const QRect& rViewport = i_rContext.Viewport();
  const float Width = static_cast< float >( rViewport.width() );
  const float Height = static_cast< float >( rViewport.height() );
  const QRect Rect = i_rRect.translated( -rViewport.topLeft() );
  const float Left = 2.0f * static_cast< float >( Rect.left() ) / Width - 1.0f;
  const float Right = 2.0f * static_cast< float >( Rect.left() + Rect.width() ) / Width - 1.0f;
  const float Bottom = 2.0f * static_cast< float >( Rect.top() ) / Height - 1.0f;
  const float Top = 2.0f * static_cast< float >( Rect.top() + Rect.height() ) / Height - 1.0f;
  for ( const VDrawn& rDrawn : m_Drawn )
  {
    std::uint32_t Id = rDrawn.pBatch->FirstId();
    for ( const VScenePoint& rSphere : rDrawn.pBatch->Spheres() )
    {
      const std::uint32_t Own = Id++;
      if ( !( SizeOf( rSphere, rDrawn.Sizing ) > 0 ) )
      {
        continue;
      }
      const QVector4D Clip = rDrawn.ViewProjection * QVector4D( rSphere.X, rSphere.Y, rSphere.Z, 1.0f );
      // Spheres behind the eye would come out mirrored into the rectangle.
      if ( Clip.w() > 0 && Clip.x() >= Left * Clip.w() && Clip.x() <= Right * Clip.w() &&
           Clip.y() >= Bottom * Clip.w() && Clip.y() <= Top * Clip.w() )
      {
        io_rIds.push_back( Own );
      }
    }
  }
}

} // namespace MoxelGraphics
