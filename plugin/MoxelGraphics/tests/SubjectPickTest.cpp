#include "SubjectFixture.h"

#include <random>

// What of subjects a pointer finds, and how what is marked looks.

namespace MoxelGraphics
{

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

} // namespace MoxelGraphics
