#include "VMaximisedGreyscale.h"

#include "Log.h"
#include "VGreyscaleBatch.h"

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

/// A grey pixel: its place in units of the point's size.
struct VPoint
{
  float X, Y;
  std::uint32_t Colour;
};
const VVertexElement Position{ EAttributePosition, 2, GL_FLOAT, false, 0 };
const VVertexLayout PointLayout( sizeof( VPoint ), 0,
                                 { Position, { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 8 } } );
const VVertexLayout PlaceLayout( sizeof( VPoint ), 0, { Position } );
const VVertexLayout WordLayout( 4, 0, { { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 0 } } );

constexpr int MapXUnit = 0, MapYUnit = 1;

std::size_t PixelCount( const ZEK::VGreyscaleData& i_rData )
{
  std::size_t Count = 0;
  for ( const ZEK::VGreyscaleSpan& rLine : i_rData.Lines )
  {
    Count += rLine.Length;
  }
  return Count;
}

/// Calls back with each line, its row and its record.
template < typename TTake >
void ForEachLine( const ZEK::VGreyscaleData& i_rData, TTake&& i_rTake )
{
  for ( std::size_t Record = 0; Record < i_rData.Records.size(); ++Record )
  {
    const ZEK::VGreyscaleRecord& rRecord = i_rData.Records[Record];
    for ( std::uint32_t Row = rRecord.Top; Row <= rRecord.Bottom; ++Row )
    {
      i_rTake( i_rData.Lines[rRecord.FirstLine + Row - rRecord.Top], Row, Record );
    }
  }
}
} // namespace

VMaximisedGreyscale::VMap::~VMap()
{
  // Where no context of the group is current the texture goes with the group.
  QOpenGLContext* pContext = QOpenGLContext::currentContext();
  if ( m_Texture != 0 && pContext && m_pGroup && pContext->shareGroup() == m_pGroup )
  {
    pContext->functions()->glDeleteTextures( 1, &m_Texture );
  }
}

bool VMaximisedGreyscale::VMap::Write( VRenderContext& io_rContext, int i_Unit, const std::vector< float >& i_rPlaces )
{
  QOpenGLExtraFunctions& rGl = *io_rContext.Functions();
  GLint Longest = 0;
  rGl.glGetIntegerv( GL_MAX_TEXTURE_SIZE, &Longest );
  if ( i_rPlaces.size() > static_cast< std::size_t >( Longest ) )
  {
    return false;
  }
  if ( !m_pGroup || m_pGroup != io_rContext.Context()->shareGroup() )
  {
    m_pGroup = io_rContext.Context()->shareGroup();
    rGl.glGenTextures( 1, &m_Texture );
  }
  io_rContext.BindTexture( i_Unit, m_Texture );
  for ( const GLenum Filter : { GL_TEXTURE_MIN_FILTER, GL_TEXTURE_MAG_FILTER } )
  {
    rGl.glTexParameteri( GL_TEXTURE_2D, Filter, GL_NEAREST );
  }
  for ( const GLenum Wrap : { GL_TEXTURE_WRAP_S, GL_TEXTURE_WRAP_T } )
  {
    rGl.glTexParameteri( GL_TEXTURE_2D, Wrap, GL_CLAMP_TO_EDGE );
  }
  rGl.glTexImage2D( GL_TEXTURE_2D, 0, GL_R32F, GLsizei( i_rPlaces.size() ), 1, 0, GL_RED, GL_FLOAT, i_rPlaces.data() );
  VVertexBuffer::CountBytes( i_rPlaces.size() * sizeof( float ) );
  return true;
}

bool VMaximisedGreyscale::VMap::Bind( VRenderContext& io_rContext, int i_Unit ) const
{
  if ( m_Texture == 0 || !m_pGroup || m_pGroup != io_rContext.Context()->shareGroup() )
  {
    return false;
  }
  io_rContext.BindTexture( i_Unit, m_Texture );
  return true;
}

VMaximisedGreyscale::VMaximisedGreyscale( VMoxelScene& i_rScene,
                                          std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider )
  : m_rScene( i_rScene )
  , m_pProvider( std::move( i_pProvider ) )
{
  VResources& rResources = *i_rScene.Resources();
  m_pNormal = rResources.GetProgram( "GreyscaleMaximised", "Greyscale2D" );
  m_pSelection = rResources.GetProgram( "GreyscaleMaximised", "Greyscale2DSelection" );
  m_State.depthTest = m_State.depthWrite = false;
}

VMaximisedGreyscale::~VMaximisedGreyscale() = default;

void VMaximisedGreyscale::Collect( const VRenderContext& i_rContext, const VSceneOptions& i_rOptions )
{
  m_Tiles.resize( std::max( m_Tiles.size(), m_Collected + 1 ) );
  VTile& rTile = m_Tiles[m_Collected++];
  if ( !SameText( rTile.Text, i_rOptions.OverlayCamera ) )
  {
    rTile.Text = i_rOptions.OverlayCamera;
    rTile.Camera = rTile.Text.toStdString();
  }
  rTile.View2D = i_rContext.View2D();
  rTile.Rect = i_rContext.Viewport();
}

void VMaximisedGreyscale::DropGone()
{
  std::erase_if( m_Cameras,
                 [this]( const auto& i_rEntry )
                 {
                   return !m_pProvider->GetCamera( i_rEntry.first );
                 } );
}

void VMaximisedGreyscale::DrawTiles( VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  m_Last = std::exchange( m_Collected, 0 );
  if ( m_Last == 0 )
  {
    return;
  }
  const QRect Viewport = io_rContext.Viewport(), Scissor = io_rContext.Scissor();
  const QVector4D View2D = io_rContext.View2D();
  for ( const VTile& rTile : std::span( m_Tiles ).first( m_Last ) )
  {
    const QRect Seen = rTile.Rect.intersected( Scissor );
    if ( !Seen.isEmpty() )
    {
      io_rContext.SetViewport( rTile.Rect );
      io_rContext.SetScissor( Seen );
      io_rContext.SetView2D( rTile.View2D );
      DrawTile( io_rContext, i_rOptions, rTile );
    }
  }
  io_rContext.SetViewport( Viewport );
  io_rContext.SetScissor( Scissor );
  io_rContext.SetView2D( View2D );
  DropGone();
}

bool VMaximisedGreyscale::Take( VRenderContext& io_rContext, const VSceneOptions& i_rOptions, VCamera& io_rCamera,
                                const ZEK::IRenderCamera& i_rCamera, const ZEK::VCameraLists2D& i_rLists )
{
  const ZEK::VGreyscaleData& rData = *i_rLists.pGreyscale;
  const bool bNew = io_rCamera.Taken != i_rLists.Generation;
  if ( bNew )
  {
    io_rCamera.Stretch.Add( rData, i_rCamera.GetInfo().SensorWidth, i_rCamera.GetInfo().SensorHeight );
    io_rCamera.Taken = i_rLists.Generation;
  }
  if ( io_rCamera.Stretch.Columns().Seen.empty() || io_rCamera.Stretch.Rows().Seen.empty() )
  {
    return false;
  }
  const int History = i_rOptions.CameraMaximiseGreyscaleHistory;
  const double Factor = i_rOptions.CameraMaximiseGreyscaleFactor;
  const bool bOther = bNew || History != io_rCamera.History || Factor != io_rCamera.Factor;
  if ( !bOther && io_rCamera.bRefused )
  {
    return false;
  }
  if ( bOther || !io_rCamera.Columns.Bind( io_rContext, MapXUnit ) || !io_rCamera.Rows.Bind( io_rContext, MapYUnit ) )
  {
    io_rCamera.History = History;
    io_rCamera.Factor = Factor;
    io_rCamera.Stretch.Place( History, Factor );
    if ( !WriteMaps( io_rContext, io_rCamera, i_rCamera.GetName() ) )
    {
      return false;
    }
  }
  const float Scale = std::max( io_rCamera.Stretch.Columns().Stretch, io_rCamera.Stretch.Rows().Stretch );
  if ( io_rCamera.Drawn != i_rLists.Generation || io_rCamera.Scale != Scale ||
       ( io_rCamera.Count > 0 && !io_rCamera.Points.Bind() ) )
  {
    io_rCamera.Scale = Scale;
    io_rCamera.Drawn = WritePoints( io_rCamera, rData ) ? i_rLists.Generation : 0;
  }
  return io_rCamera.Drawn != 0 && io_rCamera.Count > 0;
}

bool VMaximisedGreyscale::WriteMaps( VRenderContext& io_rContext, VCamera& io_rCamera, const std::string& i_rName )
{
  const std::size_t Width = io_rCamera.Stretch.Columns().Places.size();
  const std::size_t Height = io_rCamera.Stretch.Rows().Places.size();
  const bool bGood = io_rCamera.Columns.Write( io_rContext, MapXUnit, io_rCamera.Stretch.Columns().Places ) &&
                     io_rCamera.Rows.Write( io_rContext, MapYUnit, io_rCamera.Stretch.Rows().Places );
  if ( !std::exchange( io_rCamera.bRefused, !bGood ) && !bGood )
  {
    ZEK::Log( LogCategory(), ZEK::ELogWarning,
              "The grey of \"%1%\" cannot be maximised: a sensor of %2% x %3% pixels is more than the device takes",
              i_rName, Width, Height );
  }
  return bGood;
}

bool VMaximisedGreyscale::WritePoints( VCamera& io_rCamera, const ZEK::VGreyscaleData& i_rData )
{
  const std::size_t Count = PixelCount( i_rData );
  io_rCamera.Count = static_cast< int >( Count );
  if ( Count == 0 )
  {
    return true;
  }
  auto* pPoint = static_cast< VPoint* >( io_rCamera.Points.Map( Count * sizeof( VPoint ) ) );
  if ( !pPoint )
  {
    return false;
  }
  const float Unit = 1.0f / io_rCamera.Scale;
  ForEachLine( i_rData,
               [&]( const ZEK::VGreyscaleSpan& i_rLine, std::uint32_t i_Row, std::size_t )
               {
                 const float Y = static_cast< float >( i_Row ) * Unit;
                 for ( std::uint32_t Column = 0; Column < i_rLine.Length; ++Column )
                 {
                   const std::uint32_t Grey = i_rData.Pixels[i_rLine.FirstByte + Column];
                   *pPoint++ = { static_cast< float >( i_rLine.X + Column ) * Unit, Y, 0xFF000000u | Grey * 0x010101u };
                 }
               } );
  return io_rCamera.Points.Unmap();
}

bool VMaximisedGreyscale::WriteWords( VCamera& io_rCamera, const ZEK::IRenderCamera& i_rCamera,
                                      const ZEK::VGreyscaleData& i_rData )
{
  const std::uint64_t Provider = m_rScene.IgnoredIds().empty() ? m_pProvider->GetGeneration() : 0;
  if ( Provider != 0 && io_rCamera.WordsProvider == Provider && io_rCamera.WordsDrawn == io_rCamera.Drawn &&
       io_rCamera.Words.Bind() )
  {
    return true;
  }
  io_rCamera.WordsProvider = 0;
  MakeBlobWords( i_rCamera, i_rData, m_rScene, m_Words );
  auto* pWord = static_cast< std::uint32_t* >(
      io_rCamera.Words.Map( static_cast< std::size_t >( io_rCamera.Count ) * sizeof( std::uint32_t ) ) );
  if ( !pWord )
  {
    return false;
  }
  ForEachLine( i_rData,
               [&]( const ZEK::VGreyscaleSpan& i_rLine, std::uint32_t, std::size_t i_Record )
               {
                 pWord = std::fill_n( pWord, i_rLine.Length, m_Words[i_Record] );
               } );
  if ( !io_rCamera.Words.Unmap() )
  {
    return false;
  }
  io_rCamera.WordsProvider = Provider;
  io_rCamera.WordsDrawn = io_rCamera.Drawn;
  return true;
}

void VMaximisedGreyscale::DrawTile( VRenderContext& io_rContext, const VSceneOptions& i_rOptions, const VTile& i_rTile )
{
  const ZEK::VRenderCameraRef pCamera = m_pProvider->GetCamera( i_rTile.Camera );
  if ( !pCamera )
  {
    return;
  }
  ZEK::VCameraLists2D Lists;
  ZEK::VDrawWords Colours;
  pCamera->GetDrawData2D( pCamera->GetInfo().FirstCentroidId,
                          static_cast< ZEK::ECentroidColourScheme >( i_rOptions.CentroidColourScheme ), true, Lists,
                          Colours );
  VCamera& rKept = m_Cameras[i_rTile.Camera];
  const bool bVisible = io_rContext.RenderMode() == ERenderModeNormal;
  const auto& rpProgram = bVisible ? m_pNormal : m_pSelection;
  if ( !Take( io_rContext, i_rOptions, rKept, *pCamera, Lists ) ||
       ( !bVisible && !WriteWords( rKept, *pCamera, *Lists.pGreyscale ) ) || !io_rContext.UseProgram( rpProgram ) )
  {
    return;
  }
  std::array< VVertexStream, 2 > Streams{ VVertexStream{ &rKept.Points, bVisible ? &PointLayout : &PlaceLayout, 0 },
                                          VVertexStream{ &rKept.Words, &WordLayout, 0 } };
  if ( !rKept.Columns.Bind( io_rContext, MapXUnit ) || !rKept.Rows.Bind( io_rContext, MapYUnit ) ||
       !io_rContext.SetVertexStreams( std::span( Streams ).first( bVisible ? 1 : 2 ) ) )
  {
    return;
  }
  const auto& [X, Y, ScaleX, ScaleY] = Lists.pGreyscale->OffsetScale;
  ( bVisible ? m_NormalSensor : m_SelectionSensor )
      .Set( *rpProgram, MakeSensorView( *pCamera, i_rOptions, i_rTile.View2D ) );
  ( bVisible ? m_NormalImage : m_SelectionImage )
      .Set( *rpProgram, QVector4D( X, Y, ScaleX * rKept.Scale, ScaleY * rKept.Scale ) );
  m_MapX.Set( *rpProgram, MapXUnit );
  m_MapY.Set( *rpProgram, MapYUnit );
  m_Show.Set( *rpProgram, io_rContext.RenderMode() == ERenderModeHighlight ? 1 : 0 );
  io_rContext.SetRenderState( m_State );
  io_rContext.DrawArrays( GL_POINTS, rKept.Count );
}

} // namespace MoxelGraphics
