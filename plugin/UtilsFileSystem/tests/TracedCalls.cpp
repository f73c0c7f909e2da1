#include "TracedCalls.h"

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <filesystem>

#include <fcntl.h>
#include <sys/mman.h>
#include <unistd.h>

namespace UtilsFileSystemTests
{
namespace fs = std::filesystem;
using UtilsFileSystem::IFileSystemCalls;

VTracedCalls::VTracedCalls( Hook i_Before )
  : m_Before( std::move( i_Before ) )
  , m_pFormer( UtilsFileSystem::SetFileSystemCalls( this ) )
{
}

VTracedCalls::~VTracedCalls()
{
  UtilsFileSystem::SetFileSystemCalls( m_pFormer );
}

std::vector< std::string > VTracedCalls::Steps( const std::string& i_rTarget ) const
{
  std::vector< std::string > Texts;
  for ( const VCall& rCall : m_Trace )
  {
    std::string Path = rCall.Path;
    for ( std::size_t At = 0; ( At = Path.find( i_rTarget ) ) != std::string::npos; )
    {
      Path.replace( At, i_rTarget.size(), 1, '*' );
    }
    Texts.push_back( rCall.Name + " " + Path );
  }
  return Texts;
}

bool VTracedCalls::IsToFail( const char* i_pName, std::string i_Path )
{
  m_Trace.push_back( { i_pName, std::move( i_Path ) } );
  const int Error = m_Before ? m_Before( m_Trace.back(), static_cast< int >( m_Trace.size() ) ) : 0;
  errno = Error != 0 ? Error : errno;
  return Error != 0;
}

template < typename TReturn, typename... TParameters, typename... TArguments >
TReturn VTracedCalls::Do( const char* i_pName, const std::string& i_rPath,
                          TReturn ( IFileSystemCalls::*i_pCall )( TParameters... ), TArguments... i_Arguments )
{
  return IsToFail( i_pName, i_rPath ) ? TReturn( -1 ) : ( m_Real.*i_pCall )( i_Arguments... );
}

int VTracedCalls::Open( const char* i_pPath, int i_Flags, mode_t i_Mode )
{
  const bool bCreates = ( i_Flags & O_CREAT ) != 0;
  const int File = Do( bCreates ? "create" : "open", i_pPath, &IFileSystemCalls::Open, i_pPath, i_Flags, i_Mode );
  if ( File >= 0 )
  {
    m_Opened[File] = i_pPath;
    if ( bCreates )
    {
      Changed( File );
    }
  }
  return File;
}

int VTracedCalls::Close( int i_File )
{
  const bool bFails = IsToFail( "close", m_Opened[i_File] );
  const int Error = errno;
  // A close that fails has closed all the same.
  (void)m_Real.Close( i_File );
  m_Opened.erase( i_File );
  errno = Error;
  return bFails ? -1 : 0;
}

ssize_t VTracedCalls::Read( int i_File, void* o_pBytes, std::size_t i_Size )
{
  return Do( "read", m_Opened[i_File], &IFileSystemCalls::Read, i_File, o_pBytes, i_Size );
}

ssize_t VTracedCalls::Write( int i_File, const void* i_pBytes, std::size_t i_Size )
{
  const ssize_t Written = Do( "write", m_Opened[i_File], &IFileSystemCalls::Write, i_File, i_pBytes,
                              std::min( i_Size, m_MostBytesAWrite ) );
  Changed( i_File );
  return Written;
}

off_t VTracedCalls::Seek( int i_File, off_t i_Offset, int i_From )
{
  return Do( "seek", m_Opened[i_File], &IFileSystemCalls::Seek, i_File, i_Offset, i_From );
}

int VTracedCalls::Sync( int i_File )
{
  if ( IsToFail( "sync", m_Opened[i_File] ) || ( m_bReallySync && m_Real.Sync( i_File ) == -1 ) )
  {
    return -1;
  }
  Synced( i_File );
  return 0;
}

ssize_t VTracedCalls::CopyRange( int i_From, int i_To, std::size_t i_Size )
{
  return Do( "copyrange", m_Opened[i_From], &IFileSystemCalls::CopyRange, i_From, i_To, i_Size );
}

int VTracedCalls::Lock( int i_File, int i_Operation )
{
  return Do( "lock", m_Opened[i_File], &IFileSystemCalls::Lock, i_File, i_Operation );
}

int VTracedCalls::StatFile( int i_File, struct stat* o_pStat )
{
  return Do( "fstat", m_Opened[i_File], &IFileSystemCalls::StatFile, i_File, o_pStat );
}

int VTracedCalls::StatPath( const char* i_pPath, struct stat* o_pStat )
{
  return Do( "stat", i_pPath, &IFileSystemCalls::StatPath, i_pPath, o_pStat );
}

int VTracedCalls::StatLink( const char* i_pPath, struct stat* o_pStat )
{
  return Do( "lstat", i_pPath, &IFileSystemCalls::StatLink, i_pPath, o_pStat );
}

ssize_t VTracedCalls::ReadLink( const char* i_pPath, char* o_pText, std::size_t i_Size )
{
  return Do( "readlink", i_pPath, &IFileSystemCalls::ReadLink, i_pPath, o_pText, i_Size );
}

int VTracedCalls::SetMode( int i_File, mode_t i_Mode )
{
  return Do( "fchmod", m_Opened[i_File], &IFileSystemCalls::SetMode, i_File, i_Mode );
}

int VTracedCalls::SetPathMode( const char* i_pPath, mode_t i_Mode )
{
  return Do( "chmod", i_pPath, &IFileSystemCalls::SetPathMode, i_pPath, i_Mode );
}

int VTracedCalls::SetPathOwner( const char* i_pPath, uid_t i_User, gid_t i_Group )
{
  return Do( "chown", i_pPath, &IFileSystemCalls::SetPathOwner, i_pPath, i_User, i_Group );
}

int VTracedCalls::Unlink( const char* i_pPath )
{
  const int Returned = Do( "unlink", i_pPath, &IFileSystemCalls::Unlink, i_pPath );
  Changed( -1 );
  return Returned;
}

int VTracedCalls::DoNames( const char* i_pName, int ( IFileSystemCalls::*i_pCall )( const char*, const char* ),
                           const char* i_pFrom, const char* i_pTo )
{
  const int Returned = Do( i_pName, std::string( i_pFrom ).append( " > " ).append( i_pTo ), i_pCall, i_pFrom, i_pTo );
  Changed( -1 );
  return Returned;
}

int VTracedCalls::Rename( const char* i_pFrom, const char* i_pTo )
{
  return DoNames( "rename", &IFileSystemCalls::Rename, i_pFrom, i_pTo );
}

int VTracedCalls::RenameNoReplace( const char* i_pFrom, const char* i_pTo )
{
  return DoNames( "move", &IFileSystemCalls::RenameNoReplace, i_pFrom, i_pTo );
}

int VTracedCalls::Link( const char* i_pFrom, const char* i_pTo )
{
  return DoNames( "link", &IFileSystemCalls::Link, i_pFrom, i_pTo );
}

void* VTracedCalls::Map( std::size_t i_Size, int i_File )
{
  return IsToFail( "mmap", m_Opened[i_File] ) ? MAP_FAILED : m_Real.Map( i_Size, i_File );
}

int VTracedCalls::SetBuffer( std::FILE* i_pFile, char* i_pBuffer, std::size_t i_Size )
{
  return m_bRefuseBuffer ? -1 : m_Real.SetBuffer( i_pFile, i_pBuffer, i_Size );
}

void VTracedCalls::Pause( int )
{
  (void)IsToFail( "pause", "" );
}

VPowerLossCalls::VPowerLossCalls( std::string i_Folder, std::string i_Kept, Hook i_Before )
  : VTracedCalls( std::move( i_Before ) )
  , m_Folder( std::move( i_Folder ) )
  , m_Kept( std::move( i_Kept ) )
{
  fs::create_directories( m_Kept );
  Note();
}

/// The files by their numbers, which a second name keeps from being used again.
void VPowerLossCalls::Note()
{
  Names State;
  for ( const fs::directory_entry& rEntry : fs::directory_iterator( m_Folder ) )
  {
    struct stat Stat;
    if ( ::lstat( rEntry.path().c_str(), &Stat ) == 0 )
    {
      State[rEntry.path().filename()] = Stat.st_ino;
      (void)::link( rEntry.path().c_str(), ( m_Kept + "/i" + std::to_string( Stat.st_ino ) ).c_str() );
    }
  }
  if ( m_States.empty() || m_States.back() != State )
  {
    m_States.push_back( State );
  }
}

void VPowerLossCalls::Changed( int i_File )
{
  const int Error = errno;
  struct stat Stat;
  if ( i_File >= 0 && ::fstat( i_File, &Stat ) == 0 )
  {
    m_SyncedSizes.try_emplace( Stat.st_ino, 0 );
  }
  Note();
  errno = Error;
}

void VPowerLossCalls::Synced( int i_File )
{
  struct stat Stat;
  if ( ::fstat( i_File, &Stat ) == 0 && S_ISDIR( Stat.st_mode ) )
  {
    m_States.clear();
    Note();
  }
  else
  {
    m_SyncedSizes[Stat.st_ino] = Stat.st_size;
  }
}

void VPowerLossCalls::LosePower()
{
  for ( const auto& [Id, Size] : m_SyncedSizes )
  {
    (void)!::truncate( ( m_Kept + "/i" + std::to_string( Id ) ).c_str(), Size );
  }
  for ( std::size_t State = 0; State < m_States.size(); ++State )
  {
    const std::string Folder = m_Kept + "/" + std::to_string( State );
    ::mkdir( Folder.c_str(), 0755 );
    for ( const auto& [Name, Id] : m_States[State] )
    {
      (void)!::link( ( m_Kept + "/i" + std::to_string( Id ) ).c_str(), ( Folder + "/" + Name ).c_str() );
    }
  }
}

} // namespace UtilsFileSystemTests
