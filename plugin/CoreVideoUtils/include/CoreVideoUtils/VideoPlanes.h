#pragma once

#include <CoreMoxelTypes/Camera.h>
#include <ZEK/Result.h>

#include <array>
#include <cstddef>

namespace CoreVideoUtils
{

/// What formats have in common for whoever draws or converts them.
enum class EPixelFamily
{
  Luminance,
  Bayer,
  YUV,      ///< packed, 4:2:2
  YUVPlanar ///< 4:2:0
};

inline constexpr CoreMoxelTypes::u32 PixelFormatCount = 10;
inline constexpr CoreMoxelTypes::u32 VideoBottomUp = 1; ///< bit of `VVideoFrame::Flags`
/// Limited range throughout; pictures of this many lines and more follow BT.709, lower ones BT.601.
inline constexpr CoreMoxelTypes::u32 HighDefinitionLines = 720;

bool IsKnown( CoreMoxelTypes::EPixelFormat i_Format );
/// Of a known format.
EPixelFamily FamilyOf( CoreMoxelTypes::EPixelFormat i_Format );
/// Where the first red pixel of a mosaic is, column and row, each 0 or 1.
std::array< int, 2 > BayerPhase( CoreMoxelTypes::EPixelFormat i_Format );

/// Rows of one plane, inside the data of its frame.
struct VVideoPlane
{
  const CoreMoxelTypes::u8* pData = nullptr;
  std::size_t Stride = 0;   ///< bytes from row to row
  std::size_t RowBytes = 0; ///< of them used
  CoreMoxelTypes::u32 Rows = 0;
};

struct VVideoPlanes
{
  std::array< VVideoPlane, 3 > Planes;
  std::size_t Count = 0;
};

/// Where the planes of a frame are, each row proven to lie within the data. Pixels of half a pair or of half a square
/// count as whole ones. `InvalidFormat` for an unknown format, `InvalidValue` for no size, one above 32768 px or a
/// stride below what a row needs, `EndOfData` where the data are too short or missing.
ZEK::IResult FindPlanes( const CoreMoxelTypes::VVideoFrame& i_rFrame, VVideoPlanes& o_rPlanes );

/// Gives a frame that format and size, with planes one behind the other and rows without gaps, and clears its flags and
/// its data. `o_rBytes` is what its data have to hold. Fails as `FindPlanes` does.
ZEK::IResult LayOutFrame( CoreMoxelTypes::EPixelFormat i_Format, CoreMoxelTypes::u32 i_Width,
                          CoreMoxelTypes::u32 i_Height, CoreMoxelTypes::VVideoFrame& o_rFrame, std::size_t& o_rBytes );

} // namespace CoreVideoUtils
