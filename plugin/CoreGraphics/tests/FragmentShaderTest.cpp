#include "ShaderBench.h"

#include <cmath>
#include <random>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;
using FragmentShaderTest = ShaderTest;

namespace
{
constexpr int Side = VShaderBench::Side;
const QVector3D Tint( 0.9f, 0.5f, 0.2f );

float PositiveDot( const QVector3D& i_rA, const QVector3D& i_rB )
{
  return std::max( 0.0f, QVector3D::dotProduct( i_rA, i_rB ) );
}

/// A surface in the light, as the lit programs see it.
struct VSurface
{
  QVector3D Up, Position, Normal, ToCamera;
  QVector3D Light = ( QVector3D( 1, 1, 1 ) + Up * 2 ).normalized();
  float Facing = PositiveDot( Normal, ToCamera );
  VValues Values = { { "u_Up", Up },
                     { "u_LightVector", Light },
                     { "u_CameraPosition", Position + ToCamera * 2000 },
                     { "v_position", Position },
                     { "v_normal", Normal * 3 },
                     { "v_eye", ToCamera * -2000 },
                     { "v_localnormal", { 1, 0, 0 } },
                     { "v_colour", QVector4D( Tint, 0.7f ) } };

  float Lit( float i_Ambient, float i_Bounce, float i_Top, float i_Camera ) const
  {
    return std::min( 1.0f, i_Ambient + i_Bounce * PositiveDot( Normal, -Up ) + i_Top * PositiveDot( Normal, Light ) +
                               i_Camera * Facing );
  }
};
} // namespace

TEST_F( FragmentShaderTest, LightIsTheSumOfItsTerms )
{
  const std::tuple< const char*, float, float, float, float > Lights[] = { { "SimpleLighting", 0.2f, 0.2f, 0.8f, 0.5f },
                                                                           { "Camera", 0.1f, 0.2f, 0, 0 },
                                                                           { "Covariance", 0.5f, 0.2f, 0.2f, 1 },
                                                                           { "Segment", 0.2f, 0.2f, 0.8f, 0.5f },
                                                                           { "ForcePlate", 0.2f, 0.2f, 0.8f, 0.5f } };
  const QVector3D Image( 0.4f, 0.8f, 0.2f ), Specular( 0.3f, 0.2f, 0.1f ), Emissive( 0.01f, 0.02f, 0.3f );
  const float Luma = QVector3D::dotProduct( Image, { 0.299f, 0.587f, 0.114f } );
  const VValues Material = {
      { "t_DiffuseTexture", Bench.Texture( 2, 1, { 0.4f, 0.8f, 0.2f, 1, 0.4f, 0.8f, 0.2f, 0 } ) },
      { "u_UserColourA", { 1, 0, 0, 0.25f } },
      { "u_UserColourB", { 0, 0, 1, 0.5f } },
      { "u_SpecularColour", Specular },
      { "u_EmissiveColour", Emissive },
      { "u_Alpha", 0.6f } };
  std::mt19937 Random( 11 );
  std::normal_distribution< float > Number;
  const auto Direction = [&]
  {
    return QVector3D( Number( Random ), Number( Random ), Number( Random ) ).normalized();
  };
  for ( int Index = 0; Index < 24; ++Index )
  {
    const bool bYUp = Index % 2 == 1, bA = Index % 4 < 2;
    const VSurface Surface{ { 0, bYUp ? 1.0f : 0, bYUp ? 0 : 1.0f }, Direction() * 300, Direction(), Direction() };
    for ( const auto& [pName, Ambient, Bounce, Top, Camera] : Lights )
    {
      ExpectPixel( pName, Surface.Values, QVector4D( Tint * Surface.Lit( Ambient, Bounce, Top, Camera ), 0.7f ) );
    }
    const float Facing = QVector3D::dotProduct( Surface.ToCamera, Surface.Normal );
    ExpectPixel( "XRay", With( Surface.Values, Material ), QVector4D( Tint, ( 1 - Facing ) * 0.25f + Luma * 0.03f ) );
    ExpectPixel( "MissingMarker", Surface.Values, QVector4D( Tint, std::max( 0.0f, Facing - 0.5f ) ) );
    // The texture's alpha chooses the user's colour; the camera's light is that of the side seen from the side.
    const QVector3D Painted = bA ? Image * 0.75f + QVector3D( 0.25f, 0, 0 ) : Image * 0.5f + QVector3D( 0, 0, 0.5f );
    const float Camera = 0.5f * std::max( 0.0f, 1 - QVector3D::dotProduct( Surface.ToCamera, Surface.Up ) );
    const float Rim = 0.25f * std::pow( 1 - Surface.Facing, 4.0f );
    const float Glance = PositiveDot( Surface.Normal, ( Surface.Light + Surface.ToCamera ).normalized() );
    for ( const float Shininess : { 0.0f, 5.0f } )
    {
      const QVector3D Glow = Specular * ( Shininess > 0 ? std::pow( Glance, Shininess ) : 0 ) + Emissive;
      const QVector3D Lit =
          Painted * Tint * Surface.Lit( 0.2f, 0.2f, 0.8f, Camera ) + QVector3D( Rim, Rim, Rim ) + Glow;
      const VValues Seen = { { "v_uv", { bA ? 0.25f : 0.75f, 0.5f } }, { "u_Shininess", Shininess } };
      ExpectPixel( "FBXMaterial", With( With( Surface.Values, Material ), Seen ), QVector4D( Lit, 0.6f ), 2e-3f );
    }
  }
}

TEST_F( FragmentShaderTest, MarksOnLitSurfaces )
{
  // The cross on a plate that is pushed by 25 N or more is 8 thick, and lies on its top alone.
  const QVector3D ToCamera = QVector3D( -1, -3, 2 ).normalized(), Push( 15, 0, 20.1f ), Weak( 15, 0, 19.9f );
  const VSurface Top{ { 0, 0, 1 }, { 100, 50, 0 }, { 0, 0, 1 }, ToCamera };
  const VSurface TopOfY{ { 0, 1, 0 }, { 100, 0, 50 }, { 0, 1, 0 }, ToCamera };
  const VSurface Flank{ { 0, 0, 1 }, { 100, 50, 0 }, QVector3D( 0, -1, 0.09f ).normalized(), ToCamera };
  const QVector4D Line( 1, 0.5f, 0.5f, 0.7f ), Plain( Tint * Top.Lit( 0.2f, 0.2f, 0.8f, 0.5f ), 0.7f );
  const std::tuple< VSurface, QVector3D, QVector3D, bool > Plates[] = {
      { Top, Push, { 3.9f, 200, 10 }, true },   { Top, Push, { 200, -3.9f, 10 }, true },
      { Top, Push, { 4.1f, -4.1f, 0 }, false }, { Top, Weak, { 0, 0, 0 }, false },
      { Flank, Push, { 0, 0, 0 }, false },      { TopOfY, Push, { 200, 10, 3.9f }, true },
      { TopOfY, Push, { 200, 0, 200 }, false } };
  for ( const auto& [rSurface, rForce, rFromCentre, bLine] : Plates )
  {
    const VValues Pressed = { { "u_Force", rForce }, { "u_CentreOfPressure", rSurface.Position - rFromCentre } };
    const QVector4D Lit( Tint * rSurface.Lit( 0.2f, 0.2f, 0.8f, 0.5f ), 0.7f );
    ExpectPixel( "ForcePlate", With( rSurface.Values, Pressed ), bLine ? Line : Lit );
  }
  // The bone's stripe, and the ring around a camera's lens.
  const QVector4D Striped( Plain.toVector3D() * 0.67f, 0.7f );
  ExpectPixel( "Segment", With( Top.Values, { { "v_localnormal", { 0.09f, 0.5f, 0.5f } } } ), Striped );
  ExpectPixel( "Segment", With( Top.Values, { { "v_localnormal", { -0.11f, 0.5f, 0.5f } } } ), Plain );
  ExpectPixel( "Segment", With( Top.Values, { { "v_localnormal", { 0.05f, -0.5f, 0.5f } } } ), Plain );
  ExpectPixel( "Camera", With( Top.Values, { { "v_faceradial", 0.51f } } ), { 1, 0, 0, 0.7f } );
  ExpectPixel( "Camera", With( Top.Values, { { "v_faceradial", 0.49f } } ), { 0.09f, 0.05f, 0.02f, 0.7f } );
}

TEST_F( FragmentShaderTest, WhatIsClippedAndWhereAlphaChanges )
{
  const QVector4D Plain( 0.1f, 0.2f, 0.3f, 0.4f );
  const VValues Colour = { { "v_colour", Plain }, { "u_Colour", Plain } };
  const float Lines = Bench.Texture( 4, 1, { 1, 0, 0, 0 } );
  ExpectPixel( "Colour", Colour, Plain );
  ExpectPixel( "UniformColour", Colour, Plain );
  ExpectPixel( "Mask", Colour, Plain );
  ExpectPixel( "Greyscale2D", Colour, { 0.1f, 0.1f, 0.1f, 1 } );
  ExpectPixel( "Selection", { { "u_SelectionId", { 0.1f, 0.2f, 0.3f } } }, { 0.1f, 0.2f, 0.3f, 1 / 255.0f }, 1e-6f );
  const float Picture = Bench.Texture( 2, 2, { 0, 0.25f, 0.5f, 0.75f } );
  ExpectPixel( "Copy", { { "t_DiffuseTexture", Picture }, { "u_FrameSize", { 16, 32 } } }, { 0.25f, 0, 0, 1 } );
  for ( const bool bYUp : { false, true } )
  {
    const QVector3D Up( 0, bYUp ? 1 : 0, bYUp ? 0 : 1 ), Across( -50, bYUp ? 0 : -9, bYUp ? -9 : 0 );
    const std::tuple< const char*, float, VValue > Heights[] = { { "ClipFloor", -0.1f, Untouched },
                                                                 { "ClipFloor", 0.1f, Plain },
                                                                 { "CameraCoverageFurstum", -0.1f, Untouched },
                                                                 { "CameraCoverageFurstum", 0.1f, { 1, 0, 1, 1 } },
                                                                 { "CameraCoverageFurstum", 9.9f, { 1, 0, 1, 1 } },
                                                                 { "CameraCoverageFurstum", 10.1f, Plain } };
    for ( const auto& [pName, Height, rExpected] : Heights )
    {
      ExpectPixel( pName, With( Colour, { { "u_Up", Up }, { "v_position", Up * Height + Across } } ), rExpected );
    }
    // Coarse lines count whole and fine ones half; from below all is faint.
    const std::tuple< float, float, float, float > Floors[] = {
        { 10, 100, 0.5f, 0.75f }, { 110, 100, 0.5f, 0.75f }, { 510, -100, 0.33f, 0.25f }, { 610, -100, 0.16f, 0.25f } };
    for ( const auto& [X, Height, Grey, Alpha] : Floors )
    {
      const VValues Floor = { { "t_Texture", Lines },
                              { "u_GridSpacings", { 1000, 250 } },
                              { "v_floor", { X, X } },
                              { "u_Up", Up },
                              { "u_CameraPosition", Up * Height + Across } };
      ExpectPixel( "FloorGrid", Floor, { Grey, Grey, Grey, Alpha } );
    }
  }
  for ( const float Distance : { 0.0f, 3.9f, 4.1f, 7.9f, 8.1f, 803.9f, 804.1f } )
  {
    const VValues Values = { { "u_SourcePoint", { 1, 2, 3 } }, { "v_position", { 1, 2 + Distance, 3 } } };
    ExpectPixel( "StippledLine", With( Colour, Values ), std::fmod( Distance, 8.0f ) > 4 ? Untouched : Plain );
  }
  // The halo is full at 0.2 and gone 0.1 further in or out.
  for ( const float Radius : { 0.0f, 0.1f, 0.15f, 0.2f, 0.25f, 0.3f } )
  {
    const VValues Values = With( Colour, { { "v_uv", { 0.6f * Radius, -0.8f * Radius } } } );
    ExpectPixel( "ActiveLabelHalo", Values, Plain * std::max( 0.0f, 1 - std::abs( Radius - 0.2f ) / 0.1f ) );
  }
}

TEST_F( FragmentShaderTest, PointsOfASensorsView )
{
  constexpr float Size = 22.4f;
  const VValues Colour = { { "v_colour", { 0.5f, 0.25f, 32 / 255.0f, 0.8f } }, { "v_size", Size } };
  // A disc: cross through the middle, border of 2, in between paler; outside nothing.
  const VShaderBench::VImage Disc = Bench.Fragment( "Centroid2D", Colour, 14 );
  const VShaderBench::VImage Wand = Bench.Fragment( "WandWave2D", Colour, 14 );
  const VShaderBench::VImage Hard = Bench.Fragment( "Centroid2DSelection", Colour, 14 );
  for ( int Pixel = 0; Pixel < 14 * 14; ++Pixel )
  {
    const int X = 1 + Pixel % 14, Y = 1 + Pixel / 14;
    const float Dx = std::abs( float( X ) - 7.5f ) * Size / 14, Dy = std::abs( float( Y ) - 7.5f ) * Size / 14;
    const float Inner = Size / 2 - std::hypot( Dx, Dy );
    const float Share = Inner < 2 || std::min( Dx, Dy ) < 0.75f ? 0.8f : 0.8f * 0.3f;
    const float Alpha = Share * std::clamp( Inner + 0.5f, 0.0f, 1.0f );
    EXPECT_TRUE( IsNear( Disc.At( X, Y ), { 0.5f, 0.25f, 32 / 255.0f, Alpha }, 4e-3f ) ) << X << ' ' << Y;
    EXPECT_NEAR( Wand.At( X, Y ).w(), 0.8f * std::max( 0.0f, Inner / Size * 2 ), 1e-3f ) << X << ' ' << Y;
    EXPECT_EQ( Hard.At( X, Y ) == Untouched, Inner < 0 ) << X << ' ' << Y;
  }
  for ( const auto& [Small, bSquare] : { std::pair( 2.0f, true ), { 2.1f, false } } )
  {
    const VValues Values = With( Colour, { { "v_size", Small } } );
    EXPECT_EQ( Bench.Fragment( "Centroid2DSelection", Values, 14 ).At( 1, 1 ) == Untouched, !bSquare );
    EXPECT_TRUE( !bSquare || Bench.Fragment( "Centroid2D", Values, 14 ).At( 7, 7 ).w() == 0.8f );
  }
  // What is not selected vanishes where only the selection is to be shown.
  for ( const char* pName : { "Centroid2DSelection", "Greyscale2DSelection", "MaskSelection" } )
  {
    for ( const auto& [Blue, Show] : { std::pair( 31.0f, 0.0f ), { 31.0f, 1.0f }, { 32.0f, 0.0f }, { 32.0f, 1.0f } } )
    {
      const QVector4D Id( 7 / 255.0f, 9 / 255.0f, Blue / 255, 1 / 255.0f );
      const VValues Values = With( Colour, { { "v_colour", Id }, { "u_ShowSelection", Show } } );
      EXPECT_EQ( Bench.Fragment( pName, Values, 14 ).At( 8, 8 ), Blue < 32 && Show > 0 ? Untouched : Id ) << pName;
    }
  }
}
