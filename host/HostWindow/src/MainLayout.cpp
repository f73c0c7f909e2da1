#include <HostWindow/MainWindow.h>

#include <QtCore/QJsonArray>
#include <QtCore/QJsonObject>
#include <QtGui/QGuiApplication>

namespace HostWindow
{
namespace
{
constexpr const char* pLayoutName = "Last";
constexpr const char* pGeometryName = "MainWindow";
constexpr const char* pStateName = "MainWindowState";
constexpr int StateVersion = 1;
} // namespace

void VMainWindow::SaveLayout()
{
  auto& rPreferences = m_rSession.Host().Preferences();
  QJsonArray Windows;
  for ( const VWorkspaceDock* pDock : m_Docks )
  {
    Windows.append( QJsonObject{ { "kind", QString::fromStdString( pDock->Kind() ) },
                                 { "name", pDock->objectName() },
                                 { "state", pDock->SaveState() } } );
  }
  rPreferences.SetLayout( pLayoutName, QJsonObject{ { "windows", Windows } } );
  rPreferences.SetGeometry( pGeometryName, saveGeometry() );
  rPreferences.SetGeometry( pStateName, saveState( StateVersion ) );
  rPreferences.SetValue( "altToSelect", AltToSelect() );
  (void)rPreferences.Save();
}

void VMainWindow::RestoreLayout()
{
  auto& rPreferences = m_rSession.Host().Preferences();
  const QJsonValue Alt = rPreferences.Value( "altToSelect" );
  if ( Alt.isBool() && Alt.toBool() != AltToSelect() )
  {
    const ZEK::VStoreWriteScope Scope( *m_rSession.Host().Store() );
    (void)Scope->SetValue( m_Preferences.AltToSelect().Entry(), ZEK::IO::MakeValue( Alt.toBool() ) );
  }
  for ( const QJsonValue& rValue : rPreferences.Layout( pLayoutName )["windows"].toArray() )
  {
    const QJsonObject Window = rValue.toObject();
    // A kind that another profile publishes is left out.
    if ( VWorkspaceDock* pDock = AddWindow( Window["kind"].toString().toStdString() ) )
    {
      pDock->setObjectName( Window["name"].toString() );
      pDock->RestoreState( Window["state"].toObject() );
      m_NextWindow = std::max( m_NextWindow, Window["name"].toString().section( '-', -1 ).toInt() + 1 );
    }
  }
  if ( m_Docks.empty() )
  {
    AddWindow( m_rSession.FindWindowKind( "3d" ) );
  }
  if ( !restoreGeometry( rPreferences.Geometry( pGeometryName ) ) )
  {
    resize( 1280, 820 );
  }
  restoreState( rPreferences.Geometry( pStateName ), StateVersion );
  m_pMessages->hide();
  // A layout must not leave a window without anything to see.
  const bool bAnySeen = std::any_of( m_Docks.begin(), m_Docks.end(),
                                     []( const VWorkspaceDock* i_pDock )
                                     {
                                       return !i_pDock->isHidden();
                                     } );
  if ( !bAnySeen && !m_Docks.empty() )
  {
    m_Docks.front()->show();
  }
}

} // namespace HostWindow
