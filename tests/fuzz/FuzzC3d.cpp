#include "FuzzCheck.h"

#include <HostSources/VC3dReader.h>

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  const std::string Name = "input.c3d";
  HostSources::VRecording Recording;
  std::string Message;
  const auto Result = HostSources::ReadC3d( std::as_bytes( std::span( i_pData, i_Size ) ), Name, Recording, Message );
  FuzzCheck::CheckRead( Result, Name, Message, Recording );
  return 0;
}
