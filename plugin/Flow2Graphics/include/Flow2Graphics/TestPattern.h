#pragma once

#include <ZEK/FlowState.h>

namespace Flow2Graphics
{

inline constexpr const char* TestPatternCacheName = "[DEV] Test Pattern";

/// Makes the cache of that name where there is none, and puts one state into it in which every view finds something of
/// known place and size: a floor, a lattice of points, a loaded plate, and four calibrated cameras around them, each
/// with a grid of centroids, a disc of greys with its edges, a mask of the corners and a picture of colour bars. Again
/// replaces it. For developers.
ZEK::IResult CreateTestPattern( ZEK::IFlowStateCacheManager& io_rManager, ZEK::IFlowStateFactoryHandle& io_rFactory,
                                ZEK::IFlowStoreHandle& io_rStore );

} // namespace Flow2Graphics
