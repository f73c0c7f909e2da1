#include <HostServices/VPostalService.h>

#include <TestSupport/LogGuard.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QEventLoop>

#include <gtest/gtest.h>

#include <stdexcept>
#include <thread>

using HostServices::VPostalService;

namespace
{
/// An application object of the test's own, so that its end can be tested too.
class PostalService : public testing::Test
{
protected:
  PostalService()
  {
    static int Count = 1;
    static char Name[] = "postal";
    static char* Arguments[] = { Name, nullptr };
    m_pApplication = std::make_unique< QCoreApplication >( Count, Arguments );
    m_pPostal = std::make_shared< VPostalService >();
  }

  void Note( int i_Number )
  {
    m_pPostal->Post(
        [this, i_Number]
        {
          m_Order.push_back( i_Number );
        } );
  }

  std::unique_ptr< QCoreApplication > m_pApplication;
  std::shared_ptr< VPostalService > m_pPostal;
  std::vector< int > m_Order;
};
} // namespace

TEST_F( PostalService, RunsInOrderAndLaterPostsInALaterTurn )
{
  Note( 1 );
  m_pPostal->Post(
      [this]
      {
        m_Order.push_back( 2 );
        Note( 4 );
      } );
  Note( 3 );
  EXPECT_TRUE( m_Order.empty() );
  QCoreApplication::sendPostedEvents();
  EXPECT_EQ( m_Order, ( std::vector{ 1, 2, 3 } ) );
  QCoreApplication::sendPostedEvents();
  EXPECT_EQ( m_Order, ( std::vector{ 1, 2, 3, 4 } ) );
}

TEST_F( PostalService, KeepsTheOrderInsideANestedEventLoop )
{
  m_pPostal->Post(
      [this]
      {
        m_Order.push_back( 1 );
        Note( 4 );
        QEventLoop Loop;
        m_pPostal->Post(
            [&Loop]
            {
              Loop.quit();
            } );
        Loop.exec();
        m_Order.push_back( 5 );
      } );
  Note( 2 );
  Note( 3 );
  while ( m_Order.size() < 5 )
  {
    QCoreApplication::processEvents();
  }
  EXPECT_EQ( m_Order, ( std::vector{ 1, 2, 3, 4, 5 } ) );
}

TEST_F( PostalService, DrainsWhatPostsPostAndLeavesNothingEarlyForTheLoop )
{
  m_pPostal->Post(
      [this]
      {
        Note( 1 );
      } );
  EXPECT_TRUE( m_pPostal->DrainForTest() );
  EXPECT_EQ( m_Order, ( std::vector{ 1 } ) );
  // The loop still holds the turns of what the drain ran: none of them may run what is posted from inside.
  m_pPostal->Post(
      [this]
      {
        Note( 2 );
      } );
  QCoreApplication::sendPostedEvents();
  EXPECT_EQ( m_Order, ( std::vector{ 1 } ) );
  QCoreApplication::sendPostedEvents();
  EXPECT_EQ( m_Order, ( std::vector{ 1, 2 } ) );

  // What a function held may post as it goes.
  std::shared_ptr< void > pHeld( nullptr,
                                 [this]( void* )
                                 {
                                   Note( 3 );
                                 } );
  m_pPostal->Post( [pKept = std::move( pHeld )] {} );
  m_pPostal->Post( [] {} );
  EXPECT_TRUE( m_pPostal->DrainForTest() );
  EXPECT_EQ( m_Order, ( std::vector{ 1, 2, 3 } ) );

  std::function< void() > Again = [&]
  {
    m_pPostal->Post( Again );
  };
  Again();
  EXPECT_FALSE( m_pPostal->DrainForTest() );
}

TEST_F( PostalService, GoesOnAfterAFunctionThatThrows )
{
  TestSupport::ExpectFailureLine( "A posted function failed: broken" );
  m_pPostal->Post(
      []
      {
        throw std::runtime_error( "broken" );
      } );
  Note( 1 );
  m_pPostal->Post( {} );
  QCoreApplication::sendPostedEvents();
  EXPECT_EQ( m_Order, ( std::vector{ 1 } ) );
  EXPECT_EQ( TestSupport::LogTexts( "PostalService", ZEK::ELogFailure ).size(), 1u );
}

TEST_F( PostalService, MayBeDestroyedByAFunctionItRuns )
{
  m_pPostal->Post(
      [this]
      {
        m_pPostal.reset();
        m_Order.push_back( 1 );
      } );
  Note( 2 );
  QCoreApplication::sendPostedEvents();
  QCoreApplication::sendPostedEvents();
  EXPECT_EQ( m_Order, ( std::vector{ 1 } ) );
}

TEST_F( PostalService, KeepsTheOrderOfEachPostingThread )
{
  constexpr int Threads = 3;
  constexpr int Posts = 2000;
  std::vector< int > Seen[Threads];
  std::vector< std::thread > Pool;
  for ( auto& rSeen : Seen )
  {
    Pool.emplace_back(
        [&]
        {
          for ( int Number = 0; Number < Posts; ++Number )
          {
            m_pPostal->Post(
                [&rSeen, Number]
                {
                  rSeen.push_back( Number );
                } );
          }
        } );
  }
  while ( Seen[0].size() + Seen[1].size() + Seen[2].size() < Threads * Posts )
  {
    QCoreApplication::processEvents();
  }
  for ( int Thread = 0; Thread < Threads; ++Thread )
  {
    Pool[static_cast< std::size_t >( Thread )].join();
    EXPECT_TRUE( std::is_sorted( std::begin( Seen[Thread] ), std::end( Seen[Thread] ) ) );
  }
}

TEST_F( PostalService, TakesPostsWhileTheApplicationEndsAndAfter )
{
  std::atomic< bool > bStop = false;
  std::atomic< int > Posted = 0;
  const auto pAlive = std::make_shared< int >( 0 );
  std::thread Poster(
      [&]
      {
        while ( !bStop )
        {
          m_pPostal->Post( [pAlive] {} );
          ++Posted;
          std::this_thread::yield();
        }
      } );
  while ( Posted < 200 )
  {
    QCoreApplication::processEvents();
  }
  m_pApplication.reset();
  const int AtEnd = Posted;
  while ( Posted < AtEnd + 200 )
  {
    std::this_thread::yield();
  }
  bStop = true;
  Poster.join();
  // What was not run is dropped, with all that it held. This test holds the rest.
  EXPECT_EQ( pAlive.use_count(), 1 );
  EXPECT_TRUE( m_pPostal->DrainForTest() );
}
