#include "RestNormals.h"

#include <HarrowPluginInterface/MeshMath.h>

#include <cmath>

namespace HostMeshes
{
namespace
{
using namespace HarrowPluginInterface;
using VVector = std::array< float, 3 >;

/// What takes each vertex from the bind pose to rest.
std::vector< VMeshTransform > RestTransforms( const VMeshScene& i_rMesh, std::span< const VMeshTransform > i_Rest,
                                              const VMeshSurface& i_rSurface )
{
  std::vector< VMeshTransform > Bones;
  for ( const VMeshBone& rBone : i_rMesh.Bones )
  {
    Bones.push_back( i_Rest[rBone.Node] * rBone.InverseBind );
  }
  std::vector< VMeshTransform > Vertices( i_rSurface.Influences.size() );
  for ( std::size_t Vertex = 0; Vertex < Vertices.size(); ++Vertex )
  {
    const VMeshInfluence& rInfluence = i_rSurface.Influences[Vertex];
    for ( std::size_t Index = 0; Index < 12; ++Index )
    {
      for ( std::size_t Place = 0; Place < 4; ++Place )
      {
        Vertices[Vertex][Index] +=
            static_cast< double >( rInfluence.Weights[Place] ) * Bones[rInfluence.Bones[Place]][Index];
      }
    }
  }
  return Vertices;
}

/// How many corners have a normal that looks out at the back of their triangle.
std::size_t CountTurned( const VMeshSurface& i_rSurface, const std::vector< VVector >& i_rPositions )
{
  std::size_t Turned = 0;
  for ( std::size_t Corner = 0; Corner + 2 < i_rSurface.Triangles.size(); Corner += 3 )
  {
    const std::uint32_t* const pTriangle = &i_rSurface.Triangles[Corner];
    const VVector &rA = i_rPositions[pTriangle[0]], &rB = i_rPositions[pTriangle[1]], &rC = i_rPositions[pTriangle[2]];
    const VVector U{ rB[0] - rA[0], rB[1] - rA[1], rB[2] - rA[2] }, V{ rC[0] - rA[0], rC[1] - rA[1], rC[2] - rA[2] };
    const VVector Face{ U[1] * V[2] - U[2] * V[1], U[2] * V[0] - U[0] * V[2], U[0] * V[1] - U[1] * V[0] };
    for ( std::size_t Vertex = 0; Vertex < 3; ++Vertex )
    {
      const VVector& rNormal = i_rSurface.Normals[pTriangle[Vertex]];
      Turned += Face[0] * rNormal[0] + Face[1] * rNormal[1] + Face[2] * rNormal[2] < 0 ? 1 : 0;
    }
  }
  return Turned;
}
} // namespace

void BindRestNormals( const VMeshScene& i_rMesh, std::span< const VMeshTransform > i_Rest, VMeshSurface& io_rSurface )
{
  const std::size_t TurnedBound = CountTurned( io_rSurface, io_rSurface.Positions );
  // A few are turned in sound files too.
  if ( io_rSurface.Influences.empty() || TurnedBound * 50 < io_rSurface.Triangles.size() )
  {
    return;
  }
  const std::vector< VMeshTransform > ToRest = RestTransforms( i_rMesh, i_Rest, io_rSurface );
  std::vector< VVector > AtRest( io_rSurface.Positions.size() );
  for ( std::size_t Vertex = 0; Vertex < AtRest.size(); ++Vertex )
  {
    AtRest[Vertex] = MovePoint( ToRest[Vertex], io_rSurface.Positions[Vertex] );
  }
  if ( CountTurned( io_rSurface, AtRest ) * 2 > TurnedBound )
  {
    return;
  }
  for ( std::size_t Vertex = 0; Vertex < AtRest.size(); ++Vertex )
  {
    VMeshTransform Back;
    if ( !InvertMesh( ToRest[Vertex], Back ) )
    {
      continue;
    }
    Back[3] = Back[7] = Back[11] = 0;
    const VVector Turned = MovePoint( Back, io_rSurface.Normals[Vertex] );
    const float Length = std::hypot( Turned[0], Turned[1], Turned[2] );
    if ( std::isfinite( Length ) && Length > 1e-20F )
    {
      io_rSurface.Normals[Vertex] = { Turned[0] / Length, Turned[1] / Length, Turned[2] / Length };
    }
  }
}

} // namespace HostMeshes
