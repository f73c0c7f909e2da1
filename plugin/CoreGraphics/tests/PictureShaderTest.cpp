#include "ShaderBench.h"

#include <cmath>
#include <functional>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
using VValues = VShaderBench::VValues;
using VBytes = std::vector< std::uint8_t >;
constexpr int Side = VShaderBench::Side;

QVector4D At( const VShaderBench::VImage& i_rImage, int i_X, int i_Y )
{
  return i_rImage[std::size_t( i_Y * Side + i_X )];
}

float Difference( const QVector4D& i_rA, const QVector4D& i_rB )
{
  return ( i_rA - i_rB ).length();
}
} // namespace

/// The programs that make a picture from a picture.
class PictureShaderTest : public testing::TestWithParam< EContextKind >
{
public:
  VShaderBench Bench{ GetParam() };
};
INSTANTIATE_TEST_SUITE_P( Contexts, PictureShaderTest, testing::Values( EKindCore, EKindES ), KindName );

TEST_P( PictureShaderTest, OutlinesOfAMask )
{
  const QVector3D Primary( 0.9f, 0.4f, 0.1f ), Hover( 0.25f, 0.125f, 0 );
  // A square of 8 pixels from (4, 4), of one id word; another beside it differs in the lowest bit only.
  const auto Draw = [&]( std::uint32_t i_Word, std::uint32_t i_Right )
  {
    VBytes Mask( Side * Side * 4, 0 );
    for ( int Y = 4; Y < 12; ++Y )
    {
      for ( int X = 4; X < 12; ++X )
      {
        const std::uint32_t Word = 0x01000000u | ( X < 8 ? i_Word : i_Right );
        for ( int Byte = 0; Byte < 4; ++Byte )
        {
          Mask[std::size_t( ( Y * Side + X ) * 4 + Byte )] = std::uint8_t( Word >> ( 8 * Byte ) );
        }
      }
    }
    return Bench.Fragment( "Outlines", { { "t_Selection", { Bench.Texture( Side, Side, Mask, true ) } },
                                         { "u_PrimaryColour", Floats( Primary, 1 ) },
                                         { "u_PreSelectColour", Floats( Hover ) } } );
  };
  // Columns in row 6: inside, at the seam of both objects, at the rim inside and outside, far outside.
  const auto Check = [&]( const VShaderBench::VImage& i_rImage, const QVector3D& i_rFill )
  {
    const QVector3D White( 0.75f, 0.75f, 0.75f );
    for ( const auto& [X, bInside, bEdge] :
          { std::tuple( 5, true, false ), std::tuple( 7, true, true ), std::tuple( 8, true, true ),
            std::tuple( 4, true, true ), std::tuple( 3, false, true ), std::tuple( 1, false, false ) } )
    {
      const QVector3D Fill = bInside ? i_rFill : QVector3D();
      EXPECT_LE( Difference( At( i_rImage, X, 6 ), QVector4D( bEdge ? Fill + White : Fill, 0 ) ), 1e-4f ) << X;
    }
    EXPECT_LE( Difference( At( i_rImage, 3, 3 ), QVector4D( White, 0 ) ), 1e-4f ) << "outside the corner";
  };
  Check( Draw( 0x200100, 0x200101 ), { 0.25f, 0.25f, 0.25f } );
  Check( Draw( 0x400100, 0x400101 ), Hover );
  Check( Draw( 0x63FFFE, 0x63FFFF ), Hover ); // selected, too, with the highest id that does not read as primary
  const QVector4D Next = At( Draw( 0x640000, 0x640000 ), 6, 6 );
  EXPECT_EQ( Next, QVector4D() ) << "the next one reads as primary, between its stripes";
  for ( const QVector4D& rPixel : Draw( 0, 0 ) )
  {
    EXPECT_LE( Difference( rPixel, QVector4D( 0, 0, 0, 0 ) ), 1e-6f ) << "no selection, no change";
  }

  const VShaderBench::VImage Hatched = Draw( 0xA00100, 0xA00100 );
  for ( int Y = 1; Y < 15; ++Y )
  {
    for ( int X = 1; X < 15; ++X )
    {
      const bool bInside = X >= 4 && X < 12 && Y >= 4 && Y < 12;
      const bool bTouching = X >= 3 && X < 13 && Y >= 3 && Y < 13;
      const bool bEdge = bTouching && !( X >= 5 && X < 11 && Y >= 5 && Y < 11 );
      const float Hatch = ( X + Y ) % 4 == 3 && bTouching ? 1.0f : 0.0f;
      const float Intensity = bEdge ? 0.75f : 0.0f;
      EXPECT_LE( Difference( At( Hatched, X, Y ), QVector4D( Primary * ( Hatch + Intensity ), Intensity ) ), 1e-4f )
          << X << ' ' << Y << ' ' << bInside;
    }
  }
}

TEST_P( PictureShaderTest, EdgesAreSmoothedByFourTaps )
{
  VBytes Buffer( Side * Side * 4, 0 );
  std::fill_n( Buffer.begin() + ( 8 * Side + 5 ) * 4, 4, std::uint8_t( 255 ) );
  const VShaderBench::VImage Image =
      Bench.Fragment( "AntiAlias", { { "t_Buffer", { Bench.Texture( Side, Side, Buffer, true ) } } } );
  const float Weights[] = { 0.75f * 0.75f, 0.1875f / 2, 0.0625f / 4, 0 }; // by how many steps of a side away
  for ( int Y = 6; Y <= 10; ++Y )
  {
    for ( int X = 3; X <= 7; ++X )
    {
      const int Far = std::max( std::abs( X - 5 ), std::abs( Y - 8 ) );
      const int Steps = Far > 1 ? 3 : std::abs( X - 5 ) + std::abs( Y - 8 );
      EXPECT_NEAR( At( Image, X, Y ).x(), Weights[Steps], 0.01f ) << X << ' ' << Y;
    }
  }
}

TEST_P( PictureShaderTest, AWorldIsWarpedToWhatTheSensorSaw )
{
  // The picture holds its own places, the tile shows a sensor of 640 by 480, turned and smaller than the tile.
  constexpr int Texels = 512;
  std::vector< float > Places;
  for ( int Index = 0; Index < Texels * Texels; ++Index )
  {
    Places.insert( Places.end(), { ( float( Index % Texels ) + 0.5f ) / Texels,
                                   ( float( Index / Texels ) + 0.5f ) / Texels, 0.5f, 0.25f } );
  }
  const float Picture = Bench.Texture( Texels, Texels, Places );
  const double Sine = std::sin( 0.4 ), Cosine = std::cos( 0.4 ), K = 4e-7;
  const double Cx = 300, Cy = 250, Px = 310, Py = 235, W = 640, H = 480, Sx = 0.7, Sy = 0.6, Zx = 0.5, Zy = 0.45;
  const auto F = []( double i_Value )
  {
    return float( i_Value );
  };
  VValues Values = { { "u_View2D", { F( Sx ), F( Sy ), F( Zx ), F( Zy ) } },
                     { "u_SensorSize", { F( W ), F( H ) } },
                     { "u_RadialDistortionCentre", { F( Cx ), F( Cy ) } },
                     { "u_RadialDistortionParameters", { F( K ), 0, 0 } },
                     { "u_RotationCentre", { F( Px ), F( Py ) } },
                     { "u_Rotation", { F( Cosine ), F( Sine ), F( -Sine ), F( Cosine ) } },
                     { "u_RotationInverse", { F( Cosine ), F( -Sine ), F( Sine ), F( Cosine ) } },
                     { "t_DiffuseTexture", { Picture } } };
  int Inside = 0, Outside = 0;
  for ( double V = 0.05; V < 1; V += 0.1 )
  {
    for ( double U = 0.05; U < 1; U += 0.1 )
    {
      Values["v_uv"] = { F( U ), F( V ) };
      const QVector4D Found = Bench.Pixel( "Distort", Values );
      const double X = ( ( U - 0.5 ) / Sx + Zx ) * W - Px, Y = ( -( V - 0.5 ) / Sy + Zy ) * H - Py;
      const double SensorX = Cosine * X + Sine * Y + Px, SensorY = -Sine * X + Cosine * Y + Py;
      if ( SensorX < 0 || SensorX > W || SensorY < 0 || SensorY > H )
      {
        ++Outside;
        EXPECT_EQ( Found, QVector4D( 0, 0, 0, 1 ) );
        continue;
      }
      const double Dx = SensorX - 0.5 - Cx, Dy = SensorY - 0.5 - Cy, Scale = 1 + K * ( Dx * Dx + Dy * Dy );
      const double TrueX = Cx + Dx * Scale + 0.5 - Px, TrueY = Cy + Dy * Scale + 0.5 - Py;
      const double ViewX = ( Cosine * TrueX - Sine * TrueY + Px ) / W - Zx;
      const double ViewY = ( Sine * TrueX + Cosine * TrueY + Py ) / H - Zy;
      const double FoundU = ViewX * Sx + 0.5, FoundV = -ViewY * Sy + 0.5;
      const bool bDrawn = FoundU >= 0 && FoundU <= 1 && FoundV >= 0 && FoundV <= 1;
      const QVector4D Expected = bDrawn ? QVector4D( F( FoundU ), F( FoundV ), 0.5f, 0.25f ) : QVector4D();
      EXPECT_LE( Difference( Found, Expected ), 1.01f / Texels ) << U << ' ' << V;
      ++Inside;
    }
  }
  EXPECT_GT( Inside, 30 );
  EXPECT_GT( Outside, 10 );
}

TEST_P( PictureShaderTest, VideoColours )
{
  const VValues Neutral = {
      { "u_GammaCorrection", { 1 } }, { "u_VideoSaturation", { 1 } }, { "v_uv", { 0.3f, 0.5f } } };
  struct VColour
  {
    int Y, U, V;
    QVector3D Expected;
  };
  const auto Check = [&]( int i_Lines, const std::vector< VColour >& i_rColours )
  {
    for ( const VColour& rColour : i_rColours )
    {
      const auto Plane = [&]( int i_Value )
      {
        return Bench.Texture( 2, i_Lines, VBytes( std::size_t( 2 * i_Lines ), std::uint8_t( i_Value ) ), true );
      };
      const QVector4D Expected( rColour.Expected, 1 );
      EXPECT_LE(
          Difference( Bench.Pixel( "VideoYUVPlanar", With( Neutral, { { "t_TextureY", { Plane( rColour.Y ) } },
                                                                      { "t_TextureU", { Plane( rColour.U ) } },
                                                                      { "t_TextureV", { Plane( rColour.V ) } } } ) ),
                      Expected ),
          0.012f );
      // Two pixels of the same chroma, the second one black: 0.3 of two texels lies in the second pixel.
      for ( const bool bChromaFirst : { false, true } )
      {
        VBytes Packed;
        for ( int Texel = 0; Texel < 2 * i_Lines; ++Texel )
        {
          const VBytes Luma{ std::uint8_t( 16 ), std::uint8_t( rColour.Y ) };
          const VBytes Chroma{ std::uint8_t( rColour.U ), std::uint8_t( rColour.V ) };
          for ( int Half = 0; Half < 2; ++Half )
          {
            const std::size_t Index = std::size_t( Half );
            Packed.push_back( bChromaFirst ? Chroma[Index] : Luma[Index] );
            Packed.push_back( bChromaFirst ? Luma[Index] : Chroma[Index] );
          }
        }
        const VValues Values = With( Neutral, { { "t_Texture", { Bench.Texture( 2, i_Lines, Packed ) } },
                                                { "u_ChromaFirst", { bChromaFirst ? 1.0f : 0.0f } } } );
        EXPECT_LE( Difference( Bench.Pixel( "VideoYUV", Values ), Expected ), 0.012f ) << bChromaFirst;
      }
    }
  };
  Check( 719, { { 235, 128, 128, { 1, 1, 1 } },
                { 81, 90, 240, { 1, 0, 0 } },
                { 145, 54, 34, { 0, 1, 0 } },
                { 41, 240, 110, { 0, 0, 1 } },
                { 126, 100, 160, { 0.7026f, 0.4433f, 0.2808f } } } );
  Check( 720, { { 16, 128, 128, { 0, 0, 0 } },
                { 63, 102, 240, { 1, 0, 0 } },
                { 173, 42, 26, { 0, 1, 0 } },
                { 32, 240, 118, { 0, 0, 1 } },
                { 126, 100, 160, { 0.7273f, 0.4588f, 0.2704f } } } );

  // Gamma and saturation; nothing beside the image.
  const std::uint8_t Grey[] = { 64 };
  const float Texture = Bench.Texture( 1, 1, Grey );
  VValues Values = With( Neutral, { { "t_Texture", { Texture } } } );
  Values["u_GammaCorrection"] = { 2 };
  const float Lifted = std::sqrt( 64 / 255.0f );
  EXPECT_LE( Difference( Bench.Pixel( "VideoLuminance", Values ), { Lifted, Lifted, Lifted, 1 } ), 1e-3f );
  Values["v_uv"] = { 0.5f, 1.01f };
  EXPECT_EQ( Bench.Pixel( "VideoLuminance", Values ).x(), VShaderBench::Untouched );
}

TEST_P( PictureShaderTest, AMosaicOfAnyPhaseGivesItsColoursBack )
{
  // Colours that rise evenly come back exactly inside, even ones everywhere.
  constexpr int Width = 8, Height = 6;
  for ( const float Slope : { 0.0f, 0.02f } )
  {
    const auto Colour = [&]( int i_X, int i_Y )
    {
      return QVector3D( 0.2f + Slope * float( i_X ), 0.4f + 2 * Slope * float( i_Y ),
                        0.7f - Slope * float( i_X ) + Slope * float( i_Y ) );
    };
    for ( int Phase = 0; Phase < 4; ++Phase )
    {
      std::vector< float > Mosaic;
      for ( int Index = 0; Index < Width * Height; ++Index )
      {
        const int X = Index % Width, Y = Index / Width;
        const int Odd = ( ( X ^ Phase ) & 1 ) + ( ( Y ^ ( Phase >> 1 ) ) & 1 );
        Mosaic.push_back( Colour( X, Y )[Odd] );
      }
      VValues Values = { { "t_Texture", { Bench.Texture( Width, Height, Mosaic ) } },
                         { "u_PhaseX", { float( Phase & 1 ) } },
                         { "u_PhaseY", { float( Phase >> 1 ) } },
                         { "u_GammaCorrection", { 1 } },
                         { "u_VideoSaturation", { 1 } } };
      const int Rim = Slope > 0 ? 1 : 0;
      for ( int Y = Rim; Y < Height - Rim; ++Y )
      {
        for ( int X = Rim; X < Width - Rim; ++X )
        {
          Values["v_uv"] = { ( float( X ) + 0.5f ) / Width, ( float( Y ) + 0.5f ) / Height };
          EXPECT_LE( Difference( Bench.Pixel( "VideoBayer", Values ), QVector4D( Colour( X, Y ), 1 ) ), 1e-4f )
              << Phase << ' ' << X << ' ' << Y;
        }
      }
      Values["u_VideoSaturation"] = { 0 };
      const QVector4D Grey = Bench.Pixel( "VideoBayer", Values );
      EXPECT_LE( Difference( Grey, { Grey.x(), Grey.x(), Grey.x(), 1 } ), 1e-5f );
    }
  }
}
