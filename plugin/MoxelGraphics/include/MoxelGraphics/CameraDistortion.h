#pragma once

#include <CoreGraphics/VShaderProgram.h>

#include <QtGui/QMatrix4x4>
#include <QtGui/QVector4D>

#include <array>

namespace ZEK
{
class IRenderCamera;
}

namespace MoxelGraphics
{
struct VSceneOptions;

/// Whether 2D data are corrected for the lens, so that they match a world that is drawn over them without distortion.
bool Distort2D( const VSceneOptions& i_rOptions );

/// How one camera's sensor is shown in its tile: lens, orientation on screen, and the part that is looked at. Sensor
/// pixels; matrices are 2 by 2, row-major. Every program and every pick of a camera view takes it from here.
struct VSensorView
{
  std::array< float, 2 > SensorSize{ 1, 1 };
  std::array< float, 2 > DistortionCentre{}; ///< (0, 0): not distorted
  std::array< float, 3 > DistortionParameters{};
  std::array< float, 2 > RotationCentre{};
  std::array< float, 4 > Rotation{ 1, 0, 0, 1 };
  std::array< float, 4 > RotationInverse{ 1, 0, 0, 1 };
  QVector4D View2D{ 1, 1, 0.5f, 0.5f }; ///< x scale, y scale, x centre, y centre

  friend bool operator==( const VSensorView&, const VSensorView& ) = default;
};

/// `i_rView2D` is the tile's, as the context has it. With `i_bLens` the camera's lens is given whatever `Distort2D`
/// says, for what maps the world to the lens. A camera without a sensor size gets one of a pixel.
VSensorView MakeSensorView( const ZEK::IRenderCamera& i_rCamera, const VSceneOptions& i_rOptions,
                            const QVector4D& i_rView2D, bool i_bLens = false );

/// The clip position, x and y from -1 to 1 in the tile, of a place on the sensor. `i_Offset` is added behind the lens:
/// 0.5 for what stands at the centre of a pixel, 0 for edges of pixels.
std::array< double, 2 > SensorToClip( const VSensorView& i_rView, double i_X, double i_Y, double i_Offset = 0.5 );

/// The projection of the world into the tile for a calibrated camera; its view matrix is `CameraFromWorld`. The place
/// where `SensorToClip` shows the centroid of a point, seen through a lens without distortion.
QMatrix4x4 ImageProjection( const ZEK::IRenderCamera& i_rCamera, const VSceneOptions& i_rOptions,
                            const QVector4D& i_rView2D );

/// Gives one program what its source knows of the sensor; `u_View2D` is the context's own. The program is in use.
class VSensorUniforms
{
public:
  void Set( CoreGraphics::VShaderProgram& io_rProgram, const VSensorView& i_rView );

private:
  CoreGraphics::VUniform m_SensorSize{ "u_SensorSize" };
  CoreGraphics::VUniform m_Centre{ "u_RadialDistortionCentre" };
  CoreGraphics::VUniform m_Parameters{ "u_RadialDistortionParameters" };
  CoreGraphics::VUniform m_RotationCentre{ "u_RotationCentre" };
  CoreGraphics::VUniform m_Rotation{ "u_Rotation" };
  CoreGraphics::VUniform m_RotationInverse{ "u_RotationInverse" };
};

} // namespace MoxelGraphics
