#pragma once

#include <HostWindow/Headless.h>
#include <HostWindow/Panels.h>
#include <HostWindow/RecordingLoader.h>
#include <HostWindow/Session.h>
#include <HostWindow/TransportBar.h>
#include <HostWindow/ViewMenu.h>
#include <HostWindow/WorkspaceDock.h>

#include <ZEK/CoreUserPreferences.h>

#include <QtGui/QActionGroup>
#include <QtWidgets/QLineEdit>
#include <QtWidgets/QMainWindow>
#include <QtWidgets/QProgressBar>

namespace HostWindow
{

class VPreferencesWindow;

/// The program's window: docked workspace windows, menus, transport bar, message bar, log panel and status line.
class VMainWindow : public QMainWindow
{
  Q_OBJECT

public:
  explicit VMainWindow( VSession& i_rSession, QWidget* i_pParent = nullptr );
  ~VMainWindow() override;

  /// Reads the recordings in turn and shows the first of them that can be read.
  void OpenFiles( const QStringList& i_rPaths );
  /// A new window of that published kind; null when there is none.
  VWorkspaceDock* AddWindow( const std::string& i_rKind );
  const std::vector< VWorkspaceDock* >& Windows() const { return m_Docks; }
  VMessageBar& Messages() { return *m_pMessages; }
  /// Runs the text as a command of the active window, or as a command of the program.
  bool ExecuteCommand( const QString& i_rText );
  /// Opens the window of preferences, or brings it to the front.
  void ShowPreferences();

protected:
  void closeEvent( QCloseEvent* io_pEvent ) override;
  void changeEvent( QEvent* io_pEvent ) override;
  void dragEnterEvent( QDragEnterEvent* io_pEvent ) override;
  void dropEvent( QDropEvent* io_pEvent ) override;

private:
  /// A recording that was opened in this run.
  struct VOpened
  {
    QString Path;
    std::shared_ptr< const HostSources::VRecording > pRecording;
  };

  // MainMenus.cpp
  void MakeMenus();
  void MakeFileMenu();
  void MakePlaybackMenu();
  void MakeViewMenu();
  void MakeUpAxisMenu( QMenu& io_rMenu );
  void FillRecentMenu();
  void FillOpenedMenu();
  void FillWindowMenu();
  /// Entries for contexts that the plug-in made.
  void FillContexts();
  void FillPluginMenus();
  void ShowAbout();

  // MainWindow.cpp
  void MakeBars();
  void MakeStatusBar();
  void MakeCommandBox();
  void ConnectLoader();
  void AskForFiles();
  void AskForFolder();
  void LoadNext();
  void OnLoaded( const QString& i_rPath, std::shared_ptr< const HostSources::VRecording > i_pRecording,
                 const QString& i_rMessage );
  void OnFailed( const QString& i_rPath, const QString& i_rMessage, quint32 i_Code );
  void OnSourceChanged();
  void OnDockClosed( VWorkspaceDock* i_pDock );
  void ShowSelection();
  void ShowSeen( bool i_bSeen );
  void SetActive( VWorkspaceDock* i_pDock );
  VWorkspaceDock* ActiveDock() const;

  // MainPreferences.cpp
  void WatchPreferences();
  bool AltToSelect() const;
  void SetAltToSelect( bool i_bOn );
  void ShowAltToSelect();
  void ShowSettingsMessage();
  /// A recording that was just read is shown, unless the operator wants to stay live.
  void ShowLoaded( const VOpened& i_rOpened );
  void ShowRecording( const VOpened& i_rOpened );

  // MainLayout.cpp
  void SaveLayout();
  void RestoreLayout();
  void TakeOverAltToSelect();

  VSession& m_rSession;
  ZEK::ICoreUserPreferencesLayout m_Preferences;
  VRecordingLoader m_Loader;
  QStringList m_Queue;
  bool m_bShowNext = true; ///< the next recording of the queue that can be read is shown
  std::vector< VOpened > m_Opened;
  std::vector< VWorkspaceDock* > m_Docks;
  QPointer< VWorkspaceDock > m_pActive;
  int m_NextWindow = 1;
  VTransportBar* m_pTransport = nullptr;
  VMessageBar* m_pMessages = nullptr;
  VLogPanel* m_pLog = nullptr;
  QLineEdit* m_pCommand = nullptr;
  QLabel* m_pGestures = nullptr;
  QLabel* m_pSelection = nullptr;
  QWidget* m_pLoading = nullptr;
  QProgressBar* m_pProgress = nullptr;
  QMenu* m_pRecentMenu = nullptr;
  QMenu* m_pOpenedMenu = nullptr;
  QMenu* m_pWindowMenu = nullptr;
  VViewMenu* m_pViewMenu = nullptr;
  QAction* m_pAltAction = nullptr;
  VPreferencesWindow* m_pPreferencesWindow = nullptr;
  QList< QAction* > m_PluginActions;
  QList< QMenu* > m_PluginMenus;
  ZEK::VConnection m_SelectionConnection;
  ZEK::VConnection m_CommandsConnection;
  ZEK::VConnection m_FactoriesConnection;
  ZEK::VConnection m_AltToSelectConnection;
  ZEK::VConnection m_FailedConnection;
  ZEK::VConnection m_SettingsConnection;
  QString m_SettingsMessage; ///< as it was shown
};

/// Opens the window and runs the program until it is closed. Needs the application object.
VRunResult RunMainWindow( const VCommonOptions& i_rCommon, const std::vector< std::string >& i_rFiles );

} // namespace HostWindow
