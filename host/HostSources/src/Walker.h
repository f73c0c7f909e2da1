#pragma once

#include "SimulationMath.h"

#include <array>
#include <cstddef>
#include <span>

namespace HostSources::Simulation
{

inline constexpr std::size_t WalkerMarkers = 53;

/// How one person walks: in a circle about the middle of the floor. Lengths in mm.
struct VWalkerStyle
{
  double Radius = 2000;
  double Start = 0;      ///< place on the circle at 0 s, rad
  double Direction = 1;  ///< 1 against the clock, -1 with it
  double Speed = 1050;   ///< mm/s
  double Cadence = 0.92; ///< strides (two steps) a second
  double Phase = 0;      ///< of the stride at 0 s, 0 to 1
  double Scale = 1;      ///< 1 is 1.75 m tall
  double MassKg = 75;
};

/// What the floor feels of one foot.
struct VFootLoad
{
  bool bDown = false;
  D3 Centre; ///< of pressure, on the floor
  D3 Force;  ///< on the body, N
};

struct VWalkerPose
{
  std::array< D3, WalkerMarkers > Markers;
  std::array< VFootLoad, 2 > Feet; ///< left, right
};

const std::array< const char*, WalkerMarkers >& WalkerMarkerNames();

/// Pairs of markers to join by a stick.
std::span< const std::array< std::uint32_t, 2 > > WalkerSticks();

/// Thread: any.
void PoseWalker( const VWalkerStyle& i_rStyle, double i_Seconds, VWalkerPose& o_rPose );
/// The feet alone, for the plates, which feel many times a frame.
void LoadFeet( const VWalkerStyle& i_rStyle, double i_Seconds, std::array< VFootLoad, 2 >& o_rFeet );

} // namespace HostSources::Simulation
