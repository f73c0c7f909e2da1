#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <mutex>
#include <utility>
#include <vector>

namespace ZEK
{

/// The host's queue: a function handed to it runs later on its thread, in order. Thread: `Post` from any thread.
class IPostalService
{
public:
  virtual ~IPostalService() = default;
  virtual void Post( std::function< void() > i_Function ) = 0;
};

/// Keeps a callback connected; the destructor disconnects. A call that is already running on another thread is
/// not waited for: a callback holds weak references only.
class VConnection
{
public:
  VConnection() = default;
  explicit VConnection( std::function< void() > i_Disconnect )
    : m_Disconnect( std::move( i_Disconnect ) )
  {
  }
  VConnection( VConnection&& io_rOther ) noexcept
    : m_Disconnect( std::exchange( io_rOther.m_Disconnect, nullptr ) )
  {
  }
  VConnection& operator=( VConnection&& io_rOther ) noexcept
  {
    if ( this != &io_rOther )
    {
      Disconnect();
      m_Disconnect = std::exchange( io_rOther.m_Disconnect, nullptr );
    }
    return *this;
  }
  ~VConnection() { Disconnect(); }

  void Disconnect()
  {
    if ( m_Disconnect )
    {
      std::exchange( m_Disconnect, nullptr )();
    }
  }

private:
  std::function< void() > m_Disconnect;
};

template < typename TSignature >
class IMultiCallback;

/// A notifier that functions connect to.
template < typename... TArguments >
class IMultiCallback< void( TArguments... ) >
{
public:
  using VFunction = std::function< void( TArguments... ) >;

  virtual ~IMultiCallback() = default;
  /// With a postal service the function runs on its thread; with null it runs on the thread that fires, so it
  /// may only set flags or post work. The connection may outlive the notifier.
  [[nodiscard]] virtual VConnection Connect( VFunction i_Function, std::shared_ptr< IPostalService > i_pPostal ) = 0;
};

template < typename TSignature >
using IMultiCallbackPostal = IMultiCallback< TSignature >;

template < typename TSignature >
class VMultiCallback;

/// The one implementation of a notifier. Thread: any; functions run with no lock held.
template < typename... TArguments >
class VMultiCallback< void( TArguments... ) > final : public IMultiCallback< void( TArguments... ) >
{
public:
  using VFunction = typename IMultiCallback< void( TArguments... ) >::VFunction;

  [[nodiscard]] VConnection Connect( VFunction i_Function, std::shared_ptr< IPostalService > i_pPostal ) override
  {
    const std::lock_guard Lock( m_pState->Guard );
    const std::uint64_t Id = m_pState->NextId++;
    m_pState->Copy();
    m_pState->pEntries->push_back(
        { Id, std::make_shared< VFunction >( std::move( i_Function ) ), std::move( i_pPostal ) } );
    return VConnection(
        [pWeak = std::weak_ptr( m_pState ), Id]
        {
          if ( const auto pState = pWeak.lock() )
          {
            const std::lock_guard Inner( pState->Guard );
            pState->Copy();
            std::erase_if( *pState->pEntries,
                           [Id]( const VEntry& i_rEntry )
                           {
                             return i_rEntry.Id == Id;
                           } );
          }
        } );
  }

  /// Allocates nothing for functions without a postal service.
  void Fire( TArguments... i_Arguments ) const
  {
    std::shared_ptr< std::vector< VEntry > > pEntries;
    {
      const std::lock_guard Lock( m_pState->Guard );
      pEntries = m_pState->pEntries;
    }
    for ( const VEntry& rEntry : *pEntries )
    {
      if ( !rEntry.pPostal )
      {
        ( *rEntry.pFunction )( i_Arguments... );
        continue;
      }
      // A delivery that arrives after Disconnect() finds the function gone.
      rEntry.pPostal->Post(
          [pWeak = std::weak_ptr( rEntry.pFunction ), i_Arguments...]
          {
            if ( const auto pFunction = pWeak.lock() )
            {
              ( *pFunction )( i_Arguments... );
            }
          } );
    }
  }

private:
  struct VEntry
  {
    std::uint64_t Id;
    std::shared_ptr< VFunction > pFunction;
    std::shared_ptr< IPostalService > pPostal;
  };
  struct VState
  {
    /// The list is replaced, never changed in place, while a Fire() may be walking it.
    void Copy() { pEntries = std::make_shared< std::vector< VEntry > >( *pEntries ); }

    std::mutex Guard;
    std::uint64_t NextId = 1;
    std::shared_ptr< std::vector< VEntry > > pEntries = std::make_shared< std::vector< VEntry > >();
  };
  std::shared_ptr< VState > m_pState = std::make_shared< VState >();
};

} // namespace ZEK
