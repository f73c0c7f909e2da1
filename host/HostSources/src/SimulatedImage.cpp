#include "SimulatedImage.h"

#include <algorithm>
#include <cmath>

using namespace CoreMoxelTypes;

namespace HostSources::Simulation
{
namespace
{

constexpr double Rim = 0.5; // px: how far light falls beyond the radius

int Ceiling( double i_Value )
{
  const int Whole = static_cast< int >( i_Value );
  return Whole + ( Whole < i_Value ? 1 : 0 );
}
int Floor( double i_Value )
{
  const int Whole = static_cast< int >( i_Value );
  return Whole - ( Whole > i_Value ? 1 : 0 );
}

/// Brightens the pixels of a row, from a column on.
void Shine( const VDisc& i_rDisc, int i_Row, int i_First, std::span< u8 > io_Pixels )
{
  constexpr float Range = 255 - VDiscPainter::Threshold;
  const double Outer = i_rDisc.Radius + Rim, Y = i_Row - i_rDisc.y;
  const auto Fall = static_cast< float >( Range / ( 2 * i_rDisc.Radius ) );
  const auto Top = static_cast< float >( Outer * Outer - Y * Y ) * Fall;
  float X = static_cast< float >( i_First - i_rDisc.x );
  for ( u8& rPixel : io_Pixels )
  {
    const float Light = std::clamp( Top - X * X * Fall, 0.0F, Range );
    const auto Grey = static_cast< u8 >( static_cast< float >( VDiscPainter::Threshold ) + 0.5F + Light );
    rPixel = std::max( rPixel, Grey );
    X += 1;
  }
}

} // namespace

/// As for discs that touch, but for nearly every centroid of nearly every frame.
void VDiscPainter::PaintOne( const VDisc& i_rDisc, std::uint32_t i_Width, std::uint32_t i_Height,
                             VGreyscaleBlobSet& io_rBlobs, VEdgePairSet* io_pEdges )
{
  const double Outer = i_rDisc.Radius + Rim;
  const int FirstRow = std::max( Ceiling( i_rDisc.y - Outer ), 0 );
  const int LastRow = std::min( Floor( i_rDisc.y + Outer ), static_cast< int >( i_Height ) - 1 );
  const auto Side = static_cast< std::size_t >( 2 * Outer ) + 1;
  std::size_t Pixel = io_rBlobs.Pixels.size();
  io_rBlobs.Pixels.resize( Pixel + Side * Side );
  for ( int Row = FirstRow; Row <= LastRow; ++Row )
  {
    const double Down = Row - i_rDisc.y, Half = std::sqrt( std::max( Outer * Outer - Down * Down, 0.0 ) );
    const int First = std::max( Ceiling( i_rDisc.x - Half ), 0 );
    const int Last = std::min( Floor( i_rDisc.x + Half ), static_cast< int >( i_Width ) - 1 );
    if ( First > Last )
    {
      continue;
    }
    const auto Length = static_cast< std::size_t >( Last - First + 1 );
    const std::span< u8 > Pixels( io_rBlobs.Pixels.data() + Pixel, Length );
    Shine( i_rDisc, Row, First, Pixels );
    io_rBlobs.Lines.push_back( { static_cast< u16 >( First ), static_cast< u16 >( Row ), static_cast< u16 >( Length ),
                                 static_cast< u32 >( Pixel ) } );
    Pixel += Length;
    if ( io_pEdges )
    {
      const double Edge = std::max( Half - Rim, 0.0 );
      io_pEdges->Pairs.push_back( { static_cast< u16 >( Row ), static_cast< f32 >( i_rDisc.x - Edge ),
                                    static_cast< f32 >( i_rDisc.x + Edge ), Pixels.front(), Pixels.back() } );
    }
  }
  io_rBlobs.Pixels.resize( Pixel );
}

void VDiscPainter::FindSpans( std::span< const VDisc > i_Discs, int i_Row, int i_Width )
{
  m_Spans.clear();
  for ( const VDisc& rDisc : i_Discs )
  {
    const double Down = i_Row - rDisc.y, Outer = rDisc.Radius + Rim;
    const double HalfSq = Outer * Outer - Down * Down;
    if ( HalfSq <= 0 )
    {
      continue;
    }
    const double Half = std::sqrt( HalfSq ), Edge = std::max( Half - Rim, 0.0 );
    const int First = std::max( Ceiling( rDisc.x - Half ), 0 );
    const int Last = std::min( Floor( rDisc.x + Half ), i_Width - 1 );
    if ( First <= Last )
    {
      m_Spans.push_back(
          { First, Last, static_cast< float >( rDisc.x - Edge ), static_cast< float >( rDisc.x + Edge ) } );
    }
  }
  if ( m_Spans.size() < 2 )
  {
    return;
  }
  std::sort( m_Spans.begin(), m_Spans.end(),
             []( const VSpan& i_rA, const VSpan& i_rB )
             {
               return i_rA.First < i_rB.First;
             } );
  std::size_t Kept = 0;
  for ( std::size_t Span = 1; Span < m_Spans.size(); ++Span )
  {
    const VSpan Next = m_Spans[Span];
    VSpan& rLast = m_Spans[Kept];
    if ( Next.First <= rLast.Last + 1 )
    {
      rLast.Last = std::max( rLast.Last, Next.Last );
      rLast.Left = std::min( rLast.Left, Next.Left );
      rLast.Right = std::max( rLast.Right, Next.Right );
    }
    else
    {
      m_Spans[++Kept] = Next;
    }
  }
  m_Spans.resize( Kept + 1 );
}

void VDiscPainter::Paint( std::span< const VDisc > i_Discs, std::uint32_t i_Width, std::uint32_t i_Height,
                          std::int32_t i_Centroid, VGreyscaleBlobSet& io_rBlobs, VEdgePairSet* io_pEdges )
{
  const std::size_t FirstLine = io_rBlobs.Lines.size();
  if ( i_Discs.size() == 1 )
  {
    PaintOne( i_Discs[0], i_Width, i_Height, io_rBlobs, io_pEdges );
  }
  else
  {
    PaintAll( i_Discs, i_Width, i_Height, io_rBlobs, io_pEdges );
  }
  io_rBlobs.Blobs.push_back(
      { static_cast< u32 >( FirstLine ), static_cast< u32 >( io_rBlobs.Lines.size() - FirstLine ), i_Centroid } );
}

void VDiscPainter::PaintAll( std::span< const VDisc > i_Discs, std::uint32_t i_Width, std::uint32_t i_Height,
                             VGreyscaleBlobSet& io_rBlobs, VEdgePairSet* io_pEdges )
{
  double Top = i_Height, Bottom = -1;
  for ( const VDisc& rDisc : i_Discs )
  {
    Top = std::min( Top, rDisc.y - rDisc.Radius - Rim );
    Bottom = std::max( Bottom, rDisc.y + rDisc.Radius + Rim );
  }
  const int FirstRow = std::max( Ceiling( Top ), 0 );
  const int LastRow = std::min( Floor( Bottom ), static_cast< int >( i_Height ) - 1 );
  for ( int Row = FirstRow; Row <= LastRow; ++Row )
  {
    FindSpans( i_Discs, Row, static_cast< int >( i_Width ) );
    for ( const VSpan& rSpan : m_Spans )
    {
      const auto Length = static_cast< std::size_t >( rSpan.Last - rSpan.First + 1 );
      const std::size_t First = io_rBlobs.Pixels.size();
      io_rBlobs.Pixels.resize( First + Length );
      const std::span< u8 > Pixels( io_rBlobs.Pixels.data() + First, Length );
      for ( const VDisc& rDisc : i_Discs )
      {
        Shine( rDisc, Row, rSpan.First, Pixels );
      }
      io_rBlobs.Lines.push_back( { static_cast< u16 >( rSpan.First ), static_cast< u16 >( Row ),
                                   static_cast< u16 >( Length ), static_cast< u32 >( First ) } );
      if ( io_pEdges )
      {
        io_pEdges->Pairs.push_back(
            { static_cast< u16 >( Row ), rSpan.Left, rSpan.Right, Pixels.front(), Pixels.back() } );
      }
    }
  }
}

} // namespace HostSources::Simulation
