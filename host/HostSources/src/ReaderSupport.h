#pragma once

// What both readers do alike.

#include <HostSources/VRecording.h>

#include <ZEK/Result.h>

#include <filesystem>
#include <new>
#include <string>
#include <string_view>

namespace HostSources
{

/// A rate that gives a frame at least one tick and a day at least one frame.
bool IsUsableRate( double i_RateHz );

/// Takes the rate, or 100 Hz with a note where it is of no use or would make the frames known so far last longer than
/// ticks can be counted.
void TakeRate( double i_RateHz, VRecording& io_rRecording );

/// Takes a unit of length: mm, cm, m or in; any other counts as mm, with a note.
void TakeUnit( const std::string& i_rUnit, VRecording& io_rRecording );

/// The text, taken as Latin-1 where it is not UTF-8, without control characters.
std::string ToUtf8( std::string_view i_Text );

/// Runs a reader so that a failure leaves an empty recording and a message that begins with the file's name.
template < typename TRead >
ZEK::IResult ReadGuarded( ERecordingFormat i_Format, const std::string& i_rName, VRecording& o_rRecording,
                          std::string& o_rMessage, TRead&& i_rRead )
{
  o_rRecording = {};
  o_rRecording.Format = i_Format;
  o_rRecording.Name = ToUtf8( std::filesystem::path( i_rName ).filename().string() );
  o_rMessage.clear();
  ZEK::IResult Result;
  try
  {
    Result = i_rRead();
  }
  catch ( const std::bad_alloc& )
  {
    o_rMessage = "expected memory for what the file holds, and there is not enough";
    Result = ZEK::IResult::AllocationFailure;
  }
  if ( Result.IsError() )
  {
    o_rRecording = {};
  }
  if ( !o_rMessage.empty() )
  {
    o_rMessage = i_rName + ": " + o_rMessage;
  }
  return Result;
}

} // namespace HostSources
