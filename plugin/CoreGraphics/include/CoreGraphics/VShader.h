#pragma once

#include <QtCore/QByteArray>
#include <QtCore/QString>
#include <QtOpenGL/QOpenGLShader>

#include <memory>

namespace CoreGraphics
{

enum EShaderType
{
  EVertexShader,
  EFragmentShader
};

/// How the per-object uniforms of a source (declared with PER_OBJECT) reach it. One source serves all forms.
enum EShaderForm
{
  EFormSingle,             ///< as uniforms: a draw an object
  EFormInstanced,          ///< as attributes: a draw for all objects
  EFormInstancedSelection, ///< as attributes, and the selection colour from `u_FirstId`, instance and flag byte
  EFormPointsSelection,    ///< the same for objects that are one vertex each
  EFormTextureBuffers      ///< as EFormSingle, with TEXTURE_BUFFERS defined; for contexts that have them
};

/// The version lines that a context can compile.
enum EShaderDialect
{
  EDialectES300,     ///< OpenGL ES 3, and desktop contexts that compile its language
  EDialectDesktop330 ///< desktop contexts that do not
};

/// One compiled GLSL source. Thread: render thread with a context current.
class VShader
{
public:
  /// Reads and compiles the file.
  VShader( QString i_Path, EShaderType i_Type, EShaderForm i_Form, EShaderDialect i_Dialect );

  const QString& Path() const { return m_Path; }
  EShaderType Type() const { return m_Type; }
  bool IsCompiled() const { return m_bCompiled; }
  QOpenGLShader* Shader() const { return m_pShader.get(); }

  /// Reads the file anew, and compiles it when path, text or dialect changed or `i_bForce` is set. True when it
  /// was compiled again, with whatever result.
  bool Reload( const QString& i_rPath, EShaderDialect i_Dialect, bool i_bForce );

  /// The lines that are put before every source.
  static QByteArray Prefix( EShaderType i_Type, EShaderDialect i_Dialect );
  /// The whole text that is compiled for a source.
  static QByteArray Compose( const QByteArray& i_rSource, EShaderType i_Type, EShaderForm i_Form,
                             EShaderDialect i_Dialect );

private:
  void Compile();

  QString m_Path;
  EShaderType m_Type;
  EShaderForm m_Form;
  EShaderDialect m_Dialect;
  QByteArray m_Source;
  std::unique_ptr< QOpenGLShader > m_pShader;
  bool m_bCompiled = false;
};

} // namespace CoreGraphics
