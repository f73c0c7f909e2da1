#pragma once

#include <HostSources/VRecording.h>

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace HostSources
{

/// What a recording holds, in figures, for people and programs to read.
struct VRecordingInfo
{
  struct VGap
  {
    std::string Label;
    std::uint64_t Missing = 0;
  };
  struct VPlate
  {
    std::string Name;
    std::uint32_t Type = 0;
    CoreMoxelTypes::D3 Corners[4]; ///< mm, world
    CoreMoxelTypes::D3 Origin;     ///< mm, plate frame
    std::uint64_t SampleCount = 0;
    double PeakForce = 0; ///< greatest |Fz|, N
    std::uint64_t PeakSample = 0;
    std::int64_t PeakFrame = 0;    ///< index from 0
    CoreMoxelTypes::D3 PeakCentre; ///< mm, world; NaN where there is none
  };

  struct VSkeleton
  {
    std::string Name;
    std::vector< std::string > Segments;
    std::vector< std::string > Markers; ///< of the model
    std::uint64_t JointCount = 0;       ///< segments behind them are nothing but bones
    std::uint64_t BoneCount = 0, PoseCount = 0;
    std::uint64_t EndSiteCount = 0, ChannelCount = 0, StateSize = 0;
  };
  /// Whom labelled points belong to.
  struct VSubject
  {
    std::string Name;
    std::vector< std::string > Markers;
  };
  struct VVideo
  {
    std::string File, Codec, PixelFormat;
    std::uint32_t Width = 0, Height = 0; ///< px
    std::int64_t FrameCount = 0;
    double RateHz = 0;
    bool bByNumber = true; ///< shown frame by frame, otherwise the nearest in time
  };
  struct VCamera
  {
    std::string Name;
    std::uint32_t Width = 0, Height = 0; ///< px
    bool bCalibrated = false;
    std::uint64_t DetectionCount = 0, KnownCount = 0; ///< known: of a point of the recording
    std::uint64_t FramesSeen = 0;                     ///< frames with a detection
    std::uint64_t MeasuredCount = 0;
    double MeanDistance = 0, WorstDistance = 0; ///< of detections from projected points, px
    std::optional< VVideo > Video;
  };

  std::string Name, Format, Form, Unit;
  std::uint64_t PointCount = 0;
  std::vector< std::string > Labels;
  std::int64_t FrameCount = 0, FirstFrame = 0, LastFrame = 0;
  double RateHz = 0, DurationSeconds = 0;
  std::uint64_t SampleCount = 0, GapCount = 0, UnlabelledCount = 0;
  std::vector< VGap > Gaps; ///< the points that have any
  VRecordingBounds Bounds;
  double AnalogRateHz = 0;
  std::vector< VAnalogChannel > AnalogChannels;
  std::vector< VPlate > ForcePlates;
  std::vector< VCamera > Cameras;
  std::vector< VSubject > Subjects;
  std::uint64_t NobodysPointCount = 0; ///< columns that belong to no subject
  std::vector< VSkeleton > Skeletons;
  std::vector< VRecordingEvent > Events;
  EUpAxis UpAxis = EUpAxis::Z;
  std::string UpAxisReason;
  std::vector< std::string > Notes;

  /// Lines for a terminal, ending in a line feed.
  std::string Text() const;
  /// One JSON object, indented; numbers that are not finite become null.
  std::string Json() const;
};

VRecordingInfo DescribeRecording( const VRecording& i_rRecording );

} // namespace HostSources
