#pragma once

#include <HostMeshes/VMeshCache.h>
#include <HostSources/VSimulatedCapture.h>

namespace HostWindow
{

/// Gives the cache the bodies that a simulated capture's subjects ask for.
void AddPerformerMeshes( const HostSources::VSimulatedCaptureOptions& i_rOptions, HostMeshes::VMeshCache& io_rCache );

} // namespace HostWindow
