#include "VVideoDecoder.h"
#include "VideoWriter.h"

#include <HostVideo/VVideoStream.h>

#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <condition_variable>
#include <fstream>
#include <mutex>
#include <random>

namespace HostVideo
{
namespace
{
using CoreMoxelTypes::EPixelFormat;
using testing::HasSubstr;

class VideoFiles : public testing::Test
{
protected:
  std::filesystem::path Write( const std::string& i_rName, const VWrittenVideo& i_rVideo )
  {
    const auto Path = m_Folder.Path() / i_rName;
    EXPECT_TRUE( WriteVideo( Path, i_rVideo ) ) << i_rVideo.Codec;
    return Path;
  }
  std::filesystem::path Save( const std::string& i_rName, const std::string& i_rBytes )
  {
    const auto Path = m_Folder.Path() / i_rName;
    std::ofstream( Path, std::ios::binary ) << i_rBytes;
    return Path;
  }
  static std::string Bytes( const std::filesystem::path& i_rPath )
  {
    std::ifstream File( i_rPath, std::ios::binary );
    return { std::istreambuf_iterator< char >( File ), {} };
  }
  std::shared_ptr< const VVideoClip > Scan( const std::filesystem::path& i_rPath,
                                            ZEK::IResult i_Expected = ZEK::IResult::Ok )
  {
    const auto pClip = std::make_shared< VVideoClip >();
    EXPECT_EQ( ScanVideo( i_rPath, *pClip, m_Message ), i_Expected ) << m_Message;
    return pClip;
  }

  TestSupport::VTemporaryDir m_Folder;
  std::string m_Message;
};

struct VCase
{
  const char* pName;
  const char* pFile;
  VWrittenVideo Video;
  bool bCounted = false;
};

VWrittenVideo Coded( const char* i_pCodec, int i_BFrames, const char* i_pFormat = "yuv420p" )
{
  VWrittenVideo Video;
  Video.Codec = i_pCodec;
  Video.BFrames = i_BFrames;
  Video.PixelFormat = i_pFormat;
  return Video;
}

class VideoForms : public VideoFiles, public testing::WithParamInterface< VCase >
{
};
} // namespace

TEST_P( VideoForms, EveryFrameIsExactWhereverOneSeeks )
{
  const VCase& rCase = GetParam();
  const auto Path = m_Folder.Path() / rCase.pFile;
  if ( !WriteVideo( Path, rCase.Video ) )
  {
    GTEST_SKIP() << "there is no encoder " << rCase.Video.Codec << " here";
  }
  const auto pClip = Scan( Path );
  ASSERT_EQ( pClip->FrameCount(), 60 );
  EXPECT_NEAR( pClip->RateHz, 60, 0.01 );
  EXPECT_TRUE( pClip->bEven );
  EXPECT_EQ( pClip->Stamps.empty(), rCase.bCounted );
  EXPECT_EQ( pClip->Notes.empty(), !rCase.bCounted ) << pClip->Notes.front();
  VVideoStream Stream( pClip );
  const auto Check = [&]( std::int64_t i_Index )
  {
    const VVideoPicture Picture = Stream.GetExact( i_Index );
    EXPECT_TRUE( Picture.bExact );
    ASSERT_EQ( Picture.Index, i_Index );
    ASSERT_TRUE( Picture.Frame.Data );
    ASSERT_EQ( ShownNumber( Picture.Frame ), i_Index );
    EXPECT_NEAR( Picture.Frame.PresentationTime, static_cast< double >( i_Index ) / 60, 2e-3 );
    EXPECT_EQ( Stream.GetExact( i_Index ).Frame.Data, Picture.Frame.Data );
  };
  for ( int Round = 0; Round < 2; ++Round )
  {
    for ( std::int64_t Index = 0; Index < 60; ++Index )
    {
      Check( Index );
    }
  }
  for ( std::int64_t Index = 59; Index >= 0; --Index )
  {
    Check( Index );
  }
  std::mt19937 Random( 7 );
  for ( int Step = 0; Step < 40; ++Step )
  {
    Check( static_cast< std::int64_t >( Random() % 60 ) );
  }
  EXPECT_EQ( Stream.GetExact( 1000 ).Index, 59 );
  EXPECT_EQ( Stream.GetExact( -3 ).Index, 0 );
  EXPECT_EQ( Stream.Counts().Missing, 0u );
}

INSTANTIATE_TEST_SUITE_P( All, VideoForms,
                          testing::Values( VCase{ "Mpeg4Mp4", "a.mp4", Coded( "mpeg4", 2 ) },
                                           VCase{ "Mpeg4Matroska", "a.mkv", Coded( "mpeg4", 0 ) },
                                           VCase{ "Mpeg4Avi", "a.avi", Coded( "mpeg4", 2 ), true },
                                           VCase{ "Mpeg2Stream", "a.ts", Coded( "mpeg2video", 2 ) },
                                           VCase{ "Ffv1Matroska", "a.mkv", Coded( "ffv1", 0 ) },
                                           VCase{ "MjpegAvi", "a.avi", Coded( "mjpeg", 0, "yuvj420p" ) },
                                           VCase{ "H264Mp4", "a.mp4", Coded( "libx264", 3 ) } ),
                          []( const auto& i_rInfo )
                          {
                            return std::string( i_rInfo.param.pName );
                          } );

TEST_F( VideoFiles, PlayingDecodesEachFrameOnceAndHoldsFew )
{
  VWrittenVideo Video = Coded( "mpeg4", 2 );
  Video.Width = 320;
  Video.Height = 240;
  Video.Frames = 200;
  const auto pClip = Scan( Write( "long.mp4", Video ) );
  const std::size_t FrameBytes = 320 * 240 * 3 / 2;
  for ( const std::size_t Most : { std::size_t{ 0 }, std::size_t{ 6 * 320 * 240 * 2 }, std::size_t{ 48 } << 20 } )
  {
    VVideoStream Stream( pClip, { Most, 1 } );
    for ( std::int64_t Index = 0; Index < 200; ++Index )
    {
      ASSERT_EQ( Stream.GetExact( Index ).Index, Index );
    }
    const VVideoStreamCounts Counts = Stream.Counts();
    EXPECT_LE( Counts.MostHeldBytes, std::max( Most, 2 * FrameBytes ) );
    EXPECT_LE( Counts.MostHeldFrames, 12u );
    EXPECT_GE( Counts.MostHeldFrames, 2u );
    EXPECT_EQ( Counts.Decoded, 200u );
    EXPECT_EQ( Counts.Seeks, 0u );
    // A step back lies in the ring where there is room for more than two.
    const std::int64_t Back = Most == 0 ? 199 : 198;
    EXPECT_EQ( Stream.GetExact( Back ).Index, Back );
    EXPECT_EQ( Stream.Counts().Decoded, 200u );
  }
}

TEST_F( VideoFiles, AFrameThatIsNotThereYetIsToldOfWhenItIs )
{
  VWrittenVideo Video = Coded( "mpeg4", 2 );
  Video.Width = 640; // large enough to be late
  Video.Height = 480;
  const auto pClip = Scan( Write( "a.mp4", Video ) );
  VVideoStream Stream( pClip );
  std::mutex Guard;
  std::condition_variable Told;
  int Calls = 0;
  Stream.SetOnReady(
      [&]
      {
        const std::lock_guard Lock( Guard );
        ++Calls;
        Told.notify_all();
      } );
  int Expected = 0;
  for ( const std::int64_t Index : { 50, 3, 59, 20 } )
  {
    const std::int64_t Before = Index == 50 ? -1 : Stream.GetExact( 30 ).Index;
    const VVideoPicture Late = Stream.Get( Index );
    if ( Late.bExact )
    {
      EXPECT_EQ( Late.Index, Index );
      continue;
    }
    // Nothing, the last one, or one on the way.
    EXPECT_TRUE( Late.Index == Before || ( Late.Index >= 0 && Late.Index <= Index ) ) << Late.Index;
    ++Expected;
    std::unique_lock Lock( Guard );
    Told.wait( Lock,
               [&]
               {
                 return Calls == Expected;
               } );
    Lock.unlock();
    const VVideoPicture There = Stream.Get( Index );
    EXPECT_TRUE( There.bExact );
    EXPECT_EQ( ShownNumber( There.Frame ), Index );
  }
  EXPECT_GE( Expected, 1 );
}

TEST_F( VideoFiles, WhatIsLeftOfACutFilePlays )
{
  VWrittenVideo First = Coded( "mpeg4", 0 );
  First.bIndexFirst = true;
  const std::pair< std::string, VWrittenVideo > Files[] = { { "a.mp4", First }, { "b.mkv", Coded( "ffv1", 0 ) } };
  for ( const auto& [rName, rVideo] : Files )
  {
    SCOPED_TRACE( rName );
    const std::string Whole = Bytes( Write( rName, rVideo ) );
    const auto pClip =
        Scan( Save( "cut-" + rName, Whole.substr( 0, Whole.size() * 6 / 10 ) ), ZEK::IResult::OkButPartial );
    ASSERT_GT( pClip->FrameCount(), 10 );
    ASSERT_FALSE( pClip->Notes.empty() );
    EXPECT_LT( pClip->FrameCount(), 50 );
    EXPECT_THAT( pClip->Notes.front(), HasSubstr( "cut off or damaged: " + std::to_string( pClip->FrameCount() ) ) );
    VVideoStream Stream( pClip );
    for ( const std::int64_t Index : { pClip->FrameCount() - 1, std::int64_t{ 5 }, pClip->FrameCount() - 2 } )
    {
      EXPECT_EQ( ShownNumber( Stream.GetExact( Index ).Frame ), Index );
    }
  }
  const std::string Last = Bytes( Write( "c.mp4", Coded( "mpeg4", 0 ) ) );
  Scan( Save( "no-index.mp4", Last.substr( 0, Last.size() / 2 ) ), ZEK::IResult::InvalidFormat );
  EXPECT_THAT( m_Message, HasSubstr( "no-index.mp4: expected a video file" ) );
}

TEST_F( VideoFiles, DamageCostsTheFramesThatItHits )
{
  const std::string Whole = Bytes( Write( "a.mkv", Coded( "ffv1", 0 ) ) );
  std::mt19937 Random( 3 );
  std::size_t Told = 0;
  for ( int Round = 0; Round < 12; ++Round )
  {
    std::string Damaged = Whole;
    for ( int Hit = 0; Hit < 1 + Round * 4; ++Hit )
    {
      Damaged[500 + Random() % ( Damaged.size() - 500 )] = static_cast< char >( Random() );
    }
    const auto pClip = std::make_shared< VVideoClip >();
    if ( ScanVideo( Save( "damaged.mkv", Damaged ), *pClip, m_Message ).IsError() )
    {
      EXPECT_FALSE( m_Message.empty() );
      continue;
    }
    VVideoStream Stream( pClip );
    for ( std::int64_t Index = 0; Index < pClip->FrameCount(); Index += 3 )
    {
      const VVideoPicture Picture = Stream.GetExact( Index );
      EXPECT_TRUE( Picture.bExact );
      EXPECT_LE( Picture.Index, Index );
    }
    Told += Stream.Counts().Missing > 0;
  }
  EXPECT_GT( Told, 0u );
  const auto Lines = TestSupport::LogTexts( "Video", ZEK::ELogWarning );
  EXPECT_EQ( Lines.size(), Told ) << "once a stream";
  EXPECT_THAT( Lines, testing::Each( HasSubstr( "damaged.mkv\" cannot be decoded; the last good one is shown" ) ) );
}

TEST_F( VideoFiles, ADecoderThatIsStoppedFindsNothingMore )
{
  std::atomic< bool > bStop = false;
  VVideoDecoder Decoder( Scan( Write( "a.mkv", Coded( "ffv1", 0 ) ) ), bStop );
  std::string Message;
  ASSERT_TRUE( Decoder.Open( 1, Message ) ) << Message;
  EXPECT_EQ( Decoder.Next(), 0 );
  bStop = true;
  EXPECT_EQ( Decoder.Next(), -1 );
  EXPECT_FALSE( Decoder.Seek( 40, Message ) );
}

TEST_F( VideoFiles, OneDamagedStretchDoesNotEndSeeking )
{
  const auto Path = Write( "a.mov", Coded( "mpeg4", 0 ) );
  const auto pClip = Scan( Path );
  ASSERT_GT( pClip->Keys.size(), 4u );
  ASSERT_EQ( pClip->Keys[1].Frame, 12 );
  std::string Damaged = Bytes( Path );
  VFFmpegPtr< AVFormatContext > pInput;
  int Stream = -1;
  ASSERT_EQ( OpenVideo( Path, pInput, Stream ), 0 );
  const VFFmpegPtr< AVPacket > pPacket( av_packet_alloc() );
  for ( int Frame = 0; Frame < 24 && av_read_frame( pInput.get(), pPacket.get() ) >= 0; ++Frame )
  {
    if ( Frame >= 12 )
    {
      std::fill_n( Damaged.begin() + pPacket->pos, pPacket->size, '\0' );
    }
    av_packet_unref( pPacket.get() );
  }
  Save( "a.mov", Damaged );
  const std::atomic< bool > bStop = false;
  VVideoDecoder Decoder( pClip, bStop );
  std::string Message;
  ASSERT_TRUE( Decoder.Open( 1, Message ) ) << Message;
  // From the beginning, as no key before the damage has one before itself.
  ASSERT_TRUE( Decoder.Seek( 14, Message ) );
  EXPECT_EQ( Decoder.Next(), 0 );
  ASSERT_TRUE( Decoder.Seek( 50, Message ) );
  EXPECT_GT( Decoder.Next(), 24 );
}

TEST_F( VideoFiles, WhatIsNoVideoIsRefusedWithAReason )
{
  const struct
  {
    std::filesystem::path Path;
    ZEK::IResult::ECode Result;
    const char* pSays;
  } Cases[] = { { m_Folder.Path() / "absent.mp4", ZEK::IResult::FileNotFound, "absent.mp4: there is no such file" },
                { m_Folder.Path(), ZEK::IResult::FileIOFailure, "expected a plain file" },
                { Save( "empty.mp4", "" ), ZEK::IResult::InvalidFormat, "expected a video file" },
                { Save( "text.mkv", std::string( 5000, 'x' ) ), ZEK::IResult::InvalidFormat, "expected a video file" },
                { Save( "concat:a.avi", "ffconcat version 1.0\nfile /etc/hostname\n" ), ZEK::IResult::InvalidFormat,
                  "expected a video file" },
                { Save( "list.avi", "ffconcat version 1.0\nfile beside.avi\n" ), ZEK::IResult::InvalidFormat,
                  "expected a video file" } };
  // The list must be refused for being one, and not for naming nothing.
  Scan( Write( "beside.avi", Coded( "mjpeg", 0, "yuvj420p" ) ), ZEK::IResult::Ok );
  for ( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.Path );
    Scan( rCase.Path, rCase.Result );
    EXPECT_THAT( m_Message, HasSubstr( rCase.pSays ) );
  }
  const auto Path = Write( "a.mkv", Coded( "ffv1", 0 ) );
  int Calls = 0;
  VVideoClip Clip;
  EXPECT_EQ( ScanVideo( Path, Clip, m_Message,
                        [&]( double )
                        {
                          ++Calls;
                          return false;
                        } ),
             ZEK::IResult( ZEK::IResult::Canceled ) );
  EXPECT_EQ( Calls, 1 );
}

TEST_F( VideoFiles, AFileThatVanishedGivesNothingAndSaysSoOnce )
{
  const auto Path = Write( "a.mkv", Coded( "ffv1", 0 ) );
  const auto pClip = Scan( Path );
  std::filesystem::remove( Path );
  VVideoStream Stream( pClip );
  for ( const std::int64_t Index : { 0, 10 } )
  {
    const VVideoPicture Picture = Stream.GetExact( Index );
    EXPECT_TRUE( Picture.bExact );
    EXPECT_EQ( Picture.Index, -1 );
    EXPECT_FALSE( Picture.Frame.Data );
  }
  EXPECT_EQ( TestSupport::LogTexts( "Video", ZEK::ELogWarning ).size(), 1u );
  VVideoStream Empty( std::make_shared< VVideoClip >() );
  EXPECT_TRUE( Empty.GetExact( 3 ).bExact );
}

TEST_F( VideoFiles, PicturesComeInFormsThatViewsKnow )
{
  const struct
  {
    const char* pFormat;
    EPixelFormat Delivered;
    int Luma, ChromaB, ChromaR; ///< of the corner; in RGB its green is cut off at 0
  } Cases[] = { { "yuv420p", EPixelFormat::I420, 40, 150, 200 },     { "gray", EPixelFormat::Luminance8, 40, 0, 0 },
                { "yuv422p", EPixelFormat::I420, 40, 150, 200 },     { "bgr0", EPixelFormat::I420, 60, 138, 186 },
                { "yuv420p10le", EPixelFormat::I420, 40, 150, 200 }, { "yuv444p", EPixelFormat::I420, 40, 150, 200 } };
  for ( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.pFormat );
    VWrittenVideo Video = Coded( "ffv1", 0, rCase.pFormat );
    Video.Width = 131;
    Video.Height = 47;
    Video.Frames = 5;
    VVideoStream Stream( Scan( Write( "a.mkv", Video ) ) );
    const auto Frame = Stream.GetExact( 4 ).Frame;
    EXPECT_EQ( Frame.Format, rCase.Delivered );
    EXPECT_EQ( Frame.Width, 131u );
    EXPECT_EQ( Frame.Height, 47u );
    ASSERT_EQ( ShownNumber( Frame ), 4 );
    EXPECT_NEAR( Frame.Data->at( Frame.Offset[0] + 46 * Frame.Stride[0] + 130 ), rCase.Luma, 3 );
    if ( rCase.Delivered == EPixelFormat::I420 )
    {
      EXPECT_NEAR( Frame.Data->at( Frame.Offset[1] + 23 * Frame.Stride[1] + 60 ), rCase.ChromaB, 4 );
      EXPECT_NEAR( Frame.Data->at( Frame.Offset[2] + 23 * Frame.Stride[2] + 60 ), rCase.ChromaR, 4 );
    }
  }
  VVideoStream Full( Scan( Write( "full.avi", Coded( "mjpeg", 0, "yuvj420p" ) ) ) );
  // The file has 28 of 0 to 255, which is 40 of 16 to 235.
  EXPECT_NEAR( Full.GetExact( 0 ).Frame.Data->at( 0 ), 40, 3 );
}

TEST_F( VideoFiles, AFrameIsTurnedAsItsFileAsks )
{
  for ( int Turns = 1; Turns < 4; ++Turns )
  {
    SCOPED_TRACE( Turns );
    VWrittenVideo Video = Coded( "mpeg4", 0 );
    Video.QuarterTurns = Turns;
    Video.Frames = 9;
    const auto pClip = Scan( Write( "turned.mov", Video ) );
    const bool bAcross = Turns != 2;
    EXPECT_EQ( pClip->QuarterTurns, Turns );
    EXPECT_EQ( pClip->Width, bAcross ? 48u : 128u );
    VVideoStream Stream( pClip );
    const auto Frame = Stream.GetExact( 8 ).Frame;
    ASSERT_EQ( Frame.Width, pClip->Width );
    ASSERT_EQ( Frame.Height, pClip->Height );
    // The one light square, the fourth from the left before the turn.
    const std::size_t Along = 3 * 16 + 8,
                      X = Turns == 1   ? 40
                          : Turns == 2 ? 127 - Along
                                       : 8,
                      Y = Turns == 1   ? Along
                          : Turns == 2 ? 40
                                       : 127 - Along;
    EXPECT_NEAR( Frame.Data->at( Y * Frame.Stride[0] + X ), 200, 12 );
    EXPECT_NEAR( Frame.Data->at( ( Turns == 2 ? Y : 127 - Y ) * Frame.Stride[0] + ( Turns == 2 ? 127 - X : X ) ), 40,
                 12 );
  }
}

TEST_F( VideoFiles, ColoursFollowTheHeightThatIsShown )
{
  VWrittenVideo Video = Coded( "ffv1", 0, "bgr0" );
  Video.Width = 720;
  Video.Frames = 2;
  for ( const auto& [Turns, Luma] : { std::pair{ 0, 60 }, { 1, 47 } } )
  {
    SCOPED_TRACE( Turns );
    Video.QuarterTurns = Turns;
    VVideoStream Stream( Scan( Write( "wide.mov", Video ) ) );
    const auto Frame = Stream.GetExact( 0 ).Frame;
    ASSERT_EQ( Frame.Height, Turns == 0 ? 48u : 720u );
    EXPECT_NEAR( Frame.Data->at( Frame.Offset[0] ), Luma, 3 );
  }
}

TEST_F( VideoFiles, FramesThatAreLargerThanTheirPixelsStayWithinTheirBytes )
{
  VWrittenVideo Video = Coded( "ffv1", 0, "yuv422p" );
  Video.Width = 8; // rows are filled up to 32 bytes
  VVideoStream Stream( Scan( Write( "narrow.mkv", Video ) ), { 10000, 1 } );
  for ( std::int64_t Index = 0; Index < 60; ++Index )
  {
    ASSERT_EQ( Stream.GetExact( Index ).Index, Index );
  }
  EXPECT_LE( Stream.Counts().MostHeldBytes, 10000u );
  EXPECT_EQ( Stream.Counts().Decoded, 60u );
}

TEST_F( VideoFiles, UnevenFramesAreFoundByTime )
{
  VWrittenVideo Video = Coded( "ffv1", 0 );
  Video.bUneven = true;
  const auto pClip = Scan( Write( "uneven.mkv", Video ) );
  EXPECT_FALSE( pClip->bEven );
  const std::pair< double, std::int64_t > Known[] = { { -1, 0 },       { 0, 0 },         { 1 / 60.0, 1 },
                                                      { 2.4 / 60, 1 }, { 2.6 / 60, 2 },  { 40 / 60.0, 20 },
                                                      { 1e9, 59 },     { 41.1 / 60, 21 } };
  for ( const auto& [Seconds, Frame] : Known )
  {
    EXPECT_EQ( pClip->NearestFrame( Seconds ), Frame ) << Seconds;
  }
  EXPECT_EQ( VVideoClip().NearestFrame( 1 ), -1 );
}

TEST( RealVideo, ShortClipsOfAPhoneAreWhole )
{
  HARROW_NEEDS_RECORDINGS();
  for ( int Camera = 1; Camera <= 4; ++Camera )
  {
    const auto pClip = std::make_shared< VVideoClip >();
    std::string Message;
    const auto Path = TestSupport::RecordingsDir() / "multicam-person/static/videos" /
                      std::string( "cam0" ).append( std::to_string( Camera ) ).append( ".mp4" );
    ASSERT_EQ( ScanVideo( Path, *pClip, Message ), ZEK::IResult( ZEK::IResult::Ok ) ) << Message;
    EXPECT_EQ( pClip->Codec, "h264" );
    EXPECT_EQ( pClip->FrameCount(), 11 );
    EXPECT_NEAR( pClip->RateHz, 60, 0.01 );
    EXPECT_EQ( pClip->Width, Camera <= 2 ? 1088u : 1080u );
    EXPECT_EQ( pClip->Height, 1920u );
    VVideoStream Stream( pClip );
    const auto pFirst = Stream.GetExact( 0 ).Frame.Data, pSixth = Stream.GetExact( 6 ).Frame.Data;
    EXPECT_EQ( *Stream.GetExact( 0 ).Frame.Data, *pFirst );
    EXPECT_NE( *pFirst, *pSixth );
    EXPECT_EQ( Stream.Counts().Missing, 0u );
  }
}

} // namespace HostVideo
