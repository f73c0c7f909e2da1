#pragma once

#include <CoreMoxelTypes/Camera.h>
#include <ZEK/Result.h>

#include <cstddef>
#include <span>
#include <vector>

namespace CoreVideoUtils
{

/// A picture of R, G, B, A from its top row down, rows without gaps.
struct VRgbaPicture
{
  CoreMoxelTypes::u32 Width = 0, Height = 0;
  std::vector< CoreMoxelTypes::u8 > Pixels;
};

/// Order of the bytes of a pixel.
enum class ERgbOrder
{
  RGB,
  BGR,
  RGBA,
  BGRA
};

/// A picture that somebody else holds, from its top row down. Alpha is not looked at.
struct VRgbImage
{
  std::span< const CoreMoxelTypes::u8 > Data;
  CoreMoxelTypes::u32 Width = 0, Height = 0;
  std::size_t Stride = 0; ///< bytes from row to row
  ERgbOrder Order = ERgbOrder::RGBA;
};

// All of them work in 8 bits, refuse what `FindPlanes` refuses with the same codes, and then leave their result as it
// was. Thread: any.

/// What is seen of a frame, bottom-up ones turned.
ZEK::IResult ToRgba( const CoreMoxelTypes::VVideoFrame& i_rFrame, VRgbaPicture& o_rPicture );

/// A frame of a picture. Everything but format, size, planes, flags and data of the frame stays.
ZEK::IResult FromRgb( const VRgbImage& i_rImage, CoreMoxelTypes::EPixelFormat i_Format,
                      CoreMoxelTypes::VVideoFrame& io_rFrame );

/// The frame in another format, or in its own with rows without gaps. Place, time and flags come along.
ZEK::IResult ConvertFrame( const CoreMoxelTypes::VVideoFrame& i_rFrame, CoreMoxelTypes::EPixelFormat i_Format,
                           CoreMoxelTypes::VVideoFrame& o_rFrame );

/// An image of 1 (grey), 2 (grey and alpha), 3 (RGB) or 4 components; `InvalidFormat` for others, `InvalidValue` and
/// `EndOfData` as above.
ZEK::IResult ImageToRgba( const CoreMoxelTypes::VImageSet::I& i_rImage, VRgbaPicture& o_rPicture );

} // namespace CoreVideoUtils
