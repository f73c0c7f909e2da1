#include "ShaderBench.h"

#include <QtCore/QFile>
#include <QtCore/QRegularExpression>

#include <cmath>

using namespace CoreGraphics;

namespace CoreGraphicsTests
{
namespace
{
constexpr GLenum Float32 = 0x8814; // GL_RGBA32F
constexpr int Captured = 64;       // floats

auto* const s_pBench = TUntilTheEnd< VShaderBench >::Make();

QByteArray Source( EShaderType i_Type, const std::string& i_rName )
{
  const QString Folder = i_Type == EVertexShader ? ":/VertexShaders/" : ":/FragmentShaders/";
  QFile File( Folder + QString::fromStdString( i_rName ) + ".glsl" );
  EXPECT_TRUE( File.open( QIODevice::ReadOnly ) ) << i_rName;
  return File.readAll();
}

// The inputs or outputs that a source declares: names, and components.
std::vector< std::pair< std::string, int > > Varyings( const QByteArray& i_rSource )
{
  const QRegularExpression Declaration( "^varying\\s+(float|vec(\\d))\\s+(\\w+);",
                                        QRegularExpression::MultilineOption );
  std::vector< std::pair< std::string, int > > Found;
  for ( const QRegularExpressionMatch& rMatch : Declaration.globalMatch( QString( i_rSource ) ) )
  {
    Found.emplace_back( rMatch.captured( 3 ).toStdString(), std::max( 1, rMatch.captured( 2 ).toInt() ) );
  }
  return Found;
}

// A vertex shader that hands a fragment shader what the uniforms of its inputs' names say.
QByteArray Feeder( const QByteArray& i_rSource )
{
  std::string Head = "uniform float f_PointSize;\n", Body;
  for ( const auto& [rName, Count] : Varyings( i_rSource ) )
  {
    const std::string Type = Count == 1 ? "float " : "vec" + std::to_string( Count ) + " ";
    Head += "uniform " + Type + "f_" + rName + ";\nvarying " + Type + rName + ";\n";
    Body += rName + " = f_" + rName + ";\n";
  }
  return QByteArray::fromStdString(
      Head + "void main()\n{\n" + Body +
      "vec2 corner = f_PointSize > 0.0 ? vec2( 0.0 ) : vec2( gl_VertexID & 1, gl_VertexID >> 1 ) * 4.0 - 1.0;\n"
      "gl_Position = vec4( corner, 0.0, 1.0 );\ngl_PointSize = f_PointSize;\n}\n" );
}

std::size_t Components( GLenum i_Type )
{
  static const std::map< GLenum, std::size_t > Known = {
      { GL_FLOAT_VEC2, 2 }, { GL_FLOAT_VEC3, 3 }, { GL_FLOAT_VEC4, 4 }, { GL_FLOAT_MAT2, 4 }, { GL_FLOAT_MAT4, 16 } };
  const auto It = Known.find( i_Type );
  return It != Known.end() ? It->second : 1;
}
} // namespace

VValues With( VValues i_Values, const VValues& i_rMore )
{
  for ( const auto& [rName, rValue] : i_rMore )
  {
    i_Values[rName] = rValue;
  }
  return i_Values;
}

testing::AssertionResult IsNear( const VValue& i_rFound, const VValue& i_rExpected, float i_Tolerance )
{
  double Distance = 0, Size = 0;
  for ( std::size_t Index = 0; Index < std::min( i_rFound.size(), i_rExpected.size() ); ++Index )
  {
    Distance = std::hypot( Distance, double( i_rFound[Index] ) - double( i_rExpected[Index] ) );
    Size = std::hypot( Size, i_rExpected[Index] );
  }
  if ( i_rFound.size() == i_rExpected.size() && Distance <= double( i_Tolerance ) + 4e-7 * Size )
  {
    return testing::AssertionSuccess();
  }
  return testing::AssertionFailure() << testing::PrintToString( i_rFound ) << " for "
                                     << testing::PrintToString( i_rExpected ) << ' ';
}

ShaderTest::ShaderTest()
  : Bench( s_pBench->Object() )
{
  EXPECT_TRUE( Bench.MakeCurrent() );
}

ShaderTest::~ShaderTest()
{
  EXPECT_EQ( QOpenGLContext::currentContext()->functions()->glGetError(), GLenum( GL_NO_ERROR ) );
}

VShaderBench::VShaderBench()
  : m_Context( EKindCore )
  , m_rGl( *m_Context.pRender->Functions() )
  , m_Target( QSize( Side, Side ), QOpenGLFramebufferObject::NoAttachment, GL_TEXTURE_2D, Float32 )
{
  m_Context.Begin(); // point sizes by the program
  m_rGl.glDisable( GL_SCISSOR_TEST );
  m_rGl.glGenBuffers( 1, &m_Captured );
  m_rGl.glBindBuffer( GL_TRANSFORM_FEEDBACK_BUFFER, m_Captured );
  m_rGl.glBufferData( GL_TRANSFORM_FEEDBACK_BUFFER, Captured * sizeof( float ), nullptr, GL_DYNAMIC_READ );
  EXPECT_TRUE( m_Target.bind() );
  m_rGl.glViewport( 0, 0, Side, Side );
  m_rGl.glClearColor( Untouched.x(), Untouched.y(), Untouched.z(), Untouched.w() );
}

void VShaderBench::Link( VProgram& o_rpProgram, const QByteArray& i_rVertex, const QByteArray& i_rFragment,
                         const std::vector< const char* >& i_rOutputs )
{
  o_rpProgram = std::make_unique< QOpenGLShaderProgram >();
  EXPECT_TRUE( o_rpProgram->addShaderFromSourceCode( QOpenGLShader::Vertex, i_rVertex ) );
  EXPECT_TRUE( o_rpProgram->addShaderFromSourceCode( QOpenGLShader::Fragment, i_rFragment ) );
  m_rGl.glTransformFeedbackVaryings( o_rpProgram->programId(), GLsizei( i_rOutputs.size() ), i_rOutputs.data(),
                                     GL_INTERLEAVED_ATTRIBS );
  EXPECT_TRUE( o_rpProgram->link() );
}

void VShaderBench::SetUniform( QOpenGLShaderProgram& io_rProgram, int i_Index, const VValues& i_rValues )
{
  static const VValue Zeros( std::vector< float >( 16 ) );
  std::array< char, 128 > Name{};
  GLint Size = 0;
  GLenum Type = 0;
  m_rGl.glGetActiveUniform( io_rProgram.programId(), GLuint( i_Index ), 128, nullptr, &Size, &Type, Name.data() );
  std::string Key = Name.data();
  Key = Key.substr( Key.starts_with( "f_" ) ? 2 : 0 );
  const auto It = i_rValues.find( Key.substr( 0, Key.find( '[' ) ) );
  const VValue& rValue = It != i_rValues.end() ? It->second : Zeros;
  const std::size_t Count = Components( Type );
  EXPECT_TRUE( It == i_rValues.end() || rValue.size() == Count * std::size_t( Size ) ) << Key;
  const int Location = io_rProgram.uniformLocation( Name.data() );
  switch ( Type )
  {
  case GL_FLOAT_MAT2:
    return m_rGl.glUniformMatrix2fv( Location, 1, GL_FALSE, rValue.data() );
  case GL_FLOAT_MAT4:
    return m_rGl.glUniformMatrix4fv( Location, GLsizei( rValue.size() / 16 ), GL_FALSE, rValue.data() );
  case GL_FLOAT:
  case GL_FLOAT_VEC2:
  case GL_FLOAT_VEC3:
  case GL_FLOAT_VEC4:
    return io_rProgram.setUniformValueArray( Location, rValue.data(), 1, int( Count ) );
  default: // int, bool, sampler2D
    return io_rProgram.setUniformValue( Location, GLint( rValue[0] ) );
  }
}

void VShaderBench::SetValues( QOpenGLShaderProgram& io_rProgram, const VValues& i_rValues, EShaderForm i_Form )
{
  io_rProgram.bind();
  GLint Count = 0;
  m_rGl.glGetProgramiv( io_rProgram.programId(), GL_ACTIVE_UNIFORMS, &Count );
  for ( GLint Index = 0; Index < Count; ++Index )
  {
    SetUniform( io_rProgram, Index, i_rValues );
  }
  for ( int Attribute = 0; Attribute < EAttributeCount; ++Attribute )
  {
    const char* pName = AttributeName( EVertexAttribute( Attribute ) );
    const bool bPerObject = Attribute >= FixedAttributeCount;
    EXPECT_TRUE( i_Form == EFormSingle || !bPerObject || io_rProgram.uniformLocation( pName ) < 0 ) << pName;
    const auto It = i_rValues.find( pName );
    const VValue Value = It != i_rValues.end() ? It->second : VValue{ 0, 0, 0, 0 };
    const int Columns = Value.size() == 16 ? 4 : 1;
    if ( const int Location = io_rProgram.attributeLocation( pName ); Location >= 0 )
    {
      io_rProgram.setAttributeValue( Location, Value.data(), Columns, int( Value.size() ) / Columns );
    }
  }
}

VValues VShaderBench::Vertex( const std::string& i_rName, const VValues& i_rValues )
{
  const QByteArray Text = Source( EVertexShader, i_rName );
  const VValues Result = Vertex( i_rName, Text, i_rValues, EFormSingle );
  if ( Text.contains( "\nPER_OBJECT" ) )
  {
    for ( const auto& [rOutput, rValue] : Vertex( i_rName, Text, i_rValues, EFormInstanced ) )
    {
      EXPECT_TRUE( IsNear( rValue, Result.at( rOutput ) ) ) << i_rName << ' ' << rOutput;
    }
  }
  return Result;
}

VValues VShaderBench::Vertex( const std::string& i_rName, const QByteArray& i_rText, const VValues& i_rValues,
                              EShaderForm i_Form )
{
  auto Outputs = Varyings( i_rText );
  Outputs.emplace_back( "gl_Position", 4 );
  if ( i_rText.contains( "gl_PointSize" ) )
  {
    Outputs.emplace_back( "gl_PointSize", 1 );
  }
  VProgram& rpProgram = m_Programs["V" + i_rName + std::to_string( i_Form )];
  if ( !rpProgram )
  {
    std::vector< const char* > Names;
    for ( const auto& [rName, Count] : Outputs )
    {
      Names.push_back( rName.c_str() );
    }
    const QByteArray Nothing = "void main() { gl_FragColor = vec4( 1.0 ); }";
    Link( rpProgram, VShader::Compose( i_rText, EVertexShader, i_Form, EDialectES300 ),
          VShader::Compose( Nothing, EFragmentShader, EFormSingle, EDialectES300 ), Names );
  }
  SetValues( *rpProgram, i_rValues, i_Form );
  m_rGl.glBindBufferBase( GL_TRANSFORM_FEEDBACK_BUFFER, 0, m_Captured );
  m_rGl.glEnable( GL_RASTERIZER_DISCARD );
  m_rGl.glBeginTransformFeedback( GL_POINTS );
  m_rGl.glDrawArrays( GL_POINTS, 0, 1 );
  m_rGl.glEndTransformFeedback();
  m_rGl.glDisable( GL_RASTERIZER_DISCARD );
  const auto* pValue = static_cast< const float* >(
      m_rGl.glMapBufferRange( GL_TRANSFORM_FEEDBACK_BUFFER, 0, Captured * sizeof( float ), GL_MAP_READ_BIT ) );
  VValues Result;
  for ( const auto& [rName, Count] : Outputs )
  {
    Result[rName].assign( pValue, pValue + Count );
    pValue += Count;
  }
  m_rGl.glUnmapBuffer( GL_TRANSFORM_FEEDBACK_BUFFER );
  return Result;
}

VShaderBench::VImage VShaderBench::Fragment( const std::string& i_rName, const VValues& i_rValues, float i_PointSize )
{
  VProgram& rpProgram = m_Programs["F" + i_rName];
  if ( !rpProgram )
  {
    const QByteArray Text = Source( EFragmentShader, i_rName );
    Link( rpProgram, VShader::Compose( Feeder( Text ), EVertexShader, EFormSingle, EDialectES300 ),
          VShader::Compose( Text, EFragmentShader, EFormSingle, EDialectES300 ), {} );
  }
  SetValues( *rpProgram, With( i_rValues, { { "PointSize", i_PointSize } } ), EFormSingle );
  m_rGl.glClear( GL_COLOR_BUFFER_BIT );
  i_PointSize > 0 ? m_rGl.glDrawArrays( GL_POINTS, 0, 1 ) : m_rGl.glDrawArrays( GL_TRIANGLES, 0, 3 );
  VImage Image( Side * Side );
  m_rGl.glReadPixels( 0, 0, Side, Side, GL_RGBA, GL_FLOAT, Image.data() );
  return Image;
}

float VShaderBench::Texture( int i_Width, int i_Height, const std::vector< float >& i_rTexels, bool i_bLinear )
{
  const bool bOne = i_rTexels.size() == std::size_t( i_Width * i_Height );
  const auto Filter = i_bLinear ? QOpenGLTexture::Linear : QOpenGLTexture::Nearest;
  const auto Format = bOne ? QOpenGLTexture::Red : QOpenGLTexture::RGBA;
  auto& rpTexture = m_Textures.emplace_back( std::make_unique< QOpenGLTexture >( QOpenGLTexture::Target2D ) );
  rpTexture->setFormat( bOne ? QOpenGLTexture::R32F : QOpenGLTexture::RGBA32F );
  rpTexture->setSize( i_Width, i_Height );
  rpTexture->setMinMagFilters( Filter, Filter );
  rpTexture->setWrapMode( QOpenGLTexture::ClampToEdge );
  rpTexture->allocateStorage( Format, QOpenGLTexture::Float32 );
  rpTexture->setData( Format, QOpenGLTexture::Float32, i_rTexels.data() );
  rpTexture->bind( GLuint( m_Textures.size() % 16 ) );
  return float( m_Textures.size() % 16 );
}

} // namespace CoreGraphicsTests
