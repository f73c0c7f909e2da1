#include "MurmurHash3.h"

#include <CoreGraphics/SelectionColour.h>
#include <CoreGraphics/VShader.h>

#include <gtest/gtest.h>

#include <cmath>

using namespace CoreGraphics;

TEST( ShaderText, TheLinesBeforeASource )
{
  const std::string Precision = "#version 300 es\n#undef highp\nprecision highp sampler2D;\n#undef highp\n"
                                "precision highp float;\n";
  const std::string Vertex = "#define attribute in\n#define varying out\n#define texture2D texture\n";
  const std::string Fragment = "#define varying in\nout vec4 FragColor;\n#define gl_FragColor FragColor\n"
                               "#define texture2D texture\n";
  const auto Text = []( EShaderType i_Type, EShaderForm i_Form, EShaderDialect i_Dialect )
  {
    return VShader::Compose( "void main() {}", i_Type, i_Form, i_Dialect ).toStdString();
  };
  const std::string Source = "#line 1\nvoid main() {}";
  EXPECT_EQ( Text( EVertexShader, EFormSingle, EDialectES300 ), Precision + Vertex + Source );
  EXPECT_EQ( Text( EFragmentShader, EFormSingle, EDialectES300 ), Precision + Fragment + Source );
  EXPECT_EQ( Text( EVertexShader, EFormSingle, EDialectDesktop330 ), "#version 330\n" + Vertex + Source );
  EXPECT_EQ( Text( EFragmentShader, EFormSingle, EDialectDesktop330 ), "#version 330\n" + Fragment + Source );
  EXPECT_EQ( Text( EVertexShader, EFormInstanced, EDialectES300 ),
             Precision + Vertex + "#define PER_OBJECT in\n" + Source );
  EXPECT_EQ( Text( EVertexShader, EFormInstancedSelection, EDialectES300 ).find( Precision + Vertex ), 0u );
}

TEST( ShaderText, MurmurHash3OfKnownTexts )
{
  constexpr std::uint32_t Seed = 0x9747b28c;
  EXPECT_EQ( MurmurHash3( "" ), 0u );
  EXPECT_EQ( MurmurHash3( "", 1 ), 0x514E28B7u );
  EXPECT_EQ( MurmurHash3( "", 0xFFFFFFFF ), 0x81F16F39u );
  EXPECT_EQ( MurmurHash3( "test" ), 0xBA6BD213u );
  EXPECT_EQ( MurmurHash3( "Hello, world!" ), 0xC0363E43u );
  EXPECT_EQ( MurmurHash3( "The quick brown fox jumps over the lazy dog" ), 0x2E4FF723u );
  // Every length of the rest behind the blocks of four, and bytes above 127.
  EXPECT_EQ( MurmurHash3( "a", Seed ), 0x7FA09EA6u );
  EXPECT_EQ( MurmurHash3( "aa", Seed ), 0x5D211726u );
  EXPECT_EQ( MurmurHash3( "aaa", Seed ), 0x283E0130u );
  EXPECT_EQ( MurmurHash3( "aaaa", Seed ), 0x5A97808Au );
  EXPECT_EQ( MurmurHash3( "\xCF\x80\xCF\x80\xCF\x80\xCF\x80\xCF\x80\xCF\x80\xCF\x80\xCF\x80", Seed ), 0xD58063C1u );
}

TEST( ShaderText, ASelectionColourHoldsEveryBitOfItsWord )
{
  for ( int Bit = 0; Bit < 24; ++Bit )
  {
    const std::uint32_t Word = ( 1u << Bit ) | 0x00A500u;
    const QVector3D Colour = SelectionColour( Word );
    const auto Byte = []( float i_Value )
    {
      return std::uint32_t( std::lround( i_Value * 255.0f ) );
    };
    EXPECT_EQ( Byte( Colour.x() ) | Byte( Colour.y() ) << 8 | Byte( Colour.z() ) << 16, Word );
    EXPECT_EQ( SelectionWord( Word | 0x01000000u ), Word );
  }
}
