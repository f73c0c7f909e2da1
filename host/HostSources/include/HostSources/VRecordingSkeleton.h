#pragma once

#include <CoreMoxelTypes/Subject.h>

#include <cstdint>
#include <span>
#include <vector>

namespace HostSources
{

/// A subject whose joints a recording moves.
struct VRecordingSkeleton
{
  /// Segments stand parent first; the x axis of one with a length lies along its bone. Lengths in mm.
  CoreMoxelTypes::VSubject Subject;
  std::size_t JointCount = 0;   ///< segments that are joints; those behind them are nothing but bones
  std::size_t StateSize = 0;    ///< numbers of all joints, at least 1
  std::vector< double > States; ///< frame after frame; mm and rad
  std::uint64_t ChannelCount = 0, EndSiteCount = 0; ///< as the file has them

  std::span< const double > State( std::int64_t i_Frame ) const
  {
    return { States.data() + static_cast< std::size_t >( i_Frame ) * StateSize, StateSize };
  }
};

} // namespace HostSources
