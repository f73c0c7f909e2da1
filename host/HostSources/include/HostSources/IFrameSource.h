#pragma once

#include <ZEK/FlowState.h>
#include <ZEK/Result.h>

#include <cstdint>
#include <functional>
#include <string>

namespace HostSources
{

/// What a source makes states and items with.
struct VStateMaker
{
  ZEK::VFlowStateFactoryRef Factory;
  ZEK::VFlowStoreRef Store;
  std::uint32_t Clock = 1; ///< clock of the keys: 1 for live, 2 for playback
};

enum class EUpAxis : std::uint32_t
{
  Y = 1,
  Z = 2
};

/// Gives any frame of a capture as a state: the simulated capture and recordings alike.
///
/// The state's key is (frame index x ticks a frame, ticks a frame, clock), so that the first frame stands at 0 s.
/// Slow items are made once and put into every state as the same objects; an item whose value did not change is
/// handed on as the same object too.
///
/// Thread: one caller at a time; `Name`, `RateHz`, `FrameCount` and `FrameNumber` from any thread.
class IFrameSource
{
public:
  virtual ~IFrameSource() = default;
  virtual std::string Name() const = 0;
  virtual double RateHz() const = 0;
  /// -1 for a source that never ends.
  virtual std::int64_t FrameCount() const = 0;
  /// The number that the recording itself gives to a frame.
  virtual std::int64_t FrameNumber( std::int64_t i_Index ) const = 0;
  virtual EUpAxis UpAxis() const = 0;
  /// Why that axis was taken, as a sentence for the report.
  virtual std::string UpAxisReason() const = 0;
  virtual void SetUpAxis( EUpAxis i_Axis ) = 0;
  /// `InvalidIndex` off the recording.
  virtual ZEK::IResult MakeState( std::int64_t i_Index, const VStateMaker& i_rMaker, ZEK::VFlowStateRef& o_rState ) = 0;
  /// With a function, `MakeState` does not wait for what takes long, the frames of video: the state has the nearest
  /// that are there, and the function is called when those that it lacked have come, so that the same frame may be made
  /// again. It is called on any thread and must not call the source. Without one, as at first, `MakeState` waits.
  virtual void SetOnReady( std::function< void() > ) {}

  std::int64_t TicksPerFrame() const
  {
    const auto Ticks = static_cast< std::int64_t >( static_cast< double >( ZEK::FlowTicksPerSecond ) / RateHz() + 0.5 );
    return Ticks > 0 ? Ticks : 1;
  }
};

} // namespace HostSources
