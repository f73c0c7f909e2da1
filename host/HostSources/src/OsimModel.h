#pragma once

// An articulated body model as its file has it. Lengths in metres, angles in rad.

#include "OsimFunction.h"
#include "SkeletonMath.h"

#include <HostSources/IFrameSource.h>

#include <array>
#include <cstdint>
#include <string>
#include <vector>

namespace HostSources::Osim
{

struct VCoordinate
{
  std::string Name;
  double Default = 0;
  bool bAngle = false; ///< motion files may give it in degrees
};

/// One of three turns or three shifts; none without a function.
struct VAxis
{
  VVector Direction{}; ///< of length 1
  std::vector< std::uint32_t > Coordinates;
  VFunction Function; ///< zero unless it was read
};

/// What places a body by its parent: the turns one after the other, the shifts in the parent's frame.
struct VJoint
{
  CoreMoxelTypes::Rigid ParentFrame, ChildFrame; ///< in the bodies
  std::array< VAxis, 6 > Axes;                   ///< three turns, three shifts
};

struct VBody
{
  std::string Name;
  std::int32_t Parent = -1; ///< -1: the ground
  VVector MassCentre{};
  VJoint Joint;
};

/// A coordinate that follows others, whatever a motion file says of it.
struct VCoupler
{
  std::uint32_t Dependent = 0;
  std::vector< std::uint32_t > Independents;
  VFunction Function;
  double Scale = 1;
};

struct VMarker
{
  std::string Name;
  std::uint32_t Body = 0;
  VVector Place{};
};

struct VModel
{
  std::string Name;
  std::vector< VBody > Bodies; ///< parents first
  std::vector< VCoordinate > Coordinates;
  std::vector< VCoupler > Couplers; ///< each behind those that it depends on
  std::vector< VMarker > Markers;
  EUpAxis UpAxis = EUpAxis::Y;
  std::string UpAxisReason;
  std::vector< std::string > Notes;
};

/// Throws `VReadFault`.
VModel ReadModel( std::span< const std::byte > i_Bytes );

} // namespace HostSources::Osim
