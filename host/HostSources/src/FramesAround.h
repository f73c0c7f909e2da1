#pragma once

#include <HostSources/VSourcePump.h>

#include <cstdint>
#include <utility>
#include <vector>

namespace HostSources
{

/// The states of frames to both sides of the one that is shown, made one by one as there is time. Nothing is allocated
/// for each. Thread: one.
class VFramesAround
{
public:
  VFramesAround() = default;
  VFramesAround( std::int64_t i_Frames, VSourcePump::VTakeAround i_Take );

  /// Drops all; they are to be made anew.
  void Forget();
  /// A frame was added to the cache.
  void Shown( std::int64_t i_Index, const ZEK::VFlowStateRef& i_rState );
  /// The frame that is to be made next; -1 when all are there. The nearest of those to come, then the nearest before.
  std::int64_t Next( std::int64_t i_Shown, std::int64_t i_Count ) const;
  /// Null for one that could not be made. `i_bSlow`: no more until `EndRest`, or until many were shown.
  void Made( std::int64_t i_Index, const ZEK::VFlowStateRef& i_rState, bool i_bSlow );
  bool IsResting() const { return m_Rest > 0; }
  void EndRest() { m_Rest = 0; }
  ZEK::VFlowStateRef Find( std::int64_t i_Index ) const;

  /// Something was made that nobody was told of.
  bool HasUntold() const { return m_bUntold; }
  void HandOver( std::int64_t i_Shown, bool i_bTell );

private:
  struct VSlot
  {
    std::int64_t Index = -1;
    ZEK::VFlowStateRef State; ///< null when it cannot be made
  };
  VSlot& SlotOf( std::int64_t i_Index ) { return m_Slots[static_cast< std::size_t >( i_Index ) % m_Slots.size()]; }
  const VSlot& SlotOf( std::int64_t i_Index ) const
  {
    return m_Slots[static_cast< std::size_t >( i_Index ) % m_Slots.size()];
  }

  std::int64_t m_Frames = 0;
  VSourcePump::VTakeAround m_Take;
  std::vector< VSlot > m_Slots; ///< each frame has its place among them
  std::vector< ZEK::VFlowStateRef > m_States;
  int m_Rest = 0;        ///< so many frames are shown before others are made
  bool m_bVideo = false; ///< the one shown last has some
  bool m_bUntold = false;
};

} // namespace HostSources
