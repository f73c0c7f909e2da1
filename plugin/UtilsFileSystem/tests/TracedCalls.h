#pragma once

#include <UtilsFileSystem/FileSystemCalls.h>

#include <functional>
#include <map>
#include <string>
#include <vector>

namespace UtilsFileSystemTests
{

struct VCall
{
  std::string Name;
  /// The path, or that under which the descriptor was opened; of a second name, too, with " > " between.
  std::string Path;
};

/// The real calls, noted down, after a hook had its say. It is in use while it lives.
class VTracedCalls : public UtilsFileSystem::IFileSystemCalls
{
public:
  /// Gets the call and its number from 1; gives the error that it is to fail with, or 0.
  using Hook = std::function< int( const VCall& i_rCall, int i_Number ) >;

  explicit VTracedCalls( Hook i_Before = {} );
  ~VTracedCalls() override;

  const std::vector< VCall >& Trace() const { return m_Trace; }
  /// The trace as "Name file-name-part-after-the-target", for one target.
  std::vector< std::string > Steps( const std::string& i_rTarget ) const;

  std::size_t m_MostBytesAWrite = std::size_t( -1 );
  bool m_bRefuseBuffer = false;
  /// Off, a flush is noted without waiting for the disk.
  bool m_bReallySync = false;
  Hook m_Before;

  int Open( const char* i_pPath, int i_Flags, mode_t i_Mode ) override;
  int Close( int i_File ) override;
  ssize_t Read( int i_File, void* o_pBytes, std::size_t i_Size ) override;
  ssize_t Write( int i_File, const void* i_pBytes, std::size_t i_Size ) override;
  off_t Seek( int i_File, off_t i_Offset, int i_From ) override;
  int Sync( int i_File ) override;
  ssize_t CopyRange( int i_From, int i_To, std::size_t i_Size ) override;
  int Lock( int i_File, int i_Operation ) override;
  int StatFile( int i_File, struct stat* o_pStat ) override;
  int StatPath( const char* i_pPath, struct stat* o_pStat ) override;
  int StatLink( const char* i_pPath, struct stat* o_pStat ) override;
  ssize_t ReadLink( const char* i_pPath, char* o_pText, std::size_t i_Size ) override;
  int SetMode( int i_File, mode_t i_Mode ) override;
  int SetPathMode( const char* i_pPath, mode_t i_Mode ) override;
  int SetPathOwner( const char* i_pPath, uid_t i_User, gid_t i_Group ) override;
  int Unlink( const char* i_pPath ) override;
  int Rename( const char* i_pFrom, const char* i_pTo ) override;
  int RenameNoReplace( const char* i_pFrom, const char* i_pTo ) override;
  int Link( const char* i_pFrom, const char* i_pTo ) override;
  void* Map( std::size_t i_Size, int i_File ) override;
  int SetBuffer( std::FILE* i_pFile, char* i_pBuffer, std::size_t i_Size ) override;
  /// Notes the time without spending it.
  void Pause( int i_Milliseconds ) override;

protected:
  /// After a call that changed the file behind the descriptor, or, with -1, the names.
  virtual void Changed( int ) {}
  virtual void Synced( int ) {}

private:
  bool IsToFail( const char* i_pName, std::string i_Path );
  template < typename TReturn, typename... TParameters, typename... TArguments >
  TReturn Do( const char* i_pName, const std::string& i_rPath,
              TReturn ( UtilsFileSystem::IFileSystemCalls::*i_pCall )( TParameters... ), TArguments... i_Arguments );
  int DoNames( const char* i_pName, int ( UtilsFileSystem::IFileSystemCalls::*i_pCall )( const char*, const char* ),
               const char* i_pFrom, const char* i_pTo );

  UtilsFileSystem::IFileSystemCalls m_Real;
  UtilsFileSystem::IFileSystemCalls* m_pFormer;
  std::map< int, std::string > m_Opened;
  std::vector< VCall > m_Trace;
};

/// Remembers what of one folder is on the disk. At a loss of power, written bytes that were not synchronised are
/// gone, and of the changes of names since the folder was synchronised any number, the later before the earlier.
class VPowerLossCalls final : public VTracedCalls
{
public:
  VPowerLossCalls( std::string i_Folder, std::string i_Kept, Hook i_Before = {} );

  /// Makes the folders "0", "1" and so on in the folder for what is kept, one for each state that can be left.
  void LosePower();

private:
  void Changed( int i_File ) override;
  void Synced( int i_File ) override;
  void Note();

  using Names = std::map< std::string, ino_t >;
  std::string m_Folder;
  std::string m_Kept;
  std::vector< Names > m_States;
  std::map< ino_t, off_t > m_SyncedSizes;
};

} // namespace UtilsFileSystemTests
