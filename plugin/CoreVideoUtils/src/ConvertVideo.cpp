#include <CoreVideoUtils/ConvertVideo.h>

#include "Colours.h"

#include <CoreVideoUtils/VideoPlanes.h>

#include <libyuv.h>

namespace CoreVideoUtils
{
using namespace CoreMoxelTypes;

namespace
{
using VBytes = std::vector< u8 >;

int Int( std::size_t i_Value )
{
  return static_cast< int >( i_Value );
}

bool IsYuv( EPixelFormat i_Format )
{
  const EPixelFamily Family = FamilyOf( i_Format );
  return Family == EPixelFamily::YUV || Family == EPixelFamily::YUVPlanar;
}

/// A picture of 4:2:2 in three planes, which every YUV format is led through.
struct VI422
{
  VI422( u32 i_Width, u32 i_Height )
    : Width( i_Width )
    , Height( i_Height )
    , HalfWidth( ( i_Width + 1 ) / 2 )
    , Y( std::size_t{ i_Width } * i_Height )
    , U( std::size_t{ HalfWidth } * i_Height )
    , V( U.size() )
  {
  }
  int W() const { return Int( Width ); }
  int H() const { return Int( Height ); }
  int HalfW() const { return Int( HalfWidth ); }

  u32 Width, Height, HalfWidth;
  VBytes Y, U, V;
};

/// Chroma of NV12 in planes of its own.
struct VSplitChroma
{
  explicit VSplitChroma( const VVideoPlane& i_rPairs )
    : Width( Int( i_rPairs.RowBytes / 2 ) )
    , U( i_rPairs.RowBytes / 2 * i_rPairs.Rows )
    , V( U.size() )
  {
    libyuv::SplitUVPlane( i_rPairs.pData, Int( i_rPairs.Stride ), U.data(), Width, V.data(), Width, Width,
                          Int( i_rPairs.Rows ) );
  }
  int Width;
  VBytes U, V;
};

void PlanesToI422( const VVideoPlane& i_rY, const u8* i_pU, int i_StrideU, const u8* i_pV, int i_StrideV,
                   VI422& o_rPicture )
{
  libyuv::I420ToI422( i_rY.pData, Int( i_rY.Stride ), i_pU, i_StrideU, i_pV, i_StrideV, o_rPicture.Y.data(),
                      o_rPicture.W(), o_rPicture.U.data(), o_rPicture.HalfW(), o_rPicture.V.data(), o_rPicture.HalfW(),
                      o_rPicture.W(), o_rPicture.H() );
}

void ToI422( EPixelFormat i_Format, const VVideoPlanes& i_rPlanes, VI422& o_rPicture )
{
  const auto& [rFirst, rSecond, rThird] = i_rPlanes.Planes;
  if ( i_Format == EPixelFormat::I420 )
  {
    PlanesToI422( rFirst, rSecond.pData, Int( rSecond.Stride ), rThird.pData, Int( rThird.Stride ), o_rPicture );
  }
  else if ( i_Format == EPixelFormat::NV12 )
  {
    const VSplitChroma Chroma( rSecond );
    PlanesToI422( rFirst, Chroma.U.data(), Chroma.Width, Chroma.V.data(), Chroma.Width, o_rPicture );
  }
  else
  {
    const auto Unpack = i_Format == EPixelFormat::YUYV ? &libyuv::YUY2ToI422 : &libyuv::UYVYToI422;
    Unpack( rFirst.pData, Int( rFirst.Stride ), o_rPicture.Y.data(), o_rPicture.W(), o_rPicture.U.data(),
            o_rPicture.HalfW(), o_rPicture.V.data(), o_rPicture.HalfW(), o_rPicture.W(), o_rPicture.H() );
  }
}

/// Into the data of a frame as `LayOutFrame` made it.
void FromI422( const VI422& i_rPicture, const VVideoFrame& i_rFrame, u8* o_pData )
{
  const auto Call = [&]( auto&& i_rFunction, auto... i_Targets )
  {
    i_rFunction( i_rPicture.Y.data(), i_rPicture.W(), i_rPicture.U.data(), i_rPicture.HalfW(), i_rPicture.V.data(),
                 i_rPicture.HalfW(), i_Targets..., i_rPicture.W(), i_rPicture.H() );
  };
  const int StrideY = Int( i_rFrame.Stride[0] ), HalfW = i_rPicture.HalfW(), HalfH = ( i_rPicture.H() + 1 ) / 2;
  u8* const pChroma = o_pData + i_rFrame.Offset[1];
  if ( i_rFrame.Format == EPixelFormat::YUYV )
  {
    Call( libyuv::I422ToYUY2, o_pData, StrideY );
  }
  else if ( i_rFrame.Format == EPixelFormat::UYVY )
  {
    Call( libyuv::I422ToUYVY, o_pData, StrideY );
  }
  else if ( i_rFrame.Format == EPixelFormat::I420 )
  {
    Call( libyuv::I422ToI420, o_pData, StrideY, pChroma, HalfW, o_pData + i_rFrame.Offset[2], HalfW );
  }
  else
  {
    VBytes U( static_cast< std::size_t >( HalfW ) * static_cast< std::size_t >( HalfH ) ), V( U.size() );
    Call( libyuv::I422ToI420, o_pData, StrideY, U.data(), HalfW, V.data(), HalfW );
    libyuv::MergeUVPlane( U.data(), HalfW, V.data(), HalfW, pChroma, 2 * HalfW, HalfW, HalfH );
  }
}

/// Between the two planar formats nothing but the order of the chroma differs.
void SwapPlanes( const VVideoPlanes& i_rPlanes, const VVideoFrame& i_rFrame, u8* o_pData )
{
  const auto& [rY, rSecond, rThird] = i_rPlanes.Planes;
  libyuv::CopyPlane( rY.pData, Int( rY.Stride ), o_pData, Int( rY.RowBytes ), Int( rY.RowBytes ), Int( rY.Rows ) );
  u8* const pChroma = o_pData + i_rFrame.Offset[1];
  const int Rows = Int( rSecond.Rows );
  if ( i_rFrame.Format == EPixelFormat::NV12 )
  {
    const int Width = Int( rSecond.RowBytes );
    libyuv::MergeUVPlane( rSecond.pData, Int( rSecond.Stride ), rThird.pData, Int( rThird.Stride ), pChroma, 2 * Width,
                          Width, Rows );
  }
  else
  {
    const int Width = Int( rSecond.RowBytes / 2 );
    libyuv::SplitUVPlane( rSecond.pData, Int( rSecond.Stride ), pChroma, Width, o_pData + i_rFrame.Offset[2], Width,
                          Width, Rows );
  }
}

void CopyPlanes( const VVideoPlanes& i_rPlanes, const VVideoFrame& i_rFrame, u8* o_pData )
{
  for ( std::size_t Index = 0; Index < i_rPlanes.Count; ++Index )
  {
    const VVideoPlane& rPlane = i_rPlanes.Planes[Index];
    libyuv::CopyPlane( rPlane.pData, Int( rPlane.Stride ), o_pData + i_rFrame.Offset[Index], Int( rPlane.RowBytes ),
                       Int( rPlane.RowBytes ), Int( rPlane.Rows ) );
  }
}

void GreyToRgba( const VVideoFrame& i_rFrame, const VVideoPlane& i_rPlane, u8* o_pRgba )
{
  if ( i_rFrame.Format == EPixelFormat::Luminance8 )
  {
    libyuv::J400ToARGB( i_rPlane.pData, Int( i_rPlane.Stride ), o_pRgba, Int( i_rFrame.Width ) * 4,
                        Int( i_rFrame.Width ), Int( i_rFrame.Height ) );
    return;
  }
  // Rows of 16 bits may begin anywhere, which the library does not allow.
  for ( u32 Row = 0; Row < i_rFrame.Height; ++Row )
  {
    const u8* pFrom = i_rPlane.pData + i_rPlane.Stride * Row;
    for ( u32 Column = 0; Column < i_rFrame.Width; ++Column, pFrom += 2, o_pRgba += 4 )
    {
      const auto Grey = static_cast< u8 >( ( pFrom[0] + 256 * pFrom[1] + 128 ) / 257 );
      o_pRgba[0] = o_pRgba[1] = o_pRgba[2] = Grey;
      o_pRgba[3] = 255;
    }
  }
}

/// B, G, R, A into the data of a frame as `LayOutFrame` made it.
void FromBgra( const VBytes& i_rBgra, const VVideoFrame& i_rFrame, u8* o_pData )
{
  const int W = Int( i_rFrame.Width ), H = Int( i_rFrame.Height );
  switch ( FamilyOf( i_rFrame.Format ) )
  {
  case EPixelFamily::Luminance:
    libyuv::ARGBToJ400( i_rBgra.data(), 4 * W, o_pData, W, W, H );
    if ( i_rFrame.Format == EPixelFormat::Luminance16 )
    {
      // From the end, so that no grey is overwritten before it is read.
      for ( std::size_t Pixel = std::size_t{ i_rFrame.Width } * i_rFrame.Height; Pixel-- > 0; )
      {
        o_pData[2 * Pixel] = o_pData[2 * Pixel + 1] = o_pData[Pixel];
      }
    }
    break;
  case EPixelFamily::Bayer:
    BgraToMosaic( i_rBgra.data(), i_rFrame.Width, i_rFrame.Height, BayerPhase( i_rFrame.Format ), o_pData );
    break;
  default:
  {
    VI422 Picture( i_rFrame.Width, i_rFrame.Height );
    if ( i_rFrame.Height < HighDefinitionLines )
    {
      libyuv::ARGBToI422( i_rBgra.data(), 4 * W, Picture.Y.data(), W, Picture.U.data(), Picture.HalfW(),
                          Picture.V.data(), Picture.HalfW(), W, H );
    }
    else
    {
      BgraToI422HighDefinition( i_rBgra.data(), i_rFrame.Width, i_rFrame.Height, Picture.Y.data(), Picture.U.data(),
                                Picture.V.data() );
    }
    FromI422( Picture, i_rFrame, o_pData );
  }
  }
}

void ToBgra( const VRgbImage& i_rImage, VBytes& o_rBgra )
{
  const int W = Int( i_rImage.Width ), H = Int( i_rImage.Height );
  o_rBgra.resize( std::size_t{ 4 } * i_rImage.Width * i_rImage.Height );
  constexpr auto Function = []( ERgbOrder i_Order )
  {
    switch ( i_Order )
    {
    case ERgbOrder::RGB:
      return &libyuv::RAWToARGB;
    case ERgbOrder::BGR:
      return &libyuv::RGB24ToARGB;
    case ERgbOrder::RGBA:
      return &libyuv::ABGRToARGB;
    default:
      return &libyuv::ARGBCopy;
    }
  };
  Function( i_rImage.Order )( i_rImage.Data.data(), Int( i_rImage.Stride ), o_rBgra.data(), 4 * W, W, H );
}
} // namespace

ZEK::IResult ToRgba( const VVideoFrame& i_rFrame, VRgbaPicture& o_rPicture )
{
  VVideoPlanes Planes;
  if ( const ZEK::IResult Result = FindPlanes( i_rFrame, Planes ); Result.IsError() )
  {
    return Result;
  }
  o_rPicture.Width = i_rFrame.Width;
  o_rPicture.Height = i_rFrame.Height;
  const std::size_t Row = std::size_t{ 4 } * i_rFrame.Width;
  o_rPicture.Pixels.resize( Row * i_rFrame.Height );
  u8* const pRgba = o_rPicture.Pixels.data();
  switch ( FamilyOf( i_rFrame.Format ) )
  {
  case EPixelFamily::Luminance:
    GreyToRgba( i_rFrame, Planes.Planes[0], pRgba );
    break;
  case EPixelFamily::Bayer:
    MosaicToRgba( Planes.Planes[0], BayerPhase( i_rFrame.Format ), pRgba );
    break;
  default:
    YuvToRgba( i_rFrame, Planes, pRgba );
  }
  if ( ( i_rFrame.Flags & VideoBottomUp ) != 0 )
  {
    for ( std::size_t Y = 0; Y < i_rFrame.Height / 2; ++Y )
    {
      std::swap_ranges( pRgba + Y * Row, pRgba + ( Y + 1 ) * Row, pRgba + ( i_rFrame.Height - 1 - Y ) * Row );
    }
  }
  return ZEK::IResult::Ok;
}

ZEK::IResult FromRgb( const VRgbImage& i_rImage, EPixelFormat i_Format, VVideoFrame& io_rFrame )
{
  VVideoFrame New = io_rFrame;
  std::size_t Bytes = 0;
  if ( const ZEK::IResult Result = LayOutFrame( i_Format, i_rImage.Width, i_rImage.Height, New, Bytes );
       Result.IsError() )
  {
    return Result;
  }
  const bool bThree = i_rImage.Order == ERgbOrder::RGB || i_rImage.Order == ERgbOrder::BGR;
  const std::size_t Row = std::size_t{ bThree ? 3u : 4u } * i_rImage.Width;
  constexpr std::size_t LongestStride = 0x7FFFFFFF;
  if ( i_rImage.Stride < Row || i_rImage.Stride > LongestStride )
  {
    return ZEK::IResult::InvalidValue;
  }
  if ( i_rImage.Data.size() < Row || ( i_rImage.Data.size() - Row ) / i_rImage.Stride < i_rImage.Height - 1 )
  {
    return ZEK::IResult::EndOfData;
  }
  VBytes Bgra;
  ToBgra( i_rImage, Bgra );
  const auto pData = std::make_shared< VBytes >( Bytes );
  FromBgra( Bgra, New, pData->data() );
  New.Data = pData;
  io_rFrame = std::move( New );
  return ZEK::IResult::Ok;
}

ZEK::IResult ConvertFrame( const VVideoFrame& i_rFrame, EPixelFormat i_Format, VVideoFrame& o_rFrame )
{
  VVideoPlanes Planes;
  VVideoFrame New = i_rFrame;
  std::size_t Bytes = 0;
  ZEK::IResult Result = FindPlanes( i_rFrame, Planes );
  if ( Result.IsError() )
  {
    return Result;
  }
  Result = LayOutFrame( i_Format, i_rFrame.Width, i_rFrame.Height, New, Bytes );
  if ( Result.IsError() )
  {
    return Result;
  }
  New.Flags = i_rFrame.Flags;
  const auto pData = std::make_shared< VBytes >( Bytes );
  if ( i_Format == i_rFrame.Format )
  {
    CopyPlanes( Planes, New, pData->data() );
  }
  else if ( FamilyOf( i_Format ) == EPixelFamily::YUVPlanar && FamilyOf( i_rFrame.Format ) == EPixelFamily::YUVPlanar )
  {
    SwapPlanes( Planes, New, pData->data() );
  }
  else if ( IsYuv( i_Format ) && IsYuv( i_rFrame.Format ) )
  {
    VI422 Picture( i_rFrame.Width, i_rFrame.Height );
    ToI422( i_rFrame.Format, Planes, Picture );
    FromI422( Picture, New, pData->data() );
  }
  else
  {
    // As it is stored: what lies at the bottom stays there.
    VVideoFrame Upright = i_rFrame;
    Upright.Flags &= ~VideoBottomUp;
    VRgbaPicture Picture;
    Result = ToRgba( Upright, Picture );
    VBytes Bgra;
    ToBgra( { Picture.Pixels, Picture.Width, Picture.Height, std::size_t{ 4 } * Picture.Width, ERgbOrder::RGBA },
            Bgra );
    FromBgra( Bgra, New, pData->data() );
  }
  New.Data = pData;
  o_rFrame = std::move( New );
  return Result;
}

ZEK::IResult ImageToRgba( const VImageSet::I& i_rImage, VRgbaPicture& o_rPicture )
{
  const u32 Components = i_rImage.Components;
  if ( Components == 0 || Components > 4 )
  {
    return ZEK::IResult::InvalidFormat;
  }
  VVideoFrame Tried;
  std::size_t Pixels = 0;
  if ( const ZEK::IResult Result =
           LayOutFrame( EPixelFormat::Luminance8, i_rImage.Width, i_rImage.Height, Tried, Pixels );
       Result.IsError() )
  {
    return Result;
  }
  if ( i_rImage.Data.size() / Components < Pixels )
  {
    return ZEK::IResult::EndOfData;
  }
  o_rPicture.Width = i_rImage.Width;
  o_rPicture.Height = i_rImage.Height;
  o_rPicture.Pixels.resize( 4 * Pixels );
  const bool bGrey = Components < 3;
  const u8* pFrom = i_rImage.Data.data();
  for ( u8 *pTo = o_rPicture.Pixels.data(), *pEnd = pTo + 4 * Pixels; pTo != pEnd; pTo += 4, pFrom += Components )
  {
    pTo[0] = pFrom[0];
    pTo[1] = pFrom[bGrey ? 0 : 1];
    pTo[2] = pFrom[bGrey ? 0 : 2];
    pTo[3] = Components % 2 == 0 ? pFrom[Components - 1] : 255;
  }
  return ZEK::IResult::Ok;
}

} // namespace CoreVideoUtils
