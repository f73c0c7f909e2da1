#include <CoreGraphics/VShader.h>

#include "GraphicsLog.h"

#include <QtCore/QFile>
#include <QtGui/QOpenGLContext>

namespace CoreGraphics
{
namespace
{
bool IsSelection( EShaderForm i_Form )
{
  return i_Form == EFormInstancedSelection || i_Form == EFormPointsSelection;
}

// Lines between the prefix and a source that give its per-object uniforms another origin.
QByteArray FormLines( EShaderType i_Type, EShaderForm i_Form )
{
  if ( i_Form == EFormSingle )
  {
    return {};
  }
  if ( i_Form == EFormTextureBuffers )
  {
    return "#define TEXTURE_BUFFERS\n";
  }
  if ( i_Type == EFragmentShader )
  {
    return "#define PER_OBJECT flat in\n";
  }
  return IsSelection( i_Form ) ? "#define PER_OBJECT in\n#define main PerObjectMain\n" : "#define PER_OBJECT in\n";
}

// Lines behind a vertex source: its main is called, then the object's id becomes its colour. What has no place in
// the render mode is moved out of the clip volume, which costs no fragment.
QByteArray SelectionLines( EShaderForm i_Form )
{
  const QByteArray Index = i_Form == EFormPointsSelection ? "gl_VertexID" : "gl_InstanceID";
  return "\n#undef main\n"
         "uniform highp int u_FirstId;\n"
         "uniform highp int u_RequiredFlags;\n"
         "uniform highp int u_RefusedFlags;\n"
         "in float a_InstanceFlags;\n"
         "flat out vec3 u_SelectionId;\n"
         "void main()\n"
         "{\n"
         "  PerObjectMain();\n"
         "  highp int Flags = int( a_InstanceFlags + 0.5 );\n"
         "  highp int Word = ( ( u_FirstId + " +
         Index +
         " + ( Flags >> 8 ) ) & 0x1FFFFF ) | ( ( Flags & 7 ) << 21 );\n"
         "  u_SelectionId = vec3( float( Word & 255 ), float( ( Word >> 8 ) & 255 ), float( Word >> 16 ) ) / 255.0;\n"
         "  bool bMissing = u_RequiredFlags != 0 && ( Flags & u_RequiredFlags ) == 0;\n"
         "  if ( bMissing || ( Flags & u_RefusedFlags ) != 0 )\n"
         "  {\n"
         "    gl_Position = vec4( 0.0, 0.0, 2.0, 1.0 );\n"
         "  }\n"
         "}\n";
}
} // namespace

VShader::VShader( QString i_Path, EShaderType i_Type, EShaderForm i_Form, EShaderDialect i_Dialect )
  : m_Type( i_Type )
  , m_Form( i_Form )
  , m_Dialect( i_Dialect )
{
  Reload( i_Path, i_Dialect, true );
}

QByteArray VShader::Prefix( EShaderType i_Type, EShaderDialect i_Dialect )
{
  QByteArray Text = i_Dialect == EDialectES300 ? "#version 300 es\n"
                                                 "#undef highp\nprecision highp sampler2D;\n"
                                                 "#undef highp\nprecision highp float;\n"
                                               : "#version 330\n";
  if ( i_Type == EVertexShader )
  {
    return Text + "#define attribute in\n#define varying out\n#define texture2D texture\n";
  }
  return Text + "#define varying in\nout vec4 FragColor;\n#define gl_FragColor FragColor\n"
                "#define texture2D texture\n";
}

QByteArray VShader::Compose( const QByteArray& i_rSource, EShaderType i_Type, EShaderForm i_Form,
                             EShaderDialect i_Dialect )
{
  // The language of OpenGL ES 3 has no texture buffers.
  const EShaderDialect Dialect = i_Form == EFormTextureBuffers ? EDialectDesktop330 : i_Dialect;
  QByteArray Text = Prefix( i_Type, Dialect ) + FormLines( i_Type, i_Form ) + "#line 1\n" + i_rSource;
  if ( i_Type == EVertexShader && IsSelection( i_Form ) )
  {
    Text += SelectionLines( i_Form );
  }
  return Text;
}

bool VShader::Reload( const QString& i_rPath, EShaderDialect i_Dialect, bool i_bForce )
{
  if ( !QOpenGLContext::currentContext() )
  {
    return false;
  }
  ZEK::Log( GraphicsLog(), ZEK::ELogDetail, "Loading shader file %1%", i_rPath.toStdString() );
  QByteArray Source;
  QFile File( i_rPath );
  const bool bRead = File.open( QIODevice::ReadOnly );
  if ( bRead )
  {
    Source = File.readAll();
  }
  if ( !i_bForce && i_rPath == m_Path && i_Dialect == m_Dialect && Source == m_Source )
  {
    return false;
  }
  m_Path = i_rPath;
  m_Dialect = i_Dialect;
  m_Source = Source;
  m_bCompiled = false;
  m_pShader.reset();
  if ( bRead )
  {
    Compile();
    return true;
  }
  ZEK::Log( GraphicsLog(), ZEK::ELogFailure, "Shader Failed To Compile<%1%> Log=<%2%>", m_Path.toStdString(),
            File.errorString().toStdString() );
  return true;
}

void VShader::Compile()
{
  m_pShader =
      std::make_unique< QOpenGLShader >( m_Type == EVertexShader ? QOpenGLShader::Vertex : QOpenGLShader::Fragment );
  m_bCompiled = m_pShader->compileSourceCode( Compose( m_Source, m_Type, m_Form, m_Dialect ) );
  if ( !m_bCompiled )
  {
    ZEK::Log( GraphicsLog(), ZEK::ELogFailure, "Shader Failed To Compile<%1%> Log=<%2%>", m_Path.toStdString(),
              m_pShader->log().toStdString() );
  }
}

} // namespace CoreGraphics
