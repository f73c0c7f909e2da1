#include <ZEK/DispatchCollapser.h>

#include <gtest/gtest.h>

#include <array>
#include <deque>
#include <thread>

using namespace ZEK;

namespace
{

/// A queue that runs when it is told to.
class VQueue final : public IPostalService
{
public:
  void Post( std::function< void() > i_Function ) override
  {
    const std::lock_guard Lock( m_Guard );
    m_Functions.push_back( std::move( i_Function ) );
  }
  std::size_t Run()
  {
    std::size_t Count = 0;
    for ( ;; ++Count )
    {
      std::unique_lock Lock( m_Guard );
      if ( m_Functions.empty() )
      {
        return Count;
      }
      const auto Function = std::move( m_Functions.front() );
      m_Functions.pop_front();
      Lock.unlock();
      Function();
    }
  }

private:
  std::mutex m_Guard;
  std::deque< std::function< void() > > m_Functions;
};

} // namespace

TEST( DispatchCollapser, DropsCallsWhileOneIsQueuedAndQueuesOneWhileItRuns )
{
  const auto pQueue = std::make_shared< VQueue >();
  int Calls = 0;
  std::function< void() > Again;
  const auto Count = [&]
  {
    if ( ++Calls == 1 )
    {
      Again();
      Again();
    }
  };
  {
    const VDispatchCollapser Collapser( Count, pQueue );
    Again = Collapser.Callback();
    Collapser();
    Again();
    Collapser();
    EXPECT_EQ( Calls, 0 );
    EXPECT_EQ( pQueue->Run(), 2u ) << "three calls make one delivery, two during it one more";
    EXPECT_EQ( Calls, 2 );
    Collapser();
  }
  EXPECT_EQ( pQueue->Run(), 1u );
  Again();
  EXPECT_EQ( pQueue->Run(), 0u );
  EXPECT_EQ( Calls, 2 ) << "nothing is delivered after its end";

  const VDispatchCollapser Direct( Count, nullptr );
  Direct();
  Direct();
  EXPECT_EQ( Calls, 4 );
}

TEST( DispatchCollapser, TheLastChangeOfEveryThreadIsSeen )
{
  constexpr int Steps = 2000;
  const auto pQueue = std::make_shared< VQueue >();
  std::array< std::atomic< int >, 3 > Values{};
  std::array< int, 3 > Seen{};
  const VDispatchCollapser Collapser(
      [&]
      {
        for ( std::size_t Index = 0; Index < Values.size(); ++Index )
        {
          Seen[Index] = Values[Index].load( std::memory_order_relaxed );
        }
      },
      pQueue );
  std::atomic< int > Running{ 3 };
  std::vector< std::thread > Threads;
  for ( std::atomic< int >& rValue : Values )
  {
    Threads.emplace_back(
        [&]
        {
          for ( int Step = 1; Step <= Steps; ++Step )
          {
            rValue.store( Step, std::memory_order_relaxed );
            Collapser();
          }
          --Running;
        } );
  }
  while ( Running > 0 )
  {
    pQueue->Run();
  }
  pQueue->Run();
  for ( std::thread& rThread : Threads )
  {
    rThread.join();
  }
  EXPECT_EQ( Seen, ( std::array{ Steps, Steps, Steps } ) );
}
