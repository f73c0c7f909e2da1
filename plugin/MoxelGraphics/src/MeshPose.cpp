#include <MoxelGraphics/MeshPose.h>

#include <HarrowPluginInterface/MeshMath.h>

#include <algorithm>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace HarrowPluginInterface;

template < std::size_t N >
std::array< double, N > Mix( const std::array< double, N >& i_rA, const std::array< double, N >& i_rB, double i_Share )
{
  std::array< double, N > Mixed;
  for ( std::size_t Index = 0; Index < N; ++Index )
  {
    Mixed[Index] = i_rA[Index] + i_Share * ( i_rB[Index] - i_rA[Index] );
  }
  return Mixed;
}

/// Along the shorter arc, at an even pace.
std::array< double, 4 > Mix( const std::array< double, 4 >& i_rA, std::array< double, 4 > i_B, double i_Share )
{
  double Cosine = i_rA[0] * i_B[0] + i_rA[1] * i_B[1] + i_rA[2] * i_B[2] + i_rA[3] * i_B[3];
  if ( Cosine < 0 )
  {
    Cosine = -Cosine;
    i_B = { -i_B[0], -i_B[1], -i_B[2], -i_B[3] };
  }
  double A = 1 - i_Share, B = i_Share;
  if ( Cosine < 0.9999 )
  {
    const double Angle = std::acos( Cosine );
    A = std::sin( A * Angle ) / std::sin( Angle );
    B = std::sin( B * Angle ) / std::sin( Angle );
  }
  std::array< double, 4 > Mixed;
  double Square = 0;
  for ( std::size_t Index = 0; Index < 4; ++Index )
  {
    Mixed[Index] = A * i_rA[Index] + B * i_B[Index];
    Square += Mixed[Index] * Mixed[Index];
  }
  const double Length = std::sqrt( Square );
  return { Mixed[0] / Length, Mixed[1] / Length, Mixed[2] / Length, Mixed[3] / Length };
}

template < typename TValue >
TValue Sample( const std::vector< VMeshKey< TValue > >& i_rKeys, double i_Time )
{
  const auto Later = std::upper_bound( i_rKeys.begin(), i_rKeys.end(), i_Time,
                                       []( double i_Left, const VMeshKey< TValue >& i_rKey )
                                       {
                                         return i_Left < i_rKey.Time;
                                       } );
  if ( Later == i_rKeys.begin() )
  {
    return i_rKeys.front().Value;
  }
  const auto Earlier = Later - 1;
  if ( Later == i_rKeys.end() )
  {
    return Earlier->Value;
  }
  return Mix( Earlier->Value, Later->Value, ( i_Time - Earlier->Time ) / ( Later->Time - Earlier->Time ) );
}

VSkinVertex Move( const VSkinMatrix& i_rBone, const std::array< float, 3 >& i_rPosition,
                  const std::array< float, 3 >& i_rNormal )
{
  VSkinVertex Moved;
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    const float X = i_rBone[Row], Y = i_rBone[4 + Row], Z = i_rBone[8 + Row];
    Moved.Position[Row] = X * i_rPosition[0] + Y * i_rPosition[1] + Z * i_rPosition[2] + i_rBone[12 + Row];
    Moved.Normal[Row] = X * i_rNormal[0] + Y * i_rNormal[1] + Z * i_rNormal[2];
  }
  return Moved;
}
} // namespace

VSkinMatrix ToSkinMatrix( const VMeshTransform& i_rTransform, float i_Health )
{
  VSkinMatrix Matrix{};
  for ( std::size_t Column = 0; Column < 4; ++Column )
  {
    for ( std::size_t Row = 0; Row < 3; ++Row )
    {
      Matrix[4 * Column + Row] = static_cast< float >( i_rTransform[4 * Row + Column] );
    }
  }
  Matrix[15] = i_Health;
  return Matrix;
}

void PoseNodes( const VMeshScene& i_rMesh, std::size_t i_Animation, double i_Seconds,
                std::vector< VMeshTransform >& o_rWorlds )
{
  o_rWorlds.resize( i_rMesh.Nodes.size() );
  for ( std::size_t Node = 0; Node < o_rWorlds.size(); ++Node )
  {
    o_rWorlds[Node] = i_rMesh.Nodes[Node].Local;
  }
  if ( i_Animation < i_rMesh.Animations.size() )
  {
    for ( const VMeshChannel& rChannel : i_rMesh.Animations[i_Animation].Channels )
    {
      o_rWorlds[rChannel.Node] =
          ComposeMesh( Sample( rChannel.Positions, i_Seconds ), Sample( rChannel.Rotations, i_Seconds ),
                       Sample( rChannel.Scales, i_Seconds ) );
    }
  }
  for ( std::size_t Node = 0; Node < o_rWorlds.size(); ++Node )
  {
    const std::int32_t Parent = i_rMesh.Nodes[Node].Parent;
    if ( Parent >= 0 )
    {
      o_rWorlds[Node] = o_rWorlds[static_cast< std::size_t >( Parent )] * o_rWorlds[Node];
    }
  }
}

void SkinSurface( const VMeshSurface& i_rSurface, std::span< const VSkinMatrix > i_Bones, VSkinVertex* o_pVertices )
{
  const std::size_t Count = i_rSurface.Positions.size();
  for ( std::size_t Vertex = 0; Vertex < Count; ++Vertex )
  {
    const auto& rPosition = i_rSurface.Positions[Vertex];
    const auto& rNormal = i_rSurface.Normals[Vertex];
    if ( i_rSurface.Influences.empty() )
    {
      o_pVertices[Vertex] = Move( i_Bones[i_rSurface.Bone], rPosition, rNormal );
      continue;
    }
    const VMeshInfluence& rInfluence = i_rSurface.Influences[Vertex];
    VSkinVertex Sum;
    for ( std::size_t Place = 0; Place < 4; ++Place )
    {
      const float Weight = rInfluence.Weights[Place];
      if ( Weight <= 0 )
      {
        continue;
      }
      const VSkinVertex Moved = Move( i_Bones[rInfluence.Bones[Place]], rPosition, rNormal );
      for ( std::size_t Axis = 0; Axis < 3; ++Axis )
      {
        Sum.Position[Axis] += Weight * Moved.Position[Axis];
        Sum.Normal[Axis] += Weight * Moved.Normal[Axis];
      }
    }
    o_pVertices[Vertex] = Sum;
  }
}

} // namespace MoxelGraphics
