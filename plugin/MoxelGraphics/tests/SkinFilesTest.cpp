#include "SkinFixture.h"

#include <HostMeshes/ReadMesh.h>
#include <MoxelGraphics/MeshPose.h>

#include <TestSupport/Golden.h>
#include <TestSupport/Paths.h>

namespace MoxelGraphics
{
namespace
{
using namespace HarrowPluginInterface;

class VSkinFilesTest : public VSceneTest< VSkinScene >
{
protected:
  VMeshScene Read( const char* i_pName )
  {
    VMeshScene Mesh;
    std::string Message;
    EXPECT_TRUE( HostMeshes::ReadMesh( TestSupport::RecordingsDir() / i_pName, Mesh, Message ).IsOk() ) << Message;
    return Mesh;
  }
  /// A record that wears that mesh at that size, standing upright though its file has y up.
  VSubjectRecord& Wear( const char* i_pName, VMeshScene i_Mesh, float i_Scale )
  {
    pScene->Meshes().Put( std::string( "Subject/" ) + i_pName, std::move( i_Mesh ) );
    VSubjectRecord Record;
    Record.Mesh.Category = "Subject";
    Record.Mesh.Name = i_pName;
    Record.Mesh.Scale = i_Scale;
    Record.Mesh.bByRoot = true;
    Record.Root = { 1, 0, 0, 0, 0, 0, -1, 0, 0, 1, 0, -800 };
    pScene->Group = {};
    pScene->Group.Records = { Record };
    pScene->MarkDirty();
    return pScene->Group.Records[0];
  }
  QImage Picture( const char* i_pName )
  {
    ++pScene->Group.StructureGeneration;
    ++pScene->Group.PoseGeneration;
    Draw();
    const QImage Image = Draw();
    if ( const char* const pFolder = std::getenv( "HARROW_KEEP_PICTURES" ) )
    {
      Image.save( QString( "%1/%2.png" ).arg( pFolder, i_pName ) );
    }
    return Image;
  }
  static int Drawn( const QImage& i_rPicture )
  {
    int Count = 0;
    for ( int Y = 0; Y < i_rPicture.height(); ++Y )
    {
      for ( int X = 0; X < i_rPicture.width(); ++X )
      {
        Count += Distance( i_rPicture.pixel( X, Y ), i_rPicture.pixel( 0, 0 ) ) > 8 ? 1 : 0;
      }
    }
    return Count;
  }
};

/// The places of a mesh's bones, without a size of their own, as a subject would have them.
void TakePoses( const VMeshScene& i_rMesh, double i_Seconds, double i_Scale, VSubjectGroup& o_rGroup )
{
  std::vector< VMeshTransform > Worlds;
  PoseNodes( i_rMesh, 0, i_Seconds, Worlds );
  const VSubjectRecord& rRecord = o_rGroup.Records[0];
  VMeshTransform Root;
  std::copy( rRecord.Root.begin(), rRecord.Root.end(), Root.begin() );
  for ( const VMeshBone& rBone : i_rMesh.Bones )
  {
    VMeshTransform World = Worlds[rBone.Node];
    VBonePose Pose;
    for ( std::size_t Column = 0; Column < 4; ++Column )
    {
      const double Length = std::hypot( World[Column], World[4 + Column], World[8 + Column] );
      for ( std::size_t Row = 0; Row < 12; Row += 4 )
      {
        World[Row + Column] *= Column < 3 ? 1 / Length : i_Scale;
      }
    }
    World = Root * World;
    std::copy( World.begin(), World.end(), Pose.begin() );
    o_rGroup.Poses.push_back( Pose );
    o_rGroup.BoneNames.push_back( "ada:" + rBone.Name );
    o_rGroup.Bones.emplace_back();
  }
  o_rGroup.Records[0].Bones = { 0, static_cast< std::uint32_t >( i_rMesh.Bones.size() ) };
}
} // namespace

TEST_F( VSkinFilesTest, ACharacterThatASubjectMovesLooksAsItsReference )
{
  HARROW_NEEDS_RECORDINGS();
  // Half as large as its file says, which is in centimetres; the reference has no unit.
  constexpr float Scale = 0.5F;
  for ( const int Frame : { 4, 9 } )
  {
    const std::string Reference = "fbx/maya_kenney_character_" + std::to_string( Frame ) + ".obj";
    VMeshScene Still = Read( Reference.c_str() ), Mesh = Read( "fbx/maya_kenney_character_7700_binary.fbx" );
    Still.Materials.assign( 1, Mesh.Materials[0] );
    Still.Surfaces[0].Material = 0;
    Wear( "reference.obj", Still, 10 * Scale );
    const QImage Expected = Picture( "reference" );
    EXPECT_GT( Drawn( Expected ), 2000 );
    Wear( "character.fbx", Mesh, Scale ).Mesh.bByRoot = false;
    TakePoses( Mesh, Frame / 24.0, 10.0 * Scale, pScene->Group );
    EXPECT_TRUE( TestSupport::SamePicture( Picture( "character" ), Expected, { 24, 0.001 } ) ) << Frame;
    // The file's own animation has it there too.
    VSubjectRecord& rRecord = Wear( "character.fbx", Mesh, Scale );
    rRecord.Mesh.AnimationTime = Frame / 24.0;
    EXPECT_TRUE( TestSupport::SamePicture( Picture( "animated" ), Expected, { 24, 0.001 } ) ) << Frame;
    pScene->bXRay = true;
    EXPECT_GT( Drawn( Picture( "xray" ) ), 1000 );
    pScene->bXRay = false;
  }
}

TEST_F( VSkinFilesTest, OtherFilesAreDrawn )
{
  HARROW_NEEDS_RECORDINGS();
  const VMeshScene Figure = Read( "fbx-assimp/huesitos.fbx" ), Cubes = Read( "fbx-assimp/cubes_with_names.fbx" );
  EXPECT_TRUE( Figure.IsSkinned() );
  EXPECT_EQ( Figure.Bones.size(), 8u ); // the ninth holds nothing
  EXPECT_EQ( Figure.Surfaces[0].Triangles.size(), 3u * 120 );
  EXPECT_NEAR( Figure.Animations[0].Duration, 1.56, 1e-6 );
  VSubjectRecord* pRecord = &Wear( "figure.fbx", Figure, 0.3F );
  pRecord->Root[3] = 900;
  const int First = Drawn( Picture( "figure" ) );
  EXPECT_GT( First, 500 );
  pRecord->Mesh.AnimationTime = 1.5;
  EXPECT_NE( Drawn( Picture( "figure-later" ) ), First );

  EXPECT_FALSE( Cubes.IsSkinned() );
  EXPECT_EQ( Cubes.Surfaces.size(), 4u );
  EXPECT_TRUE( Cubes.Animations.empty() );
  Wear( "cubes.fbx", Cubes, 5 );
  const QImage Image = Picture( "cubes" );
  EXPECT_GT( Drawn( Image ), 500 );
  EXPECT_EQ( pScene->Skins.Counts( 1 ).Drawn, 1u );
}

} // namespace MoxelGraphics
