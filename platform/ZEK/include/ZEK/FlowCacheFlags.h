#pragma once

#include <cstdint>

namespace ZEK
{

/// Flags of `IFlowStateCacheManager::CreateCache`. A flag that a host does not know changes nothing.
enum EFlowCacheFlags : std::uint32_t
{
  EFlowCacheDefault = 0,
  EFlowCacheWatchedLive = 1 ///< nobody looks back: a few of the newest states are enough
};

} // namespace ZEK
