#include "StoreFixture.h"

#include <ZEK/StoreValue.h>

#include <gtest/gtest.h>

#include <array>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <thread>

using namespace ZEK;
using namespace Store;

namespace
{
constexpr auto Span = std::chrono::milliseconds( 1500 );

/// Threads that run until the time is up.
class VCrowd
{
public:
  template < typename TWork >
  void Add( TWork i_Work )
  {
    m_Threads.emplace_back(
        [this, Work = std::move( i_Work )]() mutable
        {
          while ( !m_bStop.load( std::memory_order_relaxed ) )
          {
            Work();
          }
        } );
  }
  void Run( std::chrono::milliseconds i_Span = Span )
  {
    std::this_thread::sleep_for( i_Span );
    m_bStop = true;
    for ( std::thread& rThread : m_Threads )
    {
      rThread.join();
    }
    m_Threads.clear();
    m_bStop = false;
  }

private:
  std::atomic< bool > m_bStop{ false };
  std::vector< std::thread > m_Threads;
};

/// A service with a thread of its own.
class VThreadService final : public IPostalService
{
public:
  explicit VThreadService( std::chrono::microseconds i_Pause )
    : m_Pause( i_Pause )
    , m_Thread(
          [this]
          {
            Loop();
          } )
  {
  }
  ~VThreadService() override { Stop(); }
  void Post( std::function< void() > i_Function ) override
  {
    {
      const std::lock_guard Lock( m_Guard );
      m_Functions.push_back( std::move( i_Function ) );
    }
    m_Wake.notify_one();
  }
  /// Runs what is left and ends the thread.
  void Stop()
  {
    if ( m_Thread.joinable() )
    {
      {
        const std::lock_guard Lock( m_Guard );
        m_bStop = true;
      }
      m_Wake.notify_one();
      m_Thread.join();
    }
  }

private:
  void Loop()
  {
    for ( ;; )
    {
      std::unique_lock Lock( m_Guard );
      m_Wake.wait( Lock,
                   [this]
                   {
                     return m_bStop || !m_Functions.empty();
                   } );
      if ( m_Functions.empty() )
      {
        return;
      }
      const std::function< void() > Function = std::move( m_Functions.front() );
      m_Functions.pop_front();
      Lock.unlock();
      std::this_thread::sleep_for( m_Pause );
      Function();
    }
  }

  const std::chrono::microseconds m_Pause;
  std::mutex m_Guard;
  std::condition_variable m_Wake;
  std::deque< std::function< void() > > m_Functions;
  bool m_bStop = false;
  std::thread m_Thread;
};

std::uint64_t Number( const IStoreReader& i_rReader, VStoreEntry* i_pEntry )
{
  std::uint64_t Value = 0;
  return IO::ReadTyped( i_rReader.VerifiedValue( i_pEntry ), Value ) ? Value : 0;
}
} // namespace

TEST( StoreConcurrency, ReadersSeeOneGenerationAndGroupsWhole )
{
  const VTestStore Store( 256 );
  std::array< VStoreEntry*, 64 > Group{};
  for ( std::size_t Place = 0; Place < Group.size(); ++Place )
  {
    Group[Place] = Store[( "g/" + std::to_string( Place ) ).c_str()];
  }
  std::atomic< std::uint64_t > Reads{ 0 }, Turn{ 0 };
  std::atomic< bool > bWriting{ false };
  VCrowd Crowd;
  for ( const bool bLong : { false, false, true } )
  {
    Crowd.Add(
        [&, bLong]
        {
          const VStoreReadScope Scope( *Store.m_pStore );
          const std::uint64_t Id = Scope->Generation().Value();
          const VStoreReadScope Nested( *Store.m_pStore );
          if ( bLong )
          {
            std::this_thread::sleep_for( std::chrono::microseconds( 300 ) );
          }
          std::size_t Wrong = 0;
          for ( VStoreEntry* const pEntry : Group )
          {
            Wrong += Number( *Nested, pEntry ) != Id || Nested->ChangeIds( pEntry ).m_Verified.Value() != Id;
          }
          // Every second generation has a child more.
          Wrong += Scope->ChildCount( Store["g"] ) != ( Id == 0 ? 0 : Group.size() + Id % 2 );
          Wrong += Scope->FindEntries( "g/*" ).size() != Scope->ChildCount( Store["g"] );
          Wrong += Scope->Generation().Value() != Id;
          ASSERT_EQ( Wrong, 0u );
          Reads.fetch_add( 1, std::memory_order_relaxed );
        } );
  }
  for ( int Writer = 0; Writer < 2; ++Writer )
  {
    Crowd.Add(
        [&]
        {
          VStoreWriteScope Scope( *Store.m_pStore );
          ASSERT_FALSE( bWriting.exchange( true ) );
          const std::uint64_t Id = Scope->Generation().Value() + 1;
          ASSERT_EQ( Turn++, Id - 1 ) << "writers come one after another";
          for ( VStoreEntry* const pEntry : Group )
          {
            (void)Scope->SetValue( pEntry, IO::MakeValue( Id ) );
          }
          VStoreEntry* const pOdd = Store["g/odd"];
          ASSERT_TRUE( Id % 2 == 1 ? Scope->SetValue( pOdd, IO::MakeValue( Id ) ).IsOk()
                                   : Scope->RemoveEntry( pOdd ).IsOk() );
          bWriting = false;
        } );
  }
  Crowd.Add(
      [&, Made = 0]() mutable
      {
        const std::string Path = "h/" + std::to_string( ++Made % 5000 );
        VStoreEntry* const pMade = Store[Path.c_str()];
        ASSERT_EQ( Store.m_pStore->FindEntry( Path ), pMade );
      } );
  Crowd.Run();
  EXPECT_TRUE( Store.m_pStore->IsAtRest() );
  EXPECT_EQ( Store.m_pStore->LastCommit(), Turn );
  EXPECT_GT( Reads, 10u );
  EXPECT_GT( Turn, 10u );
}

TEST( StoreConcurrency, AReaderWaitsForOneCommitAndACommitForItsReaders )
{
  const VTestStore Store;
  Store.Set( "a", 1 );
  VStore& rStore = *Store.m_pStore;
  // A commit that waits for this thread's scope, a reader that comes meanwhile, and a second writer behind it.
  rStore.BeginRead();
  std::atomic< int > Stage{ 0 };
  std::thread First(
      [&]
      {
        rStore.BeginWrite()->Touch( Store["a"] );
        Stage = 1;
        rStore.EndWrite();
      } );
  while ( Stage != 1 )
  {
    std::this_thread::yield();
  }
  std::this_thread::sleep_for( std::chrono::milliseconds( 20 ) );
  EXPECT_EQ( rStore.LastCommit(), 1u );
  std::atomic< std::uint64_t > Seen{ 0 }, SeenBySecond{ 0 };
  std::atomic< bool > bLeave{ false };
  std::thread Reader(
      [&]
      {
        Seen = rStore.BeginRead()->Generation().Value();
        while ( !bLeave )
        {
          std::this_thread::yield();
        }
        rStore.EndRead();
      } );
  std::this_thread::sleep_for( std::chrono::milliseconds( 20 ) );
  std::thread Second(
      [&]
      {
        SeenBySecond = rStore.BeginWrite()->Generation().Value();
        rStore.EndWrite();
      } );
  std::this_thread::sleep_for( std::chrono::milliseconds( 20 ) );
  EXPECT_EQ( Seen, 0u ) << "the commit is still waiting";
  // Nested scopes never wait.
  rStore.BeginRead();
  rStore.EndRead();
  rStore.EndRead();
  First.join();
  while ( Seen == 0 )
  {
    std::this_thread::yield();
  }
  EXPECT_EQ( Seen, 2u );
  EXPECT_EQ( rStore.LastCommit(), 2u );
  bLeave = true;
  Reader.join();
  Second.join();
  EXPECT_EQ( SeenBySecond, 2u );
  EXPECT_EQ( rStore.LastCommit(), 3u );
  EXPECT_TRUE( rStore.IsAtRest() );
}

TEST( StoreConcurrency, HandlersComeAndGoDuringCommits )
{
  VTestStore Store( 256 );
  const auto pSlow = std::make_shared< VThreadService >( std::chrono::microseconds( 50 ) );
  const auto pFast = std::make_shared< VThreadService >( std::chrono::microseconds( 0 ) );
  // One callback a mode and service that stays, and hears of every commit in the end.
  struct VEar
  {
    std::atomic< std::uint64_t > m_Last{ 0 };
    std::atomic< bool > m_bFell{ false };
  };
  std::array< VEar, 5 > Ears;
  const auto pKept = Store.OnPattern( "*/0" );
  const auto Hear = [&Ears]( std::size_t i_Ear ) -> ChangeFunction
  {
    return [&rEar = Ears[i_Ear]]( IBitFlags< EChangeFlags >, ChangeId i_Id )
    {
      rEar.m_bFell = rEar.m_bFell || i_Id.Value() < rEar.m_Last;
      rEar.m_Last = i_Id.Value();
    };
  };
  pKept->AddImmediateCallback( Hear( 0 ), EChangeVerified );
  for ( const std::uint32_t Mode : { 0u, 1u } )
  {
    pKept->AddCallbackOn( pSlow, Hear( 1 + Mode ), EChangeVerified, Mode );
    pKept->AddCallbackOn( pFast, Hear( 3 + Mode ), EChangeVerified, Mode );
  }
  std::atomic< std::uint64_t > Commits{ 0 }, Heard{ 0 };
  VCrowd Crowd;
  for ( const char* const pName : { "x/0", "y/0", "z/1" } )
  {
    Crowd.Add(
        [&, pName, Value = 0]() mutable
        {
          Store.Set( pName, ++Value );
          if ( Value % 16 == 0 )
          {
            Store.Write(
                [&]( IStoreWriter& io_rWriter )
                {
                  (void)io_rWriter.RemoveEntry( Store[pName] );
                } );
          }
          ++Commits;
          std::this_thread::sleep_for( std::chrono::microseconds( 100 ) );
        } );
  }
  for ( const char* const pPattern : { "*/*", "x/0" } )
  {
    Crowd.Add(
        [&, pPattern]
        {
          const auto pHandler = Store.OnPattern( pPattern );
          const auto Count = [&]( IBitFlags< EChangeFlags >, ChangeId i_Id )
          {
            Heard.fetch_add( 1, std::memory_order_relaxed );
            if ( i_Id.Value() % 2 == 0 )
            {
              throw VDeregisterWeakCallbackException();
            }
            const VStoreReadScope Scope( *Store.m_pStore );
            EXPECT_GE( Scope->Generation(), i_Id );
          };
          const CallbackId Id = pHandler->AddImmediateCallback( Count, ChangeMask::All );
          pHandler->AddCallbackOn( pFast, Count, ChangeMask::All, IHandlerCallback::LatestOnly );
          std::this_thread::yield();
          pHandler->RemoveCallback( Id );
          pHandler->RemoveAllCallbacks();
        } );
  }
  Crowd.Run();
  Store.Set( "x/0", -1 );
  const std::uint64_t Last = Store.m_pStore->LastCommit();
  pSlow->Stop();
  pFast->Stop();
  for ( const VEar& rEar : Ears )
  {
    EXPECT_EQ( rEar.m_Last, Last );
  }
  // Of a service's own calls the ids never fall.
  EXPECT_FALSE( Ears[1].m_bFell || Ears[2].m_bFell || Ears[3].m_bFell || Ears[4].m_bFell );
  EXPECT_EQ( Store.m_pStore->HandlerCount(), 1u );
  pKept->RemoveAllCallbacks();
}

TEST( StoreConcurrency, StoresEndWhilePostsAreOnTheirWay )
{
  const auto pService = std::make_shared< VThreadService >( std::chrono::microseconds( 50 ) );
  std::atomic< int > Ended{ 0 };
  VCrowd Crowd;
  for ( int Thread = 0; Thread < 2; ++Thread )
  {
    Crowd.Add(
        [&]
        {
          const auto pStore = CreateStore( pService, 4 );
          const auto pHandler = pStore->RegisterHandler( { {}, { "*" } } );
          const auto pLife = std::make_shared< int >( 3 );
          pHandler->AddCallback(
              [pLife]( IBitFlags< EChangeFlags >, ChangeId )
              {
                EXPECT_EQ( *pLife, 3 );
              },
              ChangeMask::All, IHandlerCallback::EveryDelivery );
          std::thread Other(
              [&]
              {
                const VStoreReadScope Scope( *pStore );
                Scope->FindEntries( "*" );
              } );
          for ( int Value = 0; Value < 4; ++Value )
          {
            VStoreWriteScope Scope( *pStore );
            (void)Scope->SetValue( pStore->GetEntry( "a" ), Int( Value ) );
            if ( Value == 3 )
            {
              EXPECT_EQ( pStore->Shutdown(), IResult::Ok );
            }
          }
          Other.join();
          ++Ended;
        } );
  }
  Crowd.Run( std::chrono::milliseconds( 700 ) );
  pService->Stop();
  EXPECT_GT( Ended, 4 );
}

TEST( StoreConcurrency, ShortLivedThreadsAndStoresUseSlotsAgain )
{
  const VTestStore Kept;
  Kept.Set( "a", 0 );
  for ( int Round = 0; Round < 100; ++Round )
  {
    // Each thread leaves its state of a store that ends, at the place that the next store gets.
    auto pStore = std::make_unique< VTestStore >();
    std::vector< std::thread > Threads;
    for ( int Thread = 0; Thread < 3; ++Thread )
    {
      Threads.emplace_back(
          [&, Thread]
          {
            pStore->Set( "b", Thread + 1 );
            pStore->Read(
                []( const IStoreReader& i_rReader )
                {
                  i_rReader.Defer( [] {} );
                } );
            const VStoreReadScope Scope( *Kept.m_pStore );
            EXPECT_EQ( Scope->VerifiedValue( Kept["a"] ), Int( Round ) );
          } );
    }
    for ( std::thread& rThread : Threads )
    {
      rThread.join();
    }
    EXPECT_TRUE( pStore->m_pStore->IsAtRest() );
    pStore.reset();
    Kept.Set( "a", Round + 1 );
  }
  EXPECT_TRUE( Kept.m_pStore->IsAtRest() );
}
