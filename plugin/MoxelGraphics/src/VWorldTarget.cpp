#include "VWorldTarget.h"

#include "Log.h"

#include <CoreGraphics/VResources.h>
#include <MoxelGraphics/IRenderType.h>
#include <ZEK/RenderCamera.h>

#include <QtOpenGL/QOpenGLFramebufferObject>

#include <algorithm>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

constexpr float Corners[] = { 0, 0, 1, 0, 1, 1, 0, 1 };
constexpr VVertexLayout CornerLayout( 8, 0, { { EAttributePosition, 2 } } );
constexpr int Step = 64;           // px, by which pictures grow
constexpr int Patience = 1024;     // uses
constexpr double LargestReach = 2; // of the tile
constexpr int Samples = 8;         // along each side
constexpr char PicturesKey = 0;    // its address tells the pictures of a context

/// Where on the sensor a place of the tile is, without a lens; x and y of the clip position.
std::array< double, 2 > ClipToSensor( const VSensorView& i_rView, double i_X, double i_Y )
{
  const QVector4D& rView = i_rView.View2D;
  const auto& rTurn = i_rView.RotationInverse;
  const double X = ( i_X / ( 2 * rView.x() ) + rView.z() ) * i_rView.SensorSize[0] - i_rView.RotationCentre[0];
  const double Y = ( i_Y / ( -2 * rView.y() ) + rView.w() ) * i_rView.SensorSize[1] - i_rView.RotationCentre[1];
  return { rTurn[0] * X + rTurn[1] * Y + i_rView.RotationCentre[0],
           rTurn[2] * X + rTurn[3] * Y + i_rView.RotationCentre[1] };
}

int RoundedUp( int i_Size )
{
  return ( i_Size + Step - 1 ) / Step * Step;
}
} // namespace

std::array< double, 2 > LensReach( const VSensorView& i_rSensor )
{
  VSensorView Raw = i_rSensor;
  Raw.DistortionCentre = {};
  std::array< double, 2 > Reach{ 1, 1 };
  const auto Look = [&]( double i_X, double i_Y ) // sensor pixels, from the corner
  {
    const auto Shown = SensorToClip( Raw, i_X - 0.5, i_Y - 0.5 );
    if ( std::abs( Shown[0] ) <= 1 && std::abs( Shown[1] ) <= 1 )
    {
      const auto Needed = SensorToClip( i_rSensor, i_X - 0.5, i_Y - 0.5 );
      Reach = { std::max( Reach[0], std::abs( Needed[0] ) ), std::max( Reach[1], std::abs( Needed[1] ) ) };
    }
  };
  const double W = i_rSensor.SensorSize[0], H = i_rSensor.SensorSize[1];
  for ( int Row = 0; Row <= Samples; ++Row )
  {
    for ( int Column = 0; Column <= Samples; ++Column )
    {
      const double X = static_cast< double >( Column ) / Samples, Y = static_cast< double >( Row ) / Samples;
      Look( X * W, Y * H );
      const auto Place = ClipToSensor( i_rSensor, ( X - 0.5 ) * 1.999, ( Y - 0.5 ) * 1.999 );
      if ( Place[0] >= 0 && Place[0] <= W && Place[1] >= 0 && Place[1] <= H )
      {
        Look( Place[0], Place[1] );
      }
    }
  }
  for ( double& rReach : Reach )
  {
    // Between the samples it may reach a little farther.
    rReach = rReach > 1.001 ? std::min( std::ceil( rReach * 8 + 0.2 ) / 8, LargestReach ) : 1;
  }
  return Reach;
}

/// One for each parity of width and height, as the tile has to lie in the middle of its picture, and one of the frame.
struct VWorldTarget::VPictures
{
  struct VPicture
  {
    std::unique_ptr< QOpenGLFramebufferObject > pBuffer;
    QSize Needed; ///< at most, of late
    int Uses = 0;
  };
  std::array< VPicture, 4 > Tiles;
  VPicture Frame;

  static bool Make( VRenderContext& io_rContext, QSize i_Size, VPicture& o_rPicture )
  {
    io_rContext.BindTexture( 0, 0 ); // the unit that making one leaves without a texture
    o_rPicture.pBuffer.reset();
    o_rPicture.pBuffer = std::make_unique< QOpenGLFramebufferObject >( i_Size, QOpenGLFramebufferObject::Depth,
                                                                       GL_TEXTURE_2D, GL_RGBA8 );
    o_rPicture.Uses = 0;
    o_rPicture.Needed = {};
    return o_rPicture.pBuffer->isValid();
  }

  /// At least as large, and as even or odd.
  QOpenGLFramebufferObject* ForTile( VRenderContext& io_rContext, QSize i_Size )
  {
    const int OddX = i_Size.width() & 1, OddY = i_Size.height() & 1;
    VPicture& rPicture = Tiles[static_cast< std::size_t >( OddX + 2 * OddY )];
    const QSize Needed = rPicture.Needed.expandedTo( i_Size );
    const QSize Fitting( RoundedUp( Needed.width() ) + OddX, RoundedUp( Needed.height() ) + OddY );
    const QSize Has = rPicture.pBuffer ? rPicture.pBuffer->size() : QSize();
    const bool bTooSmall = Has.width() < i_Size.width() || Has.height() < i_Size.height();
    const bool bTooLarge = rPicture.Uses >= Patience && std::int64_t{ Has.width() } * Has.height() >
                                                            std::int64_t{ 2 } * Fitting.width() * Fitting.height();
    if ( bTooSmall || bTooLarge )
    {
      Make( io_rContext, bTooLarge ? Fitting : Fitting.expandedTo( Has ), rPicture );
    }
    rPicture.Needed = rPicture.Uses < Patience ? Needed : i_Size;
    rPicture.Uses = rPicture.Uses < Patience ? rPicture.Uses + 1 : 0;
    return rPicture.pBuffer->isValid() ? rPicture.pBuffer.get() : nullptr;
  }

  QOpenGLFramebufferObject* ForFrame( VRenderContext& io_rContext )
  {
    if ( !Frame.pBuffer || Frame.pBuffer->size() != io_rContext.FrameSize() )
    {
      Make( io_rContext, io_rContext.FrameSize(), Frame );
    }
    return Frame.pBuffer->isValid() ? Frame.pBuffer.get() : nullptr;
  }
};

struct VWorldTarget::VGl
{
  std::shared_ptr< VShaderProgram > pDistort, pCopy;
  VStaticBuffer Quad;
  VRenderState State;
  VSensorUniforms Sensor;
  VUniform DistortUnit{ "t_DiffuseTexture" }, CopyUnit{ "t_DiffuseTexture" };
};

VWorldTarget::VWorldTarget( VResources& io_rResources )
  : m_pGl( std::make_unique< VGl >() )
{
  m_pGl->pDistort = io_rResources.GetProgram( "FullScreen", "Distort" );
  m_pGl->pCopy = io_rResources.GetProgram( "FullScreen", "Copy" );
  m_pGl->Quad.SetContents( std::span( Corners ) );
  m_pGl->State.colourBlend = EColourBlendConstant;
  m_pGl->State.depthTest = false;
  m_pGl->State.depthWrite = false;
}

VWorldTarget::~VWorldTarget() = default;

VWorldTarget::VPictures& VWorldTarget::PicturesOf( VRenderContext& io_rContext )
{
  std::shared_ptr< void >& rpHeld = io_rContext.Belonging( &PicturesKey );
  if ( !rpHeld )
  {
    rpHeld = std::make_shared< VPictures >();
  }
  return *static_cast< VPictures* >( rpHeld.get() );
}

const std::array< double, 2 >& VWorldTarget::ReachOf( std::size_t i_Camera )
{
  if ( i_Camera >= m_Reaches.size() )
  {
    m_Reaches.resize( i_Camera + 1 );
  }
  VReach& rReach = m_Reaches[i_Camera];
  if ( rReach.Sensor != m_Sensor )
  {
    rReach = { m_Sensor, LensReach( m_Sensor ) };
  }
  return rReach.Reach;
}

bool VWorldTarget::Begin( VRenderContext& io_rContext, const ZEK::IRenderCamera& i_rCamera,
                          const VSceneOptions& i_rOptions, bool i_bLens )
{
  m_bLens = i_bLens;
  m_Viewport = io_rContext.Viewport();
  m_Scissor = io_rContext.Scissor();
  m_View2D = m_PictureView2D = io_rContext.View2D();
  m_pBefore = io_rContext.Framebuffer();
  m_Sensor = MakeSensorView( i_rCamera, i_rOptions, m_View2D, true );
  VPictures& rPictures = PicturesOf( io_rContext );
  QSize Used = m_Viewport.size();
  if ( i_bLens )
  {
    const auto& rReach = ReachOf( i_rCamera.GetInfo().Number );
    const auto Larger = []( int i_Size, double i_Reach )
    {
      return i_Size + 2 * static_cast< int >( std::ceil( i_Size * ( i_Reach - 1 ) / 2 ) );
    };
    Used = { Larger( Used.width(), rReach[0] ), Larger( Used.height(), rReach[1] ) };
    m_pPicture = rPictures.ForTile( io_rContext, Used );
  }
  else
  {
    m_pPicture = rPictures.ForFrame( io_rContext );
  }
  if ( !m_pPicture )
  {
    // Making it may have left another one bound.
    io_rContext.BindFramebuffer( m_pBefore );
    if ( !std::exchange( m_bRefusalLogged, true ) )
    {
      ZEK::Log( LogCategory(), ZEK::ELogWarning,
                "The device refuses a picture for the world: it is drawn without distortion and opaque" );
    }
    return false;
  }
  m_PictureSize = m_pPicture->size();
  io_rContext.BindFramebuffer( m_pPicture );
  io_rContext.SetClearColour( QColor( 0, 0, 0, 0 ) );
  if ( i_bLens )
  {
    const QRect All( QPoint( 0, 0 ), m_PictureSize );
    m_PictureView2D.setX( m_View2D.x() * static_cast< float >( m_Viewport.width() ) /
                          static_cast< float >( m_PictureSize.width() ) );
    m_PictureView2D.setY( m_View2D.y() * static_cast< float >( m_Viewport.height() ) /
                          static_cast< float >( m_PictureSize.height() ) );
    io_rContext.SetViewport( All );
    io_rContext.SetScissor( All );
    io_rContext.Clear( true, true );
    io_rContext.SetScissor(
        QRect( QPoint( ( m_PictureSize.width() - Used.width() ) / 2, ( m_PictureSize.height() - Used.height() ) / 2 ),
               Used ) );
  }
  else
  {
    io_rContext.SetScissor( m_Scissor );
    io_rContext.Clear( true, true );
  }
  io_rContext.SetProjection( ImageProjection( i_rCamera, i_rOptions, m_PictureView2D ) );
  m_Projection = ImageProjection( i_rCamera, i_rOptions, m_View2D );
  m_DrawsAtBegin = io_rContext.DrawCalls();
  m_bOpen = true;
  return true;
}

void VWorldTarget::End( VRenderContext& io_rContext, float i_Opacity )
{
  m_bOpen = false;
  io_rContext.BindFramebuffer( m_pBefore );
  io_rContext.SetScissor( m_Scissor );
  if ( io_rContext.DrawCalls() != m_DrawsAtBegin )
  {
    Lay( io_rContext, i_Opacity );
  }
  io_rContext.SetViewport( m_Viewport );
  io_rContext.SetView2D( m_View2D );
  io_rContext.SetProjection( m_Projection );
}

void VWorldTarget::Lay( VRenderContext& io_rContext, float i_Opacity )
{
  // The program reads the place of a pixel from where it is in the picture: the picture's viewport lies around the
  // tile's, and the view is that of the picture.
  QRect Around( QPoint( 0, 0 ), m_PictureSize );
  Around.moveTopLeft( m_Viewport.topLeft() - QPoint( ( m_PictureSize.width() - m_Viewport.width() ) / 2,
                                                     ( m_PictureSize.height() - m_Viewport.height() ) / 2 ) );
  io_rContext.SetViewport( m_bLens ? Around : m_Viewport );
  io_rContext.SetView2D( m_PictureView2D );
  const auto& rpProgram = m_bLens ? m_pGl->pDistort : m_pGl->pCopy;
  if ( !io_rContext.UseProgram( rpProgram ) || !io_rContext.SetVertexBuffer( { &m_pGl->Quad, &CornerLayout, 0 } ) )
  {
    return;
  }
  m_pGl->State.blendConstant = i_Opacity;
  io_rContext.SetRenderState( m_pGl->State );
  io_rContext.BindFramebufferTexture( 0, m_pPicture );
  ( m_bLens ? m_pGl->DistortUnit : m_pGl->CopyUnit ).Set( *rpProgram, 0 );
  if ( m_bLens )
  {
    m_pGl->Sensor.Set( *rpProgram, m_Sensor );
  }
  io_rContext.DrawArrays( GL_TRIANGLE_FAN, 4 );
  io_rContext.BindTexture( 0, 0 );
}

} // namespace MoxelGraphics
