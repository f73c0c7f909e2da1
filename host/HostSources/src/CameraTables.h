#pragma once

// What the readers of camera calibrations do alike.

#include <HostSources/CameraCalibrations.h>

#include <string>
#include <string_view>

namespace HostSources
{

/// The greatest side of a sensor that is believed, px.
inline constexpr double LargestSensor = 65535;

/// Leaves a note that a camera lacks a calibration, or is not there.
void NoteUncalibrated( const std::string& i_rName, const std::string& i_rReason,
                       VCameraCalibrations& io_rCalibrations );
void NoteLeftOut( const std::string& i_rName, const std::string& i_rReason, VCameraCalibrations& io_rCalibrations );

/// False, with what is wrong, for a text that is no calibration of the kind.
bool ReadCameraToml( std::string_view i_Text, VCameraCalibrations& o_rCalibrations, std::string& o_rMessage );
bool ReadCameraJson( std::string_view i_Text, VCameraCalibrations& o_rCalibrations, std::string& o_rMessage );

} // namespace HostSources
