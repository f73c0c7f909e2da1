#pragma once

#include "C3dParameters.h"

#include <HostSources/VRecording.h>

namespace HostSources::C3d
{

/// Reads FORCE_PLATFORM and works out what each plate felt from the analog channels and the up axis that the recording
/// has by now.
void ReadForcePlates( const VParameters& i_rParameters, VRecording& io_rRecording );

} // namespace HostSources::C3d
