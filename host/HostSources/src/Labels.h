#pragma once

#include <string>
#include <vector>

namespace HostSources
{

/// Makes every label that is not empty differ from every other: one that repeats becomes its description, or, where
/// that is empty or taken, is numbered "NAME_1", "NAME_2", … Returns how many were changed.
std::size_t MakeLabelsUnique( std::vector< std::string >& io_rLabels,
                              const std::vector< std::string >& i_rDescriptions );

} // namespace HostSources
