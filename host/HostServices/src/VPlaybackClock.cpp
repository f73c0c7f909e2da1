#include <HostServices/VPlaybackClock.h>

#include <algorithm>
#include <chrono>
#include <cmath>

namespace HostServices
{
namespace
{
/// Keeps a position that falls on a tick from being cut to the one before.
constexpr double RoundingTicks = 1e-3;

std::int64_t SteadyNow()
{
  return std::chrono::duration_cast< std::chrono::nanoseconds >( std::chrono::steady_clock::now().time_since_epoch() )
      .count();
}

double TicksOf( std::int64_t i_Nanoseconds, double i_Rate )
{
  return static_cast< double >( i_Nanoseconds ) * i_Rate * static_cast< double >( ZEK::FlowTicksPerSecond ) / 1e9;
}
} // namespace

struct VPlaybackClock::VSnapshot
{
  std::int64_t Tick;
  std::int64_t Frame;
  std::uint64_t Recording;
  std::int64_t Begin;
  std::int64_t End;
  double Rate;
  bool bPlaying;
  bool bLoop;
  bool bPlayback;
};

VPlaybackClock::VPlaybackClock( VTimeFunction i_Now )
  : m_Now( i_Now ? std::move( i_Now ) : VTimeFunction( SteadyNow ) )
{
}

VPlaybackClock::VSnapshot VPlaybackClock::Take() const
{
  return { m_Tick, CurrentFrame(), m_Recording, m_Begin, m_End, m_Rate, m_bPlaying, m_bLoop, m_bPlayback };
}

void VPlaybackClock::FireChanges( const VSnapshot& i_rBefore )
{
  const VSnapshot Now = Take();
  const bool bRecording = Now.Recording != i_rBefore.Recording;
  const bool bFrame = bRecording || Now.Frame != i_rBefore.Frame;
  const bool bState = bRecording || Now.Begin != i_rBefore.Begin || Now.End != i_rBefore.End ||
                      Now.Rate != i_rBefore.Rate || Now.bPlaying != i_rBefore.bPlaying ||
                      Now.bLoop != i_rBefore.bLoop || Now.bPlayback != i_rBefore.bPlayback;
  if ( bFrame )
  {
    m_FrameChanged.Fire();
  }
  if ( bState )
  {
    m_StateChanged.Fire();
  }
  if ( bFrame || bState || Now.Tick != i_rBefore.Tick )
  {
    m_Changed.Fire();
  }
}

ZEK::IResult VPlaybackClock::Open( std::int64_t i_FrameCount, std::int64_t i_TicksPerFrame )
{
  // Positions are counted in doubles, which hold every whole number up to here: more than a year of ticks.
  constexpr std::int64_t MaximumTick = std::int64_t{ 1 } << 53;
  if ( i_FrameCount < 1 || i_TicksPerFrame < 1 || i_FrameCount > MaximumTick / i_TicksPerFrame )
  {
    return ZEK::IResult::InvalidArgument;
  }
  const VSnapshot Before = Take();
  m_FrameCount = i_FrameCount;
  m_TicksPerFrame = i_TicksPerFrame;
  m_Begin = 0;
  m_End = LastTick();
  m_bPlaying = false;
  m_bPlayback = true;
  ++m_Recording;
  MoveTo( 0.0 );
  FireChanges( Before );
  return ZEK::IResult::Ok;
}

void VPlaybackClock::Close()
{
  if ( !HasRecording() && !m_bPlayback )
  {
    return;
  }
  const VSnapshot Before = Take();
  m_FrameCount = 0;
  m_TicksPerFrame = 1;
  m_Begin = 0;
  m_End = 0;
  m_bPlaying = false;
  m_bPlayback = false;
  ++m_Recording;
  MoveTo( 0.0 );
  FireChanges( Before );
}

void VPlaybackClock::MoveTo( double i_Offset )
{
  const auto Length = static_cast< double >( m_End - m_Begin );
  m_AnchorOffset = i_Offset;
  m_AnchorTime = m_Now();
  m_Tick = m_Begin + static_cast< std::int64_t >( std::clamp( std::floor( i_Offset + RoundingTicks ), 0.0, Length ) );
}

void VPlaybackClock::Anchor()
{
  if ( m_bPlaying )
  {
    Advance();
  }
  // Only a playing position has a part of a tick, or stands within the last frame, that is worth keeping.
  MoveTo( m_bPlaying ? m_AnchorOffset + TicksOf( std::max< std::int64_t >( 0, m_Now() - m_AnchorTime ), m_Rate )
                     : static_cast< double >( m_Tick - m_Begin ) );
}

void VPlaybackClock::Advance()
{
  if ( !m_bPlaying )
  {
    return;
  }
  const VSnapshot Before = Take();
  const std::int64_t Elapsed = std::max< std::int64_t >( 0, m_Now() - m_AnchorTime );
  const auto Length = static_cast< double >( m_End - m_Begin );
  double Offset = m_AnchorOffset + TicksOf( Elapsed, m_Rate );
  if ( m_bLoop )
  {
    const double Cycle = Length + static_cast< double >( m_TicksPerFrame );
    if ( Offset < 0.0 || Offset + RoundingTicks >= Cycle )
    {
      Offset = std::fmod( Offset + RoundingTicks, Cycle ) - RoundingTicks;
      Offset = Offset < -RoundingTicks ? Offset + Cycle : std::max( 0.0, Offset );
      MoveTo( Offset );
    }
  }
  else if ( ( m_Rate > 0.0 && Offset + RoundingTicks >= Length ) || ( m_Rate < 0.0 && Offset <= RoundingTicks ) )
  {
    m_bPlaying = false;
    MoveTo( m_Rate > 0.0 ? Length : 0.0 );
  }
  m_Tick = m_Begin + static_cast< std::int64_t >( std::clamp( std::floor( Offset + RoundingTicks ), 0.0, Length ) );
  FireChanges( Before );
}

void VPlaybackClock::Play()
{
  if ( !HasRecording() || m_bPlaying )
  {
    return;
  }
  const VSnapshot Before = Take();
  m_bPlaying = true;
  double Offset = static_cast< double >( m_Tick - m_Begin );
  if ( !m_bLoop && m_Rate >= 0.0 && m_Tick >= m_End )
  {
    Offset = 0.0;
  }
  else if ( !m_bLoop && m_Rate < 0.0 && m_Tick <= m_Begin )
  {
    Offset = static_cast< double >( m_End - m_Begin );
  }
  MoveTo( Offset );
  FireChanges( Before );
}

void VPlaybackClock::Pause()
{
  Advance();
  if ( m_bPlaying )
  {
    const VSnapshot Before = Take();
    m_bPlaying = false;
    FireChanges( Before );
  }
}

void VPlaybackClock::TogglePlay()
{
  m_bPlaying ? Pause() : Play();
}

void VPlaybackClock::Seek( std::int64_t i_Tick )
{
  const VSnapshot Before = Take();
  MoveTo( static_cast< double >( std::clamp( i_Tick, m_Begin, m_End ) - m_Begin ) );
  FireChanges( Before );
}

void VPlaybackClock::SeekFrame( std::int64_t i_Frame )
{
  Seek( std::clamp< std::int64_t >( i_Frame, 0, std::max< std::int64_t >( 0, m_FrameCount - 1 ) ) * m_TicksPerFrame );
}

void VPlaybackClock::SeekSeconds( double i_Seconds )
{
  const double Frame =
      i_Seconds * static_cast< double >( ZEK::FlowTicksPerSecond ) / static_cast< double >( m_TicksPerFrame );
  if ( !std::isnan( Frame ) )
  {
    SeekFrame(
        static_cast< std::int64_t >( std::clamp( std::round( Frame ), 0.0, static_cast< double >( m_FrameCount ) ) ) );
  }
}

void VPlaybackClock::Step( std::int64_t i_Frames )
{
  Pause();
  const std::int64_t First = ( m_Begin + m_TicksPerFrame - 1 ) / m_TicksPerFrame;
  const std::int64_t Count = m_End / m_TicksPerFrame - First + 1;
  if ( !HasRecording() || Count < 1 )
  {
    return;
  }
  const std::int64_t From = CurrentFrame() - First;
  std::int64_t To = 0;
  if ( m_bLoop )
  {
    To = ( ( From + i_Frames % Count ) % Count + Count ) % Count;
  }
  else
  {
    // Beyond the number of frames any step ends at an end.
    To = std::clamp< std::int64_t >( From + std::clamp( i_Frames, -Count - 1, Count + 1 ), 0, Count - 1 );
  }
  SeekFrame( First + To );
}

ZEK::IResult VPlaybackClock::SetRate( double i_Rate )
{
  if ( !std::isfinite( i_Rate ) )
  {
    return ZEK::IResult::InvalidArgument;
  }
  Anchor();
  const VSnapshot Before = Take();
  m_Rate = std::clamp( i_Rate, -MaximumRate, MaximumRate );
  FireChanges( Before );
  return m_Rate == i_Rate ? ZEK::IResult::Ok : ZEK::IResult::OkButModified;
}

void VPlaybackClock::SetLoop( bool i_bLoop )
{
  Anchor();
  const VSnapshot Before = Take();
  m_bLoop = i_bLoop;
  FireChanges( Before );
}

void VPlaybackClock::SetRange( std::int64_t i_Begin, std::int64_t i_End )
{
  Anchor();
  const VSnapshot Before = Take();
  const auto [Low, High] = std::minmax( i_Begin, i_End );
  const std::int64_t Tick = m_Tick;
  m_Begin = std::clamp< std::int64_t >( Low, 0, LastTick() );
  m_End = std::clamp< std::int64_t >( High, 0, LastTick() );
  MoveTo( static_cast< double >( std::clamp( Tick, m_Begin, m_End ) - m_Begin ) );
  FireChanges( Before );
}

void VPlaybackClock::ClearRange()
{
  SetRange( 0, LastTick() );
}

void VPlaybackClock::SetPlayback( bool i_bPlayback )
{
  const VSnapshot Before = Take();
  m_bPlayback = i_bPlayback;
  FireChanges( Before );
}

double VPlaybackClock::CurrentSeconds() const
{
  return static_cast< double >( m_Tick ) / static_cast< double >( ZEK::FlowTicksPerSecond );
}

} // namespace HostServices
