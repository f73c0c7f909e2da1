#include <HostWindow/ViewMenu.h>

#include <HostWindow/ViewAction.h>
#include <HostWindow/WorkspaceDock.h>

#include <QtCore/QCoreApplication>
#include <QtGui/QKeyEvent>

namespace HostWindow
{
namespace
{
constexpr int AllContributions = 3;
const QString CentroidColours = "CentroidColourScheme";

bool IsOn( const QVariant& i_rValue )
{
  return i_rValue.toDouble() != 0;
}
} // namespace

VViewMenu::VViewMenu( const QString& i_rTitle, std::function< VWorkspaceDock*() > i_ActiveDock, QWidget* i_pParent )
  : QMenu( i_rTitle, i_pParent )
  , m_ActiveDock( std::move( i_ActiveDock ) )
  , m_ViewTypes( this )
  , m_Tracking( this )
  , m_CentroidColours( this )
{
  setToolTipsVisible( true );
  AddViewTypes();
  m_For3D = actions() << addSeparator();
  AddCamera();
  addSeparator();
  const QList< QAction* > Before = actions();
  AddTracking();
  addSeparator();
  AddToggles();
  for ( QAction* const pAction : actions().mid( Before.size() ) )
  {
    m_For3D << pAction;
  }
  m_For3D << m_ForBounds.front();
  const QList< QAction* > All3D = actions();
  AddCameraToggles();
  m_ForCameras = actions().mid( All3D.size() );
  connect( this, &QMenu::aboutToShow, this,
           [this]
           {
             Refresh();
             ShowConditions( true );
           } );
  connect( this, &QMenu::aboutToHide, this,
           [this]
           {
             ShowConditions( false );
           } );
  Refresh();
}

void VViewMenu::AddViewTypes()
{
  for ( int Index = 0; Index < ViewTypeNames().size(); ++Index )
  {
    QAction* const pAction = addAction( ViewTypeNames()[Index], this,
                                        [this, Index]
                                        {
                                          if ( VWorkspaceDock* const pDock = m_ActiveDock() )
                                          {
                                            pDock->SetViewType( Index );
                                          }
                                          Refresh();
                                        } );
    pAction->setShortcut( QKeySequence( Qt::Key_1 + Index ) );
    pAction->setCheckable( true );
    m_ViewTypes.addAction( pAction );
    m_ForView << pAction;
  }
}

void VViewMenu::AddCamera()
{
  m_ForBounds << AddCommand( tr( "&Frame Selected" ), Qt::Key_F, "Workspace3d:FrameSelected",
                             tr( "Nothing is selected that could fill the view, or the view is locked" ) );
  QAction* const pHome = addAction( tr( "&Home" ), this,
                                    [this]
                                    {
                                      VWorkspaceDock* const pDock = m_ActiveDock();
                                      if ( QQuickItem* const pItem = pDock ? pDock->View().Item() : nullptr )
                                      {
                                        for ( const QEvent::Type Type : { QEvent::KeyPress, QEvent::KeyRelease } )
                                        {
                                          QKeyEvent Event( Type, Qt::Key_Home, Qt::NoModifier );
                                          QCoreApplication::sendEvent( pItem, &Event );
                                        }
                                      }
                                    } );
  pHome->setShortcut( Qt::Key_Home );
  pHome->setToolTip( tr( "Return to the view of the start; in a view of cameras, show every image whole again" ) );
  m_ForView << pHome;
}

void VViewMenu::AddTracking()
{
  // In the order of what a view answers for its tracking.
  struct VRow
  {
    QString Text;
    QKeySequence Key;
    const char* pCommand;
    QString ToolTip;
  };
  const VRow Rows[] = {
      { tr( "&No Tracking" ), Qt::SHIFT | Qt::Key_N, "Workspace3d:NoTracking", tr( "The camera stays where it is" ) },
      { tr( "Track &Objects" ), Qt::SHIFT | Qt::Key_T, "Workspace3d:TrackObjects",
        tr( "The camera follows what is selected now, whatever is selected later" ) },
      { tr( "Track &Selection" ), Qt::Key_T, "Workspace3d:TrackSelection",
        tr( "The camera follows whatever is selected" ) },
      { tr( "&Lock to Current" ), Qt::SHIFT | Qt::Key_L, "Workspace3d:TrackingLock",
        tr( "The camera rides on the selected object" ) } };
  for ( const VRow& rRow : Rows )
  {
    QAction* const pAction =
        AddCommand( rRow.Text, rRow.Key, rRow.pCommand, tr( "Nothing is selected that a camera could follow" ) );
    pAction->setToolTip( rRow.ToolTip );
    pAction->setCheckable( true );
    m_Tracking.addAction( pAction );
  }
  m_ForBounds << m_Tracking.actions()[1];
  m_pLock = m_Tracking.actions()[3];
}

void VViewMenu::AddToggle( const QString& i_rText, const QKeySequence& i_rKey, const QString& i_rOption, QVariant i_On,
                           QVariant i_Off )
{
  const qsizetype Index = m_Toggles.size();
  QAction* const pAction = addAction( i_rText, this,
                                      [this, Index]
                                      {
                                        Toggle( m_Toggles[Index] );
                                      } );
  pAction->setCheckable( true );
  pAction->setShortcut( i_rKey );
  m_Toggles.push_back( { pAction, i_rOption, std::move( i_On ), std::move( i_Off ) } );
}

void VViewMenu::AddToggles()
{
  AddToggle( tr( "Floor &Grid" ), Qt::Key_G, "FloorGrid" );
  AddToggle( tr( "Translucent Floor" ), {}, "FloorGridIsTranslucent" );
  AddToggle( tr( "Global A&xis" ), Qt::Key_X, "GlobalAxis" );
  AddToggle( tr( "Reconstruction &Volume" ), Qt::Key_V, "ReconstructionVolume" );
  AddToggle( tr( "&Recorded Radius" ), Qt::Key_R, "ReconstructedRadius" );
  AddToggle( tr( "Residual &Colours" ), Qt::Key_C, "ReconstructionResiduals" );
  AddToggle( tr( "Camera Contri&butions" ), Qt::Key_B, "ContributionsType", AllContributions, 0 );
  addSeparator();
  AddNames();
}

void VViewMenu::AddNames()
{
  AddToggle( tr( "&Names" ), Qt::Key_N, "SubjectNames" );
  AddToggle( tr( "Mar&ker Names" ), Qt::Key_K, "MarkerNames" );
  AddChoices( tr( "Si&ze of Names" ), { { tr( "Small" ), { { "LabelSize", 11 } } },
                                        { tr( "Normal" ), { { "LabelSize", 13 } } },
                                        { tr( "Large" ), { { "LabelSize", 18 } } },
                                        { tr( "Huge" ), { { "LabelSize", 26 } } } } );
  AddChoices( tr( "N&umber of Names" ), { { tr( "The 60 Nearest" ), { { "LabelLimit", 60 } } },
                                          { tr( "The 150 Nearest" ), { { "LabelLimit", 150 } } },
                                          { tr( "The 1000 Nearest" ), { { "LabelLimit", 1000 } } } } );
  AddChoices( tr( "&Distance of Names" ), { { tr( "Up to 5 m" ), { { "LabelDistance", 5000 } } },
                                            { tr( "Up to 20 m" ), { { "LabelDistance", 20000 } } },
                                            { tr( "However Far" ), { { "LabelDistance", 0 } } } } );
  AddToggle( tr( "Marker Trail&s" ), Qt::Key_J, "MarkerTrails" );
  const auto Length = []( int i_Length, int i_Unit )
  {
    return QVariantMap{ { "trialLengthPast", i_Length }, { "trialLengthFuture", i_Length }, { "TrailUnit", i_Unit } };
  };
  AddChoices( tr( "&Length of Trails" ), { { tr( "10 Frames to Each Side" ), Length( 10, 0 ) },
                                           { tr( "30 Frames to Each Side" ), Length( 30, 0 ) },
                                           { tr( "100 Frames to Each Side" ), Length( 100, 0 ) },
                                           { tr( "1 Second to Each Side" ), Length( 1, 1 ) },
                                           { tr( "2 Seconds to Each Side" ), Length( 2, 1 ) },
                                           { tr( "5 Seconds to Each Side" ), Length( 5, 1 ) } } );
  AddToggle( tr( "Ring about the Current &Marker" ), Qt::Key_A, "ActiveLabelHalo" );
}

void VViewMenu::AddChoices( const QString& i_rTitle, const QList< std::pair< QString, QVariantMap > >& i_rChoices )
{
  QMenu* const pMenu = addMenu( i_rTitle );
  m_ForView << pMenu->menuAction();
  for ( const auto& [Text, Options] : i_rChoices )
  {
    const qsizetype Index = m_Choices.size();
    QAction* const pAction = pMenu->addAction( Text, this,
                                               [this, Index]
                                               {
                                                 Choose( m_Choices[Index] );
                                               } );
    pAction->setCheckable( true );
    m_Choices.push_back( { pAction, Options } );
  }
}

void VViewMenu::AddCameraToggles()
{
  AddToggle( tr( "&Video" ), Qt::Key_V, "Video" );
  AddToggle( tr( "&Border" ), Qt::Key_B, "CameraBorder" );
  AddToggle( tr( "&Mask" ), Qt::Key_K, "CameraMaskGrid" );
  addSeparator();
  AddToggle( tr( "Show &Orientation" ), Qt::Key_O, "CameraShowRotated" );
  AddToggle( tr( "&Snap to 90°" ), Qt::Key_S, "CameraSnap90Degrees" );
  addSeparator();
  AddToggle( tr( "&Grayscale" ), Qt::Key_G, "CameraGreyscale" );
  AddToggle( tr( "Ma&ximize Grayscale" ), Qt::Key_X, "CameraMaximiseGreyscale" );
  AddToggle( tr( "&Centroids" ), Qt::Key_C, "CameraCentroids" );
  AddCentroidColours();
  AddToggle( tr( "Camera &Wand Smear" ), Qt::Key_W, "CameraWandSmear" );
  addSeparator();
  AddToggle( tr( "&3D" ), Qt::Key_3, "3D" );
  AddToggle( tr( "&Distort 3D" ), Qt::Key_D, "Distort3D" );
}

void VViewMenu::AddCentroidColours()
{
  QMenu* const pMenu = addMenu( tr( "Centroid Co&lors" ) );
  for ( const QString& rText : { tr( "&Connection" ), tr( "&Generator" ), tr( "&Marker" ) } )
  {
    const auto Scheme = static_cast< int >( m_CentroidColours.actions().size() );
    QAction* const pAction = pMenu->addAction( rText, this,
                                               [this, Scheme]
                                               {
                                                 if ( VWorkspaceDock* const pDock = m_ActiveDock() )
                                                 {
                                                   pDock->View().SetOption( CentroidColours, Scheme );
                                                 }
                                                 Refresh();
                                               } );
    pAction->setCheckable( true );
    m_CentroidColours.addAction( pAction );
  }
}

QAction* VViewMenu::AddCommand( const QString& i_rText, const QKeySequence& i_rKey, const char* i_pCommand,
                                const QString& i_rRefusal )
{
  QAction* const pAction = addAction( i_rText, this,
                                      [this, i_pCommand, i_rRefusal]
                                      {
                                        Run( i_pCommand, i_rRefusal );
                                      } );
  pAction->setShortcut( i_rKey );
  m_ForView << pAction;
  return pAction;
}

void VViewMenu::Run( const char* i_pCommand, const QString& i_rRefusal )
{
  VWorkspaceDock* const pDock = m_ActiveDock();
  if ( pDock && !pDock->View().ExecuteCommand( i_pCommand ) )
  {
    emit Refused( i_rRefusal );
  }
  Refresh();
}

void VViewMenu::Toggle( const VToggle& i_rToggle )
{
  if ( VWorkspaceDock* const pDock = m_ActiveDock() )
  {
    VSceneView View = pDock->View();
    View.SetOption( i_rToggle.Key, IsOn( View.Option( i_rToggle.Key ) ) ? i_rToggle.Off : i_rToggle.On );
  }
  Refresh();
}

void VViewMenu::Choose( const VChoice& i_rChoice )
{
  if ( VWorkspaceDock* const pDock = m_ActiveDock() )
  {
    VSceneView View = pDock->View();
    for ( auto It = i_rChoice.Options.begin(); It != i_rChoice.Options.end(); ++It )
    {
      View.SetOption( It.key(), It.value() );
    }
  }
  Refresh();
}

void VViewMenu::Refresh()
{
  VWorkspaceDock* const pDock = m_ActiveDock();
  const VSceneView View = pDock ? pDock->View() : VSceneView();
  for ( QAction* const pAction : m_ForView )
  {
    pAction->setEnabled( View.Item() != nullptr );
  }
  const auto Check = []( const QActionGroup& i_rGroup, int i_Index )
  {
    for ( int Index = 0; Index < i_rGroup.actions().size(); ++Index )
    {
      i_rGroup.actions()[Index]->setChecked( Index == i_Index );
    }
  };
  ShowFor( View.Option( "CameraView" ).toBool() );
  Check( m_ViewTypes, View.ViewType() );
  Check( m_CentroidColours, View.Item() ? View.Option( CentroidColours ).toInt() : -1 );
  Check( m_Tracking, View.Tracking() );
  if ( !View.TrackingSupported() )
  {
    m_Tracking.setVisible( false );
  }
  const QStringList Keys = View.OptionKeys();
  for ( const VToggle& rToggle : m_Toggles )
  {
    const bool bKnown = Keys.contains( rToggle.Key );
    rToggle.pAction->setEnabled( bKnown );
    rToggle.pAction->setChecked( bKnown && IsOn( View.Option( rToggle.Key ) ) );
  }
  for ( const VChoice& rChoice : m_Choices )
  {
    bool bKnown = true, bChosen = true;
    for ( auto It = rChoice.Options.begin(); It != rChoice.Options.end(); ++It )
    {
      bKnown = bKnown && Keys.contains( It.key() );
      bChosen = bChosen && bKnown && View.Option( It.key() ).toDouble() == It.value().toDouble();
    }
    rChoice.pAction->setEnabled( bKnown );
    rChoice.pAction->setChecked( bChosen );
  }
}

void VViewMenu::ShowFor( bool i_bCameraView )
{
  // An action that is not shown has no shortcut either, so both kinds of view may use the same keys.
  for ( QAction* const pAction : m_For3D )
  {
    pAction->setVisible( !i_bCameraView );
  }
  for ( QAction* const pAction : m_ForCameras )
  {
    pAction->setVisible( i_bCameraView );
  }
}

void VViewMenu::ShowConditions( bool i_bExact )
{
  // While the menu is closed its shortcuts try, because nobody tells it when the selection changes.
  VWorkspaceDock* const pDock = m_ActiveDock();
  const VSceneView View = pDock ? pDock->View() : VSceneView();
  const bool bView = View.Item() != nullptr;
  const bool bBounds = bView && ( !i_bExact || View.SelectionHasBounds() );
  for ( QAction* const pAction : m_ForBounds )
  {
    pAction->setEnabled( bBounds );
  }
  m_pLock->setEnabled( bView && ( !i_bExact || View.SelectionHasPose() ) );
}

} // namespace HostWindow
