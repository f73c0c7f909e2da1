#include <CoreGraphics/VShaderProgram.h>

#include "MurmurHash3.h"

#include <QtGui/QOpenGLContext>
#include <QtGui/QOpenGLExtraFunctions>

#include <algorithm>
#include <atomic>

namespace CoreGraphics
{
namespace
{
std::atomic< std::uint64_t > s_LinkSerial{ 0 };

// The same place for an attribute in all programs: what streams turn on then seldom changes between draws, and
// location 0, which compatibility contexts must have, is always the position's. No program takes two that share
// a place.
constexpr std::array< int, EAttributeCount > AttributePlaces = { 0,  1,  2,  3,  4,  5,  6, 10, 10,
                                                                 11, 11, 12, 11, 13, 14, 6, 7 };
} // namespace

const char* FixedUniformName( EFixedUniform i_Uniform )
{
  static constexpr std::array< const char*, FixedUniformCount > Names = {
      "u_ViewProjection", "u_View",        "u_Projection", "u_View2D",     "u_ViewportSize",  "u_ViewportOffset",
      "u_FrameSize",      "u_LightVector", "u_Up",         "u_GlobalTime", "u_CameraPosition" };
  return Names[i_Uniform];
}

VShaderProgram::VShaderProgram( std::shared_ptr< VShader > i_pVertex, std::shared_ptr< VShader > i_pFragment )
  : m_pVertex( std::move( i_pVertex ) )
  , m_pFragment( std::move( i_pFragment ) )
{
  Relink();
}

void VShaderProgram::Relink()
{
  m_LinkSerial = s_LinkSerial.fetch_add( 1, std::memory_order_relaxed ) + 1;
  m_SeenRevision = 0;
  m_Id = 0;
  m_bLinked = false;
  m_FixedUniforms.fill( -1 );
  m_Attributes.fill( -1 );
  m_Uniforms.clear();
  m_pProgram.reset();
  if ( m_pVertex->IsCompiled() && m_pFragment->IsCompiled() )
  {
    Link();
  }
}

void VShaderProgram::Link()
{
  auto pProgram = std::make_unique< QOpenGLShaderProgram >();
  if ( !pProgram->create() || !pProgram->addShader( m_pVertex->Shader() ) ||
       !pProgram->addShader( m_pFragment->Shader() ) )
  {
    return;
  }
  for ( int Attribute = 0; Attribute < EAttributeCount; ++Attribute )
  {
    pProgram->bindAttributeLocation( AttributeName( EVertexAttribute( Attribute ) ),
                                     AttributePlaces[std::size_t( Attribute )] );
  }
  if ( !pProgram->link() )
  {
    return;
  }
  m_pProgram = std::move( pProgram );
  m_Id = m_pProgram->programId();
  m_bLinked = true;
  for ( int Uniform = 0; Uniform < FixedUniformCount; ++Uniform )
  {
    m_FixedUniforms[std::size_t( Uniform )] =
        m_pProgram->uniformLocation( FixedUniformName( EFixedUniform( Uniform ) ) );
  }
  for ( int Attribute = 0; Attribute < EAttributeCount; ++Attribute )
  {
    m_Attributes[std::size_t( Attribute )] =
        m_pProgram->attributeLocation( AttributeName( EVertexAttribute( Attribute ) ) );
  }
  Collect();
}

void VShaderProgram::Collect()
{
  QOpenGLExtraFunctions* pFunctions = QOpenGLContext::currentContext()->extraFunctions();
  GLint Count = 0;
  GLint MaximumLength = 0;
  pFunctions->glGetProgramiv( m_Id, GL_ACTIVE_UNIFORMS, &Count );
  pFunctions->glGetProgramiv( m_Id, GL_ACTIVE_UNIFORM_MAX_LENGTH, &MaximumLength );
  std::vector< char > Buffer( std::size_t( std::max( MaximumLength, 1 ) ) );
  const auto Insert = [this]( std::string_view i_Name, int i_Location )
  {
    const VUniformEntry Entry{ MurmurHash3( i_Name ), i_Location };
    const auto Place = std::lower_bound( m_Uniforms.begin(), m_Uniforms.end(), Entry.Hash,
                                         []( const VUniformEntry& i_rEntry, std::uint32_t i_Hash )
                                         {
                                           return i_rEntry.Hash < i_Hash;
                                         } );
    m_Uniforms.insert( Place, Entry );
  };
  for ( GLint Index = 0; Index < Count; ++Index )
  {
    GLsizei Length = 0;
    GLint Size = 0;
    GLenum Type = 0;
    pFunctions->glGetActiveUniform( m_Id, GLuint( Index ), GLsizei( Buffer.size() ), &Length, &Size, &Type,
                                    Buffer.data() );
    const std::string_view Name( Buffer.data(), std::size_t( Length ) );
    const int Location = pFunctions->glGetUniformLocation( m_Id, Buffer.data() );
    if ( Location < 0 )
    {
      continue;
    }
    Insert( Name, Location );
    if ( Name.ends_with( "[0]" ) )
    {
      Insert( Name.substr( 0, Name.size() - 3 ), Location );
    }
  }
}

int VShaderProgram::UniformLocation( std::string_view i_Name ) const
{
  const std::uint32_t Hash = MurmurHash3( i_Name );
  const auto Place = std::lower_bound( m_Uniforms.begin(), m_Uniforms.end(), Hash,
                                       []( const VUniformEntry& i_rEntry, std::uint32_t i_Hash )
                                       {
                                         return i_rEntry.Hash < i_Hash;
                                       } );
  return Place != m_Uniforms.end() && Place->Hash == Hash ? Place->Location : -1;
}

void VShaderProgram::SetUniform( int i_Location, int i_Value )
{
  if ( i_Location >= 0 && m_pProgram )
  {
    m_pProgram->setUniformValue( i_Location, GLint( i_Value ) );
  }
}

void VShaderProgram::SetUniform( int i_Location, float i_Value )
{
  if ( i_Location >= 0 && m_pProgram )
  {
    m_pProgram->setUniformValue( i_Location, GLfloat( i_Value ) );
  }
}

void VShaderProgram::SetUniform( int i_Location, const QVector2D& i_rValue )
{
  if ( i_Location >= 0 && m_pProgram )
  {
    m_pProgram->setUniformValue( i_Location, i_rValue );
  }
}

void VShaderProgram::SetUniform( int i_Location, const QVector3D& i_rValue )
{
  if ( i_Location >= 0 && m_pProgram )
  {
    m_pProgram->setUniformValue( i_Location, i_rValue );
  }
}

void VShaderProgram::SetUniform( int i_Location, const QVector4D& i_rValue )
{
  if ( i_Location >= 0 && m_pProgram )
  {
    m_pProgram->setUniformValue( i_Location, i_rValue );
  }
}

void VShaderProgram::SetUniform( int i_Location, const QMatrix2x2& i_rValue )
{
  if ( i_Location >= 0 && m_pProgram )
  {
    m_pProgram->setUniformValue( i_Location, i_rValue );
  }
}

void VShaderProgram::SetUniform( int i_Location, const QMatrix4x4& i_rValue )
{
  if ( i_Location >= 0 && m_pProgram )
  {
    m_pProgram->setUniformValue( i_Location, i_rValue );
  }
}

void VShaderProgram::SetUniformMatrices( int i_Location, std::span< const float > i_Columns )
{
  constexpr std::size_t MatrixFloats = 16;
  const auto Count = GLsizei( i_Columns.size() / MatrixFloats );
  if ( i_Location >= 0 && m_pProgram && Count > 0 )
  {
    QOpenGLContext::currentContext()->functions()->glUniformMatrix4fv( i_Location, Count, GL_FALSE, i_Columns.data() );
  }
}

} // namespace CoreGraphics
