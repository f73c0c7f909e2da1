#pragma once

#include "TestContext.h"

#include <QtOpenGL/QOpenGLShaderProgram>
#include <QtOpenGL/QOpenGLTexture>

#include <map>
#include <span>

namespace CoreGraphicsTests
{

/// What a uniform, an attribute, an input or an output holds: its components in a row.
struct VValue : std::vector< float >
{
  VValue() = default;
  VValue( std::vector< float > i_Values )
    : vector( std::move( i_Values ) )
  {
  }
  VValue( std::initializer_list< float > i_Values )
    : vector( i_Values )
  {
  }
  VValue( float i_Value )
    : vector( 1, i_Value )
  {
  }
  VValue( const QMatrix4x4& i_rValue )
    : vector( i_rValue.constData(), i_rValue.constData() + 16 )
  {
  }
  /// Of Qt's vectors.
  template < typename T >
  requires requires( const T& i_rValue ) { i_rValue.lengthSquared(); }
  VValue( const T& i_rValue )
    : vector( sizeof( T ) / sizeof( float ) )
  {
    for ( std::size_t Index = 0; Index < size(); ++Index )
    {
      at( Index ) = i_rValue[int( Index )];
    }
  }
  QVector3D Vec3() const { return { at( 0 ), at( 1 ), at( 2 ) }; }
  QVector4D Vec4() const { return { at( 0 ), at( 1 ), at( 2 ), at( 3 ) }; }
};
using VValues = std::map< std::string, VValue >;
/// The first, with what the second has beside it or else instead.
VValues With( VValues i_Values, const VValues& i_rMore );
/// Of as many components, and no further away, but for what single precision leaves out.
testing::AssertionResult IsNear( const VValue& i_rFound, const VValue& i_rExpected, float i_Tolerance = 1e-4f );

/// Runs one source of the catalogue alone: a vertex shader on one vertex, with its outputs captured, or a fragment
/// shader on a small float target, with its inputs given by name. What is not given is 0; what is given must have
/// the components that the source says.
class VShaderBench
{
public:
  static constexpr int Side = 16;
  struct VImage : std::vector< QVector4D >
  {
    using vector::vector;
    const QVector4D& At( int i_X, int i_Y ) const { return at( std::size_t( i_Y * Side + i_X ) ); }
  };

  VShaderBench();
  ~VShaderBench() { m_Context.MakeCurrent(); }
  bool MakeCurrent() { return m_Context.MakeCurrent(); }

  /// The outputs by name, "gl_Position" and "gl_PointSize" among them. A source with per-object uniforms is also run
  /// in its instanced form, which takes them as attributes, and must give the same.
  VValues Vertex( const std::string& i_rName, const VValues& i_rValues );
  /// The picture, bottom row first, of a rectangle over all of it, or of a point of that size at its middle.
  VImage Fragment( const std::string& i_rName, const VValues& i_rValues, float i_PointSize = 0 );
  /// A texture of one or four channels. To be used by its number as the value of a sampler, up to the 15th after it.
  float Texture( int i_Width, int i_Height, const std::vector< float >& i_rTexels, bool i_bLinear = false );

private:
  VValues Vertex( const std::string& i_rName, const QByteArray& i_rText, const VValues& i_rValues,
                  CoreGraphics::EShaderForm i_Form );
  using VProgram = std::unique_ptr< QOpenGLShaderProgram >;
  void Link( VProgram& o_rpProgram, const QByteArray& i_rVertex, const QByteArray& i_rFragment,
             const std::vector< const char* >& i_rOutputs );
  void SetValues( QOpenGLShaderProgram& io_rProgram, const VValues& i_rValues, CoreGraphics::EShaderForm i_Form );
  void SetUniform( QOpenGLShaderProgram& io_rProgram, int i_Index, const VValues& i_rValues );

  VTestContext m_Context;
  QOpenGLExtraFunctions& m_rGl;
  QOpenGLFramebufferObject m_Target;
  std::map< std::string, VProgram > m_Programs;
  GLuint m_Captured = 0;
  std::vector< std::unique_ptr< QOpenGLTexture > > m_Textures;
};

/// What stands in a pixel that no fragment wrote.
const QVector4D Untouched( -7, -7, -7, -7 );

/// Tests on the only bench in the process.
class ShaderTest : public testing::Test
{
public:
  ShaderTest();
  ~ShaderTest() override;
  QVector4D Pixel( const std::string& i_rName, const VValues& i_rValues )
  {
    return Bench.Fragment( i_rName, i_rValues ).At( VShaderBench::Side / 2, VShaderBench::Side / 2 );
  }
  void ExpectPixel( const std::string& i_rName, const VValues& i_rValues, const VValue& i_rExpected,
                    float i_Tolerance = 1e-4f )
  {
    EXPECT_TRUE( IsNear( Pixel( i_rName, i_rValues ), i_rExpected, i_Tolerance ) ) << i_rName;
  }
  VShaderBench& Bench;
};

} // namespace CoreGraphicsTests
