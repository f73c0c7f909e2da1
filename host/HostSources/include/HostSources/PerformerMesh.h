#pragma once

#include <CoreMoxelTypes/Basic.h>

#include <array>
#include <cstdint>
#include <string>
#include <vector>

namespace HostSources
{

/// The body that simulated performers wear, and that of the characters that they drive.
enum class EPerformerMesh
{
  Performer,
  Character
};
/// The name under which the items of the simulated capture ask for it.
const char* PerformerMeshName( EPerformerMesh i_Mesh );

/// A closed body, in mm, arms and legs spread. A moved vertex is at
/// sum( weight x pose( bone ) x InverseBind( bone ) ) x position.
struct VPerformerMesh
{
  struct VBone
  {
    std::string Name; ///< of the segment
    CoreMoxelTypes::Rigid InverseBind;
  };
  struct VInfluence
  {
    std::array< std::uint16_t, 4 > Bones{};
    std::array< float, 4 > Weights{}; ///< they sum to 1
  };
  std::vector< VBone > Bones;
  std::vector< std::array< float, 3 > > Positions, Normals;
  std::vector< VInfluence > Influences;   ///< one a vertex
  std::vector< std::uint32_t > Triangles; ///< three vertices each, counter-clockwise from outside
};

/// Takes about a twentieth of a second. Thread: any.
VPerformerMesh MakePerformerMesh( EPerformerMesh i_Mesh );

} // namespace HostSources
