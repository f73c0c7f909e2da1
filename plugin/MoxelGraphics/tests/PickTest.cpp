#include "FrameFixture.h"

namespace MoxelGraphics
{

TEST_F( VFrameTest, SpheresStandWhereTheyBelongAndAreFoundThere )
{
  const std::vector< VScenePoint > Points = {
      { 0, 0, 0, 40 }, { 1500, 300, 900, 40 }, { -900, -1600, 200, 40 }, { -400, 1200, 1700, 40 } };
  pScene->Change( Points );
  pFrame->Input().Options.FloorGrid = false;
  pFrame->Input().Options.ReconstructedRadius = true;
  const QImage Image = Draw();
  ASSERT_TRUE( Offscreen.bDrawn );
  EXPECT_EQ( Image.pixel( 5, 5 ), Background );
  for ( std::uint32_t Index = 0; Index < Points.size(); ++Index )
  {
    SCOPED_TRACE( Index );
    const QPoint Place = ScreenPoint( Points[Index], Size ).toPoint();
    const QRgb Seen = Image.pixel( Place );
    EXPECT_GT( qRed( Seen ), qGreen( Seen ) + 40 );
    EXPECT_LT( Distance( Seen, qRgb( qRed( Seen ), qRed( Seen ) * 160 / 255, qRed( Seen ) ) ), 4 );
    EXPECT_EQ( Pick( Place ), std::vector< std::uint32_t >{ Index + 1 } );
    ASSERT_EQ( pFrame->Result().Selection.size(), 1u );
    EXPECT_EQ( pFrame->Result().Selection[0], Recon( Index ) );
    EXPECT_EQ( pFrame->Result().Labels, std::vector< std::string >{ "point " + std::to_string( Index ) } );
  }
  EXPECT_TRUE( Pick( { 600, 40 } ).empty() );
  pFrame->Input().PickMode = EPickNone;
  Draw();
  EXPECT_EQ( pFrame->Result().Mode, -1 );
}

TEST_F( VFrameTest, EveryDetailOfASphereIsFoundAtItsPlace )
{
  // Points, coarse and fine meshes: half a pixel to more than a quarter of the view.
  for ( const float Radius : { 5.0f, 10.0f, 60.0f, 300.0f, 1200.0f } )
  {
    SCOPED_TRACE( Radius );
    const VScenePoint Point{ 700, -500, 300, Radius };
    pScene->Change( { Point } );
    pFrame->Input().Options.ReconstructedRadius = true;
    pFrame->Input().Options.ReconstructionScale = 1.0f;
    const QPoint Place = ScreenPoint( Point, Size ).toPoint();
    EXPECT_EQ( Pick( Place ), std::vector< std::uint32_t >{ 1 } );
    const double Pixels = Radius / 7000.0 * 180 / std::tan( std::acos( -1.0 ) / 8 );
    EXPECT_TRUE( Pick( Place + QPoint( static_cast< int >( Pixels * 1.3 ) + 9, 0 ) ).empty() );
  }
  // Without measured radii a sphere has 7 mm; the scale counts for both.
  pScene->Change( { { 0, 0, 0, 1200 } } );
  pFrame->Input().Options.ReconstructedRadius = false;
  EXPECT_TRUE( Pick( { 320 + 20, 180 } ).empty() );
  pFrame->Input().Options.ReconstructionScale = 100.0f;
  EXPECT_EQ( Pick( { 320 + 20, 180 } ).size(), 1u );
}

TEST_F( VFrameTest, AmongFortyThousandSpheresEachKeepsItsId )
{
  // All lie in one corner but a few, which sit at both ends of the stretches that a pick gathers.
  std::vector< VScenePoint > Points( 40000, { -2500, 2500, 0, 0 } );
  const std::uint32_t Few[] = { 0, 1, 0x3FFF, 0x4000, 0x7FFF, 0x8000, 39999 };
  float Along = -900;
  for ( const std::uint32_t Index : Few )
  {
    Points[Index] = { Along, Along, 800, 0 };
    Along += 300;
  }
  pScene->Change( Points );
  // The flags of a marked one share their number with what was left out before it.
  pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, { Recon( 0x3FFF ), Recon( 39999 ) } );
  pFrame->Input().Options.ReconstructionScale = 3.0f;
  for ( const std::uint32_t Index : Few )
  {
    SCOPED_TRACE( Index );
    EXPECT_EQ( Pick( ScreenPoint( Points[Index], Size ).toPoint() ), std::vector< std::uint32_t >{ Index + 1 } );
  }
  EXPECT_EQ( Band( { 300, 20 }, { 340, 340 } ).size(), std::size( Few ) );
  EXPECT_EQ( Band( { 0, 0 }, { 640, 360 } ).size(), Points.size() );
}

TEST_F( VFrameTest, TheNearestPixelToTheMiddleOfTheWindowWins )
{
  Draw();
  const int H = Size.height();
  // The window of a pointer at (100, 100) begins at (95, H - 105); its middle is (5.5, 5.5) from there.
  auto& rPixels = pScene->pPixels->Pixels;
  rPixels = { { 95, H - 105, 9 }, { 105, H - 95, 8 } };
  EXPECT_EQ( Pick( { 100, 100 } ), std::vector< std::uint32_t >{ 8 } );
  // Four pixels lie equally near; the one that is read first wins.
  rPixels = { { 100, H - 99, 4 }, { 101, H - 100, 5 } };
  EXPECT_EQ( Pick( { 100, 100 } ), std::vector< std::uint32_t >{ 5 } );
  rPixels.push_back( { 100, H - 100, 6 } );
  EXPECT_EQ( Pick( { 100, 100 } ), std::vector< std::uint32_t >{ 6 } );
  // Just outside of the window.
  rPixels = { { 94, H - 100, 1 }, { 106, H - 100, 2 }, { 100, H - 106, 3 }, { 100, H - 94, 4 } };
  EXPECT_TRUE( Pick( { 100, 100 } ).empty() );
}

TEST_F( VFrameTest, InACornerTheWindowIsSmallerAndItsMiddleCounts )
{
  Draw();
  const int W = Size.width(), H = Size.height();
  auto& rPixels = pScene->pPixels->Pixels;
  // At the top left the window is 6 wide and 5 high; its middle is not the pointer.
  rPixels = { { 0, H - 1, 1 }, { 3, H - 3, 2 } };
  EXPECT_EQ( Pick( { 0, 0 } ), std::vector< std::uint32_t >{ 2 } );
  // At the bottom right it begins at (W - 6, -4).
  rPixels = { { W - 1, 0, 3 }, { W - 3, 3, 4 }, { W - 7, 3, 5 } };
  EXPECT_EQ( Pick( { W - 1, H - 1 } ), std::vector< std::uint32_t >{ 4 } );
  EXPECT_TRUE( Pick( { -50, 20 } ).empty() );
}

TEST_F( VFrameTest, ABandTakesWhatLiesInItAndBehind )
{
  std::vector< VScenePoint > Points = { { 0, 0, 0, 0 }, { 1500, 0, 300, 0 }, { -1500, 0, 300, 0 } };
  // Twenty more on the line from the first point to the eye, each hiding those behind it.
  const double Tilt = 30 * std::acos( -1.0 ) / 180.0;
  for ( int Step = 1; Step <= 20; ++Step )
  {
    const float Flat = static_cast< float >( Step * 50 * std::cos( Tilt ) / std::sqrt( 2.0 ) );
    Points.push_back( { -Flat, -Flat, static_cast< float >( Step * 50 * std::sin( Tilt ) ), 0 } );
  }
  pScene->Change( Points );
  pFrame->Input().Options.ReconstructionScale = 3.0f;
  const auto Found = Band( { 330, 170 }, { 310, 190 } );
  EXPECT_EQ( Found.size(), 21u );
  EXPECT_EQ( Found.front(), 1u );
  EXPECT_EQ( pFrame->Result().Selection.size(), 21u );
  EXPECT_GT( pFrame->Result().Layers, 1 );
  // Corners in any order, and one that lies outside of the frame.
  EXPECT_EQ( Band( { 310, 190 }, { 330, 170 } ), Found );
  EXPECT_EQ( Band( { 0, 0 }, { 2000, 2000 } ).size(), Points.size() );
  EXPECT_TRUE( Band( { 20, 20 }, { 60, 60 } ).empty() );
  // The picture is whole again after a band.
  pFrame->Input().PickMode = EPickNone;
  const QImage After = Draw();
  const QRgb Seen = After.pixel( ScreenPoint( Points[1], Size ).toPoint() );
  EXPECT_GT( qRed( Seen ), qGreen( Seen ) + 40 );
}

TEST_F( VFrameTest, ABandStopsAfterSixteenLayers )
{
  Draw();
  for ( std::uint32_t Id = 1; Id <= 20; ++Id )
  {
    pScene->pPixels->Pixels.push_back( { 100, 100, Id } );
  }
  const int Y = Size.height() - 200;
  const auto Found = Band( { 190, Y - 10 }, { 210, Y + 10 } );
  EXPECT_EQ( pFrame->Result().Layers, 16 );
  ASSERT_EQ( Found.size(), 16u );
  EXPECT_EQ( Found.front(), 5u );
}

TEST_F( VFrameTest, ABandWithoutExtentIsAClick )
{
  Draw();
  pScene->pPixels->Pixels = { { 100, 99, 1 }, { 100, 130, 2 } };
  const int Y = Size.height() - 100;
  EXPECT_EQ( Band( { 100, Y }, { 100, Y } ), std::vector< std::uint32_t >{ 1 } );
  // A line has no extent either, however long it is.
  EXPECT_EQ( Band( { 100, Y - 40 }, { 100, Y } ), std::vector< std::uint32_t >{ 1 } );
}

TEST_F( VFrameTest, TheAnalyticBandCountsItsBoundsAndNothingBehindTheEye )
{
  pScene->Change( { { 0, 0, 0, 7 }, { 20000, -20000, 20000, 7 } } );
  Draw();
  pFrame->Input().PickMode = EPickHover;
  Draw();
  // The first point projects onto the very middle of the frame.
  CoreGraphics::VRenderContext& rContext = *pFrame->Context();
  rContext.ResetState();
  pScene->SphereHelper()->Clear();
  rContext.SetRenderMode( ERenderModeSelection );
  pScene->RenderPass( rContext, {}, ERenderPassOpaque );
  EXPECT_EQ( pScene->SphereHelper()->Remembered(), 0u );
  pScene->SphereHelper()->Remember( true );
  pScene->RenderPass( rContext, {}, ERenderPassOpaque );
  const auto InRect = [&]( QRect i_Rect )
  {
    std::vector< std::uint32_t > Ids;
    pScene->PickInRect( rContext, {}, i_Rect, Ids );
    return Ids;
  };
  EXPECT_EQ( InRect( { 320, 180, 10, 10 } ), std::vector< std::uint32_t >{ 1 } );
  EXPECT_EQ( InRect( { 310, 170, 10, 10 } ), std::vector< std::uint32_t >{ 1 } );
  EXPECT_TRUE( InRect( { 322, 180, 10, 10 } ).empty() );
  EXPECT_EQ( InRect( { -100000, -100000, 200000, 200000 } ).size(), 1u );
}

TEST_F( VFrameTest, PlacesThatAreNoNumbersAreLeftOut )
{
  const float Nan = std::numeric_limits< float >::quiet_NaN();
  const float Infinite = std::numeric_limits< float >::infinity();
  pScene->Change( { { Nan, 0, 0, 7 }, { 0, Infinite, 0, 7 }, { 0, 0, 0, 7 }, { 0, 0, 0, Nan } } );
  pFrame->Input().Options.ReconstructedRadius = true;
  pFrame->Input().Options.ReconstructionScale = 10.0f;
  EXPECT_EQ( Pick( { 320, 180 } ), std::vector< std::uint32_t >{ 3 } );
  EXPECT_EQ( Band( { 0, 0 }, { 640, 360 } ), std::vector< std::uint32_t >{ 3 } );
}

} // namespace MoxelGraphics
