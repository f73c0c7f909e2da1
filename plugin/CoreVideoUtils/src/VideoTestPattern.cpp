#include <CoreVideoUtils/ConvertVideo.h>
#include <CoreVideoUtils/VideoPlanes.h>
#include <CoreVideoUtils/VideoTestPattern.h>

namespace CoreVideoUtils
{
using namespace CoreMoxelTypes;

VImageSet::I ColourBars( u32 i_Width, u32 i_Height )
{
  VImageSet::I Image;
  Image.Tag = "Test image";
  Image.Width = i_Width;
  Image.Height = i_Height;
  Image.Components = 3;
  Image.Data.reserve( std::size_t{ i_Width } * i_Height * Image.Components );
  for ( u32 y = 0; y < i_Height; ++y )
  {
    for ( u32 x = 0; x < i_Width; ++x )
    {
      const u32 Bar = 7 - x * 8 / i_Width;
      const auto Grey = static_cast< u8 >( x * 255 / std::max( i_Width - 1, 1u ) );
      for ( const u32 Bit : { 2u, 4u, 1u } ) // yellow follows white, blue comes before black
      {
        Image.Data.push_back( y * 4 >= i_Height * 3 ? Grey : ( Bar & Bit ) != 0 ? 0xff : 0 );
      }
    }
  }
  return Image;
}

ZEK::IResult ColourBars( EPixelFormat i_Format, u32 i_Width, u32 i_Height, VVideoFrame& io_rFrame )
{
  VVideoFrame Tried;
  std::size_t Bytes = 0;
  if ( const ZEK::IResult Result = LayOutFrame( i_Format, i_Width, i_Height, Tried, Bytes ); Result.IsError() )
  {
    return Result;
  }
  const VImageSet::I Image = ColourBars( i_Width, i_Height );
  return FromRgb( { Image.Data, i_Width, i_Height, std::size_t{ 3 } * i_Width, ERgbOrder::RGB }, i_Format, io_rFrame );
}

} // namespace CoreVideoUtils
