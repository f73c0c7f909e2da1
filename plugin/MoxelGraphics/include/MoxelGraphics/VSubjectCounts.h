#pragma once

#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>

namespace MoxelGraphics
{

/// The kinds of objects that a group of subjects is drawn as.
enum ESubjectKind : std::uint32_t
{
  ESubjectMarkers,
  ESubjectTargets,
  ESubjectSticks,
  ESubjectBones,
  ESubjectJoints,
  ESubjectOrigins,
  ESubjectAxes,
  ESubjectWires,
  ESubjectCovariances,
  ESubjectMissingMarkers,
  ESubjectSkins,
  ESubjectKindCount
};

/// How many objects of each kind the last visible frame showed of a group. Written on the render thread, read by any.
class VSubjectCounts
{
public:
  std::uint32_t At( ESubjectKind i_Kind ) const { return m_Counts[i_Kind].load( std::memory_order_relaxed ); }
  void Set( ESubjectKind i_Kind, std::size_t i_Count )
  {
    m_Counts[i_Kind].store( static_cast< std::uint32_t >( i_Count ), std::memory_order_relaxed );
  }

private:
  std::array< std::atomic< std::uint32_t >, ESubjectKindCount > m_Counts{};
};

} // namespace MoxelGraphics
