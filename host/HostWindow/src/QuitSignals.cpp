#include "QuitSignals.h"

#include <QtCore/QCoreApplication>

#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <unistd.h>

namespace HostWindow
{
namespace
{
constexpr int Signals[] = { SIGTERM, SIGINT, SIGHUP };
// Written by the handler, which may do nothing else than write to it.
volatile std::sig_atomic_t s_WriteEnd = -1;

void OnSignal( int i_Signal )
{
  const char Byte = 0;
  if ( ::write( s_WriteEnd, &Byte, 1 ) != 1 )
  {
    std::_Exit( 128 + i_Signal );
  }
  // Should quitting hang, the next one need not be asked twice.
  std::signal( i_Signal, SIG_DFL );
}
} // namespace

VQuitSignals::VQuitSignals()
{
  if ( ::pipe2( m_Ends, O_CLOEXEC | O_NONBLOCK ) != 0 )
  {
    return;
  }
  s_WriteEnd = m_Ends[1];
  m_pNotifier = std::make_unique< QSocketNotifier >( m_Ends[0], QSocketNotifier::Read );
  connect( m_pNotifier.get(), &QSocketNotifier::activated, this, &VQuitSignals::Quit );
  for ( const int Signal : Signals )
  {
    std::signal( Signal, OnSignal );
  }
}

VQuitSignals::~VQuitSignals()
{
  if ( m_pNotifier )
  {
    for ( const int Signal : Signals )
    {
      std::signal( Signal, SIG_DFL );
    }
    m_pNotifier.reset();
    ::close( m_Ends[0] );
    ::close( m_Ends[1] );
  }
}

void VQuitSignals::Quit()
{
  m_pNotifier->setEnabled( false );
  QCoreApplication::quit();
}

} // namespace HostWindow
