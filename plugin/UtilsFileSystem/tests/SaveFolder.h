#pragma once

#include <UtilsFileSystem/ProtectedFileIO.h>
#include <ZEK/Log.h>

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

namespace UtilsFileSystemTests
{

/// One protected file in a folder of its own, in memory where there is such a file system: tests save by the ten
/// thousand, and what a disk keeps is told by `VPowerLossCalls`.
class VSaveFolder
{
public:
  std::string Folder() const { return m_Base / "files"; }
  std::string Target() const { return Folder() + "/doc"; }
  std::string Kept() const { return m_Base / "kept"; }

  VSaveFolder();
  ~VSaveFolder();
  VSaveFolder( const VSaveFolder& ) = delete;
  VSaveFolder& operator=( const VSaveFolder& ) = delete;
  /// Empties the folder. Contents go to the target's name plus the ending.
  void Clear();
  void Put( const std::string& i_rEnding, const std::string& i_rContent ) const;
  std::optional< std::string > Get( const std::string& i_rEnding ) const;
  /// The endings of all files in the folder, in order.
  std::vector< std::string > Endings() const;

private:
  std::filesystem::path m_Base;
};

/// Writes through a C stream, in pieces, as a document is written.
UtilsFileSystem::PathFunction Writer( const std::string& i_rContent );
ZEK::IResult Save( const std::string& i_rTarget, const std::string& i_rContent, bool i_bOverwrite = true );
/// What a protected load finds; nothing when it gave `FileNotFound`. Other failures are the content "failed".
std::optional< std::string > Load( const std::string& i_rTarget );

/// Keeps the log of this module silent, for tests that provoke failures by the thousand.
class VQuiet
{
public:
  VQuiet() { Category().SetMaximumLevel( 0 ); }
  ~VQuiet() { Category().SetMaximumLevel( ZEK::ELogDetail ); }
  VQuiet( const VQuiet& ) = delete;
  VQuiet& operator=( const VQuiet& ) = delete;

private:
  static ZEK::VLogCategory& Category() { return ZEK::GlobalLog().Category( "UtilsFileSystem" ); }
};

} // namespace UtilsFileSystemTests
