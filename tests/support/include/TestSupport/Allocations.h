#pragma once

#include <cstdint>

namespace TestSupport
{

/// Allocations by operator new in this program so far. A program that asks lists tests/support/src/Allocations.cpp
/// among its sources. Always 0 under a sanitizer, which brings its own operator.
std::uint64_t AllocationCount();

} // namespace TestSupport
