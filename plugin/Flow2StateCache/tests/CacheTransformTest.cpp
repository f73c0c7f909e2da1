#include "CacheTestTransform.h"

#include <TestSupport/Allocations.h>
#include <TestSupport/Calls.h>
#include <TestSupport/LogGuard.h>

#include <array>
#include <deque>
#include <random>

using namespace CacheTest;
using Flow2StateCache::VFlowStateCacheTransform;

namespace
{
constexpr std::uint32_t Mask = 31, Newest = 2;

/// How often each notifier fired: `StatesChanged`, 2, 3, 4, 5, 6.
using VCounts = std::array< int, 6 >;

class VListener
{
public:
  explicit VListener( ZEK::IFlowStateCache& i_rCache )
    : m_Calls{ TestSupport::VCalls( i_rCache.StatesChanged() ), TestSupport::VCalls( i_rCache.Notifier2() ),
               TestSupport::VCalls( i_rCache.Notifier3() ),     TestSupport::VCalls( i_rCache.Notifier4() ),
               TestSupport::VCalls( i_rCache.Notifier5() ),     TestSupport::VCalls( i_rCache.Notifier6() ) }
  {
  }
  VCounts Take()
  {
    VCounts Counts{};
    for ( std::size_t Notifier = 0; Notifier < Counts.size(); ++Notifier )
    {
      Counts[Notifier] = m_Calls[Notifier].Take();
    }
    return Counts;
  }

private:
  std::array< TestSupport::VCalls, 6 > m_Calls;
};

class CacheTransform : public testing::Test
{
protected:
  void Start()
  {
    m_Cache.SetSource( m_pSource );
    m_Cache.SetTransform( m_pTransform );
  }
  void Put( std::int64_t i_Frame, std::uint32_t i_Number )
  {
    HostFlow::AddState( *m_pSource, NumberState( { i_Frame, 1, 1 }, i_Number ) );
  }
  /// The number and the parameter of what a fetch gives; -2 and -2 for null.
  std::pair< int, int > Fetched()
  {
    ZEK::VFlowStateRef State;
    EXPECT_TRUE( m_Cache.Fetch( State, Mask, Newest, 0 ) );
    return State ? std::pair( static_cast< int >( NumberOf( *State ) ), PoseOf( *State ) ) : std::pair( -2, -2 );
  }

  const std::shared_ptr< HostFlow::IHostStateCache > m_pSource = HostFlow::MakeCache( 32 );
  const std::shared_ptr< VTransform > m_pTransform = std::make_shared< VTransform >();
  VFlowStateCacheTransform m_Cache;
};
} // namespace

TEST_F( CacheTransform, WithoutASourceEveryQuestionHasItsAnswer )
{
  for ( const bool bTakenAway : { false, true } )
  {
    if ( bTakenAway )
    {
      Put( 1, 1 );
      m_pSource->SetStaticItems( { HostFlow::NewItem< CoreMoxelTypes::FlowDevice >() } );
      Start();
      EXPECT_EQ( Fetched(), std::pair( 1, 0 ) );
      m_Cache.SetSource( nullptr );
    }
    std::uint32_t Id = 9;
    m_Cache.GetId( Id );
    std::shared_ptr< void > pHandle = m_pSource;
    m_Cache.GetHandle( pHandle );
    ZEK::VFlowTimeRange Range;
    ZEK::VFlowTimeKey Key;
    std::vector< ZEK::VFlowItemRef > Items( 1 );
    EXPECT_EQ( std::tuple( Id, m_Cache.GetStatus(), m_Cache.GetFlag(), m_Cache.IsActive(), pHandle == nullptr ),
               std::tuple( 0u, 2u, true, true, true ) );
    EXPECT_FALSE( m_Cache.Query( {}, Mask, true ) || m_Cache.QueryRange( Range ) ||
                  m_Cache.Contains( { 1, 1, 1 }, 0 ) || m_Cache.QueryKey( {}, Key, {}, 0 ) ||
                  m_Cache.QueryItems( {}, {}, Items ) );
    ZEK::VFlowStateRef State = NumberState( {}, 1 );
    EXPECT_FALSE( m_Cache.Fetch( State, Mask, Newest, 0 ) );
    EXPECT_FALSE( State );
    State = NumberState( {}, 1 );
    EXPECT_FALSE( m_Cache.FetchWhere( { 1, 1, 1 }, State, Mask, Newest, 0 ) );
    EXPECT_FALSE( State );
    std::vector< ZEK::VFlowStateRef > Many{ NumberState( {}, 1 ) };
    EXPECT_FALSE( m_Cache.FetchMany( {}, Many, 0 ) );
    EXPECT_TRUE( Many.empty() );
    ZEK::IResult Status = ZEK::IResult::Failed;
    m_Cache.GetStaticItems( Status, Items );
    EXPECT_EQ( std::pair( Status.Code(), Items.size() ), std::pair( 0u, std::size_t{ 0 } ) );
  }
}

TEST_F( CacheTransform, ForwardsWhatItDoesNotTransform )
{
  Put( 3, 1 );
  Start();
  std::uint32_t Id = 0, Expected = 0;
  m_Cache.GetId( Id );
  m_pSource->GetId( Expected );
  EXPECT_EQ( Id, Expected );
  m_pSource->SetStatus( 0 );
  EXPECT_EQ( std::pair( m_Cache.GetStatus(), m_Cache.IsActive() ), std::pair( 0u, false ) );
  EXPECT_TRUE( m_Cache.Contains( { 3, 1, 1 }, 0 ) );
  EXPECT_FALSE( m_Cache.Contains( { 4, 1, 1 }, 0 ) );
  // Static items: those at hand when the source was set, and those it announced later.
  std::vector< ZEK::VFlowItemRef > Items;
  ZEK::IResult Status;
  const ZEK::VFlowItemRef Static = HostFlow::NewItem< CoreMoxelTypes::FlowDevice >();
  m_Cache.GetStaticItems( Status, Items );
  EXPECT_TRUE( Items.empty() );
  m_pSource->SetStaticItems( { Static } );
  m_Cache.GetStaticItems( Status, Items );
  EXPECT_EQ( Items, std::vector( 1, Static ) );
  VFlowStateCacheTransform Second;
  Second.SetSource( m_pSource );
  Second.GetStaticItems( Status, Items );
  EXPECT_EQ( Items, std::vector( 1, Static ) );
}

TEST_F( CacheTransform, EveryNotifierOfTheSourceFiresItsOwnButTheFifth )
{
  VListener Listener( m_Cache );
  const auto EachOf = [&]( HostFlow::IHostStateCache& i_rSource, std::uint32_t i_Status )
  {
    std::vector< VCounts > Rows;
    HostFlow::AddState( i_rSource, NumberState( { 1, 1, 1 }, 1 ) );
    Rows.push_back( Listener.Take() );
    HostFlow::AddState( i_rSource, NumberState( { 1, 1, 1 }, 2 ) ); // of the same key
    Rows.push_back( Listener.Take() );
    i_rSource.SetStatus( i_Status );
    Rows.push_back( Listener.Take() );
    i_rSource.SetStaticItems( {} );
    Rows.push_back( Listener.Take() );
    i_rSource.NamesChanged();
    Rows.push_back( Listener.Take() );
    i_rSource.Clear();
    Rows.push_back( Listener.Take() );
    return Rows;
  };
  const std::vector< VCounts > AsStated{ { 1, 0, 0, 0, 0, 0 }, { 1, 1, 0, 0, 0, 0 }, { 0, 0, 1, 0, 0, 0 },
                                         { 0, 0, 0, 1, 0, 0 }, { 0, 0, 0, 0, 0, 1 }, { 0, 0, 0, 0, 0, 1 } };
  m_Cache.SetSource( m_pSource );
  EXPECT_EQ( Listener.Take(), ( VCounts{ 1, 1, 1, 1, 0, 1 } ) );
  m_Cache.SetTransform( m_pTransform );
  EXPECT_EQ( Listener.Take(), ( VCounts{ 1, 1, 0, 0, 0, 0 } ) );
  m_Cache.SetParameters( {} );
  EXPECT_EQ( Listener.Take(), ( VCounts{ 1, 1, 0, 0, 0, 0 } ) );
  EXPECT_EQ( EachOf( *m_pSource, 2 ), AsStated );
  // Another source: the former one is heard no more, and no connection is there twice.
  const auto pOther = HostFlow::MakeCache( 4 );
  m_Cache.SetSource( pOther );
  EXPECT_EQ( Listener.Take(), ( VCounts{ 1, 1, 1, 1, 0, 1 } ) );
  EXPECT_EQ( EachOf( *m_pSource, 3 ), std::vector< VCounts >( 6 ) );
  EXPECT_EQ( EachOf( *pOther, 2 ), AsStated );
  m_Cache.SetSource( nullptr );
  EXPECT_EQ( Listener.Take(), ( VCounts{ 1, 1, 1, 1, 0, 1 } ) );
  EXPECT_EQ( EachOf( *pOther, 3 ), std::vector< VCounts >( 6 ) );
}

TEST_F( CacheTransform, FiresOutsideItsLockInTheStatedOrder )
{
  std::string Order;
  ZEK::VFlowStateRef State;
  std::vector< ZEK::VConnection > Connections;
  const auto Listen = [&]( ZEK::IMultiCallbackPostal< void() >& i_rNotifier, char i_Name )
  {
    Connections.push_back( i_rNotifier.Connect(
        [&, i_Name]
        {
          Order += i_Name;
          m_Cache.Fetch( State, Mask, Newest, 0 ); // would wait for ever if the lock were held
        },
        nullptr ) );
  };
  Listen( m_Cache.StatesChanged(), '1' );
  Listen( m_Cache.Notifier2(), '2' );
  Listen( m_Cache.Notifier3(), '3' );
  Listen( m_Cache.Notifier4(), '4' );
  Listen( m_Cache.Notifier6(), '6' );
  Start();
  m_Cache.SetParameters( {} );
  EXPECT_EQ( Order, "643121212" );
}

TEST_F( CacheTransform, TransformsAStateOnceAndAnotherOneOfItsKeyAgain )
{
  Start();
  EXPECT_EQ( Fetched(), std::pair( -2, -2 ) ) << "a source without a state";
  Put( 1, 10 );
  EXPECT_EQ( Fetched(), std::pair( 10, 0 ) );
  EXPECT_EQ( Fetched(), std::pair( 10, 0 ) );
  EXPECT_EQ( m_pTransform->Calls, 1 );
  m_Cache.SetParameters( Pose( 5 ) );
  EXPECT_EQ( Fetched(), std::pair( 10, 5 ) );
  EXPECT_EQ( m_pTransform->Calls, 2 );
  Put( 1, 11 ); // replaces
  EXPECT_EQ( Fetched(), std::pair( 11, 5 ) );
  EXPECT_EQ( m_pTransform->Calls, 3 );
  m_pTransform->Refused = 12;
  Put( 1, 12 );
  EXPECT_EQ( Fetched(), std::pair( -2, -2 ) );
  EXPECT_EQ( Fetched(), std::pair( -2, -2 ) ) << "the output of the key's former state";
  // Another transform, and a source set anew, start afresh even with a state that is in the stash.
  const auto pOther = std::make_shared< VTransform >();
  m_pTransform->Refused = ~0u;
  EXPECT_EQ( Fetched(), std::pair( 12, 5 ) );
  m_Cache.SetTransform( pOther );
  EXPECT_EQ( Fetched(), std::pair( 12, 5 ) );
  EXPECT_EQ( pOther->Calls, 1 );
  m_Cache.SetSource( m_pSource );
  EXPECT_EQ( Fetched(), std::pair( 12, 5 ) );
  EXPECT_EQ( pOther->Calls, 2 );
  const std::uint64_t Before = TestSupport::AllocationCount();
  EXPECT_EQ( Fetched(), std::pair( 12, 5 ) );
  EXPECT_EQ( TestSupport::AllocationCount(), Before ) << "a frame that is drawn again";
}

TEST_F( CacheTransform, WithoutATransformAFetchGivesNothing )
{
  m_Cache.SetSource( m_pSource );
  Put( 1, 1 );
  const TestSupport::VAssertRecorder Recorder;
  EXPECT_EQ( Fetched(), std::pair( -2, -2 ) );
#ifdef NDEBUG
  EXPECT_TRUE( Recorder.Expressions().empty() );
#else
  EXPECT_EQ( Recorder.Expressions(), std::vector< std::string >{ "m_pTransform" } );
#endif
  std::vector< ZEK::VFlowStateRef > Many( 2 );
  EXPECT_FALSE( m_Cache.FetchMany( { { 0, 1, 1 }, { 9, 1, 1 } }, Many, 0 ) );
  EXPECT_TRUE( Many.empty() );
}

// What was fetched, and how often it was transformed, as a list of the last ten pairs would have it.
TEST_F( CacheTransform, RandomFetchesAnswerAsAListOfPairsWould )
{
  struct VPair
  {
    std::int64_t Frame;
    std::uint32_t Number;
  };
  for ( std::uint32_t Seed = 0; Seed < 20; ++Seed )
  {
    std::mt19937 Random( Seed );
    m_pSource->Clear();
    Start();
    m_pTransform->Calls = 0;
    m_Cache.SetParameters( Pose( 0 ) );
    std::deque< VPair > Stashed, InRing;
    int Calls = 0, CurrentPose = 0;
    std::uint32_t Number = 0;
    const auto Expect = [&]( const VPair& i_rInput, bool i_bAfresh, const ZEK::VFlowStateRef& i_rState )
    {
      ASSERT_TRUE( i_rState ) << "seed " << Seed;
      const auto Found = std::find_if( Stashed.begin(), Stashed.end(),
                                       [&]( const VPair& i_rPair )
                                       {
                                         return i_rPair.Frame == i_rInput.Frame;
                                       } );
      Calls += i_bAfresh || Found == Stashed.end() || Found->Number != i_rInput.Number;
      if ( Found != Stashed.end() )
      {
        Stashed.erase( Found );
      }
      Stashed.push_back( i_rInput );
      if ( Stashed.size() > 10 )
      {
        Stashed.pop_front();
      }
      ASSERT_EQ(
          std::tuple( NumberOf( *i_rState ), PoseOf( *i_rState ), i_rState->GetKey().Frame, m_pTransform->Calls ),
          std::tuple( i_rInput.Number, CurrentPose, i_rInput.Frame, Calls ) )
          << "seed " << Seed;
    };
    for ( int Step = 0; Step < 300; ++Step )
    {
      ZEK::VFlowStateRef State;
      switch ( const std::uint32_t Choice = Random() % 8; Choice )
      {
      case 0:
      case 1: // a new frame, or the newest anew
        if ( InRing.empty() || Choice == 0 )
        {
          InRing.push_back( { static_cast< std::int64_t >( InRing.empty() ? 0 : InRing.back().Frame + 1 ), 0 } );
        }
        InRing.back().Number = ++Number;
        Put( InRing.back().Frame, Number );
        if ( InRing.size() > 32 )
        {
          InRing.pop_front();
        }
        break;
      case 2:
        if ( Random() % 8 == 0 )
        {
          m_Cache.SetParameters( Pose( ++CurrentPose ) );
          Stashed.clear();
        }
        break;
      case 3:
      {
        std::vector< ZEK::VFlowStateRef > Many( 3, NumberState( {}, 1 ) );
        const std::int64_t First =
            InRing.empty() ? 0 : InRing.back().Frame - static_cast< std::int64_t >( Random() % 6 );
        const int Former = Calls;
        ASSERT_TRUE( m_Cache.FetchMany( { { First, 1, 1 }, { First + 2, 1, 1 } }, Many, 0 ) );
        const int Made = m_pTransform->Calls - Former; // all before the first is looked at
        std::size_t Place = 0;
        for ( const VPair& rInput : InRing )
        {
          if ( rInput.Frame >= First && rInput.Frame <= First + 2 )
          {
            m_pTransform->Calls = Calls + 1;
            Expect( rInput, true, Many.at( Place++ ) );
          }
        }
        EXPECT_EQ( std::pair( Many.size(), Made ), std::pair( Place, static_cast< int >( Place ) ) );
        break;
      }
      case 4:
      case 5:
      case 6: // some of the last fifteen, so that some have left the stash
        if ( !InRing.empty() )
        {
          const VPair Input = InRing[InRing.size() - 1 - Random() % std::min< std::size_t >( 15, InRing.size() )];
          ASSERT_TRUE( m_Cache.FetchWhere( { Input.Frame, 1, 1 }, State, Mask, Newest, 0 ) );
          Expect( Input, false, State );
        }
        break;
      default:
        if ( !InRing.empty() )
        {
          ASSERT_TRUE( m_Cache.Fetch( State, Mask, Newest, 0 ) );
          Expect( InRing.back(), false, State );
        }
      }
      ASSERT_FALSE( HasFailure() ) << "seed " << Seed << ", step " << Step;
    }
  }
}
