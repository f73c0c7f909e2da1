#pragma once

#include "VectorMath.h"

#include <ComputeCameraModel/VRadialDistortion.h>
#include <CoreMoxelTypes/Camera.h>

namespace HostSources::Simulation
{

/// Where a point of the world falls on a sensor.
struct VSensorPoint
{
  double x = 0, y = 0; ///< px of the raw image, (0, 0) the centre of the top left pixel
  double Depth = 0;    ///< mm along the optical axis
  double Scale = 0;    ///< px for each mm beside the point
};

/// The exact way from the world to a sensor: pinhole, then the lens as the inverse of its correction.
class VSensorView
{
public:
  VSensorView( const CoreMoxelTypes::VCameraHardware& i_rHardware,
               const CoreMoxelTypes::VCameraCalibration& i_rCalibration );

  /// False behind the camera, off the sensor, and where the lens has no image.
  bool Project( const D3& i_rPoint, VSensorPoint& o_rPoint ) const;
  const D3& Position() const { return m_Position; }

private:
  D3 m_Rows[3]; ///< the camera's axes in the world
  D3 m_Position;
  double m_Focal, m_FocalY, m_Skew, m_Px, m_Py;
  double m_Width, m_Height;
  ComputeCameraModel::VRadialDistortion m_Lens;
};

} // namespace HostSources::Simulation
