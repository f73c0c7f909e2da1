#include <HostQml/Modules.h>

#include <HostServices/VHost.h>

#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>

#include <QtQml/QQmlComponent>
#include <QtQml/QQmlEngine>

#include <gtest/gtest.h>

namespace
{
HostServices::VHostOptions Options( const TestSupport::VTemporaryDir& i_rFolder )
{
  return { .ContentRoot = i_rFolder.Path(),
           .UserRoot = i_rFolder.Path(),
           .Preferences = i_rFolder.Path() / "preferences.json",
           .Now = []
           {
             return std::int64_t{ 0 };
           } };
}

std::unique_ptr< QObject > Make( HostServices::VHost& i_rHost, const char* i_pDocument )
{
  QQmlComponent Component( i_rHost.Quick()->Engine() );
  Component.setData( i_pDocument, QUrl( QStringLiteral( "qrc:/test.qml" ) ) );
  std::unique_ptr< QObject > pObject( Component.create() );
  EXPECT_TRUE( pObject ) << Component.errorString().toStdString();
  return pObject;
}
} // namespace

TEST( QmlModules, PlaybackFollowsAndMovesTheClockOfItsOwnHost )
{
  const TestSupport::VTemporaryDir Folder;
  // A second host in the process must not answer for the first.
  HostServices::VHost First( Options( Folder ) );
  HostServices::VHost Second( Options( Folder ) );
  HostQml::RegisterModules( First );
  HostQml::RegisterModules( First );
  HostQml::RegisterModules( Second );
  ASSERT_TRUE( Second.Playback()->Open( 100, 1000 ).IsOk() );
  const auto pObject = Make( Second, R"(
    import QtQml
    import Moxel.Playback
    QtObject {
      property real tick: Playback.tick
      property real period: Playback.framePeriod()
      property bool scrub: Playback.middleMouseScrub() && Playback.middleMouseScrubSensitivity() > 1
      property bool playing: Playback.playing
      function move() { Playback.tick = 4200 }
    })" );
  ASSERT_TRUE( pObject );
  EXPECT_EQ( pObject->property( "period" ).toInt(), 1000 );
  EXPECT_TRUE( pObject->property( "scrub" ).toBool() );
  QMetaObject::invokeMethod( pObject.get(), "move" );
  EXPECT_EQ( Second.Playback()->CurrentFrame(), 4 );
  EXPECT_EQ( First.Playback()->CurrentTick(), 0 );
  Second.Playback()->Play();
  Second.Playback()->SeekFrame( 7 );
  EXPECT_TRUE( Second.Postal()->DrainForTest() );
  EXPECT_EQ( pObject->property( "tick" ).toLongLong(), 7000 );
  EXPECT_TRUE( pObject->property( "playing" ).toBool() );
}

TEST( QmlModules, SelectionCountsKindsAndSignals )
{
  const TestSupport::VTemporaryDir Folder;
  HostServices::VHost Host( Options( Folder ) );
  HostQml::RegisterModules( Host );
  const auto pObject = Make( Host, R"(
    import QtQml
    import Moxel.Selection
    import Moxel.Graphics
    QtObject {
      property int points: 0
      property int all: 0
      property int changes: 0
      property int lock: ETracking.ELockCurrent * 10 + ECentroidAssignments.EIntersection
      property var connection: Connections {
        target: Selection
        function onSelectionChanged() { points = Selection.count([5, 6]); all = Selection.count(); ++changes }
      }
    })" );
  ASSERT_TRUE( pObject );
  EXPECT_EQ( pObject->property( "lock" ).toInt(), 34 );
  Host.Selection()->Set( ZEK::ISelectionService::EPrimary,
                         { { .Kind = ZEK::ESelectCamera, .Device = "A" },
                           { .Kind = ZEK::ESelectMarker, .Device = "S:M" },
                           { .Kind = ZEK::ESelectReconstruction, .Device = "", .Sub = 3 } } );
  EXPECT_TRUE( Host.Postal()->DrainForTest() );
  EXPECT_EQ( pObject->property( "points" ).toInt(), 2 );
  EXPECT_EQ( pObject->property( "all" ).toInt(), 3 );
  EXPECT_EQ( pObject->property( "changes" ).toInt(), 1 );
  EXPECT_TRUE( TestSupport::LogTexts( "Qml", ZEK::ELogWarning ).empty() );
}

TEST( QmlModules, SingletonsGoWithTheirEngine )
{
  const TestSupport::VTemporaryDir Folder;
  auto pHost = std::make_unique< HostServices::VHost >( Options( Folder ) );
  const auto pClock = pHost->Playback();
  HostQml::RegisterModules( *pHost );
  {
    const auto pObject =
        Make( *pHost, "import QtQml\nimport Moxel.Playback\nQtObject { property real t: Playback.tick }" );
    ASSERT_TRUE( pObject );
  }
  pHost.reset();
  // The singleton is gone with the engine; its connections must not be called.
  ASSERT_TRUE( pClock->Open( 10, 1000 ).IsOk() );
  pClock->SeekFrame( 3 );
  EXPECT_EQ( pClock->CurrentFrame(), 3 );
}
