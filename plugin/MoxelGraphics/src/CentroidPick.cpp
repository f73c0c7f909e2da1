#include <MoxelGraphics/CentroidPick.h>

#include <MoxelGraphics/CameraDistortion.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>
#include <ZEK/RenderCamera.h>

namespace MoxelGraphics
{
namespace
{
/// A part of the frame in the tile's clip coordinates, bounds included.
struct VClipRect
{
  double Left, Right, Bottom, Top;

  VClipRect( const QRect& i_rRect, const QRect& i_rViewport )
  {
    const auto X = [&]( int i_Pixel )
    {
      return 2.0 * ( i_Pixel - i_rViewport.x() ) / i_rViewport.width() - 1;
    };
    const auto Y = [&]( int i_Pixel )
    {
      return 2.0 * ( i_Pixel - i_rViewport.y() ) / i_rViewport.height() - 1;
    };
    Left = X( i_rRect.x() );
    Right = X( i_rRect.x() + i_rRect.width() );
    Bottom = Y( i_rRect.y() );
    Top = Y( i_rRect.y() + i_rRect.height() );
  }
  bool Holds( const std::array< double, 2 >& i_rPlace ) const
  {
    return i_rPlace[0] >= Left && i_rPlace[0] <= Right && i_rPlace[1] >= Bottom && i_rPlace[1] <= Top;
  }
};
} // namespace

void PickCentroidsInRect( const ZEK::IRenderCameraProvider& i_rProvider, const CoreGraphics::VRenderContext& i_rContext,
                          const VSceneOptions& i_rOptions, const QRect& i_rRect, std::vector< std::uint32_t >& io_rIds )
{
  const QRect& rViewport = i_rContext.Viewport();
  // What of the rectangle lies beyond the tile shows another camera.
  const QRect Part = i_rRect.intersected( rViewport );
  const bool bNothing =
      !i_rOptions.CameraView || !i_rOptions.CameraCentroids || i_rOptions.OverlayCamera.isEmpty() || Part.isEmpty();
  const ZEK::VRenderCameraRef pCamera =
      bNothing ? nullptr : i_rProvider.GetCamera( i_rOptions.OverlayCamera.toStdString() );
  if ( !pCamera || pCamera->GetInfo().FirstCentroidId == 0 )
  {
    return;
  }
  ZEK::VCameraLists2D Lists;
  ZEK::VDrawWords Colours;
  pCamera->GetDrawData2D( pCamera->GetInfo().FirstCentroidId,
                          static_cast< ZEK::ECentroidColourScheme >( i_rOptions.CentroidColourScheme ), false, Lists,
                          Colours );
  const VSensorView View = MakeSensorView( *pCamera, i_rOptions, i_rContext.View2D() );
  const VClipRect Rect( Part, rViewport );
  for ( std::size_t Index = 0; Index < Lists.pCentroids->size() && Index < Lists.pIds->size(); ++Index )
  {
    const ZEK::VCentroidVertex& rCentroid = ( *Lists.pCentroids )[Index];
    if ( Rect.Holds(
             SensorToClip( View, static_cast< double >( rCentroid.X ), static_cast< double >( rCentroid.Y ) ) ) )
    {
      io_rIds.push_back( ( *Lists.pIds )[Index] );
    }
  }
}

} // namespace MoxelGraphics
