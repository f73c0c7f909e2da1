#include <MoxelGraphics/VRenderCameraData2D.h>

#include "VTileBatch.h"

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

#include <algorithm>
#include <cstring>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;
using ZEK::VCentroidVertex;

constexpr float NoLimit = 1e6f;

constexpr std::uint8_t PerVertex = 0, PerInstance = 1;

VVertexLayout VertexLayout( std::uint8_t i_Divisor, bool i_bColour )
{
  const VVertexElement Position{ EAttributePosition, 3, GL_FLOAT, false, 0 };
  const VVertexElement Colour{ EAttributeColour, 4, GL_UNSIGNED_BYTE, true, offsetof( VCentroidVertex, Colour ) };
  return i_bColour ? VVertexLayout( sizeof( VCentroidVertex ), i_Divisor, { Position, Colour } )
                   : VVertexLayout( sizeof( VCentroidVertex ), i_Divisor, { Position } );
}

/// How the streams are read: a vertex or an instance a centroid.
struct VLayouts
{
  explicit VLayouts( std::uint8_t i_Divisor )
    : Coloured( VertexLayout( i_Divisor, true ) )
    , Bare( VertexLayout( i_Divisor, false ) )
    , Words( 4, i_Divisor, { { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 0 } } )
    , Tiles( 2, i_Divisor, { { EAttributeTile, 1, GL_UNSIGNED_SHORT, false, 0 } } )
  {
  }
  VVertexLayout Coloured, Bare, Words, Tiles;
};

struct VCentroidSet final : VTileSet
{
  VDynamicBuffer Vertices, Tiles, Words;
  std::size_t Total = 0;
  std::vector< std::uint32_t > Counts; ///< by slot, as `Tiles` holds them
  std::uint64_t WordsSerial = 0;       ///< of the set, and
  std::uint64_t WordsProvider = 0;     ///< generation of the provider that the words are of; 0: of none
};

class VCentroidBatch final : public VTileBatch
{
public:
  explicit VCentroidBatch( std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider )
    : VTileBatch( std::move( i_pProvider ), false )
  {
  }
  /// The selection words of all centroids of the set, without those that the scene ignores.
  bool WriteWords( VCentroidSet& io_rSet, const VMoxelScene& i_rScene, int i_Scheme );

protected:
  std::unique_ptr< VTileSet > MakeSet() const override { return std::make_unique< VCentroidSet >(); }
  bool Write( VRenderContext& io_rContext, VTileSet& io_rSet, std::span< const ZEK::VCameraLists2D > i_Lists ) override;

private:
  static bool WriteTiles( VCentroidSet& io_rSet );
};

bool VCentroidBatch::Write( VRenderContext&, VTileSet& io_rSet, std::span< const ZEK::VCameraLists2D > i_Lists )
{
  VCentroidSet& rSet = static_cast< VCentroidSet& >( io_rSet );
  rSet.Total = 0;
  for ( std::size_t Slot = 0; Slot < i_Lists.size(); ++Slot )
  {
    VTileSlot& rSlot = rSet.Slots[Slot];
    rSlot.First = static_cast< std::uint32_t >( rSet.Total );
    rSlot.Count = static_cast< std::uint32_t >( i_Lists[Slot].pCentroids->size() );
    rSlot.Largest = 0;
    rSet.Total += rSlot.Count;
  }
  if ( rSet.Total == 0 )
  {
    return true;
  }
  auto* pVertex = static_cast< VCentroidVertex* >( rSet.Vertices.Map( rSet.Total * sizeof( VCentroidVertex ) ) );
  if ( !pVertex )
  {
    return false;
  }
  for ( std::size_t Slot = 0; Slot < i_Lists.size(); ++Slot )
  {
    const std::vector< VCentroidVertex >& rVertices = *i_Lists[Slot].pCentroids;
    pVertex = std::copy( rVertices.begin(), rVertices.end(), pVertex );
    float Largest = 0;
    for ( const VCentroidVertex& rVertex : rVertices )
    {
      Largest = std::max( Largest, rVertex.Radius );
    }
    rSet.Slots[Slot].Largest = Largest;
  }
  return rSet.Vertices.Unmap() && WriteTiles( rSet );
}

bool VCentroidBatch::WriteTiles( VCentroidSet& io_rSet )
{
  const auto Slots = std::span( io_rSet.Slots ).first( io_rSet.SlotCount );
  const auto SameCount = []( std::uint32_t i_Count, const VTileSlot& i_rSlot )
  {
    return i_Count == i_rSlot.Count;
  };
  if ( io_rSet.Tiles.Bind() &&
       std::equal( io_rSet.Counts.begin(), io_rSet.Counts.end(), Slots.begin(), Slots.end(), SameCount ) )
  {
    return true;
  }
  io_rSet.Counts.clear();
  auto* pTile = static_cast< std::uint16_t* >( io_rSet.Tiles.Map( io_rSet.Total * sizeof( std::uint16_t ) ) );
  if ( !pTile )
  {
    return false;
  }
  std::uint16_t Number = 0;
  for ( const VTileSlot& rSlot : Slots )
  {
    pTile = std::fill_n( pTile, rSlot.Count, Number++ );
  }
  if ( !io_rSet.Tiles.Unmap() )
  {
    return false;
  }
  for ( const VTileSlot& rSlot : Slots )
  {
    io_rSet.Counts.push_back( rSlot.Count );
  }
  return true;
}

bool VCentroidBatch::WriteWords( VCentroidSet& io_rSet, const VMoxelScene& i_rScene, int i_Scheme )
{
  const bool bIgnoring = !i_rScene.IgnoredIds().empty();
  const std::uint64_t Provider = bIgnoring ? 0 : m_pProvider->GetGeneration();
  if ( Provider != 0 && io_rSet.WordsProvider == Provider && io_rSet.WordsSerial == io_rSet.Serial &&
       io_rSet.Words.Bind() )
  {
    return true;
  }
  io_rSet.WordsProvider = 0;
  auto* pWord = static_cast< std::uint32_t* >( io_rSet.Words.Map( io_rSet.Total * sizeof( std::uint32_t ) ) );
  if ( !pWord )
  {
    return false;
  }
  ZEK::VCameraLists2D Lists;
  ZEK::VDrawWords Colours;
  for ( const VTileSlot& rSlot : std::span( io_rSet.Slots ).first( io_rSet.SlotCount ) )
  {
    const ZEK::VRenderCameraRef pCamera = m_pProvider->GetCamera( rSlot.Name );
    if ( pCamera )
    {
      pCamera->GetDrawData2D( pCamera->GetInfo().FirstCentroidId, static_cast< ZEK::ECentroidColourScheme >( i_Scheme ),
                              false, Lists, Colours );
    }
    const bool bThere = pCamera && Lists.pIds->size() == rSlot.Count;
    pWord = bThere ? std::copy( Lists.pIds->begin(), Lists.pIds->end(), pWord ) : std::fill_n( pWord, rSlot.Count, 0u );
    if ( bIgnoring )
    {
      std::replace_if(
          pWord - rSlot.Count, pWord,
          [&]( std::uint32_t i_Word )
          {
            return i_rScene.IsIgnored( i_Word );
          },
          0u );
    }
  }
  if ( !io_rSet.Words.Unmap() )
  {
    return false;
  }
  io_rSet.WordsProvider = Provider;
  io_rSet.WordsSerial = io_rSet.Serial;
  return true;
}

/// One way of drawing: tiny centroids as points, the others as quads.
struct VLook
{
  std::shared_ptr< VShaderProgram > pNormal, pSelection;
  VUniform Sizes{ "u_Sizes" }, Dot{ "u_Dot" }, Show{ "u_ShowSelection" }, Table{ "t_Tiles" };
};
} // namespace

struct VRenderCameraData2D::VGl
{
  VGl( VMoxelScene& i_rScene, std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider )
    : rScene( i_rScene )
    , Batch( std::move( i_pProvider ) )
  {
    VResources& rResources = *i_rScene.Resources();
    Points.pNormal = rResources.GetProgram( "Centroid2DTiles", "Colour" );
    Points.pSelection = rResources.GetProgram( "Centroid2DTiles", "Greyscale2DSelection" );
    Quads.pNormal = rResources.GetProgram( "Centroid2DTileQuads", "Centroid2DTileQuads" );
    Quads.pSelection = rResources.GetProgram( "Centroid2DTileQuads", "Centroid2DTileQuadsSelection" );
    State.colourBlend = EColourBlendAlpha;
    State.depthTest = State.depthWrite = false;
  }
  bool Draw( VRenderContext& io_rContext, VTileBatch::VDraw& i_rDraw, bool i_bQuads );
  bool DrawAll( VRenderContext& io_rContext, const VSceneOptions& i_rOptions );

  VMoxelScene& rScene;
  VCentroidBatch Batch;
  VLook Points, Quads;
  VUnitSquare Square;
  VRenderState State;
};

bool VRenderCameraData2D::VGl::Draw( VRenderContext& io_rContext, VTileBatch::VDraw& i_rDraw, bool i_bQuads )
{
  static const VLayouts PointLayouts( PerVertex ), QuadLayouts( PerInstance );
  const bool bVisible = io_rContext.RenderMode() == ERenderModeNormal;
  VLook& rLook = i_bQuads ? Quads : Points;
  const auto& rpProgram = bVisible ? rLook.pNormal : rLook.pSelection;
  if ( !io_rContext.UseProgram( rpProgram ) )
  {
    return true; // costs this look its draw and nothing else
  }
  VCentroidSet& rSet = static_cast< VCentroidSet& >( *i_rDraw.pSet );
  const std::size_t First = i_bQuads ? i_rDraw.LargeFirst : i_rDraw.First;
  const std::size_t End = i_bQuads ? i_rDraw.LargeEnd : i_rDraw.End;
  const VLayouts& rLayouts = i_bQuads ? QuadLayouts : PointLayouts;
  std::array< VVertexStream, 4 > Streams;
  std::size_t Count = 0;
  Streams[Count++] = { &rSet.Vertices, bVisible ? &rLayouts.Coloured : &rLayouts.Bare,
                       First * sizeof( VCentroidVertex ) };
  Streams[Count++] = { &rSet.Tiles, &rLayouts.Tiles, First * sizeof( std::uint16_t ) };
  if ( !bVisible )
  {
    Streams[Count++] = { &rSet.Words, &rLayouts.Words, First * sizeof( std::uint32_t ) };
  }
  if ( i_bQuads )
  {
    Streams[Count++] = Square.Stream();
  }
  if ( !i_rDraw.pTable->Bind( io_rContext, 0 ) || !io_rContext.SetVertexStreams( std::span( Streams ).first( Count ) ) )
  {
    return false;
  }
  io_rContext.SetRenderState( State );
  rLook.Table.Set( *rpProgram, 0 );
  rLook.Sizes.Set( *rpProgram, i_bQuads ? QVector2D( VTileBatch::LargePixels, NoLimit )
                                        : QVector2D( -NoLimit, VTileBatch::LargePixels ) );
  if ( !i_bQuads )
  {
    // In a grid of many cameras most centroids are tiny, and a single pixel is not seen.
    rLook.Dot.Set( *rpProgram, bVisible ? std::max( 1.0f, io_rContext.PixelRatio() ) * VTileBatch::LargePixels : 1.0f );
  }
  rLook.Show.Set( *rpProgram, io_rContext.RenderMode() == ERenderModeHighlight ? 1 : 0 );
  const auto Objects = static_cast< int >( End - First );
  i_bQuads ? io_rContext.DrawArraysInstanced( GL_TRIANGLE_STRIP, 4, Objects )
           : io_rContext.DrawArrays( GL_POINTS, Objects );
  return true;
}

bool VRenderCameraData2D::VGl::DrawAll( VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  VTileBatch::VDraw Draw;
  if ( !Batch.Prepare( io_rContext, i_rOptions, Draw ) )
  {
    return true;
  }
  VCentroidSet& rSet = static_cast< VCentroidSet& >( *Draw.pSet );
  if ( io_rContext.RenderMode() != ERenderModeNormal &&
       !Batch.WriteWords( rSet, rScene, i_rOptions.CentroidColourScheme ) )
  {
    return false;
  }
  return this->Draw( io_rContext, Draw, false ) &&
         ( Draw.LargeEnd <= Draw.LargeFirst || this->Draw( io_rContext, Draw, true ) );
}

VRenderCameraData2D::VRenderCameraData2D( VMoxelScene& i_rScene,
                                          std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider )
  : m_pGl( std::make_unique< VGl >( i_rScene, std::move( i_pProvider ) ) )
{
}

VRenderCameraData2D::~VRenderCameraData2D() = default;

void VRenderCameraData2D::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                                  std::uint32_t i_Pass )
{
  if ( i_Pass == ERenderPassOverlay && i_rOptions.CameraView && i_rOptions.CameraCentroids &&
       !i_rOptions.OverlayCamera.isEmpty() )
  {
    m_pGl->Batch.Collect( io_rContext, i_rOptions );
  }
}

void VRenderCameraData2D::RenderTiles( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  VGl& rGl = *m_pGl;
  if ( io_rContext.RenderMode() == ERenderModeHighlight && !HasMarks( rGl.rScene, ZEK::ESelectCentroid ) )
  {
    rGl.Batch.Forget();
    return;
  }
  if ( rGl.rScene.TilesAgain() )
  {
    rGl.Batch.Again();
  }
  if ( !rGl.DrawAll( io_rContext, i_rOptions ) )
  {
    // The buffers may have died with the windows that shared them.
    rGl.Batch.Invalidate();
    rGl.Batch.Again();
    rGl.DrawAll( io_rContext, i_rOptions );
  }
}

} // namespace MoxelGraphics
