#include "SaveFolder.h"

#include <UtilsFileSystem/FileIO.h>
#include <UtilsFileSystem/FileStreams.h>

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <sstream>

using namespace ZEK;

namespace UtilsFileSystemTests
{
namespace fs = std::filesystem;
using namespace UtilsFileSystem;

VSaveFolder::VSaveFolder()
{
  for ( const fs::path& rParent : { fs::path( "/dev/shm" ), fs::temp_directory_path() } )
  {
    std::string Name = rParent / "harrow-test-XXXXXX";
    if ( m_Base.empty() && ::mkdtemp( Name.data() ) )
    {
      m_Base = Name;
    }
  }
  Clear();
}

VSaveFolder::~VSaveFolder()
{
  std::error_code Ignored;
  fs::remove_all( m_Base, Ignored );
}

void VSaveFolder::Clear()
{
  fs::remove_all( Folder() );
  fs::remove_all( Kept() );
  fs::create_directory( Folder() );
}

void VSaveFolder::Put( const std::string& i_rEnding, const std::string& i_rContent ) const
{
  std::ofstream( Target() + i_rEnding, std::ios::binary ) << i_rContent;
}

std::optional< std::string > VSaveFolder::Get( const std::string& i_rEnding ) const
{
  std::ifstream Stream( Target() + i_rEnding, std::ios::binary );
  if ( !Stream )
  {
    return {};
  }
  return std::string( std::istreambuf_iterator< char >( Stream ), {} );
}

std::vector< std::string > VSaveFolder::Endings() const
{
  std::vector< std::string > Found;
  for ( const fs::directory_entry& rEntry : fs::directory_iterator( Folder() ) )
  {
    Found.push_back( rEntry.path().string().substr( Target().size() ) );
  }
  std::sort( Found.begin(), Found.end() );
  return Found;
}

PathFunction Writer( const std::string& i_rContent )
{
  return [i_rContent]( const std::string& i_rPath ) -> IResult
  {
    std::FILE* pFile = nullptr;
    const IResult Opened = OpenOutputFile( i_rPath, "wb", pFile );
    if ( Opened.IsError() )
    {
      return Opened;
    }
    constexpr std::size_t Piece = 1000;
    for ( std::size_t At = 0; At < i_rContent.size(); At += Piece )
    {
      (void)std::fwrite( i_rContent.data() + At, 1, std::min( Piece, i_rContent.size() - At ), pFile );
    }
    return std::fclose( pFile ) == 0 ? IResult::Ok : IResult::FileIOFailure;
  };
}

IResult Save( const std::string& i_rTarget, const std::string& i_rContent, bool i_bOverwrite )
{
  return ProtectedSave( Writer( i_rContent ), i_rTarget, i_bOverwrite );
}

std::optional< std::string > Load( const std::string& i_rTarget )
{
  std::string Content;
  const IResult Result = ProtectedLoad(
      [&]( const std::string& i_rPath ) -> IResult
      {
        std::unique_ptr< VFileInputStream > pStream;
        const IResult Opened = OpenInputFileStream( i_rPath, pStream );
        if ( Opened.IsOk() )
        {
          std::ostringstream All;
          All << pStream->rdbuf();
          Content = All.str();
          return pStream->Result();
        }
        return Opened;
      },
      i_rTarget );
  return Result == IResult::FileNotFound ? std::nullopt : std::optional( Result.IsOk() ? Content : "failed" );
}

} // namespace UtilsFileSystemTests
