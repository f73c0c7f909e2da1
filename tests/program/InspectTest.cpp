#include "Program.h"

#include <TestSupport/Paths.h>

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>

#include <gmock/gmock.h>

#include <fstream>

using namespace ProgramTest;

TEST( Inspect, CamerasPrintsTheModelOfEachCamera )
{
  HARROW_NEEDS_RECORDINGS();
  const TestSupport::VTemporaryDir Folder;
  const QString Data = QString::fromStdString( TestSupport::RecordingsDir().string() );
  const QString Board = Data + "/multicam-board/camera_array.toml";
  QProcessEnvironment Bare = Environment();
  Bare.remove( "DISPLAY" );
  Bare.insert( "PATH", "/nonexistent" );
  const VRun Run = Harrow( { "inspect", "cameras", Board }, Bare );
  ASSERT_EQ( Run.Exit, 0 ) << Run.Error.toStdString();
  const QJsonArray Cameras = QJsonDocument::fromJson( Run.Output.toUtf8() ).object()["cameras"].toArray();
  ASSERT_EQ( Cameras.size(), 4 );
  for ( const QJsonValue& rCamera : Cameras )
  {
    EXPECT_EQ( rCamera["model"]["imageTransformRotated"].toArray().size(), 4 );
    EXPECT_TRUE( rCamera["model"]["roll"].isDouble() );
    EXPECT_GT( rCamera["distortionDomain"]["maxRawRadius"].toDouble( 1e9 ), 600 );
    EXPECT_GT( rCamera["refit"]["residualRms"].toDouble(), 0 );
    EXPECT_GE( rCamera["refit"]["residualWorst"].toDouble(), rCamera["refit"]["residualRms"].toDouble() );
  }

  // What it prints it also reads, and a bad file does not stop the rest.
  const auto Own = Folder.Path() / "own.json", Bad = Folder.Path() / "bad.toml";
  std::ofstream( Own ) << Run.Output.toStdString();
  std::ofstream( Bad ) << "[camera\n";
  const VRun Several = Harrow( { "inspect", "cameras", QString::fromStdString( Own.string() ),
                                 QString::fromStdString( Bad.string() ), Data + "/multicam-person/calibration.toml" } );
  EXPECT_EQ( Several.Exit, 5 );
  EXPECT_THAT( Several.Complaints().join( '\n' ).toStdString(), testing::HasSubstr( "bad.toml: line 1" ) );
  const QJsonArray List = QJsonDocument::fromJson( Several.Output.toUtf8() ).array();
  ASSERT_EQ( List.size(), 2 );
  EXPECT_EQ( List[0].toObject()["cameras"][0]["model"], Cameras[0]["model"] );
  EXPECT_EQ( Harrow( { "inspect" } ).Exit, 2 );
  EXPECT_EQ( Harrow( { "inspect", "cameras" } ).Exit, 2 );
}
