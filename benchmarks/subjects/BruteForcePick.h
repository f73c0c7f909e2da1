#pragma once

#include "StandardScene.h"

#include <QtCore/QRect>

#include <cstdint>
#include <vector>

namespace SubjectsBench
{

/// The ids of what a band of the frame holds, ascending: each object of the frame that was drawn last is drawn alone,
/// and counts when a pixel within the band is its own at half the size; a point or marker counts, too, when its centre
/// lies in the band. The band is in pixels of the frame, y down, and of even numbers.
std::vector< std::uint32_t > WalkBand( VStandardView& io_rView, const QRect& i_rBand );

} // namespace SubjectsBench
