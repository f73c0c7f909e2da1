#include <HostQml/Modules.h>

#include <HostServices/VHost.h>

#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>

#include <QtQml/QQmlComponent>
#include <QtQml/QQmlEngine>

#include <gtest/gtest.h>

namespace
{
class QmlModules : public testing::Test
{
protected:
  std::unique_ptr< HostServices::VHost > NewHost() const
  {
    auto pHost = std::make_unique< HostServices::VHost >(
        HostServices::VHostOptions{ .ContentRoot = m_Folder.Path(),
                                    .UserRoot = m_Folder.Path(),
                                    .Preferences = m_Folder.Path() / "preferences.json",
                                    .Now = []
                                    {
                                      return std::int64_t{ 0 };
                                    } } );
    HostQml::RegisterModules( *pHost );
    return pHost;
  }

  static std::unique_ptr< QObject > Make( HostServices::VHost& i_rHost, const char* i_pDocument )
  {
    QQmlComponent Component( i_rHost.Quick()->Engine() );
    Component.setData( i_pDocument, QUrl( QStringLiteral( "qrc:/test.qml" ) ) );
    std::unique_ptr< QObject > pObject( Component.create() );
    EXPECT_TRUE( pObject ) << Component.errorString().toStdString();
    return pObject;
  }

  const TestSupport::VTemporaryDir m_Folder;
  const std::unique_ptr< HostServices::VHost > m_pHost = NewHost();
};
} // namespace

TEST_F( QmlModules, PlaybackFollowsAndMovesTheClockOfItsOwnHost )
{
  // A second host in the process must not answer for the first.
  const auto pSecond = NewHost();
  HostServices::VHost& rSecond = *pSecond;
  HostQml::RegisterModules( *m_pHost );
  ASSERT_TRUE( rSecond.Playback()->Open( 100, 1000 ).IsOk() );
  const auto pObject = Make( rSecond, R"(
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
  EXPECT_EQ( rSecond.Playback()->CurrentFrame(), 4 );
  EXPECT_EQ( m_pHost->Playback()->CurrentTick(), 0 );
  rSecond.Playback()->Play();
  rSecond.Playback()->SeekFrame( 7 );
  EXPECT_TRUE( rSecond.Postal()->DrainForTest() );
  EXPECT_EQ( pObject->property( "tick" ).toLongLong(), 7000 );
  EXPECT_TRUE( pObject->property( "playing" ).toBool() );
}

TEST_F( QmlModules, SelectionCountsKindsAndSignals )
{
  HostServices::VHost& rHost = *m_pHost;
  const auto pObject = Make( rHost, R"(
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
  rHost.Selection()->Set( ZEK::ISelectionService::EPrimary,
                          { { .Kind = ZEK::ESelectDevice, .Device = "A" },
                            { .Kind = ZEK::ESelectMarker, .Device = "S:M" },
                            { .Kind = ZEK::ESelectReconstruction, .Device = "", .Sub = 3 } } );
  EXPECT_TRUE( rHost.Postal()->DrainForTest() );
  EXPECT_EQ( pObject->property( "points" ).toInt(), 2 );
  EXPECT_EQ( pObject->property( "all" ).toInt(), 3 );
  EXPECT_EQ( pObject->property( "changes" ).toInt(), 1 );
  EXPECT_TRUE( TestSupport::LogTexts( "Qml", ZEK::ELogWarning ).empty() );
}

TEST_F( QmlModules, SingletonsGoWithTheirEngine )
{
  auto pHost = NewHost();
  const auto pClock = pHost->Playback();
  ASSERT_TRUE( Make( *pHost, "import QtQml\nimport Moxel.Playback\nQtObject { property real t: Playback.tick }" ) );
  pHost.reset();
  // The singleton is gone with the engine; its connections must not be called.
  ASSERT_TRUE( pClock->Open( 10, 1000 ).IsOk() );
  pClock->SeekFrame( 3 );
  EXPECT_EQ( pClock->CurrentFrame(), 3 );
}
