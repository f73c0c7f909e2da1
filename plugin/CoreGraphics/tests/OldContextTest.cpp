#include "TestContext.h"

#include <TestSupport/LogGuard.h>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

// Needs a driver that is told to offer OpenGL 3.3 without the ES 3 language.
TEST( OldContext, TellsOnceAndDrawsWhatItCan )
{
  if ( qEnvironmentVariable( "HARROW_TEST_OLD_CONTEXT" ) != "1" )
  {
    GTEST_SKIP() << "run by CoreGraphicsOldContextTests";
  }
  VTestContext Context( EKindCompatibility );
  ASSERT_EQ( Context.Context.format().version(), std::pair( 3, 3 ) );
  VResources Resources;
  ASSERT_TRUE( Resources.Prepare() );
  ASSERT_TRUE( Resources.Prepare() );
  const std::string Words = "OpenGL context version 3.3 is unsupported";
  EXPECT_EQ( Resources.VersionNotice(), Words );
  EXPECT_EQ( Resources.Dialect(), EDialectDesktop330 );
  const std::vector< std::string > Warnings = TestSupport::LogTexts( "CoreGraphics", ZEK::ELogWarning );
  EXPECT_EQ( std::count( Warnings.begin(), Warnings.end(), Words ), 1 );
  EXPECT_EQ( Warnings.size(), 2u ) << "and one line on the missing extension";

  VInstancedProgramPair Pair;
  Pair.Load( Resources, "Sphere", "SimpleLighting" );
  constexpr VVertexLayout Layout( 16, 1, { { EAttributeReconPosAndSize, 4, GL_FLOAT, false, 0 } } );
  const std::array< float, 4 > Sphere = { 0, 0, 0, 0.9f };
  VMesh Mesh = MakeSphereMesh( 2 );
  VDynamicBuffer Buffer;
  Context.Begin();
  ASSERT_TRUE( Buffer.Write( std::span( Sphere ) ) );
  ASSERT_TRUE( Pair.Use( *Context.pRender, 1 ) );
  const std::array< VVertexStream, 2 > Streams = { Mesh.Stream(), VVertexStream{ &Buffer, &Layout, 0 } };
  ASSERT_TRUE( Context.pRender->SetVertexStreams( Streams ) );
  Context.pRender->SetConstantAttribute( EAttributeModelColour, { 1, 1, 1, 1 } );
  Context.pRender->DrawElementsInstanced( GL_TRIANGLES, Mesh, 1 );
  EXPECT_GT( Context.Covered(), 2000 );
}
