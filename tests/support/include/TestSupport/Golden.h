#pragma once

#include <gtest/gtest.h>

#include <string>

class QImage;

namespace TestSupport
{

/// How far a picture may be from the one that is kept.
struct VGoldenTolerance
{
  int Channel = 16;     ///< a pixel is as before when no channel differs by more
  double Share = 0.004; ///< of all pixels, how many may be another
};

/// Compares a picture with tests/golden/<name>.png. A difference is told by its worst pixel and by the rectangle that
/// holds all of it, and the picture and an image of the differences are left in the build folder under golden/.
/// With HARROW_UPDATE_GOLDEN=1 in the environment the picture is kept instead.
testing::AssertionResult MatchesGolden( const QImage& i_rImage, const std::string& i_rName,
                                        const VGoldenTolerance& i_rTolerance = {} );

/// The comparison alone. `o_pDifference`, unless null, gets the differences, eight times as strong.
testing::AssertionResult SamePicture( const QImage& i_rSeen, const QImage& i_rKept,
                                      const VGoldenTolerance& i_rTolerance, QImage* o_pDifference = nullptr );

} // namespace TestSupport
