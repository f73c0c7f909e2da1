#include <HostSources/VTrcReader.h>

#include "Labels.h"
#include "ReaderSupport.h"
#include "TrcText.h"
#include "UpAxis.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace HostSources
{
namespace Trc
{
namespace
{
constexpr std::string_view Mark = "PathFileType";
constexpr std::string_view ByteOrderMark = "\xEF\xBB\xBF";
/// Rows may leave out blank cells at their end, so a table can be larger than its file, but not without bound.
constexpr std::size_t TableBytesPerByte = 64;
constexpr std::size_t LeastTableBytes = std::size_t{ 256 } << 20;

struct VHeader
{
  std::int64_t Frames = -1;  ///< -1: not said
  std::int64_t Markers = -1; ///< -1: not said
};

std::string At( std::uint64_t i_Line )
{
  return "line " + std::to_string( i_Line ) + ": ";
}

std::string_view AsText( std::span< const std::byte > i_Bytes )
{
  std::string_view Text( reinterpret_cast< const char* >( i_Bytes.data() ), i_Bytes.size() );
  if ( Text.starts_with( ByteOrderMark ) )
  {
    Text.remove_prefix( ByteOrderMark.size() );
  }
  return Text;
}

std::string Quote( std::string_view i_Text )
{
  std::string Shown( i_Text.substr( 0, 40 ) );
  for ( char& rCharacter : Shown )
  {
    rCharacter = rCharacter >= ' ' && rCharacter < 127 ? rCharacter : '?';
  }
  return '"' + Shown + '"';
}

/// Reads one file, line after line.
class VReader
{
public:
  VReader( std::string_view i_Text, VRecording& io_rRecording, std::string& o_rMessage, const VProgress& i_rProgress )
    : m_Text( i_Text )
    , m_Lines( i_Text )
    , m_rRecording( io_rRecording )
    , m_rMessage( o_rMessage )
    , m_rProgress( i_rProgress )
  {
  }

  ZEK::IResult Read()
  {
    ZEK::IResult Result = ReadHeader();
    Result = Result.IsOk() ? ReadNames() : Result;
    Result = Result.IsOk() ? ReadRows() : Result;
    return Result.IsOk() ? Finish() : Result;
  }

private:
  ZEK::IResult Fail( ZEK::IResult i_Code, const std::string& i_rWhat, std::uint64_t i_Line )
  {
    m_rMessage = At( i_Line ) + i_rWhat;
    return i_Code;
  }
  ZEK::IResult CutOff( const char* i_pExpected )
  {
    return Fail( ZEK::IResult::EndOfData, std::string( "expected " ) + i_pExpected + ", found the end of the file",
                 m_Lines.Number() + 1 );
  }

  ZEK::IResult ReadHeader();
  ZEK::IResult TakeHeaderValue( std::string_view i_Name, std::string_view i_Value );
  ZEK::IResult ReadNames();
  ZEK::IResult ReadRows();
  ZEK::IResult ReadRow( std::string_view i_Line );
  ZEK::IResult ReadCells( VCells& io_rCells );
  void AddPoint( const float* i_pCoordinates, unsigned i_Count, std::size_t i_Point, VRecordingPoint* o_pRow );
  ZEK::IResult CheckTable();
  ZEK::IResult Finish();

  std::string_view m_Text;
  VLines m_Lines;
  VRecording& m_rRecording;
  std::string& m_rMessage;
  const VProgress& m_rProgress;
  VHeader m_Header;
  std::int64_t m_LastNumber = 0;
  bool m_bJumps = false;
  bool m_bCutRow = false;
  std::uint64_t m_PartBlank = 0; ///< points of which some, not all, coordinates were blank
};

ZEK::IResult VReader::TakeHeaderValue( std::string_view i_Name, std::string_view i_Value )
{
  const std::uint64_t Line = m_Lines.Number();
  if ( i_Name == "Units" )
  {
    TakeUnit( ToUtf8( i_Value ), m_rRecording );
    return ZEK::IResult::Ok;
  }
  if ( i_Name != "DataRate" && i_Name != "NumFrames" && i_Name != "NumMarkers" )
  {
    return ZEK::IResult::Ok;
  }
  double Value = 0;
  if ( ReadNumber( i_Value, Value ) != ECell::Number )
  {
    return Fail( ZEK::IResult::InvalidFormat,
                 "expected a number for " + std::string( i_Name ) + ", found " + Quote( i_Value ), Line );
  }
  if ( i_Name == "DataRate" )
  {
    TakeRate( Value, m_rRecording );
    return ZEK::IResult::Ok;
  }
  if ( !( Value >= 0 && Value < 1e15 ) )
  {
    return Fail( ZEK::IResult::InvalidFormat,
                 "expected a count for " + std::string( i_Name ) + ", found " + Quote( i_Value ), Line );
  }
  ( i_Name == "NumFrames" ? m_Header.Frames : m_Header.Markers ) = static_cast< std::int64_t >( Value );
  return ZEK::IResult::Ok;
}

ZEK::IResult VReader::ReadHeader()
{
  std::string_view Line;
  if ( !m_Lines.Next( Line ) || !Line.starts_with( Mark ) )
  {
    return Fail( m_Text.empty() ? ZEK::IResult::EndOfData : ZEK::IResult::InvalidFormat,
                 "expected \"PathFileType\", the mark of a TRC file, found " + Quote( Line ), 1 );
  }
  if ( !m_Lines.Next( Line ) )
  {
    return CutOff( "the names of the header's values" );
  }
  const std::vector< std::string_view > Names = SplitCells( Line );
  if ( std::find( Names.begin(), Names.end(), "DataRate" ) == Names.end() )
  {
    return Fail( ZEK::IResult::InvalidFormat,
                 "expected the names of the header's values, DataRate among them, with tabs between, found " +
                     Quote( Line ),
                 2 );
  }
  if ( !m_Lines.Next( Line ) )
  {
    return CutOff( "the header's values" );
  }
  const std::vector< std::string_view > Values = SplitCells( Line );
  for ( std::size_t Index = 0; Index < Names.size(); ++Index )
  {
    const ZEK::IResult Result =
        TakeHeaderValue( Names[Index], Index < Values.size() ? Values[Index] : std::string_view() );
    if ( Result.IsError() )
    {
      return Result;
    }
  }
  return ZEK::IResult::Ok;
}

/// "Frame#", "Time", then a name above the first of each point's three columns, and a line "X1 Y1 Z1 …" below.
ZEK::IResult VReader::ReadNames()
{
  std::string_view Line;
  if ( !m_Lines.Next( Line ) )
  {
    return CutOff( "the names of the markers" );
  }
  const std::vector< std::string_view > Cells = SplitCells( Line );
  if ( !Cells[0].starts_with( "Frame" ) || Cells.size() < 2 )
  {
    return Fail( ZEK::IResult::InvalidFormat,
                 "expected \"Frame#\", \"Time\" and the names of the markers, with tabs between, found " +
                     Quote( Line ),
                 m_Lines.Number() );
  }
  bool bAligned = true;
  for ( std::size_t Index = 2; Index < Cells.size(); ++Index )
  {
    bAligned = bAligned && ( Cells[Index].empty() || ( Index - 2 ) % 3 == 0 );
  }
  for ( std::size_t Index = 2; Index < Cells.size(); Index += bAligned ? 3 : 1 )
  {
    if ( bAligned || !Cells[Index].empty() )
    {
      m_rRecording.Labels.push_back( ToUtf8( Cells[Index] ) );
    }
  }
  while ( !m_rRecording.Labels.empty() && m_rRecording.Labels.back().empty() )
  {
    m_rRecording.Labels.pop_back();
  }
  m_rRecording.FileLabels = m_rRecording.Labels;
  const std::size_t Changed = MakeLabelsUnique( m_rRecording.Labels, {} );
  if ( Changed > 0 )
  {
    m_rRecording.Notes.push_back( std::to_string( Changed ) + " labels repeat; they were numbered." );
  }
  if ( m_Header.Markers >= 0 && m_Header.Markers != static_cast< std::int64_t >( m_rRecording.PointCount() ) )
  {
    m_rRecording.Notes.push_back( "The header promises " + std::to_string( m_Header.Markers ) + " markers; " +
                                  std::to_string( m_rRecording.PointCount() ) + " have names." );
  }
  if ( !m_Lines.Next( Line ) )
  {
    return CutOff( "the line of the columns X1, Y1, Z1" );
  }
  return ZEK::IResult::Ok;
}

ZEK::IResult VReader::CheckTable()
{
  const std::string_view Rest = m_Lines.Rest();
  const auto Rows = static_cast< std::size_t >( std::count( Rest.begin(), Rest.end(), '\n' ) ) + 1;
  const std::size_t RowBytes = m_rRecording.PointCount() * sizeof( VRecordingPoint );
  const std::size_t Limit = std::max( LeastTableBytes, m_Text.size() * TableBytesPerByte );
  if ( RowBytes > 0 && Rows > Limit / RowBytes )
  {
    return Fail( ZEK::IResult::InvalidFormat,
                 "expected rows for " + std::to_string( m_rRecording.PointCount() ) + " markers, found " +
                     std::to_string( Rows ) + " rows in a file that is too small to hold them",
                 m_Lines.Number() + 1 );
  }
  m_rRecording.Points.reserve( Rows * m_rRecording.PointCount() );
  m_rRecording.UnlabelledBegin.reserve( Rows + 1 );
  m_rRecording.UnlabelledBegin.push_back( 0 );
  return ZEK::IResult::Ok;
}

ZEK::IResult VReader::ReadRows()
{
  ZEK::IResult Result = CheckTable();
  std::string_view Line;
  std::uint64_t Steps = 0;
  while ( Result.IsOk() && m_Lines.Next( Line ) )
  {
    if ( m_rProgress && Steps++ % 1024 == 0 &&
         !m_rProgress( static_cast< double >( m_Lines.Position() ) / static_cast< double >( m_Text.size() ) ) )
    {
      return Fail( ZEK::IResult::Canceled, "the reading was stopped", m_Lines.Number() );
    }
    if ( Trim( Line ).find_first_not_of( '\t' ) == std::string_view::npos )
    {
      continue;
    }
    // A row without its line feed may have lost digits, unless it is the last one that was promised.
    if ( !m_Lines.Ended() && m_Header.Frames > m_rRecording.FrameCount + 1 )
    {
      m_bCutRow = true;
      break;
    }
    Result = ReadRow( Line );
  }
  return Result;
}

ZEK::IResult VReader::ReadRow( std::string_view i_Line )
{
  VCells Cells( i_Line );
  std::string_view Cell;
  double Number = 0;
  if ( !Cells.Next( Cell ) || ReadNumber( Cell, Number ) != ECell::Number || !( std::abs( Number ) < 1e15 ) )
  {
    return Fail( ZEK::IResult::InvalidFormat, "expected the number of a frame, found " + Quote( Cell ),
                 m_Lines.Number() );
  }
  double Time = 0;
  if ( Cells.Next( Cell ) && ReadNumber( Cell, Time ) == ECell::Wrong )
  {
    return Fail( ZEK::IResult::InvalidFormat, "expected a time, found " + Quote( Cell ), m_Lines.Number() );
  }
  const auto Frame = static_cast< std::int64_t >( Number );
  if ( m_rRecording.FrameCount == 0 )
  {
    m_rRecording.FirstFrame = Frame;
  }
  else
  {
    m_bJumps = m_bJumps || Frame != m_LastNumber + 1;
  }
  m_LastNumber = Frame;
  return ReadCells( Cells );
}

/// Takes up to three coordinates in the file's unit; a point with less than three finite ones is a gap.
void VReader::AddPoint( const float* i_pCoordinates, unsigned i_Count, std::size_t i_Point, VRecordingPoint* o_pRow )
{
  if ( i_Count == 0 )
  {
    return;
  }
  const auto Scale = static_cast< float >( m_rRecording.UnitScale );
  const VRecordingPoint Point{ i_pCoordinates[0] * Scale, i_pCoordinates[1] * Scale, i_pCoordinates[2] * Scale, 0 };
  if ( i_Count < 3 || !std::isfinite( Point.x ) || !std::isfinite( Point.y ) || !std::isfinite( Point.z ) )
  {
    m_PartBlank += i_Count < 3;
    return;
  }
  if ( i_Point < m_rRecording.PointCount() )
  {
    o_pRow[i_Point] = Point;
  }
  else
  {
    m_rRecording.Unlabelled.push_back( Point );
  }
}

ZEK::IResult VReader::ReadCells( VCells& io_rCells )
{
  constexpr float Nan = std::numeric_limits< float >::quiet_NaN();
  const std::size_t Begin = m_rRecording.Points.size();
  m_rRecording.Points.resize( Begin + m_rRecording.PointCount(), { Nan, Nan, Nan, Nan } );
  VRecordingPoint* pRow = m_rRecording.Points.data() + Begin;
  float Coordinates[3] = {};
  unsigned Filled = 0;
  std::size_t Column = 0;
  std::string_view Cell;
  for ( ; io_rCells.Next( Cell ); ++Column )
  {
    const ECell Kind = ReadNumber( Cell, Coordinates[Column % 3] );
    if ( Kind == ECell::Wrong )
    {
      return Fail( ZEK::IResult::InvalidFormat,
                   "expected a coordinate in column " + std::to_string( Column + 3 ) + ", found " + Quote( Cell ),
                   m_Lines.Number() );
    }
    Filled += Kind == ECell::Number;
    if ( Column % 3 == 2 )
    {
      AddPoint( Coordinates, Filled, Column / 3, pRow );
      Filled = 0;
    }
  }
  m_PartBlank += Filled > 0;
  ++m_rRecording.FrameCount;
  m_rRecording.UnlabelledBegin.push_back( m_rRecording.Unlabelled.size() );
  return ZEK::IResult::Ok;
}

ZEK::IResult VReader::Finish()
{
  VRecording& rR = m_rRecording;
  if ( rR.FrameCount == 0 )
  {
    return CutOff( "rows of frames" );
  }
  if ( rR.Unlabelled.empty() )
  {
    rR.UnlabelledBegin = {};
  }
  AddToBounds( rR.Bounds, rR.Points );
  AddToBounds( rR.Bounds, rR.Unlabelled );
  rR.GapCount = static_cast< std::uint64_t >( std::count_if( rR.Points.begin(), rR.Points.end(),
                                                             []( const VRecordingPoint& i_rPoint )
                                                             {
                                                               return !i_rPoint.IsValid();
                                                             } ) );
  rR.Form = "text";
  TakeRate( rR.RateHz, rR ); // again, as the frames are known only now
  ChooseUpAxisByData( rR, "the format does not tell" );
  if ( m_PartBlank > 0 )
  {
    rR.Notes.push_back( std::to_string( m_PartBlank ) + " points have a blank coordinate and count as missing." );
  }
  if ( m_bJumps )
  {
    rR.Notes.emplace_back( "The frame numbers do not run on by one; frames follow each other as the rows do." );
  }
  if ( m_Header.Frames > rR.FrameCount )
  {
    m_rMessage = At( m_Lines.Number() + ( m_bCutRow ? 0 : 1 ) ) + "expected " + std::to_string( m_Header.Frames ) +
                 " rows, found the end of the file" + ( m_bCutRow ? " within a row" : "" ) + "; the " +
                 std::to_string( rR.FrameCount ) + " whole rows before it were read";
    rR.Notes.push_back( "The file is cut off: " + m_rMessage + "." );
    return ZEK::IResult::OkButPartial;
  }
  if ( m_Header.Frames >= 0 && m_Header.Frames < rR.FrameCount )
  {
    rR.Notes.push_back( "The header promises " + std::to_string( m_Header.Frames ) + " frames; there are " +
                        std::to_string( rR.FrameCount ) + " rows, and all were taken." );
  }
  return ZEK::IResult::Ok;
}
} // namespace
} // namespace Trc

bool LooksLikeTrc( std::span< const std::byte > i_Bytes )
{
  return Trc::AsText( i_Bytes ).starts_with( Trc::Mark );
}

ZEK::IResult ReadTrc( std::span< const std::byte > i_Bytes, const std::string& i_rName, VRecording& o_rRecording,
                      std::string& o_rMessage, const VProgress& i_rProgress )
{
  return ReadGuarded( ERecordingFormat::Trc, i_rName, o_rRecording, o_rMessage,
                      [&]
                      {
                        return Trc::VReader( Trc::AsText( i_Bytes ), o_rRecording, o_rMessage, i_rProgress ).Read();
                      } );
}

} // namespace HostSources
