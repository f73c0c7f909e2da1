#pragma once

#include <HostSources/IFrameSource.h>
#include <HostSources/VRecording.h>
#include <HostVideo/VVideoStream.h>

#include <ZEK/FlowState.h>

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

namespace HostSources
{

/// The video items of a recording's cameras. A camera that shows the same frame keeps its item.
class VRecordingVideos
{
public:
  /// Lives longer than this.
  explicit VRecordingVideos( const VRecording& i_rRecording );

  /// Makes all items anew.
  void Forget();
  /// As `IFrameSource::SetOnReady`.
  void SetOnReady( const std::function< void() >& i_rOnReady );
  /// Begins to decode what belongs to a frame of the recording.
  void Want( std::int64_t i_Index );
  ZEK::IResult MakeItems( const VStateMaker& i_rMaker, std::int64_t i_Index );
  void AddItems( ZEK::IFlowState& io_rState ) const;

private:
  struct VShown
  {
    const VRecordingCamera* pCamera = nullptr;
    std::unique_ptr< HostVideo::VVideoStream > pStream;
    std::int64_t Of = -1; ///< frame of the clip that the item was made of
    ZEK::VFlowItemRef Item;
  };
  const VRecording& m_rRecording;
  std::vector< VShown > m_Shown; ///< cameras that have a video
  bool m_bWait = true;
};

} // namespace HostSources
