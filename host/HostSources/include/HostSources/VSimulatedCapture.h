#pragma once

#include <HostSources/IFrameSource.h>

#include <CoreMoxelTypes/Camera.h>

#include <cstdint>
#include <memory>
#include <optional>
#include <vector>

namespace HostSources
{

/// What can be wrong with a camera.
enum class ESimulatedFault : std::uint32_t
{
  Bumped, ///< it stands otherwise than it was calibrated, so that nothing it sees fits
  Missing,
  Disconnected,
  Disabled,
  NotContributing,
  Uncalibrated,
  Hot,   ///< far from the temperature of its calibration
  Warned ///< all eight warnings
};
struct VSimulatedFault
{
  std::uint32_t Camera = 0; ///< from 0; one that is not there is left out
  ESimulatedFault Fault = ESimulatedFault::Bumped;
};

/// What the simulated capture shows. Values outside their range are moved to its nearer end.
struct VSimulatedCaptureOptions
{
  std::uint32_t Seed = 1;
  std::uint32_t Cameras = 12;     ///< 0 to 256
  std::uint32_t Performers = 2;   ///< 0 to 16
  double RateHz = 120;            ///< 25 to 1000
  double NoiseMm = 0.3;           ///< standard deviation of a reconstruction on each axis, 0 to 50
  double GapProbability = 0.002;  ///< that a marker is lost for a part of a fifth of a second, for each of them
  double SwapProbability = 0.002; ///< that two near markers change labels for a part of half a second, for each pair
  std::uint32_t ExtraPoints = 3;  ///< unlabelled points that come and go, 0 to 1000
  bool bObjects = true;           ///< a prop and a calibration wand
  bool bForcePlates = true;
  bool bGreyscale = true;         ///< optical cameras send greyscale blobs, some edges too
  std::uint32_t VideoCameras = 2; ///< the last of the cameras, at most half of them
  std::optional< CoreMoxelTypes::EPixelFormat > VideoFormat =
      std::nullopt; ///< none: every format in turn, two seconds each
  std::vector< VSimulatedFault > Faults = {};
  /// 0 to 15. In every 32 frames one is sent that many frames too late, after newer ones: 0 sends all in order.
  std::uint32_t LateFrames = 0;
  bool bSolving = false;     ///< a second, fuller skeleton of each performer
  bool bRetargeting = false; ///< a character of other proportions, driven by each performer
};

/// A capture without hardware: people who walk in circles on a floor of 6 by 6 m, within a ring of cameras.
///
/// Never ends; the same options and the same frame give the same values, in whatever order frames are asked for.
/// z is up, millimetres. `SetUpAxis` changes what the state claims (0x1029), not the points.
///
/// Each state holds: 0x1000, 0x1001, 0x100a, 0x100b, 0x102d, 0x102e, 0x102f and 0x1037 of each camera (names
/// "Camera 1", ... under the device selector), of an optical one 0x1002, 0x1003, 0x100c and 0x1022 too, with greyscale
/// 0x1005 and for every fourth 0x1006, of a video camera 0x1007, 30 times a second; 0x1012, 0x1013,
/// 0x1011, 0x101a and 0x1027 of each performer (names "Ada", "Ben", ... under the object selector) and of the prop; if
/// asked for, 0x101b, 0x101c, 0x101d and 0x102c of each performer and 0x1038, 0x1039 and 0x103a of the character that
/// it drives ("Ada Character"); 0x1035, 0x1036 and 0x1034 of the wand; 0x1023 and 0x1025 of the two plates "Plate 1"
/// and "Plate 2"; 0x1 with the reconstruction's volume; 0x1029; 0x1031; 0x100d and 0x100f. A label's `SubjectId` is
/// `VSubject::Id`, its `MarkerId` the index into `VSubject::Markers`, which is also `VMarker::Id`; the wand's are of
/// `VRigidObject`. Extra points have no label. Two labels that are swapped each name the other's marker.
/// `MarkerPositions` are where the bones have the markers; a bone's health falls while markers of its own are in a gap
/// or swapped. 0x1025 holds the samples of the frame's own time, at a whole multiple of the rate near 1000 Hz; the
/// moment is about the middle of the plate. All but 0x1003, 0x1005 to 0x1007, 0x100c, 0x100d, 0x1011, 0x101d, 0x1022,
/// 0x1025, 0x1034 and 0x103a are the same objects in every state; 0x100f is while no label comes, goes or is swapped,
/// 0x102e while a camera reads the same temperature: it drifts by a degree or two within minutes and is read once a
/// second, to a tenth.
///
/// With `LateFrames` the index counts states in the order in which they come; their keys tell the frames they are.
///
/// Centroids are the exact images of where markers truly are, without the noise of reconstructions. `Rays` counts the
/// centroids that are assigned to a reconstruction. A marker in a gap may have centroids, without an assignment. A
/// camera that is missing, disconnected or disabled sends nothing, one that is bumped, uncalibrated or does not
/// contribute sends centroids without assignments.
class VSimulatedCapture final : public IFrameSource
{
public:
  explicit VSimulatedCapture( const VSimulatedCaptureOptions& i_rOptions = {} );
  ~VSimulatedCapture() override;

  /// As they were taken, within their ranges.
  const VSimulatedCaptureOptions& Options() const;

  std::string Name() const override;
  double RateHz() const override;
  std::int64_t FrameCount() const override { return -1; }
  std::int64_t FrameNumber( std::int64_t i_Index ) const override;
  EUpAxis UpAxis() const override;
  std::string UpAxisReason() const override;
  void SetUpAxis( EUpAxis i_Axis ) override;
  ZEK::IResult MakeState( std::int64_t i_Index, const VStateMaker& i_rMaker, ZEK::VFlowStateRef& o_rState ) override;

private:
  struct VImpl;
  std::unique_ptr< VImpl > m_pImpl;
};

} // namespace HostSources
