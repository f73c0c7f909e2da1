#include "TestContext.h"

#include <algorithm>
#include <random>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
/// What one object can have: a transform by columns, place and size, and four colours.
using VObject = std::array< float, 36 >;
static_assert( sizeof( VObject ) == 144 );
constexpr VVertexLayout ObjectLayout( 144, 1,
                                      { { EAttributeModelTransform, 16, GL_FLOAT, false, 0 },
                                        { EAttributeReconPosAndSize, 4, GL_FLOAT, false, 64 },
                                        { EAttributeTargetPosAndSize, 4, GL_FLOAT, false, 64 },
                                        { EAttributeModelColour, 4, GL_FLOAT, false, 80 },
                                        { EAttributeStickColourA, 4, GL_FLOAT, false, 96 },
                                        { EAttributeStickColourB, 4, GL_FLOAT, false, 112 },
                                        { EAttributeSegmentColour, 4, GL_FLOAT, false, 128 } } );
constexpr VVertexLayout FlagLayout( 2, 1, { { EAttributeInstanceFlags, 1, GL_UNSIGNED_SHORT, false, 0 } } );
// Objects that are one vertex each.
constexpr VVertexLayout PointLayout( 144, 0,
                                     { { EAttributePosition, 4, GL_FLOAT, false, 64 },
                                       { EAttributeModelColour, 4, GL_FLOAT, false, 80 } } );
constexpr VVertexLayout PointFlagLayout( 2, 0, { { EAttributeInstanceFlags, 1, GL_UNSIGNED_SHORT, false, 0 } } );
// A sphere's places are its normals, too.
constexpr VVertexLayout
    MeshLayout( 12, 0, { { EAttributePosition, 3, GL_FLOAT, false, 0 }, { EAttributeNormal, 3, GL_FLOAT, false, 0 } } );

constexpr std::uint32_t FirstId = 0x0FFFF0; // instances run over a byte's end
constexpr std::size_t Instances = 40;

// Over all channels of all pixels.
int LargestDifference( const std::vector< std::uint32_t >& i_rA, const std::vector< std::uint32_t >& i_rB )
{
  const auto* pA = reinterpret_cast< const std::uint8_t* >( i_rA.data() );
  const auto* pB = reinterpret_cast< const std::uint8_t* >( i_rB.data() );
  int Largest = 0;
  for ( std::size_t Byte = 0; Byte < i_rA.size() * 4; ++Byte )
  {
    Largest = std::max( Largest, std::abs( pA[Byte] - pB[Byte] ) );
  }
  return Largest;
}
} // namespace

class InstancingTest : public DrawingTest
{
public:
  InstancingTest()
  {
    std::mt19937 Random( 3 );
    std::uniform_real_distribution< float > Unit( 0, 1 );
    for ( std::size_t Index = 0; Index < Instances; ++Index )
    {
      const QVector3D Place( Unit( Random ) * 60 - 30, Unit( Random ) * 60 - 30, Unit( Random ) * 40 - 10 );
      QMatrix4x4 Transform;
      Transform.translate( Place );
      Transform.rotate( 360 * Unit( Random ), { 1, 2, 3 } );
      Transform.scale( 4, 6, 3 );
      VObject& rObject = Objects.emplace_back();
      for ( float& rNumber : rObject )
      {
        rNumber = Unit( Random );
      }
      std::copy_n( Transform.constData(), 16, rObject.begin() );
      std::copy_n( Transform.constData() + 12, 3, rObject.begin() + 16 );
      rObject[19] = 2 + float( Index % 5 );
      const bool bHidden = Index == 11 || Index == 16;
      // Every tenth has ids left out before it.
      Flags.push_back( std::uint16_t( Index % 8 | ( bHidden ? EInstanceHidden : 0 ) | ( Index / 10 * 3 ) << 8 ) );
    }
    QMatrix4x4 Projection, View;
    Projection.perspective( 45, 1, 1, 1000 );
    View.lookAt( { 40, -60, 50 }, { 0, 0, 0 }, { 0, 0, 1 } );
    rRender.SetProjection( Projection );
    rRender.SetView( View );
    rRender.SetLightVector( QVector3D( 1, 1, 3 ).normalized() );
    rRender.SetYUp( false );
  }

  std::uint32_t Id( std::size_t i_Index ) const { return FirstId + std::uint32_t( i_Index ) + ( Flags[i_Index] >> 8 ); }

  static void SetObject( VShaderProgram& io_rProgram, const VObject& i_rObject )
  {
    for ( int Element = 0; Element < ObjectLayout.Count; ++Element )
    {
      const VVertexElement& rElement = ObjectLayout.Elements[std::size_t( Element )];
      const float* pValue = i_rObject.data() + rElement.Offset / sizeof( float );
      const int Location = io_rProgram.UniformLocation( AttributeName( rElement.Attribute ) );
      rElement.Components == 16
          ? io_rProgram.SetUniformMatrices( Location, { pValue, 16 } )
          : io_rProgram.SetUniform( Location, QVector4D( pValue[0], pValue[1], pValue[2], pValue[3] ) );
    }
  }

  std::vector< std::uint32_t > OneByOne( int i_Mode, bool i_bPoints = false )
  {
    Context.Begin( i_Mode );
    EXPECT_TRUE( Single.Use( rRender ) );
    rRender.SetRenderState( VRenderState{} );
    EXPECT_TRUE( ObjectBuffer.Write( std::span( Objects ) ) );
    for ( std::size_t Index = 0; Index < Instances; ++Index )
    {
      const bool bMarked = Flags[Index] & ( EInstanceSelected | EInstancePreselected );
      const bool bShown = i_Mode == ERenderModeHighlight ? bMarked : !( Flags[Index] & EInstanceHidden );
      if ( i_Mode == ERenderModeNormal || bShown )
      {
        SetObject( *Single.Current(), Objects[Index] );
        Single.SetSelectionColour( Id( Index ) | ( Flags[Index] & 7u ) << 21 );
        EXPECT_TRUE( rRender.SetVertexBuffer( i_bPoints ? VVertexStream{ &ObjectBuffer, &PointLayout, Index * 144 }
                                                        : VVertexStream{ Mesh.Stream().pBuffer, &MeshLayout, 0 } ) );
        i_bPoints ? rRender.DrawArrays( GL_POINTS, 1 ) : rRender.DrawElements( GL_TRIANGLES, Mesh );
      }
    }
    return Context.Pixels();
  }

  std::vector< std::uint32_t > AllAtOnce( int i_Mode, bool i_bPoints = false )
  {
    Context.Begin( i_Mode );
    EXPECT_TRUE( ObjectBuffer.Write( std::span( Objects ) ) );
    EXPECT_TRUE( FlagBuffer.Write( std::span( Flags ) ) );
    EXPECT_TRUE( Many.Use( rRender, FirstId ) );
    rRender.SetRenderState( VRenderState{} );
    const std::array< VVertexStream, 3 > Streams = {
        VVertexStream{ &ObjectBuffer, i_bPoints ? &PointLayout : &ObjectLayout, 0 },
        { &FlagBuffer, i_bPoints ? &PointFlagLayout : &FlagLayout, 0 },
        { Mesh.Stream().pBuffer, &MeshLayout, 0 } };
    EXPECT_TRUE( rRender.SetVertexStreams( std::span( Streams ).first( i_bPoints ? 2 : 3 ) ) );
    rRender.ResetCounters();
    i_bPoints ? rRender.DrawArrays( GL_POINTS, int( Instances ) )
              : rRender.DrawElementsInstanced( GL_TRIANGLES, Mesh, int( Instances ) );
    EXPECT_EQ( rRender.DrawCalls(), 1u );
    return Context.Pixels();
  }

  VProgramPair Single;
  VInstancedProgramPair Many;
  VMesh Mesh = MakeSphereMesh( 1 );
  VDynamicBuffer ObjectBuffer, FlagBuffer;
  std::vector< VObject > Objects;
  std::vector< std::uint16_t > Flags;
};
INSTANTIATE_TEST_SUITE_P( Contexts, InstancingTest, AllKinds, KindName );

// Looks that take all of the per-object values between them, and one of objects that are points.
TEST_P( InstancingTest, ManyAtOnceGiveThePictureOfOneByOne )
{
  const std::tuple< const char*, const char*, bool > Looks[] = { { "Target", "Colour", false },
                                                                 { "Segment", "Segment", false },
                                                                 { "Stick", "SimpleLighting", false },
                                                                 { "Sphere", "SimpleLighting", false },
                                                                 { "SpherePoint", "Colour", true } };
  for ( const auto& [pVertex, pFragment, bPoints] : Looks )
  {
    Single.Load( rResources, pVertex, pFragment );
    bPoints ? Many.LoadPoints( rResources, pVertex, pFragment ) : Many.Load( rResources, pVertex, pFragment );
    for ( const int Mode : { ERenderModeNormal, ERenderModeSelection, ERenderModeHighlight } )
    {
      const std::vector< std::uint32_t > Expected = OneByOne( Mode, bPoints );
      EXPECT_GT( Context.Covered(), 300 ) << pVertex << Mode;
      // Lit colours may fall on either side of a rounding; ids may not.
      EXPECT_LE( LargestDifference( AllAtOnce( Mode, bPoints ), Expected ), Mode == ERenderModeNormal ? 1 : 0 )
          << pVertex << Mode;
      EXPECT_EQ( OneByOne( Mode, bPoints ), Expected ) << pVertex << Mode << ": takes nothing over from a draw of many";
    }
  }
  EXPECT_FALSE( Many.Use( rRender, 0 ) ) << "no id, nothing to pick";
}

TEST_P( InstancingTest, AConstantTakesThePlaceOfAStream )
{
  constexpr VVertexLayout PlaceOnly( 144, 1, { { EAttributeReconPosAndSize, 4, GL_FLOAT, false, 64 } } );
  for ( VObject& rObject : Objects )
  {
    std::fill_n( rObject.begin() + 20, 4, 1.0f );
  }
  Many.Load( rResources, "Sphere", "SimpleLighting" );
  const std::vector< std::uint32_t > Expected = AllAtOnce( ERenderModeNormal );
  Context.Begin();
  ASSERT_TRUE( Many.Use( rRender, FirstId ) );
  rRender.SetRenderState( VRenderState{} );
  const std::array< VVertexStream, 2 > Streams = { Mesh.Stream(), VVertexStream{ &ObjectBuffer, &PlaceOnly, 0 } };
  ASSERT_TRUE( rRender.SetVertexStreams( Streams ) );
  rRender.SetConstantAttribute( EAttributeModelColour, { 1, 1, 1, 1 } );
  rRender.DrawElementsInstanced( GL_TRIANGLES, Mesh, int( Instances ) );
  EXPECT_EQ( Context.Pixels(), Expected );

  // A mesh without colours is white, also in a frame after one that gave it another colour.
  const auto pProgram = rResources.GetProgram( "Simple3DModelColour", "Colour" );
  for ( int Frame = 0; Frame < 2; ++Frame )
  {
    Context.Begin();
    ASSERT_TRUE( rRender.UseProgram( pProgram ) );
    SetObject( *pProgram, Objects[0] );
    ASSERT_TRUE( rRender.SetVertexBuffer( Mesh.Stream() ) );
    rRender.DrawElements( GL_TRIANGLES, Mesh );
    const std::vector< std::uint32_t > Pixels = Context.Pixels();
    EXPECT_GT( Context.Covered(), 10 );
    EXPECT_EQ( std::count( Pixels.begin(), Pixels.end(), 0xFFFFFFFFu ), Context.Covered() );
    rRender.SetConstantAttribute( EAttributeColour, { 0, 0, 1, 1 } );
  }
}
