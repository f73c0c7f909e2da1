#include <HostSources/VBvhReader.h>

#include "BvhSkeleton.h"
#include "BvhWords.h"
#include "ReaderSupport.h"
#include "TrcText.h"

#include <algorithm>
#include <cmath>

namespace HostSources
{
namespace Bvh
{
namespace
{
constexpr std::string_view Mark = "HIERARCHY";
constexpr std::string_view ByteOrderMark = "\xEF\xBB\xBF";
constexpr double Centimetre = 10; // mm
constexpr std::size_t MostJoints = 4096;

std::string_view AsText( std::span< const std::byte > i_Bytes )
{
  std::string_view Text( reinterpret_cast< const char* >( i_Bytes.data() ), i_Bytes.size() );
  if ( Text.starts_with( ByteOrderMark ) )
  {
    Text.remove_prefix( ByteOrderMark.size() );
  }
  return Text.substr( std::min( Text.find_first_not_of( Spaces ), Text.size() ) );
}

std::string Quote( std::string_view i_Text )
{
  return i_Text.empty() ? std::string( "the end of the file" )
                        : std::string( "\"" ).append( ToUtf8( i_Text.substr( 0, 40 ) ) ).append( "\"" );
}

class VReader
{
public:
  VReader( std::string_view i_Text, VRecording& io_rRecording, std::string& o_rMessage, const VProgress& i_rProgress )
    : m_Words( i_Text )
    , m_Size( i_Text.size() )
    , m_rRecording( io_rRecording )
    , m_rMessage( o_rMessage )
    , m_rProgress( i_rProgress )
  {
  }

  ZEK::IResult Read()
  {
    ZEK::IResult Result = ReadHierarchy();
    Result = Result.IsOk() ? ReadMotionHeader() : Result;
    Result = Result.IsOk() ? ReadRows() : Result;
    return Result.IsOk() ? Finish() : Result;
  }

private:
  /// At the word that was read last; the end of the file where it is empty.
  ZEK::IResult Expected( const std::string& i_rWhat, std::string_view i_Found )
  {
    m_rMessage = std::string( "line " )
                     .append( std::to_string( m_Words.Line() ) )
                     .append( ": expected " )
                     .append( i_rWhat )
                     .append( ", found " )
                     .append( Quote( i_Found ) );
    return i_Found.empty() ? ZEK::IResult::EndOfData : ZEK::IResult::InvalidFormat;
  }
  ZEK::IResult ReadHierarchy();
  ZEK::IResult BeginJoint( std::string_view i_Keyword );
  ZEK::IResult BeginEnd();
  ZEK::IResult ReadOffset();
  ZEK::IResult ReadChannels();
  ZEK::IResult ReadNumberOf( const char* i_pWhat, double& o_rValue );
  ZEK::IResult ReadMotionHeader();
  ZEK::IResult ReadRows();
  ZEK::IResult TakeRow( std::vector< double >& io_rRow );
  ZEK::IResult Finish();

  VWords m_Words;
  std::size_t m_Size;
  VRecording& m_rRecording;
  std::string& m_rMessage;
  const VProgress& m_rProgress;
  std::vector< VJoint > m_Joints;
  std::vector< std::int32_t > m_Open; ///< joints whose braces are open; -1 for an end site
  VRecordingSkeleton m_Skeleton;
  std::int64_t m_Promised = 0;
};

ZEK::IResult VReader::ReadNumberOf( const char* i_pWhat, double& o_rValue )
{
  const std::string_view Word = m_Words.Next();
  if ( Trc::ReadNumber( Word, o_rValue ) != Trc::ECell::Number || !std::isfinite( o_rValue ) )
  {
    return Expected( std::string( "a number for " ).append( i_pWhat ), Word );
  }
  return {};
}

ZEK::IResult VReader::BeginJoint( std::string_view i_Keyword )
{
  VJoint Joint;
  Joint.Name = ToUtf8( m_Words.NextName() );
  if ( const std::string_view Brace = m_Words.Next(); Brace != "{" )
  {
    return Expected( "{", Brace );
  }
  m_Open.push_back( static_cast< std::int32_t >( m_Joints.size() ) );
  if ( m_Joints.size() >= MostJoints )
  {
    return Expected( std::string( "at most " ).append( std::to_string( MostJoints ) ).append( " joints" ), i_Keyword );
  }
  Joint.Parent = m_Open.size() < 2 ? -1 : m_Open[m_Open.size() - 2];
  m_Joints.push_back( std::move( Joint ) );
  return {};
}

ZEK::IResult VReader::BeginEnd()
{
  std::string_view Word = m_Words.Next();
  Word = Word == "Site" || Word == "SITE" ? m_Words.Next() : Word;
  if ( Word != "{" )
  {
    return Expected( "\"Site\" and {", Word );
  }
  m_Open.push_back( -1 );
  ++m_Skeleton.EndSiteCount;
  return {};
}

ZEK::IResult VReader::ReadOffset()
{
  VVector Offset{};
  for ( double& rValue : Offset )
  {
    const ZEK::IResult Result = ReadNumberOf( "an offset", rValue );
    if ( Result.IsError() )
    {
      return Result;
    }
    rValue *= Centimetre;
    if ( std::abs( rValue ) > Farthest )
    {
      return Expected( "an offset of at most 1e8", "a larger one" );
    }
  }
  if ( m_Open.back() >= 0 )
  {
    m_Joints[static_cast< std::size_t >( m_Open.back() )].Offset = Offset;
  }
  else
  {
    m_Joints[static_cast< std::size_t >( m_Open[m_Open.size() - 2] )].End = Offset;
  }
  return {};
}

ZEK::IResult VReader::ReadChannels()
{
  static constexpr std::string_view Names[] = { "Xposition", "Yposition", "Zposition",
                                                "Xrotation", "Yrotation", "Zrotation" };
  double Count = 0;
  const ZEK::IResult Result = ReadNumberOf( "the count of channels", Count );
  if ( Result.IsError() )
  {
    return Result;
  }
  auto& rChannels = m_Joints[static_cast< std::size_t >( m_Open.back() )].Channels;
  if ( !( Count >= 0 && Count <= 6 && Count == std::floor( Count ) ) || !rChannels.empty() )
  {
    return Expected( "up to six channels, once a joint", "others" );
  }
  for ( int Index = 0; Index < static_cast< int >( Count ); ++Index )
  {
    const std::string_view Word = m_Words.Next();
    const auto* pName = std::find( std::begin( Names ), std::end( Names ), Word );
    if ( pName == std::end( Names ) )
    {
      return Expected( "the name of a channel", Word );
    }
    rChannels.push_back( static_cast< EChannel >( pName - std::begin( Names ) ) );
    ++m_Skeleton.ChannelCount;
  }
  return {};
}

ZEK::IResult VReader::ReadHierarchy()
{
  std::string_view Word = m_Words.Next();
  if ( Word != Mark )
  {
    return Expected( "\"HIERARCHY\", the mark of a BVH file", Word );
  }
  while ( true )
  {
    Word = m_Words.Next();
    const bool bJoint = !m_Open.empty() && m_Open.back() >= 0, bEnd = !m_Open.empty() && m_Open.back() < 0;
    ZEK::IResult Result;
    if ( m_Open.empty() && Word == "MOTION" && !m_Joints.empty() )
    {
      break;
    }
    if ( ( m_Open.empty() && Word == "ROOT" ) || ( bJoint && Word == "JOINT" ) )
    {
      Result = BeginJoint( Word );
    }
    else if ( bJoint && ( Word == "End" || Word == "END" ) )
    {
      Result = BeginEnd();
    }
    else if ( ( bJoint || bEnd ) && Word == "OFFSET" )
    {
      Result = ReadOffset();
    }
    else if ( bJoint && Word == "CHANNELS" )
    {
      Result = ReadChannels();
    }
    else if ( ( bJoint || bEnd ) && Word == "}" )
    {
      m_Open.pop_back();
    }
    else
    {
      Result = Expected( m_Open.empty() ? m_Joints.empty() ? "ROOT" : "ROOT or MOTION"
                         : bEnd         ? "OFFSET or }"
                                        : "OFFSET, CHANNELS, JOINT, End Site or }",
                         Word );
    }
    if ( Result.IsError() )
    {
      return Result;
    }
  }
  if ( m_Skeleton.ChannelCount == 0 )
  {
    return Expected( "a joint with channels", Word );
  }
  return {};
}

ZEK::IResult VReader::ReadMotionHeader()
{
  double Frames = 0, Time = 0;
  std::string_view Word = m_Words.Next();
  if ( Word != "Frames:" )
  {
    return Expected( "\"Frames:\"", Word );
  }
  ZEK::IResult Result = ReadNumberOf( "the count of frames", Frames );
  if ( Result.IsError() )
  {
    return Result;
  }
  if ( !( Frames >= 0 && Frames < 1e15 ) )
  {
    return Expected( "a count of frames", "another number" );
  }
  m_Promised = static_cast< std::int64_t >( Frames );
  for ( const std::string_view Part : { "Frame", "Time:" } )
  {
    Word = m_Words.Next();
    if ( Word != Part )
    {
      return Expected( "\"Frame Time:\"", Word );
    }
  }
  Result = ReadNumberOf( "the time of a frame", Time );
  // Times such as 0.008333 stand for whole rates.
  const double Rate = Time > 0 ? 1 / Time : 0, Whole = std::round( Rate );
  m_rRecording.RateHz = Whole > 0 && std::abs( Rate - Whole ) < 1e-4 * Whole ? Whole : Rate;
  return Result;
}

ZEK::IResult VReader::TakeRow( std::vector< double >& io_rRow )
{
  std::size_t Column = 0;
  for ( const VJoint& rJoint : m_Joints )
  {
    for ( const EChannel Channel : rJoint.Channels )
    {
      double& rValue = io_rRow[Column++];
      const bool bPosition = Channel < EChannel::Xrotation;
      rValue *= bPosition ? Centimetre : 1;
      if ( bPosition && std::abs( rValue ) > Farthest )
      {
        return Expected( "positions of at most 1e8", "a larger one" );
      }
    }
  }
  AppendState( m_Joints, io_rRow.data(), m_Skeleton.States );
  ++m_rRecording.FrameCount;
  return {};
}

ZEK::IResult VReader::ReadRows()
{
  const auto Channels = static_cast< std::size_t >( m_Skeleton.ChannelCount );
  std::vector< double > Row( Channels );
  // A number takes two bytes at least, so that no promise makes more room than there is a file for.
  const std::size_t Rows = std::min( static_cast< std::size_t >( m_Promised ), m_Words.Left() / ( 2 * Channels ) + 1 );
  for ( const VJoint& rJoint : m_Joints )
  {
    const bool bFree = std::any_of( rJoint.Channels.begin(), rJoint.Channels.end(),
                                    []( EChannel i_Channel )
                                    {
                                      return i_Channel < EChannel::Xrotation;
                                    } );
    m_Skeleton.StateSize += rJoint.Channels.empty() ? 0 : bFree ? 6 : 3;
  }
  if ( !HasRoomForPoses( Rows, m_Skeleton.StateSize, m_Size, m_rMessage ) )
  {
    return ZEK::IResult::NotSupported;
  }
  m_Skeleton.States.reserve( Rows * m_Skeleton.StateSize );
  while ( m_rRecording.FrameCount < m_Promised && !m_Words.IsAtEnd() )
  {
    if ( m_rProgress && m_rRecording.FrameCount % 256 == 0 &&
         !m_rProgress( static_cast< double >( m_Words.Position() ) / static_cast< double >( m_Size ) ) )
    {
      m_rMessage =
          std::string( "line " ).append( std::to_string( m_Words.Line() ) ).append( ": the reading was stopped" );
      return ZEK::IResult::Canceled;
    }
    for ( double& rValue : Row )
    {
      const ZEK::IResult Result = ReadNumberOf( "a channel", rValue );
      if ( Result == ZEK::IResult( ZEK::IResult::EndOfData ) && m_rRecording.FrameCount > 0 )
      {
        return {};
      }
      if ( Result.IsError() )
      {
        return Result;
      }
    }
    // A last number without anything behind it may have lost digits, unless its row is the last that was promised.
    if ( m_Words.Left() == 0 && m_rRecording.FrameCount + 1 < m_Promised && m_rRecording.FrameCount > 0 )
    {
      return {};
    }
    const ZEK::IResult Result = TakeRow( Row );
    if ( Result.IsError() )
    {
      return Result;
    }
  }
  return {};
}

ZEK::IResult VReader::Finish()
{
  VRecording& rR = m_rRecording;
  if ( rR.FrameCount == 0 )
  {
    return Expected( "rows of frames", {} );
  }
  rR.Form = "text";
  rR.Unit = "cm";
  rR.UnitScale = Centimetre;
  rR.UpAxis = EUpAxis::Y;
  rR.UpAxisReason = "y is up: BVH files have it so.";
  rR.Notes.emplace_back( "The format states no unit of length; centimetres were taken." );
  TakeRate( rR.RateHz, rR );
  m_Skeleton.Subject = SubjectOf( m_Joints );
  m_Skeleton.Subject.Id = 1;
  m_Skeleton.JointCount = m_Joints.size();
  m_Skeleton.Subject.Name = std::filesystem::path( rR.Name ).stem().string();
  m_Skeleton.Subject.Name = m_Skeleton.Subject.Name.empty() ? m_Joints[0].Name : m_Skeleton.Subject.Name;
  AddToBounds( m_Skeleton, rR );
  const std::int64_t Missing = m_Promised - rR.FrameCount;
  rR.Skeletons.push_back( std::move( m_Skeleton ) );
  if ( Missing > 0 )
  {
    (void)Expected( std::to_string( m_Promised ) + " rows", {} );
    m_rMessage.append( "; whole rows before it that were read: " ).append( std::to_string( rR.FrameCount ) );
    rR.Notes.push_back( std::string( "The file is cut off: " ).append( m_rMessage ).append( "." ) );
    return ZEK::IResult::OkButPartial;
  }
  if ( !m_Words.IsAtEnd() )
  {
    rR.Notes.push_back( std::string( "The header promises " )
                            .append( std::to_string( m_Promised ) )
                            .append( " frames; what stands behind them was left out." ) );
  }
  return {};
}
} // namespace
} // namespace Bvh

bool LooksLikeBvh( std::span< const std::byte > i_Bytes )
{
  return Bvh::AsText( i_Bytes ).starts_with( Bvh::Mark );
}

ZEK::IResult ReadBvh( std::span< const std::byte > i_Bytes, const std::string& i_rName, VRecording& o_rRecording,
                      std::string& o_rMessage, const VProgress& i_rProgress )
{
  return ReadGuarded( ERecordingFormat::Bvh, i_rName, o_rRecording, o_rMessage,
                      [&]
                      {
                        return Bvh::VReader( Bvh::AsText( i_Bytes ), o_rRecording, o_rMessage, i_rProgress ).Read();
                      } );
}

} // namespace HostSources
