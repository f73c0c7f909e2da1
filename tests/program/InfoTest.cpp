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

/// A model of one bar that turns about z.
std::string Pendulum( const std::string& i_rName )
{
  return "<?xml version=\"1.0\"?><OpenSimDocument Version=\"40000\"><Model name=\"" + i_rName +
         R"("><gravity>0 0 -9.8</gravity>
<BodySet><objects><Body name="bar"><mass_center>0 -.4 0</mass_center></Body></objects></BodySet>
<JointSet><objects><PinJoint name="pin"><socket_parent_frame>/ground</socket_parent_frame>
<socket_child_frame>/bodyset/bar</socket_child_frame><coordinates><Coordinate name="turn"/></coordinates>
</PinJoint></objects></JointSet></Model></OpenSimDocument>)";
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

TEST( Info, MotionMovesTheModelThatIsNamedOrLiesBeside )
{
  const TestSupport::VTemporaryDir Folder;
  std::filesystem::create_directory( Folder.Path() / "models" );
  const auto Write = [&]( const char* i_pName, const std::string& i_rText )
  {
    std::ofstream( Folder.Path() / i_pName ) << i_rText;
    return QString::fromStdString( ( Folder.Path() / i_pName ).string() );
  };
  const QString Walk = Write( "walk.mot", "a\ninDegrees=yes\nendheader\ntime\tturn\n0\t0\n0.02\t90\n" );
  const QString Named = Write( "models/named.osim", Pendulum( "Named" ) );
  struct VCase
  {
    QStringList Before;
    QString Names; ///< the skeleton, or what the complaint has
    int Exit;
  };
  const auto Try = [&]( const VCase& i_rCase )
  {
    const VRun Run = Harrow( i_rCase.Before + QStringList{ "info", "--json", Walk } );
    SCOPED_TRACE( ( i_rCase.Before.join( ' ' ) + ": " + Run.Error ).toStdString() );
    EXPECT_EQ( Run.Exit, i_rCase.Exit );
    const QJsonObject Info = QJsonDocument::fromJson( Run.Output.toUtf8() ).object();
    EXPECT_EQ( Info.isEmpty(), i_rCase.Exit != 0 );
    EXPECT_EQ( Run.Complaints().size(), i_rCase.Exit == 0 ? 0 : 1 );
    const QString Told = i_rCase.Exit == 0 ? Info["skeletons"][0]["name"].toString() : Run.Complaints().join( "" );
    EXPECT_THAT( Told.toStdString(), testing::HasSubstr( i_rCase.Names.toStdString() ) );
  };
  Try( { {}, "named with --model, found none", 5 } );
  Try( { { "--model", Named }, "Named", 0 } );
  Write( "beside.osim", Pendulum( "Beside" ) );
  Try( { {}, "Beside", 0 } );
  Try( { { "--model", Named }, "Named", 0 } );
  Try( { { "--model", Named + "x" }, "named.osimx: expected a model (.osim), found no such file", 5 } );
  Try( { { "--model", QString::fromStdString( Folder.Path().string() ) },
         "expected a model (.osim), found a folder",
         5 } );
  Try( { { "--model", Walk }, "walk.mot: line 1: expected XML", 5 } );
  if ( !HasModule() )
  {
    GTEST_SKIP() << "the picture of it: the module HarrowPluginGraphics.mpm is not built";
  }
  const QJsonObject Report = Render( { "--model", Named, "--source", Walk, "--time", "0.02", "--size", "160x120" } );
  const QJsonValue Drawn = Report["subjects"]["LabellingSubject"]["subjects"];
  EXPECT_EQ( Drawn["names"][0].toString(), "Named" );
  EXPECT_EQ( Drawn["bones"].toInt(), 1 );
  EXPECT_TRUE( Report["log"].toArray().isEmpty() ) << "a run without a fault";
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
