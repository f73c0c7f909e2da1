#include "FileLog.h"
#include "Platform.h"

#include <UtilsFileSystem/FileIO.h>

#include <mutex>

using namespace ZEK;

namespace UtilsFileSystem
{
namespace
{
std::mutex g_ListerGuard;
LockerLister g_Lister;

struct VOpenTexts
{
  const char* Locked;
  const char* Plain;
};

IResult OpenFile( const std::string& i_rPath, const char* i_pMode, bool i_bExclusive, const VOpenTexts& i_rTexts,
                  std::FILE*& o_rpFile )
{
  o_rpFile = nullptr;
  if ( !i_pMode )
  {
    return IResult::InvalidArgument;
  }
  bool bBuffered = true;
  const IResult Result = Platform::OpenCFile( i_rPath, i_pMode, i_bExclusive, o_rpFile, bBuffered );
  if ( Result == IResult::NotPermitted )
  {
    LogFailure( i_rPath, Result, i_rTexts.Locked, i_rTexts.Plain );
  }
  if ( Result.IsOk() && !bBuffered )
  {
    Log( FileCategory(), ELogWarning, "Failed to enable full buffering for file stream %1%.", i_rPath );
  }
  return Result;
}
} // namespace

IResult RemoveFile( const std::string& i_rPath )
{
  const IResult Result = Platform::Remove( i_rPath );
  if ( Result.IsOk() )
  {
    Log( FileCategory(), ELogDetail, "Removed file '%1%'.", i_rPath );
  }
  else if ( Result == IResult::FileNotFound )
  {
    Log( FileCategory(), ELogDetail, "Nothing to remove: '%1%' did not exist.", i_rPath );
  }
  else
  {
    LogFailure( i_rPath, Result, "Failed to remove file '%1%': file is locked by processes '%2%'.",
                "Failed to remove file '%1%': %2%" );
  }
  return Result;
}

std::vector< std::string > ListLockingProcesses( const std::string& i_rPath )
{
  LockerLister Lister;
  {
    const std::lock_guard Lock( g_ListerGuard );
    Lister = g_Lister;
  }
  return Lister ? Lister( i_rPath ) : Platform::FindLockers( i_rPath );
}

void SetLockerLister( LockerLister i_Lister )
{
  const std::lock_guard Lock( g_ListerGuard );
  g_Lister = std::move( i_Lister );
}

IResult OpenInputFile( const std::string& i_rPath, const char* i_pMode, std::FILE*& o_rpFile )
{
  return OpenFile( i_rPath, i_pMode, false,
                   { "Failed to open input file %1% locked by processes '%2%'.", "Failed to open input file %1%: %2%" },
                   o_rpFile );
}

IResult OpenOutputFile( const std::string& i_rPath, const char* i_pMode, std::FILE*& o_rpFile )
{
  return OpenOutputFileChecked( i_rPath, i_pMode, true, o_rpFile );
}

IResult OpenOutputFileChecked( const std::string& i_rPath, const char* i_pMode, bool i_bOverwrite,
                               std::FILE*& o_rpFile )
{
  return OpenFile(
      i_rPath, i_pMode, !i_bOverwrite,
      { "Failed to open output file %1% locked by processes '%2%'.", "Failed to open output file %1%: %2%" },
      o_rpFile );
}

} // namespace UtilsFileSystem
