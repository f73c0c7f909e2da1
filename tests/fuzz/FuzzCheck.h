#pragma once

#include "FuzzRequire.h"

#include <HostSources/RecordingInfo.h>
#include <HostSources/VRecording.h>

#include <ZEK/Result.h>

#include <string>

namespace FuzzCheck
{

/// What every reader promises, whatever the bytes were.
inline void CheckRead( ZEK::IResult i_Result, const std::string& i_rName, const std::string& i_rMessage,
                       const HostSources::VRecording& i_rRecording )
{
  const auto& rR = i_rRecording;
  if ( i_Result.IsError() )
  {
    Require( i_rMessage.starts_with( i_rName + ": " ), "a failure names the file" );
    Require( i_rMessage.find( "expected" ) != std::string::npos, "a failure says what was expected" );
    Require( rR.FrameCount == 0 && rR.Points.empty() && rR.Labels.empty(), "a failure leaves nothing" );
    return;
  }
  Require( rR.FrameCount > 0, "a success has frames" );
  Require( rR.RateHz > 0 && rR.RateHz <= 1e6, "the rate is usable" );
  const auto Frames = static_cast< std::size_t >( rR.FrameCount );
  Require( rR.Points.size() == Frames * rR.PointCount(), "points fill frames" );
  Require( rR.Analog.size() == Frames * rR.AnalogPerFrame * rR.AnalogChannels.size(), "analog values fill frames" );
  Require( rR.CameraMasks.empty() || rR.CameraMasks.size() == rR.Points.size(), "one mask a point" );
  Require( rR.UnlabelledBegin.empty() || rR.UnlabelledBegin.size() == Frames + 1, "unlabelled points have frames" );
  std::uint64_t Gaps = 0;
  for ( const HostSources::VRecordingPoint& rPoint : rR.Points )
  {
    const float Sum = rPoint.x - rPoint.x + rPoint.y - rPoint.y + rPoint.z - rPoint.z;
    Require( !rPoint.IsValid() || Sum == 0, "a point that is there is finite" );
    Gaps += rPoint.IsValid() ? 0 : 1;
  }
  Require( Gaps == rR.GapCount, "gaps are counted" );
  for ( const HostSources::VForcePlate& rPlate : rR.ForcePlates )
  {
    Require( rPlate.Wrench.empty() || rPlate.Wrench.size() == Frames * rR.AnalogPerFrame, "a wrench a sample" );
  }
  const HostSources::VRecordingInfo Info = HostSources::DescribeRecording( rR );
  Require( !Info.Text().empty() && !Info.Json().empty(), "it can be described" );
}

} // namespace FuzzCheck
