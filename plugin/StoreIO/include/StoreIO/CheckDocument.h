#pragma once

#include <ZEK/Result.h>

#include <string>
#include <string_view>
#include <vector>

namespace StoreIO
{

/// Everything that an import would complain of, all at once and with nothing logged or written: faults of the text
/// with their place, the version, and each member that is not as it should be. Unlike the import it goes on behind a
/// member of the wrong type, and it also tells of members of a schema that are not understood, of leaf values that
/// would be taken otherwise than they are written, and of names that are given twice.
///
/// The result is that of an import into an empty store; `OkButPartial` when only what the import would pass over is
/// wrong.
ZEK::IResult CheckDocument( std::string_view i_Text, std::vector< std::string >& o_rErrors );

/// The same for a file as it is. A file that cannot be read is one error.
ZEK::IResult CheckDocumentFile( const std::string& i_rPath, std::vector< std::string >& o_rErrors );

} // namespace StoreIO
