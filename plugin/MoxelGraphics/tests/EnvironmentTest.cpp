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

  std::shared_ptr< VRenderFloorGrid > pFloor;
  std::shared_ptr< VRenderForcePlates > pPlates;
  std::shared_ptr< VRenderReconstructions > pPoints;
  std::shared_ptr< VRenderCentroidAssignments > pAssignments;
  std::shared_ptr< VRenderReconstructionVolume > pVolume;
};

using VPlace = std::array< double, 3 >;

/// A place as it is written where y is up.
VPlace YUp( const VPlace& i_rPlace )
{
  return { i_rPlace[0], i_rPlace[2], -i_rPlace[1] };
}

std::array< float, 3 > ToFloat( const VPlace& i_rPlace )
{
  return { static_cast< float >( i_rPlace[0] ), static_cast< float >( i_rPlace[1] ),
           static_cast< float >( i_rPlace[2] ) };
}

class VEnvironmentTest : public testing::Test
{
protected:
  VEnvironmentTest()
  {
    InitShaders();
    rOptions.GlobalAxis = false;
  }
  ~VEnvironmentTest() override
  {
    Offscreen.MakeCurrent();
    pFrame.reset();
  }

  QImage Draw() { return Offscreen.Draw( *pFrame, Size ); }
  static QRgb At( const QImage& i_rPicture, const VPlace& i_rPlace )
  {
    const std::array< float, 3 > Place = ToFloat( i_rPlace );
    return i_rPicture.pixel( ScreenPoint( { Place[0], Place[1], Place[2], 0 }, Size ).toPoint() );
  }

  /// The greatest distance between two pictures at a place and its eight neighbours: a line lies on one of them.
  static int Change( const QImage& i_rA, const QImage& i_rB, const VPlace& i_rPlace )
  {
    const std::array< float, 3 > Place = ToFloat( i_rPlace );
    const QPoint Middle = ScreenPoint( { Place[0], Place[1], Place[2], 0 }, Size ).toPoint();
    int Greatest = 0;
    for ( int Offset = 0; Offset < 9; ++Offset )
    {
      const QPoint Point = Middle + QPoint( Offset % 3 - 1, Offset / 3 - 1 );
      Greatest = std::max( Greatest, Distance( i_rA.pixel( Point ), i_rB.pixel( Point ) ) );
    }
    return Greatest;
  }

  VOffscreen Offscreen;
  std::shared_ptr< VEnvironmentScene > pScene = std::make_shared< VEnvironmentScene >();
  std::unique_ptr< VSceneFrame > pFrame =
      std::make_unique< VSceneFrame >( pScene, std::make_shared< CoreGraphics::VCameraController >() );
  VSceneOptions& rOptions = pFrame->Input().Options;
};

bool IsArrow( QRgb i_Pixel )
{
  return qRed( i_Pixel ) > qGreen( i_Pixel ) + 25 && qRed( i_Pixel ) > qBlue( i_Pixel ) + 25;
}
} // namespace

TEST_F( VEnvironmentTest, PlatesAndTheirArrowStandWhereTheyShouldWithEitherAxisUp )
{
  const std::array< VPlace, 4 > Corners{ { { 900, 500, 0 }, { 900, -300, 0 }, { -100, -300, 0 }, { -100, 500, 0 } } };
  const VPlace Centre{ 600, 300, 0 };
  for ( const bool bYUp : { false, true } )
  {
    for ( const bool bOtherWay : { false, true } )
    {
      SCOPED_TRACE( testing::Message() << "y up " << bYUp << ", corners the other way about " << bOtherWay );
      pScene->SetYUp( bYUp );
      pScene->pPlates->SetPlates( {} );
      const QImage Without = Draw();
      std::array< VPlace, 4 > Given = Corners;
      if ( bOtherWay )
      {
        std::reverse( Given.begin(), Given.end() );
      }
      VPlateLoad Load{ { 100, 0, 800 }, ToFloat( Centre ) };
      VPlace Tip{ 650, 300, 400 };
      if ( bYUp )
      {
        std::transform( Given.begin(), Given.end(), Given.begin(), YUp );
        Load = { { 100, 800, 0 }, ToFloat( YUp( Centre ) ) };
      }
      VForcePlate Plate;
      Plate.Colour = 0xFF4000C0;
      ASSERT_TRUE( VRenderForcePlates::MakeModel( Given, 50, bYUp, Plate.Model ) );
      pScene->pPlates->SetPlates( { &Plate, 1 } );
      const QImage Bare = Draw();
      for ( const VPlace& rCorner : Corners )
      {
        const auto Along = [&]( double i_Share )
        {
          return VPlace{ 400 + ( rCorner[0] - 400 ) * i_Share, 100 + ( rCorner[1] - 100 ) * i_Share, 0 };
        };
        EXPECT_GT( qRed( At( Bare, Along( 0.94 ) ) ), qGreen( At( Bare, Along( 0.94 ) ) ) + 60 ) << rCorner[0];
        // The near corner stands before the plate's own side.
        EXPECT_TRUE( rCorner[0] < 0 && rCorner[1] < 0
                         ? true
                         : Distance( At( Bare, Along( 1.08 ) ), At( Without, Along( 1.08 ) ) ) < 8 )
            << rCorner[0] << ", " << rCorner[1];
      }
      pScene->pPlates->SetLoads( { &Load, 1 } );
      const QImage Loaded = Draw();
      for ( const double Share : { 0.02, 0.5, 0.95 } )
      {
        const VPlace Place{ Centre[0] + ( Tip[0] - Centre[0] ) * Share, 300, Tip[2] * Share };
        EXPECT_TRUE( IsArrow( At( Loaded, Place ) ) ) << Share;
        EXPECT_NE( At( Loaded, Place ), At( Bare, Place ) );
      }
      EXPECT_EQ( At( Loaded, { 657, 300, 450 } ), At( Bare, { 657, 300, 450 } ) ) << "past the tip";
      // The lines of the cross are thinner than a pixel here and show as dots.
      int Dots[2] = {};
      for ( int Step = 0; Step < 40; ++Step )
      {
        Dots[0] += Change( Loaded, Bare, { 12.0 * Step, 300, 0 } ) > 20;
        Dots[1] += Change( Loaded, Bare, { 600, 10.0 * Step - 250, 0 } ) > 20;
      }
      EXPECT_GT( std::min( Dots[0], Dots[1] ), 15 );
      EXPECT_EQ( At( Loaded, { 100, -100, 0 } ), At( Bare, { 100, -100, 0 } ) );
      // A load that is none, or no number, shows the bare plate.
      const VPlateLoad None[] = { { { 0, 0, 25 }, Load.Centre },
                                  { { 0, NaN, 800 }, Load.Centre },
                                  { { 0, 0, Infinity }, Load.Centre },
                                  { { 0, 0, 800 }, { 600, NaN, 0 } } };
      for ( const VPlateLoad& rNone : None )
      {
        pScene->pPlates->SetLoads( { &rNone, 1 } );
        EXPECT_EQ( Draw(), Bare );
      }
    }
  }
}

TEST_F( VEnvironmentTest, CornersThatAreNoPlateAreRefused )
{
  const std::array< VPlace, 4 > Good{ { { 1, 1, 0 }, { 1, -1, 0 }, { -1, -1, 0 }, { -1, 1, 0 } } };
  std::array< float, 16 > Model{};
  ASSERT_TRUE( VRenderForcePlates::MakeModel( Good, 50, false, Model ) );
  const auto Before = Model;
  for ( const double Bad : { std::nan( "" ), -HUGE_VAL, HUGE_VAL, 1e12 } )
  {
    for ( std::size_t Corner = 0; Corner < 4; ++Corner )
    {
      auto Corners = Good;
      Corners[Corner][Corner % 3] = Bad;
      EXPECT_FALSE( VRenderForcePlates::MakeModel( Corners, 50, false, Model ) ) << Bad;
    }
  }
  EXPECT_FALSE( VRenderForcePlates::MakeModel( { Good[0], Good[0], Good[0], Good[0] }, 50, false, Model ) );
  EXPECT_FALSE( VRenderForcePlates::MakeModel( { Good[0], Good[0], Good[2], Good[2] }, 50, false, Model ) );
  EXPECT_EQ( Model, Before );
  for ( const double Thickness : { std::nan( "" ), HUGE_VAL, 0.0, -5.0 } )
  {
    ASSERT_TRUE( VRenderForcePlates::MakeModel( Good, Thickness, false, Model ) );
    EXPECT_TRUE( std::isfinite( Model[10] ) && Model[10] > 0 );
  }
}

TEST_F( VEnvironmentTest, ManyPlatesAreOneDrawAndOneUpload )
{
  std::vector< VForcePlate > Plates;
  const auto Fill = [&]( int i_Count )
  {
    Plates.clear();
    for ( int Index = 0; Index < i_Count; ++Index )
    {
      const double X = Index % 100 * 50 - 2500, Y = Index / 100 * 50 - 2500;
      VForcePlate& rPlate = Plates.emplace_back();
      rPlate.Colour = 0xFF808080;
      VRenderForcePlates::MakeModel( { { { X, Y, 0 }, { X + 40, Y, 0 }, { X + 40, Y + 40, 0 }, { X, Y + 40, 0 } } }, 10,
                                     false, rPlate.Model );
    }
    pScene->pPlates->SetPlates( Plates );
  };
  Fill( 10 );
  Draw();
  const std::uint64_t Calls = pFrame->Figures().DrawCalls;
  Fill( 10000 );
  Draw();
  EXPECT_EQ( pFrame->Figures().DrawCalls, Calls );
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 10000u * sizeof( VForcePlate ) );
  std::vector< VPlateLoad > Loads( 10000 );
  Loads[0] = { { 0, 0, 500 }, { -2480, -2480, 0 } };
  Loads[4000] = { { 0, 0, 500 }, { -2480, -480, 0 } };
  pScene->pPlates->SetLoads( Loads );
  Draw();
  pScene->pPlates->SetLoads( Loads );
  Draw();
  EXPECT_EQ( pFrame->Figures().DrawCalls, Calls + 4 ) << "two loaded plates, the plates between them, the arrows";
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 2 * sizeof( VForcePlate ) );
  pScene->pPlates->SetIds( 1, {} );
  Draw();
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 0u );
  // What a pick has found gives way to what lies behind it.
  VFrameInput& rInput = pFrame->Input();
  rInput.PickMode = EPickHover;
  rInput.Pointer = ScreenPoint( { -2480, -480, 0, 0 }, Size ).toPoint();
  Draw();
  EXPECT_EQ( pFrame->Result().Ids, std::vector< std::uint32_t >{ 4001 } );
  rInput.PickMode = EPickBandDone;
  rInput.BandStart = { 0, 0 };
  rInput.Pointer = { Size.width(), Size.height() };
  Draw();
  EXPECT_GT( pFrame->Result().Ids.size(), 8000u ) << "a plate of less than a pixel may hide";
}

TEST_F( VEnvironmentTest, TheVolumeIsABoxOfEdgesAndAVeil )
{
  rOptions.FloorGrid = false;
  const QImage Empty = Draw();
  pScene->pVolume->SetVolume( { 500, -1500, 0 }, { -1000, 800, 1200 } );
  EXPECT_EQ( pScene->pVolume->Minimum(), ( std::array< float, 3 >{ -1000, -1500, 0 } ) );
  const QImage Shown = Draw();
  const VPlace EdgeMiddles[] = { { 500, -350, 1200 }, { -1000, -350, 0 }, { -250, -1500, 1200 }, { 500, -1500, 600 } };
  for ( const VPlace& rPlace : EdgeMiddles )
  {
    EXPECT_NEAR( Change( Shown, Empty, rPlace ), 128 - qGreen( Background ), 4 ) << rPlace[0] << ", " << rPlace[1];
  }
  // Inside lie a near and a far wall.
  const int Veil = qGreen( At( Shown, { -250, -350, 400 } ) );
  EXPECT_GT( Veil, qGreen( Background ) + 2 );
  EXPECT_LT( Veil, 100 );
  rOptions.ReconstructionVolume = false;
  EXPECT_EQ( Draw(), Empty );
  rOptions.ReconstructionVolume = true;
  for ( const float Bad : { NaN, Infinity, 1e20F, -1000.0F } )
  {
    pScene->pVolume->SetVolume( { -1000, 0, 0 }, { Bad, 800, 1200 } );
    EXPECT_EQ( Draw(), Empty ) << Bad;
  }
}

TEST_F( VEnvironmentTest, AssignmentsFollowTheirModeAndSkipWhatIsNotThere )
{
  rOptions.FloorGrid = false;
  const auto Fill = [&]( std::uint32_t i_Camera, std::uint32_t i_Point )
  {
    auto& rCameras = pScene->pAssignments->Cameras();
    rCameras.resize( 3 );
    constexpr std::uint32_t None = VRenderCentroidAssignments::NoReconstruction;
    rCameras[0] = { { 2000, 0, 0 }, i_Camera, { 0, None, 1, 7 } };
    rCameras[1] = { { 0, -2000, 0 }, 0, { 1 } };
    rCameras[2] = { { NaN, 0, 0 }, 1, { 0, 1 } };
    const VAssignedReconstruction Points[] = { { { 0, 0, 500 }, 0 }, { { 0, 0, 1000 }, i_Point } };
    pScene->pAssignments->SetReconstructions( Points );
  };
  struct VCase
  {
    std::uint32_t Camera, Point;
    std::array< std::size_t, 5 > Lines; // by mode
  };
  // Camera 0 sees both points, camera 1 the second; a camera without a place sees nothing, though it is selected.
  const VCase Cases[] = { { 1, 1, { 0, 2, 2, 3, 1 } }, { 0, 1, { 0, 2, 0, 2, 0 } }, { 1, 0, { 0, 0, 2, 2, 0 } } };
  for ( const VCase& rCase : Cases )
  {
    Fill( rCase.Camera, rCase.Point );
    for ( int Mode = ENone; Mode <= EIntersection; ++Mode )
    {
      EXPECT_EQ( pScene->pAssignments->Lines( Mode ).size(), rCase.Lines[static_cast< std::size_t >( Mode )] * 6 )
          << rCase.Camera << rCase.Point << " mode " << Mode;
    }
  }
  pScene->pAssignments->Cameras().pop_back();
  Fill( 0, 0 );
  pScene->pAssignments->Cameras()[2].Selected = 0;
  pScene->pAssignments->SetReconstructions( std::vector< VAssignedReconstruction >( 2, { { 0, 0, 500 }, 0 } ) );
  EXPECT_EQ( pScene->pAssignments->Lines( EUnion ).size(), 3u * 6 ) << "nothing selected: all";

  const QImage Empty = Draw();
  rOptions.ContributionsType = EUnion;
  const QImage Shown = Draw();
  EXPECT_GT( Change( Shown, Empty, { 1000, 0, 250 } ), 20 );
  Draw();
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 0u );
  rOptions.ContributionsType = EIntersection;
  EXPECT_EQ( Draw(), Empty );
}

TEST_F( VEnvironmentTest, ResidualsColourPointsWithALegendWhileTheOptionIsOn )
{
  const VScenePoint Places[] = { { 0, 0, 0, 7 }, { 1000, 0, 0, 7 }, { 0, 1000, 0, 7 }, { -1000, 0, 0, 7 } };
  const VPlace Cool{ 0, 0, 0 }, Warm{ 1000, 0, 0 }, None{ 0, 1000, 0 }, Labelled{ 0, -1000, 0 };
  const VScenePoint Other[] = { { 0, -1000, 0, 7 } };
  const float Residuals[] = { 0.1F, 5.0F, 0.0F, NaN }, OtherResiduals[] = { 1.0F };
  const std::uint32_t Colours[] = { 0xFF00FF00 };
  pScene->pPoints->SetReconstructions( Places );
  pScene->pPoints->SetResiduals( Residuals );
  pScene->pPoints->SetLabelled( Other );
  pScene->pPoints->SetLabelledColours( Colours );
  pScene->pPoints->SetLabelledResiduals( OtherResiduals );
  rOptions.ReconstructionScale = 12;
  const QImage Usual = Draw();
  EXPECT_GT( qGreen( At( Usual, Labelled ) ), qRed( At( Usual, Labelled ) ) + 60 );
  EXPECT_EQ( At( Usual, Cool ), At( Usual, Warm ) );
  rOptions.ReconstructionResiduals = true;
  const QImage Coloured = Draw();
  EXPECT_GT( qBlue( At( Coloured, Cool ) ), qRed( At( Coloured, Cool ) ) + 40 );
  EXPECT_GT( qRed( At( Coloured, Warm ) ), qBlue( At( Coloured, Warm ) ) + 60 );
  EXPECT_LT( std::abs( qRed( At( Coloured, None ) ) - qBlue( At( Coloured, None ) ) ), 12 );
  EXPECT_GT( qRed( At( Coloured, Labelled ) ), qBlue( At( Coloured, Labelled ) ) + 30 );
  const QRect Legend( Size.width() - 208, Size.height() - 74, 196, 62 );
  EXPECT_NE( Coloured.copy( Legend ), Usual.copy( Legend ) );
  const QPoint Low = Legend.topLeft() + QPoint( 15, 30 ), High = Legend.topLeft() + QPoint( 124, 30 );
  EXPECT_GT( qBlue( Coloured.pixel( Low ) ), qRed( Coloured.pixel( Low ) ) + 40 );
  EXPECT_GT( qRed( Coloured.pixel( High ) ), qBlue( Coloured.pixel( High ) ) + 60 );
  Draw();
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 0u );
  rOptions.ReconstructionResiduals = false;
  EXPECT_EQ( Draw(), Usual );
}

TEST_F( VEnvironmentTest, TheFloorTakesTheViewsSizeUntilItHasItsOwn )
{
  const auto Extents = [&]( float i_Size )
  {
    rOptions.FloorGridSize = i_Size;
    Draw();
    return pScene->pFloor->GetExtents();
  };
  EXPECT_EQ( Extents( 6 ), ( std::array{ -3000, -3000, 3000, 3000 } ) );
  EXPECT_EQ( Extents( 9 ), ( std::array{ -4500, -4500, 4500, 4500 } ) );
  for ( const float Bad : { 0.0F, -1.0F, NaN, Infinity } )
  {
    EXPECT_EQ( Extents( Bad ), ( std::array{ -4500, -4500, 4500, 4500 } ) ) << Bad;
  }
  pScene->pFloor->SetExtents( { 100, 0, -100, 50 } );
  EXPECT_EQ( Extents( 4 ), ( std::array{ -2000, -2000, 2000, 2000 } ) ) << "no floor has its ends the wrong way round";
  pScene->pFloor->SetExtents( { -500, -1000, 2000, 700 } );
  EXPECT_EQ( Extents( 9 ), ( std::array{ -500, -1000, 2000, 700 } ) );
  // The border is where the extents say, whichever axis is up.
  for ( const bool bYUp : { false, true } )
  {
    pScene->SetYUp( bYUp );
    pScene->pFloor->SetExtents( bYUp ? std::array{ -500, -700, 2000, 1000 } : std::array{ -500, -1000, 2000, 700 } );
    const QImage Picture = Draw();
    for ( const VPlace& rCorner :
          { VPlace{ -500, -1000, 0 }, VPlace{ 2000, -1000, 0 }, VPlace{ 2000, 700, 0 }, VPlace{ -500, 700, 0 } } )
    {
      const auto Along = [&]( double i_Share )
      {
        return VPlace{ 750 + ( rCorner[0] - 750 ) * i_Share, -150 + ( rCorner[1] + 150 ) * i_Share, 0 };
      };
      EXPECT_NE( At( Picture, Along( 0.97 ) ), Background ) << rCorner[0];
      EXPECT_EQ( At( Picture, Along( 1.05 ) ), Background ) << rCorner[0];
    }
  }
}

} // namespace MoxelGraphics
