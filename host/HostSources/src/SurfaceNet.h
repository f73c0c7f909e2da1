#pragma once

#include "VectorMath.h"

#include <array>
#include <cstdint>
#include <functional>
#include <vector>

namespace HostSources::Simulation
{

struct VSurface
{
  std::vector< D3 > Positions, Normals;
  std::vector< std::uint32_t > Triangles; ///< counter-clockwise from outside
};

/// The closed surface where a field is 0; the field is positive outside, about the distance near it, and positive
/// everywhere on the faces of the box. One vertex in each cell of the grid that the surface passes through.
VSurface SurfaceOf( const std::function< double( const D3& ) >& i_rField, const D3& i_rLeast, const D3& i_rMost,
                    double i_Cell );

} // namespace HostSources::Simulation
