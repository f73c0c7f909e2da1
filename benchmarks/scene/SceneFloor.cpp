#include "SceneSetup.h"

#include <QtGui/QMatrix4x4>
#include <QtGui/QOpenGLExtraFunctions>
#include <QtOpenGL/QOpenGLShaderProgram>

#include <cmath>
#include <cstring>

namespace SceneBench
{
namespace
{
const char* const VertexSource = R"(#version 330
layout( location = 0 ) in vec3 a_position;
layout( location = 1 ) in vec4 a_sphere;
uniform mat4 u_vp;
out vec3 v_normal;
void main()
{
  v_normal = a_position;
  gl_Position = u_vp * vec4( a_position * a_sphere.w + a_sphere.xyz, 1.0 );
}
)";
const char* const FragmentSource = R"(#version 330
in vec3 v_normal;
out vec4 Colour;
void main() { Colour = vec4( vec3( 1.0, 0.63, 1.0 ) * ( 0.3 + 0.7 * max( 0.0, normalize( v_normal ).z ) ), 1.0 ); }
)";

/// An octahedron split once: the 32 triangles that a sphere of a few pixels needs.
std::vector< QVector3D > SphereTriangles()
{
  std::vector< QVector3D > Corners;
  for ( const float X : { -1.0F, 1.0F } )
  {
    for ( const float Y : { -1.0F, 1.0F } )
    {
      for ( const float Z : { -1.0F, 1.0F } )
      {
        const QVector3D A( X, 0, 0 ), B( 0, Y, 0 ), C( 0, 0, Z );
        const QVector3D Ab = ( A + B ).normalized(), Bc = ( B + C ).normalized(), Ca = ( C + A ).normalized();
        for ( const QVector3D& rCorner : { A, Ab, Ca, Ab, B, Bc, Ca, Bc, C, Ab, Bc, Ca } )
        {
          Corners.push_back( rCorner );
        }
      }
    }
  }
  return Corners;
}
} // namespace

struct VSphereFloor::VGl
{
  QOpenGLExtraFunctions* pFunctions = QOpenGLContext::currentContext()->extraFunctions();
  QOpenGLShaderProgram Program;
  GLuint VertexArray = 0;
  GLuint Buffers[2] = {};
  GLsizei Corners = 0;
  std::size_t Count = 0;
  std::vector< std::vector< float > > Frames;
};

VSphereFloor::VSphereFloor( std::size_t i_Count )
  : m_pGl( std::make_unique< VGl >() )
{
  VGl& rGl = *m_pGl;
  auto& rF = *rGl.pFunctions;
  rGl.Count = i_Count;
  rGl.Program.addShaderFromSourceCode( QOpenGLShader::Vertex, VertexSource );
  rGl.Program.addShaderFromSourceCode( QOpenGLShader::Fragment, FragmentSource );
  rGl.Program.link();
  const std::vector< QVector3D > Triangles = SphereTriangles();
  rGl.Corners = static_cast< GLsizei >( Triangles.size() );
  rF.glGenVertexArrays( 1, &rGl.VertexArray );
  rF.glBindVertexArray( rGl.VertexArray );
  rF.glGenBuffers( 2, rGl.Buffers );
  rF.glBindBuffer( GL_ARRAY_BUFFER, rGl.Buffers[0] );
  rF.glBufferData( GL_ARRAY_BUFFER, static_cast< GLsizeiptr >( Triangles.size() * sizeof( QVector3D ) ),
                   Triangles.data(), GL_STATIC_DRAW );
  rF.glEnableVertexAttribArray( 0 );
  rF.glVertexAttribPointer( 0, 3, GL_FLOAT, GL_FALSE, 0, nullptr );
  rF.glBindBuffer( GL_ARRAY_BUFFER, rGl.Buffers[1] );
  rF.glEnableVertexAttribArray( 1 );
  rF.glVertexAttribPointer( 1, 4, GL_FLOAT, GL_FALSE, 0, nullptr );
  rF.glVertexAttribDivisor( 1, 1 );
  for ( int Frame = 0; Frame < FrameCount; ++Frame )
  {
    std::vector< float >& rFrame = rGl.Frames.emplace_back();
    for ( std::size_t Index = 0; Index < i_Count; ++Index )
    {
      const MoxelGraphics::VScenePoint Point = PointAt( Index, { i_Count, 0 }, Frame );
      rFrame.insert( rFrame.end(), { Point.X, Point.Y, Point.Z, Point.Radius } );
    }
  }
}

VSphereFloor::~VSphereFloor()
{
  m_pGl->pFunctions->glDeleteBuffers( 2, m_pGl->Buffers );
  m_pGl->pFunctions->glDeleteVertexArrays( 1, &m_pGl->VertexArray );
}

void VSphereFloor::Draw( int i_Frame )
{
  VGl& rGl = *m_pGl;
  auto& rF = *rGl.pFunctions;
  const std::vector< float >& rFrame = rGl.Frames[static_cast< std::size_t >( i_Frame % FrameCount )];
  const auto Bytes = static_cast< GLsizeiptr >( rFrame.size() * sizeof( float ) );
  QMatrix4x4 ViewProjection;
  ViewProjection.perspective( 45.0F, float( Width ) / float( Height ), 1.0F, 100000.0F );
  ViewProjection.translate( 0, 0, -7000 );
  ViewProjection.rotate( -60, 1, 0, 0 );
  ViewProjection.rotate( 45, 0, 0, 1 );
  rF.glViewport( 0, 0, Width, Height );
  rF.glDisable( GL_SCISSOR_TEST );
  rF.glDepthMask( GL_TRUE );
  rF.glEnable( GL_DEPTH_TEST );
  rF.glDisable( GL_BLEND );
  rF.glClearColor( 0.1F, 0.1F, 0.1F, 1.0F );
  rF.glClear( GL_COLOR_BUFFER_BIT | GL_DEPTH_BUFFER_BIT );
  rGl.Program.bind();
  rGl.Program.setUniformValue( "u_vp", ViewProjection );
  rF.glBindVertexArray( rGl.VertexArray );
  rF.glBindBuffer( GL_ARRAY_BUFFER, rGl.Buffers[1] );
  rF.glBufferData( GL_ARRAY_BUFFER, Bytes, nullptr, GL_STREAM_DRAW );
  if ( void* const pMapped = rF.glMapBufferRange( GL_ARRAY_BUFFER, 0, Bytes, GL_MAP_WRITE_BIT ) )
  {
    std::memcpy( pMapped, rFrame.data(), static_cast< std::size_t >( Bytes ) );
    rF.glUnmapBuffer( GL_ARRAY_BUFFER );
  }
  rF.glDrawArraysInstanced( GL_TRIANGLES, 0, rGl.Corners, static_cast< GLsizei >( rGl.Count ) );
  rF.glBindVertexArray( 0 );
}

} // namespace SceneBench
