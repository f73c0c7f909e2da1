#include "ShaderBench.h"

#include <cmath>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;
using SensorShaderTest = ShaderTest;

namespace
{
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
    const float Sine = std::sin( Angle ), Cosine = std::cos( Angle );
    return { { "u_SensorSize", Size },
             { "u_RadialDistortionCentre", LensCentre },
             { "u_RadialDistortionParameters", Lens },
             { "u_RotationCentre", Pivot },
             { "u_Rotation", { Cosine, Sine, -Sine, Cosine } },
             { "u_RotationInverse", { Cosine, -Sine, Sine, Cosine } },
             { "u_ViewportSize", { 800, 600 } },
             { "u_SensorImageOffsetScale", { 16, 8, 0.5f, 0.25f } },
             { "u_PointSize", 7 },
             { "a_colour", { 0.5f, 1, 1, 1 } },
             { "u_View2D", View } };
  }

  /// Where a sensor point lands in the clip volume; `i_Shift` is added behind the lens.
  QVector4D Clip( double i_X, double i_Y, double i_Shift ) const
  {
    if ( !LensCentre.isNull() )
    {
      const double X = i_X - LensCentre.x(), Y = i_Y - LensCentre.y(), D = X * X + Y * Y;
      const double Scale = 1 + Lens.x() * D + Lens.y() * D * D + Lens.z() * D * D * D;
      i_X = LensCentre.x() + X * Scale;
      i_Y = LensCentre.y() + Y * Scale;
    }
    const double X = i_X + i_Shift - Pivot.x(), Y = i_Y + i_Shift - Pivot.y();
    const double TurnedX = ( std::cos( Angle ) * X - std::sin( Angle ) * Y + Pivot.x() ) / Size.x();
    const double TurnedY = ( std::sin( Angle ) * X + std::cos( Angle ) * Y + Pivot.y() ) / Size.y();
    return { float( ( TurnedX - View.z() ) * 2 * View.x() ), float( -( TurnedY - View.w() ) * 2 * View.y() ), 0, 1 };
  }
};
} // namespace

TEST_F( SensorShaderTest, AllOfASensorLandsBySameRule )
{
  // Pixel centres take half a pixel behind the lens, pixel edges do not; an offset is added there, too.
  struct VCase
  {
    const char* Name;
    float Shift;
    bool bImage, bUnit;
    float LeftEdge;
  };
  const VCase Cases[] = { { "Centroid2D", 0.5f, false, false, 0 }, { "General2D", 3.5f, false, false, 0 },
                          { "Edge2D", 3.5f, true, false, 0.5f },   { "Greyscale2D", 0.5f, true, false, 0 },
                          { "WandWave2D", 0.5f, false, false, 0 }, { "MaskSquare", 3, false, false, 0 },
                          { "Frame", 0, false, true, 0 },          { "Video", 0, false, true, 0 } };
  VSensor Bare;
  Bare.LensCentre = {};
  for ( const VSensor& rSensor : { VSensor(), Bare } )
  {
    for ( const VCase& rCase : Cases )
    {
      for ( const QVector2D Point : { QVector2D( 0, 0 ), QVector2D( 1270, 33 ), QVector2D( 400, 1000 ) } )
      {
        const QVector3D Given( rCase.bUnit ? Point / rSensor.Size : Point, 0.25f );
        const QVector2D InImage = QVector2D( 0.5f, 0.25f ) * ( Point - QVector2D( rCase.LeftEdge, 0 ) );
        const QVector2D Place = rCase.bImage ? QVector2D( 16, 8 ) + InImage : Point;
        VValues Found =
            Bench.Vertex( rCase.Name, With( rSensor.Values(), { { "a_position", Given }, { "u_Offset", { 3, 3 } } } ) );
        EXPECT_TRUE( IsNear( Found["gl_Position"], rSensor.Clip( Place.x(), Place.y(), rCase.Shift ), 2e-5f ) )
            << rCase.Name;
      }
    }
  }

  // The maps of a maximised image move its pixels: column 42 stays, row 10 goes to 20.
  VSensor Small;
  Small.Size = { 64, 32 };
  Small.LensCentre = { 30, 17 };
  Small.Lens = { 1e-4f, 0, 0 };
  std::vector< float > Columns( 64 ), Rows( 32, 0.5f / 32 );
  for ( std::size_t Index = 0; Index < 64; ++Index )
  {
    Columns[Index] = ( float( Index ) + 0.5f ) / 64;
  }
  Rows[10] = 20.5f / 32;
  const VValues Maps = { { "a_position", { 40, 10 } },
                         { "u_MapOffsetScale", { 2, 0, 1, 1 } },
                         { "t_MapX", Bench.Texture( 64, 1, Columns ) },
                         { "t_MapY", Bench.Texture( 32, 1, Rows ) } };
  VValues Found = Bench.Vertex( "GreyscaleMaximised", With( Small.Values(), Maps ) );
  EXPECT_TRUE( IsNear( Found["gl_Position"], Small.Clip( 42, 20, 0.5 ), 1e-5f ) );
}

TEST_F( SensorShaderTest, SizesAndColoursInASensorsView )
{
  const QVector4D Own( 0.5f, 1, 1, 1 );
  const VValues Values = With(
      VSensor().Values(), { { "u_SensorImageOffsetScale", { 0, 0, 4, 4 } }, { "u_MapOffsetScale", { 0, 0, 4, 4 } } } );
  constexpr float PixelSize = 800 * 0.8f / 1280; // of a sensor pixel on the screen
  const QVector4D Grey( 0.3f, 0.3f, 0.3f, 1 );
  const std::tuple< const char*, float, float, QVector4D > Sizes[] = {
      { "Centroid2D", 10, 20 * PixelSize, Own },
      { "Centroid2D", 2.01f, 2.01f * 2 * PixelSize, Own },
      { "Centroid2D", 1.9f, 1, Own },
      { "Greyscale2D", 0, 4 * PixelSize + 0.5f, Own },
      { "GreyscaleMaximised", 0, 4 * PixelSize + 0.5f, Own },
      { "Edge2D", 0.3f, 7, Grey },
      { "General2D", 0.3f, 7, Grey } };
  for ( const auto& [pName, Z, Size, rColour] : Sizes )
  {
    VValues Found = Bench.Vertex( pName, With( Values, { { "a_position", { 5, 6, Z } } } ) );
    EXPECT_TRUE( IsNear( Found["gl_PointSize"], Size ) ) << pName;
    EXPECT_TRUE( IsNear( Found["v_colour"], rColour ) ) << pName;
  }

  // The wand from new to old, and its point shrinking with it.
  const QVector3D New = QVector3D( 231, 101, 0 ) / 255;
  for ( const float Age : { -10.0f, 0.0f, 125.0f, 500.0f, 2000.0f } )
  {
    constexpr float Frame = 700;
    const float Fresh = std::clamp( 1 - Age / 500, 0.0f, 1.0f );
    const float Wave = std::abs( std::cos( 0.01f * ( Frame - Age ) ) );
    const QVector3D Old = QVector3D( 75, 120, 170 ) / 255 * ( 1 - Wave ) + QVector3D( 80, 125, 177.5f ) / 255 * Wave;
    VValues Found = Bench.Vertex(
        "WandWave2D", With( Values, { { "a_position", { 5, 6, Frame - Age } }, { "u_FrameNumber", Frame } } ) );
    EXPECT_TRUE( IsNear( Found["v_colour"], QVector4D( New * Fresh + Old * ( 1 - Fresh ), 1 ) ) ) << Age;
    EXPECT_TRUE( IsNear( Found["gl_PointSize"], 50 * PixelSize + Fresh ) ) << Age;
  }

  // Video: the part of the image, and the image upside down.
  for ( const auto& [Inverted, V] : { std::pair( 0.0f, 0.575f ), { 1.0f, 0.425f } } )
  {
    const VValues Part = { { "a_position", { 0.25f, 0.75f } },
                           { "u_VideoScaleAndOffset", { 2, 0.5f, 0.1f, 0.2f } },
                           { "u_Inverted", Inverted } };
    EXPECT_TRUE( IsNear( Bench.Vertex( "Video", With( Values, Part ) )["v_uv"], { 0.6f, V }, 1e-6f ) );
  }
}

TEST_F( SensorShaderTest, AWorldIsWarpedToWhatTheSensorSaw )
{
  // The picture holds its own places, the tile shows all of the sensor, turned and smaller than the tile.
  constexpr int Texels = 512;
  std::vector< float > Places;
  for ( int Index = 0; Index < Texels * Texels; ++Index )
  {
    Places.insert( Places.end(), { ( float( Index % Texels ) + 0.5f ) / Texels,
                                   ( float( Index / Texels ) + 0.5f ) / Texels, 0.5f, 0.25f } );
  }
  const VSensor Sensor;
  VValues Values = With( Sensor.Values(), { { "t_DiffuseTexture", Bench.Texture( Texels, Texels, Places ) } } );
  const double Sine = std::sin( Sensor.Angle ), Cosine = std::cos( Sensor.Angle );
  int Inside = 0;
  for ( int Index = 0; Index < 100; ++Index )
  {
    const QVector2D Uv( 0.05f + 0.1f * float( Index % 10 ), 0.05f + 0.1f * float( Index / 10 ) );
    Values["v_uv"] = Uv;
    const double X = ( ( Uv.x() - 0.5 ) / Sensor.View.x() + Sensor.View.z() ) * Sensor.Size.x() - Sensor.Pivot.x();
    const double Y = ( ( 0.5 - Uv.y() ) / Sensor.View.y() + Sensor.View.w() ) * Sensor.Size.y() - Sensor.Pivot.y();
    const double SensorX = Cosine * X + Sine * Y + Sensor.Pivot.x(), SensorY = Cosine * Y - Sine * X + Sensor.Pivot.y();
    if ( SensorX < 0 || SensorX > Sensor.Size.x() || SensorY < 0 || SensorY > Sensor.Size.y() )
    {
      ExpectPixel( "Distort", Values, { 0, 0, 0, 1 }, 0 );
      continue;
    }
    ++Inside;
    const QVector4D Clip = Sensor.Clip( SensorX - 0.5, SensorY - 0.5, 0.5 );
    const bool bDrawn = std::abs( Clip.x() ) <= 1 && std::abs( Clip.y() ) <= 1;
    const QVector4D Place( Clip.x() * 0.5f + 0.5f, Clip.y() * 0.5f + 0.5f, 0.5f, 0.25f );
    ExpectPixel( "Distort", Values, bDrawn ? Place : QVector4D(), 1.01f / Texels );
  }
  EXPECT_GT( Inside, 30 );
  EXPECT_LT( Inside, 90 );
}
