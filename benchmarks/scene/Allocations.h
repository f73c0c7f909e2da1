#pragma once

#include <cstdint>

namespace SceneBench
{

/// Calls of operator new in this program since its start.
std::uint64_t AllocationCount();

} // namespace SceneBench
