#include <HostMeshes/ReadMesh.h>

#include "MeshBytes.h"

#include <HarrowPluginInterface/MeshMath.h>
#include <MoxelGraphics/MeshPose.h>
#include <TestSupport/Paths.h>

#include <gtest/gtest.h>

#include <cmath>
#include <fstream>
#include <map>
#include <set>
#include <span>
#include <sstream>
#include <tuple>

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

namespace
{
std::string ReadText( const std::filesystem::path& i_rPath )
{
  std::ifstream File( i_rPath, std::ios::binary );
  return { std::istreambuf_iterator< char >( File ), {} };
}
ZEK::IResult Read( const std::string& i_rText, const std::string& i_rName, VMeshScene& o_rMesh,
                   std::string& o_rMessage )
{
  return ReadMesh( std::as_bytes( std::span( i_rText ) ), i_rName, o_rMesh, o_rMessage );
}
/// A text FBX file of models and what holds what; model 0 is the scene.
std::string ModelFile( const std::vector< std::pair< int, int > >& i_rChildAndParent )
{
  std::string Text = "; FBX 7.5.0 project file\nFBXHeaderExtension:  {\n\tFBXVersion: 7500\n}\n"
                     "GlobalSettings:  {\n\tProperties70:  {\n\t}\n}\nObjects:  {\n";
  std::set< int > Models;
  for ( const auto& [Child, Parent] : i_rChildAndParent )
  {
    Models.insert( { Child, Parent } );
  }
  Models.erase( 0 );
  for ( const int Model : Models )
  {
    Text += "\tModel: " + std::to_string( Model ) + ", \"Model::m" + std::to_string( Model ) + "\", \"Null\" {\n\t}\n";
  }
  Text += "}\nConnections:  {\n";
  for ( const auto& [Child, Parent] : i_rChildAndParent )
  {
    Text += "\tC: \"OO\"," + std::to_string( Child ) + "," + std::to_string( Parent ) + "\n";
  }
  return Text + "}\n";
}
} // namespace

TEST( ReadMesh, FilesThatAreNoMeshAreRefusedByNameAndReason )
{
  std::vector< std::pair< int, int > > Diamonds{ { 1, 0 } }; // 2^30 ways from the scene to the last model
  for ( int Model = 1; Model < 90; Model += 3 )
  {
    Diamonds.insert(
        Diamonds.end(),
        { { Model + 1, Model }, { Model + 2, Model }, { Model + 3, Model + 1 }, { Model + 3, Model + 2 } } );
  }
  const std::tuple< const char*, std::string, const char* > Cases[] = {
      { "a.fbx", "", "it is empty" },
      { "a.obj", "", "it is empty" },
      { "a.stl", "solid", "it is neither FBX nor OBJ" },
      { "a.fbx", "no mesh at all", "" },
      { "a.fbx", std::string( 3000, '\0' ), "" },
      { "a.obj", "no mesh at all", "" },
      { "a.obj", "v 0 0 0\nv 1 0 0\nv 0 1 0\n", "it holds no triangle that can be drawn" },
      { "a.obj", "v 0 0 0\nv 1 0 0\nf 1 2\n", "" },
      { "a.obj", "v 0 0 0\nv 1 0 0\nv 0 1 0\nf 1 2 999999999\n", "" },
      { "a.obj", "v 0 0 0\nv 1 0 0\nv 0 1 0\nf 1 2 -999\n", "" },
      { "a.obj", "v nan 0 0\nv 1 0 0\nv 0 inf 0\nf 1 2 3\n", "" },
      { "a.obj", "v 1e30 0 0\nv 1 0 0\nv 0 1 0\nf 1 2 3\n", "it holds no triangle that can be drawn" },
      { "a.fbx", ModelFile( { { 1, 0 }, { 2, 1 }, { 1, 2 } } ), "a model in it contains itself" },
      { "a.fbx", ModelFile( { { 1, 1 } } ), "a model in it contains itself" },
      { "a.fbx", ModelFile( Diamonds ), "its models hold one another too often or too deeply" },
      { "a.fbx", ModelFile( { { 1, 0 } } ), "it holds no triangle that can be drawn" },
      { "a.fbx", "; FBX 7.5.0 project file\nA: {" + std::string( 100000, '{' ),
        "its records lie too deep in one another" },
      { "a.fbx",
        std::string( "Kaydara FBX Binary  \0\x1a\0\xe8\x1c\0\0", 27 ) + std::string( 4, '\xff' ) +
            std::string( 9, '\1' ),
        "a record in it reaches out of the one that holds it, or of the file" } };
  for ( const auto& [pName, rText, pReason] : Cases )
  {
    VMeshScene Mesh;
    Mesh.Nodes.resize( 1 );
    std::string Message;
    EXPECT_TRUE( Read( rText, pName, Mesh, Message ).IsError() ) << rText.substr( 0, 200 );
    EXPECT_TRUE( Message.starts_with( std::string( pName ) + ": " + pReason ) ) << Message;
    EXPECT_GT( Message.size(), 10u );
    EXPECT_TRUE( Mesh.Nodes.empty() && Mesh.Surfaces.empty() );
  }
  const TestSupport::VTemporaryDir Folder;
  const std::filesystem::path Huge = Folder.Path() / "huge.fbx";
  std::ofstream( Huge ) << "Kaydara FBX Binary";
  std::filesystem::resize_file( Huge, LargestMeshFile + 1 );
  VMeshScene Mesh;
  std::string Message;
  EXPECT_TRUE( ReadMesh( Huge, Mesh, Message ).IsError() );
  EXPECT_EQ( Message, "huge.fbx: it is larger than 128 MiB" );
  EXPECT_TRUE( ReadMesh( Folder.Path() / "none.fbx", Mesh, Message ) == ZEK::IResult::FileNotFound );
}

TEST( ReadMesh, WhatIsBrokenInPartIsLeftOut )
{
  VMeshScene Mesh;
  std::string Message;
  // A pentagon, a line, a triangle of one point twice, and one at a place that is none; no normals.
  ASSERT_TRUE( Read( "v 0 0 0\nv 2 0 0\nv 3 2 0\nv 1 4 0\nv -1 2 0\nv 1e20 0 0\nf 1 2 3 4 5\nf 1 1 2\nf 1 2 6\n",
                     "a.obj", Mesh, Message )
                   .IsOk() )
      << Message;
  ASSERT_EQ( Mesh.Surfaces.size(), 1u );
  const VMeshSurface& rSurface = Mesh.Surfaces[0];
  double Area = 0;
  for ( std::size_t Corner = 0; Corner < rSurface.Triangles.size(); Corner += 3 )
  {
    const auto &rA = rSurface.Positions[rSurface.Triangles[Corner]],
               &rB = rSurface.Positions[rSurface.Triangles[Corner + 1]],
               &rC = rSurface.Positions[rSurface.Triangles[Corner + 2]];
    Area += 0.5 * double( ( rB[0] - rA[0] ) * ( rC[1] - rA[1] ) - ( rB[1] - rA[1] ) * ( rC[0] - rA[0] ) );
  }
  EXPECT_NEAR( Area, 10, 1e-6 ); // 3 triangles, counter-clockwise
  EXPECT_EQ( rSurface.Normals[0], ( std::array< float, 3 >{ 0, 0, 1 } ) );
  EXPECT_EQ( rSurface.UVs[0], ( std::array< float, 2 >{ 0, 0 } ) );
  EXPECT_EQ( Message, "1 vertices, 1 triangles" );
}

TEST( ReadMesh, BrokenWeightsAndCutOffFilesDoNoHarm )
{
  HARROW_NEEDS_RECORDINGS();
  const std::filesystem::path Folder = TestSupport::RecordingsDir() / "fbx";
  const std::string Text = ReadText( Folder / "maya_game_sausage_7500_ascii_wiggle.fbx" );
  const std::size_t Cluster = Text.find( "Indexes: *" ), List = Text.find( "a: ", Cluster ) + 3;
  const std::size_t Weights = Text.find( "a: ", Text.find( "Weights: *", Cluster ) ) + 3;
  ASSERT_LT( Weights, Text.size() );
  const TestSupport::VTemporaryDir Made;
  const std::filesystem::path Reader = TestSupport::BinaryDir() / "bin" / "harrow-mesh-reader",
                              File = Made.Path() / "a.fbx";
  ASSERT_TRUE( std::filesystem::exists( Reader ) );
  int Ended = 0;
  for ( const char* const pWrong : { "nan,", "1e38,", "-1,", "99999999," } )
  {
    for ( const std::size_t At : { List, Weights } )
    {
      std::string Wrong = Text;
      Wrong.replace( At, Wrong.find( ',', At ) + 1 - At, pWrong );
      std::ofstream( File, std::ios::binary ) << Wrong;
      VMeshScene Mesh;
      std::string Message;
      if ( ReadMeshApart( Reader, File, Mesh, Message ).IsError() )
      {
        Ended += Message == "a.fbx: it is so broken that reading it failed" ? 1 : 0;
        EXPECT_TRUE( Message.starts_with( "a.fbx: " ) && Message.size() > 10 ) << Message;
        EXPECT_TRUE( Mesh.Surfaces.empty() );
        continue;
      }
      for ( const VMeshInfluence& rInfluence : Mesh.Surfaces[0].Influences )
      {
        const auto& rW = rInfluence.Weights;
        EXPECT_NEAR( rW[0] + rW[1] + rW[2] + rW[3], 1, 1e-5 ) << pWrong;
        EXPECT_TRUE( rW[0] >= 0 && rW[1] >= 0 && rW[2] >= 0 && rW[3] >= 0 );
      }
    }
  }
  RecordProperty( "Ended", Ended );
  int ReadParts = 0;
  for ( const char* const pName : { "maya_kenney_character_7700_binary.fbx", "maya_game_sausage_7500_binary_wiggle.fbx",
                                    "maya_game_sausage_7500_ascii_wiggle.fbx", "maya_kenney_character_4.obj" } )
  {
    const std::string Whole = ReadText( Folder / pName );
    for ( std::size_t Part = 1; Part < 16; ++Part )
    {
      VMeshScene Mesh;
      std::string Message;
      ReadParts += Read( Whole.substr( 0, Whole.size() * Part / 16 ), pName, Mesh, Message ).IsOk() ? 1 : 0;
      EXPECT_EQ( Mesh.Surfaces.empty(), !Message.empty() );
    }
  }
  EXPECT_LT( ReadParts, 40 );
}

TEST( ReadMesh, AnotherProcessReadsTheSame )
{
  HARROW_NEEDS_RECORDINGS();
  const std::filesystem::path Reader = TestSupport::BinaryDir() / "bin" / "harrow-mesh-reader";
  const std::filesystem::path File = TestSupport::RecordingsDir() / "fbx/maya_kenney_character_7700_binary.fbx";
  VMeshScene Here, There;
  std::string Message;
  ASSERT_TRUE( ReadMesh( File, Here, Message ).IsOk() ) << Message;
  ASSERT_TRUE( ReadMeshApart( Reader, File, There, Message ).IsOk() ) << Message;
  ASSERT_EQ( There.Surfaces.size(), 1u );
  EXPECT_EQ( There.Surfaces[0].Positions, Here.Surfaces[0].Positions );
  EXPECT_EQ( There.Surfaces[0].Triangles, Here.Surfaces[0].Triangles );
  EXPECT_EQ( There.Nodes.size(), Here.Nodes.size() );
  EXPECT_EQ( There.Bones.back().Name, Here.Bones.back().Name );
  EXPECT_EQ( There.Animations[0].Channels.back().Scales.back().Value,
             Here.Animations[0].Channels.back().Scales.back().Value );
  VMeshOutcome Outcome{ true, "text", Here }, Taken;
  auto Picture = std::make_shared< VMeshPicture >( VMeshPicture{ 2, 1, { 1, 2, 3, 4, 5, 6, 7, 8 } } );
  Outcome.Mesh.Materials[0].pPicture = Picture;
  const std::vector< std::byte > Bytes = PackOutcome( Outcome );
  ASSERT_TRUE( UnpackOutcome( Bytes, Taken ) );
  EXPECT_EQ( Taken.Mesh.Materials[0].pPicture->Pixels, Picture->Pixels );
  for ( std::size_t Size = 0; Size < Bytes.size(); Size += 997 )
  {
    EXPECT_FALSE( UnpackOutcome( std::span( Bytes ).first( Size ), Taken ) );
  }
  EXPECT_TRUE( ReadMeshApart( "/none/such", File, There, Message ).IsError() );
}

} // namespace HostMeshes
