#include "SimulatedImage.h"

#include <algorithm>
#include <cmath>

using namespace CoreMoxelTypes;

namespace HostSources::Simulation
{
namespace
{

constexpr double Rim = 0.5; // px: how far light falls beyond the radius

u8 Grey( std::span< const VDisc > i_Discs, int i_Column, int i_Row )
{
  double Most = 0;
  for ( const VDisc& rDisc : i_Discs )
  {
    const double X = i_Column - rDisc.x, Y = i_Row - rDisc.y, Outer = rDisc.Radius + Rim;
    Most = std::max( Most, ( Outer * Outer - X * X - Y * Y ) / ( 2 * rDisc.Radius ) );
  }
  return static_cast< u8 >( VDiscPainter::Threshold + ( 255 - VDiscPainter::Threshold ) * std::min( Most, 1.0 ) + 0.5 );
}

} // namespace

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
    const int First = std::max( static_cast< int >( std::ceil( rDisc.x - Half ) ), 0 );
    const int Last = std::min( static_cast< int >( std::floor( rDisc.x + Half ) ), i_Width - 1 );
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
                          std::int32_t i_Centroid, VGreyscaleBlobSet* io_pBlobs, VEdgePairSet* io_pEdges )
{
  double Top = i_Height, Bottom = -1;
  for ( const VDisc& rDisc : i_Discs )
  {
    Top = std::min( Top, rDisc.y - rDisc.Radius - Rim );
    Bottom = std::max( Bottom, rDisc.y + rDisc.Radius + Rim );
  }
  const int FirstRow = std::max( static_cast< int >( std::ceil( Top ) ), 0 );
  const int LastRow = std::min( static_cast< int >( std::floor( Bottom ) ), static_cast< int >( i_Height ) - 1 );
  const std::size_t FirstLine = io_pBlobs ? io_pBlobs->Lines.size() : 0;
  for ( int Row = FirstRow; Row <= LastRow; ++Row )
  {
    FindSpans( i_Discs, Row, static_cast< int >( i_Width ) );
    for ( const VSpan& rSpan : m_Spans )
    {
      if ( io_pEdges )
      {
        io_pEdges->Pairs.push_back( { static_cast< u16 >( Row ), rSpan.Left, rSpan.Right,
                                      Grey( i_Discs, rSpan.First, Row ), Grey( i_Discs, rSpan.Last, Row ) } );
      }
      if ( !io_pBlobs )
      {
        continue;
      }
      io_pBlobs->Lines.push_back( { static_cast< u16 >( rSpan.First ), static_cast< u16 >( Row ),
                                    static_cast< u16 >( rSpan.Last - rSpan.First + 1 ),
                                    static_cast< u32 >( io_pBlobs->Pixels.size() ) } );
      for ( int Column = rSpan.First; Column <= rSpan.Last; ++Column )
      {
        io_pBlobs->Pixels.push_back( Grey( i_Discs, Column, Row ) );
      }
    }
  }
  if ( io_pBlobs )
  {
    io_pBlobs->Blobs.push_back(
        { static_cast< u32 >( FirstLine ), static_cast< u32 >( io_pBlobs->Lines.size() - FirstLine ), i_Centroid } );
  }
}

} // namespace HostSources::Simulation
