#include "VVideoConverter.h"

#include <algorithm>
#include <array>
#include <cstring>

namespace HostVideo
{
namespace
{
using namespace CoreMoxelTypes;

constexpr u32 VideoFlag = 2;
/// Scalers write whole vectors at the ends of rows.
constexpr u32 RowAlignment = 32, Slack = 64;
/// From so many lines on a view takes colours by the rules of high definition.
constexpr int HighDefinition = 720;

struct VForm
{
  AVPixelFormat From;
  EPixelFormat To;
};
constexpr VForm Forms[] = {
    { AV_PIX_FMT_YUV420P, EPixelFormat::I420 },           { AV_PIX_FMT_NV12, EPixelFormat::NV12 },
    { AV_PIX_FMT_YUYV422, EPixelFormat::YUYV },           { AV_PIX_FMT_UYVY422, EPixelFormat::UYVY },
    { AV_PIX_FMT_GRAY8, EPixelFormat::Luminance8 },       { AV_PIX_FMT_GRAY16LE, EPixelFormat::Luminance16 },
    { AV_PIX_FMT_BAYER_RGGB8, EPixelFormat::BayerRGGB8 }, { AV_PIX_FMT_BAYER_GRBG8, EPixelFormat::BayerGRBG8 },
    { AV_PIX_FMT_BAYER_GBRG8, EPixelFormat::BayerGBRG8 }, { AV_PIX_FMT_BAYER_BGGR8, EPixelFormat::BayerBGGR8 } };

/// One plane: bytes a row, and rows.
struct VPlane
{
  u32 Bytes = 0, Rows = 0;
};
using VPlanes = std::array< VPlane, 3 >;

VPlanes PlanesOf( EPixelFormat i_Format, u32 i_Width, u32 i_Height )
{
  const u32 HalfWidth = ( i_Width + 1 ) / 2, HalfHeight = ( i_Height + 1 ) / 2;
  switch ( i_Format )
  {
  case EPixelFormat::I420:
    return { VPlane{ i_Width, i_Height }, VPlane{ HalfWidth, HalfHeight }, VPlane{ HalfWidth, HalfHeight } };
  case EPixelFormat::NV12:
    return { VPlane{ i_Width, i_Height }, VPlane{ 2 * HalfWidth, HalfHeight } };
  case EPixelFormat::YUYV:
  case EPixelFormat::UYVY:
    return { VPlane{ 4 * HalfWidth, i_Height } };
  case EPixelFormat::Luminance16:
    return { VPlane{ 2 * i_Width, i_Height } };
  default:
    return { VPlane{ i_Width, i_Height } };
  }
}

/// Sets size, strides and offsets; gives the bytes of all planes.
std::size_t LayOut( EPixelFormat i_Format, u32 i_Width, u32 i_Height, u32 i_Alignment, VVideoFrame& o_rFrame )
{
  o_rFrame = {};
  o_rFrame.Format = i_Format;
  o_rFrame.Width = i_Width;
  o_rFrame.Height = i_Height;
  o_rFrame.Flags = VideoFlag;
  std::size_t Total = 0;
  const VPlanes Planes = PlanesOf( i_Format, i_Width, i_Height );
  for ( std::size_t Plane = 0; Plane < Planes.size(); ++Plane )
  {
    if ( Planes[Plane].Rows != 0 )
    {
      o_rFrame.Stride[Plane] = ( Planes[Plane].Bytes + i_Alignment - 1 ) / i_Alignment * i_Alignment;
      o_rFrame.Offset[Plane] = static_cast< u32 >( Total );
      Total += static_cast< std::size_t >( o_rFrame.Stride[Plane] ) * Planes[Plane].Rows;
    }
  }
  return Total;
}

bool IsFullRange( const AVFrame& i_rPicture )
{
  const auto Format = static_cast< AVPixelFormat >( i_rPicture.format );
  const AVPixFmtDescriptor* const pForm = av_pix_fmt_desc_get( Format );
  return i_rPicture.color_range == AVCOL_RANGE_JPEG || Format == AV_PIX_FMT_YUVJ420P || Format == AV_PIX_FMT_YUVJ422P ||
         Format == AV_PIX_FMT_YUVJ444P || Format == AV_PIX_FMT_YUVJ440P ||
         ( pForm && ( pForm->flags & AV_PIX_FMT_FLAG_RGB ) != 0 );
}

/// The scaler knows full range by a switch, not by the form.
AVPixelFormat PlainForm( AVPixelFormat i_Format )
{
  switch ( i_Format )
  {
  case AV_PIX_FMT_YUVJ420P:
    return AV_PIX_FMT_YUV420P;
  case AV_PIX_FMT_YUVJ422P:
    return AV_PIX_FMT_YUV422P;
  case AV_PIX_FMT_YUVJ444P:
    return AV_PIX_FMT_YUV444P;
  case AV_PIX_FMT_YUVJ440P:
    return AV_PIX_FMT_YUV440P;
  default:
    return i_Format;
  }
}

/// The view's form of a picture that has one already.
const VForm* FormOf( const AVFrame& i_rPicture )
{
  const auto It = std::find_if( std::begin( Forms ), std::end( Forms ),
                                [&]( const VForm& i_rForm )
                                {
                                  return i_rForm.From == i_rPicture.format;
                                } );
  if ( It == std::end( Forms ) )
  {
    return nullptr;
  }
  const bool bColour = It->To >= EPixelFormat::YUYV;
  return bColour && IsFullRange( i_rPicture ) ? nullptr : It;
}

void TurnPlane( const u8* i_pFrom, u32 i_FromStride, const VPlane& i_rTo, u32 i_ToStride, int i_QuarterTurns,
                u8* o_pTo )
{
  for ( u32 Row = 0; Row < i_rTo.Rows; ++Row, o_pTo += i_ToStride )
  {
    for ( u32 Column = 0; Column < i_rTo.Bytes; ++Column )
    {
      const u32 X = i_QuarterTurns == 1 ? Row : i_QuarterTurns == 2 ? i_rTo.Bytes - 1 - Column : i_rTo.Rows - 1 - Row;
      const u32 Y = i_QuarterTurns == 1   ? i_rTo.Bytes - 1 - Column
                    : i_QuarterTurns == 2 ? i_rTo.Rows - 1 - Row
                                          : Column;
      o_pTo[Column] = i_pFrom[static_cast< std::size_t >( Y ) * i_FromStride + X];
    }
  }
}

/// Of three planes, clockwise.
void Turn( int i_QuarterTurns, VVideoBuffers& io_rBuffers, VVideoFrame& io_rFrame )
{
  const bool bAcross = i_QuarterTurns % 2 != 0;
  const u32 Width = bAcross ? io_rFrame.Height : io_rFrame.Width;
  const u32 Height = bAcross ? io_rFrame.Width : io_rFrame.Height;
  VVideoFrame Turned;
  const auto pBytes = io_rBuffers.Take( LayOut( io_rFrame.Format, Width, Height, 1, Turned ) );
  const VPlanes Planes = PlanesOf( io_rFrame.Format, Width, Height );
  for ( std::size_t Plane = 0; Plane < Planes.size(); ++Plane )
  {
    TurnPlane( io_rFrame.Data->data() + io_rFrame.Offset[Plane], io_rFrame.Stride[Plane], Planes[Plane],
               Turned.Stride[Plane], i_QuarterTurns, pBytes->data() + Turned.Offset[Plane] );
  }
  Turned.Data = pBytes;
  io_rFrame = std::move( Turned );
}

} // namespace

/// Ranges have to be known before the scaler chooses its ways: told later, a copy would stay a copy.
bool VVideoConverter::PrepareScaler( const VScaled& i_rFor )
{
  if ( m_pScaler && m_ScalerFor == i_rFor )
  {
    return true;
  }
  m_pScaler.reset( sws_alloc_context() );
  SwsContext* const pScaler = m_pScaler.get();
  if ( !pScaler )
  {
    return false;
  }
  av_opt_set_int( pScaler, "srcw", i_rFor.Width, 0 );
  av_opt_set_int( pScaler, "srch", i_rFor.Height, 0 );
  av_opt_set_int( pScaler, "src_format", i_rFor.From, 0 );
  av_opt_set_int( pScaler, "src_range", i_rFor.bFullRange ? 1 : 0, 0 );
  av_opt_set_int( pScaler, "dstw", i_rFor.Width, 0 );
  av_opt_set_int( pScaler, "dsth", i_rFor.Height, 0 );
  av_opt_set_int( pScaler, "dst_format", AV_PIX_FMT_YUV420P, 0 );
  av_opt_set_int( pScaler, "dst_range", 0, 0 );
  av_opt_set_int( pScaler, "sws_flags", SWS_BILINEAR | SWS_ACCURATE_RND, 0 );
  if ( sws_init_context( pScaler, nullptr, nullptr ) < 0 )
  {
    m_pScaler.reset();
    return false;
  }
  const int* const pRules = sws_getCoefficients( i_rFor.bHighDefinition ? SWS_CS_ITU709 : SWS_CS_ITU601 );
  constexpr int One = 1 << 16;
  (void)sws_setColorspaceDetails( pScaler, pRules, i_rFor.bFullRange ? 1 : 0, pRules, 0, 0, One, One );
  m_ScalerFor = i_rFor;
  return true;
}

bool VVideoConverter::Scale( const AVFrame& i_rPicture, int i_QuarterTurns, VVideoFrame& o_rFrame )
{
  const auto From = PlainForm( static_cast< AVPixelFormat >( i_rPicture.format ) );
  const int Width = i_rPicture.width, Height = i_rPicture.height;
  const bool bHighDefinition = ( i_QuarterTurns % 2 != 0 ? Width : Height ) >= HighDefinition; // as shown
  if ( !PrepareScaler( { Width, Height, From, IsFullRange( i_rPicture ), bHighDefinition } ) )
  {
    return false;
  }
  const std::size_t Size =
      LayOut( EPixelFormat::I420, static_cast< u32 >( Width ), static_cast< u32 >( Height ), RowAlignment, o_rFrame );
  const auto pBytes = m_Buffers.Take( Size + Slack );
  std::uint8_t* To[4] = {};
  int Strides[4] = {};
  for ( std::size_t Plane = 0; Plane < 3; ++Plane )
  {
    To[Plane] = pBytes->data() + o_rFrame.Offset[Plane];
    Strides[Plane] = static_cast< int >( o_rFrame.Stride[Plane] );
  }
  o_rFrame.Data = pBytes;
  return sws_scale( m_pScaler.get(), i_rPicture.data, i_rPicture.linesize, 0, Height, To, Strides ) == Height;
}

bool VVideoConverter::Convert( const AVFrame& i_rPicture, int i_QuarterTurns, VVideoFrame& o_rFrame )
{
  if ( i_rPicture.width <= 0 || i_rPicture.height <= 0 || !i_rPicture.data[0] )
  {
    return false;
  }
  const VForm* const pForm = FormOf( i_rPicture );
  if ( !pForm || ( i_QuarterTurns != 0 && pForm->To != EPixelFormat::I420 ) )
  {
    if ( !Scale( i_rPicture, i_QuarterTurns, o_rFrame ) )
    {
      return false;
    }
  }
  else
  {
    const auto Width = static_cast< u32 >( i_rPicture.width ), Height = static_cast< u32 >( i_rPicture.height );
    const auto pBytes = m_Buffers.Take( LayOut( pForm->To, Width, Height, 1, o_rFrame ) );
    const VPlanes Planes = PlanesOf( pForm->To, Width, Height );
    for ( std::size_t Plane = 0; Plane < Planes.size() && Planes[Plane].Rows != 0; ++Plane )
    {
      av_image_copy_plane( pBytes->data() + o_rFrame.Offset[Plane], static_cast< int >( o_rFrame.Stride[Plane] ),
                           i_rPicture.data[Plane], i_rPicture.linesize[Plane],
                           static_cast< int >( Planes[Plane].Bytes ), static_cast< int >( Planes[Plane].Rows ) );
    }
    o_rFrame.Data = pBytes;
  }
  if ( i_QuarterTurns != 0 )
  {
    Turn( i_QuarterTurns, m_Buffers, o_rFrame );
  }
  return true;
}

} // namespace HostVideo
