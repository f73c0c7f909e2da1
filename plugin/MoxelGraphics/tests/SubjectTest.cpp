#include "SubjectFixture.h"
#include "SubjectShapes.h"

#include <TestSupport/Allocations.h>
#include <TestSupport/Golden.h>

#include <random>

namespace MoxelGraphics
{
namespace
{
using EGroup = VRenderSubjectDynamics::EGroup;
constexpr std::size_t Subjects = EGroup::ESubjects, Solved = EGroup::ESolved;

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

void Lose( VSubjectGroup& io_rGroup, std::size_t i_Marker )
{
  io_rGroup.Markers[i_Marker] = { VSubjectGroup::None, 0, 0, 0 };
  ++io_rGroup.MarkerGeneration;
}

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

class VSubjectTest : public VSceneTest< VSubjectScene >
{
protected:
  VSubjectTest()
  {
    HideSubjects( Options() );
    Options().FloorGrid = Options().GlobalAxis = false;
  }
  VSubjectGroup& Group( std::size_t i_Index = Subjects ) { return pScene->Groups[i_Index]; }
  VDisplayRecord& Labelling() { return Options().LabellingSubject; }
  /// Where all of a group lies on the screen, and a little more.
  QRect Around( std::size_t i_Group )
  {
    QRectF Rect;
    for ( const VScenePoint& rPoint : Group( i_Group ).Solved )
    {
      Rect |= QRectF( ScreenPoint( rPoint ), QSizeF( 1, 1 ) );
    }
    // From the root and the joints to the markers.
    return Rect.toAlignedRect().adjusted( -8, -8, 8, 8 );
  }
  std::vector< std::uint32_t > Counts( std::size_t i_Group ) const
  {
    std::vector< std::uint32_t > All;
    for ( std::uint32_t Kind = 0; Kind < ESubjectKindCount; ++Kind )
    {
      All.push_back( pScene->Count( i_Group, ESubjectKind( Kind ) ) );
    }
    return All;
  }
  /// Three bones, sticks and markers so far apart that none hides another.
  void SpreadOut()
  {
    VSubjectGroup& rGroup = Group();
    VSubjectRecord Record;
    Record.Item = { ZEK::ESelectSubject, "spread", 1, 0 };
    Record.Markers = { 0, 6 };
    Record.Sticks = Record.Bones = { 0, 3 };
    for ( int Index = 0; Index < 3; ++Index )
    {
      const float Along = -1500.0f + 1300.0f * static_cast< float >( Index );
      rGroup.Markers.push_back( { Along, -600, 200, 30 } );
      rGroup.Markers.push_back( { Along + 300, -1500, 700, 30 } );
      rGroup.Bones.push_back( { -1, 0xFF40C0FF, 900 } );
      rGroup.Poses.push_back( PoseAlong( { Along, 300, 100 }, { Along + 200, 1000, 500 } ) );
      const auto First = static_cast< std::uint32_t >( 2 * Index );
      rGroup.Sticks.push_back( { First, First + 1 } );
    }
    rGroup.Solved = rGroup.Markers;
    rGroup.Records.push_back( Record );
    pScene->Touch( rGroup );
    pScene->MarkDirty();
    Labelling().Markers = Labelling().Sticks = Labelling().Bones = true;
    Draw();
  }
  /// Points of an object on the screen, from one end to the other.
  std::vector< QPointF > Along( std::uint32_t i_Id )
  {
    const VSubjectGroup& rGroup = Group();
    QVector3D A, B;
    const auto Place = []( const VScenePoint& i_rPoint )
    {
      return QVector3D( i_rPoint.X, i_rPoint.Y, i_rPoint.Z );
    };
    if ( i_Id < rGroup.StickIds.First )
    {
      A = B = Place( rGroup.Markers[i_Id - rGroup.MarkerIds.First] );
    }
    else if ( i_Id < rGroup.BoneIds.First )
    {
      const VSubjectStick& rStick = rGroup.Sticks[i_Id - rGroup.StickIds.First];
      A = Place( rGroup.Markers[rStick.A] );
      B = Place( rGroup.Markers[rStick.B] );
    }
    else
    {
      const VBonePose& rPose = rGroup.Poses[i_Id - rGroup.BoneIds.First];
      A = { rPose[3], rPose[7], rPose[11] };
      B = A + 900 * QVector3D( rPose[0], rPose[4], rPose[8] );
    }
    std::vector< QPointF > Points;
    for ( int Step = 0; Step <= 100; ++Step )
    {
      const QVector3D At = A + ( B - A ) * ( static_cast< float >( Step ) / 100 );
      Points.push_back( ScreenPoint( { At.x(), At.y(), At.z(), 0 } ) );
    }
    return Points;
  }
  /// As each of the three blocks of ids stands.
  std::uint32_t End() { return Group().BoneIds.First + 3; }
};

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

TEST_F( VSubjectTest, PointsAndBandsFindBonesMarkersAndSticks )
{
  SpreadOut();
  const std::uint32_t First = Group().MarkerIds.First;
  for ( std::uint32_t Id = First; Id < End(); ++Id )
  {
    // The fatter half of a bone, which is not the middle of the screen's line.
    EXPECT_EQ( Pick( Along( Id )[30].toPoint() ), VIds{ Id } ) << Id - First;
  }
  std::mt19937 Random( 5 );
  std::uniform_int_distribution< int > X( 0, Size.width() ), Y( 0, Size.height() );
  int Sure = 0;
  for ( int Round = 0; Round < 60; ++Round )
  {
    const QRect Band = QRect( QPoint( X( Random ), Y( Random ) ), QPoint( X( Random ), Y( Random ) ) ).normalized();
    if ( Band.width() < 12 || Band.height() < 12 )
    {
      continue;
    }
    const VIds Found = this->Band( Band.topLeft(), Band.bottomRight() );
    for ( std::uint32_t Id = First; Id < End(); ++Id )
    {
      // The tip of a bone is too thin to be hit, and a band looks at every second pixel.
      bool bInside = false, bNear = false;
      const std::vector< QPointF > Points = Along( Id );
      for ( std::size_t Step = 0; Step < Points.size(); ++Step )
      {
        bInside =
            bInside || ( Step > 5 && Step < 75 && QRectF( Band ).adjusted( 4, 4, -4, -4 ).contains( Points[Step] ) );
        bNear = bNear || QRectF( Band ).adjusted( -12, -12, 12, 12 ).contains( Points[Step] );
      }
      const bool bFound = std::binary_search( Found.begin(), Found.end(), Id );
      EXPECT_TRUE( bFound ? bNear : !bInside ) << "round " << Round << ", object " << Id - First;
      Sure += bInside || !bNear ? 1 : 0;
    }
  }
  EXPECT_GT( Sure, 300 );
  // What is not shown is not found; joints and targets stand for their bones and markers.
  Labelling() = {};
  Labelling().Enabled = false;
  EXPECT_TRUE( Band( { 0, 0 }, { 640, 360 } ).empty() );
  HideSubjects( Options() );
  Group().Targets = { { 1, 4, { 100, 0, 0 }, {} }, { 2, 2, { 100, 0, 0 }, {} } };
  ++Group().StructureGeneration;
  Labelling().Targets = Labelling().Joints = true;
  EXPECT_EQ( Band( { 0, 0 }, { 640, 360 } ), ( VIds{ First + 2, First + 4, End() - 3, End() - 2, End() - 1 } ) );
}

TEST_F( VSubjectTest, LabelledBonesAreHalfThereBesideSolvedOnesAndBonesShineThroughXRay )
{
  SpreadOut();
  Labelling().Markers = Labelling().Sticks = false;
  const QPoint Bone = Along( End() - 2 )[30].toPoint();
  const QRgb Whole = Draw().pixel( Bone );
  const auto Half = []( QRgb i_A, QRgb i_B )
  {
    return qRgb( ( qRed( i_A ) + qRed( i_B ) ) / 2, ( qGreen( i_A ) + qGreen( i_B ) ) / 2,
                 ( qBlue( i_A ) + qBlue( i_B ) ) / 2 );
  };
  ASSERT_GT( Distance( Whole, Background ), 40 );
  // A solved bone somewhere else, and its switches.
  AddPerson( Group( Solved ), { -4000, 4000, 0 }, 0xFFFFFFFF );
  Options().SolvingSubject.Bones = true;
  EXPECT_LE( Distance( Draw().pixel( Bone ), Half( Whole, Background ) ), 3 );
  EXPECT_EQ( pScene->Count( Subjects, ESubjectBones ), 3u );
  Options().SolvingSubject.Enabled = false;
  EXPECT_EQ( Draw().pixel( Bone ), Whole );

  // Behind a wall of a sphere.
  const VBonePose& rPose = Group().Poses[1];
  const QVector3D Place( rPose[3], rPose[7], rPose[11] ), Eye = pFrame->Context()->CameraPosition();
  const QVector3D Before = Place + ( Eye - Place ).normalized() * 2500;
  pScene->Change( { { Before.x(), Before.y(), Before.z(), 700 } } );
  Options().ReconstructedRadius = true;
  const QRgb Wall = Draw().pixel( Bone );
  EXPECT_GT( Distance( Wall, Whole ), 40 );
  Labelling().SkinXRay = true;
  EXPECT_LE( Distance( Draw().pixel( Bone ), Half( Whole, Wall ) ), 3 );
}

TEST_F( VSubjectTest, OutlinesTellTheCurrentTheSelectedAndTheOneUnderThePointer )
{
  SpreadOut();
  Options().HighlightCurrentSubject = false;
  // Something is selected, though nothing here.
  pScene->Select( { { ZEK::ESelectDevice, "elsewhere", 0, 0 } } );
  const QImage Plain = Draw();
  VSubjectGroup& rGroup = Group();
  const auto Added = [&]( std::uint32_t i_Id )
  {
    const QImage Image = Draw();
    QVector3D Sum;
    const QPoint At = Along( i_Id )[30].toPoint();
    for ( int Y = -14; Y <= 14; ++Y )
    {
      for ( int X = -14; X <= 14; ++X )
      {
        const QRgb After = Image.pixel( At + QPoint( X, Y ) ), Before = Plain.pixel( At + QPoint( X, Y ) );
        Sum += QVector3D( float( qRed( After ) - qRed( Before ) ), float( qGreen( After ) - qGreen( Before ) ),
                          float( qBlue( After ) - qBlue( Before ) ) );
      }
    }
    return Sum;
  };
  Input().PreselectColour = 3;
  const std::pair< VSubjectIds*, std::size_t > Kinds[] = {
      { &rGroup.MarkerIds, rGroup.Markers.size() }, { &rGroup.StickIds, 3 }, { &rGroup.BoneIds, 3 } };
  for ( const auto& [pIds, Count] : Kinds )
  {
    const std::uint32_t Id = pIds->First + 1;
    SCOPED_TRACE( Id );
    const auto Mark = [&, pOf = pIds, All = Count]( std::uint8_t i_Flags )
    {
      pOf->Flags.assign( All, 0 );
      pOf->Flags[1] = i_Flags;
      ++pOf->Generation;
    };
    Mark( CoreGraphics::EInstanceSelected );
    const QVector3D White = Added( Id );
    EXPECT_GT( White.x(), 1000 );
    EXPECT_GT( White.z(), 0.7f * White.x() );
    Mark( CoreGraphics::EInstanceSelected | CoreGraphics::EInstancePrimary );
    const QVector3D Primary = Added( Id );
    EXPECT_GT( Primary.x(), 1000 );
    EXPECT_LT( Primary.z(), 0.4f * Primary.x() ) << "orange adds no blue";
    Mark( CoreGraphics::EInstancePreselected );
    const QVector3D Under = Added( Id );
    EXPECT_GT( Under.z() - Under.x(), White.z() - White.x() + 100 ) << "cyan";
    // A still frame draws its mask from what it holds.
    EXPECT_GT( pFrame->Figures().BytesUploaded, 0u );
    Draw();
    EXPECT_EQ( pFrame->Figures().BytesUploaded, 0u );
    Mark( 0 );
    EXPECT_EQ( Draw(), Plain );
  }
  // The current subject: its parts are hatched, or nothing is.
  rGroup.Records[0].Flags = CoreGraphics::EInstanceSelected | CoreGraphics::EInstancePrimary;
  ++rGroup.RecordGeneration;
  EXPECT_EQ( Draw(), Plain );
  Options().HighlightCurrentSubject = true;
  for ( const std::uint32_t Id : { rGroup.MarkerIds.First, rGroup.StickIds.First + 2, rGroup.BoneIds.First } )
  {
    EXPECT_GT( Added( Id ).x(), 1000 ) << Id;
    EXPECT_LT( Added( Id ).z(), 0.4f * Added( Id ).x() ) << Id;
  }
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
