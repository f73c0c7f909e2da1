#include "CameraReport.h"

#include <MoxelGraphics/CameraDistortion.h>
#include <MoxelGraphics/VCameraGrid.h>
#include <MoxelGraphics/VSceneOptions.h>
#include <ZEK/RenderCamera.h>

#include <cmath>

namespace HarrowGraphics
{
namespace
{
using MoxelGraphics::VCameraTile;

/// From a camera's sensor to the frame.
class VTilePixels
{
public:
  VTilePixels( const VCameraTile& i_rTile, const ZEK::IRenderCamera& i_rCamera,
               const MoxelGraphics::VSceneOptions& i_rOptions, int i_FrameHeight )
    : m_View( MoxelGraphics::MakeSensorView(
          i_rCamera, i_rOptions,
          { i_rTile.ScaleX * i_rTile.Zoom, i_rTile.ScaleY * i_rTile.Zoom, i_rTile.PanX, i_rTile.PanY } ) )
    , m_Rect( i_rTile.Rect.x(), i_FrameHeight - i_rTile.Rect.y() - i_rTile.Rect.height(), i_rTile.Rect.width(),
              i_rTile.Rect.height() )
  {
  }
  QPointF At( double i_X, double i_Y ) const
  {
    const auto [X, Y] = MoxelGraphics::SensorToClip( m_View, i_X, i_Y );
    return { m_Rect.x() + ( X + 1 ) / 2 * m_Rect.width(), m_Rect.y() + ( 1 - Y ) / 2 * m_Rect.height() };
  }
  QVariantMap Rect() const
  {
    return { { "x", m_Rect.x() }, { "y", m_Rect.y() }, { "width", m_Rect.width() }, { "height", m_Rect.height() } };
  }

private:
  MoxelGraphics::VSensorView m_View;
  QRect m_Rect; ///< y down
};

QVariantList Centroids( const ZEK::IRenderCamera& i_rCamera, const VTilePixels& i_rPixels,
                        const MoxelGraphics::VSceneOptions& i_rOptions )
{
  ZEK::VCameraLists2D Lists;
  ZEK::VDrawWords Colours;
  i_rCamera.GetDrawData2D( i_rCamera.GetInfo().FirstCentroidId,
                           static_cast< ZEK::ECentroidColourScheme >( i_rOptions.CentroidColourScheme ), false, Lists,
                           Colours );
  QVariantList Found;
  int Index = 0;
  for ( const ZEK::VCentroidVertex& rCentroid : *Lists.pCentroids )
  {
    const QPointF At = i_rPixels.At( rCentroid.X, rCentroid.Y );
    const QPointF Way = i_rPixels.At( rCentroid.X + rCentroid.Radius, rCentroid.Y ) - At;
    Found.append( QVariantMap{
        { "index", Index++ }, { "x", At.x() }, { "y", At.y() }, { "radius", std::hypot( Way.x(), Way.y() ) } } );
  }
  return Found;
}
} // namespace

QVariantList CameraReport( const MoxelGraphics::VCameraGrid& i_rGrid, const ZEK::IRenderCameraProvider& i_rCameras,
                           const MoxelGraphics::VSceneOptions& i_rOptions )
{
  QVariantList Tiles;
  for ( const VCameraTile& rTile : i_rGrid.Tiles() )
  {
    QVariantMap Tile{ { "urn", rTile.DeviceURN },
                      { "userId", rTile.UserId },
                      { "displayType", rTile.DisplayType },
                      { "sensorWidth", rTile.ImageWidth },
                      { "sensorHeight", rTile.ImageHeight },
                      { "zoom", rTile.Zoom },
                      { "panX", rTile.PanX },
                      { "panY", rTile.PanY } };
    if ( const ZEK::VRenderCameraRef pCamera = i_rCameras.GetCamera( rTile.DeviceURN.toStdString() ) )
    {
      const VTilePixels Pixels( rTile, *pCamera, i_rOptions, i_rGrid.FrameSize().height() );
      Tile["rect"] = Pixels.Rect();
      Tile["centroids"] = Centroids( *pCamera, Pixels, i_rOptions );
    }
    Tiles.append( Tile );
  }
  return Tiles;
}

} // namespace HarrowGraphics
