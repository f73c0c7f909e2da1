#pragma once

#include <string>

namespace UtilsFileSystem::Linux
{

/// Opens a file for a stream, with the permissions that the thread's work asks for when it is made.
/// -1 and `errno` on a failure, also for a folder.
int OpenFile( const std::string& i_rPath, int i_Flags );

} // namespace UtilsFileSystem::Linux
