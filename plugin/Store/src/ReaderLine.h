#pragma once

#include <atomic>
#include <cstdint>

namespace Store
{

/// Where one thread says that it is inside a read scope of one store, or waits to be. Nobody else writes the word, and
/// no other word shares its cache line.
struct alignas( 64 ) VReaderLine
{
  std::atomic< std::uint64_t > m_Phase{ 0 }; ///< the phase of the lock that it reads in; 0 outside
  std::atomic< bool > m_bTaken{ true };
  VReaderLine* m_pNext = nullptr; ///< fixed before the line is linked
};

/// All lines of a store. Lines are added and used again, and freed with the list only, so that it is walked without a
/// lock. Threads keep the list alive: it may outlive the store.
class VReaderLines
{
public:
  VReaderLines() = default;
  VReaderLines( const VReaderLines& ) = delete;
  VReaderLines& operator=( const VReaderLines& ) = delete;
  ~VReaderLines()
  {
    for ( VReaderLine* pLine = m_pHead.load(); pLine != nullptr; )
    {
      VReaderLine* const pNext = pLine->m_pNext;
      delete pLine;
      pLine = pNext;
    }
  }

  /// A line for the calling thread. Thread: any.
  VReaderLine& Take()
  {
    for ( VReaderLine* pLine = m_pHead.load( std::memory_order_acquire ); pLine != nullptr; pLine = pLine->m_pNext )
    {
      bool bTaken = false;
      if ( pLine->m_bTaken.compare_exchange_strong( bTaken, true, std::memory_order_acq_rel ) )
      {
        return *pLine;
      }
    }
    auto* const pLine = new VReaderLine;
    pLine->m_pNext = m_pHead.load();
    while ( !m_pHead.compare_exchange_weak( pLine->m_pNext, pLine ) )
    {
    }
    return *pLine;
  }
  static void GiveBack( VReaderLine& io_rLine ) { io_rLine.m_bTaken.store( false, std::memory_order_release ); }

  /// Somebody reads, or will, in a phase before that one.
  bool AnyBefore( std::uint64_t i_Phase ) const
  {
    for ( const VReaderLine* pLine = m_pHead.load(); pLine != nullptr; pLine = pLine->m_pNext )
    {
      // Outside, 0 becomes the greatest number.
      if ( pLine->m_Phase.load() - 1 < i_Phase - 1 )
      {
        return true;
      }
    }
    return false;
  }

private:
  std::atomic< VReaderLine* > m_pHead{ nullptr };
};

} // namespace Store
