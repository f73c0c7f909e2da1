#pragma once

namespace HostServices
{
class VHost;
}

namespace HostQml
{

/// Registers the QML modules `Moxel.Playback`, `Moxel.Selection` and `Moxel.Graphics`, once in the process, and binds
/// the host's services to its engine. Must precede the loading of any document. Thread: GUI.
void RegisterModules( HostServices::VHost& i_rHost );

} // namespace HostQml
