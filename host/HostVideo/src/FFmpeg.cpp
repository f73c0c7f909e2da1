#include "FFmpeg.h"

#include <mutex>

namespace HostVideo
{
namespace
{

/// What is wrong with a file is told once, in the project's own words.
void KeepQuiet( void*, int, const char*, va_list ) {}

} // namespace

std::string FFmpegError( int i_Error )
{
  char Text[AV_ERROR_MAX_STRING_SIZE] = {};
  return av_strerror( i_Error, Text, sizeof Text ) == 0 ? std::string( Text ) : "error " + std::to_string( i_Error );
}

int OpenVideo( const std::filesystem::path& i_rPath, VFFmpegPtr< AVFormatContext >& o_rInput, int& o_rStream )
{
  static std::once_flag Once;
  std::call_once( Once,
                  []
                  {
                    av_log_set_callback( KeepQuiet );
                  } );
  AVFormatContext* pInput = nullptr;
  AVDictionary* pOptions = nullptr;
  av_dict_set( &pOptions, "protocol_whitelist", "file", 0 );
  // With its protocol in front no name is taken for an address.
  const std::string Name = "file:" + std::filesystem::absolute( i_rPath ).string();
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
