#pragma once

#include <HostSources/VProgress.h>
#include <HostSources/VReadOptions.h>
#include <HostSources/VRecording.h>

#include <ZEK/Result.h>

#include <filesystem>
#include <string>

namespace HostSources
{

/// Reads a recording file, or a folder as `ReadFolder` does with the options; what a file is, is told by its content.
/// A table of motion is read with its model, see `FindModel`.
///
/// A failure leaves `o_rRecording` empty and says in `o_rMessage` which file it was, where (byte offset or line) and
/// what was expected: `FileNotFound`, `FileIOFailure` (unreadable, a folder of nothing known), `InvalidFormat`,
/// `EndOfData` (empty, cut off before the first whole frame, no frames), `NotFound` (a model), `NotSupported`,
/// `AllocationFailure`, `Canceled`.
/// `OkButPartial` gives the frames that are there of a file that was cut off; the message says how many. What is odd
/// but harmless is in the notes.
///
/// Thread: any; the callback runs on the caller's thread.
ZEK::IResult ReadRecording( const std::filesystem::path& i_rPath, VRecording& o_rRecording, std::string& o_rMessage,
                            const VProgress& i_rProgress = {}, const VReadOptions& i_rOptions = {} );

} // namespace HostSources
