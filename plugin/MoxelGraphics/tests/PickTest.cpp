#include "FrameFixture.h"

namespace MoxelGraphics
{

TEST_F( VFrameTest, SpheresStandWhereTheyBelongAndAreFoundThere )
{
  const std::vector< VScenePoint > Points = {
      { 0, 0, 0, 40 }, { 1500, 300, 900, 40 }, { -900, -1600, 200, 40 }, { -400, 1200, 1700, 40 } };
  pScene->Change( Points );
  Options().FloorGrid = false;
  Options().ReconstructedRadius = true;
  const QImage Image = Draw();
  EXPECT_EQ( Image.pixel( 5, 5 ), Background );
  for ( std::uint32_t Index = 0; Index < Points.size(); ++Index )
  {
    SCOPED_TRACE( Index );
    EXPECT_TRUE( IsSphere( Image.pixel( Pixel( Points[Index] ) ) ) );
    EXPECT_EQ( Pick( Pixel( Points[Index] ) ), VIds{ Index + 1 } );
    EXPECT_EQ( pFrame->Result().Selection, ZEK::VSelection{ Recon( Index ) } );
    EXPECT_EQ( pFrame->Result().Labels, std::vector< std::string >{ "point " + std::to_string( Index ) } );
  }
  EXPECT_TRUE( Pick( { 600, 40 } ).empty() );
  Input().PickMode = EPickNone;
  Draw();
  EXPECT_EQ( pFrame->Result().Mode, -1 );

  // Without measured radii a sphere has 7 mm; the scale counts for both.
  pScene->Change( { { 0, 0, 0, 1200 } } );
  Options().ReconstructedRadius = false;
  EXPECT_TRUE( Pick( { 320 + 20, 180 } ).empty() );
  Options().ReconstructionScale = 100.0f;
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
  pScene->Select( { Recon( 0x3FFF ), Recon( 39999 ) } );
  Options().ReconstructionScale = 3.0f;
  for ( const std::uint32_t Index : Few )
  {
    EXPECT_EQ( Pick( Pixel( Points[Index] ) ), VIds{ Index + 1 } ) << Index;
  }
  EXPECT_EQ( Band( { 300, 20 }, { 340, 340 } ).size(), std::size( Few ) );
  EXPECT_EQ( Band( { 0, 0 }, { 640, 360 } ).size(), Points.size() );
}

TEST_F( VFrameTest, TheNearestPixelToTheMiddleOfTheWindowWins )
{
  const int W = Size.width(), H = Size.height();
  struct VCase
  {
    QPoint Pointer;
    std::vector< VTestScene::VPixel > Pixels;
    VIds Found;
  };
  const VCase Cases[] = {
      // The window of a pointer at (100, 100) begins at (95, H - 105); its middle is (5.5, 5.5) from there.
      { { 100, 100 }, { { 95, H - 105, 9 }, { 105, H - 95, 8 } }, { 8 } },
      // Four pixels lie equally near; the one that is read first wins.
      { { 100, 100 }, { { 100, H - 99, 4 }, { 101, H - 100, 5 } }, { 5 } },
      { { 100, 100 }, { { 100, H - 99, 4 }, { 101, H - 100, 5 }, { 100, H - 100, 6 } }, { 6 } },
      { { 100, 100 }, { { 94, H - 100, 1 }, { 106, H - 100, 2 }, { 100, H - 106, 3 }, { 100, H - 94, 4 } }, {} },
      // At the top left the window is 6 wide and 5 high; its middle is not the pointer.
      { { 0, 0 }, { { 0, H - 1, 1 }, { 3, H - 3, 2 } }, { 2 } },
      // At the bottom right it begins at (W - 6, -4).
      { { W - 1, H - 1 }, { { W - 1, 0, 3 }, { W - 3, 3, 4 }, { W - 7, 3, 5 } }, { 4 } },
      { { -50, 20 }, { { 0, H - 20, 1 } }, {} },
  };
  Draw();
  for ( const VCase& rCase : Cases )
  {
    pScene->Pixels = rCase.Pixels;
    EXPECT_EQ( Pick( rCase.Pointer ), rCase.Found ) << "case " << &rCase - Cases;
  }
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
  Options().ReconstructionScale = 3.0f;
  const VIds Found = Band( { 330, 170 }, { 310, 190 } );
  EXPECT_EQ( Found.size(), 21u );
  EXPECT_EQ( Found.front(), 1u );
  EXPECT_EQ( pFrame->Result().Selection.size(), 21u );
  EXPECT_GT( pFrame->Result().Layers, 1 );
  // Corners in any order, and one that lies outside of the frame.
  EXPECT_EQ( Band( { 310, 190 }, { 330, 170 } ), Found );
  EXPECT_EQ( Band( { 0, 0 }, { 2000, 2000 } ).size(), Points.size() );
  EXPECT_TRUE( Band( { 20, 20 }, { 60, 60 } ).empty() );
  // The picture is whole again after a band.
  Input().PickMode = EPickNone;
  EXPECT_TRUE( IsSphere( Draw().pixel( Pixel( Points[1] ) ) ) );
}

TEST_F( VFrameTest, ABandStopsAfterSixteenLayersAndWithoutExtentIsAClick )
{
  Draw();
  pScene->Pixels = { { 100, 99, 1 }, { 100, 130, 2 } };
  const int Y = Size.height() - 100;
  EXPECT_EQ( Band( { 100, Y }, { 100, Y } ), VIds{ 1 } );
  EXPECT_EQ( Band( { 100, Y - 40 }, { 100, Y } ), VIds{ 1 } ) << "a line has no extent, however long it is";
  // Bands are drawn at half the size.
  pScene->Pixels.clear();
  for ( std::uint32_t Id = 1; Id <= 20; ++Id )
  {
    pScene->Pixels.push_back( { 100, 100, Id } );
  }
  const VIds Found = Band( { 190, Y - 110 }, { 210, Y - 90 } );
  EXPECT_EQ( pFrame->Result().Layers, 16 );
  ASSERT_EQ( Found.size(), 16u );
  EXPECT_EQ( Found.front(), 5u );
}

TEST_F( VFrameTest, PlacesThatAreNoNumbersOrBehindTheEyeAreLeftOut )
{
  const float Nan = std::numeric_limits< float >::quiet_NaN();
  const float Infinite = std::numeric_limits< float >::infinity();
  pScene->Change(
      { { Nan, 0, 0, 7 }, { 0, Infinite, 0, 7 }, { 0, 0, 0, 7 }, { 0, 0, 0, Nan }, { 20000, -20000, 20000, 7 } } );
  Options().ReconstructedRadius = true;
  Options().ReconstructionScale = 10.0f;
  EXPECT_EQ( Pick( { 320, 180 } ), VIds{ 3 } );
  EXPECT_EQ( pScene->SphereHelper()->Remembered(), 0u ) << "the list of centres is a band's alone";
  EXPECT_EQ( Band( { 0, 0 }, { 640, 360 } ), VIds{ 3 } );
}

} // namespace MoxelGraphics
