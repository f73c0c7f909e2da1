#include "VideoWriter.h"

#include "FFmpeg.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>

namespace HostVideo
{
namespace
{
constexpr int Bits = 8, Square = 16, Dark = 40, Light = 200;

struct VCloseOutput
{
  void operator()( AVFormatContext* i_p ) const
  {
    avio_closep( &i_p->pb );
    avformat_free_context( i_p );
  }
};

/// In 4:2:0 or grey: the squares in luma, chroma that differs from grey.
void Draw( int i_Number, AVFrame& o_rFrame )
{
  for ( int Y = 0; Y < o_rFrame.height; ++Y )
  {
    for ( int X = 0; X < o_rFrame.width; ++X )
    {
      const bool bLight = X < Bits * Square && ( i_Number >> ( X / Square ) & 1 ) != 0;
      o_rFrame.data[0][Y * o_rFrame.linesize[0] + X] = static_cast< std::uint8_t >( bLight ? Light : Dark );
    }
  }
  for ( int Plane = 1; Plane < 3 && o_rFrame.data[Plane]; ++Plane )
  {
    for ( int Y = 0; Y < ( o_rFrame.height + 1 ) / 2; ++Y )
    {
      std::memset( o_rFrame.data[Plane] + Y * o_rFrame.linesize[Plane], 100 + 50 * Plane,
                   static_cast< std::size_t >( ( o_rFrame.width + 1 ) / 2 ) );
    }
  }
}

/// Everything between a picture and the file.
class VWriter
{
public:
  VWriter( const std::filesystem::path& i_rPath, const VWrittenVideo& i_rVideo )
    : m_rVideo( i_rVideo )
    , m_Format( av_get_pix_fmt( i_rVideo.PixelFormat.c_str() ) )
  {
    AVFormatContext* pOutput = nullptr;
    EXPECT_GE( avformat_alloc_output_context2( &pOutput, nullptr, nullptr, i_rPath.c_str() ), 0 );
    m_pOutput.reset( pOutput );
  }

  bool Open( const std::filesystem::path& i_rPath );
  void Write();

private:
  void Send( const AVFrame* i_pFrame );

  const VWrittenVideo& m_rVideo;
  const AVPixelFormat m_Format;
  std::unique_ptr< AVFormatContext, VCloseOutput > m_pOutput;
  VFFmpegPtr< AVCodecContext > m_pCodec;
  AVStream* m_pStream = nullptr;
};

bool VWriter::Open( const std::filesystem::path& i_rPath )
{
  const AVCodec* const pEncoder = avcodec_find_encoder_by_name( m_rVideo.Codec.c_str() );
  if ( !pEncoder )
  {
    return false;
  }
  m_pStream = avformat_new_stream( m_pOutput.get(), nullptr );
  m_pCodec.reset( avcodec_alloc_context3( pEncoder ) );
  m_pCodec->width = m_rVideo.Width;
  m_pCodec->height = m_rVideo.Height;
  m_pCodec->pix_fmt = m_Format;
  m_pCodec->time_base = { 1, m_rVideo.RateHz };
  m_pCodec->framerate = { m_rVideo.RateHz, 1 };
  m_pCodec->gop_size = m_rVideo.KeyEvery;
  m_pCodec->max_b_frames = m_rVideo.BFrames;
  m_pCodec->bit_rate = 4000000;
  m_pCodec->strict_std_compliance = FF_COMPLIANCE_UNOFFICIAL;
  if ( m_pOutput->oformat->flags & AVFMT_GLOBALHEADER )
  {
    m_pCodec->flags |= AV_CODEC_FLAG_GLOBAL_HEADER;
  }
  EXPECT_GE( avcodec_open2( m_pCodec.get(), pEncoder, nullptr ), 0 );
  EXPECT_GE( avcodec_parameters_from_context( m_pStream->codecpar, m_pCodec.get() ), 0 );
  m_pStream->time_base = m_pCodec->time_base;
  m_pStream->avg_frame_rate = m_pCodec->framerate;
  if ( m_rVideo.QuarterTurns != 0 )
  {
    auto* const pMatrix = reinterpret_cast< std::int32_t* >(
        av_stream_new_side_data( m_pStream, AV_PKT_DATA_DISPLAYMATRIX, 9 * sizeof( std::int32_t ) ) );
    av_display_rotation_set( pMatrix, 90.0 * m_rVideo.QuarterTurns );
  }
  EXPECT_GE( avio_open( &m_pOutput->pb, i_rPath.c_str(), AVIO_FLAG_WRITE ), 0 );
  AVDictionary* pOptions = nullptr;
  if ( m_rVideo.bIndexFirst )
  {
    av_dict_set( &pOptions, "movflags", "faststart", 0 );
  }
  EXPECT_GE( avformat_write_header( m_pOutput.get(), &pOptions ), 0 );
  av_dict_free( &pOptions );
  return true;
}

void VWriter::Send( const AVFrame* i_pFrame )
{
  EXPECT_GE( avcodec_send_frame( m_pCodec.get(), i_pFrame ), 0 );
  const VFFmpegPtr< AVPacket > pPacket( av_packet_alloc() );
  while ( avcodec_receive_packet( m_pCodec.get(), pPacket.get() ) >= 0 )
  {
    av_packet_rescale_ts( pPacket.get(), m_pCodec->time_base, m_pStream->time_base );
    EXPECT_GE( av_interleaved_write_frame( m_pOutput.get(), pPacket.get() ), 0 );
  }
}

void VWriter::Write()
{
  const bool bGrey = m_Format == AV_PIX_FMT_GRAY8;
  const AVPixelFormat Drawn = bGrey ? AV_PIX_FMT_GRAY8 : AV_PIX_FMT_YUV420P;
  const VFFmpegPtr< SwsContext > pScaler( sws_getContext( m_rVideo.Width, m_rVideo.Height, Drawn, m_rVideo.Width,
                                                          m_rVideo.Height, m_Format, SWS_BILINEAR, nullptr, nullptr,
                                                          nullptr ) );
  for ( int Number = 0; Number < m_rVideo.Frames; ++Number )
  {
    const VFFmpegPtr< AVFrame > pPicture( av_frame_alloc() ), pFrame( av_frame_alloc() );
    for ( AVFrame* const pMade : { pPicture.get(), pFrame.get() } )
    {
      pMade->format = pMade == pPicture.get() ? Drawn : m_Format;
      pMade->width = m_rVideo.Width;
      pMade->height = m_rVideo.Height;
      EXPECT_GE( av_frame_get_buffer( pMade, 0 ), 0 );
    }
    Draw( Number, *pPicture );
    EXPECT_EQ( sws_scale( pScaler.get(), pPicture->data, pPicture->linesize, 0, m_rVideo.Height, pFrame->data,
                          pFrame->linesize ),
               m_rVideo.Height );
    pFrame->pts = m_rVideo.bUneven ? Number / 2 * 4 + Number % 2 : Number;
    Send( pFrame.get() );
  }
  Send( nullptr );
  EXPECT_GE( av_write_trailer( m_pOutput.get() ), 0 );
}
} // namespace

bool WriteVideo( const std::filesystem::path& i_rPath, const VWrittenVideo& i_rVideo )
{
  VWriter Writer( i_rPath, i_rVideo );
  if ( !Writer.Open( i_rPath ) )
  {
    return false;
  }
  Writer.Write();
  return true;
}

int ShownNumber( const CoreMoxelTypes::VVideoFrame& i_rFrame )
{
  int Number = 0;
  for ( int Bit = 0; i_rFrame.Data && Bit < Bits; ++Bit )
  {
    const auto X = static_cast< std::size_t >( Bit * Square + Square / 2 );
    const std::size_t Y = std::min< std::size_t >( i_rFrame.Height - 1, Square / 2 );
    const std::size_t Place = i_rFrame.Offset[0] + Y * i_rFrame.Stride[0] + X;
    Number |= Place < i_rFrame.Data->size() && ( *i_rFrame.Data )[Place] > ( Dark + Light ) / 2 ? 1 << Bit : 0;
  }
  return Number;
}

} // namespace HostVideo
