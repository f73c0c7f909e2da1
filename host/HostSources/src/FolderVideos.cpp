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
  return std::to_string( i_Width ).append( " x " ).append( std::to_string( i_Height ) );
}

/// Whether a word of a name ends before a place in it: at a sign, at a capital letter and between letters and digits.
bool IsBorder( const std::string& i_rName, std::size_t i_At )
{
  if ( i_At == 0 || i_At >= i_rName.size() )
  {
    return true;
  }
  const auto Before = static_cast< unsigned char >( i_rName[i_At - 1] ),
             After = static_cast< unsigned char >( i_rName[i_At] );
  return !std::isalnum( Before ) || !std::isalnum( After ) || ( std::islower( Before ) && std::isupper( After ) ) ||
         std::isdigit( Before ) != std::isdigit( After );
}

/// Whether the last words of a name, or where it is wanted the first ones, are these letters and digits.
bool HasWords( const std::string& i_rName, const std::string& i_rPlain, bool i_bFirstToo )
{
  for ( std::size_t At = 0; At <= i_rName.size(); ++At )
  {
    if ( IsBorder( i_rName, At ) && ( PlainName( i_rName.substr( At ) ) == i_rPlain ||
                                      ( i_bFirstToo && PlainName( i_rName.substr( 0, At ) ) == i_rPlain ) ) )
    {
      return true;
    }
  }
  return false;
}

/// How surely a name is that of a camera: 0 not at all.
int Likeness( const std::string& i_rName, const VCalibratedCamera& i_rCamera )
{
  constexpr int Same = 4, Number = 3, End = 2, Word = 1;
  const std::string Plain = PlainName( i_rName );
  const std::string Camera = PlainName( i_rCamera.Name );
  const VNumbered File( Plain ), Wanted( Camera );
  if ( Plain.empty() || Camera.empty() )
  {
    return 0;
  }
  if ( Plain == Camera )
  {
    return Same;
  }
  const std::string UserId = i_rCamera.UserId >= 0 ? std::to_string( i_rCamera.UserId ) : Wanted.Number;
  const std::string& rNumber = Wanted.Number.empty() ? UserId : Wanted.Number;
  if ( File.Number.empty() || File.Number != rNumber )
  {
    return Wanted.Number.empty() && HasWords( i_rName, Camera, true ) ? Word : 0;
  }
  if ( File.Word == Wanted.Word )
  {
    return Number;
  }
  const std::string Unnumbered = i_rName.substr( 0, i_rName.find_last_not_of( "0123456789" ) + 1 );
  if ( !Wanted.Word.empty() && HasWords( Unnumbered, Wanted.Word, false ) )
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
        m_Files.push_back( { rPath, rPath.stem().string(), i_rFolder } );
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

/// The surest pairs first, so that no camera takes a file that is more surely another's. A folder that is named like
/// the camera says less than the file's own name. The file of each camera, or null.
std::vector< VFolderVideos::VFile* > VFolderVideos::Assign()
{
  struct VPair
  {
    int Alike = 0;
    std::size_t Camera = 0;
    VFile* pFile = nullptr;
  };
  const auto& rCameras = m_pRecording->Cameras;
  std::vector< VPair > Pairs;
  for ( std::size_t Camera = 0; Camera < rCameras.size(); ++Camera )
  {
    for ( VFile& rFile : m_Files )
    {
      const int Alike = std::max( 2 * Likeness( rFile.Stem, rCameras[Camera].Camera ),
                                  Likeness( rFile.Folder, rCameras[Camera].Camera ) );
      if ( Alike > 0 )
      {
        Pairs.push_back( { Alike, Camera, &rFile } );
      }
    }
  }
  std::stable_sort( Pairs.begin(), Pairs.end(),
                    []( const VPair& i_rA, const VPair& i_rB )
                    {
                      return i_rA.Alike > i_rB.Alike;
                    } );
  std::vector< VFile* > Files( rCameras.size() );
  for ( const VPair& rPair : Pairs )
  {
    if ( !Files[rPair.Camera] && !rPair.pFile->bTaken )
    {
      Files[rPair.Camera] = rPair.pFile;
      rPair.pFile->bTaken = true;
    }
  }
  return Files;
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
    Note( std::string( "The video of the camera \"" )
              .append( io_rCamera.Camera.Name )
              .append( "\" cannot be shown: " )
              .append( ToUtf8( Message ) )
              .append( "." ) );
    return true;
  }
  pClip->Name = ToUtf8( pClip->Name );
  for ( const std::string& rNote : pClip->Notes )
  {
    Note( std::string( "The video " ).append( pClip->Name ).append( ": " ).append( rNote ) );
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
    Note( std::string( "The video " )
              .append( pClip->Name )
              .append( " is " )
              .append( SizeText( pClip->Width, pClip->Height ) )
              .append( ", the sensor of \"" )
              .append( io_rCamera.Camera.Name )
              .append( "\" " )
              .append( SizeText( rHardware.SensorWidth, rHardware.SensorHeight ) )
              .append( "; it is stretched to the whole sensor." ) );
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
    Note( std::string( "Cameras without a video: " ).append( Without ).append( "." ) );
  }
  for ( const VFile& rFile : m_Files )
  {
    if ( !rFile.bTaken )
    {
      Note( std::string( "The video " )
                .append( ToUtf8( rFile.Path.filename().string() ) )
                .append( " is not shown: by its name it is of no camera, or of one that has another." ) );
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
  const std::vector< VFile* > Files = Assign();
  for ( std::size_t Camera = 0; Camera < Files.size(); ++Camera )
  {
    const auto Part = [&]( double i_Fraction )
    {
      return !i_rProgress || i_rProgress( ( static_cast< double >( Camera ) + i_Fraction ) / Count );
    };
    if ( Files[Camera] && !Scan( *Files[Camera], io_rRecording.Cameras[Camera], Part ) )
    {
      return false;
    }
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
    // Numbers of detections that begin later are those of the video's frames, if it has as many; those that begin
    // with 1 merely count from it.
    rVideo.FirstFrame = !bAlike && i_First > 1 && rClip.FrameCount() - Count + FewFrames >= i_First ? i_First : 0;
    rVideo.bByNumber = bAlike || rVideo.FirstFrame > 0 || ( bSameRate && rClip.bEven );
    if ( !bSameRate && rClip.RateHz > 0 )
    {
      io_rRecording.Notes.push_back( std::string( "The video " )
                                         .append( rClip.Name )
                                         .append( " has " )
                                         .append( Rounded( rClip.RateHz ) )
                                         .append( " frames a second, the recording " )
                                         .append( Rounded( io_rRecording.RateHz ) )
                                         .append( rVideo.bByNumber
                                                      ? "; they are shown frame by frame, as there are as many."
                                                      : "; the frame nearest in time is shown." ) );
    }
    if ( rVideo.bByNumber && rVideo.FirstFrame == 0 && More != 0 )
    {
      const bool bEndsEarly = rClip.FrameCount() < io_rRecording.FrameCount;
      io_rRecording.Notes.push_back( std::string( "The video " )
                                         .append( rClip.Name )
                                         .append( " has " )
                                         .append( std::to_string( rClip.FrameCount() ) )
                                         .append( " frames, the " )
                                         .append( i_Count > 0 ? "camera's detections " : "recording " )
                                         .append( std::to_string( Count ) )
                                         .append( bEndsEarly ? "; its last one stays until the end." : "." ) );
    }
  }
}

} // namespace HostSources
