#include "Program.h"

#include <TestSupport/Paths.h>

#include <gtest/gtest.h>

#include <QtCore/QDeadlineTimer>
#include <QtCore/QProcess>
#include <QtCore/QThread>

#include <csignal>
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
  const std::size_t At = Expected.find( '[' );
  Expected[At] = '-';
  Expected[At + 1] = '7';
  EXPECT_EQ( std::string( std::istreambuf_iterator< char >( File ), {} ), Expected );
  // The user's own file, which is not there at first.
  EXPECT_EQ( Harrow( { "settings", "get", "x" } ).Exit, 5 );
  EXPECT_EQ( Harrow( { "settings", "set", "x", "true" } ).Exit, 0 );
  EXPECT_EQ( Harrow( { "settings", "list" } ).Output, "x\ttrue\n" );
  EXPECT_EQ( Harrow( { "settings", "get", "nothing" } ).Complaints().size(), 1 );
  EXPECT_EQ( Harrow( { "settings", "frobnicate" } ).Exit, 2 );
}

namespace
{
/// The signals that a process handles itself, as a mask.
std::uint64_t HandledSignals( qint64 i_Process )
{
  std::ifstream Status( std::string( "/proc/" ).append( std::to_string( i_Process ) ).append( "/status" ) );
  for ( std::string Word; Status >> Word; )
  {
    if ( Word == "SigCgt:" && Status >> Word )
    {
      return std::stoull( Word, nullptr, 16 );
    }
  }
  return 0;
}
} // namespace

TEST( Program, ASessionThatEndsClosesTheWindowAndKeepsItsLayout )
{
  HARROW_NEEDS_MODULE();
  const TestSupport::VTemporaryDir Folder;
  QProcessEnvironment Own = Environment();
  Own.insert( "XDG_CONFIG_HOME", QString::fromStdString( Folder.Path().string() ) );
  QProcess Process;
  Process.setProcessEnvironment( Own );
  Process.start( QString::fromStdString( ( TestSupport::BinaryDir() / "bin" / "harrow" ).string() ), QStringList() );
  ASSERT_TRUE( Process.waitForStarted() );
  const QDeadlineTimer Patience( 120'000 );
  while ( ( HandledSignals( Process.processId() ) & 1u << ( SIGTERM - 1 ) ) == 0 && !Patience.hasExpired() )
  {
    QThread::msleep( 50 );
  }
  Process.terminate();
  EXPECT_TRUE( Process.waitForFinished( 120'000 ) );
  EXPECT_EQ( Process.exitStatus(), QProcess::NormalExit );
  EXPECT_EQ( Process.exitCode(), 0 );
  int Kept = 0;
  for ( const auto& rFile : std::filesystem::recursive_directory_iterator( Folder.Path() ) )
  {
    Kept += rFile.path().filename() == "preferences.json" ? 1 : 0;
  }
  EXPECT_EQ( Kept, 1 );
  Process.kill();
}
