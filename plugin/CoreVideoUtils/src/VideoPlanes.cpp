#include <CoreVideoUtils/VideoPlanes.h>

namespace CoreVideoUtils
{
using namespace CoreMoxelTypes;

namespace
{
constexpr u32 LongestSide = 32768;
constexpr u32 LongestStride = 0x7FFFFFFF;

u32 Half( u32 i_Count )
{
  return ( i_Count + 1 ) / 2;
}

struct VPlaneSize
{
  u32 RowBytes = 0, Rows = 0;
};

/// Of a known format; gives the number of planes.
std::size_t PlaneSizes( EPixelFormat i_Format, u32 i_Width, u32 i_Height, std::array< VPlaneSize, 3 >& o_rSizes )
{
  switch ( i_Format )
  {
  case EPixelFormat::Luminance16:
    o_rSizes[0] = { 2 * i_Width, i_Height };
    return 1;
  case EPixelFormat::YUYV:
  case EPixelFormat::UYVY:
    o_rSizes[0] = { 4 * Half( i_Width ), i_Height };
    return 1;
  case EPixelFormat::I420:
    o_rSizes = {
        { { i_Width, i_Height }, { Half( i_Width ), Half( i_Height ) }, { Half( i_Width ), Half( i_Height ) } } };
    return 3;
  case EPixelFormat::NV12:
    o_rSizes = { { { i_Width, i_Height }, { 2 * Half( i_Width ), Half( i_Height ) }, {} } };
    return 2;
  default:
    o_rSizes[0] = { i_Width, i_Height };
    return 1;
  }
}

ZEK::IResult CheckSize( EPixelFormat i_Format, u32 i_Width, u32 i_Height )
{
  if ( !IsKnown( i_Format ) )
  {
    return ZEK::IResult::InvalidFormat;
  }
  const bool bSize = i_Width != 0 && i_Height != 0 && i_Width <= LongestSide && i_Height <= LongestSide;
  return bSize ? ZEK::IResult::Ok : ZEK::IResult::InvalidValue;
}
} // namespace

bool IsKnown( EPixelFormat i_Format )
{
  return static_cast< u32 >( i_Format ) < PixelFormatCount;
}

EPixelFamily FamilyOf( EPixelFormat i_Format )
{
  switch ( i_Format )
  {
  case EPixelFormat::BayerRGGB8:
  case EPixelFormat::BayerGRBG8:
  case EPixelFormat::BayerGBRG8:
  case EPixelFormat::BayerBGGR8:
    return EPixelFamily::Bayer;
  case EPixelFormat::YUYV:
  case EPixelFormat::UYVY:
    return EPixelFamily::YUV;
  case EPixelFormat::I420:
  case EPixelFormat::NV12:
    return EPixelFamily::YUVPlanar;
  default:
    return EPixelFamily::Luminance;
  }
}

std::array< int, 2 > BayerPhase( EPixelFormat i_Format )
{
  const int Place = static_cast< int >( i_Format ) - static_cast< int >( EPixelFormat::BayerRGGB8 );
  return { Place & 1, Place >> 1 & 1 };
}

ZEK::IResult FindPlanes( const VVideoFrame& i_rFrame, VVideoPlanes& o_rPlanes )
{
  if ( const ZEK::IResult Result = CheckSize( i_rFrame.Format, i_rFrame.Width, i_rFrame.Height ); Result.IsError() )
  {
    return Result;
  }
  std::array< VPlaneSize, 3 > Sizes;
  VVideoPlanes Found;
  Found.Count = PlaneSizes( i_rFrame.Format, i_rFrame.Width, i_rFrame.Height, Sizes );
  for ( std::size_t Index = 0; Index < Found.Count; ++Index )
  {
    if ( i_rFrame.Stride[Index] < Sizes[Index].RowBytes || i_rFrame.Stride[Index] > LongestStride )
    {
      return ZEK::IResult::InvalidValue;
    }
    const u64 Last = u64{ i_rFrame.Stride[Index] } * ( Sizes[Index].Rows - 1 );
    const u64 End = i_rFrame.Offset[Index] + Last + Sizes[Index].RowBytes;
    if ( !i_rFrame.Data || End > i_rFrame.Data->size() )
    {
      return ZEK::IResult::EndOfData;
    }
    Found.Planes[Index] = { i_rFrame.Data->data() + i_rFrame.Offset[Index], i_rFrame.Stride[Index],
                            Sizes[Index].RowBytes, Sizes[Index].Rows };
  }
  o_rPlanes = Found;
  return ZEK::IResult::Ok;
}

ZEK::IResult LayOutFrame( EPixelFormat i_Format, u32 i_Width, u32 i_Height, VVideoFrame& o_rFrame,
                          std::size_t& o_rBytes )
{
  if ( const ZEK::IResult Result = CheckSize( i_Format, i_Width, i_Height ); Result.IsError() )
  {
    return Result;
  }
  std::array< VPlaneSize, 3 > Sizes;
  const std::size_t Count = PlaneSizes( i_Format, i_Width, i_Height, Sizes );
  o_rFrame.Format = i_Format;
  o_rFrame.Width = i_Width;
  o_rFrame.Height = i_Height;
  o_rFrame.Flags = 0;
  o_rFrame.Data.reset();
  o_rBytes = 0;
  for ( std::size_t Index = 0; Index < Sizes.size(); ++Index )
  {
    const bool bThere = Index < Count;
    o_rFrame.Stride[Index] = bThere ? Sizes[Index].RowBytes : 0;
    o_rFrame.Offset[Index] = bThere ? static_cast< u32 >( o_rBytes ) : 0;
    o_rBytes += bThere ? std::size_t{ Sizes[Index].RowBytes } * Sizes[Index].Rows : 0;
  }
  return ZEK::IResult::Ok;
}

} // namespace CoreVideoUtils
