#include "SceneStage.h"

#include <CoreMoxelTypes/FlowTypes.h>
#include <HostFlow/VFlowFramework.h>
#include <TestSupport/Golden.h>

#include <QtGui/QPainter>

#include <gmock/gmock.h>

#include <set>

using namespace HostWindow;

namespace
{
const QStringList Blocks{ "LabellingSubject", "SolvingSubject", "RetargetingSubject", "PropSubject", "SceneMesh" };

/// A switch, and the count that it names.
struct VSwitch
{
  const char* pName;
  const char* pCount;
};
const VSwitch Switches[] = { { "Axes", "axes" },         { "Bones", "bones" },
                             { "Markers", "markers" },   { "Sticks", "sticks" },
                             { "Joints", "joints" },     { "MissingMarkers", "missingMarkers" },
                             { "Origins", "origins" },   { "SticksDuringGaps", "sticks" },
                             { "Targets", "targets" },   { "TargetCovariances", "covariances" },
                             { "Clusters", "clusters" }, { "Skin", "skins" },
                             { "SkinXRay", "skins" } };

/// Both performers with their second skeletons and characters, some of their markers lost, before an empty room.
class VSubjectPictures : public testing::Test
{
protected:
  static void SetUpTestSuite()
  {
    VCommonOptions Options;
    Options.Simulated.Cameras = 0;
    Options.Simulated.bForcePlates = false;
    Options.Simulated.GapProbability = 0.15;
    Options.Simulated.bSolving = Options.Simulated.bRetargeting = true;
    s_pStage = std::make_unique< VSceneStage >( Options, Seconds );
  }
  static void TearDownTestSuite() { s_pStage.reset(); }
  void SetUp() override
  {
    Open( "3d" );
    ASSERT_EQ( Stage().Wrong(), "" );
    // Ben fills the view.
    Stage().Select( "@subject/2/0/Ben" );
    EXPECT_TRUE( Stage().View().ExecuteCommand( "Workspace3d:FrameSelected" ) );
    Stage().Wheel( 3 );
    Stage().Select( "" );
  }
  static void Open( const std::string& i_rKind )
  {
    Stage().Open( i_rKind, { 480, 270 } );
    if ( !Stage().Wrong().empty() )
    {
      return;
    }
    for ( const char* pKey : { "FloorGrid", "GlobalAxis", "ReconstructionVolume", "Reconstructions", "SubjectNames",
                               "HighlightCurrentSubject", "ActiveLabelHalo" } )
    {
      Stage().Set( pKey, false );
    }
    for ( const QString& rBlock : Blocks )
    {
      SetBlock( rBlock, { "Enabled" } );
    }
  }

  static VSceneStage& Stage() { return *s_pStage; }
  /// Of a block, these are on and all others off.
  static void SetBlock( const QString& i_rBlock, const QStringList& i_rOn )
  {
    Stage().Set( i_rBlock + "-Enabled", i_rOn.contains( "Enabled" ) );
    for ( const VSwitch& rSwitch : Switches )
    {
      Stage().Set( i_rBlock + "-" + rSwitch.pName, i_rOn.contains( rSwitch.pName ) );
    }
  }
  /// The picture with these of one block alone.
  static QImage Only( const QString& i_rBlock, QStringList i_On )
  {
    for ( const QString& rBlock : Blocks )
    {
      SetBlock( rBlock, {} );
    }
    SetBlock( i_rBlock, i_On << "Enabled" );
    return Stage().Picture();
  }
  static QVariantMap Counts() { return Stage().View().FrameReport().value( "subjects" ).toMap(); }
  /// Takes the counts of one name out of what belongs to a block, and gives their sum.
  static int TakeCount( QVariantMap& io_rCounts, const QString& i_rBlock, const char* i_pCount )
  {
    int Sum = 0;
    QVariantMap Kinds = io_rCounts[i_rBlock].toMap();
    for ( QVariant& rKind : Kinds )
    {
      QVariantMap Values = rKind.toMap();
      EXPECT_TRUE( Values.contains( i_pCount ) ) << i_pCount;
      Sum += Values.take( i_pCount ).toInt();
      rKind = Values;
    }
    io_rCounts[i_rBlock] = Kinds;
    return Sum;
  }

  static constexpr double Seconds = 1.1;

private:
  static inline std::unique_ptr< VSceneStage > s_pStage;
};

/// What the state itself says of its labelled subjects.
QMap< QString, int > LabelledCounts( const VCommonOptions& i_rOptions, double i_Seconds )
{
  HostSources::VSimulatedCapture Capture( i_rOptions.Simulated );
  ZEK::VFlowStateRef State;
  EXPECT_TRUE( Capture
                   .MakeState( std::llround( i_Seconds * Capture.RateHz() ),
                               { HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 1 }, State )
                   .IsOk() );
  ZEK::VFlowItemRef Labels, First, Looks;
  State->FindItem( Labels, 0x100f, ZEK::EFlowTimeMatch::Overlap );
  State->FindItem( First, 0x1012, ZEK::EFlowTimeMatch::Overlap );
  State->FindItem( Looks, 0x1013, ZEK::EFlowTimeMatch::Overlap );
  const auto* pLabels = ZEK::FlowPayload< CoreMoxelTypes::VReconstructionLabelSet >( Labels.Get() );
  const auto* pFirst = ZEK::FlowPayload< CoreMoxelTypes::VSubject >( First.Get() );
  const auto* pLooks = ZEK::FlowPayload< CoreMoxelTypes::VSubjectApplicationData >( Looks.Get() );
  if ( !pLabels || !pFirst || !pLooks )
  {
    ADD_FAILURE() << "the capture has no subjects";
    return {};
  }
  std::set< std::pair< std::uint32_t, std::uint32_t > > Seen;
  for ( const auto& rLabel : pLabels->Labels )
  {
    if ( rLabel.SubjectId <= 2 )
    {
      Seen.insert( { rLabel.SubjectId, rLabel.MarkerId } );
    }
  }
  int Whole = 0;
  for ( const std::uint32_t Subject : { 1u, 2u } )
  {
    for ( const auto& rStick : pLooks->Sticks )
    {
      Whole += Seen.contains( { Subject, rStick.A } ) && Seen.contains( { Subject, rStick.B } ) ? 1 : 0;
    }
  }
  const auto Bones = std::count_if( pFirst->Segments.begin(), pFirst->Segments.end(),
                                    []( const CoreMoxelTypes::VSegment& i_rSegment )
                                    {
                                      return i_rSegment.BoneLength > 0;
                                    } );
  // Both performers are of one make.
  const int Markers = 2 * static_cast< int >( pFirst->Markers.size() ), Found = static_cast< int >( Seen.size() ),
            Segments = 2 * static_cast< int >( pFirst->Segments.size() );
  return { { "Axes", Segments },   { "Bones", 2 * static_cast< int >( Bones ) },
           { "Markers", Found },   { "Sticks", Whole },
           { "Joints", Segments }, { "MissingMarkers", Markers - Found },
           { "Origins", 2 },       { "SticksDuringGaps", 2 * static_cast< int >( pLooks->Sticks.size() ) },
           { "Targets", Markers }, { "TargetCovariances", Markers },
           { "Clusters", Found },  { "Skin", 2 },
           { "SkinXRay", 2 } };
}

/// Half way from one colour to the other.
bool IsBetween( QRgb i_Colour, QRgb i_A, QRgb i_B )
{
  const auto IsHalf = []( int i_Part, int i_First, int i_Second )
  {
    return std::abs( 2 * i_Part - i_First - i_Second ) <= 6;
  };
  return IsHalf( qRed( i_Colour ), qRed( i_A ), qRed( i_B ) ) &&
         IsHalf( qGreen( i_Colour ), qGreen( i_A ), qGreen( i_B ) ) &&
         IsHalf( qBlue( i_Colour ), qBlue( i_A ), qBlue( i_B ) );
}

QRect Changed( const VMask& i_rMask )
{
  QRect Rect;
  for ( int Y = 0; Y < i_rMask.Size().height(); ++Y )
  {
    for ( int X = 0; X < i_rMask.Size().width(); ++X )
    {
      Rect = i_rMask.At( X, Y ) ? Rect.united( { X, Y, 1, 1 } ) : Rect;
    }
  }
  return Rect;
}
} // namespace

TEST_F( VSubjectPictures, EachSwitchChangesTheCountThatItNamesAndNothingElse )
{
  const QMap< QString, int > Labelled = LabelledCounts( Stage().Session().Options(), Seconds );
  ASSERT_GT( Labelled["MissingMarkers"], 4 );
  ASSERT_GT( Labelled["SticksDuringGaps"], Labelled["Sticks"] );
  const QStringList Usual{ "Enabled", "Bones", "Markers", "Sticks", "MissingMarkers", "Origins", "Clusters" };
  for ( const QString& rBlock : Blocks )
  {
    SetBlock( rBlock, Usual );
  }
  Stage().Settle();
  for ( const QString& rBlock : Blocks )
  {
    for ( const VSwitch& rSwitch : Switches )
    {
      SCOPED_TRACE( ( rBlock + "-" + rSwitch.pName ).toStdString() );
      const QString Key = rBlock + "-" + rSwitch.pName;
      const bool bUsual = Usual.contains( rSwitch.pName );
      QVariantMap Before = Counts();
      Stage().Set( Key, !bUsual );
      Stage().Settle();
      QVariantMap After = Counts();
      const int Off = TakeCount( bUsual ? After : Before, rBlock, rSwitch.pCount );
      const int On = TakeCount( bUsual ? Before : After, rBlock, rSwitch.pCount );
      EXPECT_EQ( Before, After ) << "another count changed";
      if ( rBlock == "LabellingSubject" )
      {
        EXPECT_EQ( On, Labelled[rSwitch.pName] );
        EXPECT_EQ( Off, QString( rSwitch.pName ) == "SticksDuringGaps" ? Labelled["Sticks"] : 0 );
      }
      Stage().Set( Key, bUsual );
      Stage().Settle();
    }
    QVariantMap Others = Counts();
    Others.remove( rBlock );
    Stage().Set( rBlock + "-Enabled", false );
    Stage().Settle();
    QVariantMap Hidden = Counts();
    for ( const VSwitch& rSwitch : Switches )
    {
      EXPECT_EQ( TakeCount( Hidden, rBlock, rSwitch.pCount ), 0 ) << rSwitch.pName;
      Hidden = Counts();
    }
    Hidden.remove( rBlock );
    EXPECT_EQ( Hidden, Others );
    Stage().Set( rBlock + "-Enabled", true );
    Stage().Settle();
  }
}

TEST_F( VSubjectPictures, EachSwitchChangesThePictureWhereItsSubjectsAre )
{
  // The prop is out of sight, and there are no meshes of scenes.
  for ( const char* pBlock : { "LabellingSubject", "SolvingSubject", "RetargetingSubject" } )
  {
    const QImage Empty = Only( pBlock, {} );
    const QRect Body = Changed( VMask( Only( pBlock, { "Skin", "Bones", "Targets", "Joints" } ), Empty ) );
    ASSERT_GT( Body.height(), 100 );
    for ( const VSwitch& rSwitch : Switches )
    {
      SCOPED_TRACE( std::string( pBlock ) + "-" + rSwitch.pName );
      const QStringList Beside{ QString( rSwitch.pName ) == "SticksDuringGaps" ? "Sticks" : "" };
      const QImage Without = Only( pBlock, Beside );
      QVariantMap Counted = Counts();
      const int Off = TakeCount( Counted, pBlock, rSwitch.pCount );
      const QImage With = Only( pBlock, Beside + QStringList{ rSwitch.pName } );
      Counted = Counts();
      const int On = TakeCount( Counted, pBlock, rSwitch.pCount );
      const QRect Found = Changed( VMask( With, Without ) );
      EXPECT_EQ( !Found.isEmpty(), On > Off ) << On << " against " << Off;
      EXPECT_TRUE( Found.isEmpty() || Body.adjusted( -8, -8, 8, 8 ).contains( Found ) );
    }
    Stage().Set( QString( pBlock ) + "-Enabled", false );
    EXPECT_EQ( Stage().Picture(), Empty );
  }
}

TEST_F( VSubjectPictures, LookAsKept )
{
  const QStringList Points{ "Markers", "Sticks" }, Inner{ "Markers", "Bones", "Joints", "Axes" };
  EXPECT_TRUE( TestSupport::MatchesGolden( Only( "LabellingSubject", Points ), "performer-sticks" ) );
  EXPECT_TRUE( TestSupport::MatchesGolden( Only( "LabellingSubject", Inner ), "performer-bones" ) );
  EXPECT_TRUE(
      TestSupport::MatchesGolden( Only( "LabellingSubject", { "Sticks", "SticksDuringGaps", "MissingMarkers", "Targets",
                                                              "TargetCovariances", "Clusters", "Origins" } ),
                                  "performer-model" ) );
  EXPECT_TRUE( TestSupport::MatchesGolden( Only( "LabellingSubject", Inner + QStringList{ "Skin", "Sticks" } ),
                                           "performer-skin" ) );
  EXPECT_TRUE(
      TestSupport::MatchesGolden( Only( "LabellingSubject", { "Bones", "Skin", "SkinXRay" } ), "performer-x-ray" ) );
}

TEST_F( VSubjectPictures, LabelledBonesAreHalfThereBesideSolvedOnes )
{
  // Each kind in a pose of its own.
  Open( "subject" );
  ASSERT_EQ( Stage().Wrong(), "" );
  Stage().Wheel( 5 );
  const QStringList Poses = Stage().View().FrameReport()["subjectScene"].toMap()["poses"].toStringList();
  Stage().View().SetPoses( 0, static_cast< int >( Poses.indexOf( "T-pose" ) ),
                           static_cast< int >( Poses.indexOf( "Crouch" ) ) );
  const QImage Empty = Only( "LabellingSubject", {} ), Labelled = Only( "LabellingSubject", { "Bones" } ),
               Solved = Only( "SolvingSubject", { "Bones" } );
  SetBlock( "LabellingSubject", { "Enabled", "Bones" } );
  const QImage Both = Stage().Picture();
  EXPECT_TRUE( TestSupport::MatchesGolden( Both, "performer-solving" ) );
  const VMask OfLabelled( Labelled, Empty ), OfSolved( Solved, Empty );
  int Alone = 0, Between = 0;
  for ( int Y = 0; Y < Both.height(); ++Y )
  {
    for ( int X = 0; X < Both.width(); ++X )
    {
      if ( OfLabelled.At( X, Y ) && !OfSolved.At( X, Y ) )
      {
        ++Alone;
        // Where a bone lies over another one it is blended twice.
        Between += IsBetween( Both.pixel( X, Y ), Labelled.pixel( X, Y ), Empty.pixel( X, Y ) ) ? 1 : 0;
      }
    }
  }
  EXPECT_GT( Alone, 100 );
  EXPECT_GT( Between, 0.8 * Alone );
  Stage().Set( "SolvingSubject-Enabled", false );
  EXPECT_EQ( Stage().Picture(), Labelled );
}

TEST_F( VSubjectPictures, ClicksSelectBonesMarkersAndSticksAndOutlinesTellThemApart )
{
  const QImage Empty = Only( "LabellingSubject", {} );
  const VMask Bones( Only( "LabellingSubject", { "Bones" } ), Empty ),
      Markers( Only( "LabellingSubject", { "Markers" } ), Empty ),
      Sticks( Only( "LabellingSubject", { "Sticks" } ), Empty );
  const QImage Plain = Only( "LabellingSubject", { "Bones", "Markers", "Sticks" } );
  const auto Click = [&]( QPoint i_At )
  {
    Stage().Do( VClickAction{ i_At } );
    return Stage().Selected();
  };
  const QPoint Stick = Sticks.Deepest( { &Bones, &Markers }, 3 ), Marker = Markers.Deepest( { &Bones }, 4 );
  const std::vector< QPoint > Bone = Bones.DeepestApart( { &Markers, &Sticks }, 3, 3, 40 );
  ASSERT_EQ( Bone.size(), 3u );
  for ( const auto& [At, Kind] :
        { std::pair{ Stick, ZEK::ESelectSubject }, { Marker, ZEK::ESelectMarker }, { Bone[0], ZEK::ESelectSegment } } )
  {
    const ZEK::VSelection Found = Click( At );
    ASSERT_EQ( Found.size(), 1u ) << "kind " << Kind << " at " << At.x() << ", " << At.y();
    EXPECT_EQ( Found[0].Kind, Kind );
    const std::string Name = At.x() < 330 ? "Ben" : "Ada";
    EXPECT_TRUE( Found[0].Device.starts_with( Name ) ) << Found[0].Device << " at " << At.x();
  }
  // One bone is selected, the next is the current one, and the pointer is over the third.
  Stage().Do( VClickAction{ Bone[1] }, Qt::ShiftModifier );
  EXPECT_EQ( Stage().Selected().size(), 2u );
  Stage().Do( VHoverAction{ Bone[2] } );
  const QImage Seen = Stage().Picture();
  QImage Kept = Seen;
  QPainter( &Kept ).fillRect( QRect( Bone[2] + QPoint( 8, 8 ), QSize( 160, 40 ) ), Qt::black ); // the name beside it
  EXPECT_TRUE( TestSupport::MatchesGolden( Kept, "performer-selected" ) );
  const auto Added = [&]( QPoint i_At )
  {
    const QRgb A = Seen.pixel( i_At ), B = Plain.pixel( i_At );
    return std::array{ qRed( A ) - qRed( B ), qGreen( A ) - qGreen( B ), qBlue( A ) - qBlue( B ) };
  };
  const auto IsNear = [&]( int i_Red, int i_Green, int i_Blue )
  {
    return testing::ElementsAre( testing::AllOf( testing::Ge( i_Red - 3 ), testing::Le( i_Red + 3 ) ),
                                 testing::AllOf( testing::Ge( i_Green - 3 ), testing::Le( i_Green + 3 ) ),
                                 testing::AllOf( testing::Ge( i_Blue - 3 ), testing::Le( i_Blue + 3 ) ) );
  };
  EXPECT_THAT( Added( Bone[0] ), IsNear( 64, 64, 64 ) );
  EXPECT_THAT( Added( Bone[2] ), IsNear( 64, 32, 0 ) );
  int Hatched = 0, Left = 0;
  for ( int Step = -3; Step <= 3; ++Step )
  {
    const int Blue = Added( Bone[1] + QPoint( Step, 0 ) )[0];
    Hatched += Blue > 60 ? 1 : 0;
    Left += std::abs( Blue ) < 30 ? 1 : 0;
  }
  EXPECT_TRUE( Hatched > 0 && Left > 0 ) << Hatched << " and " << Left;
  Stage().Do( VHoverAction{ { 2, 2 } } );
  Click( { 2, 2 } );
  EXPECT_EQ( Stage().Picture(), Plain );
}
