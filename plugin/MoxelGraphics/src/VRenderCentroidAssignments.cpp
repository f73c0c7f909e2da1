#include <MoxelGraphics/VRenderCentroidAssignments.h>

#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

const QVector4D LineColour( 0.95F, 0.75F, 0.35F, 0.35F );

static_assert( sizeof( VAssignedReconstruction ) == 16 && sizeof( VCameraAssignments ) == 40 );

bool IsPlace( const std::array< float, 3 >& i_rPlace )
{
  return std::isfinite( i_rPlace[0] ) && std::isfinite( i_rPlace[1] ) && std::isfinite( i_rPlace[2] );
}

struct VFilter
{
  int Type = ENone;
  bool bAnySelected = false;

  bool Takes( bool i_bCamera, bool i_bReconstruction ) const
  {
    switch ( Type )
    {
    case EReconstructions:
      return i_bReconstruction;
    case ECameras:
      return i_bCamera;
    case EUnion:
      return i_bCamera || i_bReconstruction || !bAnySelected;
    case EIntersection:
      return i_bCamera && i_bReconstruction;
    default:
      return false;
    }
  }
};
} // namespace

struct VRenderCentroidAssignments::VGl
{
  std::shared_ptr< VShaderProgram > pProgram;
  VDynamicBuffer Buffer;
  std::uint64_t Held = 0; ///< generation of the lines in the buffer
  VRenderState State;
  VUniform Colour{ "u_Colour" };
};

VRenderCentroidAssignments::VRenderCentroidAssignments( std::shared_ptr< CoreGraphics::VResources > i_pResources )
  : m_pGl( std::make_unique< VGl >() )
{
  m_pGl->pProgram = i_pResources->GetProgram( "Simple3D", "UniformColour" );
  m_pGl->State.colourBlend = EColourBlendAlpha;
  m_pGl->State.depthWrite = false;
}

VRenderCentroidAssignments::~VRenderCentroidAssignments() = default;

void VRenderCentroidAssignments::SetReconstructions( std::span< const VAssignedReconstruction > i_Reconstructions )
{
  m_Reconstructions.assign( i_Reconstructions.begin(), i_Reconstructions.end() );
  m_LinesType = ENone;
}

std::span< const float > VRenderCentroidAssignments::Lines( int i_ContributionsType )
{
  if ( i_ContributionsType == ENone )
  {
    return {};
  }
  FillRecords();
  if ( m_LinesType == i_ContributionsType )
  {
    return m_Lines;
  }
  const auto IsSelected = []( const auto& i_rRecord )
  {
    return i_rRecord.Selected != 0;
  };
  const VFilter Filter{ i_ContributionsType,
                        std::any_of( m_Cameras.begin(), m_Cameras.end(), IsSelected ) ||
                            std::any_of( m_Reconstructions.begin(), m_Reconstructions.end(), IsSelected ) };
  m_Lines.clear();
  for ( const VCameraAssignments& rCamera : m_Cameras )
  {
    for ( const std::uint32_t Index : rCamera.Indices )
    {
      if ( Index >= m_Reconstructions.size() )
      {
        continue;
      }
      const VAssignedReconstruction& rPoint = m_Reconstructions[Index];
      if ( Filter.Takes( rCamera.Selected != 0, rPoint.Selected != 0 ) && IsPlace( rCamera.Centre ) &&
           IsPlace( rPoint.Position ) )
      {
        m_Lines.insert( m_Lines.end(), rCamera.Centre.begin(), rCamera.Centre.end() );
        m_Lines.insert( m_Lines.end(), rPoint.Position.begin(), rPoint.Position.end() );
      }
    }
  }
  m_LinesType = i_ContributionsType;
  ++m_Generation;
  return m_Lines;
}

void VRenderCentroidAssignments::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                                         std::uint32_t i_Pass )
{
  if ( io_rContext.RenderMode() != ERenderModeNormal || i_Pass != ERenderPassTranslucent ||
       i_rOptions.ContributionsType == ENone || Lines( i_rOptions.ContributionsType ).empty() )
  {
    return;
  }
  VGl& rGl = *m_pGl;
  if ( rGl.Held != m_Generation || !rGl.Buffer.Bind() )
  {
    rGl.Held = rGl.Buffer.Write( std::span( std::as_const( m_Lines ) ) ) ? m_Generation : 0;
  }
  if ( rGl.Held == 0 || !io_rContext.UseProgram( rGl.pProgram ) ||
       !io_rContext.SetVertexBuffer( { &rGl.Buffer, &PositionLayout(), 0 } ) )
  {
    return;
  }
  io_rContext.SetRenderState( rGl.State );
  rGl.Colour.Set( *rGl.pProgram, LineColour );
  io_rContext.DrawArrays( GL_LINES, static_cast< int >( m_Lines.size() / 3 ) );
}

} // namespace MoxelGraphics
