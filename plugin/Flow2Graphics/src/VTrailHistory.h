#pragma once

#include <CoreMoxelTypes/Reconstruction.h>
#include <ZEK/FlowState.h>

#include <array>
#include <cstdint>
#include <span>
#include <unordered_map>
#include <vector>

namespace Flow2Graphics
{

/// What of a frame says where markers are.
struct VTrailItems
{
  ZEK::VFlowItemRef Set, Labels, Tracks; ///< each may be null

  static VTrailItems Of( const ZEK::IFlowState& i_rState );
  friend bool operator==( const VTrailItems&, const VTrailItems& ) = default;
};

/// Where markers were in the frames of a stretch of time, each by a number of its own: labelled ones by subject and
/// marker, others by their track. Frames come in any order. Nothing is allocated while markers and the number of frames
/// stay what they were.
///
/// Thread: render thread.
class VTrailHistory
{
public:
  using VPlace = std::array< float, 3 >; ///< mm; not finite: not seen
  struct VFrame
  {
    std::int64_t Ticks = 0;
    std::vector< VPlace > Places; ///< by marker; may be short
  };
  struct VMarker
  {
    bool bTrack = false;
    std::uint32_t Subject = 0, Marker = 0; ///< of a labelled one
    std::uint64_t Track = 0;
  };

  void Clear();
  /// Tracks come and go for as long as a capture runs: so many are known that `Clear` forgets them too.
  bool IsFull() const;
  /// A second frame of one time is left out.
  void Add( std::int64_t i_Ticks, const VTrailItems& i_rItems );
  bool Has( std::int64_t i_Ticks ) const;
  /// Leaves only what lies in between, both included.
  void Keep( std::int64_t i_First, std::int64_t i_Last );

  const std::vector< VFrame >& Frames() const { return m_Frames; } ///< ascending
  const std::vector< VMarker >& Markers() const { return m_Markers; }
  /// The number of the marker that has a track; -1 for none.
  std::int64_t FindTrack( std::uint64_t i_Track ) const;

private:
  void AddLabelled( const CoreMoxelTypes::VReconstructionSet& i_rSet, const VTrailItems& i_rItems, VFrame& io_rFrame );
  void AddTracks( const CoreMoxelTypes::VReconstructionSet& i_rSet, const VTrailItems& i_rItems, VFrame& io_rFrame );
  std::uint32_t NumberOf( const VMarker& i_rMarker );
  static void Place( VFrame& io_rFrame, std::uint32_t i_Number, const CoreMoxelTypes::VReconstruction& i_rAt );

  std::vector< VFrame > m_Frames;
  std::vector< std::vector< VPlace > > m_Spare;
  std::vector< VMarker > m_Markers;
  std::unordered_map< std::uint64_t, std::uint32_t > m_ByLabel, m_ByTrack;
  std::vector< std::uint8_t > m_Taken; ///< by reconstruction of the frame that is added
};

} // namespace Flow2Graphics
