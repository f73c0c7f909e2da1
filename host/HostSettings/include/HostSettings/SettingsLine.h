#pragma once

#include <iosfwd>
#include <string>
#include <vector>

namespace HostSettings
{

/// Runs what stands behind `harrow settings` on the command line and gives what the program ends with: 0 for a
/// success, 2 for wrong usage, 5 for a failure. Errors begin with "harrow: ", and the log goes to stderr. Without
/// `--store` the file is `i_rDefaultStore`.
int RunSettingsLine( const std::vector< std::string >& i_rArguments, const std::string& i_rDefaultStore,
                     std::ostream& o_rOutput, std::ostream& o_rErrors );

} // namespace HostSettings
