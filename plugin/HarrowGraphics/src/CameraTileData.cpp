#include "CameraTileData.h"

#include <CoreMoxelTypes/Camera.h>
#include <Flow2Graphics/CameraContributions.h>
#include <HarrowPluginInterface/IHarrowServices.h>

#include <algorithm>
#include <array>
#include <cmath>

namespace HarrowGraphics
{
namespace
{
struct VWarning
{
  const char* pKey;
  const char* pText; ///< where the host has none
};
/// In the order of the bits.
constexpr std::array< VWarning, 8 > Warnings{
    { { "incompatibleVideoStandardWarningText", "Incompatible video standard." },
      { "videoFramesLostWarningText", "Video frames are lost." },
      { "timecodeErrorWarningText", "Timecode error." },
      { "badSyncWarningText", "Bad sync." },
      { "notReceivingTriggersText", "Not receiving triggers." },
      { "linkSpeedTooLowText", "Link speed is too low." },
      { "driverVersionText", "Driver version does not fit." },
      { "ipSettingsText", "IP settings do not fit." } } };

template < typename T >
T Setting( const CoreMoxelTypes::VCameraSettings* i_pSettings, const char* i_pKey, T i_Default )
{
  if ( i_pSettings )
  {
    const auto It = i_pSettings->Values.find( i_pKey );
    const T* const pValue = It == i_pSettings->Values.end() ? nullptr : std::get_if< T >( &It->second );
    return pValue ? *pValue : i_Default;
  }
  return i_Default;
}

void AddTemperatures( const VCameraHealthItems& i_rItems, QVariantMap& io_rData )
{
  const auto* const pDetails = i_rItems.pDetails;
  const auto* const pSensor = i_rItems.pSensor;
  io_rData["wasTemperatureConsistentDuringCalibration"] = !pDetails || pDetails->TemperatureSteady;
  io_rData["isCurrentTemperatureConsistentWithCalibration"] =
      !pDetails || !pSensor ||
      std::abs( pSensor->Temperature - pDetails->EndedTemperature ) <= pSensor->TemperatureTolerance;
  if ( pDetails )
  {
    io_rData["calibrationStartedTemperature"] = pDetails->StartedTemperature;
    io_rData["calibrationEndedTemperature"] = pDetails->EndedTemperature;
  }
  if ( pSensor )
  {
    io_rData["currentTemperature"] = pSensor->Temperature;
  }
}

void AddHealth( const CoreMoxelTypes::VCameraCalibrationHealth& i_rHealth, QVariantMap& io_rData )
{
  if ( std::isfinite( i_rHealth.AvgReprojectionError ) )
  {
    io_rData["avgReprojectionError"] = i_rHealth.AvgReprojectionError;
    io_rData["avgReprojectionErrorColor"] =
        QColor( Flow2Graphics::ReprojectionErrorColour( i_rHealth.AvgReprojectionError ) );
  }
  io_rData["avgReprojectionErrorScore"] = i_rHealth.Score;
  io_rData["avgReprojectionErrorScoreConfidence"] = i_rHealth.ScoreConfidence;
  io_rData["numResiduals"] = i_rHealth.NumResiduals;
  io_rData["centroidConnectionScore"] = i_rHealth.CentroidConnectionScore;
  io_rData["centroidConnectionScoreConfidence"] = i_rHealth.CentroidConnectionScoreConfidence;
}

QString WarningText( std::size_t i_Bit, const HarrowPluginInterface::ICameraDataSourceContext* i_pContext )
{
  const QString Text = i_pContext ? i_pContext->WarningText( 1u << i_Bit ) : QString();
  return Text.isEmpty() ? QString( Warnings[i_Bit].pText ) : Text;
}
} // namespace

QVariantMap CameraTileData( const VCameraHealthItems& i_rItems,
                            const HarrowPluginInterface::ICameraDataSourceContext* i_pContext )
{
  const auto* const pSettings = i_rItems.pSettings;
  QVariantMap Data;
  Data["isCalibrated"] = i_rItems.pCalibration != nullptr;
  AddTemperatures( i_rItems, Data );
  Data["isBumped"] =
      ( i_rItems.pHealth && i_rItems.pHealth->IsBumped ) || ( i_rItems.pStatus && i_rItems.pStatus->IsBumped );
  Data["isEnabled"] = Setting( pSettings, "Enabled", true );
  Data["isConnected"] = Setting( pSettings, "Connected", true );
  Data["isMissing"] = Setting( pSettings, "Missing", false );
  Data["isContributing"] = Setting( pSettings, "Contributing", true );
  Data["sensorMode"] = QString::fromStdString( Setting( pSettings, "SensorMode", std::string() ) );
  Data["audioChannels"] = static_cast< qlonglong >( Setting( pSettings, "AudioChannels", std::int64_t{ 0 } ) );
  if ( i_rItems.pHealth )
  {
    AddHealth( *i_rItems.pHealth, Data );
  }
  const std::uint32_t Flags = i_rItems.pWarnings ? i_rItems.pWarnings->Flags : 0;
  for ( std::size_t Bit = 0; Bit < Warnings.size(); ++Bit )
  {
    Data[Warnings[Bit].pKey] = ( Flags >> Bit & 1u ) != 0 ? WarningText( Bit, i_pContext ) : QString();
  }
  return Data;
}

} // namespace HarrowGraphics
