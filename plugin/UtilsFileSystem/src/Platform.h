#pragma once

#include <ZEK/Result.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <string>
#include <string_view>
#include <vector>

/// What each operating system provides in files of its own; nothing here logs a failure.
namespace UtilsFileSystem::Platform
{

enum EFileStatus
{
  EFileUnknown,
  EFileAbsent,
  EFileRegular,
  EFileFolder,
  EFileLink,
  EFileOther
};

/// What a name stands for; a symbolic link stands for itself.
struct VFileFacts
{
  EFileStatus Status = EFileUnknown;
  /// Why the status is unknown.
  ZEK::IResult Error = ZEK::IResult::Ok;
  std::uint64_t Device = 0;
  std::uint64_t Id = 0;
  unsigned Permissions = 0;

  bool IsThere() const { return Status != EFileUnknown && Status != EFileAbsent; }
  /// True for what a protected save can have left: a folder of that name is the user's.
  bool IsFile() const { return Status == EFileRegular || Status == EFileLink; }
  bool IsSame( const VFileFacts& i_rOther ) const { return Device == i_rOther.Device && Id == i_rOther.Id; }
};

VFileFacts FactsOf( const std::string& i_rPath );
/// Follows symbolic links in the last part of the name, step by step, also to a file that is not there.
ZEK::IResult ResolveLinks( const std::string& i_rPath, std::string& o_rPath, VFileFacts& o_rFacts );

ZEK::IResult Remove( const std::string& i_rPath );
/// Replaces what has the second name.
ZEK::IResult Rename( const std::string& i_rFrom, const std::string& i_rTo );
/// Returns when the file's bytes are on the disk, as far as its file system can do that.
ZEK::IResult FlushFile( const std::string& i_rPath );
void Pause( int i_Milliseconds );

/// The folder of a file, opened before names change, so that nothing but the flush itself can fail afterwards.
class VFolder
{
public:
  VFolder() = default;
  ~VFolder();
  VFolder( const VFolder& ) = delete;
  VFolder& operator=( const VFolder& ) = delete;

  ZEK::IResult Open( const std::string& i_rFileInIt );
  /// Returns when the names in the folder are on the disk.
  ZEK::IResult Flush();

private:
  int m_File = -1;
};

/// The lock of a file that is made for it and removed with it.
class VLockFile
{
public:
  VLockFile() = default;
  ~VLockFile() { Release(); }
  VLockFile( const VLockFile& ) = delete;
  VLockFile& operator=( const VLockFile& ) = delete;

  /// Without waiting. `WouldBlock` when another has it, `NotSupported` where the file system knows no locks.
  ZEK::IResult Take( const std::string& i_rPath );
  void Release();

private:
  int m_File = -1;
  std::string m_Path;
};

/// While it lives, this thread makes a file of that name with these permissions.
class VCreationPermissions
{
public:
  VCreationPermissions( const std::string& i_rPath, unsigned i_Permissions );
  ~VCreationPermissions();
  VCreationPermissions( const VCreationPermissions& ) = delete;
  VCreationPermissions& operator=( const VCreationPermissions& ) = delete;
};

enum EOpenFor
{
  EOpenToRead,
  EOpenToWrite,
  EOpenToCreate
};

/// An open file. Sizes are in bytes.
class VHandle
{
public:
  VHandle() = default;
  ~VHandle() { (void)Close(); }
  VHandle( const VHandle& ) = delete;
  VHandle& operator=( const VHandle& ) = delete;

  ZEK::IResult Open( const std::string& i_rPath, EOpenFor i_For );
  bool IsOpen() const { return m_File >= 0; }
  /// Gets 0 bytes at the end of the file only.
  ZEK::IResult Read( char* o_pBytes, std::size_t i_Size, std::size_t& o_rGot );
  ZEK::IResult Write( const char* i_pBytes, std::size_t i_Size );
  ZEK::IResult Seek( std::int64_t i_Offset, int i_From, std::int64_t& o_rPosition );
  ZEK::IResult Close();

private:
  int m_File = -1;
};

/// A C stream on that file with a full buffer; `o_rbBuffered` is false when the buffer was refused.
ZEK::IResult OpenCFile( const std::string& i_rPath, std::string_view i_Mode, bool i_bExclusive, std::FILE*& o_rpFile,
                        bool& o_rbBuffered );

/// A view of a whole regular file; null and 0 for an empty one.
ZEK::IResult MapFile( const std::string& i_rPath, char*& o_rpBytes, std::size_t& o_rSize );
void UnmapFile( char* i_pBytes, std::size_t i_Size );

std::vector< std::string > FindLockers( const std::string& i_rPath );

} // namespace UtilsFileSystem::Platform
