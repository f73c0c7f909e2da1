#include "LabelChoice.h"

#include <algorithm>
#include <bit>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
constexpr int Cell = 8; // pixels
/// So much nearer must another one be to take the place of one that is shown.
constexpr float HoldFactor = 0.85f;

constexpr unsigned PlaceBits = 30;

/// What comes first is less: rank, distance, and last the place among the candidates. One number, so that thousands are
/// put in order in no time.
std::uint64_t KeyOf( const VLabelCandidate& i_rCandidate, std::size_t i_Place )
{
  const float Away = std::max( i_rCandidate.bHeld ? i_rCandidate.Away * HoldFactor : i_rCandidate.Away, 0.0f );
  // Bits of floats that are not negative stand in the order of their numbers.
  return std::uint64_t{ i_rCandidate.Rank } << 62 |
         std::uint64_t{ std::bit_cast< std::uint32_t >( Away ) } << PlaceBits | i_Place;
}
} // namespace

void VLabelChoice::Choose( std::vector< VLabelCandidate >& io_rCandidates, int i_Limit, QSize i_Viewport )
{
  m_Columns = i_Viewport.width() / Cell + 1;
  m_Rows = i_Viewport.height() / Cell + 1;
  m_Taken.assign( static_cast< std::size_t >( m_Columns ) * static_cast< std::size_t >( m_Rows ), 0 );
  const auto Limit = static_cast< std::size_t >( std::max( i_Limit, 0 ) );
  m_Order.clear();
  for ( std::size_t Place = 0; Place < io_rCandidates.size(); ++Place )
  {
    m_Order.push_back( KeyOf( io_rCandidates[Place], Place ) );
  }
  // Ordered bit by bit: mostly the limit is reached long before the last.
  const auto Block = static_cast< std::ptrdiff_t >( std::max< std::size_t >( Limit, 64 ) );
  std::size_t Chosen = 0;
  for ( auto First = m_Order.begin(); First != m_Order.end() && Chosen < Limit; )
  {
    const auto End = m_Order.end() - First > Block ? First + Block : m_Order.end();
    if ( End != m_Order.end() )
    {
      std::nth_element( First, End, m_Order.end() );
    }
    std::sort( First, End );
    for ( ; First != End && Chosen < Limit; ++First )
    {
      VLabelCandidate& rCandidate = io_rCandidates[*First & ( ( 1u << PlaceBits ) - 1 )];
      rCandidate.bChosen = Take( rCandidate );
      Chosen += rCandidate.bChosen ? 1 : 0;
    }
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
