#pragma once

#include <atomic>

namespace HostFlow
{

/// Objects that wait for their next use, linked through their own `pNextFree`. Giving back takes no lock and may
/// happen on any thread; those who take keep out of each other's way by a lock of their own.
template < typename T >
class VFreeList
{
public:
  void GiveBack( T& i_rObject )
  {
    T* pHead = m_pReturned.load( std::memory_order_relaxed );
    do
    {
      i_rObject.pNextFree = pHead;
    } while (
        !m_pReturned.compare_exchange_weak( pHead, &i_rObject, std::memory_order_release, std::memory_order_relaxed ) );
  }

  /// Null when nothing waits.
  T* Take()
  {
    if ( !m_pReady )
    {
      // The whole chain changes hands at once, so a head that comes back meanwhile cannot deceive anyone.
      m_pReady = m_pReturned.exchange( nullptr, std::memory_order_acquire );
    }
    T* pObject = m_pReady;
    if ( pObject )
    {
      m_pReady = pObject->pNextFree;
      pObject->pNextFree = nullptr;
    }
    return pObject;
  }

private:
  alignas( 64 ) std::atomic< T* > m_pReturned{ nullptr };
  alignas( 64 ) T* m_pReady = nullptr;
};

} // namespace HostFlow
