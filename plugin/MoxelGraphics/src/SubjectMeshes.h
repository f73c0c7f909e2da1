#pragma once

#include <CoreGraphics/VMesh.h>

#include <memory>

namespace HarrowPluginInterface
{
struct VMeshScene;
}

namespace MoxelGraphics
{

// All are counter-clockwise from outside.

/// A bone: a square bipyramid from the origin to x = 1 with its waist at 0.15. Position, normal, texture place.
CoreGraphics::VMesh MakeBoneMesh();
/// The same from a file, as it stands there; null when it holds no triangle.
std::unique_ptr< CoreGraphics::VMesh > MakeBoneMesh( const HarrowPluginInterface::VMeshScene& i_rScene );
/// Arrows of length 1 along x, y and z, red, green and blue. Position, normal, colour.
CoreGraphics::VMesh MakeAxesMesh();
/// A closed cylinder of radius 1 from z = 0 to 1. Positions alone.
CoreGraphics::VMesh MakeStickMesh();
/// Its axis alone.
CoreGraphics::VMesh MakeStickLine();
/// Reads a sphere's places as its normals, too.
const CoreGraphics::VVertexLayout& SphereNormalLayout();

} // namespace MoxelGraphics
