#include "TestContext.h"

#include <CoreGraphics/SelectionColour.h>

#include <QtCore/QDirIterator>
#include <QtCore/QFile>

#include <algorithm>
#include <numeric>
#include <random>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
/// What one object can have: the per-object uniforms.
struct VObject
{
  QVector4D Transform[4]; // columns
  QVector4D PosAndSize, ModelColour, StickColourA, StickColourB, SegmentColour;
};
static_assert( sizeof( VObject ) == 144 );
constexpr VVertexLayout ObjectLayout( 144, 1,
                                      { { EAttributeModelTransform, 16, GL_FLOAT, false, 0 },
                                        { EAttributeReconPosAndSize, 4, GL_FLOAT, false, 64 },
                                        { EAttributeTargetPosAndSize, 4, GL_FLOAT, false, 64 },
                                        { EAttributeModelColour, 4, GL_FLOAT, false, 80 },
                                        { EAttributeStickColourA, 4, GL_FLOAT, false, 96 },
                                        { EAttributeStickColourB, 4, GL_FLOAT, false, 112 },
                                        { EAttributeSegmentColour, 4, GL_FLOAT, false, 128 } } );
constexpr VVertexLayout FlagLayout( 1, 1, { { EAttributeInstanceFlags, 1, GL_UNSIGNED_BYTE, false, 0 } } );
// Objects that are one vertex each.
constexpr VVertexLayout PointLayout( 144, 0,
                                     { { EAttributePosition, 4, GL_FLOAT, false, 64 },
                                       { EAttributeModelColour, 4, GL_FLOAT, false, 80 } } );
constexpr VVertexLayout PointFlagLayout( 1, 0, { { EAttributeInstanceFlags, 1, GL_UNSIGNED_BYTE, false, 0 } } );

struct VCorner
{
  QVector3D Position, Normal;
  QVector4D Colour;
};
constexpr VVertexLayout CornerLayout( 40, 0,
                                      { { EAttributePosition, 3, GL_FLOAT, false, 0 },
                                        { EAttributeNormal, 3, GL_FLOAT, false, 12 },
                                        { EAttributeColour, 4, GL_FLOAT, false, 24 } } );

constexpr std::uint32_t FirstId = 0x0FFFF0; // instances run over a byte's end
constexpr std::size_t Instances = 40;

// Triangles with corners on the unit sphere.
VMesh Triangles()
{
  std::mt19937 Random( 5 );
  std::normal_distribution< float > Normal;
  std::vector< VCorner > Corners;
  std::vector< std::uint32_t > Indices( 60 );
  std::iota( Indices.begin(), Indices.end(), 0u );
  for ( std::size_t Index = 0; Index < Indices.size(); ++Index )
  {
    const QVector3D Place = QVector3D( Normal( Random ), Normal( Random ), Normal( Random ) ).normalized();
    Corners.push_back( { Place, Place, { 1, 0.5f, 0.8f, 1 } } );
  }
  return VMesh( CornerLayout, Corners, Indices );
}

// The fragment program of a look, where it is more than the colour.
std::string FragmentFor( const std::string& i_rVertex )
{
  for ( const char* pSame : { "Camera", "ForcePlate", "MissingMarker", "Segment" } )
  {
    if ( i_rVertex == pSame )
    {
      return pSame;
    }
  }
  for ( const char* pLit : { "FBXColoredMesh", "Simple3DModel", "Simple3DModelColour", "Sphere", "Stick", "Target" } )
  {
    if ( i_rVertex == pLit )
    {
      return "SimpleLighting";
    }
  }
  return i_rVertex == "Billboard" ? "ActiveLabelHalo" : i_rVertex == "NonUniformSphere" ? "Covariance" : "Colour";
}

// Over all channels of all pixels.
int LargestDifference( const std::vector< std::uint32_t >& i_rA, const std::vector< std::uint32_t >& i_rB )
{
  int Largest = 0;
  for ( std::size_t Pixel = 0; Pixel < i_rA.size(); ++Pixel )
  {
    for ( int Shift = 0; Shift < 32; Shift += 8 )
    {
      Largest = std::max( Largest,
                          std::abs( int( ( i_rA[Pixel] >> Shift ) & 255 ) - int( ( i_rB[Pixel] >> Shift ) & 255 ) ) );
    }
  }
  return Largest;
}
} // namespace

class InstancingTest : public testing::TestWithParam< EContextKind >
{
public:
  InstancingTest()
    : Context( GetParam() )
    , rRender( *Context.pRender )
  {
    EXPECT_TRUE( Resources.Prepare() );
    std::mt19937 Random( 3 );
    std::uniform_real_distribution< float > Unit( 0, 1 );
    const auto Colour = [&]
    {
      return QVector4D( Unit( Random ), Unit( Random ), Unit( Random ), 1 );
    };
    for ( std::size_t Index = 0; Index < Instances; ++Index )
    {
      const QVector3D Place( Unit( Random ) * 60 - 30, Unit( Random ) * 60 - 30, Unit( Random ) * 40 - 10 );
      QMatrix4x4 Transform;
      Transform.translate( Place );
      Transform.rotate( 360 * Unit( Random ), { 1, 2, 3 } );
      Transform.scale( 4, 6, 3 );
      Objects.push_back(
          { { Transform.column( 0 ), Transform.column( 1 ), Transform.column( 2 ), Transform.column( 3 ) },
            { Place, 2 + float( Index % 5 ) },
            Colour(),
            Colour(),
            Colour(),
            Colour() } );
      Flags.push_back( std::uint8_t( Index % 8 ) );
    }
    Flags[11] |= EInstanceHidden;
    Flags[16] |= EInstanceHidden;
    QMatrix4x4 Projection, View;
    Projection.perspective( 45, 1, 1, 1000 );
    View.lookAt( { 40, -60, 50 }, { 0, 0, 0 }, { 0, 0, 1 } );
    rRender.SetProjection( Projection );
    rRender.SetView( View );
    rRender.SetLightVector( QVector3D( 1, 1, 3 ).normalized() );
  }

  void Load( const std::string& i_rVertex )
  {
    Single.Load( Resources, i_rVertex, FragmentFor( i_rVertex ) );
    Many.Load( Resources, i_rVertex, FragmentFor( i_rVertex ) );
  }

  bool IsDrawn( std::size_t i_Index, int i_Mode ) const
  {
    const std::uint8_t Flag = Flags[i_Index];
    return i_Mode == ERenderModeSelection   ? !( Flag & EInstanceHidden )
           : i_Mode == ERenderModeHighlight ? ( Flag & ( EInstanceSelected | EInstancePreselected ) ) != 0
                                            : true;
  }

  static void SetSensor( VShaderProgram& io_rProgram )
  {
    io_rProgram.SetUniform( io_rProgram.UniformLocation( "u_SensorSize" ), QVector2D( 1, 1 ) );
    io_rProgram.SetUniform( io_rProgram.UniformLocation( "u_SensorImageOffsetScale" ), QVector4D( 0, 0, 1, 1 ) );
  }

  static void SetObject( VShaderProgram& io_rProgram, const VObject& i_rObject )
  {
    const auto Set = [&]( EVertexAttribute i_Attribute, const QVector4D& i_rValue )
    {
      io_rProgram.SetUniform( io_rProgram.UniformLocation( AttributeName( i_Attribute ) ), i_rValue );
    };
    const auto* pColumns = reinterpret_cast< const float* >( i_rObject.Transform );
    io_rProgram.SetUniformMatrices( io_rProgram.UniformLocation( "u_ModelTransform" ), { pColumns, 16 } );
    Set( EAttributeReconPosAndSize, i_rObject.PosAndSize );
    Set( EAttributeTargetPosAndSize, i_rObject.PosAndSize );
    Set( EAttributeModelColour, i_rObject.ModelColour );
    Set( EAttributeStickColourA, i_rObject.StickColourA );
    Set( EAttributeStickColourB, i_rObject.StickColourB );
    Set( EAttributeSegmentColour, i_rObject.SegmentColour );
  }

  std::vector< std::uint32_t > OneByOne( int i_Mode, GLenum i_Primitive = GL_TRIANGLES )
  {
    Context.Begin( i_Mode );
    EXPECT_TRUE( Single.Use( rRender ) );
    rRender.SetRenderState( VRenderState{} );
    SetSensor( *Single.Current() );
    EXPECT_TRUE( rRender.SetVertexBuffer( Mesh.Stream() ) );
    for ( std::size_t Index = 0; Index < Instances; ++Index )
    {
      if ( IsDrawn( Index, i_Mode ) )
      {
        SetObject( *Single.Current(), Objects[Index] );
        Single.SetSelectionColour( ( FirstId + std::uint32_t( Index ) ) | ( Flags[Index] & 7u ) << 21 );
        rRender.DrawElements( i_Primitive, Mesh );
      }
    }
    return Context.Pixels();
  }

  std::vector< std::uint32_t > AllAtOnce( int i_Mode, GLenum i_Primitive = GL_TRIANGLES )
  {
    Context.Begin( i_Mode );
    EXPECT_TRUE( ObjectBuffer.Write( std::span( Objects ) ) );
    EXPECT_TRUE( FlagBuffer.Write( std::span( Flags ) ) );
    EXPECT_TRUE( Many.Use( rRender, FirstId ) );
    rRender.SetRenderState( VRenderState{} );
    SetSensor( *Many.Current() );
    const std::array< VVertexStream, 3 > Streams = { Mesh.Stream(), VVertexStream{ &ObjectBuffer, &ObjectLayout, 0 },
                                                     VVertexStream{ &FlagBuffer, &FlagLayout, 0 } };
    EXPECT_TRUE( rRender.SetVertexStreams( Streams ) );
    rRender.ResetCounters();
    rRender.DrawElementsInstanced( i_Primitive, Mesh, int( Instances ) );
    EXPECT_EQ( rRender.DrawCalls(), 1u );
    return Context.Pixels();
  }

  VTestContext Context;
  VRenderContext& rRender;
  VResources Resources;
  VProgramPair Single;
  VInstancedProgramPair Many;
  VMesh Mesh = Triangles();
  VDynamicBuffer ObjectBuffer;
  VDynamicBuffer FlagBuffer;
  std::vector< VObject > Objects;
  std::vector< std::uint8_t > Flags;
};
INSTANTIATE_TEST_SUITE_P( Contexts, InstancingTest, testing::Values( EKindCore, EKindCompatibility, EKindES ),
                          KindName );

TEST_P( InstancingTest, TheInstancedFormOfEveryLookDrawsThePictureOfItsSingleForm )
{
  int Looks = 0;
  for ( QDirIterator It( ":/VertexShaders" ); It.hasNext(); )
  {
    QFile File( It.next() );
    ASSERT_TRUE( File.open( QIODevice::ReadOnly ) );
    const QByteArray Text = File.readAll();
    const std::string Vertex = It.fileInfo().completeBaseName().toStdString();
    const bool bLikeCore = GetParam() == EKindCompatibility && Vertex != "Sphere";
    if ( !Text.contains( "\nPER_OBJECT" ) || Vertex == "SpherePoint" || bLikeCore ) // a SpherePoint takes no mesh
    {
      continue;
    }
    ++Looks;
    Load( Vertex );
    const GLenum Primitive = Text.contains( "gl_PointSize" ) ? GL_POINTS : GL_TRIANGLES;
    for ( const int Mode : { ERenderModeNormal, ERenderModeSelection, ERenderModeHighlight } )
    {
      if ( Mode == ERenderModeHighlight && Vertex != "Sphere" ) // the same program as in the selection
      {
        continue;
      }
      const std::vector< std::uint32_t > Expected = OneByOne( Mode, Primitive );
      EXPECT_GT( Expected.size() - std::size_t( std::count( Expected.begin(), Expected.end(), 0u ) ), 60u ) << Vertex;
      // Lit colours may fall on either side of a rounding; ids may not.
      EXPECT_LE( LargestDifference( AllAtOnce( Mode, Primitive ), Expected ), Mode == ERenderModeNormal ? 1 : 0 )
          << Vertex << Mode;
    }
  }
  EXPECT_GE( Looks, GetParam() == EKindCompatibility ? 1 : 20 );
  // A draw of one object after a draw of many takes nothing over from it.
  Load( "Stick" );
  const std::vector< std::uint32_t > Before = OneByOne( ERenderModeNormal );
  AllAtOnce( ERenderModeNormal );
  EXPECT_EQ( OneByOne( ERenderModeNormal ), Before );
}

TEST_P( InstancingTest, EachPixelNamesItsInstanceAndItsFlags )
{
  Load( "Sphere" );
  std::vector< bool > Seen( Instances );
  for ( const std::uint32_t Pixel : AllAtOnce( ERenderModeSelection ) )
  {
    if ( Pixel == 0 )
    {
      continue;
    }
    EXPECT_EQ( Pixel >> 24, 1u );
    const std::uint32_t Index = ( Pixel & ESelectionIdMask ) - FirstId;
    ASSERT_LT( Index, Instances );
    EXPECT_EQ( ( Pixel >> 21 ) & 7, Flags[Index] & 7u );
    EXPECT_FALSE( Flags[Index] & EInstanceHidden );
    Seen[Index] = true;
  }
  EXPECT_GT( std::count( Seen.begin(), Seen.end(), true ), 20 );
  rRender.SetRenderMode( ERenderModeSelection );
  EXPECT_FALSE( Many.Use( rRender, 0 ) ) << "no id, nothing to pick";
}

TEST_P( InstancingTest, AConstantTakesThePlaceOfAStream )
{
  constexpr VVertexLayout PlaceOnly( 144, 1, { { EAttributeReconPosAndSize, 4, GL_FLOAT, false, 64 } } );
  const QVector4D Colour( 1, 160.0f / 255.0f, 1, 1 );
  for ( VObject& rObject : Objects )
  {
    rObject.ModelColour = Colour;
  }
  Load( "Sphere" );
  const std::vector< std::uint32_t > Expected = AllAtOnce( ERenderModeNormal );
  Context.Begin();
  ASSERT_TRUE( Many.Use( rRender, FirstId ) );
  rRender.SetRenderState( VRenderState{} );
  const std::array< VVertexStream, 2 > Streams = { Mesh.Stream(), VVertexStream{ &ObjectBuffer, &PlaceOnly, 0 } };
  ASSERT_TRUE( rRender.SetVertexStreams( Streams ) );
  rRender.SetConstantAttribute( EAttributeModelColour, Colour );
  rRender.DrawElementsInstanced( GL_TRIANGLES, Mesh, int( Instances ) );
  EXPECT_EQ( Context.Pixels(), Expected );
}

// Also in a frame after one that gave it another colour.
TEST_P( InstancingTest, AMeshWithoutColoursIsWhite )
{
  constexpr VVertexLayout Bare( 40, 0, { { EAttributePosition, 3, GL_FLOAT, false, 0 } } );
  const auto pProgram = Resources.GetProgram( "Simple3DModelColour", "Colour" );
  Objects[0].ModelColour = { 1, 1, 0, 1 };
  for ( int Frame = 0; Frame < 2; ++Frame )
  {
    Context.Begin();
    ASSERT_TRUE( rRender.UseProgram( pProgram ) );
    SetObject( *pProgram, Objects[0] );
    ASSERT_TRUE( rRender.SetVertexBuffer( { Mesh.Stream().pBuffer, &Bare, 0 } ) );
    rRender.DrawElements( GL_TRIANGLES, Mesh );
    const std::vector< std::uint32_t > Pixels = Context.Pixels();
    EXPECT_GT( Context.Covered(), 10 );
    EXPECT_EQ( std::count( Pixels.begin(), Pixels.end(), 0xFF00FFFFu ), Context.Covered() );
    rRender.SetConstantAttribute( EAttributeColour, { 0, 0, 1, 1 } );
  }
}

TEST_P( InstancingTest, TinySpheresAsPointsLieWhereTheSpheresLie )
{
  VInstancedProgramPair Points;
  Points.LoadPoints( Resources, "SpherePoint", "SimpleLighting" );
  for ( VObject& rObject : Objects )
  {
    rObject.PosAndSize.setW( 0.2f );
  }
  const auto Draw = [&]( int i_Mode, std::uint32_t i_FirstId )
  {
    Context.Begin( i_Mode );
    EXPECT_TRUE( ObjectBuffer.Write( std::span( Objects ) ) );
    EXPECT_TRUE( FlagBuffer.Write( std::span( Flags ) ) );
    EXPECT_TRUE( Points.Use( rRender, i_FirstId ) );
    const std::array< VVertexStream, 2 > Streams = { VVertexStream{ &ObjectBuffer, &PointLayout, 0 },
                                                     VVertexStream{ &FlagBuffer, &PointFlagLayout, 0 } };
    EXPECT_TRUE( rRender.SetVertexStreams( Streams ) );
    rRender.SetRenderState( VRenderState{} );
    rRender.DrawArrays( GL_POINTS, int( Instances ) );
    return Context.Pixels();
  };
  const std::vector< std::uint32_t > Lit = Draw( ERenderModeNormal, 0 );
  const std::vector< std::uint32_t > Ids = Draw( ERenderModeSelection, FirstId );
  // Half of the three pixels that the smallest point has, and half a pixel.
  constexpr float Reach = 2.0f;
  int Drawn = 0;
  for ( std::size_t Pixel = 0; Pixel < Ids.size(); ++Pixel )
  {
    const std::uint32_t Index = ( Ids[Pixel] & ESelectionIdMask ) - FirstId;
    if ( Ids[Pixel] == 0 )
    {
      continue;
    }
    ++Drawn;
    ASSERT_LT( Index, Instances );
    EXPECT_FALSE( Flags[Index] & EInstanceHidden );
    EXPECT_NE( Lit[Pixel] & 0xFFFFFF, 0u );
    const QVector3D Clip = rRender.ViewProjection().map( Objects[Index].PosAndSize.toVector3D() );
    EXPECT_NEAR( ( Clip.x() * 0.5f + 0.5f ) * 64, float( Pixel % 64 ) + 0.5f, Reach );
    EXPECT_NEAR( ( Clip.y() * 0.5f + 0.5f ) * 64, float( Pixel / 64 ) + 0.5f, Reach );
  }
  EXPECT_GT( Drawn, 25 );
  int Highlighted = 0;
  for ( const std::uint32_t Word : Draw( ERenderModeHighlight, FirstId ) )
  {
    Highlighted += Word != 0;
    EXPECT_TRUE( Word == 0 || ( Word & ( ESelectionIdSelected | ESelectionIdPreselected ) ) != 0 );
  }
  EXPECT_GT( Highlighted, 15 );
}
