#pragma once

#include <ZEK/Result.h>

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

namespace UtilsFileSystem
{

/// Acts on the file of that name. An exception out of it counts as `FailedWithException`.
using PathFunction = std::function< ZEK::IResult( const std::string& i_rPath ) >;

/// The exclusive right to save one file: the lock of a file beside it named ".lock", which goes with the right.
/// Other savers are refused meanwhile, in this process too, and loaders that have something to recover wait. For
/// work that reads, changes and saves; a save or load by itself takes the lock of its own.
class VSaveLock
{
public:
  /// Does not wait: `NotPermitted`, with the holder's name in the log, when another has the right.
  /// A symbolic link stands for the file that it points to.
  static ZEK::IResult Take( const std::string& i_rTarget, std::unique_ptr< VSaveLock >& o_rpLock );
  ~VSaveLock();

  VSaveLock( const VSaveLock& ) = delete;
  VSaveLock& operator=( const VSaveLock& ) = delete;

private:
  struct VState;
  explicit VSaveLock( std::unique_ptr< VState > i_pState );
  std::unique_ptr< VState > m_pState;
};

/// Calls `i_rWrite` with the target's name plus ".new" and then puts that file in the target's place, so that a
/// stop of the process or of the machine at any moment leaves the whole old or the whole new document, which
/// `ProtectedLoad` finds. A success means that the new document is on the disk.
/// `NotPermitted`, and nothing touched, while another process or thread saves the same target.
/// `OkButPartial`: saved, but the backup ".old" could not be removed.
/// `AlreadyPresent`: the target exists and `i_bOverwrite` is 0.
/// With `i_bOverwrite` a symbolic link is followed and stays.
ZEK::IResult ProtectedSave( const PathFunction& i_rWrite, const std::string& i_rTarget, std::uint32_t i_bOverwrite );
/// The same for one who holds the lock of this target already.
ZEK::IResult ProtectedSave( const PathFunction& i_rWrite, const std::string& i_rTarget, std::uint32_t i_bOverwrite,
                            const VSaveLock& i_rHeld );

/// Completes or undoes what an interrupted save left and gives what `i_rRead` says of the target.
/// While another process is between the steps of a save it waits, up to two seconds, and then gives
/// `NotPermitted`: `FileNotFound` says that there really is no document.
ZEK::IResult ProtectedLoad( const PathFunction& i_rRead, const std::string& i_rTarget );
ZEK::IResult ProtectedLoad( const PathFunction& i_rRead, const std::string& i_rTarget, const VSaveLock& i_rHeld );

/// Off, a save survives a stop of the process but not of the machine. On from the start; for measurements.
void SetSaveFlushing( bool i_bOn );

} // namespace UtilsFileSystem
