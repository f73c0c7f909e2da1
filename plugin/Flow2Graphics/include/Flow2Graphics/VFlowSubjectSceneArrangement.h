#pragma once

#include <Flow2TypesUtils/TaggedCoreTypeExtractor.h>

#include <array>
#include <cstdint>
#include <vector>

namespace Flow2Graphics
{

/// Where a subject stands on the floor: its root's place in mm, z up, the viewer at negative y.
struct VSubjectPlace
{
  double X = 0, Y = 0;

  friend bool operator==( const VSubjectPlace&, const VSubjectPlace& ) = default;
};

/// Lines subjects up on a square grid in the order of their names, the first row at the back, the whole about the
/// origin. The cells are alike and hold the largest neutral pose, so that subjects do not stand in each other. Thread:
/// one at a time.
class VFlowSubjectSceneArrangement
{
public:
  /// Takes what was joined of `FlowSubjectParametrised`, `FlowSubjectParametrisedForSolving` and `FlowSubjectSettings`.
  /// False, with nothing changed, when all are those of the update before. Settings alone move nobody.
  bool Update( const Flow2TypesUtils::VTaggedCoreTypeExtractor& i_rSubjects );

  /// By the slot of the join; the origin for a name that has nothing to pose.
  const std::vector< VSubjectPlace >& Places() const { return m_Places; }
  /// The floor under all cells in mm: x minimum, y minimum, x maximum, y maximum, in whole metres and two metres each
  /// way at least. With y up the same numbers hold for x and z.
  const std::array< std::int32_t, 4 >& Volume() const { return m_Volume; }

private:
  void Arrange( const Flow2TypesUtils::VTaggedCoreTypeExtractor& i_rSubjects );

  std::vector< VSubjectPlace > m_Places;
  std::array< std::int32_t, 4 > m_Volume{ -2000, -2000, 2000, 2000 };
};

} // namespace Flow2Graphics
