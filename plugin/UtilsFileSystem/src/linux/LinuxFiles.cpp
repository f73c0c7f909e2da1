#include "LinuxCalls.h"

#include "Platform.h"

#include <climits>
#include <utility>

#include <fcntl.h>

using namespace ZEK;

namespace UtilsFileSystem
{
using namespace Linux;

namespace
{
Platform::EFileStatus StatusOf( mode_t i_Mode )
{
  return S_ISREG( i_Mode )   ? Platform::EFileRegular
         : S_ISDIR( i_Mode ) ? Platform::EFileFolder
         : S_ISLNK( i_Mode ) ? Platform::EFileLink
                             : Platform::EFileOther;
}

std::string FolderOf( const std::string& i_rPath )
{
  const std::size_t Slash = i_rPath.rfind( '/' );
  return Slash == std::string::npos ? "." : i_rPath.substr( 0, Slash + 1 );
}

/// Waits for the disk and closes. Some file systems do not know the call for what they hold; one failure is final,
/// since a second call would report nothing.
IResult SyncAndClose( int i_File )
{
  const int Synced = Retry(
      [&]
      {
        return Calls().Sync( i_File );
      } );
  const IResult Result = Synced == -1 && errno == EINVAL ? IResult::Ok : ResultOf( Synced );
  const IResult Closed = ResultOf( Close( i_File ) );
  return Result.IsError() ? Result : Closed;
}
} // namespace

Platform::VFileFacts Platform::FactsOf( const std::string& i_rPath )
{
  VFileFacts Facts;
  struct stat Stat;
  if ( Lstat( i_rPath, Stat ) == 0 )
  {
    Facts.Status = StatusOf( Stat.st_mode );
    Facts.Device = Stat.st_dev;
    Facts.Id = Stat.st_ino;
    Facts.Permissions = Stat.st_mode & 0777;
  }
  else if ( IsAbsent() || errno == ENAMETOOLONG || errno == ELOOP || errno == EILSEQ )
  {
    // A name that cannot be is not there either.
    Facts.Status = EFileAbsent;
  }
  else
  {
    Facts.Error = ResultOf( -1 );
  }
  return Facts;
}

IResult Platform::ResolveLinks( const std::string& i_rPath, std::string& o_rPath, VFileFacts& o_rFacts )
{
  constexpr int MostLinks = 40;
  o_rPath = i_rPath;
  for ( int Link = 0; Link <= MostLinks; ++Link )
  {
    o_rFacts = FactsOf( o_rPath );
    if ( o_rFacts.Status != EFileLink )
    {
      return o_rFacts.Error;
    }
    char Text[PATH_MAX];
    const ssize_t Size = Calls().ReadLink( o_rPath.c_str(), Text, sizeof( Text ) );
    if ( Size == -1 )
    {
      return ResultOf( -1 );
    }
    const std::string Next( Text, static_cast< std::size_t >( Size ) );
    o_rPath = Next.starts_with( '/' ) || o_rPath.find( '/' ) == std::string::npos ? Next : FolderOf( o_rPath ) + Next;
  }
  errno = ELOOP;
  return ResultOf( -1 );
}

IResult Platform::Remove( const std::string& i_rPath )
{
  return ResultOf( Calls().Unlink( i_rPath.c_str() ) );
}

IResult Platform::Rename( const std::string& i_rFrom, const std::string& i_rTo )
{
  return ResultOf( Calls().Rename( i_rFrom.c_str(), i_rTo.c_str() ) );
}

IResult Platform::FlushFile( const std::string& i_rPath )
{
  const int File = Open( i_rPath, O_RDONLY );
  return File == -1 ? ResultOf( File ) : SyncAndClose( File );
}

void Platform::Pause( int i_Milliseconds )
{
  Calls().Pause( i_Milliseconds );
}

Platform::VFolder::~VFolder()
{
  if ( m_File >= 0 )
  {
    (void)Close( m_File );
  }
}

IResult Platform::VFolder::Open( const std::string& i_rFileInIt )
{
  m_File = Linux::Open( FolderOf( i_rFileInIt ), O_RDONLY | O_DIRECTORY );
  return ResultOf( m_File );
}

IResult Platform::VFolder::Flush()
{
  return SyncAndClose( std::exchange( m_File, -1 ) );
}

} // namespace UtilsFileSystem
