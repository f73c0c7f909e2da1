#pragma once

#include "EntryTable.h"

#include <ZEK/EntryPath.h>

#include <optional>
#include <string_view>
#include <vector>

namespace Store
{

/// True when a component is exactly `*`; a `*` inside a name means itself.
bool IsPattern( const ZEK::VEntryPath& i_rPath );

/// Takes the first component off; what remains is nothing after the last one. "a/" has the components "a" and "".
std::string_view TakeComponent( std::optional< std::string_view >& io_rRest );

/// The committed entries that a path names: the one of that path, or for a pattern all that its walk from the root
/// finds. Thread: inside a scope, or under the store mutex.
std::vector< VStoreEntry* > FindCommitted( const VEntryTable& i_rTable, const ZEK::VEntryPath& i_rPath );
/// The same with the open scope's writes over the committed entries. Thread: that of the write scope.
std::vector< VStoreEntry* > FindOverlaid( const VEntryTable& i_rTable, const ZEK::VEntryPath& i_rPath );

} // namespace Store
