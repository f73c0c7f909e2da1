#include "TestContext.h"

#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>

#include <fstream>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;
using TestSupport::LogTexts;

namespace
{
const std::string Good = "void main() { gl_FragColor = vec4( 0.0, 1.0, 0.0, 1.0 ); }\n";
const std::string Broken = "void main() { gl_FragColor = nonsense; }\n";
constexpr std::uint32_t Green = 0xFF00FF00;
constexpr std::uint32_t Red = 0xFF0000FF;

std::string NotePath( const std::filesystem::path& i_rPath, const char* i_pStart )
{
  return std::string( i_pStart ) + i_rPath.string();
}
} // namespace

class ResourcesTest : public testing::Test
{
public:
  ResourcesTest()
  {
    pHost->Folders = { First.Path(), Second.Path() };
    Quad.SetContents( std::span( Corners ) );
    EXPECT_TRUE( Resources.Prepare() );
  }

  // The colour that a full-screen draw of the program leaves; 0 when it is refused.
  std::uint32_t Drawn( VTestContext& io_rContext, const std::shared_ptr< VShaderProgram >& i_rpProgram )
  {
    VRenderContext& rRender = *io_rContext.pRender;
    io_rContext.Begin();
    if ( !rRender.UseProgram( i_rpProgram ) )
    {
      return 0;
    }
    i_rpProgram->SetUniform( i_rpProgram->UniformLocation( "u_Colour" ), QVector4D( 1, 0, 0, 1 ) );
    EXPECT_TRUE( rRender.SetVertexBuffer( { &Quad, &Layout, 0 } ) );
    rRender.DrawArrays( GL_TRIANGLE_FAN, 4 );
    return io_rContext.Pixels()[0];
  }

  static constexpr VVertexLayout Layout{ 8, 0, { { EAttributePosition, 2, GL_FLOAT, false, 0 } } };
  const std::array< float, 8 > Corners = { 0, 0, 1, 0, 1, 1, 0, 1 };
  VStaticBuffer Quad;
  TestSupport::VTemporaryDir First;
  TestSupport::VTemporaryDir Second;
  std::filesystem::path File = Second.Path() / "FragmentShaders" / "UniformColour.glsl";
  std::shared_ptr< VFakeRenderResources > pHost = std::make_shared< VFakeRenderResources >();
  VTestContext Context{ EKindCore };
  VResources Resources{ pHost };
};

TEST_F( ResourcesTest, APairIsBuiltOnceAndAShaderCompiledOnce )
{
  const auto pProgram = Resources.GetProgram( "FullScreen", "UniformColour" );
  EXPECT_EQ( Resources.GetProgram( "FullScreen", "UniformColour" ), pProgram );
  const auto pOther = Resources.GetProgram( "FullScreen", "Copy" );
  EXPECT_NE( pOther, pProgram );
  EXPECT_EQ( pOther->Vertex(), pProgram->Vertex() );
  const std::vector< std::string > Lines = LogTexts( "CoreGraphics", ZEK::ELogDetail );
  EXPECT_EQ( std::count( Lines.begin(), Lines.end(), "Loading shader file :/VertexShaders/FullScreen.glsl" ), 1 );
}

TEST_F( ResourcesTest, OverridesWinFromTheNextReloadOnAndFallBackWhenRemoved )
{
  const auto pProgram = Resources.GetProgram( "FullScreen", "UniformColour" );
  EXPECT_EQ( Drawn( Context, pProgram ), Red );

  WriteText( File, Good );
  EXPECT_FALSE( Resources.Update() );
  EXPECT_EQ( Drawn( Context, pProgram ), Red );
  pHost->Reload();
  EXPECT_TRUE( Resources.Update() );
  EXPECT_FALSE( Resources.Update() );
  EXPECT_EQ( Drawn( Context, pProgram ), Green ) << "the held program is the new one";

  // The first folder that has a file wins.
  WriteText( First.Path() / "FragmentShaders" / "UniformColour.glsl",
             "void main() { gl_FragColor = vec4( 0.0, 0.0, 1.0, 1.0 ); }\n" );
  Resources.Reload();
  EXPECT_EQ( Drawn( Context, pProgram ), 0xFFFF0000 );

  std::filesystem::remove( File );
  std::filesystem::remove( First.Path() / "FragmentShaders" / "UniformColour.glsl" );
  Resources.Reload();
  EXPECT_EQ( Drawn( Context, pProgram ), Red );
}

TEST_F( ResourcesTest, ABrokenOverrideIsLoggedOnceAndHealsAfterAReload )
{
  const auto pProgram = Resources.GetProgram( "FullScreen", "UniformColour" );
  const auto pBystander = Resources.GetProgram( "Simple3D", "Colour" );
  const std::uint64_t Before = pProgram->LinkSerial();
  WriteText( File, Broken );
  // The compiler's words are its own: the line is compared up to them.
  ZEK::GlobalLog().SetMaximumLevel( ZEK::ELogDetail );
  Resources.Reload();
  const std::vector< std::string > Failures = LogTexts( "CoreGraphics", ZEK::ELogFailure );
  ASSERT_EQ( Failures.size(), 1u );
  TestSupport::ExpectFailureLine( Failures[0] );
  EXPECT_EQ( Failures[0].find( NotePath( File, "Shader Failed To Compile<" ) + "> Log=<" ), 0u ) << Failures[0];
  EXPECT_NE( Failures[0].find( "nonsense" ), std::string::npos );
  EXPECT_NE( Failures[0].find( "0:1(" ), std::string::npos ) << "lines count from the file's first: " << Failures[0];
  EXPECT_EQ( Failures[0].back(), '>' );

  EXPECT_EQ( Drawn( Context, pProgram ), 0u );
  Resources.Reload();
  EXPECT_EQ( Drawn( Context, pProgram ), 0u );
  EXPECT_EQ( LogTexts( "CoreGraphics", ZEK::ELogFailure ).size(), 1u ) << "the same fault is not told twice";

  WriteText( File, Good );
  Resources.Reload();
  EXPECT_EQ( Drawn( Context, pProgram ), Green );
  EXPECT_NE( pProgram->LinkSerial(), Before );
  EXPECT_TRUE( pBystander->Vertex()->IsCompiled() );
}

TEST_F( ResourcesTest, LocationsAreFoundAgainAfterAReload )
{
  VProgramPair Pair;
  Pair.Load( Resources, "FullScreen", "UniformColour" );
  Context.Begin( ERenderModeSelection );
  ASSERT_TRUE( Pair.Use( *Context.pRender ) );
  Pair.SetSelectionColour( 0x00C0FFEE );
  // In the new source another uniform takes the first location.
  WriteText( First.Path() / "FragmentShaders" / "Selection.glsl",
             "uniform vec4 a_Other; uniform vec3 u_SelectionId;\n"
             "void main() { gl_FragColor = vec4( u_SelectionId, 1.0 / 255.0 ) + a_Other; }\n" );
  Resources.Reload();
  Context.Begin( ERenderModeSelection );
  ASSERT_TRUE( Pair.Use( *Context.pRender ) );
  Pair.SetSelectionColour( 0x00123456 );
  ASSERT_TRUE( Context.pRender->SetVertexBuffer( { &Quad, &Layout, 0 } ) );
  Context.pRender->DrawArrays( GL_TRIANGLE_FAN, 4 );
  EXPECT_EQ( Context.Pixels()[100], 0x01123456u );
}

TEST_F( ResourcesTest, AContextOfTheSameGroupSharesProgramsAndBuffers )
{
  const auto pProgram = Resources.GetProgram( "FullScreen", "UniformColour" );
  EXPECT_EQ( Drawn( Context, pProgram ), Red );
  VTestContext Other( EKindCore, &Context.Context );
  EXPECT_TRUE( Resources.Prepare() );
  EXPECT_EQ( Drawn( Other, pProgram ), Red );
  Context.MakeCurrent();
  EXPECT_EQ( Drawn( Context, pProgram ), Red );
  Other.MakeCurrent();
}

TEST_F( ResourcesTest, AContextOfAnotherGroupIsRefused )
{
  {
    VTestContext Stranger( EKindCore );
    TestSupport::ExpectFailureLine(
        "The OpenGL context of a view shares no objects with the first one of its scene; nothing is drawn" );
    EXPECT_FALSE( Resources.Prepare() );
  }
  Context.MakeCurrent();
  EXPECT_TRUE( Resources.Prepare() );
  Context.Context.doneCurrent();
  EXPECT_FALSE( Resources.Prepare() ) << "no context at all";
}

TEST( Resources, ANewGroupAfterTheFirstDiedGetsEverythingAgain )
{
  VResources Resources;
  std::shared_ptr< VShaderProgram > pProgram;
  VMesh Sphere = MakeSphereMesh( 1 );
  VDynamicBuffer Dynamic;
  const std::array< float, 3 > Point = { 0, 0, 0 };
  const auto Draw = [&]( VTestContext& i_rContext )
  {
    i_rContext.Begin();
    EXPECT_TRUE( i_rContext.pRender->UseProgram( pProgram ) );
    pProgram->SetUniform( pProgram->UniformLocation( "u_Colour" ), QVector4D( 1, 1, 1, 1 ) );
    EXPECT_TRUE( i_rContext.pRender->SetVertexBuffer( Sphere.Stream() ) );
    i_rContext.pRender->DrawElements( GL_TRIANGLES, Sphere );
    return i_rContext.Covered();
  };
  int Covered = 0;
  {
    VTestContext Context( EKindCore );
    ASSERT_TRUE( Resources.Prepare() );
    pProgram = Resources.GetProgram( "Simple3D", "UniformColour" );
    Covered = Draw( Context );
    EXPECT_GT( Covered, 1000 );
    EXPECT_TRUE( Dynamic.Write( std::span( Point ) ) );
    EXPECT_TRUE( Dynamic.Bind() );
  }
  VTestContext Context( EKindCore );
  EXPECT_TRUE( Resources.Update() );
  EXPECT_FALSE( Dynamic.Bind() ) << "the contents went with the group";
  EXPECT_TRUE( Dynamic.Write( std::span( Point ) ) );
  EXPECT_TRUE( Dynamic.Bind() );
  EXPECT_EQ( Draw( Context ), Covered );
}

TEST( Resources, AProgramAskedForTooEarlyIsCompletedLater )
{
  VResources Resources;
  const auto pProgram = Resources.GetProgram( "Simple3D", "UniformColour" );
  EXPECT_FALSE( pProgram->IsUsable() );
  VTestContext Context( EKindCore );
  EXPECT_FALSE( Context.pRender->UseProgram( pProgram ) );
  ASSERT_TRUE( Resources.Prepare() );
  EXPECT_TRUE( Context.pRender->UseProgram( pProgram ) );
}

TEST( Resources, WordsOnAContextBelowTheMinimum )
{
  EXPECT_EQ( VResources::VersionText( false, 3, 3 ), "OpenGL context version 3.3 is unsupported" );
  EXPECT_EQ( VResources::VersionText( false, 4, 2 ), "OpenGL context version 4.2 is unsupported" );
  EXPECT_EQ( VResources::VersionText( true, 2, 0 ), "OpenGL ES context version 2.0 is unsupported" );
  EXPECT_EQ( VResources::VersionText( false, 4, 3 ), "" );
  EXPECT_EQ( VResources::VersionText( false, 5, 0 ), "" );
  EXPECT_EQ( VResources::VersionText( true, 3, 0 ), "" );
}
