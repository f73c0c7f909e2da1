#include "ShaderBench.h"

#include <cmath>
#include <random>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
using VValues = VShaderBench::VValues;
constexpr int Side = VShaderBench::Side;
const QVector4D Untouched( VShaderBench::Untouched, VShaderBench::Untouched, VShaderBench::Untouched,
                           VShaderBench::Untouched );

std::vector< float > Four( const QVector4D& i_rValue )
{
  return { i_rValue.x(), i_rValue.y(), i_rValue.z(), i_rValue.w() };
}

testing::AssertionResult IsNear( const QVector4D& i_rFound, const QVector4D& i_rExpected, float i_Tolerance = 1e-4f )
{
  if ( ( i_rFound - i_rExpected ).length() <= i_Tolerance )
  {
    return testing::AssertionSuccess();
  }
  return testing::AssertionFailure() << i_rFound.x() << ' ' << i_rFound.y() << ' ' << i_rFound.z() << ' '
                                     << i_rFound.w() << " for " << i_rExpected.x() << ' ' << i_rExpected.y() << ' '
                                     << i_rExpected.z() << ' ' << i_rExpected.w();
}

/// A surface in the light, as the lit programs see it.
struct VSurface
{
  bool bYUp = false;
  QVector3D Position, Normal, Eye;

  QVector3D Up() const { return bYUp ? QVector3D( 0, 1, 0 ) : QVector3D( 0, 0, 1 ); }
  QVector3D Light() const { return QVector3D( 1, bYUp ? 3 : 1, bYUp ? 1 : 3 ).normalized(); }
  QVector3D ToCamera() const { return ( Eye - Position ).normalized(); }
  float Facing() const { return std::max( 0.0f, QVector3D::dotProduct( Normal, ToCamera() ) ); }

  VValues Values() const
  {
    return { { "u_Up", Floats( Up() ) },
             { "u_LightVector", Floats( Light() ) },
             { "u_CameraPosition", Floats( Eye ) },
             { "v_position", Floats( Position ) },
             { "v_normal", Floats( Normal * 3 ) },
             { "v_eye", Floats( Position - Eye ) },
             { "v_localnormal", { 1, 0, 0 } },
             { "v_colour", { 0.9f, 0.5f, 0.2f, 0.7f } } };
  }

  float Lit( float i_Ambient, float i_Bounce, float i_Top, float i_Camera ) const
  {
    const float Sum = i_Ambient + i_Bounce * std::max( 0.0f, -QVector3D::dotProduct( Normal, Up() ) ) +
                      i_Top * std::max( 0.0f, QVector3D::dotProduct( Normal, Light() ) ) + i_Camera * Facing();
    return std::min( Sum, 1.0f );
  }
};

std::vector< VSurface > Surfaces( int i_Count )
{
  std::mt19937 Random( 11 );
  std::normal_distribution< float > Number;
  const auto Vector = [&]( float i_Scale )
  {
    return QVector3D( Number( Random ), Number( Random ), Number( Random ) ) * i_Scale;
  };
  std::vector< VSurface > Made;
  for ( int Index = 0; Index < i_Count; ++Index )
  {
    Made.push_back( { Index % 2 == 1, Vector( 300 ), Vector( 1 ).normalized(), Vector( 2000 ) } );
  }
  return Made;
}
} // namespace

class FragmentShaderTest : public testing::TestWithParam< EContextKind >
{
public:
  VShaderBench Bench{ GetParam() };
};
INSTANTIATE_TEST_SUITE_P( Contexts, FragmentShaderTest, testing::Values( EKindCore, EKindES ), KindName );

TEST_P( FragmentShaderTest, LightIsTheSumOfItsTerms )
{
  struct VCase
  {
    const char* Name;
    float Ambient, Bounce, Top, Camera;
  };
  const VCase Cases[] = { { "SimpleLighting", 0.2f, 0.2f, 0.8f, 0.5f },
                          { "Camera", 0.1f, 0.2f, 0, 0 },
                          { "Covariance", 0.5f, 0.2f, 0.2f, 1 },
                          { "Segment", 0.2f, 0.2f, 0.8f, 0.5f },
                          { "ForcePlate", 0.2f, 0.2f, 0.8f, 0.5f } };
  for ( const VSurface& rSurface : Surfaces( 24 ) )
  {
    for ( const VCase& rCase : Cases )
    {
      const float Light = rSurface.Lit( rCase.Ambient, rCase.Bounce, rCase.Top, rCase.Camera );
      EXPECT_TRUE( IsNear( Bench.Pixel( rCase.Name, rSurface.Values() ),
                           QVector4D( QVector3D( 0.9f, 0.5f, 0.2f ) * Light, 0.7f ) ) )
          << rCase.Name;
    }
  }
}

TEST_P( FragmentShaderTest, MarksOnLitSurfaces )
{
  VSurface Top{ false, { 100, 50, 0 }, { 0, 0, 1 }, { 0, -3000, 2000 } };
  const QVector4D Plain = QVector4D( QVector3D( 0.9f, 0.5f, 0.2f ) * Top.Lit( 0.2f, 0.2f, 0.8f, 0.5f ), 0.7f );
  const QVector4D Line( 1, 0.5f, 0.5f, 0.7f );
  const auto Plate = [&]( const VSurface& i_rSurface, const QVector3D& i_rForce, const QVector3D& i_rFromCentre )
  {
    const QVector3D Centre = i_rSurface.Position - i_rFromCentre;
    return Bench.Pixel( "ForcePlate", With( i_rSurface.Values(), { { "u_Force", Floats( i_rForce ) },
                                                                   { "u_CentreOfPressure", Floats( Centre ) } } ) );
  };
  const QVector3D Push( 15, 0, 20.1f ); // 25.08 N
  EXPECT_TRUE( IsNear( Plate( Top, Push, { 3.9f, 200, 10 } ), Line ) );
  EXPECT_TRUE( IsNear( Plate( Top, Push, { 200, -3.9f, 10 } ), Line ) );
  EXPECT_TRUE( IsNear( Plate( Top, Push, { 4.1f, -4.1f, 0 } ), Plain ) ) << "8 thick";
  EXPECT_TRUE( IsNear( Plate( Top, { 15, 0, 19.9f }, { 0, 0, 0 } ), Plain ) ) << "24.9 N";
  VSurface Flank = Top;
  Flank.Normal = QVector3D( 0, -1, 0.09f ).normalized();
  EXPECT_FALSE( IsNear( Plate( Flank, Push, { 0, 0, 0 } ), Line ) );
  const VSurface YUp{ true, { 100, 0, 50 }, { 0, 1, 0 }, { 0, 2000, -3000 } };
  EXPECT_TRUE( IsNear( Plate( YUp, Push, { 200, 10, 3.9f } ), Line ) );
  EXPECT_FALSE( IsNear( Plate( YUp, Push, { 200, 0, 200 } ), Line ) );

  // The bone's stripe, and the ring around a camera's lens.
  const auto Segment = [&]( const QVector3D& i_rLocal )
  {
    return Bench.Pixel( "Segment", With( Top.Values(), { { "v_localnormal", Floats( i_rLocal ) } } ) );
  };
  const QVector4D Striped( Plain.toVector3D() * 0.67f, 0.7f );
  EXPECT_TRUE( IsNear( Segment( { 0.09f, 0.5f, 0.5f } ), Striped ) );
  EXPECT_TRUE( IsNear( Segment( { -0.11f, 0.5f, 0.5f } ), Plain ) );
  EXPECT_TRUE( IsNear( Segment( { 0.05f, -0.5f, 0.5f } ), Plain ) );
  const auto Lens = [&]( float i_Radial )
  {
    return Bench.Pixel( "Camera", With( Top.Values(), { { "v_faceradial", { i_Radial } } } ) );
  };
  EXPECT_EQ( Lens( 0.51f ), QVector4D( 1, 0, 0, 0.7f ) );
  EXPECT_TRUE( IsNear( Lens( 0.49f ), QVector4D( 0.09f, 0.05f, 0.02f, 0.7f ) ) );
}

TEST_P( FragmentShaderTest, TheMaterialOfAMesh )
{
  const std::uint8_t Texels[] = { 102, 204, 51, 255, 102, 204, 51, 0 };
  const float Texture = Bench.Texture( 2, 1, Texels );
  const QVector3D Image = QVector3D( 102, 204, 51 ) / 255, Specular( 0.3f, 0.2f, 0.1f ), Emissive( 0.01f, 0.02f, 0.3f );
  const QVector3D Tint( 0.9f, 0.5f, 0.2f );
  for ( const VSurface& rSurface : Surfaces( 12 ) )
  {
    for ( const float Shininess : { 0.0f, 5.0f } )
    {
      for ( const bool bA : { true, false } )
      {
        const QVector4D User = bA ? QVector4D( 1, 0, 0, 0.25f ) : QVector4D( 0, 0, 1, 0.5f );
        const float Camera = 0.5f * std::max( 0.0f, 1 - QVector3D::dotProduct( rSurface.ToCamera(), rSurface.Up() ) );
        const float Light = rSurface.Lit( 0.2f, 0.2f, 0.8f, Camera );
        QVector3D Expected = ( Image * ( 1 - User.w() ) + User.toVector3D() * User.w() ) * Tint * Light;
        Expected += QVector3D( 1, 1, 1 ) * 0.25f * std::pow( 1 - rSurface.Facing(), 4.0f ) + Emissive;
        const QVector3D Half = ( rSurface.Light() + rSurface.ToCamera() ).normalized();
        const float Glance = std::max( 0.0f, QVector3D::dotProduct( rSurface.Normal, Half ) );
        Expected += Specular * ( Shininess > 0 ? std::pow( Glance, Shininess ) : 0 );
        const VValues Values = { { "t_DiffuseTexture", { Texture } },        { "v_uv", { bA ? 0.25f : 0.75f, 0.5f } },
                                 { "u_UserColourA", { 1, 0, 0, 0.25f } },    { "u_UserColourB", { 0, 0, 1, 0.5f } },
                                 { "u_Shininess", { Shininess } },           { "u_SpecularColour", Floats( Specular ) },
                                 { "u_EmissiveColour", Floats( Emissive ) }, { "u_Alpha", { 0.6f } } };
        EXPECT_TRUE( IsNear( Bench.Pixel( "FBXMaterial", With( rSurface.Values(), Values ) ),
                             QVector4D( Expected, 0.6f ), 2e-3f ) );
      }
    }
    const float Facing = QVector3D::dotProduct( rSurface.ToCamera(), rSurface.Normal );
    const float Luma = QVector3D::dotProduct( Image, { 0.299f, 0.587f, 0.114f } );
    EXPECT_TRUE( IsNear( Bench.Pixel( "XRay", With( rSurface.Values(), { { "t_DiffuseTexture", { Texture } } } ) ),
                         QVector4D( Tint, ( 1 - Facing ) * 0.25f + Luma * 0.03f ) ) );
    EXPECT_TRUE( IsNear( Bench.Pixel( "MissingMarker", rSurface.Values() ),
                         QVector4D( Tint, std::max( 0.0f, Facing - 0.5f ) ) ) );
  }
}

TEST_P( FragmentShaderTest, WhatIsClippedAndWhereAlphaChanges )
{
  const VValues Colour = { { "v_colour", { 0.1f, 0.2f, 0.3f, 0.4f } }, { "u_Colour", { 0.1f, 0.2f, 0.3f, 0.4f } } };
  const QVector4D Plain( 0.1f, 0.2f, 0.3f, 0.4f );
  const std::uint8_t Black[] = { 0 };
  const float Dark = Bench.Texture( 1, 1, Black );
  for ( const bool bYUp : { false, true } )
  {
    const QVector3D Up( 0, bYUp ? 1 : 0, bYUp ? 0 : 1 );
    const auto At = [&]( const char* i_pName, float i_Height )
    {
      const QVector3D Place =
          Up * i_Height + QVector3D( -50, 0, 0 ) - ( bYUp ? QVector3D( 0, 0, 9 ) : QVector3D( 0, 9, 0 ) );
      return Bench.Pixel( i_pName, With( Colour, { { "u_Up", Floats( Up ) },
                                                   { "v_position", Floats( Place ) },
                                                   { "u_CameraPosition", Floats( Place ) },
                                                   { "t_Texture", { Dark } },
                                                   { "u_GridSpacings", { 1000, 250 } } } ) );
    };
    EXPECT_EQ( At( "ClipFloor", -0.1f ), Untouched );
    EXPECT_EQ( At( "ClipFloor", 0.1f ), Plain );
    EXPECT_EQ( At( "CameraCoverageFurstum", -0.1f ), Untouched );
    EXPECT_EQ( At( "CameraCoverageFurstum", 9.9f ), QVector4D( 1, 0, 1, 1 ) );
    EXPECT_EQ( At( "CameraCoverageFurstum", 10.1f ), Plain );
    EXPECT_EQ( At( "FloorGrid", 100 ).w(), 0.75f );
    EXPECT_EQ( At( "FloorGrid", -100 ).w(), 0.25f );
  }
  for ( const float Distance : { 0.0f, 3.9f, 4.1f, 7.9f, 8.1f, 803.9f, 804.1f } )
  {
    const VValues Values = { { "u_SourcePoint", { 1, 2, 3 } }, { "v_position", { 1, 2 + Distance, 3 } } };
    EXPECT_EQ( Bench.Pixel( "StippledLine", With( Colour, Values ) ),
               std::fmod( Distance, 8.0f ) > 4 ? Untouched : Plain )
        << Distance;
  }
  // The halo is full at 0.2 and gone 0.1 further in or out.
  for ( const auto& [Radius, Share] : std::map< float, float >{
            { 0.0f, 0.0f }, { 0.1f, 0.0f }, { 0.15f, 0.5f }, { 0.2f, 1.0f }, { 0.25f, 0.5f }, { 0.3f, 0.0f } } )
  {
    const VValues Values = { { "v_uv", { 0.6f * Radius, -0.8f * Radius } } };
    EXPECT_TRUE( IsNear( Bench.Pixel( "ActiveLabelHalo", With( Colour, Values ) ), Plain * Share ) ) << Radius;
  }
}

TEST_P( FragmentShaderTest, PointsOfASensorsView )
{
  const VValues Colour = { { "v_colour", { 0.5f, 0.25f, 32 / 255.0f, 0.8f } }, { "v_size", { 14 } } };
  const auto At = [&]( const VShaderBench::VImage& i_rImage, int i_X, int i_Y )
  {
    return i_rImage[std::size_t( i_Y * Side + i_X )];
  };
  // A disc of 14 pixels: cross through the middle, border of 2, in between paler; outside nothing.
  const VShaderBench::VImage Disc = Bench.Fragment( "Centroid2D", Colour, 14 );
  const VShaderBench::VImage Wand = Bench.Fragment( "WandWave2D", Colour, 14 );
  for ( int Y = 1; Y < Side - 1; ++Y )
  {
    for ( int X = 1; X < Side - 1; ++X )
    {
      const float Dx = std::abs( float( X ) + 0.5f - 8 );
      const float Dy = std::abs( float( Y ) + 0.5f - 8 );
      const float Inner = 7 - std::hypot( Dx, Dy );
      const float Cover = std::clamp( Inner + 0.5f, 0.0f, 1.0f );
      const bool bLine = Inner < 2 || std::min( Dx, Dy ) < 0.75f;
      EXPECT_TRUE(
          IsNear( At( Disc, X, Y ), { 0.5f, 0.25f, 32 / 255.0f, 0.8f * Cover * ( bLine ? 1 : 0.3f ) }, 2e-3f ) )
          << X << ' ' << Y;
      const float Alpha = std::max( 0.0f, 1 - 2 * std::hypot( Dx, Dy ) / 14 );
      EXPECT_NEAR( At( Wand, X, Y ).w(), 0.8f * Alpha, 1e-3f );
    }
  }
  EXPECT_EQ( At( Bench.Fragment( "Centroid2D", With( Colour, { { "v_size", { 2 } } } ), 2 ), 7, 7 ).w(), 0.8f );

  const VShaderBench::VImage Hard = Bench.Fragment( "Centroid2DSelection", Colour, 14 );
  EXPECT_EQ( At( Hard, 1, 1 ), Untouched );
  EXPECT_EQ( At( Hard, 8, 1 ), QVector4D( 0.5f, 0.25f, 32 / 255.0f, 1 / 255.0f ) );
  for ( const char* pName : { "Centroid2DSelection", "Greyscale2DSelection", "MaskSelection" } )
  {
    for ( const int Blue : { 31, 32 } )
    {
      for ( const float Show : { 0.0f, 1.0f } )
      {
        const QVector4D Id( 7 / 255.0f, 9 / 255.0f, float( Blue ) / 255, 1 / 255.0f );
        const VValues Values = With( Colour, { { "v_colour", Four( Id ) }, { "u_ShowSelection", { Show } } } );
        const bool bGone = Blue < 32 && Show > 0;
        EXPECT_EQ( At( Bench.Fragment( pName, Values, 14 ), 8, 8 ), bGone ? Untouched : Id ) << pName << Blue << Show;
      }
    }
  }
  EXPECT_EQ( Bench.Pixel( "Greyscale2D", Colour ), QVector4D( 0.5f, 0.5f, 0.5f, 1 ) );
  EXPECT_EQ( Bench.Pixel( "Mask", Colour ), Vec4( Colour.at( "v_colour" ) ) );
}
