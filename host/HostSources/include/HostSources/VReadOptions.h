#pragma once

#include <filesystem>
#include <string>

namespace HostSources
{

/// What a person says of recordings that they do not say of themselves.
struct VReadOptions
{
  /// How the axes of a folder's 3D points become those of its cameras' world: three letters, each with a sign or
  /// without, such as "zxy" for world (x, y, z) = points' (z, x, y), or "x-zy". Empty: the turn by quarters of which
  /// the projected points lie nearest to the detections.
  std::string WorldAxes;
  /// The model (.osim) whose joints a motion file (.mot) moves. Empty: the one that lies beside it.
  std::filesystem::path Model;
};

} // namespace HostSources
