#pragma once

#include <QtCore/QVariantMap>

namespace CoreMoxelTypes
{
struct VCameraSettings;
struct VCameraCalibration;
struct VCameraCalibrationHealth;
struct VCameraCalibrationDetails;
struct VCameraPhysicalStatus;
struct VCameraPhysicalSensorData;
struct VDeviceWarnings;
} // namespace CoreMoxelTypes

namespace HarrowPluginInterface
{
class ICameraDataSourceContext;
}

namespace HarrowGraphics
{

/// What a state says of one camera beside what it sees; each may be null.
struct VCameraHealthItems
{
  const CoreMoxelTypes::VCameraSettings* pSettings = nullptr;
  const CoreMoxelTypes::VCameraCalibration* pCalibration = nullptr;
  const CoreMoxelTypes::VCameraCalibrationHealth* pHealth = nullptr;
  const CoreMoxelTypes::VCameraCalibrationDetails* pDetails = nullptr;
  const CoreMoxelTypes::VCameraPhysicalStatus* pStatus = nullptr;
  const CoreMoxelTypes::VCameraPhysicalSensorData* pSensor = nullptr;
  const CoreMoxelTypes::VDeviceWarnings* pWarnings = nullptr;
};

/// The named values that the overlay of a tile shows. A switch that no item tells stands as in a camera without a
/// fault; a number that no item tells is left out. The texts of warnings that are not set are empty.
QVariantMap CameraTileData( const VCameraHealthItems& i_rItems,
                            const HarrowPluginInterface::ICameraDataSourceContext* i_pContext );

} // namespace HarrowGraphics
