#pragma once

#include <HostServices/VSaveSchedule.h>

#include <ZEK/Callback.h>
#include <ZEK/Result.h>
#include <ZEK/Store.h>

#include <filesystem>
#include <functional>
#include <memory>
#include <string>

namespace HostServices
{

/// Keeps the persistent entries of a store in a file, from one run of the program to the next.
///
/// At the start of the program `Load`, then `StartSaving`. From there on a thread of its own saves when changes have
/// ended, when it is asked to, and once more at the end if something is left. It reads the store in a short scope and
/// writes outside of it, so that nobody who writes settings waits for a disk. A save that fails is told, stays pending
/// and is tried again. Without `StartSaving` nothing is ever written.
///
/// A file that could not be taken in as it stands is kept under a dated name, never over another file. Where that is
/// not possible nothing is saved to its name.
///
/// Thread: that which makes it, save for `IsPending` and `Message`, which are for any.
class VSettingsFile
{
public:
  VSettingsFile( std::shared_ptr< ZEK::IStore > i_pStore, std::filesystem::path i_Path,
                 const VSaveSchedule::VDelays& i_rDelays = {} );
  /// As `Finish`.
  ~VSettingsFile();
  VSettingsFile( const VSettingsFile& ) = delete;
  VSettingsFile& operator=( const VSettingsFile& ) = delete;

  /// Puts the values of the file, if all of it can be read, into the store: there they count as set, and the entries as
  /// persistent, also those that nothing declares. Then, in any case, calls the function that declares what the program
  /// needs. `FileNotFound` without a word when there is no file; after any other failure nothing of the file is in the
  /// store. `OkButPartial` when the store did not take every value, or the declarations did not leave it as it was.
  ZEK::IResult Load( const std::function< void() >& i_rDeclare );
  /// What stands in the store now needs no saving. Puts a file aside that was not loaded, and keeps a copy of one that
  /// was taken in part. `NotPermitted` when that was not possible.
  ZEK::IResult StartSaving();
  /// Saves soon, even if nothing changed.
  void Request();
  /// Something is to be saved, or is being saved.
  bool IsPending() const;
  /// Waits for a save that runs, saves what is pending, and ends the saving. The result is that of the last save that
  /// was tried, `OkButNoEffect` when nothing was pending.
  ZEK::IResult Finish();

  /// What people should know at this time, such as why a save failed; empty when all is well.
  std::string Message() const;
  /// Fires on any thread; connect with a postal service.
  ZEK::IMultiCallback< void() >& MessageChanged();

  const std::filesystem::path& Path() const;

private:
  struct VState;
  std::shared_ptr< VState > m_pState;
};

} // namespace HostServices
