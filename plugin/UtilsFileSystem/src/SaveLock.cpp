#include "SaveLock.h"
#include "FileLog.h"
#include "SaveSteps.h"

using namespace ZEK;

namespace UtilsFileSystem
{

IResult TakeLock( const VSaveNames& i_rNames, Platform::VLockFile& io_rLock )
{
  const IResult Result = io_rLock.Take( i_rNames.Lock );
  if ( Result == IResult::NotSupported )
  {
    Log( FileCategory(), ELogWarning, "File [%1%] cannot be locked here: another process may save it at the same time.",
         i_rNames.Target );
    return IResult::Ok;
  }
  // Where there is no folder yet nobody else can be at work.
  return Result == IResult::FileNotFound ? IResult::Ok : Result;
}

void LogLocked( const VSaveNames& i_rNames, const char* i_pLocked, const char* i_pPlain )
{
  LogFailure( i_rNames.Target, i_rNames.Lock, IResult::NotPermitted, i_pLocked, i_pPlain );
}

IResult CallBack( const PathFunction& i_rFunction, const std::string& i_rPath )
{
  try
  {
    return i_rFunction ? i_rFunction( i_rPath ) : IResult::InvalidArgument;
  }
  catch ( ... )
  {
    return IResult::FailedWithException;
  }
}

VSaveLock::VSaveLock( std::unique_ptr< VState > i_pState )
  : m_pState( std::move( i_pState ) )
{
}

VSaveLock::~VSaveLock() = default;

IResult TakeSaveLock( const VSaveNames& i_rNames, Platform::VLockFile& io_rLock )
{
  constexpr const char* Plain = "Failed to save file '%1%': %2%";
  const IResult Result = TakeLock( i_rNames, io_rLock );
  if ( Result == IResult::WouldBlock )
  {
    LogLocked( i_rNames, "Failed to save file '%1%': file is locked by processes '%2%'.", Plain );
    return IResult::NotPermitted;
  }
  if ( Result.IsError() )
  {
    Log( FileCategory(), ELogFailure, Plain, i_rNames.Target, Result.Text() );
  }
  return Result;
}

IResult VSaveLock::Take( const std::string& i_rTarget, std::unique_ptr< VSaveLock >& o_rpLock )
{
  o_rpLock.reset();
  std::string Target;
  Platform::VFileFacts Facts;
  IResult Result = Platform::ResolveLinks( i_rTarget, Target, Facts );
  if ( Result.IsError() )
  {
    Log( FileCategory(), ELogFailure, "Failed to save file '%1%': %2%", i_rTarget, Result.Text() );
    return Result;
  }
  auto pState = std::make_unique< VState >();
  Result = TakeSaveLock( VSaveNames( Target ), pState->Lock );
  if ( Result.IsOk() )
  {
    o_rpLock.reset( new VSaveLock( std::move( pState ) ) );
  }
  return Result;
}

} // namespace UtilsFileSystem
