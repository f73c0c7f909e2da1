#include "CacheTestTransform.h"

#include <atomic>
#include <chrono>
#include <thread>

using namespace CacheTest;
using Flow2StateCache::VFlowStateCacheTransform;

namespace
{
/// A lock is not fair: without a pause the one who has it takes it again.
constexpr std::chrono::microseconds Breath( 20 );

/// Adds frames to both of its caches, and fires all else that they can, until it goes.
class VWriter
{
public:
  VWriter()
    : m_Thread(
          [this]
          {
            for ( std::uint32_t Frame = 1; !m_bDone; ++Frame )
            {
              for ( std::size_t Which = 0; Which < 2; ++Which )
              {
                Caches[Which]->Add( NumberState( { static_cast< std::int64_t >( Frame ), 1, 1 }, Frame ) ).Code();
                Caches[Which]->SetStatus( Frame % 2 );
              }
              if ( Frame % 16 == 0 )
              {
                Caches[0]->SetStaticItems( { HostFlow::NewItem< CoreMoxelTypes::FlowDevice >() } );
                Caches[1]->NamesChanged();
                Caches[1]->Clear();
                std::this_thread::sleep_for( Breath );
              }
            }
          } )
  {
  }
  ~VWriter()
  {
    m_bDone = true;
    m_Thread.join();
  }

  const std::shared_ptr< HostFlow::IHostStateCache > Caches[2] = { HostFlow::MakeCache( 8 ), HostFlow::MakeCache( 8 ) };

private:
  std::atomic< bool > m_bDone{ false };
  std::thread m_Thread;
};

/// Fetches from a cache that may go away meanwhile, as a view does.
struct VReader
{
  std::weak_ptr< VFlowStateCacheTransform > pWeak;
  const std::atomic< int >& rPose;
  std::atomic< int >& rWrong;
  std::atomic< int >& rSeen;

  void operator()() const
  {
    // Holds the cache for one round at a time: whoever has the last reference then destroys it.
    for ( int Round = 0; Fetch( Round ); ++Round )
    {
      std::this_thread::sleep_for( Breath );
    }
  }
  bool Fetch( int i_Round ) const
  {
    const auto pCache = pWeak.lock();
    if ( !pCache )
    {
      return false;
    }
    const int Least = rPose;
    ZEK::VFlowStateRef State;
    pCache->Fetch( State, 31, 2, 0 );
    Check( State, Least );
    if ( State && i_Round % 4 == 0 )
    {
      const ZEK::VFlowTimeKey Key = State->GetKey();
      pCache->FetchWhere( Key, State, 31, 2, 0 );
      Check( State, Least );
      std::vector< ZEK::VFlowStateRef > Many;
      pCache->FetchMany( { { Key.Frame - 2, 1, 1 }, Key }, Many, 0 );
      for ( const ZEK::VFlowStateRef& rState : Many )
      {
        Check( rState, Least );
      }
      ZEK::IResult Status;
      std::vector< ZEK::VFlowItemRef > Items;
      pCache->GetStaticItems( Status, Items );
      rWrong += Items.size() > 1;
    }
    return true;
  }
  /// A whole output, made of its own input, and not with parameters that were replaced before the fetch.
  void Check( const ZEK::VFlowStateRef& i_rState, int i_Least ) const
  {
    if ( i_rState )
    {
      rSeen += 1;
      rWrong += NumberOf( *i_rState ) != i_rState->GetKey().Frame || PoseOf( *i_rState ) < i_Least;
    }
  }
};
} // namespace

TEST( CacheTransformThreads, SourcesComeAndGoAndTheCacheDiesWhileOthersFetchAndFire )
{
  VWriter Writer;
  std::atomic< int > Wrong{ 0 }, Seen{ 0 };
  const auto pFired = std::make_shared< std::atomic< int > >( 0 );
  for ( int Life = 0; Life < 40; ++Life )
  {
    std::atomic< int > CurrentPose{ 0 };
    auto pCache = std::make_shared< VFlowStateCacheTransform >();
    const auto pTransform = std::make_shared< VTransform >();
    pCache->SetSource( Writer.Caches[0] );
    pCache->SetTransform( pTransform );
    std::vector< ZEK::VConnection > Connections;
    for ( ZEK::IMultiCallbackPostal< void() >* pNotifier :
          { &pCache->StatesChanged(), &pCache->Notifier3(), &pCache->Notifier4(), &pCache->Notifier6() } )
    {
      Connections.push_back( pNotifier->Connect(
          [pFired]
          {
            ++*pFired;
          },
          nullptr ) );
    }
    std::vector< std::thread > Readers;
    for ( int Reader = 0; Reader < 2; ++Reader )
    {
      Readers.emplace_back( VReader{ pCache, CurrentPose, Wrong, Seen } );
    }
    const int Goal = Seen + 60;
    for ( int Change = 1; Seen < Goal || Change < 24; ++Change )
    {
      pCache->SetParameters( Pose( Change ) );
      CurrentPose = Change;
      if ( Change % 3 == 0 )
      {
        pCache->SetSource( Change % 9 == 0 ? nullptr : Writer.Caches[Change % 2] );
      }
      if ( Change % 5 == 0 )
      {
        pCache->SetTransform( std::make_shared< VTransform >() );
      }
    }
    // The last reference goes with the main thread in one life and with a reader in the next.
    pCache.reset();
    for ( std::thread& rReader : Readers )
    {
      rReader.join();
    }
    EXPECT_EQ( Wrong, 0 ) << "life " << Life;
  }
  EXPECT_GT( *pFired, 100 );
}
