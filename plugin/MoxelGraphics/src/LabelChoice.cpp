#include "LabelChoice.h"

#include <algorithm>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
constexpr int Cell = 8; // pixels
/// So much nearer must another one be to take the place of one that is shown.
constexpr float HoldFactor = 0.85f;

bool StandsBefore( const VLabelCandidate& i_rA, const VLabelCandidate& i_rB )
{
  if ( i_rA.Rank != i_rB.Rank )
  {
    return i_rA.Rank < i_rB.Rank;
  }
  const float A = i_rA.bHeld ? i_rA.Away * HoldFactor : i_rA.Away;
  const float B = i_rB.bHeld ? i_rB.Away * HoldFactor : i_rB.Away;
  return A != B ? A < B : i_rA.Label < i_rB.Label;
}
} // namespace

void VLabelChoice::Choose( std::vector< VLabelCandidate >& io_rCandidates, int i_Limit, QSize i_Viewport )
{
  m_Columns = i_Viewport.width() / Cell + 1;
  m_Rows = i_Viewport.height() / Cell + 1;
  m_Taken.assign( static_cast< std::size_t >( m_Columns ) * static_cast< std::size_t >( m_Rows ), 0 );
  const auto Limit = static_cast< std::size_t >( std::max( i_Limit, 0 ) );
  // Behind so many there is nobody left to be asked: most of them would have to stand in the way of one another.
  const std::size_t Asked = std::min( io_rCandidates.size(), Limit * 4 + 64 );
  const auto End = io_rCandidates.begin() + static_cast< std::ptrdiff_t >( Asked );
  if ( End != io_rCandidates.end() )
  {
    std::nth_element( io_rCandidates.begin(), End, io_rCandidates.end(), StandsBefore );
  }
  std::sort( io_rCandidates.begin(), End, StandsBefore );
  std::size_t Chosen = 0;
  for ( auto It = io_rCandidates.begin(); It != End && Chosen < Limit; ++It )
  {
    It->bChosen = Take( *It );
    Chosen += It->bChosen ? 1 : 0;
  }
}

bool VLabelChoice::Take( const VLabelCandidate& i_rCandidate )
{
  const auto CellOf = []( float i_Pixel, int i_Count )
  {
    return std::clamp( static_cast< int >( std::floor( i_Pixel / Cell ) ), 0, i_Count - 1 );
  };
  const int Left = CellOf( i_rCandidate.X + i_rCandidate.Left, m_Columns );
  const int Right = CellOf( i_rCandidate.X + i_rCandidate.Right, m_Columns );
  const int Bottom = CellOf( i_rCandidate.Y + i_rCandidate.Bottom, m_Rows );
  const int Top = CellOf( i_rCandidate.Y + i_rCandidate.Top, m_Rows );
  // One that is shown may touch another by a cell before it has to go.
  const int SlackX = i_rCandidate.bHeld && Right - Left >= 2 ? 1 : 0;
  const int SlackY = i_rCandidate.bHeld && Top - Bottom >= 2 ? 1 : 0;
  const auto At = [this]( int i_Column, int i_Row )
  {
    return static_cast< std::size_t >( i_Row ) * static_cast< std::size_t >( m_Columns ) +
           static_cast< std::size_t >( i_Column );
  };
  for ( int Row = Bottom + SlackY; Row <= Top - SlackY; ++Row )
  {
    for ( int Column = Left + SlackX; Column <= Right - SlackX; ++Column )
    {
      if ( m_Taken[At( Column, Row )] != 0 )
      {
        return false;
      }
    }
  }
  for ( int Row = Bottom; Row <= Top; ++Row )
  {
    std::fill_n( m_Taken.begin() + static_cast< std::ptrdiff_t >( At( Left, Row ) ), Right - Left + 1,
                 std::uint8_t{ 1 } );
  }
  return true;
}

} // namespace MoxelGraphics
