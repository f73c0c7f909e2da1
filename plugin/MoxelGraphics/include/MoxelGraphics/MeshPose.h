#pragma once

#include <HarrowPluginInterface/VMeshScene.h>

#include <array>
#include <cstddef>
#include <span>
#include <vector>

namespace MoxelGraphics
{

/// How a bone moves vertices: a matrix, column by column, whose last element is not 1 but the bone's health, 0 to 1.
using VSkinMatrix = std::array< float, 16 >;

struct VSkinVertex
{
  std::array< float, 3 > Position{};
  std::array< float, 3 > Normal{}; ///< not of unit length
};

VSkinMatrix ToSkinMatrix( const HarrowPluginInterface::VMeshTransform& i_rTransform, float i_Health = 1 );

/// Where the nodes of a mesh stand in its own space, so many seconds into an animation; as at rest where that moves
/// nothing, or there is none of that number. The list keeps its capacity.
void PoseNodes( const HarrowPluginInterface::VMeshScene& i_rMesh, std::size_t i_Animation, double i_Seconds,
                std::vector< HarrowPluginInterface::VMeshTransform >& o_rWorlds );

/// Moves the vertices of a surface, one matrix a bone of the mesh. As many are written as the surface has.
void SkinSurface( const HarrowPluginInterface::VMeshSurface& i_rSurface, std::span< const VSkinMatrix > i_Bones,
                  VSkinVertex* o_pVertices );

} // namespace MoxelGraphics
