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
} // namespace

class ResourcesTest : public testing::Test
{
public:
  ResourcesTest()
  {
    pHost->Folders = { First.Path(), Second.Path() };
    EXPECT_TRUE( Resources.Prepare() );
  }
  ~ResourcesTest() override { EXPECT_TRUE( Context.MakeCurrent() ); }

  // The colour that a full-screen draw of the program leaves; 0 when it is refused.
  std::uint32_t Drawn( VTestContext& io_rContext, const std::shared_ptr< VShaderProgram >& i_rpProgram )
  {
    io_rContext.Begin();
    return io_rContext.Fill( Context.Quad, i_rpProgram, { 1, 0, 0, 1 } ) ? io_rContext.Pixels()[0] : 0;
  }

  TestSupport::VTemporaryDir First, Second;
  std::filesystem::path File = Second.Path() / "FragmentShaders" / "UniformColour.glsl";
  std::shared_ptr< VFakeRenderResources > pHost = std::make_shared< VFakeRenderResources >();
  VTestScene& Context = SharedScene( EKindCore );
  VResources Resources{ pHost };
};

TEST_F( ResourcesTest, OverridesWinFromTheNextReloadOnAndFallBackWhenRemoved )
{
  const auto pProgram = Resources.GetProgram( "FullScreen", "UniformColour" );
  EXPECT_EQ( Resources.GetProgram( "FullScreen", "UniformColour" ), pProgram ) << "a pair is built once";
  EXPECT_EQ( Resources.GetProgram( "FullScreen", "Copy" )->Vertex(), pProgram->Vertex() ) << "a shader, too";
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
  EXPECT_EQ( Failures[0].find( "Shader Failed To Compile<" + File.string() + "> Log=<" ), 0u ) << Failures[0];
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
  ASSERT_TRUE( Context.Fill( Context.Quad, Pair.Selection(), {} ) );
  EXPECT_EQ( Context.Pixels()[100], 0x01123456u );
}

TEST_F( ResourcesTest, OnlyContextsOfOneGroupShareProgramsAndBuffers )
{
  const auto pProgram = Resources.GetProgram( "FullScreen", "UniformColour" );
  EXPECT_EQ( Drawn( Context, pProgram ), Red );
  {
    VTestContext Other( EKindCore, &Context.Context );
    EXPECT_TRUE( Resources.Prepare() );
    EXPECT_EQ( Drawn( Other, pProgram ), Red );
    VTestContext Stranger( EKindCore );
    TestSupport::ExpectFailureLine(
        "The OpenGL context of a view shares no objects with the first one of its scene; nothing is drawn" );
    EXPECT_FALSE( Resources.Prepare() );
  }
  Context.MakeCurrent();
  EXPECT_TRUE( Resources.Prepare() );
  EXPECT_EQ( Drawn( Context, pProgram ), Red );
  Context.Context.doneCurrent();
  EXPECT_FALSE( Resources.Prepare() ) << "no context at all";
}

TEST( Resources, AGroupAfterTheFirstOneDiedGetsEverythingAgain )
{
  SharedScene( EKindCore ).Context.doneCurrent();
  VResources Resources;
  const auto pProgram = Resources.GetProgram( "FullScreen", "UniformColour" );
  VMesh Quad = MakeQuad();
  VDynamicBuffer Dynamic;
  const std::array< float, 3 > Point = { 0, 0, 0 };
  for ( int Group = 0; Group < 2; ++Group )
  {
    VTestContext Context( EKindCore );
    EXPECT_FALSE( Dynamic.Bind() ) << "the contents went with the group";
    EXPECT_TRUE( Group == 1 || !Context.pRender->UseProgram( pProgram ) ) << "asked for too early, completed later";
    EXPECT_TRUE( Group == 0 ? Resources.Prepare() : Resources.Update() );
    Context.Begin();
    EXPECT_TRUE( Context.Fill( Quad, pProgram, { 1, 1, 1, 1 } ) );
    EXPECT_EQ( Context.Covered(), VTestContext::Side * VTestContext::Side );
    EXPECT_TRUE( Dynamic.Write( std::span( Point ) ) && Dynamic.Bind() );
  }
}

TEST( Resources, WordsOnAContextBelowTheMinimum )
{
  EXPECT_EQ( VResources::VersionText( false, 3, 3 ), "OpenGL context version 3.3 is unsupported" );
  EXPECT_EQ( VResources::VersionText( false, 4, 2 ), "OpenGL context version 4.2 is unsupported" );
  EXPECT_EQ( VResources::VersionText( true, 2, 0 ), "OpenGL ES context version 2.0 is unsupported" );
  EXPECT_EQ( VResources::VersionText( false, 4, 3 ) + VResources::VersionText( false, 5, 0 ), "" );
  EXPECT_EQ( VResources::VersionText( true, 3, 0 ), "" );
}

TEST( OldContext, TellsOnceAndDrawsWhatItCan )
{
  if ( !IsOldContext() )
  {
    GTEST_SKIP() << "run by CoreGraphicsOldContextTests";
  }
  VTestScene Context( EKindCompatibility );
  ASSERT_EQ( Context.Context.format().version(), std::pair( 3, 3 ) );
  ASSERT_TRUE( Context.Resources.Prepare() );
  const std::string Words = "OpenGL context version 3.3 is unsupported";
  EXPECT_EQ( Context.Resources.VersionNotice(), Words );
  const std::vector< std::string > Warnings = LogTexts( "CoreGraphics", ZEK::ELogWarning );
  EXPECT_EQ( std::count( Warnings.begin(), Warnings.end(), Words ), 1 );
  EXPECT_EQ( Warnings.size(), 2u ) << "and one line on the missing extension";
  Context.Begin();
  EXPECT_TRUE(
      Context.Fill( Context.Quad, Context.Resources.GetProgram( "FullScreen", "UniformColour" ), { 1, 1, 1, 1 } ) );
  EXPECT_EQ( Context.Covered(), VTestContext::Side * VTestContext::Side );
}
