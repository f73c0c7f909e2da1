#pragma once

#include <HostSources/IFrameSource.h>
#include <HostSources/VRecording.h>

#include <atomic>
#include <memory>
#include <string>
#include <vector>

namespace HostSources
{

/// Gives the frames of a recording as states.
///
/// A state holds every valid point in one `FlowReconstructionSet` (Id: number of the point, from 1; points without a
/// column are numbered on from there), and the named ones in a `FlowReconstructionLabelSet` with one `FlowSubject` a
/// prefix "Subject:" (the file's stem where there is none); `SubjectId` is the subject's `Id`, from 1, and `MarkerId`
/// the index into its `Markers`. Beside them stand the up axis, the volume's floor, each force plate with the samples
/// of the frame, and each camera with its hardware, calibration, centroids, their labels and their assignments (index
/// into the frame's reconstructions), and the frame of its video where it has one. A skeleton is one `FlowSubject`
/// more, with its structure and poses as `FlowSubjectParametrised` and each frame's as `FlowSubjectDynamicParameters`.
/// Coordinates stay as they are when y is up: the view is told by the up axis.
class VRecordingSource final : public IFrameSource
{
public:
  explicit VRecordingSource( std::shared_ptr< const VRecording > i_pRecording );
  ~VRecordingSource() override;

  std::string Name() const override;
  double RateHz() const override;
  std::int64_t FrameCount() const override;
  std::int64_t FrameNumber( std::int64_t i_Index ) const override;
  EUpAxis UpAxis() const override;
  std::string UpAxisReason() const override;
  void SetUpAxis( EUpAxis i_Axis ) override;
  ZEK::IResult MakeState( std::int64_t i_Index, const VStateMaker& i_rMaker, ZEK::VFlowStateRef& o_rState ) override;
  void SetOnReady( std::function< void() > i_OnReady ) override;

  const VRecording& Recording() const { return *m_pRecording; }
  /// The frame nearest to a time, within the recording.
  std::int64_t NearestFrame( double i_Seconds ) const;

private:
  class VState;
  std::shared_ptr< const VRecording > m_pRecording;
  std::unique_ptr< VState > m_pState;
  std::atomic< EUpAxis > m_UpAxis;
  std::atomic< bool > m_bOverruled{ false };
};

} // namespace HostSources
