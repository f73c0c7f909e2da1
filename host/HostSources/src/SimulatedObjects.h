#pragma once

#include "Walker.h"

#include <CoreMoxelTypes/Subject.h>

#include <array>
#include <span>
#include <string>

namespace HostSources::Simulation
{

inline constexpr std::size_t PropMarkers = 5, WandMarkers = 5, ObjectMarkers = PropMarkers + WandMarkers;

/// Numbers of what labels speak of: the performers from 1 on, then the prop, then the wand.
constexpr std::uint32_t PerformerId( std::uint32_t i_Performer )
{
  return i_Performer + 1;
}
constexpr std::uint32_t PropId( std::uint32_t i_Performers )
{
  return i_Performers + 1;
}
constexpr std::uint32_t WandId( std::uint32_t i_Performers )
{
  return i_Performers + 2;
}
/// Of the character that a performer drives.
constexpr std::uint32_t CharacterId( std::uint32_t i_Performers, std::uint32_t i_Performer )
{
  return i_Performers + 3 + i_Performer;
}

std::string PerformerName( std::uint32_t i_Performer );
std::uint32_t PerformerColour( std::uint32_t i_Performer );
std::uint32_t Mixed( std::uint32_t i_Colour, std::uint32_t i_Towards, double i_Share );

/// The colours of a body and its sticks: left lighter, right darker, so that it can be seen which way it faces.
void FillColours( const CoreMoxelTypes::VSubject& i_rSubject, std::uint32_t i_Colour,
                  CoreMoxelTypes::VSubjectApplicationData& o_rData );

/// The prop turns on its stand, the wand is waved, both in corners that nobody crosses.
VFrame PropAt( double i_Seconds );
VFrame WandAt( double i_Seconds );
/// Where their markers are.
void PoseObjects( double i_Seconds, std::array< D3, ObjectMarkers >& o_rMarkers );

/// One free bone.
void FillProp( CoreMoxelTypes::VSubject& o_rProp, CoreMoxelTypes::VSubjectApplicationData& o_rData );
void FillWand( CoreMoxelTypes::VRigidObject& o_rWand, CoreMoxelTypes::VRigidObjectApplicationData& o_rData );

} // namespace HostSources::Simulation
