#include "LinuxHandle.h"
#include "LinuxCalls.h"

#include "Platform.h"

#include <utility>

#include <fcntl.h>
#include <sys/mman.h>

using namespace ZEK;

namespace UtilsFileSystem
{
using namespace Linux;

namespace
{
thread_local const std::string* t_pCreatedPath = nullptr;
thread_local unsigned t_CreatedPermissions = 0;
} // namespace

int Linux::OpenFile( const std::string& i_rPath, int i_Flags )
{
  const bool bKnown = t_pCreatedPath && *t_pCreatedPath == i_rPath;
  const int File = Open( i_rPath, i_Flags, bKnown ? t_CreatedPermissions : 0666 );
  struct stat Stat;
  if ( File == -1 || ( i_Flags & O_ACCMODE ) != O_RDONLY )
  {
    return File;
  }
  // A folder can be opened to read, but nothing can be read.
  const int Looked = Calls().StatFile( File, &Stat );
  if ( Looked == -1 || S_ISDIR( Stat.st_mode ) )
  {
    const int Error = Looked == -1 ? errno : EISDIR;
    (void)Close( File );
    errno = Error;
    return -1;
  }
  return File;
}

Platform::VCreationPermissions::VCreationPermissions( const std::string& i_rPath, unsigned i_Permissions )
{
  t_pCreatedPath = &i_rPath;
  t_CreatedPermissions = i_Permissions;
}

Platform::VCreationPermissions::~VCreationPermissions()
{
  t_pCreatedPath = nullptr;
}

IResult Platform::VHandle::Open( const std::string& i_rPath, EOpenFor i_For )
{
  const int Flags = i_For == EOpenToRead    ? O_RDONLY
                    : i_For == EOpenToWrite ? O_WRONLY | O_CREAT | O_TRUNC
                                            : O_WRONLY | O_CREAT | O_EXCL;
  m_File = OpenFile( i_rPath, Flags );
  return ResultOf( m_File );
}

IResult Platform::VHandle::Read( char* o_pBytes, std::size_t i_Size, std::size_t& o_rGot )
{
  const ssize_t Got = ReadSome( m_File, o_pBytes, i_Size );
  o_rGot = Got > 0 ? static_cast< std::size_t >( Got ) : 0;
  return ResultOf( Got );
}

IResult Platform::VHandle::Write( const char* i_pBytes, std::size_t i_Size )
{
  return ResultOf( WriteAll( m_File, i_pBytes, i_Size ) );
}

IResult Platform::VHandle::Seek( std::int64_t i_Offset, int i_From, std::int64_t& o_rPosition )
{
  o_rPosition = Calls().Seek( m_File, i_Offset, i_From );
  return ResultOf( o_rPosition );
}

IResult Platform::VHandle::Close()
{
  return m_File == -1 ? IResult::Ok : ResultOf( Linux::Close( std::exchange( m_File, -1 ) ) );
}

IResult Platform::MapFile( const std::string& i_rPath, char*& o_rpBytes, std::size_t& o_rSize )
{
  constexpr off_t MostBytes = 0x7fffffff;
  o_rpBytes = nullptr;
  o_rSize = 0;
  // Without waiting for a pipe's other end.
  const int File = OpenFile( i_rPath, O_RDONLY | O_NONBLOCK );
  if ( File == -1 )
  {
    return ResultOf( File );
  }
  struct stat Stat;
  IResult Result = ResultOf( Calls().StatFile( File, &Stat ) );
  if ( Result.IsOk() && ( !S_ISREG( Stat.st_mode ) || Stat.st_size > MostBytes ) )
  {
    Result = IResult::NotSupported;
  }
  if ( Result.IsOk() && Stat.st_size > 0 )
  {
    const std::size_t Size = static_cast< std::size_t >( Stat.st_size );
    void* const pBytes = Calls().Map( Size, File );
    Result = pBytes == MAP_FAILED ? ResultOf( -1 ) : IResult::Ok;
    if ( Result.IsOk() )
    {
      (void)Calls().AdviseSequential( pBytes, Size );
      o_rpBytes = static_cast< char* >( pBytes );
      o_rSize = Size;
    }
  }
  (void)Linux::Close( File );
  return Result;
}

void Platform::UnmapFile( char* i_pBytes, std::size_t i_Size )
{
  if ( i_pBytes )
  {
    (void)Calls().Unmap( i_pBytes, i_Size );
  }
}

} // namespace UtilsFileSystem
