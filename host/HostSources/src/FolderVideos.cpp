#include "FolderVideos.h"

#include "ReaderSupport.h"

#include <algorithm>
#include <cctype>
#include <cmath>
#include <cstdlib>

namespace HostSources
{
namespace
{
/// A recording and the video that it was made of may differ by that many frames at their ends.
constexpr std::int64_t FewFrames = 2;
/// Part of the rate up to which two rates are the same.
constexpr double SameRate = 1e-3;

/// The number at the end of a plain name without its leading zeros, and what stands before it.
struct VNumbered
{
  std::string Word, Number;

  explicit VNumbered( const std::string& i_rPlain )
  {
    const std::size_t Last = i_rPlain.find_last_not_of( "0123456789" );
    const std::size_t Begin = Last == std::string::npos ? 0 : Last + 1;
    const std::size_t First = i_rPlain.find_first_not_of( '0', Begin );
    Word = i_rPlain.substr( 0, Begin );
    Number = Begin == i_rPlain.size() ? "" : First == std::string::npos ? "0" : i_rPlain.substr( First );
  }
};

std::string Rounded( double i_Value )
{
  std::string Text = std::to_string( i_Value );
  Text.erase( Text.find_last_not_of( '0' ) + 1 );
  return Text.ends_with( '.' ) ? Text.substr( 0, Text.size() - 1 ) : Text;
}

std::string SizeText( std::uint32_t i_Width, std::uint32_t i_Height )
{
  return std::to_string( i_Width ) + " x " + std::to_string( i_Height );
}

/// How surely a name is that of a camera: 0 not at all.
int Likeness( const std::string& i_rPlain, const VCalibratedCamera& i_rCamera )
{
  constexpr int Same = 4, Number = 3, End = 2, Word = 1;
  const std::string Camera = PlainName( i_rCamera.Name );
  const VNumbered File( i_rPlain ), Wanted( Camera );
  if ( i_rPlain.empty() || Camera.empty() )
  {
    return 0;
  }
  if ( i_rPlain == Camera )
  {
    return Same;
  }
  const std::string UserId = i_rCamera.UserId >= 0 ? std::to_string( i_rCamera.UserId ) : Wanted.Number;
  const std::string& rNumber = Wanted.Number.empty() ? UserId : Wanted.Number;
  if ( File.Number.empty() || File.Number != rNumber )
  {
    return i_rPlain.find( Camera ) != std::string::npos && Wanted.Number.empty() ? Word : 0;
  }
  if ( File.Word == Wanted.Word )
  {
    return Number;
  }
  if ( !Wanted.Word.empty() && File.Word.ends_with( Wanted.Word ) )
  {
    return End;
  }
  for ( const char* const pUsual : { "", "cam", "camera", "port", "video", "view" } )
  {
    if ( File.Word == pUsual )
    {
      return Word;
    }
  }
  return 0;
}
} // namespace

std::string PlainName( const std::string& i_rName )
{
  std::string Text;
  for ( const char Character : i_rName )
  {
    if ( std::isalnum( static_cast< unsigned char >( Character ) ) )
    {
      Text += static_cast< char >( std::tolower( static_cast< unsigned char >( Character ) ) );
    }
  }
  return Text;
}

void VFolderVideos::List( const VFolderFiles& i_rFiles )
{
  m_Files.clear();
  const auto Add = [&]( const std::vector< std::filesystem::path >& i_rPaths, const std::string& i_rFolder )
  {
    for ( const auto& rPath : i_rPaths )
    {
      if ( HostVideo::IsVideoSuffix( SuffixOf( rPath ) ) )
      {
        m_Files.push_back( { rPath, PlainName( rPath.stem().string() ), PlainName( i_rFolder ) } );
      }
    }
  };
  Add( i_rFiles.Files, {} );
  for ( const auto& rFolder : i_rFiles.Folders )
  {
    VFolderFiles Inner;
    std::string Message;
    if ( ListFolder( rFolder, Inner, Message ).IsOk() )
    {
      Add( Inner.Files, rFolder.filename().string() );
    }
  }
}

/// A folder that is named like the camera says less than the file's own name.
VFolderVideos::VFile* VFolderVideos::BestFor( const VCalibratedCamera& i_rCamera )
{
  VFile* pBest = nullptr;
  int Best = 0;
  for ( VFile& rFile : m_Files )
  {
    const int Alike = 2 * Likeness( rFile.Stem, i_rCamera ), Inside = Likeness( rFile.Folder, i_rCamera );
    const int This = std::max( Alike, Inside );
    if ( !rFile.bTaken && This > Best )
    {
      pBest = &rFile;
      Best = This;
    }
  }
  return pBest;
}

/// False when it was stopped.
bool VFolderVideos::Scan( const VFile& i_rFile, VRecordingCamera& io_rCamera, const VProgress& i_rProgress )
{
  const auto pClip = std::make_shared< HostVideo::VVideoClip >();
  std::string Message;
  const ZEK::IResult Scanned = HostVideo::ScanVideo( i_rFile.Path, *pClip, Message, i_rProgress );
  if ( Scanned == ZEK::IResult( ZEK::IResult::Canceled ) )
  {
    return false;
  }
  if ( Scanned.IsError() )
  {
    Note( "The video of the camera \"" + io_rCamera.Camera.Name + "\" cannot be shown: " + ToUtf8( Message ) + "." );
    return true;
  }
  pClip->Name = ToUtf8( pClip->Name );
  for ( const std::string& rNote : pClip->Notes )
  {
    Note( "The video " + pClip->Name + ": " + rNote );
  }
  auto& rHardware = io_rCamera.Camera.Hardware;
  rHardware.Video = true;
  if ( !io_rCamera.Camera.Calibration )
  {
    // Nothing else tells of the sensor, and what was seen lies within.
    rHardware.SensorWidth = std::max( rHardware.SensorWidth, pClip->Width );
    rHardware.SensorHeight = std::max( rHardware.SensorHeight, pClip->Height );
  }
  if ( rHardware.SensorWidth != pClip->Width || rHardware.SensorHeight != pClip->Height )
  {
    Note( "The video " + pClip->Name + " is " + SizeText( pClip->Width, pClip->Height ) + ", the sensor of \"" +
          io_rCamera.Camera.Name + "\" " + SizeText( rHardware.SensorWidth, rHardware.SensorHeight ) +
          "; it is stretched to the whole sensor." );
  }
  io_rCamera.Video.pClip = pClip;
  return true;
}

/// Of videos without a camera, and of cameras without a video beside others that have one.
void VFolderVideos::TellRest()
{
  std::string Without;
  for ( const VRecordingCamera& rCamera : m_pRecording->Cameras )
  {
    if ( !rCamera.Video.pClip )
    {
      Without.append( Without.empty() ? "\"" : ", \"" ).append( rCamera.Camera.Name ).append( "\"" );
    }
  }
  if ( !Without.empty() )
  {
    Note( "Cameras without a video: " + Without + "." );
  }
  for ( const VFile& rFile : m_Files )
  {
    if ( !rFile.bTaken )
    {
      Note( "The video " + ToUtf8( rFile.Path.filename().string() ) +
            " is not shown: by its name it is of no camera, or of one that has another." );
    }
  }
}

bool VFolderVideos::Find( const VFolderFiles& i_rFiles, VRecording& io_rRecording, const VProgress& i_rProgress )
{
  m_pRecording = &io_rRecording;
  List( i_rFiles );
  if ( m_Files.empty() )
  {
    return true;
  }
  const auto Count = static_cast< double >( std::max< std::size_t >( io_rRecording.Cameras.size(), 1 ) );
  double Done = 0;
  for ( VRecordingCamera& rCamera : io_rRecording.Cameras )
  {
    if ( VFile* const pFile = BestFor( rCamera.Camera ) )
    {
      pFile->bTaken = true;
      const auto Part = [&]( double i_Fraction )
      {
        return !i_rProgress || i_rProgress( ( Done + i_Fraction ) / Count );
      };
      if ( !Scan( *pFile, rCamera, Part ) )
      {
        return false;
      }
    }
    ++Done;
  }
  TellRest();
  return true;
}

double VFolderVideos::RateHz( const VRecording& i_rRecording )
{
  for ( const VRecordingCamera& rCamera : i_rRecording.Cameras )
  {
    if ( rCamera.Video.pClip && rCamera.Video.pClip->RateHz > 0 )
    {
      return rCamera.Video.pClip->RateHz;
    }
  }
  return 0;
}

void VFolderVideos::Match( std::int64_t i_First, std::int64_t i_Count, VRecording& io_rRecording )
{
  const std::int64_t Count = i_Count > 0 ? i_Count : io_rRecording.FrameCount;
  for ( VRecordingCamera& rCamera : io_rRecording.Cameras )
  {
    VRecordingVideo& rVideo = rCamera.Video;
    if ( !rVideo.pClip )
    {
      continue;
    }
    const HostVideo::VVideoClip& rClip = *rVideo.pClip;
    const std::int64_t More = rClip.FrameCount() - Count;
    const bool bSameRate = std::abs( rClip.RateHz - io_rRecording.RateHz ) <= SameRate * io_rRecording.RateHz;
    const bool bAlike = std::abs( More ) <= FewFrames;
    // Numbers of detections that begin later are those of the video's frames, if it has as many.
    rVideo.FirstFrame = !bAlike && i_First > 0 && rClip.FrameCount() >= i_First + Count - FewFrames ? i_First : 0;
    rVideo.bByNumber = bAlike || rVideo.FirstFrame > 0 || ( bSameRate && rClip.bEven );
    if ( !bSameRate && rClip.RateHz > 0 )
    {
      io_rRecording.Notes.push_back( "The video " + rClip.Name + " has " + Rounded( rClip.RateHz ) +
                                     " frames a second, the recording " + Rounded( io_rRecording.RateHz ) +
                                     ( rVideo.bByNumber ? "; they are shown frame by frame, as there are as many."
                                                        : "; the frame nearest in time is shown." ) );
    }
    if ( rVideo.bByNumber && rVideo.FirstFrame == 0 && More != 0 )
    {
      const bool bEndsEarly = rClip.FrameCount() < io_rRecording.FrameCount;
      io_rRecording.Notes.push_back( "The video " + rClip.Name + " has " + std::to_string( rClip.FrameCount() ) +
                                     " frames, the camera's detections " + std::to_string( Count ) +
                                     ( bEndsEarly ? "; its last one stays until the end." : "." ) );
    }
  }
}

} // namespace HostSources
