#pragma once

#include "ReaderLine.h"
#include "ThreadState.h"

#include <atomic>
#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <vector>

namespace Store
{

/// Locks the mutex; one that cannot be locked is fatal.
std::unique_lock< std::mutex > LockOrDie( std::mutex& io_rMutex );

/// Orders the scopes of a store: a commit waits for the readers of its generation, readers that come meanwhile wait
/// for that one commit, and writers commit in the order in which they came.
///
/// A FIFO of generations counts who is inside or waits to be; its front is the current generation. Readers that come
/// while no commit is under way are not counted there: each says in a cache line of its own that it is inside, then
/// looks whether a commit has begun, while the commit says that it begins, then looks at the lines. One of the two
/// sees the other. To the FIFO such readers are holders of its front that the commit waits for besides the count;
/// they need no place of their own, as a first writer enters the current generation with them or without them.
class VGenerationLock
{
public:
  /// Guards the FIFO, and all else of the store that its users say.
  std::mutex& Mutex() const { return m_Mutex; }
  const std::shared_ptr< VReaderLines >& Lines() const { return m_pLines; }
  /// The newest commit; stays as it is while a scope is open.
  std::uint64_t LastCommit() const { return m_Current.load( std::memory_order_relaxed ) - 1; }

  void BeginRead( VThreadState& io_rThread )
  {
    io_rThread.m_bCounted = false;
    io_rThread.m_pLine->m_Reading.store( 1 );
    if ( m_bCommit.load() )
    {
      LeaveLine( io_rThread );
      BeginCounted( io_rThread );
    }
  }
  void EndRead( VThreadState& io_rThread )
  {
    if ( io_rThread.m_bCounted )
    {
      EndCounted();
    }
    else
    {
      LeaveLine( io_rThread );
    }
  }
  void BeginWrite();
  /// Waits until the readers of the generation are gone, and gives the number of the commit. From here to
  /// `EndCommit` the caller holds the mutex, and nobody else is inside.
  std::uint64_t BeginCommit( std::unique_lock< std::mutex >& io_rLock );
  void EndCommit() { m_bCommit.store( false, std::memory_order_release ); }
  /// To be called when the mutex is free again: lets those in who wait for the commit.
  void Advance() { m_Advance.notify_all(); }

  /// Nobody is inside, and nobody waits.
  bool IsAtRest() const;

private:
  struct VGeneration
  {
    std::uint64_t m_Number;
    std::uint32_t m_Count;
  };

  void LeaveLine( VThreadState& io_rThread )
  {
    // The look may come before the store: the commit that fell asleep in between looks again by itself.
    io_rThread.m_pLine->m_Reading.store( 0, std::memory_order_release );
    if ( m_bDrainWaits.load( std::memory_order_relaxed ) )
    {
      WakeDrain();
    }
  }
  void BeginCounted( VThreadState& io_rThread );
  void EndCounted();
  void WakeDrain();
  bool IsDrained() const { return m_Fifo.front().m_Count == 0 && !m_pLines->AnyReading(); }

  mutable std::mutex m_Mutex;
  std::condition_variable m_Drain;
  std::condition_variable m_Advance;
  std::vector< VGeneration > m_Fifo;
  std::atomic< std::uint64_t > m_Current{ 1 };
  bool m_bWriterQueued = false;
  bool m_bCommitting = false;                 ///< a commit waits for readers
  std::atomic< bool > m_bCommit{ false };     ///< from before that until after the merge
  std::atomic< bool > m_bDrainWaits{ false }; ///< the commit sleeps: who leaves a line wakes it
  std::shared_ptr< VReaderLines > m_pLines = std::make_shared< VReaderLines >();
};

} // namespace Store
