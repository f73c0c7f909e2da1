#include <MoxelGraphics/VRenderCameraData3D.h>

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>

#include "VTileBatch.h"

#include <ComputeCameraModel/VCameraModel.h>
#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

#include <algorithm>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;
using ZEK::VCentroidVertex;

const VVertexElement Position{ EAttributePosition, 2, GL_FLOAT, false, 0 };
const VVertexLayout ColouredLayout(
    sizeof( VCentroidVertex ), 0,
    { Position, { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, offsetof( VCentroidVertex, Colour ) } } );
const VVertexLayout BareLayout( sizeof( VCentroidVertex ), 0, { Position } );
const VVertexLayout WordLayout( 4, 0, { { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 0 } } );
const VVertexLayout TileLayout( 2, 0, { { EAttributeTile, 1, GL_UNSIGNED_SHORT, false, 0 } } );

constexpr std::size_t RowFloats = 32, MostCameras = 0x10000;
constexpr std::uint32_t Marked = EIdSelected | EIdPreselected;

/// From sensor pixels on the plane z = 1 of the frustum to the world, three rows of four.
void FillRow( const ZEK::IRenderCamera& i_rCamera, float* o_pRow )
{
  const ZEK::VMatrix4& rFrustum = i_rCamera.GetModel().FrustumTransform;
  const ZEK::VRenderCameraInfo& rInfo = i_rCamera.GetInfo();
  const float X = 2.0f / static_cast< float >( std::max( rInfo.SensorWidth, 1u ) );
  const float Y = 2.0f / static_cast< float >( std::max( rInfo.SensorHeight, 1u ) );
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    const float A = rFrustum[Row], B = rFrustum[4 + Row];
    *o_pRow++ = A * X;
    *o_pRow++ = B * Y;
    *o_pRow++ = rFrustum[8 + Row] - A - B;
    *o_pRow++ = rFrustum[12 + Row];
  }
}
} // namespace

struct VRenderCameraData3D::VGl
{
  /// What the buffers were made of.
  struct VKey
  {
    std::uint64_t Provider = 0;
    int Scheme = 0;
    bool bCentroids = false, bGreyscale = false;

    friend bool operator==( const VKey&, const VKey& ) = default;
  };

  VGl( VMoxelScene& i_rScene, std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider )
    : rScene( i_rScene )
    , pCameras( std::move( i_pProvider ) )
    , pProgram( i_rScene.Resources()->GetProgram( "Centroid3DTiles", "Colour" ) )
  {
  }
  bool Write( VRenderContext& io_rContext, const VKey& i_rKey );
  bool WriteWords( bool i_bHighlight );
  bool MakeWords( bool i_bHighlight );
  bool Draw( VRenderContext& io_rContext, const VKey& i_rKey );
  void Gather( const ZEK::IRenderCamera& i_rCamera, const VKey& i_rKey );

  VMoxelScene& rScene;
  const std::shared_ptr< const ZEK::IRenderCameraProvider > pCameras;
  std::shared_ptr< VShaderProgram > pProgram;
  VUniform Table{ "t_Tiles" };
  VRenderState State;
  /// The selection words as one mode draws them.
  struct VModeWords
  {
    VDynamicBuffer Buffer;
    std::uint64_t MadeOf = 0; ///< number of the vertices' writing; 0: to be made anew
    bool bAny = false;
  };
  std::array< VModeWords, 2 > ModeWords; ///< of picking and of highlighting
  VDynamicBuffer VertexBuffer, TileBuffer;
  VTexelBuffer Rows{ ETexelFloats };
  VKey Key;
  std::uint64_t Written = 0; ///< how often the vertices were
  bool bMade = false;
  std::vector< VCentroidVertex > Vertices;
  std::vector< std::uint32_t > Words, Shown;
  std::vector< std::uint16_t > Tiles;
  std::vector< float > Matrices;
  ZEK::VCameraLists3D Lists;
  ZEK::VDrawWords Ids;
};

void VRenderCameraData3D::VGl::Gather( const ZEK::IRenderCamera& i_rCamera, const VKey& i_rKey )
{
  i_rCamera.GetDrawData3D( Ids, Lists, static_cast< ZEK::ECentroidColourScheme >( i_rKey.Scheme ) );
  const auto Tile = static_cast< std::uint16_t >( Matrices.size() / RowFloats );
  if ( i_rKey.bGreyscale )
  {
    Vertices.insert( Vertices.end(), Lists.pGreyscale->begin(), Lists.pGreyscale->end() );
  }
  // A span of grey has no id of its own.
  Words.resize( Vertices.size(), 0 );
  if ( i_rKey.bCentroids )
  {
    Vertices.insert( Vertices.end(), Lists.pCentroids->begin(), Lists.pCentroids->end() );
    Words.insert( Words.end(), Ids->begin(), Ids->end() );
    Words.resize( Vertices.size(), 0 );
  }
  Tiles.resize( Vertices.size(), Tile );
  Matrices.resize( Matrices.size() + RowFloats );
  FillRow( i_rCamera, Matrices.data() + Tile * RowFloats );
  Lists = {};
  Ids.reset();
}

bool VRenderCameraData3D::VGl::Write( VRenderContext& io_rContext, const VKey& i_rKey )
{
  if ( bMade && Key == i_rKey && i_rKey.Provider != 0 )
  {
    return !Vertices.empty();
  }
  bMade = false;
  Key = i_rKey;
  Vertices.clear();
  Words.clear();
  Tiles.clear();
  Matrices.clear();
  ++Written;
  for ( const ZEK::VRenderCameraRef& rpCamera : pCameras->GetCameras() )
  {
    if ( rpCamera->GetInfo().bCalibrated && Matrices.size() / RowFloats < MostCameras )
    {
      Gather( *rpCamera, i_rKey );
    }
  }
  bMade = true;
  if ( Vertices.empty() )
  {
    return false;
  }
  void* const pRows = Rows.Map( io_rContext, Matrices.size() * sizeof( float ), false );
  if ( pRows )
  {
    std::copy( Matrices.begin(), Matrices.end(), static_cast< float* >( pRows ) );
  }
  bMade = pRows && Rows.Unmap( io_rContext ) && VertexBuffer.Write( std::span( std::as_const( Vertices ) ) ) &&
          TileBuffer.Write( std::span( std::as_const( Tiles ) ) );
  return bMade;
}

bool VRenderCameraData3D::VGl::WriteWords( bool i_bHighlight )
{
  VModeWords& rMode = ModeWords[i_bHighlight ? 1 : 0];
  // What a band found draws no more, one layer after another.
  const bool bIgnoring = !i_bHighlight && !rScene.IgnoredIds().empty();
  if ( !bIgnoring && rMode.MadeOf == Written && ( !rMode.bAny || rMode.Buffer.Bind() ) )
  {
    return rMode.bAny;
  }
  rMode.MadeOf = 0;
  rMode.bAny = MakeWords( i_bHighlight );
  if ( rMode.bAny && !rMode.Buffer.Write( std::span( std::as_const( Shown ) ) ) )
  {
    return false;
  }
  rMode.MadeOf = bIgnoring ? 0 : Written;
  return rMode.bAny;
}

bool VRenderCameraData3D::VGl::MakeWords( bool i_bHighlight )
{
  const auto Word = [&]( std::uint32_t i_Word )
  {
    const bool bShown = i_bHighlight ? ( i_Word & Marked ) != 0 : !rScene.IsIgnored( i_Word );
    return bShown ? i_Word : 0;
  };
  Shown.resize( Words.size() );
  std::transform( Words.begin(), Words.end(), Shown.begin(), Word );
  return std::any_of( Shown.begin(), Shown.end(),
                      []( std::uint32_t i_Word )
                      {
                        return i_Word != 0;
                      } );
}

bool VRenderCameraData3D::VGl::Draw( VRenderContext& io_rContext, const VKey& i_rKey )
{
  const int Mode = io_rContext.RenderMode();
  const bool bVisible = Mode == ERenderModeNormal;
  if ( !Write( io_rContext, i_rKey ) || ( !bVisible && !WriteWords( Mode == ERenderModeHighlight ) ) ||
       !io_rContext.UseProgram( pProgram ) )
  {
    return true;
  }
  VDynamicBuffer& rWordBuffer = ModeWords[Mode == ERenderModeHighlight ? 1 : 0].Buffer;
  const std::array< VVertexStream, 3 > Streams{
      VVertexStream{ &VertexBuffer, bVisible ? &ColouredLayout : &BareLayout, 0 },
      VVertexStream{ &TileBuffer, &TileLayout, 0 }, VVertexStream{ &rWordBuffer, &WordLayout, 0 } };
  if ( !Rows.Bind( io_rContext, 0 ) || !io_rContext.SetVertexStreams( std::span( Streams ).first( bVisible ? 2 : 3 ) ) )
  {
    return false;
  }
  Table.Set( *pProgram, 0 );
  io_rContext.SetRenderState( State );
  io_rContext.DrawArrays( GL_POINTS, static_cast< int >( Vertices.size() ) );
  return true;
}

VRenderCameraData3D::VRenderCameraData3D( VMoxelScene& i_rScene,
                                          std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider )
  : m_pGl( std::make_unique< VGl >( i_rScene, std::move( i_pProvider ) ) )
{
}

VRenderCameraData3D::~VRenderCameraData3D() = default;

void VRenderCameraData3D::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                                  std::uint32_t i_Pass )
{
  const bool bPlanes = i_Pass == ERenderPassOpaque && !i_rOptions.CameraView && i_rOptions.OverlayCamera.isEmpty() &&
                       i_rOptions.Cameras && i_rOptions.CameraFrustums;
  if ( !bPlanes || !( i_rOptions.CameraCentroids || i_rOptions.CameraGreyscale ) )
  {
    return;
  }
  VGl& rGl = *m_pGl;
  if ( io_rContext.RenderMode() == ERenderModeHighlight && !HasMarks( rGl.rScene, ZEK::ESelectCentroid ) )
  {
    return;
  }
  const VGl::VKey Key{ rGl.pCameras->GetGeneration(), i_rOptions.CentroidColourScheme, i_rOptions.CameraCentroids,
                       i_rOptions.CameraGreyscale };
  if ( !rGl.Draw( io_rContext, Key ) )
  {
    // The buffers may have died with the windows that shared them.
    rGl.bMade = false;
    rGl.Draw( io_rContext, Key );
  }
}

} // namespace MoxelGraphics
