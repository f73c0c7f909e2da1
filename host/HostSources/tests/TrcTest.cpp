#include "ReadHelpers.h"

#include <cmath>

namespace HostSources
{
namespace
{
std::string Head( int i_Frames, int i_Markers, const std::string& i_rUnit = "mm", const std::string& i_rRate = "50.0" )
{
  return "PathFileType\t4\t(X/Y/Z)\tmade.trc\n"
         "DataRate\tCameraRate\tNumFrames\tNumMarkers\tUnits\tOrigDataRate\tOrigDataStartFrame\tOrigNumFrames\n" +
         i_rRate + "\t50.0\t   " + std::to_string( i_Frames ) + "\t" + std::to_string( i_Markers ) + "\t" + i_rUnit +
         "\t50\t1\t" + std::to_string( i_Frames ) + "\n";
}

const std::string Names = "Frame#\tTime\tHEAD\t\t\tFOOT\t\t\n\t\tX1\tY1\tZ1\tX2\tY2\tZ2\n";

std::string WithCarriageReturns( std::string i_Text )
{
  for ( std::size_t At = 0; ( At = i_Text.find( '\n', At ) ) != std::string::npos; At += 2 )
  {
    i_Text.insert( At, 1, '\r' );
  }
  return i_Text;
}
} // namespace

TEST( Trc, RowsOfAnyLengthAndEitherLineEnd )
{
  const std::string Text = Head( 4, 2 ) + Names +
                           "\n7\t1.50\t1\t2\t3\t4\t5\t6\n"           // first frame 7 at 1.5 s
                           "8\t1.52\t1.5\t-2e1\t+3\t\t\t\t9\t8\t7\n" // a gap, and a point without a column
                           "9\t1.54\n"                               // nothing at all
                           "10\t1.56\t\t\t\t4\t 5 \t6\t\t\t\t1\t1\t1\t2\t2\t2";
  for ( const std::string& rText : { Text, WithCarriageReturns( Text ), "\xEF\xBB\xBF" + Text } )
  {
    const VRecording R = MustReadTrc( rText );
    EXPECT_EQ( R.RateHz, 50 );
    EXPECT_EQ( R.FirstFrame, 7 );
    ASSERT_EQ( R.FrameCount, 4 );
    EXPECT_THAT( R.Labels, testing::ElementsAre( "HEAD", "FOOT" ) );
    ExpectPoint( R, 0, "FOOT", 4, 5, 6 );
    ExpectPoint( R, 1, "HEAD", 1.5, -20, 3 );
    EXPECT_FALSE( R.Frame( 1 )[1].IsValid() );
    ASSERT_EQ( R.UnlabelledFrame( 1 ).size(), 1u );
    ExpectPoint( R.UnlabelledFrame( 1 )[0], 9, 8, 7, 0 );
    EXPECT_FALSE( R.Frame( 2 )[0].IsValid() );
    EXPECT_TRUE( R.UnlabelledFrame( 2 ).empty() );
    EXPECT_FALSE( R.Frame( 3 )[0].IsValid() );
    ExpectPoint( R, 3, "FOOT", 4, 5, 6 );
    ASSERT_EQ( R.UnlabelledFrame( 3 ).size(), 2u );
    EXPECT_EQ( R.GapCount, 4u );
  }
}

TEST( Trc, UnitsAndNumbersThatAreNone )
{
  const VRecording R =
      MustReadTrc( Head( 2, 2, "m" ) + Names + "1\t0\t0.1\t0.2\t0.3\tnan\t1\t1\n2\t0\tinf\t1\t1\t1e99\t1\t1\n" );
  ExpectPoint( R, 0, "HEAD", 100, 200, 300, 1e-3 );
  EXPECT_EQ( R.GapCount, 3u );
}

TEST( Trc, HeaderIsCheckedAgainstTheRows )
{
  const std::string Rows = "1\t0\t1\t2\t3\t4\t5\t6\n2\t0.02\t1\t2\t3\t4\t5\t6\n";
  EXPECT_THAT( MustReadTrc( Head( 1, 2 ) + Names + Rows ).Notes,
               testing::ElementsAre( "The header promises 1 frames; there are 2 rows, and all were taken." ) );
  std::string Slow = Head( 1000, 2, "mm", "0.00002" ) + Names;
  for ( int Row = 0; Row < 1000; ++Row )
  {
    Slow += std::to_string( Row ) + "\t0\n";
  }
  EXPECT_EQ( MustReadTrc( Slow ).RateHz, 100 ) << "more ticks than can be counted";
  EXPECT_THAT( MustReadTrc( Head( 2, 5 ) + Names + Rows ).Notes,
               testing::ElementsAre( "The header promises 5 markers; 2 have names." ) );
  EXPECT_THAT( MustReadTrc( Head( 2, 2 ) + Names + "1\t0\t1\t2\t3\t4\t5\t6\n5\t0\t1\t2\t3\t4\t\t6\n" ).Notes,
               testing::ElementsAre( "1 points have a blank coordinate and count as missing.",
                                     testing::StartsWith( "The frame numbers do not run on by one" ) ) );
  VOutcome Outcome = ReadText( Head( 3, 2 ) + Names + Rows );
  EXPECT_EQ( Outcome.Result, ZEK::IResult( ZEK::IResult::OkButPartial ) );
  EXPECT_EQ( Outcome.Recording.FrameCount, 2 );
  EXPECT_EQ( Outcome.Message,
             "made.trc: line 8: expected 3 rows, found the end of the file; the 2 whole rows before it "
             "were read" );
  // A last line without its end may have lost digits.
  Outcome = ReadText( Head( 3, 2 ) + Names + Rows + "3\t0.04\t1\t2\t3\t4\t5\t66" );
  EXPECT_EQ( Outcome.Result, ZEK::IResult( ZEK::IResult::Ok ) );
  Outcome = ReadText( Head( 4, 2 ) + Names + Rows + "3\t0.04\t1\t2\t3\t4\t5\t66" );
  EXPECT_EQ( Outcome.Recording.FrameCount, 2 );
  EXPECT_THAT( Outcome.Message,
               testing::HasSubstr( "line 8: expected 4 rows, found the end of the file within a row" ) );
}

TEST( Trc, NamesInEveryArrangement )
{
  const std::string Row = "1\t0\t1\t2\t3\t4\t5\t6\t7\t8\t9\n";
  const VRecording Packed = MustReadTrc( Head( 1, 3 ) + "Frame#\tTime\tA\tB\tC\n\t\tX1\n" + Row );
  EXPECT_THAT( Packed.Labels, testing::ElementsAre( "A", "B", "C" ) );
  ExpectPoint( Packed, 0, "C", 7, 8, 9 );
  const VRecording Twice = MustReadTrc( Head( 1, 3 ) + "Frame#\tTime\tA\t\t\t\t\t\tA\n\t\tX1\n" + Row );
  EXPECT_THAT( Twice.Labels, testing::ElementsAre( "A_1", "", "A_2" ) );
  EXPECT_THAT( Twice.FileLabels, testing::ElementsAre( "A", "", "A" ) );
  EXPECT_THAT( Twice.Notes, testing::ElementsAre( "2 labels repeat; they were numbered." ) );
}

TEST( Trc, MessagesSayWhereAndWhat )
{
  const std::string Good = Head( 1, 2 ) + Names;
  const std::vector< std::pair< std::string, std::string > > Cases{
      { "", "line 1: expected \"PathFileType\"" },
      { "Something\n", "line 1: expected \"PathFileType\", the mark of a TRC file, found \"Something\"" },
      { "PathFileType\t4\n", "line 2: expected the names of the header's values" },
      { "PathFileType\t4\nDataRate,NumFrames\n50,2\n", "line 2: expected the names of the header's values, DataRate" },
      { "PathFileType\t4\nDataRate\tUnits\n", "line 3: expected the header's values, found the end of the file" },
      { "PathFileType\t4\nDataRate\tUnits\nfast\tmm\n", "line 3: expected a number for DataRate, found \"fast\"" },
      { "PathFileType\t4\nDataRate\tNumFrames\n50\t-3\n", "line 3: expected a count for NumFrames, found \"-3\"" },
      { Head( 1, 2 ), "line 4: expected the names of the markers, found the end of the file" },
      { Head( 1, 2 ) + "1\t0\t1\t2\t3\n", "line 4: expected \"Frame#\", \"Time\" and the names" },
      { Head( 1, 2 ) + "Frame#\tTime\tA\n", "line 5: expected the line of the columns" },
      { Good, "line 6: expected rows of frames, found the end of the file" },
      { Good + "\n\t\t\n", "line 8: expected rows of frames" },
      { Good + "one\t0\t1\t2\t3\n", "line 6: expected the number of a frame, found \"one\"" },
      { Good + "1\t0\t1\t2\t3\n2\tlate\t1\t2\t3\n", "line 7: expected a time, found \"late\"" },
      { Good + "1\t0\t1\t2,5\t3\n", "line 6: expected a coordinate in column 4, found \"2,5\"" } };
  for ( const auto& [rText, rExpected] : Cases )
  {
    const VOutcome Outcome = ReadText( rText );
    EXPECT_TRUE( Outcome.Result.IsError() ) << rText;
    EXPECT_THAT( Outcome.Message, testing::StartsWith( "made.trc: " + rExpected ) );
    EXPECT_EQ( Outcome.Recording.FrameCount, 0 );
    EXPECT_TRUE( Outcome.Recording.Labels.empty() );
  }
}

TEST( Trc, CutOffAnywhereNeverGivesAWrongNumber )
{
  const std::string Whole =
      Head( 3, 2 ) + Names + "1\t0\t1.25\t2\t3\t4\t5\t6.5\n2\t0\t1.25\t2\t3\t4\t5\t6.5\n3\t0\t1.25\t2\t3\t4\t5\t6.5\n";
  for ( std::size_t Size = 0; Size + 1 < Whole.size(); ++Size )
  {
    const VOutcome Outcome = ReadText( std::string_view( Whole ).substr( 0, Size ) );
    const std::int64_t Rows = Outcome.Recording.FrameCount;
    ASSERT_LE( Rows, 3 );
    for ( std::int64_t Frame = 0; Frame < std::min< std::int64_t >( Rows, 2 ); ++Frame )
    {
      EXPECT_EQ( Outcome.Recording.Frame( Frame )[1].z, 6.5f ) << Size;
    }
    EXPECT_EQ( Outcome.Message.empty(), Rows == 3 ) << Size;
  }
}

TEST( Trc, ATableThatItsFileCannotHoldIsRefused )
{
  std::string Text = Head( 100000, 100000 ) + "Frame#\tTime";
  for ( int Index = 0; Index < 30000; ++Index )
  {
    Text += "\tN" + std::to_string( Index );
  }
  Text += "\nX1\n";
  for ( int Index = 0; Index < 30000; ++Index )
  {
    Text += "1\n";
  }
  const VOutcome Outcome = ReadText( Text );
  EXPECT_EQ( Outcome.Result, ZEK::IResult( ZEK::IResult::InvalidFormat ) );
  EXPECT_THAT( Outcome.Message, testing::HasSubstr( "too small to hold them" ) );
}

} // namespace HostSources
