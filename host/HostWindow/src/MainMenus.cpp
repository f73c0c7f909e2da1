#include <HostWindow/MainWindow.h>

#include <QtCore/QFileInfo>
#include <QtGui/QAction>
#include <QtWidgets/QApplication>
#include <QtWidgets/QMenu>
#include <QtWidgets/QMenuBar>
#include <QtWidgets/QMessageBox>
#include <QtWidgets/QStatusBar>

namespace HostWindow
{

void VMainWindow::MakeMenus()
{
  MakeFileMenu();
  QMenu* pEdit = menuBar()->addMenu( tr( "&Edit" ) );
  QUndoStack& rUndo = m_rSession.Host().Undo().Stack();
  QAction* pUndo = rUndo.createUndoAction( pEdit, tr( "&Undo" ) );
  pUndo->setShortcut( QKeySequence::Undo );
  QAction* pRedo = rUndo.createRedoAction( pEdit, tr( "&Redo" ) );
  pRedo->setShortcut( QKeySequence::Redo );
  pEdit->addActions( { pUndo, pRedo } );
  pEdit->addSeparator();
  QAction* pPreferences = pEdit->addAction( tr( "Pre&ferences…" ), this, &VMainWindow::ShowPreferences );
  pPreferences->setShortcut( QKeySequence( Qt::CTRL | Qt::Key_Comma ) );
  pPreferences->setMenuRole( QAction::PreferencesRole );
  MakeViewMenu();
  MakePlaybackMenu();
  m_pWindowMenu = menuBar()->addMenu( tr( "&Window" ) );
  connect( m_pWindowMenu, &QMenu::aboutToShow, this, &VMainWindow::FillWindowMenu );
  FillWindowMenu();
  FillPluginMenus();
  QMenu* pHelp = menuBar()->addMenu( tr( "&Help" ) );
  pHelp->addAction( tr( "&About Harrow" ), this, &VMainWindow::ShowAbout );
}

void VMainWindow::MakeFileMenu()
{
  QMenu* pMenu = menuBar()->addMenu( tr( "&File" ) );
  pMenu->setToolTipsVisible( true );
  QAction* pOpen = pMenu->addAction( tr( "&Open…" ), this, &VMainWindow::AskForFiles );
  pOpen->setShortcut( QKeySequence::Open );
  pOpen->setToolTip( tr( "Open recordings in C3D, TRC, BVH and MOT files" ) );
  QAction* pFolder = pMenu->addAction( tr( "Open &Folder…" ), this, &VMainWindow::AskForFolder );
  pFolder->setShortcut( QKeySequence( Qt::CTRL | Qt::SHIFT | Qt::Key_O ) );
  pFolder->setToolTip( tr( "Open a folder of what cameras saw" ) );
  m_pRecentMenu = pMenu->addMenu( tr( "Open &Recent" ) );
  connect( m_pRecentMenu, &QMenu::aboutToShow, this, &VMainWindow::FillRecentMenu );
  m_pOpenedMenu = pMenu->addMenu( tr( "Opened &Before" ) );
  connect( m_pOpenedMenu, &QMenu::aboutToShow, this, &VMainWindow::FillOpenedMenu );
  connect( pMenu, &QMenu::aboutToShow, this,
           [this]
           {
             m_pRecentMenu->setEnabled( !m_rSession.Host().Preferences().RecentFiles().isEmpty() );
             m_pOpenedMenu->setEnabled( !m_Opened.empty() );
           } );
  pMenu->addSeparator();
  QAction* pSave = pMenu->addAction( tr( "&Save Settings" ), this,
                                     [this]
                                     {
                                       m_rSession.Host().Settings().Request();
                                     } );
  pSave->setToolTip( tr( "Settings are saved by themselves two seconds after a change, too" ) );
  pMenu->addSeparator();
  QAction* pQuit = pMenu->addAction( tr( "&Quit" ), this, &QWidget::close );
  pQuit->setShortcut( QKeySequence( Qt::CTRL | Qt::Key_Q ) );
}

void VMainWindow::FillRecentMenu()
{
  m_pRecentMenu->clear();
  m_pRecentMenu->setToolTipsVisible( true );
  for ( const QString& rPath : m_rSession.Host().Preferences().RecentFiles() )
  {
    QAction* pAction = m_pRecentMenu->addAction( QFileInfo( rPath ).fileName().replace( '&', "&&" ), this,
                                                 [this, rPath]
                                                 {
                                                   OpenFiles( { rPath } );
                                                 } );
    pAction->setToolTip( rPath );
  }
  m_pRecentMenu->addSeparator();
  m_pRecentMenu->addAction( tr( "&Clear List" ), this,
                            [this]
                            {
                              m_rSession.Host().Preferences().ClearRecentFiles();
                            } );
}

void VMainWindow::FillOpenedMenu()
{
  m_pOpenedMenu->clear();
  m_pOpenedMenu->setToolTipsVisible( true );
  for ( const VOpened& rOpened : m_Opened )
  {
    QAction* pAction = m_pOpenedMenu->addAction( QFileInfo( rOpened.Path ).fileName().replace( '&', "&&" ), this,
                                                 [this, rOpened]
                                                 {
                                                   ShowRecording( rOpened );
                                                 } );
    pAction->setToolTip( rOpened.Path );
  }
}

void VMainWindow::MakePlaybackMenu()
{
  QMenu* pMenu = menuBar()->addMenu( tr( "&Playback" ) );
  const auto Add = [&]( const QString& i_rText, const QKeySequence& i_rKey, std::function< void() > i_Do )
  {
    pMenu->addAction( i_rText, this, std::move( i_Do ) )->setShortcut( i_rKey );
  };
  Add( tr( "&Play or Pause" ), Qt::Key_Space,
       [this]
       {
         m_pTransport->TogglePlay();
       } );
  Add( tr( "Step &Forward" ), Qt::Key_Right,
       [this]
       {
         m_pTransport->Step( 1 );
       } );
  Add( tr( "Step &Back" ), Qt::Key_Left,
       [this]
       {
         m_pTransport->Step( -1 );
       } );
  Add( tr( "Ten Frames Forward" ), Qt::SHIFT | Qt::Key_Right,
       [this]
       {
         m_pTransport->Step( 10 );
       } );
  Add( tr( "Ten Frames Back" ), Qt::SHIFT | Qt::Key_Left,
       [this]
       {
         m_pTransport->Step( -10 );
       } );
  pMenu->addSeparator();
  Add( tr( "Show &Live Capture" ), Qt::CTRL | Qt::Key_L,
       [this]
       {
         m_rSession.GoLive();
       } );
  Add( tr( "Show &Recording" ), Qt::CTRL | Qt::Key_R,
       [this]
       {
         m_rSession.GoPlayback();
       } );
}

void VMainWindow::MakeViewMenu()
{
  m_pViewMenu = new VViewMenu(
      tr( "&View" ),
      [this]
      {
        return ActiveDock();
      },
      this );
  connect( m_pViewMenu, &VViewMenu::Refused, this,
           [this]( const QString& i_rWhy )
           {
             statusBar()->showMessage( i_rWhy, 4000 );
           } );
  menuBar()->addMenu( m_pViewMenu );
  QMenu* const pMenu = m_pViewMenu;
  pMenu->addSeparator();
  MakeUpAxisMenu( *pMenu->addMenu( tr( "&Up Axis" ) ) );
  m_pAltAction = pMenu->addAction( tr( "&Alt to Select" ), this, &VMainWindow::SetAltToSelect );
  m_pAltAction->setCheckable( true );
  m_pAltAction->setToolTip(
      tr( "With this on, dragging navigates and Alt selects; with it off, the other way round" ) );
  pMenu->addSeparator();
  m_pLog->toggleViewAction()->setShortcut( QKeySequence( Qt::CTRL | Qt::Key_G ) );
  pMenu->addAction( m_pLog->toggleViewAction() );
  QAction* pFull = pMenu->addAction( tr( "F&ull Screen" ), this,
                                     [this]
                                     {
                                       setWindowState( windowState() ^ Qt::WindowFullScreen );
                                     } );
  pFull->setShortcut( Qt::Key_F11 );
}

void VMainWindow::MakeUpAxisMenu( QMenu& io_rMenu )
{
  using HostSources::EUpAxis;
  auto* pGroup = new QActionGroup( &io_rMenu );
  const auto Add = [&]( const QString& i_rText, std::optional< EUpAxis > i_Axis )
  {
    QAction* pAction = io_rMenu.addAction( i_rText, this,
                                           [this, i_Axis]
                                           {
                                             m_rSession.SetUpAxis( i_Axis );
                                           } );
    pAction->setCheckable( true );
    pAction->setChecked( m_rSession.UpAxisChoice() == i_Axis );
    pGroup->addAction( pAction );
  };
  Add( tr( "&As the Recording Says" ), std::nullopt );
  Add( tr( "&Y" ), EUpAxis::Y );
  Add( tr( "&Z" ), EUpAxis::Z );
}

void VMainWindow::FillWindowMenu()
{
  m_pWindowMenu->clear();
  for ( const std::string& rKind : m_rSession.Host().Factories()->Names() )
  {
    m_pWindowMenu->addAction( tr( "New %1" ).arg( QString::fromStdString( rKind ) ), this,
                              [this, rKind]
                              {
                                AddWindow( rKind );
                                // A new view would get what is left over beside the others.
                                const QList< QDockWidget* > Docks( m_Docks.begin(), m_Docks.end() );
                                resizeDocks( Docks, QList< int >( Docks.size(), width() ), Qt::Horizontal );
                              } );
  }
  m_pWindowMenu->addSeparator();
  for ( VWorkspaceDock* pDock : m_Docks )
  {
    m_pWindowMenu->addAction( pDock->toggleViewAction() );
  }
  FillContexts();
}

void VMainWindow::FillContexts()
{
  // The first two are the session's own, and the transport bar switches between them.
  const std::vector< std::string > Names = m_rSession.Host().Contexts()->Names();
  if ( Names.size() <= 2 )
  {
    return;
  }
  m_pWindowMenu->addSeparator();
  const std::string Shown = m_rSession.Context()->Name();
  for ( std::size_t Index = 2; Index < Names.size(); ++Index )
  {
    QAction* pAction = m_pWindowMenu->addAction(
        tr( "Show %1" ).arg( QString::fromStdString( Names[Index] ).replace( '&', "&&" ) ), this,
        [this, Name = Names[Index]]
        {
          m_rSession.ShowContext( m_rSession.Context()->Name() == Name ? std::string() : Name );
        } );
    pAction->setCheckable( true );
    pAction->setChecked( Names[Index] == Shown );
  }
}

void VMainWindow::FillPluginMenus()
{
  qDeleteAll( std::exchange( m_PluginMenus, {} ) );
  const auto FindMenu = [this]( QMenu* i_pParent, const QString& i_rTitle )
  {
    const auto Actions = i_pParent ? i_pParent->actions() : menuBar()->actions();
    for ( QAction* pAction : Actions )
    {
      if ( pAction->menu() && QString( pAction->text() ).remove( '&' ) == QString( i_rTitle ).remove( '&' ) )
      {
        return pAction->menu();
      }
    }
    QMenu* pMenu = i_pParent ? i_pParent->addMenu( i_rTitle ) : menuBar()->addMenu( i_rTitle );
    if ( !i_pParent )
    {
      m_PluginMenus << pMenu;
    }
    return pMenu;
  };
  for ( const HostServices::VMenuAction& rEntry : m_rSession.Host().Commands()->Actions() )
  {
    QMenu* pMenu = nullptr;
    for ( std::size_t i = 0; i + 1 < rEntry.Path.size(); ++i )
    {
      pMenu = FindMenu( pMenu, rEntry.Path[i] );
    }
    pMenu = pMenu ? pMenu : FindMenu( nullptr, tr( "Commands" ) );
    pMenu
        ->addAction( rEntry.Path.back(), this,
                     [Do = rEntry.Callback]
                     {
                       Do();
                     } )
        ->setToolTip( rEntry.ToolTip );
  }
  for ( const HostServices::VKeyedCommand& rCommand : m_rSession.Host().Commands()->Commands() )
  {
    FindMenu( nullptr, tr( "Commands" ) )
        ->addAction( rCommand.Text, this,
                     [Do = rCommand.Callback]
                     {
                       Do();
                     } )
        ->setShortcut( QKeySequence( rCommand.DefaultKey ) );
  }
}

void VMainWindow::ShowAbout()
{
  QMessageBox::about( this, tr( "About Harrow" ),
                      tr( "<b>Harrow %1</b><p>Shows motion-capture data: a simulated capture, and recordings in C3D, "
                          "TRC, BVH and MOT files and folders of what cameras saw.</p><p>Qt %2</p>" )
                          .arg( QApplication::applicationVersion(), qVersion() ) );
}

} // namespace HostWindow
