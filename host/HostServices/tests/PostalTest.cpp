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
  constexpr int Threads = 4;
  constexpr int Posts = 2000;
  std::vector< std::vector< int > > Seen( Threads );
  std::vector< std::thread > Pool;
  for ( int Thread = 0; Thread < Threads; ++Thread )
  {
    Pool.emplace_back(
        [&, Thread]
        {
          for ( int Number = 0; Number < Posts; ++Number )
          {
            m_pPostal->Post(
                [&rSeen = Seen[Thread], Number]
                {
                  rSeen.push_back( Number );
                } );
          }
        } );
  }
  const auto AllSeen = [&]
  {
    std::size_t Count = 0;
    for ( const auto& rSeen : Seen )
    {
      Count += rSeen.size();
    }
    return Count == Threads * Posts;
  };
  while ( !AllSeen() )
  {
    QCoreApplication::processEvents();
  }
  for ( std::thread& rThread : Pool )
  {
    rThread.join();
  }
  for ( const auto& rSeen : Seen )
  {
    EXPECT_TRUE( std::is_sorted( rSeen.begin(), rSeen.end() ) );
  }
}

TEST_F( PostalService, TakesPostsWhileTheApplicationEndsAndAfter )
{
  std::atomic< bool > bStop = false;
  std::atomic< int > Posted = 0;
  const auto pAlive = std::make_shared< int >( 0 );
  const auto PostUntilStopped = [&, pPostal = m_pPostal]
  {
    while ( !bStop )
    {
      pPostal->Post( [pAlive] {} );
      ++Posted;
      std::this_thread::yield();
    }
  };
  std::thread A( PostUntilStopped );
  std::thread B( PostUntilStopped );
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
  A.join();
  B.join();
  // What was not run is dropped, with all that it held. This test and the threads' lambda hold the rest.
  EXPECT_EQ( pAlive.use_count(), 1 );
  EXPECT_TRUE( m_pPostal->DrainForTest() );
}
