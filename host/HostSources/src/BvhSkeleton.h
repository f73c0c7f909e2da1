#pragma once

// A skeleton as a BVH file has it, and as a subject.

#include "SkeletonMath.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace HostSources::Bvh
{

/// What a number of a row says; the order of its axes within both.
enum class EChannel : std::uint8_t
{
  Xposition,
  Yposition,
  Zposition,
  Xrotation,
  Yrotation,
  Zrotation
};

struct VJoint
{
  std::string Name;
  std::int32_t Parent = -1;
  VVector Offset{}; ///< mm
  std::vector< EChannel > Channels;
  std::optional< VVector > End; ///< mm; where the bone ends that has no joint below
};

/// First the joints in their order: Free with a position, Ball with a rotation alone, Dummy without a channel. Each is
/// turned so that its x axis points to the first joint below that is away from it, or else to the end site. Behind them
/// stand the bones to further joints below: Dummy segments of the parent whose x axis points there.
CoreMoxelTypes::VSubject SubjectOf( const std::vector< VJoint >& i_rJoints );

/// Appends the joint state of a row, which has one number a channel, degrees and mm.
void AppendState( const std::vector< VJoint >& i_rJoints, const double* i_pRow, std::vector< double >& io_rStates );

} // namespace HostSources::Bvh
