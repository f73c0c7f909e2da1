#include <TestSupport/Paths.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

namespace
{
namespace fs = std::filesystem;

// From the ground up: a room may include its own headers and those of rooms before it.
const std::vector< std::string > Rooms{ "platform/ZEK",
                                        "platform/CoreMoxelTypes",
                                        "platform/HarrowPluginInterface",
                                        "plugin/UtilsFileSystem",
                                        "plugin/ComputeCameraModel",
                                        "plugin/ComputeSubjectFK",
                                        "plugin/Store",
                                        "plugin/CoreGraphics",
                                        "plugin/MoxelGraphics",
                                        "plugin/Flow2TypesUtils",
                                        "plugin/Flow2StateCache",
                                        "plugin/Flow2Graphics",
                                        "plugin/MoxelQtQuick",
                                        "plugin/HarrowGraphics",
                                        "plugin/HarrowPluginGraphics",
                                        "host/HostFlow",
                                        "host/HostServices",
                                        "host/HostMeshes",
                                        "host/HostVideo",
                                        "host/HostSources",
                                        "host/HostQml",
                                        "host/HostWindow",
                                        "host/harrow" };

struct VInclude
{
  fs::path File;
  std::string Header;
};

std::vector< fs::path > Sources( const fs::path& i_rFolder )
{
  std::vector< fs::path > Files;
  if ( !fs::is_directory( i_rFolder ) )
  {
    return Files;
  }
  for ( const fs::directory_entry& rEntry : fs::recursive_directory_iterator( i_rFolder ) )
  {
    if ( rEntry.path().extension() == ".h" || rEntry.path().extension() == ".cpp" )
    {
      Files.push_back( rEntry.path() );
    }
  }
  return Files;
}

std::vector< VInclude > Includes( const fs::path& i_rFile )
{
  std::vector< VInclude > Found;
  std::ifstream Stream( i_rFile );
  for ( std::string Line; std::getline( Stream, Line ); )
  {
    const std::size_t Begin = Line.find_first_of( "<\"" );
    if ( Line.starts_with( "#include" ) && Begin != std::string::npos )
    {
      Found.push_back( { i_rFile, Line.substr( Begin + 1, Line.find_first_of( ">\"", Begin + 1 ) - Begin - 1 ) } );
    }
  }
  return Found;
}

std::string ModuleOf( const std::string& i_rRoom )
{
  return i_rRoom.substr( i_rRoom.find( '/' ) + 1 );
}

bool IsTest( const fs::path& i_rFile )
{
  return i_rFile.string().find( "/tests/" ) != std::string::npos;
}

/// The place of the room whose public headers `i_rHeader` belongs to; npos for a foreign header.
std::size_t RoomOf( const std::string& i_rHeader )
{
  const std::string Module = i_rHeader.substr( 0, i_rHeader.find( '/' ) );
  const auto It = std::find_if( Rooms.begin(), Rooms.end(),
                                [&]( const std::string& i_rRoom )
                                {
                                  return ModuleOf( i_rRoom ) == Module;
                                } );
  return It == Rooms.end() ? std::string::npos : static_cast< std::size_t >( It - Rooms.begin() );
}
} // namespace

TEST( Structure, ARoomIncludesOnlyRoomsBelowItAndOnlyTheirPublicHeaders )
{
  std::size_t Seen = 0;
  for ( std::size_t Room = 0; Room < Rooms.size(); ++Room )
  {
    for ( const fs::path& rFile : Sources( TestSupport::SourceDir() / Rooms[Room] ) )
    {
      for ( const VInclude& rInclude : Includes( rFile ) )
      {
        EXPECT_EQ( rInclude.Header.find( "../" ), std::string::npos ) << rFile << " includes " << rInclude.Header;
        const std::size_t Other = RoomOf( rInclude.Header );
        if ( Other == std::string::npos || Other == Room )
        {
          continue;
        }
        ++Seen;
        EXPECT_TRUE( fs::exists( TestSupport::SourceDir() / Rooms[Other] / "include" / rInclude.Header ) )
            << rFile << " includes " << rInclude.Header << ", which is not public";
        const bool bHostAndPlugin =
            Rooms[Room].starts_with( "host/" ) && Rooms[Other].starts_with( "plugin/" ) &&
            ModuleOf( Rooms[Other] ) != "UtilsFileSystem" && ModuleOf( Rooms[Other] ) != "ComputeCameraModel" &&
            ModuleOf( Rooms[Other] ) != "ComputeSubjectFK" && ModuleOf( Rooms[Other] ) != "Store";
        EXPECT_TRUE( IsTest( rFile ) || ( Other < Room && !bHostAndPlugin ) )
            << rFile << " includes " << rInclude.Header << ", which lies above it or on the other side";
      }
    }
  }
  EXPECT_GT( Seen, 50u ) << "the test no longer finds the sources";
}

TEST( Structure, SourcesStayReadable )
{
  constexpr std::size_t MostLines = 500;
  for ( const char* pFolder : { "platform", "plugin", "host", "tests", "benchmarks" } )
  {
    for ( const fs::path& rFile : Sources( TestSupport::SourceDir() / pFolder ) )
    {
      std::ifstream Stream( rFile );
      const auto Lines = std::count( std::istreambuf_iterator< char >( Stream ), {}, '\n' );
      EXPECT_LE( static_cast< std::size_t >( Lines ), MostLines ) << rFile;
    }
  }
}
