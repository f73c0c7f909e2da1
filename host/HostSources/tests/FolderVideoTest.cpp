#include "ReadHelpers.h"
#include "VideoWriter.h"

#include <CoreMoxelTypes/FlowTypes.h>
#include <HostFlow/VFlowFramework.h>
#include <HostSources/VFolderReader.h>
#include <HostSources/VRecordingSource.h>
#include <HostSources/VSourcePump.h>

#include <chrono>
#include <fstream>
#include <map>
#include <thread>

namespace HostSources
{
namespace
{
using namespace CoreMoxelTypes;
using testing::HasSubstr;
using testing::Not;

using VVideoItems = std::map< std::string, ZEK::VFlowItemRef >;

VVideoItems VideosOf( const ZEK::VFlowStateRef& i_rState )
{
  VVideoItems All;
  ZEK::VFlowCursor At, End;
  i_rState->TagBegin( At, ZEK::FlowTag< FlowVideoFrame >, ZEK::EFlowTimeMatch::Overlap );
  i_rState->TagEnd( End, ZEK::FlowTag< FlowVideoFrame >, ZEK::EFlowTimeMatch::Overlap );
  for ( ; !( At == End ); ++At )
  {
    std::string_view Name;
    EXPECT_TRUE( At->pItem->Value().GetName( ZEK::EFlowNameDevice, Name ) );
    All[std::string( Name )] = ZEK::VFlowItemRef( const_cast< ZEK::IFlowItem* >( At->pItem ) );
  }
  return All;
}

const VVideoFrame& FrameOf( const VVideoItems& i_rItems, const std::string& i_rCamera )
{
  static const VVideoFrame None;
  const auto It = i_rItems.find( i_rCamera );
  return It == i_rItems.end() ? None : *ZEK::FlowPayload< VVideoFrame >( It->second.Get() );
}

class FolderVideo : public testing::Test
{
protected:
  void Save( const std::string& i_rName, const std::string& i_rText )
  {
    const auto Path = m_Folder.Path() / i_rName;
    std::filesystem::create_directories( Path.parent_path() );
    std::ofstream( Path, std::ios::binary ) << i_rText;
  }
  void SaveVideo( const std::string& i_rName, int i_Frames, int i_RateHz )
  {
    const auto Path = m_Folder.Path() / i_rName;
    std::filesystem::create_directories( Path.parent_path() );
    HostVideo::VWrittenVideo Video;
    Video.Codec = "mpeg4";
    Video.Frames = i_Frames;
    Video.RateHz = i_RateHz;
    EXPECT_TRUE( HostVideo::WriteVideo( Path, Video ) );
  }
  /// A file a frame, each with one point.
  void SaveDetections( const std::string& i_rCamera, int i_Frames, int i_First = 0 )
  {
    for ( int Frame = 0; Frame < i_Frames; ++Frame )
    {
      Save( i_rCamera + "/f_" + std::to_string( i_First + Frame ) + ".json",
            "{\"people\": [{\"pose_keypoints_2d\": [" + std::to_string( Frame ) + ", 20, 0.5]}]}" );
    }
  }
  std::shared_ptr< VRecording > Read( const std::filesystem::path& i_rPath )
  {
    auto pRecording = std::make_shared< VRecording >();
    std::string Message;
    double Done = 0;
    const auto Progress = [&]( double i_Fraction )
    {
      EXPECT_LE( Done, i_Fraction );
      Done = i_Fraction;
      return true;
    };
    EXPECT_EQ( ReadFolder( i_rPath, *pRecording, Message, Progress ), ZEK::IResult( ZEK::IResult::Ok ) ) << Message;
    EXPECT_LE( Done, 1 );
    m_Notes.clear();
    for ( const std::string& rNote : pRecording->Notes )
    {
      m_Notes += rNote + "\n";
    }
    return pRecording;
  }
  VVideoItems Videos( VRecordingSource& io_rSource, std::int64_t i_Index )
  {
    ZEK::VFlowStateRef Made;
    EXPECT_EQ( io_rSource.MakeState( i_Index, m_Maker, Made ), ZEK::IResult( ZEK::IResult::Ok ) );
    return VideosOf( Made );
  }

  const VStateMaker m_Maker{ HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 2 };
  TestSupport::VTemporaryDir m_Folder;
  std::string m_Notes;
};
} // namespace

TEST_F( FolderVideo, ThePersonsVideoRunsBehindTheDetections )
{
  HARROW_NEEDS_RECORDINGS();
  const auto pR = Read( TestSupport::RecordingsDir() / "multicam-person/static" );
  EXPECT_THAT( m_Notes, HasSubstr( "The video cam03.mp4 is 1080 x 1920, the sensor of \"cam_03\" 1088 x 1920; it is "
                                   "stretched to the whole sensor." ) );
  EXPECT_THAT( m_Notes, HasSubstr( "The video cam01.mp4 has 11 frames, the camera's detections 12; its last one stays "
                                   "until the end." ) );
  const std::string Info = DescribeRecording( *pR ).Text();
  EXPECT_THAT( Info, HasSubstr( "video cam02.mp4: h264, 1088 x 1920, yuv420p, 11 frames at 60 Hz, frame by frame" ) );
  EXPECT_THAT( DescribeRecording( *pR ).Json(), HasSubstr( "\"codec\": \"h264\"" ) );
  VRecordingSource Source( pR );
  const VVideoItems Sixth = Videos( Source, 6 );
  ASSERT_EQ( Sixth.size(), 4u );
  for ( const auto& [rCamera, rItem] : Sixth )
  {
    const VVideoFrame& rFrame = FrameOf( Sixth, rCamera );
    EXPECT_EQ( rFrame.Format, EPixelFormat::I420 );
    EXPECT_NEAR( rFrame.PresentationTime, 0.1, 1e-6 );
    EXPECT_EQ( rFrame.Width, rCamera < "cam_03" ? 1088u : 1080u );
    // The image covers the sensor from the first edge to the last.
    const auto Right = static_cast< float >( rFrame.Width ) - 0.5f;
    EXPECT_NEAR( rFrame.SensorOffset.x + rFrame.SensorScale.x * Right, 1087.5f, 1e-2f );
    EXPECT_NEAR( rFrame.SensorOffset.x - rFrame.SensorScale.x / 2, -0.5f, 1e-4f );
  }
  const VVideoItems Again = Videos( Source, 6 ), Last = Videos( Source, 10 ), After = Videos( Source, 11 );
  EXPECT_EQ( Again.at( "cam_01" ).Get(), Sixth.at( "cam_01" ).Get() );
  EXPECT_NE( Last.at( "cam_01" ).Get(), Sixth.at( "cam_01" ).Get() );
  EXPECT_EQ( After.at( "cam_01" ).Get(), Last.at( "cam_01" ).Get() );
  EXPECT_TRUE( pR->Cameras[0].Camera.Hardware.Video );
  const auto pWithout = Read( TestSupport::RecordingsDir() / "multicam-person/balancing" );
  EXPECT_THAT( m_Notes, Not( HasSubstr( "ideo" ) ) );
  VRecordingSource Without( pWithout );
  EXPECT_TRUE( Videos( Without, 30 ).empty() );
}

TEST_F( FolderVideo, EachCameraShowsTheFrameOfItsTimeAndFaultsStopNoOther )
{
  for ( const char* const pCamera : { "a", "b", "c", "d" } )
  {
    SaveDetections( pCamera, 60 );
  }
  SaveVideo( "a/a.mp4", 60, 60 );
  SaveVideo( "videos/b.mkv", 30, 30 );
  Save( "videos/c.mp4", "this is no video" );
  SaveVideo( "stray.mp4", 5, 25 );
  const auto pR = Read( m_Folder.Path() );
  EXPECT_THAT( m_Notes, HasSubstr( "The frame rate is that of the videos." ) );
  EXPECT_THAT( m_Notes, HasSubstr( "The video b.mkv has 30 frames a second, the recording 60; the frame nearest in" ) );
  EXPECT_THAT( m_Notes, HasSubstr( "The video of the camera \"c\" cannot be shown: " ) );
  EXPECT_THAT( m_Notes, HasSubstr( "Cameras without a video: \"c\", \"d\"." ) );
  EXPECT_THAT( m_Notes, HasSubstr( "The video stray.mp4 is not shown" ) );
  EXPECT_EQ( pR->RateHz, 60 );
  // Nobody tells of the sensors but the videos.
  EXPECT_EQ( pR->Cameras[0].Camera.Hardware.SensorWidth, 128u );
  VRecordingSource Source( pR );
  VVideoItems Before;
  for ( const std::int64_t Index : { 0, 1, 2, 3, 58, 59, 7, 6, 0 } )
  {
    SCOPED_TRACE( Index );
    const VVideoItems Items = Videos( Source, Index );
    ASSERT_EQ( Items.size(), 2u );
    EXPECT_EQ( HostVideo::ShownNumber( FrameOf( Items, "a" ) ), Index );
    EXPECT_EQ( HostVideo::ShownNumber( FrameOf( Items, "b" ) ), Index / 2 );
    if ( Index == 1 || Index == 3 )
    {
      EXPECT_EQ( Items.at( "b" ).Get(), Before.at( "b" ).Get() ) << "the same frame of the video is the same item";
    }
    Before = Items;
  }
}

TEST_F( FolderVideo, PlaybackGoesOnAndCatchesUp )
{
  SaveDetections( "cam", 200 );
  SaveVideo( "cam.mp4", 200, 50 );
  const auto pSource = std::make_shared< VRecordingSource >( Read( m_Folder.Path() ) );
  const auto pCache = HostFlow::MakeCache();
  VSourcePump Pump( pSource, pCache, m_Maker );
  const auto Newest = [&]
  {
    ZEK::VFlowStateRef State;
    pCache->Fetch( State, 31, 2, 0 );
    return State;
  };
  Pump.StartFollow();
  for ( const std::int64_t Index : { 0, 150, 3, 199, 198, 40 } )
  {
    SCOPED_TRACE( Index );
    Pump.Show( Index );
    Pump.WaitShown();
    // The frame of the recording is there at once, that of the video as soon as it is decoded, with nobody asking.
    ASSERT_EQ( Newest()->GetKey().Frame, Index * pSource->TicksPerFrame() );
    const auto IsThere = [&]
    {
      const VVideoItems Items = VideosOf( Newest() );
      return !Items.empty() && HostVideo::ShownNumber( FrameOf( Items, "cam" ) ) == Index;
    };
    const auto End = std::chrono::steady_clock::now() + std::chrono::seconds( 30 );
    while ( !IsThere() && std::chrono::steady_clock::now() < End )
    {
      std::this_thread::yield();
    }
    ASSERT_TRUE( IsThere() );
    EXPECT_EQ( Pump.ShownIndex(), Index );
  }
  // A run without pauses ends with the frame that was asked for last, whatever the video does.
  for ( std::int64_t Index = 41; Index < 120; ++Index )
  {
    Pump.Show( Index );
  }
  Pump.WaitShown();
  EXPECT_EQ( Pump.ShownIndex(), 119 );
  Pump.Stop();
  // A still waits for the exact frame again.
  for ( const std::int64_t Index : { 10, 190 } )
  {
    EXPECT_EQ( HostVideo::ShownNumber( FrameOf( Videos( *pSource, Index ), "cam" ) ), Index );
  }
}

TEST_F( FolderVideo, NumbersOfDetectionsThatBeginLaterAreThoseOfTheVideo )
{
  // Numbers from 1 on merely count.
  for ( const auto& [First, Shown] : { std::pair{ 35, 35 }, { 1, 0 }, { 0, 0 } } )
  {
    SCOPED_TRACE( First );
    const std::string Folder = std::to_string( First ).append( "/" );
    SaveDetections( Folder + "cam01", 20, First );
    SaveVideo( Folder + "cam01/whole.mp4", 80, 60 );
    VRecordingSource Source( Read( m_Folder.Path() / Folder ) );
    EXPECT_EQ( HostVideo::ShownNumber( FrameOf( Videos( Source, 0 ), "cam01" ) ), Shown );
    EXPECT_EQ( HostVideo::ShownNumber( FrameOf( Videos( Source, 19 ), "cam01" ) ), Shown + 19 );
  }
}

TEST_F( FolderVideo, TablesWithoutTimesTakeTheRateOfTheVideos )
{
  std::string Rows = "sync_index,cam_id,object_id,keypoint_id,img_loc_x,img_loc_y\n";
  for ( int Frame = 0; Frame < 20; ++Frame )
  {
    Rows.append( std::to_string( Frame ) ).append( ",0,0,0,10,20\n" );
  }
  Save( "points2d.csv", Rows );
  EXPECT_EQ( Read( m_Folder.Path() )->RateHz, 100 );
  EXPECT_THAT( m_Notes, HasSubstr( "100 Hz was taken" ) );
  SaveVideo( "cam_0.mp4", 20, 50 );
  EXPECT_EQ( Read( m_Folder.Path() )->RateHz, 50 );
  EXPECT_THAT( m_Notes, HasSubstr( "The frame rate is that of the videos." ) );
  EXPECT_THAT( m_Notes, Not( HasSubstr( "100 Hz" ) ) );
  Save( "times.csv", "sync_index,cam_id,frame_time\n0,0,0\n19,0,0.76\n" );
  EXPECT_NEAR( Read( m_Folder.Path() )->RateHz, 25, 1e-9 );
}

TEST_F( FolderVideo, AFileGoesToTheCameraThatItIsMostSurelyOf )
{
  SaveDetections( "left", 5 );
  SaveDetections( "left_rear", 5 );
  SaveVideo( "videos/left_rear.mp4", 5, 60 );
  const auto pR = Read( m_Folder.Path() );
  ASSERT_EQ( pR->Cameras.size(), 2u );
  EXPECT_FALSE( pR->Cameras[0].Video.pClip );
  EXPECT_TRUE( pR->Cameras[1].Video.pClip );
  EXPECT_THAT( m_Notes, HasSubstr( "Cameras without a video: \"left\"." ) );
}

TEST_F( FolderVideo, AFileIsThatOfTheCameraItIsNamedAfter )
{
  const struct
  {
    const char *pCamera, *pFile;
    bool bHers;
  } Cases[] = { { "cam_01", "v/Cam01.MP4", true },    { "cam_01", "v/Static_cam_1.mkv", true },
                { "cam_01", "v/cam11.mp4", false },   { "cam_01", "cam_01/film.avi", true },
                { "cam_01", "v/camera 1.mov", true }, { "cam_01", "v/1.mp4", true },
                { "cam_01", "v/trial1.mp4", false },  { "left", "v/Trial 3 left.mp4", true },
                { "left", "v/right.mp4", false },     { "cam_10", "v/cam_1.mp4", false },
                { "cam_01", "v/cam_01.txt", false },  { "a", "v/Gait_b.mp4", false },
                { "a", "v/Gait_a.mp4", true },        { "a", "v/A take 2.mp4", true },
                { "left", "v/GaitLeft.mp4", true },   { "a1", "v/gamma1.mp4", false },
                { "left", "v/leftover.mp4", false },  { "cam_01", "v/StaticCam01.mp4", true } };
  int Number = 0;
  for ( const auto& rCase : Cases )
  {
    SCOPED_TRACE( std::string( rCase.pCamera ) + " " + rCase.pFile );
    const std::string Folder = std::to_string( ++Number ) + "/";
    Save( Folder + rCase.pCamera + "/f_0.json", "{\"people\": [{\"pose_keypoints_2d\": [1, 20, 0.5]}]}" );
    Save( Folder + rCase.pFile, "empty" );
    Read( m_Folder.Path() / std::to_string( Number ) );
    EXPECT_EQ( m_Notes.find( "cannot be shown: " ) != std::string::npos, rCase.bHers ) << m_Notes;
  }
}

} // namespace HostSources
