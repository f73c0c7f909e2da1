#include "FrameFixture.h"

#include <TestSupport/Golden.h>

// Pictures that are kept, each looked at by a person. HARROW_UPDATE_GOLDEN=1 keeps new ones.

namespace MoxelGraphics
{
namespace
{
constexpr QSize GoldenSize( 320, 200 );

/// Markers of a standing person, mm, z up, facing along x.
std::vector< VScenePoint > Person()
{
  std::vector< VScenePoint > Points = { { 90, 0, 1700, 0 },   { -90, 0, 1700, 0 }, { 110, 0, 1400, 0 },
                                        { -110, 0, 1450, 0 }, { 120, 0, 1150, 0 }, { -120, 0, 1000, 0 } };
  for ( const float Side : { -1.0f, 1.0f } )
  {
    const VScenePoint Half[] = { { 0, Side * 80, 1690, 0 },  { 0, Side * 200, 1480, 0 }, { 0, Side * 300, 1200, 0 },
                                 { 60, Side * 320, 950, 0 }, { 90, Side * 340, 880, 0 }, { 110, Side * 130, 1000, 0 },
                                 { 60, Side * 140, 740, 0 }, { 40, Side * 150, 500, 0 }, { 20, Side * 150, 300, 0 },
                                 { 0, Side * 160, 90, 0 },   { 170, Side * 170, 40, 0 }, { -60, Side * 150, 50, 0 } };
    Points.insert( Points.end(), std::begin( Half ), std::end( Half ) );
  }
  return Points;
}

} // namespace

class VGoldenTest : public VFrameTest
{
protected:
  VGoldenTest()
  {
    Stand( false );
    Options().ReconstructionScale = 4.0f;
    for ( const VScenePoint& rPoint : Points )
    {
      Focus.emplace_back( rPoint.X, rPoint.Y, rPoint.Z, 7 );
    }
  }
  void Stand( bool i_bYUp )
  {
    pScene->SetYUp( i_bYUp );
    std::vector< VScenePoint > Stood = Points;
    for ( VScenePoint& rPoint : Stood )
    {
      rPoint = i_bYUp ? VScenePoint{ rPoint.X, rPoint.Z, -rPoint.Y, 0 } : rPoint;
    }
    pScene->Change( Stood );
  }
  QImage Picture() { return Offscreen.Draw( *pFrame, GoldenSize ); }
  void Mark( ZEK::VSelection i_Selected, ZEK::VSelection i_Preselected )
  {
    pScene->Select( std::move( i_Selected ) );
    pScene->Preselect( std::move( i_Preselected ) );
  }
  void Expect( const std::string& i_rName ) { EXPECT_TRUE( TestSupport::MatchesGolden( Picture(), i_rName ) ); }

  const std::vector< VScenePoint > Points = Person();
  std::vector< QVector4D > Focus;
};

TEST_F( VGoldenTest, TheFloorFromAboveAndBelowWithEitherAxisUp )
{
  for ( const bool bYUp : { false, true } )
  {
    Stand( bYUp );
    const std::string Up = bYUp ? "y-up" : "z-up";
    pFrame->Controller().SetLockPose( {} );
    Expect( "floor-above-" + Up );
    // The eye is turned about the right of the view until it lies below the floor.
    QMatrix4x4 Below;
    Below.rotate( 45, QVector3D( 1, bYUp ? 0 : -1, bYUp ? 1 : 0 ) );
    pFrame->Controller().SetLockPose( Below );
    Expect( "floor-below-" + Up );
  }
}

TEST_F( VGoldenTest, EachViewType )
{
  for ( int Type = 0; Type < CoreGraphics::ViewTypeCount; ++Type )
  {
    pFrame->Controller().SetViewType( Type );
    Picture();
    pFrame->Controller().SetFocusPoints( Focus, true );
    Expect( std::string( "view-" ) + CoreGraphics::ViewTypeName( Type ) );
  }
}

TEST_F( VGoldenTest, SelectedAndPreselectedWithEachModifier )
{
  // Close enough for the markers of the upper body to be some ten pixels large.
  Picture();
  pFrame->Controller().SetFocusPoints( std::span( Focus ).first( 2 ), true );
  Options().ReconstructionScale = 3.0f;
  Mark( { Recon( 0 ), Recon( 6 ), Recon( 18 ) }, {} );
  Expect( "selected" );
  const char* const Modifiers[] = { "plain", "shift", "shift-control", "control" };
  Mark( { Recon( 6 ), Recon( 18 ) }, { Recon( 1 ), Recon( 18 ) } );
  for ( int Index = 0; Index < 4; ++Index )
  {
    Input().PreselectColour = Index;
    Expect( std::string( "preselected-" ) + Modifiers[Index] );
  }
}

TEST_F( VGoldenTest, OutlinesOfOneAgainstManyAndWithSamples )
{
  Picture();
  pFrame->Controller().SetFocusPoints( Focus, true );
  ZEK::VSelection Arm;
  for ( std::uint32_t Index = 18; Index < 23; ++Index )
  {
    Arm.push_back( Recon( Index ) );
  }
  Mark( Arm, {} );
  Expect( "outlines-arm" );
  const auto pTarget = VSceneFrame::MakeTarget( GoldenSize, true );
  ASSERT_TRUE( pTarget );
  EXPECT_EQ( pTarget->format().samples(), 4 );
  pTarget->bind();
  EXPECT_TRUE( pFrame->Render( *pTarget ) );
  EXPECT_TRUE( TestSupport::MatchesGolden( pTarget->toImage(), "outlines-arm-samples" ) );
}

TEST( GoldenPictures, ADifferenceIsToldByPlaceAndColour )
{
  QImage Kept( 50, 40, QImage::Format_RGB32 );
  Kept.fill( qRgb( 10, 20, 30 ) );
  QImage Seen = Kept;
  Seen.setPixel( 3, 4, qRgb( 60, 20, 30 ) );
  Seen.setPixel( 7, 30, qRgb( 10, 20, 130 ) );
  EXPECT_TRUE( TestSupport::SamePicture( Seen, Kept, { 16, 0.001 } ) );
  EXPECT_TRUE( TestSupport::SamePicture( Seen, Kept, { 100, 0 } ) );
  QImage Differences;
  const auto Result = TestSupport::SamePicture( Seen, Kept, { 16, 0.0004 }, &Differences );
  EXPECT_FALSE( Result );
  EXPECT_STREQ( Result.message(), "2 pixels are others, all in x 3 to 7, y 4 to 30; the worst at (7, 30) is "
                                  "(10, 20, 130), kept is (10, 20, 30)" );
  EXPECT_EQ( Differences.pixel( 3, 4 ), qRgb( 255, 0, 0 ) );
  EXPECT_FALSE( TestSupport::SamePicture( Seen, Kept.copy( 0, 0, 50, 39 ), {} ) );
}

} // namespace MoxelGraphics
