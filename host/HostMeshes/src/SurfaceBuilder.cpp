#include "SurfaceBuilder.h"

#include <HarrowPluginInterface/MeshMath.h>

#include <assimp/mesh.h>

#include <cmath>
#include <cstring>
#include <unordered_map>

namespace HostMeshes
{
namespace
{
using namespace HarrowPluginInterface;
using VVector = std::array< float, 3 >;

constexpr double FarthestVertex = 1e12;

VVector Cross( const VVector& i_rA, const VVector& i_rB )
{
  return { i_rA[1] * i_rB[2] - i_rA[2] * i_rB[1], i_rA[2] * i_rB[0] - i_rA[0] * i_rB[2],
           i_rA[0] * i_rB[1] - i_rA[1] * i_rB[0] };
}

VVector Minus( const VVector& i_rA, const VVector& i_rB )
{
  return { i_rA[0] - i_rB[0], i_rA[1] - i_rB[1], i_rA[2] - i_rB[2] };
}

/// False when it has no direction.
bool Normalise( VVector& io_rVector )
{
  const double X = io_rVector[0], Y = io_rVector[1], Z = io_rVector[2];
  const double Length = std::sqrt( X * X + Y * Y + Z * Z );
  if ( !std::isfinite( Length ) || Length < 1e-30 )
  {
    return false;
  }
  io_rVector = { static_cast< float >( X / Length ), static_cast< float >( Y / Length ),
                 static_cast< float >( Z / Length ) };
  return true;
}

/// A vertex that is not a place makes the triangles on it void; it stays, at the origin, so that the others keep their
/// numbers.
std::vector< bool > FillPositions( const aiMesh& i_rMesh, const VMeshTransform& i_rWorld, VMeshSurface& io_rSurface,
                                   VSurfaceFaults& io_rFaults )
{
  std::vector< bool > Good( i_rMesh.mNumVertices, true );
  io_rSurface.Positions.resize( i_rMesh.mNumVertices );
  for ( std::size_t Vertex = 0; Vertex < i_rMesh.mNumVertices; ++Vertex )
  {
    const aiVector3D& rSource = i_rMesh.mVertices[Vertex];
    const std::array< double, 3 > Place = MovePoint< double >( i_rWorld, { rSource.x, rSource.y, rSource.z } );
    const double Farthest = std::abs( Place[0] ) + std::abs( Place[1] ) + std::abs( Place[2] );
    Good[Vertex] = Farthest < FarthestVertex; // false for a NaN
    io_rFaults.Vertices += Good[Vertex] ? 0 : 1;
    for ( std::size_t Axis = 0; Good[Vertex] && Axis < 3; ++Axis )
    {
      io_rSurface.Positions[Vertex][Axis] = static_cast< float >( Place[Axis] );
    }
  }
  return Good;
}

void FillTriangles( const aiMesh& i_rMesh, const std::vector< bool >& i_rGood, bool i_bMirrored,
                    VMeshSurface& io_rSurface, VSurfaceFaults& io_rFaults )
{
  io_rSurface.Triangles.reserve( std::size_t{ 3 } * i_rMesh.mNumFaces );
  for ( std::size_t Face = 0; Face < i_rMesh.mNumFaces; ++Face )
  {
    const aiFace& rFace = i_rMesh.mFaces[Face];
    if ( rFace.mNumIndices < 3 )
    {
      continue; // lines and points are not drawn
    }
    const unsigned A = rFace.mIndices[0], B = rFace.mIndices[1], C = rFace.mIndices[2];
    const std::size_t Count = i_rGood.size();
    if ( rFace.mNumIndices > 3 || A >= Count || B >= Count || C >= Count || A == B || B == C || A == C || !i_rGood[A] ||
         !i_rGood[B] || !i_rGood[C] )
    {
      ++io_rFaults.Triangles;
      continue;
    }
    io_rSurface.Triangles.insert( io_rSurface.Triangles.end(), { A, i_bMirrored ? C : B, i_bMirrored ? B : C } );
  }
}

/// Tells corners of one point by what the file says of them.
struct VCorner
{
  std::array< std::uint32_t, 3 > Place;
  VMeshInfluence Influence;
  bool operator==( const VCorner& i_rOther ) const
  {
    return Place == i_rOther.Place && Influence.Bones == i_rOther.Influence.Bones &&
           Influence.Weights == i_rOther.Influence.Weights;
  }
};
struct VCornerHash
{
  std::size_t operator()( const VCorner& i_rCorner ) const
  {
    std::size_t Hash = i_rCorner.Influence.Bones[0];
    for ( const std::uint32_t Part : i_rCorner.Place )
    {
      Hash = ( Hash ^ Part ) * 0x9E3779B97F4A7C15u;
      Hash ^= Hash >> 29u;
    }
    return Hash;
  }
};

std::uint32_t FillControlPoints( const aiMesh& i_rMesh, VMeshSurface& io_rSurface )
{
  std::unordered_map< VCorner, std::uint32_t, VCornerHash > Points;
  Points.reserve( i_rMesh.mNumVertices );
  io_rSurface.ControlPoints.resize( i_rMesh.mNumVertices );
  for ( std::size_t Vertex = 0; Vertex < i_rMesh.mNumVertices; ++Vertex )
  {
    VCorner Corner{};
    const float Place[3] = { i_rMesh.mVertices[Vertex].x, i_rMesh.mVertices[Vertex].y, i_rMesh.mVertices[Vertex].z };
    std::memcpy( Corner.Place.data(), Place, sizeof( Place ) );
    if ( !io_rSurface.Influences.empty() )
    {
      Corner.Influence = io_rSurface.Influences[Vertex];
    }
    io_rSurface.ControlPoints[Vertex] =
        Points.try_emplace( Corner, static_cast< std::uint32_t >( Points.size() ) ).first->second;
  }
  return static_cast< std::uint32_t >( Points.size() );
}

/// The normals of points as their triangles stand, by size.
std::vector< VVector > PointNormals( const VMeshSurface& i_rSurface, std::uint32_t i_PointCount )
{
  std::vector< VVector > Normals( i_PointCount );
  for ( std::size_t Corner = 0; Corner + 2 < i_rSurface.Triangles.size(); Corner += 3 )
  {
    const std::uint32_t* const pTriangle = &i_rSurface.Triangles[Corner];
    const VVector& rA = i_rSurface.Positions[pTriangle[0]];
    const VVector Normal =
        Cross( Minus( i_rSurface.Positions[pTriangle[1]], rA ), Minus( i_rSurface.Positions[pTriangle[2]], rA ) );
    for ( std::size_t Vertex = 0; Vertex < 3; ++Vertex )
    {
      VVector& rSum = Normals[i_rSurface.ControlPoints[pTriangle[Vertex]]];
      rSum = { rSum[0] + Normal[0], rSum[1] + Normal[1], rSum[2] + Normal[2] };
    }
  }
  return Normals;
}

void FillNormals( const aiMesh& i_rMesh, const VMeshTransform& i_rWorld, std::uint32_t i_PointCount,
                  VMeshSurface& io_rSurface )
{
  const std::array< double, 9 > Adjugate = MeshAdjugate( i_rWorld );
  const double Sign = MeshDeterminant( i_rWorld ) < 0 ? -1.0 : 1.0;
  std::vector< VVector > Computed;
  io_rSurface.Normals.resize( i_rMesh.mNumVertices );
  for ( std::size_t Vertex = 0; Vertex < i_rMesh.mNumVertices; ++Vertex )
  {
    VVector& rNormal = io_rSurface.Normals[Vertex];
    if ( i_rMesh.mNormals )
    {
      const aiVector3D& rSource = i_rMesh.mNormals[Vertex];
      for ( std::size_t Axis = 0; Axis < 3; ++Axis )
      {
        rNormal[Axis] = static_cast< float >(
            Sign * ( Adjugate[Axis] * rSource.x + Adjugate[3 + Axis] * rSource.y + Adjugate[6 + Axis] * rSource.z ) );
      }
    }
    if ( Normalise( rNormal ) )
    {
      continue;
    }
    if ( Computed.empty() )
    {
      Computed = PointNormals( io_rSurface, i_PointCount );
    }
    rNormal = Computed[io_rSurface.ControlPoints[Vertex]];
    if ( !Normalise( rNormal ) )
    {
      rNormal = { 0, 0, 1 };
    }
  }
}

void FillUVs( const aiMesh& i_rMesh, VMeshSurface& io_rSurface )
{
  io_rSurface.UVs.resize( i_rMesh.mNumVertices );
  for ( std::size_t Vertex = 0; i_rMesh.mTextureCoords[0] && Vertex < i_rMesh.mNumVertices; ++Vertex )
  {
    const aiVector3D& rSource = i_rMesh.mTextureCoords[0][Vertex];
    if ( std::isfinite( rSource.x ) && std::isfinite( rSource.y ) )
    {
      io_rSurface.UVs[Vertex] = { rSource.x, rSource.y };
    }
  }
}
} // namespace

bool FillSurface( const aiMesh& i_rMesh, const VMeshTransform& i_rWorld, VMeshSurface& io_rSurface,
                  VSurfaceFaults& io_rFaults )
{
  if ( !i_rMesh.mVertices || i_rMesh.mNumVertices == 0 || !i_rMesh.mFaces )
  {
    return false;
  }
  io_rSurface.Name = i_rMesh.mName.C_Str();
  const std::vector< bool > Good = FillPositions( i_rMesh, i_rWorld, io_rSurface, io_rFaults );
  FillTriangles( i_rMesh, Good, MeshDeterminant( i_rWorld ) < 0, io_rSurface, io_rFaults );
  if ( io_rSurface.Triangles.empty() )
  {
    return false;
  }
  const std::uint32_t Points = FillControlPoints( i_rMesh, io_rSurface );
  FillNormals( i_rMesh, i_rWorld, Points, io_rSurface );
  FillUVs( i_rMesh, io_rSurface );
  return true;
}

} // namespace HostMeshes
