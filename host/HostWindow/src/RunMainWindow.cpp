#include "QuitSignals.h"

#include <HostWindow/MainWindow.h>

#include <QtWidgets/QApplication>
#include <QtWidgets/QStyleFactory>

namespace HostWindow
{
namespace
{
constexpr const char* pStyleSheet =
    "QToolTip { color: #e8ebef; background: #2c3138; border: 1px solid #4a525c; padding: 2px; }"
    "QMainWindow::separator { background: #14161a; width: 3px; height: 3px; }"
    "QDockWidget::title { padding: 4px; background: #22262b; }"
    "QToolBar { border: none; spacing: 2px; }"
    "QStatusBar::item { border: none; }"
    "QMenu { etch-disabled-text: 0; }";

void ApplyTheme( const HostServices::VHost& i_rHost )
{
  QApplication::setStyle( QStyleFactory::create( "Fusion" ) );
  QApplication::setPalette( i_rHost.Quick()->Palette() );
  qApp->setStyleSheet( pStyleSheet );
}
} // namespace

VRunResult RunMainWindow( const VCommonOptions& i_rCommon, const std::vector< std::string >& i_rFiles )
{
  VSession Session( i_rCommon );
  ApplyTheme( Session.Host() );
  const std::string PluginError = Session.StartPlugin();
  if ( !PluginError.empty() )
  {
    return { EExitPlugin, PluginError };
  }
  Session.GoLive();
  VMainWindow Window( Session );
  QStringList Files;
  for ( const std::string& rFile : i_rFiles )
  {
    Files << QString::fromStdString( rFile );
  }
  Window.OpenFiles( Files );
  Window.show();
  const VQuitSignals Signals;
  // What the start itself has set is not a change by a person. What there is to tell is shown over everything else.
  (void)Session.Host().Settings().StartSaving();
  return { QApplication::exec(), {} };
}

} // namespace HostWindow
