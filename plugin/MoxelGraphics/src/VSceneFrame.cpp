#include <MoxelGraphics/VSceneFrame.h>

#include "HandOver.h"
#include "HighlightUnit.h"
#include "Log.h"
#include "TileLayout.h"

#include <MoxelGraphics/VMoxelScene.h>

#include <CoreGraphics/VCameraController.h>
#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

#include <QtCore/QThread>
#include <QtCore/QTime>
#include <QtGui/QGuiApplication>
#include <QtGui/QOpenGLContext>
#include <QtGui/QPainter>
#include <QtOpenGL/QOpenGLFramebufferObject>
#include <QtOpenGL/QOpenGLPaintDevice>

#include <cmath>

namespace MoxelGraphics
{
namespace
{
const QString NotShared = QStringLiteral( "This window's OpenGL context does not share with the scene's first one" );

QVector3D LightDirection( bool i_bYUp )
{
  return ( i_bYUp ? QVector3D( 1, 3, 1 ) : QVector3D( 1, 1, 3 ) ).normalized();
}

QString GlText( QOpenGLExtraFunctions& io_rGl, GLenum i_Name )
{
  return QString::fromLatin1( reinterpret_cast< const char* >( io_rGl.glGetString( i_Name ) ) );
}

std::unique_ptr< QOpenGLFramebufferObject > TryTarget( QSize i_Size, int i_Samples, GLenum i_Format )
{
  QOpenGLFramebufferObjectFormat Format;
  Format.setAttachment( QOpenGLFramebufferObject::Depth );
  Format.setSamples( i_Samples );
  Format.setInternalTextureFormat( i_Format );
  auto pTarget = std::make_unique< QOpenGLFramebufferObject >( i_Size, Format );
  return pTarget->isValid() ? std::move( pTarget ) : nullptr;
}
} // namespace

std::unique_ptr< QOpenGLFramebufferObject > VSceneFrame::MakeTarget( QSize i_Size, bool i_bMultisampled )
{
  const bool bES = QOpenGLContext::currentContext()->isOpenGLES();
  const GLenum Format = bES ? GL_RGBA : GL_RGB;
  auto pTarget = TryTarget( i_Size, i_bMultisampled && !bES ? 4 : 0, Format );
  if ( !pTarget )
  {
    pTarget = TryTarget( i_Size, 0, Format );
  }
  return pTarget ? std::move( pTarget ) : TryTarget( i_Size, 0, GL_RGBA );
}

VSceneFrame::VSceneFrame( std::shared_ptr< VMoxelScene > i_pScene,
                          std::shared_ptr< CoreGraphics::VCameraController > i_pController )
  : m_pScene( std::move( i_pScene ) )
  , m_pController( std::move( i_pController ) )
  , m_pContext( std::make_unique< CoreGraphics::VRenderContext >() )
{
}

VSceneFrame::~VSceneFrame()
{
  m_pSelectionTarget.reset();
  m_pOutlineTarget.reset();
  m_pContext.reset();
  // A scene is an object of the GUI thread: where this is another one, the last reference must not end here.
  if ( qGuiApp && m_pScene->thread() != QThread::currentThread() )
  {
    VMoxelScene* const pScene = m_pScene.get();
    QMetaObject::invokeMethod(
        pScene, [pKept = std::move( m_pScene )] {}, Qt::QueuedConnection );
    HandOver( pScene );
  }
}

void VSceneFrame::Resize( QSize i_Size )
{
  m_pController->SetSize( i_Size );
  m_Size = i_Size;
  m_pSelectionTarget.reset();
  m_pOutlineTarget.reset();
  m_Gl.clear();
  m_DirtyMask = QRect( QPoint( 0, 0 ), i_Size );
  if ( i_Size.isEmpty() )
  {
    return;
  }
  m_pSelectionTarget =
      std::make_unique< QOpenGLFramebufferObject >( i_Size, QOpenGLFramebufferObject::Depth, GL_TEXTURE_2D );
  m_pOutlineTarget =
      std::make_unique< QOpenGLFramebufferObject >( i_Size, QOpenGLFramebufferObject::NoAttachment, GL_TEXTURE_2D );
  if ( !m_pSelectionTarget->isValid() || !m_pOutlineTarget->isValid() )
  {
    ZEK::Log(
        LogCategory(), ZEK::ELogWarning,
        "The device refuses a target of %1% by %2%: this view shows no selection, and nothing can be picked in it",
        i_Size.width(), i_Size.height() );
  }
}

bool VSceneFrame::Prepare()
{
  if ( m_pContext->IsInitialised() )
  {
    return !m_bRefused;
  }
  m_pContext->Initialise();
  if ( !m_pContext->IsInitialised() )
  {
    return false;
  }
  m_pScene->Initialise( *m_pContext );
  m_bRefused = !m_pScene->CanDraw();
  m_Notice = m_bRefused ? NotShared : QString::fromStdString( m_pScene->Resources()->VersionNotice() );
  if ( m_pContext->IsSoftwareRasteriser() )
  {
    ZEK::Log( LogCategory(), ZEK::ELogDetail,
              "A software rasteriser draws this view: textures are not filtered along slopes" );
  }
  return !m_bRefused;
}

double VSceneFrame::Lap()
{
  if ( m_Input.bReporting )
  {
    m_pContext->Functions()->glFinish();
  }
  const double Passed = static_cast< double >( m_Clock.nsecsElapsed() ) * 1e-6;
  m_Clock.start();
  return Passed;
}

bool VSceneFrame::Render( QOpenGLFramebufferObject& io_rTarget )
{
  m_Result.Mode = -1;
  const bool bReady = Prepare();
  if ( m_bRefused && m_Input.bVisible )
  {
    // The picture shows nothing rather than what the memory held before.
    m_pContext->Functions()->glClearColor( 0, 0, 0, 1 );
    m_pContext->Functions()->glClear( GL_COLOR_BUFFER_BIT );
  }
  if ( !bReady || !m_Input.bVisible || m_Size.isEmpty() || !m_pSelectionTarget )
  {
    return false;
  }
  if ( m_Gl.isEmpty() )
  {
    ReadGl( io_rTarget );
  }
  Begin();
  m_Figures.UpdateMs = Lap();
  m_pScene->SetHighlighted( false );
  m_pScene->SetSettled( m_Input.bReporting );
  // A device that refuses the off-screen target costs the view its picks and highlights, not its picture.
  if ( m_pSelectionTarget->isValid() && m_pOutlineTarget->isValid() )
  {
    SelectAndHighlight();
  }
  DrawVisible( io_rTarget );
  m_Figures.DrawMs = Lap();
  m_Figures.DrawCalls = m_pContext->DrawCalls();
  m_Figures.BytesUploaded = m_pContext->BytesUploaded();
  ++m_Figures.Frames;
  return true;
}

void VSceneFrame::Begin()
{
  m_Clock.start();
  m_pContext->ResetCounters();
  if ( m_pScene->Resources()->Update() )
  {
    // What other programs left undrawn may be drawn now: every view goes through its tiles again.
    m_pScene->BeginTileWalk();
  }
  if ( m_pScene->IsPending() )
  {
    m_pScene->ProcessPending();
  }
  m_pContext->ResetState();
  m_pContext->SetOutlineMask( m_pOutlineTarget.get() );
  m_pContext->SetPreselectColourIndex( m_Input.PreselectColour );
  UpdateCamera();
  if ( !m_Input.Options.CameraView && !m_Input.Options.OverlayCamera.isEmpty() )
  {
    m_pContext->SetView2D( ViewThroughCamera() );
  }
  m_pContext->SetYUp( m_pScene->YUp() );
  m_pContext->SetGlobalTime( static_cast< float >( QTime::currentTime().msecsSinceStartOfDay() ) * 0.001f );
  m_pContext->SetPixelRatio( m_Input.PixelRatio );
}

void VSceneFrame::CollectPoints( const std::vector< VScenePoint >& i_rPoints )
{
  m_Points.clear();
  for ( const VScenePoint& rPoint : i_rPoints )
  {
    if ( std::isfinite( rPoint.X ) && std::isfinite( rPoint.Y ) && std::isfinite( rPoint.Z ) )
    {
      m_Points.emplace_back( rPoint.X, rPoint.Y, rPoint.Z, std::isfinite( rPoint.Radius ) ? rPoint.Radius : 0.0f );
    }
  }
}

void VSceneFrame::UpdateCamera()
{
  bool bFit = std::exchange( m_Input.bFit, false );
  VScenePose Pose;
  const bool bPose = m_Input.Tracking == ELockCurrent && m_pScene->GetSelectionPose( m_Input.TrackedSelection, Pose );
  m_Points.clear();
  if ( bFit || m_Input.Tracking == ETrackCurrent )
  {
    CollectPoints( m_pScene->GetSelectionPositions( m_Input.TrackedSelection ) );
  }
  else if ( m_Input.Tracking == ETrackSelection )
  {
    CollectPoints( m_pScene->GetSelectionPositions( m_pScene->GetSelection() ) );
  }
  else if ( !m_bAtHome && !m_Input.Options.CameraView )
  {
    CollectPoints( m_pScene->HomePoints() );
    m_bAtHome = bFit = !m_Points.empty();
  }
  m_pController->SetYUp( m_pScene->YUp() );
  m_pController->SetFocusPoints( m_Points, bFit );
  if ( bPose )
  {
    // The record is column-major, the constructor reads rows.
    m_pController->SetLockPose( QMatrix4x4( Pose.Matrix.data() ).transposed() );
  }
  m_pController->Step();
  m_pController->Apply( *m_pContext );
}

const QVector4D& VSceneFrame::ViewThroughCamera()
{
  const VSceneOptions& rOptions = m_Input.Options;
  VThrough& rThrough = m_Through;
  if ( rThrough.URN == rOptions.OverlayCamera && rThrough.Cameras == m_pScene->CameraGeneration() &&
       rThrough.Size == m_Size && rThrough.bRotated == rOptions.CameraShowRotated &&
       rThrough.bSnapped == rOptions.CameraSnap90Degrees )
  {
    return rThrough.View2D;
  }
  rThrough = { rOptions.OverlayCamera,     m_pScene->CameraGeneration(), m_Size,
               rOptions.CameraShowRotated, rOptions.CameraSnap90Degrees, QVector4D( 1, 1, 0.5F, 0.5F ) };
  const std::string URN = rThrough.URN.toStdString();
  for ( const VCameraDefinition& rCamera : m_pScene->CameraDefinitions() )
  {
    if ( rCamera.DeviceURN == URN )
    {
      VCameraTiles Tiles{ MakeImageTile( rCamera ) };
      MeasureRotated( Tiles.front(), rThrough.bRotated, rThrough.bSnapped );
      PlaceTiles( Tiles, m_Size, {} );
      rThrough.View2D.setX( Tiles.front().ScaleX );
      rThrough.View2D.setY( Tiles.front().ScaleY );
    }
  }
  return rThrough.View2D;
}

void VSceneFrame::DrawAllTiles()
{
  if ( !m_Input.Tiles )
  {
    return;
  }
  const bool bAgain = AreTilesAgain();
  if ( !bAgain )
  {
    const std::uint64_t Number = m_pScene->BeginTileWalk(), Draws = m_pContext->DrawCalls();
    for ( const VCameraTile& rTile : *m_Input.Tiles )
    {
      if ( !rTile.Rect.isEmpty() )
      {
        DrawTile( rTile, rTile.Viewport, rTile.Rect );
      }
    }
    m_TileWalk = { m_Input.Tiles,
                   m_Input.Options,
                   m_Size,
                   m_pContext->RenderMode(),
                   Number,
                   m_pScene->UpdateCount(),
                   m_pContext->DrawCalls() == Draws };
  }
  const QRect Frame( QPoint( 0, 0 ), m_Size );
  m_pContext->SetViewport( Frame );
  m_pContext->SetScissor( Frame );
  m_pScene->SetTilesAgain( bAgain );
  m_pScene->DrawTiles( *m_pContext, m_Input.Options );
  m_pScene->SetTilesAgain( false );
}

bool VSceneFrame::AreTilesAgain() const
{
  return m_TileWalk.bCollected && m_TileWalk.Number == m_pScene->TileWalk() &&
         m_TileWalk.Updates == m_pScene->UpdateCount() && m_TileWalk.Tiles == m_Input.Tiles &&
         m_TileWalk.Size == m_Size && m_TileWalk.RenderMode == m_pContext->RenderMode() &&
         m_TileWalk.Options == m_Input.Options;
}

void VSceneFrame::DrawTile( const VCameraTile& i_rTile, const QRect& i_rViewport, const QRect& i_rScissor )
{
  ApplyTile( i_rTile, *m_pContext );
  m_pContext->SetViewport( i_rViewport );
  m_pContext->SetScissor( i_rScissor );
  m_Input.Options.OverlayCamera = i_rTile.DeviceURN;
  m_pScene->DrawScene( *m_pContext, m_Input.Options );
  m_Input.Options.OverlayCamera.clear();
}

void VSceneFrame::DrawView()
{
  m_pScene->Clear( *m_pContext, m_Input.Options );
  m_pContext->SetLightVector( LightDirection( m_pContext->YUp() ) );
  if ( m_Input.Options.CameraView )
  {
    DrawAllTiles();
  }
  else
  {
    m_pScene->DrawScene( *m_pContext, m_Input.Options );
  }
  m_pScene->DrawPost( *m_pContext, m_Input.Options );
}

void VSceneFrame::DrawVisible( QOpenGLFramebufferObject& io_rTarget )
{
  m_pContext->SetRenderMode( ERenderModeNormal );
  m_pContext->SetDefaultFramebuffer( io_rTarget.handle() );
  m_pContext->BindDefaultFramebuffer();
  m_pContext->BindFramebufferTexture( HighlightUnit, m_pSelectionTarget.get() );
  DrawView();
  m_pContext->BindTexture( HighlightUnit, 0 );
  m_pContext->ResetState();
  PaintOverlay( io_rTarget );
  m_pContext->ReleaseVertexArray();
}

void VSceneFrame::PaintOverlay( const QOpenGLFramebufferObject& i_rTarget )
{
  const bool bBand = m_Input.PickMode == EPickBand && m_Input.BandStart != m_Input.Pointer;
  if ( !bBand && !m_pScene->WantsPaint( m_Input.Options ) )
  {
    return;
  }
  m_pContext->ReleaseVertexArray();
  m_pContext->Functions()->glDisable( GL_SCISSOR_TEST );
  QOpenGLPaintDevice Device( i_rTarget.size() );
  QPainter Painter( &Device );
  Painter.setRenderHint( QPainter::Antialiasing );
  if ( bBand )
  {
    Painter.setPen( QColor( 231, 101, 0, 255 ) );
    Painter.setBrush( QColor( 75, 120, 170, 64 ) );
    Painter.drawRect( QRectF( m_Input.BandStart, m_Input.Pointer ).normalized() );
  }
  PaintTiles( Painter );
  m_pScene->Paint( Painter, *m_pContext, m_Input.Options );
  Painter.end();
}

void VSceneFrame::PaintTiles( QPainter& io_rPainter )
{
  if ( !m_Input.Options.CameraView || !m_Input.Tiles || !m_pScene->WantsPaint( m_Input.Options ) )
  {
    return;
  }
  for ( const VCameraTile& rTile : *m_Input.Tiles )
  {
    const QRect& rRect = rTile.Rect;
    io_rPainter.save();
    // The context's viewport is the painter's too.
    io_rPainter.beginNativePainting();
    ApplyTile( rTile, *m_pContext );
    io_rPainter.endNativePainting();
    io_rPainter.setClipRect( rRect.x(), m_Size.height() - rRect.y() - rRect.height(), rRect.width(), rRect.height() );
    m_Input.Options.OverlayCamera = rTile.DeviceURN;
    m_pScene->Paint( io_rPainter, *m_pContext, m_Input.Options );
    io_rPainter.restore();
  }
  m_Input.Options.OverlayCamera.clear();
}

void VSceneFrame::ReadGl( const QOpenGLFramebufferObject& i_rTarget )
{
  QOpenGLExtraFunctions& rGl = *m_pContext->Functions();
  const QOpenGLContext& rContext = *m_pContext->Context();
  const bool bCore = rContext.format().profile() == QSurfaceFormat::CoreProfile;
  m_Gl[QStringLiteral( "vendor" )] = GlText( rGl, GL_VENDOR );
  m_Gl[QStringLiteral( "renderer" )] = GlText( rGl, GL_RENDERER );
  m_Gl[QStringLiteral( "version" )] = GlText( rGl, GL_VERSION );
  m_Gl[QStringLiteral( "glsl" )] = GlText( rGl, GL_SHADING_LANGUAGE_VERSION );
  m_Gl[QStringLiteral( "profile" )] = rContext.isOpenGLES() ? "es" : bCore ? "core" : "compatibility";
  m_Gl[QStringLiteral( "width" )] = i_rTarget.width();
  m_Gl[QStringLiteral( "height" )] = i_rTarget.height();
  m_Gl[QStringLiteral( "samples" )] = i_rTarget.format().samples();
}

} // namespace MoxelGraphics
