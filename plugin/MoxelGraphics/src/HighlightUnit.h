#pragma once

namespace MoxelGraphics
{

/// The texture unit that has the highlight mask while the visible frame is drawn.
constexpr int HighlightUnit = 7;

} // namespace MoxelGraphics
