#pragma once

#include <CoreVideoUtils/VideoPlanes.h>

// What the library lacks: mosaics, and colours after BT.709. Its colours out of YUV are up to 14 levels off there, as
// one of its factors does not fit its fixed point, and its way of filling in chroma spoils the last column of odd
// pictures; so they are made here as well.

namespace CoreVideoUtils
{

/// Of a frame of one of the YUV formats. Chroma of planar formats lies between the pixels that share it and is filled
/// in evenly. Writes R, G, B, 255, rows without gaps, as stored.
void YuvToRgba( const CoreMoxelTypes::VVideoFrame& i_rFrame, const VVideoPlanes& i_rPlanes,
                CoreMoxelTypes::u8* o_pRgba );

/// The colours between the pixels of a mosaic, as the mean of the nearest ones; at the edges the neighbour of the same
/// colour stands in. Writes R, G, B, 255, rows without gaps.
void MosaicToRgba( const VVideoPlane& i_rMosaic, const std::array< int, 2 >& i_rPhase, CoreMoxelTypes::u8* o_pRgba );

/// What the sensor behind a mosaic keeps of a picture of B, G, R, A.
void BgraToMosaic( const CoreMoxelTypes::u8* i_pBgra, CoreMoxelTypes::u32 i_Width, CoreMoxelTypes::u32 i_Height,
                   const std::array< int, 2 >& i_rPhase, CoreMoxelTypes::u8* o_pMosaic );

/// A row pair by pair (4:2:2) after BT.709, limited range, for which the library has no conversion.
void BgraToI422HighDefinition( const CoreMoxelTypes::u8* i_pBgra, CoreMoxelTypes::u32 i_Width,
                               CoreMoxelTypes::u32 i_Height, CoreMoxelTypes::u8* o_pY, CoreMoxelTypes::u8* o_pU,
                               CoreMoxelTypes::u8* o_pV );

} // namespace CoreVideoUtils
