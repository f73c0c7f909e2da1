#pragma once

#include <sys/stat.h>
#include <sys/types.h>

#include <cstddef>
#include <cstdio>
#include <string>
#include <vector>

namespace UtilsFileSystem
{

/// Every system call of this module, one function each, so that a test can count them, stop at one or let one fail.
/// The functions here are the real calls: they return what those return and leave `errno`. Thread: any.
struct IFileSystemCalls
{
  virtual ~IFileSystemCalls() = default;

  virtual int Open( const char* i_pPath, int i_Flags, mode_t i_Mode );
  virtual int Close( int i_File );
  virtual ssize_t Read( int i_File, void* o_pBytes, std::size_t i_Size );
  virtual ssize_t Write( int i_File, const void* i_pBytes, std::size_t i_Size );
  virtual off_t Seek( int i_File, off_t i_Offset, int i_From );
  virtual int Sync( int i_File );
  virtual ssize_t CopyRange( int i_From, int i_To, std::size_t i_Size );
  virtual int Lock( int i_File, int i_Operation );

  virtual int StatFile( int i_File, struct stat* o_pStat );
  virtual int StatPath( const char* i_pPath, struct stat* o_pStat );
  /// Of a symbolic link itself.
  virtual int StatLink( const char* i_pPath, struct stat* o_pStat );
  virtual ssize_t ReadLink( const char* i_pPath, char* o_pText, std::size_t i_Size );
  virtual int SetMode( int i_File, mode_t i_Mode );
  virtual int SetPathMode( const char* i_pPath, mode_t i_Mode );
  virtual int SetPathOwner( const char* i_pPath, uid_t i_User, gid_t i_Group );

  virtual int Unlink( const char* i_pPath );
  virtual int Rename( const char* i_pFrom, const char* i_pTo );
  virtual int RenameNoReplace( const char* i_pFrom, const char* i_pTo );
  virtual int Link( const char* i_pFrom, const char* i_pTo );

  virtual void* Map( std::size_t i_Size, int i_File );
  virtual int AdviseSequential( void* i_pBytes, std::size_t i_Size );
  virtual int Unmap( void* i_pBytes, std::size_t i_Size );

  virtual int SetBuffer( std::FILE* i_pFile, char* i_pBuffer, std::size_t i_Size );
  /// The names in a folder, without "." and "..".
  virtual int ListFolder( const char* i_pPath, std::vector< std::string >& o_rNames );
  virtual void Pause( int i_Milliseconds );
};

/// Puts a table in the place of the one in use, which it returns; null restores the real calls. The caller keeps
/// the table alive. Not while another thread is inside this module.
IFileSystemCalls* SetFileSystemCalls( IFileSystemCalls* i_pCalls );

} // namespace UtilsFileSystem
