#pragma once

#include <CoreGraphics/VMesh.h>
#include <CoreGraphics/VRenderState.h>
#include <CoreGraphics/VShaderProgram.h>
#include <CoreGraphics/VVertexLayout.h>

#include <QtCore/QPointer>
#include <QtCore/QRect>
#include <QtCore/QSize>
#include <QtGui/QColor>
#include <QtGui/QMatrix4x4>
#include <QtGui/QOpenGLExtraFunctions>

#include <array>
#include <cstdint>
#include <memory>
#include <span>
#include <utility>
#include <vector>

class QOpenGLDebugLogger;
class QOpenGLFramebufferObject;
class QOpenGLVertexArrayObject;

namespace CoreGraphics
{

/// Wraps the OpenGL calls of one view, keeps its per-frame values and hands them to every program. One per
/// renderer. Render types never set OpenGL state past it: it remembers what is set and skips what is set already.
/// Thread: render thread with the view's context current, destructor included.
class VRenderContext
{
public:
  VRenderContext();
  ~VRenderContext();
  VRenderContext( const VRenderContext& ) = delete;
  VRenderContext& operator=( const VRenderContext& ) = delete;

  bool IsInitialised() const { return m_pFunctions && m_pContext; }
  /// Takes the current context. With none current it stays uninitialised.
  void Initialise();
  /// Puts OpenGL into the state that render types start from; called at the start and end of a frame, and whenever
  /// somebody else drew. Binds the vertex array object.
  void ResetState();
  /// Lets go of the vertex array object: before a painter works on the frame, and at its end.
  void ReleaseVertexArray();
  /// Writes the messages of the debug logger to the log; in debug builds, or with HARROW_GL_ERRORS set to 1, also
  /// the pending OpenGL errors, once for each place and code.
  void CheckErrors( const char* i_pFile = __builtin_FILE(), int i_Line = __builtin_LINE() );

  /// The functions of the context; null before `Initialise`.
  QOpenGLExtraFunctions* Functions() const { return m_pFunctions; }
  QOpenGLContext* Context() const;
  bool HasDebugLogger() const { return m_pLogger != nullptr; }

  void SetRenderState( const VRenderState& i_rState );
  /// False when the program is empty or not usable; nothing may be drawn then. Fixed uniforms are sent only when
  /// they changed since this program was last in use.
  bool UseProgram( const std::shared_ptr< VShaderProgram >& i_rpProgram );
  /// The program in use, or null.
  const std::shared_ptr< VShaderProgram >& Program() const { return m_pProgram; }

  /// Both follow `UseProgram`: they feed the attributes of the program in use, and turn all others off. False when
  /// a buffer has no contents, or more than 8 attributes are asked for: nothing may be drawn then.
  bool SetVertexBuffer( const VVertexStream& i_rStream );
  bool SetVertexStreams( std::span< const VVertexStream > i_Streams );
  /// The value of an attribute that no stream feeds, for all vertices or instances of the draws that follow. From
  /// `ResetState` on the colour is white.
  void SetConstantAttribute( EVertexAttribute i_Attribute, const QVector4D& i_rValue );

  void DrawArrays( GLenum i_Mode, int i_Count, int i_First = 0 );
  void DrawArraysInstanced( GLenum i_Mode, int i_Count, int i_Instances );
  /// The mesh's vertices must have been given by `SetVertexBuffer` or `SetVertexStreams`.
  void DrawElements( GLenum i_Mode, VMesh& i_rMesh );
  void DrawElementsInstanced( GLenum i_Mode, VMesh& i_rMesh, int i_Instances );

  /// Binds a 2D texture; 0 unbinds. The unit stays the active one.
  void BindTexture( int i_Unit, GLuint i_Texture );
  /// The same for a texture that reads a buffer.
  void BindBufferTexture( int i_Unit, GLuint i_Texture );
  /// Binds the colour texture; filtered nearest in the modes 1 and 2, linear in mode 0. Null unbinds.
  void BindFramebufferTexture( int i_Unit, const QOpenGLFramebufferObject* i_pFramebuffer );
  /// Acts on the texture of the active unit.
  void SetTextureSampling( const VTextureSampling& i_rSampling );

  /// Null binds the default framebuffer.
  void BindFramebuffer( QOpenGLFramebufferObject* i_pFramebuffer );
  /// The framebuffer that Qt gave the view.
  void SetDefaultFramebuffer( std::uint32_t i_Id ) { m_DefaultFramebuffer = i_Id; }
  std::uint32_t DefaultFramebuffer() const { return m_DefaultFramebuffer; }
  void BindDefaultFramebuffer();
  bool IsFramebufferComplete();
  /// The framebuffer in use; null when it is the default one.
  QOpenGLFramebufferObject* Framebuffer() const { return m_pFramebuffer; }
  void SetOutlineMask( QOpenGLFramebufferObject* i_pFramebuffer ) { m_pOutlineMask = i_pFramebuffer; }
  QOpenGLFramebufferObject* OutlineMask() const { return m_pOutlineMask; }

  void SetClearColour( const QColor& i_rColour );
  /// Turns depth and colour writes on and clears within the scissor.
  void Clear( bool i_bColour, bool i_bDepth );
  /// Pixels, origin at the lower left.
  void SetViewport( const QRect& i_rViewport );
  void SetScissor( const QRect& i_rScissor );
  void ReadPixels( const QRect& i_rRect, void* o_pBuffer, GLenum i_Format );

  const QMatrix4x4& Projection() const { return m_Projection; }
  void SetProjection( const QMatrix4x4& i_rProjection );
  const QMatrix4x4& View() const { return m_View; }
  void SetView( const QMatrix4x4& i_rView );
  /// Projection times view.
  const QMatrix4x4& ViewProjection();
  /// The eye in the world: the translation of the inverse of the view.
  const QVector3D& CameraPosition();
  /// x scale, y scale, x centre, y centre of a sensor's view.
  const QVector4D& View2D() const { return m_View2D; }
  void SetView2D( const QVector4D& i_rView2D ) { Change( m_View2D, i_rView2D ); }
  const QRect& Viewport() const { return m_Viewport; }
  const QRect& Scissor() const { return m_Scissor; }
  const QSize& FrameSize() const { return m_FrameSize; }
  void SetFrameSize( const QSize& i_rSize ) { Change( m_FrameSize, i_rSize ); }
  const QVector3D& LightVector() const { return m_LightVector; }
  void SetLightVector( const QVector3D& i_rVector ) { Change( m_LightVector, i_rVector ); }
  bool YUp() const { return m_bYUp; }
  void SetYUp( bool i_bYUp );
  void SetUpAxis( bool i_bYUp ) { SetYUp( i_bYUp ); }
  const QVector3D& UpVector() const { return m_UpVector; }
  /// Seconds since midnight.
  float GlobalTime() const { return m_GlobalTime; }
  void SetGlobalTime( float i_Seconds ) { Change( m_GlobalTime, i_Seconds ); }
  float PixelRatio() const { return m_PixelRatio; }
  void SetPixelRatio( float i_Ratio ) { m_PixelRatio = i_Ratio; }
  /// One of ERenderMode.
  int RenderMode() const { return m_RenderMode; }
  void SetRenderMode( int i_Mode );
  int PreselectColourIndex() const { return m_PreselectColourIndex; }
  void SetPreselectColourIndex( int i_Index ) { m_PreselectColourIndex = i_Index; }

  /// Known after `Initialise`.
  float MaximumPointSize() const { return m_MaximumPointSize; }
  /// The level to give to textures seen at an angle: 16 or the device's maximum; 1 on a software rasteriser.
  float Anisotropy() const { return m_Anisotropy; }
  bool IsSoftwareRasteriser() const { return m_bSoftware; }
  /// The texels that a texture buffer may have; 0 where the context has none.
  int MaximumBufferTexels() const { return m_MaximumBufferTexels; }

  /// Draw calls since `ResetCounters`, and bytes written to buffers by this process since then.
  std::uint64_t DrawCalls() const { return m_DrawCalls; }
  std::uint64_t BytesUploaded() const { return VVertexBuffer::TotalBytesUploaded() - m_UploadedAtReset; }
  void ResetCounters();

  /// What an owner keeps for this context alone, such as framebuffers, which contexts do not share; null at first. It
  /// ends with the context, while that is current. The owner is told apart by its address.
  std::shared_ptr< void >& Belonging( const void* i_pOwner );

private:
  static constexpr int LocationCount = 16;
  static constexpr int MaximumAttributes = 8;

  /// What one attribute array of the vertex array object points at.
  struct VPointer
  {
    std::uint64_t Serial = 0;
    std::size_t Offset = 0;
    GLenum Type = 0;
    std::uint16_t Stride = 0;
    std::uint8_t Components = 0;
    std::uint8_t Divisor = 0;
    bool bNormalised = false;
    bool operator==( const VPointer& ) const = default;
  };
  /// Blend, depth, cull and mask state as OpenGL has it.
  struct VApplied
  {
    bool bBlend = false;
    bool bCull = false;
    bool bDepthTest = false;
    bool bDepthWrite = true;
    bool bColourWrite = true;
    bool bScissor = false;
    int ColourBlend = -1;
    int AlphaBlend = -1;
    int CullMode = ECullBack;
    int DepthFunction = -1;
    float BlendConstant = -1.0f;
  };

  template < typename T >
  void Change( T& io_rField, const T& i_rValue )
  {
    if ( io_rField != i_rValue )
    {
      io_rField = i_rValue;
      Touch();
    }
  }
  void Touch();
  void ReadLimits();
  void StartDebugLogger();
  void WriteDebugMessages();
  void WriteErrors( const char* i_pFile, int i_Line );
  void BindVertexArray();
  void ResetFixedFunction();
  void Toggle( GLenum i_Capability, bool i_bOn, bool& io_rbState );
  void SetDepthWrite( bool i_bOn );
  void SetColourWrite( bool i_bOn );
  void ApplyBlend( const VRenderState& i_rState );
  void SendFixedUniforms( VShaderProgram& io_rProgram );
  bool SetStream( const VVertexStream& i_rStream, std::uint32_t& io_rEnabled, int& io_rCount );
  void SetPointer( int i_Location, const VVertexStream& i_rStream, const VVertexElement& i_rElement );
  void SetEnabledArrays( std::uint32_t i_Mask );
  void ActiveUnit( int i_Unit );

  QPointer< QOpenGLContext > m_pContext;
  QOpenGLExtraFunctions* m_pFunctions = nullptr;
  std::unique_ptr< QOpenGLDebugLogger > m_pLogger;
  std::unique_ptr< QOpenGLVertexArrayObject > m_pVertexArray;
  std::shared_ptr< VShaderProgram > m_pProgram;
  QOpenGLFramebufferObject* m_pFramebuffer = nullptr;
  QOpenGLFramebufferObject* m_pOutlineMask = nullptr;
  std::uint32_t m_DefaultFramebuffer = 0;

  QMatrix4x4 m_Projection;
  QMatrix4x4 m_View;
  QMatrix4x4 m_ViewProjection;
  QVector3D m_CameraPosition;
  bool m_bMatricesDirty = true;
  QVector4D m_View2D{ 1.0f, 1.0f, 0.0f, 0.0f };
  QRect m_Viewport;
  QRect m_Scissor;
  QSize m_FrameSize;
  QVector3D m_LightVector{ 0.0f, 0.0f, 1.0f };
  QVector3D m_UpVector{ 0.0f, 0.0f, 1.0f };
  bool m_bYUp = false;
  float m_GlobalTime = 0.0f;
  float m_PixelRatio = 1.0f;
  int m_RenderMode = ERenderModeNormal;
  int m_PreselectColourIndex = 0;

  std::uint64_t m_Revision = 0; // of the values behind the fixed uniforms; unique in the process
  VApplied m_Applied;
  VRenderState m_LastState;
  bool m_bLastStateKnown = false;
  std::array< VPointer, LocationCount > m_Pointers{};
  std::uint32_t m_EnabledArrays = 0;
  int m_ActiveUnit = 0;
  std::uint64_t m_BoundLink = 0; // the link in use; 0 for none

  bool m_bES = false;
  bool m_bCompatibility = false;
  bool m_bSoftware = false;
  bool m_bReadErrors = false;
  float m_MaximumPointSize = 1.0f;
  float m_Anisotropy = 1.0f;
  int m_MaximumBufferTexels = 0;
  std::uint64_t m_DrawCalls = 0;
  std::uint64_t m_UploadedAtReset = 0;
  std::vector< std::pair< const void*, std::shared_ptr< void > > > m_Belongings;
};

} // namespace CoreGraphics
