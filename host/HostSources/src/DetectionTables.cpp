#include "CsvTable.h"
#include "Detections.h"
#include "ReaderSupport.h"

#include <algorithm>
#include <cmath>
#include <map>
#include <tuple>
#include <utility>

namespace HostSources
{
namespace
{
enum EImageColumn : std::size_t
{
  EImageFrame,
  EImageCamera,
  EImageObject,
  EImagePoint,
  EImageX,
  EImageY
};
enum EPlaceColumn : std::size_t
{
  EPlaceFrame,
  EPlaceObject,
  EPlacePoint,
  EPlaceX,
  EPlaceY,
  EPlaceZ
};
enum ETimeColumn : std::size_t
{
  ETimeFrame,
  ETimeSeconds
};
constexpr double MetresToMillimetres = 1000;
constexpr double LargestIndex = 1e15, LargestNumber = 2e9;

struct VTableFiles
{
  std::filesystem::path Images, Places, Times;
};

/// A table is known by its columns, or by its name where they are damaged.
VTableFiles FindTables( const VFolderFiles& i_rFiles )
{
  VTableFiles Found;
  for ( const auto& rFile : i_rFiles.Files )
  {
    VFileSource Source;
    std::string Message;
    if ( SuffixOf( rFile ) != ".csv" || Source.Open( rFile, Message ).IsError() )
    {
      continue;
    }
    const auto Head = Source.Read( 0, 4096 );
    std::string_view Text( reinterpret_cast< const char* >( Head.data() ), Head.size() );
    Text.remove_prefix( Text.starts_with( "\xEF\xBB\xBF" ) ? 3 : 0 );
    const std::vector< std::string > Names = CsvHeader( Text );
    const auto Has = [&]( const char* i_pName )
    {
      return std::find( Names.begin(), Names.end(), i_pName ) != Names.end();
    };
    const std::string Stem = rFile.stem().string();
    std::filesystem::path* const pPlace = Has( "img_loc_x" ) || Has( "img_loc_y" ) || Stem == "points2d" ? &Found.Images
                                          : Has( "x_coord" ) || Has( "y_coord" ) || Stem == "points3d"   ? &Found.Places
                                          : ( Has( "sync_index" ) && Has( "frame_time" ) )               ? &Found.Times
                                                                                                         : nullptr;
    if ( pPlace && pPlace->empty() )
    {
      *pPlace = rFile;
    }
  }
  return Found;
}

class VReader
{
public:
  VReader( VDetections& io_rDetections, VRecording& io_rRecording, std::string& o_rMessage,
           const VProgress& i_rProgress )
    : m_rDetections( io_rDetections )
    , m_rRecording( io_rRecording )
    , m_rMessage( o_rMessage )
    , m_rProgress( i_rProgress )
  {
  }

  ZEK::IResult Read( const VTableFiles& i_rFiles );

private:
  ZEK::IResult ReadTable( const std::filesystem::path& i_rPath, std::initializer_list< VCsvColumn > i_Columns,
                          VCsvTable& o_rTable );
  void KeepWhole( VCsvTable& io_rTable, const std::filesystem::path& i_rPath,
                  std::initializer_list< std::size_t > i_Whole );
  void Number();
  ZEK::IResult Span();
  void TakeImages();
  void TakePlaces();
  void TakeRate();
  std::int32_t PointOf( double i_Object, double i_Point ) const
  {
    return m_Points.at( { static_cast< std::int64_t >( i_Object ), static_cast< std::int64_t >( i_Point ) } );
  }

  VDetections& m_rDetections;
  VRecording& m_rRecording;
  std::string& m_rMessage;
  const VProgress& m_rProgress;
  VCsvTable m_Images, m_Places, m_Times;
  std::uint64_t m_Bytes = 0;
  double m_Done = 0;                                                          ///< tables
  std::map< std::pair< std::int64_t, std::int64_t >, std::int32_t > m_Points; ///< by object and number
  std::map< std::int64_t, std::size_t > m_Cameras;                            ///< by number
};

ZEK::IResult VReader::ReadTable( const std::filesystem::path& i_rPath, std::initializer_list< VCsvColumn > i_Columns,
                                 VCsvTable& o_rTable )
{
  if ( i_rPath.empty() )
  {
    return ZEK::IResult::Ok;
  }
  VFileSource Source;
  std::string_view Text;
  ZEK::IResult Result = ReadText( i_rPath, Source, Text, m_rMessage );
  if ( Result.IsError() )
  {
    return Result;
  }
  m_Bytes += Text.size();
  constexpr double Tables = 3;
  Result = ReadCsv( Text, i_Columns, o_rTable, m_rMessage,
                    [&]( double i_Fraction )
                    {
                      return !m_rProgress || m_rProgress( ( m_Done + i_Fraction ) / Tables );
                    } );
  m_Done += 1;
  const std::string Name = ToUtf8( i_rPath.filename().string() );
  if ( Result.IsError() )
  {
    m_rMessage = Name + ": " + m_rMessage;
  }
  if ( o_rTable.BadRows > 0 )
  {
    m_rDetections.Losses.push_back( Name + ": " + std::to_string( o_rTable.BadRows ) +
                                    " rows were left out; the first: " + o_rTable.FirstBad +
                                    ( o_rTable.bCutOff ? "; the file ends within a row" : "" ) );
  }
  return Result;
}

/// Drops rows of which a number is not finite, or an index not whole.
void VReader::KeepWhole( VCsvTable& io_rTable, const std::filesystem::path& i_rPath,
                         std::initializer_list< std::size_t > i_Whole )
{
  std::size_t Kept = 0;
  const std::size_t Rows = io_rTable.Rows();
  for ( std::size_t Row = 0; Row < Rows; ++Row )
  {
    double* const pRow = io_rTable.Cells.data() + Row * io_rTable.Columns;
    bool bGood = true;
    for ( const std::size_t Column : i_Whole )
    {
      const double Limit = Column == 0 ? LargestIndex : LargestNumber;
      bGood = bGood && std::abs( pRow[Column] ) < Limit && pRow[Column] == std::floor( pRow[Column] );
    }
    for ( std::size_t Column = 0; Column < io_rTable.Columns; ++Column )
    {
      bGood = bGood && std::isfinite( static_cast< float >( pRow[Column] ) );
    }
    if ( bGood )
    {
      std::copy_n( pRow, io_rTable.Columns, io_rTable.Cells.data() + Kept++ * io_rTable.Columns );
    }
  }
  io_rTable.Cells.resize( Kept * io_rTable.Columns );
  if ( Kept < Rows )
  {
    m_rDetections.Losses.push_back( ToUtf8( i_rPath.filename().string() ) + ": " + std::to_string( Rows - Kept ) +
                                    " rows hold what is no number or no index and were left out" );
  }
}

/// Gives cameras and points their places.
void VReader::Number()
{
  const auto AddPoint = [&]( double i_Object, double i_Point )
  {
    m_Points.try_emplace( { static_cast< std::int64_t >( i_Object ), static_cast< std::int64_t >( i_Point ) }, 0 );
  };
  for ( std::size_t Row = 0; Row < m_Images.Rows(); ++Row )
  {
    const double* const pRow = m_Images.Row( Row );
    AddPoint( pRow[EImageObject], pRow[EImagePoint] );
    m_Cameras.try_emplace( static_cast< std::int64_t >( pRow[EImageCamera] ), 0 );
  }
  for ( std::size_t Row = 0; Row < m_Places.Rows(); ++Row )
  {
    AddPoint( m_Places.Row( Row )[EPlaceObject], m_Places.Row( Row )[EPlacePoint] );
  }
  const bool bObjects = !m_Points.empty() && m_Points.begin()->first.first != m_Points.rbegin()->first.first;
  for ( auto& [rKey, rIndex] : m_Points )
  {
    rIndex = static_cast< std::int32_t >( m_rDetections.Points.size() );
    m_rDetections.Points.push_back(
        ( bObjects ? std::string( "object " ).append( std::to_string( rKey.first ) ).append( ":" ) : std::string() ) +
        std::string( "keypoint " ).append( std::to_string( rKey.second ) ) );
  }
  for ( auto& [rId, rIndex] : m_Cameras )
  {
    rIndex = m_rDetections.Cameras.size();
    m_rDetections.Cameras.emplace_back().Id = static_cast< std::int32_t >( rId );
  }
}

ZEK::IResult VReader::Span()
{
  double First = LargestIndex, Last = -LargestIndex;
  for ( const VCsvTable* const pTable : { &m_Images, &m_Places } )
  {
    for ( std::size_t Row = 0; Row < pTable->Rows(); ++Row )
    {
      First = std::min( First, pTable->Row( Row )[0] );
      Last = std::max( Last, pTable->Row( Row )[0] );
    }
  }
  if ( First > Last )
  {
    m_rMessage = "expected rows of detections or points, found none that can be used";
    return ZEK::IResult::EndOfData;
  }
  const auto Frames = static_cast< std::uint64_t >( Last - First );
  const std::uint64_t PerFrame =
      m_Cameras.size() * sizeof( std::uint64_t ) + m_Points.size() * sizeof( VRecordingPoint );
  if ( !IsReasonable( Frames, PerFrame, m_Bytes ) )
  {
    m_rMessage = "expected rows that follow each other in time, found sync_index from " +
                 std::to_string( static_cast< std::int64_t >( First ) ) + " to " +
                 std::to_string( static_cast< std::int64_t >( Last ) ) + " in tables that are too small for it";
    return ZEK::IResult::InvalidFormat;
  }
  m_rDetections.First = static_cast< std::int64_t >( First );
  m_rDetections.Count = static_cast< std::int64_t >( Frames ) + 1;
  return ZEK::IResult::Ok;
}

void VReader::TakeImages()
{
  struct VRow
  {
    std::size_t Camera, Frame;
    std::int32_t Point;
    float x, y;
  };
  std::vector< VRow > Rows;
  Rows.reserve( m_Images.Rows() );
  for ( std::size_t Row = 0; Row < m_Images.Rows(); ++Row )
  {
    const double* const pRow = m_Images.Row( Row );
    Rows.push_back( { m_Cameras.at( static_cast< std::int64_t >( pRow[EImageCamera] ) ),
                      static_cast< std::size_t >( pRow[EImageFrame] - static_cast< double >( m_rDetections.First ) ),
                      PointOf( pRow[EImageObject], pRow[EImagePoint] ), static_cast< float >( pRow[EImageX] ),
                      static_cast< float >( pRow[EImageY] ) } );
  }
  m_Images.Cells = {};
  std::stable_sort( Rows.begin(), Rows.end(),
                    []( const VRow& i_rA, const VRow& i_rB )
                    {
                      return std::tie( i_rA.Camera, i_rA.Frame, i_rA.Point ) <
                             std::tie( i_rB.Camera, i_rB.Frame, i_rB.Point );
                    } );
  std::uint64_t Repeated = 0;
  for ( std::size_t Index = 0; Index < Rows.size(); ++Index )
  {
    const VRow& rRow = Rows[Index];
    if ( Index > 0 && Rows[Index - 1].Camera == rRow.Camera && Rows[Index - 1].Frame == rRow.Frame &&
         Rows[Index - 1].Point == rRow.Point )
    {
      ++Repeated;
      continue;
    }
    VRecordingCamera& rSeen = m_rDetections.Cameras[rRow.Camera].Seen;
    rSeen.DetectionBegin.resize( std::max( rSeen.DetectionBegin.size(), rRow.Frame + 1 ), rSeen.Detections.size() );
    rSeen.Detections.push_back( { rRow.x, rRow.y, 1, rRow.Point, 0 } );
  }
  for ( VDetections::VCamera& rCamera : m_rDetections.Cameras )
  {
    rCamera.Seen.DetectionBegin.resize( static_cast< std::size_t >( m_rDetections.Count ) + 1,
                                        rCamera.Seen.Detections.size() );
  }
  if ( Repeated > 0 )
  {
    m_rDetections.Losses.push_back( std::to_string( Repeated ) +
                                    " rows see a point in a camera for the second time and were left out" );
  }
}

void VReader::TakePlaces()
{
  if ( m_Places.Rows() == 0 )
  {
    return;
  }
  const std::size_t Columns = m_rDetections.Points.size();
  m_rRecording.Points.resize( static_cast< std::size_t >( m_rDetections.Count ) * Columns );
  for ( std::size_t Row = 0; Row < m_Places.Rows(); ++Row )
  {
    const double* const pRow = m_Places.Row( Row );
    const auto Frame = static_cast< std::size_t >( pRow[EPlaceFrame] - static_cast< double >( m_rDetections.First ) );
    const auto Point = static_cast< std::size_t >( PointOf( pRow[EPlaceObject], pRow[EPlacePoint] ) );
    m_rRecording.Points[Frame * Columns + Point] = { static_cast< float >( pRow[EPlaceX] * MetresToMillimetres ),
                                                     static_cast< float >( pRow[EPlaceY] * MetresToMillimetres ),
                                                     static_cast< float >( pRow[EPlaceZ] * MetresToMillimetres ), 0 };
  }
  m_Places.Cells = {};
}

/// From the first and the last time of the frames, over the cameras' mean.
void VReader::TakeRate()
{
  struct VMean
  {
    double Sum = 0, Count = 0;
    void Add( double i_Value )
    {
      Sum += i_Value;
      Count += 1;
    }
  };
  double First = LargestIndex, Last = -LargestIndex;
  for ( std::size_t Row = 0; Row < m_Times.Rows(); ++Row )
  {
    First = std::min( First, m_Times.Row( Row )[ETimeFrame] );
    Last = std::max( Last, m_Times.Row( Row )[ETimeFrame] );
  }
  VMean Begin, End;
  for ( std::size_t Row = 0; Row < m_Times.Rows(); ++Row )
  {
    const double* const pRow = m_Times.Row( Row );
    if ( pRow[ETimeFrame] == First )
    {
      Begin.Add( pRow[ETimeSeconds] );
    }
    if ( pRow[ETimeFrame] == Last )
    {
      End.Add( pRow[ETimeSeconds] );
    }
  }
  m_rRecording.FrameCount = m_rDetections.Count;
  const double Rate = First < Last ? ( Last - First ) / ( End.Sum / End.Count - Begin.Sum / Begin.Count ) : 0;
  m_rDetections.bRateKnown = IsUsableRate( Rate );
  m_rRecording.RateHz = m_rDetections.bRateKnown ? Rate : m_rRecording.RateHz;
}

ZEK::IResult VReader::Read( const VTableFiles& i_rFiles )
{
  ZEK::IResult Result = ReadTable(
      i_rFiles.Images,
      { { "sync_index" }, { "cam_id" }, { "object_id", false }, { "keypoint_id" }, { "img_loc_x" }, { "img_loc_y" } },
      m_Images );
  Result = Result.IsOk() ? ReadTable( i_rFiles.Places,
                                      { { "sync_index" },
                                        { "object_id", false },
                                        { "keypoint_id" },
                                        { "x_coord" },
                                        { "y_coord" },
                                        { "z_coord" } },
                                      m_Places )
                         : Result;
  Result = Result.IsOk() ? ReadTable( i_rFiles.Times, { { "sync_index" }, { "frame_time" } }, m_Times ) : Result;
  if ( Result.IsError() )
  {
    return Result;
  }
  // Without the column all belong to one object.
  for ( const auto& [pTable, Column] : { std::pair{ &m_Images, EImageObject + 0 }, { &m_Places, EPlaceObject + 0 } } )
  {
    for ( std::size_t Row = 0; Row < pTable->Rows(); ++Row )
    {
      double& rObject = pTable->Cells[Row * pTable->Columns + Column];
      rObject = std::isnan( rObject ) ? 0 : rObject;
    }
  }
  KeepWhole( m_Images, i_rFiles.Images, { EImageFrame, EImageCamera, EImageObject, EImagePoint } );
  KeepWhole( m_Places, i_rFiles.Places, { EPlaceFrame, EPlaceObject, EPlacePoint } );
  KeepWhole( m_Times, i_rFiles.Times, { ETimeFrame } );
  Number();
  Result = Span();
  if ( Result.IsOk() )
  {
    TakeImages();
    TakePlaces();
    TakeRate();
    m_rDetections.Form = "CSV tables";
  }
  return Result;
}
} // namespace

bool IsReasonable( std::uint64_t i_Frames, std::uint64_t i_BytesPerFrame, std::uint64_t i_FileBytes )
{
  constexpr std::uint64_t PerByte = 64, Least = std::uint64_t{ 256 } << 20;
  return i_Frames < std::max( Least, i_FileBytes * PerByte ) / std::max< std::uint64_t >( i_BytesPerFrame, 1 );
}

ZEK::IResult ReadDetectionTables( const VFolderFiles& i_rFiles, VDetections& o_rDetections, VRecording& io_rRecording,
                                  std::string& o_rMessage, const VProgress& i_rProgress )
{
  const VTableFiles Files = FindTables( i_rFiles );
  if ( Files.Images.empty() && Files.Places.empty() )
  {
    return ZEK::IResult::Ok;
  }
  return VReader( o_rDetections, io_rRecording, o_rMessage, i_rProgress ).Read( Files );
}

} // namespace HostSources
