#pragma once

#include <MoxelGraphics/VCameraGrid.h>

#include <QtGui/QKeyEvent>
#include <QtGui/QMouseEvent>
#include <QtGui/QWheelEvent>

#include <gtest/gtest.h>

namespace MoxelGraphics
{

using VRoles = std::vector< QList< int > >;

inline VCameraDefinition Camera( const std::string& i_rURN, int i_Width = 640, int i_Height = 480 )
{
  VCameraDefinition Definition;
  Definition.DeviceURN = i_rURN;
  Definition.DisplayType = "type of " + i_rURN;
  Definition.UserId = 7;
  Definition.ImageWidth = i_Width;
  Definition.ImageHeight = i_Height;
  return Definition;
}

inline std::vector< VCameraDefinition > Cameras( const std::vector< std::string >& i_rURNs )
{
  std::vector< VCameraDefinition > List;
  for ( const std::string& rURN : i_rURNs )
  {
    List.push_back( Camera( rURN ) );
  }
  return List;
}

/// A grid whose signals are written down.
class VGridTest : public testing::Test
{
protected:
  VGridTest() { Show( false ); }
  void Show( bool i_bSingle )
  {
    pGrid = std::make_shared< VCameraGrid >( i_bSingle );
    QObject::connect( pGrid.get(), &VCameraGrid::dataChanged,
                      [this]( const QModelIndex& i_rFrom, const QModelIndex& i_rTo, const QList< int >& i_rRoles )
                      {
                        EXPECT_EQ( i_rTo.row() - i_rFrom.row() + 1,
                                   i_rRoles == QList< int >{ 266 } ? 1 : pGrid->rowCount() );
                        Reported.push_back( i_rRoles );
                      } );
    QObject::connect( pGrid.get(), &VCameraGrid::modelReset,
                      [this]
                      {
                        ++Resets;
                      } );
    QObject::connect( pGrid.get(), &VCameraGrid::CountChanged,
                      [this]
                      {
                        ++Counts;
                      } );
    Requests = pGrid->TileRequested().Connect(
        [this]( const QStringList& i_rURNs )
        {
          Requested.push_back( i_rURNs );
        },
        nullptr );
  }
  void Mouse( QEvent::Type i_Type, QPointF i_Place, Qt::MouseButton i_Button )
  {
    QMouseEvent Event( i_Type, i_Place, i_Place, i_Type == QEvent::MouseMove ? Qt::NoButton : i_Button, i_Button, {} );
    i_Type == QEvent::MouseButtonPress      ? pGrid->MousePress( Event, Ratio )
    : i_Type == QEvent::MouseButtonDblClick ? pGrid->DoubleClick( Event, Ratio )
                                            : pGrid->MouseMove( Event, Ratio );
  }
  void Drag( Qt::MouseButton i_Button, QPointF i_From, QPointF i_To )
  {
    Mouse( QEvent::MouseButtonPress, i_From, i_Button );
    Mouse( QEvent::MouseMove, ( i_From + i_To ) / 2, i_Button );
    Mouse( QEvent::MouseMove, i_To, i_Button );
  }
  void Wheel( QPointF i_Place, int i_Delta )
  {
    QWheelEvent Event( i_Place, i_Place, {}, { 0, i_Delta }, {}, {}, Qt::NoScrollPhase, false );
    pGrid->Wheel( Event, Ratio );
  }
  bool Key( Qt::Key i_Key ) { return pGrid->KeyPress( QKeyEvent( QEvent::KeyPress, i_Key, {} ) ); }
  QVariant Data( int i_Row, int i_Role ) const { return pGrid->data( pGrid->index( i_Row ), i_Role ); }
  QStringList URNs() const
  {
    VCameraGrid::VURNs Pinned;
    QStringList List;
    pGrid->GetPinnedCameras( Pinned, List );
    return List;
  }
  const VCameraTile& Tile( std::size_t i_Index = 0 ) const { return pGrid->Tiles().at( i_Index ); }
  /// The part of the image that stands under a point of the frame, y down.
  std::array< double, 2 > Under( const VCameraTile& i_rTile, QPointF i_Point ) const
  {
    const QRect& rRect = i_rTile.Rect;
    const double Top = pGrid->FrameSize().height() - rRect.y() - rRect.height();
    const double X = ( i_Point.x() - rRect.x() ) / rRect.width() - 0.5;
    const double Y = ( i_Point.y() - Top ) / rRect.height() - 0.5;
    return { i_rTile.PanX + X / ( static_cast< double >( i_rTile.ScaleX ) * i_rTile.Zoom ),
             i_rTile.PanY + Y / ( static_cast< double >( i_rTile.ScaleY ) * i_rTile.Zoom ) };
  }

  double Ratio = 1.0;
  std::shared_ptr< VCameraGrid > pGrid;
  ZEK::VConnection Requests;
  VRoles Reported;
  std::vector< QStringList > Requested;
  int Resets = 0;
  int Counts = 0;
};

} // namespace MoxelGraphics
