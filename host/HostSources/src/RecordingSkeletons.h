#pragma once

#include "RecordingItems.h"

#include <HostSources/VRecording.h>

#include <ComputeSubjectFK/VComputeSubjectFK.h>

#include <memory>
#include <vector>

namespace HostSources
{

/// The items of a recording's skeletons: the subject with its poses' structure, and each frame's joint state with the
/// segments' poses in the world.
class VRecordingSkeletons
{
public:
  /// The recording lives longer than this. Subjects are numbered from `i_FirstId` on.
  VRecordingSkeletons( const VRecording& i_rRecording, std::uint32_t i_FirstId );

  ZEK::IResult MakeSlowItems( const VStateMaker& i_rMaker, std::vector< ZEK::VFlowItemRef >& io_rSlow );
  ZEK::IResult MakeFastItems( const VStateMaker& i_rMaker, std::int64_t i_Index );
  void AddItems( ZEK::IFlowState& io_rState ) const;

private:
  struct VPlayed
  {
    const VRecordingSkeleton* pSkeleton = nullptr;
    std::unique_ptr< ComputeSubject::VComputeSubjectFK > pSubject; ///< null where it cannot be posed
    std::uint32_t Id = 0;
    std::int64_t Of = -1; ///< the frame that the item was made of
    ZEK::VFlowItemRef Item;
  };
  std::vector< VPlayed > m_Played;
};

} // namespace HostSources
