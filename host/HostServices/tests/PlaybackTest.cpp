#include <HostServices/VPlaybackClock.h>

#include <TestSupport/Calls.h>

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

using HostServices::VPlaybackClock;

namespace
{
constexpr std::int64_t Period = 2'700'000; ///< of 100 frames a second
constexpr std::int64_t FrameNs = 10'000'000;
constexpr auto Low = std::numeric_limits< std::int64_t >::min();
constexpr auto High = std::numeric_limits< std::int64_t >::max();

/// A recording of ten frames at 100 Hz, under a clock that the test turns.
class PlaybackClock : public testing::Test
{
protected:
  PlaybackClock() { EXPECT_TRUE( m_Clock.Open( 10, Period ).IsOk() ); }

  /// The frame after so many frame times, of parts of which the position must not depend.
  std::int64_t After( double i_Frames, int i_Parts = 1 )
  {
    const std::int64_t Start = m_Now;
    for ( int Part = 1; Part <= i_Parts; ++Part )
    {
      m_Now = Start + static_cast< std::int64_t >( i_Frames * FrameNs * Part / i_Parts );
      m_Clock.Advance();
    }
    return m_Clock.CurrentFrame();
  }

  std::int64_t m_Now = 1'000'000'007;
  VPlaybackClock m_Clock{ [this]
                          {
                            return m_Now;
                          } };
  TestSupport::VCalls m_Frames{ m_Clock.FrameChanged() };
  TestSupport::VCalls m_States{ m_Clock.StateChanged() };
};
} // namespace

TEST_F( PlaybackClock, PlaysInTimeHoweverOftenItIsAsked )
{
  EXPECT_EQ( After( 5 ), 0 ) << "paused";
  m_Clock.Play();
  EXPECT_EQ( After( 1 ), 1 ) << "a frame begins on its very tick";
  EXPECT_EQ( After( 0.99, 7 ), 1 );
  EXPECT_EQ( After( 0.01 ), 2 );
  EXPECT_EQ( m_Clock.CurrentTick(), 2 * Period );
  EXPECT_EQ( After( 4, 1000 ), 6 );
  EXPECT_EQ( m_Frames.Take(), 6 + 1 ) << "the opening too";
  m_Now -= FrameNs * 50;
  m_Clock.Advance();
  EXPECT_EQ( m_Clock.CurrentFrame(), 0 ) << "a clock that falls back counts as standing";
  EXPECT_TRUE( m_Clock.IsPlaying() );
}

TEST_F( PlaybackClock, StopsAtItsEndsAndStartsOver )
{
  m_States.Take();
  m_Clock.Play();
  EXPECT_EQ( After( 9.5 ), 9 );
  EXPECT_FALSE( m_Clock.IsPlaying() );
  EXPECT_EQ( m_Clock.CurrentTick(), m_Clock.RangeEnd() );
  EXPECT_EQ( m_States.Take(), 2 );
  m_Clock.Play();
  EXPECT_EQ( m_Clock.CurrentFrame(), 0 );
  EXPECT_EQ( After( 2 ), 2 );
  ASSERT_TRUE( m_Clock.SetRate( -0.5 ).IsOk() );
  EXPECT_EQ( After( 2 ), 1 );
  EXPECT_EQ( After( 100 ), 0 );
  EXPECT_FALSE( m_Clock.IsPlaying() );
  m_Clock.Play();
  EXPECT_EQ( m_Clock.CurrentFrame(), 9 ) << "backwards from the first frame means from the last";
}

TEST_F( PlaybackClock, LoopsWithTheLastFrameAtFullLength )
{
  m_Clock.SetLoop( true );
  m_Clock.Play();
  EXPECT_EQ( After( 9.9 ), 9 );
  EXPECT_LE( m_Clock.CurrentTick(), m_Clock.RangeEnd() ) << "always within the range";
  EXPECT_EQ( After( 0.1 ), 0 );
  EXPECT_EQ( After( 25, 13 ), 5 );
  EXPECT_EQ( After( 1e6 ), 5 );
  ASSERT_TRUE( m_Clock.SetRate( -1.0 ).IsOk() );
  EXPECT_EQ( After( 5 ), 0 );
  EXPECT_EQ( After( 1 ), 9 );
  EXPECT_EQ( After( 12 ), 7 );
  EXPECT_TRUE( m_Clock.IsPlaying() );
}

TEST_F( PlaybackClock, LoopsInsideANarrowedRange )
{
  m_Clock.SetRange( 7 * Period, 5 * Period );
  EXPECT_EQ( m_Clock.RangeBegin(), 5 * Period );
  EXPECT_EQ( m_Clock.RangeEnd(), 7 * Period );
  EXPECT_EQ( m_Clock.CurrentFrame(), 5 );
  m_Clock.SetLoop( true );
  m_Clock.Play();
  EXPECT_EQ( After( 4 ), 6 );
  m_Clock.Seek( 0 );
  EXPECT_EQ( m_Clock.CurrentFrame(), 5 );
  m_Clock.SetRange( -5, High );
  EXPECT_EQ( m_Clock.RangeEnd(), 9 * Period );
  m_Clock.SetRange( 3, 4 );
  m_Clock.ClearRange();
  EXPECT_EQ( m_Clock.RangeBegin(), 0 );
  EXPECT_EQ( m_Clock.CurrentTick(), 4 ) << "the position stays where the narrow range had it";
}

TEST_F( PlaybackClock, SeeksClampToTheRange )
{
  for ( const auto& [Tick, Expected] :
        { std::pair{ Low, std::int64_t{ 0 } }, { High, 9 * Period }, { 3 * Period + 1, 3 * Period + 1 } } )
  {
    m_Clock.Seek( Tick );
    EXPECT_EQ( m_Clock.CurrentTick(), Expected );
  }
  for ( const auto& [Asked, Frame] : { std::pair{ High, 9 }, { Low, 0 } } )
  {
    m_Clock.SeekFrame( Asked );
    EXPECT_EQ( m_Clock.CurrentFrame(), Frame );
  }
  for ( const auto& [Seconds, Frame] : { std::pair{ 0.0449, 4 }, { 0.0451, 5 }, { 1e300, 9 }, { -1e300, 0 } } )
  {
    m_Clock.SeekSeconds( Seconds );
    EXPECT_EQ( m_Clock.CurrentFrame(), Frame ) << Seconds;
  }
  m_Clock.SeekFrame( 4 );
  m_Clock.SeekSeconds( std::nan( "" ) );
  EXPECT_EQ( m_Clock.CurrentFrame(), 4 );
}

TEST_F( PlaybackClock, StepsStopAtTheEndsOrGoRound )
{
  m_Clock.Play();
  After( 3.5 );
  m_Clock.Step( 1 );
  EXPECT_FALSE( m_Clock.IsPlaying() );
  EXPECT_EQ( m_Clock.CurrentTick(), 4 * Period );
  const auto Steps = [&]( const std::vector< std::pair< std::int64_t, std::int64_t > >& i_rSteps )
  {
    for ( const auto& [Frames, Expected] : i_rSteps )
    {
      m_Clock.Step( Frames );
      EXPECT_EQ( m_Clock.CurrentFrame(), Expected ) << Frames;
    }
  };
  Steps( { { 100, 9 }, { 1, 9 }, { High, 9 }, { Low, 0 } } );
  m_Clock.SetLoop( true );
  Steps( { { -1, 9 }, { 12, 1 }, { Low, 3 } } ); // 1 - 2^63, modulo 10
  m_Clock.Close();
  m_Clock.Step( 1 );
  EXPECT_EQ( m_Clock.CurrentTick(), 0 );
}

TEST_F( PlaybackClock, TakesAnyFiniteRate )
{
  for ( const double Bad : { std::nan( "" ), HUGE_VAL, -HUGE_VAL } )
  {
    EXPECT_EQ( m_Clock.SetRate( Bad ), ZEK::IResult::InvalidArgument );
    EXPECT_EQ( m_Clock.Rate(), 1.0 );
  }
  EXPECT_EQ( m_Clock.SetRate( 1e300 ), ZEK::IResult::OkButModified );
  m_Clock.SetLoop( true );
  m_Clock.Play();
  m_Now = High;
  m_Clock.Advance();
  EXPECT_GE( m_Clock.CurrentTick(), 0 );
  EXPECT_LE( m_Clock.CurrentTick(), m_Clock.RangeEnd() );
  m_Clock.SetLoop( false );
  ASSERT_TRUE( m_Clock.SetRate( 0.0 ).IsOk() );
  const std::int64_t Standing = m_Clock.CurrentTick();
  m_Now = 0;
  m_Clock.Seek( Standing );
  EXPECT_EQ( After( 1e6 ) * Period, Standing / Period * Period );
}

TEST_F( PlaybackClock, AChangeOfRateKeepsThePosition )
{
  m_Clock.Play();
  After( 2.5 );
  ASSERT_TRUE( m_Clock.SetRate( 2.0 ).IsOk() );
  EXPECT_EQ( m_Clock.CurrentTick(), 2 * Period + Period / 2 );
  EXPECT_EQ( After( 0.25 ), 3 );
  m_Clock.Pause();
  EXPECT_EQ( After( 10 ), 3 );
  m_Clock.Play();
  EXPECT_EQ( After( 0.5 ), 4 );
}

TEST_F( PlaybackClock, OpensOnlyWhatCanBeCounted )
{
  m_Frames.Take();
  for ( const auto& [Frames, Ticks] :
        { std::pair< std::int64_t, std::int64_t >{ 0, 1 }, { 1, 0 }, { -1, Period }, { High, 2 } } )
  {
    EXPECT_EQ( m_Clock.Open( Frames, Ticks ), ZEK::IResult::InvalidArgument );
  }
  EXPECT_EQ( m_Clock.FrameCount(), 10 );
  EXPECT_EQ( m_Frames.Take(), 0 );
  ASSERT_TRUE( m_Clock.Open( 1, Period ).IsOk() );
  EXPECT_EQ( m_Frames.Take(), 1 ) << "frame 0 of another recording is another frame";
  m_Clock.Play();
  EXPECT_EQ( After( 5 ), 0 );
  EXPECT_FALSE( m_Clock.IsPlaying() );
  EXPECT_TRUE( m_Clock.IsPlayback() );
  m_Clock.Close();
  EXPECT_FALSE( m_Clock.IsPlayback() );
  m_Clock.Play();
  EXPECT_FALSE( m_Clock.IsPlaying() );
}
