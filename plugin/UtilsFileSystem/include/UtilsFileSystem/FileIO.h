#pragma once

#include <ZEK/Result.h>

#include <cstdint>
#include <cstdio>
#include <functional>
#include <string>
#include <vector>

/// File operations that report through a result and never throw. Paths are UTF-8. Thread: any; two operations on
/// one name meet in the operating system only.
namespace UtilsFileSystem
{

/// `FileNotFound` when there was nothing; a folder gives `NotPermitted`.
ZEK::IResult RemoveFile( const std::string& i_rPath );
/// Overwrites the destination in place and gives it the mode bits of the source. A destination that could only be
/// filled in part is removed.
ZEK::IResult CopyFile( const std::string& i_rSource, const std::string& i_rDestination );
/// Never replaces: `AlreadyPresent` when the destination exists, also when it appears at the last moment.
/// `NotSupported` from one file system to another.
ZEK::IResult MoveFile( const std::string& i_rSource, const std::string& i_rDestination );

/// Puts `i_rReplacement` in the place of `i_rReplaced`, whose former bytes stay under `i_rBackup`; the name
/// `i_rReplaced` exists at every moment. Without a file to replace this is a move that leaves the backup alone.
/// Mode bits and owner pass to the replacement where that is allowed. Folders, devices and pipes give
/// `NotPermitted`, before anything is touched.
ZEK::IResult ReplaceFile( const std::string& i_rReplacement, const std::string& i_rReplaced,
                          const std::string& i_rBackup );
/// The same with renames alone, for file systems without hard links: `i_rReplaced` is missing for a moment.
ZEK::IResult ReplaceFileByRenames( const std::string& i_rReplacement, const std::string& i_rReplaced,
                                   const std::string& i_rBackup );

/// The programs, by the paths of their images, that hold the file open or locked, this one included: at most 10.
/// Empty when nothing could be found out.
std::vector< std::string > ListLockingProcesses( const std::string& i_rPath );
using LockerLister = std::function< std::vector< std::string >( const std::string& ) >;
/// For tests; an empty function restores the platform's own.
void SetLockerLister( LockerLister i_Lister );

/// 0 is `Ok`; an error that has no result of its own is logged and gives `Failed`.
ZEK::IResult ResultFromErrno( int i_Error );
/// The same for the error codes of Windows.
ZEK::IResult ResultFromSystemError( std::uint32_t i_Error );

/// C streams with a full buffer of 64 KiB, to be closed by `std::fclose`, which fails when any write before it
/// failed. They have no descriptor of their own: `fileno` fails. Modes are those of `std::fopen`; every stream is
/// closed when another program is started.
ZEK::IResult OpenInputFile( const std::string& i_rPath, const char* i_pMode, std::FILE*& o_rpFile );
ZEK::IResult OpenOutputFile( const std::string& i_rPath, const char* i_pMode, std::FILE*& o_rpFile );
/// Without `i_bOverwrite` an existing file gives `AlreadyPresent`, and no other process can slip one in between.
ZEK::IResult OpenOutputFileChecked( const std::string& i_rPath, const char* i_pMode, bool i_bOverwrite,
                                    std::FILE*& o_rpFile );

} // namespace UtilsFileSystem
