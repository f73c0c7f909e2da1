#include <ZEK/Callback.h>

#include <gtest/gtest.h>

#include <atomic>
#include <deque>
#include <thread>

using namespace ZEK;

namespace
{
class VManualPostal : public IPostalService
{
public:
  void Post( std::function< void() > i_Function ) override { m_Queue.push_back( std::move( i_Function ) ); }
  void Drain()
  {
    while ( !m_Queue.empty() )
    {
      const auto Function = std::move( m_Queue.front() );
      m_Queue.pop_front();
      Function();
    }
  }

private:
  std::deque< std::function< void() > > m_Queue;
};
} // namespace

TEST( VMultiCallback, DeliversDirectlyOrThroughThePostalService )
{
  VMultiCallback< void( int ) > Notifier;
  const auto pPostal = std::make_shared< VManualPostal >();
  int Direct = 0;
  int Posted = 0;
  const VConnection A = Notifier.Connect(
      [&]( int i_Value )
      {
        Direct += i_Value;
      },
      nullptr );
  const VConnection B = Notifier.Connect(
      [&]( int i_Value )
      {
        Posted += i_Value;
      },
      pPostal );
  Notifier.Fire( 3 );
  EXPECT_EQ( Direct, 3 );
  EXPECT_EQ( Posted, 0 );
  pPostal->Drain();
  EXPECT_EQ( Posted, 3 );
}

TEST( VMultiCallback, ADeliveryAfterDisconnectDoesNothing )
{
  const auto pPostal = std::make_shared< VManualPostal >();
  int Count = 0;
  {
    VMultiCallback< void() > Notifier;
    VConnection Connection = Notifier.Connect(
        [&]
        {
          ++Count;
        },
        pPostal );
    Notifier.Fire();
    Connection.Disconnect();
  }
  pPostal->Drain();
  EXPECT_EQ( Count, 0 );
}

TEST( VMultiCallback, AConnectionMayOutliveTheNotifierAndMayGoDuringAFire )
{
  VConnection Late;
  {
    VMultiCallback< void() > Notifier;
    Late = Notifier.Connect(
        [&]
        {
          Late.Disconnect();
        },
        nullptr );
    Notifier.Fire();
    Late = Notifier.Connect( [] {}, nullptr );
  }
  Late.Disconnect();
}

TEST( VMultiCallback, FiresAndConnectsFromSeveralThreads )
{
  VMultiCallback< void() > Notifier;
  std::atomic< int > Count{ 0 };
  const VConnection Kept = Notifier.Connect(
      [&]
      {
        ++Count;
      },
      nullptr );
  std::thread Firing(
      [&]
      {
        for ( int Index = 0; Index < 1000; ++Index )
        {
          Notifier.Fire();
        }
      } );
  for ( int Index = 0; Index < 1000; ++Index )
  {
    const VConnection Brief = Notifier.Connect( [] {}, nullptr );
  }
  Firing.join();
  EXPECT_EQ( Count, 1000 );
}
