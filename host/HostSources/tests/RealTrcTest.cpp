// The figures of real files, read from them by another program.

#include "ReadHelpers.h"

#include <cmath>
#include <functional>

namespace HostSources
{
TEST( RealTrc, GaitHoldsNamedAndUnnamedPoints )
{
  HARROW_NEEDS_RECORDINGS();
  const VRecording Gait = Real( "c3d-trc/Gait.trc" );
  EXPECT_EQ( Gait.FrameCount, 487 );
  EXPECT_EQ( Gait.RateHz, 100 );
  EXPECT_EQ( Gait.Unit, "mm" );
  EXPECT_EQ( Gait.PointCount(), 33u );
  EXPECT_THAT( Gait.Notes, testing::Contains( "The header promises 66 markers; 33 have names." ) );
  EXPECT_EQ( Gait.UnlabelledFrame( 0 ).size(), 2u );
  EXPECT_EQ( Gait.UnlabelledFrame( 93 ).size(), 21u );
  EXPECT_EQ( Gait.UnlabelledFrame( 486 ).size(), 8u );
  std::int64_t First = -1, Labelled = 0;
  std::size_t MostUnlabelled = 0;
  for ( std::int64_t Frame = 0; Frame < Gait.FrameCount; ++Frame )
  {
    const auto Points = Gait.Frame( Frame );
    if ( std::any_of( Points.begin(), Points.end(), std::mem_fn( &VRecordingPoint::IsValid ) ) )
    {
      First = First < 0 ? Frame : First;
      ++Labelled;
    }
    else
    {
      MostUnlabelled = std::max( MostUnlabelled, Gait.UnlabelledFrame( Frame ).size() );
    }
  }
  EXPECT_EQ( First, 159 );
  EXPECT_EQ( Labelled, 280 );
  EXPECT_EQ( MostUnlabelled, 33u );
  EXPECT_EQ( Gait.UpAxis, EUpAxis::Z );
}

TEST( RealTrc, GaitLiesNearTheSameTrialInTheOtherFormat )
{
  HARROW_NEEDS_RECORDINGS();
  const VRecording Trc = Real( "c3d-trc/Gait.trc" );
  const VRecording C3d = Real( "c3d-trc/Gait.c3d" );
  ASSERT_EQ( Trc.Points.size(), C3d.Points.size() );
  std::size_t Common = 0;
  double Greatest = 0;
  for ( std::size_t Index = 0; Index < Trc.Points.size(); ++Index )
  {
    const VRecordingPoint &rA = Trc.Points[Index], &rB = C3d.Points[Index];
    if ( rA.IsValid() && rB.IsValid() )
    {
      ++Common;
      Greatest =
          std::max( Greatest, std::hypot( static_cast< double >( rA.x - rB.x ), static_cast< double >( rA.y - rB.y ),
                                          static_cast< double >( rA.z - rB.z ) ) );
    }
  }
  EXPECT_EQ( Common, 5515u );
  EXPECT_NEAR( Greatest, 8.4, 0.05 );
}

TEST( RealTrc, UnnamedHoldsUnlabelledPointsOnly )
{
  HARROW_NEEDS_RECORDINGS();
  const VRecording Unnamed = Real( "c3d-trc/unnamed.trc" );
  EXPECT_EQ( Unnamed.PointCount(), 0u );
  EXPECT_EQ( Unnamed.FrameCount, 1313 );
  EXPECT_EQ( Unnamed.RateHz, 400 );
  EXPECT_EQ( Unnamed.Unlabelled.size(), 14911u );
  std::size_t Least = 1000, Most = 0;
  for ( std::int64_t Frame = 0; Frame < Unnamed.FrameCount; ++Frame )
  {
    Least = std::min( Least, Unnamed.UnlabelledFrame( Frame ).size() );
    Most = std::max( Most, Unnamed.UnlabelledFrame( Frame ).size() );
  }
  EXPECT_EQ( Least, 3u );
  EXPECT_EQ( Most, 27u );
  ASSERT_EQ( Unnamed.UnlabelledFrame( 0 ).size(), 13u );
  ExpectPoint( Unnamed.UnlabelledFrame( 0 )[0], -352.4512, 985.40039, 288.96054, 1e-4 );
  EXPECT_EQ( Unnamed.UnlabelledFrame( 1312 ).size(), 24u );
}

TEST( RealTrc, FilesInMetresWithYUp )
{
  HARROW_NEEDS_RECORDINGS();
  const std::tuple< const char*, std::size_t, std::int64_t > Cases[] = {
      { "multicam-person/balancing/markers21.trc", 21, 100 },
      { "multicam-person/balancing/markers64.trc", 64, 100 },
      { "multicam-person/static/markers21.trc", 21, 12 },
      { "fk-fullbody/markers21.trc", 21, 100 } };
  for ( const auto& [pFile, Points, Frames] : Cases )
  {
    SCOPED_TRACE( pFile );
    const VRecording Trial = Real( pFile );
    EXPECT_EQ( Trial.PointCount(), Points );
    EXPECT_EQ( Trial.FrameCount, Frames );
    EXPECT_EQ( Trial.RateHz, 60 );
    EXPECT_EQ( Trial.Unit, "m" );
    EXPECT_EQ( Trial.GapCount, 0u );
    EXPECT_TRUE( Trial.Unlabelled.empty() );
    EXPECT_EQ( Trial.UpAxis, EUpAxis::Y );
    EXPECT_EQ( Trial.Labels.front(), "RHip" );
  }
}

} // namespace HostSources
