#pragma once

// Subjects, props and rigid objects. Items carry the object name under selector 3.
// The number beside a structure is the tag of its items.

#include <CoreMoxelTypes/Basic.h>

namespace CoreMoxelTypes
{

enum class EJointType : u32
{
  Free,
  Ball,
  HardySpicer,
  Hinge,
  Slider,
  Dummy
};
struct VSegment
{
  std::string Name;
  i32 Parent = -1; ///< index, -1 for a root
  EJointType Joint = EJointType::Free;
  Rigid Pre, Post;
  f32 BoneLength = 0; ///< mm, along x
};

struct VMarker
{
  u32 Id = 0;
  std::string Name;
  i32 Segment = -1;
  D3 Local; ///< mm
  f32 Radius = 0;
  f64 Covariance[9]{}; ///< mm^2
};

/// 0x1012 0x101b 0x1038
struct VSubject
{
  u32 Id = 0;
  std::string Name;
  std::vector< VSegment > Segments;
  std::vector< VMarker > Markers;
  std::vector< std::pair< u32, u32 > > Clusters;
};

struct VStick
{
  u32 A = 0, B = 0; ///< marker numbers
  u32 ColourA = 0, ColourB = 0;
};

/// 0x1013 0x101c 0x1039
struct VSubjectApplicationData
{
  std::vector< u32 > MarkerColours; ///< one per marker or the subject is left out
  std::vector< u32 > SegmentColours;
  std::vector< VStick > Sticks;
  std::string Skin;
};

/// 0x1011 0x101d 0x103a
struct VSubjectDynamicParameters
{
  std::vector< f64 > JointState;
  std::vector< Rigid > Segments;     ///< world; optional
  std::vector< D3 > MarkerPositions; ///< solved; NaN none
  std::vector< u8 > MarkerVisible;
  std::vector< f32 > SegmentHealth; ///< 0..1
  f32 Error = 0;
};

/// 0x101a 0x102c
struct VSubjectParametrised
{
  VSubject Base;
  std::vector< std::vector< f64 > > Poses; ///< joint states
  std::vector< std::string > PoseNames;
  std::map< std::string, f64 > Parameters;
};

/// 0x1027
struct VSubjectSettings
{
  enum EKind : u32
  {
    Subject,
    Prop
  } Kind = {};
  bool Enabled = true, Tracked = true;
  u32 Colour = 0;
  std::map< std::string, VVariant > Values;
};

/// 0x102a 0x1030 0x103c
struct VSubjectTemplate
{
  VSubject Base;
};

/// 0x1033 0x1040
struct VLabelledRotationSet
{
  struct R
  {
    u32 SubjectId = 0, SegmentIndex = 0;
    f64 Rotation[4]{};
  };
  std::vector< R > Items;
};

/// 0x1035
struct VRigidObject
{
  u32 Id = 0;
  std::string Name;
  std::vector< VMarker > Markers;
  Rigid Origin;
};

/// 0x1036
struct VRigidObjectApplicationData
{
  u32 Colour = 0;
  std::vector< u32 > MarkerColours;
  std::vector< VStick > Sticks;
  std::string Mesh;
};

/// 0x1034
struct VRigidObjectDynamicParameters
{
  Rigid Pose;
  bool Tracked = false;
  std::vector< u8 > MarkerVisible;
  f32 Error = 0;
};

/// 0x1044
struct VSmartObject
{
  std::vector< u32 > MemberIds;
  bool Modified = false;
};

} // namespace CoreMoxelTypes
