#include "VGlyphSheet.h"

#include "Log.h"

#include <CoreGraphics/VRenderContext.h>

#include <QtGui/QFontMetricsF>
#include <QtGui/QGlyphRun>
#include <QtGui/QGuiApplication>
#include <QtGui/QImage>
#include <QtGui/QPainter>
#include <QtGui/QRawFont>
#include <QtGui/QTextLayout>

#include <algorithm>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
constexpr int SheetWidth = 1024;
constexpr int MostRows = 4096; ///< any device takes a texture of so many
constexpr int HeightStep = 64;
constexpr int JoinedRows = MostRows / 2; ///< beyond it only glyphs are added
constexpr double WidestText = 22;        ///< in heights of the text
constexpr qsizetype LongestText = 256;
constexpr float Darkness = 0.8F; ///< of the edge

QFont MakeFont( int i_Pixels, bool i_bBold )
{
  QFont Font = QGuiApplication::font();
  Font.setPixelSize( i_Pixels );
  Font.setBold( i_bBold );
  // Whole pixels: a label stands on them, and its glyphs are drawn once for all places.
  Font.setHintingPreference( QFont::PreferFullHinting );
  Font.setStyleStrategy( QFont::StyleStrategy( QFont::PreferAntialias | QFont::NoSubpixelAntialias ) );
  return Font;
}

std::int16_t Short( int i_Value )
{
  return static_cast< std::int16_t >( i_Value );
}
} // namespace

VGlyphSheet::VGlyphSheet( int i_Pixels )
  : m_Pixels( i_Pixels )
  , m_Soft( std::max( 1, ( i_Pixels + 1 ) / 8 ) )
  , m_Plain( MakeFont( i_Pixels, false ) )
  , m_Bold( MakeFont( i_Pixels, true ) )
{
  const QFontMetricsF Metrics( m_Bold );
  m_Ascent = static_cast< int >( std::lround( Metrics.ascent() ) );
  m_Descent = static_cast< int >( std::lround( Metrics.descent() ) );
}

QString VGlyphSheet::Prepare( const std::string& i_rText, const QFont& i_rFont ) const
{
  // One line, and not measured at a length that nobody would read.
  QString Text = QString::fromUtf8( i_rText.data(), static_cast< qsizetype >( i_rText.size() ) );
  if ( Text.size() > LongestText )
  {
    Text.truncate( LongestText );
  }
  Text = Text.simplified();
  for ( QChar& rLetter : Text )
  {
    if ( rLetter.category() == QChar::Other_Control )
    {
      rLetter = u' ';
    }
  }
  return QFontMetricsF( i_rFont ).elidedText( Text, Qt::ElideRight, WidestText * m_Pixels );
}

const VTextLayout& VGlyphSheet::Layout( const std::string& i_rText, bool i_bBold )
{
  const QFont& rFont = i_bBold ? m_Bold : m_Plain;
  const QString Text = Prepare( i_rText, rFont );
  const auto Found = m_Layouts[i_bBold].constFind( Text );
  if ( Found != m_Layouts[i_bBold].constEnd() )
  {
    return *Found;
  }
  VTextLayout Result;
  Result.First = static_cast< std::uint32_t >( m_Placed.size() );
  if ( !Text.isEmpty() )
  {
    ++m_LaidOut;
    QTextLayout Lines( Text, rFont );
    Lines.beginLayout();
    QTextLine Line = Lines.createLine();
    Line.setNumColumns( static_cast< int >( Text.size() ) );
    Lines.endLayout();
    for ( const QGlyphRun& rRun : Line.glyphRuns() )
    {
      Place( rRun, Line.ascent() );
    }
    Result.Width = static_cast< std::int32_t >( std::ceil( Line.naturalTextWidth() ) );
  }
  Result.Count = static_cast< std::uint32_t >( m_Placed.size() ) - Result.First;
  Join( Result );
  return *m_Layouts[i_bBold].insert( Text, Result );
}

void VGlyphSheet::Place( const QGlyphRun& i_rRun, double i_Baseline )
{
  const QRawFont Font = i_rRun.rawFont();
  const QString Name = Font.familyName() + u'/' + Font.styleName() + u'/' + QString::number( Font.weight() ) + u'/' +
                       QString::number( Font.pixelSize() );
  const quint64 Key = *m_Fonts.insert( Name, m_Fonts.value( Name, static_cast< quint64 >( m_Fonts.size() + 1 ) ) );
  const QList< quint32 > Indexes = i_rRun.glyphIndexes();
  const QList< QPointF > Positions = i_rRun.positions();
  for ( qsizetype Index = 0; Index < Indexes.size() && Index < Positions.size(); ++Index )
  {
    const VCell& rCell = CellOf( Font, Key, Indexes[Index] );
    if ( rCell.Width > 0 )
    {
      const int X = static_cast< int >( std::lround( Positions[Index].x() ) );
      const int Y = static_cast< int >( std::lround( Positions[Index].y() - i_Baseline ) );
      m_Placed.push_back(
          { Short( X + rCell.Left ), Short( Y + rCell.Top ), rCell.Width, rCell.Height, rCell.X, rCell.Y } );
    }
  }
}

/// Puts the glyphs of a text together in a cell of its own. Where they meet the stronger counts, so that the edge of
/// one does not darken another.
void VGlyphSheet::Join( VTextLayout& io_rLayout )
{
  const std::vector< VPlacedGlyph > Glyphs( m_Placed.begin() + io_rLayout.First, m_Placed.end() );
  int Left = INT16_MAX, Top = INT16_MAX, Right = INT16_MIN, Bottom = INT16_MIN;
  for ( const VPlacedGlyph& rGlyph : Glyphs )
  {
    Left = std::min< int >( Left, rGlyph.X );
    Top = std::min< int >( Top, rGlyph.Y );
    Right = std::max( Right, rGlyph.X + rGlyph.Width );
    Bottom = std::max( Bottom, rGlyph.Y + rGlyph.Height );
  }
  VCell Cell;
  if ( Glyphs.size() < 2 || Right - Left > SheetWidth || m_RowY + m_RowHeight + Bottom - Top > JoinedRows ||
       !Reserve( Right - Left, Bottom - Top, Cell ) )
  {
    return;
  }
  const auto At = [this]( int i_X, int i_Y )
  {
    return &m_Pixmap[( static_cast< std::size_t >( i_Y ) * SheetWidth + static_cast< std::size_t >( i_X ) ) * 2];
  };
  for ( const VPlacedGlyph& rGlyph : Glyphs )
  {
    for ( int Row = 0; Row < rGlyph.Height; ++Row )
    {
      const std::uint8_t* const pFrom = At( rGlyph.SheetX, rGlyph.SheetY + Row );
      std::uint8_t* const pTo = At( Cell.X + rGlyph.X - Left, Cell.Y + rGlyph.Y - Top + Row );
      std::transform( pFrom, pFrom + std::ptrdiff_t{ 2 } * rGlyph.Width, pTo, pTo,
                      []( std::uint8_t i_A, std::uint8_t i_B )
                      {
                        return std::max( i_A, i_B );
                      } );
    }
  }
  m_Placed.resize( io_rLayout.First );
  m_Placed.push_back( { Short( Left ), Short( Top ), Cell.Width, Cell.Height, Cell.X, Cell.Y } );
  io_rLayout.Count = 1;
  m_bWritten = false;
}

const VGlyphSheet::VCell& VGlyphSheet::CellOf( const QRawFont& i_rFont, quint64 i_FontKey, quint32 i_Glyph )
{
  const quint64 Key = i_FontKey << 32 | i_Glyph;
  const auto Found = m_Cells.constFind( Key );
  if ( Found != m_Cells.constEnd() )
  {
    return *Found;
  }
  QPoint TopLeft;
  const QImage Image = Draw( i_rFont, i_Glyph, TopLeft );
  return *m_Cells.insert( Key, Keep( Image, TopLeft ) );
}

QImage VGlyphSheet::Draw( const QRawFont& i_rFont, quint32 i_Glyph, QPoint& o_rTopLeft ) const
{
  const QRectF Bounds = i_rFont.boundingRect( i_Glyph );
  if ( !( Bounds.width() > 0 ) || !( Bounds.height() > 0 ) || Bounds.width() > 8 * m_Pixels ||
       Bounds.height() > 8 * m_Pixels )
  {
    return {}; // a space, or what no font means
  }
  const QRect Room = Bounds.toAlignedRect().adjusted( -2, -2, 2, 2 ); // for what antialiasing adds
  QImage Image( Room.size(), QImage::Format_ARGB32_Premultiplied );
  Image.fill( Qt::transparent );
  QPainter Painter( &Image );
  Painter.setRenderHint( QPainter::TextAntialiasing );
  Painter.setPen( Qt::white );
  QGlyphRun Run;
  Run.setRawFont( i_rFont );
  Run.setGlyphIndexes( { i_Glyph } );
  Run.setPositions( { QPointF( 0, 0 ) } );
  Painter.drawGlyphRun( -Room.topLeft(), Run );
  Painter.end();
  o_rTopLeft = Room.topLeft();
  return Image;
}

/// Cuts off what is empty: every pixel of a cell is drawn for each letter that shows it.
VGlyphSheet::VCell VGlyphSheet::Keep( const QImage& i_rImage, QPoint i_TopLeft )
{
  QRect Ink;
  for ( int Y = 0; Y < i_rImage.height(); ++Y )
  {
    for ( int X = 0; X < i_rImage.width(); ++X )
    {
      Ink |= qAlpha( i_rImage.pixel( X, Y ) ) != 0 ? QRect( X, Y, 1, 1 ) : QRect();
    }
  }
  VCell Cell;
  const QRect Whole = Ink.adjusted( -m_Soft, -m_Soft, m_Soft, m_Soft );
  if ( !Ink.isEmpty() && Reserve( Whole.width(), Whole.height(), Cell ) )
  {
    Cell.Left = Short( i_TopLeft.x() + Whole.left() );
    Cell.Top = Short( i_TopLeft.y() + Whole.top() );
    Copy( i_rImage.copy( Whole ), Cell ); // beyond its rims an image is transparent
  }
  return Cell;
}

bool VGlyphSheet::Reserve( int i_Width, int i_Height, VCell& o_rCell )
{
  if ( m_RowX + i_Width > SheetWidth )
  {
    m_RowY += m_RowHeight;
    m_RowX = m_RowHeight = 0;
  }
  const int Bottom = m_RowY + std::max( m_RowHeight, i_Height );
  if ( i_Width > SheetWidth || Bottom > MostRows )
  {
    if ( m_RowY < MostRows )
    {
      m_RowY = MostRows; // said once
      ZEK::Log( LogCategory(), ZEK::ELogWarning, "The names of this scene have more letters than can be shown" );
    }
    return false;
  }
  if ( Bottom > m_Height )
  {
    m_Height = ( Bottom + HeightStep - 1 ) / HeightStep * HeightStep;
    m_Pixmap.resize( static_cast< std::size_t >( m_Height ) * SheetWidth * 2 );
  }
  o_rCell.X = Short( m_RowX );
  o_rCell.Y = Short( m_RowY );
  o_rCell.Width = Short( i_Width );
  o_rCell.Height = Short( i_Height );
  m_RowX += i_Width;
  m_RowHeight = std::max( m_RowHeight, i_Height );
  return true;
}

void VGlyphSheet::Copy( const QImage& i_rImage, const VCell& i_rCell )
{
  const auto Alpha = [&]( int i_X, int i_Y )
  {
    const bool bInside = i_X >= 0 && i_Y >= 0 && i_X < i_rImage.width() && i_Y < i_rImage.height();
    return bInside ? qAlpha( reinterpret_cast< const QRgb* >( i_rImage.constScanLine( i_Y ) )[i_X] ) : 0;
  };
  for ( int Y = 0; Y < i_rImage.height(); ++Y )
  {
    std::uint8_t* pOut = &m_Pixmap[( static_cast< std::size_t >( i_rCell.Y + Y ) * SheetWidth +
                                     static_cast< std::size_t >( i_rCell.X ) ) *
                                   2];
    for ( int X = 0; X < i_rImage.width(); ++X )
    {
      // The edge: the strongest of what lies around, weaker with its distance.
      float Edge = 0;
      for ( int Dy = -m_Soft; Dy <= m_Soft; ++Dy )
      {
        for ( int Dx = -m_Soft; Dx <= m_Soft; ++Dx )
        {
          const float Far = std::sqrt( static_cast< float >( Dx * Dx + Dy * Dy ) ) / static_cast< float >( m_Soft + 1 );
          Edge = std::max( Edge, static_cast< float >( Alpha( X + Dx, Y + Dy ) ) * ( 1 - Far * Far ) );
        }
      }
      const auto Ink = static_cast< float >( Alpha( X, Y ) );
      *pOut++ = static_cast< std::uint8_t >( Ink );
      *pOut++ = static_cast< std::uint8_t >( Ink + Edge * Darkness * ( 1 - Ink / 255 ) );
    }
  }
  m_bWritten = false;
}

bool VGlyphSheet::Bind( CoreGraphics::VRenderContext& io_rContext, int i_Unit )
{
  if ( m_Height == 0 )
  {
    return false;
  }
  if ( !m_bWritten || !m_Texture.IsThere( io_rContext ) )
  {
    m_bWritten = m_Texture.Write( io_rContext, ETexel::RG8, SheetWidth, m_Height, m_Pixmap.data(),
                                  std::size_t{ SheetWidth } * 2 );
  }
  if ( m_bWritten )
  {
    m_Texture.Bind( io_rContext, i_Unit );
  }
  return m_bWritten;
}

} // namespace MoxelGraphics
