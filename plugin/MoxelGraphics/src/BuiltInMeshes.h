#pragma once

#include <CoreGraphics/VMesh.h>

#include <cstdint>

namespace MoxelGraphics
{

/// Faces of a box, for those that want some left out.
enum EBoxFace : std::uint32_t
{
  EBoxLowX = 1,
  EBoxHighX = 2,
  EBoxLowY = 4,
  EBoxHighY = 8,
  EBoxLowZ = 16,
  EBoxHighZ = 32,
  EBoxAll = 63
};

// All are counter-clockwise from outside and hold position, normal and white as their colour.

/// The cube of side 1 about the origin.
CoreGraphics::VMesh MakeBoxMesh( std::uint32_t i_Faces = EBoxAll );
/// The twelve edges of that cube, for GL_LINES.
CoreGraphics::VMesh MakeBoxEdges();
/// From the origin to z = 1, with a shaft of radius 1 and a wider head.
CoreGraphics::VMesh MakeArrowMesh();

} // namespace MoxelGraphics
