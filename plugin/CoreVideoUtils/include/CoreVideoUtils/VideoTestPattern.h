#pragma once

#include <CoreMoxelTypes/Camera.h>
#include <ZEK/Result.h>

namespace CoreVideoUtils
{

/// Eight bars from white to black, in the lower quarter a ramp of greys: three components.
CoreMoxelTypes::VImageSet::I ColourBars( CoreMoxelTypes::u32 i_Width, CoreMoxelTypes::u32 i_Height );

/// The same as a video frame. Fails as `FromRgb` does.
ZEK::IResult ColourBars( CoreMoxelTypes::EPixelFormat i_Format, CoreMoxelTypes::u32 i_Width,
                         CoreMoxelTypes::u32 i_Height, CoreMoxelTypes::VVideoFrame& io_rFrame );

} // namespace CoreVideoUtils
