#pragma once

// What the feeds of subjects hand to the render types of subjects: all subjects of one kind (labelled subjects, props,
// rigid objects, solved and retargeted subjects, scene meshes) in flat lists, so that a group is one buffer and one
// draw a kind of object, however many subjects it holds. A record says which stretch of each list is its subject's.
//
// Structure changes when a subject comes, goes or is edited; motion with every frame; ids and flags with every update.
// Each has its generation: whoever draws keeps the one that it drew last, and derives what it needs from the lists only
// when its kind is shown and the generation moved. Lists keep their capacity.
//
// Thread: render thread.

#include <MoxelGraphics/VSelectionRegistry.h>

#include <array>
#include <cstdint>
#include <limits>
#include <string>
#include <vector>

namespace MoxelGraphics
{

struct VSubjectRange
{
  std::uint32_t First = 0, Count = 0;
};

/// The pose of a bone in the world: the upper three rows of its matrix, row by row, translation in mm. An entry that
/// is not finite: the bone has no pose and is not drawn.
using VBonePose = std::array< float, 12 >;

struct VSubjectStick
{
  std::uint32_t A = 0, B = 0; ///< markers, by their place in the group
  std::uint32_t ColourA = 0xFFFFFFFF, ColourB = 0xFFFFFFFF;
};

struct VSubjectBone
{
  std::int32_t Parent = -1;          ///< by its place in the group; -1 for a root
  std::uint32_t Colour = 0xFFFFFFFF; ///< 0xAABBGGRR
  float Length = 0;                  ///< mm along x; 0: nothing but a joint
};

/// Where the model has a marker on a bone.
struct VSubjectTarget
{
  std::uint32_t Bone = 0;   ///< by its place in the group
  std::uint32_t Marker = 0; ///< by its place in the group
  std::array< float, 3 > Local{};
  std::array< float, 9 > Covariance{}; ///< mm², in the axes of the bone; zeros: none
};

/// A wire from the start of a bone to a marker that moves with it.
struct VSubjectWire
{
  std::uint32_t Bone = 0, Marker = 0; ///< by their places in the group
};

/// The mesh that a subject wears. It is asked of the scene's mesh cache by whoever draws it.
struct VSubjectMesh
{
  std::string Category; ///< "Subject", "Prop" or "SceneMesh"
  std::string Name;     ///< empty: none
  float Scale = 1;
  double AnimationTime = 0;       ///< s, for meshes that bring their own animation; changes with motion
  std::vector< VBonePose > Bones; ///< poses by bone of the mesh, for meshes that are posed that way; else empty
  bool bByRoot = false;           ///< not skinned: the whole stands at the record's `Root`
};

struct VSubjectRecord
{
  ZEK::VSelectionItem Item;
  std::string Name;
  std::uint32_t Colour = 0xFFFFFFFF; ///< 0xAABBGGRR
  VSubjectRange Markers, Sticks, Bones, Targets, Wires;
  VSubjectMesh Mesh;

  // Motion.
  VBonePose Root{ 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0 }; ///< where the subject's origin stands; may be not finite
  // Ids and flags.
  std::uint32_t Id = 0;   ///< the selection id of its skin
  std::uint8_t Flags = 0; ///< EInstanceFlag bits: its word from EIdSelected up, shifted down by 21
};

/// The ids of one kind of object in an update: object i has First + i, none with 0. `Flags` is empty when nothing is
/// marked, else it holds EInstanceFlag bits for each object.
struct VSubjectIds
{
  std::uint32_t First = 0;
  std::vector< std::uint8_t > Flags;
  std::uint64_t Generation = 0; ///< grows when `First` or `Flags` became others
};

struct VSubjectGroup
{
  static constexpr float None = std::numeric_limits< float >::quiet_NaN();

  std::vector< VSubjectRecord > Records;

  // Structure.
  std::vector< std::uint32_t > MarkerColours; ///< one a marker, 0xAABBGGRR
  std::vector< std::string > MarkerNames;     ///< one a marker
  std::vector< VSubjectStick > Sticks;
  std::vector< VSubjectBone > Bones;
  std::vector< std::string > BoneNames; ///< one a bone
  std::vector< VSubjectTarget > Targets;
  std::vector< VSubjectWire > Wires;
  std::uint64_t StructureGeneration = 1;

  // Motion.
  std::vector< VScenePoint > Markers; ///< where each marker was seen; not finite: it was not
  std::vector< VScenePoint > Solved;  ///< where the model has each marker; not finite: nowhere. As many as `Markers`
  std::uint64_t MarkerGeneration = 1; ///< of `Markers` and `Solved`
  std::vector< VBonePose > Poses;     ///< one a bone
  std::vector< float > Health;        ///< one a bone, 0 to 1
  std::uint64_t PoseGeneration = 1;   ///< of `Poses`, `Health` and what records hold of motion

  // Ids and flags.
  VSubjectIds MarkerIds; ///< also of targets and missing markers, each by its marker
  VSubjectIds StickIds;
  VSubjectIds BoneIds;                ///< also of joints and axes, each by its bone
  std::uint64_t RecordGeneration = 1; ///< grows when `Id` or `Flags` of a record became others

  bool IsEmpty() const { return Records.empty(); }
};

} // namespace MoxelGraphics
