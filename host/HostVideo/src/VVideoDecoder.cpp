#include "VVideoDecoder.h"

#include <algorithm>
#include <utility>

namespace HostVideo
{
namespace
{

constexpr std::int64_t MostPixels = std::int64_t{ 16384 } * 16384;

} // namespace

bool VVideoDecoder::Open( int i_Threads, std::string& o_rMessage )
{
  m_Threads = i_Threads;
  m_pPacket.reset( av_packet_alloc() );
  m_pPicture.reset( av_frame_alloc() );
  m_pCodec.reset();
  m_bDrained = m_bPending = false;
  m_bLanded = true;
  m_ReadError = 0;
  m_Last = -1;
  m_Floor = m_Counted = 0;
  int Result = OpenVideo( m_pClip->Path, m_pInput, m_Stream, &m_rStop );
  if ( Result >= 0 )
  {
    const AVCodecParameters& rParameters = *m_pInput->streams[m_Stream]->codecpar;
    const AVCodec* const pDecoder = avcodec_find_decoder( rParameters.codec_id );
    m_pCodec.reset( pDecoder ? avcodec_alloc_context3( pDecoder ) : nullptr );
    Result = m_pCodec ? avcodec_parameters_to_context( m_pCodec.get(), &rParameters ) : AVERROR_DECODER_NOT_FOUND;
    if ( Result >= 0 )
    {
      m_pCodec->thread_count = i_Threads;
      m_pCodec->max_pixels = MostPixels;
      m_pCodec->pkt_timebase = m_pInput->streams[m_Stream]->time_base;
      Result = avcodec_open2( m_pCodec.get(), pDecoder, nullptr );
    }
  }
  if ( Result < 0 || !m_pPacket || !m_pPicture )
  {
    o_rMessage = FFmpegError( Result < 0 ? Result : AVERROR( ENOMEM ) );
    m_pCodec.reset();
    m_pInput.reset();
    return false;
  }
  return true;
}

/// Packets that make no picture are passed over.
bool VVideoDecoder::Receive()
{
  if ( !m_pCodec )
  {
    return false;
  }
  while ( !m_rStop )
  {
    av_frame_unref( m_pPicture.get() );
    const int Received = avcodec_receive_frame( m_pCodec.get(), m_pPicture.get() );
    if ( Received == 0 )
    {
      return true;
    }
    if ( Received == AVERROR_EOF || ( m_bDrained && Received == AVERROR( EAGAIN ) ) )
    {
      return false;
    }
    int Read = 0;
    do
    {
      av_packet_unref( m_pPacket.get() );
      Read = m_bDrained ? AVERROR_EOF : av_read_frame( m_pInput.get(), m_pPacket.get() );
    } while ( Read >= 0 && m_pPacket->stream_index != m_Stream );
    if ( Read < 0 && !m_bDrained )
    {
      // A file that was cut off ends as well; only what the system failed to read is told apart.
      const AVIOContext* const pFile = m_pInput->pb;
      m_ReadError = pFile && pFile->error < 0 && pFile->error != AVERROR_EOF ? pFile->error : 0;
      m_bDrained = true;
    }
    if ( Read >= 0 && !std::exchange( m_bLanded, true ) )
    {
      m_bMissed = ( m_pPacket->flags & AV_PKT_FLAG_KEY ) == 0 || m_pPacket->pts > m_SoughtStamp;
    }
    // What is wrong with a packet shows as a frame that does not come.
    (void)avcodec_send_packet( m_pCodec.get(), Read < 0 ? nullptr : m_pPacket.get() );
    av_packet_unref( m_pPacket.get() );
  }
  return false;
}

std::int64_t VVideoDecoder::NumberOf( const AVFrame& i_rPicture )
{
  const auto& rStamps = m_pClip->Stamps;
  if ( rStamps.empty() )
  {
    return std::min( m_Counted++, m_pClip->FrameCount() - 1 );
  }
  const auto After = std::upper_bound( rStamps.begin(), rStamps.end(), i_rPicture.best_effort_timestamp );
  return After - rStamps.begin() - 1;
}

std::int64_t VVideoDecoder::Next()
{
  if ( m_bPending )
  {
    m_bPending = false;
    return m_Last;
  }
  while ( Receive() )
  {
    const std::int64_t Number = NumberOf( *m_pPicture );
    if ( Number >= m_Floor && Number > m_Last )
    {
      m_Last = Number;
      return Number;
    }
  }
  return -1;
}

/// The last key at or before a frame; 0 where there is none.
std::size_t VVideoDecoder::KeyAt( std::int64_t i_Frame ) const
{
  const auto& rKeys = m_pClip->Keys;
  const auto After = std::upper_bound( rKeys.begin(), rKeys.end(), i_Frame,
                                       []( std::int64_t i_Number, const VVideoClip::VKey& i_rKey )
                                       {
                                         return i_Number < i_rKey.Frame;
                                       } );
  return After == rKeys.begin() ? 0 : static_cast< std::size_t >( After - rKeys.begin() ) - 1;
}

bool VVideoDecoder::IsSeekShorter( std::int64_t i_Frame ) const
{
  if ( i_Frame < m_Last || ( i_Frame == m_Last && !m_bPending ) )
  {
    return true;
  }
  if ( !m_bSeekable || m_pClip->Stamps.empty() || m_pClip->Keys.empty() )
  {
    return false;
  }
  const std::int64_t Key = m_pClip->Keys[KeyAt( i_Frame )].Frame;
  return Key > m_Last + 1 && Key != m_Sought;
}

bool VVideoDecoder::SeekToKey( std::size_t i_Key )
{
  const VVideoClip::VKey& rKey = m_pClip->Keys[i_Key];
  if ( !m_pInput || avformat_seek_file( m_pInput.get(), m_Stream, INT64_MIN, rKey.Stamp, rKey.Stamp, 0 ) < 0 )
  {
    return false;
  }
  avcodec_flush_buffers( m_pCodec.get() );
  m_bDrained = m_bPending = m_bLanded = m_bMissed = false;
  m_ReadError = 0;
  m_SoughtStamp = rKey.Stamp;
  m_Last = -1;
  m_Floor = rKey.Frame;
  return true;
}

bool VVideoDecoder::Seek( std::int64_t i_Frame, std::string& o_rMessage )
{
  // Some forms of files find a key by the time of its decoding and then land behind the frame: the keys before it are
  // tried, and in the end the file is begun anew.
  constexpr std::size_t Tries = 3;
  const bool bKeys = m_bSeekable && !m_pClip->Stamps.empty() && !m_pClip->Keys.empty();
  const std::size_t Key = bKeys ? KeyAt( i_Frame ) : 0;
  m_Sought = bKeys ? m_pClip->Keys[Key].Frame : -1;
  bool bMissed = false;
  for ( std::size_t Try = 0; Try < Tries && Try < Key; ++Try )
  {
    if ( !SeekToKey( Key - Try ) )
    {
      bMissed = !m_rStop;
      break;
    }
    const std::int64_t First = Next();
    if ( First >= 0 && First <= i_Frame )
    {
      m_bPending = true;
      return true;
    }
    // A seek that found its key and still came out behind the frame met damage, which is no fault of the seeking.
    bMissed = bMissed || ( First >= 0 && m_bMissed );
  }
  m_bSeekable = m_bSeekable && !bMissed;
  return Open( m_Threads, o_rMessage );
}

} // namespace HostVideo
