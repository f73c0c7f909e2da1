#include "PickFloor.h"

#include <QtGui/QOpenGLContext>
#include <QtGui/QOpenGLExtraFunctions>
#include <QtOpenGL/QOpenGLShaderProgram>

#include <cstring>

namespace PickBench
{
namespace
{
const char* const VertexSource = R"(#version 330
layout( location = 0 ) in vec4 a_sphere;
layout( location = 1 ) in uint a_id;
uniform mat4 u_vp;
uniform vec3 u_right;
uniform vec3 u_up;
out vec2 v_place;
flat out vec4 v_id;
void main()
{
  vec2 corner = vec2( gl_VertexID & 1, gl_VertexID >> 1 ) * 2.0 - 1.0;
  v_place = corner;
  v_id = vec4( float( a_id & 255u ), float( ( a_id >> 8 ) & 255u ), float( ( a_id >> 16 ) & 255u ), 255.0 ) / 255.0;
  gl_Position = u_vp * vec4( a_sphere.xyz + a_sphere.w * ( corner.x * u_right + corner.y * u_up ), 1.0 );
}
)";
const char* const FragmentSource = R"(#version 330
in vec2 v_place;
flat in vec4 v_id;
uniform bool u_pick;
out vec4 Colour;
void main()
{
  float depth = 1.0 - dot( v_place, v_place );
  if ( depth < 0.0 ) discard;
  Colour = u_pick ? v_id : vec4( vec3( 1.0, 0.63, 1.0 ) * ( 0.3 + 0.7 * sqrt( depth ) ), 1.0 );
}
)";

struct VInstance
{
  float X, Y, Z, Radius;
  std::uint32_t Id;
};
constexpr int MaximumLayers = 16;
} // namespace

struct VPickFloor::VGl
{
  QOpenGLExtraFunctions& rF = *QOpenGLContext::currentContext()->extraFunctions();
  QOpenGLShaderProgram Program;
  int PickLocation = -1;
  GLuint VertexArray = 0;
  GLuint Buffer = 0;
  QMatrix4x4 ViewProjection;
  std::vector< std::vector< VInstance > > Frames;
  const std::vector< VInstance >* pFrame = nullptr;
  std::vector< VInstance > Left;
  std::vector< std::uint8_t > IsFound;
  std::vector< std::uint32_t > Found;
  std::vector< std::uint32_t > Pixels;

  void Write( const std::vector< VInstance >& i_rInstances )
  {
    const auto Bytes = static_cast< GLsizeiptr >( i_rInstances.size() * sizeof( VInstance ) );
    rF.glBindBuffer( GL_ARRAY_BUFFER, Buffer );
    if ( void* const pMapped =
             rF.glMapBufferRange( GL_ARRAY_BUFFER, 0, Bytes, GL_MAP_WRITE_BIT | GL_MAP_INVALIDATE_BUFFER_BIT ) )
    {
      std::memcpy( pMapped, i_rInstances.data(), static_cast< std::size_t >( Bytes ) );
      rF.glUnmapBuffer( GL_ARRAY_BUFFER );
    }
  }
};

VPickFloor::VPickFloor( const SceneBench::VPopulation& i_rPopulation, const QMatrix4x4& i_rView,
                        const QMatrix4x4& i_rProjection )
  : m_pGl( std::make_unique< VGl >() )
{
  VGl& rGl = *m_pGl;
  rGl.ViewProjection = i_rProjection * i_rView;
  for ( int Frame = 0; Frame < SceneBench::FrameCount; ++Frame )
  {
    std::vector< VInstance >& rFrame = rGl.Frames.emplace_back();
    for ( std::size_t Index = 0; Index < i_rPopulation.Count(); ++Index )
    {
      const MoxelGraphics::VScenePoint Point = SceneBench::PointAt( Index, i_rPopulation, Frame );
      rFrame.push_back( { Point.X, Point.Y, Point.Z, Point.Radius, static_cast< std::uint32_t >( Index + 1 ) } );
    }
  }
  rGl.IsFound.resize( i_rPopulation.Count() + 1 );
  rGl.Program.addShaderFromSourceCode( QOpenGLShader::Vertex, VertexSource );
  rGl.Program.addShaderFromSourceCode( QOpenGLShader::Fragment, FragmentSource );
  rGl.Program.link();
  rGl.Program.bind();
  rGl.Program.setUniformValue( "u_vp", rGl.ViewProjection );
  rGl.Program.setUniformValue( "u_right", i_rView.row( 0 ).toVector3D() );
  rGl.Program.setUniformValue( "u_up", i_rView.row( 1 ).toVector3D() );
  rGl.PickLocation = rGl.Program.uniformLocation( "u_pick" );
  rGl.rF.glGenVertexArrays( 1, &rGl.VertexArray );
  rGl.rF.glBindVertexArray( rGl.VertexArray );
  rGl.rF.glGenBuffers( 1, &rGl.Buffer );
  rGl.rF.glBindBuffer( GL_ARRAY_BUFFER, rGl.Buffer );
  rGl.rF.glBufferData( GL_ARRAY_BUFFER, static_cast< GLsizeiptr >( i_rPopulation.Count() * sizeof( VInstance ) ),
                       nullptr, GL_STREAM_DRAW );
  rGl.rF.glEnableVertexAttribArray( 0 );
  rGl.rF.glVertexAttribPointer( 0, 4, GL_FLOAT, GL_FALSE, sizeof( VInstance ), nullptr );
  rGl.rF.glVertexAttribDivisor( 0, 1 );
  rGl.rF.glEnableVertexAttribArray( 1 );
  rGl.rF.glVertexAttribIPointer( 1, 1, GL_UNSIGNED_INT, sizeof( VInstance ),
                                 reinterpret_cast< const void* >( offsetof( VInstance, Id ) ) );
  rGl.rF.glVertexAttribDivisor( 1, 1 );
  rGl.rF.glBindVertexArray( 0 );
}

VPickFloor::~VPickFloor()
{
  m_pGl->rF.glDeleteBuffers( 1, &m_pGl->Buffer );
  m_pGl->rF.glDeleteVertexArrays( 1, &m_pGl->VertexArray );
}

void VPickFloor::Submit( bool i_bPick, std::size_t i_Count )
{
  auto& rF = m_pGl->rF;
  const float Background = i_bPick ? 0.0F : 0.125F;
  rF.glClearColor( Background, Background, Background, i_bPick ? 0.0F : 1.0F );
  rF.glClear( GL_COLOR_BUFFER_BIT | GL_DEPTH_BUFFER_BIT );
  m_pGl->Program.bind();
  m_pGl->Program.setUniformValue( m_pGl->PickLocation, i_bPick );
  rF.glBindVertexArray( m_pGl->VertexArray );
  rF.glDrawArraysInstanced( GL_TRIANGLE_STRIP, 0, 4, static_cast< GLsizei >( i_Count ) );
  rF.glBindVertexArray( 0 );
}

void VPickFloor::Draw( int i_Frame )
{
  auto& rF = m_pGl->rF;
  m_pGl->pFrame = &m_pGl->Frames[static_cast< std::size_t >( i_Frame % SceneBench::FrameCount )];
  rF.glViewport( 0, 0, SceneBench::Width, SceneBench::Height );
  rF.glDisable( GL_SCISSOR_TEST );
  rF.glDisable( GL_BLEND );
  rF.glDisable( GL_CULL_FACE );
  rF.glEnable( GL_DEPTH_TEST );
  rF.glDepthMask( GL_TRUE );
  m_pGl->Write( *m_pGl->pFrame );
  Submit( false, m_pGl->pFrame->size() );
}

std::uint32_t VPickFloor::Point( int i_X, int i_Y )
{
  auto& rF = m_pGl->rF;
  rF.glScissor( i_X - 5, i_Y - 5, 11, 11 );
  rF.glEnable( GL_SCISSOR_TEST );
  Submit( true, m_pGl->pFrame->size() );
  std::uint32_t Window[121];
  rF.glReadPixels( i_X - 5, i_Y - 5, 11, 11, GL_RGBA, GL_UNSIGNED_BYTE, Window );
  rF.glDisable( GL_SCISSOR_TEST );
  std::uint32_t Best = 0;
  float Nearest = 1e30F;
  for ( int Pixel = 0; Pixel < 121; ++Pixel )
  {
    const std::uint32_t Id = Window[Pixel] & 0xFFFFFF;
    const float X = static_cast< float >( Pixel % 11 ) - 5.5F, Y = static_cast< float >( Pixel / 11 ) - 5.5F;
    if ( Id != 0 && X * X + Y * Y < Nearest )
    {
      Nearest = X * X + Y * Y;
      Best = Id;
    }
  }
  return Best;
}

std::size_t VPickFloor::WriteUnfound()
{
  m_pGl->Left.clear();
  for ( const VInstance& rInstance : *m_pGl->pFrame )
  {
    if ( m_pGl->IsFound[rInstance.Id] == 0 )
    {
      m_pGl->Left.push_back( rInstance );
    }
  }
  if ( !m_pGl->Left.empty() )
  {
    m_pGl->Write( m_pGl->Left );
  }
  return m_pGl->Left.size();
}

void VPickFloor::Find( std::uint32_t i_Id )
{
  if ( m_pGl->IsFound[i_Id] == 0 )
  {
    m_pGl->IsFound[i_Id] = 1;
    m_pGl->Found.push_back( i_Id );
  }
}

void VPickFloor::FindCentres( float i_Left, float i_Bottom, float i_Right, float i_Top )
{
  const float* const pM = m_pGl->ViewProjection.constData();
  for ( const VInstance& rS : *m_pGl->pFrame )
  {
    const float X = pM[0] * rS.X + pM[4] * rS.Y + pM[8] * rS.Z + pM[12];
    const float Y = pM[1] * rS.X + pM[5] * rS.Y + pM[9] * rS.Z + pM[13];
    const float W = pM[3] * rS.X + pM[7] * rS.Y + pM[11] * rS.Z + pM[15];
    if ( W > 0 && X >= i_Left * W && X <= i_Right * W && Y >= i_Bottom * W && Y <= i_Top * W )
    {
      Find( rS.Id );
    }
  }
}

const std::vector< std::uint32_t >& VPickFloor::Band( int i_Left, int i_Bottom, int i_Right, int i_Top )
{
  auto& rF = m_pGl->rF;
  const int Width = ( i_Right - i_Left ) / 2;
  const int Height = ( i_Top - i_Bottom ) / 2;
  m_pGl->Pixels.resize( static_cast< std::size_t >( Width ) * static_cast< std::size_t >( Height ) );
  std::fill( m_pGl->IsFound.begin(), m_pGl->IsFound.end(), std::uint8_t( 0 ) );
  m_pGl->Found.clear();
  rF.glViewport( 0, 0, SceneBench::Width / 2, SceneBench::Height / 2 );
  rF.glScissor( i_Left / 2, i_Bottom / 2, Width, Height );
  rF.glEnable( GL_SCISSOR_TEST );
  for ( int Layer = 0; Layer < MaximumLayers; ++Layer )
  {
    const std::size_t Before = m_pGl->Found.size();
    Submit( true, WriteUnfound() );
    rF.glReadPixels( i_Left / 2, i_Bottom / 2, Width, Height, GL_RGBA, GL_UNSIGNED_BYTE, m_pGl->Pixels.data() );
    for ( const std::uint32_t Pixel : m_pGl->Pixels )
    {
      if ( const std::uint32_t Id = Pixel & 0xFFFFFF; Id != 0 )
      {
        Find( Id );
      }
    }
    if ( m_pGl->Found.size() == Before )
    {
      break;
    }
  }
  rF.glDisable( GL_SCISSOR_TEST );
  rF.glViewport( 0, 0, SceneBench::Width, SceneBench::Height );
  const auto Place = []( int i_Pixel, int i_Extent )
  {
    return 2.0F * static_cast< float >( i_Pixel ) / static_cast< float >( i_Extent ) - 1.0F;
  };
  FindCentres( Place( i_Left, SceneBench::Width ), Place( i_Bottom, SceneBench::Height ),
               Place( i_Right, SceneBench::Width ), Place( i_Top, SceneBench::Height ) );
  return m_pGl->Found;
}

} // namespace PickBench
