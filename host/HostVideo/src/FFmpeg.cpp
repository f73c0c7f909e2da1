#include "FFmpeg.h"

#include <mutex>

namespace HostVideo
{
namespace
{

/// What is wrong with a file is told once, in the project's own words.
void KeepQuiet( void*, int, const char*, va_list ) {}

/// Forms of files that hold their video themselves; lists that name other files are none of them.
constexpr const char* Forms = "mov,matroska,avi,mpeg,mpegts,mpegvideo,m4v,asf,mxf,ogg,flv,h264,hevc,mjpeg";

int IsStopped( void* i_pStop )
{
  return static_cast< const std::atomic< bool >* >( i_pStop )->load() ? 1 : 0;
}

} // namespace

std::string FFmpegError( int i_Error )
{
  char Text[AV_ERROR_MAX_STRING_SIZE] = {};
  return av_strerror( i_Error, Text, sizeof Text ) == 0 ? std::string( Text )
                                                        : std::string( "error " ).append( std::to_string( i_Error ) );
}

int OpenVideo( const std::filesystem::path& i_rPath, VFFmpegPtr< AVFormatContext >& o_rInput, int& o_rStream,
               const std::atomic< bool >* i_pStop )
{
  static std::once_flag Once;
  std::call_once( Once,
                  []
                  {
                    av_log_set_callback( KeepQuiet );
                  } );
  std::error_code Failure;
  const std::filesystem::path Path = std::filesystem::absolute( i_rPath, Failure );
  if ( Failure )
  {
    return AVERROR( ENOENT );
  }
  AVFormatContext* pInput = avformat_alloc_context();
  if ( !pInput )
  {
    return AVERROR( ENOMEM );
  }
  if ( i_pStop )
  {
    pInput->interrupt_callback = { IsStopped, const_cast< std::atomic< bool >* >( i_pStop ) };
  }
  AVDictionary* pOptions = nullptr;
  av_dict_set( &pOptions, "protocol_whitelist", "file", 0 );
  av_dict_set( &pOptions, "format_whitelist", Forms, 0 );
  // With its protocol in front no name is taken for an address.
  const std::string Name = std::string( "file:" ).append( Path.string() );
  int Result = avformat_open_input( &pInput, Name.c_str(), nullptr, &pOptions );
  av_dict_free( &pOptions );
  if ( Result < 0 )
  {
    return Result;
  }
  o_rInput.reset( pInput );
  Result = avformat_find_stream_info( pInput, nullptr );
  if ( Result < 0 )
  {
    return Result;
  }
  o_rStream = av_find_best_stream( pInput, AVMEDIA_TYPE_VIDEO, -1, -1, nullptr, 0 );
  if ( o_rStream < 0 || ( pInput->streams[o_rStream]->disposition & AV_DISPOSITION_ATTACHED_PIC ) != 0 )
  {
    return AVERROR_STREAM_NOT_FOUND;
  }
  for ( unsigned Index = 0; Index < pInput->nb_streams; ++Index )
  {
    pInput->streams[Index]->discard = static_cast< int >( Index ) == o_rStream ? AVDISCARD_DEFAULT : AVDISCARD_ALL;
  }
  return 0;
}

} // namespace HostVideo
