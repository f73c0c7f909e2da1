#include <HostWindow/MainWindow.h>

#include <HostWindow/PreferencesWindow.h>

#include <QtCore/QFileInfo>
#include <QtWidgets/QStatusBar>

namespace HostWindow
{
namespace
{
/// By whether the view is one of cameras, and by whether Alt selects.
constexpr const char* Gestures[2][2] = {
    { "Alt+drag: orbit · Alt+right drag: zoom · Alt+left+right: pan · Drag: select · Click: select",
      "Drag: orbit · Right drag: zoom · Left+right: pan · Alt+drag: select · Click: select" },
    { "Alt+drag: pan · Right drag: zoom · Double click: one camera or all · Drag: select · Click: select",
      "Drag: pan · Right drag: zoom · Double click: one camera or all · Alt+drag: select · Click: select" } };
} // namespace

void VMainWindow::WatchPreferences()
{
  auto& rHost = m_rSession.Host();
  m_AltToSelectConnection = m_Preferences.AltToSelect().Connect(
      [pThis = QPointer< VMainWindow >( this )]( auto, auto )
      {
        if ( pThis )
        {
          pThis->ShowAltToSelect();
        }
      },
      rHost.Postal() );
  m_FailedConnection = rHost.PreferenceEditor().Failed().Connect(
      [this]( const QString& i_rWhy )
      {
        m_pMessages->ShowMessage( i_rWhy, true );
      },
      nullptr );
  m_SettingsConnection = rHost.Settings().MessageChanged().Connect(
      [this]
      {
        ShowSettingsMessage();
      },
      rHost.Postal() );
  ShowSettingsMessage();
  ShowAltToSelect();
}

void VMainWindow::ShowSettingsMessage()
{
  const QString Text = QString::fromStdString( m_rSession.Host().Settings().Message() );
  if ( !Text.isEmpty() )
  {
    m_pMessages->ShowMessage( Text, true );
  }
  else if ( m_pMessages->Text() == m_SettingsMessage )
  {
    m_pMessages->hide();
  }
  m_SettingsMessage = Text;
}

void VMainWindow::ShowPreferences()
{
  if ( !m_pPreferencesWindow )
  {
    auto& rHost = m_rSession.Host();
    m_pPreferencesWindow = new VPreferencesWindow( rHost.PreferenceEditor(), rHost.Undo(), rHost.Postal(), this );
  }
  m_pPreferencesWindow->show();
  m_pPreferencesWindow->raise();
  m_pPreferencesWindow->activateWindow();
}

bool VMainWindow::AltToSelect() const
{
  bool bOn = true;
  (void)m_Preferences.AltToSelect().Read( bOn );
  return bOn;
}

void VMainWindow::SetAltToSelect( bool i_bOn )
{
  QString Why;
  const auto pEntry = m_Preferences.AltToSelect().Entry();
  if ( m_rSession.Host().PreferenceEditor().Set( pEntry, ZEK::IO::MakeValue( i_bOn ), Why ).IsError() )
  {
    m_pMessages->ShowMessage( Why, true );
  }
  ShowAltToSelect();
}

void VMainWindow::ShowAltToSelect()
{
  const bool bOn = AltToSelect();
  m_pAltAction->setChecked( bOn );
  const VWorkspaceDock* const pDock = ActiveDock();
  const bool bCameraView = pDock && pDock->View().Option( "CameraView" ).toBool();
  m_pGestures->setText( QString::fromUtf8( Gestures[bCameraView ? 1 : 0][bOn ? 1 : 0] ) );
}

void VMainWindow::ShowLoaded( const VOpened& i_rOpened )
{
  bool bSwitch = true;
  (void)m_Preferences.EnableAutoContextSwitch().Read( bSwitch );
  if ( bSwitch || !m_rSession.IsLive() )
  {
    ShowRecording( i_rOpened );
    return;
  }
  m_rSession.OpenRecording( i_rOpened.pRecording, false );
  statusBar()->showMessage(
      tr( "%1 is open. Playback > Show Recording shows it." ).arg( QFileInfo( i_rOpened.Path ).fileName() ) );
}

void VMainWindow::ShowRecording( const VOpened& i_rOpened )
{
  for ( const auto Set : { ZEK::ISelectionService::EPrimary, ZEK::ISelectionService::ESecondary } )
  {
    m_rSession.Host().Selection()->Set( Set, {} );
  }
  m_rSession.OpenRecording( i_rOpened.pRecording );
  bool bPlay = false;
  (void)m_Preferences.StartPlayingAutomatically().Read( bPlay );
  if ( bPlay )
  {
    m_rSession.Clock().Play();
  }
}

} // namespace HostWindow
