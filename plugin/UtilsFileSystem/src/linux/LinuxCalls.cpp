#include "LinuxCalls.h"

#include <UtilsFileSystem/FileIO.h>

#include <atomic>

#include <dirent.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/mman.h>
#include <time.h>
#include <unistd.h>

namespace UtilsFileSystem
{
namespace
{
std::atomic< IFileSystemCalls* > g_pCalls{ nullptr };
}

int IFileSystemCalls::Open( const char* i_pPath, int i_Flags, mode_t i_Mode )
{
  return ::open( i_pPath, i_Flags, i_Mode );
}

int IFileSystemCalls::Close( int i_File )
{
  return ::close( i_File );
}

ssize_t IFileSystemCalls::Read( int i_File, void* o_pBytes, std::size_t i_Size )
{
  return ::read( i_File, o_pBytes, i_Size );
}

ssize_t IFileSystemCalls::Write( int i_File, const void* i_pBytes, std::size_t i_Size )
{
  return ::write( i_File, i_pBytes, i_Size );
}

off_t IFileSystemCalls::Seek( int i_File, off_t i_Offset, int i_From )
{
  return ::lseek( i_File, i_Offset, i_From );
}

int IFileSystemCalls::Sync( int i_File )
{
  return ::fsync( i_File );
}

ssize_t IFileSystemCalls::CopyRange( int i_From, int i_To, std::size_t i_Size )
{
  return ::copy_file_range( i_From, nullptr, i_To, nullptr, i_Size, 0 );
}

int IFileSystemCalls::Lock( int i_File, int i_Operation )
{
  return ::flock( i_File, i_Operation );
}

int IFileSystemCalls::StatFile( int i_File, struct stat* o_pStat )
{
  return ::fstat( i_File, o_pStat );
}

int IFileSystemCalls::StatPath( const char* i_pPath, struct stat* o_pStat )
{
  return ::stat( i_pPath, o_pStat );
}

int IFileSystemCalls::StatLink( const char* i_pPath, struct stat* o_pStat )
{
  return ::lstat( i_pPath, o_pStat );
}

ssize_t IFileSystemCalls::ReadLink( const char* i_pPath, char* o_pText, std::size_t i_Size )
{
  return ::readlink( i_pPath, o_pText, i_Size );
}

int IFileSystemCalls::SetMode( int i_File, mode_t i_Mode )
{
  return ::fchmod( i_File, i_Mode );
}

int IFileSystemCalls::SetPathMode( const char* i_pPath, mode_t i_Mode )
{
  return ::chmod( i_pPath, i_Mode );
}

int IFileSystemCalls::SetPathOwner( const char* i_pPath, uid_t i_User, gid_t i_Group )
{
  return ::lchown( i_pPath, i_User, i_Group );
}

int IFileSystemCalls::Unlink( const char* i_pPath )
{
  return ::unlink( i_pPath );
}

int IFileSystemCalls::Rename( const char* i_pFrom, const char* i_pTo )
{
  return ::rename( i_pFrom, i_pTo );
}

int IFileSystemCalls::RenameNoReplace( const char* i_pFrom, const char* i_pTo )
{
  return ::renameat2( AT_FDCWD, i_pFrom, AT_FDCWD, i_pTo, RENAME_NOREPLACE );
}

int IFileSystemCalls::Link( const char* i_pFrom, const char* i_pTo )
{
  return ::link( i_pFrom, i_pTo );
}

void* IFileSystemCalls::Map( std::size_t i_Size, int i_File )
{
  return ::mmap( nullptr, i_Size, PROT_READ, MAP_PRIVATE, i_File, 0 );
}

int IFileSystemCalls::AdviseSequential( void* i_pBytes, std::size_t i_Size )
{
  return ::madvise( i_pBytes, i_Size, MADV_SEQUENTIAL );
}

int IFileSystemCalls::Unmap( void* i_pBytes, std::size_t i_Size )
{
  return ::munmap( i_pBytes, i_Size );
}

int IFileSystemCalls::SetBuffer( std::FILE* i_pFile, char* i_pBuffer, std::size_t i_Size )
{
  return std::setvbuf( i_pFile, i_pBuffer, _IOFBF, i_Size );
}

int IFileSystemCalls::ListFolder( const char* i_pPath, std::vector< std::string >& o_rNames )
{
  DIR* const pFolder = ::opendir( i_pPath );
  if ( !pFolder )
  {
    return -1;
  }
  errno = 0;
  while ( const dirent* const pEntry = ::readdir( pFolder ) )
  {
    const std::string Name = pEntry->d_name;
    if ( Name != "." && Name != ".." )
    {
      o_rNames.push_back( Name );
    }
    errno = 0;
  }
  const int Error = errno;
  ::closedir( pFolder );
  errno = Error;
  return Error == 0 ? 0 : -1;
}

void IFileSystemCalls::Pause( int i_Milliseconds )
{
  const timespec Time{ i_Milliseconds / 1000, i_Milliseconds % 1000 * 1000000L };
  ::nanosleep( &Time, nullptr );
}

IFileSystemCalls* SetFileSystemCalls( IFileSystemCalls* i_pCalls )
{
  return g_pCalls.exchange( i_pCalls );
}

namespace Linux
{

IFileSystemCalls& Calls()
{
  static IFileSystemCalls Real;
  IFileSystemCalls* const pCalls = g_pCalls.load( std::memory_order_acquire );
  return pCalls ? *pCalls : Real;
}

ZEK::IResult ResultOf( long i_Returned )
{
  return i_Returned == -1 ? ResultFromErrno( errno ) : ZEK::IResult::Ok;
}

int Open( const std::string& i_rPath, int i_Flags, mode_t i_Mode )
{
  return Retry(
      [&]
      {
        return Calls().Open( i_rPath.c_str(), i_Flags | O_CLOEXEC, i_Mode );
      } );
}

int Close( int i_File )
{
  const int Returned = Calls().Close( i_File );
  return Returned == -1 && errno == EINTR ? 0 : Returned;
}

ssize_t WriteAll( int i_File, const char* i_pBytes, std::size_t i_Size )
{
  std::size_t Done = 0;
  while ( Done < i_Size )
  {
    const ssize_t Written = Retry(
        [&]
        {
          return Calls().Write( i_File, i_pBytes + Done, i_Size - Done );
        } );
    if ( Written <= 0 )
    {
      errno = Written == 0 ? EIO : errno;
      return -1;
    }
    Done += static_cast< std::size_t >( Written );
  }
  return static_cast< ssize_t >( Done );
}

ssize_t ReadSome( int i_File, char* o_pBytes, std::size_t i_Size )
{
  return Retry(
      [&]
      {
        return Calls().Read( i_File, o_pBytes, i_Size );
      } );
}

int Lstat( const std::string& i_rPath, struct stat& o_rStat )
{
  return Calls().StatLink( i_rPath.c_str(), &o_rStat );
}

bool IsAbsent()
{
  return errno == ENOENT || errno == ENOTDIR;
}

} // namespace Linux
} // namespace UtilsFileSystem
