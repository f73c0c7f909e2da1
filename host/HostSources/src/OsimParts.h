#pragma once

// What the parts of the model's reader share.

#include "OsimModel.h"

#include <string>
#include <string_view>
#include <unordered_map>

namespace HostSources::Osim
{

using VIndices = std::unordered_map< std::string, std::uint32_t >;

/// A joint before its bodies are in order.
struct VJointText
{
  VJoint Joint;
  std::string Name, Parent, Child; ///< bodies; `GroundName` for the world
};
inline constexpr std::string_view GroundName = "ground";

/// `"text"`, fit for messages.
std::string Quoted( std::string_view i_Text );
/// The last part of a path such as /bodyset/pelvis.
std::string LastPart( std::string_view i_Path );
/// Three numbers; zeros where the element is not there.
VVector ReadVector( Xml::VNode i_pElement, const std::string& i_rWhat );
/// Throws for one that is not there.
std::uint32_t IndexOf( const VIndices& i_rIndices, std::string_view i_Name, const std::string& i_rWhat );

/// Adds the joint's coordinates to those of the model; `i_rBodies` tells bodies from frames.
VJointText ReadJoint( Xml::VNode i_pJoint, const VIndices& i_rBodies, VModel& io_rModel, VIndices& io_rCoordinates );

} // namespace HostSources::Osim
