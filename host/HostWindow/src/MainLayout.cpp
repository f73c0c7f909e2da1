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
  (void)rPreferences.Save();
}

/// Earlier versions kept it here. Once the settings file has it, it is no longer needed.
void VMainWindow::TakeOverAltToSelect()
{
  const char* const pKey = "altToSelect";
  const QJsonValue Alt = m_rSession.Host().Preferences().Value( pKey );
  if ( !Alt.isBool() )
  {
    return;
  }
  const auto pEntry = m_Preferences.AltToSelect().Entry();
  const ZEK::VStoreWriteScope Scope( *m_rSession.Host().Store() );
  if ( ( Scope->Flags( pEntry ) & ZEK::EUsingDefault ) != 0 )
  {
    (void)Scope->SetValue( pEntry, ZEK::IO::MakeValue( Alt.toBool() ) );
  }
  else
  {
    m_rSession.Host().Preferences().SetValue( pKey, QJsonValue::Undefined );
  }
}

void VMainWindow::RestoreLayout()
{
  auto& rPreferences = m_rSession.Host().Preferences();
  TakeOverAltToSelect();
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
    VWorkspaceDock* const pScene = AddWindow( m_rSession.FindWindowKind( "3d" ) );
    VWorkspaceDock* const pCameras = AddWindow( m_rSession.FindWindowKind( "cameras" ) );
    if ( pScene && pCameras )
    {
      resizeDocks( { pScene, pCameras }, { 3, 2 }, Qt::Horizontal );
      SetActive( pScene );
    }
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
