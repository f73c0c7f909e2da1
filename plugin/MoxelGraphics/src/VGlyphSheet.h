#pragma once

#include "VTexture.h"

#include <QtCore/QHash>
#include <QtCore/QPoint>
#include <QtCore/QString>
#include <QtGui/QFont>

#include <cstdint>
#include <string>
#include <vector>

class QGlyphRun;
class QImage;
class QRawFont;

namespace CoreGraphics
{
class VRenderContext;
}

namespace MoxelGraphics
{

/// A piece of a text that was laid out, the whole or a glyph: where it stands to the start of the text's baseline, and
/// where it lies in the sheet; pixels, y down.
struct VPlacedGlyph
{
  std::int16_t X = 0, Y = 0;
  std::int16_t Width = 0, Height = 0;
  std::int16_t SheetX = 0, SheetY = 0;
};

/// A text that was laid out.
struct VTextLayout
{
  std::uint32_t First = 0, Count = 0; ///< of the sheet's pieces
  std::int32_t Width = 0;             ///< pixels
};

/// The glyphs of texts of one height in device pixels: each drawn once, its own shape (red) and that over the soft dark
/// edge around it (green). While there is room, a text lies in the sheet as a whole and is one piece; of a text that
/// came too late for that each letter is one. Thread: render thread.
class VGlyphSheet
{
public:
  explicit VGlyphSheet( int i_Pixels );

  int Pixels() const { return m_Pixels; }
  int Ascent() const { return m_Ascent; }
  int Descent() const { return m_Descent; }

  /// The same text is laid out once.
  const VTextLayout& Layout( const std::string& i_rText, bool i_bBold );
  const VPlacedGlyph* Glyphs( const VTextLayout& i_rLayout ) const { return m_Placed.data() + i_rLayout.First; }
  std::uint64_t LaidOut() const { return m_LaidOut; }

  /// False when there is nothing to be read.
  bool Bind( CoreGraphics::VRenderContext& io_rContext, int i_Unit );

private:
  struct VCell
  {
    std::int16_t X = 0, Y = 0, Width = 0, Height = 0;
    std::int16_t Left = 0, Top = 0; ///< from the glyph's origin
  };

  QString Prepare( const std::string& i_rText, const QFont& i_rFont ) const;
  void Place( const QGlyphRun& i_rRun, double i_Baseline );
  void Join( VTextLayout& io_rLayout );
  const VCell& CellOf( const QRawFont& i_rFont, quint64 i_FontKey, quint32 i_Glyph );
  QImage Draw( const QRawFont& i_rFont, quint32 i_Glyph, QPoint& o_rTopLeft ) const;
  VCell Keep( const QImage& i_rImage, QPoint i_TopLeft );
  bool Reserve( int i_Width, int i_Height, VCell& o_rCell );
  void Copy( const QImage& i_rImage, const VCell& i_rCell );

  const int m_Pixels;
  const int m_Soft; ///< width of the soft edge
  QFont m_Plain, m_Bold;
  int m_Ascent = 0, m_Descent = 0;
  QHash< QString, quint64 > m_Fonts;
  QHash< quint64, VCell > m_Cells; ///< by font and glyph
  QHash< QString, VTextLayout > m_Layouts[2];
  std::vector< VPlacedGlyph > m_Placed;
  std::uint64_t m_LaidOut = 0;

  // The sheet is filled in rows of cells.
  std::vector< std::uint8_t > m_Pixmap; ///< two bytes a pixel
  int m_Height = 0;
  int m_RowX = 0, m_RowY = 0, m_RowHeight = 0;
  VTexture m_Texture;
  bool m_bWritten = false;
};

} // namespace MoxelGraphics
