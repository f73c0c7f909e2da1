#pragma once

#include <array>
#include <filesystem>
#include <map>
#include <string>
#include <vector>

// As much of a musculoskeletal model and of its tables as kinematics needs. Lengths in metres, angles in rad.
namespace OsimModel
{

using VVector = std::array< double, 3 >;

struct VFrame
{
  std::string Body; ///< "ground" for the world
  VVector Translation{};
  VVector Orientation{}; ///< about x, then the turned y, then the turned z
};

struct VAxis
{
  std::string Coordinate; ///< empty for none
  VVector Direction{};
  double Slope = 1; ///< of the value by its coordinate
};

struct VJoint
{
  std::string Kind, Name, ParentFrame, ChildFrame;
  std::vector< std::string > Coordinates;
  std::map< std::string, VFrame > Frames;
  std::vector< VAxis > Axes; ///< three turns in order, then three shifts
};

std::vector< VJoint > ReadJoints( const std::filesystem::path& i_rFile );

/// Columns by name.
using VTable = std::map< std::string, std::vector< double > >;
VTable ReadMotion( const std::filesystem::path& i_rFile );
VTable ReadSegments( const std::filesystem::path& i_rFile );

} // namespace OsimModel
