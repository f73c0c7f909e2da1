#include <MoxelGraphics/VRenderCameras.h>

#include "VCameraWorld.h"
#include "VPlaneEdges.h"
#include "VTilePictures.h"

#include <MoxelGraphics/CentroidPick.h>
#include <MoxelGraphics/VCameraGreyscale.h>
#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <ComputeCameraModel/VCameraModel.h>
#include <CoreMoxelTypes/Camera.h>

namespace MoxelGraphics
{

std::uint32_t CellCount( const CoreMoxelTypes::VCameraMaskGrid& i_rMask )
{
  const std::size_t Count = std::size_t{ i_rMask.Columns } * i_rMask.Rows;
  const bool bAgree = i_rMask.CellWidth != 0 && i_rMask.CellHeight != 0 && i_rMask.Cells.size() == Count;
  return bAgree ? static_cast< std::uint32_t >( Count ) : 0;
}

struct VRenderCameras::VParts
{
  VParts( VMoxelScene& i_rScene, const std::shared_ptr< const ZEK::IRenderCameraProvider >& i_rpProvider )
    : World( i_rScene )
    , Edges( i_rScene )
    , Pictures( i_rScene, i_rpProvider )
    , Greyscale( i_rScene, i_rpProvider )
  {
  }
  VCameraWorld World;
  VPlaneEdges Edges;
  VTilePictures Pictures;
  VCameraGreyscale Greyscale;
};

VRenderCameras::VRenderCameras( VMoxelScene& i_rScene, std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider )
  : m_rScene( i_rScene )
  , m_pProvider( std::move( i_pProvider ) )
  , m_pParts( std::make_unique< VParts >( i_rScene, m_pProvider ) )
{
}

VRenderCameras::~VRenderCameras() = default;

bool VRenderCameras::TakeCameras()
{
  const std::vector< ZEK::VRenderCameraRef >& rCameras = m_pProvider->GetCameras();
  bool bChanged = rCameras.size() != m_Taken.size();
  m_Taken.resize( rCameras.size() );
  for ( std::size_t Index = 0; Index < rCameras.size(); ++Index )
  {
    const std::int32_t ChangeCount = rCameras[Index]->GetInfo().ChangeCount;
    if ( m_Taken[Index].pCamera != rCameras[Index] || m_Taken[Index].ChangeCount != ChangeCount )
    {
      m_Taken[Index] = { rCameras[Index], ChangeCount };
      bChanged = true;
    }
  }
  if ( !bChanged )
  {
    return false;
  }
  m_pParts->Pictures.CamerasChanged();
  VCameraPlaces& rPlaces = m_pParts->World.Places();
  rPlaces.Bodies.clear();
  rPlaces.Frustums.clear();
  m_NewBodies.clear();
  for ( const ZEK::VRenderCameraRef& rpCamera : rCameras )
  {
    const ComputeCameraModel::VCameraModel& rModel = rpCamera->GetModel();
    if ( rpCamera->GetInfo().bCalibrated && rModel.IsFinite() )
    {
      rPlaces.Bodies.push_back( rModel.WorldFromCamera );
      rPlaces.Frustums.push_back( rModel.FrustumTransform );
      m_NewBodies.push_back( rpCamera );
    }
  }
  m_pParts->World.PlacesChanged();
  m_Bodies.swap( m_NewBodies );
  const bool bOther = m_Bodies != m_NewBodies;
  // Cameras that departed are not held.
  m_NewBodies.clear();
  return bOther;
}

void VRenderCameras::SetIds( std::uint32_t i_FirstId, std::span< const std::uint8_t > i_Flags )
{
  m_FirstId = i_FirstId;
  m_pParts->World.SetIds( i_FirstId, i_Flags );
}

void VRenderCameras::SetPictures( std::span< const VCameraPictures > i_Pictures, double i_Frame )
{
  m_pParts->Pictures.SetPictures( i_Pictures, i_Frame );
  m_pParts->Edges.Take( m_pProvider->GetCameras(), i_Pictures );
}

void VRenderCameras::SetPicturesFrame( double i_Frame )
{
  m_pParts->Pictures.SetFrame( i_Frame );
}

void VRenderCameras::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                             std::uint32_t i_Pass )
{
  if ( i_Pass == ERenderPassOpaque )
  {
    RenderOpaque( io_rContext, i_rOptions );
  }
  else if ( i_Pass == ERenderPassOverlay )
  {
    // A camera that is only looked through in the 3D view has no tile.
    if ( i_rOptions.CameraView && !i_rOptions.OverlayCamera.isEmpty() )
    {
      m_pParts->Pictures.Collect( io_rContext, i_rOptions );
      m_pParts->Greyscale.Collect( io_rContext, i_rOptions );
    }
  }
  else if ( i_Pass == ERenderPassTranslucent && io_rContext.RenderMode() == ERenderModeNormal && i_rOptions.Cameras &&
            i_rOptions.CameraFrustums && i_rOptions.OverlayCamera.isEmpty() )
  {
    m_pParts->World.DrawFaces( io_rContext, m_PrimaryColour );
  }
}

void VRenderCameras::RenderOpaque( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  VCameraWorld& rWorld = m_pParts->World;
  const int Mode = io_rContext.RenderMode();
  const bool bIds = Mode != ERenderModeNormal;
  if ( !i_rOptions.Cameras || rWorld.Count() == 0 || ( bIds && rWorld.FirstId() == 0 ) ||
       ( Mode == ERenderModeHighlight && !rWorld.IsMarked() ) )
  {
    return;
  }
  if ( i_rOptions.CameraCylinder )
  {
    rWorld.DrawBodies( io_rContext );
  }
  // Among what a camera sees the lines about it, and about others, are in the way.
  if ( !i_rOptions.OverlayCamera.isEmpty() )
  {
    return;
  }
  if ( bIds )
  {
    // The lines are there to be clicked; the outline goes about the body where there is one.
    if ( i_rOptions.CameraFrustums && ( Mode == ERenderModeSelection || !i_rOptions.CameraCylinder ) )
    {
      rWorld.DrawFrustumIds( io_rContext );
    }
    return;
  }
  if ( i_rOptions.CameraAxes )
  {
    rWorld.DrawAxes( io_rContext );
  }
  if ( i_rOptions.CameraFrustums )
  {
    DrawFrustums( io_rContext, false );
    DrawFrustums( io_rContext, true );
    if ( i_rOptions.CameraGreyscale )
    {
      m_pParts->Edges.Draw( io_rContext );
    }
  }
  if ( i_rOptions.CameraRays )
  {
    rWorld.DrawRays( io_rContext );
  }
}

void VRenderCameras::DrawFrustums( CoreGraphics::VRenderContext& io_rContext, bool i_bSelected )
{
  m_pParts->World.DrawFrustums( io_rContext, i_bSelected, m_PrimaryColour );
}

void VRenderCameras::RenderTiles( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  m_pParts->Pictures.DrawUnder( io_rContext, i_rOptions );
  m_pParts->Greyscale.DrawTiles( io_rContext, i_rOptions );
  m_pParts->Pictures.DrawOver( io_rContext, i_rOptions );
}

void VRenderCameras::PickInRect( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                                 const QRect& i_rRect, std::vector< std::uint32_t >& io_rIds )
{
  PickCentroidsInRect( *m_pProvider, io_rContext, i_rOptions, i_rRect, io_rIds );
}

} // namespace MoxelGraphics
