#pragma once

#include <ZEK/Callback.h>

#include <atomic>
#include <functional>
#include <memory>
#include <utility>

namespace ZEK
{

/// Turns a stream of calls into at most one delivery at a time: a call while a delivery is queued is dropped. A call
/// that comes while the function runs queues the next delivery, so the last change is never lost.
///
/// With a postal service the function runs on its thread; with null it runs at once on the calling thread.
/// A delivery that is still queued when the collapser goes away is not made. Thread: any.
class VDispatchCollapser
{
public:
  VDispatchCollapser( std::function< void() > i_Function, std::shared_ptr< IPostalService > i_pPostal )
    : m_pState( std::make_shared< VState >() )
  {
    m_pState->Function = std::move( i_Function );
    m_pState->pPostal = std::move( i_pPostal );
  }

  void operator()() const { Dispatch( m_pState ); }

  /// For a notifier to keep: calls that come after the collapser went away do nothing.
  std::function< void() > Callback() const
  {
    return [pWeak = std::weak_ptr( m_pState )]
    {
      if ( const auto pState = pWeak.lock() )
      {
        Dispatch( pState );
      }
    };
  }

private:
  struct VState
  {
    std::function< void() > Function;
    std::shared_ptr< IPostalService > pPostal;
    std::atomic< bool > bQueued{ false };
  };

  static void Dispatch( const std::shared_ptr< VState >& i_rpState )
  {
    if ( !i_rpState->pPostal )
    {
      i_rpState->Function();
      return;
    }
    if ( i_rpState->bQueued.exchange( true, std::memory_order_acq_rel ) )
    {
      return;
    }
    i_rpState->pPostal->Post(
        [pWeak = std::weak_ptr( i_rpState )]
        {
          if ( const auto pState = pWeak.lock() )
          {
            // An exchange, not a store: it takes over what the dropped callers wrote before they called.
            pState->bQueued.exchange( false, std::memory_order_acq_rel );
            pState->Function();
          }
        } );
  }

  std::shared_ptr< VState > m_pState;
};

} // namespace ZEK
