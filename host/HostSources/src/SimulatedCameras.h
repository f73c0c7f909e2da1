#pragma once

#include "SimulatedImage.h"
#include "SimulatedItems.h"
#include "SimulatedLens.h"
#include "SimulatedMarkers.h"
#include "SimulatedVideo.h"

#include <CoreMoxelTypes/FlowTypes.h>

#include <cstdint>
#include <string>
#include <vector>

namespace HostSources::Simulation
{

inline constexpr std::uint32_t CellSize = 32; ///< px, of a mask

/// 0 for a fault that nobody knows.
constexpr std::uint32_t FaultBit( ESimulatedFault i_Fault )
{
  const auto Bit = static_cast< std::uint32_t >( i_Fault );
  return Bit < 32 ? 1u << Bit : 0;
}

/// What the cameras of the capture are and see. The last of them are video cameras, which see no markers.
///
/// A centroid is the exact image of a marker's true place; discs that touch are one centroid, which belongs to the
/// nearest of their markers. Masked cells, a body in between and faults hide markers.
class VSimulatedCameras
{
public:
  /// Keeps the options.
  explicit VSimulatedCameras( const VSimulatedCaptureOptions& i_rOptions );

  /// What holds for every frame.
  void AddSlowItems( VItemMaker& io_rMaker, std::vector< ZEK::VFlowItemRef >& io_rSlow ) const;
  /// What each camera sees of the markers. Counts the rays of the reconstructions.
  void AddFrame( const std::vector< VStageMarker >& i_rMarkers, VItemMaker& io_rMaker, ZEK::IFlowState& io_rState,
                 CoreMoxelTypes::VReconstructionSet& io_rPoints );

  /// Video frames come at a rate of their own: between two of them the item stays.
  void AddVideo( const VMarkerStage& i_rStage, double i_Seconds, VItemMaker& io_rMaker, ZEK::IFlowState& io_rState );

  /// What the cameras' own sensors read. The item stays while the reading does.
  void AddSensors( double i_Seconds, VItemMaker& io_rMaker, ZEK::IFlowState& io_rState );

private:
  struct VCamera
  {
    std::string Name;
    CoreMoxelTypes::VCameraHardware Hardware;
    CoreMoxelTypes::VCameraCalibration Calibration;
    VSensorView View;
    std::uint32_t Faults = 0;
    bool bVideo = false;
    bool bEdges = false;
    std::vector< CoreMoxelTypes::u8 > Mask;
    ZEK::VFlowItemRef Video; ///< the frame last made
    ZEK::VFlowItemRef Sensor = {};
    std::int32_t Tenths = 0; ///< of a degree, in that item
  };
  /// The items of one camera in one frame.
  struct VFrameSets;

  VHash HealthHash( std::size_t i_Camera ) const;
  void MakeMask( VCamera& io_rCamera ) const;
  void AddHealth( const VCamera& i_rCamera, std::size_t i_Index, VItemMaker& io_rMaker,
                  std::vector< ZEK::VFlowItemRef >& io_rSlow ) const;
  void See( const VCamera& i_rCamera, const std::vector< VStageMarker >& i_rMarkers );
  void Group();
  void AddCentroid( const VCamera& i_rCamera, std::uint32_t i_First, const std::vector< VStageMarker >& i_rMarkers,
                    VFrameSets& io_rSets, CoreMoxelTypes::VReconstructionSet& io_rPoints );

  const VSimulatedCaptureOptions& m_rOptions;
  std::vector< VCamera > m_Cameras;
  std::vector< VDisc > m_Discs;                           ///< of the camera being looked through, by row
  std::vector< std::uint32_t > m_Parents, m_Next, m_Last; ///< by disc
  std::vector< VDisc > m_Members;                         ///< of the centroid being made
  VDiscPainter m_Painter;
  std::int64_t m_VideoNumber = -1; ///< of the frames last made
  std::vector< VStageMarker > m_VideoMarkers;
  VVideoPainter m_VideoPainter;
};

} // namespace HostSources::Simulation
