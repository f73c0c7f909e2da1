#include "RecordingInfoParts.h"

#include "RecordingSubjects.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdarg>
#include <cstdio>

namespace HostSources
{
namespace InfoParts
{

std::string Format( const char* i_pFormat, ... )
{
  va_list Arguments;
  va_start( Arguments, i_pFormat );
  std::array< char, 512 > Text{};
  const int Size = std::vsnprintf( Text.data(), Text.size(), i_pFormat, Arguments );
  va_end( Arguments );
  return { Text.data(), std::min( static_cast< std::size_t >( std::max( Size, 0 ) ), Text.size() - 1 ) };
}

std::string Shown( const std::string& i_rLabel )
{
  return i_rLabel.empty() ? "(unnamed)" : i_rLabel;
}

void Number( VWriter& io_rWriter, const char* i_pKey, double i_Value )
{
  io_rWriter.Key( i_pKey );
  std::isfinite( i_Value ) ? io_rWriter.Double( i_Value ) : io_rWriter.Null();
}
void Integer( VWriter& io_rWriter, const char* i_pKey, std::int64_t i_Value )
{
  io_rWriter.Key( i_pKey );
  io_rWriter.Int64( i_Value );
}
void Text( VWriter& io_rWriter, const char* i_pKey, const std::string& i_rValue )
{
  io_rWriter.Key( i_pKey );
  io_rWriter.String( i_rValue.c_str(), static_cast< rapidjson::SizeType >( i_rValue.size() ) );
}
void Texts( VWriter& io_rWriter, const char* i_pKey, const std::vector< std::string >& i_rValues )
{
  io_rWriter.Key( i_pKey );
  io_rWriter.StartArray();
  for ( const std::string& rValue : i_rValues )
  {
    io_rWriter.String( rValue.c_str(), static_cast< rapidjson::SizeType >( rValue.size() ) );
  }
  io_rWriter.EndArray();
}
} // namespace InfoParts

using namespace InfoParts;

namespace
{

VRecordingInfo::VPlate DescribePlate( const VForcePlate& i_rPlate, std::uint32_t i_PerFrame )
{
  VRecordingInfo::VPlate Plate;
  Plate.Name = i_rPlate.Name;
  Plate.Type = i_rPlate.Type;
  std::copy( std::begin( i_rPlate.Corners ), std::end( i_rPlate.Corners ), Plate.Corners );
  Plate.Origin = i_rPlate.Origin;
  Plate.SampleCount = i_rPlate.Wrench.size();
  Plate.PeakCentre = { std::nan( "" ), std::nan( "" ), std::nan( "" ) };
  for ( std::size_t Index = 0; Index < i_rPlate.Wrench.size(); ++Index )
  {
    const double Force = std::abs( i_rPlate.VerticalForce( Index ) );
    if ( Force > Plate.PeakForce )
    {
      const auto& rW = i_rPlate.Wrench[Index];
      Plate.PeakForce = Force;
      Plate.PeakSample = Index;
      Plate.PeakFrame = static_cast< std::int64_t >( Index / std::max( i_PerFrame, 1u ) );
      Plate.PeakCentre = { rW[6], rW[7], rW[8] };
    }
  }
  return Plate;
}

void CountGaps( const VRecording& i_rRecording, VRecordingInfo& io_rInfo )
{
  std::vector< std::uint64_t > Missing( i_rRecording.PointCount() );
  std::size_t Column = 0;
  for ( const VRecordingPoint& rPoint : i_rRecording.Points )
  {
    Missing[Column] += rPoint.IsValid() ? 0u : 1u;
    Column = Column + 1 == Missing.size() ? 0 : Column + 1;
  }
  for ( std::size_t Index = 0; Index < Missing.size(); ++Index )
  {
    if ( Missing[Index] > 0 )
    {
      io_rInfo.Gaps.push_back( { i_rRecording.Labels[Index], Missing[Index] } );
    }
  }
}

std::string Position( double i_X, double i_Y, double i_Z )
{
  return std::isfinite( i_X ) ? Format( "(%.2f, %.2f, %.2f)", i_X, i_Y, i_Z ) : std::string( "none" );
}

template < typename T >
void Vector( VWriter& io_rWriter, const T& i_rX, const T& i_rY, const T& i_rZ )
{
  io_rWriter.StartArray();
  for ( const double Value :
        { static_cast< double >( i_rX ), static_cast< double >( i_rY ), static_cast< double >( i_rZ ) } )
  {
    std::isfinite( Value ) ? io_rWriter.Double( Value ) : io_rWriter.Null();
  }
  io_rWriter.EndArray();
}

void WritePlates( VWriter& io_rWriter, const VRecordingInfo& i_rInfo )
{
  io_rWriter.Key( "forcePlates" );
  io_rWriter.StartArray();
  for ( const VRecordingInfo::VPlate& rPlate : i_rInfo.ForcePlates )
  {
    io_rWriter.StartObject();
    Text( io_rWriter, "name", rPlate.Name );
    Integer( io_rWriter, "type", rPlate.Type );
    io_rWriter.Key( "corners" );
    io_rWriter.StartArray();
    for ( const auto& rCorner : rPlate.Corners )
    {
      Vector( io_rWriter, rCorner.x, rCorner.y, rCorner.z );
    }
    io_rWriter.EndArray();
    io_rWriter.Key( "origin" );
    Vector( io_rWriter, rPlate.Origin.x, rPlate.Origin.y, rPlate.Origin.z );
    Integer( io_rWriter, "samples", static_cast< std::int64_t >( rPlate.SampleCount ) );
    Number( io_rWriter, "peakForce", rPlate.PeakForce );
    Integer( io_rWriter, "peakSample", static_cast< std::int64_t >( rPlate.PeakSample ) );
    Integer( io_rWriter, "peakFrameIndex", rPlate.PeakFrame );
    io_rWriter.Key( "peakCentreOfPressure" );
    Vector( io_rWriter, rPlate.PeakCentre.x, rPlate.PeakCentre.y, rPlate.PeakCentre.z );
    io_rWriter.EndObject();
  }
  io_rWriter.EndArray();
}

VRecordingInfo::VCamera DescribeCamera( const VRecordingCamera& i_rCamera, std::int64_t i_Frames )
{
  VRecordingInfo::VCamera Camera;
  Camera.Name = i_rCamera.Camera.Name;
  Camera.Width = i_rCamera.Camera.Hardware.SensorWidth;
  Camera.Height = i_rCamera.Camera.Hardware.SensorHeight;
  Camera.bCalibrated = i_rCamera.Camera.Calibration.has_value();
  Camera.DetectionCount = i_rCamera.Detections.size();
  for ( const VRecordingDetection& rSeen : i_rCamera.Detections )
  {
    Camera.KnownCount += rSeen.Point >= 0;
  }
  for ( std::int64_t Frame = 0; Frame < i_Frames; ++Frame )
  {
    Camera.FramesSeen += !i_rCamera.Frame( Frame ).empty();
  }
  Camera.MeasuredCount = i_rCamera.MeasuredCount;
  Camera.MeanDistance = i_rCamera.MeanDistance;
  Camera.WorstDistance = i_rCamera.WorstDistance;
  if ( const auto& rpClip = i_rCamera.Video.pClip )
  {
    Camera.Video = { rpClip->Name,   rpClip->Codec,        rpClip->PixelFormat, rpClip->Width,
                     rpClip->Height, rpClip->FrameCount(), rpClip->RateHz,      i_rCamera.Video.bByNumber };
  }
  return Camera;
}

std::string CameraText( const VRecordingInfo::VCamera& i_rCamera )
{
  std::string Line = Format( "  %s, %u x %u, %s, %llu detections in %llu frames, %llu of them of known points",
                             i_rCamera.Name.substr( 0, 200 ).c_str(), i_rCamera.Width, i_rCamera.Height,
                             i_rCamera.bCalibrated ? "calibrated" : "uncalibrated",
                             static_cast< unsigned long long >( i_rCamera.DetectionCount ),
                             static_cast< unsigned long long >( i_rCamera.FramesSeen ),
                             static_cast< unsigned long long >( i_rCamera.KnownCount ) );
  if ( i_rCamera.MeasuredCount > 0 )
  {
    Line += Format( ", %.3f px from the projected points (worst %.1f px)", i_rCamera.MeanDistance,
                    i_rCamera.WorstDistance );
  }
  Line += "\n";
  if ( i_rCamera.Video )
  {
    const VRecordingInfo::VVideo& rVideo = *i_rCamera.Video;
    Line += "    video " + rVideo.File +
            Format( ": %s, %u x %u, %s, %lld frames at %g Hz, %s\n", rVideo.Codec.c_str(), rVideo.Width, rVideo.Height,
                    rVideo.PixelFormat.c_str(), static_cast< long long >( rVideo.FrameCount ), rVideo.RateHz,
                    rVideo.bByNumber ? "frame by frame" : "the nearest in time" );
  }
  return Line;
}

void WriteVideo( VWriter& io_rWriter, const std::optional< VRecordingInfo::VVideo >& i_rVideo )
{
  io_rWriter.Key( "video" );
  if ( !i_rVideo )
  {
    io_rWriter.Null();
    return;
  }
  io_rWriter.StartObject();
  Text( io_rWriter, "file", i_rVideo->File );
  Text( io_rWriter, "codec", i_rVideo->Codec );
  Text( io_rWriter, "pixelFormat", i_rVideo->PixelFormat );
  Integer( io_rWriter, "width", i_rVideo->Width );
  Integer( io_rWriter, "height", i_rVideo->Height );
  Integer( io_rWriter, "frames", i_rVideo->FrameCount );
  Number( io_rWriter, "rateHz", i_rVideo->RateHz );
  io_rWriter.Key( "byNumber" );
  io_rWriter.Bool( i_rVideo->bByNumber );
  io_rWriter.EndObject();
}

void WriteCameras( VWriter& io_rWriter, const VRecordingInfo& i_rInfo )
{
  io_rWriter.Key( "cameras" );
  io_rWriter.StartArray();
  for ( const VRecordingInfo::VCamera& rCamera : i_rInfo.Cameras )
  {
    io_rWriter.StartObject();
    Text( io_rWriter, "name", rCamera.Name );
    Integer( io_rWriter, "width", rCamera.Width );
    Integer( io_rWriter, "height", rCamera.Height );
    io_rWriter.Key( "calibrated" );
    io_rWriter.Bool( rCamera.bCalibrated );
    Integer( io_rWriter, "detections", static_cast< std::int64_t >( rCamera.DetectionCount ) );
    Integer( io_rWriter, "detectionsOfPoints", static_cast< std::int64_t >( rCamera.KnownCount ) );
    Integer( io_rWriter, "framesSeen", static_cast< std::int64_t >( rCamera.FramesSeen ) );
    Integer( io_rWriter, "measured", static_cast< std::int64_t >( rCamera.MeasuredCount ) );
    Number( io_rWriter, "meanDistance", rCamera.MeanDistance );
    Number( io_rWriter, "worstDistance", rCamera.WorstDistance );
    WriteVideo( io_rWriter, rCamera.Video );
    io_rWriter.EndObject();
  }
  io_rWriter.EndArray();
}

void WriteAnalogAndEvents( VWriter& io_rWriter, const VRecordingInfo& i_rInfo )
{
  Number( io_rWriter, "analogRateHz", i_rInfo.AnalogRateHz );
  io_rWriter.Key( "analogChannels" );
  io_rWriter.StartArray();
  for ( const VAnalogChannel& rChannel : i_rInfo.AnalogChannels )
  {
    io_rWriter.StartObject();
    Text( io_rWriter, "name", rChannel.Name );
    Text( io_rWriter, "description", rChannel.Description );
    Text( io_rWriter, "unit", rChannel.Unit );
    io_rWriter.EndObject();
  }
  io_rWriter.EndArray();
  WritePlates( io_rWriter, i_rInfo );
  io_rWriter.Key( "events" );
  io_rWriter.StartArray();
  for ( const VRecordingEvent& rEvent : i_rInfo.Events )
  {
    io_rWriter.StartObject();
    Text( io_rWriter, "label", rEvent.Label );
    Text( io_rWriter, "context", rEvent.Context );
    Number( io_rWriter, "fileSeconds", rEvent.FileSeconds );
    Number( io_rWriter, "seconds", rEvent.Seconds );
    io_rWriter.EndObject();
  }
  io_rWriter.EndArray();
}

void WritePoints( VWriter& io_rWriter, const VRecordingInfo& i_rInfo )
{
  Integer( io_rWriter, "points", static_cast< std::int64_t >( i_rInfo.PointCount ) );
  Texts( io_rWriter, "labels", i_rInfo.Labels );
  Integer( io_rWriter, "samples", static_cast< std::int64_t >( i_rInfo.SampleCount ) );
  Integer( io_rWriter, "missingSamples", static_cast< std::int64_t >( i_rInfo.GapCount ) );
  Integer( io_rWriter, "unlabelledSamples", static_cast< std::int64_t >( i_rInfo.UnlabelledCount ) );
  io_rWriter.Key( "gaps" );
  io_rWriter.StartArray();
  for ( const VRecordingInfo::VGap& rGap : i_rInfo.Gaps )
  {
    io_rWriter.StartObject();
    Text( io_rWriter, "label", rGap.Label );
    Integer( io_rWriter, "missing", static_cast< std::int64_t >( rGap.Missing ) );
    io_rWriter.EndObject();
  }
  io_rWriter.EndArray();
  io_rWriter.Key( "bounds" );
  if ( i_rInfo.Bounds.IsEmpty() )
  {
    io_rWriter.Null();
    return;
  }
  io_rWriter.StartObject();
  io_rWriter.Key( "min" );
  Vector( io_rWriter, i_rInfo.Bounds.Min[0], i_rInfo.Bounds.Min[1], i_rInfo.Bounds.Min[2] );
  io_rWriter.Key( "max" );
  Vector( io_rWriter, i_rInfo.Bounds.Max[0], i_rInfo.Bounds.Max[1], i_rInfo.Bounds.Max[2] );
  io_rWriter.EndObject();
}

std::string PlateText( const VRecordingInfo::VPlate& i_rPlate )
{
  std::string Lines = Format( "  %s, type %u, corners", i_rPlate.Name.c_str(), i_rPlate.Type );
  for ( const auto& rCorner : i_rPlate.Corners )
  {
    Lines += ' ' + Position( rCorner.x, rCorner.y, rCorner.z );
  }
  Lines += " mm\n";
  if ( i_rPlate.SampleCount > 0 )
  {
    Lines += Format( "    greatest |Fz| %.2f N at sample %llu (frame index %lld), centre of pressure ",
                     i_rPlate.PeakForce, static_cast< unsigned long long >( i_rPlate.PeakSample ),
                     static_cast< long long >( i_rPlate.PeakFrame ) ) +
             Position( i_rPlate.PeakCentre.x, i_rPlate.PeakCentre.y, i_rPlate.PeakCentre.z ) + " mm\n";
  }
  return Lines;
}

std::string PointsText( const VRecordingInfo& i_rInfo )
{
  std::string Lines = Format(
      "Points:    %llu columns, %llu of %llu samples missing, %llu points outside the columns\n",
      static_cast< unsigned long long >( i_rInfo.PointCount ), static_cast< unsigned long long >( i_rInfo.GapCount ),
      static_cast< unsigned long long >( i_rInfo.SampleCount ),
      static_cast< unsigned long long >( i_rInfo.UnlabelledCount ) );
  for ( std::size_t Index = 0; Index < i_rInfo.Labels.size(); ++Index )
  {
    Lines += ( Index == 0 ? "Labels:    " : ", " ) + Shown( i_rInfo.Labels[Index] );
  }
  Lines += i_rInfo.Labels.empty() ? "" : "\n";
  for ( const VRecordingInfo::VGap& rGap : i_rInfo.Gaps )
  {
    Lines += "  missing  " + Shown( rGap.Label ) + ": " + std::to_string( rGap.Missing ) + " frames\n";
  }
  const VRecordingBounds& rB = i_rInfo.Bounds;
  return Lines + "Bounds:    " +
         ( rB.IsEmpty() ? std::string( "no points\n" )
                        : Format( "x %.1f to %.1f, y %.1f to %.1f, z %.1f to %.1f mm\n",
                                  static_cast< double >( rB.Min[0] ), static_cast< double >( rB.Max[0] ),
                                  static_cast< double >( rB.Min[1] ), static_cast< double >( rB.Max[1] ),
                                  static_cast< double >( rB.Min[2] ), static_cast< double >( rB.Max[2] ) ) );
}
} // namespace

VRecordingInfo DescribeRecording( const VRecording& i_rRecording )
{
  VRecordingInfo Info;
  Info.Name = i_rRecording.Name;
  Info.Format = i_rRecording.Format == ERecordingFormat::C3d      ? "C3D"
                : i_rRecording.Format == ERecordingFormat::Trc    ? "TRC"
                : i_rRecording.Format == ERecordingFormat::Folder ? "folder"
                : i_rRecording.Format == ERecordingFormat::Bvh    ? "BVH"
                : i_rRecording.Format == ERecordingFormat::Motion ? "MOT"
                                                                  : "none";
  Info.Form = i_rRecording.Form;
  Info.Unit = i_rRecording.Unit;
  Info.PointCount = i_rRecording.PointCount();
  Info.Labels = i_rRecording.Labels;
  Info.FrameCount = i_rRecording.FrameCount;
  Info.FirstFrame = i_rRecording.FirstFrame;
  Info.LastFrame = i_rRecording.FirstFrame + i_rRecording.FrameCount - 1;
  Info.RateHz = i_rRecording.RateHz;
  Info.DurationSeconds = i_rRecording.DurationSeconds();
  Info.SampleCount = i_rRecording.Points.size();
  Info.GapCount = i_rRecording.GapCount;
  Info.UnlabelledCount = i_rRecording.Unlabelled.size();
  Info.Bounds = i_rRecording.Bounds;
  Info.AnalogRateHz = i_rRecording.AnalogRateHz();
  Info.AnalogChannels = i_rRecording.AnalogChannels;
  Info.Events = i_rRecording.Events;
  Info.UpAxis = i_rRecording.UpAxis;
  Info.UpAxisReason = i_rRecording.UpAxisReason;
  Info.Notes = i_rRecording.Notes;
  CountGaps( i_rRecording, Info );
  for ( const VForcePlate& rPlate : i_rRecording.ForcePlates )
  {
    Info.ForcePlates.push_back( DescribePlate( rPlate, i_rRecording.AnalogPerFrame ) );
  }
  const VRecordingSubjects Subjects = SubjectsOf( i_rRecording );
  Info.NobodysPointCount = Info.PointCount;
  for ( const CoreMoxelTypes::VSubject& rSubject : Subjects.Subjects )
  {
    Info.Subjects.push_back( DescribeSubject( rSubject ) );
    Info.NobodysPointCount -= rSubject.Markers.size();
  }
  for ( const VRecordingSkeleton& rSkeleton : i_rRecording.Skeletons )
  {
    Info.Skeletons.push_back( DescribeSkeleton( rSkeleton ) );
  }
  for ( const VRecordingCamera& rCamera : i_rRecording.Cameras )
  {
    Info.Cameras.push_back( DescribeCamera( rCamera, i_rRecording.FrameCount ) );
  }
  return Info;
}

std::string VRecordingInfo::Text() const
{
  std::string Lines = "File:      " + Name + "\nFormat:    " + Format + ( Form.empty() ? "" : " (" + Form + ")" ) +
                      ", lengths in " + Unit + "\n";
  Lines += HostSources::Format( "Frames:    %lld, numbered %lld to %lld, at %g Hz, %.3f s\n",
                                static_cast< long long >( FrameCount ), static_cast< long long >( FirstFrame ),
                                static_cast< long long >( LastFrame ), RateHz, DurationSeconds );
  Lines += PointsText( *this );
  Lines += "Up axis:   " + UpAxisReason + "\n";
  if ( !AnalogChannels.empty() )
  {
    Lines += HostSources::Format( "Analog:    %zu channels at %g Hz:", AnalogChannels.size(), AnalogRateHz );
    for ( const VAnalogChannel& rChannel : AnalogChannels )
    {
      Lines += ' ' + Shown( rChannel.Name ) + ( rChannel.Unit.empty() ? "" : " [" + rChannel.Unit + "]" );
    }
    Lines += '\n';
  }
  for ( const VPlate& rPlate : ForcePlates )
  {
    Lines += ( &rPlate == &ForcePlates.front() ? "Plates:\n" : "" ) + PlateText( rPlate );
  }
  for ( const VSubject& rSubject : Subjects )
  {
    Lines += SubjectText( rSubject );
  }
  if ( NobodysPointCount > 0 )
  {
    Lines += HostSources::Format( "  %llu columns have no name, or one that a program gave, and belong to no subject\n",
                                  static_cast< unsigned long long >( NobodysPointCount ) );
  }
  for ( const VSkeleton& rSkeleton : Skeletons )
  {
    Lines += SkeletonText( rSkeleton );
  }
  for ( const VCamera& rCamera : Cameras )
  {
    Lines += ( &rCamera == &Cameras.front() ? "Cameras:\n" : "" ) + CameraText( rCamera );
  }
  for ( const VRecordingEvent& rEvent : Events )
  {
    Lines += HostSources::Format( "Event:     %.3f s (%.3f s in the file) ", rEvent.Seconds, rEvent.FileSeconds ) +
             rEvent.Label + ( rEvent.Context.empty() ? "" : ", " + rEvent.Context ) + "\n";
  }
  for ( const std::string& rNote : Notes )
  {
    Lines += "Note:      " + rNote + "\n";
  }
  return Lines;
}

std::string VRecordingInfo::Json() const
{
  rapidjson::StringBuffer Buffer;
  VWriter Writer( Buffer );
  Writer.SetIndent( ' ', 2 );
  Writer.StartObject();
  HostSources::Text( Writer, "file", Name );
  HostSources::Text( Writer, "format", Format );
  HostSources::Text( Writer, "form", Form );
  HostSources::Text( Writer, "unit", Unit );
  Integer( Writer, "frames", FrameCount );
  Integer( Writer, "firstFrame", FirstFrame );
  Integer( Writer, "lastFrame", LastFrame );
  Number( Writer, "rateHz", RateHz );
  Number( Writer, "durationSeconds", DurationSeconds );
  WritePoints( Writer, *this );
  HostSources::Text( Writer, "upAxis", UpAxis == EUpAxis::Y ? "y" : "z" );
  HostSources::Text( Writer, "upAxisReason", UpAxisReason );
  WriteSubjects( Writer, *this );
  Integer( Writer, "pointsOfNoSubject", static_cast< std::int64_t >( NobodysPointCount ) );
  WriteSkeletons( Writer, *this );
  WriteCameras( Writer, *this );
  WriteAnalogAndEvents( Writer, *this );
  Texts( Writer, "notes", Notes );
  Writer.EndObject();
  return std::string( Buffer.GetString(), Buffer.GetSize() ) + '\n';
}

} // namespace HostSources
