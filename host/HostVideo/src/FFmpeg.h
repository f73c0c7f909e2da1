#pragma once

// The headers of FFmpeg, and owners of what its functions give.

extern "C"
{
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
#include <libavutil/display.h>
#include <libavutil/imgutils.h>
#include <libavutil/opt.h>
#include <libavutil/pixdesc.h>
#include <libswscale/swscale.h>
}

#include <atomic>
#include <filesystem>
#include <memory>
#include <string>

namespace HostVideo
{

struct VFFmpegFree
{
  void operator()( AVFormatContext* i_p ) const { avformat_close_input( &i_p ); }
  void operator()( AVCodecContext* i_p ) const { avcodec_free_context( &i_p ); }
  void operator()( AVPacket* i_p ) const { av_packet_free( &i_p ); }
  void operator()( AVFrame* i_p ) const { av_frame_free( &i_p ); }
  void operator()( SwsContext* i_p ) const { sws_freeContext( i_p ); }
};
template < typename T >
using VFFmpegPtr = std::unique_ptr< T, VFFmpegFree >;

std::string FFmpegError( int i_Error );

/// Opens a file, and only that: no other file or address that its content may name. The best video stream is in
/// `o_rStream`, and packets of all others are left out. Less than 0 is an error of FFmpeg's. `i_pStop` lives as long as
/// what was opened and ends its waiting and reading when it is set.
int OpenVideo( const std::filesystem::path& i_rPath, VFFmpegPtr< AVFormatContext >& o_rInput, int& o_rStream,
               const std::atomic< bool >* i_pStop = nullptr );

} // namespace HostVideo
