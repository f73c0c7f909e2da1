#include <CoreGraphics/VRenderContext.h>

#include <QtGui/QOpenGLContext>
#include <QtOpenGL/QOpenGLDebugLogger>
#include <QtOpenGL/QOpenGLFramebufferObject>
#include <QtOpenGL/QOpenGLVertexArrayObject>

#include <array>

// The part of the context that sets OpenGL state and per-frame values.

namespace CoreGraphics
{
namespace
{
struct VFactors
{
  GLenum Source;
  GLenum Target;
};

VFactors ColourFactors( int i_Blend )
{
  switch ( i_Blend )
  {
  case EColourBlendAlpha:
    return { GL_SRC_ALPHA, GL_ONE_MINUS_SRC_ALPHA };
  case EColourBlendAdd:
    return { GL_SRC_ALPHA, GL_ONE };
  case EColourBlendConstant:
    return { GL_CONSTANT_ALPHA, GL_ONE };
  case EColourBlendPremultiplied:
    return { GL_ONE, GL_ONE_MINUS_SRC_ALPHA };
  default:
    return { GL_ONE, GL_ZERO };
  }
}

VFactors AlphaFactors( int i_Blend )
{
  switch ( i_Blend )
  {
  case EAlphaBlendKeep:
    return { GL_ZERO, GL_ONE };
  case EAlphaBlendAdd:
    return { GL_ONE, GL_ONE };
  default:
    return { GL_ONE, GL_ZERO };
  }
}

GLenum DepthFunction( int i_Function )
{
  static constexpr std::array< GLenum, 6 > Functions = { GL_LESS,   GL_LEQUAL,   GL_GREATER,
                                                         GL_GEQUAL, GL_NOTEQUAL, GL_EQUAL };
  return i_Function >= 0 && i_Function < int( Functions.size() ) ? Functions[std::size_t( i_Function )] : GL_LESS;
}

GLenum MinFilter( int i_Filter )
{
  static constexpr std::array< GLenum, 4 > Filters = { GL_NEAREST_MIPMAP_NEAREST, GL_LINEAR_MIPMAP_NEAREST,
                                                       GL_LINEAR_MIPMAP_LINEAR, GL_NEAREST };
  return i_Filter >= 0 && i_Filter < int( Filters.size() ) ? Filters[std::size_t( i_Filter )] : GL_NEAREST;
}

QVector2D ToVector( const QSize& i_rSize )
{
  return { float( i_rSize.width() ), float( i_rSize.height() ) };
}
} // namespace

void VRenderContext::Toggle( GLenum i_Capability, bool i_bOn, bool& io_rbState )
{
  if ( io_rbState != i_bOn )
  {
    io_rbState = i_bOn;
    i_bOn ? m_pFunctions->glEnable( i_Capability ) : m_pFunctions->glDisable( i_Capability );
  }
}

void VRenderContext::SetDepthWrite( bool i_bOn )
{
  if ( m_Applied.bDepthWrite != i_bOn )
  {
    m_Applied.bDepthWrite = i_bOn;
    m_pFunctions->glDepthMask( i_bOn ? GL_TRUE : GL_FALSE );
  }
}

void VRenderContext::SetColourWrite( bool i_bOn )
{
  if ( m_Applied.bColourWrite != i_bOn )
  {
    m_Applied.bColourWrite = i_bOn;
    const GLboolean Mask = i_bOn ? GL_TRUE : GL_FALSE;
    m_pFunctions->glColorMask( Mask, Mask, Mask, Mask );
  }
}

void VRenderContext::ApplyBlend( const VRenderState& i_rState )
{
  // An id that is blended is another id.
  const bool bBlend = m_RenderMode == ERenderModeNormal && ( i_rState.colourBlend != 0 || i_rState.alphaBlend != 0 );
  Toggle( GL_BLEND, bBlend, m_Applied.bBlend );
  if ( !bBlend )
  {
    return;
  }
  if ( m_Applied.ColourBlend != i_rState.colourBlend || m_Applied.AlphaBlend != i_rState.alphaBlend )
  {
    m_Applied.ColourBlend = i_rState.colourBlend;
    m_Applied.AlphaBlend = i_rState.alphaBlend;
    const VFactors Colour = ColourFactors( i_rState.colourBlend );
    const VFactors Alpha = AlphaFactors( i_rState.alphaBlend );
    m_pFunctions->glBlendFuncSeparate( Colour.Source, Colour.Target, Alpha.Source, Alpha.Target );
  }
  const float Constant = i_rState.blendConstant;
  if ( i_rState.colourBlend == EColourBlendConstant && m_Applied.BlendConstant != Constant )
  {
    m_Applied.BlendConstant = Constant;
    m_pFunctions->glBlendColor( Constant, Constant, Constant, Constant );
  }
}

void VRenderContext::SetRenderState( const VRenderState& i_rState )
{
  if ( !m_pFunctions || ( m_bLastStateKnown && m_LastState == i_rState ) )
  {
    return;
  }
  m_LastState = i_rState;
  m_bLastStateKnown = true;
  ApplyBlend( i_rState );
  const bool bCull = i_rState.cullMode == ECullFront || i_rState.cullMode == ECullBack;
  Toggle( GL_CULL_FACE, bCull, m_Applied.bCull );
  if ( bCull && m_Applied.CullMode != i_rState.cullMode )
  {
    m_Applied.CullMode = i_rState.cullMode;
    m_pFunctions->glCullFace( i_rState.cullMode == ECullFront ? GL_FRONT : GL_BACK );
  }
  Toggle( GL_DEPTH_TEST, i_rState.depthTest, m_Applied.bDepthTest );
  if ( m_Applied.DepthFunction != i_rState.depthFunction )
  {
    m_Applied.DepthFunction = i_rState.depthFunction;
    m_pFunctions->glDepthFunc( DepthFunction( i_rState.depthFunction ) );
  }
  SetDepthWrite( i_rState.depthWrite );
  SetColourWrite( i_rState.colourWrite || m_RenderMode != ERenderModeNormal );
}

bool VRenderContext::UseProgram( const std::shared_ptr< VShaderProgram >& i_rpProgram )
{
  if ( !m_pFunctions || !i_rpProgram || !i_rpProgram->IsUsable() )
  {
    return false;
  }
  if ( m_BoundLink != i_rpProgram->LinkSerial() )
  {
    m_pFunctions->glUseProgram( i_rpProgram->Id() );
    m_BoundLink = i_rpProgram->LinkSerial();
  }
  if ( m_pProgram != i_rpProgram )
  {
    m_pProgram = i_rpProgram;
  }
  if ( i_rpProgram->m_SeenRevision != m_Revision )
  {
    i_rpProgram->m_SeenRevision = m_Revision;
    SendFixedUniforms( *i_rpProgram );
  }
  CheckErrors();
  return true;
}

void VRenderContext::SendFixedUniforms( VShaderProgram& io_rProgram )
{
  const auto Send = [&]( EFixedUniform i_Uniform, const auto& i_rValue )
  {
    io_rProgram.SetUniform( io_rProgram.FixedLocation( i_Uniform ), i_rValue );
  };
  Send( EUniformViewProjection, ViewProjection() );
  Send( EUniformView, m_View );
  Send( EUniformProjection, m_Projection );
  Send( EUniformView2D, m_View2D );
  Send( EUniformViewportSize, ToVector( m_Viewport.size() ) );
  Send( EUniformViewportOffset, QVector2D( float( m_Viewport.left() ), float( m_Viewport.top() ) ) );
  Send( EUniformFrameSize, ToVector( m_FrameSize ) );
  Send( EUniformLightVector, m_LightVector );
  Send( EUniformUp, m_UpVector );
  Send( EUniformGlobalTime, m_GlobalTime );
  Send( EUniformCameraPosition, CameraPosition() );
}

void VRenderContext::ActiveUnit( int i_Unit )
{
  if ( m_ActiveUnit != i_Unit )
  {
    m_ActiveUnit = i_Unit;
    m_pFunctions->glActiveTexture( GL_TEXTURE0 + GLenum( i_Unit ) );
  }
}

void VRenderContext::BindTexture( int i_Unit, GLuint i_Texture )
{
  ActiveUnit( i_Unit );
  m_pFunctions->glBindTexture( GL_TEXTURE_2D, i_Texture );
}

void VRenderContext::BindBufferTexture( int i_Unit, GLuint i_Texture )
{
  constexpr GLenum TextureBuffer = 0x8C2A; // a name that the headers of OpenGL ES lack
  ActiveUnit( i_Unit );
  m_pFunctions->glBindTexture( TextureBuffer, i_Texture );
}

void VRenderContext::BindFramebufferTexture( int i_Unit, const QOpenGLFramebufferObject* i_pFramebuffer )
{
  BindTexture( i_Unit, i_pFramebuffer ? i_pFramebuffer->texture() : 0 );
  if ( i_pFramebuffer )
  {
    const GLint Filter = m_RenderMode == ERenderModeNormal ? GL_LINEAR : GL_NEAREST;
    m_pFunctions->glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER, Filter );
    m_pFunctions->glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER, Filter );
  }
}

void VRenderContext::SetTextureSampling( const VTextureSampling& i_rSampling )
{
  const auto Set = [this]( GLenum i_Name, GLenum i_Value )
  {
    m_pFunctions->glTexParameteri( GL_TEXTURE_2D, i_Name, GLint( i_Value ) );
  };
  Set( GL_TEXTURE_MIN_FILTER, MinFilter( i_rSampling.minFilter ) );
  Set( GL_TEXTURE_MAG_FILTER, i_rSampling.magnifyLinear ? GL_LINEAR : GL_NEAREST );
  Set( GL_TEXTURE_WRAP_S, i_rSampling.clampS ? GL_CLAMP_TO_EDGE : GL_REPEAT );
  Set( GL_TEXTURE_WRAP_T, i_rSampling.clampT ? GL_CLAMP_TO_EDGE : GL_REPEAT );
}

void VRenderContext::BindFramebuffer( QOpenGLFramebufferObject* i_pFramebuffer )
{
  if ( !i_pFramebuffer )
  {
    BindDefaultFramebuffer();
    return;
  }
  i_pFramebuffer->bind();
  m_pFramebuffer = i_pFramebuffer;
}

void VRenderContext::BindDefaultFramebuffer()
{
  m_pFunctions->glBindFramebuffer( GL_FRAMEBUFFER, m_DefaultFramebuffer );
  m_pFramebuffer = nullptr;
}

bool VRenderContext::IsFramebufferComplete()
{
  return m_pFunctions->glCheckFramebufferStatus( GL_FRAMEBUFFER ) == GL_FRAMEBUFFER_COMPLETE;
}

void VRenderContext::SetClearColour( const QColor& i_rColour )
{
  m_pFunctions->glClearColor( i_rColour.redF(), i_rColour.greenF(), i_rColour.blueF(), i_rColour.alphaF() );
}

void VRenderContext::Clear( bool i_bColour, bool i_bDepth )
{
  m_bLastStateKnown = false;
  SetDepthWrite( true );
  SetColourWrite( true );
  const GLbitfield Parts = ( i_bColour ? GL_COLOR_BUFFER_BIT : 0u ) | ( i_bDepth ? GL_DEPTH_BUFFER_BIT : 0u );
  if ( Parts != 0 )
  {
    m_pFunctions->glClear( Parts );
  }
}

void VRenderContext::SetViewport( const QRect& i_rViewport )
{
  Change( m_Viewport, i_rViewport );
  if ( m_pFunctions )
  {
    m_pFunctions->glViewport( i_rViewport.x(), i_rViewport.y(), i_rViewport.width(), i_rViewport.height() );
  }
}

void VRenderContext::SetScissor( const QRect& i_rScissor )
{
  m_Scissor = i_rScissor;
  if ( m_pFunctions )
  {
    Toggle( GL_SCISSOR_TEST, true, m_Applied.bScissor );
    m_pFunctions->glScissor( i_rScissor.x(), i_rScissor.y(), std::max( i_rScissor.width(), 0 ),
                             std::max( i_rScissor.height(), 0 ) );
  }
}

void VRenderContext::ReadPixels( const QRect& i_rRect, void* o_pBuffer, GLenum i_Format )
{
  m_pFunctions->glReadPixels( i_rRect.x(), i_rRect.y(), i_rRect.width(), i_rRect.height(), i_Format, GL_UNSIGNED_BYTE,
                              o_pBuffer );
}

void VRenderContext::SetProjection( const QMatrix4x4& i_rProjection )
{
  if ( m_Projection != i_rProjection )
  {
    m_Projection = i_rProjection;
    m_bMatricesDirty = true;
    Touch();
  }
}

void VRenderContext::SetView( const QMatrix4x4& i_rView )
{
  if ( m_View != i_rView )
  {
    m_View = i_rView;
    m_bMatricesDirty = true;
    Touch();
  }
}

const QMatrix4x4& VRenderContext::ViewProjection()
{
  if ( m_bMatricesDirty )
  {
    m_ViewProjection = m_Projection * m_View;
    m_CameraPosition = m_View.inverted().column( 3 ).toVector3D();
    m_bMatricesDirty = false;
  }
  return m_ViewProjection;
}

const QVector3D& VRenderContext::CameraPosition()
{
  ViewProjection();
  return m_CameraPosition;
}

void VRenderContext::SetYUp( bool i_bYUp )
{
  m_bYUp = i_bYUp;
  Change( m_UpVector, i_bYUp ? QVector3D( 0, 1, 0 ) : QVector3D( 0, 0, 1 ) );
}

void VRenderContext::SetRenderMode( int i_Mode )
{
  m_RenderMode = i_Mode;
  m_bLastStateKnown = false;
}

} // namespace CoreGraphics
