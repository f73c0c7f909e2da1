#include "FrameFixture.h"

#include <TestSupport/LogGuard.h>

namespace MoxelGraphics
{

/// One large dark sphere in the middle of the view, so that what is added to it does not saturate.
class VOutlinesTest : public VFrameTest
{
protected:
  VOutlinesTest()
  {
    pScene->Change( { { 0, 0, 0, 700 }, { 0, 0, 0, 1 } } );
    Options().ReconstructedRadius = true;
    Options().FloorGrid = false;
    Options().GlobalAxis = false;
    Options().BackgroundColorRGB = 0;
    Draw();
    const std::uint32_t Colours[] = { 0xFF000000, 0xFF000000 };
    pScene->pRecons->SetLabelled( std::vector< VScenePoint >{ { 0, 0, 0, 701 }, { 3000, 0, 0, 1 } } );
    pScene->pRecons->SetLabelledColours( Colours );
    Plain = Draw();
  }
  /// What was added to the channels of a pixel, so many to the right of the middle.
  QVector3D Added( const QImage& i_rImage, int i_Right = 0 ) const
  {
    const QRgb After = i_rImage.pixel( Middle + QPoint( i_Right, 0 ) );
    const QRgb Before = Plain.pixel( Middle + QPoint( i_Right, 0 ) );
    return { float( qRed( After ) - qRed( Before ) ), float( qGreen( After ) - qGreen( Before ) ),
             float( qBlue( After ) - qBlue( Before ) ) };
  }

  const QPoint Middle{ Size.width() / 2, Size.height() / 2 };
  QImage Plain;
};

TEST_F( VOutlinesTest, ColoursAreThoseOfTheModifierAndOfWhatIsCurrent )
{
  pScene->Preselect( { Recon( 0 ) } );
  const QVector3D Colours[] = { { 0.25f, 0.125f, 0 }, { 0, 1, 0 }, { 1, 0, 0 }, { 0, 1, 1 } };
  for ( int Index = 0; Index < 4; ++Index )
  {
    Input().PreselectColour = Index;
    const QImage Image = Draw();
    EXPECT_LT( ( Added( Image ) - 255 * Colours[Index] ).length(), 3 ) << Index;
    EXPECT_EQ( Image.pixel( 20, 20 ), Plain.pixel( 20, 20 ) );
    EXPECT_EQ( pFrame->Result().Mode, -1 ) << "no pick is needed";
  }
  // The last one of a selection is the current one, and hatched; the others are grey.
  pScene->Preselect( {} );
  pScene->Select( { Recon( 0 ), Recon( 1 ) } );
  EXPECT_LT( ( Added( Draw() ) - QVector3D( 64, 64, 64 ) ).length(), 3 );
  pScene->Select( { Recon( 0 ) } );
  for ( const QVector3D& rColour : { QVector3D( 231, 101, 0 ), QVector3D( 0, 0, 255 ) } )
  {
    const QImage Image = Draw();
    QVector3D Sum;
    for ( int X = 0; X < 4; ++X )
    {
      Sum += Added( Image, X );
    }
    EXPECT_LT( ( Sum - rColour ).length(), 10 ) << "one pixel of four, softened";
    pScene->pOutlines->SetPrimaryColour( { 0, 0, 1, 1 } );
  }
}

TEST_F( VOutlinesTest, NothingMarkedCostsNoDrawAndTheStagesWouldChangeNothing )
{
  Show( std::make_shared< VTestScene >() );
  pScene->Change( { { 0, 0, 0, 7 }, { 900, 0, 300, 7 } } );
  // A pick soils the mask, and it is clear again for the frame's own picture.
  EXPECT_EQ( Pick( Middle ).size(), 1u );
  const QImage Spared = Draw();
  Input().PickMode = EPickNone;
  EXPECT_EQ( Draw(), Spared );
  const std::uint64_t Calls = pFrame->Figures().DrawCalls;
  // The stages that an empty mask spares, drawn all the same.
  pScene->pPost->Function =
      [&]( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, std::uint32_t i_Pass )
  {
    pScene->SetHighlighted( true );
    pScene->pOutlines->Render( io_rContext, i_rOptions, i_Pass );
    EXPECT_EQ( io_rContext.Framebuffer(), nullptr );
  };
  EXPECT_EQ( Draw(), Spared );
  EXPECT_EQ( pFrame->Figures().DrawCalls, Calls + 2 );
  // What is selected and gone from the state marks nothing either.
  pScene->pPost->Function = {};
  pScene->Select( { Recon( 500 ), { ZEK::ESelectSubject, "x", 1, 0 } } );
  EXPECT_EQ( Draw(), Spared );
  EXPECT_EQ( pFrame->Figures().DrawCalls, Calls );
}

TEST_F( VOutlinesTest, AnIncompleteTargetLeavesThePictureAsItWas )
{
  pScene->Select( { Recon( 0 ) } );
  pScene->pExtra->Function = DrawCorner;
  EXPECT_FALSE( Added( Draw() ).isNull() );
  QOpenGLFramebufferObject* const pOutlines = pFrame->Context()->OutlineMask();
  ASSERT_TRUE( pOutlines && pOutlines->bind() );
  pFrame->Context()->Functions()->glFramebufferTexture2D( GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0, GL_TEXTURE_2D, 0, 0 );
  const QImage Image = Draw();
  EXPECT_TRUE( Offscreen.bDrawn );
  EXPECT_TRUE( Added( Image ).isNull() );
  EXPECT_EQ( Image.pixel( 3, Size.height() - 4 ) | 0xFF000000, QColor( Qt::red ).rgb() );
}

TEST_F( VOutlinesTest, WithoutASelectionTargetTheViewIsDrawnAndPicksNothing )
{
  EXPECT_EQ( Pick( Middle ).size(), 1u );
  // More than any device here can do.
  pFrame->Resize( { 1 << 20, 4 } );
  while ( pFrame->Context()->Functions()->glGetError() != GL_NO_ERROR )
  {
  }
  EXPECT_EQ( TestSupport::LogTexts( "MoxelGraphics", ZEK::ELogWarning ).size(), 1u );
  Draw();
  EXPECT_TRUE( Offscreen.bDrawn );
  EXPECT_EQ( pFrame->Result().Mode, -1 );
  pFrame->Resize( Size );
  EXPECT_EQ( Pick( Middle ).size(), 1u );
}

TEST_F( VOutlinesTest, MoreObjectsThanIdsAreDrawnAndCannotBePicked )
{
  Show( std::make_shared< VTestScene >() );
  // All ids but one, before the points ask.
  pScene->BeforePoints = [&]
  {
    pScene->Registry().Allocate( { ZEK::ESelectDevice, "many", 0, 0 }, EIdMask - 1 );
  };
  pScene->Change( { { 0, 0, 0, 700 }, { 0, 0, 0, 1 } } );
  pScene->Select( { Recon( 0 ) } );
  Options().ReconstructedRadius = true;
  for ( const int Mode : { EPickHover, EPickBandDone } )
  {
    EXPECT_TRUE( Pick( Middle, Mode ).empty() );
    EXPECT_TRUE( IsSphere( Draw().pixel( Middle ) ) );
  }
}

} // namespace MoxelGraphics
