#pragma once

#include <HarrowPluginInterface/VMeshScene.h>

struct aiMesh;

namespace HostMeshes
{

/// Broken things that were left out of a surface.
struct VSurfaceFaults
{
  std::size_t Vertices = 0, Triangles = 0;
};

/// Fills everything of a surface but its bones and material. `i_rWorld` takes the vertices into the space of the file.
/// `io_rSurface` brings its influences, if it has any. False when no triangle is left.
bool FillSurface( const aiMesh& i_rMesh, const HarrowPluginInterface::VMeshTransform& i_rWorld,
                  HarrowPluginInterface::VMeshSurface& io_rSurface, VSurfaceFaults& io_rFaults );

} // namespace HostMeshes
