// What a hand does to the tiles, and what is kept of it.

#include <MoxelGraphics/VCameraGrid.h>

#include <QtGui/QKeyEvent>
#include <QtGui/QMouseEvent>
#include <QtGui/QWheelEvent>

#include <algorithm>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
constexpr float SmallestZoom = 0.5f;
constexpr float LargestZoom = 2000.0f;
constexpr float ZoomPerPixel = 0.01f;
const QString ZoomKey = QStringLiteral( "zoom" );
const QString PanXKey = QStringLiteral( "panX" );
const QString PanYKey = QStringLiteral( "panY" );

float Limited( float i_Zoom )
{
  return std::clamp( i_Zoom, SmallestZoom, LargestZoom );
}

QPoint FramePoint( QPointF i_Point, double i_Ratio )
{
  return { static_cast< int >( std::round( i_Point.x() * i_Ratio ) ),
           static_cast< int >( std::round( i_Point.y() * i_Ratio ) ) };
}

QVariantMap ViewMap( float i_Zoom, float i_PanX, float i_PanY )
{
  return { { ZoomKey, double( i_Zoom ) }, { PanXKey, double( i_PanX ) }, { PanYKey, double( i_PanY ) } };
}

bool ReadNumber( const QVariantMap& i_rMap, const QString& i_rKey, float& o_rNumber )
{
  bool bNumber = false;
  o_rNumber = i_rMap.value( i_rKey ).toFloat( &bNumber );
  return bNumber && std::isfinite( o_rNumber );
}
} // namespace

int VCameraGrid::TileAt( QPoint i_Point ) const
{
  return TileUnder( m_Tiles, m_FrameSize, i_Point );
}

void VCameraGrid::EndGesture()
{
  m_PressedURN.clear();
  m_bZooming = m_bPanning = false;
}

bool VCameraGrid::MousePress( const QMouseEvent& i_rEvent, double i_Ratio )
{
  EndGesture();
  m_PressPoint = FramePoint( i_rEvent.position(), i_Ratio );
  const int Index = TileAt( m_PressPoint );
  if ( Index < 0 )
  {
    return false;
  }
  const VCameraTile& rTile = m_Tiles[static_cast< std::size_t >( Index )];
  m_PressedURN = rTile.DeviceURN;
  m_PressedView = { rTile.Zoom, rTile.PanX, rTile.PanY };
  m_bPanning = i_rEvent.button() == Qt::LeftButton;
  m_bZooming = i_rEvent.button() == Qt::RightButton;
  return m_bPanning || m_bZooming;
}

VCameraTile* VCameraGrid::Pressed()
{
  const int Index = m_bPanning || m_bZooming ? TileAt( m_PressPoint ) : -1;
  VCameraTile* const pTile = Index < 0 ? nullptr : &m_Tiles[static_cast< std::size_t >( Index )];
  // The tiles may have moved under the hand.
  return pTile && pTile->DeviceURN == m_PressedURN ? pTile : nullptr;
}

bool VCameraGrid::MouseMove( const QMouseEvent& i_rEvent, double i_Ratio )
{
  VCameraTile* const pTile = Pressed();
  if ( !pTile )
  {
    EndGesture();
    return false;
  }
  const QPoint Way = FramePoint( i_rEvent.position(), i_Ratio ) - m_PressPoint;
  const VView Former{ pTile->Zoom, pTile->PanX, pTile->PanY };
  if ( m_bZooming )
  {
    Zoom( *pTile, Way.y() );
  }
  else
  {
    Pan( *pTile, Way );
  }
  if ( pTile->Zoom != Former.Zoom || pTile->PanX != Former.PanX || pTile->PanY != Former.PanY )
  {
    Touch();
  }
  return true;
}

void VCameraGrid::Zoom( VCameraTile& io_rTile, int i_Way )
{
  const float Factor = 1.0f + static_cast< float >( std::abs( i_Way ) ) * ZoomPerPixel;
  io_rTile.Zoom = Limited( i_Way < 1 ? m_PressedView.Zoom * Factor : m_PressedView.Zoom / Factor );
  // What lies under the hand stays there.
  const QRect& rRect = io_rTile.Rect;
  const float MiddleX = static_cast< float >( rRect.x() ) + static_cast< float >( rRect.width() ) * 0.5f;
  const float MiddleY = static_cast< float >( m_FrameSize.height() - rRect.y() - rRect.height() ) +
                        static_cast< float >( rRect.height() ) * 0.5f;
  const float OffsetX = ( static_cast< float >( m_PressPoint.x() ) - MiddleX ) / static_cast< float >( rRect.width() );
  const float OffsetY = ( static_cast< float >( m_PressPoint.y() ) - MiddleY ) / static_cast< float >( rRect.height() );
  const float Change = 1.0f / m_PressedView.Zoom - 1.0f / io_rTile.Zoom;
  io_rTile.PanX = m_PressedView.PanX + OffsetX / io_rTile.ScaleX * Change;
  io_rTile.PanY = m_PressedView.PanY + OffsetY / io_rTile.ScaleY * Change;
}

void VCameraGrid::Pan( VCameraTile& io_rTile, QPoint i_Way )
{
  const auto Moved = [&]( float i_From, int i_Pixels, int i_Extent, float i_Scale )
  {
    return i_From - static_cast< float >( i_Pixels ) / ( static_cast< float >( i_Extent ) * i_Scale * io_rTile.Zoom );
  };
  io_rTile.PanX = Moved( m_PressedView.PanX, i_Way.x(), io_rTile.Rect.width(), io_rTile.ScaleX );
  io_rTile.PanY = Moved( m_PressedView.PanY, i_Way.y(), io_rTile.Rect.height(), io_rTile.ScaleY );
}

void VCameraGrid::MouseRelease( const QMouseEvent& i_rEvent )
{
  if ( ( m_bPanning && i_rEvent.button() == Qt::LeftButton ) || ( m_bZooming && i_rEvent.button() == Qt::RightButton ) )
  {
    EndGesture();
  }
}

bool VCameraGrid::Wheel( const QWheelEvent& i_rEvent, double i_Ratio )
{
  const int Index = TileAt( FramePoint( i_rEvent.position(), i_Ratio ) );
  if ( Index < 0 )
  {
    return false;
  }
  VCameraTile& rTile = m_Tiles[static_cast< std::size_t >( Index )];
  const float Factor = i_rEvent.angleDelta().y() < 1 ? 0.9f : 1.1f;
  if ( const float Zoom = Limited( rTile.Zoom * Factor ); Zoom != rTile.Zoom )
  {
    rTile.Zoom = Zoom;
    Touch();
  }
  return true;
}

bool VCameraGrid::DoubleClick( const QMouseEvent& i_rEvent, double i_Ratio )
{
  const int Index = TileAt( FramePoint( i_rEvent.position(), i_Ratio ) );
  if ( Index < 0 )
  {
    return false;
  }
  const QString URN = m_Tiles[static_cast< std::size_t >( Index )].DeviceURN;
  // A device and its own video are shown together: asking for it once more would change nothing.
  const bool bAlone = std::all_of( m_Tiles.begin(), m_Tiles.end(),
                                   [&]( const VCameraTile& i_rTile )
                                   {
                                     return IsSameDevice( i_rTile.DeviceURN, URN );
                                   } );
  EndGesture();
  m_TileRequested.Fire( bAlone ? QStringList() : QStringList{ URN } );
  return true;
}

bool VCameraGrid::KeyPress( const QKeyEvent& i_rEvent )
{
  const bool bTaken = i_rEvent.key() == Qt::Key_Home && !m_Tiles.empty();
  if ( bTaken )
  {
    ResetViews();
  }
  return bTaken;
}

void VCameraGrid::ResetViews()
{
  EndGesture();
  m_Restored.clear();
  const VView View = DefaultView();
  for ( VCameraTile& rTile : m_Tiles )
  {
    rTile.Zoom = View.Zoom;
    rTile.PanX = View.PanX;
    rTile.PanY = View.PanY;
  }
  Touch();
}

QVariantMap VCameraGrid::SaveViews() const
{
  QVariantMap Views;
  const VView Default = DefaultView();
  for ( const VCameraTile& rTile : m_Tiles )
  {
    if ( rTile.Zoom != Default.Zoom || rTile.PanX != Default.PanX || rTile.PanY != Default.PanY )
    {
      Views.insert( rTile.DeviceURN, ViewMap( rTile.Zoom, rTile.PanX, rTile.PanY ) );
    }
  }
  for ( auto It = m_Restored.constBegin(); It != m_Restored.constEnd(); ++It )
  {
    Views.insert( It.key(), ViewMap( It->Zoom, It->PanX, It->PanY ) );
  }
  return Views;
}

void VCameraGrid::RestoreViews( const QVariantMap& i_rViews )
{
  EndGesture();
  for ( auto It = i_rViews.constBegin(); It != i_rViews.constEnd(); ++It )
  {
    const QVariantMap Map = It->toMap();
    VView View{};
    const bool bWhole = ReadNumber( Map, ZoomKey, View.Zoom ) && ReadNumber( Map, PanXKey, View.PanX ) &&
                        ReadNumber( Map, PanYKey, View.PanY );
    if ( !bWhole )
    {
      continue;
    }
    View.Zoom = Limited( View.Zoom );
    if ( const int Index = m_Index.value( It.key(), -1 ); Index >= 0 )
    {
      VCameraTile& rTile = m_Tiles[static_cast< std::size_t >( Index )];
      rTile.Zoom = View.Zoom;
      rTile.PanX = View.PanX;
      rTile.PanY = View.PanY;
    }
    else
    {
      m_Restored.insert( It.key(), View );
    }
  }
  Touch();
}

} // namespace MoxelGraphics
