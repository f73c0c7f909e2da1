#include "Residuals.h"

#include <QtGui/QPainter>

#include <algorithm>
#include <array>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
// Lightness and hue both change along the scale, so that it reads without colour vision, too.
constexpr std::array< std::array< float, 3 >, 5 > Scale{ { { 0.32F, 0.62F, 0.86F },
                                                           { 0.50F, 0.82F, 0.78F },
                                                           { 0.93F, 0.90F, 0.55F },
                                                           { 0.96F, 0.62F, 0.32F },
                                                           { 0.86F, 0.25F, 0.22F } } };
constexpr std::array< float, 3 > NoneColour{ 0.55F, 0.55F, 0.58F };

std::uint32_t Packed( const std::array< float, 3 >& i_rColour )
{
  const auto Part = []( float i_Value )
  {
    return static_cast< std::uint32_t >( std::lround( i_Value * 255.0F ) );
  };
  return 0xFF000000u | Part( i_rColour[2] ) << 16 | Part( i_rColour[1] ) << 8 | Part( i_rColour[0] );
}

QColor ToColour( std::uint32_t i_Colour )
{
  return QColor( i_Colour & 0xFF, i_Colour >> 8 & 0xFF, i_Colour >> 16 & 0xFF );
}
} // namespace

std::uint32_t ResidualColour( float i_Residual )
{
  if ( !( i_Residual > 0 ) )
  {
    return Packed( NoneColour );
  }
  const float Place = std::min( i_Residual / LargestResidual, 1.0F ) * static_cast< float >( Scale.size() - 1 );
  const std::size_t Low = std::min( static_cast< std::size_t >( Place ), Scale.size() - 2 );
  const float Share = Place - static_cast< float >( Low );
  std::array< float, 3 > Colour{};
  for ( std::size_t Part = 0; Part < Colour.size(); ++Part )
  {
    Colour[Part] = Scale[Low][Part] + ( Scale[Low + 1][Part] - Scale[Low][Part] ) * Share;
  }
  return Packed( Colour );
}

QImage MakeResidualLegend( float i_PixelRatio )
{
  constexpr int Width = 196, Height = 62, Left = 12, BarTop = 26, BarHeight = 8, BarWidth = 116, NoneLeft = 152;
  QImage Image( QSize( Width, Height ) * static_cast< double >( i_PixelRatio ), QImage::Format_ARGB32_Premultiplied );
  Image.fill( Qt::transparent );
  QPainter Painter( &Image );
  Painter.setRenderHint( QPainter::Antialiasing );
  Painter.scale( static_cast< double >( i_PixelRatio ), static_cast< double >( i_PixelRatio ) );
  Painter.setPen( Qt::NoPen );
  Painter.setBrush( QColor( 16, 16, 16, 170 ) );
  Painter.drawRoundedRect( QRectF( 0, 0, Width, Height ), 4, 4 );
  QLinearGradient Gradient( Left, 0, Left + BarWidth, 0 );
  constexpr int Stops = 16;
  for ( int Stop = 0; Stop <= Stops; ++Stop )
  {
    const float Share = static_cast< float >( Stop ) / static_cast< float >( Stops );
    Gradient.setColorAt( static_cast< double >( Share ),
                         ToColour( ResidualColour( std::max( Share, 1e-4F ) * LargestResidual ) ) );
  }
  Painter.setBrush( Gradient );
  Painter.drawRect( QRectF( Left, BarTop, BarWidth, BarHeight ) );
  Painter.setBrush( ToColour( ResidualColour( 0 ) ) );
  Painter.drawRect( QRectF( NoneLeft, BarTop, 20, BarHeight ) );
  QFont Font = Painter.font();
  Font.setPixelSize( 11 );
  Painter.setFont( Font );
  Painter.setPen( QColor( 220, 220, 220 ) );
  Painter.drawText( QRectF( Left, 6, Width - Left, 16 ), Qt::AlignVCenter, QStringLiteral( "Residual, mm" ) );
  const auto Figure = [&]( double i_Centre, const QString& i_rText )
  {
    Painter.drawText( QRectF( i_Centre - 30, 38, 60, 16 ), Qt::AlignCenter, i_rText );
  };
  Figure( Left + 3, QStringLiteral( "0" ) );
  Figure( Left + 0.5 * BarWidth, QStringLiteral( "1" ) );
  Figure( Left + BarWidth - 4, QStringLiteral( "2+" ) );
  Figure( NoneLeft + 10, QStringLiteral( "none" ) );
  return Image;
}

} // namespace MoxelGraphics
