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
  /// The structures with some poses, z up as views of the structure alone take them, made from data of that axis.
  ZEK::IResult MakePoses( const VStateMaker& i_rMaker, EUpAxis i_Up );
  ZEK::IResult MakeFastItems( const VStateMaker& i_rMaker, std::int64_t i_Index );
  void AddItems( const ZEK::VFlowTimeKey& i_rSlowKey, ZEK::IFlowState& io_rState ) const;

private:
  struct VPlayed
  {
    const VRecordingSkeleton* pSkeleton = nullptr;
    std::unique_ptr< ComputeSubject::VComputeSubjectFK > pSubject; ///< null where it cannot be posed
    std::uint32_t Id = 0;
    std::int64_t Of = -1; ///< the frame that the item was made of
    ZEK::VFlowItemRef Item, Poses;
  };
  std::vector< VPlayed > m_Played;
};

} // namespace HostSources
