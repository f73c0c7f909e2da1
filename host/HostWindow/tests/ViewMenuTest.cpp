#include <HostWindow/Session.h>
#include <HostWindow/ViewDriver.h>
#include <HostWindow/ViewMenu.h>
#include <HostWindow/WorkspaceDock.h>

#include <TestSupport/Paths.h>

#include <QtQml/QQmlComponent>
#include <QtQml/QQmlEngine>
#include <QtQml/QQmlPropertyMap>
#include <QtWidgets/QVBoxLayout>

#include <gmock/gmock.h>

#include <set>

namespace MoxelGraphics
{
/// Of the name by which the host knows the item of a plug-in.
class VSceneFramebufferObject : public QQuickItem
{
  Q_OBJECT
  Q_PROPERTY( QObject* sceneOptions READ Options CONSTANT )
  Q_PROPERTY( int cameraType MEMBER ViewType )
  Q_PROPERTY( int tracking MEMBER Tracking )

public:
  using QQuickItem::QQuickItem;
  QObject* Options() { return &Map; }
  Q_INVOKABLE void setOption( const QString& i_rKey, const QVariant& i_rValue ) { Map.insert( i_rKey, i_rValue ); }
  Q_INVOKABLE QVariantMap frameReport() { return { { "frames", ++Frames } }; }

  QQmlPropertyMap Map;
  int ViewType = 0;
  int Tracking = 0;
  int Frames = 0;

protected:
  void keyPressEvent( QKeyEvent* i_pEvent ) override { Keys << i_pEvent->key(); }

public:
  QList< int > Keys;
};
} // namespace MoxelGraphics

using namespace HostWindow;
using MoxelGraphics::VSceneFramebufferObject;

namespace
{
class VFakeView : public QQuickWidget
{
  Q_OBJECT

public:
  VFakeView()
  {
    auto* const pComponent = new QQmlComponent( engine(), this );
    pComponent->setData( "import QtQuick\nItem {}", {} );
    auto* const pRoot = qobject_cast< QQuickItem* >( pComponent->create() );
    pItem = new VSceneFramebufferObject( pRoot );
    for ( const char* pKey : { "FloorGrid", "FloorGridIsTranslucent", "GlobalAxis", "ReconstructionVolume" } )
    {
      pItem->Map.insert( pKey, true );
    }
    pItem->Map.insert( "ReconstructedRadius", false );
    pItem->Map.insert( "ContributionsType", 0 );
    setContent( {}, pComponent, pRoot );
  }
  Q_INVOKABLE bool selectionHasBounds() const { return bBounds; }
  Q_INVOKABLE bool selectionHasPose() const { return bPose; }

  VSceneFramebufferObject* pItem = nullptr;
  bool bBounds = false;
  bool bPose = false;

public slots:
  void OnCameraTypeChanged( int i_Index ) { pItem->ViewType = i_Index; }
};

class VFakeWindow : public HarrowPluginInterface::VWindowFrameContent,
                    public HarrowPluginInterface::IHarrowExecuteCommand
{
public:
  VFakeWindow()
    : pView( new VFakeView )
  {
    setLayout( new QVBoxLayout );
    layout()->addWidget( pView );
  }
  bool ExecuteCommand( const std::string& i_rText ) override
  {
    const QStringList Names{ "NoTracking", "TrackObjects", "TrackSelection", "TrackingLock" };
    const auto Index = Names.indexOf( QString::fromStdString( i_rText ).section( ':', 1 ) );
    const bool bCan =
        ( Index != 1 || pView->bBounds ) && ( Index != 3 || pView->bPose ) && ( Index >= 0 || pView->bBounds );
    pView->pItem->Tracking = bCan && Index >= 0 ? static_cast< int >( Index ) : pView->pItem->Tracking;
    return bCan;
  }
  VFakeView* pView;
};

class VFakeWindows : public HarrowPluginInterface::IWorkspaceContentFactory
{
public:
  void Create( std::shared_ptr< HarrowPluginInterface::VWindowFrameContent >& o_rpContent,
               const std::shared_ptr< HarrowPluginInterface::IStateCacheContext >&,
               const QPointer< QWidget >& ) override
  {
    pNewest = std::make_shared< VFakeWindow >();
    o_rpContent = pNewest;
  }
  std::shared_ptr< VFakeWindow > pNewest;
};

class ViewMenu : public testing::Test
{
protected:
  void SetUp() override
  {
    qputenv( "XDG_CONFIG_HOME", m_Folder.Path().c_str() );
    qputenv( "XDG_DATA_HOME", m_Folder.Path().c_str() );
    m_pSession = std::make_unique< VSession >( VCommonOptions() );
    m_pSession->Host().Factories()->AddFactory( "3D View", m_pFactory );
    m_pSession->GoLive();
    m_pMenu = std::make_unique< VViewMenu >(
        "View",
        [this]
        {
          return m_pActive;
        },
        nullptr );
  }
  QAction& Action( const QString& i_rText )
  {
    for ( QAction* const pAction : m_pMenu->actions() )
    {
      if ( QString( pAction->text() ).remove( '&' ) == i_rText )
      {
        return *pAction;
      }
    }
    throw std::runtime_error( "there is no action " + i_rText.toStdString() );
  }
  QStringList Checked()
  {
    QStringList Texts;
    for ( const QAction* const pAction : m_pMenu->actions() )
    {
      if ( pAction->isChecked() )
      {
        Texts << QString( pAction->text() ).remove( '&' );
      }
    }
    return Texts;
  }
  VFakeView& Fake() { return *m_pFactory->pNewest->pView; }

  TestSupport::VTemporaryDir m_Folder;
  std::shared_ptr< VFakeWindows > m_pFactory = std::make_shared< VFakeWindows >();
  std::unique_ptr< VSession > m_pSession;
  std::unique_ptr< VWorkspaceDock > m_pDock;
  VWorkspaceDock* m_pActive = nullptr;
  std::unique_ptr< VViewMenu > m_pMenu;
};
} // namespace

TEST_F( ViewMenu, ShowsTheTrueStateOfTheActiveViewAndChangesIt )
{
  for ( const QAction* const pAction : m_pMenu->actions() )
  {
    EXPECT_FALSE( pAction->isEnabled() && !pAction->isSeparator() ) << pAction->text().toStdString();
  }
  m_pDock = std::make_unique< VWorkspaceDock >( *m_pSession, "3D View" );
  m_pActive = m_pDock.get();
  emit m_pMenu->aboutToShow();
  EXPECT_EQ( Checked(), QStringList( { "Perspective", "No Tracking", "Floor Grid", "Translucent Floor", "Global Axis",
                                       "Reconstruction Volume" } ) );
  EXPECT_FALSE( Action( "Frame Selected" ).isEnabled() );
  EXPECT_FALSE( Action( "Track Objects" ).isEnabled() );
  EXPECT_FALSE( Action( "Lock to Current" ).isEnabled() );
  EXPECT_TRUE( Action( "Track Selection" ).isEnabled() );
  EXPECT_FALSE( Action( "Residual Colours" ).isEnabled() ) << "a view without that option";
  emit m_pMenu->aboutToHide();

  QStringList Refusals;
  QObject::connect( m_pMenu.get(), &VViewMenu::Refused,
                    [&]( const QString& i_rWhy )
                    {
                      Refusals << i_rWhy;
                    } );
  Action( "Track Objects" ).trigger();
  EXPECT_EQ( Refusals.size(), 1 ) << "a shortcut is told why nothing happens";
  EXPECT_TRUE( Action( "No Tracking" ).isChecked() );
  Fake().bBounds = Fake().bPose = true;
  Action( "Lock to Current" ).trigger();
  Action( "Left" ).trigger();
  Action( "Floor Grid" ).trigger();
  Action( "Recorded Radius" ).trigger();
  Action( "Camera Contributions" ).trigger();
  Action( "Home" ).trigger();
  EXPECT_EQ( Fake().pItem->Map.value( "FloorGrid" ), QVariant( false ) );
  EXPECT_EQ( Fake().pItem->Map.value( "ContributionsType" ), QVariant( 3 ) );
  EXPECT_EQ( Fake().pItem->Keys, QList< int >{ Qt::Key_Home } );
  EXPECT_EQ( Checked(), QStringList( { "Left", "Lock to Current", "Translucent Floor", "Global Axis",
                                       "Reconstruction Volume", "Recorded Radius", "Camera Contributions" } ) );
  Action( "Camera Contributions" ).trigger();
  EXPECT_EQ( Fake().pItem->Map.value( "ContributionsType" ), QVariant( 0 ) );

  // A choice sets all that it stands for, the unit of a length with the length.
  QMenu* const pLengths = Action( "Length of Trails" ).menu();
  EXPECT_FALSE( pLengths->actions()[4]->isEnabled() ) << "a view without these options";
  for ( const char* pKey : { "trialLengthPast", "trialLengthFuture", "TrailUnit" } )
  {
    Fake().pItem->Map.insert( pKey, 2 );
  }
  m_pMenu->Refresh();
  EXPECT_FALSE( pLengths->actions()[4]->isChecked() );
  pLengths->actions()[4]->trigger();
  EXPECT_TRUE( pLengths->actions()[4]->isChecked() );
  EXPECT_EQ( Fake().pItem->Map.value( "TrailUnit" ), QVariant( 1 ) );

  m_pDock->Rebuild();
  m_pMenu->Refresh();
  EXPECT_TRUE( Action( "Left" ).isChecked() ) << "another recording is seen from the same side";
  EXPECT_TRUE( Refusals.size() == 1 );
  m_pActive = nullptr;
  m_pMenu->Refresh();
  EXPECT_TRUE( Checked().isEmpty() );
}

TEST_F( ViewMenu, AViewOfCamerasHasEntriesOfItsOwnAndNoTwoKeysThatAreShownAreTheSame )
{
  const auto Shown = [this]
  {
    QStringList Texts;
    std::set< QString > Keys;
    for ( const QAction* const pAction : m_pMenu->actions() )
    {
      if ( pAction->isVisible() && !pAction->isSeparator() )
      {
        Texts << QString( pAction->text() ).remove( '&' );
        const QString Key = pAction->shortcut().toString();
        EXPECT_TRUE( Key.isEmpty() || Keys.insert( Key ).second ) << Key.toStdString();
      }
    }
    // Of the transport bar and of the plug-in.
    EXPECT_FALSE( Keys.contains( "L" ) || Keys.contains( "M" ) || Keys.contains( "Space" ) );
    return Texts;
  };
  const QStringList Only3D = Shown();
  m_pDock = std::make_unique< VWorkspaceDock >( *m_pSession, "3D View" );
  m_pActive = m_pDock.get();
  auto& rOptions = Fake().pItem->Map;
  for ( const char* pKey : { "CameraView", "Video", "CameraShowRotated" } )
  {
    rOptions.insert( pKey, true );
  }
  rOptions.insert( "CentroidColourScheme", 1 );
  m_pMenu->Refresh();
  const QStringList OnlyCameras = Shown();
  EXPECT_TRUE( OnlyCameras.contains( "Video" ) && !Only3D.contains( "Video" ) );
  EXPECT_TRUE( Only3D.contains( "Floor Grid" ) && !OnlyCameras.contains( "Floor Grid" ) );
  EXPECT_TRUE( Action( "Video" ).isChecked() );
  EXPECT_FALSE( Action( "Border" ).isEnabled() ) << "a view without that option";
  EXPECT_FALSE( Action( "Reconstruction Volume" ).isEnabled() ) << "its key is the video's here";
  Action( "Video" ).trigger();
  EXPECT_EQ( rOptions.value( "Video" ), QVariant( false ) );
  const QList< QAction* > Schemes = Action( "Centroid Colors" ).menu()->actions();
  EXPECT_TRUE( Schemes[1]->isChecked() );
  Schemes[2]->trigger();
  EXPECT_EQ( rOptions.value( "CentroidColourScheme" ), QVariant( 2 ) );
  EXPECT_FALSE( Schemes[1]->isChecked() );
}

TEST_F( ViewMenu, AScriptSelectsAndRunsCommandsAsAPersonDoes )
{
  m_pDock = std::make_unique< VWorkspaceDock >( *m_pSession, "3D View" );
  const auto pSelection = m_pSession->Host().Selection();
  VViewDriver Driver( m_pDock->View(), pSelection );
  const auto Do = [&]( const char* i_pOption, const char* i_pText, Qt::KeyboardModifiers i_Modifiers = {} )
  {
    VViewAction Action;
    EXPECT_EQ( ParseViewAction( i_pOption, i_pText, Action ), "" );
    Action.Modifiers = i_Modifiers;
    return Driver.Perform( Action );
  };
  const ZEK::VSelectionItem Marker{ ZEK::ESelectMarker, "Ada:C7", 1, 4 };
  EXPECT_EQ( Do( "--select", "@marker/1/4/Ada:C7" ), "" );
  EXPECT_EQ( Do( "--select", "vi:2", Qt::ShiftModifier ), "" );
  EXPECT_EQ( pSelection->Get( ZEK::ISelectionService::EPrimary ),
             ( ZEK::VSelection{ Marker, { ZEK::ESelectDevice, "vi:2", 0, 0 } } ) );
  EXPECT_EQ( Do( "--select", "vi:2", Qt::ControlModifier ), "" );
  EXPECT_EQ( pSelection->Get( ZEK::ISelectionService::EPrimary ), ZEK::VSelection{ Marker } );
  EXPECT_NE( Do( "--select", "@robot/1" ), "" );
  EXPECT_EQ( Do( "--select", "" ), "" );
  EXPECT_TRUE( pSelection->Get( ZEK::ISelectionService::EPrimary ).empty() );
  EXPECT_EQ( Do( "--tracking", "selection" ), "" );
  EXPECT_EQ( m_pDock->View().Tracking(), 2 );
  EXPECT_NE( Do( "--tracking", "objects" ), "" ) << "nothing is selected";
  EXPECT_EQ( Do( "--command", "Workspace3d:NoTracking" ), "" );
  EXPECT_EQ( m_pDock->View().Tracking(), 0 );
}

#include "ViewMenuTest.moc"
