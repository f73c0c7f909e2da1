#pragma once

#include <CoreGraphics/VMesh.h>

#include <cstdint>

namespace MoxelGraphics
{

/// The body of a camera for the program `Camera`, which makes of the unit cylinder about z a body of 40 mm radius and
/// 100 mm length that ends at the lens: a housing with bevelled edges, a ring of strobes, a sunk lens.
CoreGraphics::VMesh MakeCameraMesh();

/// Lines that stand for one object each, to be drawn many times; two vertices a line.
struct VLineVertex
{
  float Position[3];
  std::uint32_t Colour = 0xFFFFFFFF; ///< 0xAABBGGRR
};
const CoreGraphics::VVertexLayout& LineLayout();

/// Of the frustum whose tip is the origin and whose far face is z = 1, x and y from -1 to 1: its edges, and its faces
/// as triangles.
std::vector< VLineVertex > FrustumLines( std::uint32_t i_Colour );
std::vector< VLineVertex > FrustumFaces();
/// Three axes, red, green and blue, of that length.
std::vector< VLineVertex > AxisLines( float i_Length );

} // namespace MoxelGraphics
