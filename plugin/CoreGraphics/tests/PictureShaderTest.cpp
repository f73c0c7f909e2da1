#include "ShaderBench.h"

#include <cmath>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

/// The programs that make a picture from a picture.
using PictureShaderTest = ShaderTest;

namespace
{
constexpr int Side = VShaderBench::Side;
} // namespace

TEST_F( PictureShaderTest, OutlinesOfAMask )
{
  const QVector3D Primary( 0.9f, 0.4f, 0.1f ), Hover( 0.25f, 0.125f, 0 ), Selected( 0.25f, 0.25f, 0.25f ), None;
  // A square of 8 pixels from (4, 4), of one id word; another beside it differs in the lowest bit only.
  const std::tuple< std::uint32_t, bool, QVector3D > Words[] = {
      { 0x200100, false, Selected },
      { 0x400100, false, Hover },
      { 0x63FFFE, false, Hover }, // selected, too, with the highest ids that do not read as primary
      { 0xA00100, true, None } };
  const auto Draw = [&]( std::uint32_t i_Word )
  {
    std::vector< float > Mask( Side * Side * 4, 0 );
    for ( int Pixel = 0; Pixel < 64; ++Pixel )
    {
      const int X = 4 + Pixel % 8, Y = 4 + Pixel / 8;
      const std::uint32_t Word = i_Word | ( X >= 8 ? 0x01000001u : 0x01000000u );
      for ( int Byte = 0; Byte < 4; ++Byte )
      {
        Mask[std::size_t( ( Y * Side + X ) * 4 + Byte )] = float( ( Word >> ( 8 * Byte ) ) & 255 ) / 255;
      }
    }
    return Bench.Fragment( "Outlines", { { "t_Selection", Bench.Texture( Side, Side, Mask, true ) },
                                         { "u_PrimaryColour", QVector4D( Primary, 1 ) },
                                         { "u_PreSelectColour", Hover } } );
  };
  for ( const auto& [Word, bPrimary, rFill] : Words )
  {
    const VShaderBench::VImage Image = Draw( Word );
    for ( int Y = 1; Y < Side - 1; ++Y )
    {
      for ( int X = 1; X < Side - 1; ++X )
      {
        // Edges lie on both sides of the rim, and of the seam.
        const int Out = std::max( std::abs( 2 * X - 15 ), std::abs( 2 * Y - 15 ) );
        const bool bEdge = Out == 7 || Out == 9 || ( Out < 7 && ( X == 7 || X == 8 ) );
        const float Edge = bEdge ? 0.75f : 0, Hatch = ( X + Y ) % 4 == 3 && Out <= 9 ? 1 : 0;
        const QVector3D Filled = ( Out <= 7 ? rFill : None ) + QVector3D( Edge, Edge, Edge );
        EXPECT_TRUE( IsNear( Image.At( X, Y ),
                             bPrimary ? QVector4D( Primary * ( Hatch + Edge ), Edge ) : QVector4D( Filled, 0 ) ) )
            << Word << ' ' << X << ' ' << Y;
      }
    }
  }
  EXPECT_EQ( Draw( 0x640000 ).At( 6, 6 ), QVector4D() ) << "reads as primary, between its stripes";
  const float Empty = Bench.Texture( 1, 1, { 0, 0, 0, 0 } );
  EXPECT_EQ( Bench.Fragment( "Outlines", { { "t_Selection", Empty } } ), VShaderBench::VImage( Side * Side ) );
}

TEST_F( PictureShaderTest, EdgesAreSmoothedByFourTaps )
{
  std::vector< float > Buffer( Side * Side * 4, 0 );
  std::fill_n( Buffer.begin() + ( 8 * Side + 5 ) * 4, 4, 1.0f );
  const auto Image = Bench.Fragment( "AntiAlias", { { "t_Buffer", Bench.Texture( Side, Side, Buffer, true ) } } );
  const float Weights[] = { 0.75f * 0.75f, 0.1875f / 2, 0.0625f / 4, 0 }; // by how many steps of a side away
  for ( int Pixel = 0; Pixel < 25; ++Pixel )
  {
    const int X = Pixel % 5 - 2, Y = Pixel / 5 - 2;
    const int Steps = std::max( std::abs( X ), std::abs( Y ) ) > 1 ? 3 : std::abs( X ) + std::abs( Y );
    EXPECT_NEAR( Image.At( 5 + X, 8 + Y ).x(), Weights[Steps], 2e-3f ) << X << ' ' << Y;
  }
}

TEST_F( PictureShaderTest, VideoColours )
{
  VValues Values = { { "u_GammaCorrection", 1 }, { "u_VideoSaturation", 1 }, { "v_uv", { 0.3f, 0.5f } } };
  struct VColour
  {
    int Lines;
    float Y, U, V;
    QVector3D Expected;
  };
  const VColour Colours[] = { { 719, 235, 128, 128, { 1, 1, 1 } },
                              { 719, 81, 90, 240, { 1, 0, 0 } },
                              { 719, 145, 54, 34, { 0, 1, 0 } },
                              { 719, 41, 240, 110, { 0, 0, 1 } },
                              { 719, 255, 128, 128, { 1, 1, 1 } },
                              { 719, 0, 128, 128, { 0, 0, 0 } },
                              { 719, 126, 100, 160, { 0.7026f, 0.4433f, 0.2808f } },
                              { 720, 16, 128, 128, { 0, 0, 0 } },
                              { 720, 63, 102, 240, { 1, 0, 0 } },
                              { 720, 173, 42, 26, { 0, 1, 0 } },
                              { 720, 32, 240, 118, { 0, 0, 1 } },
                              { 720, 126, 100, 160, { 0.7273f, 0.4588f, 0.2704f } } };
  for ( const auto& [Lines, Y, U, V, rExpected] : Colours )
  {
    const auto Texture = [&, Count = Lines]( const std::vector< float >& i_rBytes, bool i_bLinear )
    {
      std::vector< float > Texels;
      for ( std::size_t Index = 0; Index < i_rBytes.size() * std::size_t( Count ); ++Index )
      {
        Texels.push_back( i_rBytes[Index % i_rBytes.size()] / 255 );
      }
      return Bench.Texture( 2, Count, Texels, i_bLinear );
    };
    // Packed: two pixels of the same chroma, the second one of the colour: 0.3 of two texels lies in it.
    Values = With( Values, { { "t_TextureY", Texture( { Y, Y }, true ) },
                             { "t_TextureU", Texture( { U, U }, true ) },
                             { "t_TextureV", Texture( { V, V }, true ) },
                             { "t_Texture", Texture( { 16, U, Y, V, 16, U, Y, V }, false ) } } );
    const VValues ChromaFirst = { { "t_Texture", Texture( { U, 16, V, Y, U, 16, V, Y }, false ) },
                                  { "u_ChromaFirst", 1 } };
    const QVector4D Expected( rExpected, 1 );
    ExpectPixel( "VideoYUVPlanar", Values, Expected, 0.012f );
    ExpectPixel( "VideoYUV", Values, Expected, 0.012f );
    ExpectPixel( "VideoYUV", With( Values, ChromaFirst ), Expected, 0.012f );
  }

  // Gamma; nothing beside the image.
  Values = With( Values, { { "t_Texture", Bench.Texture( 1, 1, { 0.25f } ) }, { "u_GammaCorrection", 2 } } );
  ExpectPixel( "VideoLuminance", Values, { 0.5f, 0.5f, 0.5f, 1 }, 1e-3f );
  for ( const char* pName : { "VideoLuminance", "VideoYUV", "VideoYUVPlanar", "VideoBayer" } )
  {
    for ( const QVector2D Beside : { QVector2D( -0.01f, 0.5f ), QVector2D( 0.5f, 1.01f ) } )
    {
      ExpectPixel( pName, With( Values, { { "v_uv", Beside } } ), Untouched );
      const QVector2D Inside( 0.5f + ( Beside.x() - 0.5f ) * 0.96f, 0.5f + ( Beside.y() - 0.5f ) * 0.96f );
      EXPECT_NE( Pixel( pName, With( Values, { { "v_uv", Inside } } ) ), Untouched ) << pName;
    }
  }
}

TEST_F( PictureShaderTest, AMosaicOfAnyPhaseGivesItsColoursBack )
{
  // Colours that rise evenly come back exactly inside, even ones everywhere.
  constexpr int Width = 8, Height = 6;
  for ( int Case = 0; Case < 8; ++Case )
  {
    const int PhaseX = Case & 1, PhaseY = Case >> 1 & 1, Rim = Case >> 2;
    const float Slope = Rim ? 0.02f : 0;
    const auto Colour = [&]( int i_X, int i_Y )
    {
      const float X = float( i_X ) * Slope, Y = float( i_Y ) * Slope;
      return QVector3D( 0.2f + X, 0.4f + 2 * Y, 0.7f - X + Y );
    };
    std::vector< float > Mosaic;
    for ( int Index = 0; Index < Width * Height; ++Index )
    {
      const int X = Index % Width, Y = Index / Width;
      Mosaic.push_back( Colour( X, Y )[( ( X ^ PhaseX ) & 1 ) + ( ( Y ^ PhaseY ) & 1 )] );
    }
    VValues Values = { { "t_Texture", Bench.Texture( Width, Height, Mosaic ) },
                       { "u_PhaseX", float( PhaseX ) },
                       { "u_PhaseY", float( PhaseY ) },
                       { "u_GammaCorrection", 1 },
                       { "u_VideoSaturation", 1 } };
    for ( int Y = Rim; Y < Height - Rim; ++Y )
    {
      for ( int X = Rim; X < Width - Rim; ++X )
      {
        Values["v_uv"] = { ( float( X ) + 0.5f ) / Width, ( float( Y ) + 0.5f ) / Height };
        ExpectPixel( "VideoBayer", Values, QVector4D( Colour( X, Y ), 1 ) );
      }
    }
    Values["u_VideoSaturation"] = 0;
    const float Grey = Pixel( "VideoBayer", Values ).x();
    ExpectPixel( "VideoBayer", Values, { Grey, Grey, Grey, 1 }, 1e-5f );
  }
}
