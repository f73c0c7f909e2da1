#include "FuzzCheck.h"

#include <HostSources/VBvhReader.h>

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  const std::string Name = "input.bvh";
  HostSources::VRecording Recording;
  std::string Message;
  const auto Result = HostSources::ReadBvh( std::as_bytes( std::span( i_pData, i_Size ) ), Name, Recording, Message );
  FuzzCheck::CheckRead( Result, Name, Message, Recording );
  for ( const HostSources::VRecordingSkeleton& rSkeleton : Recording.Skeletons )
  {
    const auto Frames = static_cast< std::size_t >( Recording.FrameCount );
    FuzzCheck::Require( rSkeleton.States.size() == Frames * rSkeleton.StateSize, "states fill frames" );
    FuzzCheck::Require( !Recording.Bounds.IsEmpty(), "the skeleton can be posed" );
  }
  return 0;
}
