#include "CameraTileData.h"

#include <HarrowGraphics/VCameraModelStateCacheDataSource.h>
#include <HarrowGraphics/VHarrowScene.h>
#include <HarrowGraphics/VSceneManager.h>
#include <HarrowGraphics/VSceneWindowContent.h>
#include <HarrowGraphics/VSceneWindowContentFactory.h>

#include <CoreMoxelTypes/FlowTypes.h>
#include <Flow2Graphics/VContributions.h>
#include <HostServices/VHost.h>
#include <HostServices/VStateJson.h>
#include <TestSupport/Calls.h>
#include <TestSupport/LogGuard.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QElapsedTimer>
#include <QtQml/QQmlComponent>
#include <QtQml/QQmlEngine>
#include <QtQuick/QQuickItem>
#include <QtWidgets/QHBoxLayout>
#include <QtWidgets/QPushButton>

#include <gmock/gmock.h>

namespace
{
using namespace CoreMoxelTypes;
using HarrowGraphics::VSceneWindowContent;

class VFakeWidgets : public HarrowPluginInterface::IWidgetService
{
public:
  void SetMaskCells( const std::string& i_rURN, const std::vector< std::uint32_t >& i_rCells,
                     std::uint8_t i_Value ) override
  {
    Done.push_back( i_rURN + ":" + std::to_string( i_rCells.size() ) + "=" + std::to_string( i_Value ) );
  }
  void ClearMask( const std::string& i_rURN ) override { Done.push_back( i_rURN + " cleared" ); }
  bool CanImportSceneMesh( const std::filesystem::path& ) const override { return false; }
  void ImportSceneMesh( const std::filesystem::path& ) override {}

  std::vector< std::string > Done;
};

class CameraWindow : public testing::Test
{
protected:
  CameraWindow()
  {
    [[maybe_unused]] static const int Registered =
        qmlRegisterType< MoxelGraphics::VSceneFramebufferObject >( "Flow2Graphics", 1, 0, "SceneFramebufferObject" );
    Host.SetWidgetService( pWidgets );
    pManager = std::make_shared< HarrowGraphics::VSceneManager >( Host.Application(), Host.Workspace() );
    pFactory = std::make_shared< HarrowGraphics::VSceneWindowContentFactory >(
        Host.Application(), Host.Workspace(), "Cameras", pManager, HarrowGraphics::EWindowKindCameras );
    Toolbar.setLayout( new QHBoxLayout );
  }

  template < typename TFlow >
  void Add( const ZEK::VFlowStateRef& i_rState, const std::string& i_rURN,
            const typename ZEK::FlowValueType< TFlow >::type& i_rValue )
  {
    ZEK::IResult Status;
    ZEK::VFlowItemRef Item;
    Host.ItemStore()->CreateItem( Status, ZEK::FlowValueType< TFlow >::Descriptor, Item );
    *ZEK::FlowMutablePayload< typename ZEK::FlowValueType< TFlow >::type >( Item.Get() ) = i_rValue;
    Item->MutableValue().SetName( ZEK::EFlowNameDevice, i_rURN );
    i_rState->AddItem( Item );
  }
  /// A state of that many cameras, "c1" and on; the third says that it is disabled.
  void ShowCameras( int i_Count )
  {
    ZEK::VFlowStateRef State;
    (void)Host.StateFactory()->CreateState( State, { ++Frame, 1, 1 }, {}, {} );
    for ( int Camera = 1; Camera <= i_Count; ++Camera )
    {
      const std::string URN = std::string( "c" ).append( std::to_string( Camera ) );
      VCameraHardware Hardware;
      Hardware.DefaultDisplayType = "Wide";
      Hardware.SensorWidth = 1280;
      Hardware.SensorHeight = 1024;
      Hardware.Video = Camera == 2;
      Add< FlowCameraHardware >( State, URN, Hardware );
      VCameraSettings Settings;
      Settings.Values = { { "UserId", std::int64_t{ Camera } }, { "Enabled", Camera != 3 } };
      Add< FlowCameraSettings >( State, URN, Settings );
    }
    EXPECT_TRUE( Host.Contexts()->LiveCache()->Add( State ).IsOk() );
  }
  std::shared_ptr< VSceneWindowContent > Open()
  {
    std::shared_ptr< HarrowPluginInterface::VWindowFrameContent > pContent;
    pFactory->Create( pContent, Host.Contexts()->Find( "Live" ), &Toolbar );
    pContent->resize( 900, 600 );
    pContent->show();
    return std::dynamic_pointer_cast< VSceneWindowContent >( pContent );
  }
  static bool WaitFor( const std::function< bool() >& i_rDone )
  {
    QElapsedTimer Timer;
    for ( Timer.start(); !i_rDone() && Timer.elapsed() < 20'000; )
    {
      QCoreApplication::processEvents( QEventLoop::AllEvents, 10 );
    }
    return i_rDone();
  }
  static QList< QQuickItem* > Tiles( VSceneWindowContent& i_rContent )
  {
    QList< QQuickItem* > Found;
    for ( QQuickItem* const pItem :
          i_rContent.SceneWidget().rootObject()->findChild< QQuickItem* >( "tiles" )->childItems() )
    {
      if ( pItem->property( "tileDeviceURN" ).isValid() )
      {
        Found << pItem;
      }
    }
    return Found;
  }
  void Select( ZEK::VSelection i_Items )
  {
    Host.Selection()->Set( ZEK::ISelectionService::EPrimary, std::move( i_Items ) );
  }
  QPushButton& Button( const char* i_pName )
  {
    auto* const pButton = Toolbar.findChild< QPushButton* >( i_pName );
    EXPECT_NE( pButton, nullptr ) << i_pName;
    return *pButton;
  }

  HostServices::VHost Host;
  QWidget Toolbar;
  std::int64_t Frame = 0;
  std::shared_ptr< VFakeWidgets > pWidgets = std::make_shared< VFakeWidgets >();
  std::shared_ptr< HarrowGraphics::VSceneManager > pManager;
  std::shared_ptr< HarrowGraphics::VSceneWindowContentFactory > pFactory;
};
} // namespace

TEST_F( CameraWindow, OverlaysStandOverTheirTilesAndHideWhatHasNoRoom )
{
  ShowCameras( 4 );
  const auto pContent = Open();
  auto& rGrid = pContent->SceneWidget().CameraGrid();
  ASSERT_TRUE( WaitFor(
      [&]
      {
        return Tiles( *pContent ).size() == 4;
      } ) );
  EXPECT_TRUE( pContent->SceneWidget().SceneItem()->Options().CameraView );
  EXPECT_FALSE( pContent->SceneWidget().SceneItem()->Options().Show3DOverlay );
  QStringList Numbers, Marks;
  for ( int Row = 0; Row < 4; ++Row )
  {
    QQuickItem& rTile = *Tiles( *pContent )[Row];
    EXPECT_EQ( QRectF( rTile.position(), rTile.size() ),
               rGrid.data( rGrid.index( Row ), MoxelGraphics::VCameraGrid::TileRect ).toRectF() );
    Numbers << rTile.property( "number" ).toString();
    Marks << rTile.property( "mark" ).toString();
  }
  EXPECT_EQ( Numbers, QStringList( { "1", "3", "4", "2" } ) ) << "video after the others";
  EXPECT_EQ( Marks, QStringList( { "", "", "", "VIDEO" } ) );
  const auto Complete = [&]( int i_Row )
  {
    return Tiles( *pContent )[i_Row]->property( "summary" ).toString();
  };
  EXPECT_THAT( Complete( 1 ).toStdString(), testing::HasSubstr( "Camera is disabled." ) );
  EXPECT_THAT( Complete( 0 ).toStdString(), testing::HasSubstr( "Camera is uncalibrated." ) );

  // Nothing that is shown stands over the edge of its tile, however small that is.
  for ( const int Count : { 12, 128 } )
  {
    ShowCameras( Count );
    ASSERT_TRUE( WaitFor(
        [&]
        {
          return Tiles( *pContent ).size() == Count;
        } ) );
    // Warnings are laid out a little after their tiles.
    WaitFor(
        [&]
        {
          const auto All = Tiles( *pContent );
          return std::none_of( All.begin(), All.end(),
                               []( const QQuickItem* i_pTile )
                               {
                                 const auto Parts = i_pTile->childItems();
                                 return std::any_of( Parts.begin(), Parts.end(),
                                                     []( const QQuickItem* i_pPart )
                                                     {
                                                       return i_pPart->isVisible() && i_pPart->size().isNull();
                                                     } );
                               } );
        } );
    for ( QQuickItem* const pTile : Tiles( *pContent ) )
    {
      for ( QQuickItem* const pPart : pTile->childItems() )
      {
        const QRectF Part( pPart->position(),
                           QSizeF( std::max( pPart->width(), pPart->implicitWidth() ), pPart->height() ) );
        EXPECT_TRUE( !pPart->isVisible() || QRectF( QPointF(), pTile->size() ).contains( Part ) )
            << Count << " " << pPart->metaObject()->className();
      }
    }
  }
  EXPECT_TRUE( TestSupport::LogTexts( "Qml", ZEK::ELogWarning ).empty() );
}

TEST_F( CameraWindow, SelectionShowsCamerasAndPinnedOnesStay )
{
  ShowCameras( 4 );
  const auto pContent = Open();
  auto& rGrid = pContent->SceneWidget().CameraGrid();
  const auto Count = [&]( int i_Count )
  {
    return WaitFor(
        [&]
        {
          return Tiles( *pContent ).size() == i_Count;
        } );
  };
  ASSERT_TRUE( Count( 4 ) );
  EXPECT_FALSE( Button( "MaskPaint" ).isEnabled() );
  EXPECT_EQ( Button( "MaskEraseAll" ).toolTip(),
             "Erase entire mask (Mask editing disabled when multiple cameras selected)" );
  Select( { { ZEK::ESelectDevice, "c3", 0, 0 } } );
  ASSERT_TRUE( Count( 1 ) );
  EXPECT_TRUE( Tiles( *pContent )[0]->property( "selected" ).toBool() );
  EXPECT_TRUE( Button( "MaskPaint" ).isEnabled() );
  EXPECT_EQ( Button( "MaskPaint" ).toolTip(), "Paint mask on selected area" );
  Button( "PinCameras" ).click();
  Select( {} );
  WaitFor(
      [&]
      {
        return !Button( "MaskPaint" ).isEnabled();
      } );
  ASSERT_EQ( Tiles( *pContent ).size(), 1 );
  EXPECT_FALSE( Tiles( *pContent )[0]->property( "selected" ).toBool() );
  EXPECT_EQ( rGrid.Tiles()[0].DeviceURN, "c3" );
  Button( "PinCameras" ).click();
  EXPECT_TRUE( Count( 4 ) );
}

TEST_F( CameraWindow, CommandsMaskTheSelectedCellsOfTheOneSelectedCamera )
{
  ShowCameras( 4 );
  const auto pContent = Open();
  ASSERT_TRUE( WaitFor(
      [&]
      {
        return Tiles( *pContent ).size() == 4;
      } ) );
  const auto Cell = []( const char* i_pURN, std::uint32_t i_Cell )
  {
    return ZEK::VSelectionItem{ ZEK::ESelectMaskCell, i_pURN, 0, i_Cell };
  };
  const ZEK::VSelectionItem C1{ ZEK::ESelectDevice, "c1", 0, 0 }, C2{ ZEK::ESelectDevice, "c2", 0, 0 };
  Select( { C1, C2, Cell( "c1", 5 ) } );
  EXPECT_TRUE( pContent->ExecuteCommand( "WorkspaceCamera:MaskPaint" ) );
  EXPECT_TRUE( pContent->ExecuteCommand( "WorkspaceCamera:MaskEraseAll" ) );
  EXPECT_TRUE( pWidgets->Done.empty() ) << "which camera was meant is not known";
  Select( { C1, Cell( "c1", 5 ), Cell( "c2", 6 ), Cell( "c1", 7 ) } );
  for ( const char* pCommand : { "MaskPaint", "MaskErase", "MaskEraseAll" } )
  {
    EXPECT_TRUE( pContent->ExecuteCommand( std::string( "WorkspaceCamera:" ).append( pCommand ) ) );
  }
  EXPECT_EQ( pWidgets->Done, ( std::vector< std::string >{ "c1:2=255", "c1:2=0", "c1 cleared" } ) );
  EXPECT_TRUE( pContent->ExecuteCommand( "WorkspaceCamera:DisableGreyscale" ) );
  EXPECT_FALSE( pContent->SceneWidget().SceneItem()->Options().CameraGreyscale );
  EXPECT_FALSE( pContent->ExecuteCommand( "Workspace3d:TrackSelection" ) );
  EXPECT_FALSE( pContent->ExecuteCommand( "Workspace3d:FrameSelected" ) );
  EXPECT_FALSE( pContent->ExecuteCommand( "WorkspaceCamera:MaskPaint " ) );
}

TEST_F( CameraWindow, ZoomPanAndPinnedCamerasComeBackAndWhatIsMissingIsAsInANewWindow )
{
  ShowCameras( 4 );
  QJsonObject Saved;
  {
    const auto pContent = Open();
    auto& rGrid = pContent->SceneWidget().CameraGrid();
    ASSERT_TRUE( WaitFor(
        [&]
        {
          return rGrid.Count() == 4;
        } ) );
    rGrid.RestoreViews( { { "c2", QVariantMap{ { "zoom", 4.0 }, { "panX", 0.25 }, { "panY", 0.75 } } } } );
    rGrid.SetPinnedCameras( { "c2", "c4" } );
    pContent->SceneWidget().SceneItem()->setOption( "CameraBorder", true );
    HostServices::VStateJsonWriter Writer;
    pContent->SaveState( Writer, "View" );
    Saved = Writer.Object();
  }
  const auto pContent = Open();
  auto& rGrid = pContent->SceneWidget().CameraGrid();
  pContent->RestoreState( HostServices::VStateJsonReader( Saved ), "View" );
  ASSERT_TRUE( WaitFor(
      [&]
      {
        return rGrid.Count() == 2;
      } ) );
  const MoxelGraphics::VCameraTile& rTile = rGrid.Tiles()[1];
  EXPECT_EQ( rTile.DeviceURN, "c2" );
  EXPECT_FLOAT_EQ( rTile.Zoom, 4 );
  EXPECT_FLOAT_EQ( rTile.PanX, 0.25F );
  EXPECT_FLOAT_EQ( rTile.PanY, 0.75F );
  EXPECT_TRUE( Button( "PinCameras" ).isChecked() );
  EXPECT_TRUE( pContent->SceneWidget().SceneItem()->Options().CameraBorder );

  Saved = { { "ViewPinned", 5 }, { "ViewViews", "no JSON" } };
  pContent->RestoreState( HostServices::VStateJsonReader( Saved ), "View" );
  EXPECT_EQ( rGrid.Count(), 4 );
  EXPECT_FALSE( Button( "PinCameras" ).isChecked() );
  EXPECT_TRUE( rGrid.SaveViews().isEmpty() );
  MoxelGraphics::VSceneOptions Expected;
  Expected.CameraView = true;
  Expected.Show3DOverlay = false;
  EXPECT_TRUE( pContent->SceneWidget().SceneItem()->Options() == Expected );
  EXPECT_EQ( TestSupport::LogTexts( "HarrowGraphics", ZEK::ELogWarning ).size(), 1u );
}

TEST_F( CameraWindow, TheHealthOfCamerasIsReadOnceForEachChange )
{
  const auto pSource = pManager->ForContext( Host.Contexts()->Find( "Live" ) ).pCameraData;
  TestSupport::VCalls Changed( pSource->Changed() );
  EXPECT_TRUE( pSource->AdditionalData( "c1" ).isEmpty() );
  ShowCameras( 2 );
  ShowCameras( 3 );
  ASSERT_TRUE( WaitFor(
      [&]
      {
        return !pSource->AdditionalData( "c3" ).isEmpty();
      } ) );
  EXPECT_EQ( pSource->AdditionalData( "c3" )["isEnabled"], false );
  EXPECT_EQ( pSource->AdditionalData( "c1" )["isEnabled"], true );
  EXPECT_TRUE( pSource->AdditionalData( "c4" ).isEmpty() );
  EXPECT_EQ( Changed.Take(), 1 );
  // Other values with the same content are no change; the fourth camera is.
  ShowCameras( 3 );
  ShowCameras( 4 );
  ASSERT_TRUE( WaitFor(
      [&]
      {
        return !pSource->AdditionalData( "c4" ).isEmpty();
      } ) );
  EXPECT_EQ( Changed.Take(), 1 );
}

TEST( CameraTileData, TellsWhatItemsSayAndNothingElse )
{
  VCameraSettings Settings;
  Settings.Values = {
      { "Connected", false }, { "Missing", std::string( "no bool" ) }, { "SensorMode", std::string( "Bin 2" ) } };
  VCameraCalibrationHealth Health;
  Health.AvgReprojectionError = 0.1;
  Health.NumResiduals = 12;
  const VCameraCalibrationDetails Details{ 20, 30, false, 0 };
  const VCameraPhysicalStatus Status{ true, 0, 0 };
  VCameraPhysicalSensorData Sensor;
  Sensor.Temperature = 36;
  const VDeviceWarnings Warnings{ 1u << 3 | 1u << 7 };
  const QVariantMap Data =
      HarrowGraphics::CameraTileData( { &Settings, nullptr, &Health, &Details, &Status, &Sensor, &Warnings }, nullptr );
  const std::pair< const char*, QVariant > Expected[] = { { "isCalibrated", false },
                                                          { "isConnected", false },
                                                          { "isMissing", false },
                                                          { "isContributing", true },
                                                          { "isBumped", true },
                                                          { "sensorMode", "Bin 2" },
                                                          { "numResiduals", 12 },
                                                          { "isCurrentTemperatureConsistentWithCalibration", false },
                                                          { "wasTemperatureConsistentDuringCalibration", false },
                                                          { "badSyncWarningText", "Bad sync." },
                                                          { "ipSettingsText", "IP settings do not fit." },
                                                          { "timecodeErrorWarningText", "" } };
  for ( const auto& [pKey, rValue] : Expected )
  {
    EXPECT_EQ( Data[pKey], rValue ) << pKey;
  }
  // The colour depends on the error alone, and is that of an error anywhere else.
  const auto Colour = []( double i_Error )
  {
    VCameraCalibrationHealth One;
    One.AvgReprojectionError = i_Error;
    return HarrowGraphics::CameraTileData( { nullptr, nullptr, &One }, nullptr )["avgReprojectionErrorColor"]
        .value< QColor >();
  };
  EXPECT_EQ( Colour( 0 ), QColor( 0x40, 0xC0, 0x48 ) );
  EXPECT_EQ( Colour( 1 ), QColor( 0xF0, 0xD0, 0x30 ) );
  EXPECT_EQ( Colour( 1e9 ), QColor( 0xE0, 0x38, 0x30 ) );
  EXPECT_FALSE( Colour( std::nan( "" ) ).isValid() );
  EXPECT_FALSE( HarrowGraphics::CameraTileData( {}, nullptr ).contains( "currentTemperature" ) );
}

TEST( SceneContributions, RowsAreWatchedWhileTheListIsOpenAndNothingOnceItIsGone )
{
  Flow2Graphics::VContributions First( nullptr ), Second( nullptr );
  const auto Watched = []( const Flow2Graphics::VContributions& i_rOf )
  {
    return std::pair( i_rOf.IsWatched(), i_rOf.AreRowsWatched() );
  };
  QQmlEngine Engine;
  QQmlComponent Component( &Engine, QUrl( "qrc:/SceneContributions.qml" ) );
  std::unique_ptr< QObject > pList( Component.create() );
  ASSERT_TRUE( pList ) << Component.errorString().toStdString();
  for ( int Round = 0; Round < 2; ++Round )
  {
    pList->setProperty( "contributions", QVariant::fromValue< QObject* >( &First ) );
    EXPECT_EQ( Watched( First ), std::pair( true, false ) );
    pList->setProperty( "open", true );
    EXPECT_EQ( Watched( First ), std::pair( true, true ) );
    pList->setProperty( "contributions", QVariant::fromValue< QObject* >( &Second ) );
    EXPECT_EQ( Watched( First ), std::pair( false, false ) );
    EXPECT_EQ( Watched( Second ), std::pair( true, true ) );
    pList->setProperty( "open", false );
    EXPECT_EQ( Watched( Second ), std::pair( true, false ) );
  }
  pList->setProperty( "open", true );
  pList.reset();
  EXPECT_EQ( Watched( Second ), std::pair( false, false ) );
}
