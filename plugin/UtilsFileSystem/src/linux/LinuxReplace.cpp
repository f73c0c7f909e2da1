#include "FileLog.h"
#include "LinuxCalls.h"

#include "Platform.h"

#include <UtilsFileSystem/FileIO.h>

using namespace ZEK;

namespace UtilsFileSystem
{
using namespace Linux;

namespace
{
/// The two files of a replace, looked at before anything is touched.
struct VPair
{
  struct stat New;
  struct stat Old;
  bool bOld = false;

  bool IsOneFile() const { return bOld && New.st_dev == Old.st_dev && New.st_ino == Old.st_ino; }
};

bool CanBeReplaced( const struct stat& i_rStat )
{
  return S_ISREG( i_rStat.st_mode ) || S_ISLNK( i_rStat.st_mode );
}

IResult LookAt( const std::string& i_rReplacement, const std::string& i_rReplaced, VPair& o_rPair )
{
  if ( Lstat( i_rReplacement, o_rPair.New ) == -1 )
  {
    return ResultOf( -1 );
  }
  o_rPair.bOld = Lstat( i_rReplaced, o_rPair.Old ) == 0;
  if ( !o_rPair.bOld && !IsAbsent() )
  {
    return ResultOf( -1 );
  }
  return CanBeReplaced( o_rPair.New ) && ( !o_rPair.bOld || CanBeReplaced( o_rPair.Old ) ) ? IResult::Ok
                                                                                           : IResult::NotPermitted;
}

/// Owner first: it takes bits of the mode with it. Failures do not matter.
void PassOn( const VPair& i_rPair, const std::string& i_rReplacement )
{
  if ( !i_rPair.bOld || i_rPair.IsOneFile() || !S_ISREG( i_rPair.Old.st_mode ) || !S_ISREG( i_rPair.New.st_mode ) )
  {
    return;
  }
  if ( i_rPair.Old.st_uid != i_rPair.New.st_uid || i_rPair.Old.st_gid != i_rPair.New.st_gid )
  {
    (void)Calls().SetPathOwner( i_rReplacement.c_str(), i_rPair.Old.st_uid, i_rPair.Old.st_gid );
  }
  if ( ( ( i_rPair.Old.st_mode ^ i_rPair.New.st_mode ) & 0777 ) != 0 )
  {
    (void)Calls().SetPathMode( i_rReplacement.c_str(), i_rPair.Old.st_mode & 0777 );
  }
}

/// Gives the replaced file its second name, for which a stale backup makes room.
int LinkBackup( const std::string& i_rReplaced, const std::string& i_rBackup )
{
  const int Linked = Calls().Link( i_rReplaced.c_str(), i_rBackup.c_str() );
  if ( Linked == 0 || errno != EEXIST )
  {
    return Linked;
  }
  return Calls().Unlink( i_rBackup.c_str() ) == -1 && !IsAbsent()
             ? -1
             : Calls().Link( i_rReplaced.c_str(), i_rBackup.c_str() );
}

bool AreLinksRefused()
{
  return errno == EPERM || errno == EOPNOTSUPP || errno == EMLINK || errno == ENOSYS;
}

IResult ReplaceByRenames( const VPair& i_rPair, const std::string& i_rReplacement, const std::string& i_rReplaced,
                          const std::string& i_rBackup )
{
  if ( i_rPair.bOld )
  {
    const IResult Result = Platform::Rename( i_rReplaced, i_rBackup );
    if ( Result.IsError() )
    {
      Log( FileCategory(), ELogFailure, "Failed to create backup file %1% while replacing file: %2%.", i_rBackup,
           Result.Text() );
      return Result;
    }
  }
  const IResult Result = Platform::Rename( i_rReplacement, i_rReplaced );
  if ( Result.IsError() )
  {
    Log( FileCategory(), ELogFailure, "Failed to replace file %1% with file %2%: %3%.", i_rReplaced, i_rReplacement,
         Result.Text() );
    if ( i_rPair.bOld )
    {
      (void)Platform::Rename( i_rBackup, i_rReplaced );
    }
  }
  return Result;
}
} // namespace

IResult MoveFile( const std::string& i_rSource, const std::string& i_rDestination )
{
  if ( Calls().RenameNoReplace( i_rSource.c_str(), i_rDestination.c_str() ) == 0 )
  {
    return IResult::Ok;
  }
  if ( errno != EINVAL && errno != ENOSYS )
  {
    return ResultOf( -1 );
  }
  if ( Calls().Link( i_rSource.c_str(), i_rDestination.c_str() ) == -1 )
  {
    if ( !AreLinksRefused() )
    {
      return ResultOf( -1 );
    }
    struct stat Stat;
    if ( Lstat( i_rDestination, Stat ) == 0 )
    {
      return IResult::AlreadyPresent;
    }
    if ( !IsAbsent() )
    {
      return ResultOf( -1 );
    }
    // Nothing that could not be raced is left; those who save here keep each other out by their lock.
    return Platform::Rename( i_rSource, i_rDestination );
  }
  const IResult Result = Platform::Remove( i_rSource );
  if ( Result.IsError() )
  {
    (void)Platform::Remove( i_rDestination );
  }
  return Result;
}

IResult ReplaceFile( const std::string& i_rReplacement, const std::string& i_rReplaced, const std::string& i_rBackup )
{
  VPair Pair;
  if ( const IResult Looked = LookAt( i_rReplacement, i_rReplaced, Pair ); Looked.IsError() )
  {
    return Looked;
  }
  if ( !Pair.bOld )
  {
    return MoveFile( i_rReplacement, i_rReplaced );
  }
  PassOn( Pair, i_rReplacement );
  if ( LinkBackup( i_rReplaced, i_rBackup ) == -1 )
  {
    return AreLinksRefused() ? ReplaceByRenames( Pair, i_rReplacement, i_rReplaced, i_rBackup ) : ResultOf( -1 );
  }
  // A rename between two names of one file does nothing and reports a success.
  return Pair.IsOneFile() ? Platform::Remove( i_rReplacement ) : Platform::Rename( i_rReplacement, i_rReplaced );
}

IResult ReplaceFileByRenames( const std::string& i_rReplacement, const std::string& i_rReplaced,
                              const std::string& i_rBackup )
{
  VPair Pair;
  if ( const IResult Looked = LookAt( i_rReplacement, i_rReplaced, Pair ); Looked.IsError() )
  {
    return Looked;
  }
  PassOn( Pair, i_rReplacement );
  return ReplaceByRenames( Pair, i_rReplacement, i_rReplaced, i_rBackup );
}

} // namespace UtilsFileSystem
