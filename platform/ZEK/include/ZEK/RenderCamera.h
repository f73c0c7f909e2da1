#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace ZEK
{

/// A 4 by 4 matrix, column-major, as OpenGL takes it.
using VMatrix4 = std::array< float, 16 >;

/// One optical camera as the views need it. Thread: render thread, valid until the provider's next update.
class IRenderCamera
{
public:
  virtual ~IRenderCamera() = default;
  virtual const std::string& DeviceURN() const = 0;
  virtual std::uint32_t UserId() const = 0;
  virtual bool IsCalibrated() const = 0;
  /// Sensor size in pixels.
  virtual std::uint32_t SensorWidth() const = 0;
  virtual std::uint32_t SensorHeight() const = 0;
  virtual const VMatrix4& WorldFromCamera() const = 0;
};

/// The cameras of the frame, sorted by device URN.
class IRenderCameraProvider
{
public:
  virtual ~IRenderCameraProvider() = default;
  virtual std::size_t CameraCount() const = 0;
  virtual const IRenderCamera& Camera( std::size_t i_Index ) const = 0;
  virtual const IRenderCamera* FindCamera( const std::string& i_rDeviceURN ) const = 0;
};

} // namespace ZEK
