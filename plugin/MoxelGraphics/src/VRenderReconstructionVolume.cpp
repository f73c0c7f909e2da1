#include <MoxelGraphics/VRenderReconstructionVolume.h>

#include "BuiltInMeshes.h"

#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

constexpr float LargestPlace = 1e9F; // mm
/// How far the edges on the floor are drawn above it, mm: in its plane they would fight with it.
constexpr float EdgeLift = 10.0F;
const QVector4D EdgeColour( 0.5F, 0.5F, 0.5F, 1.0F );
const QVector4D FarColour( 0.5F, 0.5F, 0.5F, 0.2F );
const QVector4D NearColour( 0.5F, 0.5F, 0.5F, 0.1F );
} // namespace

struct VRenderReconstructionVolume::VGl
{
  std::shared_ptr< VShaderProgram > pWalls;
  std::shared_ptr< VShaderProgram > pEdges;
  // A wall on the floor would fight with it.
  VMesh WallsZUp = MakeBoxMesh( EBoxAll & ~EBoxLowZ );
  VMesh WallsYUp = MakeBoxMesh( EBoxAll & ~EBoxLowY );
  VMesh Edges = MakeBoxEdges();
  VRenderState WallState;
  VRenderState EdgeState;
  VUniform WallTransform{ "u_ModelTransform" };
  VUniform WallColour{ "u_ModelColour" };
  VUniform EdgeTransform{ "u_ModelTransform" };
  VUniform EdgeColourUniform{ "u_Colour" };

  void Walls( VRenderContext& io_rContext, const QMatrix4x4& i_rModel )
  {
    VMesh& rMesh = io_rContext.YUp() ? WallsYUp : WallsZUp;
    if ( !io_rContext.UseProgram( pWalls ) || !io_rContext.SetVertexBuffer( rMesh.Stream() ) )
    {
      return;
    }
    WallTransform.Set( *pWalls, i_rModel );
    for ( const int Cull : { ECullFront, ECullBack } )
    {
      WallState.cullMode = Cull;
      io_rContext.SetRenderState( WallState );
      WallColour.Set( *pWalls, Cull == ECullFront ? FarColour : NearColour );
      io_rContext.DrawElements( GL_TRIANGLES, rMesh );
    }
  }
  void Lines( VRenderContext& io_rContext, const QMatrix4x4& i_rModel )
  {
    if ( !io_rContext.UseProgram( pEdges ) || !io_rContext.SetVertexBuffer( Edges.Stream() ) )
    {
      return;
    }
    io_rContext.SetRenderState( EdgeState );
    EdgeTransform.Set( *pEdges, i_rModel );
    EdgeColourUniform.Set( *pEdges, EdgeColour );
    io_rContext.DrawElements( GL_LINES, Edges );
  }
};

VRenderReconstructionVolume::VRenderReconstructionVolume( std::shared_ptr< CoreGraphics::VResources > i_pResources )
  : m_pGl( std::make_unique< VGl >() )
{
  m_pGl->pWalls = i_pResources->GetProgram( "Simple3DModelColour", "SimpleLighting" );
  m_pGl->pEdges = i_pResources->GetProgram( "Simple3DModelWireframe", "UniformColour" );
  m_pGl->WallState.colourBlend = EColourBlendAlpha;
  m_pGl->WallState.depthWrite = false;
  m_pGl->EdgeState.depthFunction = EDepthLessOrEqual;
}

VRenderReconstructionVolume::~VRenderReconstructionVolume() = default;

void VRenderReconstructionVolume::SetVolume( const std::array< float, 3 >& i_rCorner,
                                             const std::array< float, 3 >& i_rOpposite )
{
  m_bShown = true;
  for ( std::size_t Axis = 0; Axis < 3; ++Axis )
  {
    m_Minimum[Axis] = std::min( i_rCorner[Axis], i_rOpposite[Axis] );
    m_Maximum[Axis] = std::max( i_rCorner[Axis], i_rOpposite[Axis] );
    const bool bPlaces = std::abs( i_rCorner[Axis] ) < LargestPlace && std::abs( i_rOpposite[Axis] ) < LargestPlace;
    m_bShown = m_bShown && bPlaces && m_Minimum[Axis] < m_Maximum[Axis];
  }
}

void VRenderReconstructionVolume::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                                          std::uint32_t i_Pass )
{
  if ( !i_rOptions.ReconstructionVolume || io_rContext.RenderMode() != ERenderModeNormal || !m_bShown ||
       i_Pass == ERenderPassOverlay )
  {
    return;
  }
  QVector3D Low( m_Minimum[0], m_Minimum[1], m_Minimum[2] );
  const QVector3D High( m_Maximum[0], m_Maximum[1], m_Maximum[2] );
  float& rFoot = Low[io_rContext.YUp() ? 1 : 2];
  rFoot = std::abs( rFoot ) < EdgeLift ? std::min( EdgeLift, High[io_rContext.YUp() ? 1 : 2] ) : rFoot;
  QMatrix4x4 Model;
  Model.translate( 0.5F * ( Low + High ) );
  Model.scale( High - Low );
  if ( i_Pass == ERenderPassOpaque )
  {
    m_pGl->Lines( io_rContext, Model );
  }
  else
  {
    m_pGl->Walls( io_rContext, Model );
  }
}

} // namespace MoxelGraphics
