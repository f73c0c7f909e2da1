#include "Icons.h"

#include <QtGui/QIconEngine>
#include <QtGui/QPainter>
#include <QtGui/QPainterPath>

namespace HostWindow
{
namespace
{
/// In a square of 16 by 16.
QPainterPath Triangle( double i_Tip, double i_Base )
{
  QPainterPath Path;
  Path.moveTo( i_Base, 3 );
  Path.lineTo( i_Tip, 8 );
  Path.lineTo( i_Base, 13 );
  Path.closeSubpath();
  return Path;
}

QPainterPath Bar( double i_Left, double i_Width )
{
  QPainterPath Path;
  Path.addRect( QRectF( i_Left, 3, i_Width, 10 ) );
  return Path;
}

QPainterPath Circle( double i_Radius )
{
  QPainterPath Path;
  Path.addEllipse( QPointF( 8, 8 ), i_Radius, i_Radius );
  return Path;
}

QPainterPath LoopPath()
{
  QPainterPath Ring = Circle( 5.5 ).subtracted( Circle( 4 ) );
  QPainterPath Gap;
  Gap.addRect( QRectF( 8, 0, 8, 6 ) );
  QPainterPath Arrow;
  Arrow.moveTo( 8, 0.5 );
  Arrow.lineTo( 12, 3.3 );
  Arrow.lineTo( 8, 6 );
  Arrow.closeSubpath();
  return Ring.subtracted( Gap ).united( Arrow );
}

QPainterPath PathOf( EIcon i_Icon )
{
  switch ( i_Icon )
  {
  case EIcon::Play:
    return Triangle( 13, 4 );
  case EIcon::Pause:
    return Bar( 4, 3 ).united( Bar( 9, 3 ) );
  case EIcon::StepBack:
    return Triangle( 5, 11 ).united( Bar( 11.5, 1.5 ) );
  case EIcon::StepForward:
    return Triangle( 11, 5 ).united( Bar( 3, 1.5 ) );
  case EIcon::First:
    return Triangle( 5, 13 ).united( Bar( 3, 1.8 ) );
  case EIcon::Last:
    return Triangle( 11, 3 ).united( Bar( 11.2, 1.8 ) );
  case EIcon::Loop:
    return LoopPath();
  case EIcon::Live:
    return Circle( 4.5 );
  case EIcon::Reset:
    return QTransform( -1, 0, 0, 1, 16, 0 ).map( LoopPath() );
  }
  return {};
}

class VPathEngine final : public QIconEngine
{
public:
  VPathEngine( QPainterPath i_Path, QColor i_Colour )
    : m_Path( std::move( i_Path ) )
    , m_Colour( std::move( i_Colour ) )
  {
  }
  void paint( QPainter* io_pPainter, const QRect& i_rRect, QIcon::Mode i_Mode, QIcon::State ) override
  {
    QColor Colour = m_Colour;
    Colour.setAlphaF( i_Mode == QIcon::Disabled ? 0.35f : 1.0f );
    io_pPainter->save();
    io_pPainter->setRenderHint( QPainter::Antialiasing );
    io_pPainter->translate( i_rRect.topLeft() );
    io_pPainter->scale( i_rRect.width() / 16.0, i_rRect.height() / 16.0 );
    io_pPainter->fillPath( m_Path, Colour );
    io_pPainter->restore();
  }
  QPixmap pixmap( const QSize& i_rSize, QIcon::Mode i_Mode, QIcon::State i_State ) override
  {
    QPixmap Pixmap( i_rSize );
    Pixmap.fill( Qt::transparent );
    QPainter Painter( &Pixmap );
    paint( &Painter, QRect( QPoint(), i_rSize ), i_Mode, i_State );
    return Pixmap;
  }
  QIconEngine* clone() const override { return new VPathEngine( *this ); }

private:
  QPainterPath m_Path;
  QColor m_Colour;
};
} // namespace

QIcon MakeIcon( EIcon i_Icon, const QColor& i_rColour )
{
  return QIcon( new VPathEngine( PathOf( i_Icon ), i_rColour ) );
}

} // namespace HostWindow
