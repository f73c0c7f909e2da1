#include "TestContext.h"

#include <QtCore/QDirIterator>
#include <QtCore/QFile>

#include <algorithm>
#include <map>
#include <random>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
/// What one object can have, by the names of the per-object uniforms.
struct VObject
{
  float Transform[16];
  QVector4D ReconPosAndSize, TargetPosAndSize, ModelColour, StickColourA, StickColourB, SegmentColour;
};
static_assert( sizeof( VObject ) == 160 );
constexpr VVertexLayout ObjectLayout( 160, 1,
                                      { { EAttributeModelTransform, 16, GL_FLOAT, false, 0 },
                                        { EAttributeReconPosAndSize, 4, GL_FLOAT, false, 64 },
                                        { EAttributeTargetPosAndSize, 4, GL_FLOAT, false, 80 },
                                        { EAttributeModelColour, 4, GL_FLOAT, false, 96 },
                                        { EAttributeStickColourA, 4, GL_FLOAT, false, 112 },
                                        { EAttributeStickColourB, 4, GL_FLOAT, false, 128 },
                                        { EAttributeSegmentColour, 4, GL_FLOAT, false, 144 } } );
constexpr VVertexLayout FlagLayout( 1, 1, { { EAttributeInstanceFlags, 1, GL_UNSIGNED_BYTE, false, 0 } } );

struct VCorner
{
  float Position[3], Normal[3], Colour[4], Uv[2];
};
constexpr VVertexLayout CornerLayout( 48, 0,
                                      { { EAttributePosition, 3, GL_FLOAT, false, 0 },
                                        { EAttributeNormal, 3, GL_FLOAT, false, 12 },
                                        { EAttributeColour, 4, GL_FLOAT, false, 24 },
                                        { EAttributeUV, 2, GL_FLOAT, false, 40 } } );

constexpr std::size_t Objects = 12;
constexpr std::uint32_t FirstId = 0x01FFFA;

// Fragment programs of the catalogue's pairs; the colour alone for the rest.
std::string FragmentFor( const std::string& i_rVertex )
{
  static const std::map< std::string, std::string > Pairs = { { "Billboard", "ActiveLabelHalo" },
                                                              { "Camera", "Camera" },
                                                              { "FBXColoredMesh", "SimpleLighting" },
                                                              { "ForcePlate", "ForcePlate" },
                                                              { "MissingMarker", "MissingMarker" },
                                                              { "NonUniformSphere", "Covariance" },
                                                              { "Segment", "Segment" },
                                                              { "Simple3DModel", "SimpleLighting" },
                                                              { "Sphere", "SimpleLighting" },
                                                              { "Simple3DModelColour", "SimpleLighting" },
                                                              { "Stick", "SimpleLighting" },
                                                              { "Target", "SimpleLighting" } };
  const auto It = Pairs.find( i_rVertex );
  return It != Pairs.end() ? It->second : "Colour";
}
} // namespace

class InstancedCatalogueTest : public testing::TestWithParam< EContextKind >
{
public:
  InstancedCatalogueTest()
    : Context( GetParam() )
    , rRender( *Context.pRender )
  {
    std::mt19937 Random( 21 );
    std::uniform_real_distribution< float > Unit( 0, 1 );
    const auto Colour = [&]
    {
      return QVector4D( Unit( Random ), Unit( Random ), Unit( Random ), 1 );
    };
    for ( std::size_t Index = 0; Index < Objects; ++Index )
    {
      const QVector3D Place( Unit( Random ) * 60 - 30, Unit( Random ) * 60 - 30, Unit( Random ) * 40 );
      QMatrix4x4 Transform;
      Transform.translate( Place );
      Transform.rotate( 360 * Unit( Random ), { 1, 2, 3 } );
      Transform.scale( 8, 12, 5 );
      VObject& rObject = Made.emplace_back();
      std::copy_n( Transform.constData(), 16, rObject.Transform );
      rObject.ReconPosAndSize = rObject.TargetPosAndSize = QVector4D( Place, 6 + 4 * Unit( Random ) );
      rObject.ModelColour = Colour();
      rObject.StickColourA = Colour();
      rObject.StickColourB = Colour();
      rObject.SegmentColour = Colour();
      Flags.push_back( std::uint8_t( Index % 8 ) );
    }
    std::normal_distribution< float > Normal;
    for ( int Index = 0; Index < 60; ++Index )
    {
      const QVector3D P = QVector3D( Normal( Random ), Normal( Random ), Normal( Random ) ).normalized();
      Corners.push_back( { { P.x(), P.y(), P.z() }, { P.x(), P.y(), P.z() }, { 1, 0.5f, 0.8f, 1 }, { 0.5f, 0.5f } } );
    }
    CornerBuffer.SetContents( std::span( Corners ) );
    QMatrix4x4 Projection, View;
    Projection.perspective( 45, 1, 1, 1000 );
    View.lookAt( { 60, -70, 60 }, { 0, 0, 10 }, { 0, 0, 1 } );
    rRender.SetProjection( Projection );
    rRender.SetView( View );
    rRender.SetLightVector( QVector3D( 1, 1, 3 ).normalized() );
  }

  void SetSensor( VShaderProgram& io_rProgram )
  {
    io_rProgram.SetUniform( io_rProgram.UniformLocation( "u_SensorSize" ), QVector2D( 1, 1 ) );
    io_rProgram.SetUniform( io_rProgram.UniformLocation( "u_SensorImageOffsetScale" ), QVector4D( 0, 0, 1, 1 ) );
  }

  void SetObject( VShaderProgram& io_rProgram, const VObject& i_rObject )
  {
    const auto Set = [&]( EVertexAttribute i_Attribute, const auto& i_rValue )
    {
      io_rProgram.SetUniform( io_rProgram.UniformLocation( AttributeName( i_Attribute ) ), i_rValue );
    };
    Set( EAttributeModelTransform, QMatrix4x4( i_rObject.Transform ).transposed() );
    Set( EAttributeReconPosAndSize, i_rObject.ReconPosAndSize );
    Set( EAttributeTargetPosAndSize, i_rObject.TargetPosAndSize );
    Set( EAttributeModelColour, i_rObject.ModelColour );
    Set( EAttributeStickColourA, i_rObject.StickColourA );
    Set( EAttributeStickColourB, i_rObject.StickColourB );
    Set( EAttributeSegmentColour, i_rObject.SegmentColour );
  }

  std::vector< std::uint32_t > OneByOne( VProgramPair& io_rPair, int i_Mode, GLenum i_Primitive )
  {
    Context.Begin( i_Mode );
    EXPECT_TRUE( io_rPair.Use( rRender ) );
    rRender.SetRenderState( VRenderState{} );
    SetSensor( *io_rPair.Current() );
    EXPECT_TRUE( rRender.SetVertexBuffer( { &CornerBuffer, &CornerLayout, 0 } ) );
    for ( std::size_t Index = 0; Index < Objects; ++Index )
    {
      SetObject( *io_rPair.Current(), Made[Index] );
      io_rPair.SetSelectionColour( ( FirstId + std::uint32_t( Index ) ) | ( Flags[Index] & 7u ) << 21 );
      rRender.DrawArrays( i_Primitive, int( Corners.size() ) );
    }
    return Context.Pixels();
  }

  std::vector< std::uint32_t > AllAtOnce( VInstancedProgramPair& io_rPair, int i_Mode, GLenum i_Primitive )
  {
    Context.Begin( i_Mode );
    EXPECT_TRUE( ObjectBuffer.Write( std::span( Made ) ) );
    EXPECT_TRUE( FlagBuffer.Write( std::span( Flags ) ) );
    EXPECT_TRUE( io_rPair.Use( rRender, FirstId ) );
    rRender.SetRenderState( VRenderState{} );
    SetSensor( *io_rPair.Current() );
    const std::array< VVertexStream, 3 > Streams = { VVertexStream{ &CornerBuffer, &CornerLayout, 0 },
                                                     VVertexStream{ &ObjectBuffer, &ObjectLayout, 0 },
                                                     VVertexStream{ &FlagBuffer, &FlagLayout, 0 } };
    EXPECT_TRUE( rRender.SetVertexStreams( Streams ) );
    rRender.DrawArraysInstanced( i_Primitive, int( Corners.size() ), int( Objects ) );
    return Context.Pixels();
  }

  // Pixels of which a channel differs by more than rounding.
  static int Differing( const std::vector< std::uint32_t >& i_rA, const std::vector< std::uint32_t >& i_rB, int i_Most )
  {
    int Count = 0;
    for ( std::size_t Pixel = 0; Pixel < i_rA.size(); ++Pixel )
    {
      for ( int Shift = 0; Shift < 32; Shift += 8 )
      {
        const int Step = int( ( i_rA[Pixel] >> Shift ) & 255 ) - int( ( i_rB[Pixel] >> Shift ) & 255 );
        Count += std::abs( Step ) > i_Most;
      }
    }
    return Count;
  }

  VTestContext Context;
  VRenderContext& rRender;
  std::vector< VObject > Made;
  std::vector< std::uint8_t > Flags;
  std::vector< VCorner > Corners;
  VStaticBuffer CornerBuffer;
  VDynamicBuffer ObjectBuffer;
  VDynamicBuffer FlagBuffer;
};
INSTANTIATE_TEST_SUITE_P( Contexts, InstancedCatalogueTest, testing::Values( EKindCore, EKindCompatibility, EKindES ),
                          KindName );

TEST_P( InstancedCatalogueTest, EveryLookOfManyObjectsIsThatOfEachAlone )
{
  VResources Resources;
  ASSERT_TRUE( Resources.Prepare() );
  int Looks = 0;
  for ( QDirIterator It( ":/VertexShaders" ); It.hasNext(); )
  {
    QFile File( It.next() );
    ASSERT_TRUE( File.open( QIODevice::ReadOnly ) );
    const QByteArray Text = File.readAll();
    const std::string Vertex = It.fileInfo().completeBaseName().toStdString();
    if ( !Text.contains( "\nPER_OBJECT" ) || Vertex == "SpherePoint" ) // points have a test of their own
    {
      continue;
    }
    ++Looks;
    const GLenum Primitive = Text.contains( "gl_PointSize" ) ? GL_POINTS : GL_TRIANGLES;
    VProgramPair Single;
    VInstancedProgramPair Many;
    Single.Load( Resources, Vertex, FragmentFor( Vertex ) );
    Many.Load( Resources, Vertex, FragmentFor( Vertex ) );
    for ( const int Mode : { ERenderModeNormal, ERenderModeSelection } )
    {
      const std::vector< std::uint32_t > Expected = OneByOne( Single, Mode, Primitive );
      EXPECT_LT( std::count( Expected.begin(), Expected.end(), 0u ), VTestContext::Side * VTestContext::Side - 80 )
          << Vertex;
      const std::vector< std::uint32_t > Drawn = AllAtOnce( Many, Mode, Primitive );
      EXPECT_EQ( Differing( Drawn, Expected, Mode == ERenderModeNormal ? 1 : 0 ), 0 ) << Vertex << ' ' << Mode;
    }
  }
  EXPECT_GE( Looks, 20 );
}

// Without a stream of colours a mesh is white, also after one that was given another colour.
TEST_P( InstancedCatalogueTest, AMeshWithoutColoursIsWhite )
{
  constexpr VVertexLayout Bare( 48, 0, { { EAttributePosition, 3, GL_FLOAT, false, 0 } } );
  VResources Resources;
  const auto pProgram = Resources.GetProgram( "Simple3DModelColour", "Colour" );
  Made[0].ModelColour = { 1, 1, 0, 1 };
  for ( int Frame = 0; Frame < 2; ++Frame )
  {
    Context.Begin();
    ASSERT_TRUE( rRender.UseProgram( pProgram ) );
    SetObject( *pProgram, Made[0] );
    ASSERT_TRUE( rRender.SetVertexBuffer( { &CornerBuffer, &Bare, 0 } ) );
    rRender.DrawArrays( GL_TRIANGLES, int( Corners.size() ) );
    int Yellow = 0;
    for ( const std::uint32_t Pixel : Context.Pixels() )
    {
      Yellow += Pixel == 0xFF00FFFF;
    }
    EXPECT_GT( Yellow, 10 );
    EXPECT_EQ( Yellow, Context.Covered() );
    rRender.SetConstantAttribute( EAttributeColour, { 0, 0, 1, 1 } );
  }
}
