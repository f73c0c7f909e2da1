#include "FuzzCheck.h"

#include <HostSources/VMotionReader.h>

#include <algorithm>
#include <cmath>

/// A model, a zero byte, and the table of its motion.
extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  const auto Bytes = std::as_bytes( std::span( i_pData, i_Size ) );
  const auto Zero = std::find( Bytes.begin(), Bytes.end(), std::byte{ 0 } );
  const auto Split = static_cast< std::size_t >( Zero - Bytes.begin() );
  const std::string Name = "input.mot";
  HostSources::VRecording Recording;
  std::string Message;
  const auto Result = HostSources::ReadMotion( Bytes.subspan( Zero == Bytes.end() ? Split : Split + 1 ), Name,
                                               Bytes.first( Split ), "input.osim", Recording, Message );
  FuzzCheck::CheckRead( Result, Name, Message, Recording );
  for ( const HostSources::VRecordingSkeleton& rSkeleton : Recording.Skeletons )
  {
    const auto Frames = static_cast< std::size_t >( Recording.FrameCount );
    FuzzCheck::Require( rSkeleton.States.size() == Frames * rSkeleton.StateSize, "states fill frames" );
    FuzzCheck::Require( !Recording.Bounds.IsEmpty(), "the skeleton can be posed" );
    for ( const double Value : rSkeleton.States )
    {
      FuzzCheck::Require( std::isfinite( Value ), "poses are finite" );
    }
  }
  return 0;
}
