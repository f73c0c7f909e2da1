#include "MurmurHash3.h"
#include "TestContext.h"

#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>

#include <numeric>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
using VFloats = std::vector< float >;

// Uses all fixed uniforms, so that the compiler keeps them.
const char* const Fixed = R"(uniform mat4 u_ViewProjection; uniform mat4 u_View; uniform mat4 u_Projection;
uniform vec4 u_View2D; uniform vec2 u_ViewportSize; uniform vec2 u_ViewportOffset; uniform vec2 u_FrameSize;
uniform vec3 u_LightVector; uniform vec3 u_Up; uniform float u_GlobalTime; uniform vec3 u_CameraPosition;
uniform int u_Int; uniform float u_Float; uniform mat2 u_Matrix2; uniform vec4 u_Array[3]; attribute vec3 a_position;
void main() { vec4 sum = u_View * u_Projection * u_View2D + u_Array[u_Int];
sum.xy += u_ViewportSize + u_ViewportOffset + u_FrameSize + u_Matrix2 * sum.zw;
sum.xyz += u_LightVector + u_Up + u_CameraPosition + vec3( u_GlobalTime * u_Float );
gl_Position = u_ViewProjection * vec4( a_position, 1.0 ) + sum; })";

VFloats Of( const QMatrix4x4& i_rMatrix )
{
  return { i_rMatrix.constData(), i_rMatrix.constData() + 16 };
}
} // namespace

class ProgramTest : public DrawingTest
{
public:
  ProgramTest()
  {
    WriteText( Folder.Path() / "VertexShaders" / "Fixed.glsl", Fixed );
    pHost->Folders = { Folder.Path() };
    EXPECT_TRUE( Resources.Prepare() );
    Context.Begin();
  }

  VFloats Value( const VShaderProgram& i_rProgram, int i_Location, std::size_t i_Count )
  {
    VFloats Values( 16, -99.0f );
    pGl->glGetUniformfv( i_rProgram.Id(), i_Location, Values.data() );
    Values.resize( i_Count );
    return Values;
  }

  TestSupport::VTemporaryDir Folder;
  std::shared_ptr< VFakeRenderResources > pHost = std::make_shared< VFakeRenderResources >();
  VResources Resources{ pHost };
};
INSTANTIATE_TEST_SUITE_P( Contexts, ProgramTest, AllKinds, KindName );

TEST_P( ProgramTest, FixedUniformsCarryTheContextsValues )
{
  const auto pProgram = Resources.GetProgram( "Fixed", "UniformColour" );
  QMatrix4x4 Projection, View;
  Projection.perspective( 40, 1.5f, 1, 1000 );
  View.lookAt( { 10, 20, 30 }, { 0, 0, 0 }, { 0, 0, 1 } );
  rRender.SetProjection( Projection );
  rRender.SetView( View );
  rRender.SetView2D( { 1, 2, 3, 4 } );
  rRender.SetViewport( QRect( 5, 6, 70, 80 ) );
  rRender.SetFrameSize( { 90, 91 } );
  rRender.SetLightVector( { 7, 8, 9 } );
  rRender.SetYUp( true );
  rRender.SetGlobalTime( 12.5f );
  ASSERT_TRUE( rRender.UseProgram( pProgram ) );
  const std::pair< EFixedUniform, VFloats > Expected[] = { { EUniformViewProjection, Of( Projection * View ) },
                                                           { EUniformView, Of( View ) },
                                                           { EUniformProjection, Of( Projection ) },
                                                           { EUniformView2D, { 1, 2, 3, 4 } },
                                                           { EUniformViewportSize, { 70, 80 } },
                                                           { EUniformViewportOffset, { 5, 6 } },
                                                           { EUniformFrameSize, { 90, 91 } },
                                                           { EUniformLightVector, { 7, 8, 9 } },
                                                           { EUniformUp, { 0, 1, 0 } },
                                                           { EUniformGlobalTime, { 12.5f } },
                                                           { EUniformCameraPosition, { 10, 20, 30 } } };
  for ( const auto& [Uniform, rValues] : Expected )
  {
    const VFloats Sent = Value( *pProgram, pProgram->FixedLocation( Uniform ), rValues.size() );
    for ( std::size_t Index = 0; Index < rValues.size(); ++Index )
    {
      EXPECT_NEAR( Sent[Index], rValues[Index], Uniform == EUniformCameraPosition ? 1e-4f : 0 ) << Uniform;
    }
  }

  // A change reaches a program that was in use before.
  ASSERT_TRUE( rRender.UseProgram( Resources.GetProgram( "Simple3D", "UniformColour" ) ) );
  rRender.SetGlobalTime( 13.5f );
  ASSERT_TRUE( rRender.UseProgram( pProgram ) );
  EXPECT_EQ( Value( *pProgram, pProgram->FixedLocation( EUniformGlobalTime ), 1 ), VFloats{ 13.5f } );
  rRender.SetYUp( false ); // one that is in use already
  ASSERT_TRUE( rRender.UseProgram( pProgram ) );
  EXPECT_EQ( Value( *pProgram, pProgram->FixedLocation( EUniformUp ), 3 ), ( VFloats{ 0, 0, 1 } ) );
}

TEST_P( ProgramTest, OtherUniformsAreFoundByNameAndSetByLocation )
{
  const auto pProgram = Resources.GetProgram( "Fixed", "UniformColour" );
  ASSERT_TRUE( rRender.UseProgram( pProgram ) );
  for ( const char* pName : { "u_Int", "u_Float", "u_Matrix2", "u_Array", "u_Array[0]", "u_Colour", "u_View" } )
  {
    EXPECT_EQ( pProgram->UniformLocation( pName ), pGl->glGetUniformLocation( pProgram->Id(), pName ) ) << pName;
    EXPECT_GE( pProgram->UniformLocation( pName ), 0 ) << pName;
  }
  EXPECT_EQ( pProgram->UniformLocation( "u_Missing" ), -1 );
  EXPECT_EQ( pProgram->UniformLocation( "" ), -1 );
  pProgram->SetUniform( -1, 1 );
  pProgram->SetUniform( pProgram->UniformLocation( "u_Array" ), QVector4D( 1, 2, 3, 4 ) );
  EXPECT_EQ( Value( *pProgram, pProgram->UniformLocation( "u_Array" ), 4 ), ( VFloats{ 1, 2, 3, 4 } ) );

  // An array of matrices is filled from its start; seven floats are no matrix.
  const auto pSkin = Resources.GetProgram( "FBXSkin", "FBXMaterial" );
  ASSERT_TRUE( rRender.UseProgram( pSkin ) );
  const int Bones = pSkin->UniformLocation( "u_BoneTransforms" );
  ASSERT_GE( Bones, 0 );
  VFloats Columns( 250 * 16 + 7 );
  std::iota( Columns.begin(), Columns.end(), 1.0f );
  pSkin->SetUniformMatrices( Bones, Columns );
  pSkin->SetUniformMatrices( Bones, std::span( Columns ).first( 15 ) );
  pSkin->SetUniformMatrices( -1, Columns );
  for ( const int Index : { 0, 1, 249 } )
  {
    const std::string Name = "u_BoneTransforms[" + std::to_string( Index ) + "]";
    const auto First = Columns.begin() + Index * 16;
    EXPECT_EQ( Value( *pSkin, pGl->glGetUniformLocation( pSkin->Id(), Name.c_str() ), 16 ),
               VFloats( First, First + 16 ) );
  }
}

TEST_P( ProgramTest, UsingProgramsAllocatesNothing )
{
  const auto pFirst = Resources.GetProgram( "Fixed", "UniformColour" );
  const auto pSecond = Resources.GetProgram( "Simple3D", "UniformColour" );
  VProgramPair Pair;
  Pair.Load( Resources, "Sphere", "SimpleLighting" );
  Context.Begin( ERenderModeSelection );
  std::uint64_t Before = 0;
  for ( int Count = 0; Count < 100; ++Count )
  {
    rRender.SetGlobalTime( float( Count ) );
    EXPECT_TRUE( rRender.UseProgram( pFirst ) && rRender.UseProgram( pSecond ) && Pair.Use( rRender ) );
    Pair.SetSelectionColour( 77 );
    rRender.SetRenderState( VRenderState{} );
    Before = Count == 0 ? AllocationCount() : Before;
  }
  EXPECT_EQ( AllocationCount(), Before );
}

TEST_P( ProgramTest, AnUnusableProgramIsRefused )
{
  EXPECT_FALSE( rRender.UseProgram( nullptr ) );
  // The varying that the fragment shader reads is missing: both compile, the pair does not link.
  EXPECT_FALSE( rRender.UseProgram( Resources.GetProgram( "Fixed", "Colour" ) ) );
  TestSupport::ExpectFailureLine(
      "Shader Failed To Compile<:/VertexShaders/NoSuchFile.glsl> Log=<No such file or directory>" );
  const auto pMissing = Resources.GetProgram( "NoSuchFile", "Colour" );
  EXPECT_FALSE( pMissing->IsUsable() || rRender.UseProgram( pMissing ) );
  EXPECT_EQ( pMissing->UniformLocation( "u_View" ), -1 );
}

// Every length of the rest behind the blocks of four, and bytes above 127.
TEST( ProgramText, MurmurHash3OfKnownTexts )
{
  constexpr std::uint32_t Seed = 0x9747b28c;
  EXPECT_EQ( MurmurHash3( "" ), 0u );
  EXPECT_EQ( MurmurHash3( "", 0xFFFFFFFF ), 0x81F16F39u );
  EXPECT_EQ( MurmurHash3( "The quick brown fox jumps over the lazy dog" ), 0x2E4FF723u );
  EXPECT_EQ( MurmurHash3( "a", Seed ), 0x7FA09EA6u );
  EXPECT_EQ( MurmurHash3( "aa", Seed ), 0x5D211726u );
  EXPECT_EQ( MurmurHash3( "aaaa", Seed ), 0x5A97808Au );
  EXPECT_EQ( MurmurHash3( "\xCF\x80\xCF\x80\xCF\x80\xCF\x80\xCF\x80\xCF\x80\xCF\x80\xCF\x80", Seed ), 0xD58063C1u );
}
