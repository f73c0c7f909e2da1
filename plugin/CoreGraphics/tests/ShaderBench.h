#pragma once

#include "TestContext.h"

#include <map>
#include <span>
#include <utility>

namespace CoreGraphicsTests
{

/// Runs one source of the catalogue alone: a vertex shader on one vertex, with its outputs captured, or a fragment
/// shader on a small float target, with its inputs given by name. What is not given is 0.
class VShaderBench
{
public:
  using VValues = std::map< std::string, std::vector< float > >;
  using VImage = std::vector< QVector4D >;
  static constexpr int Side = 16;
  /// What stands in a pixel that no fragment wrote.
  static constexpr float Untouched = -7.0f;

  explicit VShaderBench( EContextKind i_Kind );
  ~VShaderBench();

  /// The outputs by name, "gl_Position" and "gl_PointSize" among them. Uniforms and attributes are given by name; in
  /// an instanced form the per-object uniforms are attributes.
  VValues Vertex( const std::string& i_rName, const VValues& i_rValues,
                  CoreGraphics::EShaderForm i_Form = CoreGraphics::EFormSingle );
  /// The picture, bottom row first, of a rectangle over all of it, or of a point of that size at its middle.
  VImage Fragment( const std::string& i_rName, const VValues& i_rValues, float i_PointSize = 0 );
  /// The same, of one pixel.
  QVector4D Pixel( const std::string& i_rName, const VValues& i_rValues, int i_X = Side / 2, int i_Y = Side / 2 );

  /// Bytes, or floats, of one or four channels. To be used by its number as the value of a sampler; stays until the
  /// end.
  float Texture( int i_Width, int i_Height, std::span< const std::uint8_t > i_Texels, bool i_bLinear = false );
  float Texture( int i_Width, int i_Height, std::span< const float > i_Texels );

private:
  GLuint Link( const QByteArray& i_rVertex, const QByteArray& i_rFragment, std::span< const std::string > i_Outputs );
  void SetValues( GLuint i_Program, const VValues& i_rValues );
  void SetUniform( int i_Location, GLenum i_Type, int i_Size, const std::vector< float >& i_rValue );
  void SetAttribute( GLuint i_Program, const std::string& i_rName, const std::vector< float >& i_rValue );
  float AddTexture( int i_Width, int i_Height, GLint i_Internal, GLenum i_Format, GLenum i_Type, const void* i_pTexels,
                    GLint i_Filter );

  VTestContext m_Context;
  QOpenGLExtraFunctions& m_rGl;
  std::map< std::string, GLuint > m_Programs;
  std::vector< GLuint > m_Textures;
  GLuint m_Target = 0;
  GLuint m_VertexArray = 0;
  GLuint m_Framebuffer = 0;
  GLuint m_Corners = 0;
  GLuint m_Vertex = 0;
  GLuint m_Captured = 0;
};

/// The first, with what the second has beside it or else instead.
VShaderBench::VValues With( VShaderBench::VValues i_Values, const VShaderBench::VValues& i_rMore );
/// The elements of vectors and matrices in a row.
std::vector< float > Floats( const QMatrix4x4& i_rMatrix );
std::vector< float > Floats( const QVector3D& i_rVector, float i_W );
std::vector< float > Floats( const QVector3D& i_rVector );
QVector4D Vec4( const std::vector< float >& i_rValue );
QVector3D Vec3( const std::vector< float >& i_rValue );

} // namespace CoreGraphicsTests
