#include "GenerationLock.h"

#include <ZEK/DebugServices.h>

#include <chrono>
#include <exception>
#include <system_error>
#include <thread>

namespace Store
{
namespace
{
/// Scopes are mostly over before a thread could fall asleep and be woken: so often it lets others run and looks again.
template < typename TDone >
bool IsSoon( const TDone& i_rDone )
{
  for ( int Look = 0; Look < 200; ++Look )
  {
    if ( i_rDone() )
    {
      return true;
    }
    std::this_thread::yield();
  }
  return false;
}
} // namespace

std::unique_lock< std::mutex > LockOrDie( std::mutex& io_rMutex )
{
  try
  {
    return std::unique_lock( io_rMutex );
  }
  catch ( const std::system_error& )
  {
    DebugServices::CallAssertFailHandler( "mutex locked", __FILE__, __LINE__ );
    std::terminate();
  }
}

void VGenerationLock::BeginLate( VReaderLine& io_rLine )
{
  // The line holds an older phase, so that no commit but the one under way can be over before it holds the new one.
  const std::uint64_t Phase = m_Phase.load();
  const std::uint64_t Target = Phase + ( IsCommit( Phase ) ? 1 : 0 );
  io_rLine.m_Phase.store( Target );
  // Up until now the line may have held the commit.
  if ( m_bDrainWaits.load() )
  {
    WakeDrain();
  }
  AwaitPhase( Target );
}

/// Returns in that phase; for a reader, who has announced it, in that or in the commit that waits for the reader.
void VGenerationLock::AwaitPhase( std::uint64_t i_Phase )
{
  const auto IsThere = [this, i_Phase]
  {
    return m_Phase.load( std::memory_order_acquire ) >= i_Phase;
  };
  if ( !IsSoon( IsThere ) )
  {
    std::unique_lock Lock = LockOrDie( m_Mutex );
    m_Advance.wait( Lock, IsThere );
  }
}

std::unique_lock< std::mutex > VGenerationLock::BeginCommit()
{
  const std::uint64_t Phase = m_Phase.load( std::memory_order_relaxed ) + 1;
  m_Phase.store( Phase );
  const auto IsDrained = [this, Phase]
  {
    return !m_pLines->AnyBefore( Phase );
  };
  // Without the mutex: readers may need it for handles before they leave.
  const bool bDrained = IsSoon( IsDrained );
  std::unique_lock Lock = LockOrDie( m_Mutex );
  if ( !bDrained )
  {
    m_bDrainWaits.store( true );
    // Whoever leaves wakes it; should its look have missed the sleeper, the commit is late by so much and no more.
    while ( !IsDrained() )
    {
      m_Drain.wait_for( Lock, std::chrono::milliseconds( 1 ) );
    }
    m_bDrainWaits.store( false );
  }
  return Lock;
}

void VGenerationLock::WakeDrain()
{
  // Taking the mutex: the commit is asleep by then, or has not looked yet.
  LockOrDie( m_Mutex ).unlock();
  m_Drain.notify_all();
}

bool VGenerationLock::IsAtRest() const
{
  const std::uint64_t Phase = m_Phase.load();
  return !IsCommit( Phase ) && m_NextWriter.load() == Phase / 2 && !m_pLines->AnyBefore( ~std::uint64_t( 0 ) );
}

} // namespace Store
