#include "TestContext.h"

#include <CoreGraphics/SelectionColour.h>

#include <TestSupport/LogGuard.h>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
constexpr GLenum PointSprite = 0x8861;
constexpr GLenum ProgramPointSize = 0x8642;
constexpr std::array< GLenum, 5 > Capabilities = { GL_CULL_FACE, GL_BLEND, GL_DEPTH_TEST, GL_SCISSOR_TEST, GL_DITHER };
} // namespace

class RenderContextTest : public DrawingTest
{
public:
  bool FillWith( const QVector4D& i_rColour )
  {
    return Context.Fill( Context.Quad, rResources.GetProgram( "FullScreen", "UniformColour" ), i_rColour );
  }

  int Integer( GLenum i_Name )
  {
    GLint Value = -1;
    pGl->glGetIntegerv( i_Name, &Value );
    return Value;
  }
};
INSTANTIATE_TEST_SUITE_P( Contexts, RenderContextTest, AllKinds, KindName );

// In a core context a draw without a bound vertex array object leaves the target empty and says nothing.
TEST_P( RenderContextTest, ResetStateMendsWhatOthersLeft )
{
  VMesh Quad = MakeQuad();
  Context.Begin();
  EXPECT_FALSE( rRender.SetVertexBuffer( Quad.Stream() ) ) << "no program";
  EXPECT_NE( Integer( GL_VERTEX_ARRAY_BINDING ), 0 );
  for ( const std::uint64_t Bytes : { 60u, 0u } )
  {
    rRender.ResetCounters();
    ASSERT_TRUE( Context.Fill( Quad, rResources.GetProgram( "FullScreen", "UniformColour" ), { 1, 0, 0, 1 } ) );
    EXPECT_EQ( Context.Covered(), VTestContext::Side * VTestContext::Side );
    EXPECT_EQ( rRender.DrawCalls(), 1u );
    EXPECT_EQ( rRender.BytesUploaded(), Bytes );
  }
  VStaticBuffer Empty;
  EXPECT_FALSE( rRender.SetVertexBuffer( { &Empty, &PositionLayout(), 0 } ) );
  EXPECT_FALSE( rRender.SetVertexBuffer( {} ) );
  VMesh Bad( PositionLayout(), std::vector< QVector3D >( 3 ), { 0, 1, 3 } );
  rRender.DrawElements( GL_TRIANGLES, Bad );
  EXPECT_EQ( rRender.DrawCalls(), 1u );
  EXPECT_GE( rRender.MaximumPointSize(), 1.0f );
  rRender.ReleaseVertexArray();
  EXPECT_EQ( Integer( GL_VERTEX_ARRAY_BINDING ), 0 );

  for ( const GLenum Capability : Capabilities )
  {
    pGl->glEnable( Capability );
  }
  pGl->glCullFace( GL_FRONT );
  pGl->glDepthMask( GL_FALSE );
  pGl->glColorMask( GL_FALSE, GL_TRUE, GL_TRUE, GL_TRUE );
  pGl->glPixelStorei( GL_PACK_ALIGNMENT, 1 );
  pGl->glActiveTexture( GL_TEXTURE3 );
  pGl->glUseProgram( 0 );
  rRender.ResetState();
  for ( const GLenum Capability : Capabilities )
  {
    EXPECT_FALSE( pGl->glIsEnabled( Capability ) ) << Capability;
  }
  EXPECT_EQ( Integer( GL_CULL_FACE_MODE ), GL_BACK );
  EXPECT_EQ( Integer( GL_PACK_ALIGNMENT ), 4 );
  EXPECT_EQ( Integer( GL_ACTIVE_TEXTURE ), GL_TEXTURE0 );
  EXPECT_EQ( Integer( GL_DEPTH_WRITEMASK ), 1 );
  EXPECT_EQ( rRender.Program(), nullptr );
  EXPECT_TRUE( GetParam() == EKindES || pGl->glIsEnabled( ProgramPointSize ) );
  EXPECT_TRUE( GetParam() != EKindCompatibility || pGl->glIsEnabled( PointSprite ) );
  // What was known of the state before is not believed any more.
  Context.Begin();
  ASSERT_TRUE( FillWith( { 0, 0, 1, 1 } ) );
  EXPECT_EQ( Context.Pixels()[0], 0xFFFF0000u );
}

TEST_P( RenderContextTest, EachRecordBecomesItsState )
{
  Context.Begin();
  using VFactors = std::array< int, 4 >;
  const std::tuple< int, int, VFactors > Blends[] = {
      { 1, 0, { GL_SRC_ALPHA, GL_ONE_MINUS_SRC_ALPHA, GL_ZERO, GL_ONE } },
      { 2, 1, { GL_SRC_ALPHA, GL_ONE, GL_ONE, GL_ONE } },
      { 3, 2, { GL_CONSTANT_ALPHA, GL_ONE, GL_ONE, GL_ZERO } },
      { 4, 0, { GL_ONE, GL_ONE_MINUS_SRC_ALPHA, GL_ZERO, GL_ONE } },
      { 0, 1, { GL_ONE, GL_ZERO, GL_ONE, GL_ONE } } };
  for ( const auto& [Colour, Alpha, rFactors] : Blends )
  {
    VRenderState State;
    State.colourBlend = Colour;
    State.alphaBlend = Alpha;
    State.blendConstant = 0.25f;
    rRender.SetRenderState( State );
    EXPECT_TRUE( pGl->glIsEnabled( GL_BLEND ) );
    EXPECT_EQ( ( VFactors{ Integer( GL_BLEND_SRC_RGB ), Integer( GL_BLEND_DST_RGB ), Integer( GL_BLEND_SRC_ALPHA ),
                           Integer( GL_BLEND_DST_ALPHA ) } ),
               rFactors );
  }
  std::array< GLfloat, 4 > Constant{};
  pGl->glGetFloatv( GL_BLEND_COLOR, Constant.data() );
  EXPECT_EQ( Constant, ( std::array< GLfloat, 4 >{ 0.25f, 0.25f, 0.25f, 0.25f } ) );

  const std::array< GLint, 6 > Depths = { GL_LESS, GL_LEQUAL, GL_GREATER, GL_GEQUAL, GL_NOTEQUAL, GL_EQUAL };
  for ( int Function = 0; Function < 6; ++Function )
  {
    VRenderState State;
    State.depthFunction = Function;
    State.cullMode = Function % 3;
    State.depthTest = Function % 2 == 0;
    State.depthWrite = Function > 2;
    State.colourWrite = Function < 3;
    rRender.SetRenderState( State );
    EXPECT_FALSE( pGl->glIsEnabled( GL_BLEND ) );
    EXPECT_EQ( Integer( GL_DEPTH_FUNC ), Depths[std::size_t( Function )] );
    EXPECT_EQ( pGl->glIsEnabled( GL_CULL_FACE ) != 0, State.cullMode != 0 );
    EXPECT_TRUE( State.cullMode == 0 || Integer( GL_CULL_FACE_MODE ) == ( State.cullMode == 1 ? GL_FRONT : GL_BACK ) );
    EXPECT_EQ( pGl->glIsEnabled( GL_DEPTH_TEST ) != 0, State.depthTest );
    EXPECT_EQ( Integer( GL_DEPTH_WRITEMASK ) != 0, State.depthWrite );
    std::array< GLboolean, 4 > Mask{};
    pGl->glGetBooleanv( GL_COLOR_WRITEMASK, Mask.data() );
    EXPECT_EQ( Mask[3] != 0, State.colourWrite );
  }
  rRender.Clear( true, true );
  EXPECT_EQ( Integer( GL_DEPTH_WRITEMASK ), 1 );
  EXPECT_EQ( Context.Covered(), 0 );
}

TEST_P( RenderContextTest, IdsAreWrittenUnblendedAndReadBackExactly )
{
  VProgramPair Pair;
  Pair.Load( rResources, "FullScreen", "UniformColour" );
  VRenderState Blended;
  Blended.colourBlend = EColourBlendAlpha;
  Blended.colourWrite = false;
  Blended.depthTest = false;
  Context.Begin();
  rRender.SetRenderState( Blended ); // known from the visible mode, must not be taken for set in the next
  const auto Word = []( std::uint32_t i_Level )
  {
    return i_Level | ( 255 - i_Level ) << 8 | ( ( i_Level * 7 ) & 255 ) << 16;
  };
  for ( const int Mode : { ERenderModeSelection, ERenderModeHighlight } )
  {
    Context.Begin( Mode );
    ASSERT_TRUE( Pair.Use( rRender ) );
    rRender.SetRenderState( Blended );
    ASSERT_TRUE( rRender.SetVertexBuffer( Context.Quad.Stream() ) );
    // A pixel for each value of a byte, so that each channel takes every level.
    for ( std::uint32_t Level = 0; Level < 256; ++Level )
    {
      rRender.SetScissor( QRect( int( Level % 64 ), int( Level / 64 ), 1, 1 ) );
      Pair.SetSelectionColour( Word( Level ) );
      rRender.DrawElements( GL_TRIANGLES, Context.Quad );
    }
    const std::vector< std::uint32_t > Pixels = Context.Pixels();
    for ( std::uint32_t Level = 0; Level < 256; ++Level )
    {
      EXPECT_EQ( Pixels[Level], 0x01000000 | Word( Level ) );
      EXPECT_EQ( SelectionWord( Pixels[Level] ), Word( Level ) );
    }
  }
}

TEST_P( RenderContextTest, ViewportsScissorsAndFramebuffersLandWhereTheyAreSaid )
{
  Context.Begin();
  rRender.SetScissor( QRect( 3, 60, 2, 1 ) ); // near the top left corner
  ASSERT_TRUE( FillWith( { 0, 0, 1, 1 } ) );
  const std::vector< std::uint32_t > Pixels = Context.Pixels();
  EXPECT_EQ( Pixels[60 * 64 + 3], 0xFFFF0000u );
  EXPECT_EQ( Pixels[60 * 64 + 4], 0xFFFF0000u );
  EXPECT_EQ( Context.Covered(), 2 );

  QOpenGLFramebufferObject Other( 8, 8 );
  rRender.BindFramebuffer( &Other );
  EXPECT_EQ( rRender.Framebuffer(), &Other );
  EXPECT_TRUE( rRender.IsFramebufferComplete() );
  rRender.SetDefaultFramebuffer( Context.pTarget->handle() );
  rRender.BindDefaultFramebuffer();
  EXPECT_EQ( rRender.Framebuffer(), nullptr );
  EXPECT_EQ( Integer( GL_FRAMEBUFFER_BINDING ), int( Context.pTarget->handle() ) );

  const auto Sampling = [&]( int i_Name )
  {
    GLint Set = 0;
    pGl->glGetTexParameteriv( GL_TEXTURE_2D, GLenum( i_Name ), &Set );
    return Set;
  };
  for ( const int Mode : { 0, 1, 2 } )
  {
    rRender.SetRenderMode( Mode );
    rRender.BindFramebufferTexture( 7, &Other );
    EXPECT_EQ( Sampling( GL_TEXTURE_MAG_FILTER ), Mode == 0 ? GL_LINEAR : GL_NEAREST );
  }
  rRender.SetTextureSampling( { EMinLinearMipmapNearest, false, true, false } );
  EXPECT_EQ( Sampling( GL_TEXTURE_MIN_FILTER ), GL_LINEAR_MIPMAP_NEAREST );
  EXPECT_EQ( Sampling( GL_TEXTURE_MAG_FILTER ), GL_NEAREST );
  EXPECT_EQ( Sampling( GL_TEXTURE_WRAP_S ), GL_CLAMP_TO_EDGE );
  EXPECT_EQ( Sampling( GL_TEXTURE_WRAP_T ), GL_REPEAT );
  rRender.BindFramebufferTexture( 7, nullptr );
  EXPECT_EQ( Integer( GL_TEXTURE_BINDING_2D ), 0 );
}

TEST( RenderContext, ADebugLoggerExistsOnlyWhereOneWasAskedFor )
{
  VTestContext Plain( EKindCore );
  EXPECT_FALSE( Plain.pRender->HasDebugLogger() );
  EXPECT_TRUE( TestSupport::LogTexts( "CoreGraphics", ZEK::ELogWarning ).empty() );
  VTestContext Debug( EKindCore, nullptr, true );
  EXPECT_TRUE( Debug.pRender->HasDebugLogger() );
  const std::vector< std::string > Lines = TestSupport::LogTexts( "CoreGraphics", ZEK::ELogDetail );
  EXPECT_EQ( std::count( Lines.begin(), Lines.end(), "Debug OpenGL context requested" ), 1 );
  EXPECT_EQ( std::count( Lines.begin(), Lines.end(), "Initialising debug logger" ), 1 );
  // A misuse reaches the log with the driver's words.
  Debug.pRender->Functions()->glEnable( 0xFFFF );
  Debug.pRender->CheckErrors();
  const std::vector< std::string > Failures = TestSupport::LogTexts( "CoreGraphics", ZEK::ELogFailure );
  ASSERT_FALSE( Failures.empty() );
  EXPECT_NE( Failures[0].find( "glEnable" ), std::string::npos ) << Failures[0];
  for ( const std::string& rLine : Failures )
  {
    TestSupport::ExpectFailureLine( rLine );
  }
}

TEST( RenderContext, WithoutAnyContextItStaysUninitialised )
{
  if ( QOpenGLContext* pCurrent = QOpenGLContext::currentContext() )
  {
    pCurrent->doneCurrent();
  }
  VRenderContext Render;
  Render.Initialise();
  EXPECT_FALSE( Render.IsInitialised() );
  Render.ResetState();
  Render.SetRenderState( VRenderState{} );
  Render.SetViewport( QRect( 0, 0, 4, 4 ) );
  EXPECT_FALSE( Render.UseProgram( nullptr ) );
  Render.ReleaseVertexArray();
}
