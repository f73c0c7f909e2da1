#pragma once

#include <Flow2Graphics/VFlowRenderSubject.h>

#include <ComputeSubjectFK/VComputeSubjectFK.h>
#include <ZEK/Log.h>

#include <cmath>
#include <limits>

namespace Flow2Graphics
{

/// What a group keeps of an object beside its record.
struct VFlowRenderSubject::VOwn
{
  std::size_t Slot = 0; ///< in the extractor
  bool bOneBone = false;
  bool bModelled = true;           ///< the model may have a place for a marker; else all of its places are nowhere
  std::uint32_t RootBone = NoBone; ///< by its place in the group
  /// Made when a joint state is first to be posed; null after that for a skeleton that cannot be.
  std::unique_ptr< ComputeSubject::VComputeSubjectFK > pKinematics;
  bool bKinematicsTried = false;

  static constexpr std::uint32_t NoBone = ~std::uint32_t{ 0 };
};

constexpr float NoPlace = MoxelGraphics::VSubjectGroup::None;
constexpr MoxelGraphics::VBonePose NoPose{ NoPlace, NoPlace, NoPlace, NoPlace, NoPlace, NoPlace,
                                           NoPlace, NoPlace, NoPlace, NoPlace, NoPlace, NoPlace };

ZEK::VLogCategory& SubjectCategory();

} // namespace Flow2Graphics
