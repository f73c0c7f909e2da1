#include "SimulatedCameras.h"

#include <cmath>
#include <numbers>

using namespace CoreMoxelTypes;
using namespace ZEK;

namespace HostSources::Simulation
{
namespace
{

constexpr float WarmCamera = 41; // degrees Celsius

/// Of a camera's own, in [0, 1).
f32 SpreadOf( const VHash& i_rHash )
{
  return static_cast< f32 >( i_rHash.Uniform() );
}

/// The room warms and cools within ten minutes, the air conditioning within one.
double Drift( const VHash& i_rHash, std::int64_t i_Second )
{
  const auto Wave = [&]( double i_Period, std::uint64_t i_Stream )
  {
    const double Turn = std::fmod( static_cast< double >( i_Second ), i_Period ) / i_Period;
    return std::sin( 2 * std::numbers::pi * ( Turn + i_rHash.With( i_Stream ).Uniform() ) );
  };
  return 1.2 * Wave( 600, 1 ) + 0.3 * Wave( 53, 2 );
}

} // namespace

void VSimulatedCameras::AddSlowItems( VItemMaker& io_rMaker, std::vector< VFlowItemRef >& io_rSlow ) const
{
  for ( std::size_t Index = 0; Index < m_Cameras.size(); ++Index )
  {
    const VCamera& rCamera = m_Cameras[Index];
    const auto Has = [&]( ESimulatedFault i_Fault )
    {
      return ( rCamera.Faults & FaultBit( i_Fault ) ) != 0;
    };
    io_rMaker.AddSlow< FlowCameraHardware >( io_rSlow, EFlowNameDevice, rCamera.Name, rCamera.Hardware );
    VCameraSettings Settings;
    Settings.Values = { { "Name", rCamera.Name },
                        { "UserId", static_cast< std::int64_t >( Index + 1 ) },
                        { "Connected", !Has( ESimulatedFault::Disconnected ) && !Has( ESimulatedFault::Missing ) },
                        { "Enabled", !Has( ESimulatedFault::Disabled ) },
                        { "Missing", Has( ESimulatedFault::Missing ) },
                        { "Contributing", !Has( ESimulatedFault::NotContributing ) },
                        { "SensorMode", std::string( "Full" ) },
                        { "AudioChannels", std::int64_t{ 0 } },
                        { "GammaCorrection", 1.0 },
                        { "VideoSaturation", 1.0 },
                        { "Threshold", std::int64_t{ VDiscPainter::Threshold } } };
    io_rMaker.AddSlow< FlowCameraSettings >( io_rSlow, EFlowNameDevice, rCamera.Name, std::move( Settings ) );
    if ( !Has( ESimulatedFault::Uncalibrated ) )
    {
      io_rMaker.AddSlow< FlowCameraCalibration >( io_rSlow, EFlowNameDevice, rCamera.Name, rCamera.Calibration );
    }
    if ( !rCamera.Mask.empty() )
    {
      VCameraMaskGrid Mask{ static_cast< u16 >( rCamera.Hardware.SensorWidth / CellSize ),
                            static_cast< u16 >( rCamera.Hardware.SensorHeight / CellSize ), CellSize, CellSize,
                            rCamera.Mask };
      io_rMaker.AddSlow< FlowCameraMaskGrid >( io_rSlow, EFlowNameDevice, rCamera.Name, std::move( Mask ) );
    }
    AddHealth( rCamera, Index, io_rMaker, io_rSlow );
  }
}

void VSimulatedCameras::AddHealth( const VCamera& i_rCamera, std::size_t i_Index, VItemMaker& io_rMaker,
                                   std::vector< VFlowItemRef >& io_rSlow ) const
{
  const bool bBumped = ( i_rCamera.Faults & FaultBit( ESimulatedFault::Bumped ) ) != 0;
  const bool bWarned = ( i_rCamera.Faults & FaultBit( ESimulatedFault::Warned ) ) != 0;
  const f32 Spread = SpreadOf( HealthHash( i_Index ) );
  const f32 Temperature = WarmCamera + 2 * Spread;
  if ( !( i_rCamera.Faults & FaultBit( ESimulatedFault::Uncalibrated ) ) )
  {
    VCameraCalibrationHealth Health;
    Health.AvgReprojectionError = bBumped ? 6.0 : 0.08 + 0.1 * Spread;
    Health.Score = bBumped ? 0.95F : 0.05F + 0.2F * Spread;
    Health.ScoreConfidence = 0.9F;
    Health.NumResiduals = 4000 + static_cast< u32 >( 2000 * Spread );
    Health.CentroidConnectionScore = bBumped ? 0.9F : 0.1F * Spread;
    Health.CentroidConnectionScoreConfidence = 0.9F;
    Health.IsBumped = bBumped;
    io_rMaker.AddSlow< FlowCameraCalibrationHealth >( io_rSlow, EFlowNameDevice, i_rCamera.Name, Health );
    io_rMaker.AddSlow< FlowCameraCalibrationDetails >( io_rSlow, EFlowNameDevice, i_rCamera.Name,
                                                       { Temperature - 0.6F, Temperature, true, 0 } );
  }
  io_rMaker.AddSlow< FlowCameraPhysicalStatus >( io_rSlow, EFlowNameDevice, i_rCamera.Name,
                                                 { bBumped, bBumped ? 3.0F : 0.0F, 0 } );
  io_rMaker.AddSlow< FlowCameraWarnings >( io_rSlow, EFlowNameDevice, i_rCamera.Name, { bWarned ? 0xFFu : 0u } );
}

void VSimulatedCameras::AddSensors( double i_Seconds, VItemMaker& io_rMaker, IFlowState& io_rState )
{
  for ( std::size_t Index = 0; Index < m_Cameras.size(); ++Index )
  {
    VCamera& rCamera = m_Cameras[Index];
    const VHash Hash = HealthHash( Index );
    const bool bHot = ( rCamera.Faults & FaultBit( ESimulatedFault::Hot ) ) != 0;
    const double Celsius = WarmCamera + 2 * static_cast< double >( SpreadOf( Hash ) ) + ( bHot ? 25 : 0 ) +
                           Drift( Hash, static_cast< std::int64_t >( i_Seconds ) );
    const auto Tenths = static_cast< std::int32_t >( std::lround( 10 * Celsius ) );
    if ( !rCamera.Sensor || rCamera.Tenths != Tenths )
    {
      auto* const pSensor =
          io_rMaker.MakeNamed< FlowCameraPhysicalSensorData >( rCamera.Sensor, EFlowNameDevice, rCamera.Name );
      if ( !pSensor )
      {
        return;
      }
      rCamera.Tenths = Tenths;
      // The way down on the ring, in the camera's own axes, is the same for all but the tilt.
      const f32 Tilt = static_cast< f32 >( std::atan2( rCamera.Calibration.Position.z - 900, 4800.0 ) );
      *pSensor = { static_cast< f32 >( Tenths ) / 10, { 0, std::cos( Tilt ), std::sin( Tilt ) }, 5 };
    }
    io_rState.AddItem( rCamera.Sensor );
  }
}

VHash VSimulatedCameras::HealthHash( std::size_t i_Camera ) const
{
  return VHash( m_rOptions.Seed ).With( 0x4865 ).With( i_Camera );
}

} // namespace HostSources::Simulation
