#pragma once

#include <HarrowPluginInterface/IHarrowServices.h>

#include <ZEK/FlowTypes.h>
#include <ZEK/Result.h>

#include <functional>

namespace HostServices
{

/// Where the playback of a recording stands: a position in ticks that follows a monotonic clock while it plays.
///
/// The first frame stands at tick 0 and frame i at i times the frame period. The clock has no timer: its owner calls
/// `Advance` as often as it wants to draw, and the position depends on the time function alone, however often that
/// is. Thread: GUI.
class VPlaybackClock final : public HarrowPluginInterface::IPlaybackRange
{
public:
  /// Nanoseconds since any fixed moment, never falling.
  using VTimeFunction = std::function< std::int64_t() >;
  static constexpr double MaximumRate = 1e6;

  /// An empty function stands for the steady clock.
  explicit VPlaybackClock( VTimeFunction i_Now = {} );

  /// A recording of so many frames, `i_TicksPerFrame` apart: paused at its first frame, the range is the whole.
  /// `InvalidArgument` when either is below 1 or the last tick passes the range of a tick; nothing is then changed.
  ZEK::IResult Open( std::int64_t i_FrameCount, std::int64_t i_TicksPerFrame );
  /// Back to having no recording.
  void Close();

  void Play();
  void Pause();
  void TogglePlay();
  /// Moves to a tick, or to the nearest one of the range.
  void Seek( std::int64_t i_Tick );
  void SeekFrame( std::int64_t i_Frame );
  /// Moves to the frame nearest to a time from the first frame.
  void SeekSeconds( double i_Seconds );
  /// Pauses and moves by whole frames from the current one; at an end of the range it stays, or goes round when
  /// looping.
  void Step( std::int64_t i_Frames );
  /// 1 is the speed of the recording, negative runs backwards. `InvalidArgument` for a number that is not finite;
  /// one beyond `MaximumRate` either way is cut to it, with `OkButModified`.
  ZEK::IResult SetRate( double i_Rate );
  void SetLoop( bool i_bLoop );
  /// Narrows what is played, ends included; clamped to the recording, and swapped when given the wrong way round.
  void SetRange( std::int64_t i_Begin, std::int64_t i_End );
  void ClearRange();
  /// While false, the views show live data and the range does not matter to them. `Open` sets it, `Close` clears it.
  void SetPlayback( bool i_bPlayback );

  /// Takes the position that belongs to now; at an end of the range without looping it pauses there.
  void Advance();

  bool HasRecording() const { return m_FrameCount > 0; }
  bool IsPlaying() const { return m_bPlaying; }
  bool IsLooping() const { return m_bLoop; }
  double Rate() const { return m_Rate; }
  std::int64_t FrameCount() const { return m_FrameCount; }
  std::int64_t TicksPerFrame() const { return m_TicksPerFrame; }
  /// The frame whose span holds the current tick; 0 without a recording.
  std::int64_t CurrentFrame() const { return m_Tick / m_TicksPerFrame; }
  double CurrentSeconds() const;

  bool IsPlayback() const override { return m_bPlayback; }
  std::int64_t RangeBegin() const override { return m_Begin; }
  std::int64_t RangeEnd() const override { return m_End; }
  std::int64_t CurrentTick() const override { return m_Tick; }
  /// Fires at each change, of the tick too.
  ZEK::IMultiCallback< void() >& Changed() override { return m_Changed; }
  /// Fires when the current frame is another one, or belongs to another recording.
  ZEK::IMultiCallback< void() >& FrameChanged() { return m_FrameChanged; }
  /// Fires when anything but the position changes: playing, rate, loop, range, recording.
  ZEK::IMultiCallback< void() >& StateChanged() { return m_StateChanged; }

private:
  struct VSnapshot;
  VSnapshot Take() const;
  void FireChanges( const VSnapshot& i_rBefore );
  void Anchor();
  void MoveTo( double i_Offset );
  std::int64_t LastTick() const { return HasRecording() ? ( m_FrameCount - 1 ) * m_TicksPerFrame : 0; }

  VTimeFunction m_Now;
  std::int64_t m_FrameCount = 0;
  std::int64_t m_TicksPerFrame = 1;
  std::int64_t m_Begin = 0;
  std::int64_t m_End = 0;
  std::int64_t m_Tick = 0;
  double m_AnchorOffset = 0.0; ///< ticks after the range's begin at the anchor's time; may lie within the last frame
  std::int64_t m_AnchorTime = 0;
  double m_Rate = 1.0;
  bool m_bPlaying = false;
  bool m_bLoop = false;
  bool m_bPlayback = false;
  std::uint64_t m_Recording = 0; ///< counts openings
  ZEK::VMultiCallback< void() > m_Changed;
  ZEK::VMultiCallback< void() > m_FrameChanged;
  ZEK::VMultiCallback< void() > m_StateChanged;
};

/// Hands a scene its playback range.
class VSceneServices final : public HarrowPluginInterface::ISceneServices
{
public:
  explicit VSceneServices( std::shared_ptr< HarrowPluginInterface::IPlaybackRange > i_pRange )
    : m_pRange( std::move( i_pRange ) )
  {
  }

  std::shared_ptr< HarrowPluginInterface::IPlaybackRange > PlaybackRange() const override { return m_pRange; }

private:
  std::shared_ptr< HarrowPluginInterface::IPlaybackRange > m_pRange;
};

} // namespace HostServices
