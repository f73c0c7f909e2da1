#include <HostVideo/VideoClip.h>

#include "FFmpeg.h"

#include <algorithm>
#include <cmath>
#include <numeric>

namespace HostVideo
{
namespace
{

constexpr int MostPixelsAcross = 16384;
constexpr std::size_t MostFrames = std::size_t{ 1 } << 24;
/// Of the mean distance: by so much may one of them differ.
constexpr double UnevenPart = 0.25;
/// A file is cut off where so much of its length is not there: s, and part of the length.
constexpr double LeastLoss = 0.1, LossPart = 0.02;

/// What the packets of one file tell of its frames.
class VScan
{
public:
  VScan( const std::filesystem::path& i_rPath, VVideoClip& o_rClip, std::string& o_rMessage,
         const VScanProgress& i_rProgress )
    : m_rPath( i_rPath )
    , m_rClip( o_rClip )
    , m_rMessage( o_rMessage )
    , m_rProgress( i_rProgress )
  {
  }

  ZEK::IResult Run();

private:
  struct VPacket
  {
    std::int64_t Shown = AV_NOPTS_VALUE, Decoded = AV_NOPTS_VALUE;
    bool bKey = false;
  };
  ZEK::IResult Fail( ZEK::IResult i_Result, const std::string& i_rWhat );
  ZEK::IResult Open();
  ZEK::IResult Describe();
  ZEK::IResult ReadPackets();
  void TakeTurn();
  void NumberFrames();
  void CountFrames();
  void TakeRate();
  void Smooth();
  void TellLoss();
  /// After the first frame; the distance of two stamps may be too large for a signed number.
  double SecondsOf( std::int64_t i_Stamp ) const
  {
    const auto First = static_cast< std::uint64_t >( m_rClip.Stamps.front() );
    return static_cast< double >( static_cast< std::uint64_t >( i_Stamp ) - First ) * av_q2d( Stream().time_base );
  }
  const AVStream& Stream() const { return *m_pInput->streams[m_Stream]; }
  void Note( std::string i_Text ) { m_rClip.Notes.push_back( std::move( i_Text ) ); }

  const std::filesystem::path& m_rPath;
  VVideoClip& m_rClip;
  std::string& m_rMessage;
  const VScanProgress& m_rProgress;
  VFFmpegPtr< AVFormatContext > m_pInput;
  int m_Stream = -1;
  std::vector< VPacket > m_Packets;
  std::int64_t m_Cut = 0;    ///< packets that are there in part
  std::int64_t m_Hidden = 0; ///< packets that are decoded but not shown
  double m_End = 0;          ///< of what is there, of sound too, by the file's clock, s
  bool m_bReadFailed = false;
};

ZEK::IResult VScan::Fail( ZEK::IResult i_Result, const std::string& i_rWhat )
{
  m_rMessage = m_rPath.string().append( ": " ).append( i_rWhat );
  return i_Result;
}

ZEK::IResult VScan::Open()
{
  std::error_code Error;
  const auto Kind = std::filesystem::status( m_rPath, Error ).type();
  if ( Kind == std::filesystem::file_type::not_found )
  {
    return Fail( ZEK::IResult::FileNotFound, "there is no such file" );
  }
  if ( Kind != std::filesystem::file_type::regular )
  {
    return Fail( ZEK::IResult::FileIOFailure, "expected a plain file" );
  }
  const int Opened = OpenVideo( m_rPath, m_pInput, m_Stream );
  if ( Opened == AVERROR( EACCES ) || Opened == AVERROR( EIO ) )
  {
    return Fail( ZEK::IResult::FileIOFailure, "expected a video file, and it could not be read" );
  }
  if ( Opened == AVERROR_STREAM_NOT_FOUND )
  {
    return Fail( ZEK::IResult::InvalidFormat, "expected a video file, found a file without a video in it" );
  }
  return Opened < 0
             ? Fail( ZEK::IResult::InvalidFormat, std::string( "expected a video file that is whole up to its index: " )
                                                      .append( FFmpegError( Opened ) ) )
             : ZEK::IResult::Ok;
}

/// Of the orientation that the file asks for; a turn that is none by quarters is left out.
void VScan::TakeTurn()
{
  const auto* const pMatrix = reinterpret_cast< const std::int32_t* >(
      av_stream_get_side_data( &Stream(), AV_PKT_DATA_DISPLAYMATRIX, nullptr ) );
  const double Degrees = pMatrix ? -av_display_rotation_get( pMatrix ) : 0;
  if ( !std::isfinite( Degrees ) || Degrees == 0 )
  {
    return;
  }
  const double Quarters = std::round( Degrees / 90 );
  if ( std::abs( Degrees - Quarters * 90 ) > 1 )
  {
    Note( std::string( "The file asks for a turn by " )
              .append( std::to_string( static_cast< int >( Degrees ) ) )
              .append( " degrees, which is not made." ) );
    return;
  }
  m_rClip.QuarterTurns = ( static_cast< int >( Quarters ) % 4 + 4 ) % 4;
  if ( m_rClip.QuarterTurns % 2 != 0 )
  {
    std::swap( m_rClip.Width, m_rClip.Height );
  }
}

ZEK::IResult VScan::Describe()
{
  const AVCodecParameters& rCodec = *Stream().codecpar;
  m_rClip.Container = m_pInput->iformat->name;
  m_rClip.Codec = avcodec_get_name( rCodec.codec_id );
  const char* const pFormat = av_get_pix_fmt_name( static_cast< AVPixelFormat >( rCodec.format ) );
  m_rClip.PixelFormat = pFormat ? pFormat : "unknown";
  if ( rCodec.width <= 0 || rCodec.height <= 0 )
  {
    return Fail( ZEK::IResult::InvalidFormat, std::string( "expected a video of known size, found " )
                                                  .append( m_rClip.Codec )
                                                  .append( " data that do not tell" ) );
  }
  if ( rCodec.width > MostPixelsAcross || rCodec.height > MostPixelsAcross )
  {
    return Fail( ZEK::IResult::NotSupported, std::string( "expected frames of at most " )
                                                 .append( std::to_string( MostPixelsAcross ) )
                                                 .append( " pixels each way, found " )
                                                 .append( std::to_string( rCodec.width ) )
                                                 .append( " x " )
                                                 .append( std::to_string( rCodec.height ) ) );
  }
  m_rClip.Width = static_cast< std::uint32_t >( rCodec.width );
  m_rClip.Height = static_cast< std::uint32_t >( rCodec.height );
  if ( !avcodec_find_decoder( rCodec.codec_id ) )
  {
    return Fail( ZEK::IResult::NotSupported,
                 std::string( "there is no decoder for " ).append( m_rClip.Codec ).append( " video here" ) );
  }
  TakeTurn();
  return ZEK::IResult::Ok;
}

ZEK::IResult VScan::ReadPackets()
{
  const VFFmpegPtr< AVPacket > pPacket( av_packet_alloc() );
  std::error_code Ignored;
  const auto Size = static_cast< double >( std::filesystem::file_size( m_rPath, Ignored ) );
  int Result = 0;
  std::uint64_t Read = 0; // of sound too
  for ( unsigned Index = 0; Index < m_pInput->nb_streams; ++Index )
  {
    m_pInput->streams[Index]->discard = AVDISCARD_DEFAULT; // sound tells as well how much is there
  }
  while ( ( Result = av_read_frame( m_pInput.get(), pPacket.get() ) ) >= 0 )
  {
    if ( pPacket->pts != AV_NOPTS_VALUE )
    {
      const AVRational& rTick = m_pInput->streams[pPacket->stream_index]->time_base;
      // Their sum may be too large for a whole number.
      const double Ticks = static_cast< double >( pPacket->pts ) + static_cast< double >( pPacket->duration );
      m_End = std::max( m_End, Ticks * av_q2d( rTick ) );
    }
    const bool bStream = pPacket->stream_index == m_Stream;
    const bool bOurs = bStream && ( pPacket->flags & AV_PKT_FLAG_DISCARD ) == 0;
    m_Hidden += bStream && !bOurs;
    if ( bOurs && ( ( pPacket->flags & AV_PKT_FLAG_CORRUPT ) != 0 || pPacket->size == 0 ) )
    {
      ++m_Cut;
    }
    else if ( bOurs )
    {
      m_Packets.push_back( { pPacket->pts, pPacket->dts, ( pPacket->flags & AV_PKT_FLAG_KEY ) != 0 } );
    }
    const double At = pPacket->pos > 0 && Size > 0 ? static_cast< double >( pPacket->pos ) / Size : 0;
    av_packet_unref( pPacket.get() );
    if ( m_Packets.size() > MostFrames )
    {
      return Fail( ZEK::IResult::NotSupported,
                   std::string( "expected at most " ).append( std::to_string( MostFrames ) ).append( " frames" ) );
    }
    if ( m_rProgress && Read++ % 64 == 0 && !m_rProgress( std::min( At, 1.0 ) ) )
    {
      return Fail( ZEK::IResult::Canceled, "the reading was stopped" );
    }
  }
  m_bReadFailed = Result != AVERROR_EOF;
  return m_Packets.empty()
             ? Fail( ZEK::IResult::EndOfData, "expected a video, found no frame that is there as a whole" )
             : ZEK::IResult::Ok;
}

/// By their time stamps. Where a frame has none of its own, all are counted instead.
void VScan::NumberFrames()
{
  const bool bInOrder = Stream().codecpar->video_delay == 0;
  for ( VPacket& rPacket : m_Packets )
  {
    rPacket.Shown = rPacket.Shown == AV_NOPTS_VALUE && bInOrder ? rPacket.Decoded : rPacket.Shown;
  }
  std::vector< std::size_t > Order( m_Packets.size() );
  std::iota( Order.begin(), Order.end(), 0u );
  std::stable_sort( Order.begin(), Order.end(),
                    [&]( std::size_t i_A, std::size_t i_B )
                    {
                      return m_Packets[i_A].Shown < m_Packets[i_B].Shown;
                    } );
  for ( const std::size_t Place : Order )
  {
    const VPacket& rPacket = m_Packets[Place];
    const bool bOwn =
        rPacket.Shown != AV_NOPTS_VALUE && ( m_rClip.Stamps.empty() || rPacket.Shown > m_rClip.Stamps.back() );
    if ( !bOwn )
    {
      CountFrames();
      return;
    }
    const auto Frame = static_cast< std::int64_t >( m_rClip.Stamps.size() );
    m_rClip.Stamps.push_back( rPacket.Shown );
    m_rClip.Times.push_back( SecondsOf( rPacket.Shown ) );
    if ( rPacket.bKey )
    {
      m_rClip.Keys.push_back( { Frame, rPacket.Shown } );
    }
  }
}

void VScan::CountFrames()
{
  AVRational Rate = Stream().avg_frame_rate;
  Rate = Rate.num > 0 && Rate.den > 0 ? Rate : Stream().r_frame_rate;
  const bool bRate = Rate.num > 0 && Rate.den > 0;
  Note( std::string( "The file does not give each frame a time of its own; frames are counted" )
            .append( bRate ? "." : ", and 25 of them were taken for a second." ) );
  const double Step = bRate ? 1 / av_q2d( Rate ) : 0.04;
  m_rClip.Stamps.clear();
  m_rClip.Keys = { { 0, 0 } };
  m_rClip.Times.resize( m_Packets.size() );
  for ( std::size_t Frame = 0; Frame < m_rClip.Times.size(); ++Frame )
  {
    m_rClip.Times[Frame] = static_cast< double >( Frame ) * Step;
  }
}

void VScan::TakeRate()
{
  const auto& rTimes = m_rClip.Times;
  if ( rTimes.size() < 2 || rTimes.back() <= 0 )
  {
    return;
  }
  const double Step = rTimes.back() / static_cast< double >( rTimes.size() - 1 );
  m_rClip.RateHz = 1 / Step;
  // What the file says is a round number where stamps are rounded, if it says the same.
  const AVRational Said = Stream().avg_frame_rate;
  if ( Said.num > 0 && Said.den > 0 &&
       std::abs( av_q2d( Said ) * Step - 1 ) * static_cast< double >( rTimes.size() - 1 ) < 0.5 )
  {
    m_rClip.RateHz = av_q2d( Said );
  }
  Smooth();
}

/// Stamps in coarse ticks are rounded times of frames that follow one another evenly.
void VScan::Smooth()
{
  auto& rTimes = m_rClip.Times;
  const double Step = 1 / m_rClip.RateHz, Tick = av_q2d( Stream().time_base );
  bool bRounded = true;
  for ( std::size_t Frame = 1; Frame < rTimes.size(); ++Frame )
  {
    const double Off = std::abs( rTimes[Frame] - rTimes[Frame - 1] - Step );
    m_rClip.bEven = m_rClip.bEven && Off <= UnevenPart * Step + Tick;
    bRounded = bRounded && std::abs( rTimes[Frame] - static_cast< double >( Frame ) * Step ) <= Tick;
  }
  for ( std::size_t Frame = 0; bRounded && Frame < rTimes.size(); ++Frame )
  {
    rTimes[Frame] = static_cast< double >( Frame ) * Step;
  }
}

void VScan::TellLoss()
{
  const auto There = static_cast< std::int64_t >( m_Packets.size() );
  const std::int64_t Promised = Stream().nb_frames - m_Hidden;
  // A length that the file itself tells, and not one that was worked out.
  const bool bLength =
      m_pInput->duration > 0 && m_pInput->duration_estimation_method == AVFMT_DURATION_FROM_STREAM && m_End > 0;
  const double Length = bLength ? static_cast< double >( m_pInput->duration ) / AV_TIME_BASE : 0;
  const double Start =
      m_pInput->start_time == AV_NOPTS_VALUE ? 0 : static_cast< double >( m_pInput->start_time ) / AV_TIME_BASE;
  const bool bShort = Length - ( m_End - Start ) > std::max( LeastLoss, LossPart * Length );
  if ( m_Cut > 0 || m_bReadFailed || Promised > There || bShort )
  {
    std::string Text = std::string( "The file is cut off or damaged: " ).append( std::to_string( There ) );
    if ( Promised > There )
    {
      Text.append( " of " ).append( std::to_string( Promised ) );
    }
    Note( std::move( Text.append( " frames are there." ) ) );
  }
}

ZEK::IResult VScan::Run()
{
  ZEK::IResult Result = Open();
  Result = Result.IsError() ? Result : Describe();
  Result = Result.IsError() ? Result : ReadPackets();
  if ( Result.IsError() )
  {
    return Result;
  }
  TellLoss();
  const bool bLoss = !m_rClip.Notes.empty() && m_rClip.Notes.back().starts_with( "The file is cut" );
  NumberFrames();
  TakeRate();
  return bLoss ? ZEK::IResult::OkButPartial : ZEK::IResult::Ok;
}

} // namespace

std::int64_t VVideoClip::NearestFrame( double i_Seconds ) const
{
  const auto After = std::lower_bound( Times.begin(), Times.end(), i_Seconds );
  if ( After == Times.begin() || After == Times.end() )
  {
    return After == Times.begin() && !Times.empty() ? 0 : FrameCount() - 1;
  }
  const auto Frame = static_cast< std::int64_t >( After - Times.begin() );
  // Rounding of two equal distances must not decide.
  constexpr double Tie = 1e-9;
  return i_Seconds - *( After - 1 ) <= *After - i_Seconds + Tie ? Frame - 1 : Frame;
}

ZEK::IResult ScanVideo( const std::filesystem::path& i_rPath, VVideoClip& o_rClip, std::string& o_rMessage,
                        const VScanProgress& i_rProgress )
{
  o_rClip = {};
  o_rMessage.clear();
  o_rClip.Path = i_rPath;
  o_rClip.Name = i_rPath.filename().string();
  ZEK::IResult Result;
  try
  {
    Result = VScan( i_rPath, o_rClip, o_rMessage, i_rProgress ).Run();
  }
  catch ( const std::bad_alloc& )
  {
    o_rMessage = i_rPath.string().append( ": too little memory for the frames of the video" );
    Result = ZEK::IResult::AllocationFailure;
  }
  if ( Result.IsError() )
  {
    o_rClip = {};
  }
  return Result;
}

bool IsVideoSuffix( const std::string& i_rSuffix )
{
  for ( const char* const pKnown :
        { ".mp4",  ".mov", ".m4v", ".mkv", ".webm", ".avi", ".mpg",  ".mpeg", ".ts",   ".mts",
          ".m2ts", ".wmv", ".mxf", ".ogv", ".3gp",  ".flv", ".h264", ".h265", ".hevc", ".mjpeg" } )
  {
    if ( i_rSuffix == pKnown )
    {
      return true;
    }
  }
  return false;
}

} // namespace HostVideo
