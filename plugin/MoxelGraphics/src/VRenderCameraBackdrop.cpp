#include <MoxelGraphics/VRenderCameraBackdrop.h>

#include "Log.h"
#include "VVideoTextures.h"
#include "VWorldTarget.h"

#include <MoxelGraphics/CameraDistortion.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <ComputeCameraModel/VCameraModel.h>
#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

#include <QtCore/QHash>

#include <algorithm>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;
using namespace CoreMoxelTypes;
using CoreVideoUtils::EPixelFamily;

constexpr int Cells = 32; ///< along each side of the net that a lens bends
constexpr int NetVertices = Cells * Cells * 6;
constexpr VVertexLayout PlaceLayout( 8, 0, { { EAttributePosition, 2 } } );
const QVector4D Black( 0, 0, 0, 1 );
const QVector4D Refused( 0.25F, 0.02F, 0.02F, 1 ); ///< a sensor whose video cannot be shown

/// The unit square as a net of triangles, and behind them as a fan.
std::vector< QVector2D > Net()
{
  std::vector< QVector2D > Places;
  Places.reserve( NetVertices + 4 );
  const auto Place = []( int i_X, int i_Y )
  {
    return QVector2D( static_cast< float >( i_X ), static_cast< float >( i_Y ) ) / static_cast< float >( Cells );
  };
  for ( int Y = 0; Y < Cells; ++Y )
  {
    for ( int X = 0; X < Cells; ++X )
    {
      Places.insert( Places.end(), { Place( X, Y ), Place( X + 1, Y ), Place( X, Y + 1 ), Place( X, Y + 1 ),
                                     Place( X + 1, Y ), Place( X + 1, Y + 1 ) } );
    }
  }
  Places.insert( Places.end(), { { 0, 0 }, { 1, 0 }, { 1, 1 }, { 0, 1 } } );
  return Places;
}

/// By which everything lies behind the far plane.
QMatrix4x4 Nowhere()
{
  return { 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 2, 0, 0, 0, 1 };
}

float WorldOpacity( const VSceneOptions& i_rOptions )
{
  const double Opacity = i_rOptions.Opacity3DOverlay;
  return std::isfinite( Opacity ) ? static_cast< float >( std::clamp( Opacity, 0.0, 1.0 ) ) : 1.0F;
}

/// Where a frame's image is found from a place on the sensor, 0 to 1: scale and offset. `i_Columns` are those of the
/// texture.
QVector4D VideoPlace( const VVideoFrame& i_rFrame, const ZEK::VRenderCameraInfo& i_rInfo, u32 i_Columns )
{
  const V2 Scale = i_rFrame.SensorScale, Offset = i_rFrame.SensorOffset;
  const float W = static_cast< float >( i_rFrame.Width ), H = static_cast< float >( i_rFrame.Height );
  const bool bTold = Scale.x != 1 || Scale.y != 1 || Offset.x != 0 || Offset.y != 0;
  const bool bUsable = std::isfinite( Scale.x + Scale.y + Offset.x + Offset.y ) && Scale.x > 0 && Scale.y > 0;
  QVector4D Place( 1, 1, 0, 0 );
  if ( bTold && bUsable )
  {
    // Told between centres of pixels, needed between corners.
    Place = { static_cast< float >( i_rInfo.SensorWidth ) / ( Scale.x * W ),
              static_cast< float >( i_rInfo.SensorHeight ) / ( Scale.y * H ),
              ( 0.5F - ( 0.5F + Offset.x ) / Scale.x ) / W, ( 0.5F - ( 0.5F + Offset.y ) / Scale.y ) / H };
  }
  const float Share = W / static_cast< float >( i_Columns );
  return { Place.x() * Share, Place.y(), Place.z() * Share, Place.w() };
}

/// Whether the image reaches to all borders of the sensor.
bool Covers( const QVector4D& i_rPlace )
{
  constexpr float Slack = 1e-4F;
  return std::min( i_rPlace.z(), i_rPlace.w() ) >= -Slack &&
         std::max( i_rPlace.x() + i_rPlace.z(), i_rPlace.y() + i_rPlace.w() ) <= 1 + Slack;
}

/// One program of the vertex source `Video`.
struct VLook
{
  std::shared_ptr< VShaderProgram > pProgram;
  VSensorUniforms Sensor;
  VUniform ScaleAndOffset{ "u_VideoScaleAndOffset" }, Inverted{ "u_Inverted" };
  VUniform Gamma{ "u_GammaCorrection" }, Saturation{ "u_VideoSaturation" };
  VUniform Texture{ "t_Texture" }, TextureY{ "t_TextureY" }, TextureU{ "t_TextureU" }, TextureV{ "t_TextureV" };
  VUniform PhaseX{ "u_PhaseX" }, PhaseY{ "u_PhaseY" }, ChromaFirst{ "u_ChromaFirst" };
  VUniform Wide{ "u_Wide" }, Paired{ "u_Paired" }, ChromaTrim{ "u_ChromaTrim" };
  VUniform Opacity{ "u_Opacity" };

  /// What follows from the format alone.
  void SetFormat( const VVideoTextures& i_rVideo )
  {
    VShaderProgram& rProgram = *pProgram;
    const EPixelFormat Format = i_rVideo.Frame().Format;
    Texture.Set( rProgram, 0 );
    TextureY.Set( rProgram, 0 );
    TextureU.Set( rProgram, 1 );
    TextureV.Set( rProgram, Format == EPixelFormat::NV12 ? 1 : 2 );
    const auto Phase = CoreVideoUtils::BayerPhase( Format );
    PhaseX.Set( rProgram, Phase[0] );
    PhaseY.Set( rProgram, Phase[1] );
    ChromaFirst.Set( rProgram, Format == EPixelFormat::UYVY ? 1 : 0 );
    Wide.Set( rProgram, Format == EPixelFormat::Luminance16 ? 1 : 0 );
    Paired.Set( rProgram, Format == EPixelFormat::NV12 ? 1 : 0 );
    ChromaTrim.Set( rProgram, i_rVideo.ChromaTrim() );
  }
};
} // namespace

/// A camera of the provider and what is on the GPU for it.
struct VRenderCameraBackdrop::VKept
{
  ZEK::VRenderCameraRef pCamera;
  VVideoTextures Video;
  VImageTextures Images;
  ZEK::IResult Logged;

  bool IsIn( const ZEK::IRenderCameraProvider& i_rProvider ) const
  {
    const auto& rList = i_rProvider.GetCameras();
    const std::uint32_t Number = pCamera->GetInfo().Number;
    return Number < rList.size() && rList[Number] == pCamera;
  }
  void Free()
  {
    Video.Free();
    Images.Free();
  }
};

struct VRenderCameraBackdrop::VParts
{
  explicit VParts( VResources& io_rResources )
    : World( io_rResources )
  {
    const char* const Names[] = { "VideoLuminance", "VideoBayer", "VideoYUV", "VideoYUVPlanar" }; // by family
    for ( std::size_t Family = 0; Family < Looks.size(); ++Family )
    {
      Looks[Family].pProgram = io_rResources.GetProgram( "Video", Names[Family] );
    }
    Image.pProgram = io_rResources.GetProgram( "Video", "VideoImage" );
    pFill = io_rResources.GetProgram( "Frame", "UniformColour" );
    const std::vector< QVector2D > Places = Net();
    Square.SetContents( std::span( Places ) );
    State.depthTest = false;
    State.depthWrite = false;
  }

  QHash< QString, std::shared_ptr< VKept > > Kept;
  std::array< VLook, 4 > Looks;
  VLook Image;
  std::shared_ptr< VShaderProgram > pFill;
  VSensorUniforms SensorOfFill;
  VUniform FillColour{ "u_Colour" };
  VStaticBuffer Square;
  VRenderState State;
  VWorldTarget World;
  float Opacity = 1;
  VSensorView Sensor; ///< of the camera that is being drawn
};

VRenderCameraBackdrop::VRenderCameraBackdrop( VMoxelScene& i_rScene,
                                              std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider )
  : m_rScene( i_rScene )
  , m_pProvider( std::move( i_pProvider ) )
  , m_pParts( std::make_unique< VParts >( *i_rScene.Resources() ) )
{
}

VRenderCameraBackdrop::~VRenderCameraBackdrop() = default;

std::size_t VRenderCameraBackdrop::CameraCount() const
{
  return static_cast< std::size_t >( m_pParts->Kept.size() );
}

void VRenderCameraBackdrop::DropAbsent()
{
  if ( m_CameraGeneration == m_rScene.CameraGeneration() )
  {
    return;
  }
  m_CameraGeneration = m_rScene.CameraGeneration();
  for ( auto It = m_pParts->Kept.begin(); It != m_pParts->Kept.end(); )
  {
    It = ( *It )->IsIn( *m_pProvider ) ? std::next( It ) : m_pParts->Kept.erase( It );
  }
}

VRenderCameraBackdrop::VKept* VRenderCameraBackdrop::Find( const QString& i_rName )
{
  const auto It = m_pParts->Kept.constFind( i_rName );
  if ( It != m_pParts->Kept.constEnd() && ( *It )->IsIn( *m_pProvider ) )
  {
    return It->get();
  }
  ZEK::VRenderCameraRef pCamera = m_pProvider->GetCamera( i_rName.toStdString() );
  if ( !pCamera )
  {
    m_pParts->Kept.remove( i_rName );
    return nullptr;
  }
  const auto pNew = std::make_shared< VKept >();
  pNew->pCamera = std::move( pCamera );
  m_pParts->Kept.insert( i_rName, pNew );
  return pNew.get();
}

bool VRenderCameraBackdrop::RenderBackdrop( VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  DropAbsent();
  VKept* const pKept = Find( i_rOptions.OverlayCamera );
  io_rContext.SetView( {} );
  io_rContext.SetProjection( Nowhere() );
  if ( !pKept || io_rContext.Viewport().isEmpty() )
  {
    return false;
  }
  const ZEK::IRenderCamera& rCamera = *pKept->pCamera;
  const ZEK::VRenderCameraInfo& rInfo = rCamera.GetInfo();
  const bool bSensor = rInfo.SensorWidth != 0 && rInfo.SensorHeight != 0;
  if ( bSensor && io_rContext.RenderMode() == ERenderModeNormal )
  {
    m_pParts->Sensor = MakeSensorView( rCamera, i_rOptions, io_rContext.View2D() );
    DrawVideo( io_rContext, i_rOptions, *pKept );
    DrawImages( io_rContext, i_rOptions, *pKept );
  }
  m_pParts->Opacity = WorldOpacity( i_rOptions );
  // What is not to be seen is not to be picked either.
  if ( !bSensor || !rInfo.bCalibrated || !i_rOptions.Show3DOverlay || m_pParts->Opacity == 0 )
  {
    return false;
  }
  // The matrix is column-major, the constructor reads rows.
  io_rContext.SetView( QMatrix4x4( rCamera.GetModel().CameraFromWorld.data() ).transposed() );
  // A translucent world is picked and marked as an opaque one is.
  const bool bTranslucent = m_pParts->Opacity < 1 && io_rContext.RenderMode() == ERenderModeNormal;
  const bool bApart = ( i_rOptions.Distort3D || bTranslucent ) &&
                      m_pParts->World.Begin( io_rContext, rCamera, i_rOptions, i_rOptions.Distort3D );
  if ( !bApart )
  {
    io_rContext.SetProjection( ImageProjection( rCamera, i_rOptions, io_rContext.View2D() ) );
  }
  return true;
}

void VRenderCameraBackdrop::Render( VRenderContext& io_rContext, const VSceneOptions&, std::uint32_t i_Pass )
{
  DropAbsent();
  if ( i_Pass == ERenderPassOverlay && m_pParts->World.IsOpen() )
  {
    m_pParts->World.End( io_rContext, m_pParts->Opacity );
  }
}

void VRenderCameraBackdrop::DrawVideo( VRenderContext& io_rContext, const VSceneOptions& i_rOptions, VKept& io_rKept )
{
  const VVideoFrame* const pFrame = io_rKept.pCamera->GetVideoFrame();
  if ( !pFrame )
  {
    io_rKept.Video.Free();
  }
  if ( !pFrame || !i_rOptions.Video )
  {
    return;
  }
  const std::uint64_t Before = io_rKept.Video.BytesWritten();
  const ZEK::IResult Result = io_rKept.Video.Take( io_rContext, *pFrame );
  m_BytesUploaded += io_rKept.Video.BytesWritten() - Before;
  if ( Result.IsError() )
  {
    FillSensor( io_rContext, Refused );
    if ( Result.Code() != io_rKept.Logged.Code() )
    {
      ZEK::Log( LogCategory(), ZEK::ELogWarning, "The video of \"%1%\" cannot be shown: %2%",
                io_rKept.pCamera->GetName(), Result.Text() );
    }
    io_rKept.Logged = Result;
    return;
  }
  io_rKept.Logged = Result;
  const ZEK::VRenderCameraInfo& rInfo = io_rKept.pCamera->GetInfo();
  const QVector4D Place = VideoPlace( *pFrame, rInfo, io_rKept.Video.TextureColumns() );
  if ( !Covers( Place ) )
  {
    FillSensor( io_rContext, Black );
  }
  EPixelFamily Family = CoreVideoUtils::FamilyOf( pFrame->Format );
  const bool bRaw = i_rOptions.DebugVideo == 1, bPlain = i_rOptions.DebugVideo != 0;
  const bool bPacked = Family == EPixelFamily::YUV;
  Family = bRaw && !bPacked ? EPixelFamily::Luminance : Family;
  VLook& rLook = m_pParts->Looks[static_cast< std::size_t >( Family )];
  if ( !io_rContext.UseProgram( rLook.pProgram ) )
  {
    return;
  }
  io_rKept.Video.Bind( io_rContext );
  rLook.SetFormat( io_rKept.Video );
  rLook.Sensor.Set( *rLook.pProgram, m_pParts->Sensor );
  rLook.ScaleAndOffset.Set( *rLook.pProgram, Place );
  rLook.Inverted.Set( *rLook.pProgram, ( pFrame->Flags & CoreVideoUtils::VideoBottomUp ) != 0 ? 1 : 0 );
  rLook.Gamma.Set( *rLook.pProgram, bPlain ? 1.0F : rInfo.GammaCorrection );
  rLook.Saturation.Set( *rLook.pProgram, bRaw ? 0.0F : bPlain ? 1.0F : rInfo.VideoSaturation );
  m_pParts->State.colourBlend = EColourBlendNone;
  DrawSensor( io_rContext );
}

void VRenderCameraBackdrop::DrawImages( VRenderContext& io_rContext, const VSceneOptions& i_rOptions, VKept& io_rKept )
{
  std::uint64_t Id = 0;
  const VImageSet* const pSet = io_rKept.pCamera->GetImageSet( Id );
  if ( !pSet )
  {
    io_rKept.Images.Free();
  }
  const float Opacity = i_rOptions.ImageSetOpacity;
  if ( !pSet || !( Opacity > 0 ) )
  {
    return;
  }
  const std::uint64_t Before = io_rKept.Images.BytesWritten();
  io_rKept.Images.Take( io_rContext, *pSet, Id, i_rOptions.ImageSetSearchExpression );
  m_BytesUploaded += io_rKept.Images.BytesWritten() - Before;
  VLook& rLook = m_pParts->Image;
  if ( io_rKept.Images.Found().empty() || !io_rContext.UseProgram( rLook.pProgram ) )
  {
    return;
  }
  rLook.Sensor.Set( *rLook.pProgram, m_pParts->Sensor );
  rLook.ScaleAndOffset.Set( *rLook.pProgram, QVector4D( 1, 1, 0, 0 ) );
  rLook.Inverted.Set( *rLook.pProgram, 0 );
  rLook.Texture.Set( *rLook.pProgram, 0 );
  rLook.Opacity.Set( *rLook.pProgram, std::min( Opacity, 1.0F ) );
  m_pParts->State.colourBlend = EColourBlendAlpha;
  for ( const VTexture* const pTexture : io_rKept.Images.Found() )
  {
    pTexture->Bind( io_rContext, 0 );
    DrawSensor( io_rContext );
  }
}

void VRenderCameraBackdrop::FillSensor( VRenderContext& io_rContext, const QVector4D& i_rColour )
{
  if ( !io_rContext.UseProgram( m_pParts->pFill ) )
  {
    return;
  }
  m_pParts->SensorOfFill.Set( *m_pParts->pFill, m_pParts->Sensor );
  m_pParts->FillColour.Set( *m_pParts->pFill, i_rColour );
  m_pParts->State.colourBlend = EColourBlendNone;
  DrawSensor( io_rContext );
}

void VRenderCameraBackdrop::DrawSensor( VRenderContext& io_rContext )
{
  if ( !io_rContext.SetVertexBuffer( { &m_pParts->Square, &PlaceLayout, 0 } ) )
  {
    return;
  }
  io_rContext.SetRenderState( m_pParts->State );
  if ( m_pParts->Sensor.DistortionCentre != std::array< float, 2 >{} )
  {
    io_rContext.DrawArrays( GL_TRIANGLES, NetVertices );
  }
  else
  {
    io_rContext.DrawArrays( GL_TRIANGLE_FAN, 4, NetVertices );
  }
}

} // namespace MoxelGraphics
