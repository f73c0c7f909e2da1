#include "CameraTables.h"
#include "ReaderSupport.h"

#include <HostSources/VByteSource.h>

#include <algorithm>
#include <new>
#include <unordered_map>

namespace HostSources
{
namespace
{
constexpr std::uint64_t LargestFile = 256u << 20;

std::string Shown( const std::string& i_rName )
{
  return i_rName.empty() ? "without a name" : "\"" + i_rName + "\"";
}

/// Names are what cameras are told apart by: one that is empty or taken gets a number.
void GiveNames( VCameraCalibrations& io_rCalibrations )
{
  std::unordered_map< std::string, std::size_t > Last;
  for ( const VCalibratedCamera& rCamera : io_rCalibrations.Cameras )
  {
    Last.emplace( rCamera.Name, 0 );
  }
  for ( VCalibratedCamera& rCamera : io_rCalibrations.Cameras )
  {
    if ( std::size_t& rSeen = Last[rCamera.Name]; !rCamera.Name.empty() && rSeen == 0 )
    {
      rSeen = 1;
      continue;
    }
    const std::string Base = rCamera.Name.empty() ? "camera" : rCamera.Name;
    std::size_t& rNumber = Last[Base];
    std::string New;
    do
    {
      New = Base + " (" + std::to_string( ++rNumber ) + ")";
    } while ( Last.contains( New ) );
    io_rCalibrations.Notes.push_back( "The camera " + Shown( rCamera.Name ) +
                                      " has no name of its own and is called \"" + New + "\"." );
    rCamera.Name = std::move( New );
  }
}
} // namespace

void NoteUncalibrated( const std::string& i_rName, const std::string& i_rReason, VCameraCalibrations& io_rCalibrations )
{
  io_rCalibrations.Notes.push_back( "The camera " + Shown( i_rName ) + " is not calibrated: " + i_rReason + "." );
}

void NoteLeftOut( const std::string& i_rName, const std::string& i_rReason, VCameraCalibrations& io_rCalibrations )
{
  io_rCalibrations.Notes.push_back( "The camera " + Shown( i_rName ) + " is left out: " + i_rReason + "." );
}

ZEK::IResult ReadCameraCalibrations( std::string_view i_Text, const std::string& i_rName,
                                     VCameraCalibrations& o_rCalibrations, std::string& o_rMessage )
{
  o_rCalibrations = {};
  o_rMessage.clear();
  ZEK::IResult Result = ZEK::IResult::InvalidFormat;
  try
  {
    const std::size_t First = i_Text.find_first_not_of( "\xEF\xBB\xBF \t\r\n" );
    if ( First == std::string_view::npos )
    {
      o_rMessage = "expected a calibration of cameras in TOML or JSON, found nothing";
    }
    else
    {
      const std::string_view Text = i_Text.substr( i_Text.starts_with( "\xEF\xBB\xBF" ) ? 3 : 0 );
      const bool bRead = i_Text[First] == '{' ? ReadCameraJson( Text, o_rCalibrations, o_rMessage )
                                              : ReadCameraToml( Text, o_rCalibrations, o_rMessage );
      GiveNames( o_rCalibrations );
      const bool bWhole = o_rCalibrations.Notes.empty();
      Result = !bRead ? ZEK::IResult::InvalidFormat : bWhole ? ZEK::IResult::Ok : ZEK::IResult::OkButPartial;
    }
  }
  catch ( const std::bad_alloc& )
  {
    o_rMessage = "expected memory for what the file holds, and there is not enough";
    Result = ZEK::IResult::AllocationFailure;
  }
  if ( Result.IsError() )
  {
    o_rCalibrations = {};
    o_rMessage = i_rName + ": " + o_rMessage;
  }
  o_rCalibrations.Name = ToUtf8( std::filesystem::path( i_rName ).filename().string() );
  return Result;
}

ZEK::IResult ReadCameraCalibrations( const std::filesystem::path& i_rPath, VCameraCalibrations& o_rCalibrations,
                                     std::string& o_rMessage )
{
  o_rCalibrations = {};
  o_rMessage.clear();
  VFileSource Source;
  const ZEK::IResult Opened = Source.Open( i_rPath, o_rMessage );
  if ( Opened.IsError() )
  {
    return Opened;
  }
  if ( Source.Size() > LargestFile )
  {
    o_rMessage = i_rPath.string() + ": expected a calibration of cameras, found a file of " +
                 std::to_string( Source.Size() ) + " bytes";
    return ZEK::IResult::InvalidFormat;
  }
  const std::span< const std::byte > Bytes = Source.Read( 0, static_cast< std::size_t >( Source.Size() ) );
  if ( Bytes.size() != Source.Size() )
  {
    o_rMessage = i_rPath.string() + ": expected a calibration of cameras, and the file could not be read";
    return ZEK::IResult::FileIOFailure;
  }
  return ReadCameraCalibrations( { reinterpret_cast< const char* >( Bytes.data() ), Bytes.size() }, i_rPath.string(),
                                 o_rCalibrations, o_rMessage );
}

} // namespace HostSources
