#include "ShaderBench.h"

#include <QtGui/QGenericMatrix>

#include <cmath>
#include <limits>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
using VValues = VShaderBench::VValues;

constexpr float Nan = std::numeric_limits< float >::quiet_NaN();

QVector3D Projected( const QVector4D& i_rClip )
{
  return i_rClip.toVector3DAffine();
}

void ExpectNear( const QVector4D& i_rFound, const QVector4D& i_rExpected, float i_Tolerance,
                 const std::string& i_rWhat )
{
  EXPECT_LE( ( i_rFound - i_rExpected ).length(), i_Tolerance )
      << i_rWhat << ": " << i_rFound.x() << ' ' << i_rFound.y() << ' ' << i_rFound.z() << ' ' << i_rFound.w() << " for "
      << i_rExpected.x() << ' ' << i_rExpected.y() << ' ' << i_rExpected.z() << ' ' << i_rExpected.w();
}

/// A sensor as a tile shows it.
struct VSensor
{
  QVector2D Size{ 1280, 1024 };
  QVector2D LensCentre{ 655, 498 };
  QVector3D Lens{ 1.1e-7f, -3.0e-14f, 2.0e-21f };
  QVector2D Pivot{ 600, 540 };
  float Angle = 0.7f;
  QVector4D View{ 0.8f, 1.1f, 0.45f, 0.55f };

  VValues Values() const
  {
    const float Sine = std::sin( Angle );
    const float Cosine = std::cos( Angle );
    return { { "u_SensorSize", { Size.x(), Size.y() } },
             { "u_RadialDistortionCentre", { LensCentre.x(), LensCentre.y() } },
             { "u_RadialDistortionParameters", Floats( Lens ) },
             { "u_RotationCentre", { Pivot.x(), Pivot.y() } },
             { "u_Rotation", { Cosine, Sine, -Sine, Cosine } },
             { "u_View2D", { View.x(), View.y(), View.z(), View.w() } },
             { "u_ViewportSize", { 800, 600 } } };
  }

  /// Where a sensor point lands in the clip volume; `i_Shift` is added behind the lens.
  QVector4D Clip( double i_X, double i_Y, double i_Shift ) const
  {
    if ( !LensCentre.isNull() )
    {
      const double X = i_X - LensCentre.x();
      const double Y = i_Y - LensCentre.y();
      const double D = X * X + Y * Y;
      const double Scale = 1 + Lens.x() * D + Lens.y() * D * D + Lens.z() * D * D * D;
      i_X = LensCentre.x() + X * Scale;
      i_Y = LensCentre.y() + Y * Scale;
    }
    const double X = i_X + i_Shift - Pivot.x();
    const double Y = i_Y + i_Shift - Pivot.y();
    const double TurnedX = ( std::cos( Angle ) * X - std::sin( Angle ) * Y + Pivot.x() ) / Size.x();
    const double TurnedY = ( std::sin( Angle ) * X + std::cos( Angle ) * Y + Pivot.y() ) / Size.y();
    return { float( ( TurnedX - View.z() ) * 2 * View.x() ), float( -( TurnedY - View.w() ) * 2 * View.y() ), 0, 1 };
  }
};
} // namespace

class VertexShaderTest : public testing::TestWithParam< EContextKind >
{
public:
  VertexShaderTest()
    : Bench( GetParam() )
  {
    View.lookAt( { 900, -2500, 1400 }, { 0, 0, 300 }, { 0, 0, 1 } );
    Perspective.perspective( 45, 1.25f, 1, 100000 );
    Parallel.ortho( -2000, 2000, -1500, 1500, 1, 100000 );
    Model.translate( 120, -40, 75 );
    Model.rotate( 50, { 1, 2, 3 } );
    Model.scale( 2, 3, 0.5f );
  }

  VValues Camera( const QMatrix4x4& i_rProjection, bool i_bYUp = false ) const
  {
    return { { "u_ViewProjection", Floats( i_rProjection * View ) },
             { "u_Projection", Floats( i_rProjection ) },
             { "u_CameraPosition", Floats( View.inverted().column( 3 ).toVector3D() ) },
             { "u_LightVector", Floats( QVector3D( 1, i_bYUp ? 3 : 1, i_bYUp ? 1 : 3 ).normalized() ) },
             { "u_Up", { 0, i_bYUp ? 1.0f : 0.0f, i_bYUp ? 0.0f : 1.0f } },
             { "u_ModelTransform", Floats( Model ) } };
  }

  VShaderBench Bench;
  QMatrix4x4 View, Perspective, Parallel, Model;
};
INSTANTIATE_TEST_SUITE_P( Contexts, VertexShaderTest, testing::Values( EKindCore, EKindES ), KindName );

TEST_P( VertexShaderTest, AllOfASensorLandsBySameRule )
{
  // Pixel centres take half a pixel behind the lens, pixel edges do not; an offset is added there, too.
  struct VCase
  {
    const char* Name;
    float Half;
    bool bImage;
    bool bOffset;
    float LeftEdge;
  };
  const VCase Cases[] = { { "Centroid2D", 0.5f, false, false, 0 }, { "General2D", 0.5f, false, true, 0 },
                          { "Edge2D", 0.5f, true, true, 0.5f },    { "Greyscale2D", 0.5f, true, false, 0 },
                          { "WandWave2D", 0.5f, false, false, 0 }, { "MaskSquare", 0, false, true, 0 },
                          { "Frame", 0, false, false, 0 },         { "Video", 0, false, false, 0 } };
  constexpr float Offset = 3;
  VSensor Bare;
  Bare.LensCentre = {};
  for ( const VSensor& rSensor : { VSensor(), Bare } )
  {
    for ( const VCase& rCase : Cases )
    {
      const bool bUnit = rCase.Name == std::string( "Frame" ) || rCase.Name == std::string( "Video" );
      for ( const QVector2D Point : { QVector2D( 0, 0 ), QVector2D( 1270, 33 ), QVector2D( 400, 1000 ) } )
      {
        const QVector2D Given = bUnit ? Point / rSensor.Size : Point;
        const VValues Values = With( rSensor.Values(), { { "a_position", { Given.x(), Given.y(), 0.25f } },
                                                         { "u_Offset", { Offset, Offset } },
                                                         { "u_SensorImageOffsetScale", { 16, 8, 0.5f, 0.25f } } } );
        QVector2D Place = Point;
        if ( rCase.bImage )
        {
          Place = QVector2D( 16, 8 ) + QVector2D( 0.5f, 0.25f ) * ( Point - QVector2D( rCase.LeftEdge, 0 ) );
        }
        const float Shift = rCase.Half + ( rCase.bOffset ? Offset : 0 );
        ExpectNear( Vec4( Bench.Vertex( rCase.Name, Values )["gl_Position"] ),
                    rSensor.Clip( Place.x(), Place.y(), Shift ), 2e-5f, rCase.Name );
      }
    }
  }
}

TEST_P( VertexShaderTest, SizesAndColoursInASensorsView )
{
  const VSensor Sensor;
  const VValues Base = With( Sensor.Values(), { { "u_SensorImageOffsetScale", { 0, 0, 4, 4 } },
                                                { "u_MapOffsetScale", { 0, 0, 4, 4 } },
                                                { "u_PointSize", { 9 } } } );
  constexpr float PixelSize = 800 * 0.8f / 1280; // of a sensor pixel on the screen
  const auto Size = [&]( const char* i_pName, float i_Z )
  {
    return Bench.Vertex( i_pName, With( Base, { { "a_position", { 5, 6, i_Z } } } ) )["gl_PointSize"].at( 0 );
  };
  EXPECT_NEAR( Size( "Centroid2D", 10 ), 20 * PixelSize, 1e-4 );
  EXPECT_NEAR( Size( "Centroid2D", 2.01f ), 2.01f * 2 * PixelSize, 1e-4 );
  EXPECT_EQ( Size( "Centroid2D", 1.9f ), 1 ) << "below 2";
  EXPECT_NEAR( Size( "Greyscale2D", 0 ), 4 * PixelSize + 0.5f, 1e-4 );
  EXPECT_NEAR( Size( "GreyscaleMaximised", 0 ), 4 * PixelSize + 0.5f, 1e-4 );
  EXPECT_EQ( Size( "Edge2D", 0 ), 9 );
  EXPECT_EQ( Size( "General2D", 0 ), 9 );
  for ( const char* pName : { "Edge2D", "General2D" } )
  {
    ExpectNear( Vec4( Bench.Vertex( pName, With( Base, { { "a_position", { 0, 0, 0.3f } } } ) )["v_colour"] ),
                { 0.3f, 0.3f, 0.3f, 1 }, 1e-6f, pName );
  }

  // The wand from new to old, and its point shrinking with it.
  const QVector3D New = QVector3D( 231, 101, 0 ) / 255;
  for ( const float Age : { -10.0f, 0.0f, 125.0f, 500.0f, 2000.0f } )
  {
    constexpr float Frame = 700;
    const float Fresh = std::clamp( 1 - Age / 500, 0.0f, 1.0f );
    const float Wave = std::abs( std::cos( 0.01f * ( Frame - Age ) ) );
    const QVector3D Old = QVector3D( 75, 120, 170 ) / 255 * ( 1 - Wave ) + QVector3D( 80, 125, 177.5f ) / 255 * Wave;
    VValues Found = Bench.Vertex( "WandWave2D", With( Base, { { "a_position", { 5, 6, Frame - Age } },
                                                              { "a_colour", { 0, 0, 0, 0.5f } },
                                                              { "u_FrameNumber", { Frame } } } ) );
    ExpectNear( Vec4( Found["v_colour"] ), QVector4D( New * Fresh + Old * ( 1 - Fresh ), 0.5f ), 1e-4f, "wand" );
    EXPECT_NEAR( Found["gl_PointSize"][0], 50 * PixelSize + Fresh, 1e-4 );
  }

  // Video: the part of the image, and the image upside down.
  const VValues Scaled = { { "a_position", { 0.25f, 0.75f } }, { "u_VideoScaleAndOffset", { 2, 0.5f, 0.1f, 0.2f } } };
  for ( const float Inverted : { 0.0f, 1.0f } )
  {
    const std::vector< float > Uv =
        Bench.Vertex( "Video", With( With( Base, Scaled ), { { "u_Inverted", { Inverted } } } ) )["v_uv"];
    EXPECT_NEAR( Uv[0], 0.6f, 1e-6 );
    EXPECT_NEAR( Uv[1], Inverted > 0 ? 0.425f : 0.575f, 1e-6 );
  }
}

TEST_P( VertexShaderTest, TheMapsOfAMaximisedImageMoveItsPixels )
{
  VSensor Sensor;
  Sensor.Size = { 64, 32 };
  Sensor.LensCentre = { 30, 17 };
  Sensor.Lens = { 1e-4f, 0, 0 };
  std::vector< float > Columns( 64 ), Rows( 32 );
  for ( std::size_t Index = 0; Index < 64; ++Index )
  {
    Columns[Index] = ( float( Index ) + 0.5f ) / 64;
    Rows[Index / 2] = float( Index / 2 == 10 ? 20.5f : 0.5f ) / 32;
  }
  const VValues Values = With( Sensor.Values(), { { "a_position", { 40, 10 } },
                                                  { "u_MapOffsetScale", { 2, 0, 1, 1 } },
                                                  { "t_MapX", { Bench.Texture( 64, 1, Columns ) } },
                                                  { "t_MapY", { Bench.Texture( 32, 1, Rows ) } } } );
  ExpectNear( Vec4( Bench.Vertex( "GreyscaleMaximised", Values )["gl_Position"] ), Sensor.Clip( 42, 20, 0.5 ), 1e-5f,
              "column 42 stays, row 10 goes to 20" );
}

TEST_P( VertexShaderTest, ASensorStandsOnThePlaneOfItsCamera )
{
  struct VCase
  {
    const char* Name;
    QVector2D Place; // sensor pixels
  };
  const VCase Cases[] = {
      { "Centroid3D", { 320, 768 } }, { "Greyscale3D", { 176, 200 } }, { "Edge3D", { 175.75f, 200 } } };
  for ( const VCase& rCase : Cases )
  {
    VValues Found = Bench.Vertex(
        rCase.Name, With( Camera( Perspective ), { { "a_position", { 320, 768 } },
                                                   { "u_SensorSize", { 64, 32 } },
                                                   { "u_SensorImageOffsetScale", { 16, 8, 0.5f, 0.25f } } } ) );
    const QVector4D Plane( rCase.Place.x() / 32 - 1, rCase.Place.y() / 16 - 1, 1, 1 );
    const QVector4D Expected = Perspective * ( View * ( Model * Plane ) );
    ExpectNear( Vec4( Found["gl_Position"] ), Expected, 0.01f, rCase.Name );
    if ( rCase.Name == std::string( "Edge3D" ) )
    {
      EXPECT_EQ( Vec4( Found["v_colour"] ), QVector4D( 0.5f, 0.5f, 1, 1 ) );
    }
    else
    {
      EXPECT_EQ( Found["gl_PointSize"][0], 1 );
    }
  }
}

TEST_P( VertexShaderTest, NearnessIsTakenFromWOrInAParallelViewFromDepth )
{
  const VValues Object = { { "a_position", { 10, 20, 0 } },
                           { "u_ReconPosAndSize", { 5, 6, 7, 2 } },
                           { "u_StickColourA", { 0, 0, 0, 1 } },
                           { "u_StickColourB", { 0, 0, 0, 1 } } };
  for ( const bool bYUp : { false, true } )
  {
    const QVector3D Up( 0, bYUp ? 1 : 0, bYUp ? 0 : 1 );
    const QVector3D Light = QVector3D( 1, bYUp ? 3 : 1, bYUp ? 1 : 3 ).normalized();
    const auto Fallen = [&]( const QVector3D& i_rPoint )
    {
      return i_rPoint - Light * QVector3D::dotProduct( i_rPoint, Up ) / QVector3D::dotProduct( Light, Up );
    };
    const QVector3D Local( 10, 20, 0 );
    const std::map< std::string, QVector3D > World = { { "Point3D", Local },
                                                       { "ForcePlate", Model.map( Local ) },
                                                       { "SphereShadow", Fallen( Local * 2 + QVector3D( 5, 6, 7 ) ) },
                                                       { "StickShadow", Fallen( Model.map( Local ) ) } };
    for ( const auto& [rName, rPoint] : World )
    {
      const QVector4D Near = Vec4( Bench.Vertex( rName, With( Camera( Perspective, bYUp ), Object ) )["gl_Position"] );
      ExpectNear( Near, Perspective * ( View * QVector4D( rPoint, 1 ) ) + QVector4D( 0, 0, 0, 0.02f ), 2e-3f, rName );
      const QVector4D Flat = Vec4( Bench.Vertex( rName, With( Camera( Parallel, bYUp ), Object ) )["gl_Position"] );
      const QVector3D Eye = View.map( rPoint ) + QVector3D( 0, 0, 10 );
      ExpectNear( Flat, Parallel * QVector4D( Eye, 1 ), 1e-6f, rName );
      // Nowhere a picture of another size.
      EXPECT_LE( ( Projected( Flat ) - Projected( Parallel * ( View * QVector4D( rPoint, 1 ) ) ) ).length(), 2.1e-4f );
    }
    for ( const float Height : { -5.0f, 0.0f, 1500.0f, 2900.0f, 4000.0f } )
    {
      const float Alpha = 0.5f * std::clamp( 1 - Height / 3000, 0.0f, 1.0f );
      const VValues Sphere = { { "a_position", { 0, 0, 1 } }, { "u_ReconPosAndSize", Floats( Up * Height, 100 ) } };
      ExpectNear( Vec4( Bench.Vertex( "SphereShadow", With( Camera( Parallel, bYUp ), Sphere ) )["v_colour"] ),
                  { 0, 0, 0, Alpha }, 1e-5f, "sphere" );
      // A stick that fades to half of its alpha, seen at its end.
      QMatrix4x4 Place;
      Place.translate( Up * Height - QVector3D( 0, 0, 1 ) );
      const VValues Stick = { { "a_position", { 0, 0, 1 } },
                              { "u_ModelTransform", Floats( Place ) },
                              { "u_StickColourA", { 1, 1, 1, 1 } },
                              { "u_StickColourB", { 1, 1, 1, 0.5f } } };
      ExpectNear( Vec4( Bench.Vertex( "StickShadow", With( Camera( Parallel, bYUp ), Stick ) )["v_colour"] ),
                  { 0, 0, 0, Alpha / 2 }, 1e-5f, "stick" );
    }
  }
}

TEST_P( VertexShaderTest, SkinFollowsItsBonesAndShowsTheirHealth )
{
  QMatrix4x4 Half, Ill, Broken;
  Half.translate( 10, 0, 0 );
  Ill.rotate( 90, { 0, 0, 1 } );
  Broken.fill( Nan );
  std::vector< float > Bones( 250 * 16, 0.0f );
  const auto Put = [&]( std::size_t i_Index, QMatrix4x4 i_Bone, float i_Health )
  {
    i_Bone( 3, 3 ) = i_Health;
    const std::vector< float > Values = Floats( i_Bone );
    std::copy( Values.begin(), Values.end(), Bones.begin() + std::ptrdiff_t( i_Index * 16 ) );
  };
  Put( 0, Broken, Nan );
  Put( 7, Half, 0.5f );
  Put( 249, Ill, 0.25f );
  VValues Values = With( Camera( Perspective ), { { "a_position", { 100, 20, 30 } },
                                                  { "a_normal", { 1, 0, 0 } },
                                                  { "a_uv", { 0.25f, 0.75f } },
                                                  { "a_BoneIndices", { 7, 249, 0, 0 } },
                                                  { "a_BoneWeights", { 0.75f, 0.25f, 0, -1 } },
                                                  { "u_BoneTransforms", Bones } } );
  VValues Found = Bench.Vertex( "FBXSkin", Values );
  const QVector3D Place = QVector3D( 110, 20, 30 ) * 0.75f + QVector3D( -20, 100, 30 ) * 0.25f;
  EXPECT_LE( ( Vec3( Found["v_position"] ) - Place ).length(), 1e-4f ) << "a bone without weight does not count";
  EXPECT_LE( ( Vec3( Found["v_normal"] ) - QVector3D( 0.75f, 0.25f, 0 ) ).length(), 1e-5f );
  EXPECT_LE( ( Vec3( Found["v_eye"] ) - ( Place - QVector3D( 900, -2500, 1400 ) ) ).length(), 1e-2f );
  EXPECT_EQ( Vec4( Found["v_colour"] ), QVector4D( 1, 1, 1, 1 ) );
  ExpectNear( Vec4( Found["gl_Position"] ), Perspective * ( View * QVector4D( Place, 1 ) ), 0.01f, "skin" );
  Values["u_HighlightMissing"] = { 1 };
  const float Health = 1 - 0.5f * 0.75f - 0.75f * 0.25f;
  ExpectNear( Vec4( Bench.Vertex( "FBXSkin", Values )["v_colour"] ), { 1, Health, Health, 1 }, 1e-6f, "health" );
}

TEST_P( VertexShaderTest, MeshesStandWhereTheirTransformsSay )
{
  const VValues Values = With( Camera( Perspective ), { { "a_position", { 0.3f, 0.4f, 0.25f } },
                                                        { "a_normal", { 0, 0.6f, 0.8f } },
                                                        { "a_colour", { 0.5f, 1, 1, 1 } },
                                                        { "a_uv", { 0.1f, 0.2f } },
                                                        { "u_ModelColour", { 0.8f, 0.6f, 0.4f, 0.2f } },
                                                        { "u_SegmentColour", { 0.8f, 0.6f, 0.4f, 0.2f } },
                                                        { "u_StickColourA", { 1, 0, 0, 1 } },
                                                        { "u_StickColourB", { 0, 1, 0, 0.6f } },
                                                        { "u_ReconPosAndSize", { 100, 50, 25, 8 } },
                                                        { "u_TargetPosAndSize", { 100, 50, 25, 8 } } } );
  const QVector3D Local( 0.3f, 0.4f, 0.25f ), Normal( 0, 0.6f, 0.8f );
  const QVector3D Sized = Local * 8 + QVector3D( 100, 50, 25 );
  QMatrix4x4 Turn = Model.inverted().transposed();
  const QVector3D Turned = Turn.mapVector( Normal ).normalized();
  const QVector3D Direct = Model.mapVector( Normal ).normalized();
  const QVector4D Plain( 0.8f, 0.6f, 0.4f, 0.2f ), White( 1, 1, 1, 1 ), Own( 0.5f, 1, 1, 1 );
  struct VCase
  {
    const char* Name;
    QVector3D World, Normal;
    QVector4D Colour;
  };
  const VCase Cases[] = { { "Simple3DModel", Model.map( Local ), Turned, Own },
                          { "Simple3DModelColour", Model.map( Local ), Turned, Plain * Own },
                          { "FBXMesh", Model.map( Local ), Turned, White },
                          { "FBXColoredMesh", Model.map( Local ), Turned, Plain },
                          { "Segment", Model.map( Local ), Turned, Plain },
                          { "Stick", Model.map( Local ), Turned, { 0.75f, 0.25f, 0, 0.9f } },
                          { "Camera", Model.map( QVector3D( 12, 16, -75 ) ), Direct, Plain },
                          { "NonUniformSphere", Model.map( Local ), Model.mapVector( Local ).normalized(), Plain },
                          { "Target", Sized, Normal, Plain },
                          { "MissingMarker", Sized, Local.normalized(), Plain } };
  for ( const VCase& rCase : Cases )
  {
    VValues Found = Bench.Vertex( rCase.Name, Values );
    ExpectNear( Vec4( Found["gl_Position"] ), Perspective * ( View * QVector4D( rCase.World, 1 ) ), 0.01f, rCase.Name );
    ExpectNear( Vec4( Found["v_colour"] ), rCase.Colour, 1e-6f, rCase.Name );
    EXPECT_LE( ( Vec3( Found["v_normal"] ).normalized() - rCase.Normal ).length(), 1e-4f ) << rCase.Name;
    if ( Found.count( "v_position" ) )
    {
      EXPECT_LE( ( Vec3( Found["v_position"] ) - rCase.World ).length(), 1e-3f ) << rCase.Name;
    }
    if ( Found.count( "v_eye" ) )
    {
      EXPECT_LE( ( Vec3( Found["v_eye"] ) - rCase.World + QVector3D( 900, -2500, 1400 ) ).length(), 0.01f );
    }
  }
  EXPECT_NEAR( Bench.Vertex( "Camera", Values )["v_faceradial"][0], 0.5f, 1e-6 );
  EXPECT_EQ( Bench.Vertex( "Camera", With( Values, { { "a_normal", { 1, 0, 0.5f } } } ) )["v_faceradial"][0], 0 );
  EXPECT_EQ( Vec3( Bench.Vertex( "Segment", Values )["v_localnormal"] ), Normal );
  EXPECT_EQ( Bench.Vertex( "Billboard", Values )["v_uv"], ( std::vector< float >{ 0.3f, 0.25f } ) );
  EXPECT_EQ( Vec3( Bench.Vertex( "CameraRay", With( Values, { { "a_position", { 2, 4, 6, 2 } } } ) )["v_position"] ),
             QVector3D( 1, 2, 3 ) );
  EXPECT_EQ( Bench.Vertex( "PlumeMarkerTrails", Values )["gl_PointSize"][0], 4 );
  EXPECT_EQ( Bench.Vertex( "Point3D", Values )["gl_PointSize"][0], 2 );
  // A mirrored model does not turn its normals inside out.
  QMatrix4x4 Mirror;
  Mirror.scale( -1, 1, 1 );
  EXPECT_EQ( Vec3( Bench.Vertex( "Stick", With( Values, { { "u_ModelTransform", Floats( Mirror ) } } ) )["v_normal"] ),
             Normal );
}
