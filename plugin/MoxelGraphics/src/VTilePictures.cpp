#include "VTilePictures.h"

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>
#include <CoreMoxelTypes/Camera.h>

#include <algorithm>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

constexpr std::uint8_t Masked = 0xFF;
constexpr std::uint32_t MaskColour = 0x8CAA784B;
constexpr std::uint32_t BorderColour = 0xFF808080;
/// A lens bends the border.
constexpr int BorderSteps = 16;
constexpr int OutlineVertices = 4 * BorderSteps * 2;

const VVertexLayout CornerLayout( 8, 0, { { EAttributeUV, 2, GL_FLOAT, false, 0 } } );
const VVertexLayout RectangleLayout( 16, 1,
                                     { { EAttributePosition, 4, GL_UNSIGNED_SHORT, false, 0 },
                                       { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 8 },
                                       { EAttributeTile, 1, GL_FLOAT, false, 12 } } );
const VVertexLayout
    SpotLayout( 16, 0, { { EAttributePosition, 3, GL_FLOAT, false, 0 }, { EAttributeTile, 1, GL_FLOAT, false, 12 } } );

std::uint16_t Edge( std::size_t i_Pixel )
{
  return static_cast< std::uint16_t >( std::min< std::size_t >( i_Pixel, 0xFFFF ) );
}

/// Lines once around the unit square.
std::vector< float > Outline()
{
  std::vector< float > Lines;
  constexpr float Corners[5][2] = { { 0, 0 }, { 1, 0 }, { 1, 1 }, { 0, 1 }, { 0, 0 } };
  const auto Add = [&]( int i_Step )
  {
    const auto Side = std::min( i_Step / BorderSteps, 3 );
    const float Share = static_cast< float >( i_Step - Side * BorderSteps ) / BorderSteps;
    for ( std::size_t Axis = 0; Axis < 2; ++Axis )
    {
      Lines.push_back( Corners[Side][Axis] + Share * ( Corners[Side + 1][Axis] - Corners[Side][Axis] ) );
    }
  };
  for ( int Step = 0; Step < 4 * BorderSteps; ++Step )
  {
    Add( Step );
    Add( Step + 1 );
  }
  return Lines;
}
} // namespace

VTilePictures::VTilePictures( const VMoxelScene& i_rScene,
                              std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider )
  : m_rScene( i_rScene )
  , m_pProvider( i_pProvider )
  , m_Tiles( std::move( i_pProvider ) )
{
  VResources& rResources = *i_rScene.Resources();
  m_Mask.pProgram = rResources.GetProgram( "MaskSquareTiles", "MaskTiles" );
  m_MaskSelection.pProgram = rResources.GetProgram( "MaskSquareTiles", "MaskTilesSelection" );
  m_Edge.pProgram = rResources.GetProgram( "Edge2DTiles", "MaskTiles" );
  m_WandLook.pProgram = rResources.GetProgram( "WandWave2DTiles", "WandWave2DTiles" );
  constexpr std::array< float, 8 > Corners{ 0, 0, 1, 0, 0, 1, 1, 1 };
  m_Square.SetContents( std::span( Corners ) );
  const std::vector< float > Lines = Outline();
  m_Outline.SetContents( std::span( Lines ) );
  m_BlendState.colourBlend = EColourBlendAlpha;
  m_BlendState.depthTest = m_BlendState.depthWrite = false;
  m_IdState.depthTest = m_IdState.depthWrite = false;
}

void VTilePictures::SetPictures( std::span< const VCameraPictures > i_Pictures, double i_Frame )
{
  m_Frame = i_Frame;
  bool bMasks = i_Pictures.size() != m_Pictures.size(), bEdges = bMasks, bWand = bMasks, bIds = bMasks;
  m_Edited = i_Pictures.size();
  for ( std::size_t Index = 0; Index < i_Pictures.size(); ++Index )
  {
    const VCameraPictures& rNew = i_Pictures[Index];
    if ( rNew.FirstCellId != 0 )
    {
      m_Edited = Index;
    }
    if ( Index < m_Pictures.size() )
    {
      const VCameraPictures& rOld = m_Pictures[Index];
      bMasks = bMasks || rNew.MaskGeneration != rOld.MaskGeneration;
      bEdges = bEdges || rNew.EdgesGeneration != rOld.EdgesGeneration;
      bWand = bWand || rNew.WandGeneration != rOld.WandGeneration;
      bIds = bIds || rNew.FirstCellId != rOld.FirstCellId;
    }
  }
  m_Pictures.assign( i_Pictures.begin(), i_Pictures.end() );
  const std::span< const VMarkedCell > Marked =
      m_Edited < i_Pictures.size() ? i_Pictures[m_Edited].MarkedCells : std::span< const VMarkedCell >();
  bIds = bIds || bMasks || !std::equal( Marked.begin(), Marked.end(), m_MarkedCells.begin(), m_MarkedCells.end() );
  m_MarkedCells.assign( Marked.begin(), Marked.end() );
  m_MasksGeneration += bMasks;
  m_EdgesGeneration += bEdges;
  m_WandGeneration += bWand;
  m_CellsGeneration += bIds;
}

bool VTilePictures::Wants( const VSceneOptions& i_rOptions, int i_RenderMode ) const
{
  if ( i_RenderMode != ERenderModeNormal )
  {
    return i_rOptions.CameraMaskGrid && m_Edited < m_Pictures.size() &&
           ( i_RenderMode == ERenderModeSelection || !m_MarkedCells.empty() );
  }
  return i_rOptions.CameraMaskGrid || i_rOptions.CameraGreyscale || i_rOptions.CameraWandSmear ||
         i_rOptions.CameraBorder;
}

void VTilePictures::Collect( const CoreGraphics::VRenderContext& i_rContext, const VSceneOptions& i_rOptions )
{
  if ( Wants( i_rOptions, i_rContext.RenderMode() ) )
  {
    m_Tiles.Collect( i_rContext, i_rOptions );
  }
}

VTilePictures::VRectangle VTilePictures::CellOf( const CoreMoxelTypes::VCameraMaskGrid& i_rMask, std::size_t i_Cell )
{
  const std::size_t Column = i_Cell % i_rMask.Columns, Row = i_Cell / i_rMask.Columns;
  return { Edge( Column * i_rMask.CellWidth ), Edge( Row * i_rMask.CellHeight ),
           Edge( ( Column + 1 ) * i_rMask.CellWidth ), Edge( ( Row + 1 ) * i_rMask.CellHeight ) };
}

void VTilePictures::MakeMasks()
{
  if ( std::exchange( m_Masks.MadeOf, m_MasksGeneration ) == m_MasksGeneration )
  {
    return;
  }
  ++m_Masks.Generation;
  m_Masks.Items.clear();
  for ( std::size_t Camera = 0; Camera < m_Pictures.size(); ++Camera )
  {
    const CoreMoxelTypes::VCameraMaskGrid* const pMask = m_Pictures[Camera].pMask;
    const std::uint32_t Count = pMask ? CellCount( *pMask ) : 0;
    for ( std::uint32_t Cell = 0; Cell < Count; ++Cell )
    {
      if ( pMask->Cells[Cell] == Masked )
      {
        VRectangle& rItem = m_Masks.Items.emplace_back( CellOf( *pMask, Cell ) );
        rItem.Colour = MaskColour;
        rItem.Tile = static_cast< float >( Camera );
      }
    }
  }
}

/// All cells that can be picked in the selection mode, masked or not; the marked ones in the highlight mode.
void VTilePictures::MakeCellIds( VList< VRectangle >& io_rList, int i_RenderMode )
{
  const bool bAll = i_RenderMode == ERenderModeSelection;
  const bool bHiding = bAll && !m_rScene.IgnoredIds().empty();
  if ( std::exchange( io_rList.MadeOf, bHiding ? 0 : m_CellsGeneration ) == m_CellsGeneration && !bHiding )
  {
    return;
  }
  ++io_rList.Generation;
  io_rList.Items.clear();
  const VCameraPictures& rCamera = m_Pictures[m_Edited];
  const std::uint32_t Count = rCamera.pMask ? CellCount( *rCamera.pMask ) : 0;
  const auto Add = [&]( std::uint32_t i_Cell, std::uint32_t i_Flags )
  {
    const std::uint32_t Word = ( rCamera.FirstCellId + i_Cell ) | i_Flags;
    if ( i_Cell < Count && !m_rScene.IgnoreId( Word, i_RenderMode ) )
    {
      VRectangle& rItem = io_rList.Items.emplace_back( CellOf( *rCamera.pMask, i_Cell ) );
      rItem.Colour = Word;
      rItem.Tile = static_cast< float >( m_Edited );
    }
  };
  for ( std::uint32_t Cell = 0; bAll && Cell < Count; ++Cell )
  {
    Add( Cell, 0 );
  }
  for ( const VMarkedCell& rCell : m_MarkedCells )
  {
    if ( !bAll )
    {
      Add( rCell.Cell, rCell.Flags );
    }
  }
}

void VTilePictures::MakeEdges()
{
  if ( std::exchange( m_Edges.MadeOf, m_EdgesGeneration ) == m_EdgesGeneration )
  {
    return;
  }
  ++m_Edges.Generation;
  m_Edges.Items.clear();
  for ( std::size_t Camera = 0; Camera < m_Pictures.size(); ++Camera )
  {
    const CoreMoxelTypes::VEdgePairSet* const pEdges = m_Pictures[Camera].pEdges;
    if ( !pEdges )
    {
      continue;
    }
    const auto Add = [&]( float i_X, float i_Y, std::uint8_t i_Grey )
    {
      const float X = pEdges->SensorScale.x * ( i_X - 0.5F ) + pEdges->SensorOffset.x;
      const float Y = pEdges->SensorScale.y * i_Y + pEdges->SensorOffset.y;
      if ( std::isfinite( X ) && std::isfinite( Y ) )
      {
        m_Edges.Items.push_back( { X, Y, static_cast< float >( i_Grey ) / 255.0F, static_cast< float >( Camera ) } );
      }
    };
    for ( const CoreMoxelTypes::VEdgePair& rPair : pEdges->Pairs )
    {
      Add( rPair.Left, rPair.y, rPair.GreyLeft );
      Add( rPair.Right, rPair.y, rPair.GreyRight );
    }
  }
}

void VTilePictures::MakeWand()
{
  if ( std::exchange( m_Wand.MadeOf, m_WandGeneration ) == m_WandGeneration )
  {
    return;
  }
  ++m_Wand.Generation;
  m_Wand.Items.clear();
  for ( std::size_t Camera = 0; Camera < m_Pictures.size(); ++Camera )
  {
    for ( const VWandPoint& rPoint : m_Pictures[Camera].Wand )
    {
      m_Wand.Items.push_back( { rPoint.X, rPoint.Y, rPoint.Frame, static_cast< float >( Camera ) } );
    }
  }
}

void VTilePictures::MakeBorders()
{
  if ( std::exchange( m_Borders.MadeOf, m_CamerasGeneration ) == m_CamerasGeneration )
  {
    return;
  }
  ++m_Borders.Generation;
  m_Borders.Items.clear();
  for ( const ZEK::VRenderCameraRef& rpCamera : m_pProvider->GetCameras() )
  {
    const ZEK::VRenderCameraInfo& rInfo = rpCamera->GetInfo();
    m_Borders.Items.push_back( { 0, 0, Edge( rInfo.SensorWidth ), Edge( rInfo.SensorHeight ), BorderColour,
                                 static_cast< float >( rInfo.Number ) } );
  }
}

bool VTilePictures::Use( CoreGraphics::VRenderContext& io_rContext, VLook& io_rLook )
{
  if ( !io_rContext.UseProgram( io_rLook.pProgram ) || !m_pTable->Bind( io_rContext, 0 ) )
  {
    return false;
  }
  io_rLook.Table.Set( *io_rLook.pProgram, 0 );
  return true;
}

void VTilePictures::DrawRectangles( CoreGraphics::VRenderContext& io_rContext, VLook& io_rLook,
                                    VList< VRectangle >& io_rList, bool i_bOutline )
{
  static_assert( sizeof( VRectangle ) == 16 && sizeof( VSpot ) == 16 );
  const VVertexStream Streams[] = { { i_bOutline ? &m_Outline : &m_Square, &CornerLayout, 0 },
                                    { &io_rList.Buffer.Buffer, &RectangleLayout, 0 } };
  if ( io_rList.Items.empty() || !io_rList.Buffer.Feed( io_rList.Items, io_rList.Generation ) ||
       !Use( io_rContext, io_rLook ) || !io_rContext.SetVertexStreams( Streams ) )
  {
    return;
  }
  const bool bVisible = io_rContext.RenderMode() == ERenderModeNormal;
  io_rLook.Show.Set( *io_rLook.pProgram, io_rContext.RenderMode() == ERenderModeHighlight ? 1 : 0 );
  io_rContext.SetRenderState( bVisible ? m_BlendState : m_IdState );
  const auto Count = static_cast< int >( io_rList.Items.size() );
  i_bOutline ? io_rContext.DrawArraysInstanced( GL_LINES, OutlineVertices, Count )
             : io_rContext.DrawArraysInstanced( GL_TRIANGLE_STRIP, 4, Count );
}

void VTilePictures::DrawSpots( CoreGraphics::VRenderContext& io_rContext, VLook& io_rLook, VList< VSpot >& io_rList )
{
  if ( !io_rList.Items.empty() && io_rList.Buffer.Feed( io_rList.Items, io_rList.Generation ) &&
       Use( io_rContext, io_rLook ) && io_rContext.SetVertexBuffer( { &io_rList.Buffer.Buffer, &SpotLayout, 0 } ) )
  {
    io_rLook.Frame.Set( *io_rLook.pProgram, static_cast< float >( m_Frame ) );
    io_rContext.SetRenderState( m_BlendState );
    io_rContext.DrawArrays( GL_POINTS, static_cast< int >( io_rList.Items.size() ) );
  }
}

void VTilePictures::DrawUnder( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  if ( m_rScene.TilesAgain() )
  {
    m_Tiles.Again();
  }
  m_pTable = m_Tiles.Prepare( io_rContext, i_rOptions );
  const int Mode = io_rContext.RenderMode();
  if ( !m_pTable || !i_rOptions.CameraMaskGrid )
  {
    return;
  }
  if ( Mode == ERenderModeNormal )
  {
    MakeMasks();
    DrawRectangles( io_rContext, m_Mask, m_Masks, false );
  }
  else if ( m_Edited < m_Pictures.size() )
  {
    VList< VRectangle >& rList = Mode == ERenderModeSelection ? m_Cells : m_Marked;
    MakeCellIds( rList, Mode );
    DrawRectangles( io_rContext, m_MaskSelection, rList, false );
  }
}

void VTilePictures::DrawOver( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  if ( !m_pTable || io_rContext.RenderMode() != ERenderModeNormal )
  {
    return;
  }
  if ( i_rOptions.CameraGreyscale )
  {
    MakeEdges();
    DrawSpots( io_rContext, m_Edge, m_Edges );
  }
  if ( i_rOptions.CameraWandSmear )
  {
    MakeWand();
    DrawSpots( io_rContext, m_WandLook, m_Wand );
  }
  if ( i_rOptions.CameraBorder )
  {
    MakeBorders();
    DrawRectangles( io_rContext, m_Mask, m_Borders, true );
  }
}

} // namespace MoxelGraphics
