#pragma once

#include "Delivery.h"
#include "ReaderLine.h"

#include <cstddef>
#include <cstdint>
#include <deque>
#include <functional>
#include <memory>
#include <utility>

namespace Store
{

/// What a thread has open in one store.
struct VThreadState
{
  std::uint64_t m_Serial = 0;   ///< of the store; another one's leavings are never taken for its own
  std::uint32_t m_Depth = 0;    ///< open scopes
  bool m_bWriter = false;       ///< the outermost one writes
  bool m_bDraining = false;     ///< deferred functions are being run
  bool m_bSpareTaken = false;   ///< by a commit whose end is not over
  std::uint32_t m_Dispatch = 0; ///< commits of this thread whose callbacks are being called
  std::deque< std::function< void() > > m_Deferred;
  VOutbox m_Outbox;
  VDelivery m_Spare; ///< keeps its memory from commit to commit
  std::shared_ptr< VReaderLines > m_pLines;
  VReaderLine* m_pLine = nullptr;
};

/// The place of a store among the states of every thread. Places are used again, serials never.
class VThreadSlot
{
public:
  VThreadSlot();
  ~VThreadSlot();
  VThreadSlot( const VThreadSlot& ) = delete;
  VThreadSlot& operator=( const VThreadSlot& ) = delete;

  /// The calling thread's state; lasts as long as the slot and the thread.
  VThreadState& Get( const std::shared_ptr< VReaderLines >& i_rpLines )
  {
    return t_LastSerial == m_Serial ? *t_pLast : Find( i_rpLines );
  }

private:
  VThreadState& Find( const std::shared_ptr< VReaderLines >& i_rpLines );

  // The state that the thread used last.
  static constinit thread_local std::uint64_t t_LastSerial;
  static constinit thread_local VThreadState* t_pLast;
  friend struct VThreadStates;

  std::size_t m_Place;
  std::uint64_t m_Serial;
};

} // namespace Store
