#pragma once

#include <ZEK/TypedValueText.h>

#include <cstddef>
#include <string_view>

namespace StoreIO
{

inline constexpr std::string_view KeyVersion = "Version";
inline constexpr std::string_view KeyChildren = "Children";
inline constexpr std::string_view KeyValue = "Value";
inline constexpr std::string_view KeyValueProposed = "Value-Proposed";
inline constexpr std::string_view KeyData = "Data";
inline constexpr std::string_view KeyType = "Type";
inline constexpr std::string_view LeafVersions = "Versions";

inline constexpr ZEK::IO::VVersion MinimumVersion{ 3, 0 };
inline constexpr ZEK::IO::VVersion MaximumVersion{ 3, 0 };
/// Of a document that does not tell.
inline constexpr ZEK::IO::VVersion OldestVersion{ 1, 0 };

/// As the RapidJSON documents of the exporter and importer take memory.
inline constexpr std::size_t PoolChunkBytes = 64 * 1024;
inline constexpr std::size_t ParseStackBytes = 1024;

} // namespace StoreIO
