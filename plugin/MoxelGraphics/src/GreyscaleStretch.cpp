#include "GreyscaleStretch.h"

#include <algorithm>
#include <cmath>

namespace MoxelGraphics
{

void VGreyscaleStretch::Mark( VAxis& io_rAxis, float i_First, float i_Last ) const
{
  if ( io_rAxis.Seen.empty() || !std::isfinite( i_First ) || !std::isfinite( i_Last ) )
  {
    return;
  }
  const auto End = static_cast< float >( io_rAxis.Seen.size() - 1 );
  const auto First = static_cast< std::ptrdiff_t >( std::clamp( std::floor( i_First + 0.5f ), 0.0f, End ) );
  const auto Last = static_cast< std::ptrdiff_t >( std::clamp( std::floor( i_Last + 0.5f ), 0.0f, End ) );
  std::fill( io_rAxis.Seen.begin() + std::min( First, Last ), io_rAxis.Seen.begin() + std::max( First, Last ) + 1,
             m_Frame );
}

void VGreyscaleStretch::Add( const ZEK::VGreyscaleData& i_rData, std::uint32_t i_Width, std::uint32_t i_Height )
{
  // A sensor is never this large; a width that somebody sent wrong is no size for a table.
  constexpr std::uint32_t Most = 1u << 16;
  m_Columns.Seen.resize( std::min( i_Width, Most ) );
  m_Rows.Seen.resize( std::min( i_Height, Most ) );
  ++m_Frame;
  const auto& [X, Y, ScaleX, ScaleY] = i_rData.OffsetScale;
  for ( const ZEK::VGreyscaleRecord& rRecord : i_rData.Records )
  {
    Mark( m_Columns, X + ScaleX * rRecord.Left, X + ScaleX * rRecord.Right );
    Mark( m_Rows, Y + ScaleY * rRecord.Top, Y + ScaleY * rRecord.Bottom );
  }
}

void VGreyscaleStretch::Place( VAxis& io_rAxis, std::uint64_t i_History, double i_Factor ) const
{
  const auto Weight = [&]( std::uint64_t i_Seen )
  {
    return i_Seen != 0 && m_Frame - i_Seen < i_History ? 1.0 : i_Factor;
  };
  const bool bAny = std::any_of( io_rAxis.Seen.begin(), io_rAxis.Seen.end(),
                                 [&]( std::uint64_t i_Seen )
                                 {
                                   return i_Seen != 0 && m_Frame - i_Seen < i_History;
                                 } );
  double Total = 0;
  for ( const std::uint64_t Seen : io_rAxis.Seen )
  {
    Total += bAny ? Weight( Seen ) : 1.0;
  }
  io_rAxis.Stretch = bAny ? static_cast< float >( static_cast< double >( io_rAxis.Seen.size() ) / Total ) : 1.0f;
  io_rAxis.Places.resize( io_rAxis.Seen.size() );
  double At = 0;
  for ( std::size_t Index = 0; Index < io_rAxis.Seen.size(); ++Index )
  {
    const double Width = bAny ? Weight( io_rAxis.Seen[Index] ) : 1.0;
    io_rAxis.Places[Index] = static_cast< float >( ( At + 0.5 * Width ) / Total );
    At += Width;
  }
}

void VGreyscaleStretch::Place( int i_History, double i_Factor )
{
  const auto History = static_cast< std::uint64_t >( std::max( i_History, 1 ) );
  const double Factor = std::isfinite( i_Factor ) ? std::clamp( i_Factor, 0.0, 1.0 ) : 0.0;
  Place( m_Columns, History, Factor );
  Place( m_Rows, History, Factor );
}

} // namespace MoxelGraphics
