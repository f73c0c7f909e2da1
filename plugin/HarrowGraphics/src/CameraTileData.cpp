#include "CameraTileData.h"

#include <CoreMoxelTypes/Camera.h>
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

/// On a scale of pixels that is the same for all cameras at all times: calm up to a quarter, alarming from one on.
QColor ErrorColour( double i_Pixels )
{
  struct VStop
  {
    double Pixels;
    std::array< double, 3 > Colour;
  };
  constexpr std::array< VStop, 4 > Stops{ { { 0.0, { 0.50, 0.82, 0.78 } },
                                            { 0.25, { 0.50, 0.82, 0.78 } },
                                            { 0.5, { 0.93, 0.90, 0.55 } },
                                            { 1.0, { 0.93, 0.36, 0.27 } } } };
  const double Pixels = std::clamp( i_Pixels, Stops.front().Pixels, Stops.back().Pixels );
  std::size_t Upper = 1;
  while ( Upper + 1 < Stops.size() && Stops[Upper].Pixels < Pixels )
  {
    ++Upper;
  }
  const VStop& rLow = Stops[Upper - 1];
  const VStop& rHigh = Stops[Upper];
  const double Share = ( Pixels - rLow.Pixels ) / ( rHigh.Pixels - rLow.Pixels );
  const auto Part = [&]( std::size_t i_Index )
  {
    return static_cast< float >( std::lerp( rLow.Colour[i_Index], rHigh.Colour[i_Index], Share ) );
  };
  return QColor::fromRgbF( Part( 0 ), Part( 1 ), Part( 2 ) );
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
    io_rData["avgReprojectionErrorColor"] = ErrorColour( i_rHealth.AvgReprojectionError );
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
