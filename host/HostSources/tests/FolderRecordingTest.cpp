#include "ReadHelpers.h"

#include <CoreMoxelTypes/FlowTypes.h>
#include <HostFlow/VFlowFramework.h>
#include <HostSources/VFolderReader.h>
#include <HostSources/VRecordingSource.h>

#include <cmath>
#include <fstream>
#include <map>

namespace HostSources
{
namespace
{
using namespace CoreMoxelTypes;

/// The value of an item of the state by its device.
template < typename TFlow >
auto ByDevice( const ZEK::VFlowStateRef& i_rState )
{
  std::map< std::string, const typename ZEK::FlowValueType< TFlow >::type* > All;
  ZEK::VFlowCursor At, End;
  i_rState->TagBegin( At, ZEK::FlowTag< TFlow >, ZEK::EFlowTimeMatch::Overlap );
  i_rState->TagEnd( End, ZEK::FlowTag< TFlow >, ZEK::EFlowTimeMatch::Overlap );
  for ( ; !( At == End ); ++At )
  {
    std::string_view Name;
    EXPECT_TRUE( At->pItem->Value().GetName( ZEK::EFlowNameDevice, Name ) );
    All[std::string( Name )] = ZEK::FlowPayload< typename ZEK::FlowValueType< TFlow >::type >( At->pItem );
  }
  return All;
}

template < typename TFlow >
const typename ZEK::FlowValueType< TFlow >::type& Only( const ZEK::VFlowStateRef& i_rState )
{
  ZEK::VFlowItemRef Item;
  i_rState->FindItem( Item, ZEK::FlowTag< TFlow >, ZEK::EFlowTimeMatch::Overlap );
  return *ZEK::FlowPayload< typename ZEK::FlowValueType< TFlow >::type >( Item.Get() );
}

class FolderRecording : public testing::Test
{
protected:
  std::shared_ptr< VRecording > Read( const std::filesystem::path& i_rPath, ZEK::IResult i_Expected = ZEK::IResult::Ok,
                                      const VReadOptions& i_rOptions = {} )
  {
    auto pRecording = std::make_shared< VRecording >();
    EXPECT_EQ( ReadFolder( i_rPath, *pRecording, m_Message, {}, i_rOptions ), i_Expected ) << m_Message;
    m_Notes.clear();
    for ( const std::string& rNote : pRecording->Notes )
    {
      m_Notes += rNote + "\n";
    }
    return pRecording;
  }
  std::filesystem::path Save( const std::string& i_rName, const std::string& i_rText )
  {
    const auto Path = m_Folder.Path() / i_rName;
    std::filesystem::create_directories( Path.parent_path() );
    std::ofstream( Path, std::ios::binary ) << i_rText;
    return Path;
  }
  ZEK::VFlowStateRef State( VRecordingSource& i_rSource, std::int64_t i_Index )
  {
    ZEK::VFlowStateRef Made;
    EXPECT_EQ( i_rSource.MakeState( i_Index, m_Maker, Made ), ZEK::IResult( ZEK::IResult::Ok ) );
    return Made;
  }

  const VStateMaker m_Maker{ HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 2 };
  TestSupport::VTemporaryDir m_Folder;
  std::string m_Message, m_Notes;
};

constexpr const char* Head2d = "sync_index,cam_id,object_id,keypoint_id,img_loc_x,img_loc_y\n";
constexpr const char* Head3d = "sync_index,object_id,keypoint_id,x_coord,y_coord,z_coord\n";
/// At the origin, looking along z, 1000 px of focal length.
constexpr const char* OneCamera =
    "[cameras.0]\ncam_id = 0\nsize = [1000, 800]\nmatrix = [[1000.0, 0.0, 500.0], [0.0, 1000.0, 400.0], [0.0, 0.0, "
    "1.0]]\ndistortions = [0.0, 0.0, 0.0, 0.0, 0.0]\ntranslation = [0.0, 0.0, 0.0]\nrotation = [0.0, 0.0, 0.0]\n";
} // namespace

TEST_F( FolderRecording, TheBoardFillsCentroidsAssignmentsAndLabels )
{
  HARROW_NEEDS_RECORDINGS();
  const auto pR = Read( TestSupport::RecordingsDir() / "multicam-board" );
  ASSERT_EQ( pR->Cameras.size(), 4u );
  EXPECT_EQ( pR->FrameCount, 57 );
  EXPECT_EQ( pR->FirstFrame, 35 );
  EXPECT_NEAR( pR->RateHz, 6, 0.3 );
  EXPECT_EQ( pR->PointCount(), 12u );
  EXPECT_EQ( pR->Points.size() - pR->GapCount, 660u );
  ExpectPoint( pR->Frame( 0 )[0], 536.124, 324.082, 7.971, 1e-3 );
  EXPECT_THAT( m_Notes, testing::HasSubstr( "\"xyz\"" ) );
  ExpectBounds( pR->Bounds, { -52, 548, -30, 517, -113, 212 }, 1 );
  const struct
  {
    std::size_t Rows;
    double Mean, Worst;
  } Known[] = { { 655, 1.055, 4.0 }, { 544, 1.735, 6.7 }, { 592, 1.497, 5.7 }, { 384, 1.128, 6.3 } };

  VRecordingSource Source( pR );
  std::map< std::string, std::size_t > Centroids, Assigned;
  for ( std::int64_t Frame = 0; Frame < Source.FrameCount(); ++Frame )
  {
    const auto pState = State( Source, Frame );
    const auto Sets = ByDevice< FlowCentroidSet >( pState );
    const auto Assignments = ByDevice< FlowCentroidAssignmentSet >( pState );
    const auto Labels = ByDevice< FlowCentroidLabelSet >( pState );
    const auto& rSubject = Only< FlowSubject >( pState );
    const auto& rPoints = Only< FlowReconstructionSet >( pState ).Items;
    std::size_t InFrame = 0;
    ASSERT_EQ( Sets.size(), 4u );
    ASSERT_EQ( ByDevice< FlowCameraHardware >( pState ).size(), 4u );
    ASSERT_EQ( ByDevice< FlowCameraCalibration >( pState ).size(), 4u );
    for ( const auto& [rName, pSet] : Sets )
    {
      const auto& rAssigned = Assignments.at( rName )->Reconstruction;
      const auto& rLabels = Labels.at( rName )->Labels;
      ASSERT_EQ( rAssigned.size(), pSet->Centroids.size() );
      ASSERT_EQ( rLabels.size(), pSet->Centroids.size() );
      Centroids[rName] += pSet->Centroids.size();
      InFrame += pSet->Centroids.size();
      for ( std::size_t Index = 0; Index < rLabels.size(); ++Index )
      {
        EXPECT_EQ( pSet->Centroids[Index].radius, 4 );
        ASSERT_EQ( rLabels[Index].SubjectId, rSubject.Id );
        const std::string& rMarker = rSubject.Markers.at( rLabels[Index].MarkerId ).Name;
        ASSERT_LT( rAssigned[Index], static_cast< int >( rPoints.size() ) );
        if ( rAssigned[Index] >= 0 )
        {
          ++Assigned[rName];
          // Ids number the points from 1, keypoints count from 0.
          const auto Id = rPoints[static_cast< std::size_t >( rAssigned[Index] )].Id;
          EXPECT_EQ( rMarker, "keypoint " + std::to_string( Id - 1 ) );
        }
      }
    }
    EXPECT_GE( InFrame, 14u );
    EXPECT_LE( InFrame, 48u );
  }
  for ( std::size_t Camera = 0; Camera < 4; ++Camera )
  {
    const VRecordingCamera& rCamera = pR->Cameras[Camera];
    SCOPED_TRACE( rCamera.Camera.Name );
    EXPECT_EQ( Centroids[rCamera.Camera.Name], Known[Camera].Rows );
    EXPECT_EQ( Assigned[rCamera.Camera.Name], rCamera.MeasuredCount );
    EXPECT_NEAR( rCamera.MeanDistance, Known[Camera].Mean, 0.01 );
    EXPECT_NEAR( rCamera.WorstDistance, Known[Camera].Worst, 0.06 );
  }
  EXPECT_NEAR( static_cast< double >( pR->Cameras[0].Detections[0].x ), 577.268311, 1e-4 );
}

TEST_F( FolderRecording, ThePersonIsFoundBesideTheBystander )
{
  HARROW_NEEDS_RECORDINGS();
  const struct
  {
    const char* pFolder;
    std::int64_t Frames;
    std::size_t Observations;
    double Means[4];
  } Cases[] = { { "balancing", 100, 8082, { 15.9, 8.9, 24.7, 10.2 } },
                { "static", 12, 1008, { 14.5, 7.8, 13.8, 7.2 } } };
  for ( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.pFolder );
    const auto pR = Read( TestSupport::RecordingsDir() / "multicam-person" / rCase.pFolder );
    ASSERT_EQ( pR->Cameras.size(), 4u );
    EXPECT_EQ( pR->Name, rCase.pFolder );
    EXPECT_THAT( m_Notes, testing::HasSubstr( "those of markers21.trc" ) );
    EXPECT_EQ( pR->FrameCount, rCase.Frames );
    EXPECT_EQ( pR->RateHz, 60 );
    EXPECT_EQ( pR->UpAxis, EUpAxis::Z );
    EXPECT_EQ( pR->PointCount(), 21u );
    EXPECT_THAT( m_Notes, testing::HasSubstr( "\"zxy\"" ) );
    std::size_t Measured = 0;
    for ( std::size_t Camera = 0; Camera < 4; ++Camera )
    {
      const VRecordingCamera& rCamera = pR->Cameras[Camera];
      EXPECT_NEAR( rCamera.MeanDistance, rCase.Means[Camera], 0.2 ) << Camera;
      EXPECT_EQ( rCamera.Camera.Name, "cam_0" + std::to_string( Camera + 1 ) );
      Measured += rCamera.MeasuredCount;
      EXPECT_TRUE( std::none_of( rCamera.Detections.begin(), rCamera.Detections.end(),
                                 []( const VRecordingDetection& i_rSeen )
                                 {
                                   return i_rSeen.Likelihood <= 0;
                                 } ) );
    }
    EXPECT_EQ( Measured, rCase.Observations );
  }
  const auto pR = Read( TestSupport::RecordingsDir() / "multicam-person" / "balancing" );
  ExpectPoint( *pR, 0, "RHip", -1400.589, -64.972, 901.505, 1e-2 );
  // In the first frame camera 1 sees two persons; one of them is nobody that is known.
  const auto Detections = pR->Cameras[0].Frame( 0 );
  EXPECT_GT( Detections.size(), 25u );
  std::size_t Known = 0;
  for ( const VRecordingDetection& rSeen : Detections )
  {
    Known += rSeen.Point >= 0;
    if ( rSeen.Point == static_cast< int >( LabelIndex( *pR, "RHip" ) ) )
    {
      EXPECT_NEAR( static_cast< double >( rSeen.x ), 389.456, 1e-3 );
    }
  }
  EXPECT_EQ( Known, 21u );
  const auto pKept =
      Read( TestSupport::RecordingsDir() / "multicam-person" / "static", ZEK::IResult::Ok, { "xyz", {} } );
  EXPECT_THAT( m_Notes, testing::HasSubstr( "as was asked" ) );
  ExpectPoint( *pKept, 0, "RHip", -80.589, 869.695, 76.164, 1e-2 );
  const VRecordingInfo Info = DescribeRecording( *pR );
  EXPECT_THAT( Info.Text(), testing::HasSubstr( "cam_03, 1088 x 1920, calibrated, " ) );
  EXPECT_THAT( Info.Text(), testing::HasSubstr( "at 60 Hz" ) );
  EXPECT_THAT( Info.Json(), testing::HasSubstr( "\"framesSeen\": 100" ) );
}

TEST_F( FolderRecording, RowsInAnyOrderAndOnesThatAreNone )
{
  Save( "cameras.toml", OneCamera );
  Save( "a.csv", std::string( Head2d ) +
                     "12,0,0,1,600,400\n10,0,0,1,500,500\n10,0,0,0,500,400\n10,0,0,0,9,9\n10,7,0,0,1,2\n"
                     "10,0,0,2,nan,5\n11,0,0,x,5,5\n10.5,0,0,1,5,5\n12,0,0,0,5" );
  // One metre in front of the camera.
  Save( "b.csv", std::string( Head3d ) + "10,0,0,0,0,1\n10,0,1,0,0.1,1\n12,0,1,0.1,0,1\n" );
  const auto pR = Read( m_Folder.Path(), ZEK::IResult::OkButPartial );
  EXPECT_THAT( m_Message, testing::HasSubstr( "a.csv: 2 rows were left out; the first: line 8: expected a number" ) );
  EXPECT_THAT( m_Message, testing::HasSubstr( "ends within a row" ) );
  EXPECT_THAT( m_Message, testing::HasSubstr( "2 rows hold what is no number" ) );
  EXPECT_THAT( m_Message, testing::HasSubstr( "1 rows see a point in a camera for the second time" ) );
  EXPECT_THAT( m_Notes, testing::HasSubstr( "does not know the camera \"cam_7\"" ) );
  EXPECT_EQ( pR->FrameCount, 3 );
  EXPECT_EQ( pR->RateHz, 100 );
  ASSERT_EQ( pR->Cameras.size(), 2u );
  EXPECT_EQ( pR->Cameras[0].Detections.size(), 3u );
  EXPECT_EQ( pR->Cameras[0].MeasuredCount, 3u );
  EXPECT_LT( pR->Cameras[0].WorstDistance, 1e-3 );
  EXPECT_FALSE( pR->Cameras[1].Camera.Calibration.has_value() );
  VRecordingSource Source( pR );
  const auto pFirst = State( Source, 0 ), pLast = State( Source, 2 ), pEmpty = State( Source, 1 );
  EXPECT_THAT( ByDevice< FlowCentroidAssignmentSet >( pFirst ).at( "cam_0" )->Reconstruction,
               testing::ElementsAre( 0, 1 ) );
  // Its point is the only one that is there.
  EXPECT_THAT( ByDevice< FlowCentroidAssignmentSet >( pLast ).at( "cam_0" )->Reconstruction,
               testing::ElementsAre( 0 ) );
  EXPECT_EQ( ByDevice< FlowCentroidLabelSet >( pLast ).at( "cam_0" )->Labels[0].MarkerId, 1u );
  EXPECT_TRUE( ByDevice< FlowCentroidSet >( pEmpty ).at( "cam_0" )->Centroids.empty() );
  EXPECT_EQ( ByDevice< FlowCentroidSet >( pLast ).at( "cam_7" ), ByDevice< FlowCentroidSet >( pEmpty ).at( "cam_7" ) )
      << "what did not change is handed on";
  EXPECT_EQ( ByDevice< FlowCameraCalibration >( pFirst ).size(), 1u );
}

TEST_F( FolderRecording, WithoutCalibrationCentroidsAreThere )
{
  const std::string Person = R"({"pose_keypoints_2d": [10, 20, 0.5, 0, 0, 0, 30, 39.5, 1, NaN, 1, 1]})";
  Save( "left/f_0005.json", "{\"people\": [" + Person + "]}" );
  Save( "left/f_0007.json", "{\"people\": [" + Person + ", 3, {}, " + Person + "]}" );
  Save( "left/f_0006.json", "{\"people\": [" + Person );
  Save( "right/f_0006.json", std::string( 100000, '[' ) );
  const auto pR = Read( m_Folder.Path(), ZEK::IResult::OkButPartial );
  EXPECT_THAT( m_Message, testing::HasSubstr( "2 JSON files could not be used; the first: " ) );
  EXPECT_THAT( m_Message, testing::HasSubstr( "f_0006.json: byte offset" ) );
  EXPECT_THAT( m_Message, testing::HasSubstr( "3 keypoints are not numbers" ) );
  EXPECT_THAT( m_Notes, testing::HasSubstr( "uncalibrated" ) );
  ASSERT_EQ( pR->Cameras.size(), 2u );
  EXPECT_EQ( pR->FirstFrame, 5 );
  EXPECT_EQ( pR->FrameCount, 3 );
  EXPECT_EQ( pR->Cameras[0].Camera.Hardware.SensorHeight, 41u );
  VRecordingSource Source( pR );
  const auto pState = State( Source, 0 );
  EXPECT_EQ( ByDevice< FlowCentroidSet >( pState ).at( "left" )->Centroids.size(), 2u );
  EXPECT_EQ( ByDevice< FlowCentroidLabelSet >( pState ).at( "left" )->Labels[1].MarkerId, 2u );
  EXPECT_THAT( ByDevice< FlowCentroidAssignmentSet >( pState ).at( "left" )->Reconstruction,
               testing::ElementsAre( -1, -1 ) );
  EXPECT_TRUE( ByDevice< FlowCameraCalibration >( pState ).empty() );
  // With two persons nobody knows who is who.
  EXPECT_EQ( ByDevice< FlowCentroidLabelSet >( State( Source, 2 ) ).at( "left" )->Labels[0].MarkerId, 0xFFFFFFFFu );
}

TEST_F( FolderRecording, CutAndChangedFilesGiveFramesOrAReason )
{
  const std::string Table =
      std::string( Head2d ) + "1,0,0,0,500,400\n1,0,0,1,600,400\n2,0,0,0,500,500\n3,0,0,1,500,400\n";
  const std::string Frame = R"({"people": [{"pose_keypoints_2d": [10, 20, 0.5, 3e1, 4, 1]}, {"person_id": [-1]}]})";
  Save( "cameras.toml", OneCamera );
  const struct
  {
    const char* pFile;
    const std::string& rText;
  } Files[] = { { "tables/points2d.csv", Table }, { "frames/cam_0/frame.01.json", Frame } };
  for ( const auto& rFile : Files )
  {
    for ( std::size_t Place = 0; Place <= rFile.rText.size(); ++Place )
    {
      for ( const char* const pChange : { "", "9e99", "{", "-\n" } )
      {
        // The first only cuts; the others stand where a character was.
        std::string Text = rFile.rText.substr( 0, Place ) + pChange;
        Text += *pChange && Place < rFile.rText.size() ? rFile.rText.substr( Place + 1 ) : "";
        const auto Path = Save( rFile.pFile, Text );
        VRecording Recording;
        std::string Message;
        const auto Folder = m_Folder.Path() / *std::filesystem::path( rFile.pFile ).begin();
        const ZEK::IResult Result = ReadFolder( Folder, Recording, Message );
        ASSERT_EQ( Result.IsError(), Recording.FrameCount == 0 ) << Text << Message;
        ASSERT_EQ( Result == ZEK::IResult( ZEK::IResult::Ok ), Message.empty() ) << Text << Message;
        const auto pRecording = std::make_shared< VRecording >( std::move( Recording ) );
        VRecordingSource Source( pRecording );
        for ( std::int64_t Index = 0; Index < std::min< std::int64_t >( Source.FrameCount(), 4 ); ++Index )
        {
          State( Source, Index );
        }
      }
    }
  }
}

TEST_F( FolderRecording, WhatCannotBeReadIsNamed )
{
  const struct
  {
    const char *pFile, *pText;
    ZEK::IResult Expected;
    const char* pMessage;
  } Cases[] = {
      { "", "", ZEK::IResult::FileIOFailure, "a folder that is empty" },
      { "notes.txt", "hello", ZEK::IResult::FileIOFailure, "a folder without them" },
      { "points2d.csv", "", ZEK::IResult::EndOfData, "points2d.csv: line 1: expected the names of columns" },
      { "points2d.csv", "sync_index,cam_id,keypoint_id,img_loc_x\n1,2,3,4\n", ZEK::IResult::InvalidFormat,
        "found no img_loc_y" },
      { "points2d.csv", Head2d, ZEK::IResult::EndOfData, "expected rows" },
      { "points3d.csv", "sync_index,keypoint_id,x_coord,y_coord,z_coord\n1,nan,1,1,1\n", ZEK::IResult::EndOfData,
        "none that can be used" },
      { "points3d.csv", "sync_index,keypoint_id,x_coord,y_coord,z_coord\n1,0,1,1,1\n900000000000,0,1,1,1\n",
        ZEK::IResult::InvalidFormat, "from 1 to 900000000000" },
      { "cam/1.json", "{\"people\": 3}", ZEK::IResult::InvalidFormat, "the list \"people\"" },
      { "bad.trc", "nothing", ZEK::IResult::InvalidFormat, "PathFileType" },
  };
  int Number = 0;
  for ( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.pMessage );
    const auto Folder = m_Folder.Path() / std::to_string( ++Number );
    std::filesystem::create_directories( Folder );
    if ( *rCase.pFile )
    {
      Save( std::to_string( Number ) + "/" + rCase.pFile, rCase.pText );
    }
    EXPECT_EQ( Read( Folder, rCase.Expected )->FrameCount, 0 );
    EXPECT_THAT( m_Message, testing::StartsWith( Folder.string() ) );
    EXPECT_THAT( m_Message, testing::HasSubstr( rCase.pMessage ) );
  }
  Read( m_Folder.Path(), ZEK::IResult::InvalidArgument, { "xxy", {} } );
  Read( m_Folder.Path(), ZEK::IResult::InvalidArgument, { "yxz", {} } );
}

} // namespace HostSources
