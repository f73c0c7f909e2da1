#pragma once

#include <ZEK/Result.h>
#include <ZEK/Store.h>

namespace HostServices
{

/// The branch of a store under which all preferences lie.
inline constexpr const char* PreferencesRoot = "Preferences";

/// Gives a store the entries of all preferences, in one write scope: persistent, with their defaults, texts, ranges and
/// choices. Values that are there stay. One of another type, or one that its entry does not take, is replaced by the
/// default with a log line of level 3. `NotPermitted` inside a read scope.
ZEK::IResult DeclareUserPreferences( ZEK::IStore& io_rStore );

} // namespace HostServices
