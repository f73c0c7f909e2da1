#pragma once

#include <HostSources/IFrameSource.h>

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

namespace HostSources
{

/// Carries the frames of a source into a cache on a thread of its own, live or as a playback clock asks.
///
/// A frame whose slow parts come late is shown again with them.
/// A frame that cannot be made is logged once a run of failures, its result kept, and the pump goes on.
/// Thread: all operations from any thread, but `Stop` and the destructor not from the cache's notifiers.
class VSourcePump
{
public:
  /// Hands over what lies around the frame that is shown and gets back what it handed over before, to be cleared. True:
  /// to be told to whoever looks on, as nothing else happens for the moment.
  using VTakeAround = std::function< void( std::vector< ZEK::VFlowStateRef >&, bool ) >;

  VSourcePump( std::shared_ptr< IFrameSource > i_pSource, std::shared_ptr< ZEK::IFlowWritableStateCache > i_pCache,
               const VStateMaker& i_rMaker );
  /// Stops.
  ~VSourcePump();

  /// Shows frames at the source's rate from `i_First` on, in real time: a pump that is late leaves frames out rather
  /// than falling behind. A source that ends stands at its last frame.
  void StartLive( std::int64_t i_First = 0 );
  /// Shows what `Show` asks for, and only the newest of what is waiting.
  void StartFollow();
  /// Joins the thread: nothing is added to the cache after it. What was asked for and not begun is forgotten.
  void Stop();
  bool IsRunning() const;

  /// Asks for a frame in follow mode; before `StartFollow` it waits for it. The cache is emptied first when the frame
  /// lies before the one shown last, or when `i_bSeek` is set.
  void Show( std::int64_t i_Index, bool i_bSeek = false );
  /// Returns when the newest frame asked for is in the cache (or failed), or the pump does not follow.
  void WaitShown();

  /// In follow mode, the pump makes in the time it has left so many frames to each side of the one that is shown, those
  /// to come first; never beside one with video, which would have to be decoded frame by frame. Before the first start.
  void KeepAround( std::int64_t i_Frames, VTakeAround i_Take );

  /// Runs a function on the source while no frame is being made, on the calling thread.
  void WithSource( const std::function< void( IFrameSource& ) >& i_rFunction );

  /// The frame that is in the cache since the last start; -1 before the first.
  std::int64_t ShownIndex() const;
  std::uint64_t AddedCount() const;
  /// Frames that live mode left out because it was late.
  std::uint64_t SkippedCount() const;
  /// Of the frame that was made last.
  ZEK::IResult LastResult() const;

private:
  struct VImpl;
  std::unique_ptr< VImpl > m_pImpl;
};

} // namespace HostSources
