#include <HostServices/VHost.h>
#include <HostSettings/SettingsLine.h>
#include <HostWindow/CommandLine.h>
#include <HostWindow/Display.h>
#include <HostWindow/Headless.h>
#include <HostWindow/MainWindow.h>

#include <QtWidgets/QApplication>
#include <QtWidgets/QStyleFactory>

#include <cmath>
#include <exception>
#include <iostream>
#include <locale>
#include <string_view>

namespace
{
int Report( const HostWindow::VRunResult& i_rResult )
{
  if ( !i_rResult.Message.empty() )
  {
    std::cerr << "harrow: " << i_rResult.Message << std::endl;
  }
  return i_rResult.Exit;
}

/// With no display there is no window to open, but there are pictures to take.
void TurnIntoPictures( HostWindow::VCommandLine& io_rLine )
{
  std::cerr << "harrow: there is no display; every window is drawn into a PNG file in \""
            << io_rLine.Render.OutputDir.string() << "\"" << std::endl;
  if ( io_rLine.Mode == HostWindow::EProgramMode::Open )
  {
    io_rLine.Render.Sources = { io_rLine.Files.front() };
  }
  io_rLine.Mode = HostWindow::EProgramMode::Render;
  io_rLine.Render.bAll = true;
}

/// Needs neither a display nor a plug-in.
int RunSettings( int i_Count, char** i_ppArguments )
{
  QCoreApplication::setApplicationName( "harrow" );
  return HostSettings::RunSettingsLine( { i_ppArguments + 2, i_ppArguments + i_Count },
                                        HostServices::SettingsPath().string(), std::cout, std::cerr );
}

int Run( int i_Count, char** i_ppArguments )
{
  if ( i_Count > 1 && std::string_view( i_ppArguments[1] ) == "settings" )
  {
    return RunSettings( i_Count, i_ppArguments );
  }
  HostWindow::VCommandLine Line;
  const HostWindow::VParseResult Parsed = HostWindow::ParseCommandLine( i_Count, i_ppArguments, Line );
  if ( Parsed.Exit )
  {
    std::cout << Parsed.Output << std::flush;
    return Report( { *Parsed.Exit, Parsed.Error } );
  }
  if ( Line.Mode == HostWindow::EProgramMode::Info )
  {
    return Report( HostWindow::RunInfo( Line.Files, Line.bJson, Line.Common.Reading ) );
  }
  if ( Line.Mode == HostWindow::EProgramMode::InspectCameras )
  {
    return Report( HostWindow::RunInspectCameras( Line.Files ) );
  }

  HostWindow::VPrivateDisplay Display;
  if ( !HostWindow::HasDisplay() )
  {
    if ( Line.Mode != HostWindow::EProgramMode::Render )
    {
      TurnIntoPictures( Line );
    }
    const auto Pixels = [&]( int i_Size )
    {
      return static_cast< int >( std::ceil( i_Size * Line.Render.Ratio ) );
    };
    const std::string Missing =
        Display.Start( std::max( 1920, Pixels( Line.Render.Width ) ), std::max( 1080, Pixels( Line.Render.Height ) ) );
    if ( !Missing.empty() )
    {
      return Report( { HostWindow::EExitDisplay, Missing } );
    }
  }

  HostWindow::RouteQtMessages();
  HostWindow::SetUpGraphics( Line.Common.bCoreProfile, Line.Render.Ratio );
  // The arguments are the program's own: Qt would take some of them for its own.
  int NoArguments = 1;
  QApplication Application( NoArguments, i_ppArguments );
  QApplication::setApplicationName( "harrow" );
  QApplication::setApplicationDisplayName( "Harrow" );
  QApplication::setApplicationVersion( "1.0.0" );
  QApplication::setStyle( QStyleFactory::create( "Fusion" ) );
  // Qt has taken the user's locale; numbers that are read and written keep their point.
  std::setlocale( LC_NUMERIC, "C" );
  if ( Line.Mode == HostWindow::EProgramMode::Render )
  {
    return Report( HostWindow::RunRender( Line.Common, Line.Render ) );
  }
  return Report( HostWindow::RunMainWindow( Line.Common, Line.Files ) );
}
} // namespace

int main( int i_Count, char** i_ppArguments )
{
  try
  {
    return Run( i_Count, i_ppArguments );
  }
  catch ( const std::exception& rError )
  {
    return Report( { 1, std::string( "unexpected failure: " ) + rError.what() } );
  }
}
