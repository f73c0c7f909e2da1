#include "SubjectFixture.h"
#include "SubjectShapes.h"

#include <TestSupport/Allocations.h>
#include <TestSupport/Golden.h>

#include <random>

namespace MoxelGraphics
{
namespace
{

const std::vector< std::pair< const char*, VDisplayRecord VSceneOptions::* > > Blocks = {
    { "prop", &VSceneOptions::PropSubject },
    { "labelling", &VSceneOptions::LabellingSubject },
    { "solving", &VSceneOptions::SolvingSubject },
    { "retargeting", &VSceneOptions::RetargetingSubject },
    { "scene mesh", &VSceneOptions::SceneMesh } };

/// Which block a group goes by, written out.
constexpr std::size_t BlockOf[] = { 0, 1, 0, 2, 3, 4 };

/// Where groups stand apart in the first pose of the camera.
QVector3D PlaceOf( std::size_t i_Group )
{
  const float Along = -2500.0f + 1000.0f * static_cast< float >( i_Group );
  return { Along, -Along, 0 };
}

struct VSwitch
{
  ESubjectKind Kind;
  bool VDisplayRecord::*pField;
  std::uint32_t Count; ///< of one person with two markers missing
};
const VSwitch Switches[] = { { ESubjectMarkers, &VDisplayRecord::Markers, 38 },
                             { ESubjectTargets, &VDisplayRecord::Targets, 40 },
                             { ESubjectBones, &VDisplayRecord::Bones, 20 },
                             { ESubjectJoints, &VDisplayRecord::Joints, 20 },
                             { ESubjectOrigins, &VDisplayRecord::Origins, 1 },
                             { ESubjectAxes, &VDisplayRecord::Axes, 20 },
                             { ESubjectWires, &VDisplayRecord::Clusters, 38 },
                             { ESubjectCovariances, &VDisplayRecord::TargetCovariances, 40 },
                             { ESubjectMissingMarkers, &VDisplayRecord::MissingMarkers, 2 } };

QRect Changed( const QImage& i_rA, const QImage& i_rB )
{
  QRect Rect;
  for ( int Y = 0; Y < i_rA.height(); ++Y )
  {
    for ( int X = 0; X < i_rA.width(); ++X )
    {
      Rect = i_rA.pixel( X, Y ) == i_rB.pixel( X, Y ) ? Rect : Rect.united( { X, Y, 1, 1 } );
    }
  }
  return Rect;
}
} // namespace

TEST_F( VSubjectTest, EachSwitchOfABlockShowsItsKindOfItsGroupsAndNothingElse )
{
  for ( std::size_t Index = 0; Index < pScene->Groups.size(); ++Index )
  {
    AddPerson( Group( Index ), PlaceOf( Index ), 0xFF40C0FF );
    Lose( Group( Index ), 3 );
    Lose( Group( Index ), 30 );
  }
  const QImage Empty = Draw();
  for ( std::size_t Block = 0; Block < Blocks.size(); ++Block )
  {
    VDisplayRecord& rRecord = Options().*Blocks[Block].second;
    for ( const VSwitch& rSwitch : Switches )
    {
      SCOPED_TRACE( testing::Message() << Blocks[Block].first << ", kind " << rSwitch.Kind );
      rRecord.*rSwitch.pField = true;
      const QRect Found = Changed( Draw(), Empty );
      const bool bOfMarkers = rSwitch.Kind == ESubjectMarkers || rSwitch.Kind == ESubjectTargets;
      QRect Expected;
      for ( std::size_t Index = 0; Index < pScene->Groups.size(); ++Index )
      {
        const bool bShown = BlockOf[Index] == Block && ( !bOfMarkers || Index <= Solved );
        std::vector< std::uint32_t > Wanted( ESubjectKindCount, 0 );
        Wanted[rSwitch.Kind] = bShown ? rSwitch.Count : 0;
        EXPECT_EQ( Counts( Index ), Wanted ) << "group " << Index;
        Expected |= bShown ? Around( Index ) : QRect();
      }
      // Across the room the axes of an origin are less than a pixel.
      EXPECT_TRUE( Found.isEmpty() == Expected.isEmpty() || rSwitch.Kind == ESubjectOrigins );
      EXPECT_TRUE( Found.isEmpty() || Expected.contains( Found ) );
      rRecord.Enabled = false;
      EXPECT_EQ( Draw(), Empty );
      EXPECT_EQ( Counts( Subjects ), std::vector< std::uint32_t >( ESubjectKindCount, 0 ) );
      rRecord.Enabled = true;
      rRecord.*rSwitch.pField = false;
    }
  }
}

TEST_F( VSubjectTest, SticksToMissingMarkersAreLeftOutUnlessTheyAreWanted )
{
  AddPerson( Group(), {}, 0xFF40C0FF );
  Draw();
  Labelling().Sticks = true;
  Draw();
  const std::uint32_t All = pScene->Count( Subjects, ESubjectSticks );
  EXPECT_EQ( All, Group().Sticks.size() );
  Lose( Group(), 12 );
  const auto Touching = std::count_if( Group().Sticks.begin(), Group().Sticks.end(),
                                       []( const VSubjectStick& i_rStick )
                                       {
                                         return i_rStick.A == 12 || i_rStick.B == 12;
                                       } );
  ASSERT_GT( Touching, 0 );
  const QImage Gap = Draw();
  EXPECT_EQ( pScene->Count( Subjects, ESubjectSticks ), All - Touching );
  Labelling().SticksDuringGaps = true;
  EXPECT_NE( Draw(), Gap );
  EXPECT_EQ( pScene->Count( Subjects, ESubjectSticks ), All );
  Group().Solved[12].Z = std::numeric_limits< float >::infinity();
  ++Group().MarkerGeneration;
  EXPECT_EQ( Draw(), Gap ) << "the model does not know either";
  // Near by they are round, and thicker the nearer the eye is.
  const auto Lit = [&]
  {
    const QImage Image = Draw();
    int Pixels = 0;
    for ( int Y = 0; Y < Image.height(); ++Y )
    {
      for ( int X = 0; X < Image.width(); ++X )
      {
        Pixels += Image.pixel( X, Y ) != Background ? 1 : 0;
      }
    }
    return Pixels;
  };
  const int Far = Lit();
  pFrame->Controller().SetFocusPoints( std::vector< QVector4D >{ { 0, 0, 900, 200 } }, true );
  EXPECT_GT( Lit(), 4 * Far );
}

TEST_F( VSubjectTest, BadInputDrawsWhatIsGoodOfIt )
{
  Labelling() = { true, true, true, true, true, true, true, true, true, true, true, true, true, true };
  AddPerson( Group(), {}, 0xFF40C0FF );
  Draw();
  VSubjectGroup& rGroup = Group();
  const float Infinite = std::numeric_limits< float >::infinity();
  rGroup.Poses[0][7] = VSubjectGroup::None;
  rGroup.Poses[1][0] = -Infinite;
  rGroup.Bones[2].Length = VSubjectGroup::None;
  rGroup.Bones[3].Length = -5;
  rGroup.Bones[4].Length = Infinite;
  rGroup.Bones[5].Parent = 4000000;
  rGroup.Sticks[0].A = 0xFFFFFFFF;
  rGroup.Sticks[1].B = static_cast< std::uint32_t >( rGroup.Markers.size() );
  rGroup.Sticks.push_back( { 7, 7 } );
  rGroup.Targets[10].Bone = 0xFFFFFFFF;
  rGroup.Targets[11].Marker = 0xFFFFFFFF;
  rGroup.Targets[12].Local[1] = Infinite;
  rGroup.Targets[13].Covariance = { 1, 0, 0, 0, -1, 0, 0, 0, 1 };
  rGroup.Targets[14].Covariance = { 1, 9, 0, 0, 1, 0, 0, 0, 1 };
  rGroup.Targets[15].Covariance.fill( VSubjectGroup::None );
  rGroup.Targets[16].Covariance.fill( 0 );
  rGroup.Targets[17].Covariance = { 1, 2, 3, 2, 4, 6, 3, 6, 9 };
  rGroup.Wires[20] = { 0xFFFFFFFF, 0 };
  rGroup.Wires[21] = { 0, 0xFFFFFFFF };
  rGroup.MarkerColours.resize( 3 );
  rGroup.Records[0].Markers = { 5, 0xFFFFFFFF };
  rGroup.Records[0].Flags = CoreGraphics::EInstanceSelected | CoreGraphics::EInstancePrimary;
  rGroup.Records[0].Root[3] = Infinite;
  rGroup.MarkerIds.Flags.assign( 7, 1 );
  pScene->Touch( rGroup );
  pScene->MarkDirty();
  Draw();
  // Two poses, four targets of them, and four wires are gone with the two bad poses.
  const auto Count = [&]( ESubjectKind i_Kind )
  {
    return pScene->Count( Subjects, i_Kind );
  };
  EXPECT_EQ( Count( ESubjectBones ), 15u );
  EXPECT_EQ( Count( ESubjectJoints ), 18u );
  EXPECT_EQ( Count( ESubjectAxes ), 18u );
  EXPECT_EQ( Count( ESubjectOrigins ), 0u );
  EXPECT_EQ( Count( ESubjectSticks ), rGroup.Sticks.size() - 2 );
  EXPECT_EQ( Count( ESubjectTargets ), 40u - 4 - 3 );
  EXPECT_EQ( Count( ESubjectCovariances ), 40u - 4 - 3 - 4 );
  EXPECT_EQ( Count( ESubjectWires ), 40u - 4 - 2 );
  // Lists that are not as long as they should be.
  rGroup.Poses.resize( 6 );
  rGroup.Markers.resize( 11 );
  rGroup.Solved.resize( 4 );
  pScene->Touch( rGroup );
  for ( const int Mode : { EPickHover, EPickBandDone, EPickNone } )
  {
    Input().PickMode = Mode;
    Input().BandStart = { 5, 5 };
    Input().Pointer = { 600, 300 };
    Draw();
    EXPECT_LE( Count( ESubjectBones ), 6u );
    EXPECT_EQ( Count( ESubjectMarkers ), 11u );
  }
  rGroup = {};
  pScene->Touch( rGroup );
  Draw();
  EXPECT_EQ( Counts( Subjects ), std::vector< std::uint32_t >( ESubjectKindCount, 0 ) );
}

TEST_F( VSubjectTest, ManySubjectsAreAsManyDrawsAsOneAndOnlyWhatChangedIsTakenUp )
{
  Options().LabellingSubject = {};
  Labelling().Joints = Labelling().Axes = Labelling().Targets = Labelling().TargetCovariances = true;
  AddPerson( Group(), {}, 0xFF40C0FF );
  Lose( Group(), 7 );
  pScene->MarkDirty();
  const VFrameFigures& rFigures = pFrame->Figures();
  Draw();
  const std::uint64_t Calls = rFigures.DrawCalls;
  for ( int Index = 1; Index < 20; ++Index )
  {
    AddPerson( Group(), { static_cast< float >( 500 * ( Index % 5 ) ), static_cast< float >( Index / 5 * -600 ), 0 },
               0xFFFFB050 );
  }
  pScene->Touch( Group() );
  pScene->MarkDirty();
  Draw();
  EXPECT_EQ( rFigures.DrawCalls, Calls );
  EXPECT_EQ( pScene->Count( Subjects, ESubjectBones ), 400u );
  Draw();
  EXPECT_EQ( rFigures.BytesUploaded, 0u );
  // Markers moved: spheres, sticks, wires and ghosts, and nothing of the bones.
  HideSubjects( Options() );
  Labelling().Markers = Labelling().Sticks = Labelling().Bones = true;
  Draw();
  Draw();
  const std::uint64_t Moved = 800 * 16 + Group().Sticks.size() * 24, Posed = 400 * 48;
  ++Group().MarkerGeneration;
  Draw();
  EXPECT_EQ( rFigures.BytesUploaded, Moved );
  ++Group().PoseGeneration;
  Draw();
  EXPECT_EQ( rFigures.BytesUploaded, Posed );
  EXPECT_EQ( rFigures.DrawCalls, 3u );
  // The two of them allocate nothing, still or moving.
  std::uint64_t Allocated = 0;
  bool bMoving = false;
  pScene->pExtra->Function =
      [&]( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, std::uint32_t i_Pass )
  {
    std::uint64_t Before = 0;
    for ( int Round = 0; Round < 12 && i_Pass == ERenderPassOpaque; ++Round )
    {
      Group().MarkerGeneration += bMoving ? 1 : 0;
      Group().PoseGeneration += bMoving ? 1 : 0;
      Before = Round == 4 ? TestSupport::AllocationCount() : Before;
      pScene->pMarkers->Render( io_rContext, i_rOptions, i_Pass );
      for ( const std::uint32_t Pass : { ERenderPassOpaque, ERenderPassTranslucent, ERenderPassOverlay } )
      {
        pScene->pDynamics->Render( io_rContext, i_rOptions, Pass );
      }
    }
    Allocated = i_Pass == ERenderPassOpaque ? TestSupport::AllocationCount() - Before : Allocated;
  };
  for ( const bool bNow : { false, true } )
  {
    bMoving = bNow;
    Draw();
    EXPECT_EQ( Allocated, 0u ) << bNow;
  }
}

TEST( SubjectShapes, AnEllipsoidsAxesMakeItsCovariance )
{
  std::mt19937 Random( 9 );
  std::normal_distribution< double > Number( 0, 8 );
  for ( int Round = 0; Round < 200; ++Round )
  {
    std::array< std::array< double, 3 >, 3 > Root{}, Axes;
    std::array< float, 9 > Covariance{};
    for ( auto& rRow : Root )
    {
      for ( double& rValue : rRow )
      {
        rValue = Number( Random );
      }
    }
    for ( std::size_t Index = 0; Index < 9; ++Index )
    {
      for ( std::size_t K = 0; K < 3; ++K )
      {
        Covariance[Index] += static_cast< float >( Root[Index / 3][K] * Root[Index % 3][K] );
      }
    }
    ASSERT_TRUE( EllipsoidAxes( Covariance, 1.0f, Axes ) );
    for ( std::size_t Index = 0; Index < 9; ++Index )
    {
      double Sum = 0, Across = 0;
      for ( std::size_t K = 0; K < 3; ++K )
      {
        Sum += Axes[K][Index / 3] * Axes[K][Index % 3];
        Across += Axes[Index / 3][K] * Axes[Index % 3][K];
      }
      EXPECT_NEAR( Sum, Covariance[Index], 0.2 );
      EXPECT_TRUE( Index % 4 == 0 || std::abs( Across ) < 0.02 ) << "axes stand upright on each other";
    }
  }
}

TEST_F( VSubjectTest, Pictures )
{
  constexpr QSize PictureSize( 480, 360 );
  AddPerson( Group(), { 0, -500, 0 }, 0xFFE0A040 );
  AddPerson( Group(), { 0, 500, 0 }, 0xFF50A8F0 );
  for ( std::size_t Index = 5; Index < 80; Index += 9 )
  {
    Lose( Group(), Index );
  }
  Options().FloorGrid = true;
  std::vector< QVector4D > Focus;
  for ( const VScenePoint& rPoint : Group().Solved )
  {
    Focus.emplace_back( rPoint.X, rPoint.Y, rPoint.Z, 60 );
  }
  Labelling() = {};
  Offscreen.Draw( *pFrame, PictureSize );
  const auto Expect = [&]( const char* i_pName, std::span< const QVector4D > i_Focus )
  {
    pFrame->Controller().SetFocusPoints( i_Focus, true );
    EXPECT_TRUE( TestSupport::MatchesGolden( Offscreen.Draw( *pFrame, PictureSize ), i_pName ) ) << i_pName;
  };
  Expect( "subjects", Focus );
  Expect( "subjects-near", std::span( Focus ).subspan( 44, 14 ) );
  Labelling().Axes = Labelling().Joints = Labelling().TargetCovariances = true;
  Labelling().Markers = Labelling().Sticks = false;
  Expect( "subjects-model", std::span( Focus ).subspan( 44, 14 ) );
}

} // namespace MoxelGraphics
