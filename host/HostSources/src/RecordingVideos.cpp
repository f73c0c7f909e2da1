#include "RecordingVideos.h"

#include "RecordingItems.h"

#include <CoreMoxelTypes/FlowTypes.h>

#include <algorithm>
#include <thread>

namespace HostSources
{
namespace
{
using namespace CoreMoxelTypes;

/// Of decoded frames, over all cameras.
constexpr std::size_t MostBytes = std::size_t{ 512 } << 20;
constexpr std::size_t MostBytesOfOne = std::size_t{ 64 } << 20;
constexpr std::size_t MostDecoderThreads = 4;

/// From places in the image to those on the sensor, (0, 0) the centre of the first pixel.
void CoverSensor( const VCameraHardware& i_rHardware, VVideoFrame& io_rFrame )
{
  if ( i_rHardware.SensorWidth == 0 || i_rHardware.SensorHeight == 0 )
  {
    return;
  }
  io_rFrame.SensorScale = { static_cast< f32 >( i_rHardware.SensorWidth ) / static_cast< f32 >( io_rFrame.Width ),
                            static_cast< f32 >( i_rHardware.SensorHeight ) / static_cast< f32 >( io_rFrame.Height ) };
  io_rFrame.SensorOffset = { ( io_rFrame.SensorScale.x - 1 ) / 2, ( io_rFrame.SensorScale.y - 1 ) / 2 };
}
} // namespace

VRecordingVideos::VRecordingVideos( const VRecording& i_rRecording )
  : m_rRecording( i_rRecording )
{
  const auto Count =
      static_cast< std::size_t >( std::count_if( i_rRecording.Cameras.begin(), i_rRecording.Cameras.end(),
                                                 []( const VRecordingCamera& i_rCamera )
                                                 {
                                                   return i_rCamera.Video.pClip != nullptr;
                                                 } ) );
  if ( Count == 0 )
  {
    return;
  }
  const std::size_t Cores = std::max( std::thread::hardware_concurrency(), 1u );
  HostVideo::VVideoStreamOptions Options;
  Options.MostBytes = std::min( MostBytes / Count, MostBytesOfOne );
  Options.DecoderThreads = static_cast< int >( std::clamp< std::size_t >( Cores / Count, 1, MostDecoderThreads ) );
  m_Shown.reserve( Count );
  for ( const VRecordingCamera& rCamera : i_rRecording.Cameras )
  {
    if ( rCamera.Video.pClip )
    {
      VShown& rShown = m_Shown.emplace_back();
      rShown.pCamera = &rCamera;
      rShown.pStream = std::make_unique< HostVideo::VVideoStream >( rCamera.Video.pClip, Options );
    }
  }
}

void VRecordingVideos::Forget()
{
  for ( VShown& rShown : m_Shown )
  {
    rShown.Of = -1;
    rShown.Item = {};
  }
}

void VRecordingVideos::SetOnReady( const std::function< void() >& i_rOnReady )
{
  m_bWait = !i_rOnReady;
  for ( VShown& rShown : m_Shown )
  {
    rShown.pStream->SetOnReady( i_rOnReady );
  }
}

void VRecordingVideos::Want( std::int64_t i_Index )
{
  for ( VShown& rShown : m_Shown )
  {
    rShown.pStream->Want( rShown.pCamera->Video.FrameAt( i_Index, m_rRecording.RateHz ) );
  }
}

ZEK::IResult VRecordingVideos::MakeItems( const VStateMaker& i_rMaker, std::int64_t i_Index )
{
  ZEK::IResult Result;
  for ( VShown& rShown : m_Shown )
  {
    const std::int64_t Wanted = rShown.pCamera->Video.FrameAt( i_Index, m_rRecording.RateHz );
    HostVideo::VVideoPicture Picture = m_bWait ? rShown.pStream->GetExact( Wanted ) : rShown.pStream->Get( Wanted );
    if ( Picture.Index < 0 )
    {
      rShown.Of = -1;
      rShown.Item = {};
      continue;
    }
    if ( rShown.Of == Picture.Index && rShown.Item )
    {
      continue;
    }
    rShown.Of = -1;
    auto* const pFrame = MakeItem< FlowVideoFrame >( i_rMaker, rShown.Item, Result );
    if ( !pFrame )
    {
      return Result;
    }
    *pFrame = std::move( Picture.Frame );
    CoverSensor( rShown.pCamera->Camera.Hardware, *pFrame );
    rShown.Item->MutableValue().SetName( ZEK::EFlowNameDevice, rShown.pCamera->Camera.Name );
    rShown.Of = Picture.Index;
  }
  return Result;
}

void VRecordingVideos::AddItems( ZEK::IFlowState& io_rState ) const
{
  for ( const VShown& rShown : m_Shown )
  {
    if ( rShown.Item )
    {
      io_rState.AddItem( rShown.Item );
    }
  }
}

} // namespace HostSources
