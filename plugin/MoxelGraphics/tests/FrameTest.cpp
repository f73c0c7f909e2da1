#include "FrameFixture.h"

#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>

#include <fstream>

namespace MoxelGraphics
{
namespace
{
class VTestOverrides final : public HarrowPluginInterface::IRenderResources
{
public:
  std::vector< std::filesystem::path > OverrideFolders() const override { return { m_Folder.Path() }; }
  std::uint64_t Generation() const override { return 1; }
  void Reload() override {}
  ZEK::IMultiCallback< void() >& ReloadRequested() override { return m_Requested; }
  void Write( const std::string& i_rName, const std::string& i_rText )
  {
    std::filesystem::create_directories( m_Folder.Path() / "VertexShaders" );
    std::ofstream( m_Folder.Path() / "VertexShaders" / i_rName ) << i_rText;
  }

private:
  TestSupport::VTemporaryDir m_Folder;
  ZEK::VMultiCallback< void() > m_Requested;
};
} // namespace

TEST_F( VFrameTest, DrawsAndUploadsGrowWithChangeAlone )
{
  const auto Points = []( int i_Count )
  {
    std::vector< VScenePoint > List;
    for ( int Index = 0; Index < i_Count; ++Index )
    {
      List.push_back( { static_cast< float >( Index % 50 * 40 ), static_cast< float >( Index / 50 * 40 ), 500, 7 } );
    }
    return List;
  };
  pScene->Change( Points( 1000 ) );
  Draw();
  Draw();
  const std::uint64_t Calls = pFrame->Figures().DrawCalls;
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 0u );
  pScene->Change( Points( 10000 ) );
  Draw();
  EXPECT_EQ( pFrame->Figures().DrawCalls, Calls );
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 10000u * 16u );
  // A new state with the same points: ids are new, no buffer is.
  pScene->MarkDirty();
  Draw();
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 0u );
  // One selected point brings the mask and the two draws of its outline, and its flags once.
  pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, { Recon( 77 ) } );
  Draw();
  EXPECT_EQ( pFrame->Figures().DrawCalls, Calls + 3 );
  EXPECT_GE( pFrame->Figures().BytesUploaded, 10000u );
  Draw();
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 0u );
}

TEST_F( VFrameTest, TheMaskHoldsTheWordsOfWhatIsMarkedAndNothingElse )
{
  pScene->Change( { { 0, 0, 0, 7 }, { 1500, 0, 0, 7 }, { -1500, 0, 0, 7 } } );
  pFrame->Input().Options.ReconstructionScale = 10.0f;
  // A post type would read the mask from its unit while the visible frame is drawn.
  class VReader final : public IRenderType
  {
  public:
    void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions&, std::uint32_t ) override
    {
      if ( io_rContext.RenderMode() == ERenderModeNormal )
      {
        auto& rGl = *io_rContext.Functions();
        GLint Texture = 0;
        rGl.glActiveTexture( GL_TEXTURE7 );
        rGl.glGetIntegerv( GL_TEXTURE_BINDING_2D, &Texture );
        rGl.glActiveTexture( GL_TEXTURE0 );
        GLuint Target = 0;
        rGl.glGenFramebuffers( 1, &Target );
        rGl.glBindFramebuffer( GL_READ_FRAMEBUFFER, Target );
        rGl.glFramebufferTexture2D( GL_READ_FRAMEBUFFER, GL_COLOR_ATTACHMENT0, GL_TEXTURE_2D,
                                    static_cast< GLuint >( Texture ), 0 );
        Mask.assign( static_cast< std::size_t >( Size.width() * Size.height() ), 1 );
        rGl.glReadPixels( 0, 0, Size.width(), Size.height(), GL_RGBA, GL_UNSIGNED_BYTE, Mask.data() );
        rGl.glBindFramebuffer( GL_READ_FRAMEBUFFER, io_rContext.DefaultFramebuffer() );
        rGl.glDeleteFramebuffers( 1, &Target );
      }
    }
    std::vector< std::uint32_t > Mask;
  };
  class VMaskScene final : public VTestScene
  {
  public:
    explicit VMaskScene( std::shared_ptr< IRenderType > i_pPost ) { m_PostList.push_back( std::move( i_pPost ) ); }
  };
  const auto pReader = std::make_shared< VReader >();
  const auto pMaskScene = std::make_shared< VMaskScene >( pReader );
  VSceneFrame Frame( pMaskScene, std::make_shared< CoreGraphics::VCameraController >() );
  Frame.Input().Options.ReconstructionScale = 10.0f;
  const std::vector< VScenePoint > Points = { { 0, 0, 0, 7 }, { 1500, 0, 0, 7 }, { -1500, 0, 0, 7 } };
  pMaskScene->Change( Points );
  const auto At = [&]( std::size_t i_Index )
  {
    const QPoint Place = ScreenPoint( Points[i_Index], Size ).toPoint();
    return pReader->Mask[static_cast< std::size_t >( ( Size.height() - 1 - Place.y() ) * Size.width() + Place.x() )] &
           EIdPixelMask;
  };
  const auto Dark = [&]
  {
    return std::all_of( pReader->Mask.begin(), pReader->Mask.end(),
                        []( std::uint32_t i_Pixel )
                        {
                          return i_Pixel == 0;
                        } );
  };
  // The pick of the same frame leaves nothing behind in it.
  Frame.Input().PickMode = EPickHover;
  Frame.Input().Pointer = { 320, 180 };
  Offscreen.Draw( Frame, Size );
  EXPECT_EQ( Frame.Result().Ids.size(), 1u );
  EXPECT_TRUE( Dark() );
  pMaskScene->pSelection->Set( ZEK::ISelectionService::EPrimary, { Recon( 1 ) } );
  pMaskScene->pSelection->Set( ZEK::ISelectionService::ESecondary, { Recon( 2 ) } );
  Offscreen.Draw( Frame, Size );
  EXPECT_EQ( At( 0 ), 0u );
  EXPECT_EQ( At( 1 ), 2u | EIdSelected | EIdPrimary );
  EXPECT_EQ( At( 2 ), 3u | EIdPreselected );
  pMaskScene->pSelection->Set( ZEK::ISelectionService::EPrimary, {} );
  pMaskScene->pSelection->Set( ZEK::ISelectionService::ESecondary, {} );
  Offscreen.Draw( Frame, Size );
  EXPECT_TRUE( Dark() );
}

TEST_F( VFrameTest, TheFloorIsThinnerFromBelow )
{
  auto& rInput = pFrame->Input();
  rInput.Options.GlobalAxis = false;
  // On a square of the finest grid, away from its lines.
  const QPoint Place = ScreenPoint( { 120, 120, 0, 0 }, Size ).toPoint();
  const auto Alpha = [&]( QPoint i_Place )
  {
    rInput.Options.BackgroundColorRGB = 0;
    const int Dark = qGreen( Draw().pixel( i_Place ) );
    rInput.Options.BackgroundColorRGB = 0xFFFFFF;
    return 1.0 - ( qGreen( Draw().pixel( i_Place ) ) - Dark ) / 255.0;
  };
  EXPECT_NEAR( Alpha( Place ), 0.75, 0.02 );
  pFrame->Controller().SetViewType( CoreGraphics::EViewBottom );
  EXPECT_NEAR( Alpha( { 320 + 33, 180 + 33 } ), 0.25, 0.02 );
  pFrame->Controller().SetViewType( CoreGraphics::EViewTop );
  EXPECT_NEAR( Alpha( { 320 + 33, 180 + 33 } ), 0.75, 0.02 );
  rInput.Options.FloorGridIsTranslucent = false;
  EXPECT_NEAR( Alpha( { 320 + 33, 180 + 33 } ), 1.0, 0.02 );
  rInput.Options.FloorGrid = false;
  EXPECT_NEAR( Alpha( { 320 + 33, 180 + 33 } ), 0.0, 0.02 );
}

TEST_F( VFrameTest, TheGizmoKeepsToItsCorner )
{
  EXPECT_EQ( VRenderAxis::Square( { 0, 0, 200, 200 } ), QRect( 0, 0, 50, 50 ) );
  EXPECT_EQ( VRenderAxis::Square( { 7, 9, 1000, 2000 } ), QRect( 7, 9, 100, 100 ) );
  auto& rOptions = pFrame->Input().Options;
  rOptions.FloorGrid = false;
  const auto Painted = [&]
  {
    const QImage Image = Draw();
    QRect Area;
    for ( int Y = 0; Y < Image.height(); ++Y )
    {
      for ( int X = 0; X < Image.width(); ++X )
      {
        const bool bEmpty = ( Image.pixel( X, Y ) | 0xFF000000 ) == Image.pixel( 300, 100 );
        Area |= bEmpty ? QRect() : QRect( X, Y, 1, 1 );
      }
    }
    return Area;
  };
  const QRect Area = Painted();
  EXPECT_TRUE( QRect( 0, Size.height() - 90, 90, 90 ).contains( Area ) );
  EXPECT_GT( Area.width(), 30 );
  rOptions.OverlayCamera = "cam:1";
  EXPECT_TRUE( Painted().isEmpty() );
  rOptions.OverlayCamera.clear();
  rOptions.GlobalAxis = false;
  EXPECT_TRUE( Painted().isEmpty() );
}

TEST_F( VFrameTest, WithoutTheWorldTheOverlayIsStillDrawn )
{
  pScene->Change( { { 0, 0, 0, 7 } } );
  auto& rOptions = pFrame->Input().Options;
  rOptions.ReconstructionScale = 20.0f;
  rOptions.FloorGrid = false;
  rOptions.Show3DOverlay = false;
  pScene->pCorner->bShown = true;
  const QImage Image = Draw();
  EXPECT_EQ( Image.pixel( 320, 180 ), Background );
  EXPECT_EQ( Image.pixel( 3, Size.height() - 4 ) | 0xFF000000, QColor( Qt::red ).rgb() );
  EXPECT_EQ( Image.pixel( 3, 3 ), Background );
}

TEST_F( VFrameTest, AHiddenOrEmptyViewDrawsNothing )
{
  pFrame->Input().bVisible = false;
  pFrame->Input().PickMode = EPickHover;
  Draw();
  EXPECT_FALSE( Offscreen.bDrawn );
  EXPECT_EQ( pFrame->Result().Mode, -1 );
  EXPECT_EQ( pFrame->Figures().Frames, 0u );
  EXPECT_TRUE( pScene->IsPending() );
  pFrame->Input().bVisible = true;
  Draw();
  EXPECT_TRUE( Offscreen.bDrawn );
  EXPECT_FALSE( pScene->IsPending() );
  auto pTarget = VSceneFrame::MakeTarget( { 1, 1 }, true );
  pFrame->Resize( {} );
  EXPECT_FALSE( pFrame->Render( *pTarget ) );
}

TEST_F( VFrameTest, FocusAndTrackingMoveTheCamera )
{
  pScene->Change( { { 1000, 200, 300, 7 }, { 0, 0, 0, 7 } } );
  pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, { Recon( 0 ) } );
  Draw();
  auto& rInput = pFrame->Input();
  rInput.TrackedSelection = { Recon( 0 ) };
  rInput.bFit = true;
  Draw();
  EXPECT_EQ( pFrame->Controller().Fields().centre, QVector3D( 1000, 200, 300 ) );
  const float Fitted = pFrame->Controller().Fields().distance;
  EXPECT_LT( Fitted, 1000.0f );
  rInput.Tracking = ETrackSelection;
  pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, { Recon( 1 ) } );
  Draw();
  EXPECT_EQ( pFrame->Controller().Fields().centre, QVector3D( 0, 0, 0 ) );
  EXPECT_EQ( pFrame->Controller().Fields().distance, Fitted );
  rInput.Tracking = ETrackCurrent;
  pScene->Change( { { 1, 2, 3, 7 }, { 0, 0, 0, 7 } } );
  Draw();
  EXPECT_EQ( pFrame->Controller().Fields().centre, QVector3D( 1, 2, 3 ) );
}

TEST_F( VFrameTest, ASourceThatDoesNotCompileCostsItsTypeAlone )
{
  const auto pOverrides = std::make_shared< VTestOverrides >();
  pOverrides->Write( "Sphere.glsl", "this is no shader\n" );
  pOverrides->Write( "SpherePoint.glsl", "neither is this\n" );
  const auto pBroken = std::make_shared< VTestScene >( pOverrides );
  pBroken->Change( { { 0, 0, 0, 7 } } );
  VSceneFrame Frame( pBroken, std::make_shared< CoreGraphics::VCameraController >() );
  Frame.Input().Options.ReconstructionScale = 20.0f;
  VOffscreen Other;
  Other.Draw( Frame, Size );
  const auto First = TestSupport::LogTexts( "CoreGraphics", ZEK::ELogFailure );
  for ( const std::string& rText : First )
  {
    EXPECT_TRUE( rText.starts_with( "Shader Failed To Compile<" ) ) << rText;
    TestSupport::ExpectFailureLine( rText );
  }
  EXPECT_FALSE( First.empty() );
  const QImage Image = Other.Draw( Frame, Size );
  EXPECT_TRUE( Other.bDrawn );
  // Floor, but no sphere; and no further line.
  const QRgb Floor = Image.pixel( ScreenPoint( { 120, 120, 0, 0 }, Size ).toPoint() );
  EXPECT_GT( Distance( Floor, Background ), 4 );
  EXPECT_LT( qRed( Image.pixel( 320, 180 ) ) - qGreen( Image.pixel( 320, 180 ) ), 10 );
  EXPECT_EQ( TestSupport::LogTexts( "CoreGraphics", ZEK::ELogFailure ).size(), First.size() );
}

TEST_F( VFrameTest, AContextThatSharesNothingShowsANotice )
{
  Draw();
  EXPECT_TRUE( pFrame->Notice().isEmpty() );
  VOffscreen Stranger( false );
  VSceneFrame Frame( pScene, std::make_shared< CoreGraphics::VCameraController >() );
  Stranger.Draw( Frame, Size );
  for ( const std::string& rText : TestSupport::LogTexts( "CoreGraphics", ZEK::ELogFailure ) )
  {
    TestSupport::ExpectFailureLine( rText );
  }
  EXPECT_FALSE( Stranger.bDrawn );
  EXPECT_FALSE( Frame.Notice().isEmpty() );
  const QImage Image = Stranger.Draw( Frame, Size );
  EXPECT_EQ( Image.pixel( 320, 180 ) & 0xFFFFFF, 0u );
  EXPECT_EQ( TestSupport::LogTexts( "CoreGraphics", ZEK::ELogFailure ).size(), 1u );
  // The scene's own views go on.
  Offscreen.MakeCurrent();
  Draw();
  EXPECT_TRUE( Offscreen.bDrawn );
  EXPECT_EQ( pScene->Initialised, 2 );
}

TEST_F( VFrameTest, TwoViewsDrawOneScene )
{
  pScene->Change( { { 0, 0, 0, 7 } } );
  pFrame->Input().Options.ReconstructionScale = 20.0f;
  Draw();
  const auto pRecons = pScene->pRecons;
  VOffscreen Other;
  {
    VSceneFrame Frame( pScene, std::make_shared< CoreGraphics::VCameraController >() );
    Frame.Input().Options.ReconstructionScale = 20.0f;
    const QImage Image = Other.Draw( Frame, { 320, 180 } );
    EXPECT_GT( qRed( Image.pixel( 160, 90 ) ), qGreen( Image.pixel( 160, 90 ) ) + 40 );
  }
  EXPECT_EQ( pScene->pRecons, pRecons );
  Offscreen.MakeCurrent();
  const QImage Image = Draw();
  EXPECT_GT( qRed( Image.pixel( 320, 180 ) ), qGreen( Image.pixel( 320, 180 ) ) + 40 );
}

TEST( Frame, DrawsAndPicksInEveryKindOfContext )
{
  InitShaders();
  QSurfaceFormat Core = QSurfaceFormat::defaultFormat(), Compatibility, Embedded;
  Compatibility.setDepthBufferSize( 24 );
  Embedded.setRenderableType( QSurfaceFormat::OpenGLES );
  Embedded.setVersion( 3, 0 );
  for ( const QSurfaceFormat& rFormat : { Core, Compatibility, Embedded } )
  {
    VOffscreen Context( false, rFormat );
    SCOPED_TRACE( Context.IsES()                                              ? "ES"
                  : Context.Format().profile() == QSurfaceFormat::CoreProfile ? "core"
                                                                              : "other" );
    EXPECT_EQ( Context.IsES(), rFormat.renderableType() == QSurfaceFormat::OpenGLES );
    const auto pScene = std::make_shared< VTestScene >();
    pScene->Change( { { 0, 0, 0, 7 }, { 1500, 300, 900, 7 } } );
    VSceneFrame Frame( pScene, std::make_shared< CoreGraphics::VCameraController >() );
    // A mesh each, and then a point each.
    for ( const double Scale : { 20.0, 1.0 } )
    {
      Frame.Input().Options.ReconstructionScale = static_cast< float >( Scale );
      Frame.Input().PickMode = EPickHover;
      const QPointF Place = ScreenPoint( { 1500, 300, 900, 7 }, Size );
      Frame.Input().Pointer = QPoint( static_cast< int >( Place.x() ), static_cast< int >( Place.y() ) );
      const QImage Image = Context.Draw( Frame, Size );
      EXPECT_TRUE( Context.bDrawn );
      EXPECT_EQ( Frame.Result().Ids, std::vector< std::uint32_t >{ 2 } );
      const QRgb Seen = Image.pixel( Frame.Input().Pointer );
      EXPECT_GT( qRed( Seen ), qGreen( Seen ) + 40 );
      EXPECT_GT( Distance( Image.pixel( ScreenPoint( { 120, 120, 0, 0 }, Size ).toPoint() ), Background ), 4 );
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

TEST_F( VFrameTest, CameraDefinitionsChangeOnlyWhenTheyDiffer )
{
  VCameraDefinition A, B;
  A.DeviceURN = "a";
  B.DeviceURN = "b";
  pScene->SetCameraDefinitions( { B, A } );
  EXPECT_EQ( pScene->CameraDefinitions().front().DeviceURN, "a" );
  const std::uint64_t Generation = pScene->CameraGeneration();
  pScene->SetCameraDefinitions( { A, B } );
  EXPECT_EQ( pScene->CameraGeneration(), Generation );
  pScene->SetCameraDefinitions( { A } );
  EXPECT_GT( pScene->CameraGeneration(), Generation );
}

} // namespace MoxelGraphics
