#pragma once

#include "Walker.h"

#include <HostSources/VSimulatedCapture.h>

#include <CoreMoxelTypes/FlowTypes.h>

#include <array>
#include <cstddef>
#include <vector>

namespace HostSources::Simulation
{

inline constexpr std::size_t Plates = 2;
inline constexpr double FloorHalf = 3000; ///< mm

VWalkerStyle PerformerStyle( const VSimulatedCaptureOptions& i_rOptions, std::uint32_t i_Performer );
/// The limbs as the style's scale says, the breadth of each a little their own.
VBodyShape PerformerShape( const VSimulatedCaptureOptions& i_rOptions, std::uint32_t i_Performer );

void FillCamera( std::uint32_t i_Camera, std::uint32_t i_Count, double i_RateHz,
                 CoreMoxelTypes::VCameraHardware& o_rHardware, CoreMoxelTypes::VCameraCalibration& o_rCalibration );
void FillPlate( std::size_t i_Plate, CoreMoxelTypes::VDevice& o_rDevice );

/// What the parameters of the reconstruction say: people and objects, and no more.
void FillVolume( CoreMoxelTypes::VParametersItem& o_rParameters );

/// What one plate feels of all feet at one time: force, moment about the middle of its surface, centre of pressure.
std::array< float, 9 > PlateWrench( std::size_t i_Plate, const std::vector< VFootLoad >& i_rLoads );

} // namespace HostSources::Simulation
