#include "SkinFixture.h"

#include <TestSupport/Allocations.h>
#include <TestSupport/Golden.h>
#include <TestSupport/LogGuard.h>

#include <limits>
#include <numbers>

namespace MoxelGraphics
{
namespace
{
constexpr float NaN = std::numeric_limits< float >::quiet_NaN();
constexpr float Scale = 2;

/// A bone that stands somewhere, turned about y.
VBonePose Pose( float i_X, float i_Y, float i_Z, double i_Degrees )
{
  const auto C = static_cast< float >( std::cos( i_Degrees * std::numbers::pi / 180 ) );
  const auto S = static_cast< float >( std::sin( i_Degrees * std::numbers::pi / 180 ) );
  return { C, 0, S, i_X, 0, 1, 0, i_Y, -S, 0, C, i_Z };
}

/// Upper arm, lower arm and hand of a subject as large as the mesh times `Scale`, bent.
const std::array< VBonePose, 3 > Bent{ Pose( -900, 0, 300, 0 ), Pose( -100, 0, 300, -30 ),
                                       Pose( -100 + 692.82F, 0, 300 + 400, 45 ) };

std::array< float, 3 > Move( const VBonePose& i_rPose, const std::array< float, 3 >& i_rPoint )
{
  std::array< float, 3 > Moved;
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    const float* const pRow = i_rPose.data() + 4 * Row;
    Moved[Row] = pRow[0] * i_rPoint[0] + pRow[1] * i_rPoint[1] + pRow[2] * i_rPoint[2] + pRow[3];
  }
  return Moved;
}

/// Where the bent arm is, worked out from what the mesh is known to be: a thing that does not move, in mm.
VMeshScene MakeBentArm( const std::array< VBonePose, 3 >& i_rPoses )
{
  VMeshScene Mesh = MakeArm();
  Mesh.MillimetresPerUnit = 1;
  for ( HarrowPluginInterface::VMeshSurface& rSurface : Mesh.Surfaces )
  {
    for ( std::size_t Vertex = 0; Vertex < rSurface.Positions.size(); ++Vertex )
    {
      const HarrowPluginInterface::VMeshInfluence Influence = rSurface.Influences.empty()
                                                                  ? HarrowPluginInterface::VMeshInfluence{ {}, { 1 } }
                                                                  : rSurface.Influences[Vertex];
      const auto Position = rSurface.Positions[Vertex], Normal = rSurface.Normals[Vertex];
      rSurface.Positions[Vertex] = rSurface.Normals[Vertex] = {};
      for ( std::size_t Place = 0; Place < 2; ++Place )
      {
        const std::size_t Bone = Influence.Bones[Place];
        VBonePose Turn = i_rPoses[Bone];
        const auto At = Move( Turn, { ( Position[0] - 40 * static_cast< float >( Bone ) ) * 10 * Scale,
                                      Position[1] * 10 * Scale, Position[2] * 10 * Scale } );
        Turn[3] = Turn[7] = Turn[11] = 0;
        const auto Up = Move( Turn, Normal );
        for ( std::size_t Axis = 0; Axis < 3; ++Axis )
        {
          rSurface.Positions[Vertex][Axis] += Influence.Weights[Place] * At[Axis];
          rSurface.Normals[Vertex][Axis] += Influence.Weights[Place] * Up[Axis];
        }
      }
    }
    rSurface.Influences.clear();
  }
  return Mesh;
}

class VSkinTest : public VSceneTest< VSkinScene >
{
protected:
  VSkinTest()
  {
    Wear( "Subject", "arm.fbx" );
    pScene->Meshes().Put( "Subject/arm.fbx", MakeArm() );
    pScene->Meshes().Put( "Subject/bent.fbx", MakeBentArm( Bent ) );
  }
  VSubjectGroup& Group() { return pScene->Group; }
  VSubjectRecord& Record() { return pScene->Group.Records[0]; }
  const VSubjectSkins::VCounts& Counts() const { return pScene->Skins.Counts( 1 ); }

  /// One subject with that mesh and the bones of an arm, after a bone of another subject.
  void Wear( const std::string& i_rCategory, const std::string& i_rName )
  {
    VSubjectRecord Record;
    Record.Name = "Ada";
    Record.Bones = { 1, 3 };
    Record.Mesh.Category = i_rCategory;
    Record.Mesh.Name = i_rName;
    Record.Mesh.Scale = Scale;
    Record.Id = 5;
    Group().Records = { Record };
    Group().BoneNames = { "hand", "ada:UPPER", "lower", "Hand" };
    Group().Bones.resize( 4 );
    Group().Poses = { Pose( 0, 0, -1000, 0 ), Bent[0], Bent[1], Bent[2] };
    Group().Health.assign( 4, 1 );
    Touch();
  }
  void Touch()
  {
    ++Group().StructureGeneration;
    ++Group().PoseGeneration;
    ++Group().RecordGeneration;
    pScene->MarkDirty();
  }
  QImage Picture()
  {
    Touch();
    return Draw();
  }
  /// A mesh that stands as it is.
  QImage StillPicture( const std::string& i_rName, std::uint32_t i_Colour = 0xFFFFFFFF )
  {
    Wear( "Subject", i_rName );
    Record().Mesh.bByRoot = true;
    Record().Mesh.Scale = 1;
    Record().Colour = i_Colour;
    return Picture();
  }
  static bool IsBlank( const QImage& i_rPicture )
  {
    return TestSupport::SamePicture( i_rPicture, Blank( i_rPicture ), { 0, 0 } );
  }
  static QImage Blank( const QImage& i_rPicture )
  {
    QImage Empty( i_rPicture.size(), i_rPicture.format() );
    Empty.fill( i_rPicture.pixel( 2, 2 ) );
    return Empty;
  }
  static testing::AssertionResult Same( const QImage& i_rSeen, const QImage& i_rKept )
  {
    if ( IsBlank( i_rKept ) )
    {
      return testing::AssertionFailure() << "there is nothing in the picture";
    }
    return TestSupport::SamePicture( i_rSeen, i_rKept, { 12, 0.0008 } );
  }
};
} // namespace

TEST_F( VSkinTest, ASkinIsWhereItsBonesPutItHoweverManyThereAre )
{
  const QImage Skinned = Picture();
  EXPECT_EQ( Counts().Drawn, 1u );
  EXPECT_EQ( Counts().OnCpu, 0u );
  EXPECT_TRUE( Same( Skinned, StillPicture( "bent.fbx" ) ) );

  for ( const std::size_t Bones : { 250, 251 } )
  {
    pScene->Meshes().Put( "Subject/many.fbx", MakeArm( Bones - 3 ) );
    Wear( "Subject", "many.fbx" );
    EXPECT_TRUE( Same( Picture(), Skinned ) ) << Bones;
    EXPECT_EQ( Counts().Drawn, 1u );
    EXPECT_EQ( Counts().OnCpu, Bones > 250 ? 1u : 0u );
  }
  pScene->bXRay = true;
  const QImage XRayMoved = Draw();
  Wear( "Subject", "arm.fbx" );
  EXPECT_TRUE( Same( XRayMoved, Picture() ) );
  EXPECT_FALSE( Same( XRayMoved, Skinned ) );
}

TEST_F( VSkinTest, ABoneThatTheSubjectDoesNotHaveMovesWithItsParent )
{
  std::array< VBonePose, 3 > Stiff = Bent;
  const auto Hand = Move( Bent[1], { 400 * Scale, 0, 0 } );
  Stiff[2] = Bent[1];
  Stiff[2][3] = Hand[0];
  Stiff[2][7] = Hand[1];
  Stiff[2][11] = Hand[2];
  pScene->Meshes().Put( "Subject/stiff.fbx", MakeBentArm( Stiff ) );
  const QImage Expected = StillPicture( "stiff.fbx" );
  for ( const bool bNamed : { false, true } )
  {
    Wear( "Subject", "arm.fbx" );
    EXPECT_FALSE( Same( Picture(), Expected ) );
    if ( bNamed )
    {
      Group().Poses[3][5] = NaN;
    }
    else
    {
      Group().BoneNames[3] = "paw";
    }
    EXPECT_TRUE( Same( Picture(), Expected ) ) << bNamed;
  }
  Group().Poses.resize( 2 ); // the lists are shorter than the record says
  EXPECT_FALSE( IsBlank( Picture() ) );
  Group().Poses.assign( 4, Pose( NaN, 0, 0, 0 ) );
  EXPECT_TRUE( IsBlank( Picture() ) );
}

TEST_F( VSkinTest, WhatFitsNothingIsSaidOnceAndNotDrawn )
{
  const auto Said = []( const char* i_pText )
  {
    const std::vector< std::string > Texts = TestSupport::LogTexts( "MoxelGraphics", ZEK::ELogWarning );
    return std::count_if( Texts.begin(), Texts.end(),
                          [&]( const std::string& i_rText )
                          {
                            return i_rText.find( i_pText ) != std::string::npos;
                          } );
  };
  VMeshScene Broken = MakeArm();
  Broken.Surfaces[0].Triangles[7] = 99999;
  pScene->Meshes().Put( "Subject/broken.fbx", Broken );
  Broken = MakeArm();
  Broken.Surfaces[0].Influences[3].Bones[1] = 3;
  pScene->Meshes().Put( "Subject/bones.fbx", Broken );
  for ( int Frame = 0; Frame < 3; ++Frame )
  {
    Wear( "Subject", "arm.fbx" );
    Group().BoneNames = { "upper", "a", "b", "c" }; // the first is another subject's
    EXPECT_TRUE( IsBlank( Picture() ) );
    EXPECT_EQ( Counts().Unmatched, 1u );
    for ( const char* const pName : { "broken.fbx", "bones.fbx" } )
    {
      Wear( "Subject", pName );
      EXPECT_TRUE( IsBlank( Picture() ) );
    }
  }
  EXPECT_EQ( Said( "\"arm.fbx\" has no bone of the name of one of subject \"Ada\"" ), 1 );
  EXPECT_EQ( Said( "is broken and not drawn" ), 2 );
  for ( const float Wrong : { NaN, 0.0F, -1.0F } )
  {
    Wear( "Subject", "arm.fbx" );
    Record().Mesh.Scale = Wrong;
    EXPECT_TRUE( IsBlank( Picture() ) ) << Wrong;
  }
  (void)StillPicture( "arm.fbx" );
  Record().Root[7] = NaN;
  EXPECT_TRUE( IsBlank( Picture() ) );
}

TEST_F( VSkinTest, AMeshThatComesLateIsDrawnAndAStillOneCostsNothing )
{
  Wear( "Prop", "arm.fbx" );
  EXPECT_TRUE( IsBlank( Draw() ) );
  EXPECT_EQ( Counts().Waiting, 1u );
  Draw();
  EXPECT_EQ( pScene->Meshes().Requests, 1 ) << "asked again without a reason";
  pScene->Meshes().Put( "Prop/arm.fbx", MakeArm() );
  EXPECT_FALSE( IsBlank( Draw() ) );
  EXPECT_EQ( Counts().Waiting, 0u );
  Draw();
  EXPECT_EQ( pScene->Meshes().Requests, 2 );

  // The device takes the matrices of a frame as uniforms, so that nothing is written but on the processor.
  for ( const bool bMany : { false, true } )
  {
    pScene->Meshes().Put( "Prop/arm.fbx", MakeArm( bMany ? 300 : 0 ) );
    Draw();
    std::uint64_t Allocated = 0;
    const auto Function = pScene->pDraw->Function;
    pScene->pDraw->Function = [&]( auto& io_rContext, const VSceneOptions& i_rOptions, std::uint32_t i_Pass )
    {
      const std::uint64_t Before = TestSupport::AllocationCount();
      Function( io_rContext, i_rOptions, i_Pass );
      Allocated += TestSupport::AllocationCount() - Before;
    };
    for ( const bool bMoving : { false, true } )
    {
      Group().PoseGeneration += bMoving ? 1 : 0;
      Allocated = 0;
      const std::uint64_t Before = CoreGraphics::VVertexBuffer::TotalBytesUploaded();
      Draw();
      const std::uint64_t Written = CoreGraphics::VVertexBuffer::TotalBytesUploaded() - Before;
      EXPECT_EQ( Written, bMany && bMoving ? ( 31u * 12 + 8 ) * 24 : 0u ) << bMany << bMoving;
      EXPECT_EQ( Allocated, 0u ) << bMany << bMoving;
    }
    pScene->pDraw->Function = Function;
  }
}

TEST_F( VSkinTest, ASkinIsPickedAndHighlightedAsItsRecord )
{
  const QPoint OnArm = Pixel( { -500, 0, 300, 0 } );
  EXPECT_EQ( Pick( OnArm ), VIds{ 5 } );
  EXPECT_EQ( Pick( QPoint( 4, 4 ) ), VIds{} );
  EXPECT_EQ( Band( { 1, 1 }, { Size.width() - 1, Size.height() - 1 } ), VIds{ 5 } );
  Input().PickMode = EPickNone;
  const QImage Plain = Picture();
  // A view looks for what is highlighted only while something is selected.
  pScene->SelectionService()->Set( ZEK::ISelectionService::EPrimary, { { ZEK::ESelectSubject, "Ada", 5, 0 } } );
  EXPECT_TRUE( Same( Picture(), Plain ) );
  for ( const std::size_t More : { 0, 300 } )
  {
    pScene->Meshes().Put( "Subject/arm.fbx", MakeArm( More ) );
    Record().Flags = CoreGraphics::EInstanceSelected;
    const QImage Selected = Picture();
    EXPECT_FALSE( Same( Selected, Plain ) );
    EXPECT_LT( Distance( Selected.pixel( 2, 2 ), Plain.pixel( 2, 2 ) ), 3 );
    Record().Flags = 0;
    EXPECT_TRUE( Same( Picture(), Plain ) );
  }
  Record().Id = 0;
  EXPECT_EQ( Pick( OnArm ), VIds{} );
}

TEST_F( VSkinTest, MissingHealthShowsWhenAsked )
{
  const QPoint OnUpper = Pixel( { -700, 0, 300, 0 } );
  Group().Health = { 1, 0, 1, 1 };
  const QRgb Hidden = Picture().pixel( OnUpper );
  EXPECT_GT( qGreen( Hidden ), 60 );
  pScene->Skins.SetHighlightMissing( true );
  const QRgb Shown = Picture().pixel( OnUpper );
  EXPECT_NEAR( qRed( Shown ), qRed( Hidden ), 3 );
  EXPECT_LT( qGreen( Shown ), qGreen( Hidden ) / 3 );
  Group().Health = {};
  EXPECT_LT( Distance( Picture().pixel( OnUpper ), Hidden ), 3 );
}

TEST_F( VSkinTest, AMeshStandsAtItsRootOrGoesByItsAnimationOrByItsOwnBones )
{
  const QImage Expected = StillPicture( "bent.fbx" );
  // By its own bones: the subject's names do not matter, nor does the root.
  Wear( "Subject", "arm.fbx" );
  Group().BoneNames = { "a", "b", "c", "d" };
  Record().Mesh.bByRoot = true;
  Record().Mesh.Bones.assign( Bent.begin(), Bent.end() );
  EXPECT_TRUE( Same( Picture(), Expected ) );

  // By its animation: half a second on, the first joint is where the root is not.
  VMeshScene Moving = MakeArm();
  const double Turn = std::sqrt( 0.5 );
  Moving.Animations = { { "wave",
                          1,
                          { { 1,
                              { { 0, {} }, { 1, { 0, 0, 20 } } },
                              { { 0, { 0, 0, 0, 1 } }, { 1, { 0, 0, Turn, Turn } } },
                              { { 0, { 100, 100, 100 } } } } } } };
  pScene->Meshes().Put( "Subject/moving.fbx", Moving );
  Wear( "Subject", "moving.fbx" );
  Record().Mesh.bByRoot = true;
  Record().Mesh.AnimationTime = 0.5;
  Record().Root = Pose( -200, 100, 0, 0 );
  const QImage Animated = Picture();
  pScene->Meshes().Put( "Subject/arm.fbx", MakeArm() );
  Wear( "Subject", "arm.fbx" );
  Record().Mesh.bByRoot = true;
  const auto Half = static_cast< float >( Turn ); // of a right angle about z
  Record().Root = { Half, -Half, 0, -200, Half, Half, 0, 100, 0, 0, 1, 10 * 10 * Scale };
  EXPECT_TRUE( Same( Picture(), Animated ) );

  // The colour of a thing is its record's.
  const QPoint OnUpper = Pixel( { -700, 0, 300, 0 } );
  const QRgb White = Expected.pixel( OnUpper ), Blue = StillPicture( "bent.fbx", 0xFFFF0000 ).pixel( OnUpper );
  EXPECT_NEAR( qBlue( Blue ), qBlue( White ), 3 );
  EXPECT_LT( qRed( Blue ), qRed( White ) / 3 );
}

} // namespace MoxelGraphics
