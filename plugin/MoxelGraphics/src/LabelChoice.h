#pragma once

#include <QtCore/QSize>

#include <cstdint>
#include <vector>

namespace MoxelGraphics
{

/// A label that a view could show.
struct VLabelCandidate
{
  std::uint32_t Label = 0;
  std::uint8_t Rank = 0;                                 ///< the lower, the sooner
  bool bHeld = false;                                    ///< shown until now
  float Away = 0;                                        ///< among those of one rank the nearest comes first
  std::int32_t X = 0, Y = 0;                             ///< the label's place, pixels from the lower left
  std::int16_t Left = 0, Bottom = 0, Right = 0, Top = 0; ///< of its text about that place, y up
  float Strength = 1;                                    ///< that it would be shown with
  bool bChosen = false;
};

/// Chooses among labels: the nearest, up to a number, of which none covers another. What is shown already stays until
/// another is clearly nearer, so that equals do not take turns.
class VLabelChoice
{
public:
  /// Marks those that are chosen, as many as the limit allows.
  void Choose( std::vector< VLabelCandidate >& io_rCandidates, int i_Limit, QSize i_Viewport );

private:
  void Order( const std::vector< VLabelCandidate >& i_rCandidates );
  bool Take( const VLabelCandidate& i_rCandidate );
  std::uint64_t& WordAt( int i_Row, int i_Word )
  {
    return m_Taken[static_cast< std::size_t >( i_Row ) * m_Words + static_cast< std::size_t >( i_Word )];
  }

  std::vector< std::uint64_t > m_Order, m_Sorted; ///< rank and distance of each candidate, and its place
  int m_Columns = 0, m_Rows = 0;
  std::size_t m_Words = 0;              ///< of a row
  std::vector< std::uint64_t > m_Taken; ///< a bit for each cell of the viewport, row by row
};

} // namespace MoxelGraphics
