#include "LinuxCalls.h"

#include "Platform.h"

#include <utility>

#include <fcntl.h>
#include <sys/file.h>

using namespace ZEK;

namespace UtilsFileSystem
{
using namespace Linux;

IResult Platform::VLockFile::Take( const std::string& i_rPath )
{
  constexpr int MostTurns = 100;
  for ( int Turn = 0; Turn < MostTurns; ++Turn )
  {
    const int File = Open( i_rPath, O_RDONLY | O_CREAT | O_NOFOLLOW, 0644 );
    if ( File == -1 )
    {
      return ResultOf( File );
    }
    const int Locked = Retry(
        [&]
        {
          return Calls().Lock( File, LOCK_EX | LOCK_NB );
        } );
    struct stat Mine;
    struct stat Named;
    if ( Locked == -1 )
    {
      const IResult Result = errno == ENOLCK || errno == EINVAL ? IResult::NotSupported : ResultOf( Locked );
      (void)Close( File );
      return Result;
    }
    if ( Calls().StatFile( File, &Mine ) == -1 )
    {
      const IResult Result = ResultOf( -1 );
      (void)Close( File );
      return Result;
    }
    // The last owner removes the file before it lets go: the lock of a file without a name is worth nothing.
    const bool bNamed = Lstat( i_rPath, Named ) == 0;
    if ( bNamed && Mine.st_dev == Named.st_dev && Mine.st_ino == Named.st_ino )
    {
      m_File = File;
      m_Path = i_rPath;
      return IResult::Ok;
    }
    const IResult Looked = bNamed || IsAbsent() ? IResult::Ok : ResultOf( -1 );
    (void)Close( File );
    if ( Looked.IsError() )
    {
      return Looked;
    }
  }
  return IResult::WouldBlock;
}

void Platform::VLockFile::Release()
{
  if ( m_File >= 0 )
  {
    (void)Calls().Unlink( m_Path.c_str() );
    (void)Close( std::exchange( m_File, -1 ) );
  }
}

} // namespace UtilsFileSystem
