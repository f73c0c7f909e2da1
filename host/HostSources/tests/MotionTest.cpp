#include "OsimFunction.h"
#include "ReadHelpers.h"
#include "RecordingPlayer.h"

#include <HostSources/VMotionReader.h>

#include <cmath>
#include <fstream>
#include <map>
#include <sstream>

namespace HostSources
{
namespace
{
using namespace CoreMoxelTypes;
const ZEK::IResult Ok = ZEK::IResult::Ok;

/// A trunk that goes along x and turns about z, an arm whose elbow follows the shoulder and slides out as it bends.
const std::string Model = R"(<?xml version="1.0"?>
<!-- <deep> --><OpenSimDocument Version="40000"><Model name="Two bars"><gravity>0 0 -9.8</gravity>
<BodySet><objects><Body name="arm"><mass_center>0 -.1 0</mass_center></Body><Body name="trunk"/></objects></BodySet>
<JointSet><objects>
<UniversalJoint name="shoulder"><socket_parent_frame>on_trunk</socket_parent_frame>
<socket_child_frame>/bodyset/arm</socket_child_frame>
<coordinates><Coordinate name="swing"><default_value>0</default_value></Coordinate><Coordinate name="tilt"/></coordinates>
<frames><PhysicalOffsetFrame name="on_trunk"><socket_parent>/bodyset/trunk</socket_parent>
<translation>0 .5 0</translation><orientation>0 0 1.5707963267948966</orientation></PhysicalOffsetFrame></frames>
</UniversalJoint>
<CustomJoint name="hip"><socket_parent_frame>/ground</socket_parent_frame>
<socket_child_frame>/bodyset/trunk</socket_child_frame>
<coordinates><Coordinate name="turn"/><Coordinate name="way"/></coordinates>
<SpatialTransform>
<TransformAxis name="rotation1"><coordinates>turn</coordinates><axis>0 0 2</axis>
<LinearFunction><coefficients>1 0</coefficients></LinearFunction></TransformAxis>
<TransformAxis name="translation1"><coordinates>way</coordinates><axis>1 0 0</axis>
<MultiplierFunction><function><PolynomialFunction><coefficients>1 0 0</coefficients></PolynomialFunction></function>
<scale>2</scale></MultiplierFunction></TransformAxis>
</SpatialTransform></CustomJoint></objects></JointSet>
<ConstraintSet><objects><CoordinateCouplerConstraint name="c"><isEnforced>true</isEnforced>
<coupled_coordinates_function><LinearFunction><coefficients>-1 0</coefficients></LinearFunction>
</coupled_coordinates_function><independent_coordinate_names>turn</independent_coordinate_names>
<dependent_coordinate_name>tilt</dependent_coordinate_name><scale_factor>1</scale_factor>
</CoordinateCouplerConstraint></objects></ConstraintSet>
<MarkerSet><objects><Marker name="tip"><socket_parent_frame>/bodyset/arm</socket_parent_frame>
<location>0 -.2 0</location></Marker><Marker name="far"><socket_parent_frame>/ground</socket_parent_frame>
<location>0 0 0</location></Marker></objects></MarkerSet></Model></OpenSimDocument>
)";
const std::string Motion = "made\nnRows=2\nnColumns=5\ninDegrees=yes\nendheader\n"
                           "time\tturn\tway\ttilt\tmuscle/activation\n"
                           "0.5 90 1 77 nan\n0.51 0 0.5 77 0\n";

std::string With( std::string i_Text, const std::string& i_rOld, const std::string& i_rNew )
{
  const std::size_t At = i_Text.find( i_rOld );
  EXPECT_NE( At, std::string::npos ) << i_rOld;
  return i_Text.replace( At, i_rOld.size(), i_rNew );
}

VOutcome Read( const std::string& i_rMotion, const std::string& i_rModel = Model )
{
  VOutcome Outcome;
  Outcome.Result =
      ReadMotion( Bytes( i_rMotion ), "made.mot", Bytes( i_rModel ), "made.osim", Outcome.Recording, Outcome.Message );
  return Outcome;
}

using VTable = std::map< std::string, std::vector< double > >;

/// Columns by name.
VTable ReadSegments( const std::filesystem::path& i_rFile )
{
  std::ifstream Stream( i_rFile );
  VTable Table;
  std::vector< std::string > Names;
  for ( std::string Line; std::getline( Stream, Line ); )
  {
    std::replace( Line.begin(), Line.end(), ',', ' ' );
    std::istringstream Words( Line );
    std::string Word;
    for ( std::size_t Index = 0; Words >> Word; )
    {
      if ( Line.starts_with( '#' ) )
      {
        Names.insert( Names.end(), Word == "#" ? 0u : 1u, Word );
      }
      else
      {
        Table[Names.at( Index++ )].push_back( std::stod( Word ) );
      }
    }
  }
  return Table;
}

/// Rz Ry Rx of the table, whose axes are x, -z, y of the model.
std::array< double, 9 > TurnOf( double i_X, double i_Y, double i_Z )
{
  const double Cx = std::cos( i_X ), Sx = std::sin( i_X ), Cy = std::cos( i_Y ), Sy = std::sin( i_Y ),
               Cz = std::cos( i_Z ), Sz = std::sin( i_Z );
  const std::array< double, 9 > R{ Cz * Cy,
                                   Cz * Sy * Sx - Sz * Cx,
                                   Cz * Sy * Cx + Sz * Sx,
                                   Sz * Cy,
                                   Sz * Sy * Sx + Cz * Cx,
                                   Sz * Sy * Cx - Cz * Sx,
                                   -Sy,
                                   Cy * Sx,
                                   Cy * Cx };
  return { R[0], R[1], R[2], R[6], R[7], R[8], -R[3], -R[4], -R[5] };
}
} // namespace

TEST( Motion, BodiesOfTheRealModelStandWhereTheTableHasThem )
{
  HARROW_NEEDS_RECORDINGS();
  const VRecording Recording = Real( "fk-fullbody/motion.mot" );
  const VTable Table = ReadSegments( TestSupport::RecordingsDir() / "fk-fullbody/segments.csv" );
  ASSERT_EQ( Table.size(), 181u );
  EXPECT_EQ( Recording.FrameCount, 100 );
  EXPECT_EQ( Recording.RateHz, 60 );
  EXPECT_EQ( Recording.UpAxis, EUpAxis::Y );
  ASSERT_EQ( Recording.Skeletons.size(), 1u );
  const VRecordingSkeleton& rSkeleton = Recording.Skeletons[0];
  EXPECT_EQ( rSkeleton.JointCount, 30u );
  EXPECT_EQ( rSkeleton.ChannelCount, 62u );
  EXPECT_EQ( rSkeleton.Subject.Markers.size(), 21u );
  const auto& rSegments = rSkeleton.Subject.Segments;
  VRecordingPlayer Player( Recording );
  double WorstTurn = 0, WorstPlace = 0, WorstBone = 0;
  for ( std::int64_t Frame = 0; Frame < 100; ++Frame )
  {
    Player.Show( Frame );
    const auto& rPoses = Player.Value< FlowSubjectDynamicParameters >().Segments;
    ASSERT_EQ( rPoses.size(), rSegments.size() );
    for ( std::size_t Index = 0; Index < rSkeleton.JointCount; ++Index )
    {
      const std::string& rName = rSegments[Index].Name;
      const auto At = [&]( const char* i_pColumn )
      {
        return Table.at( rName + i_pColumn ).at( static_cast< std::size_t >( Frame ) );
      };
      const double* T = rPoses[Index].T;
      WorstPlace = std::max(
          WorstPlace, std::hypot( T[0] - 1000 * At( "_x" ), T[1] - 1000 * At( "_z" ), T[2] + 1000 * At( "_y" ) ) );
      const auto Turn = TurnOf( At( "_rotx" ), At( "_roty" ), At( "_rotz" ) );
      for ( std::size_t Entry = 0; Entry < 9; ++Entry )
      {
        WorstTurn = std::max( WorstTurn, std::abs( rPoses[Index].R[Entry] - Turn[Entry] ) );
      }
    }
    for ( std::size_t Index = rSkeleton.JointCount; Index < rPoses.size(); ++Index )
    {
      // A bone ends where the next begins, but for joints that shift as they turn.
      const VSegment& rBone = rSegments[Index];
      const std::string To = rBone.Name.substr( rBone.Name.find( " to " ) + 4 );
      const auto Next =
          std::find_if( rSegments.begin() + static_cast< std::ptrdiff_t >( rSkeleton.JointCount ), rSegments.end(),
                        [&]( const VSegment& i_rSegment )
                        {
                          return i_rSegment.Name.starts_with( To + " to " );
                        } );
      EXPECT_TRUE( Next != rSegments.end() || To == "its centre" || To == "its markers" ) << rBone.Name;
      if ( Next == rSegments.end() || To.starts_with( "patella" ) )
      {
        continue;
      }
      const Rigid& rPose = rPoses[Index];
      const Rigid& rNext = rPoses[static_cast< std::size_t >( Next - rSegments.begin() )];
      const auto Length = static_cast< double >( rBone.BoneLength );
      WorstBone = std::max( WorstBone, std::hypot( rPose.T[0] + Length * rPose.R[0] - rNext.T[0],
                                                   rPose.T[1] + Length * rPose.R[3] - rNext.T[1],
                                                   rPose.T[2] + Length * rPose.R[6] - rNext.T[2] ) );
    }
  }
  EXPECT_LE( WorstPlace, 1e-3 );
  EXPECT_LE( WorstTurn, 1e-6 );
  EXPECT_LE( WorstBone, 12 );
  std::printf( "30 bodies over 100 frames: off by at most %.2g mm and %.2g in a rotation's entries; bones end %.2g mm "
               "off the next at most\n",
               WorstPlace, WorstTurn, WorstBone );
}

TEST( Motion, JointsCouplingsAndMarkersFollowTheModel )
{
  const VOutcome Outcome = Read( Motion );
  ASSERT_EQ( Outcome.Result, Ok ) << Outcome.Message;
  EXPECT_EQ( Outcome.Recording.RateHz, 100 );
  EXPECT_EQ( Outcome.Recording.UpAxis, EUpAxis::Z );
  EXPECT_THAT( Outcome.Recording.Notes, testing::UnorderedElementsAre(
                                            "Coordinates without a column stand as the model has them: swing.",
                                            "Columns that are no coordinates of the model were left out: "
                                            "muscle/activation.",
                                            "Markers of the model that are on none of its bodies were left out: 1." ) );
  const VRecordingSkeleton& rSkeleton = Outcome.Recording.Skeletons.at( 0 );
  const auto& rSegments = rSkeleton.Subject.Segments;
  ASSERT_EQ( rSegments.size(), 4u );
  EXPECT_EQ( rSkeleton.JointCount, 2u );
  EXPECT_EQ( rSkeleton.Subject.Name, "Two bars" );
  EXPECT_EQ( rSegments[0].Joint, EJointType::Free );
  EXPECT_EQ( rSegments[1].Joint, EJointType::Ball ) << "a joint that only turns";
  EXPECT_EQ( rSegments[2].Name, "trunk to arm" );
  EXPECT_FLOAT_EQ( rSegments[2].BoneLength, 500 );
  EXPECT_EQ( rSegments[3].Name, "arm to its markers" );
  EXPECT_FLOAT_EQ( rSegments[3].BoneLength, 200 );
  VRecordingPlayer Player( Outcome.Recording );
  Player.Show( 0 );
  const auto Near = []( const D3& i_rPlace, double i_X, double i_Y, double i_Z )
  {
    EXPECT_NEAR( i_rPlace.x, i_X, 1e-9 );
    EXPECT_NEAR( i_rPlace.y, i_Y, 1e-9 );
    EXPECT_NEAR( i_rPlace.z, i_Z, 1e-9 );
  };
  Near( Player.Joint( "trunk" ), 2000, 0, 0 );
  Near( Player.Joint( "arm" ), 1500, 0, 0 );
  const auto& rMoves = Player.Value< FlowSubjectDynamicParameters >();
  EXPECT_NEAR( rMoves.Segments[1].R[6], 1, 1e-12 ) << "the tilt follows the turn, whatever its column says";
  ASSERT_EQ( rMoves.MarkerPositions.size(), 1u );
  Near( rMoves.MarkerPositions[0], 1500, 200, 0 );
  EXPECT_EQ( rMoves.MarkerVisible, std::vector< u8 >{ 1 } );
  EXPECT_EQ( Player.Value< FlowSubjectApplicationData >().MarkerColours.size(), 1u );
  EXPECT_FALSE( Player.Item< FlowReconstructionSet >() ) << "nothing was measured";
  Player.Show( 1 );
  Near( Player.Value< FlowSubjectDynamicParameters >().MarkerPositions.at( 0 ), 700, 500, 0 );
  const VOutcome Radians = Read( With( Motion, "inDegrees=yes", "inDegrees=no" ) );
  EXPECT_NEAR( Radians.Recording.Skeletons.at( 0 ).States[2], std::remainder( 90, 2 * std::acos( -1.0 ) ), 1e-12 );
  const VOutcome Paths = Read( With( Motion, "\tturn\t", "\t/jointset/hip/turn/value\t" ) );
  EXPECT_EQ( Paths.Recording.Skeletons.at( 0 ).States, rSkeleton.States );
  const std::string Text = DescribeRecording( Outcome.Recording ).Text();
  EXPECT_THAT( Text, testing::HasSubstr( "Two bars, 2 joints, 2 bones, 0 end sites, 3 channels, 9 degrees of freedom, "
                                         "1 markers, 2 poses" ) );
}

TEST( Motion, FunctionsGoThroughTheirPointsAndStraightOnBeyond )
{
  const auto Value = []( const char* i_pXml, double i_At )
  {
    const Xml::VDocument Document( Bytes( i_pXml ) );
    return Osim::VFunction::Read( Document.Root(), 1, "a test" ).Value( std::array{ i_At } );
  };
  // The spline's ends are those of cubics, so that it is one where its points lie on one.
  const char* pCubic = "<SimmSpline><x>-1 0 2 3 5</x><y>-1 0 8 27 125</y></SimmSpline>";
  for ( const double At : { -1.0, -0.5, 0.0, 1.0, 2.5, 4.0, 5.0 } )
  {
    EXPECT_NEAR( Value( pCubic, At ), At * At * At, 1e-12 ) << At;
  }
  EXPECT_NEAR( Value( pCubic, 6 ), 125 + 75, 1e-11 );
  EXPECT_NEAR( Value( pCubic, -3 ), -1 - 2 * 3, 1e-12 );
  const char* pPieces = "<PiecewiseLinearFunction><x>0 1 3</x><y>0 2 0</y></PiecewiseLinearFunction>";
  for ( const auto& [At, Expected] : { std::pair( -1.0, -2.0 ), { 0.5, 1.0 }, { 2.0, 1.0 }, { 4.0, -1.0 } } )
  {
    EXPECT_DOUBLE_EQ( Value( pPieces, At ), Expected ) << At;
  }
  EXPECT_DOUBLE_EQ( Value( "<NaturalCubicSpline><x>0 2</x><y>0 1</y></NaturalCubicSpline>", 1 ), 0.5 );
}

TEST( Motion, DamagedFilesGiveTheirWholeRowsOrAReason )
{
  struct VCase
  {
    std::string Motion, Model;
    ZEK::IResult::ECode Code;
    const char* pMessage;
  };
  using enum ZEK::IResult::ECode;
  std::string Deep;
  for ( int Level = 0; Level < 100000; ++Level )
  {
    Deep += "<a b='>'>";
  }
  // A quote in a name hides nothing.
  const std::string Quotes[] = { "<a\"" + Deep, "<a=\"x></a=\"x>" + Deep, "<a x\"='1'>" + Deep };
  std::string Far = With( Motion, "0.5 90 1", "0.5 90 1e9" );
  const std::string Tilt = "<dependent_coordinate_name>tilt</dependent_coordinate_name>",
                    Turn = "<dependent_coordinate_name>turn</dependent_coordinate_name>";
  const VCase Cases[] = {
      { "", Model, EndOfData, "\"endheader\" behind a header, found the end of the file" },
      { "nRows=many\n", Model, InvalidFormat, "line 1: expected a count of rows" },
      { With( Motion, "=yes", "=maybe" ), Model, InvalidFormat, "inDegrees=yes or inDegrees=no" },
      { With( Motion, "time\t", "x\t" ), Model, InvalidFormat, "\"time\" first, found \"x\"" },
      { "endheader\ntime a\n1 2\n", Model, InvalidFormat, "coordinates of the model made.osim, found a" },
      { "endheader\ntime turn turn\n1 2 3\n", Model, InvalidFormat, "one column a coordinate, found two of turn" },
      { "endheader\ntime turn\n", Model, EndOfData, "line 2: expected rows of numbers" },
      { With( Motion, "90", "nan" ), Model, InvalidFormat, "line 7: expected a number for turn, found \"nan\"" },
      { With( Motion, "90", "1e999" ), Model, InvalidFormat, "a number for turn" },
      { With( Motion, "77 nan\n", "\n" ), Model, InvalidFormat, "line 7: expected 5 numbers, one a column, found" },
      { With( Motion, "77 nan\n", "77 0 1\n" ), Model, InvalidFormat, "5 numbers, one a column, found \"1\"" },
      { Far, Model, InvalidFormat, "line 7: expected a pose within 1000 km" },
      { With( Motion, "77 0\n", "77\n" ), Model, OkButPartial, "whole rows before it that were read: 1" },
      { With( Motion, "nRows=2", "nRows=900000000000000" ), Model, OkButPartial, "that were read: 2" },
      { With( Motion, "nRows=2", "nRows=1" ), Model, Ok, "" },
      { With( Motion, "0.51", "0.4" ), Model, Ok, "" },
      { Motion, "", EndOfData, "made.osim: expected an XML element" },
      { Motion, "<a>", InvalidFormat, "made.osim: line 1: expected XML" },
      { Motion, Deep, NotSupported, "at most 200 elements within each other" },
      { Motion, Quotes[0], NotSupported, "at most 200 elements within each other" },
      { Motion, Quotes[1], NotSupported, "at most 200 elements within each other" },
      { Motion, Quotes[2], NotSupported, "at most 200 elements within each other" },
      { Motion, "<!DOCTYPE a [<!ENTITY b 'c'>]><a/>", NotSupported, "a declaration of the type of document" },
      { Motion, std::string( "<a>\0</a>", 8 ), InvalidFormat, "found a zero byte" },
      { Motion, "<html/>", InvalidFormat, "the root element of a model, found \"html\"" },
      { Motion, With( Model, "40000", "30000" ), NotSupported, "version 40000 or later, found \"30000\"" },
      { Motion, With( Model, "\"arm\">", "\"trunk\">" ), InvalidFormat, "names of their own, found another \"trunk\"" },
      { Motion, With( Model, ">0 .5 0<", ">0 .5<" ), InvalidFormat, "three numbers for the translation" },
      { Motion, With( Model, ">0 .5 0<", ">0 inf 0<" ), InvalidFormat, "expected numbers for the translation" },
      { Motion, With( Model, "/bodyset/trunk</socket_parent>", "/bodyset/leg</socket_parent>" ), InvalidFormat,
        "a body that carries the frame \"on_trunk\"" },
      { Motion, With( Model, "/ground", "/bodyset/arm" ), InvalidFormat,
        "hang on the ground by joints, found \"arm\"" },
      { Motion, With( Model, "/bodyset/arm<", "/bodyset/trunk<" ), InvalidFormat, "found two for \"trunk\"" },
      { Motion, With( With( Model, "<Univ", "<Odd" ), "</Univ", "</Odd" ), NotSupported, "found OddersalJoint" },
      { Motion, With( Model, "<Coordinate name=\"tilt\"/>", "" ), InvalidFormat, "expected 2 coordinates of" },
      { Motion, With( Model, "<axis>0 0 2<", "<axis>0 0 0<" ), InvalidFormat, "expected a direction for rotation1" },
      { Motion, With( Model, "rotation1", "rotation4" ), InvalidFormat, "rotation1 to translation3" },
      { Motion, With( Model, ">turn</coordinates>", ">twist</coordinates>" ), InvalidFormat, "found \"twist\"" },
      { Motion, With( Model, ">1 0</coefficients>", ">1 0 2</coefficients>" ), InvalidFormat, "found 3" },
      { Motion, With( With( Model, "<Poly", "<GCV" ), "</Poly", "</GCV" ), NotSupported,
        "found \"GCVnomialFunction\"" },
      { Motion, With( Model, "<function>", "<other>" ), InvalidFormat, "expected XML, found a fault" },
      { Motion, With( Model, Tilt, Turn ), InvalidFormat, "a circle, found one through \"turn\"" },
  };
  for ( const VCase& rCase : Cases )
  {
    SCOPED_TRACE( rCase.pMessage );
    const VOutcome Outcome = Read( rCase.Motion, rCase.Model );
    EXPECT_EQ( Outcome.Result, ZEK::IResult( rCase.Code ) ) << Outcome.Message;
    EXPECT_THAT( Outcome.Message, testing::HasSubstr( rCase.pMessage ) );
    EXPECT_EQ( Outcome.Recording.Skeletons.empty(), Outcome.Result.IsError() );
  }
}

TEST( Motion, TheModelLiesBesideTheFileOrIsNamed )
{
  const TestSupport::VTemporaryDir Folder;
  const auto Write = [&]( const char* i_pName, const std::string& i_rText )
  {
    std::ofstream( Folder.Path() / i_pName ) << i_rText;
    return Folder.Path() / i_pName;
  };
  const auto Path = Write( "walk.mot", Motion ), Plain = Write( "table.txt", Motion );
  const auto Tell = [&]( const std::filesystem::path& i_rPath, const VReadOptions& i_rOptions = {} )
  {
    VRecording Recording;
    std::string Message;
    const ZEK::IResult Result = ReadRecording( i_rPath, Recording, Message, {}, i_rOptions );
    EXPECT_EQ( Recording.Skeletons.empty(), Result.IsError() );
    return Result.IsOk() ? Recording.Skeletons.at( 0 ).Subject.Name : std::string( Result.Text() ) + ": " + Message;
  };
  using testing::AllOf;
  using testing::HasSubstr;
  EXPECT_THAT( Tell( Path ), AllOf( HasSubstr( "walk.mot: " ), HasSubstr( "named with --model, found none" ) ) );
  const auto First = Write( "a.osim", With( Model, "Two bars", "First" ) );
  EXPECT_EQ( Tell( Path ), "First" );
  EXPECT_EQ( Tell( Plain ), "First" ) << "told by its content";
  Write( "b.osim", With( Model, "Two bars", "Second" ) );
  EXPECT_THAT( Tell( Path ), HasSubstr( "found a.osim, b.osim" ) );
  EXPECT_EQ( Tell( Path, { {}, First } ), "First" );
  Write( "walk.osim", Model );
  EXPECT_EQ( Tell( Path ), "Two bars" );
  EXPECT_THAT( Tell( Path, { {}, Folder.Path() / "none.osim" } ), HasSubstr( "none.osim" ) );
  EXPECT_THAT( Tell( First ), HasSubstr( "found a model; open the motion file" ) );
}

} // namespace HostSources
