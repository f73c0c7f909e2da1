#include "RecordingCameras.h"

#include "RecordingItems.h"

#include <CoreMoxelTypes/FlowTypes.h>

#include <algorithm>

namespace HostSources
{
using namespace CoreMoxelTypes;

VRecordingCameras::VRecordingCameras( const VRecording& i_rRecording, const VRecordingSubjects& i_rSubjects )
  : m_rRecording( i_rRecording )
  , m_rSubjects( i_rSubjects )
  , m_Seen( i_rRecording.Cameras.size() )
  , m_Entries( i_rRecording.PointCount() )
{
}

ZEK::IResult VRecordingCameras::MakeSlowItems( const VStateMaker& i_rMaker, std::vector< ZEK::VFlowItemRef >& io_rSlow )
{
  std::fill( m_Seen.begin(), m_Seen.end(), VSeen() );
  ZEK::IResult Result;
  ZEK::VFlowItemRef Item;
  for ( const VRecordingCamera& rSeen : m_rRecording.Cameras )
  {
    const VCalibratedCamera& rCamera = rSeen.Camera;
    const auto Keep = [&]
    {
      Item->MutableValue().SetName( ZEK::EFlowNameDevice, rCamera.Name );
      io_rSlow.push_back( Item );
    };
    if ( auto* const pHardware = MakeItem< FlowCameraHardware >( i_rMaker, Item, Result ) )
    {
      *pHardware = rCamera.Hardware;
      Keep();
    }
    if ( auto* const pSettings = Result.IsOk() ? MakeItem< FlowCameraSettings >( i_rMaker, Item, Result ) : nullptr )
    {
      pSettings->Values = { { "Name", rCamera.DisplayName },
                            { "UserId", static_cast< std::int64_t >( rCamera.UserId ) },
                            { "Connected", true },
                            { "Enabled", true } };
      Keep();
    }
    if ( auto* const pCalibration = Result.IsOk() && rCamera.Calibration
                                        ? MakeItem< FlowCameraCalibration >( i_rMaker, Item, Result )
                                        : nullptr )
    {
      *pCalibration = *rCamera.Calibration;
      Keep();
    }
    if ( Result.IsError() )
    {
      break;
    }
  }
  return Result;
}

bool VRecordingCameras::SameFrame( const VRecordingCamera& i_rCamera, std::int64_t i_A, std::int64_t i_B ) const
{
  const auto SeenA = i_rCamera.Frame( i_A ), SeenB = i_rCamera.Frame( i_B );
  if ( !SameBits( SeenA, SeenB ) )
  {
    return false;
  }
  // Assignments count the points that are there.
  const auto PointsA = m_rRecording.Frame( i_A ), PointsB = m_rRecording.Frame( i_B );
  return SeenA.empty() || std::equal( PointsA.begin(), PointsA.end(), PointsB.begin(), PointsB.end(),
                                      []( const VRecordingPoint& i_rA, const VRecordingPoint& i_rB )
                                      {
                                        return i_rA.IsValid() == i_rB.IsValid();
                                      } );
}

void VRecordingCameras::NumberPoints( std::int64_t i_Index )
{
  if ( m_EntriesOf == i_Index )
  {
    return;
  }
  m_EntriesOf = i_Index;
  const auto Points = m_rRecording.Frame( i_Index );
  std::int32_t Next = 0;
  for ( std::size_t Point = 0; Point < Points.size(); ++Point )
  {
    m_Entries[Point] = Points[Point].IsValid() ? Next++ : -1;
  }
}

ZEK::IResult VRecordingCameras::MakeSeen( const VStateMaker& i_rMaker, const VRecordingCamera& i_rCamera,
                                          std::int64_t i_Index, VSeen& o_rSeen )
{
  ZEK::IResult Result;
  o_rSeen.Of = -1;
  auto* const pCentroids = MakeItem< FlowCentroidSet >( i_rMaker, o_rSeen.Centroids, Result );
  auto* const pAssignments =
      pCentroids ? MakeItem< FlowCentroidAssignmentSet >( i_rMaker, o_rSeen.Assignments, Result ) : nullptr;
  auto* const pLabels = pAssignments ? MakeItem< FlowCentroidLabelSet >( i_rMaker, o_rSeen.Labels, Result ) : nullptr;
  if ( !pLabels )
  {
    return Result;
  }
  for ( ZEK::VFlowItemRef* const pItem : { &o_rSeen.Centroids, &o_rSeen.Assignments, &o_rSeen.Labels } )
  {
    ( *pItem )->MutableValue().SetName( ZEK::EFlowNameDevice, i_rCamera.Camera.Name );
  }
  const auto Detections = i_rCamera.Frame( i_Index );
  pCentroids->Centroids.reserve( Detections.size() );
  pAssignments->Reconstruction.reserve( Detections.size() );
  pLabels->Labels.reserve( Detections.size() );
  for ( const VRecordingDetection& rDetection : Detections )
  {
    VCentroid Centroid;
    Centroid.x = rDetection.x;
    Centroid.y = rDetection.y;
    Centroid.radius = DetectionRadius;
    Centroid.Id = static_cast< u32 >( pCentroids->Centroids.size() );
    Centroid.Quality = static_cast< u8 >( std::clamp( rDetection.Likelihood, 0.f, 1.f ) * 255 );
    pCentroids->Centroids.push_back( Centroid );
    VCentroidLabel Label;
    std::int32_t Entry = -1;
    if ( rDetection.Point >= 0 )
    {
      const auto Point = static_cast< std::size_t >( rDetection.Point );
      Entry = m_Entries[Point];
      if ( const VRecordingSubjects::VPlace& rPlace = m_rSubjects.Places[Point]; rPlace.SubjectId != 0 )
      {
        Label = { rPlace.SubjectId, rPlace.MarkerIndex };
      }
    }
    pAssignments->Reconstruction.push_back( Entry );
    pLabels->Labels.push_back( Label );
  }
  o_rSeen.Of = i_Index;
  return Result;
}

ZEK::IResult VRecordingCameras::MakeFastItems( const VStateMaker& i_rMaker, std::int64_t i_Index )
{
  ZEK::IResult Result;
  for ( std::size_t Index = 0; Index < m_Seen.size() && Result.IsOk(); ++Index )
  {
    const VRecordingCamera& rCamera = m_rRecording.Cameras[Index];
    VSeen& rSeen = m_Seen[Index];
    if ( rSeen.Of < 0 || ( rSeen.Of != i_Index && !SameFrame( rCamera, rSeen.Of, i_Index ) ) )
    {
      NumberPoints( i_Index );
      Result = MakeSeen( i_rMaker, rCamera, i_Index, rSeen );
    }
  }
  return Result;
}

void VRecordingCameras::AddItems( ZEK::IFlowState& io_rState ) const
{
  for ( const VSeen& rSeen : m_Seen )
  {
    io_rState.AddItem( rSeen.Centroids );
    io_rState.AddItem( rSeen.Assignments );
    io_rState.AddItem( rSeen.Labels );
  }
}

} // namespace HostSources
