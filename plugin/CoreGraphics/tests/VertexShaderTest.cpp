#include "ShaderBench.h"

#include <cmath>
#include <limits>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
QVector3D Vertical( bool i_bYUp, float i_Across, float i_Up )
{
  return { i_Across, i_bYUp ? i_Up : i_Across, i_bYUp ? i_Across : i_Up };
}
} // namespace

class VertexShaderTest : public ShaderTest
{
public:
  VertexShaderTest()
  {
    View.lookAt( Eye, { 0, 0, 300 }, { 0, 0, 1 } );
    Perspective.perspective( 45, 1.25f, 1, 100000 );
    Model.translate( 120, -40, 75 );
    Model.rotate( 50, { 1, 2, 3 } );
    Model.scale( 2, 3, 0.5f );
    Values = { { "u_ViewProjection", Perspective * View },
               { "u_Projection", Perspective },
               { "u_View", View },
               { "mv", View },
               { "u_CameraPosition", Eye },
               { "u_ViewportSize", { 800, 600 } },
               { "u_Up", { 0, 0, 1 } },
               { "u_ModelTransform", Model },
               { "a_position", Local },
               { "a_normal", Normal },
               { "a_colour", Own },
               { "a_uv", { 0.1f, 0.2f } },
               { "u_Extents", { -10, -20, 40, 60 } },
               { "u_PointSize", 7 },
               { "u_Colour", Plain },
               { "u_ModelColour", Plain },
               { "u_SegmentColour", Plain },
               { "u_StickColourA", { 1, 0, 0, 1 } },
               { "u_StickColourB", { 0, 1, 0, 0.6f } },
               { "u_ReconPosAndSize", { 100, 50, 25, 30 } },
               { "u_TargetPosAndSize", { -80, 60, 35, 40 } },
               { "u_SensorSize", { 64, 32 } },
               { "u_SensorImageOffsetScale", { 16, 8, 0.5f, 0.25f } } };
  }

  // What a shader hands on of a point of the world.
  VValues At( const QVector3D& i_rWorld, const QVector4D& i_rColour, const QVector3D& i_rNormal = {} ) const
  {
    return { { "gl_Position", Perspective * ( View * QVector4D( i_rWorld, 1 ) ) },
             { "v_position", i_rWorld },
             { "v_eye", i_rWorld - Eye },
             { "v_colour", i_rColour },
             { "v_normal", i_rNormal },
             { "v_uv", { 0.1f, 0.2f } } };
  }

  // All that the shader hands on must be expected.
  void Check( const std::string& i_rName, const VValues& i_rExpected, const VValues& i_rGiven = {},
              float i_Tolerance = 1e-4f )
  {
    for ( const auto& [rOutput, rValue] : Bench.Vertex( i_rName, With( Values, i_rGiven ) ) )
    {
      const auto It = i_rExpected.find( rOutput );
      ASSERT_NE( It, i_rExpected.end() ) << i_rName << ' ' << rOutput;
      const bool bDirection = rOutput == "v_normal";
      EXPECT_TRUE( bDirection ? IsNear( rValue.Vec3().normalized(), It->second.Vec3().normalized() )
                              : IsNear( rValue, It->second, i_Tolerance ) )
          << i_rName << ' ' << rOutput;
    }
  }

  const QVector3D Eye{ 900, -2500, 1400 }, Local{ 0.3f, 0.4f, 0.25f }, Normal{ 0, 0.6f, 0.8f };
  const QVector4D Plain{ 0.8f, 0.6f, 0.4f, 0.2f }, Own{ 0.5f, 1, 1, 1 };
  QMatrix4x4 View, Perspective, Model;
  VValues Values;
};

TEST_F( VertexShaderTest, NearnessIsTakenFromWOrInAParallelViewFromDepth )
{
  QMatrix4x4 Parallel;
  Parallel.ortho( -2000, 2000, -1500, 1500, 1, 100000 );
  for ( const bool bYUp : { false, true } )
  {
    const QVector3D Up = Vertical( bYUp, 0, 1 ), Light = QVector3D( 1, 0, 0 ) + Vertical( bYUp, 0, 3 );
    const auto Fallen = [&]( const QVector3D& i_rPoint )
    {
      return i_rPoint - Light * QVector3D::dotProduct( i_rPoint, Up ) / 3;
    };
    Values["u_Up"] = Up;
    Values["u_LightVector"] = Light.normalized();
    const std::pair< const char*, QVector3D > Places[] = {
        { "Point3D", Local },
        { "ForcePlate", Model.map( Local ) },
        { "SphereShadow", Fallen( Local * 30 + QVector3D( 100, 50, 25 ) ) },
        { "StickShadow", Fallen( Model.map( Local ) ) } };
    for ( const auto& [pName, rPoint] : Places )
    {
      const QVector3D Seen = View.map( rPoint );
      VValues Found = Bench.Vertex( pName, Values );
      EXPECT_TRUE( IsNear( Found["gl_Position"],
                           Perspective * Seen.toVector4D() + Perspective.column( 3 ) + QVector4D( 0, 0, 0, 0.02f ) ) )
          << pName;
      Found = Bench.Vertex( pName,
                            With( Values, { { "u_Projection", Parallel }, { "u_ViewProjection", Parallel * View } } ) );
      EXPECT_TRUE( IsNear( Found["gl_Position"], Parallel * QVector4D( Seen + QVector3D( 0, 0, 10 ), 1 ), 1e-6f ) )
          << pName;
    }
    // A stick that fades to half of its alpha, seen at its end.
    for ( const float Height : { -5.0f, 0.0f, 1500.0f, 2900.0f, 4000.0f } )
    {
      const float Alpha = 0.5f * std::clamp( 1 - Height / 3000, 0.0f, 1.0f );
      QMatrix4x4 Place;
      Place.translate( Up * Height - QVector3D( 0, 0, 1 ) );
      const VValues Object = With( Values, { { "a_position", { 0, 0, 1 } },
                                             { "u_ReconPosAndSize", QVector4D( Up * Height, 1 ) },
                                             { "u_ModelTransform", Place },
                                             { "u_StickColourB", { 1, 1, 1, 0.5f } } } );
      EXPECT_TRUE( IsNear( Bench.Vertex( "SphereShadow", Object )["v_colour"], { 0, 0, 0, Alpha }, 1e-5f ) );
      EXPECT_TRUE( IsNear( Bench.Vertex( "StickShadow", Object )["v_colour"], { 0, 0, 0, Alpha / 2 }, 1e-5f ) );
    }
  }
}

TEST_F( VertexShaderTest, SkinFollowsItsBonesAndShowsTheirHealth )
{
  QMatrix4x4 Half, Ill, Broken;
  Half.translate( 10, 0, 0 );
  Ill.rotate( 90, { 0, 0, 1 } );
  Broken.fill( std::numeric_limits< float >::quiet_NaN() );
  Half( 3, 3 ) = 0.5f;
  Ill( 3, 3 ) = 0.25f;
  std::vector< float > Bones( 250 * 16, 0.0f );
  for ( const auto& [Index, rBone] : { std::pair( 0, Broken ), { 7, Half }, { 249, Ill } } )
  {
    std::copy_n( rBone.constData(), 16, Bones.begin() + Index * 16 );
  }
  Values = With( Values, { { "a_position", { 100, 20, 30 } },
                           { "a_normal", { 1, 0, 0 } },
                           { "a_BoneIndices", { 7, 249, 0, 0 } },
                           { "a_BoneWeights", { 0.75f, 0.25f, 0, -1 } }, // a bone without weight does not count
                           { "u_BoneTransforms", Bones } } );
  const QVector3D Place = QVector3D( 110, 20, 30 ) * 0.75f + QVector3D( -20, 100, 30 ) * 0.25f;
  const float Health = 1 - 0.5f * 0.75f - 0.75f * 0.25f;
  Check( "FBXSkin", At( Place, { 1, 1, 1, 1 }, { 0.75f, 0.25f, 0 } ) );
  Check( "FBXSkin", At( Place, { 1, Health, Health, 1 }, { 0.75f, 0.25f, 0 } ), { { "u_HighlightMissing", 1 } } );
}

TEST_F( VertexShaderTest, EachStandsWhereItsValuesSay )
{
  const QVector3D Middle( 100, 50, 25 ), World = Model.map( Local ), Sized = Local * 30 + Middle;
  const QVector3D Turned = Model.inverted().transposed().mapVector( Normal ), Axes = View.mapVector( Local );
  const QVector2D Floor( -10 + 50 * Local.x(), -20 + 80 * Local.y() );
  const auto OnPlane = [&]( float i_X, float i_Y, const QVector4D& i_rColour )
  {
    return With( At( Model.map( QVector3D( i_X / 32 - 1, i_Y / 16 - 1, 1 ) ), i_rColour ), { { "gl_PointSize", 1 } } );
  };
  Check( "Simple3DModel", At( World, Own, Turned ) );
  Check( "Simple3DModelColour", At( World, Plain * Own, Turned ) );
  Check( "Simple3DModelWireframe", At( World, Own ) );
  Check( "Locator", At( World, Plain ) );
  Check( "FBXMesh", At( World, { 1, 1, 1, 1 }, Turned ) );
  Check( "FBXColoredMesh", At( World, Plain, Turned ) );
  Check( "Segment", With( At( World, Plain, Turned ), { { "v_localnormal", Normal } } ) );
  Check( "Stick", At( World, { 0.75f, 0.25f, 0, 0.9f }, Turned ) );
  Check( "NonUniformSphere", At( World, Plain, Model.mapVector( Local ) ) );
  Check( "Target", At( Local * 40 + QVector3D( -80, 60, 35 ), Plain, Normal ) );
  Check( "MissingMarker", At( Sized, Plain, Local ) );
  Check( "Sphere", At( Sized, Plain, Local ) );
  Check( "Simple3D", At( Local, Own ) );
  Check( "ColoredLine", At( Local, Own ) );
  Check( "Simple3DUniformColour", At( Local, Plain ) );
  Check( "Simple3DVertexColour", At( Local, Own ) );
  Check( "Simple3DPointSize", With( At( Local, Own ), { { "gl_PointSize", 7 } } ) );
  Check( "PlumeMarkerTrails", With( At( Local, Plain ), { { "gl_PointSize", 4 } } ) );
  Check( "Simple", { { "gl_Position", QVector4D( Local, 1 ) } } );
  Check( "SimpleColour", { { "gl_Position", QVector4D( Local, 1 ) }, { "v_colour", Own } } );
  Check( "FullScreen", { { "gl_Position", { -0.4f, -0.2f, 0, 1 } }, { "v_uv", { 0.3f, 0.4f } } } );
  Check( "ScreenSpaceAxis", { { "gl_Position", { Axes.x(), Axes.y(), -Axes.z(), 1 } }, { "v_colour", Own } } );
  Check( "Billboard", With( At( World, Plain ), { { "v_uv", { 0.3f, 0.25f } } } ) );
  Check( "FloorGrid", With( At( { Floor, 0 }, Own ), { { "v_floor", Floor } } ) );
  Check( "FloorGrid", With( At( { Floor.x(), 0, Floor.y() }, Own ), { { "v_floor", Floor } } ),
         { { "u_Up", { 0, 1, 0 } } } );
  // Sensor pixels on the plane before a camera.
  const VValues Pixel = { { "a_position", { 320, 768 } } };
  Check( "Centroid3D", OnPlane( 320, 768, Own ), Pixel );
  Check( "Greyscale3D", OnPlane( 176, 200, Own ), Pixel );
  Check( "Edge3D", OnPlane( 175.75f, 200, { 0.5f, 0.5f, 1, 1 } ), Pixel );
  // The ring on a camera's face alone.
  const VValues Camera = At( Model.map( QVector3D( 12, 16, -75 ) ), Plain, Model.mapVector( Normal ) );
  const VValues Side = With( Camera, { { "v_faceradial", 0 }, { "v_normal", Model.mapVector( { 1, 0, 0.5f } ) } } );
  Check( "Camera", With( Camera, { { "v_faceradial", 0.5f } } ) );
  Check( "Camera", Side, { { "a_normal", { 1, 0, 0.5f } } } );
  // A ray ends far away.
  const VValues Ray = At( { 1, 2, 3 }, Own );
  Check( "CameraRay", With( Ray, { { "gl_Position", Ray.at( "gl_Position" ).Vec4() * 2 } } ),
         { { "a_position", { 2, 4, 6, 2 } } } );
  // Markers are never specks, unless they have no size.
  const float Pixels = Perspective( 1, 1 ) * 600 / At( Middle, Own )["gl_Position"][3]; // of 2 mm there
  Check( "Sphere", At( Local * ( 1.75f * 2 / Pixels ) + Middle, Plain, Local ),
         { { "u_ReconPosAndSize", QVector4D( Middle, 0.1f ) } } );
  Check( "Sphere", At( Middle, Plain, Local ), { { "u_ReconPosAndSize", QVector4D( Middle, 0 ) } } );
  for ( const auto& [Radius, Size] : { std::pair( 0.1f, 3.0f ), { 90.0f, 90 * Pixels } } )
  {
    Check( "SpherePoint", With( At( Middle, Plain, Eye - Middle ), { { "gl_PointSize", Size } } ),
           { { "a_position", QVector4D( Middle, Radius ) } } );
  }
  EXPECT_EQ( Bench.Vertex( "Point3D", Values )["gl_PointSize"], VValue{ 2 } );
  EXPECT_EQ( Bench.Vertex( "Point3D", Values )["v_colour"], VValue( Own ) );
  EXPECT_EQ( Bench.Vertex( "ForcePlate", Values )["v_colour"], VValue( Own * Plain ) );
  // A mirrored model does not turn its normals inside out.
  QMatrix4x4 Mirror;
  Mirror.scale( -1, 1, 1 );
  EXPECT_EQ( Bench.Vertex( "Stick", With( Values, { { "u_ModelTransform", Mirror } } ) )["v_normal"],
             VValue( Normal ) );
}
