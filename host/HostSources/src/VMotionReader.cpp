#include <HostSources/VMotionReader.h>

#include "MotionText.h"
#include "OsimSkeleton.h"
#include "ReaderSupport.h"
#include "XmlTree.h"

#include <algorithm>
#include <cmath>
#include <numbers>
#include <unordered_map>

namespace HostSources
{
namespace
{
std::string_view AsText( std::span< const std::byte > i_Bytes )
{
  return { reinterpret_cast< const char* >( i_Bytes.data() ), i_Bytes.size() };
}

/// At most five names, and how many more there are.
std::string Listed( const std::vector< std::string >& i_rNames )
{
  constexpr std::size_t Shown = 5;
  std::string Text;
  for ( std::size_t Index = 0; Index < i_rNames.size() && Index < Shown; ++Index )
  {
    Text.append( Index == 0 ? "" : ", " ).append( ToUtf8( i_rNames[Index].substr( 0, 60 ) ) );
  }
  return i_rNames.size() > Shown
             ? Text.append( " and " ).append( std::to_string( i_rNames.size() - Shown ) ).append( " more" )
             : Text;
}

/// What a column is of: its coordinate, also of a path such as /jointset/hip/hip_flexion/value; empty for a speed.
std::string_view CoordinateOf( std::string_view i_Column )
{
  constexpr std::string_view Value = "/value";
  if ( !i_Column.starts_with( '/' ) )
  {
    return i_Column;
  }
  if ( !i_Column.ends_with( Value ) )
  {
    return {};
  }
  i_Column.remove_suffix( Value.size() );
  return i_Column.substr( i_Column.rfind( '/' ) + 1 );
}

Osim::VModel ReadModelOf( std::span< const std::byte > i_Bytes, const std::string& i_rName )
{
  try
  {
    return Osim::ReadModel( i_Bytes );
  }
  catch ( const VReadFault& rFault )
  {
    throw VReadFault( std::string( i_rName ).append( ": " ).append( rFault.what() ), rFault.Code() );
  }
}

class VReader
{
public:
  VReader( std::span< const std::byte > i_Motion, std::span< const std::byte > i_Model, const std::string& i_rModelName,
           VRecording& io_rRecording, std::string& o_rMessage, const VProgress& i_rProgress )
    : m_Size( i_Motion.size() )
    , m_ModelSize( i_Model.size() )
    , m_Text( AsText( i_Motion ) )
    , m_Model( ReadModelOf( i_Model, i_rModelName ) )
    , m_Poser( m_Model )
    , m_rModelName( i_rModelName )
    , m_rRecording( io_rRecording )
    , m_rMessage( o_rMessage )
    , m_rProgress( i_rProgress )
  {
  }

  ZEK::IResult Read()
  {
    MatchColumns();
    const ZEK::IResult Result = ReadRows();
    return Result.IsError() ? Result : Finish();
  }

private:
  struct VMatch
  {
    std::size_t Column = 0, Coordinate = 0;
    double Scale = 1;
  };
  void MatchColumns();
  bool TakesDegrees();
  ZEK::IResult ReadRows();
  void TakeRow( const std::vector< double >& i_rRow );
  void TakeTimes( double i_Time );
  double Rate();
  ZEK::IResult Finish();
  void Note( std::string i_Text ) { m_rRecording.Notes.push_back( std::move( i_Text ) ); }

  std::size_t m_Size, m_ModelSize;
  VMotionText m_Text;
  Osim::VModel m_Model;
  Osim::VPoser m_Poser;
  const std::string& m_rModelName;
  VRecording& m_rRecording;
  std::string& m_rMessage;
  const VProgress& m_rProgress;
  std::vector< VMatch > m_Matches;
  std::vector< double > m_Values;
  VRecordingSkeleton m_Skeleton;
  double m_FirstTime = 0, m_LastTime = 0, m_ShortestStep = 0, m_LongestStep = 0;
  bool m_bDegrees = false, m_bCut = false;
};

bool VReader::TakesDegrees()
{
  if ( !m_Text.Degrees() )
  {
    Note( "The header does not say whether angles are in degrees; degrees were taken." );
  }
  return m_Text.Degrees().value_or( true );
}

void VReader::MatchColumns()
{
  constexpr double Degree = std::numbers::pi / 180;
  std::unordered_map< std::string_view, std::size_t > Indices;
  std::vector< bool > bKnown( m_Model.Coordinates.size(), false );
  for ( std::size_t Index = 0; Index < m_Model.Coordinates.size(); ++Index )
  {
    Indices.emplace( m_Model.Coordinates[Index].Name, Index );
    m_Values.push_back( m_Model.Coordinates[Index].Default );
  }
  m_bDegrees = TakesDegrees();
  const auto& rColumns = m_Text.Columns();
  std::vector< bool > bWanted( rColumns.size(), false );
  bWanted[0] = true;
  std::vector< std::string > Others, Missing;
  for ( std::size_t Column = 1; Column < rColumns.size(); ++Column )
  {
    const auto It = Indices.find( CoordinateOf( rColumns[Column] ) );
    if ( It == Indices.end() )
    {
      Others.push_back( rColumns[Column] );
      continue;
    }
    if ( bKnown[It->second] )
    {
      throw VReadFault( "expected one column a coordinate, found two of " + ToUtf8( It->first ) );
    }
    bKnown[It->second] = bWanted[Column] = true;
    m_Matches.push_back( { Column, It->second, m_bDegrees && m_Model.Coordinates[It->second].bAngle ? Degree : 1 } );
  }
  if ( m_Matches.empty() )
  {
    throw VReadFault( "expected columns that are coordinates of the model " + m_rModelName + ", found " +
                      ( Others.empty() ? "none" : Listed( Others ) ) );
  }
  for ( const Osim::VCoupler& rCoupler : m_Model.Couplers )
  {
    bKnown[rCoupler.Dependent] = true;
  }
  for ( std::size_t Index = 0; Index < bKnown.size(); ++Index )
  {
    if ( !bKnown[Index] )
    {
      Missing.push_back( m_Model.Coordinates[Index].Name );
    }
  }
  if ( !Missing.empty() )
  {
    Note( "Coordinates without a column stand as the model has them: " + Listed( Missing ) + "." );
  }
  if ( !Others.empty() )
  {
    Note( "Columns that are no coordinates of the model were left out: " + Listed( Others ) + "." );
  }
  if ( m_Text.PromisedColumns() != 0 && m_Text.PromisedColumns() != rColumns.size() )
  {
    Note( "The header promises " + std::to_string( m_Text.PromisedColumns() ) + " columns and names " +
          std::to_string( rColumns.size() ) + "." );
  }
  m_Text.Want( std::move( bWanted ) );
}

void VReader::TakeTimes( double i_Time )
{
  const double Step = i_Time - m_LastTime;
  const bool bFirst = m_rRecording.FrameCount == 0, bSecond = m_rRecording.FrameCount == 1;
  m_FirstTime = bFirst ? i_Time : m_FirstTime;
  m_ShortestStep = bSecond ? Step : std::min( m_ShortestStep, Step );
  m_LongestStep = bSecond ? Step : std::max( m_LongestStep, Step );
  m_LastTime = i_Time;
}

void VReader::TakeRow( const std::vector< double >& i_rRow )
{
  for ( const VMatch& rMatch : m_Matches )
  {
    m_Values[rMatch.Coordinate] = i_rRow[rMatch.Column] * rMatch.Scale;
  }
  const std::size_t Before = m_Skeleton.States.size();
  m_Poser.AppendState( m_Values, m_Skeleton.States );
  for ( std::size_t Index = Before; Index < m_Skeleton.States.size(); ++Index )
  {
    if ( !( std::abs( m_Skeleton.States[Index] ) <= Farthest ) )
    {
      throw VReadFault( "line " + std::to_string( m_Text.Line() ) +
                        ": expected a pose within 1000 km, found one beyond it" );
    }
  }
  TakeTimes( i_rRow[0] );
  ++m_rRecording.FrameCount;
}

ZEK::IResult VReader::ReadRows()
{
  m_Skeleton.StateSize = m_Poser.StateSize();
  std::vector< double > Row( m_Text.Columns().size() );
  while ( true )
  {
    const auto Frames = static_cast< std::size_t >( m_rRecording.FrameCount );
    if ( Frames % 256 == 0 )
    {
      if ( !HasRoomForPoses( Frames + 256, m_Skeleton.StateSize, m_Size + m_ModelSize, m_rMessage ) )
      {
        return ZEK::IResult::NotSupported;
      }
      if ( m_rProgress && !m_rProgress( static_cast< double >( m_Text.Position() ) / static_cast< double >( m_Size ) ) )
      {
        m_rMessage = "line " + std::to_string( m_Text.Line() ) + ": the reading was stopped, expected the rest";
        return ZEK::IResult::Canceled;
      }
    }
    const VMotionText::ERow Found = m_Text.NextRow( Row );
    m_bCut = Found == VMotionText::ERow::Cut;
    if ( Found != VMotionText::ERow::Row )
    {
      return {};
    }
    TakeRow( Row );
  }
}

double VReader::Rate()
{
  const double Steps = static_cast< double >( m_rRecording.FrameCount - 1 );
  if ( !( Steps > 0 && m_ShortestStep > 0 ) )
  {
    return 0;
  }
  const double Mean = ( m_LastTime - m_FirstTime ) / Steps;
  if ( m_LongestStep > 1.25 * Mean || m_ShortestStep < 0.75 * Mean )
  {
    Note( "The times are not evenly spaced; the frames are shown at their mean rate." );
  }
  // Times such as 0.01666667 stand for whole rates.
  const double Found = 1 / Mean, Whole = std::round( Found );
  return Whole > 0 && std::abs( Found - Whole ) < 1e-4 * Whole ? Whole : Found;
}

ZEK::IResult VReader::Finish()
{
  VRecording& rR = m_rRecording;
  if ( rR.FrameCount == 0 )
  {
    m_rMessage = "line " + std::to_string( m_Text.Line() ) + ": expected rows of numbers, found the end of the file";
    return ZEK::IResult::EndOfData;
  }
  rR.Form = std::string( m_bDegrees ? "text, degrees" : "text, radians" ).append( ", moving " ).append( m_rModelName );
  rR.Unit = "m";
  rR.UnitScale = 1000;
  rR.UpAxis = m_Model.UpAxis;
  rR.UpAxisReason = m_Model.UpAxisReason;
  rR.Notes.insert( rR.Notes.end(), m_Model.Notes.begin(), m_Model.Notes.end() );
  TakeRate( Rate(), rR );
  m_Skeleton.Subject = m_Poser.Subject();
  if ( m_Skeleton.Subject.Name.empty() )
  {
    m_Skeleton.Subject.Name = std::filesystem::path( rR.Name ).stem().string();
  }
  m_Skeleton.JointCount = m_Model.Bodies.size();
  m_Skeleton.ChannelCount = m_Matches.size();
  AddToBounds( m_Skeleton, rR );
  rR.Skeletons.push_back( std::move( m_Skeleton ) );
  const std::int64_t Promised = m_Text.PromisedRows().value_or( rR.FrameCount );
  if ( m_bCut || Promised > rR.FrameCount )
  {
    m_rMessage = "line " + std::to_string( m_Text.Line() ) + ": expected " +
                 ( Promised > rR.FrameCount ? std::to_string( Promised ) + " rows" : "a whole row" ) +
                 ", found the end of the file; whole rows before it that were read: " + std::to_string( rR.FrameCount );
    Note( "The file is cut off: " + m_rMessage + "." );
    return ZEK::IResult::OkButPartial;
  }
  if ( Promised < rR.FrameCount )
  {
    Note( "The header promises " + std::to_string( Promised ) + " rows; all " + std::to_string( rR.FrameCount ) +
          " were read." );
  }
  return {};
}

bool IsModel( const std::filesystem::path& i_rPath )
{
  return i_rPath.extension() == ".osim" || i_rPath.extension() == ".OSIM";
}
} // namespace

bool LooksLikeMotion( std::span< const std::byte > i_Bytes )
{
  const std::string_view Text = AsText( i_Bytes );
  const std::size_t End = Text.find( "endheader" );
  return End != std::string_view::npos && ( End == 0 || Text[End - 1] == '\n' ) &&
         Text.substr( 0, End ).find( '\0' ) == std::string_view::npos;
}

ZEK::IResult FindModel( const std::filesystem::path& i_rMotion, const std::filesystem::path& i_rNamed,
                        std::filesystem::path& o_rModel, std::string& o_rMessage )
{
  o_rMessage.clear();
  o_rModel = i_rNamed;
  if ( !i_rNamed.empty() )
  {
    return {};
  }
  const std::filesystem::path Folder = i_rMotion.has_parent_path() ? i_rMotion.parent_path() : ".";
  std::error_code Error;
  std::vector< std::filesystem::path > Models;
  for ( std::filesystem::directory_iterator It( Folder, Error ), End; !Error && It != End; It.increment( Error ) )
  {
    if ( IsModel( It->path() ) )
    {
      Models.push_back( It->path() );
    }
  }
  std::sort( Models.begin(), Models.end() );
  for ( const std::filesystem::path& rModel : Models )
  {
    if ( Models.size() == 1 || rModel.stem() == i_rMotion.stem() )
    {
      o_rModel = rModel;
      return {};
    }
  }
  std::vector< std::string > Names;
  for ( const std::filesystem::path& rModel : Models )
  {
    Names.push_back( rModel.filename().string() );
  }
  o_rMessage = i_rMotion.string() + ": joint coordinates cannot be shown without the model that they move: expected " +
               ( Names.empty() ? "a model (.osim) beside the file or named with --model, found none"
                               : "one model (.osim) beside the file or named with --model, found " + Listed( Names ) );
  return ZEK::IResult::NotFound;
}

ZEK::IResult ReadMotion( std::span< const std::byte > i_Motion, const std::string& i_rName,
                         std::span< const std::byte > i_Model, const std::string& i_rModelName,
                         VRecording& o_rRecording, std::string& o_rMessage, const VProgress& i_rProgress )
{
  return ReadGuarded(
      ERecordingFormat::Motion, i_rName, o_rRecording, o_rMessage,
      [&]
      {
        try
        {
          return VReader( i_Motion, i_Model, i_rModelName, o_rRecording, o_rMessage, i_rProgress ).Read();
        }
        catch ( const VReadFault& rFault )
        {
          o_rMessage = rFault.what();
          return ZEK::IResult( rFault.Code() );
        }
      } );
}

} // namespace HostSources
