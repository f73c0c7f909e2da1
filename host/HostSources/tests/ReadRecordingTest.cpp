#include "ReadHelpers.h"

#include <rapidjson/document.h>

#include <cmath>
#include <fstream>
#include <sys/stat.h>
#include <unistd.h>

namespace HostSources
{
namespace
{
class ReadFile : public testing::Test
{
protected:
  std::filesystem::path Save( const std::string& i_rName, std::span< const std::byte > i_Bytes )
  {
    const auto Path = m_Folder.Path() / i_rName;
    std::ofstream( Path, std::ios::binary )
        .write( reinterpret_cast< const char* >( i_Bytes.data() ), static_cast< std::streamsize >( i_Bytes.size() ) );
    return Path;
  }
  void ExpectFailure( const std::filesystem::path& i_rPath, ZEK::IResult i_Expected, const std::string& i_rText )
  {
    VRecording Recording;
    Recording.FrameCount = 5;
    std::string Message;
    EXPECT_EQ( ReadRecording( i_rPath, Recording, Message ), i_Expected );
    EXPECT_THAT( Message, testing::StartsWith( i_rPath.string() + ": " ) );
    EXPECT_THAT( Message, testing::HasSubstr( i_rText ) );
    EXPECT_EQ( Recording.FrameCount, 0 ) << "what was there before must not seem to come from this file";
  }

  static C3dWriter::VFile LongFile()
  {
    C3dWriter::VFile File;
    File.Points = 10;
    for ( int Index = 0; Index < 10; ++Index )
    {
      File.Labels.push_back( "Body:M" + std::to_string( Index ) );
    }
    File.Frames.assign( 20000, std::vector< double >( 40, 1 ) );
    return File;
  }

  TestSupport::VTemporaryDir m_Folder;
};
} // namespace

TEST_F( ReadFile, WhatCannotBeReadIsNamed )
{
  const auto Pipe = m_Folder.Path() / "pipe.c3d";
  ASSERT_EQ( mkfifo( Pipe.c_str(), 0600 ), 0 );
  const auto Bare = m_Folder.Path() / "bare";
  std::filesystem::create_directory( Bare );
  const auto Other = Bytes( "hello, world" );
  const std::tuple< std::filesystem::path, ZEK::IResult, const char* > Cases[] = {
      { m_Folder.Path() / "none.c3d", ZEK::IResult::FileNotFound, "found no such file" },
      { Bare, ZEK::IResult::FileIOFailure, "found a folder" },
      { Pipe, ZEK::IResult::FileIOFailure, "no plain file" },
      { Save( "empty.trc", {} ), ZEK::IResult::EndOfData, "byte offset 0: expected" },
      { Save( "other.txt", Other ), ZEK::IResult::InvalidFormat, "found none of them" },
      { Save( "other.trc", Other ), ZEK::IResult::InvalidFormat, "line 1: expected" },
      { Save( "other.C3D", Other ), ZEK::IResult::InvalidFormat, "byte offset 0: expected" } };
  for ( const auto& [rPath, Result, pText] : Cases )
  {
    ExpectFailure( rPath, Result, pText );
  }
  const auto Locked = Save( "locked.c3d", Other );
  std::filesystem::permissions( Locked, std::filesystem::perms::none );
  if ( access( Locked.c_str(), R_OK ) != 0 )
  {
    ExpectFailure( Locked, ZEK::IResult::FileIOFailure, "Permission denied" );
  }
}

TEST_F( ReadFile, ContentCountsNotTheSuffix )
{
  // The name has a byte that no UTF-8 has, and a control character.
  const VRecording R = MustRead( Save( "really\xE9\n.trc", C3dWriter::Write( LongFile() ) ) );
  EXPECT_EQ( R.Format, ERecordingFormat::C3d );
  EXPECT_EQ( R.Name, "really\xC3\xA9 .trc" );
  EXPECT_EQ( R.FrameCount, 20000 );
}

TEST_F( ReadFile, ProgressRunsToTheEndOrStops )
{
  const auto Path = Save( "long.c3d", C3dWriter::Write( LongFile() ) );
  const auto Text = Save( "some.trc", Bytes( "PathFileType\nDataRate\n5\nFrame#\tTime\tA\nX1\n1\t0\t1\t2\t3\n" ) );
  for ( const auto& rFile : { Path, Text } )
  {
    std::vector< double > Steps;
    std::size_t Limit = 1000;
    const auto Read = [&]
    {
      VOutcome Outcome;
      Steps.clear();
      Outcome.Result = ReadRecording( rFile, Outcome.Recording, Outcome.Message,
                                      [&]( double i_Fraction )
                                      {
                                        Steps.push_back( i_Fraction );
                                        return Steps.size() < Limit;
                                      } );
      return Outcome;
    };
    EXPECT_TRUE( Read().Result.IsOk() );
    EXPECT_GT( Steps.size(), rFile == Path ? 3u : 1u );
    EXPECT_TRUE( std::is_sorted( Steps.begin(), Steps.end() ) );
    EXPECT_GE( Steps.front(), 0 );
    EXPECT_LE( Steps.back(), 1 );
    Limit = 2;
    const VOutcome Stopped = Read();
    EXPECT_EQ( Stopped.Result, ZEK::IResult( ZEK::IResult::Canceled ) );
    EXPECT_EQ( Steps.size(), 2u );
    EXPECT_EQ( Stopped.Recording.FrameCount, 0 );
  }
}

TEST_F( ReadFile, AMillionFrames )
{
  C3dWriter::VFile File;
  File.bFloat = false;
  File.Points = 1;
  File.HeaderLast = 65535;
  File.SetParameter( { "POINT", "LONG_FRAMES", 4, {}, { 1000000 }, {} } );
  File.Frames.assign( 1000000, { 1, 2, 3, 0 } );
  const VRecording R = MustRead( Save( "million.c3d", C3dWriter::Write( File ) ) );
  EXPECT_EQ( R.FrameCount, 1000000 );
  EXPECT_FLOAT_EQ( R.Frame( 999999 )[0].z, 0.3f );
  EXPECT_EQ( R.Labels.front(), "" ) << "a point without a label stays without one";
}

TEST( RecordingInfo, JsonSaysWhatTheRecordingHolds )
{
  C3dWriter::VFile File;
  File.Points = 2;
  File.Channels = File.PerFrame = 1;
  File.Labels = { "A \"quoted\"", "B" };
  File.FirstFrame = 5;
  File.Frames = { { 1, 2, 3, 0, 4, 5, 6, -1, 0 }, { 1, 2, 4, 0, 4, 5, 6, 0, 0 } };
  File.SetParameter( { "ANALOG", "LABELS", -1, { 3, 1 }, {}, { "EMG" } } );
  File.SetParameter( { "ANALOG", "UNITS", -1, { 2, 1 }, {}, { "mV" } } );
  File.SetParameter( { "EVENT", "TIMES", 4, { 2, 1 }, { 0, 0.05 }, {} } );
  const VRecordingInfo Info = DescribeRecording( MustReadC3d( File ) );
  rapidjson::Document Json;
  ASSERT_FALSE( Json.Parse( Info.Json().c_str() ).HasParseError() );
  EXPECT_STREQ( Json["format"].GetString(), "C3D" );
  EXPECT_STREQ( Json["form"].GetString(), "float, Intel" );
  EXPECT_EQ( Json["frames"].GetInt(), 2 );
  EXPECT_EQ( Json["firstFrame"].GetInt(), 5 );
  EXPECT_EQ( Json["lastFrame"].GetInt(), 6 );
  EXPECT_STREQ( Json["labels"][0].GetString(), "A \"quoted\"" );
  EXPECT_EQ( Json["missingSamples"].GetInt(), 1 );
  ASSERT_EQ( Json["gaps"].Size(), 1u );
  EXPECT_STREQ( Json["gaps"][0]["label"].GetString(), "B" );
  EXPECT_EQ( Json["bounds"]["max"][2].GetDouble(), 6 );
  EXPECT_STREQ( Json["analogChannels"][0]["unit"].GetString(), "mV" );
  EXPECT_NEAR( Json["events"][0]["seconds"].GetDouble(), 0.01, 1e-6 );
  EXPECT_STREQ( Json["upAxis"].GetString(), "z" );
  const std::string Text = Info.Text();
  EXPECT_THAT( Text, testing::HasSubstr( "2 columns, 1 of 4 samples missing" ) );
  EXPECT_THAT( Text, testing::HasSubstr( Info.UpAxisReason ) );
}

} // namespace HostSources
