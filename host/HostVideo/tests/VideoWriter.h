#pragma once

#include <CoreMoxelTypes/Camera.h>

#include <cstdint>
#include <filesystem>
#include <string>

namespace HostVideo
{

/// A video whose frames show their numbers: eight squares beside one another, dark for 0 and light for 1.
struct VWrittenVideo
{
  std::string Codec = "mpeg4";
  std::string PixelFormat = "yuv420p";
  int Width = 128, Height = 48;
  int Frames = 60, RateHz = 60;
  int KeyEvery = 12, BFrames = 0;
  int QuarterTurns = 0;     ///< clockwise, that a player is asked for
  bool bIndexFirst = false; ///< of an mp4 file
  bool bUneven = false;     ///< every other frame lasts three times as long
};

/// The file's suffix decides on its form. False when there is no such encoder.
bool WriteVideo( const std::filesystem::path& i_rPath, const VWrittenVideo& i_rVideo );

/// Read from the first plane of a frame with luma in it.
int ShownNumber( const CoreMoxelTypes::VVideoFrame& i_rFrame );

} // namespace HostVideo
