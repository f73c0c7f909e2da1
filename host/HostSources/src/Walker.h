#pragma once

#include "WalkerBody.h"

#include <string>

namespace HostSources::Simulation
{

/// How one person walks: in a circle about the middle of the floor. Lengths in mm.
struct VWalkerStyle
{
  double Radius = 2000;
  double Start = 0;      ///< place on the circle at 0 s, rad
  double Direction = 1;  ///< 1 against the clock, -1 with it
  double Speed = 1050;   ///< mm/s
  double Cadence = 0.92; ///< strides (two steps) a second
  double Phase = 0;      ///< of the stride at 0 s, 0 to 1
  double Scale = 1;      ///< of the body
  double MassKg = 75;
};

/// What the floor feels of one foot.
struct VFootLoad
{
  bool bDown = false;
  D3 Centre; ///< of pressure, on the floor
  D3 Force;  ///< on the body, N
};

/// One foot in its stride.
struct VWalkerFoot
{
  VFrame Frame; ///< at the ball, on the sole, pitched
  D3 Place;     ///< of the ball, were the sole flat on the floor
  double Stride = 0;
  double Toes = 0; ///< how far they are bent up, rad
};

struct VWalkerPose
{
  VWalkerState State;
  std::array< ComputeSubject::VRigidTransform, EBones > Segments; ///< in the world
  std::array< D3, WalkerMarkers > Solved;                         ///< where the bones have the markers
  std::array< D3, WalkerMarkers > Markers;                        ///< where they are, on skin that moves
};

inline D3 Placed( const ComputeSubject::VRigidTransform& i_rPose, const D3& i_rLocal )
{
  const double Local[3] = { i_rLocal.x, i_rLocal.y, i_rLocal.z };
  double World[3];
  i_rPose.Place( Local, World );
  return { World[0], World[1], World[2] };
}

/// The body's place over the floor when it has walked for that long.
VFrame PathAt( const VWalkerStyle& i_rStyle, double i_Seconds );
/// `i_Side` is 1 for the left one, -1 for the right one.
VWalkerFoot FootAt( const VWalkerStyle& i_rStyle, double i_Seconds, int i_Side );

/// Thread: any. The body's legs are as the style's scale says.
void PoseWalker( const VWalkerStyle& i_rStyle, const VWalkerBody& i_rBody, double i_Seconds, VWalkerPose& o_rPose );
/// The feet alone, for the plates, which feel many times a frame.
void LoadFeet( const VWalkerStyle& i_rStyle, double i_Seconds, std::array< VFootLoad, 2 >& o_rFeet );

/// A pose to look at, where the body stands on the origin and looks along x.
struct VNamedPose
{
  std::string Name;
  VWalkerState State;
};
/// The first is "Neutral", zeros.
std::vector< VNamedPose > NamedPoses( const VWalkerBody& i_rBody );
/// Arms and legs away from each other and from the trunk, feet flat on the floor.
VWalkerState SpreadState( const VWalkerBody& i_rBody );

} // namespace HostSources::Simulation
