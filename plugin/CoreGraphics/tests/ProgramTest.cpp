#include "TestContext.h"

#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>

#include <numeric>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
// Uses all fixed uniforms, so that the compiler keeps them.
const char* const Fixed = "uniform mat4 u_ViewProjection; uniform mat4 u_View; uniform mat4 u_Projection;\n"
                          "uniform vec4 u_View2D; uniform vec2 u_ViewportSize; uniform vec2 u_ViewportOffset;\n"
                          "uniform vec2 u_FrameSize; uniform vec3 u_LightVector; uniform vec3 u_Up;\n"
                          "uniform float u_GlobalTime; uniform vec3 u_CameraPosition;\n"
                          "uniform int u_Int; uniform float u_Float; uniform mat2 u_Matrix2; uniform vec4 u_Array[3];\n"
                          "attribute vec3 a_position;\n"
                          "void main() { vec4 sum = u_View * u_Projection * u_View2D + u_Array[u_Int];\n"
                          "sum.xy += u_ViewportSize + u_ViewportOffset + u_FrameSize + u_Matrix2 * sum.zw;\n"
                          "sum.xyz += u_LightVector + u_Up + u_CameraPosition + vec3( u_GlobalTime * u_Float );\n"
                          "gl_Position = u_ViewProjection * vec4( a_position, 1.0 ) + sum; }\n";

std::vector< float > Value( VTestContext& i_rContext, const VShaderProgram& i_rProgram, int i_Location, int i_Count )
{
  std::vector< float > Values( 16, -99.0f );
  i_rContext.pRender->Functions()->glGetUniformfv( i_rProgram.Id(), i_Location, Values.data() );
  Values.resize( std::size_t( i_Count ) );
  return Values;
}

std::vector< float > Of( const QMatrix4x4& i_rMatrix )
{
  return std::vector< float >( i_rMatrix.constData(), i_rMatrix.constData() + 16 );
}
} // namespace

class ProgramTest : public testing::TestWithParam< EContextKind >
{
public:
  ProgramTest()
    : Context( GetParam() )
  {
    WriteText( Folder.Path() / "VertexShaders" / "Fixed.glsl", Fixed );
    pHost->Folders = { Folder.Path() };
    EXPECT_TRUE( Resources.Prepare() );
  }

  TestSupport::VTemporaryDir Folder;
  std::shared_ptr< VFakeRenderResources > pHost = std::make_shared< VFakeRenderResources >();
  VTestContext Context;
  VResources Resources{ pHost };
};
INSTANTIATE_TEST_SUITE_P( Contexts, ProgramTest, testing::Values( EKindCore, EKindCompatibility, EKindES ), KindName );

TEST_P( ProgramTest, FixedUniformsCarryTheContextsValues )
{
  const auto pProgram = Resources.GetProgram( "Fixed", "UniformColour" );
  VRenderContext& rRender = *Context.pRender;
  Context.Begin();
  QMatrix4x4 Projection;
  Projection.perspective( 40, 1.5f, 1, 1000 );
  QMatrix4x4 View;
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

  const auto Sent = [&]( EFixedUniform i_Uniform, int i_Count )
  {
    return Value( Context, *pProgram, pProgram->FixedLocation( i_Uniform ), i_Count );
  };
  EXPECT_EQ( Sent( EUniformViewProjection, 16 ), Of( Projection * View ) );
  EXPECT_EQ( Sent( EUniformView, 16 ), Of( View ) );
  EXPECT_EQ( Sent( EUniformProjection, 16 ), Of( Projection ) );
  EXPECT_EQ( Sent( EUniformView2D, 4 ), ( std::vector< float >{ 1, 2, 3, 4 } ) );
  EXPECT_EQ( Sent( EUniformViewportSize, 2 ), ( std::vector< float >{ 70, 80 } ) );
  EXPECT_EQ( Sent( EUniformViewportOffset, 2 ), ( std::vector< float >{ 5, 6 } ) );
  EXPECT_EQ( Sent( EUniformFrameSize, 2 ), ( std::vector< float >{ 90, 91 } ) );
  EXPECT_EQ( Sent( EUniformLightVector, 3 ), ( std::vector< float >{ 7, 8, 9 } ) );
  EXPECT_EQ( Sent( EUniformUp, 3 ), ( std::vector< float >{ 0, 1, 0 } ) );
  EXPECT_EQ( Sent( EUniformGlobalTime, 1 ), ( std::vector< float >{ 12.5f } ) );
  const std::vector< float > Eye = Sent( EUniformCameraPosition, 3 );
  EXPECT_NEAR( Eye[0], 10, 1e-4 );
  EXPECT_NEAR( Eye[1], 20, 1e-4 );
  EXPECT_NEAR( Eye[2], 30, 1e-4 );

  // A change reaches a program that is in use already, and one that was in use before.
  const auto pOther = Resources.GetProgram( "Simple3D", "UniformColour" );
  ASSERT_TRUE( rRender.UseProgram( pOther ) );
  rRender.SetGlobalTime( 13.5f );
  ASSERT_TRUE( rRender.UseProgram( pProgram ) );
  EXPECT_EQ( Sent( EUniformGlobalTime, 1 ), ( std::vector< float >{ 13.5f } ) );
  rRender.SetYUp( false );
  ASSERT_TRUE( rRender.UseProgram( pProgram ) );
  EXPECT_EQ( Sent( EUniformUp, 3 ), ( std::vector< float >{ 0, 0, 1 } ) );
}

TEST_P( ProgramTest, OtherUniformsAreFoundByNameAndSetByLocation )
{
  const auto pProgram = Resources.GetProgram( "Fixed", "UniformColour" );
  Context.Begin();
  ASSERT_TRUE( Context.pRender->UseProgram( pProgram ) );
  for ( const char* pName : { "u_Int", "u_Float", "u_Matrix2", "u_Array", "u_Array[0]", "u_Colour", "u_View" } )
  {
    EXPECT_EQ( pProgram->UniformLocation( pName ),
               Context.pRender->Functions()->glGetUniformLocation( pProgram->Id(), pName ) )
        << pName;
    EXPECT_GE( pProgram->UniformLocation( pName ), 0 ) << pName;
  }
  EXPECT_EQ( pProgram->UniformLocation( "u_Missing" ), -1 );
  EXPECT_EQ( pProgram->UniformLocation( "" ), -1 );

  pProgram->SetUniform( pProgram->UniformLocation( "u_Float" ), 2.5f );
  pProgram->SetUniform( pProgram->UniformLocation( "u_Array" ), QVector4D( 1, 2, 3, 4 ) );
  const float Numbers[] = { 1, 2, 3, 4 };
  const QMatrix2x2 Matrix( Numbers );
  pProgram->SetUniform( pProgram->UniformLocation( "u_Matrix2" ), Matrix );
  pProgram->SetUniform( -1, 1 );
  pProgram->SetUniform( -1, QMatrix4x4() );
  EXPECT_EQ( Value( Context, *pProgram, pProgram->UniformLocation( "u_Float" ), 1 )[0], 2.5f );
  EXPECT_EQ( Value( Context, *pProgram, pProgram->UniformLocation( "u_Array" ), 4 ),
             ( std::vector< float >{ 1, 2, 3, 4 } ) );
  EXPECT_EQ( Value( Context, *pProgram, pProgram->UniformLocation( "u_Matrix2" ), 4 ),
             std::vector< float >( Matrix.constData(), Matrix.constData() + 4 ) );
}

TEST_P( ProgramTest, AnArrayOfMatricesIsFilledFromItsStart )
{
  const auto pProgram = Resources.GetProgram( "FBXSkin", "FBXMaterial" );
  Context.Begin();
  ASSERT_TRUE( Context.pRender->UseProgram( pProgram ) );
  const int Bones = pProgram->UniformLocation( "u_BoneTransforms" );
  ASSERT_GE( Bones, 0 );
  std::vector< float > Columns( 250 * 16 + 7 );
  std::iota( Columns.begin(), Columns.end(), 1.0f );
  pProgram->SetUniformMatrices( Bones, Columns ); // seven floats are no matrix
  pProgram->SetUniformMatrices( Bones, std::span( Columns ).first( 15 ) );
  pProgram->SetUniformMatrices( -1, Columns );
  for ( const int Index : { 0, 1, 249 } )
  {
    const std::string Name = "u_BoneTransforms[" + std::to_string( Index ) + "]";
    const int Location = Context.pRender->Functions()->glGetUniformLocation( pProgram->Id(), Name.c_str() );
    const auto First = Columns.begin() + Index * 16;
    EXPECT_EQ( Value( Context, *pProgram, Location, 16 ), std::vector< float >( First, First + 16 ) ) << Index;
  }
}

TEST_P( ProgramTest, UsingProgramsAllocatesNothing )
{
  const auto pFirst = Resources.GetProgram( "Fixed", "UniformColour" );
  const auto pSecond = Resources.GetProgram( "Simple3D", "UniformColour" );
  VProgramPair Pair;
  Pair.Load( Resources, "Sphere", "SimpleLighting" );
  Context.Begin( ERenderModeSelection );
  const auto Frame = [&]( float i_Time )
  {
    Context.pRender->SetGlobalTime( i_Time );
    EXPECT_TRUE( Context.pRender->UseProgram( pFirst ) );
    EXPECT_TRUE( Context.pRender->UseProgram( pSecond ) );
    EXPECT_TRUE( Pair.Use( *Context.pRender ) );
    Pair.SetSelectionColour( 77 );
    Context.pRender->SetRenderState( VRenderState{} );
  };
  Frame( 1 );
  const std::uint64_t Before = AllocationCount();
  for ( int Count = 0; Count < 100; ++Count )
  {
    Frame( float( Count ) );
  }
  EXPECT_EQ( AllocationCount(), Before );
}

TEST_P( ProgramTest, AnUnusableProgramIsRefused )
{
  EXPECT_FALSE( Context.pRender->UseProgram( nullptr ) );
  // The varying that the fragment shader reads is missing: both compile, the pair does not link.
  const auto pUnlinked = Resources.GetProgram( "Fixed", "Colour" );
  EXPECT_FALSE( pUnlinked->IsUsable() );
  EXPECT_FALSE( Context.pRender->UseProgram( pUnlinked ) );
  TestSupport::ExpectFailureLine(
      "Shader Failed To Compile<:/VertexShaders/NoSuchFile.glsl> Log=<No such file or directory>" );
  const auto pMissing = Resources.GetProgram( "NoSuchFile", "Colour" );
  EXPECT_FALSE( Context.pRender->UseProgram( pMissing ) );
  EXPECT_EQ( pMissing->UniformLocation( "u_View" ), -1 );
}
