#pragma once

#include <ZEK/Result.h>
#include <ZEK/Store.h>

#include <memory>
#include <string>

namespace HostServices
{

/// Reads a settings file into a store of its own and, if all of it can be read, into the other, where all that have a
/// value become persistent. `o_rWhy` says what is wrong with the file.
ZEK::IResult LoadSettings( const std::string& i_rPath, ZEK::IStore& io_rStore, std::shared_ptr< ZEK::IStore >& o_rpRead,
                           std::string& o_rWhy );

/// Every value of the first store is in the second as well.
bool HoldsAll( ZEK::IStore& i_rRead, ZEK::IStore& i_rStore );

/// The document of the persistent entries. Reads the store in one scope, and makes the text after it.
ZEK::IResult SettingsText( ZEK::IStore& i_rStore, std::string& o_rText );

/// Makes the folder, too.
ZEK::IResult SaveSettingsText( const std::string& i_rPath, const std::string& i_rText );

/// Moves the file to a dated name beside it, or puts a copy there: "settings.kept-20260131-142500.json". Never over
/// another file, and not while another program saves it.
ZEK::IResult KeepAside( const std::string& i_rPath, bool i_bCopy, std::string& o_rKept );

} // namespace HostServices
