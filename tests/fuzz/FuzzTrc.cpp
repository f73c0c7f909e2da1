#include "FuzzCheck.h"

#include <HostSources/VTrcReader.h>

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  const std::string Name = "input.trc";
  HostSources::VRecording Recording;
  std::string Message;
  const auto Result = HostSources::ReadTrc( std::as_bytes( std::span( i_pData, i_Size ) ), Name, Recording, Message );
  FuzzCheck::CheckRead( Result, Name, Message, Recording );
  return 0;
}
