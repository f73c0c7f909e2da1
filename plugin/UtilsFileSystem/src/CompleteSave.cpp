#include "FileLog.h"
#include "SaveSteps.h"

#include <UtilsFileSystem/FileIO.h>

#include <atomic>

using namespace ZEK;

namespace UtilsFileSystem
{
namespace
{
std::atomic< bool > g_bFlushes{ true };

/// Everything that can fail before the first name changes.
IResult FlushNew( const VSaveNames& i_rNames, Platform::VFolder& o_rFolder )
{
  if ( !g_bFlushes )
  {
    return IResult::Ok;
  }
  const IResult Result = Platform::FlushFile( i_rNames.New );
  return Result.IsError() ? Result : o_rFolder.Open( i_rNames.Target );
}

IResult FlushNames( const VSaveNames& i_rNames, Platform::VFolder& io_rFolder )
{
  const IResult Result = g_bFlushes ? io_rFolder.Flush() : IResult::Ok;
  if ( Result.IsError() )
  {
    Log( FileCategory(), ELogFailure, "Protected save: the name of file [%1%] may not be on the disk: %2%",
         i_rNames.Target, Result.Text() );
  }
  return Result;
}

void LogMove( const VSaveNames& i_rNames, int i_Level, const char* i_pText, IResult i_Result )
{
  Log( FileCategory(), i_Level, i_pText, i_rNames.New, i_rNames.Target, i_Result.Text() );
}

void LogMoved( const VSaveNames& i_rNames )
{
  Log( FileCategory(), ELogDetail, "Protected save: new file [%1%] moved to [%2%].", i_rNames.New, i_rNames.Target );
}

void RemoveNew( const VSaveNames& i_rNames )
{
  const IResult Result = Platform::Remove( i_rNames.New );
  if ( Result.IsError() && Result != IResult::FileNotFound )
  {
    LogMove( i_rNames, ELogWarning, "Protected save: failed removing intermediate file [%1%]: %3%", Result );
  }
}

IResult CompleteByMove( const VSaveNames& i_rNames )
{
  Platform::VFolder Folder;
  IResult Result = FlushNew( i_rNames, Folder );
  if ( Result.IsOk() )
  {
    Result = MoveFile( i_rNames.New, i_rNames.Target );
  }
  if ( Result.IsError() )
  {
    LogMove( i_rNames, ELogDetail, "Protected save: new file [%1%] could not be moved to [%2%]: %3%", Result );
    RemoveNew( i_rNames );
    return Result;
  }
  if ( Result = FlushNames( i_rNames, Folder ); Result.IsOk() )
  {
    LogMoved( i_rNames );
  }
  return Result;
}

IResult RemoveBackup( const VSaveNames& i_rNames )
{
  const IResult Result = Platform::Remove( i_rNames.Old );
  if ( Result.IsOk() )
  {
    Log( FileCategory(), ELogDetail, "Protected save: removed backup file [%1%].", i_rNames.Old );
  }
  else if ( Result != IResult::FileNotFound )
  {
    Log( FileCategory(), ELogFailure, "Protected save: failed removing backup file [%1%]: %3%", i_rNames.Old,
         i_rNames.Target, Result.Text() );
    return IResult::OkButPartial;
  }
  return IResult::Ok;
}

IResult CompleteByReplacing( const VSaveNames& i_rNames )
{
  constexpr const char* NotMoved = "Protected save: new file [%1%] could not be moved to [%2%]: %3%";
  Platform::VFolder Folder;
  IResult Result = FlushNew( i_rNames, Folder );
  if ( Result.IsError() && Result != IResult::FileNotFound )
  {
    LogMove( i_rNames, ELogFailure, NotMoved, Result );
    RemoveNew( i_rNames );
    return Result;
  }
  if ( Result.IsOk() )
  {
    Result = ReplaceFile( i_rNames.New, i_rNames.Target, i_rNames.Old );
  }
  if ( Result == IResult::FileNotFound )
  {
    Log( FileCategory(), ELogDetail, "Protected save: new file [%1%] doesn't exist so it wasn't moved to [%2%].",
         i_rNames.New, i_rNames.Target );
  }
  else if ( Result.IsError() )
  {
    LogMove( i_rNames, ELogFailure, NotMoved, Result );
    return Result;
  }
  else if ( Result = FlushNames( i_rNames, Folder ); Result.IsError() )
  {
    return Result;
  }
  LogMoved( i_rNames );
  return RemoveBackup( i_rNames );
}
} // namespace

VNeighbours::VNeighbours( const VSaveNames& i_rNames )
  : New( Platform::FactsOf( i_rNames.New ) )
  , Old( Platform::FactsOf( i_rNames.Old ) )
  , Target( Platform::FactsOf( i_rNames.Target ) )
{
}

IResult VNeighbours::Error() const
{
  return New.Error.IsError() ? New.Error : Old.Error.IsError() ? Old.Error : Target.Error;
}

IResult CompleteSave( const VSaveNames& i_rNames, bool i_bOverwrite )
{
  return i_bOverwrite ? CompleteByReplacing( i_rNames ) : CompleteByMove( i_rNames );
}

IResult RestoreBackup( const VSaveNames& i_rNames, bool i_bSay )
{
  if ( i_bSay )
  {
    Log( FileCategory(), ELogWarning, "File [%1%] not found but backup [%2%] is present, restoring backup...",
         i_rNames.Target, i_rNames.Old );
  }
  const IResult Result = MoveFile( i_rNames.Old, i_rNames.Target );
  if ( Result.IsError() && i_bSay )
  {
    Log( FileCategory(), ELogWarning, "Failed to restore backup: %1%", Result.Text() );
  }
  return Result;
}

void SetSaveFlushing( bool i_bOn )
{
  g_bFlushes = i_bOn;
}

} // namespace UtilsFileSystem
