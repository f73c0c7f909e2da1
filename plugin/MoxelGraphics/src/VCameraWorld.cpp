#include "VCameraWorld.h"

#include "VPickWindow.h"

#include <MoxelGraphics/VMoxelScene.h>

#include <CoreGraphics/VResources.h>

#include <algorithm>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

const QVector4D BodyColour( 2.5F, 2.5F, 2.7F, 1.0F );
constexpr std::uint32_t LineColour = 0xFF857A73;
const QVector4D SelectedColour( 1, 1, 1, 1 );
constexpr float FaceAlpha = 0.05F;
constexpr float AxisLength = 150.0F;  // mm
constexpr float RayLength = 10000.0F; // mm
constexpr float RayColour[4] = { 0.75F, 0.85F, 1.0F, 0.15F };
constexpr std::uint8_t SelectedFlag = EInstanceSelected, PrimaryFlag = EInstancePrimary;

const VVertexLayout PlaceLayout( sizeof( ZEK::VMatrix4 ), 1, { { EAttributeModelTransform, 16, GL_FLOAT, false, 0 } } );
const VVertexLayout FlagsLayout( 1, 1, { { EAttributeInstanceFlags, 1, GL_UNSIGNED_BYTE, false, 0 } } );
const VVertexLayout
    RayLayout( 28, 0, { { EAttributePosition, 3, GL_FLOAT, false, 0 }, { EAttributeColour, 4, GL_FLOAT, false, 12 } } );
constexpr std::size_t RayFloats = 7;
const VVertexLayout PickedLayout( 68, 1,
                                  { { EAttributeModelTransform, 16, GL_FLOAT, false, 0 },
                                    { EAttributeInstanceFlags, 1, GL_UNSIGNED_INT, false, 64 } } );
constexpr std::uint32_t SkippedShift = 8;
/// So many can be counted in what the shift leaves.
constexpr std::size_t MostPicked = 0x4000;

/// What a body lies within, mm; as its vertex program has it.
const std::array< QVector3D, 8 > BodyCorners{
    QVector3D( -40, -40, -100 ), QVector3D( 40, -40, -100 ), QVector3D( 40, 40, -100 ), QVector3D( -40, 40, -100 ),
    QVector3D( -40, -40, 0 ),    QVector3D( 40, -40, 0 ),    QVector3D( 40, 40, 0 ),    QVector3D( -40, 40, 0 ) };
const std::array< QVector3D, 5 > FrustumCorners{ QVector3D( 0, 0, 0 ), QVector3D( -1, -1, 1 ), QVector3D( 1, -1, 1 ),
                                                 QVector3D( 1, 1, 1 ), QVector3D( -1, 1, 1 ) };

int Fill( VStaticBuffer& o_rBuffer, const std::vector< VLineVertex >& i_rVertices )
{
  o_rBuffer.SetContents( std::span( i_rVertices ) );
  return static_cast< int >( i_rVertices.size() );
}
} // namespace

VCameraWorld::VCameraWorld( const VMoxelScene& i_rScene )
  : m_rScene( i_rScene )
  , m_LineVertices( Fill( m_Lines, FrustumLines( LineColour ) ) )
  , m_FaceVertices( Fill( m_Faces, FrustumFaces() ) )
  , m_AxisVertices( Fill( m_Axes, AxisLines( AxisLength ) ) )
{
  VResources& rResources = *i_rScene.Resources();
  m_BodyPair.Load( rResources, "Camera", "Camera" );
  m_LinePair.Load( rResources, "Simple3DModelWireframe", "Colour" );
  m_pUniformLines = rResources.GetProgram( "Simple3DModelWireframe", "UniformColour", EFormInstanced );
  m_pRays = rResources.GetProgram( "CameraRay", "CameraCoverageFurstum" );
  m_BodyState.cullMode = ECullBack;
  m_LineState.depthFunction = EDepthLessOrEqual;
  m_VeilState.colourBlend = EColourBlendAlpha;
  m_VeilState.depthWrite = false;
}

void VCameraWorld::PlacesChanged()
{
  ++m_PlacesGeneration;
  if ( m_Flags.size() != Count() )
  {
    m_Flags.assign( Count(), 0 );
    m_bMarked = false;
    ++m_FlagsGeneration;
  }
}

void VCameraWorld::SetIds( std::uint32_t i_FirstId, std::span< const std::uint8_t > i_Flags )
{
  m_FirstId = i_FirstId;
  const bool bNone = i_Flags.size() != m_Flags.size();
  const auto IsZero = []( std::uint8_t i_Flag )
  {
    return i_Flag == 0;
  };
  const bool bSame = bNone ? std::all_of( m_Flags.begin(), m_Flags.end(), IsZero )
                           : std::equal( i_Flags.begin(), i_Flags.end(), m_Flags.begin() );
  if ( bSame )
  {
    return;
  }
  ++m_FlagsGeneration;
  bNone ? m_Flags.assign( m_Flags.size(), 0 ) : m_Flags.assign( i_Flags.begin(), i_Flags.end() );
  m_bMarked = std::any_of( m_Flags.begin(), m_Flags.end(),
                           []( std::uint8_t i_Flag )
                           {
                             return ( i_Flag & ( EInstanceSelected | EInstancePreselected ) ) != 0;
                           } );
}

bool VCameraWorld::FeedFlags()
{
  return m_FlagsBuffer.Feed( m_Flags, m_FlagsGeneration );
}

void VCameraWorld::DrawPicked( CoreGraphics::VRenderContext& io_rContext, VInstancedProgramPair& io_rPair,
                               const std::vector< ZEK::VMatrix4 >& i_rPlaces, std::span< const QVector3D > i_Corners,
                               const VVertexStream& i_rShape, VMesh* i_pMesh )
{
  const VPickWindow Window( io_rContext );
  std::array< VScenePoint, 8 > Hull;
  m_Picked.clear();
  const std::size_t Count = std::min( i_rPlaces.size(), MostPicked );
  for ( std::size_t Index = 0; Index < Count; ++Index )
  {
    const ZEK::VMatrix4& rPlace = i_rPlaces[Index];
    for ( std::size_t Corner = 0; Corner < i_Corners.size(); ++Corner )
    {
      const QVector3D& rCorner = i_Corners[Corner];
      const auto At = [&]( std::size_t i_Row )
      {
        return rPlace[i_Row] * rCorner.x() + rPlace[4 + i_Row] * rCorner.y() + rPlace[8 + i_Row] * rCorner.z() +
               rPlace[12 + i_Row];
      };
      Hull[Corner] = { At( 0 ), At( 1 ), At( 2 ), 0 };
      Hull[Corner].Radius = Window.Drawn( 0, Window.Depth( Hull[Corner].X, Hull[Corner].Y, Hull[Corner].Z ) );
    }
    // What a band has found already gives way to what lies behind it.
    if ( Window.MeetsHull( std::span( Hull ).first( i_Corners.size() ) ) &&
         !m_rScene.IsIgnored( m_FirstId + static_cast< std::uint32_t >( Index ) ) )
    {
      const auto Skipped = static_cast< std::uint32_t >( Index - m_Picked.size() );
      m_Picked.push_back( { rPlace, m_Flags[Index] | Skipped << SkippedShift } );
    }
  }
  if ( !m_Picked.empty() && m_PickedBuffer.Write( std::span( std::as_const( m_Picked ) ) ) )
  {
    const VVertexStream Streams[] = { i_rShape, { &m_PickedBuffer, &PickedLayout, 0 } };
    DrawIds( io_rContext, io_rPair, Streams, i_pMesh, m_Picked.size() );
  }
}

void VCameraWorld::DrawIds( CoreGraphics::VRenderContext& io_rContext, VInstancedProgramPair& io_rPair,
                            std::span< const VVertexStream > i_Streams, VMesh* i_pMesh, std::size_t i_Count )
{
  if ( !io_rPair.Use( io_rContext, m_FirstId ) || !io_rContext.SetVertexStreams( i_Streams ) )
  {
    return;
  }
  const int Instances = static_cast< int >( i_Count );
  if ( i_pMesh )
  {
    io_rContext.SetConstantAttribute( EAttributeModelColour, BodyColour );
    io_rContext.SetRenderState( m_BodyState );
    io_rContext.DrawElementsInstanced( GL_TRIANGLES, *i_pMesh, Instances );
  }
  else
  {
    io_rContext.SetRenderState( m_LineState );
    io_rContext.DrawArraysInstanced( GL_LINES, m_LineVertices, Instances );
  }
}

void VCameraWorld::DrawBodies( CoreGraphics::VRenderContext& io_rContext )
{
  if ( io_rContext.RenderMode() == ERenderModeSelection )
  {
    DrawPicked( io_rContext, m_BodyPair, m_Places.Bodies, BodyCorners, m_Body.Stream(), &m_Body );
    return;
  }
  const bool bVisible = io_rContext.RenderMode() == ERenderModeNormal;
  if ( Count() == 0 || !m_BodyBuffer.Feed( m_Places.Bodies, m_PlacesGeneration ) || ( !bVisible && !FeedFlags() ) )
  {
    return;
  }
  const VVertexStream Streams[] = {
      m_Body.Stream(), { &m_BodyBuffer.Buffer, &PlaceLayout, 0 }, { &m_FlagsBuffer.Buffer, &FlagsLayout, 0 } };
  DrawIds( io_rContext, m_BodyPair, std::span( Streams ).first( bVisible ? 2 : 3 ), &m_Body, Count() );
}

void VCameraWorld::DrawFrustumIds( CoreGraphics::VRenderContext& io_rContext )
{
  const VVertexStream Lines{ &m_Lines, &LineLayout(), 0 };
  if ( io_rContext.RenderMode() == ERenderModeSelection )
  {
    DrawPicked( io_rContext, m_LinePair, m_Places.Frustums, FrustumCorners, Lines, nullptr );
  }
  else if ( Count() != 0 && m_FrustumBuffer.Feed( m_Places.Frustums, m_PlacesGeneration ) && FeedFlags() )
  {
    const VVertexStream Streams[] = {
        Lines, { &m_FrustumBuffer.Buffer, &PlaceLayout, 0 }, { &m_FlagsBuffer.Buffer, &FlagsLayout, 0 } };
    DrawIds( io_rContext, m_LinePair, Streams, nullptr, Count() );
  }
}

void VCameraWorld::DrawAxes( CoreGraphics::VRenderContext& io_rContext )
{
  const VVertexStream Streams[] = { { &m_Axes, &LineLayout(), 0 }, { &m_BodyBuffer.Buffer, &PlaceLayout, 0 } };
  if ( Count() != 0 && m_BodyBuffer.Feed( m_Places.Bodies, m_PlacesGeneration ) && m_LinePair.Use( io_rContext, 0 ) &&
       io_rContext.SetVertexStreams( Streams ) )
  {
    io_rContext.SetRenderState( m_LineState );
    io_rContext.DrawArraysInstanced( GL_LINES, m_AxisVertices, static_cast< int >( Count() ) );
  }
}

/// Frustums of a kind stand together only while some camera is selected: with none, all of them are plain.
void VCameraWorld::Sort()
{
  if ( m_SortedPlaces == m_PlacesGeneration && m_SortedFlags == m_FlagsGeneration )
  {
    return;
  }
  m_SortedPlaces = m_PlacesGeneration;
  m_SortedFlags = m_FlagsGeneration;
  ++m_SortedGeneration;
  m_Sorted.clear();
  const auto Take = [&]( std::uint8_t i_Kind )
  {
    const std::size_t First = m_Sorted.size();
    for ( std::size_t Index = 0; Index < Count(); ++Index )
    {
      const std::uint8_t Flags = m_Flags[Index];
      const auto Kind =
          static_cast< std::uint8_t >( ( Flags & SelectedFlag ) != 0 ? Flags & ( SelectedFlag | PrimaryFlag ) : 0 );
      if ( Kind == i_Kind )
      {
        m_Sorted.push_back( m_Places.Frustums[Index] );
      }
    }
    return VRun{ First, m_Sorted.size() - First };
  };
  const bool bAny = std::any_of( m_Flags.begin(), m_Flags.end(),
                                 []( std::uint8_t i_Flag )
                                 {
                                   return ( i_Flag & SelectedFlag ) != 0;
                                 } );
  m_Plain = bAny ? Take( 0 ) : VRun{ 0, Count() };
  m_Selected = bAny ? Take( SelectedFlag ) : VRun{};
  m_Primary = bAny ? Take( SelectedFlag | PrimaryFlag ) : VRun{};
}

void VCameraWorld::DrawRun( CoreGraphics::VRenderContext& io_rContext, VStaticBuffer& io_rShape, GLenum i_Mode,
                            int i_Vertices, const VRun& i_rRun, const QVector4D& i_rColour )
{
  const VVertexStream Streams[] = { { &io_rShape, &LineLayout(), 0 },
                                    { &m_SortedBuffer.Buffer, &PlaceLayout, i_rRun.First * sizeof( ZEK::VMatrix4 ) } };
  if ( i_rRun.Count != 0 && m_SortedBuffer.Feed( m_Sorted, m_SortedGeneration ) &&
       io_rContext.UseProgram( m_pUniformLines ) && io_rContext.SetVertexStreams( Streams ) )
  {
    m_Colour.Set( *m_pUniformLines, i_rColour );
    io_rContext.DrawArraysInstanced( i_Mode, i_Vertices, static_cast< int >( i_rRun.Count ) );
  }
}

void VCameraWorld::DrawFrustums( CoreGraphics::VRenderContext& io_rContext, bool i_bSelected,
                                 const QVector4D& i_rPrimary )
{
  Sort();
  io_rContext.SetRenderState( m_LineState );
  if ( i_bSelected )
  {
    DrawRun( io_rContext, m_Lines, GL_LINES, m_LineVertices, m_Selected, SelectedColour );
    DrawRun( io_rContext, m_Lines, GL_LINES, m_LineVertices, m_Primary, i_rPrimary );
    return;
  }
  const bool bAll = m_Sorted.empty();
  const VVertexStream Streams[] = { { &m_Lines, &LineLayout(), 0 },
                                    { bAll ? &m_FrustumBuffer.Buffer : &m_SortedBuffer.Buffer, &PlaceLayout, 0 } };
  const bool bFed = m_Plain.Count != 0 && ( bAll ? m_FrustumBuffer.Feed( m_Places.Frustums, m_PlacesGeneration )
                                                 : m_SortedBuffer.Feed( m_Sorted, m_SortedGeneration ) );
  if ( bFed && m_LinePair.Use( io_rContext, 0 ) && io_rContext.SetVertexStreams( Streams ) )
  {
    io_rContext.DrawArraysInstanced( GL_LINES, m_LineVertices, static_cast< int >( m_Plain.Count ) );
  }
}

void VCameraWorld::DrawFaces( CoreGraphics::VRenderContext& io_rContext, const QVector4D& i_rPrimary )
{
  Sort();
  io_rContext.SetRenderState( m_VeilState );
  const auto Veil = []( QVector4D i_Colour )
  {
    i_Colour.setW( FaceAlpha );
    return i_Colour;
  };
  DrawRun( io_rContext, m_Faces, GL_TRIANGLES, m_FaceVertices, m_Selected, Veil( SelectedColour ) );
  DrawRun( io_rContext, m_Faces, GL_TRIANGLES, m_FaceVertices, m_Primary, Veil( i_rPrimary ) );
}

/// Along the edges of what each camera sees, and along its axis.
void VCameraWorld::MakeRays()
{
  if ( m_RaysPlaces == m_PlacesGeneration )
  {
    return;
  }
  m_RaysPlaces = m_PlacesGeneration;
  m_RayVertices.clear();
  m_RayVertices.reserve( Count() * 10 * RayFloats );
  const auto Add = [&]( const QVector3D& i_rPlace )
  {
    m_RayVertices.insert( m_RayVertices.end(), { i_rPlace.x(), i_rPlace.y(), i_rPlace.z(), RayColour[0], RayColour[1],
                                                 RayColour[2], RayColour[3] } );
  };
  for ( const ZEK::VMatrix4& rFrustum : m_Places.Frustums )
  {
    const auto Column = [&]( std::size_t i_Column )
    {
      return QVector3D( rFrustum[i_Column * 4], rFrustum[i_Column * 4 + 1], rFrustum[i_Column * 4 + 2] );
    };
    const QVector3D Eye = Column( 3 );
    for ( const QVector2D Towards :
          { QVector2D( 0, 0 ), QVector2D( -1, -1 ), QVector2D( 1, -1 ), QVector2D( 1, 1 ), QVector2D( -1, 1 ) } )
    {
      Add( Eye );
      Add( Eye + RayLength * ( Column( 0 ) * Towards.x() + Column( 1 ) * Towards.y() + Column( 2 ) ).normalized() );
    }
  }
}

void VCameraWorld::DrawRays( CoreGraphics::VRenderContext& io_rContext )
{
  MakeRays();
  if ( Count() != 0 && m_RayBuffer.Feed( m_RayVertices, m_RaysPlaces ) && io_rContext.UseProgram( m_pRays ) &&
       io_rContext.SetVertexBuffer( { &m_RayBuffer.Buffer, &RayLayout, 0 } ) )
  {
    io_rContext.SetRenderState( m_VeilState );
    io_rContext.DrawArrays( GL_LINES, static_cast< int >( m_RayVertices.size() / RayFloats ) );
  }
}

} // namespace MoxelGraphics
