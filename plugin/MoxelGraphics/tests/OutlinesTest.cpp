#include "FrameFixture.h"

#include <TestSupport/LogGuard.h>

namespace MoxelGraphics
{
namespace
{
/// What was added to the channels of a pixel.
struct VChange
{
  int Red, Green, Blue;
};

VChange Change( QRgb i_Before, QRgb i_After )
{
  return { qRed( i_After ) - qRed( i_Before ), qGreen( i_After ) - qGreen( i_Before ),
           qBlue( i_After ) - qBlue( i_Before ) };
}

void ExpectNear( const VChange& i_rSeen, const QVector3D& i_rWanted )
{
  EXPECT_NEAR( i_rSeen.Red, i_rWanted.x() * 255, 2.1 );
  EXPECT_NEAR( i_rSeen.Green, i_rWanted.y() * 255, 2.1 );
  EXPECT_NEAR( i_rSeen.Blue, i_rWanted.z() * 255, 2.1 );
}
} // namespace

/// One large dark sphere in the middle of the view, so that what is added to it does not saturate.
class VOutlinesTest : public VFrameTest
{
protected:
  VOutlinesTest()
  {
    pScene->Change( { { 0, 0, 0, 700 }, { 0, 0, 0, 1 } } );
    rInput.Options.ReconstructedRadius = true;
    rInput.Options.FloorGrid = false;
    rInput.Options.GlobalAxis = false;
    rInput.Options.BackgroundColorRGB = 0;
    Draw();
    const std::uint32_t Colours[] = { 0xFF000000, 0xFF000000 };
    pScene->pRecons->SetLabelled( std::vector< VScenePoint >{ { 0, 0, 0, 701 }, { 3000, 0, 0, 1 } } );
    pScene->pRecons->SetLabelledColours( Colours );
    Plain = Draw();
  }
  void Select( ZEK::VSelection i_Selection )
  {
    pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, std::move( i_Selection ) );
  }
  void Preselect( ZEK::VSelection i_Selection )
  {
    pScene->pSelection->Set( ZEK::ISelectionService::ESecondary, std::move( i_Selection ) );
  }
  /// Leftmost pixel of the middle row that differs from the plain picture.
  int Edge( const QImage& i_rImage ) const
  {
    int X = 0;
    while ( X < Middle.x() && i_rImage.pixel( X, Middle.y() ) == Plain.pixel( X, Middle.y() ) )
    {
      ++X;
    }
    return X;
  }

  VFrameInput& rInput = pFrame->Input();
  const QPoint Middle{ Size.width() / 2, Size.height() / 2 };
  QImage Plain;
};

TEST_F( VOutlinesTest, APreselectedObjectIsFilledByTheModifierAtOnce )
{
  Preselect( { Recon( 0 ) } );
  const QVector3D Colours[] = { { 0.25f, 0.125f, 0 }, { 0, 1, 0 }, { 1, 0, 0 }, { 0, 1, 1 } };
  for ( int Index = 0; Index < 4; ++Index )
  {
    SCOPED_TRACE( Index );
    rInput.PreselectColour = Index;
    const QImage Image = Draw();
    ExpectNear( Change( Plain.pixel( Middle ), Image.pixel( Middle ) ), Colours[Index] );
    EXPECT_EQ( Image.pixel( 20, 20 ), Plain.pixel( 20, 20 ) );
    EXPECT_EQ( pFrame->Result().Mode, -1 );
  }
}

TEST_F( VOutlinesTest, ASelectedObjectThatIsNotTheCurrentOneIsGreyWithAWhiteEdge )
{
  // The last one of a selection is the current one.
  Select( { Recon( 0 ), Recon( 1 ) } );
  const QImage Image = Draw();
  ExpectNear( Change( Plain.pixel( Middle ), Image.pixel( Middle ) ), { 0.25f, 0.25f, 0.25f } );
  const int Left = Edge( Image );
  ASSERT_GT( Left, 20 );
  ASSERT_LT( Left, Middle.x() - 20 );
  // The brightest of the edge, and none of it two pixels on either side.
  int Brightest = 0;
  for ( int X = Left; X < Left + 5; ++X )
  {
    Brightest = std::max( Brightest, Change( Plain.pixel( X, Middle.y() ), Image.pixel( X, Middle.y() ) ).Green );
  }
  EXPECT_GE( Brightest, 150 );
  EXPECT_NEAR( Change( Plain.pixel( Left + 5, Middle.y() ), Image.pixel( Left + 5, Middle.y() ) ).Green, 64, 3 );
}

TEST_F( VOutlinesTest, TheCurrentObjectIsHatchedInItsColour )
{
  Select( { Recon( 0 ) } );
  EXPECT_NEAR( pScene->pOutlines->PrimaryColour().x(), 231.0 / 255, 1e-6 );
  const auto Row = [&]
  {
    const QImage Image = Draw();
    std::vector< VChange > Changes;
    for ( int X = 0; X < 8; ++X )
    {
      const QPoint Place = Middle + QPoint( X, 0 );
      Changes.push_back( Change( Plain.pixel( Place ), Image.pixel( Place ) ) );
    }
    return Changes;
  };
  const auto Orange = Row();
  int Full = 0;
  for ( int X = 0; X < 8; ++X )
  {
    const VChange& rSeen = Orange[static_cast< std::size_t >( X )];
    EXPECT_LE( rSeen.Blue, 2 );
    EXPECT_NEAR( rSeen.Green, rSeen.Red * 101.0 / 231.0, 3 );
    EXPECT_NEAR( rSeen.Red, Orange[static_cast< std::size_t >( ( X + 4 ) % 8 )].Red, 2 );
    Full = std::max( Full, rSeen.Red );
  }
  EXPECT_GT( Full, 110 );
  // One pixel of four, softened.
  EXPECT_NEAR( Orange[0].Red + Orange[1].Red + Orange[2].Red + Orange[3].Red, 231, 6 );
  // Bound to no other colour than the one that is set; still hatched under the pointer.
  pScene->pOutlines->SetPrimaryColour( { 0, 0, 1, 1 } );
  Preselect( { Recon( 0 ) } );
  rInput.PreselectColour = 2;
  const auto Blue = Row();
  for ( std::size_t X = 0; X < 8; ++X )
  {
    EXPECT_LE( Blue[X].Red, 2 );
    EXPECT_NEAR( Blue[X].Blue, Orange[X].Red * 255.0 / 231.0, 4 );
  }
}

TEST_F( VOutlinesTest, NothingMarkedCostsNoDrawAndTheStagesWouldChangeNothing )
{
  /// Has the stages drawn that an empty mask spares.
  class VForced final : public IRenderType
  {
  public:
    explicit VForced( VTestScene& i_rScene )
      : m_rScene( i_rScene )
    {
    }
    void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                 std::uint32_t i_Pass ) override
    {
      if ( bOn && io_rContext.RenderMode() == ERenderModeNormal )
      {
        m_rScene.SetHighlighted( true );
        m_rScene.pOutlines->Render( io_rContext, i_rOptions, i_Pass );
        EXPECT_EQ( io_rContext.Framebuffer(), nullptr );
      }
    }
    bool bOn = false;

  private:
    VTestScene& m_rScene;
  };
  class VForcedScene final : public VTestScene
  {
  public:
    void Initialise( CoreGraphics::VRenderContext& io_rContext ) override
    {
      VTestScene::Initialise( io_rContext );
      pForced = std::make_shared< VForced >( *this );
      m_PostList.push_back( pForced );
    }
    std::shared_ptr< VForced > pForced;
  };
  const auto pForcedScene = std::make_shared< VForcedScene >();
  pForcedScene->Change( { { 0, 0, 0, 7 }, { 900, 0, 300, 7 } } );
  VSceneFrame Frame( pForcedScene, std::make_shared< CoreGraphics::VCameraController >() );
  Frame.Resize( Size );
  // A pick soils the mask, and it is clear again for the frame's own picture.
  Frame.Input().PickMode = EPickHover;
  Frame.Input().Pointer = Middle;
  const QImage Spared = Offscreen.Draw( Frame, Size );
  EXPECT_EQ( Frame.Result().Ids.size(), 1u );
  Frame.Input().PickMode = EPickNone;
  EXPECT_EQ( Offscreen.Draw( Frame, Size ), Spared );
  const std::uint64_t Calls = Frame.Figures().DrawCalls;
  pForcedScene->pForced->bOn = true;
  EXPECT_EQ( Offscreen.Draw( Frame, Size ), Spared );
  EXPECT_EQ( Frame.Figures().DrawCalls, Calls + 2 );
  // What is selected and gone from the state marks nothing either.
  pForcedScene->pForced->bOn = false;
  pForcedScene->pSelection->Set( ZEK::ISelectionService::EPrimary,
                                 { Recon( 500 ), { ZEK::ESelectSubject, "x", 1, 0 } } );
  EXPECT_EQ( Offscreen.Draw( Frame, Size ), Spared );
  EXPECT_EQ( Frame.Figures().DrawCalls, Calls );
  Offscreen.MakeCurrent();
}

TEST_F( VOutlinesTest, AnIncompleteTargetLeavesThePictureAsItWas )
{
  Select( { Recon( 0 ) } );
  pScene->pCorner->bShown = true;
  const QImage Whole = Draw();
  EXPECT_NE( Whole.pixel( Middle ), Plain.pixel( Middle ) );
  QOpenGLFramebufferObject* const pOutlines = pFrame->Context()->OutlineMask();
  ASSERT_TRUE( pOutlines && pOutlines->bind() );
  pFrame->Context()->Functions()->glFramebufferTexture2D( GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0, GL_TEXTURE_2D, 0, 0 );
  const QImage Image = Draw();
  EXPECT_TRUE( Offscreen.bDrawn );
  EXPECT_EQ( Image.pixel( Middle ), Plain.pixel( Middle ) );
  EXPECT_EQ( Image.pixel( 3, Size.height() - 4 ) | 0xFF000000, QColor( Qt::red ).rgb() );
}

TEST_F( VOutlinesTest, WithoutASelectionTargetTheViewIsDrawnAndPicksNothing )
{
  Select( { Recon( 0 ) } );
  rInput.PickMode = EPickHover;
  rInput.Pointer = Middle;
  Draw();
  EXPECT_EQ( pFrame->Result().Ids.size(), 1u );
  // More than any device here can do.
  pFrame->Resize( { 1 << 20, 4 } );
  while ( pFrame->Context()->Functions()->glGetError() != GL_NO_ERROR )
  {
  }
  EXPECT_EQ( TestSupport::LogTexts( "MoxelGraphics", ZEK::ELogWarning ).size(), 1u );
  const auto pTarget = VSceneFrame::MakeTarget( Size, false );
  pTarget->bind();
  EXPECT_TRUE( pFrame->Render( *pTarget ) );
  EXPECT_EQ( pFrame->Result().Mode, -1 );
  pFrame->Resize( Size );
  EXPECT_TRUE( pFrame->Render( *pTarget ) );
  EXPECT_EQ( pFrame->Result().Mode, static_cast< int >( EPickHover ) );
}

TEST_F( VOutlinesTest, MoreObjectsThanIdsAreDrawnAndCannotBePicked )
{
  const auto pFull = std::make_shared< VTestScene >();
  // All ids but one, before the points ask.
  pFull->BeforePoints = [&]
  {
    pFull->Registry().Allocate( { ZEK::ESelectDevice, "many", 0, 0 }, EIdMask - 1 );
  };
  pFull->Change( { { 0, 0, 0, 700 }, { 0, 0, 0, 1 } } );
  pFull->pSelection->Set( ZEK::ISelectionService::EPrimary, { Recon( 0 ) } );
  VSceneFrame Frame( pFull, std::make_shared< CoreGraphics::VCameraController >() );
  Frame.Resize( Size );
  Frame.Input().Options.ReconstructedRadius = true;
  Frame.Input().Pointer = Middle;
  for ( const int Mode : { EPickHover, EPickBandDone } )
  {
    Frame.Input().PickMode = Mode;
    const QImage Image = Offscreen.Draw( Frame, Size );
    EXPECT_TRUE( Frame.Result().Ids.empty() );
    EXPECT_EQ( Frame.Result().Mode, Mode );
    const QRgb Seen = Image.pixel( Middle );
    EXPECT_GT( qRed( Seen ), qGreen( Seen ) + 40 );
    EXPECT_LT( Distance( Seen, qRgb( qRed( Seen ), qRed( Seen ) * 160 / 255, qRed( Seen ) ) ), 4 );
  }
  Offscreen.MakeCurrent();
}

} // namespace MoxelGraphics
