#pragma once

#include <ZEK/Log.h>
#include <ZEK/Result.h>

#include <string>

namespace UtilsFileSystem
{

ZEK::VLogCategory& FileCategory();

/// Says at level 2 that an operation on a file failed. After `NotPermitted` the processes that hold the file are
/// looked for: with names `i_pLocked` is used (%1% path, %2% names), otherwise `i_pPlain` (%1% path, %2% result).
void LogFailure( const std::string& i_rPath, ZEK::IResult i_Result, const char* i_pLocked, const char* i_pPlain );
/// The same for a file of another name whose holders are the ones to blame.
void LogFailure( const std::string& i_rPath, const std::string& i_rHeld, ZEK::IResult i_Result, const char* i_pLocked,
                 const char* i_pPlain );

} // namespace UtilsFileSystem
