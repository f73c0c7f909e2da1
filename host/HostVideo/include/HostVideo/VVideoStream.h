#pragma once

#include <HostVideo/VideoClip.h>

#include <CoreMoxelTypes/Camera.h>

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>

namespace HostVideo
{

struct VVideoStreamOptions
{
  /// Of decoded frames that are kept around the one that is wanted; two frames are kept however large they are.
  std::size_t MostBytes = std::size_t{ 48 } << 20;
  int DecoderThreads = 1; ///< of the decoder; 1: the stream's own does it
};

/// A frame of a stream.
struct VVideoPicture
{
  std::int64_t Index = -1; ///< -1: none
  CoreMoxelTypes::VVideoFrame Frame;
  bool bExact = false; ///< the one that was asked for, or what the file has in its place
};

struct VVideoStreamCounts
{
  std::uint64_t Decoded = 0, Copied = 0, Seeks = 0;
  std::uint64_t HeldBytes = 0, MostHeldBytes = 0; ///< of decoded frames in the ring
  std::size_t HeldFrames = 0, MostHeldFrames = 0;
  std::size_t Missing = 0; ///< frames that could not be decoded
};

/// Decodes the frames of one video on a thread of its own, a little ahead of the one that is wanted.
///
/// The thread begins with the first frame that is asked for and ends with the stream. In place of a frame that cannot
/// be decoded stands the last good one before it. A file that can no longer be read gives no frame. Each of both is
/// logged once. Thread: `Want` and the `Get` functions from one thread at a time.
class VVideoStream
{
public:
  explicit VVideoStream( std::shared_ptr< const VVideoClip > i_pClip, const VVideoStreamOptions& i_rOptions = {} );
  ~VVideoStream();
  VVideoStream( const VVideoStream& ) = delete;
  VVideoStream& operator=( const VVideoStream& ) = delete;

  const VVideoClip& Clip() const { return *m_pClip; }

  /// Is called on the stream's thread when a frame that `Get` could not give is there, unless another one was asked
  /// for since. Must not call the stream. Returns when a call of the function before has ended.
  void SetOnReady( std::function< void() > i_OnReady );

  /// Begins to decode a frame; an index off the clip is moved to its nearer end.
  void Want( std::int64_t i_Index );
  /// Never waits: while the frame is not there, the nearest before it that is, or the one that was given last.
  VVideoPicture Get( std::int64_t i_Index );
  /// Waits for the frame.
  VVideoPicture GetExact( std::int64_t i_Index );

  VVideoStreamCounts Counts() const;

private:
  struct VImpl;
  std::shared_ptr< const VVideoClip > m_pClip;
  std::unique_ptr< VImpl > m_pImpl;
};

} // namespace HostVideo
