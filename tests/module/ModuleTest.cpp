#include <TestSupport/Paths.h>

#include <gtest/gtest.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <set>
#include <sstream>
#include <string>

#include <sys/wait.h>

namespace
{
std::string Module()
{
  return ( TestSupport::BinaryDir() / "lib" / "HarrowPluginGraphics.mpm" ).string();
}

struct VRun
{
  int ExitCode = -1;
  std::string Output;
};

VRun Execute( const std::string& i_rCommand )
{
  VRun Result;
  FILE* const pPipe = popen( ( i_rCommand + " 2>&1" ).c_str(), "r" );
  if ( !pPipe )
  {
    return Result;
  }
  std::array< char, 4096 > Buffer{};
  while ( const std::size_t Count = fread( Buffer.data(), 1, Buffer.size(), pPipe ) )
  {
    Result.Output.append( Buffer.data(), Count );
  }
  const int Status = pclose( pPipe );
  Result.ExitCode = WIFEXITED( Status ) ? WEXITSTATUS( Status ) : 128 + WTERMSIG( Status );
  return Result;
}

VRun Life( const std::string& i_rStory )
{
  return Execute( ( TestSupport::BinaryDir() / "bin" / "ModuleLife" ).string() + " " + Module() + " " + i_rStory );
}
} // namespace

TEST( Module, ExportsThreeFunctionsAndNothingElse )
{
  const VRun Names = Execute( "nm -D --defined-only " + Module() );
  ASSERT_EQ( Names.ExitCode, 0 ) << Names.Output;
  std::set< std::string > Exports;
  std::istringstream Stream( Names.Output );
  std::string Address, Type, Name;
  while ( Stream >> Address >> Type >> Name )
  {
    Exports.insert( Name );
  }
  // Tools of the tool chain, sanitizers among them, may add their own, which begin with an underscore.
  std::erase_if( Exports,
                 []( const std::string& i_rName )
                 {
                   return i_rName.starts_with( '_' );
                 } );
  EXPECT_EQ( Exports, ( std::set< std::string >{ "CreatePlugin", "DestroyPlugin", "PluginBuildRevision" } ) );
}

TEST( Module, LivesFiftyTimesInOneProcessWithoutGrowing )
{
  const VRun Result = Life( "cycle 50" );
  EXPECT_EQ( Result.ExitCode, 0 ) << Result.Output;
}

class ModuleWrongOrder : public testing::TestWithParam< const char* >
{
};

TEST_P( ModuleWrongOrder, EndsWithoutACrash )
{
  const VRun Result = Life( GetParam() );
  EXPECT_EQ( Result.ExitCode, 0 ) << Result.Output;
}

INSTANTIATE_TEST_SUITE_P( Orders, ModuleWrongOrder,
                          testing::Values( "destroy-null", "release-first", "content-twice", "register-twice",
                                           "content-without-register", "destroy-without-release",
                                           "window-after-release", "state-after-close", "release-twice", "unload" ),
                          []( const testing::TestParamInfo< const char* >& i_rInfo )
                          {
                            std::string Name = i_rInfo.param;
                            std::erase( Name, '-' );
                            return Name;
                          } );
