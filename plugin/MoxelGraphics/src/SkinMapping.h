#pragma once

#include <MoxelGraphics/MeshPose.h>
#include <MoxelGraphics/VSubjectGroup.h>

#include <HarrowPluginInterface/VMeshScene.h>

#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace MoxelGraphics
{

/// How a bone of a mesh finds its pose.
struct VSkinBone
{
  static constexpr std::int32_t None = -1;

  std::int32_t Pose = None;   ///< in the list of poses
  std::int32_t Parent = None; ///< the bone of the mesh that it moves with while it has none
  VBonePose Bind{};           ///< from the space of the mesh, in its units, to the bone's, in mm
};

/// The name by which bones are compared: lower case, without a namespace.
std::string PlainBoneName( std::string_view i_Name );

/// A bone goes by the pose of its name or, where there is none of it, by that of its nearest parent that has one. Poses
/// have no size of their own: the mesh keeps its own, times the scale. Empty when no name is found.
std::vector< VSkinBone > MapBonesByName( const HarrowPluginInterface::VMeshScene& i_rMesh,
                                         std::span< const std::string > i_PoseNames, double i_Scale );
/// The same for poses that are listed by bone of the mesh.
std::vector< VSkinBone > MapBonesByIndex( const HarrowPluginInterface::VMeshScene& i_rMesh, double i_Scale );

/// One matrix a bone of the mesh. A bone whose pose is not there, or not finite, moves with its parent. False when
/// there is no pose at all. A health that is not given is 1.
bool PoseSkin( std::span< const VSkinBone > i_Bones, std::span< const VBonePose > i_Poses,
               std::span< const float > i_Health, std::vector< VSkinMatrix >& o_rMatrices );

} // namespace MoxelGraphics
