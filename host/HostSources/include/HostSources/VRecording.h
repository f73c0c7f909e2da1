#pragma once

#include <HostSources/IFrameSource.h>
#include <HostSources/VRecordingCamera.h>
#include <HostSources/VRecordingSkeleton.h>

#include <CoreMoxelTypes/Basic.h>

#include <array>
#include <cstdint>
#include <limits>
#include <span>
#include <string>
#include <vector>

namespace HostSources
{

enum class ERecordingFormat : std::uint32_t
{
  Unknown,
  C3d,
  Trc,
  Folder,
  Bvh,
  Motion
};

/// One point in one frame, in millimetres; all of it NaN where the point is missing.
struct VRecordingPoint
{
  float x = std::numeric_limits< float >::quiet_NaN();
  float y = std::numeric_limits< float >::quiet_NaN();
  float z = std::numeric_limits< float >::quiet_NaN();
  float Residual = 0; ///< mm; 0 where the file has none or the point was filled

  bool IsValid() const { return x == x; }
};

struct VAnalogChannel
{
  std::string Name, Description, Unit;
};

/// A force plate, and what it felt.
///
/// Plate axes: x and y along the surface, z down into the floor when the corners stand in their proper order. `Wrench`
/// holds, for each analog sample, the force on the body (N), its moment about the middle of the surface (N mm) and the
/// centre of pressure (mm), all in world axes; the centre is NaN where the plate carries too little to have one. Empty
/// for a plate whose channels are not there.
struct VForcePlate
{
  std::string Name;
  std::uint32_t Type = 0;
  CoreMoxelTypes::D3 Corners[4]; ///< mm, world
  CoreMoxelTypes::D3 Origin;     ///< mm, plate frame, with the sign that the file gives it
  CoreMoxelTypes::D3 Sensor;     ///< mm, plate frame, from the middle of the surface: what the sensors turn about
  CoreMoxelTypes::Rigid Pose;    ///< from plate axes at the middle of the surface to the world
  std::vector< std::uint32_t > Channels; ///< indices into the analog channels, from 0
  std::vector< std::array< float, 9 > > Wrench;

  /// The force on the body along the plate's z axis; negative under load, as z points down.
  double VerticalForce( std::size_t i_Sample ) const
  {
    const auto& rW = Wrench[i_Sample];
    return Pose.R[2] * rW[0] + Pose.R[5] * rW[1] + Pose.R[8] * rW[2];
  }
};

struct VRecordingEvent
{
  std::string Label, Context;
  double FileSeconds = 0; ///< as it stands in the file, where frame 1 is at 0 s
  double Seconds = 0;     ///< from the first frame of the recording
};

/// Least and greatest position; least > greatest while nothing was added.
struct VRecordingBounds
{
  std::array< float, 3 > Min{ std::numeric_limits< float >::max(), std::numeric_limits< float >::max(),
                              std::numeric_limits< float >::max() };
  std::array< float, 3 > Max{ std::numeric_limits< float >::lowest(), std::numeric_limits< float >::lowest(),
                              std::numeric_limits< float >::lowest() };

  bool IsEmpty() const { return Min[0] > Max[0]; }
};

/// A recording in memory, in millimetres, newtons and newton millimetres whatever the units of its file.
struct VRecording
{
  std::string Name; ///< of the file, without its folder; UTF-8
  ERecordingFormat Format = ERecordingFormat::Unknown;
  std::string Form; ///< how the file holds its numbers, e.g. "integer, DEC"
  double RateHz = 100;
  std::int64_t FirstFrame = 1; ///< the number that the file gives to its first frame
  std::int64_t FrameCount = 0;
  std::string Unit;     ///< of the file
  double UnitScale = 1; ///< mm a unit of the file
  EUpAxis UpAxis = EUpAxis::Z;
  std::string UpAxisReason;

  /// One a point, all different; empty for a point that has no name.
  std::vector< std::string > Labels;
  /// The names as the file has them, repeats and all.
  std::vector< std::string > FileLabels;
  std::vector< std::string > Descriptions; ///< empty, or one a point

  /// Frame after frame, one a label.
  std::vector< VRecordingPoint > Points;
  /// One a point of `Points`: bit n is set where camera n contributed. Empty where the file does not say.
  std::vector< std::uint8_t > CameraMasks;
  /// Points that belong to no column, frame after frame; frame f owns [UnlabelledBegin[f], UnlabelledBegin[f + 1]).
  std::vector< VRecordingPoint > Unlabelled;
  std::vector< std::uint64_t > UnlabelledBegin; ///< empty, or one more than frames

  std::vector< VAnalogChannel > AnalogChannels;
  std::uint32_t AnalogPerFrame = 0;
  std::vector< float > Analog; ///< scaled; sample after sample, one a channel

  std::vector< VForcePlate > ForcePlates;
  std::vector< VRecordingCamera > Cameras;
  std::vector< VRecordingSkeleton > Skeletons;
  std::vector< VRecordingEvent > Events;
  std::vector< std::string > Notes; ///< what was odd about the file, as sentences

  VRecordingBounds Bounds;    ///< of all valid points, or of all joints
  std::uint64_t GapCount = 0; ///< missing samples in `Points`

  std::size_t PointCount() const { return Labels.size(); }
  double AnalogRateHz() const { return RateHz * AnalogPerFrame; }
  double DurationSeconds() const { return static_cast< double >( FrameCount ) / RateHz; }
  std::span< const VRecordingPoint > Frame( std::int64_t i_Index ) const
  {
    return { Points.data() + static_cast< std::size_t >( i_Index ) * PointCount(), PointCount() };
  }
  std::span< const VRecordingPoint > UnlabelledFrame( std::int64_t i_Index ) const
  {
    if ( UnlabelledBegin.empty() )
    {
      return {};
    }
    const auto Index = static_cast< std::size_t >( i_Index );
    return { Unlabelled.data() + UnlabelledBegin[Index], UnlabelledBegin[Index + 1] - UnlabelledBegin[Index] };
  }
};

} // namespace HostSources
