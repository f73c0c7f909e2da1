#include <HostServices/VPostalService.h>

#include <ZEK/Log.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QEvent>
#include <QtCore/QObject>
#include <QtCore/QThread>

#include <deque>
#include <exception>
#include <mutex>

namespace HostServices
{
namespace
{
ZEK::VLogCategory& Category()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "PostalService" );
  return rCategory;
}

QEvent::Type TurnEventType()
{
  static const auto Type = static_cast< QEvent::Type >( QEvent::registerEventType() );
  return Type;
}

class VTurnEvent final : public QEvent
{
public:
  explicit VTurnEvent( std::uint64_t i_Last )
    : QEvent( TurnEventType() )
    , Last( i_Last )
  {
  }
  const std::uint64_t Last; ///< the function that this turn is for
};

void Run( const std::function< void() >& i_rFunction )
{
  try
  {
    i_rFunction();
  }
  catch ( const std::exception& rError )
  {
    ZEK::Log( Category(), ZEK::ELogFailure, "A posted function failed: %1%", rError.what() );
  }
  catch ( ... )
  {
    ZEK::Log( Category(), ZEK::ELogFailure, "A posted function failed" );
  }
}
} // namespace

struct VPostalService::VState
{
  /// Lives on the thread of the service and takes its events.
  class VReceiver final : public QObject
  {
  public:
    explicit VReceiver( std::weak_ptr< VState > i_pState )
      : m_pState( std::move( i_pState ) )
    {
    }

    bool event( QEvent* i_pEvent ) override
    {
      const auto pState = m_pState.lock();
      if ( !pState )
      {
        return QObject::event( i_pEvent );
      }
      // The event was made under the guard by the thread that posted.
      std::unique_lock Lock( pState->Guard );
      if ( i_pEvent->type() != TurnEventType() )
      {
        Lock.unlock();
        return QObject::event( i_pEvent );
      }
      const std::uint64_t Last = static_cast< VTurnEvent* >( i_pEvent )->Last;
      Lock.unlock();
      // The function may destroy the service, and this object with it: nothing of it is touched afterwards.
      pState->RunUpTo( Last );
      return true;
    }

  private:
    std::weak_ptr< VState > m_pState;
  };

  struct VEntry
  {
    std::uint64_t Number;
    std::function< void() > Function;
  };

  /// Empty when no function up to that number is left.
  std::function< void() > TakeFront( std::uint64_t i_Last )
  {
    const std::lock_guard Lock( Guard );
    std::function< void() > Function;
    if ( !Queue.empty() && Queue.front().Number <= i_Last )
    {
      Function.swap( Queue.front().Function );
      Queue.pop_front();
    }
    return Function;
  }

  /// Events of functions that `DrainForTest` has run find nothing to do; they must not run a later one early.
  void RunUpTo( std::uint64_t i_Last )
  {
    // Each is destroyed outside the lock: what it held may post.
    while ( const std::function< void() > Function = TakeFront( i_Last ) )
    {
      Run( Function );
    }
  }

  void Close()
  {
    std::deque< VEntry > Dropped;
    std::unique_ptr< VReceiver > pGone;
    const std::lock_guard Lock( Guard );
    bOpen = false;
    Dropped.swap( Queue );
    pGone = std::move( pReceiver );
    if ( pGone && pGone->thread() != QThread::currentThread() )
    {
      // Its own thread may be handing it an event at this moment.
      pGone.release()->deleteLater();
    }
    // Declared before the lock, the queue and the receiver are destroyed after it: a function that goes may post.
  }

  std::mutex Guard;
  std::deque< VEntry > Queue;
  std::uint64_t NextNumber = 1;
  bool bOpen = true;
  std::unique_ptr< VReceiver > pReceiver;
};

namespace
{
/// Closes what still is open when the application object goes: its event queue must not be reached afterwards.
class VEndOfApplication
{
public:
  static VEndOfApplication& Get()
  {
    static VEndOfApplication Instance;
    return Instance;
  }

  void Add( std::weak_ptr< void > i_pOwner, std::function< void() > i_Close )
  {
    const std::lock_guard Lock( m_Guard );
    std::erase_if( m_Closers,
                   []( const VCloser& i_rCloser )
                   {
                     return i_rCloser.pOwner.expired();
                   } );
    if ( !m_bListening )
    {
      qAddPostRoutine( &VEndOfApplication::CloseAll );
      m_bListening = true;
    }
    m_Closers.push_back( { std::move( i_pOwner ), std::move( i_Close ) } );
  }

private:
  struct VCloser
  {
    std::weak_ptr< void > pOwner;
    std::function< void() > Close;
  };

  static void CloseAll()
  {
    std::vector< VCloser > Closers;
    {
      const std::lock_guard Lock( Get().m_Guard );
      Closers.swap( Get().m_Closers );
      // Routines are called once; another application object wants its own.
      Get().m_bListening = false;
    }
    for ( const VCloser& rCloser : Closers )
    {
      rCloser.Close();
    }
  }

  std::mutex m_Guard;
  std::vector< VCloser > m_Closers;
  bool m_bListening = false;
};
} // namespace

VPostalService::VPostalService()
  : m_pState( std::make_shared< VState >() )
{
  m_pState->pReceiver = std::make_unique< VState::VReceiver >( m_pState );
  const std::weak_ptr< VState > pWeak = m_pState;
  VEndOfApplication::Get().Add( pWeak,
                                [pWeak]
                                {
                                  if ( const auto pState = pWeak.lock() )
                                  {
                                    pState->Close();
                                  }
                                } );
}

VPostalService::~VPostalService()
{
  Close();
}

void VPostalService::Post( std::function< void() > i_Function )
{
  if ( !i_Function )
  {
    return;
  }
  const auto pState = m_pState;
  // Posting the event under the lock keeps events in the order of their numbers and the receiver alive.
  const std::lock_guard Lock( pState->Guard );
  if ( !pState->bOpen )
  {
    return;
  }
  const std::uint64_t Number = pState->NextNumber++;
  pState->Queue.push_back( { Number, std::move( i_Function ) } );
  QCoreApplication::postEvent( pState->pReceiver.get(), new VTurnEvent( Number ) );
}

bool VPostalService::DrainForTest()
{
  constexpr int MaximumTurns = 10'000;
  const auto pState = m_pState;
  for ( int Turn = 0; Turn < MaximumTurns; ++Turn )
  {
    std::uint64_t Last = 0;
    {
      const std::lock_guard Lock( pState->Guard );
      if ( pState->Queue.empty() )
      {
        return true;
      }
      Last = pState->Queue.back().Number;
    }
    pState->RunUpTo( Last );
  }
  return false;
}

void VPostalService::Close()
{
  m_pState->Close();
}

} // namespace HostServices
