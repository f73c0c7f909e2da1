#include "Program.h"

#include <TestSupport/Paths.h>

#include <gtest/gtest.h>

#include <fstream>
#include <iterator>

using namespace ProgramTest;

TEST( Program, SettingsGoInAndOutWithoutAWindow )
{
  const TestSupport::VTemporaryDir Folder;
  const auto In = [&Folder]( const char* i_pName )
  {
    return QString::fromStdString( ( Folder.Path() / i_pName ).string() );
  };
  const std::string Whole = "{\"Version\":\"3.0\",\"Children\":{\"*\":{\"Value\":[],\"Type\":\"Int8\"},"
                            "\"p\":{\"Value-Proposed\":\"b\",\"Value\":\"a\",\"Type\":\"String\"}}}";
  std::ofstream( Folder.Path() / "a.json" ) << Whole;
  EXPECT_EQ( Harrow( { "settings", "check", In( "a.json" ) } ).Complaints().size(), 1 );
  EXPECT_EQ( Harrow( { "settings", "import", In( "a.json" ), "--store", In( "s.json" ) } ).Exit, 0 );
  EXPECT_EQ( Harrow( { "settings", "set", "*", "-7", "--store", In( "s.json" ) } ).Exit, 0 );
  EXPECT_EQ( Harrow( { "settings", "get", "*", "--store", In( "s.json" ) } ).Output, "-7\n" );
  EXPECT_EQ( Harrow( { "settings", "export", In( "b.json" ), "--store", In( "s.json" ) } ).Exit, 0 );
  std::ifstream File( Folder.Path() / "b.json" );
  std::string Expected = Whole;
  EXPECT_EQ( std::string( std::istreambuf_iterator< char >( File ), {} ),
             Expected.replace( Expected.find( "[]" ), 2, "-7" ) );
  // The user's own file, which is not there at first.
  EXPECT_EQ( Harrow( { "settings", "get", "x" } ).Exit, 5 );
  EXPECT_EQ( Harrow( { "settings", "set", "x", "true" } ).Exit, 0 );
  EXPECT_EQ( Harrow( { "settings", "list" } ).Output, "x\ttrue\n" );
  EXPECT_EQ( Harrow( { "settings", "get", "nothing" } ).Complaints().size(), 1 );
  EXPECT_EQ( Harrow( { "settings", "frobnicate" } ).Exit, 2 );
}
