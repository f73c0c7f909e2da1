#include <HostWindow/Display.h>

#include <HarrowPluginInterface/GraphicsSetUp.h>
#include <ZEK/Log.h>

#include <QtCore/QByteArray>
#include <QtCore/QCoreApplication>
#include <QtCore/QFileInfo>
#include <QtCore/QLibrary>
#include <QtCore/QStandardPaths>
#include <QtCore/QThread>
#include <QtGui/QGuiApplication>

#include <array>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <poll.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

namespace HostWindow
{
namespace
{
/// Runs in the child between fork and exec: only calls that are safe there.
[[noreturn]] void RunServer( const char* i_pProgram, int i_Pipe, const char* i_pScreen, pid_t i_Parent )
{
  prctl( PR_SET_PDEATHSIG, SIGTERM );
  if ( getppid() != i_Parent )
  {
    _exit( 127 );
  }
  // An interrupt from the terminal is for the program, which then ends the server.
  setpgid( 0, 0 );
  dup2( i_Pipe, 3 );
  fcntl( 3, F_SETFD, 0 );
  const int Nowhere = open( "/dev/null", O_RDWR );
  dup2( Nowhere, STDIN_FILENO );
  dup2( Nowhere, STDOUT_FILENO );
  dup2( Nowhere, STDERR_FILENO );
  execl( i_pProgram, i_pProgram, "-displayfd", "3", "-screen", "0", i_pScreen, "-nolisten", "tcp", "-noreset",
         static_cast< char* >( nullptr ) );
  _exit( 127 );
}

/// The number that the server writes once it is ready; empty when it ends or says nothing for half a minute.
QByteArray ReadDisplayNumber( int i_Pipe )
{
  QByteArray Text;
  while ( !Text.contains( '\n' ) )
  {
    pollfd Poll{ i_Pipe, POLLIN, 0 };
    std::array< char, 32 > Buffer{};
    const int Ready = poll( &Poll, 1, 30'000 );
    if ( Ready < 0 && errno == EINTR )
    {
      continue;
    }
    const ssize_t Count = Ready > 0 ? read( i_Pipe, Buffer.data(), Buffer.size() ) : 0;
    if ( Count <= 0 )
    {
      return {};
    }
    Text.append( Buffer.data(), Count );
  }
  return Text.trimmed();
}

/// The platform plug-in of Qt ends the process when it cannot connect, so the question is asked first. The connection
/// stays open for the life of the process: a server without a client may begin anew, and then turns down who comes.
bool XServerAnswers()
{
  using FConnect = void* (*)( const char*, int* );
  using FHasError = int ( * )( void* );
  using FDisconnect = void ( * )( void* );
  QLibrary Xcb( "xcb", 1 );
  const auto pConnect = reinterpret_cast< FConnect >( Xcb.resolve( "xcb_connect" ) );
  const auto pHasError = reinterpret_cast< FHasError >( Xcb.resolve( "xcb_connection_has_error" ) );
  const auto pDisconnect = reinterpret_cast< FDisconnect >( Xcb.resolve( "xcb_disconnect" ) );
  if ( !pConnect || !pHasError || !pDisconnect )
  {
    return true;
  }
  for ( int Try = 0; Try < 10; ++Try )
  {
    void* pConnection = pConnect( nullptr, nullptr );
    if ( pHasError( pConnection ) == 0 )
    {
      return true;
    }
    pDisconnect( pConnection );
    QThread::msleep( 50 );
  }
  return false;
}
} // namespace

VPrivateDisplay::~VPrivateDisplay()
{
  if ( m_Server > 0 )
  {
    kill( m_Server, SIGTERM );
    waitpid( m_Server, nullptr, 0 );
  }
}

std::string VPrivateDisplay::Start( int i_Width, int i_Height )
{
  const QByteArray Program = QStandardPaths::findExecutable( "Xvfb" ).toLocal8Bit();
  if ( Program.isEmpty() )
  {
    return "there is no display, and no virtual X server can be started: install the package \"xvfb\"";
  }
  const QByteArray Screen = QByteArray::number( i_Width ) + 'x' + QByteArray::number( i_Height ) + "x24";
  std::array< int, 2 > Pipe{};
  if ( pipe2( Pipe.data(), O_CLOEXEC ) != 0 )
  {
    return std::string( "no pipe for the virtual X server: " ) + std::strerror( errno );
  }
  const pid_t Parent = getpid();
  m_Server = fork();
  if ( m_Server == 0 )
  {
    RunServer( Program.constData(), Pipe[1], Screen.constData(), Parent );
  }
  close( Pipe[1] );
  const QByteArray Number = m_Server > 0 ? ReadDisplayNumber( Pipe[0] ) : QByteArray();
  close( Pipe[0] );
  if ( Number.isEmpty() )
  {
    return "the virtual X server (" + Program.toStdString() + ") did not start";
  }
  qputenv( "DISPLAY", ':' + Number );
  qputenv( "QT_QPA_PLATFORM", "xcb" );
  return {};
}

bool HasDisplay()
{
  const QByteArray Platform = qgetenv( "QT_QPA_PLATFORM" );
  if ( Platform.startsWith( "offscreen" ) || Platform.startsWith( "minimal" ) || Platform.startsWith( "vnc" ) )
  {
    return false;
  }
  if ( !qEnvironmentVariableIsEmpty( "WAYLAND_DISPLAY" ) )
  {
    return true;
  }
  return !qEnvironmentVariableIsEmpty( "DISPLAY" ) && XServerAnswers();
}

void RouteQtMessages()
{
  qInstallMessageHandler(
      []( QtMsgType i_Type, const QMessageLogContext&, const QString& i_rText )
      {
        static const ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Qt" );
        // Said on every machine without a login session, and of no consequence.
        if ( i_rText.startsWith( "QStandardPaths: XDG_RUNTIME_DIR not set" ) )
        {
          return;
        }
        const int Level = i_Type == QtCriticalMsg || i_Type == QtFatalMsg ? ZEK::ELogFailure
                          : i_Type == QtWarningMsg                        ? ZEK::ELogWarning
                                                                          : ZEK::ELogDetail;
        if ( i_Type == QtFatalMsg )
        {
          // The process ends after this; a sink may not be there yet.
          std::fprintf( stderr, "harrow: %s\n", qPrintable( i_rText ) );
        }
        if ( rCategory.IsOn( Level ) )
        {
          ZEK::GlobalLog().Write( rCategory, Level, i_rText.toStdString() );
        }
      } );
}

void SetUpGraphics( bool i_bCoreProfile, double i_Ratio )
{
  if ( i_Ratio != 1 )
  {
    qputenv( "QT_SCALE_FACTOR", QByteArray::number( i_Ratio ) );
    QGuiApplication::setHighDpiScaleFactorRoundingPolicy( Qt::HighDpiScaleFactorRoundingPolicy::PassThrough );
  }
  qputenv( "QT_QUICK_CONTROLS_STYLE", "Basic" );
  HarrowPluginInterface::SetUpGraphics( i_bCoreProfile );
}

} // namespace HostWindow
