#pragma once

#include "FFmpeg.h"

#include <HostVideo/VideoClip.h>

#include <atomic>
#include <cstdint>
#include <memory>
#include <string>

namespace HostVideo
{

/// Decodes the frames of a clip one after the other, from any place in it. Thread: one.
class VVideoDecoder
{
public:
  /// Set from any thread, `i_rStop` ends what the decoder does: it then finds no more frames. Lives longer than this.
  VVideoDecoder( std::shared_ptr< const VVideoClip > i_pClip, const std::atomic< bool >& i_rStop )
    : m_pClip( std::move( i_pClip ) )
    , m_rStop( i_rStop )
  {
  }

  /// False, with a message, when the file cannot be opened or decoded; that it changed since shows as missing frames.
  bool Open( int i_Threads, std::string& o_rMessage );

  /// Makes the next frame that can be had: its number, or -1 at the end and after a failure. Numbers rise until the
  /// next seek; one that is left out could not be decoded.
  std::int64_t Next();
  /// Why the file could not be read on, an error of FFmpeg's; 0 where it could.
  int ReadError() const { return m_ReadError; }
  /// The picture that `Next` made.
  const AVFrame& Picture() const { return *m_pPicture; }

  /// Whether the frame is reached sooner by a seek than by going on.
  bool IsSeekShorter( std::int64_t i_Frame ) const;
  /// Lets `Next` go on at or before a frame, as near to it as can be.
  bool Seek( std::int64_t i_Frame, std::string& o_rMessage );

private:
  std::size_t KeyAt( std::int64_t i_Frame ) const;
  bool SeekToKey( std::size_t i_Key );
  bool Receive();
  std::int64_t NumberOf( const AVFrame& i_rPicture );

  std::shared_ptr< const VVideoClip > m_pClip;
  const std::atomic< bool >& m_rStop;
  int m_Threads = 1;
  VFFmpegPtr< AVFormatContext > m_pInput;
  VFFmpegPtr< AVCodecContext > m_pCodec;
  VFFmpegPtr< AVPacket > m_pPacket;
  VFFmpegPtr< AVFrame > m_pPicture;
  int m_Stream = -1;
  int m_ReadError = 0;
  bool m_bLanded = false;     ///< a packet was read since the last seek
  bool m_bMissed = false;     ///< it was none at or before the key that was sought
  bool m_bDrained = false;    ///< the end was told to the decoder
  bool m_bPending = false;    ///< the picture was made by a seek and not given yet
  bool m_bSeekable = true;    ///< no seek has missed its key so far
  std::int64_t m_Sought = -1; ///< the key that the last seek was for
  std::int64_t m_SoughtStamp = 0;
  std::int64_t m_Last = -1;   ///< number of the frame made last
  std::int64_t m_Floor = 0;   ///< frames before it lack what they were coded by
  std::int64_t m_Counted = 0; ///< pictures since the beginning of the file
};

} // namespace HostVideo
