#pragma once

// Devices (name selector 2), environment and parameters (selector 1 is the target).
// The number beside a structure is the tag of its items.

#include <CoreMoxelTypes/Basic.h>

namespace CoreMoxelTypes
{

/// 0x1023
struct VDevice
{
  std::string Name;
  enum EKind : u32
  {
    Other,
    ForcePlate,
    Emg
  } Kind = {};
  D3 Corners[4]; ///< mm, world
  D3 Origin;     ///< mm, plate frame
  f32 Thickness = 50;
};

/// 0x1024
struct VDeviceApplicationData
{
  u32 Colour = 0;
};

/// 0x1025
struct VDeviceSamples
{
  f32 RateHz = 0;
  u32 First = 0;
  std::vector< std::array< f32, 9 > >
      Wrench; ///< force Fx Fy Fz N and moment Mx My Mz N mm on the body, CoP x y z mm; all in world axes
};

/// 0x1031
struct VVolumeProperties
{
  i32 XMin = 0, YMin = 0, XMax = 0, YMax = 0;
  f32 MajorSpacing = 0; ///< 0 = default 1000
  i32 Subdivision = 0;
};

/// 0x1029
struct VWorldAxis
{
  u32 Up = 0;
};

/// 0x1 (selector 1 = Target)
struct VParametersItem
{
  std::string Target;
  std::map< std::string, VVariant > Values;
};

/// 0x1018 (selector 2)
struct VGeometrySet
{
  std::vector< V3 > Points;
  std::vector< std::string > PointNames;
  std::vector< u32 > Lines, Triangles;
  u32 Colour = 0;
};

struct VSceneMesh
{
  std::string File;
  u32 Id = 0;
};

/// 0x1050 0x1052
struct VSceneMeshDynamicParameters
{
  Rigid Pose;
  std::vector< Rigid > Bones;
  f64 AnimationTime = 0;
};

struct VSceneMeshApplicationData
{
  u32 Colour = 0;
};

/// 0x1051 0x1054
struct VSceneMeshSettings
{
  bool Enabled = true;
  f32 Scale = 1;
};

} // namespace CoreMoxelTypes
