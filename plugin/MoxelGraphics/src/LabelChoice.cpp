#include "LabelChoice.h"

#include <algorithm>
#include <array>
#include <bit>
#include <utility>

namespace MoxelGraphics
{
namespace
{
constexpr int Cell = 8; // pixels
/// So much nearer must another one be to take the place of one that is shown.
constexpr float HoldFactor = 0.85f;

constexpr int WordBits = 64;
constexpr std::uint64_t AllBits = ~std::uint64_t{ 0 };

// What comes first is less: rank, then distance, to 1 part in 16384, in so many digits.
constexpr int DistanceBits = 22, DigitBits = 8, Digits = 3, PlaceBits = 32;
static_assert( DistanceBits + 2 == DigitBits * Digits );

std::uint64_t KeyOf( const VLabelCandidate& i_rCandidate )
{
  const float Away = std::max( i_rCandidate.bHeld ? i_rCandidate.Away * HoldFactor : i_rCandidate.Away, 0.0f );
  // Bits of floats that are not negative stand in the order of their numbers.
  const std::uint32_t Bits = std::bit_cast< std::uint32_t >( Away ) >> ( 31 - DistanceBits );
  return std::uint64_t{ i_rCandidate.Rank } << DistanceBits | Bits;
}

std::size_t DigitOf( std::uint64_t i_Entry, int i_Digit )
{
  return i_Entry >> ( PlaceBits + i_Digit * DigitBits ) & ( ( 1u << DigitBits ) - 1 );
}

/// The bits of a word that lie between two columns, both included.
std::uint64_t MaskOf( int i_Word, int i_Left, int i_Right )
{
  const int First = std::max( i_Left - i_Word * WordBits, 0 );
  const int Last = std::min( i_Right - i_Word * WordBits, WordBits - 1 );
  return AllBits << First & AllBits >> ( WordBits - 1 - Last );
}
} // namespace

/// Digit by digit: thousands are put in order in no time, and equals keep theirs.
void VLabelChoice::Order( const std::vector< VLabelCandidate >& i_rCandidates )
{
  std::array< std::array< std::uint32_t, 1u << DigitBits >, Digits > Starts{};
  m_Order.resize( i_rCandidates.size() );
  m_Sorted.resize( i_rCandidates.size() );
  for ( std::size_t Place = 0; Place < i_rCandidates.size(); ++Place )
  {
    m_Order[Place] = KeyOf( i_rCandidates[Place] ) << PlaceBits | Place;
    for ( int Digit = 0; Digit < Digits; ++Digit )
    {
      ++Starts[static_cast< std::size_t >( Digit )][DigitOf( m_Order[Place], Digit )];
    }
  }
  for ( int Digit = 0; Digit < Digits; ++Digit )
  {
    std::uint32_t Sum = 0;
    auto& rStarts = Starts[static_cast< std::size_t >( Digit )];
    for ( std::uint32_t& rStart : rStarts )
    {
      Sum += std::exchange( rStart, Sum );
    }
    for ( const std::uint64_t Entry : m_Order )
    {
      m_Sorted[rStarts[DigitOf( Entry, Digit )]++] = Entry;
    }
    m_Order.swap( m_Sorted );
  }
}

void VLabelChoice::Choose( std::vector< VLabelCandidate >& io_rCandidates, int i_Limit, QSize i_Viewport )
{
  m_Columns = i_Viewport.width() / Cell + 1;
  m_Rows = i_Viewport.height() / Cell + 1;
  m_Words = static_cast< std::size_t >( ( m_Columns + WordBits - 1 ) / WordBits );
  m_Taken.assign( m_Words * static_cast< std::size_t >( m_Rows ), 0 );
  Order( io_rCandidates );
  const auto Limit = static_cast< std::size_t >( std::max( i_Limit, 0 ) );
  std::size_t Chosen = 0;
  for ( std::size_t Next = 0; Next < m_Order.size() && Chosen < Limit; ++Next )
  {
    VLabelCandidate& rCandidate = io_rCandidates[static_cast< std::uint32_t >( m_Order[Next] )];
    rCandidate.bChosen = Take( rCandidate );
    Chosen += rCandidate.bChosen ? 1 : 0;
  }
}

bool VLabelChoice::Take( const VLabelCandidate& i_rCandidate )
{
  const auto CellOf = []( int i_Pixel, int i_Count )
  {
    return std::clamp( i_Pixel >= 0 ? i_Pixel / Cell : 0, 0, i_Count - 1 );
  };
  const int Left = CellOf( i_rCandidate.X + i_rCandidate.Left, m_Columns );
  const int Right = CellOf( i_rCandidate.X + i_rCandidate.Right, m_Columns );
  const int Bottom = CellOf( i_rCandidate.Y + i_rCandidate.Bottom, m_Rows );
  const int Top = CellOf( i_rCandidate.Y + i_rCandidate.Top, m_Rows );
  // One that is shown may touch another by a cell before it has to go.
  const int SlackX = i_rCandidate.bHeld && Right - Left >= 2 ? 1 : 0;
  const int SlackY = i_rCandidate.bHeld && Top - Bottom >= 2 ? 1 : 0;
  for ( int Word = Left / WordBits; Word <= Right / WordBits; ++Word )
  {
    const bool bTested = ( Left + SlackX ) / WordBits <= Word && Word <= ( Right - SlackX ) / WordBits;
    const std::uint64_t Mask = bTested ? MaskOf( Word, Left + SlackX, Right - SlackX ) : 0;
    for ( int Row = Bottom + SlackY; Row <= Top - SlackY; ++Row )
    {
      if ( ( WordAt( Row, Word ) & Mask ) != 0 )
      {
        return false;
      }
    }
  }
  for ( int Word = Left / WordBits; Word <= Right / WordBits; ++Word )
  {
    const std::uint64_t Mask = MaskOf( Word, Left, Right );
    for ( int Row = Bottom; Row <= Top; ++Row )
    {
      WordAt( Row, Word ) |= Mask;
    }
  }
  return true;
}

} // namespace MoxelGraphics
