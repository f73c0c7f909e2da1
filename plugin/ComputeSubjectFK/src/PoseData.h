#pragma once

// What the loops over all joints of a pose work on. Included by sources that are compiled for other processors than the
// rest: nothing here may have an inline function.

#include <cstddef>
#include <cstdint>

namespace ComputeSubject
{

inline constexpr int PoseLanes = 4;

/// Joints of one kind, one a lane; lanes without a joint repeat the first.
struct VPoseBlock
{
  alignas( 32 ) double Fixed[12][PoseLanes]; ///< rotation row by row, then translation
  std::uint32_t State[PoseLanes];            ///< where a joint's numbers begin
  std::uint32_t Segment[PoseLanes];
};

/// Kinds of joint that move, in the order of their blocks.
enum EPoseKind : std::uint32_t
{
  EPoseFree,
  EPoseBall,
  EPoseHardySpicer,
  EPoseHinge,
  EPoseSlider,
  EPoseKinds
};

/// A segment on a Dummy joint: what stands still against the parent, as three rows of rotation and translation.
struct VPoseStill
{
  alignas( 32 ) double Rows[12];
  std::uint32_t Segment;
};

/// A tree of joints. For each, the fixed transform is Post(parent) Pre.
struct VPoseTree
{
  const VPoseBlock* pBlocks[EPoseKinds];
  std::uint32_t BlockCounts[EPoseKinds];
  const VPoseStill* pStills;
  std::uint32_t StillCount;
  const std::int32_t* pParents; ///< by segment, below their own index; -1 for a root
  std::uint32_t SegmentCount;
};

/// Writes each segment's result as 12 numbers, and meanwhile other things there.
using VPoseFunction = void ( * )( const VPoseTree& i_rTree, const double* i_pState, double* o_pResults );
void PoseBaseline( const VPoseTree& i_rTree, const double* i_pState, double* o_pResults );
/// Only where the processor has AVX2 and FMA.
void PoseAvx2( const VPoseTree& i_rTree, const double* i_pState, double* o_pResults );

/// What the loops leave out: joints of a kind that turn further than pi, or by what is no number. Writes the three rows
/// of their fixed transform times their moving part.
void PoseExactly( EPoseKind i_Kind, const VPoseTree& i_rTree, const double* i_pState, double* o_pResults );

/// Turns up to this, squared and quartered, are done by the loops; a little over (pi / 2)².
inline constexpr double MostHalfTurnSquared = 2.5;

} // namespace ComputeSubject
