#include <Flow2Graphics/VFlowRenderCamera.h>

#include "VCameraDrawData.h"

#include <CoreMoxelTypes/Camera.h>

#include <algorithm>
#include <cmath>
#include <limits>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;

constexpr float BodyBehindCentre = 50; // mm
constexpr std::uint32_t VideoFlag = 2;

const VVariant* Find( const VCameraSettings& i_rSettings, const char* i_pKey )
{
  const auto It = i_rSettings.Values.find( i_pKey );
  return It == i_rSettings.Values.end() ? nullptr : &It->second;
}

double Number( const VCameraSettings& i_rSettings, const char* i_pKey, double i_Default )
{
  const VVariant* const pValue = Find( i_rSettings, i_pKey );
  double Value = i_Default;
  if ( const auto* const pReal = pValue ? std::get_if< f64 >( pValue ) : nullptr )
  {
    Value = *pReal;
  }
  else if ( const auto* const pWhole = pValue ? std::get_if< std::int64_t >( pValue ) : nullptr )
  {
    Value = static_cast< double >( *pWhole );
  }
  return std::isfinite( Value ) ? Value : i_Default;
}

template < typename T >
T Get( const VCameraSettings& i_rSettings, const char* i_pKey, T i_Default )
{
  const VVariant* const pValue = Find( i_rSettings, i_pKey );
  const T* const pTyped = pValue ? std::get_if< T >( pValue ) : nullptr;
  return pTyped ? *pTyped : std::move( i_Default );
}
} // namespace

void VCameraMarks::Clear()
{
  Device = 0;
  Centroids.clear();
  Blobs.clear();
  MaskCells.clear();
}

VFlowRenderCamera::VFlowRenderCamera( std::string i_Name, std::shared_ptr< const VCameraColours > i_pColours )
  : m_Name( std::move( i_Name ) )
  , m_pDrawData( std::make_unique< VCameraDrawData >( std::move( i_pColours ) ) )
{
}

VFlowRenderCamera::~VFlowRenderCamera() = default;

bool VFlowRenderCamera::GetGreyscaleFlag() const
{
  const auto* const pSet = Value< VGreyscaleBlobSet >( ECameraGreyscaleBlobs );
  return pSet && pSet->Complete;
}

bool VFlowRenderCamera::GetVideoFlag() const
{
  const VVideoFrame* const pFrame = GetVideoFrame();
  return pFrame && ( pFrame->Flags & VideoFlag ) != 0;
}

const VVideoFrame* VFlowRenderCamera::GetVideoFrame() const
{
  return Value< VVideoFrame >( ECameraVideoFrame );
}

const VImageSet* VFlowRenderCamera::GetImageSet( std::uint64_t& o_rId ) const
{
  const ZEK::IFlowItem* const pItem = GetItem( ECameraImageSet );
  o_rId = pItem ? static_cast< std::uint64_t >( pItem->Id().Number ) ^ std::uint64_t{ pItem->Id().Salt } << 32 : 0;
  return Value< VImageSet >( ECameraImageSet );
}

std::size_t VFlowRenderCamera::CentroidCount() const
{
  const auto* const pSet = Value< VCentroidSet >( ECameraCentroids );
  return pSet ? pSet->Centroids.size() : 0;
}

std::size_t VFlowRenderCamera::BlobCount() const
{
  const auto* const pSet = Value< VGreyscaleBlobSet >( ECameraGreyscaleBlobs );
  return pSet ? pSet->Blobs.size() : 0;
}

void VFlowRenderCamera::GetDrawData2D( std::uint32_t i_Id, ZEK::ECentroidColourScheme i_Mode, bool i_bWide,
                                       ZEK::VCameraLists2D& o_rLists, ZEK::VDrawWords& o_rColours ) const
{
  m_pDrawData->Get2D( { *this, m_Marks }, i_Id, i_Mode, i_bWide, o_rLists, o_rColours );
}

void VFlowRenderCamera::GetDrawData3D( ZEK::VDrawWords& o_rIds, ZEK::VCameraLists3D& o_rLists,
                                       ZEK::ECentroidColourScheme i_Colours ) const
{
  m_pDrawData->Get3D( { *this, m_Marks }, i_Colours, o_rIds, o_rLists );
}

void VFlowRenderCamera::SetItem( ECameraItem i_Which, ZEK::IFlowItem* i_pNew )
{
  ZEK::VFlowItemRef& rHeld = m_Items[i_Which];
  if ( i_pNew == rHeld.Get() || ( i_pNew && rHeld && i_pNew->Id() == rHeld->Id() ) )
  {
    return;
  }
  rHeld = ZEK::VFlowItemRef( i_pNew );
  switch ( i_Which )
  {
  case ECameraHardware:
    TakeHardware();
    break;
  case ECameraSettings:
    TakeSettings();
    break;
  case ECameraCalibration:
    TakeCalibration();
    break;
  case ECameraCentroids:
    m_pDrawData->CentroidsChanged();
    break;
  case ECameraCentroidLabels:
  case ECameraCentroidAssignments:
    m_pDrawData->ColoursChanged();
    break;
  case ECameraGreyscaleBlobs:
    m_pDrawData->BlobsChanged();
    break;
  default:
    break;
  }
}

void VFlowRenderCamera::TakeHardware()
{
  const auto* const pHardware = Value< VCameraHardware >( ECameraHardware );
  if ( !pHardware )
  {
    return;
  }
  const bool bOtherSensor = m_Info.SensorWidth != pHardware->SensorWidth ||
                            m_Info.SensorHeight != pHardware->SensorHeight ||
                            m_Info.PixelAspect != pHardware->PixelAspect;
  m_Info.SensorWidth = pHardware->SensorWidth;
  m_Info.SensorHeight = pHardware->SensorHeight;
  m_Info.PixelAspect = pHardware->PixelAspect;
  const double Aspect = pHardware->SensorWidth * pHardware->PixelAspect / pHardware->SensorHeight;
  m_Info.ImageAspect = std::isfinite( Aspect ) && Aspect > 0 ? Aspect : 1;
  m_Info.bVideo = pHardware->Video;
  m_Info.DisplayType = pHardware->UserDisplayType.empty() ? pHardware->DefaultDisplayType : pHardware->UserDisplayType;
  ++m_Info.ChangeCount;
  if ( bOtherSensor && m_Items[ECameraCalibration] )
  {
    TakeCalibration();
  }
}

void VFlowRenderCamera::TakeSettings()
{
  const auto* const pHeld = Value< VCameraSettings >( ECameraSettings );
  if ( !pHeld )
  {
    return;
  }
  m_DisplayName = Get< std::string >( *pHeld, "Name", {} );
  m_Info.GammaCorrection = static_cast< float >( Number( *pHeld, "GammaCorrection", 1 ) );
  m_Info.VideoSaturation = static_cast< float >( Number( *pHeld, "VideoSaturation", 1 ) );
  m_Info.bConnected = Get( *pHeld, "Connected", true );
  const auto UserId = Get< std::int64_t >( *pHeld, "UserId", -1 );
  m_Info.UserId = static_cast< std::int32_t >( UserId );
  ++m_Info.ChangeCount;
}

void VFlowRenderCamera::ClearCalibrated()
{
  if ( std::exchange( m_Info.bCalibrated, false ) )
  {
    ++m_Info.ChangeCount;
    m_pDrawData->ModelChanged();
  }
}

void VFlowRenderCamera::TakeCalibration()
{
  const auto* const pCalibration = Value< VCameraCalibration >( ECameraCalibration );
  const auto* const pHardware = Value< VCameraHardware >( ECameraHardware );
  if ( !pCalibration || !pHardware || !ComputeCameraModel::IsUsable( *pCalibration ) )
  {
    ClearCalibrated();
    return;
  }
  ComputeCameraModel::VCameraModel Model = m_Model;
  Model.Set( *pHardware, *pCalibration );
  if ( !Model.IsFinite() )
  {
    // Numbers that are none, or a sensor without an area.
    ClearCalibrated();
    return;
  }
  if ( !std::exchange( m_Info.bCalibrated, true ) )
  {
    ++m_Info.ChangeCount;
  }
  m_Model = Model;
  for ( std::size_t Axis = 0; Axis < 3; ++Axis )
  {
    m_Info.Position[Axis] = m_Model.WorldFromCamera[12 + Axis] - BodyBehindCentre * m_Model.WorldFromCamera[8 + Axis];
  }
  ++m_Info.ChangeCount;
  m_pDrawData->ModelChanged();
}

void VFlowRenderCamera::SetMarks( VCameraMarks& io_rMarks )
{
  if ( io_rMarks == m_Marks )
  {
    return;
  }
  if ( io_rMarks.Centroids != m_Marks.Centroids )
  {
    m_pDrawData->MarksChanged();
  }
  std::swap( m_Marks, io_rMarks );
}

void VFlowRenderCamera::SetFirstIds( std::uint32_t i_Centroid, std::uint32_t i_Blob )
{
  m_Info.FirstCentroidId = i_Centroid;
  m_Info.FirstBlobId = i_Blob;
}

void VFlowRenderCamera::SetNumber( std::uint32_t i_Number )
{
  if ( std::exchange( m_Info.Number, i_Number ) != i_Number )
  {
    m_pDrawData->BlobsChanged();
  }
}

} // namespace Flow2Graphics
