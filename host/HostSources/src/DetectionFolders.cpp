#include "Detections.h"

#include <rapidjson/document.h>

#include <algorithm>
#include <charconv>
#include <cmath>

namespace HostSources
{
namespace
{
constexpr int FewestValues = 3;
/// The order in which an image's 25 keypoints come.
constexpr const char* BodyPoints[] = { "Nose",   "LEye",    "REye",      "LEar",   "REar", "LShoulder", "RShoulder",
                                       "LElbow", "RElbow",  "LWrist",    "RWrist", "LHip", "RHip",      "LKnee",
                                       "RKnee",  "LAnkle",  "RAnkle",    "Neck",   "Head", "LBigToe",   "LSmallToe",
                                       "LHeel",  "RBigToe", "RSmallToe", "RHeel" };
constexpr std::size_t BodyPointCount = std::size( BodyPoints );

struct VFrameFile
{
  std::int64_t Number = 0;
  std::filesystem::path Path;
};

/// The last number in the name without its suffix.
bool NumberOf( const std::filesystem::path& i_rPath, std::int64_t& o_rNumber )
{
  const std::string Stem = i_rPath.stem().string();
  const std::size_t Last = Stem.find_last_of( "0123456789" );
  if ( Last == std::string::npos )
  {
    return false;
  }
  const std::size_t Before = Stem.find_last_not_of( "0123456789", Last );
  const std::size_t Begin = Before == std::string::npos ? 0 : Before + 1;
  return std::from_chars( Stem.data() + Begin, Stem.data() + Last + 1, o_rNumber ).ec == std::errc();
}

std::vector< VFrameFile > FramesOf( const std::vector< std::filesystem::path >& i_rFiles )
{
  std::vector< VFrameFile > Frames;
  for ( const auto& rFile : i_rFiles )
  {
    VFrameFile Frame;
    if ( SuffixOf( rFile ) == ".json" && NumberOf( rFile, Frame.Number ) )
    {
      Frame.Path = rFile;
      Frames.push_back( std::move( Frame ) );
    }
  }
  std::stable_sort( Frames.begin(), Frames.end(),
                    []( const VFrameFile& i_rA, const VFrameFile& i_rB )
                    {
                      return i_rA.Number < i_rB.Number;
                    } );
  return Frames;
}

/// Reads the files of all cameras.
class VReader
{
public:
  VReader( VDetections& io_rDetections, const VProgress& i_rProgress )
    : m_rDetections( io_rDetections )
    , m_rProgress( i_rProgress )
  {
  }

  void AddCamera( const std::filesystem::path& i_rFolder, const std::vector< std::filesystem::path >& i_rFiles )
  {
    std::vector< VFrameFile > Frames = FramesOf( i_rFiles );
    if ( !Frames.empty() )
    {
      m_rDetections.Cameras.emplace_back().Name = ShownName( i_rFolder );
      m_Total += Frames.size();
      m_Frames.push_back( std::move( Frames ) );
    }
  }

  ZEK::IResult Read( std::string& o_rMessage );

private:
  bool Span( std::string& o_rMessage );
  bool ReadFrames( std::size_t i_Camera );
  bool ReadFrame( const std::filesystem::path& i_rPath, VRecordingCamera& io_rSeen );
  void ReadPerson( const rapidjson::Value& i_rPerson, std::uint32_t i_Number, VRecordingCamera& io_rSeen );
  void TellLosses();

  VDetections& m_rDetections;
  const VProgress& m_rProgress;
  std::vector< std::vector< VFrameFile > > m_Frames; ///< by camera
  std::size_t m_Total = 0, m_Done = 0, m_Good = 0, m_KeypointCount = 0;
  std::uint64_t m_Bad = 0, m_Repeated = 0, m_NotFinite = 0, m_Uneven = 0;
  std::string m_FirstBad;
};

bool VReader::Span( std::string& o_rMessage )
{
  std::int64_t Last = 0;
  m_rDetections.First = m_Frames.front().front().Number;
  for ( const auto& rFrames : m_Frames )
  {
    m_rDetections.First = std::min( m_rDetections.First, rFrames.front().Number );
    Last = std::max( Last, rFrames.back().Number );
  }
  const auto Frames = static_cast< std::uint64_t >( Last - m_rDetections.First );
  if ( !IsReasonable( Frames, m_Frames.size() * sizeof( std::uint64_t ), m_Total * 1024 ) )
  {
    o_rMessage = "expected a JSON file a frame, found files numbered " + std::to_string( m_rDetections.First ) +
                 " to " + std::to_string( Last ) + ", and only " + std::to_string( m_Total ) + " of them";
    return false;
  }
  m_rDetections.Count = static_cast< std::int64_t >( Frames ) + 1;
  return true;
}

void VReader::ReadPerson( const rapidjson::Value& i_rPerson, std::uint32_t i_Number, VRecordingCamera& io_rSeen )
{
  const auto Found = i_rPerson.FindMember( "pose_keypoints_2d" );
  if ( Found == i_rPerson.MemberEnd() || !Found->value.IsArray() )
  {
    ++m_Uneven;
    return;
  }
  const rapidjson::Value& rValues = Found->value;
  m_Uneven += rValues.Size() % FewestValues != 0;
  const rapidjson::SizeType Count = rValues.Size() / FewestValues;
  m_KeypointCount = std::max( m_KeypointCount, static_cast< std::size_t >( Count ) );
  for ( rapidjson::SizeType Keypoint = 0; Keypoint < Count; ++Keypoint )
  {
    float Values[FewestValues];
    bool bFinite = true;
    for ( rapidjson::SizeType Part = 0; Part < FewestValues; ++Part )
    {
      const rapidjson::Value& rValue = rValues[Keypoint * FewestValues + Part];
      Values[Part] = rValue.IsNumber() ? static_cast< float >( rValue.GetDouble() ) : std::nanf( "" );
      bFinite = bFinite && std::isfinite( Values[Part] );
    }
    if ( !bFinite )
    {
      ++m_NotFinite;
    }
    else if ( Values[2] > 0 )
    {
      io_rSeen.Detections.push_back(
          { Values[0], Values[1], Values[2], static_cast< std::int32_t >( Keypoint ), i_Number } );
    }
  }
}

/// False, with nothing taken, for a file that is no such frame.
bool VReader::ReadFrame( const std::filesystem::path& i_rPath, VRecordingCamera& io_rSeen )
{
  VFileSource Source;
  std::string_view Text;
  std::string Message;
  if ( ReadText( i_rPath, Source, Text, Message ).IsError() )
  {
    m_FirstBad = m_FirstBad.empty() ? Message : m_FirstBad;
    return false;
  }
  rapidjson::Document Json;
  // Without recursion, so that no depth of brackets can end the process.
  Json.Parse< rapidjson::kParseNanAndInfFlag | rapidjson::kParseIterativeFlag >( Text.data(), Text.size() );
  const bool bPeople =
      !Json.HasParseError() && Json.IsObject() && Json.HasMember( "people" ) && Json["people"].IsArray();
  if ( !bPeople )
  {
    m_FirstBad = !m_FirstBad.empty() ? m_FirstBad
                                     : i_rPath.string() + ": byte offset " + std::to_string( Json.GetErrorOffset() ) +
                                           ": expected a JSON object with the list \"people\"";
    return false;
  }
  std::uint32_t Number = 0;
  for ( const rapidjson::Value& rPerson : Json["people"].GetArray() )
  {
    if ( rPerson.IsObject() )
    {
      ReadPerson( rPerson, Number++, io_rSeen );
    }
    else
    {
      ++m_Uneven;
    }
  }
  return true;
}

/// False when the reading was stopped.
bool VReader::ReadFrames( std::size_t i_Camera )
{
  VRecordingCamera& rSeen = m_rDetections.Cameras[i_Camera].Seen;
  rSeen.DetectionBegin.reserve( static_cast< std::size_t >( m_rDetections.Count ) + 1 );
  rSeen.DetectionBegin.push_back( 0 );
  for ( const VFrameFile& rFrame : m_Frames[i_Camera] )
  {
    if ( m_rProgress && !m_rProgress( static_cast< double >( m_Done ) / static_cast< double >( m_Total ) ) )
    {
      return false;
    }
    ++m_Done;
    const auto Frame = static_cast< std::size_t >( rFrame.Number - m_rDetections.First );
    if ( rSeen.DetectionBegin.size() > Frame + 1 )
    {
      ++m_Repeated;
      continue;
    }
    rSeen.DetectionBegin.resize( Frame + 1, rSeen.Detections.size() );
    const bool bGood = ReadFrame( rFrame.Path, rSeen );
    ( bGood ? m_Good : m_Bad ) += 1;
    rSeen.DetectionBegin.push_back( rSeen.Detections.size() );
  }
  rSeen.DetectionBegin.resize( static_cast< std::size_t >( m_rDetections.Count ) + 1, rSeen.Detections.size() );
  return true;
}

void VReader::TellLosses()
{
  const auto Tell = [&]( std::uint64_t i_Count, const std::string& i_rWhat )
  {
    if ( i_Count > 0 )
    {
      m_rDetections.Losses.push_back( std::to_string( i_Count ) + i_rWhat );
    }
  };
  Tell( m_Bad, " JSON files could not be used; the first: " + m_FirstBad );
  Tell( m_Repeated, " JSON files have the number of another one of their camera and were left out" );
  Tell( m_NotFinite, " keypoints are not numbers and were left out" );
  Tell( m_Uneven, " persons do not give their keypoints as triples" );
}

ZEK::IResult VReader::Read( std::string& o_rMessage )
{
  if ( m_Frames.empty() )
  {
    return ZEK::IResult::Ok;
  }
  if ( !Span( o_rMessage ) )
  {
    return ZEK::IResult::InvalidFormat;
  }
  for ( std::size_t Camera = 0; Camera < m_Frames.size(); ++Camera )
  {
    if ( !ReadFrames( Camera ) )
    {
      o_rMessage = "the reading was stopped";
      return ZEK::IResult::Canceled;
    }
  }
  if ( m_Good == 0 )
  {
    o_rMessage = m_FirstBad;
    return ZEK::IResult::InvalidFormat;
  }
  m_rDetections.Form = "a JSON file a frame and camera";
  m_rDetections.bPersons = true;
  for ( std::size_t Point = 0; Point < m_KeypointCount; ++Point )
  {
    m_rDetections.Points.push_back( m_KeypointCount == BodyPointCount ? BodyPoints[Point]
                                                                      : "keypoint " + std::to_string( Point ) );
  }
  TellLosses();
  return ZEK::IResult::Ok;
}
} // namespace

ZEK::IResult ReadDetectionFolders( const std::filesystem::path& i_rFolder, const VFolderFiles& i_rFiles,
                                   VDetections& o_rDetections, std::string& o_rMessage, const VProgress& i_rProgress )
{
  VReader Reader( o_rDetections, i_rProgress );
  for ( const auto& rFolder : i_rFiles.Folders )
  {
    VFolderFiles Inner;
    const ZEK::IResult Listed = ListFolder( rFolder, Inner, o_rMessage );
    if ( Listed.IsError() )
    {
      o_rDetections.Losses.push_back( o_rMessage );
      o_rMessage.clear();
      continue;
    }
    Reader.AddCamera( rFolder, Inner.Files );
  }
  if ( o_rDetections.Cameras.empty() )
  {
    // The folder of one camera is a source as well, unless its numbered file is the calibration.
    VFolderFiles Own = i_rFiles;
    std::erase_if( Own.Files,
                   []( const std::filesystem::path& i_rFile )
                   {
                     VFileSource Source;
                     std::string Message;
                     std::string_view Text;
                     return SuffixOf( i_rFile ) != ".json" || ReadText( i_rFile, Source, Text, Message ).IsError() ||
                            Text.find( "\"people\"" ) == std::string_view::npos;
                   } );
    Reader.AddCamera( i_rFolder, Own.Files );
  }
  return Reader.Read( o_rMessage );
}

} // namespace HostSources
