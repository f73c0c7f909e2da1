#include <HostSources/VFolderReader.h>

#include <HostSources/ReadRecording.h>

#include "CameraWorld.h"
#include "Detections.h"
#include "FolderVideos.h"
#include "ReaderSupport.h"
#include "UpAxis.h"

#include <algorithm>
#include <cmath>

namespace HostSources
{
namespace
{
std::string Rounded( double i_Pixels )
{
  const std::string Text = std::to_string( i_Pixels );
  return Text.substr( 0, Text.find( '.' ) + 3 );
}

/// Joins what lies in one folder.
class VJoin
{
public:
  VJoin( const std::filesystem::path& i_rPath, VRecording& io_rRecording, std::string& o_rMessage,
         const VProgress& i_rProgress, const VReadOptions& i_rOptions )
    : m_rPath( i_rPath )
    , m_rRecording( io_rRecording )
    , m_rMessage( o_rMessage )
    , m_rProgress( i_rProgress )
    , m_rOptions( i_rOptions )
  {
  }

  ZEK::IResult Run();

private:
  ZEK::IResult ReadDetections();
  ZEK::IResult ReadPoints();
  bool FitFrames();
  void NamePoints();
  void NameCameras();
  void AddOtherCameras();
  void GuessSensor( VRecordingCamera& io_rCamera );
  bool FindVideos();
  void TurnToWorld( const VAxisTurn* i_pWanted );
  ZEK::IResult Finish();
  void Note( std::string i_Text ) { m_rRecording.Notes.push_back( std::move( i_Text ) ); }

  const std::filesystem::path& m_rPath;
  VRecording& m_rRecording;
  std::string& m_rMessage;
  const VProgress& m_rProgress;
  const VReadOptions& m_rOptions;
  VFolderFiles m_Files;
  VDetections m_Detections;
  VCameraCalibrations m_Calibrations;
  std::vector< bool > m_Taken; ///< by camera of the calibration
  bool m_bPointFile = false;   ///< the points come from a file of their own
};

ZEK::IResult VJoin::ReadDetections()
{
  const auto First = [&]( double i_Fraction )
  {
    return !m_rProgress || m_rProgress( i_Fraction * 0.4 );
  };
  ZEK::IResult Result = ReadDetectionTables( m_Files, m_Detections, m_rRecording, m_rMessage, First );
  if ( Result.IsOk() && m_Detections.Form.empty() )
  {
    Result = ReadDetectionFolders( m_rPath, m_Files, m_Detections, m_rMessage, First );
  }
  return Result;
}

/// The first file of points by name, where no table gave any.
ZEK::IResult VJoin::ReadPoints()
{
  const auto IsPoints = []( const std::filesystem::path& i_rFile )
  {
    const std::string Suffix = SuffixOf( i_rFile );
    return Suffix == ".trc" || Suffix == ".c3d";
  };
  const auto It = std::find_if( m_Files.Files.begin(), m_Files.Files.end(), IsPoints );
  if ( !m_rRecording.Points.empty() || It == m_Files.Files.end() )
  {
    return ZEK::IResult::Ok;
  }
  VRecording Points;
  const auto Second = [&]( double i_Fraction )
  {
    return !m_rProgress || m_rProgress( 0.4 + i_Fraction * 0.1 );
  };
  std::string Message;
  const ZEK::IResult Result = ReadRecording( *It, Points, Message, Second );
  if ( Message.starts_with( It->string() ) )
  {
    // The folder is named once for all.
    Message.replace( 0, It->string().size(), It->filename().string() );
  }
  if ( !Message.empty() && !Result.IsError() )
  {
    m_Detections.Losses.push_back( Message );
  }
  if ( Result == ZEK::IResult( ZEK::IResult::Canceled ) || ( Result.IsError() && m_Detections.Form.empty() ) )
  {
    m_rMessage = Message;
    return Result;
  }
  if ( Result.IsError() )
  {
    m_Detections.Losses.push_back( Message );
    return ZEK::IResult::Ok;
  }
  m_bPointFile = true;
  const auto Count = std::count_if( It, m_Files.Files.end(), IsPoints );
  std::vector< std::string > Notes = std::move( m_rRecording.Notes );
  Points.Format = ERecordingFormat::Folder;
  Notes.push_back( "The 3D points are those of " + Points.Name + "." );
  Points.Name = m_rRecording.Name;
  m_rRecording = std::move( Points );
  m_rRecording.Notes.insert( m_rRecording.Notes.begin(), Notes.begin(), Notes.end() );
  if ( Count > 1 )
  {
    Note( "Other files of 3D points in the folder: " + std::to_string( Count - 1 ) + "." );
  }
  return ZEK::IResult::Ok;
}

/// Detections and points last as long as the longer of them.
bool VJoin::FitFrames()
{
  if ( !m_bPointFile )
  {
    m_rRecording.FirstFrame = m_Detections.First;
    m_rRecording.FrameCount = m_Detections.Count;
    return true;
  }
  const std::int64_t Count = std::max( m_rRecording.FrameCount, m_Detections.Count );
  if ( m_Detections.Count > 0 && m_Detections.Count != m_rRecording.FrameCount )
  {
    Note( "The cameras have " + std::to_string( m_Detections.Count ) + " frames, the 3D points " +
          std::to_string( m_rRecording.FrameCount ) + "; both begin together." );
  }
  const auto Size = static_cast< std::size_t >( Count );
  const std::size_t Columns = m_rRecording.PointCount();
  if ( Count > m_rRecording.FrameCount &&
       !IsReasonable( Size, Columns * sizeof( VRecordingPoint ), m_rRecording.Points.size() * 16 ) )
  {
    m_rMessage = "expected frames of the cameras beside those of the 3D points, found " + std::to_string( Size );
    return false;
  }
  m_rRecording.Points.resize( Size * Columns );
  if ( !m_rRecording.CameraMasks.empty() )
  {
    m_rRecording.CameraMasks.resize( Size * Columns );
  }
  if ( !m_rRecording.UnlabelledBegin.empty() )
  {
    m_rRecording.UnlabelledBegin.resize( Size + 1, m_rRecording.Unlabelled.size() );
  }
  m_rRecording.FrameCount = Count;
  return true;
}

/// Points of detections become columns: those of the file of that name, or columns of their own without a file.
void VJoin::NamePoints()
{
  std::vector< std::int32_t > Columns( m_Detections.Points.size(), -1 );
  if ( !m_bPointFile )
  {
    m_rRecording.Labels = m_rRecording.FileLabels = m_Detections.Points;
    m_rRecording.Points.resize( static_cast< std::size_t >( m_rRecording.FrameCount ) * m_Detections.Points.size() );
  }
  for ( std::size_t Point = 0; Point < Columns.size(); ++Point )
  {
    const auto& rLabels = m_rRecording.Labels;
    const auto It = std::find_if( rLabels.begin(), rLabels.end(),
                                  [&]( const std::string& i_rLabel )
                                  {
                                    return i_rLabel == m_Detections.Points[Point] ||
                                           i_rLabel.ends_with( ":" + m_Detections.Points[Point] );
                                  } );
    Columns[Point] = It == rLabels.end() ? -1 : static_cast< std::int32_t >( It - rLabels.begin() );
  }
  for ( VDetections::VCamera& rCamera : m_Detections.Cameras )
  {
    for ( VRecordingDetection& rSeen : rCamera.Seen.Detections )
    {
      rSeen.Point = Columns[static_cast< std::size_t >( rSeen.Point )];
    }
    if ( !rCamera.Seen.DetectionBegin.empty() )
    {
      rCamera.Seen.DetectionBegin.resize( static_cast< std::size_t >( m_rRecording.FrameCount ) + 1,
                                          rCamera.Seen.Detections.size() );
    }
  }
}

/// Without a calibration nothing tells of the sensor: it is as large as what was seen on it.
void VJoin::GuessSensor( VRecordingCamera& io_rCamera )
{
  constexpr float Largest = 65535;
  float Width = 1, Height = 1;
  for ( const VRecordingDetection& rSeen : io_rCamera.Detections )
  {
    Width = std::max( Width, std::min( rSeen.x + 1, Largest ) );
    Height = std::max( Height, std::min( rSeen.y + 1, Largest ) );
  }
  auto& rHardware = io_rCamera.Camera.Hardware;
  rHardware.SensorWidth = static_cast< std::uint32_t >( std::ceil( Width ) );
  rHardware.SensorHeight = static_cast< std::uint32_t >( std::ceil( Height ) );
}

void VJoin::NameCameras()
{
  auto& rKnown = m_Calibrations.Cameras;
  m_Taken.assign( rKnown.size(), false );
  for ( VDetections::VCamera& rCamera : m_Detections.Cameras )
  {
    const auto It = std::find_if( rKnown.begin(), rKnown.end(),
                                  [&]( const VCalibratedCamera& i_rKnown )
                                  {
                                    return rCamera.Name.empty()
                                               ? rCamera.Id >= 0 && i_rKnown.UserId == rCamera.Id
                                               : PlainName( i_rKnown.Name ) == PlainName( rCamera.Name );
                                  } );
    const auto Index = static_cast< std::size_t >( It - rKnown.begin() );
    VRecordingCamera& rSeen = m_rRecording.Cameras.emplace_back( std::move( rCamera.Seen ) );
    if ( It != rKnown.end() && !m_Taken[Index] )
    {
      m_Taken[Index] = true;
      rSeen.Camera = *It;
      continue;
    }
    rSeen.Camera.Name =
        rCamera.Name.empty() ? std::string( "cam_" ).append( std::to_string( rCamera.Id ) ) : rCamera.Name;
    rSeen.Camera.UserId = rCamera.Id;
    for ( int Number = 1; std::any_of( rKnown.begin(), rKnown.end(),
                                       [&]( const VCalibratedCamera& i_rKnown )
                                       {
                                         return i_rKnown.Name == rSeen.Camera.Name;
                                       } );
          ++Number )
    {
      rSeen.Camera.Name.append( " (" ).append( std::to_string( Number ) ).append( ")" );
    }
    rSeen.Camera.DisplayName = rSeen.Camera.Hardware.Name = rSeen.Camera.Name;
    GuessSensor( rSeen );
    if ( !rKnown.empty() )
    {
      Note( "The calibration does not know the camera \"" + rSeen.Camera.Name + "\"; it is uncalibrated." );
    }
  }
}

void VJoin::AddOtherCameras()
{
  for ( std::size_t Index = 0; Index < m_Calibrations.Cameras.size(); ++Index )
  {
    if ( !m_Taken[Index] )
    {
      m_rRecording.Cameras.emplace_back().Camera = m_Calibrations.Cameras[Index];
      Note( "The camera \"" + m_Calibrations.Cameras[Index].Name + "\" saw nothing." );
    }
  }
}

/// Once the frames are known: the rate is the videos' where nothing else tells of it.
bool VJoin::FindVideos()
{
  const auto Last = [&]( double i_Fraction )
  {
    return !m_rProgress || m_rProgress( 0.5 + std::min( i_Fraction, 1.0 ) * 0.5 );
  };
  if ( !VFolderVideos().Find( m_Files, m_rRecording, Last ) )
  {
    m_rMessage = "the reading was stopped";
    return false;
  }
  if ( !m_bPointFile )
  {
    const double FromVideo = m_Detections.bRateKnown ? 0 : VFolderVideos::RateHz( m_rRecording );
    TakeRate( m_Detections.bRateKnown ? m_rRecording.RateHz : FromVideo, m_rRecording );
    if ( FromVideo > 0 && m_rRecording.RateHz == FromVideo )
    {
      Note( "The frame rate is that of the videos." );
    }
  }
  VFolderVideos::Match( m_Detections.First, m_Detections.Count, m_rRecording );
  return true;
}

void VJoin::TurnToWorld( const VAxisTurn* i_pWanted )
{
  VAxisTurn Turn;
  double Distance = 0, Second = 0;
  if ( i_pWanted )
  {
    Turn = *i_pWanted;
    Note( "World axes: x, y and z are \"" + Turn.Text() + "\" of the 3D points, as was asked." );
  }
  else if ( FindAxisTurn( m_rRecording, Turn, Distance, Second ) )
  {
    Note( "World axes: x, y and z are \"" + Turn.Text() +
          "\" of the 3D points, for which their projections lie nearest to the detections (" + Rounded( Distance ) +
          " px on average" + ( std::isfinite( Second ) ? "; the second best turn: " + Rounded( Second ) + " px" : "" ) +
          ")." );
  }
  if ( !Turn.IsNone() )
  {
    TurnRecording( Turn, m_rRecording );
    ChooseUpAxisByData( m_rRecording, "the points were turned into the world of the cameras" );
  }
}

ZEK::IResult VJoin::Finish()
{
  VRecording& rR = m_rRecording;
  if ( rR.Form.empty() || m_bPointFile )
  {
    rR.Form = m_Detections.Form.empty() ? "3D points alone" : m_Detections.Form;
  }
  rR.Unit = rR.Unit.empty() ? "m" : rR.Unit;
  rR.GapCount = static_cast< std::uint64_t >( std::count_if( rR.Points.begin(), rR.Points.end(),
                                                             []( const VRecordingPoint& i_rPoint )
                                                             {
                                                               return !i_rPoint.IsValid();
                                                             } ) );
  for ( const std::string& rLoss : m_Detections.Losses )
  {
    m_rMessage.append( m_rMessage.empty() ? "" : "; " ).append( rLoss );
  }
  return m_Detections.Losses.empty() ? ZEK::IResult::Ok : ZEK::IResult::OkButPartial;
}

ZEK::IResult VJoin::Run()
{
  VAxisTurn Wanted;
  if ( !m_rOptions.WorldAxes.empty() && !VAxisTurn::Parse( m_rOptions.WorldAxes, Wanted ) )
  {
    m_rMessage = "expected world axes such as \"zxy\" or \"x-zy\", found \"" + m_rOptions.WorldAxes + "\"";
    return ZEK::IResult::InvalidArgument;
  }
  ZEK::IResult Result = ListFolder( m_rPath, m_Files, m_rMessage );
  Result = Result.IsOk() ? ReadDetections() : Result;
  Result = Result.IsOk() ? ReadPoints() : Result;
  if ( Result.IsError() )
  {
    return Result;
  }
  if ( m_Detections.Form.empty() && !m_bPointFile )
  {
    m_rMessage = m_Files.Files.empty() && m_Files.Folders.empty()
                     ? "expected what cameras saw, or 3D points, found a folder that is empty"
                     : "expected tables or JSON files of what cameras saw, or 3D points, found a folder without them";
    return ZEK::IResult::FileIOFailure;
  }
  std::vector< std::string > Problems;
  if ( FindCalibration( m_rPath, m_Calibrations, Problems ) )
  {
    Note( "The calibration is that of " + m_Calibrations.Name + "." );
    m_rRecording.Notes.insert( m_rRecording.Notes.end(), m_Calibrations.Notes.begin(), m_Calibrations.Notes.end() );
  }
  else
  {
    Note( "Neither the folder nor its parent holds a calibration; the cameras are uncalibrated." );
    m_rRecording.Notes.insert( m_rRecording.Notes.end(), Problems.begin(), Problems.end() );
  }
  if ( !FitFrames() )
  {
    return ZEK::IResult::InvalidFormat;
  }
  NamePoints();
  NameCameras();
  AddOtherCameras();
  AddToBounds( m_rRecording.Bounds, m_bPointFile ? std::span< const VRecordingPoint >() : m_rRecording.Points );
  if ( !m_bPointFile )
  {
    ChooseUpAxisByData( m_rRecording, "the tables do not tell" );
  }
  if ( !FindVideos() )
  {
    return ZEK::IResult::Canceled;
  }
  TurnToWorld( m_rOptions.WorldAxes.empty() ? nullptr : &Wanted );
  if ( m_Detections.bPersons )
  {
    ChoosePersons( m_rRecording );
  }
  MeasureDistances( m_rRecording );
  return Finish();
}
} // namespace

ZEK::IResult ReadFolder( const std::filesystem::path& i_rPath, VRecording& o_rRecording, std::string& o_rMessage,
                         const VProgress& i_rProgress, const VReadOptions& i_rOptions )
{
  return ReadGuarded( ERecordingFormat::Folder, i_rPath.string(), o_rRecording, o_rMessage,
                      [&]
                      {
                        o_rRecording.Name = ShownName( i_rPath );
                        return VJoin( i_rPath, o_rRecording, o_rMessage, i_rProgress, i_rOptions ).Run();
                      } );
}

} // namespace HostSources
