#include <MoxelGraphics/CameraDistortion.h>

#include <MoxelGraphics/VSceneOptions.h>

#include <ComputeCameraModel/VCameraModel.h>
#include <ZEK/RenderCamera.h>

#include <algorithm>

namespace MoxelGraphics
{
namespace
{
QVector2D ToVector( const std::array< float, 2 >& i_rPair )
{
  return { i_rPair[0], i_rPair[1] };
}

QMatrix2x2 ToMatrix( const std::array< float, 4 >& i_rRows )
{
  return QMatrix2x2( i_rRows.data() );
}

/// The model is column-major, the constructor reads rows.
QMatrix4x4 ToMatrix( const ZEK::VMatrix4& i_rColumns )
{
  return QMatrix4x4( i_rColumns.data() ).transposed();
}
} // namespace

bool Distort2D( const VSceneOptions& i_rOptions )
{
  return i_rOptions.Show3DOverlay && !i_rOptions.Distort3D;
}

VSensorView MakeSensorView( const ZEK::IRenderCamera& i_rCamera, const VSceneOptions& i_rOptions,
                            const QVector4D& i_rView2D, bool i_bLens )
{
  const ZEK::VRenderCameraInfo& rInfo = i_rCamera.GetInfo();
  const ComputeCameraModel::VCameraModel& rModel = i_rCamera.GetModel();
  VSensorView View;
  View.SensorSize = { static_cast< float >( std::max( rInfo.SensorWidth, 1u ) ),
                      static_cast< float >( std::max( rInfo.SensorHeight, 1u ) ) };
  View.View2D = i_rView2D;
  const bool bHasCentre = rModel.DistortionCentre != std::array< float, 2 >{};
  // A lens without a centre leaves no better place to turn about than the middle of the image.
  View.RotationCentre =
      bHasCentre ? rModel.DistortionCentre : std::array< float, 2 >{ View.SensorSize[0] / 2, View.SensorSize[1] / 2 };
  if ( rInfo.bCalibrated && ( i_bLens || Distort2D( i_rOptions ) ) )
  {
    View.DistortionCentre = rModel.DistortionCentre;
    View.DistortionParameters = rModel.DistortionParameters;
  }
  if ( i_rOptions.CameraShowRotated )
  {
    const bool bSnapped = i_rOptions.CameraSnap90Degrees;
    View.Rotation = bSnapped ? rModel.SnappedRotation : rModel.RollRotation;
    View.RotationInverse = bSnapped ? rModel.SnappedInverse : rModel.RollInverse;
  }
  return View;
}

std::array< double, 2 > SensorToClip( const VSensorView& i_rView, double i_X, double i_Y, double i_Offset )
{
  double X = i_X, Y = i_Y;
  if ( i_rView.DistortionCentre != std::array< float, 2 >{} )
  {
    const double Cx = i_rView.DistortionCentre[0], Cy = i_rView.DistortionCentre[1];
    const double Dx = X - Cx, Dy = Y - Cy, D = Dx * Dx + Dy * Dy;
    const auto& [K1, K2, K3] = i_rView.DistortionParameters;
    const double Factor = 1 + D * ( K1 + D * ( K2 + D * static_cast< double >( K3 ) ) );
    X = Cx + Dx * Factor;
    Y = Cy + Dy * Factor;
  }
  const double Rx = i_rView.RotationCentre[0], Ry = i_rView.RotationCentre[1];
  const double Ox = X + i_Offset - Rx, Oy = Y + i_Offset - Ry;
  const auto& rTurn = i_rView.Rotation;
  const double U = ( rTurn[0] * Ox + rTurn[1] * Oy + Rx ) / static_cast< double >( i_rView.SensorSize[0] );
  const double V = ( rTurn[2] * Ox + rTurn[3] * Oy + Ry ) / static_cast< double >( i_rView.SensorSize[1] );
  const QVector4D& rView = i_rView.View2D;
  return { 2 * rView.x() * ( U - static_cast< double >( rView.z() ) ),
           -2 * rView.y() * ( V - static_cast< double >( rView.w() ) ) };
}

QMatrix4x4 ImageProjection( const ZEK::IRenderCamera& i_rCamera, const VSceneOptions& i_rOptions,
                            const QVector4D& i_rView2D )
{
  const ComputeCameraModel::VCameraModel& rModel = i_rCamera.GetModel();
  const VSensorView View = MakeSensorView( i_rCamera, i_rOptions, i_rView2D );
  const bool bSnapped = i_rOptions.CameraSnap90Degrees;
  const ZEK::VMatrix4& rImage = !i_rOptions.CameraShowRotated ? rModel.ImageTransform
                                : bSnapped                    ? rModel.ImageTransformSnapped
                                                              : rModel.ImageTransformRotated;
  // The model turns about its centre of distortion: where that is not the centre of the view, the image moves.
  const float Dx = View.RotationCentre[0] - rModel.DistortionCentre[0];
  const float Dy = View.RotationCentre[1] - rModel.DistortionCentre[1];
  const auto& rTurn = View.Rotation;
  const float MoveU = ( Dx - rTurn[0] * Dx - rTurn[1] * Dy ) / View.SensorSize[0];
  const float MoveV = ( Dy - rTurn[2] * Dx - rTurn[3] * Dy ) / View.SensorSize[1];
  // From the image (0 to 1, y down) to the tile; all that divides by w stays in the column of w.
  const float Sx = 2 * i_rView2D.x(), Sy = -2 * i_rView2D.y();
  const QMatrix4x4 ToTile( Sx, 0, 0, Sx * ( MoveU - i_rView2D.z() ), 0, Sy, 0, Sy * ( MoveV - i_rView2D.w() ), 0, 0, 1,
                           0, 0, 0, 0, 1 );
  return ToTile * ToMatrix( rImage );
}

void VSensorUniforms::Set( CoreGraphics::VShaderProgram& io_rProgram, const VSensorView& i_rView )
{
  const auto& [K1, K2, K3] = i_rView.DistortionParameters;
  m_SensorSize.Set( io_rProgram, ToVector( i_rView.SensorSize ) );
  m_Centre.Set( io_rProgram, ToVector( i_rView.DistortionCentre ) );
  m_Parameters.Set( io_rProgram, QVector3D( K1, K2, K3 ) );
  m_RotationCentre.Set( io_rProgram, ToVector( i_rView.RotationCentre ) );
  m_Rotation.Set( io_rProgram, ToMatrix( i_rView.Rotation ) );
  m_RotationInverse.Set( io_rProgram, ToMatrix( i_rView.RotationInverse ) );
}

} // namespace MoxelGraphics
