#pragma once

#include "ReaderLine.h"

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <memory>
#include <mutex>

namespace Store
{

/// Locks the mutex; one that cannot be locked is fatal.
std::unique_lock< std::mutex > LockOrDie( std::mutex& io_rMutex );

/// Orders the scopes of a store: a commit waits for the readers of its generation, readers that come meanwhile wait
/// for that one commit, and writers commit in the order in which they came.
///
/// The phase tells all: 2g while generation g may be read, 2g + 1 while commit g drains its readers and merges. Writers
/// draw numbers, and the one with number g is inside in generation g. A reader writes the phase in which it will read
/// in a line of its own, then looks whether that phase has passed, while a commit moves the phase, then looks at the
/// lines: one of the two sees the other. A reader that comes during a commit announces the phase after it, so that
/// this commit does not wait for it and the next one does, however long the reader takes to wake.
class VGenerationLock
{
public:
  /// Guards what its users say. Merges happen under it, so the phase ends a commit under it, too.
  std::mutex& Mutex() const { return m_Mutex; }
  const std::shared_ptr< VReaderLines >& Lines() const { return m_pLines; }
  /// The newest commit; stays as it is while a scope is open.
  std::uint64_t LastCommit() const { return m_Phase.load( std::memory_order_relaxed ) / 2 - 1; }

  void BeginRead( VReaderLine& io_rLine )
  {
    const std::uint64_t Phase = m_Phase.load( std::memory_order_relaxed );
    io_rLine.m_Phase.store( Phase );
    if ( m_Phase.load() != Phase || IsCommit( Phase ) )
    {
      BeginLate( io_rLine );
    }
  }
  void EndRead( VReaderLine& io_rLine )
  {
    // The look may come before the store: the commit that fell asleep in between looks again by itself.
    io_rLine.m_Phase.store( 0, std::memory_order_release );
    if ( m_bDrainWaits.load( std::memory_order_relaxed ) )
    {
      WakeDrain();
    }
  }
  void BeginWrite()
  {
    const std::uint64_t Mine = 2 * m_NextWriter.fetch_add( 1, std::memory_order_relaxed );
    if ( m_Phase.load( std::memory_order_acquire ) != Mine )
    {
      AwaitPhase( Mine );
    }
  }
  /// Waits until the readers of the generation are gone. From here to `EndCommit` the caller holds the mutex, and
  /// nobody else is inside.
  std::unique_lock< std::mutex > BeginCommit();
  /// The number of the commit under way.
  std::uint64_t Commit() const { return m_Phase.load( std::memory_order_relaxed ) / 2; }
  void EndCommit() { m_Phase.store( m_Phase.load( std::memory_order_relaxed ) + 1, std::memory_order_release ); }
  /// To be called when the mutex is free again: lets those in who wait for the commit.
  void Advance() { m_Advance.notify_all(); }

  /// Nobody is inside, and nobody waits.
  bool IsAtRest() const;

private:
  static bool IsCommit( std::uint64_t i_Phase ) { return i_Phase % 2 != 0; }
  void BeginLate( VReaderLine& io_rLine );
  void AwaitPhase( std::uint64_t i_Phase );
  void WakeDrain();

  // Those that every reader looks at, apart from those that every writer writes.
  alignas( 64 ) std::atomic< std::uint64_t > m_Phase{ 2 };
  std::atomic< bool > m_bDrainWaits{ false }; ///< the commit sleeps: who leaves a line wakes it
  std::shared_ptr< VReaderLines > m_pLines = std::make_shared< VReaderLines >();

  alignas( 64 ) std::atomic< std::uint64_t > m_NextWriter{ 1 };
  mutable std::mutex m_Mutex;
  std::condition_variable m_Drain;
  std::condition_variable m_Advance;
};

} // namespace Store
