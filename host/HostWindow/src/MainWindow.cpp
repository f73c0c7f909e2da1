#include <HostWindow/MainWindow.h>

#include "Report.h"

#include <QtCore/QCoreApplication>
#include <QtCore/QFileInfo>
#include <QtCore/QMimeData>
#include <QtCore/QUrl>
#include <QtGui/QCloseEvent>
#include <QtGui/QDragEnterEvent>
#include <QtGui/QDropEvent>
#include <QtWidgets/QApplication>
#include <QtWidgets/QCompleter>
#include <QtWidgets/QFileDialog>
#include <QtWidgets/QMenu>
#include <QtWidgets/QStatusBar>
#include <QtWidgets/QToolBar>

namespace HostWindow
{
namespace
{
const QStringList Suffixes{ "c3d", "trc", "bvh", "mot", "sto" };

QStringList DroppedFiles( const QMimeData* i_pData )
{
  QStringList Paths;
  for ( const QUrl& rUrl : i_pData ? i_pData->urls() : QList< QUrl >() )
  {
    const QString Path = rUrl.toLocalFile();
    const QString Suffix = QFileInfo( Path ).suffix().toLower();
    if ( Suffixes.contains( Suffix ) || QFileInfo( Path ).isDir() )
    {
      Paths << Path;
    }
  }
  return Paths;
}
} // namespace

VMainWindow::VMainWindow( VSession& i_rSession, QWidget* i_pParent )
  : QMainWindow( i_pParent )
  , m_rSession( i_rSession )
  , m_Preferences( i_rSession.Host().Store() )
  , m_Loader( i_rSession.Host().Postal(), i_rSession.Options().Reading )
{
  setAcceptDrops( true );
  setDockNestingEnabled( true );
  setAttribute( Qt::WA_DeleteOnClose, false );
  MakeBars();
  MakeStatusBar();
  MakeMenus();
  MakeCommandBox();
  ConnectLoader();

  auto& rHost = m_rSession.Host();
  m_SelectionConnection = rHost.Selection()->ForKinds( {} )->Connect(
      [this]
      {
        ShowSelection();
      },
      rHost.Postal() );
  m_CommandsConnection = rHost.Commands()->Changed().Connect(
      [this]
      {
        FillPluginMenus();
      },
      rHost.Postal() );
  m_FactoriesConnection = rHost.Factories()->Changed().Connect(
      [this]
      {
        FillWindowMenu();
      },
      rHost.Postal() );
  connect( &m_rSession, &VSession::SourceChanged, this, &VMainWindow::OnSourceChanged );
  RestoreLayout();
  WatchPreferences();
  OnSourceChanged();
  ShowSelection();
}

VMainWindow::~VMainWindow()
{
  m_SelectionConnection.Disconnect();
  m_CommandsConnection.Disconnect();
  m_FactoriesConnection.Disconnect();
  m_AltToSelectConnection.Disconnect();
  m_FailedConnection.Disconnect();
  // The contents go while everything they draw from is still there.
  for ( VWorkspaceDock* pDock : std::exchange( m_Docks, {} ) )
  {
    delete pDock;
  }
}

void VMainWindow::MakeBars()
{
  m_pMessages = new VMessageBar( this );
  addToolBar( Qt::TopToolBarArea, m_pMessages );
  addToolBarBreak( Qt::TopToolBarArea );

  m_pTransport = new VTransportBar( m_rSession );
  auto* pBottom = new QToolBar( tr( "Transport" ), this );
  pBottom->setObjectName( "TransportToolBar" );
  pBottom->setMovable( false );
  pBottom->toggleViewAction()->setVisible( false );
  m_pTransport->setSizePolicy( QSizePolicy::Expanding, QSizePolicy::Preferred );
  pBottom->addWidget( m_pTransport );
  addToolBar( Qt::BottomToolBarArea, pBottom );

  m_pLog = new VLogPanel( m_rSession.LogRing(), this );
  addDockWidget( Qt::BottomDockWidgetArea, m_pLog );
  m_pLog->hide();
}

void VMainWindow::MakeStatusBar()
{
  m_pGestures = new QLabel( this );
  m_pGestures->setObjectName( "Gestures" );
  m_pGestures->setToolTip( tr( "What the mouse does in a view" ) );
  statusBar()->addWidget( m_pGestures );
  m_pLoading = new QWidget( this );
  auto* pLayout = new QHBoxLayout( m_pLoading );
  pLayout->setContentsMargins( 0, 0, 0, 0 );
  m_pProgress = new QProgressBar( m_pLoading );
  m_pProgress->setRange( 0, 100 );
  m_pProgress->setMaximumWidth( 220 );
  auto* pCancel = new QToolButton( m_pLoading );
  pCancel->setObjectName( "CancelLoading" );
  pCancel->setText( tr( "Cancel" ) );
  pCancel->setToolTip( tr( "Give up reading this recording" ) );
  connect( pCancel, &QToolButton::clicked, this,
           [this]
           {
             m_Queue.clear();
             m_Loader.Cancel();
           } );
  pLayout->addWidget( m_pProgress );
  pLayout->addWidget( pCancel );
  statusBar()->addPermanentWidget( m_pLoading );
  m_pLoading->hide();
  m_pSelection = new QLabel( this );
  m_pSelection->setObjectName( "Selection" );
  m_pSelection->setToolTip( tr( "What is under the pointer, or selected" ) );
  statusBar()->addPermanentWidget( m_pSelection );
}

void VMainWindow::MakeCommandBox()
{
  if ( !m_rSession.Host().Application().DeveloperMode() )
  {
    return;
  }
  m_pCommand = new QLineEdit;
  m_pCommand->setObjectName( "Command" );
  m_pCommand->setPlaceholderText( tr( "Command, such as Workspace3d:FrameSelected" ) );
  m_pCommand->setToolTip( tr( "Runs a command of the active window, or of the program" ) );
  m_pCommand->setClearButtonEnabled( true );
  auto* pCompleter = new QCompleter( m_rSession.Host().Commands()->Names(), m_pCommand );
  pCompleter->setCaseSensitivity( Qt::CaseInsensitive );
  m_pCommand->setCompleter( pCompleter );
  connect( m_pCommand, &QLineEdit::returnPressed, this,
           [this]
           {
             const QString Text = m_pCommand->text();
             const bool bDone = ExecuteCommand( Text );
             statusBar()->showMessage( bDone ? tr( "Done: %1" ).arg( Text ) : tr( "Not done: %1" ).arg( Text ), 4000 );
           } );
  auto* pBar = addToolBar( tr( "Command" ) );
  pBar->setObjectName( "CommandToolBar" );
  pBar->addWidget( m_pCommand );
}

void VMainWindow::ConnectLoader()
{
  connect( &m_Loader, &VRecordingLoader::Progress, this,
           [this]( const QString& i_rPath, double i_Fraction )
           {
             m_pProgress->setFormat( QFileInfo( i_rPath ).fileName() + " %p%" );
             m_pProgress->setValue( static_cast< int >( i_Fraction * 100 ) );
           } );
  connect( &m_Loader, &VRecordingLoader::Loaded, this, &VMainWindow::OnLoaded );
  connect( &m_Loader, &VRecordingLoader::Failed, this, &VMainWindow::OnFailed );
}

VWorkspaceDock* VMainWindow::AddWindow( const std::string& i_rKind )
{
  if ( !m_rSession.Host().Factories()->Find( i_rKind ) )
  {
    return nullptr;
  }
  auto* pDock = new VWorkspaceDock( m_rSession, i_rKind, this );
  pDock->setObjectName( QString( "Window-%1" ).arg( m_NextWindow++ ) );
  connect( pDock, &VWorkspaceDock::Closed, this, &VMainWindow::OnDockClosed );
  connect( pDock, &VWorkspaceDock::Activated, this, &VMainWindow::SetActive );
  addDockWidget( Qt::TopDockWidgetArea, pDock );
  m_Docks.push_back( pDock );
  SetActive( pDock );
  return pDock;
}

void VMainWindow::OnDockClosed( VWorkspaceDock* i_pDock )
{
  std::erase( m_Docks, i_pDock );
  i_pDock->deleteLater();
  m_pViewMenu->Refresh();
  ShowAltToSelect();
}

void VMainWindow::SetActive( VWorkspaceDock* i_pDock )
{
  m_pActive = i_pDock;
  m_pViewMenu->Refresh();
  ShowAltToSelect();
}

VWorkspaceDock* VMainWindow::ActiveDock() const
{
  if ( m_pActive && std::find( m_Docks.begin(), m_Docks.end(), m_pActive ) != m_Docks.end() )
  {
    return m_pActive;
  }
  return m_Docks.empty() ? nullptr : m_Docks.front();
}

bool VMainWindow::ExecuteCommand( const QString& i_rText )
{
  VWorkspaceDock* pDock = ActiveDock();
  return ( pDock && pDock->View().ExecuteCommand( i_rText.toStdString() ) ) ||
         m_rSession.Host().Commands()->Execute( i_rText );
}

void VMainWindow::AskForFiles()
{
  const auto Recent = m_rSession.Host().Preferences().RecentFiles();
  const QString Folder = Recent.isEmpty() ? QString() : QFileInfo( Recent.front() ).absolutePath();
  QStringList Patterns;
  for ( const QString& rSuffix : Suffixes )
  {
    Patterns << "*." + rSuffix << "*." + rSuffix.toUpper();
  }
  OpenFiles( QFileDialog::getOpenFileNames( this, tr( "Open Recordings" ), Folder,
                                            tr( "Recordings (%1);;All files (*)" ).arg( Patterns.join( ' ' ) ) ) );
}

void VMainWindow::AskForFolder()
{
  const auto Recent = m_rSession.Host().Preferences().RecentFiles();
  const QString Folder = Recent.isEmpty() ? QString() : QFileInfo( Recent.front() ).absolutePath();
  const QString Chosen = QFileDialog::getExistingDirectory( this, tr( "Open Recording of Cameras" ), Folder );
  if ( !Chosen.isEmpty() )
  {
    OpenFiles( { Chosen } );
  }
}

void VMainWindow::OpenFiles( const QStringList& i_rPaths )
{
  if ( i_rPaths.isEmpty() )
  {
    return;
  }
  m_Queue = i_rPaths;
  m_bShowNext = true;
  m_pMessages->hide();
  LoadNext();
}

void VMainWindow::LoadNext()
{
  m_pLoading->setVisible( !m_Queue.isEmpty() );
  if ( !m_Queue.isEmpty() )
  {
    m_pProgress->setValue( 0 );
    m_Loader.Load( QFileInfo( m_Queue.takeFirst() ).absoluteFilePath() );
  }
}

void VMainWindow::OnLoaded( const QString& i_rPath, std::shared_ptr< const HostSources::VRecording > i_pRecording,
                            const QString& i_rMessage )
{
  std::erase_if( m_Opened,
                 [&]( const VOpened& i_rOpened )
                 {
                   return i_rOpened.Path == i_rPath;
                 } );
  m_Opened.push_back( { i_rPath, std::move( i_pRecording ) } );
  m_rSession.Host().Preferences().AddRecentFile( i_rPath );
  if ( !i_rMessage.isEmpty() )
  {
    m_pMessages->ShowMessage( i_rMessage, false );
  }
  if ( std::exchange( m_bShowNext, false ) )
  {
    ShowLoaded( m_Opened.back() );
  }
  LoadNext();
}

void VMainWindow::OnFailed( const QString& i_rPath, const QString& i_rMessage, quint32 i_Code )
{
  if ( i_Code == ZEK::IResult::Canceled )
  {
    statusBar()->showMessage( tr( "Canceled: %1" ).arg( QFileInfo( i_rPath ).fileName() ), 4000 );
  }
  else
  {
    const QString Text = QString::fromStdString( ZEK::IResult::FromCode( i_Code ).Text() );
    m_pMessages->ShowMessage( i_rMessage.isEmpty() ? i_rPath + ": " + Text : i_rMessage, true );
    m_rSession.Host().Preferences().RemoveRecentFile( i_rPath );
  }
  LoadNext();
}

void VMainWindow::OnSourceChanged()
{
  const auto pContext = m_rSession.Context();
  for ( VWorkspaceDock* pDock : m_Docks )
  {
    if ( pDock->ContextName() != pContext->Name() )
    {
      pDock->Rebuild();
    }
  }
  m_pViewMenu->Refresh();
  const HostSources::IFrameSource* pSource = m_rSession.Source();
  setWindowTitle( pSource ? QString::fromStdString( pSource->Name() ) : QString() );
}

void VMainWindow::ShowSelection()
{
  const auto& rSelection = *m_rSession.Host().Selection();
  const ZEK::VSelection Hovered = rSelection.Get( ZEK::ISelectionService::ESecondary );
  const ZEK::VSelection Selected = rSelection.Get( ZEK::ISelectionService::EPrimary );
  if ( !Hovered.empty() )
  {
    m_pSelection->setText( SelectionLabel( Hovered.back() ) );
  }
  else if ( Selected.empty() )
  {
    m_pSelection->setText( tr( "Nothing selected" ) );
  }
  else
  {
    const QString Others = Selected.size() > 1 ? tr( " and %1 more" ).arg( Selected.size() - 1 ) : QString();
    m_pSelection->setText( tr( "Selected: %1%2" ).arg( SelectionLabel( Selected.back() ), Others ) );
  }
}

void VMainWindow::ShowSeen( bool i_bSeen )
{
  m_rSession.SetSeen( i_bSeen );
  for ( VWorkspaceDock* pDock : m_Docks )
  {
    pDock->SetSeen( i_bSeen );
  }
}

void VMainWindow::changeEvent( QEvent* io_pEvent )
{
  QMainWindow::changeEvent( io_pEvent );
  if ( io_pEvent->type() == QEvent::WindowStateChange )
  {
    ShowSeen( !isMinimized() );
  }
}

void VMainWindow::closeEvent( QCloseEvent* io_pEvent )
{
  m_Loader.Cancel();
  SaveLayout();
  QMainWindow::closeEvent( io_pEvent );
}

void VMainWindow::dragEnterEvent( QDragEnterEvent* io_pEvent )
{
  if ( !DroppedFiles( io_pEvent->mimeData() ).isEmpty() )
  {
    io_pEvent->acceptProposedAction();
  }
}

void VMainWindow::dropEvent( QDropEvent* io_pEvent )
{
  OpenFiles( DroppedFiles( io_pEvent->mimeData() ) );
  io_pEvent->acceptProposedAction();
}

} // namespace HostWindow
