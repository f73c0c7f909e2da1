#include <CoreGraphics/VRenderContext.h>

#include "GraphicsLog.h"

#include <QtGui/QOpenGLContext>
#include <QtOpenGL/QOpenGLDebugLogger>
#include <QtOpenGL/QOpenGLVertexArrayObject>

#include <algorithm>
#include <array>
#include <atomic>
#include <cstdlib>
#include <mutex>
#include <set>
#include <string_view>
#include <tuple>

namespace CoreGraphics
{
namespace
{
// Names that the headers of OpenGL ES lack.
constexpr GLenum ProgramPointSize = 0x8642;
constexpr GLenum PointSprite = 0x8861;
constexpr GLenum PointSmooth = 0x0B10;
constexpr GLenum PointSizeRange = 0x0B12;
constexpr GLenum DebugOutput = 0x92E0;
constexpr GLenum FramebufferSRGB = 0x8DB9;
constexpr GLenum MaximumTextureAnisotropy = 0x84FF;
constexpr GLenum MaximumTextureBufferSize = 0x8C2B;
constexpr float WantedAnisotropy = 16.0f;
constexpr int FixedArrays = 8;

std::atomic< std::uint64_t > s_Revision{ 0 };

bool WantsErrors()
{
  const char* pSwitch = std::getenv( "HARROW_GL_ERRORS" );
  if ( pSwitch )
  {
    return std::string_view( pSwitch ) == "1";
  }
#ifdef NDEBUG
  return false;
#else
  return true;
#endif
}

bool IsSoftware( std::string_view i_Renderer )
{
  static constexpr std::array< std::string_view, 6 > Names = { "llvmpipe", "softpipe",    "swrast",
                                                               "Software", "SwiftShader", "Basic Render" };
  return std::any_of( Names.begin(), Names.end(),
                      [&]( std::string_view i_Name )
                      {
                        return i_Renderer.find( i_Name ) != std::string_view::npos;
                      } );
}

int LevelOf( const QOpenGLDebugMessage& i_rMessage )
{
  if ( i_rMessage.type() == QOpenGLDebugMessage::ErrorType )
  {
    return ZEK::ELogFailure;
  }
  const auto Severity = i_rMessage.severity();
  const bool bGrave = Severity == QOpenGLDebugMessage::HighSeverity || Severity == QOpenGLDebugMessage::MediumSeverity;
  return bGrave ? ZEK::ELogWarning : ZEK::ELogDetail;
}
} // namespace

VRenderContext::VRenderContext()
{
  Touch();
}

VRenderContext::~VRenderContext() = default;

std::shared_ptr< void >& VRenderContext::Belonging( const void* i_pOwner )
{
  for ( auto& [pOwner, rpHeld] : m_Belongings )
  {
    if ( pOwner == i_pOwner )
    {
      return rpHeld;
    }
  }
  return m_Belongings.emplace_back( i_pOwner, nullptr ).second;
}

QOpenGLContext* VRenderContext::Context() const
{
  return m_pContext;
}

void VRenderContext::Initialise()
{
  QOpenGLContext* pContext = QOpenGLContext::currentContext();
  if ( !pContext )
  {
    return;
  }
  m_pContext = pContext;
  m_pFunctions = pContext->extraFunctions();
  m_pFunctions->initializeOpenGLFunctions();
  m_bReadErrors = WantsErrors();
  m_Pointers.fill( {} );
  m_EnabledArrays = 0;
  m_pVertexArray = std::make_unique< QOpenGLVertexArrayObject >();
  m_pVertexArray->create();
  ReadLimits();
  StartDebugLogger();
  CheckErrors();
  SetClearColour( QColor( 25, 25, 25, 255 ) );
  CheckErrors();
}

void VRenderContext::ReadLimits()
{
  const QSurfaceFormat Format = m_pContext->format();
  m_bES = m_pContext->isOpenGLES();
  const bool bOld = Format.version() < std::pair( 3, 1 );
  m_bCompatibility = !m_bES && ( bOld || Format.profile() == QSurfaceFormat::CompatibilityProfile ||
                                 m_pContext->hasExtension( "GL_ARB_compatibility" ) );
  const auto* pRenderer = reinterpret_cast< const char* >( m_pFunctions->glGetString( GL_RENDERER ) );
  m_bSoftware = pRenderer && IsSoftware( pRenderer );
  std::array< GLfloat, 2 > PointSizes{ 1.0f, 1.0f };
  m_pFunctions->glGetFloatv( m_bES ? GL_ALIASED_POINT_SIZE_RANGE : PointSizeRange, PointSizes.data() );
  m_MaximumPointSize = PointSizes[1];
  m_MaximumBufferTexels = 0;
  if ( !m_bES && Format.version() >= std::pair( 3, 3 ) )
  {
    m_pFunctions->glGetIntegerv( MaximumTextureBufferSize, &m_MaximumBufferTexels );
  }
  m_Anisotropy = 1.0f;
  if ( m_bSoftware )
  {
    ZEK::Log( GraphicsLog(), ZEK::ELogDetail, "Software rasteriser \"%1%\": anisotropic filtering is off", pRenderer );
  }
  else if ( m_pContext->hasExtension( "GL_EXT_texture_filter_anisotropic" ) ||
            ( !m_bES && Format.version() >= std::pair( 4, 6 ) ) )
  {
    GLfloat Maximum = 1.0f;
    m_pFunctions->glGetFloatv( MaximumTextureAnisotropy, &Maximum );
    m_Anisotropy = std::clamp( Maximum, 1.0f, WantedAnisotropy );
  }
}

void VRenderContext::StartDebugLogger()
{
  m_pLogger.reset();
  if ( !m_pContext->format().testOption( QSurfaceFormat::DebugContext ) )
  {
    return;
  }
  ZEK::Log( GraphicsLog(), ZEK::ELogDetail, "Debug OpenGL context requested" );
  if ( !m_pContext->hasExtension( "GL_KHR_debug" ) )
  {
    ZEK::Log( GraphicsLog(), ZEK::ELogWarning, "GL_KHR_debug not available" );
    return;
  }
  ZEK::Log( GraphicsLog(), ZEK::ELogDetail, "Initialising debug logger" );
  m_pLogger = std::make_unique< QOpenGLDebugLogger >();
  m_pLogger->initialize();
  m_pFunctions->glEnable( DebugOutput );
}

void VRenderContext::CheckErrors( const char* i_pFile, int i_Line )
{
  if ( m_pLogger )
  {
    WriteDebugMessages();
  }
  if ( m_bReadErrors && m_pFunctions )
  {
    WriteErrors( i_pFile, i_Line );
  }
}

void VRenderContext::WriteDebugMessages()
{
  for ( const QOpenGLDebugMessage& rMessage : m_pLogger->loggedMessages() )
  {
    const int Level = LevelOf( rMessage );
    if ( GraphicsLog().IsOn( Level ) )
    {
      ZEK::GlobalLog().Write( GraphicsLog(), Level, rMessage.message().toStdString() );
    }
  }
}

void VRenderContext::WriteErrors( const char* i_pFile, int i_Line )
{
  constexpr int MostErrors = 16; // a lost context reports errors for ever
  static std::mutex Guard;       // views may be drawn by threads of their own
  static std::set< std::tuple< std::string_view, int, GLenum > > Written;
  const std::string_view Path = i_pFile;
  const std::string_view File = Path.substr( Path.find_last_of( '/' ) + 1 );
  for ( int Count = 0; Count < MostErrors; ++Count )
  {
    const GLenum Code = m_pFunctions->glGetError();
    if ( Code == GL_NO_ERROR )
    {
      return;
    }
    const std::lock_guard Lock( Guard );
    if ( Written.emplace( File, i_Line, Code ).second )
    {
      ZEK::Log( GraphicsLog(), ZEK::ELogFailure, "OpenGL error 0x%1$04x at %2%:%3%", Code, File, i_Line );
    }
  }
}

void VRenderContext::Touch()
{
  m_Revision = s_Revision.fetch_add( 1, std::memory_order_relaxed ) + 1;
}

void VRenderContext::BindVertexArray()
{
  if ( m_pVertexArray && m_pVertexArray->isCreated() )
  {
    m_pVertexArray->bind();
  }
}

void VRenderContext::ReleaseVertexArray()
{
  if ( IsInitialised() && m_pVertexArray->isCreated() )
  {
    m_pVertexArray->release();
  }
}

void VRenderContext::ResetState()
{
  if ( !IsInitialised() )
  {
    return;
  }
  CheckErrors();
  BindVertexArray();
  m_EnabledArrays |= ( 1u << FixedArrays ) - 1;
  SetEnabledArrays( 0 );
  // A mesh without colours is white.
  m_pFunctions->glVertexAttrib4f( EAttributeColour, 1.0f, 1.0f, 1.0f, 1.0f );
  m_pFunctions->glBindBuffer( GL_ARRAY_BUFFER, 0 );
  m_pFunctions->glBindBuffer( GL_ELEMENT_ARRAY_BUFFER, 0 );
  m_pFunctions->glUseProgram( 0 );
  ResetFixedFunction();
  m_pFunctions->glActiveTexture( GL_TEXTURE0 );
  m_pFunctions->glBindTexture( GL_TEXTURE_2D, 0 );
  m_ActiveUnit = 0;
  m_pProgram.reset();
  m_BoundLink = 0;
  CheckErrors();
}

// Also what others may have left on and render types never turn on.
void VRenderContext::ResetFixedFunction()
{
  for ( const GLenum Capability :
        { GL_CULL_FACE, GL_BLEND, GL_DEPTH_TEST, GL_SCISSOR_TEST, GL_STENCIL_TEST, GL_DITHER } )
  {
    m_pFunctions->glDisable( Capability );
  }
  m_pFunctions->glColorMask( GL_TRUE, GL_TRUE, GL_TRUE, GL_TRUE );
  m_pFunctions->glDepthMask( GL_TRUE );
  m_pFunctions->glCullFace( GL_BACK );
  m_pFunctions->glPixelStorei( GL_PACK_ALIGNMENT, 4 );
  m_Applied = VApplied{};
  m_bLastStateKnown = false;
  if ( m_bES )
  {
    return;
  }
  m_pFunctions->glDisable( FramebufferSRGB );
  m_pFunctions->glEnable( ProgramPointSize );
  if ( m_bCompatibility )
  {
    m_pFunctions->glEnable( PointSprite );
    if ( m_pContext->format().majorVersion() < 3 )
    {
      m_pFunctions->glDisable( PointSmooth );
    }
  }
}

void VRenderContext::ResetCounters()
{
  m_DrawCalls = 0;
  m_UploadedAtReset = VVertexBuffer::TotalBytesUploaded();
}

} // namespace CoreGraphics
