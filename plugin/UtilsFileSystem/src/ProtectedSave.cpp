#include "FileLog.h"
#include "SaveLock.h"
#include "SaveSteps.h"

#include <UtilsFileSystem/FileIO.h>

using namespace ZEK;

namespace UtilsFileSystem
{
namespace
{
/// A backup must not lie beside a file that is being written: after a stop they would look like a swap, and half a
/// document would be taken for a whole one.
IResult PutBackupAside( const VSaveNames& i_rNames )
{
  const IResult Moved = Platform::Rename( i_rNames.Old, i_rNames.Stale );
  if ( Moved.IsOk() )
  {
    return Moved;
  }
  // The name may be too long for one more ending; the target is whole, the backup can be spared.
  const IResult Removed = Platform::Remove( i_rNames.Old );
  return Removed == IResult::FileNotFound ? IResult::Ok : Removed;
}

IResult RemoveLeftNew( const VSaveNames& i_rNames )
{
  const IResult Result = Platform::Remove( i_rNames.New );
  if ( Result.IsOk() || Result == IResult::FileNotFound )
  {
    return IResult::Ok;
  }
  Log( FileCategory(), ELogFailure, "Failed to remove intermediate file [%1%]: %2%", i_rNames.New, Result.Text() );
  return Result;
}

/// Brings what former saves left to one file under the target's name, or fails.
IResult PutInOrder( const VSaveNames& i_rNames, Platform::VFileFacts& o_rTarget )
{
  constexpr int MostTurns = 4;
  IResult Last = IResult::NotPermitted;
  for ( int Turn = 0; Turn < MostTurns; ++Turn )
  {
    const VNeighbours Found( i_rNames );
    if ( Found.Error().IsError() )
    {
      return Found.Error();
    }
    if ( Found.New.IsFile() && Found.Old.IsFile() )
    {
      Log( FileCategory(), ELogWarning,
           "Interrupted save detected for [%1%], attempting to complete save of new data [%2%]...", i_rNames.Target,
           i_rNames.New );
      Last = CompleteSave( i_rNames, true );
    }
    else if ( Found.IsTargetAside() )
    {
      Last = RestoreBackup( i_rNames, true );
    }
    else if ( Found.Old.IsFile() )
    {
      if ( Last = PutBackupAside( i_rNames ); Last.IsError() )
      {
        return Last;
      }
    }
    else
    {
      o_rTarget = Found.Target;
      return Found.New.IsThere() ? RemoveLeftNew( i_rNames ) : IResult::Ok;
    }
  }
  return Last.IsError() ? Last : IResult::NotPermitted;
}

/// After a failure the backup that was put aside comes back, but never beside a ".new".
void PutBackupBack( const VSaveNames& i_rNames )
{
  const VNeighbours Left( i_rNames );
  if ( Left.Error().IsOk() && Left.Target.IsThere() && !Left.New.IsThere() && !Left.Old.IsThere() )
  {
    (void)MoveFile( i_rNames.Stale, i_rNames.Old );
  }
}

IResult SaveLocked( const PathFunction& i_rWrite, const VSaveNames& i_rNames, bool i_bOverwrite )
{
  Platform::VFileFacts Target;
  IResult Result = PutInOrder( i_rNames, Target );
  if ( Result.IsError() )
  {
    Log( FileCategory(), ELogFailure, "Failed to save file '%1%': %2%", i_rNames.Target, Result.Text() );
    return Result;
  }
  {
    // Never open to more readers than the target is; the owner's bits are what the save itself needs.
    const bool bKnown = Target.Status == Platform::EFileRegular;
    const Platform::VCreationPermissions Permissions( i_rNames.New, bKnown ? Target.Permissions | 0600 : 0666 );
    Result = CallBack( i_rWrite, i_rNames.New );
  }
  if ( Result.IsError() )
  {
    (void)RemoveLeftNew( i_rNames );
  }
  else
  {
    Result = CompleteSave( i_rNames, i_bOverwrite );
  }
  if ( Result.IsOk() )
  {
    (void)Platform::Remove( i_rNames.Stale );
  }
  else
  {
    PutBackupBack( i_rNames );
  }
  return Result;
}

IResult Save( const PathFunction& i_rWrite, const std::string& i_rTarget, bool i_bOverwrite, const VSaveLock* i_pHeld )
{
  std::string Target = i_rTarget;
  Platform::VFileFacts Facts;
  // Without overwriting a link is in the way like any file.
  IResult Result = i_bOverwrite ? Platform::ResolveLinks( i_rTarget, Target, Facts ) : IResult::Ok;
  if ( Result.IsOk() && i_bOverwrite && Facts.IsThere() && !Facts.IsFile() )
  {
    Result = IResult::NotPermitted;
  }
  if ( Result.IsError() )
  {
    Log( FileCategory(), ELogFailure, "Failed to save file '%1%': %2%", i_rTarget, Result.Text() );
    return Result;
  }
  const VSaveNames Names( Target );
  Platform::VLockFile Lock;
  if ( !i_pHeld )
  {
    Result = TakeSaveLock( Names, Lock );
  }
  return Result.IsError() ? Result : SaveLocked( i_rWrite, Names, i_bOverwrite );
}
} // namespace

IResult ProtectedSave( const PathFunction& i_rWrite, const std::string& i_rTarget, std::uint32_t i_bOverwrite )
{
  return Save( i_rWrite, i_rTarget, i_bOverwrite != 0, nullptr );
}

IResult ProtectedSave( const PathFunction& i_rWrite, const std::string& i_rTarget, std::uint32_t i_bOverwrite,
                       const VSaveLock& i_rHeld )
{
  return Save( i_rWrite, i_rTarget, i_bOverwrite != 0, &i_rHeld );
}

} // namespace UtilsFileSystem
