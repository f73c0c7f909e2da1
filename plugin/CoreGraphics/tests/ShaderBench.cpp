#include "ShaderBench.h"

#include <QtCore/QFile>
#include <QtCore/QRegularExpression>

using namespace CoreGraphics;

namespace CoreGraphicsTests
{
namespace
{
constexpr GLenum Float32 = 0x8814; // GL_RGBA32F
constexpr int Captured = 64;       // floats

QByteArray Source( EShaderType i_Type, const std::string& i_rName )
{
  const QString Folder = i_Type == EVertexShader ? ":/VertexShaders/" : ":/FragmentShaders/";
  QFile File( Folder + QString::fromStdString( i_rName ) + ".glsl" );
  EXPECT_TRUE( File.open( QIODevice::ReadOnly ) ) << i_rName;
  return File.readAll();
}

struct VVarying
{
  std::string Type;
  std::string Name;
};

std::vector< VVarying > Varyings( const QByteArray& i_rSource )
{
  const QRegularExpression Declaration( "^varying\\s+(\\w+)\\s+(\\w+);", QRegularExpression::MultilineOption );
  std::vector< VVarying > Found;
  for ( auto It = Declaration.globalMatch( QString( i_rSource ) ); It.hasNext(); )
  {
    const QRegularExpressionMatch Match = It.next();
    Found.push_back( { Match.captured( 1 ).toStdString(), Match.captured( 2 ).toStdString() } );
  }
  return Found;
}

std::size_t Components( const std::string& i_rType )
{
  return i_rType == "float" ? 1 : std::size_t( i_rType.back() - '0' );
}

// A vertex shader that hands a fragment shader what the uniforms of its inputs' names say.
QByteArray Feeder( const std::vector< VVarying >& i_rVaryings )
{
  std::string Head = "attribute vec2 a_position;\nuniform float f_PointSize;\n";
  std::string Body = "void main()\n{\n";
  for ( const auto& [rType, rName] : i_rVaryings )
  {
    Head += "uniform " + rType + " f_" + rName + ";\nvarying " + rType + " " + rName + ";\n";
    Body += rName + " = f_" + rName + ";\n";
  }
  Body += "gl_Position = vec4( a_position, 0.0, 1.0 );\ngl_PointSize = f_PointSize;\n}\n";
  return QByteArray::fromStdString( Head + Body );
}
} // namespace

VShaderBench::VValues With( VShaderBench::VValues i_Values, const VShaderBench::VValues& i_rMore )
{
  for ( const auto& [rName, rValue] : i_rMore )
  {
    i_Values[rName] = rValue;
  }
  return i_Values;
}

std::vector< float > Floats( const QMatrix4x4& i_rMatrix )
{
  return { i_rMatrix.constData(), i_rMatrix.constData() + 16 };
}

std::vector< float > Floats( const QVector3D& i_rVector, float i_W )
{
  return { i_rVector.x(), i_rVector.y(), i_rVector.z(), i_W };
}

std::vector< float > Floats( const QVector3D& i_rVector )
{
  return { i_rVector.x(), i_rVector.y(), i_rVector.z() };
}

QVector4D Vec4( const std::vector< float >& i_rValue )
{
  return { i_rValue.at( 0 ), i_rValue.at( 1 ), i_rValue.at( 2 ), i_rValue.at( 3 ) };
}

QVector3D Vec3( const std::vector< float >& i_rValue )
{
  return { i_rValue.at( 0 ), i_rValue.at( 1 ), i_rValue.at( 2 ) };
}

VShaderBench::VShaderBench( EContextKind i_Kind )
  : m_Context( i_Kind )
  , m_rGl( *m_Context.pRender->Functions() )
{
  m_Context.Begin(); // point sizes by the program
  m_rGl.glDisable( GL_SCISSOR_TEST );
  m_rGl.glGenVertexArrays( 1, &m_VertexArray );
  m_rGl.glBindVertexArray( m_VertexArray );
  m_rGl.glEnableVertexAttribArray( 0 );
  for ( GLuint* pBuffer : { &m_Corners, &m_Vertex, &m_Captured } )
  {
    m_rGl.glGenBuffers( 1, pBuffer );
    m_rGl.glBindBuffer( GL_ARRAY_BUFFER, *pBuffer );
    const std::array< float, Captured > Corners{ -1, -1, 1, -1, -1, 1, 1, 1, 0, 0 };
    m_rGl.glBufferData( GL_ARRAY_BUFFER, sizeof( Corners ), Corners.data(), GL_DYNAMIC_DRAW );
  }
  m_rGl.glGenTextures( 1, &m_Target );
  m_rGl.glBindTexture( GL_TEXTURE_2D, m_Target );
  m_rGl.glTexImage2D( GL_TEXTURE_2D, 0, Float32, Side, Side, 0, GL_RGBA, GL_FLOAT, nullptr );
  m_rGl.glGenFramebuffers( 1, &m_Framebuffer );
  m_rGl.glBindFramebuffer( GL_FRAMEBUFFER, m_Framebuffer );
  m_rGl.glFramebufferTexture2D( GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0, GL_TEXTURE_2D, m_Target, 0 );
  EXPECT_EQ( m_rGl.glCheckFramebufferStatus( GL_FRAMEBUFFER ), GLenum( GL_FRAMEBUFFER_COMPLETE ) );
  m_rGl.glViewport( 0, 0, Side, Side );
}

VShaderBench::~VShaderBench()
{
  EXPECT_EQ( m_rGl.glGetError(), GLenum( GL_NO_ERROR ) );
  for ( const auto& [rKey, Program] : m_Programs )
  {
    m_rGl.glDeleteProgram( Program );
  }
  m_rGl.glDeleteTextures( GLsizei( m_Textures.size() ), m_Textures.data() );
  m_rGl.glDeleteTextures( 1, &m_Target );
  m_rGl.glDeleteFramebuffers( 1, &m_Framebuffer );
  for ( const GLuint& rBuffer : { m_Corners, m_Vertex, m_Captured } )
  {
    m_rGl.glDeleteBuffers( 1, &rBuffer );
  }
  m_rGl.glDeleteVertexArrays( 1, &m_VertexArray );
}

GLuint VShaderBench::Link( const QByteArray& i_rVertex, const QByteArray& i_rFragment,
                           std::span< const std::string > i_Outputs )
{
  QOpenGLShader Vertex( QOpenGLShader::Vertex );
  QOpenGLShader Fragment( QOpenGLShader::Fragment );
  EXPECT_TRUE( Vertex.compileSourceCode( i_rVertex ) && Fragment.compileSourceCode( i_rFragment ) );
  const GLuint Program = m_rGl.glCreateProgram();
  m_rGl.glAttachShader( Program, Vertex.shaderId() );
  m_rGl.glAttachShader( Program, Fragment.shaderId() );
  m_rGl.glBindAttribLocation( Program, 0, "a_position" );
  std::vector< const char* > Names;
  for ( const std::string& rName : i_Outputs )
  {
    Names.push_back( rName.c_str() );
  }
  m_rGl.glTransformFeedbackVaryings( Program, GLsizei( Names.size() ), Names.data(), GL_INTERLEAVED_ATTRIBS );
  m_rGl.glLinkProgram( Program );
  GLint Linked = 0;
  m_rGl.glGetProgramiv( Program, GL_LINK_STATUS, &Linked );
  EXPECT_TRUE( Linked );
  return Program;
}

void VShaderBench::SetUniform( int i_Location, GLenum i_Type, int i_Size, const std::vector< float >& i_rValue )
{
  const float* pValue = i_rValue.data();
  switch ( i_Type )
  {
  case GL_FLOAT:
    return m_rGl.glUniform1fv( i_Location, 1, pValue );
  case GL_FLOAT_VEC2:
    return m_rGl.glUniform2fv( i_Location, 1, pValue );
  case GL_FLOAT_VEC3:
    return m_rGl.glUniform3fv( i_Location, 1, pValue );
  case GL_FLOAT_VEC4:
    return m_rGl.glUniform4fv( i_Location, 1, pValue );
  case GL_FLOAT_MAT2:
    return m_rGl.glUniformMatrix2fv( i_Location, 1, GL_FALSE, pValue );
  case GL_FLOAT_MAT4:
    return m_rGl.glUniformMatrix4fv( i_Location, std::min( i_Size, int( i_rValue.size() / 16 ) ), GL_FALSE, pValue );
  default: // int, bool, sampler2D
    return m_rGl.glUniform1i( i_Location, int( *pValue ) );
  }
}

void VShaderBench::SetAttribute( GLuint i_Program, const std::string& i_rName, const std::vector< float >& i_rValue )
{
  const int Location = m_rGl.glGetAttribLocation( i_Program, i_rName.c_str() );
  if ( Location < 0 )
  {
    return;
  }
  if ( Location == 0 )
  {
    const auto Count = GLint( i_rValue.size() );
    m_rGl.glBindBuffer( GL_ARRAY_BUFFER, m_Vertex );
    m_rGl.glBufferSubData( GL_ARRAY_BUFFER, 0, Count * GLsizei( sizeof( float ) ), i_rValue.data() );
    m_rGl.glVertexAttribPointer( 0, Count, GL_FLOAT, GL_FALSE, 0, nullptr );
    return;
  }
  for ( std::size_t Column = 0; Column * 4 < i_rValue.size(); ++Column )
  {
    std::array< float, 4 > Values{ 0, 0, 0, 1 };
    const auto Begin = i_rValue.begin() + std::ptrdiff_t( Column * 4 );
    std::copy_n( Begin, std::min< std::ptrdiff_t >( 4, i_rValue.end() - Begin ), Values.begin() );
    m_rGl.glVertexAttrib4fv( GLuint( Location ) + GLuint( Column ), Values.data() );
  }
}

void VShaderBench::SetValues( GLuint i_Program, const VValues& i_rValues )
{
  m_rGl.glUseProgram( i_Program );
  GLint Count = 0;
  m_rGl.glGetProgramiv( i_Program, GL_ACTIVE_UNIFORMS, &Count );
  for ( GLint Index = 0; Index < Count; ++Index )
  {
    std::array< char, 128 > Name{};
    GLint Size = 0;
    GLenum Type = 0;
    m_rGl.glGetActiveUniform( i_Program, GLuint( Index ), 128, nullptr, &Size, &Type, Name.data() );
    std::string Key = Name.data();
    Key = Key.substr( Key.starts_with( "f_" ) ? 2 : 0 );
    const auto It = i_rValues.find( Key.substr( 0, Key.find( '[' ) ) );
    const std::vector< float > Zeros( 16, 0.0f );
    SetUniform( m_rGl.glGetUniformLocation( i_Program, Name.data() ), Type, Size,
                It != i_rValues.end() ? It->second : Zeros );
  }
  for ( const auto& [rName, rValue] : i_rValues )
  {
    SetAttribute( i_Program, rName, rValue );
  }
}

VShaderBench::VValues VShaderBench::Vertex( const std::string& i_rName, const VValues& i_rValues, EShaderForm i_Form )
{
  const QByteArray Text = Source( EVertexShader, i_rName );
  std::vector< VVarying > Outputs = Varyings( Text );
  Outputs.push_back( { "vec4", "gl_Position" } );
  if ( Text.contains( "gl_PointSize" ) )
  {
    Outputs.push_back( { "float", "gl_PointSize" } );
  }
  GLuint& rProgram = m_Programs["V" + i_rName + std::to_string( i_Form )];
  if ( rProgram == 0 )
  {
    std::vector< std::string > Names;
    for ( const VVarying& rOutput : Outputs )
    {
      Names.push_back( rOutput.Name );
    }
    const QByteArray Nothing = "void main() { gl_FragColor = vec4( 1.0 ); }";
    rProgram = Link( VShader::Compose( Text, EVertexShader, i_Form, EDialectES300 ),
                     VShader::Compose( Nothing, EFragmentShader, EFormSingle, EDialectES300 ), Names );
  }
  SetValues( rProgram, i_rValues );
  m_rGl.glBindBufferBase( GL_TRANSFORM_FEEDBACK_BUFFER, 0, m_Captured );
  m_rGl.glEnable( GL_RASTERIZER_DISCARD );
  m_rGl.glBeginTransformFeedback( GL_POINTS );
  m_rGl.glDrawArrays( GL_POINTS, 0, 1 );
  m_rGl.glEndTransformFeedback();
  m_rGl.glDisable( GL_RASTERIZER_DISCARD );
  const auto* pValue = static_cast< const float* >(
      m_rGl.glMapBufferRange( GL_TRANSFORM_FEEDBACK_BUFFER, 0, Captured * sizeof( float ), GL_MAP_READ_BIT ) );
  VValues Result;
  for ( const auto& [rType, rName] : Outputs )
  {
    Result[rName].assign( pValue, pValue + Components( rType ) );
    pValue += Components( rType );
  }
  m_rGl.glUnmapBuffer( GL_TRANSFORM_FEEDBACK_BUFFER );
  return Result;
}

VShaderBench::VImage VShaderBench::Fragment( const std::string& i_rName, const VValues& i_rValues, float i_PointSize )
{
  GLuint& rProgram = m_Programs["F" + i_rName];
  if ( rProgram == 0 )
  {
    const QByteArray Text = Source( EFragmentShader, i_rName );
    rProgram = Link( VShader::Compose( Feeder( Varyings( Text ) ), EVertexShader, EFormSingle, EDialectES300 ),
                     VShader::Compose( Text, EFragmentShader, EFormSingle, EDialectES300 ), {} );
  }
  VValues Values = i_rValues;
  Values["PointSize"] = { i_PointSize };
  SetValues( rProgram, Values );
  m_rGl.glClearColor( Untouched, Untouched, Untouched, Untouched );
  m_rGl.glClear( GL_COLOR_BUFFER_BIT );
  m_rGl.glBindBuffer( GL_ARRAY_BUFFER, m_Corners );
  m_rGl.glVertexAttribPointer( 0, 2, GL_FLOAT, GL_FALSE, 0, nullptr );
  i_PointSize > 0 ? m_rGl.glDrawArrays( GL_POINTS, 4, 1 ) : m_rGl.glDrawArrays( GL_TRIANGLE_STRIP, 0, 4 );
  VImage Image( Side * Side );
  static_assert( sizeof( QVector4D ) == 4 * sizeof( float ) );
  m_rGl.glReadPixels( 0, 0, Side, Side, GL_RGBA, GL_FLOAT, Image.data() );
  return Image;
}

QVector4D VShaderBench::Pixel( const std::string& i_rName, const VValues& i_rValues, int i_X, int i_Y )
{
  return Fragment( i_rName, i_rValues )[std::size_t( i_Y * Side + i_X )];
}

float VShaderBench::AddTexture( int i_Width, int i_Height, GLint i_Internal, GLenum i_Format, GLenum i_Type,
                                const void* i_pTexels, GLint i_Filter )
{
  constexpr std::size_t Units = 16;
  const auto Unit = GLenum( m_Textures.size() % Units );
  m_rGl.glActiveTexture( GL_TEXTURE0 + Unit );
  m_rGl.glGenTextures( 1, &m_Textures.emplace_back() );
  m_rGl.glBindTexture( GL_TEXTURE_2D, m_Textures.back() );
  m_rGl.glPixelStorei( GL_UNPACK_ALIGNMENT, 1 );
  m_rGl.glTexImage2D( GL_TEXTURE_2D, 0, i_Internal, i_Width, i_Height, 0, i_Format, i_Type, i_pTexels );
  m_rGl.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER, i_Filter );
  m_rGl.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER, i_Filter );
  m_rGl.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_WRAP_S, GL_CLAMP_TO_EDGE );
  m_rGl.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_WRAP_T, GL_CLAMP_TO_EDGE );
  return float( Unit );
}

float VShaderBench::Texture( int i_Width, int i_Height, std::span< const std::uint8_t > i_Texels, bool i_bLinear )
{
  const bool bOne = i_Texels.size() == std::size_t( i_Width * i_Height );
  return AddTexture( i_Width, i_Height, bOne ? GL_R8 : GL_RGBA8, bOne ? GL_RED : GL_RGBA, GL_UNSIGNED_BYTE,
                     i_Texels.data(), i_bLinear ? GL_LINEAR : GL_NEAREST );
}

float VShaderBench::Texture( int i_Width, int i_Height, std::span< const float > i_Texels )
{
  const bool bOne = i_Texels.size() == std::size_t( i_Width * i_Height );
  return AddTexture( i_Width, i_Height, bOne ? 0x822E : int( Float32 ), bOne ? GL_RED : GL_RGBA, GL_FLOAT,
                     i_Texels.data(), GL_NEAREST );
}

} // namespace CoreGraphicsTests
