#include "ReadHelpers.h"

#include <CoreMoxelTypes/Device.h>
#include <CoreMoxelTypes/FlowTypes.h>
#include <CoreMoxelTypes/Reconstruction.h>
#include <CoreMoxelTypes/Subject.h>
#include <HostFlow/VFlowFramework.h>
#include <HostSources/VRecordingSource.h>

#include <cmath>

namespace HostSources
{
namespace
{
using namespace CoreMoxelTypes;

class RecordingSource : public testing::Test
{
protected:
  ZEK::VFlowStateRef State( VRecordingSource& i_rSource, std::int64_t i_Index )
  {
    ZEK::VFlowStateRef Made;
    EXPECT_EQ( i_rSource.MakeState( i_Index, m_Maker, Made ), ZEK::IResult( ZEK::IResult::Ok ) );
    return Made;
  }

  const VStateMaker m_Maker{ HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 2 };
};

template < typename TFlow >
ZEK::VFlowItemRef Item( const ZEK::VFlowStateRef& i_rState )
{
  ZEK::VFlowItemRef Found;
  i_rState->FindItem( Found, ZEK::FlowTag< TFlow >, ZEK::EFlowTimeMatch::Overlap );
  return Found;
}

template < typename TFlow >
const typename ZEK::FlowValueType< TFlow >::type& Value( const ZEK::VFlowStateRef& i_rState )
{
  static const typename ZEK::FlowValueType< TFlow >::type None{};
  // The state lives on in the caller, and the item with it.
  const auto* pValue =
      ZEK::FlowPayload< typename ZEK::FlowValueType< TFlow >::type >( Item< TFlow >( i_rState ).Get() );
  EXPECT_NE( pValue, nullptr );
  return pValue ? *pValue : None;
}

template < typename TFlow >
std::vector< ZEK::IFlowItem* > Items( const ZEK::VFlowStateRef& i_rState )
{
  ZEK::VFlowCursor At, End;
  i_rState->TagBegin( At, ZEK::FlowTag< TFlow >, ZEK::EFlowTimeMatch::Overlap );
  i_rState->TagEnd( End, ZEK::FlowTag< TFlow >, ZEK::EFlowTimeMatch::Overlap );
  std::vector< ZEK::IFlowItem* > All;
  for ( ; !( At == End ); ++At )
  {
    All.push_back( At->pItem );
  }
  return All;
}

std::string NameOf( const ZEK::IFlowItem* i_pItem, ZEK::EFlowName i_Selector )
{
  std::string_view Name;
  return i_pItem->Value().GetName( i_Selector, Name ) ? std::string( Name ) : "(none)";
}

VRecordingPoint At( float i_X, float i_Y, float i_Z )
{
  return { i_X, i_Y, i_Z, 0 };
}

/// Two subjects by prefix, one by the file's name, one column without a name; frame 1 repeats frame 0, frame 2 misses a
/// point, frame 3 has a point outside the columns.
std::shared_ptr< VRecording > Recording()
{
  auto pR = std::make_shared< VRecording >();
  pR->Name = "trial 7.c3d";
  pR->RateHz = 50;
  pR->FirstFrame = 101;
  pR->FrameCount = 4;
  pR->Labels = { "Ann:HEAD", "Bob:HEAD", "Ann:FOOT", "", "WAND" };
  const std::vector< VRecordingPoint > Whole{ At( 1, 2, 3 ), At( 4, 5, 6 ), At( 7, 8, 9 ), At( 10, 11, 12 ),
                                              At( 13, 14, 15 ) };
  for ( int Frame = 0; Frame < 4; ++Frame )
  {
    pR->Points.insert( pR->Points.end(), Whole.begin(), Whole.end() );
  }
  pR->Points[2 * 5 + 1] = {};
  pR->Unlabelled = { At( 20, 21, 22 ) };
  pR->UnlabelledBegin = { 0, 0, 0, 0, 1 };
  pR->CameraMasks.assign( 20, 0x15 );
  pR->UpAxisReason = "z is up: because.";
  pR->Bounds.Min = { -4100, -1, 2 };
  pR->Bounds.Max = { 4, 5, 3300 };
  return pR;
}
} // namespace

TEST_F( RecordingSource, EveryValidPointIsAnEntryAndNamesTravelAsSubjects )
{
  VRecordingSource Source( Recording() );
  const auto Made = State( Source, 3 );
  EXPECT_EQ( Made->GetKey(), ( ZEK::VFlowTimeKey{ 3 * 270'000'000 / 50, 1, 2 } ) );
  EXPECT_EQ( Made->GetKey().Span, 270'000'000 / 50 );
  EXPECT_EQ( Made->GetInfoA().RateNumerator, 50 );
  EXPECT_EQ( Source.FrameNumber( 3 ), 104 );

  const auto& rSet = Value< FlowReconstructionSet >( Made );
  ASSERT_EQ( rSet.Items.size(), 6u );
  EXPECT_EQ( rSet.Items[4].Id, 5u );
  EXPECT_EQ( rSet.Items[4].Position.z, 15 );
  EXPECT_EQ( rSet.Items[4].Rays, 3u );
  EXPECT_EQ( rSet.Items[5].Id, 6u );
  EXPECT_EQ( rSet.Items[5].Position.x, 20 );

  const auto Subjects = Items< FlowSubject >( Made );
  ASSERT_EQ( Subjects.size(), 3u );
  std::vector< std::string > Names, Labels;
  for ( const ZEK::IFlowItem* pItem : Subjects )
  {
    const auto& rSubject = *ZEK::FlowPayload< VSubject >( pItem );
    EXPECT_EQ( NameOf( pItem, ZEK::EFlowNameObject ), rSubject.Name );
    Names.push_back( rSubject.Name );
    for ( const VReconstructionLabelSet::L& rLabel : Value< FlowReconstructionLabelSet >( Made ).Labels )
    {
      if ( rLabel.SubjectId == rSubject.Id )
      {
        Labels.push_back( rSubject.Name + ":" + rSubject.Markers[rLabel.MarkerId].Name + "=" +
                          std::to_string( rSet.Items[rLabel.Reconstruction].Id ) );
      }
    }
  }
  EXPECT_THAT( Names, testing::ElementsAre( "Ann", "Bob", "trial 7" ) );
  EXPECT_THAT( Labels, testing::ElementsAre( "Ann:HEAD=1", "Ann:FOOT=3", "Bob:HEAD=2", "trial 7:WAND=5" ) );
  for ( const ZEK::IFlowItem* pItem : Items< FlowSubjectApplicationData >( Made ) )
  {
    const std::string Name = NameOf( pItem, ZEK::EFlowNameObject );
    EXPECT_EQ( ZEK::FlowPayload< VSubjectApplicationData >( pItem )->MarkerColours.size(), Name == "Ann" ? 2u : 1u );
  }
}

TEST_F( RecordingSource, PointsThatAProgramNumberedBelongToNobody )
{
  const auto pR = Recording();
  pR->Labels = { "*12", "Ann:C7", "Ann:*110", "C_12", "U*3" };
  VRecordingSource Source( pR );
  const auto Subjects = Items< FlowSubject >( State( Source, 0 ) );
  ASSERT_EQ( Subjects.size(), 1u );
  const auto& rSubject = *ZEK::FlowPayload< VSubject >( Subjects[0] );
  EXPECT_EQ( rSubject.Name, "Ann" );
  ASSERT_EQ( rSubject.Markers.size(), 1u );
  EXPECT_EQ( rSubject.Markers[0].Name, "C7" );
  ASSERT_EQ( Value< FlowReconstructionLabelSet >( State( Source, 0 ) ).Labels.size(), 1u );
  EXPECT_EQ( Value< FlowReconstructionLabelSet >( State( Source, 0 ) ).Labels[0].Reconstruction, 1u );
  EXPECT_EQ( Value< FlowReconstructionSet >( State( Source, 0 ) ).Items.size(), 5u ) << "they are there all the same";
  EXPECT_THAT( DescribeRecording( *pR ).Text(), testing::HasSubstr( "  4 columns have no name" ) );
  for ( const char* pName : { "Unlabeled 12", "unlabelled_3", "U_1", "C_", "RSHO12", "12", "CLAV" } )
  {
    pR->Labels = { "A", "B", "C", "D", pName };
    VRecordingSource Named( pR );
    const auto Found = Items< FlowSubject >( State( Named, 0 ) );
    ASSERT_EQ( Found.size(), 1u );
    const bool bAutomatic = std::string_view( pName ).starts_with( "U_" ) || std::string_view( pName ).size() > 8;
    EXPECT_EQ( ZEK::FlowPayload< VSubject >( Found[0] )->Markers.size(), bAutomatic ? 4u : 5u ) << pName;
  }
}

TEST_F( RecordingSource, WhatDidNotChangeIsTheSameObject )
{
  VRecordingSource Source( Recording() );
  const auto First = State( Source, 0 ), Second = State( Source, 1 ), Third = State( Source, 2 );
  EXPECT_EQ( Item< FlowReconstructionSet >( First ), Item< FlowReconstructionSet >( Second ) );
  EXPECT_EQ( Item< FlowReconstructionLabelSet >( First ), Item< FlowReconstructionLabelSet >( Second ) );
  EXPECT_NE( Item< FlowReconstructionSet >( Second ), Item< FlowReconstructionSet >( Third ) );
  EXPECT_NE( Item< FlowReconstructionLabelSet >( Second ), Item< FlowReconstructionLabelSet >( Third ) );
  EXPECT_EQ( Item< FlowWorldAxis >( First ), Item< FlowWorldAxis >( Third ) );
  EXPECT_EQ( Item< FlowVolumeProperties >( First ), Item< FlowVolumeProperties >( Third ) );
  EXPECT_EQ( Items< FlowSubject >( First ), Items< FlowSubject >( Third ) );

  ASSERT_EQ( Value< FlowReconstructionSet >( Third ).Items.size(), 4u );
  EXPECT_EQ( Value< FlowReconstructionSet >( Third ).Items[1].Id, 3u ) << "an id belongs to the point, not the place";
  EXPECT_EQ( Value< FlowReconstructionLabelSet >( Third ).Labels.size(), 3u );
  EXPECT_EQ( Value< FlowReconstructionLabelSet >( Third ).Labels[2].Reconstruction, 3u );
  // Where points move and none comes or goes, the labels stay.
  const auto pMoving = Recording();
  pMoving->Points[5].x = 99;
  VRecordingSource Moving( pMoving );
  const auto Before = State( Moving, 0 ), After = State( Moving, 1 );
  EXPECT_NE( Item< FlowReconstructionSet >( Before ), Item< FlowReconstructionSet >( After ) );
  EXPECT_EQ( Item< FlowReconstructionLabelSet >( Before ), Item< FlowReconstructionLabelSet >( After ) );
}

TEST_F( RecordingSource, UpAxisAndFloorFollowTheRecordingAndTheHand )
{
  VRecordingSource Source( Recording() );
  auto Made = State( Source, 0 );
  EXPECT_EQ( Value< FlowWorldAxis >( Made ).Up, 2u );
  EXPECT_EQ( Source.UpAxisReason(), "z is up: because." );
  const auto Floor = [&]
  {
    const VVolumeProperties& rV = Value< FlowVolumeProperties >( Made );
    return std::array{ rV.XMin, rV.YMin, rV.XMax, rV.YMax };
  };
  EXPECT_EQ( Floor(), ( std::array{ -5000, -3000, 3000, 3000 } ) );
  Source.SetUpAxis( EUpAxis::Y );
  Made = State( Source, 0 );
  EXPECT_EQ( Value< FlowWorldAxis >( Made ).Up, 1u );
  EXPECT_EQ( Floor(), ( std::array{ -5000, -3000, 3000, 4000 } ) ) << "the floor lies in x and z when y is up";
  EXPECT_EQ( Value< FlowReconstructionSet >( Made ).Items[0].Position.z, 3 );
  EXPECT_EQ( Source.UpAxis(), EUpAxis::Y );
  EXPECT_THAT( Source.UpAxisReason(), testing::StartsWith( "y is up: it was chosen by hand" ) );
}

TEST_F( RecordingSource, ForcePlatesBringTheSamplesOfTheirFrame )
{
  const auto pR = Recording();
  pR->AnalogChannels.resize( 6 );
  pR->AnalogPerFrame = 3;
  VForcePlate Plate;
  Plate.Name = "Force plate 1";
  Plate.Type = 2;
  Plate.Sensor = { 1, 2, 40 };
  Plate.Corners[2] = { 3, 4, 5 };
  for ( int Sample = 0; Sample < 12; ++Sample )
  {
    Plate.Wrench.push_back( { 0, 0, static_cast< float >( Sample ) } );
  }
  VForcePlate Silent = Plate;
  Silent.Name = "Force plate 2";
  Silent.Wrench.clear();
  pR->ForcePlates = { Plate, Silent };
  VRecordingSource Source( pR );
  const auto Made = State( Source, 2 );
  const auto Devices = Items< FlowDevice >( Made );
  ASSERT_EQ( Devices.size(), 2u );
  EXPECT_EQ( NameOf( Devices[0], ZEK::EFlowNameDevice ), "Force plate 1" );
  const auto& rDevice = *ZEK::FlowPayload< VDevice >( Devices[0] );
  EXPECT_EQ( rDevice.Kind, VDevice::ForcePlate );
  EXPECT_EQ( rDevice.Corners[2].y, 4 );
  EXPECT_EQ( rDevice.Origin.z, 40 );
  ASSERT_EQ( Items< FlowDeviceSamples >( Made ).size(), 1u );
  EXPECT_EQ( NameOf( Items< FlowDeviceSamples >( Made )[0], ZEK::EFlowNameDevice ), "Force plate 1" );
  const auto& rSamples = Value< FlowDeviceSamples >( Made );
  EXPECT_EQ( rSamples.RateHz, 150 );
  EXPECT_EQ( rSamples.First, 6u );
  ASSERT_EQ( rSamples.Wrench.size(), 3u );
  EXPECT_EQ( rSamples.Wrench[2][2], 8 );
}

TEST_F( RecordingSource, TimesAndFramesOutsideTheRecording )
{
  VRecordingSource Source( Recording() );
  ZEK::VFlowStateRef Made = State( Source, 0 );
  EXPECT_EQ( Source.MakeState( 4, m_Maker, Made ), ZEK::IResult( ZEK::IResult::InvalidIndex ) );
  EXPECT_FALSE( Made );
  EXPECT_EQ( Source.MakeState( -1, m_Maker, Made ), ZEK::IResult( ZEK::IResult::InvalidIndex ) );
  EXPECT_EQ( Source.MakeState( 0, {}, Made ), ZEK::IResult( ZEK::IResult::InvalidHandle ) );
  EXPECT_EQ( Source.NearestFrame( 0.029 ), 1 );
  EXPECT_EQ( Source.NearestFrame( 0.031 ), 2 );
  EXPECT_EQ( Source.NearestFrame( 1e9 ), 3 );
  EXPECT_EQ( Source.NearestFrame( -5 ), 0 );
  EXPECT_EQ( Source.NearestFrame( std::nan( "" ) ), 0 );
}

TEST_F( RecordingSource, AnotherStoreGetsItsOwnItems )
{
  VRecordingSource Source( Recording() );
  const auto First = State( Source, 0 );
  const VStateMaker Other{ HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 1 };
  ZEK::VFlowStateRef Second;
  ASSERT_TRUE( Source.MakeState( 0, Other, Second ).IsOk() );
  EXPECT_EQ( Second->GetKey().Clock, 1u );
  EXPECT_EQ( Items< FlowSubject >( Second ).size(), 3u );
  EXPECT_EQ( Value< FlowReconstructionSet >( Second ).Items.size(), 5u );
}

TEST_F( RecordingSource, AWalkWithForcePlatesPlaysThrough )
{
  HARROW_NEEDS_RECORDINGS();
  const auto pR = std::make_shared< VRecording >( MustRead( TestSupport::RecordingsDir() / "c3d-trc/Gait.c3d" ) );
  VRecordingSource Source( pR );
  EXPECT_EQ( Source.Name(), "Gait.c3d" );
  EXPECT_EQ( Source.NearestFrame( 2.43 ), 243 );
  std::size_t Entries = 0;
  for ( std::int64_t Frame = 0; Frame < Source.FrameCount(); ++Frame )
  {
    const auto Made = State( Source, Frame );
    Entries += Value< FlowReconstructionSet >( Made ).Items.size();
    ASSERT_EQ( Items< FlowDeviceSamples >( Made ).size(), 2u );
  }
  EXPECT_EQ( Entries, 16071u - 9682u );
  const auto Made = State( Source, 243 );
  const auto& rLabels = Value< FlowReconstructionLabelSet >( Made ).Labels;
  const auto& rSubject = Value< FlowSubject >( Made );
  EXPECT_EQ( rSubject.Name, "Gait" );
  const auto It = std::find_if( rLabels.begin(), rLabels.end(),
                                [&]( const VReconstructionLabelSet::L& i_rLabel )
                                {
                                  return rSubject.Markers[i_rLabel.MarkerId].Name == "RSHO";
                                } );
  ASSERT_NE( It, rLabels.end() );
  EXPECT_NEAR( Value< FlowReconstructionSet >( Made ).Items[It->Reconstruction].Position.x, 640.4994, 1e-3 );
}

TEST_F( RecordingSource, ARecordingWithoutPointsPlaysToo )
{
  HARROW_NEEDS_RECORDINGS();
  const auto pR = std::make_shared< VRecording >( MustRead( TestSupport::RecordingsDir() / "c3d-trc/emg-only.c3d" ) );
  VRecordingSource Source( pR );
  const auto Made = State( Source, 4563 );
  EXPECT_TRUE( Value< FlowReconstructionSet >( Made ).Items.empty() );
  EXPECT_TRUE( Items< FlowSubject >( Made ).empty() );
}

} // namespace HostSources
