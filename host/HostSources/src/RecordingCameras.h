#pragma once

#include "RecordingSubjects.h"

#include <ZEK/FlowState.h>

#include <vector>

namespace HostSources
{

/// The items of a recording's cameras: hardware, settings and calibration once; centroids, assignments and labels anew
/// when they differ from the frame before.
class VRecordingCameras
{
public:
  /// Both live longer than this.
  VRecordingCameras( const VRecording& i_rRecording, const VRecordingSubjects& i_rSubjects );

  /// Appends; forgets the items of any frame.
  ZEK::IResult MakeSlowItems( const VStateMaker& i_rMaker, std::vector< ZEK::VFlowItemRef >& io_rSlow );
  ZEK::IResult MakeFastItems( const VStateMaker& i_rMaker, std::int64_t i_Index );
  void AddItems( ZEK::IFlowState& io_rState ) const;

private:
  struct VSeen
  {
    std::int64_t Of = -1; ///< the frame that the items were made of
    ZEK::VFlowItemRef Centroids, Assignments, Labels;
  };
  bool SameFrame( const VRecordingCamera& i_rCamera, std::int64_t i_A, std::int64_t i_B ) const;
  void NumberPoints( std::int64_t i_Index );
  ZEK::IResult MakeSeen( const VStateMaker& i_rMaker, const VRecordingCamera& i_rCamera, std::int64_t i_Index,
                         VSeen& o_rSeen );

  const VRecording& m_rRecording;
  const VRecordingSubjects& m_rSubjects;
  std::vector< VSeen > m_Seen; ///< by camera
  /// Index of each column's point among those of the frame that are there; -1 for one that is missing.
  std::vector< std::int32_t > m_Entries;
  std::int64_t m_EntriesOf = -1;
};

} // namespace HostSources
