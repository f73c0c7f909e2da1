#include "TestContext.h"

#include <CoreGraphics/SelectionColour.h>

#include <random>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
struct VInstance
{
  float X, Y, Z, Radius;
  std::uint32_t Colour;
};
static_assert( sizeof( VInstance ) == 20 );

constexpr VVertexLayout InstanceLayout( 20, 1,
                                        { { EAttributeReconPosAndSize, 4, GL_FLOAT, false, 0 },
                                          { EAttributeModelColour, 4, GL_UNSIGNED_BYTE, true, 16 } } );
constexpr VVertexLayout FlagLayout( 1, 1, { { EAttributeInstanceFlags, 1, GL_UNSIGNED_BYTE, false, 0 } } );
constexpr VVertexLayout PointLayout( 20, 0,
                                     { { EAttributePosition, 4, GL_FLOAT, false, 0 },
                                       { EAttributeModelColour, 4, GL_UNSIGNED_BYTE, true, 16 } } );
constexpr VVertexLayout PointFlagLayout( 1, 0, { { EAttributeInstanceFlags, 1, GL_UNSIGNED_BYTE, false, 0 } } );
constexpr std::uint32_t FirstId = 0x0FFFF0; // instances run over a byte's end
constexpr std::size_t Instances = 40;

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
    Single.Load( Resources, "Sphere", "SimpleLighting" );
    Many.Load( Resources, "Sphere", "SimpleLighting" );
    Points.LoadPoints( Resources, "SpherePoint", "SimpleLighting" );
    std::mt19937 Random( 3 );
    std::uniform_real_distribution< float > Place( -30, 30 );
    for ( std::size_t Index = 0; Index < Instances; ++Index )
    {
      Spheres.push_back( { Place( Random ), Place( Random ), Place( Random ), 2.0f + float( Index % 5 ),
                           0xFF000000u | std::uint32_t( Random() ) } );
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

  bool IsDrawn( std::size_t i_Index, int i_Mode ) const
  {
    const std::uint8_t Flag = Flags[i_Index];
    return i_Mode == ERenderModeSelection   ? !( Flag & EInstanceHidden )
           : i_Mode == ERenderModeHighlight ? ( Flag & ( EInstanceSelected | EInstancePreselected ) ) != 0
                                            : true;
  }

  std::vector< std::uint32_t > OneByOne( int i_Mode )
  {
    Context.Begin( i_Mode );
    EXPECT_TRUE( Single.Use( rRender ) );
    rRender.SetRenderState( VRenderState{} );
    EXPECT_TRUE( rRender.SetVertexBuffer( Mesh.Stream() ) );
    VUniform Position{ "u_ReconPosAndSize" };
    VUniform Colour{ "u_ModelColour" };
    for ( std::size_t Index = 0; Index < Instances; ++Index )
    {
      if ( IsDrawn( Index, i_Mode ) )
      {
        const VInstance& rSphere = Spheres[Index];
        const auto Part = [&]( int i_Shift )
        {
          return float( ( rSphere.Colour >> i_Shift ) & 255 ) / 255.0f;
        };
        Position.Set( *Single.Current(), QVector4D( rSphere.X, rSphere.Y, rSphere.Z, rSphere.Radius ) );
        Colour.Set( *Single.Current(), QVector4D( Part( 0 ), Part( 8 ), Part( 16 ), Part( 24 ) ) );
        Single.SetSelectionColour( ( FirstId + std::uint32_t( Index ) ) | ( Flags[Index] & 7u ) << 21 );
        rRender.DrawElements( GL_TRIANGLES, Mesh );
      }
    }
    return Context.Pixels();
  }

  std::vector< std::uint32_t > AllAtOnce( int i_Mode )
  {
    Context.Begin( i_Mode );
    EXPECT_TRUE( InstanceBuffer.Write( std::span( Spheres ) ) );
    EXPECT_TRUE( FlagBuffer.Write( std::span( Flags ) ) );
    EXPECT_TRUE( Many.Use( rRender, FirstId ) );
    rRender.SetRenderState( VRenderState{} );
    const std::array< VVertexStream, 3 > Streams = { Mesh.Stream(),
                                                     VVertexStream{ &InstanceBuffer, &InstanceLayout, 0 },
                                                     VVertexStream{ &FlagBuffer, &FlagLayout, 0 } };
    EXPECT_TRUE( rRender.SetVertexStreams( Streams ) );
    rRender.ResetCounters();
    rRender.DrawElementsInstanced( GL_TRIANGLES, Mesh, int( Instances ) );
    EXPECT_EQ( rRender.DrawCalls(), 1u );
    return Context.Pixels();
  }

  VTestContext Context;
  VRenderContext& rRender;
  VResources Resources;
  VProgramPair Single;
  VInstancedProgramPair Many;
  VInstancedProgramPair Points;
  VMesh Mesh = MakeSphereMesh( 2 );
  VDynamicBuffer InstanceBuffer;
  VDynamicBuffer FlagBuffer;
  std::vector< VInstance > Spheres;
  std::vector< std::uint8_t > Flags;
};
INSTANTIATE_TEST_SUITE_P( Contexts, InstancingTest, testing::Values( EKindCore, EKindCompatibility, EKindES ),
                          KindName );

TEST_P( InstancingTest, TheInstancedFormDrawsThePictureOfTheSingleForm )
{
  for ( const int Mode : { ERenderModeNormal, ERenderModeSelection, ERenderModeHighlight } )
  {
    const std::vector< std::uint32_t > Expected = OneByOne( Mode );
    EXPECT_GT( Context.Covered(), 300 ) << Mode;
    const std::vector< std::uint32_t > Drawn = AllAtOnce( Mode );
    // Lit colours may fall on either side of a rounding; ids may not.
    EXPECT_LE( LargestDifference( Drawn, Expected ), Mode == ERenderModeNormal ? 1 : 0 ) << Mode;
  }
  // A draw of one object after a draw of many takes nothing over from it.
  const std::vector< std::uint32_t > First = OneByOne( ERenderModeNormal );
  AllAtOnce( ERenderModeNormal );
  EXPECT_EQ( OneByOne( ERenderModeNormal ), First );
}

TEST_P( InstancingTest, EachPixelNamesItsInstanceAndItsFlags )
{
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
  constexpr VVertexLayout PlaceOnly( 20, 1, { { EAttributeReconPosAndSize, 4, GL_FLOAT, false, 0 } } );
  for ( VInstance& rSphere : Spheres )
  {
    rSphere.Colour = 0xFFFFA0FF;
  }
  const std::vector< std::uint32_t > Expected = AllAtOnce( ERenderModeNormal );
  Context.Begin();
  ASSERT_TRUE( Many.Use( rRender, FirstId ) );
  rRender.SetRenderState( VRenderState{} );
  const std::array< VVertexStream, 2 > Streams = { Mesh.Stream(), VVertexStream{ &InstanceBuffer, &PlaceOnly, 0 } };
  ASSERT_TRUE( rRender.SetVertexStreams( Streams ) );
  rRender.SetConstantAttribute( EAttributeModelColour, { 1, 160.0f / 255.0f, 1, 1 } );
  rRender.DrawElementsInstanced( GL_TRIANGLES, Mesh, int( Instances ) );
  EXPECT_EQ( Context.Pixels(), Expected );
}

TEST_P( InstancingTest, TinySpheresAsPointsLieWhereTheSpheresLie )
{
  for ( VInstance& rSphere : Spheres )
  {
    rSphere.Radius = 0.2f;
  }
  const auto Draw = [&]( int i_Mode, std::uint32_t i_FirstId )
  {
    Context.Begin( i_Mode );
    EXPECT_TRUE( InstanceBuffer.Write( std::span( Spheres ) ) );
    EXPECT_TRUE( FlagBuffer.Write( std::span( Flags ) ) );
    EXPECT_TRUE( Points.Use( rRender, i_FirstId ) );
    const std::array< VVertexStream, 2 > Streams = { VVertexStream{ &InstanceBuffer, &PointLayout, 0 },
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
    const VInstance& rSphere = Spheres[Index];
    const QVector3D Clip = rRender.ViewProjection().map( QVector3D( rSphere.X, rSphere.Y, rSphere.Z ) );
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
