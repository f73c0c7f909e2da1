#include <HostSources/PerformerMesh.h>

#include "Walker.h"

#include <gtest/gtest.h>

#include <map>

using namespace CoreMoxelTypes;
using namespace HostSources;
using namespace HostSources::Simulation;

namespace
{

/// The vertices where the bones carry them.
std::vector< D3 > Moved( const VPerformerMesh& i_rMesh, const VWalkerBody& i_rBody, const VWalkerState& i_rState )
{
  std::vector< ComputeSubject::VRigidTransform > Bones( i_rMesh.Bones.size() );
  EXPECT_TRUE( i_rBody.Tree().Pose( i_rState, 1, Bones ).IsOk() );
  for ( std::size_t Bone = 0; Bone < Bones.size(); ++Bone )
  {
    Bones[Bone] = Bones[Bone] * ComputeSubject::VRigidTransform::From( i_rMesh.Bones[Bone].InverseBind );
  }
  std::vector< D3 > Places;
  for ( std::size_t Vertex = 0; Vertex < i_rMesh.Positions.size(); ++Vertex )
  {
    const auto& rAt = i_rMesh.Positions[Vertex];
    D3 Place;
    for ( std::size_t Hold = 0; Hold < 4; ++Hold )
    {
      Place = Place + Placed( Bones[i_rMesh.Influences[Vertex].Bones[Hold]], { rAt[0], rAt[1], rAt[2] } ) *
                          i_rMesh.Influences[Vertex].Weights[Hold];
    }
    Places.push_back( Place );
  }
  return Places;
}

D3 AsPoint( const std::array< float, 3 >& i_rFloats )
{
  return { i_rFloats[0], i_rFloats[1], i_rFloats[2] };
}

} // namespace

TEST( PerformerMesh, BodiesAreClosedSmoothAndHeldByTheBonesOfTheirSkeleton )
{
  for ( const EPerformerMesh Which : { EPerformerMesh::Performer, EPerformerMesh::Character } )
  {
    SCOPED_TRACE( PerformerMeshName( Which ) );
    const VPerformerMesh Mesh = MakePerformerMesh( Which );
    const VWalkerBody Body( Which == EPerformerMesh::Performer ? VBodyShape{} : CharacterShape );
    ASSERT_EQ( Mesh.Bones.size(), Body.Subject().Segments.size() );
    for ( std::size_t Bone = 0; Bone < Mesh.Bones.size(); ++Bone )
    {
      EXPECT_EQ( Mesh.Bones[Bone].Name, Body.Subject().Segments[Bone].Name );
    }
    EXPECT_GT( Mesh.Triangles.size() / 3, 2000u );
    EXPECT_LT( Mesh.Triangles.size() / 3, 9000u );
    ASSERT_EQ( Mesh.Influences.size(), Mesh.Positions.size() );
    ASSERT_EQ( Mesh.Normals.size(), Mesh.Positions.size() );

    std::map< std::pair< std::uint32_t, std::uint32_t >, int > Edges;
    double Volume = 0, Inward = 0;
    for ( std::size_t First = 0; First < Mesh.Triangles.size(); First += 3 )
    {
      D3 Corners[3];
      for ( std::size_t Corner = 0; Corner < 3; ++Corner )
      {
        const std::uint32_t From = Mesh.Triangles[First + Corner], To = Mesh.Triangles[First + ( Corner + 1 ) % 3];
        ASSERT_LT( From, Mesh.Positions.size() );
        ++Edges[{ From, To }];
        Corners[Corner] = AsPoint( Mesh.Positions[From] );
      }
      const D3 Face = Cross( Corners[1] - Corners[0], Corners[2] - Corners[0] );
      Volume += Dot( Corners[0], Face ) / 6;
      Inward += Dot( Face, AsPoint( Mesh.Normals[Mesh.Triangles[First]] ) ) < 0 ? Length( Face ) : 0;
    }
    for ( const auto& [rEdge, Count] : Edges )
    {
      const auto Back = Edges.find( { rEdge.second, rEdge.first } );
      ASSERT_TRUE( Back != Edges.end() && Back->second == Count ) << "an open edge";
    }
    EXPECT_NEAR( Volume / 1e6, Which == EPerformerMesh::Performer ? 66 : 35, 8 ) << "litres";
    EXPECT_LT( Inward / 2e6, 0.01 ) << "square metres whose normals point the wrong way";
    for ( std::size_t Vertex = 0; Vertex < Mesh.Positions.size(); ++Vertex )
    {
      const auto& rWeights = Mesh.Influences[Vertex].Weights;
      EXPECT_NEAR( rWeights[0] + rWeights[1] + rWeights[2] + rWeights[3], 1, 1e-5 );
      EXPECT_NEAR( Length( AsPoint( Mesh.Normals[Vertex] ) ), 1, 1e-5 );
      for ( const std::uint16_t Bone : Mesh.Influences[Vertex].Bones )
      {
        EXPECT_LT( Bone, Mesh.Bones.size() );
      }
    }

    const std::vector< D3 > Standing = Moved( Mesh, Body, VWalkerState{} );
    double Top = 0, Sole = 1000;
    for ( const D3& rPlace : Standing )
    {
      Top = std::max( Top, rPlace.z );
      Sole = std::min( Sole, rPlace.z );
    }
    EXPECT_NEAR( Top, Body.Neutral()[EHeadEnd].Origin.z, 15 );
    EXPECT_NEAR( Sole, 0, 8 );
    for ( const VMarker& rMarker : Body.Subject().Markers )
    {
      const VFrame& rBone = Body.Neutral()[static_cast< std::size_t >( rMarker.Segment )];
      const D3 Place = rBone.Point( rMarker.Local.x, rMarker.Local.y, rMarker.Local.z );
      double Nearest = 1000;
      for ( const D3& rSkin : Standing )
      {
        Nearest = std::min( Nearest, Length( rSkin - Place ) );
      }
      EXPECT_LT( Nearest, 25 ) << rMarker.Name << " sits on the skin";
    }
  }
}
