#include "GenerationLock.h"

#include <ZEK/DebugServices.h>

#include <chrono>
#include <exception>
#include <system_error>
#include <thread>

namespace Store
{

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

void VGenerationLock::BeginCounted( VThreadState& io_rThread )
{
  std::unique_lock Lock = LockOrDie( m_Mutex );
  io_rThread.m_bCounted = true;
  const std::uint64_t Current = m_Current.load( std::memory_order_relaxed );
  if ( m_Fifo.empty() )
  {
    m_Fifo.push_back( { Current, 1 } );
    m_bWriterQueued = false;
    return;
  }
  if ( !m_bCommitting )
  {
    ++m_Fifo.front().m_Count;
    return;
  }
  if ( m_Fifo.size() > 1 )
  {
    ++m_Fifo[1].m_Count;
  }
  else
  {
    m_Fifo.push_back( { Current + 1, 1 } );
    // Else the next writer would open a generation behind this one, which its readers take away without a commit:
    // the writer would wait for a number that never comes.
    m_bWriterQueued = false;
  }
  m_Advance.wait( Lock,
                  [this, Current]
                  {
                    return m_Current.load( std::memory_order_relaxed ) == Current + 1;
                  } );
}

void VGenerationLock::EndCounted()
{
  std::unique_lock Lock = LockOrDie( m_Mutex );
  if ( --m_Fifo.front().m_Count != 0 )
  {
    return;
  }
  if ( m_bCommitting )
  {
    Lock.unlock();
    m_Drain.notify_all();
    return;
  }
  DebugServices::Check( m_Fifo.size() == 1, "m_Fifo.size() == 1", __FILE__, __LINE__ );
  m_Fifo.erase( m_Fifo.begin() );
}

void VGenerationLock::BeginWrite()
{
  std::unique_lock Lock = LockOrDie( m_Mutex );
  std::uint64_t Target = m_Current.load( std::memory_order_relaxed ) + m_Fifo.size();
  if ( !m_Fifo.empty() && !m_bWriterQueued )
  {
    --Target;
    ++m_Fifo.back().m_Count;
  }
  else
  {
    m_Fifo.push_back( { Target, 1 } );
  }
  m_bWriterQueued = true;
  m_Advance.wait( Lock,
                  [this, Target]
                  {
                    return m_Current.load( std::memory_order_relaxed ) == Target;
                  } );
}

std::uint64_t VGenerationLock::BeginCommit( std::unique_lock< std::mutex >& io_rLock )
{
  --m_Fifo.front().m_Count;
  m_bCommitting = true;
  m_bCommit.store( true );
  // Readers that are in no hurry to be counted are mostly gone before a thread could fall asleep.
  for ( int Look = 0; Look < 100 && m_Fifo.front().m_Count == 0 && m_pLines->AnyReading(); ++Look )
  {
    std::this_thread::yield();
  }
  if ( !IsDrained() )
  {
    m_bDrainWaits.store( true );
    // Whoever leaves wakes it; should its look have missed the sleeper, the commit is late by so much and no more.
    while ( !IsDrained() )
    {
      m_Drain.wait_for( io_rLock, std::chrono::milliseconds( 1 ) );
    }
    m_bDrainWaits.store( false );
  }
  m_Fifo.erase( m_Fifo.begin() );
  m_bCommitting = false;
  const std::uint64_t Number = m_Current.load( std::memory_order_relaxed );
  m_Current.store( Number + 1, std::memory_order_relaxed );
  return Number;
}

void VGenerationLock::WakeDrain()
{
  // Taking the mutex: the commit is asleep by then, or has not looked yet.
  LockOrDie( m_Mutex ).unlock();
  m_Drain.notify_all();
}

bool VGenerationLock::IsAtRest() const
{
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  return m_Fifo.empty() && !m_bCommitting && !m_bCommit.load() && !m_pLines->AnyReading();
}

} // namespace Store
