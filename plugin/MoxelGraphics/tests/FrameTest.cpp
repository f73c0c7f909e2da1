#include "FrameFixture.h"

#include <TestSupport/LogGuard.h>

namespace MoxelGraphics
{
namespace
{
/// A place on a square of the finest grid, away from its lines.
const VScenePoint OnFloor{ 120, 120, 0, 0 };
} // namespace

TEST_F( VFrameTest, DrawsAndUploadsGrowWithChangeAlone )
{
  const auto DrawPoints = [&]( int i_Count )
  {
    std::vector< VScenePoint > List;
    for ( int Index = 0; Index < i_Count; ++Index )
    {
      List.push_back( { static_cast< float >( Index % 50 * 40 ), static_cast< float >( Index / 50 * 40 ), 500, 7 } );
    }
    pScene->Change( List );
    Draw();
  };
  const VFrameFigures& rFigures = pFrame->Figures();
  DrawPoints( 1000 );
  Draw();
  const std::uint64_t Calls = rFigures.DrawCalls;
  EXPECT_EQ( rFigures.BytesUploaded, 0u );
  DrawPoints( 10000 );
  EXPECT_EQ( rFigures.DrawCalls, Calls );
  EXPECT_EQ( rFigures.BytesUploaded, 10000u * 16u );
  pScene->MarkDirty();
  Draw();
  EXPECT_EQ( rFigures.BytesUploaded, 0u ) << "a new state with the same points: ids are new, no buffer is";
  pScene->Select( { Recon( 77 ) } );
  Draw();
  EXPECT_EQ( rFigures.DrawCalls, Calls + 3 ) << "the mask and the two draws of its outline";
  EXPECT_GE( rFigures.BytesUploaded, 10000u );
  Draw();
  EXPECT_EQ( rFigures.BytesUploaded, 0u );
}

TEST_F( VFrameTest, FloorGizmoAndWorldGoWithTheirOptions )
{
  Options().GlobalAxis = false;
  const QImage Thin = Draw();
  Options().FloorGridIsTranslucent = false;
  EXPECT_NE( Draw().pixel( Pixel( OnFloor ) ), Thin.pixel( Pixel( OnFloor ) ) );
  Options().FloorGrid = false;
  EXPECT_EQ( Draw().pixel( Pixel( OnFloor ) ), Background );
  EXPECT_EQ( VRenderAxis::Square( { 0, 0, 200, 200 } ), QRect( 0, 0, 50, 50 ) );
  EXPECT_EQ( VRenderAxis::Square( { 7, 9, 1000, 2000 } ), QRect( 7, 9, 100, 100 ) );
  const QImage Empty = Draw();
  Options().GlobalAxis = true;
  const QImage Gizmo = Draw();
  const int Side = 90, Below = Size.height() - Side;
  EXPECT_NE( Gizmo.copy( 0, Below, Side, Side ), Empty.copy( 0, Below, Side, Side ) );
  EXPECT_EQ( Gizmo.copy( 0, 0, Size.width(), Below ), Empty.copy( 0, 0, Size.width(), Below ) );
  EXPECT_EQ( Gizmo.copy( Side, 0, 550, Size.height() ), Empty.copy( Side, 0, 550, Size.height() ) );
  Options().OverlayCamera = "cam:1";
  EXPECT_NE( Draw().copy( 0, Below, Side, Side ), Gizmo.copy( 0, Below, Side, Side ) );

  // Without the world the overlay is still drawn.
  pScene->Change( { { 0, 0, 0, 7 } } );
  Options() = {};
  Options().ReconstructionScale = 20.0f;
  Options().Show3DOverlay = false;
  pScene->pExtra->Function = DrawCorner;
  const QImage Image = Draw();
  EXPECT_EQ( Image.pixel( 320, 180 ), Background );
  EXPECT_EQ( Image.pixel( 3, Size.height() - 4 ) | 0xFF000000, QColor( Qt::red ).rgb() );
}

TEST_F( VFrameTest, AContextThatSharesNothingShowsANotice )
{
  Draw();
  EXPECT_TRUE( pFrame->Notice().isEmpty() );
  {
    VOffscreen Stranger( false );
    VSceneFrame Frame( pScene, std::make_shared< CoreGraphics::VCameraController >() );
    Stranger.Draw( Frame, Size );
    const QImage Image = Stranger.Draw( Frame, Size );
    EXPECT_FALSE( Stranger.bDrawn );
    EXPECT_FALSE( Frame.Notice().isEmpty() );
    EXPECT_EQ( Image.pixel( 320, 180 ) & 0xFFFFFF, 0u );
  }
  const auto Lines = TestSupport::LogTexts( "CoreGraphics", ZEK::ELogFailure );
  ASSERT_EQ( Lines.size(), 1u );
  TestSupport::ExpectFailureLine( Lines.front() );
  // The scene's own views go on.
  Offscreen.MakeCurrent();
  Draw();
  EXPECT_TRUE( Offscreen.bDrawn );
  EXPECT_EQ( pScene->Initialised, 2 );
}

TEST( Frame, DrawsAndPicksInEveryKindOfContext )
{
  QSurfaceFormat Compatibility, Embedded;
  Compatibility.setDepthBufferSize( 24 );
  Embedded.setRenderableType( QSurfaceFormat::OpenGLES );
  Embedded.setVersion( 3, 0 );
  const VScenePoint Point{ 1500, 300, 900, 7 };
  for ( const QSurfaceFormat& rFormat : { QSurfaceFormat::defaultFormat(), Compatibility, Embedded } )
  {
    VOffscreen Context( false, rFormat );
    SCOPED_TRACE( testing::Message() << "ES " << Context.IsES() << ", profile " << rFormat.profile() );
    EXPECT_EQ( Context.IsES(), rFormat.renderableType() == QSurfaceFormat::OpenGLES );
    const auto pScene = std::make_shared< VTestScene >();
    pScene->Change( { { 0, 0, 0, 7 }, Point } );
    VSceneFrame Frame( pScene, std::make_shared< CoreGraphics::VCameraController >() );
    Frame.Input().PickMode = EPickHover;
    Frame.Input().Pointer = QPoint( static_cast< int >( ScreenPoint( Point ).x() ), Pixel( Point ).y() );
    // A mesh each, and then a point each.
    for ( const float Scale : { 20.0F, 1.0F } )
    {
      Frame.Input().Options.ReconstructionScale = Scale;
      const QImage Image = Context.Draw( Frame, Size );
      EXPECT_EQ( Frame.Result().Ids, VIds{ 2 } );
      EXPECT_TRUE( IsSphere( Image.pixel( Frame.Input().Pointer ) ) );
      EXPECT_GT( Distance( Image.pixel( Pixel( OnFloor ) ), Background ), 4 );
    }
    const auto pTarget = VSceneFrame::MakeTarget( Size, true );
    ASSERT_TRUE( pTarget );
    EXPECT_EQ( pTarget->format().samples() > 0, !Context.IsES() );
  }
}

TEST_F( VFrameTest, CallbacksRunUntilTheyAreDone )
{
  int Runs = 0;
  const auto pCallback = std::make_shared< VRenderCallback >();
  pCallback->Function = [&, pRaw = pCallback.get()]
  {
    pRaw->bDone = ++Runs == 2;
  };
  pScene->AddRenderCallback( pCallback );
  for ( int Frame = 0; Frame < 4; ++Frame )
  {
    pScene->MarkDirty();
    Draw();
  }
  EXPECT_EQ( Runs, 2 );
}

} // namespace MoxelGraphics
