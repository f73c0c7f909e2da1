#pragma once

#include "Platform.h"

#include <UtilsFileSystem/ProtectedFileIO.h>

#include <string>

namespace UtilsFileSystem
{

/// The files of one protected file, links of the target resolved.
struct VSaveNames
{
  explicit VSaveNames( const std::string& i_rTarget )
    : Target( i_rTarget )
    , New( i_rTarget + ".new" )
    , Old( i_rTarget + ".old" )
    , Stale( i_rTarget + ".old.stale" )
    , Lock( i_rTarget + ".lock" )
  {
  }

  std::string Target;
  /// The data being saved; whole once ".old" is there, too.
  std::string New;
  /// The target's former file during a swap.
  std::string Old;
  /// A backup that a former save left, out of the way while ".new" is being written.
  std::string Stale;
  std::string Lock;
};

struct VNeighbours
{
  explicit VNeighbours( const VSaveNames& i_rNames );

  bool IsToRecover() const { return New.IsFile() || Old.IsFile(); }
  bool IsTargetAside() const { return Old.IsFile() && !Target.IsThere(); }
  /// The first reason why one of the three could not be looked at.
  ZEK::IResult Error() const;

  Platform::VFileFacts New;
  Platform::VFileFacts Old;
  Platform::VFileFacts Target;
};

/// Flushes ".new", gives it the target's name and removes what is left of the swap. Logs each step.
ZEK::IResult CompleteSave( const VSaveNames& i_rNames, bool i_bOverwrite );
/// Gives the backup the name of a target that is missing.
ZEK::IResult RestoreBackup( const VSaveNames& i_rNames, bool i_bSay );

/// Takes the lock of the target. `WouldBlock` when another has it; `Ok` without a lock where there can be none.
ZEK::IResult TakeLock( const VSaveNames& i_rNames, Platform::VLockFile& io_rLock );
/// Says who has it.
void LogLocked( const VSaveNames& i_rNames, const char* i_pLocked, const char* i_pPlain );

/// Calls back; an exception counts as `FailedWithException`.
ZEK::IResult CallBack( const PathFunction& i_rFunction, const std::string& i_rPath );

} // namespace UtilsFileSystem
