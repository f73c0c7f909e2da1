#pragma once

#include <CoreGraphics/VShader.h>
#include <CoreGraphics/VVertexLayout.h>

#include <QtGui/QMatrix4x4>
#include <QtGui/QVector2D>
#include <QtGui/QVector3D>
#include <QtGui/QVector4D>
#include <QtOpenGL/QOpenGLShaderProgram>

#include <array>
#include <cstdint>
#include <memory>
#include <span>
#include <string_view>
#include <vector>

namespace CoreGraphics
{

/// The uniforms that the context sets in every program that has them.
enum EFixedUniform
{
  EUniformViewProjection = 0,
  EUniformView,
  EUniformProjection,
  EUniformView2D,
  EUniformViewportSize,
  EUniformViewportOffset,
  EUniformFrameSize,
  EUniformLightVector,
  EUniformUp,
  EUniformGlobalTime,
  EUniformCameraPosition,
  FixedUniformCount
};

const char* FixedUniformName( EFixedUniform i_Uniform );

/// One linked pair of shaders. The object stays when its sources are reloaded; it is then linked again in place
/// and `LinkSerial` changes, so a holder keeps the shared pointer and looks locations up through `VUniform`.
/// Thread: render thread with a context current; setters act on the program that is in use.
class VShaderProgram
{
public:
  VShaderProgram( std::shared_ptr< VShader > i_pVertex, std::shared_ptr< VShader > i_pFragment );

  bool IsUsable() const { return m_bLinked && m_pProgram->isLinked(); }
  GLuint Id() const { return m_Id; }
  /// Never 0, and never the same for two links in this process.
  std::uint64_t LinkSerial() const { return m_LinkSerial; }

  /// -1 when the program has no such uniform. An array is found by its plain name and as "name[0]".
  int UniformLocation( std::string_view i_Name ) const;
  int FixedLocation( EFixedUniform i_Uniform ) const { return m_FixedUniforms[i_Uniform]; }
  int AttributeLocation( EVertexAttribute i_Attribute ) const { return m_Attributes[i_Attribute]; }

  /// Each does nothing for a negative location.
  void SetUniform( int i_Location, int i_Value );
  void SetUniform( int i_Location, float i_Value );
  void SetUniform( int i_Location, const QVector2D& i_rValue );
  void SetUniform( int i_Location, const QVector3D& i_rValue );
  void SetUniform( int i_Location, const QVector4D& i_rValue );
  void SetUniform( int i_Location, const QMatrix2x2& i_rValue );
  void SetUniform( int i_Location, const QMatrix4x4& i_rValue );
  /// Fills an array of mat4 from its start: 16 floats a matrix, column-major. A rest that is no matrix is left out.
  void SetUniformMatrices( int i_Location, std::span< const float > i_Columns );

  /// Links again after a shader was reloaded.
  void Relink();
  const std::shared_ptr< VShader >& Vertex() const { return m_pVertex; }
  const std::shared_ptr< VShader >& Fragment() const { return m_pFragment; }

private:
  friend class VRenderContext;
  struct VUniformEntry
  {
    std::uint32_t Hash;
    int Location;
  };
  void Link();
  void Collect();

  std::shared_ptr< VShader > m_pVertex;
  std::shared_ptr< VShader > m_pFragment;
  std::unique_ptr< QOpenGLShaderProgram > m_pProgram;
  std::array< int, FixedUniformCount > m_FixedUniforms{};
  std::array< int, EAttributeCount > m_Attributes{};
  std::vector< VUniformEntry > m_Uniforms;
  std::uint64_t m_LinkSerial = 0;
  std::uint64_t m_SeenRevision = 0; // the context values that the fixed uniforms hold
  GLuint m_Id = 0;
  bool m_bLinked = false;
};

/// A uniform's location, looked up by name once per link. The name must be a literal.
class VUniform
{
public:
  explicit constexpr VUniform( const char* i_pName )
    : m_pName( i_pName )
  {
  }
  int Location( const VShaderProgram& i_rProgram )
  {
    if ( m_LinkSerial != i_rProgram.LinkSerial() )
    {
      m_LinkSerial = i_rProgram.LinkSerial();
      m_Location = i_rProgram.UniformLocation( m_pName );
    }
    return m_Location;
  }
  template < typename T >
  void Set( VShaderProgram& io_rProgram, const T& i_rValue )
  {
    io_rProgram.SetUniform( Location( io_rProgram ), i_rValue );
  }

private:
  const char* m_pName;
  std::uint64_t m_LinkSerial = 0;
  int m_Location = -1;
};

} // namespace CoreGraphics
