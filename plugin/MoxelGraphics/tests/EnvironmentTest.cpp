#include "FrameFixture.h"

#include <MoxelGraphics/VRenderCentroidAssignments.h>
#include <MoxelGraphics/VRenderForcePlates.h>
#include <MoxelGraphics/VRenderReconstructionVolume.h>

#include <limits>

namespace MoxelGraphics
{
namespace
{
constexpr float NaN = std::numeric_limits< float >::quiet_NaN();
constexpr float Infinity = std::numeric_limits< float >::infinity();

/// What stands around the subjects, each fed by hand.
class VEnvironmentScene final : public VMoxelScene
{
public:
  VEnvironmentScene()
    : VMoxelScene( nullptr, nullptr, nullptr, nullptr, false )
    , pFloor( std::make_shared< VRenderFloorGrid >( Resources() ) )
    , pPlates( std::make_shared< VRenderForcePlates >( *this ) )
    , pPoints( std::make_shared< VRenderReconstructions >( *this ) )
    , pAssignments( std::make_shared< VRenderCentroidAssignments >( Resources() ) )
    , pVolume( std::make_shared< VRenderReconstructionVolume >( Resources() ) )
  {
    m_RenderList = { pFloor, pPlates, pPoints, pAssignments, pVolume };
  }

  const std::shared_ptr< VRenderFloorGrid > pFloor;
  const std::shared_ptr< VRenderForcePlates > pPlates;
  const std::shared_ptr< VRenderReconstructions > pPoints;
  const std::shared_ptr< VRenderCentroidAssignments > pAssignments;
  const std::shared_ptr< VRenderReconstructionVolume > pVolume;
};

using VPlace = std::array< double, 3 >;

/// A place as it is written where y is up.
VPlace YUp( const VPlace& i_rPlace )
{
  return { i_rPlace[0], i_rPlace[2], -i_rPlace[1] };
}
std::array< float, 3 > Floats( const VPlace& i_rPlace )
{
  return { float( i_rPlace[0] ), float( i_rPlace[1] ), float( i_rPlace[2] ) };
}
QPoint Seen( const VPlace& i_rPlace )
{
  const auto [X, Y, Z] = Floats( i_rPlace );
  return Pixel( { X, Y, Z, 0 } );
}
/// On the floor, so far along the way from a middle to a corner.
VPlace Along( const VPlace& i_rMiddle, const VPlace& i_rCorner, double i_Share )
{
  return { i_rMiddle[0] + ( i_rCorner[0] - i_rMiddle[0] ) * i_Share,
           i_rMiddle[1] + ( i_rCorner[1] - i_rMiddle[1] ) * i_Share, 0 };
}
/// The greatest distance between two pictures at a place and its eight neighbours: a line lies on one of them.
int Change( const QImage& i_rA, const QImage& i_rB, const VPlace& i_rPlace )
{
  int Greatest = 0;
  for ( int Offset = 0; Offset < 9; ++Offset )
  {
    const QPoint Place = Seen( i_rPlace ) + QPoint( Offset % 3 - 1, Offset / 3 - 1 );
    Greatest = std::max( Greatest, Distance( i_rA.pixel( Place ), i_rB.pixel( Place ) ) );
  }
  return Greatest;
}
/// By how much red outdoes a channel: 1 green, 2 blue.
int Redness( const QImage& i_rPicture, const VPlace& i_rPlace, int i_Channel )
{
  const QRgb Colour = i_rPicture.pixel( Seen( i_rPlace ) );
  return qRed( Colour ) - ( i_Channel == 1 ? qGreen( Colour ) : qBlue( Colour ) );
}

class VEnvironmentTest : public VSceneTest< VEnvironmentScene >
{
protected:
  VEnvironmentTest() { Options().GlobalAxis = false; }
};
} // namespace

TEST_F( VEnvironmentTest, PlatesAndTheirArrowStandWhereTheyShouldWithEitherAxisUp )
{
  const std::array< VPlace, 4 > Corners{ { { 900, 500, 0 }, { 900, -300, 0 }, { -100, -300, 0 }, { -100, 500, 0 } } };
  const VPlace Centre{ 600, 300, 0 }, Middle{ 400, 100, 0 };
  for ( const int Case : { 0, 1, 2, 3 } )
  {
    const bool bYUp = Case / 2 == 1, bOtherWay = Case % 2 == 1;
    SCOPED_TRACE( testing::Message() << "y up " << bYUp << ", corners the other way about " << bOtherWay );
    pScene->SetYUp( bYUp );
    pScene->pPlates->SetPlates( {} );
    const QImage Without = Draw();
    std::array< VPlace, 4 > Given = Corners;
    VPlateLoad Load{ { 100, 0, 800 }, Floats( Centre ) };
    if ( bOtherWay )
    {
      std::reverse( Given.begin(), Given.end() );
    }
    if ( bYUp )
    {
      std::transform( Given.begin(), Given.end(), Given.begin(), YUp );
      Load = { { 100, 800, 0 }, Floats( YUp( Centre ) ) };
    }
    VForcePlate Plate;
    Plate.Colour = 0xFF4000C0;
    ASSERT_TRUE( VRenderForcePlates::MakeModel( Given, 50, bYUp, Plate.Model ) );
    pScene->pPlates->SetPlates( { &Plate, 1 } );
    const QImage Bare = Draw();
    for ( const VPlace& rCorner : Corners )
    {
      EXPECT_GT( Redness( Bare, Along( Middle, rCorner, 0.94 ), 1 ), 60 ) << rCorner[0] << ", " << rCorner[1];
      // The near corner stands before the plate's own side.
      const QPoint Outside = Seen( Along( Middle, rCorner, 1.08 ) );
      const bool bNear = rCorner[0] < 0 && rCorner[1] < 0;
      EXPECT_TRUE( bNear || Distance( Bare.pixel( Outside ), Without.pixel( Outside ) ) < 8 ) << rCorner[0];
    }
    pScene->pPlates->SetLoads( { &Load, 1 } );
    const QImage Loaded = Draw();
    for ( const double Share : { 0.02, 0.5, 0.95 } )
    {
      const VPlace Place{ 600 + 50 * Share, 300, 400 * Share };
      EXPECT_GT( std::min( Redness( Loaded, Place, 1 ), Redness( Loaded, Place, 2 ) ), 25 ) << Share;
      EXPECT_NE( Loaded.pixel( Seen( Place ) ), Bare.pixel( Seen( Place ) ) ) << Share;
    }
    for ( const VPlace& rPlace : { VPlace{ 657, 300, 450 }, VPlace{ 100, -100, 0 } } ) // past the tip; off the cross
    {
      EXPECT_EQ( Loaded.pixel( Seen( rPlace ) ), Bare.pixel( Seen( rPlace ) ) ) << rPlace[0];
    }
    // The lines of the cross are thinner than a pixel here and show as dots.
    int Dots[2] = {};
    for ( int Step = 0; Step < 40; ++Step )
    {
      Dots[0] += Change( Loaded, Bare, { 12.0 * Step, 300, 0 } ) > 20;
      Dots[1] += Change( Loaded, Bare, { 600, 10.0 * Step - 250, 0 } ) > 20;
    }
    EXPECT_GT( std::min( Dots[0], Dots[1] ), 15 );
    // A load that is none, or no number, shows the bare plate.
    for ( const VPlateLoad& rNone :
          { VPlateLoad{ { 0, 0, 25 }, Load.Centre }, VPlateLoad{ { 0, NaN, 800 }, Load.Centre },
            VPlateLoad{ { 0, 0, Infinity }, Load.Centre }, VPlateLoad{ { 0, 0, 800 }, { 600, NaN, 0 } } } )
    {
      pScene->pPlates->SetLoads( { &rNone, 1 } );
      EXPECT_EQ( Draw(), Bare );
    }
  }
}

TEST_F( VEnvironmentTest, ManyPlatesAreOneDrawAndOneUpload )
{
  const VFrameFigures& rFigures = pFrame->Figures();
  const auto DrawPlates = [&]( std::size_t i_Count )
  {
    std::vector< VForcePlate > Plates( i_Count );
    for ( std::size_t Index = 0; Index < i_Count; ++Index )
    {
      const double X = double( Index % 100 ) * 50 - 2500, Y = double( Index / 100 ) * 50 - 2500;
      VRenderForcePlates::MakeModel( { { { X, Y, 0 }, { X + 40, Y, 0 }, { X + 40, Y + 40, 0 }, { X, Y + 40, 0 } } }, 10,
                                     false, Plates[Index].Model );
    }
    pScene->pPlates->SetPlates( Plates );
    Draw();
    return rFigures.DrawCalls;
  };
  const std::uint64_t Calls = DrawPlates( 10 );
  EXPECT_EQ( DrawPlates( 10000 ), Calls );
  EXPECT_EQ( rFigures.BytesUploaded, 10000u * sizeof( VForcePlate ) );
  std::vector< VPlateLoad > Loads( 10000 );
  Loads[0] = { { 0, 0, 500 }, { -2480, -2480, 0 } };
  Loads[4000] = { { 0, 0, 500 }, { -2480, -480, 0 } };
  for ( int Time = 0; Time < 2; ++Time )
  {
    pScene->pPlates->SetLoads( Loads );
    Draw();
  }
  EXPECT_EQ( rFigures.DrawCalls, Calls + 4 ) << "two loaded plates, the plates between them, the arrows";
  EXPECT_EQ( rFigures.BytesUploaded, 2 * sizeof( VForcePlate ) );
  pScene->pPlates->SetIds( 1, {} );
  Draw();
  EXPECT_EQ( rFigures.BytesUploaded, 0u );
  // What a pick has found gives way to what lies behind it.
  EXPECT_EQ( Pick( Seen( { -2480, -480, 0 } ) ), VIds{ 4001 } );
  EXPECT_GT( Band( { 0, 0 }, { 640, 360 } ).size(), 8000u ) << "a plate of less than a pixel may hide";
}

TEST_F( VEnvironmentTest, TheVolumeIsABoxOfEdgesAndAVeil )
{
  Options().FloorGrid = false;
  const QImage Empty = Draw();
  pScene->pVolume->SetVolume( { 500, -1500, 0 }, { -1000, 800, 1200 } ); // corners in any order
  const QImage Shown = Draw();
  for ( const VPlace& rMiddle : { VPlace{ 500, -350, 1200 }, VPlace{ -1000, -350, 0 }, VPlace{ -250, -1500, 1200 },
                                  VPlace{ 500, -1500, 600 } } ) // of edges
  {
    EXPECT_NEAR( Change( Shown, Empty, rMiddle ), 128 - qGreen( Background ), 4 ) << rMiddle[0] << ", " << rMiddle[1];
  }
  // Inside lie a near and a far wall.
  const int Veil = qGreen( Shown.pixel( Seen( { -250, -350, 400 } ) ) );
  EXPECT_GT( Veil, qGreen( Background ) + 2 );
  EXPECT_LT( Veil, 100 );
  Options().ReconstructionVolume = false;
  EXPECT_EQ( Draw(), Empty );
  Options().ReconstructionVolume = true;
  for ( const float Bad : { NaN, Infinity, 1e20F, -1000.0F } )
  {
    pScene->pVolume->SetVolume( { -1000, 0, 0 }, { Bad, 800, 1200 } );
    EXPECT_EQ( Draw(), Empty ) << Bad;
  }
}

TEST_F( VEnvironmentTest, AssignmentsFollowTheirModeAndSkipWhatIsNotThere )
{
  Options().FloorGrid = false;
  VRenderCentroidAssignments& rTested = *pScene->pAssignments;
  struct VCase
  {
    std::uint32_t First, Second, Last; // selected cameras, and the second point
    std::uint32_t Point;
    std::array< std::size_t, 5 > Lines; // by mode
  };
  // Camera 0 sees both points, camera 1 the second; a camera without a place sees nothing, though it is selected. With
  // nothing selected the union shows all.
  const VCase Cases[] = { { 1, 0, 1, 1, { 0, 2, 2, 3, 1 } },
                          { 0, 0, 1, 1, { 0, 2, 0, 2, 0 } },
                          { 1, 0, 1, 0, { 0, 0, 2, 2, 0 } },
                          { 0, 0, 0, 0, { 0, 0, 0, 3, 0 } } };
  for ( const VCase& rCase : Cases )
  {
    constexpr std::uint32_t None = VRenderCentroidAssignments::NoReconstruction;
    rTested.Cameras().resize( 3 );
    rTested.Cameras()[0] = { { 2000, 0, 0 }, rCase.First, { 0, None, 1, 7 } };
    rTested.Cameras()[1] = { { 0, -2000, 0 }, rCase.Second, { 1 } };
    rTested.Cameras()[2] = { { NaN, 0, 0 }, rCase.Last, { 0, 1 } };
    rTested.SetReconstructions(
        std::vector< VAssignedReconstruction >{ { { 0, 0, 500 }, 0 }, { { 0, 0, 1000 }, rCase.Point } } );
    for ( int Mode = ENone; Mode <= EIntersection; ++Mode )
    {
      EXPECT_EQ( rTested.Lines( Mode ).size(), rCase.Lines[static_cast< std::size_t >( Mode )] * 6 )
          << "case " << &rCase - Cases << " mode " << Mode;
    }
  }
  const QImage Empty = Draw();
  Options().ContributionsType = EUnion;
  EXPECT_GT( Change( Draw(), Empty, { 1000, 0, 250 } ), 20 );
  Draw();
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 0u );
  Options().ContributionsType = EIntersection;
  EXPECT_EQ( Draw(), Empty );
}

TEST_F( VEnvironmentTest, ResidualsColourPointsWithALegendWhileTheOptionIsOn )
{
  const VPlace Cool{ 0, 0, 0 }, Warm{ 1000, 0, 0 }, None{ 0, 1000, 0 }, Labelled{ 0, -1000, 0 };
  const VScenePoint Places[] = { { 0, 0, 0, 7 }, { 1000, 0, 0, 7 }, { 0, 1000, 0, 7 }, { -1000, 0, 0, 7 } };
  const VScenePoint Other[] = { { 0, -1000, 0, 7 } };
  const float Residuals[] = { 0.1F, 5.0F, 0.0F, NaN }, OtherResiduals[] = { 1.0F };
  const std::uint32_t Colours[] = { 0xFF00FF00 };
  pScene->pPoints->SetReconstructions( Places );
  pScene->pPoints->SetResiduals( Residuals );
  pScene->pPoints->SetLabelled( Other );
  pScene->pPoints->SetLabelledColours( Colours );
  pScene->pPoints->SetLabelledResiduals( OtherResiduals );
  Options().ReconstructionScale = 12;
  const QImage Usual = Draw();
  EXPECT_LT( Redness( Usual, Labelled, 1 ), -60 );
  EXPECT_EQ( Usual.pixel( Seen( Cool ) ), Usual.pixel( Seen( Warm ) ) );
  Options().ReconstructionResiduals = true;
  const QImage Coloured = Draw();
  EXPECT_LT( Redness( Coloured, Cool, 2 ), -40 );
  EXPECT_GT( Redness( Coloured, Warm, 2 ), 60 );
  EXPECT_LT( std::abs( Redness( Coloured, None, 2 ) ), 12 );
  EXPECT_GT( Redness( Coloured, Labelled, 2 ), 30 );
  const QRgb Low = Coloured.pixel( Size.width() - 193, Size.height() - 44 ); // the legend's ends
  const QRgb High = Coloured.pixel( Size.width() - 84, Size.height() - 44 );
  EXPECT_GT( qBlue( Low ), qRed( Low ) + 40 );
  EXPECT_GT( qRed( High ), qBlue( High ) + 60 );
  Draw();
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 0u );
  Options().ReconstructionResiduals = false;
  EXPECT_EQ( Draw(), Usual );
}

TEST_F( VEnvironmentTest, TheFloorTakesTheViewsSizeUntilItHasItsOwn )
{
  const auto Extents = [&]( float i_Size )
  {
    Options().FloorGridSize = i_Size;
    Draw();
    return pScene->pFloor->GetExtents();
  };
  EXPECT_EQ( Extents( 6 ), ( std::array{ -3000, -3000, 3000, 3000 } ) );
  for ( const float Edge : { 9.0F, 0.0F, -1.0F, NaN, Infinity } )
  {
    EXPECT_EQ( Extents( Edge ), ( std::array{ -4500, -4500, 4500, 4500 } ) ) << Edge;
  }
  pScene->pFloor->SetExtents( { 100, 0, -100, 50 } );
  EXPECT_EQ( Extents( 4 ), ( std::array{ -2000, -2000, 2000, 2000 } ) ) << "no floor has its ends the wrong way round";
  // The border is where the extents say, whichever axis is up.
  for ( const bool bYUp : { false, true } )
  {
    pScene->SetYUp( bYUp );
    const auto Own = bYUp ? std::array{ -500, -700, 2000, 1000 } : std::array{ -500, -1000, 2000, 700 };
    pScene->pFloor->SetExtents( Own );
    EXPECT_EQ( Extents( 9 ), Own );
    const QImage Picture = Draw();
    for ( const VPlace& rCorner :
          { VPlace{ -500, -1000, 0 }, VPlace{ 2000, -1000, 0 }, VPlace{ 2000, 700, 0 }, VPlace{ -500, 700, 0 } } )
    {
      const VPlace Middle{ 750, -150, 0 };
      EXPECT_NE( Picture.pixel( Seen( Along( Middle, rCorner, 0.97 ) ) ), Background ) << rCorner[0];
      EXPECT_EQ( Picture.pixel( Seen( Along( Middle, rCorner, 1.05 ) ) ), Background ) << rCorner[0];
    }
  }
}

} // namespace MoxelGraphics
