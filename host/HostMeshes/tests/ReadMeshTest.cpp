#include <HostMeshes/ReadMesh.h>

#include <HarrowPluginInterface/MeshMath.h>
#include <MoxelGraphics/MeshPose.h>
#include <TestSupport/Paths.h>

#include <gtest/gtest.h>

#include <cmath>
#include <fstream>
#include <limits>
#include <map>
#include <sstream>

namespace HostMeshes
{
namespace
{
using namespace HarrowPluginInterface;
using VPlace = std::array< double, 3 >;

/// A mesh as an OBJ file lists it: its points, and which of them the corners of its polygons are.
struct VReference
{
  std::vector< VPlace > Points;
  std::vector< std::uint32_t > Corners;
};

VReference ReadReference( const std::filesystem::path& i_rPath )
{
  VReference Reference;
  std::ifstream File( i_rPath );
  for ( std::string Line; std::getline( File, Line ); )
  {
    std::istringstream Words( Line );
    std::string Word;
    Words >> Word;
    if ( Word == "v" )
    {
      VPlace& rPlace = Reference.Points.emplace_back();
      Words >> rPlace[0] >> rPlace[1] >> rPlace[2];
    }
    while ( Word == "f" && Words >> Line )
    {
      Reference.Corners.push_back( static_cast< std::uint32_t >( std::stoul( Line ) ) - 1 );
    }
  }
  return Reference;
}

/// The vertices of the one surface at a time of the first animation, in units of the file.
std::vector< MoxelGraphics::VSkinVertex > Skin( const VMeshScene& i_rMesh, double i_Seconds )
{
  std::vector< VMeshTransform > Worlds;
  MoxelGraphics::PoseNodes( i_rMesh, 0, i_Seconds, Worlds );
  std::vector< MoxelGraphics::VSkinMatrix > Bones;
  for ( const VMeshBone& rBone : i_rMesh.Bones )
  {
    Bones.push_back( MoxelGraphics::ToSkinMatrix( Worlds[rBone.Node] * rBone.InverseBind ) );
  }
  std::vector< MoxelGraphics::VSkinVertex > Vertices( i_rMesh.Surfaces[0].Positions.size() );
  MoxelGraphics::SkinSurface( i_rMesh.Surfaces[0], Bones, Vertices.data() );
  return Vertices;
}

struct VCase
{
  const char* pMesh;
  const char* pReference;
  double Frame;
  double FirstFrame; ///< of the file's animation, at 24 a second
  std::size_t Points;
  VPlace First;
};
class VReferenceTest : public testing::TestWithParam< VCase >
{
};
} // namespace

TEST_P( VReferenceTest, EveryVertexOfASkinIsWhereTheReferenceHasIt )
{
  HARROW_NEEDS_RECORDINGS();
  const VCase& rCase = GetParam();
  const std::filesystem::path Folder = TestSupport::RecordingsDir() / "fbx";
  VMeshScene Mesh;
  std::string Message;
  ASSERT_TRUE( ReadMesh( Folder / rCase.pMesh, Mesh, Message ).IsOk() ) << Message;
  ASSERT_EQ( Mesh.Surfaces.size(), 1u );
  EXPECT_EQ( Mesh.MillimetresPerUnit, 10 );
  const VReference Reference = ReadReference( Folder / rCase.pReference );
  const VMeshSurface& rSurface = Mesh.Surfaces[0];
  ASSERT_EQ( Reference.Points.size(), rCase.Points );
  ASSERT_EQ( Reference.Corners.size(), rSurface.Positions.size() );
  const auto Vertices = Skin( Mesh, ( rCase.Frame - rCase.FirstFrame ) / 24.0 );
  std::vector< double > Worst( rCase.Points, -1 );
  std::map< std::uint32_t, std::uint32_t > PointOf; // of the reference, by control point
  for ( std::size_t Vertex = 0; Vertex < Vertices.size(); ++Vertex )
  {
    const std::uint32_t Point = Reference.Corners[Vertex];
    const auto [It, bNew] = PointOf.try_emplace( rSurface.ControlPoints[Vertex], Point );
    EXPECT_EQ( It->second, Point ) << "control point " << rSurface.ControlPoints[Vertex];
    for ( std::size_t Axis = 0; Axis < 3; ++Axis )
    {
      Worst[Point] =
          std::max( Worst[Point], std::abs( Vertices[Vertex].Position[Axis] - Reference.Points[Point][Axis] ) );
    }
    if ( Point == 0 )
    {
      EXPECT_NEAR( Vertices[Vertex].Position[0], rCase.First[0], 1e-3 );
      EXPECT_NEAR( Vertices[Vertex].Position[1], rCase.First[1], 1e-3 );
      EXPECT_NEAR( Vertices[Vertex].Position[2], rCase.First[2], 1e-3 );
    }
  }
  EXPECT_EQ( PointOf.size(), rCase.Points );
  const auto [Least, Most] = std::minmax_element( Worst.begin(), Worst.end() );
  EXPECT_GE( *Least, 0 ) << "a point that no vertex is";
  EXPECT_LE( *Most, 1e-3 ) << "point " << Most - Worst.begin();
  RecordProperty( "Worst", std::to_string( *Most ) );
}

constexpr VPlace Kenney4{ 40.588000, 329.407510, 54.891318 }, Kenney9{ 43.154904, 329.001531, 56.302542 },
    Sausage10{ -0.466914, -0.179786, 0.5 }, Sausage18{ -0.416621, 0.277053, 0.5 };
INSTANTIATE_TEST_SUITE_P(
    Files, VReferenceTest,
    testing::Values(
        VCase{ "maya_kenney_character_7700_binary.fbx", "maya_kenney_character_4.obj", 4, 0, 804, Kenney4 },
        VCase{ "maya_kenney_character_7700_binary.fbx", "maya_kenney_character_9.obj", 9, 0, 804, Kenney9 },
        VCase{ "maya_game_sausage_7500_ascii_wiggle.fbx", "maya_game_sausage_wiggle_10.obj", 10, 1, 24, Sausage10 },
        VCase{ "maya_game_sausage_7500_ascii_wiggle.fbx", "maya_game_sausage_wiggle_18.obj", 18, 1, 24, Sausage18 },
        VCase{ "maya_game_sausage_7500_binary_wiggle.fbx", "maya_game_sausage_wiggle_10.obj", 10, 1, 24, Sausage10 },
        VCase{ "maya_game_sausage_7500_binary_wiggle.fbx", "maya_game_sausage_wiggle_18.obj", 18, 1, 24,
               Sausage18 } ) );

} // namespace HostMeshes
