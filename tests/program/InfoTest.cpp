#include "Program.h"

#include <TestSupport/Paths.h>

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>

#include <gmock/gmock.h>

#include <fstream>

using namespace ProgramTest;

namespace
{
/// A recording of two points in two frames, the second of which lacks one of them.
std::string SmallTrc()
{
  return "PathFileType\t4\t(X/Y/Z)\tsmall.trc\n"
         "DataRate\tCameraRate\tNumFrames\tNumMarkers\tUnits\tOrigDataRate\tOrigDataStartFrame\tOrigNumFrames\n"
         "50\t50\t2\t2\tmm\t50\t1\t2\n"
         "Frame#\tTime\tLeft\t\t\tRight\t\t\n"
         "\t\tX1\tY1\tZ1\tX2\tY2\tZ2\n"
         "\n"
         "1\t0.00\t100\t200\t300\t400\t500\t600\n"
         "2\t0.02\t101\t201\t301\t\t\t\n";
}
} // namespace

TEST( Info, NeedsNoDisplayAndSaysWhatASmallFileHolds )
{
  const TestSupport::VTemporaryDir Folder;
  const auto Path = Folder.Path() / "small.trc";
  std::ofstream( Path ) << SmallTrc();
  QProcessEnvironment Bare = Environment();
  Bare.remove( "DISPLAY" );
  Bare.insert( "PATH", "/nonexistent" );
  const VRun Run = Harrow( { "info", QString::fromStdString( Path.string() ) }, Bare );
  EXPECT_EQ( Run.Exit, 0 ) << Run.Error.toStdString();
  for ( const char* pWord : { "small.trc", "Left", "Right", "50" } )
  {
    EXPECT_TRUE( Run.Output.contains( pWord ) ) << pWord << " is not in\n" << Run.Output.toStdString();
  }
}

TEST( Info, SeveralFilesAreOneListAndABadOneDoesNotStopTheRest )
{
  const TestSupport::VTemporaryDir Folder;
  const auto Good = Folder.Path() / "small.trc";
  const auto Bad = Folder.Path() / "bad.c3d";
  std::ofstream( Good ) << SmallTrc();
  std::ofstream( Bad ) << std::string( 100, 'x' );
  const QString GoodPath = QString::fromStdString( Good.string() );
  const VRun Run = Harrow( { "info", "--json", GoodPath, QString::fromStdString( Bad.string() ), GoodPath } );
  EXPECT_EQ( Run.Exit, 5 );
  EXPECT_THAT( Run.Complaints().join( '\n' ).toStdString(), testing::HasSubstr( "bad.c3d" ) );
  const QJsonDocument List = QJsonDocument::fromJson( Run.Output.toUtf8() );
  ASSERT_TRUE( List.isArray() ) << Run.Output.toStdString();
  EXPECT_EQ( List.array().size(), 2 );
  EXPECT_EQ( List.array()[0], List.array()[1] );
}

TEST( Info, FailuresNameTheFileAndEndWithFive )
{
  const TestSupport::VTemporaryDir Folder;
  const auto Empty = Folder.Path() / "empty.c3d";
  std::ofstream{ Empty };
  for ( const auto& rPath : { Empty, Folder.Path() / "missing.trc", Folder.Path() } )
  {
    const VRun Run = Harrow( { "info", QString::fromStdString( rPath.string() ) } );
    EXPECT_EQ( Run.Exit, 5 );
    ASSERT_EQ( Run.Complaints().size(), 1 );
    EXPECT_THAT( Run.Complaints().front().toStdString(), testing::HasSubstr( rPath.filename().string() ) );
    EXPECT_EQ( Run.Output, "" );
  }
}

TEST( Info, RealRecordingsGiveTheirTrueFigures )
{
  HARROW_NEEDS_RECORDINGS();
  const VRun Figures = Harrow( { "info", "--json", Recording( "c3d-trc/Gait.c3d" ) } );
  const QJsonObject Gait = QJsonDocument::fromJson( Figures.Output.toUtf8() ).object();
  EXPECT_EQ( Gait["frames"].toInt(), 487 );
  EXPECT_EQ( Gait["missingSamples"].toInt(), 9682 );
  const VRun Words = Harrow( { "info", Recording( "c3d-trc/mocap36.c3d" ) } );
  EXPECT_EQ( Words.Exit, 0 );
  for ( const char* pWord : { "1380", "8244", "Skeleton_Hip1" } )
  {
    EXPECT_TRUE( Words.Output.contains( pWord ) ) << pWord;
  }
}
