// The item's side of a camera view: the grid that it feeds, and whose tiles it hands to its frames.

#include "HandOver.h"
#include "Log.h"
#include "VSynced.h"

#include <MoxelGraphics/VCameraGrid.h>
#include <MoxelGraphics/VMoxelScene.h>

#include <QtQuick/QQuickWindow>

namespace MoxelGraphics
{
namespace
{
QVariantMap TileReport( const VCameraTile& i_rTile, int i_FrameHeight, double i_Ratio )
{
  const QRect& rRect = i_rTile.Rect;
  const int Top = i_FrameHeight - rRect.y() - rRect.height();
  return {
      { "urn", i_rTile.DeviceURN },
      { "rect", QVariantList{ rRect.x() / i_Ratio, Top / i_Ratio, rRect.width() / i_Ratio, rRect.height() / i_Ratio } },
      { "viewport", QVariantList{ i_rTile.Viewport.x(), i_rTile.Viewport.y(), i_rTile.Viewport.width(),
                                  i_rTile.Viewport.height() } },
      { "view2d",
        QVariantList{ i_rTile.ScaleX * i_rTile.Zoom, i_rTile.ScaleY * i_rTile.Zoom, i_rTile.PanX, i_rTile.PanY } },
      { "zoom", i_rTile.Zoom },
      { "pan", QVariantList{ i_rTile.PanX, i_rTile.PanY } } };
}
} // namespace

QObject* VSceneFramebufferObject::CameraGrid() const
{
  return m_pCameraGrid;
}

VCameraGrid* VSceneFramebufferObject::Grid() const
{
  return m_Options.CameraView ? m_pCameraGrid.data() : nullptr;
}

void VSceneFramebufferObject::SetCameraGrid( QObject* i_pGrid )
{
  TakeOver( this );
  auto* const pGrid = qobject_cast< VCameraGrid* >( i_pGrid );
  if ( i_pGrid && !pGrid )
  {
    ZEK::Log( LogCategory(), ZEK::ELogFailure, "The camera grid of a view must be a VCameraGrid" );
    return;
  }
  disconnect( m_GridViews );
  m_pCameraGrid = pGrid;
  m_Tiles.reset();
  m_pSynced->CameraGeneration = VSynced::NoGeneration;
  if ( pGrid )
  {
    m_GridViews = connect( pGrid, &VCameraGrid::ViewsChanged, this, &QQuickItem::update );
    m_GridRatio = 0.0;
    ResizeGrid();
    PassGridOptions();
    if ( !m_PreviewCamera.isEmpty() )
    {
      pGrid->SetShownCameras( { m_PreviewCamera } );
    }
  }
  update();
}

void VSceneFramebufferObject::geometryChange( const QRectF& i_rNew, const QRectF& i_rOld )
{
  QQuickFramebufferObject::geometryChange( i_rNew, i_rOld );
  if ( i_rNew.size() != i_rOld.size() )
  {
    ResizeGrid();
  }
}

void VSceneFramebufferObject::ResizeGrid()
{
  TakeOver( this );
  if ( !m_pCameraGrid )
  {
    return;
  }
  // The size that the frame's target is going to have.
  m_GridRatio = Ratio();
  const bool bSize = width() > 0 && height() > 0;
  const QSize Item( std::max( 1, static_cast< int >( width() ) ), std::max( 1, static_cast< int >( height() ) ) );
  const QSize Frame = bSize ? Item * m_GridRatio : QSize( 0, 0 );
  const auto GridRatio = static_cast< float >( m_GridRatio );
  if ( Frame != m_pCameraGrid->FrameSize() || GridRatio != m_pCameraGrid->PixelRatio() )
  {
    m_pCameraGrid->Resize( Frame, GridRatio );
  }
}

void VSceneFramebufferObject::PassGridOptions()
{
  if ( m_pCameraGrid )
  {
    m_pCameraGrid->SetRotation( m_Options.CameraShowRotated, m_Options.CameraSnap90Degrees );
  }
}

void VSceneFramebufferObject::PrepareMeeting()
{
  TakeOver( this );
  // Grids belong to the GUI thread; the renderer only ever sees what they were.
  m_Tiles = m_pCameraGrid ? m_pCameraGrid->Snapshot() : nullptr;
  HandOver( this );
}

void VSceneFramebufferObject::ExchangeTiles( VSceneFrame& io_rFrame )
{
  VFrameInput& rInput = io_rFrame.Input();
  m_pSynced->Tiles = rInput.Tiles;
  m_pSynced->FrameHeight = io_rFrame.Size().height();
  m_pSynced->PixelRatio = static_cast< double >( rInput.PixelRatio );
  rInput.Tiles = m_Options.CameraView ? m_Tiles : nullptr;
  if ( !m_pCameraGrid )
  {
    return;
  }
  if ( m_GridRatio != Ratio() )
  {
    Post(
        [this]
        {
          ResizeGrid();
        } );
  }
  if ( const std::uint64_t Generation = m_pScene->CameraGeneration(); Generation != m_pSynced->CameraGeneration )
  {
    m_pSynced->CameraGeneration = Generation;
    Post(
        [this, Cameras = m_pScene->CameraDefinitions()]
        {
          if ( m_pCameraGrid )
          {
            m_pCameraGrid->SetCameras( Cameras );
          }
        } );
  }
}

QVariantList VSceneFramebufferObject::TilesReport() const
{
  QVariantList Tiles;
  if ( m_pSynced->Tiles )
  {
    for ( const VCameraTile& rTile : *m_pSynced->Tiles )
    {
      Tiles.append( TileReport( rTile, m_pSynced->FrameHeight, m_pSynced->PixelRatio ) );
    }
  }
  return Tiles;
}

} // namespace MoxelGraphics
