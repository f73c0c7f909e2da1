#pragma once

#include "Walker.h"

#include <HostSources/VSimulatedCapture.h>

#include <CoreMoxelTypes/FlowTypes.h>

#include <array>
#include <cstddef>
#include <string>
#include <vector>

namespace HostSources::Simulation
{

inline constexpr std::size_t Plates = 2;
inline constexpr std::size_t ObjectMarkers = 10; ///< five of the prop, five of the wand
inline constexpr double FloorHalf = 3000;        ///< mm

std::string PerformerName( std::uint32_t i_Performer );
std::uint32_t PerformerColour( std::uint32_t i_Performer );
VWalkerStyle PerformerStyle( const VSimulatedCaptureOptions& i_rOptions, std::uint32_t i_Performer );

void FillCamera( std::uint32_t i_Camera, std::uint32_t i_Count, double i_RateHz,
                 CoreMoxelTypes::VCameraHardware& o_rHardware, CoreMoxelTypes::VCameraCalibration& o_rCalibration );
void FillSubject( std::uint32_t i_Performer, CoreMoxelTypes::VSubject& o_rSubject );
void FillColours( std::uint32_t i_Performer, CoreMoxelTypes::VSubjectApplicationData& o_rData );
void FillPlate( std::size_t i_Plate, CoreMoxelTypes::VDevice& o_rDevice );

/// What the parameters of the reconstruction say: people and objects, and no more.
void FillVolume( CoreMoxelTypes::VParametersItem& o_rParameters );

/// The prop turns on its stand, the wand is waved, both in corners that nobody crosses.
void PoseObjects( double i_Seconds, std::array< D3, ObjectMarkers >& o_rMarkers );

/// What one plate feels of all feet at one time: force, moment about the middle of its surface, centre of pressure.
std::array< float, 9 > PlateWrench( std::size_t i_Plate, const std::vector< VFootLoad >& i_rLoads );

} // namespace HostSources::Simulation
