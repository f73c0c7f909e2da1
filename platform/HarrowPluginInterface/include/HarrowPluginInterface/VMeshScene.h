#pragma once

// What a mesh file holds, as plain values: nodes, surfaces, the bones that move them, materials and animations. One
// is filled once, by whoever reads the file, and never changes after that: it may be read from any thread.
//
// All lengths are in the unit of the file; `MillimetresPerUnit` is what a drawing scales them by. All surfaces stand
// in one space, that of the whole file in its bind pose, so that a vertex at rest is where it is drawn and a moved one
// is at  sum( weight x pose( bone ) x InverseBind( bone ) ) x position.

#include <array>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace HarrowPluginInterface
{

/// The upper three rows of a matrix, row by row, translation in the fourth column.
using VMeshTransform = std::array< double, 12 >;
constexpr VMeshTransform MeshIdentity{ 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0 };

struct VMeshNode
{
  std::string Name;
  std::int32_t Parent = -1;            ///< an earlier node; -1 for a root
  VMeshTransform Local = MeshIdentity; ///< at rest, in the parent
};

/// A node that moves vertices.
struct VMeshBone
{
  std::string Name;
  std::uint32_t Node = 0;
  VMeshTransform InverseBind = MeshIdentity; ///< from the space of the surfaces into that of the bone
};

/// What moves a vertex: bones by their index, weights that sum to 1. A place that is not used has weight 0.
struct VMeshInfluence
{
  std::array< std::uint16_t, 4 > Bones{};
  std::array< float, 4 > Weights{};
};

struct VMeshPicture
{
  int Width = 0, Height = 0;
  std::vector< std::uint8_t > Pixels; ///< RGBA, row by row from the top
};

struct VMeshMaterial
{
  std::string Name;
  std::array< float, 3 > Colour{ 1, 1, 1 };
  std::array< float, 3 > Specular{ 0, 0, 0 };
  std::array< float, 3 > Emissive{ 0, 0, 0 };
  float Alpha = 1;
  float Shininess = 0;                            ///< exponent; 0: no highlight
  std::shared_ptr< const VMeshPicture > pPicture; ///< null: none, or none that could be read
};

/// Vertices in lists of equal length, and triangles over them. An index is never past its list; no number is other
/// than finite.
struct VMeshSurface
{
  std::string Name;
  std::vector< std::array< float, 3 > > Positions;
  std::vector< std::array< float, 3 > > Normals; ///< of unit length
  std::vector< std::array< float, 2 > > UVs;     ///< v from the bottom; zeros where the file has none
  /// Vertices that are corners of one point of the surface have its index: same position, same influence. Points are
  /// counted from 0 in the order of the file's polygons.
  std::vector< std::uint32_t > ControlPoints;
  std::vector< VMeshInfluence > Influences; ///< empty: the surface as a whole moves with `Bone`
  std::uint32_t Bone = 0;
  std::vector< std::uint32_t > Triangles; ///< three vertices each, counter-clockwise from outside
  std::uint32_t Material = 0;
};

template < typename TValue >
struct VMeshKey
{
  double Time = 0; ///< s
  TValue Value{};
};

/// How a node moves. Between keys positions and scales go along a line, rotations along the shorter arc; before the
/// first and after the last they stand. At least one key in each list, in order of time.
struct VMeshChannel
{
  std::uint32_t Node = 0;
  std::vector< VMeshKey< std::array< double, 3 > > > Positions;
  std::vector< VMeshKey< std::array< double, 4 > > > Rotations; ///< x, y, z, w; of unit length
  std::vector< VMeshKey< std::array< double, 3 > > > Scales;
};

struct VMeshAnimation
{
  std::string Name;
  double Duration = 0; ///< s
  std::vector< VMeshChannel > Channels;
};

struct VMeshScene
{
  std::string Name;
  double MillimetresPerUnit = 1;
  std::vector< VMeshNode > Nodes; ///< parents first; at least one
  std::vector< VMeshBone > Bones; ///< at least one when there is a surface
  std::vector< VMeshMaterial > Materials;
  std::vector< VMeshSurface > Surfaces;
  std::vector< VMeshAnimation > Animations;

  bool IsSkinned() const
  {
    for ( const VMeshSurface& rSurface : Surfaces )
    {
      if ( !rSurface.Influences.empty() )
      {
        return true;
      }
    }
    return false;
  }
};

} // namespace HarrowPluginInterface
