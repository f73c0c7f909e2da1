#pragma once

#include <functional>

namespace HostSources
{

/// Told now and then how much of the work is done, 0 to 1; returning false stops it. May be empty.
using VProgress = std::function< bool( double i_Fraction ) >;

} // namespace HostSources
