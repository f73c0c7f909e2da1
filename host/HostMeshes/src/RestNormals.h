#pragma once

#include <HarrowPluginInterface/VMeshScene.h>

#include <span>

namespace HostMeshes
{

/// Some writers put positions down as they are bound and normals as they are at rest. Takes the normals of a skinned
/// surface back into the bind pose when they suit its faces better at rest than there. `i_Rest` are the places of the
/// nodes at rest.
void BindRestNormals( const HarrowPluginInterface::VMeshScene& i_rMesh,
                      std::span< const HarrowPluginInterface::VMeshTransform > i_Rest,
                      HarrowPluginInterface::VMeshSurface& io_rSurface );

} // namespace HostMeshes
