#include "StandardScene.h"

#include <CoreMoxelTypes/FlowTypes.h>
#include <HostFlow/VFlowFramework.h>

#include <cmath>
#include <cstdlib>
#include <string>

namespace SubjectsBench
{
namespace
{
using namespace CoreMoxelTypes;

constexpr u32 SensorWidth = 1280, SensorHeight = 960;

class VItems
{
public:
  /// A new item of that kind, for whoever fills its payload.
  template < typename TFlow >
  typename ZEK::FlowValueType< TFlow >::type& Add( std::vector< ZEK::VFlowItemRef >& io_rItems )
  {
    ZEK::IResult Status;
    ZEK::VFlowItemRef Item;
    m_Store->CreateItem( Status, ZEK::FlowValueType< TFlow >::Descriptor, Item );
    if ( !Item )
    {
      std::abort();
    }
    io_rItems.push_back( Item );
    return *ZEK::FlowMutablePayload< typename ZEK::FlowValueType< TFlow >::type >( Item.Get() );
  }
  template < typename TFlow >
  typename ZEK::FlowValueType< TFlow >::type& Add( std::vector< ZEK::VFlowItemRef >& io_rItems, ZEK::EFlowName i_Which,
                                                   const std::string& i_rName )
  {
    auto& rPayload = Add< TFlow >( io_rItems );
    io_rItems.back()->MutableValue().SetName( i_Which, i_rName );
    return rPayload;
  }

private:
  ZEK::VFlowStoreRef m_Store = HostFlow::MakeItemStore();
};

/// A name with a number of fixed length, so that names stand in the order of their numbers.
std::string Name( const char* i_pWhat, int i_Number )
{
  const std::string Digits = std::to_string( i_Number );
  return std::string( i_pWhat ).append( 4 - Digits.size(), '0' ).append( Digits );
}

void AddCamera( const VStandardData& i_rData, int i_Camera, VItems& io_rMaker,
                std::vector< ZEK::VFlowItemRef >& io_rItems )
{
  const std::string URN = Name( "camera:", i_Camera );
  const VPlace& rPlace = i_rData.Cameras[static_cast< std::size_t >( i_Camera )];
  auto& rHardware = io_rMaker.Add< FlowCameraHardware >( io_rItems, ZEK::EFlowNameDevice, URN );
  rHardware.Name = URN;
  rHardware.SensorWidth = SensorWidth;
  rHardware.SensorHeight = SensorHeight;
  auto& rCalibration = io_rMaker.Add< FlowCameraCalibration >( io_rItems, ZEK::EFlowNameDevice, URN );
  rCalibration.Position = { rPlace.Position.X, rPlace.Position.Y, rPlace.Position.Z };
  // The axis of the turn from z is (-y, x, 0); a calibration turns the world into the camera, the other way round.
  const double Sine = std::hypot( rPlace.Along.X, rPlace.Along.Y );
  const double Factor = std::atan2( Sine, rPlace.Along.Z ) / Sine;
  rCalibration.Rotation = { rPlace.Along.Y * Factor, -rPlace.Along.X * Factor, 0 };
  rCalibration.FocalLength = 0.5 * SensorWidth * 1000 / i_rData.HalfWidths[static_cast< std::size_t >( i_Camera )];
  rCalibration.PrincipalPoint[0] = 0.5 * SensorWidth;
  rCalibration.PrincipalPoint[1] = 0.5 * SensorHeight;
}

void AddSubject( const VStandardData& i_rData, int i_Subject, VItems& io_rMaker,
                 std::vector< ZEK::VFlowItemRef >& io_rItems )
{
  const std::string SubjectName = Name( "subject ", i_Subject );
  const u32 Colour = i_rData.SubjectColours[static_cast< std::size_t >( i_Subject )];
  auto& rSubject = io_rMaker.Add< FlowSubject >( io_rItems, ZEK::EFlowNameObject, SubjectName );
  rSubject.Id = static_cast< u32 >( i_Subject + 1 );
  rSubject.Name = SubjectName;
  for ( int Segment = 0; Segment < SegmentsPerSubject; ++Segment )
  {
    rSubject.Segments.push_back( { Name( "segment ", Segment ),
                                   Segment - 1,
                                   Segment == 0 ? EJointType::Free : EJointType::Ball,
                                   {},
                                   {},
                                   SegmentLength( Segment ) } );
  }
  for ( int Marker = 0; Marker < MarkersPerSubject; ++Marker )
  {
    rSubject.Markers.push_back(
        { static_cast< u32 >( Marker ), Name( "marker ", Marker ), Marker % SegmentsPerSubject, {}, MarkerRadius } );
  }
  auto& rData = io_rMaker.Add< FlowSubjectApplicationData >( io_rItems, ZEK::EFlowNameObject, SubjectName );
  rData.MarkerColours.assign( MarkersPerSubject, Colour );
  rData.SegmentColours.assign( SegmentsPerSubject, Colour );
  for ( int Stick = 0; Stick < SticksPerSubject; ++Stick )
  {
    const std::array< std::uint32_t, 2 > Ends = StickEnds( Stick );
    rData.Sticks.push_back( { Ends[0], Ends[1], StickColours[0], StickColours[1] } );
  }
}

/// A bone lies along the x axis of its segment, and points where the place does.
Rigid PoseOf( const VPlace& i_rPlace )
{
  const std::array< double, 9 > Turn = FromZ( i_rPlace.Along );
  Rigid Pose;
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    Pose.R[Row * 3] = Turn[Row * 3 + 2];
    Pose.R[Row * 3 + 1] = Turn[Row * 3];
    Pose.R[Row * 3 + 2] = Turn[Row * 3 + 1];
  }
  Pose.T[0] = i_rPlace.Position.X;
  Pose.T[1] = i_rPlace.Position.Y;
  Pose.T[2] = i_rPlace.Position.Z;
  return Pose;
}

VReconstruction Seen( std::size_t i_Index, const VPoint& i_rPoint, float i_Radius )
{
  return { static_cast< u32 >( i_Index + 1 ), { i_rPoint.X, i_rPoint.Y, i_rPoint.Z }, i_Radius, 0, 3 };
}

void AddFrame( const VStandardData::VFrame& i_rFrame, VItems& io_rMaker, std::vector< ZEK::VFlowItemRef >& io_rItems )
{
  auto& rSet = io_rMaker.Add< FlowReconstructionSet >( io_rItems );
  auto& rLabels = io_rMaker.Add< FlowReconstructionLabelSet >( io_rItems );
  for ( const VPoint& rPoint : i_rFrame.Reconstructions )
  {
    rSet.Items.push_back( Seen( rSet.Items.size(), rPoint, ReconstructionRadius ) );
  }
  for ( std::size_t Marker = 0; Marker < i_rFrame.Markers.size(); ++Marker )
  {
    rLabels.Labels.push_back( { static_cast< u32 >( rSet.Items.size() ),
                                static_cast< u32 >( Marker / MarkersPerSubject + 1 ),
                                static_cast< u32 >( Marker % MarkersPerSubject ) } );
    rSet.Items.push_back( Seen( rSet.Items.size(), i_rFrame.Markers[Marker], MarkerRadius ) );
  }
  for ( std::size_t First = 0; First < i_rFrame.Segments.size(); First += SegmentsPerSubject )
  {
    auto& rPoses = io_rMaker.Add< FlowSubjectDynamicParameters >(
        io_rItems, ZEK::EFlowNameObject, Name( "subject ", static_cast< int >( First / SegmentsPerSubject ) ) );
    for ( std::size_t Segment = First; Segment < First + SegmentsPerSubject; ++Segment )
    {
      rPoses.Segments.push_back( PoseOf( i_rFrame.Segments[Segment] ) );
    }
  }
}
} // namespace

std::vector< ZEK::VFlowStateRef > MakeStates( const VStandardData& i_rData )
{
  VItems Maker;
  std::vector< ZEK::VFlowItemRef > Slow;
  for ( int Camera = 0; Camera < CamerasPerScale * i_rData.Scale; ++Camera )
  {
    AddCamera( i_rData, Camera, Maker, Slow );
  }
  for ( int Subject = 0; Subject < SubjectsPerScale * i_rData.Scale; ++Subject )
  {
    AddSubject( i_rData, Subject, Maker, Slow );
  }
  const ZEK::VFlowStateFactoryRef Factory = HostFlow::MakeStateFactory();
  std::vector< ZEK::VFlowStateRef > States;
  for ( std::size_t Number = 0; Number < i_rData.Frames.size(); ++Number )
  {
    std::vector< ZEK::VFlowItemRef > Items = Slow;
    AddFrame( i_rData.Frames[Number], Maker, Items );
    ZEK::VFlowStateRef State;
    if ( Factory->CreateState( State, { static_cast< std::int64_t >( Number ), 1, 1 }, {}, {} ).IsError() )
    {
      std::abort();
    }
    for ( const ZEK::VFlowItemRef& rItem : Items )
    {
      State->AddItem( rItem );
    }
    States.push_back( std::move( State ) );
  }
  return States;
}

} // namespace SubjectsBench
