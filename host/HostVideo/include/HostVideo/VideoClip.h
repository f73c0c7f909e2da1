#pragma once

#include <ZEK/Result.h>

#include <cstdint>
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace HostVideo
{

/// Where the frames of a video file lie. Does not change once it was scanned.
///
/// Frames are numbered from 0 in the order of showing. They are those whose data are in the file as a whole: of a file
/// that was cut off the ones that are left.
struct VVideoClip
{
  struct VKey
  {
    std::int64_t Frame = 0; ///< that can be decoded without any before it
    std::int64_t Stamp = 0; ///< where to seek for it, in the file's ticks
  };

  std::filesystem::path Path;
  std::string Name;                    ///< of the file, without its folder; UTF-8
  std::string Container;               ///< short names of the file's form
  std::string Codec;                   ///< short name
  std::string PixelFormat;             ///< of the file; frames are delivered in one that views know
  std::uint32_t Width = 0, Height = 0; ///< px, as shown
  int QuarterTurns = 0;                ///< clockwise, by which what is stored is turned to be shown
  double RateHz = 0;                   ///< mean; 0 for less than two frames
  bool bEven = true;                   ///< frames follow one another at equal distances
  std::vector< double > Times;         ///< of each frame after the first, s, ascending
  std::vector< VKey > Keys;            ///< ascending
  /// The file's time stamps by frame, ascending; empty where the file does not give each frame one of its own, so that
  /// frames have to be counted from the first.
  std::vector< std::int64_t > Stamps;
  std::vector< std::string > Notes; ///< what is odd about the file, as sentences

  std::int64_t FrameCount() const { return static_cast< std::int64_t >( Times.size() ); }
  double DurationSeconds() const { return RateHz > 0 ? static_cast< double >( Times.size() ) / RateHz : 0; }
  /// The frame nearest to a time after the first frame, s; the earlier one of two; -1 for a clip without frames.
  std::int64_t NearestFrame( double i_Seconds ) const;
};

/// What is told of the work, from 0 to 1; false stops it.
using VScanProgress = std::function< bool( double i_Fraction ) >;

/// Reads through a video file without decoding it. `OkButPartial` when it was cut off, with a note; a failure says in
/// `o_rMessage` which file it was and what was wrong with it: `FileNotFound`, `FileIOFailure`, `InvalidFormat`,
/// `EndOfData` (no frame that is whole), `NotSupported` (no decoder), `Canceled`. Thread: any.
ZEK::IResult ScanVideo( const std::filesystem::path& i_rPath, VVideoClip& o_rClip, std::string& o_rMessage,
                        const VScanProgress& i_rProgress = {} );

/// Whether a suffix (lower case, with its dot) is that of a video file.
bool IsVideoSuffix( const std::string& i_rSuffix );

} // namespace HostVideo
