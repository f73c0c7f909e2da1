#pragma once

#include <HostSources/CameraCalibrations.h>
#include <HostVideo/VideoClip.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

namespace HostSources
{

/// Detections give no radius, px.
constexpr float DetectionRadius = 4;

/// A point that a camera saw.
struct VRecordingDetection
{
  float x = 0, y = 0; ///< px; (0, 0) is the centre of the top left pixel
  float Likelihood = 1;
  std::int32_t Point = -1;  ///< column of the recording's points that was seen; -1: none of them, or not known
  std::uint32_t Person = 0; ///< groups the detections of one frame that belong together
};

/// What a camera filmed, and which frame of it belongs to which frame of the recording.
struct VRecordingVideo
{
  std::shared_ptr< const HostVideo::VVideoClip > pClip; ///< null: the camera has no video
  bool bByNumber = true;       ///< frame by frame from `FirstFrame` on; otherwise the nearest in time
  std::int64_t FirstFrame = 0; ///< of the clip, that belongs to the recording's first

  /// The frame of the clip; after its end the last one stays.
  std::int64_t FrameAt( std::int64_t i_Index, double i_RateHz ) const
  {
    return bByNumber ? std::min( i_Index + FirstFrame, pClip->FrameCount() - 1 )
                     : pClip->NearestFrame( static_cast< double >( i_Index ) / i_RateHz );
  }
};

/// What one camera saw in a recording.
struct VRecordingCamera
{
  VCalibratedCamera Camera; ///< without a calibration where none was found
  /// Frame after frame; frame f owns [DetectionBegin[f], DetectionBegin[f + 1]).
  std::vector< VRecordingDetection > Detections;
  std::vector< std::uint64_t > DetectionBegin; ///< empty for a camera that saw nothing, or one more than frames

  /// Distances between detections and projected points, of those with a likelihood of 0.3 or more; 0 without any.
  std::uint64_t MeasuredCount = 0;
  double MeanDistance = 0, WorstDistance = 0; ///< px

  VRecordingVideo Video;

  std::span< const VRecordingDetection > Frame( std::int64_t i_Index ) const
  {
    const auto Index = static_cast< std::size_t >( i_Index );
    if ( Index + 1 >= DetectionBegin.size() )
    {
      return {};
    }
    return { Detections.data() + DetectionBegin[Index], DetectionBegin[Index + 1] - DetectionBegin[Index] };
  }
};

} // namespace HostSources
