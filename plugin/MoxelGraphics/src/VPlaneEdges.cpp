#include "VPlaneEdges.h"

#include <MoxelGraphics/VMoxelScene.h>

#include <ComputeCameraModel/VCameraModel.h>
#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>
#include <CoreMoxelTypes/Camera.h>

#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

const VVertexLayout PlaneLayout( 8, 0, { { EAttributePosition, 2, GL_FLOAT, false, 0 } } );

std::array< float, 2 > Corrected( const ComputeCameraModel::VCameraModel& i_rModel, float i_X, float i_Y )
{
  const auto& [CentreX, CentreY] = i_rModel.DistortionCentre;
  if ( CentreX == 0 && CentreY == 0 )
  {
    return { i_X, i_Y };
  }
  const auto& [K1, K2, K3] = i_rModel.DistortionParameters;
  const float X = i_X - CentreX, Y = i_Y - CentreY, D = X * X + Y * Y;
  const float Scale = 1 + D * ( K1 + D * ( K2 + D * K3 ) );
  return { CentreX + Scale * X, CentreY + Scale * Y };
}
} // namespace

VPlaneEdges::VPlaneEdges( const VMoxelScene& i_rScene )
  : m_pProgram( i_rScene.Resources()->GetProgram( "Edge3D", "Colour" ) )
{
  m_State.depthFunction = EDepthLessOrEqual;
}

void VPlaneEdges::Take( const std::vector< ZEK::VRenderCameraRef >& i_rCameras,
                        std::span< const VCameraPictures > i_Pictures )
{
  const std::size_t Count = std::min( i_rCameras.size(), i_Pictures.size() );
  bool bChanged = m_Taken.size() != Count;
  m_Taken.resize( Count );
  for ( std::size_t Index = 0; Index < Count; ++Index )
  {
    const VTaken New{ i_Pictures[Index].EdgesGeneration, i_rCameras[Index]->GetInfo().ChangeCount };
    bChanged = bChanged || ( m_Taken[Index] != New && ( New.Generation != 0 || m_Taken[Index].Generation != 0 ) );
    m_Taken[Index] = New;
  }
  if ( !bChanged )
  {
    return;
  }
  ++m_Generation;
  m_Vertices.clear();
  m_Parts.clear();
  for ( std::size_t Index = 0; Index < Count; ++Index )
  {
    const CoreMoxelTypes::VEdgePairSet* const pEdges = i_Pictures[Index].pEdges;
    const ZEK::IRenderCamera& rCamera = *i_rCameras[Index];
    if ( !pEdges || !rCamera.GetInfo().bCalibrated || !rCamera.GetModel().IsFinite() )
    {
      continue;
    }
    const std::size_t First = m_Vertices.size() / 2;
    for ( const CoreMoxelTypes::VEdgePair& rPair : pEdges->Pairs )
    {
      const float Y = pEdges->SensorScale.y * rPair.y + pEdges->SensorOffset.y;
      const float Left = pEdges->SensorScale.x * ( rPair.Left - 0.5F ) + pEdges->SensorOffset.x;
      const float Right = pEdges->SensorScale.x * ( rPair.Right - 0.5F ) + pEdges->SensorOffset.x;
      if ( std::isfinite( Left ) && std::isfinite( Right ) && std::isfinite( Y ) )
      {
        const auto A = Corrected( rCamera.GetModel(), Left, Y ), B = Corrected( rCamera.GetModel(), Right, Y );
        m_Vertices.insert( m_Vertices.end(), { A[0], A[1], B[0], B[1] } );
      }
    }
    if ( const std::size_t Own = m_Vertices.size() / 2 - First; Own != 0 )
    {
      m_Parts.push_back( { i_rCameras[Index], First, Own } );
    }
  }
}

void VPlaneEdges::Draw( CoreGraphics::VRenderContext& io_rContext )
{
  if ( m_Parts.empty() || !m_Buffer.Feed( m_Vertices, m_Generation ) || !io_rContext.UseProgram( m_pProgram ) ||
       !io_rContext.SetVertexBuffer( { &m_Buffer.Buffer, &PlaneLayout, 0 } ) )
  {
    return;
  }
  io_rContext.SetRenderState( m_State );
  // The program takes half a pixel off what is an edge of an image; what is given here was taken to the sensor before.
  m_OffsetScale.Set( *m_pProgram, QVector4D( 0.5F, 0, 1, 1 ) );
  for ( const VPart& rPart : m_Parts )
  {
    const ZEK::VRenderCameraInfo& rInfo = rPart.pCamera->GetInfo();
    m_Sensor.Set( *m_pProgram,
                  QVector2D( static_cast< float >( rInfo.SensorWidth ), static_cast< float >( rInfo.SensorHeight ) ) );
    // The constructor reads rows.
    m_Transform.Set( *m_pProgram, QMatrix4x4( rPart.pCamera->GetModel().FrustumTransform.data() ).transposed() );
    io_rContext.DrawArrays( GL_LINES, static_cast< int >( rPart.Count ), static_cast< int >( rPart.First ) );
  }
}

} // namespace MoxelGraphics
