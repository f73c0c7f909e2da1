#pragma once

#include <UtilsFileSystem/FileSystemCalls.h>
#include <ZEK/Result.h>

#include <cerrno>
#include <string>

namespace UtilsFileSystem::Linux
{

/// The table in use.
IFileSystemCalls& Calls();

/// Calls again after a signal came in between.
template < typename TCall >
auto Retry( TCall i_Call )
{
  for ( ;; )
  {
    const auto Result = i_Call();
    if ( Result != -1 || errno != EINTR )
    {
      return Result;
    }
  }
}

/// The result of a call that returned -1 for a failure, told by `errno`.
ZEK::IResult ResultOf( long i_Returned );

/// Always close on exec. -1 and `errno` on a failure.
int Open( const std::string& i_rPath, int i_Flags, mode_t i_Mode = 0666 );
/// Never again: what Linux says of a failed close is that the descriptor is gone.
int Close( int i_File );
/// Everything or -1.
ssize_t WriteAll( int i_File, const char* i_pBytes, std::size_t i_Size );
ssize_t ReadSome( int i_File, char* o_pBytes, std::size_t i_Size );

int Lstat( const std::string& i_rPath, struct stat& o_rStat );
/// True when the last error says that there is nothing of that name.
bool IsAbsent();

} // namespace UtilsFileSystem::Linux
