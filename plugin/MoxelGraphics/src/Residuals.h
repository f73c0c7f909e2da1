#pragma once

#include <QtGui/QImage>

#include <cstdint>

namespace MoxelGraphics
{

/// The colour of a residual in mm, 0xAABBGGRR: from cool to warm up to `LargestResidual`, and a grey of its own for a
/// point that has none.
std::uint32_t ResidualColour( float i_Residual );
inline constexpr float LargestResidual = 2.0F; ///< mm; all above look alike

/// The scale of those colours with its figures, for a pixel ratio.
QImage MakeResidualLegend( float i_PixelRatio );

} // namespace MoxelGraphics
