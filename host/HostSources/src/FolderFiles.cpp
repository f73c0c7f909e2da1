#include "FolderFiles.h"

#include "ReaderSupport.h"

#include <algorithm>
#include <cctype>

namespace HostSources
{
namespace
{
/// A folder may hold one JSON file a frame, none of which is a calibration.
constexpr int MostCandidates = 16;

bool FindIn( const std::filesystem::path& i_rFolder, VCameraCalibrations& o_rCalibrations,
             std::vector< std::string >& io_rProblems )
{
  VFolderFiles Listed;
  std::string Message;
  if ( ListFolder( i_rFolder, Listed, Message ).IsError() )
  {
    return false;
  }
  for ( const char* const pSuffix : { ".toml", ".json" } )
  {
    int Tried = 0;
    for ( const auto& rFile : Listed.Files )
    {
      if ( SuffixOf( rFile ) != pSuffix || Tried++ >= MostCandidates )
      {
        continue;
      }
      if ( !ReadCameraCalibrations( rFile, o_rCalibrations, Message ).IsError() )
      {
        return true;
      }
      io_rProblems.push_back( "No calibration: " + Message + "." );
    }
  }
  return false;
}
} // namespace

std::string SuffixOf( const std::filesystem::path& i_rPath )
{
  std::string Suffix = i_rPath.extension().string();
  std::transform( Suffix.begin(), Suffix.end(), Suffix.begin(),
                  []( unsigned char i_Character )
                  {
                    return static_cast< char >( std::tolower( i_Character ) );
                  } );
  return Suffix;
}

std::string ShownName( const std::filesystem::path& i_rPath )
{
  std::error_code Ignored;
  const auto Whole = std::filesystem::absolute( i_rPath, Ignored ).lexically_normal();
  const auto Last = Whole.has_filename() ? Whole.filename() : Whole.parent_path().filename();
  return ToUtf8( Last.string() );
}

ZEK::IResult ListFolder( const std::filesystem::path& i_rPath, VFolderFiles& o_rFiles, std::string& o_rMessage )
{
  o_rFiles = {};
  std::error_code Error;
  std::filesystem::directory_iterator It( i_rPath, Error );
  for ( ; !Error && It != std::filesystem::directory_iterator(); It.increment( Error ) )
  {
    std::error_code Ignored;
    const auto Kind = std::filesystem::status( It->path(), Ignored ).type();
    if ( Kind == std::filesystem::file_type::regular )
    {
      o_rFiles.Files.push_back( It->path() );
    }
    else if ( Kind == std::filesystem::file_type::directory )
    {
      o_rFiles.Folders.push_back( It->path() );
    }
  }
  if ( Error )
  {
    o_rMessage = i_rPath.string() + ": expected a folder that can be read: " + Error.message();
    return ZEK::IResult::FileIOFailure;
  }
  std::sort( o_rFiles.Files.begin(), o_rFiles.Files.end() );
  std::sort( o_rFiles.Folders.begin(), o_rFiles.Folders.end() );
  return ZEK::IResult::Ok;
}

ZEK::IResult ReadText( const std::filesystem::path& i_rPath, VFileSource& o_rSource, std::string_view& o_rText,
                       std::string& o_rMessage )
{
  const ZEK::IResult Opened = o_rSource.Open( i_rPath, o_rMessage );
  if ( Opened.IsError() )
  {
    return Opened;
  }
  const auto Bytes = o_rSource.Read( 0, static_cast< std::size_t >( o_rSource.Size() ) );
  if ( Bytes.size() != o_rSource.Size() )
  {
    o_rMessage =
        i_rPath.string() + ": expected " + std::to_string( o_rSource.Size() ) + " bytes, and they could not be read";
    return ZEK::IResult::FileIOFailure;
  }
  o_rText = { reinterpret_cast< const char* >( Bytes.data() ), Bytes.size() };
  if ( o_rText.starts_with( "\xEF\xBB\xBF" ) )
  {
    o_rText.remove_prefix( 3 );
  }
  return ZEK::IResult::Ok;
}

bool FindCalibration( const std::filesystem::path& i_rFolder, VCameraCalibrations& o_rCalibrations,
                      std::vector< std::string >& io_rNotes )
{
  std::error_code Error;
  std::filesystem::path Whole = std::filesystem::absolute( i_rFolder, Error ).lexically_normal();
  if ( !Whole.has_filename() )
  {
    Whole = Whole.parent_path(); // the path ended in a slash
  }
  std::vector< std::string > Problems;
  if ( FindIn( i_rFolder, o_rCalibrations, Problems ) ||
       ( Whole.has_parent_path() && FindIn( Whole.parent_path(), o_rCalibrations, Problems ) ) )
  {
    return true;
  }
  o_rCalibrations = {};
  io_rNotes.insert( io_rNotes.end(), Problems.begin(), Problems.end() );
  return false;
}

} // namespace HostSources
