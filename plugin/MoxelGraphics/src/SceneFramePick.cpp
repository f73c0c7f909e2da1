#include <MoxelGraphics/VSceneFrame.h>

#include "HighlightUnit.h"

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSphereHelper.h>

#include <CoreGraphics/VRenderContext.h>

#include <QtOpenGL/QOpenGLFramebufferObject>

#include <cmath>

// The part of a frame that is not to be seen: what is picked, and the mask of what is highlighted.

namespace MoxelGraphics
{
namespace
{
/// A rectangle of the frame in one of another size.
QRect InFrame( const QRect& i_rRect, QSize i_From, QSize i_To )
{
  if ( i_From == i_To )
  {
    return i_rRect;
  }
  const auto X = [&]( int i_X )
  {
    return static_cast< int >( std::round( static_cast< double >( i_X ) * i_To.width() / i_From.width() ) );
  };
  const auto Y = [&]( int i_Y )
  {
    return static_cast< int >( std::round( static_cast< double >( i_Y ) * i_To.height() / i_From.height() ) );
  };
  const int Left = X( i_rRect.x() ), Bottom = Y( i_rRect.y() );
  return { Left, Bottom, X( i_rRect.x() + i_rRect.width() ) - Left, Y( i_rRect.y() + i_rRect.height() ) - Bottom };
}
} // namespace

bool VSceneFrame::IsBand() const
{
  const bool bBand = m_Input.PickMode == EPickBand || m_Input.PickMode == EPickBandDone;
  return bBand && m_Input.BandStart != m_Input.Pointer;
}

void VSceneFrame::SelectAndHighlight()
{
  m_pContext->BindTexture( HighlightUnit, 0 );
  m_pContext->SetRenderMode( ERenderModeSelection );
  m_pContext->BindFramebuffer( m_pSelectionTarget.get() );
  if ( m_Input.PickMode != EPickNone )
  {
    m_Found.clear();
    m_Result.Layers = IsBand() ? PickBand() : 0;
    const bool bBand = m_Result.Layers > 0;
    if ( !bBand )
    {
      PickPoint();
      m_Result.Layers = 1;
    }
    ++m_Result.Serial;
    m_Result.Mode = m_Input.PickMode;
    m_Result.Edit = m_Input.Edit;
    m_Result.Ids = m_Found;
    m_Result.Labels.clear();
    m_Result.Selection = m_pScene->ResolveIds( m_Found, m_Result.Labels );
    if ( bBand )
    {
      std::erase_if( m_Result.Selection,
                     []( const ZEK::VSelectionItem& i_rItem )
                     {
                       return i_rItem.Kind == ZEK::ESelectObjectManipulator;
                     } );
    }
  }
  m_Figures.SelectMs = Lap();
  Highlight();
  m_Figures.HighlightMs = Lap();
}

void VSceneFrame::Highlight()
{
  m_pContext->SetRenderMode( ERenderModeHighlight );
  bool bDrawn = false;
  if ( !m_pScene->Registry().Marks().empty() )
  {
    const std::uint64_t Draws = m_pContext->DrawCalls();
    DrawView();
    bDrawn = m_pContext->DrawCalls() != Draws;
    m_DirtyMask = bDrawn ? QRect( QPoint( 0, 0 ), m_Size ) : QRect();
  }
  else if ( !m_DirtyMask.isEmpty() )
  {
    // Nothing has a flag, so nothing would draw: only what a pick or an older frame left has to go.
    m_pScene->Clear( *m_pContext, m_Input.Options, m_DirtyMask );
    m_DirtyMask = QRect();
  }
  m_pScene->SetHighlighted( bDrawn );
}

const VCameraTile* VSceneFrame::TileUnderPointer( QPoint i_Point ) const
{
  const bool bTiles = m_Input.Options.CameraView && m_Input.Tiles;
  const int Index = bTiles ? TileUnder( *m_Input.Tiles, m_Size, i_Point ) : -1;
  return Index < 0 ? nullptr : &( *m_Input.Tiles )[static_cast< std::size_t >( Index )];
}

void VSceneFrame::Draw( const QRect& i_rScissor, const VCameraTile* i_pTile )
{
  m_DirtyMask |= i_rScissor;
  m_pScene->Clear( *m_pContext, m_Input.Options, i_rScissor );
  if ( !m_Input.Options.CameraView )
  {
    m_pScene->DrawScene( *m_pContext, m_Input.Options );
    return;
  }
  // What is not to be seen is not to be picked either.
  const QRect Frame( QPoint( 0, 0 ), m_pContext->FrameSize() );
  const QRect Part = i_pTile ? i_rScissor.intersected( InFrame( i_pTile->Rect, m_Size, Frame.size() ) ) : QRect();
  if ( Part.isEmpty() )
  {
    return;
  }
  m_pScene->BeginTileWalk();
  DrawTile( *i_pTile, InFrame( i_pTile->Viewport, m_Size, Frame.size() ), Part );
  m_pContext->SetViewport( Frame );
  m_pContext->SetScissor( i_rScissor );
  m_pScene->DrawTiles( *m_pContext, m_Input.Options );
}

void VSceneFrame::PickPoint()
{
  const QRect Frame( QPoint( 0, 0 ), m_Size );
  const QRect Window =
      QRect( m_Input.Pointer.x() - 5, m_Size.height() - m_Input.Pointer.y() - 5, 11, 11 ).intersected( Frame );
  if ( Window.isEmpty() )
  {
    return;
  }
  m_Pixels.assign( static_cast< std::size_t >( Window.width() ) * static_cast< std::size_t >( Window.height() ), 0 );
  m_pScene->SetIgnoredIds( {} );
  Draw( Window, TileUnderPointer( m_Input.Pointer ) );
  m_pContext->ReadPixels( Window, m_Pixels.data(), GL_RGBA );

  float Nearest = std::numeric_limits< float >::max();
  std::uint32_t Winner = 0;
  for ( int Row = 0; Row < Window.height(); ++Row )
  {
    for ( int Column = 0; Column < Window.width(); ++Column )
    {
      const std::uint32_t Id = m_Pixels[static_cast< std::size_t >( Row * Window.width() + Column )] & EIdPixelMask;
      const float Distance = std::hypot( static_cast< float >( Column ) - static_cast< float >( Window.width() ) * 0.5f,
                                         static_cast< float >( Row ) - static_cast< float >( Window.height() ) * 0.5f );
      if ( Id != 0 && Distance < Nearest )
      {
        Nearest = Distance;
        Winner = Id & EIdMask;
      }
    }
  }
  if ( Winner != 0 )
  {
    m_Found.push_back( Winner );
  }
}

int VSceneFrame::PickBand()
{
  constexpr double Scale = 0.5;
  const VCameraTile* pTile = TileUnderPointer( m_Input.Pointer );
  // A hand that slips off all tiles goes on with the one where it began.
  pTile = pTile ? pTile : TileUnderPointer( m_Input.BandStart );
  const auto Scaled = [&]( QPoint i_Point )
  {
    QPoint Point( i_Point.x(), m_Size.height() - i_Point.y() );
    if ( pTile )
    {
      const QRect& rRect = pTile->Rect;
      Point.setX( std::clamp( Point.x(), rRect.x(), rRect.x() + rRect.width() ) );
      Point.setY( std::clamp( Point.y(), rRect.y(), rRect.y() + rRect.height() ) );
    }
    return QPoint( static_cast< int >( std::round( Point.x() * Scale ) ),
                   static_cast< int >( std::round( Point.y() * Scale ) ) );
  };
  const QRect Frame( 0, 0, static_cast< int >( std::round( m_Size.width() * Scale ) ),
                     static_cast< int >( std::round( m_Size.height() * Scale ) ) );
  const QPoint Start = Scaled( m_Input.BandStart );
  const QPoint End = Scaled( m_Input.Pointer );
  const QRect Band = QRect( std::min( Start.x(), End.x() ), std::min( Start.y(), End.y() ),
                            std::abs( Start.x() - End.x() ), std::abs( Start.y() - End.y() ) )
                         .intersected( Frame );
  if ( Band.isEmpty() )
  {
    return 0;
  }
  const QRect Viewport = m_pContext->Viewport();
  const QRect Scissor = m_pContext->Scissor();
  m_pContext->SetViewport( Frame );
  m_pContext->SetFrameSize( Frame.size() );
  const auto Remember = [this]( bool i_bOn )
  {
    if ( VSphereHelper* const pHelper = m_pScene->SphereHelper() )
    {
      pHelper->Remember( i_bOn );
    }
  };
  // A lens shows the spheres elsewhere than the matrix that drew them says; pixels find those.
  const bool bCamera = pTile || !m_Input.Options.OverlayCamera.isEmpty();
  Remember( !( bCamera && m_Input.Options.Show3DOverlay && m_Input.Options.Distort3D ) );
  const int Layers = PickLayers( Band, pTile );
  Remember( false );
  m_pContext->SetFrameSize( m_Size );
  m_pContext->SetViewport( Viewport );
  m_pContext->SetScissor( Scissor );
  return Layers;
}

int VSceneFrame::PickLayers( const QRect& i_rBand, const VCameraTile* i_pTile )
{
  constexpr int MaximumLayers = 16;
  m_Pixels.resize( static_cast< std::size_t >( i_rBand.width() ) * static_cast< std::size_t >( i_rBand.height() ) );
  m_pScene->SetIgnoredIds( {} );
  int Layers = 0;
  bool bNew = true;
  while ( bNew && Layers < MaximumLayers )
  {
    ++Layers;
    Draw( i_rBand, i_pTile );
    m_pContext->ReadPixels( i_rBand, m_Pixels.data(), GL_RGBA );
    bNew = false;
    std::uint32_t Last = 0;
    for ( const std::uint32_t Pixel : m_Pixels )
    {
      const std::uint32_t Id = Pixel & EIdMask;
      // What was found no longer draws, so that the next layer shows what it hid.
      if ( Id != Last && Id != 0 && Take( Id ) )
      {
        bNew = true;
      }
      Last = Id;
    }
  }
  PickAnalytically( i_rBand, i_pTile );
  m_pScene->SetIgnoredIds( {} );
  return Layers;
}

void VSceneFrame::PickAnalytically( const QRect& i_rBand, const VCameraTile* i_pTile )
{
  if ( m_Input.Options.CameraView && !i_pTile )
  {
    return;
  }
  if ( i_pTile )
  {
    ApplyTile( *i_pTile, *m_pContext );
    m_pContext->SetViewport( InFrame( i_pTile->Viewport, m_Size, m_pContext->FrameSize() ) );
    m_pContext->SetScissor( i_rBand );
    m_Input.Options.OverlayCamera = i_pTile->DeviceURN;
  }
  m_Analytic.clear();
  m_pScene->PickInRect( *m_pContext, m_Input.Options, i_rBand, m_Analytic );
  if ( i_pTile )
  {
    m_Input.Options.OverlayCamera.clear();
  }
  for ( const std::uint32_t Id : m_Analytic )
  {
    Take( Id & EIdMask );
  }
}

bool VSceneFrame::Take( std::uint32_t i_Id )
{
  if ( i_Id == 0 || !m_pScene->AddIgnoredId( i_Id ) )
  {
    return false;
  }
  m_Found.push_back( i_Id );
  return true;
}

} // namespace MoxelGraphics
