#pragma once

#include <HostSources/VRecording.h>

#include <span>
#include <string>

namespace HostSources
{

/// Widens the bounds by the valid ones of the points.
void AddToBounds( VRecordingBounds& io_rBounds, std::span< const VRecordingPoint > i_Points );

/// Sets the up axis by the data: z, unless y is the axis whose smallest value lies nearest the floor and whose range
/// is largest.
void ChooseUpAxisByData( VRecording& io_rRecording, const std::string& i_rWhy );

/// Sets the up axis by the axes that point right and up on a screen, such as "+Y" and "+Z".
void ChooseUpAxisByScreen( VRecording& io_rRecording, const std::string& i_rX, const std::string& i_rY );

} // namespace HostSources
