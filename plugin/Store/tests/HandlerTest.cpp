#include "StoreFixture.h"

#include <TestSupport/LogGuard.h>

#include <gtest/gtest.h>

#include <stdexcept>

using namespace ZEK;
using namespace Store;

namespace
{
using VCalls = std::vector< VHeard::VCall >;
constexpr std::uint64_t Value = EChangeVerified;
constexpr std::uint64_t New = EAdded | Value;
constexpr std::uint32_t Every = IHandlerCallback::EveryDelivery;
constexpr std::uint32_t Latest = IHandlerCallback::LatestOnly;

struct VHandlers : testing::Test
{
  VTestStore m_Store;
  VHeard m_Heard;
};
} // namespace

TEST_F( VHandlers, EqualSetsShareAHandlerWhileItLives )
{
  VStoreEntry* const pA = m_Store["a"];
  VStoreEntry* const pB = m_Store["b"];
  const auto Register = [&]( const VEntryPatternSet& i_rSet )
  {
    return m_Store.m_pStore->RegisterHandler( i_rSet );
  };
  auto pFirst = Register( { { pA, pB, nullptr, pA }, { "x/*", "x" } } );
  EXPECT_EQ( Register( { { pA, pB, nullptr, pA }, { "x/*", "x" } } ), pFirst );
  EXPECT_NE( Register( { { pB, pA, nullptr, pA }, { "x/*", "x" } } ), pFirst );
  EXPECT_NE( Register( { { pA, pB, nullptr, pA }, { "x", "x/*" } } ), pFirst );
  EXPECT_EQ( m_Store.m_pStore->HandlerCount(), 1u );
  // A callback keeps its handler, and the last one lets it go.
  const CallbackId Id = pFirst->AddImmediateCallback( m_Heard.As( "kept" ), Value );
  const std::weak_ptr< IHandlerCallback > pWeak = pFirst;
  pFirst.reset();
  m_Store.Set( "x/y", 1 );
  m_Store.Set( "a", 1 );
  EXPECT_EQ( m_Heard.Take(), ( VCalls{ { "kept", New | EChildAdded, 1 }, { "kept", New, 2 } } ) );
  EXPECT_TRUE( pWeak.lock()->RemoveCallback( Id ) );
  EXPECT_TRUE( pWeak.expired() );
  EXPECT_EQ( m_Store.m_pStore->HandlerCount(), 0u );
  EXPECT_TRUE( pA->m_Handlers.empty() && m_Store["x/y"]->m_PatternHandlers.empty() );
  m_Store.Set( "x/y", 2 );
  m_Store.Set( "x/z", 2 );
  EXPECT_TRUE( m_Heard.Take().empty() );
}

TEST_F( VHandlers, MasksChooseCallsAndAreCountedExactly )
{
  const auto pHandler = m_Store.OnEntry( "a" );
  IHandlerCallbackProxy Proxy = pHandler->CreateProxy( Value | EChangeDefault, Every );
  const CallbackId Id = Proxy.ConnectImmediate( m_Heard.As( "both" ) );
  pHandler->AddImmediateCallback( m_Heard.As( "default" ), EChangeDefault );
  Proxy.Connect( m_Heard.As( "posted" ) );
  auto pOther = std::make_shared< VManualService >();
  {
    const VConnection Connection = Proxy.Connect( m_Heard.As( "other" ), pOther );
    EXPECT_EQ( Proxy.Count(), 3u );
    EXPECT_EQ( pHandler->CountCallbacks(), 4u );
    EXPECT_EQ( pHandler->CountCallbacksWithMask( EChangeDefault ), 1u );
    EXPECT_EQ( pHandler->CountCallbacksWithMask( Value ), 0u );
  }
  EXPECT_EQ( Proxy.Count(), 2u );
  EXPECT_EQ( pOther.use_count(), 1 ) << "the empty list of a service is dropped";
  m_Store.Set( "a", 1 );
  EXPECT_EQ( m_Store.m_pService->Waiting(), 1u );
  EXPECT_EQ( m_Heard.Take(), ( VCalls{ { "both", New, 1 } } ) );
  EXPECT_TRUE( Proxy.Disconnect( Id ) );
  EXPECT_FALSE( Proxy.Disconnect( Id ) );
  EXPECT_EQ( Proxy.DisconnectAll(), 1u );
  m_Store.m_pService->RunAll();
  EXPECT_TRUE( m_Heard.Take().empty() ) << "removed before its delivery";
  EXPECT_EQ( pHandler->RemoveCallbacksWithMask( ChangeMask::All ), 0u );
  EXPECT_EQ( pHandler->RemoveCallbacksWithMask( EChangeDefault ), 1u );
}

TEST_F( VHandlers, OnePostAServiceAndCommit )
{
  const auto pA = m_Store.OnEntry( "a" );
  const auto pB = m_Store.OnEntry( "b" );
  for ( int Number = 0; Number < 50; ++Number )
  {
    pA->AddCallback( m_Heard.As( "" ), Value, Every );
    pB->AddCallback( m_Heard.As( "" ), Value, Latest );
  }
  auto pOther = std::make_shared< VManualService >();
  pB->AddCallbackOn( pOther, m_Heard.As( "other" ), Value, Every );
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        (void)io_rWriter.SetValue( m_Store["a"], Int( 1 ) );
        (void)io_rWriter.SetValue( m_Store["b"], Int( 1 ) );
      } );
  EXPECT_EQ( m_Store.m_pService->Waiting(), 1u );
  EXPECT_EQ( pOther->Waiting(), 1u );
  m_Store.Set( "a", 1 );
  EXPECT_EQ( m_Store.m_pService->Waiting(), 1u ) << "nothing changed";
  m_Store.m_pService->RunAll();
  EXPECT_EQ( m_Heard.Take().size(), 100u );
  pOther->RunAll();
  EXPECT_EQ( m_Heard.Take(), ( VCalls{ { "other", New, 1 } } ) );
}

TEST_F( VHandlers, AServiceThatIsBehindGetsEachModeItsWay )
{
  const auto pHandler = m_Store.OnEntry( "a" );
  pHandler->AddCallback( m_Heard.As( "every" ), Value | EChangeExtraText1, Every );
  pHandler->AddCallback( m_Heard.As( "latest" ), Value | EChangeExtraText1, Latest );
  m_Store.Set( "a", 1 );
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        io_rWriter.SetExtraText1( m_Store["a"], "x" );
      } );
  m_Store.Set( "a", 2 );
  EXPECT_EQ( m_Store.m_pService->Waiting(), 3u );
  m_Store.m_pService->RunOne();
  constexpr std::uint64_t All = New | EChangeExtraText1;
  EXPECT_EQ( m_Heard.Take(), ( VCalls{ { "every", All, 3 } } ) );
  // A commit in between makes the next the newest.
  m_Store.Set( "a", 3 );
  m_Store.m_pService->RunOne();
  EXPECT_EQ( m_Heard.Take(), ( VCalls{ { "every", Value, 4 } } ) );
  m_Store.m_pService->RunAll();
  EXPECT_EQ( m_Heard.Take(), ( VCalls{ { "latest", All, 4 } } ) );
}

TEST_F( VHandlers, CallbacksHoldNoLockAndPostsLeaveWithTheOutermostCommit )
{
  const auto pOuter = m_Store.OnEntry( "outer" );
  const auto pInner = m_Store.OnEntry( "inner" );
  auto pOther = std::make_shared< VManualService >();
  pOuter->AddImmediateCallback(
      [&]( IBitFlags< EChangeFlags >, ChangeId i_Id )
      {
        m_Store.Set( "inner", 1 );
        EXPECT_EQ( m_Store.m_pService->Waiting(), 0u );
        EXPECT_EQ( m_Store.m_pStore->HandlerCount(), 2u );
        EXPECT_EQ( m_Store.Read(
                       [&]( const IStoreReader& i_rReader )
                       {
                         return i_rReader.Generation().Value();
                       } ),
                   i_Id.Value() + 1 );
      },
      Value );
  pOuter->AddCallback( m_Heard.As( "outer" ), Value, Every );
  pInner->AddCallback( m_Heard.As( "inner" ), Value, Every );
  m_Store.Set( "outer", 1 );
  EXPECT_EQ( m_Store.m_pService->Waiting(), 1u );
  m_Store.m_pService->RunAll();
  EXPECT_EQ( m_Heard.Take(), ( VCalls{ { "inner", New, 2 }, { "outer", New, 1 } } ) );
}

TEST_F( VHandlers, CallbacksLeaveFromInside )
{
  for ( const bool bPosted : { false, true } )
  {
    const auto pHandler = m_Store.OnEntry( "a" );
    const auto Add = [&]( ChangeFunction i_Function )
    {
      return bPosted ? pHandler->AddCallback( std::move( i_Function ), Value, Every )
                     : pHandler->AddImmediateCallback( std::move( i_Function ), Value );
    };
    CallbackId Own = nullptr, Other = nullptr;
    Own = Add(
        [&]( IBitFlags< EChangeFlags >, ChangeId )
        {
          EXPECT_TRUE( pHandler->RemoveCallback( Own ) );
          EXPECT_TRUE( pHandler->RemoveCallback( Other ) );
          m_Heard.As( "removes" )( 0, ChangeId() );
        } );
    Other = Add( m_Heard.As( "removed" ) );
    Add(
        [&]( IBitFlags< EChangeFlags >, ChangeId )
        {
          m_Heard.As( "leaves" )( 0, ChangeId() );
          throw VDeregisterWeakCallbackException();
        } );
    Add( m_Heard.As( "stays" ) );
    m_Store.Set( "a", bPosted ? 1 : 2 );
    m_Store.m_pService->RunAll();
    EXPECT_EQ( m_Heard.Take().size(), 4u ) << "a removed one still gets the call of the pass";
    EXPECT_EQ( pHandler->CountCallbacks(), 1u );
    m_Store.Set( "a", bPosted ? 3 : 4 );
    m_Store.m_pService->RunAll();
    EXPECT_EQ( m_Heard.Take().size(), 1u );
    pHandler->RemoveAllCallbacks();
  }
}

TEST_F( VHandlers, AFailingCallbackStopsNobodyElse )
{
  struct VDeadService final : IPostalService
  {
    void Post( std::function< void() > ) override { throw std::runtime_error( "service" ); }
  };
  const auto pHandler = m_Store.OnEntry( "a" );
  const auto Failing = []( IBitFlags< EChangeFlags >, ChangeId )
  {
    throw std::runtime_error( "first" );
  };
  pHandler->AddImmediateCallback( Failing, Value );
  pHandler->AddImmediateCallback( ChangeFunction(), Value );
  pHandler->AddImmediateCallback( m_Heard.As( "next" ), Value );
  pHandler->AddCallbackOn( std::make_shared< VDeadService >(), m_Heard.As( "never" ), Value, Every );
  pHandler->AddCallback( Failing, Value, Every );
  pHandler->AddCallback( m_Heard.As( "posted" ), Value, Every );
  const auto Commit = [&]( std::int32_t i_Value )
  {
    IStoreWriter& rWriter = *m_Store.m_pStore->BeginWrite();
    (void)rWriter.SetValue( m_Store["a"], Int( i_Value ) );
    rWriter.Defer(
        [&]
        {
          m_Heard.As( "deferred" )( 0, ChangeId() );
          throw std::logic_error( "last" );
        } );
    m_Store.m_pStore->EndWrite();
  };
  for ( const std::int32_t Round : { 1, 2 } )
  {
    EXPECT_THROW( Commit( Round ), std::runtime_error );
    ASSERT_EQ( m_Heard.Take().size(), 2u );
    EXPECT_EQ( m_Store.m_pService->Waiting(), 1u );
    EXPECT_THROW( m_Store.m_pService->RunOne(), std::runtime_error );
    EXPECT_EQ( m_Heard.Take().size(), 1u );
    EXPECT_TRUE( m_Store.m_pStore->IsAtRest() );
  }
  TestSupport::ExpectFailureLine( "A callback failed while another failure was on its way: first." );
  EXPECT_THROW( m_Store.Write(
                    [&]( IStoreWriter& io_rWriter )
                    {
                      (void)io_rWriter.SetValue( m_Store["a"], Int( 9 ) );
                      throw std::out_of_range( "own" );
                    } ),
                std::out_of_range );
}

TEST_F( VHandlers, DeferredFunctionsRunInOrderAfterTheOutermostScope )
{
  std::vector< int > Ran;
  const auto Defer = [&]( const IStoreReader& i_rReader )
  {
    i_rReader.Defer(
        [&]
        {
          Ran.push_back( 1 );
          const VStoreReadScope Scope( *m_Store.m_pStore );
          Scope->Defer(
              [&]
              {
                Ran.push_back( 3 );
              } );
        } );
    i_rReader.Defer(
        [&]
        {
          m_Store.Set( "a", 1 );
          Ran.push_back( 2 );
        } );
    const VStoreReadScope Inner( *m_Store.m_pStore );
  };
  m_Store.Read(
      [&]( const IStoreReader& i_rReader )
      {
        Defer( i_rReader );
        EXPECT_TRUE( Ran.empty() );
      } );
  EXPECT_EQ( Ran, ( std::vector< int >{ 1, 2, 3 } ) );
  Ran.clear();
  m_Store.Write( Defer );
  EXPECT_EQ( Ran, ( std::vector< int >{ 1, 2, 3 } ) );
}

TEST_F( VHandlers, StoresEndBeforeTheirHandlersAndPosts )
{
  const auto pLife = std::make_shared< int >();
  std::weak_ptr< IHandlerCallback > pForgotten;
  std::shared_ptr< IHandlerCallback > pKept = m_Store.OnPattern( "*" );
  {
    const auto pHandler = m_Store.OnEntry( "a" );
    pForgotten = pHandler;
    pHandler->AddCallback(
        [pLife, this]( IBitFlags< EChangeFlags >, ChangeId )
        {
          m_Heard.As( "late" )( 0, ChangeId() );
        },
        Value, Every );
    pKept->AddImmediateCallback( [pLife]( IBitFlags< EChangeFlags >, ChangeId ) {}, Value );
  }
  m_Store.Set( "a", 1 );
  EXPECT_EQ( m_Store.m_pService->Waiting(), 1u );
  m_Store.m_pStore.reset();
  EXPECT_TRUE( pForgotten.expired() );
  EXPECT_EQ( pLife.use_count(), 1 );
  m_Store.m_pService->RunAll();
  EXPECT_TRUE( m_Heard.Take().empty() );
  EXPECT_EQ( pKept->CountCallbacks(), 0u );
  pKept.reset();
}

TEST_F( VHandlers, CallbacksMayEndTheStore )
{
  auto pStore = m_Store.m_pStore;
  const auto pHandler = m_Store.OnEntry( "a" );
  pHandler->AddImmediateCallback(
      [&]( IBitFlags< EChangeFlags >, ChangeId )
      {
        m_Store.m_pStore.reset();
      },
      Value );
  VStore* const pRaw = pStore.get();
  IStoreWriter& rWriter = *pRaw->BeginWrite();
  (void)rWriter.SetValue( m_Store["a"], Int( 1 ) );
  const std::weak_ptr< VStore > pWeak = pStore;
  pStore.reset();
  pRaw->EndWrite();
  EXPECT_TRUE( pWeak.expired() );
}

TEST( StoreWithoutService, PostsOnlyWhereAServiceIsGiven )
{
  const TestSupport::VAssertRecorder Asserts;
  const auto pStore = CreateStore( nullptr, 8 );
  const auto pHandler = pStore->RegisterHandler( { {}, { "a" } } );
  VHeard Heard;
  EXPECT_EQ( pHandler->AddCallback( Heard.As( "refused" ), Value, Every ), nullptr );
  EXPECT_EQ( pHandler->AddCallbackOn( nullptr, Heard.As( "refused" ), Value, Every ), nullptr );
  EXPECT_EQ( Asserts.Expressions().size(), 2u );
  const auto pService = std::make_shared< VManualService >();
  EXPECT_NE( pHandler->AddCallbackOn( pService, Heard.As( "posted" ), Value, Every ), nullptr );
  pHandler->AddImmediateCallback( Heard.As( "now" ), Value );
  {
    const VStoreWriteScope Scope( *pStore );
    (void)Scope->SetValue( pStore->GetEntry( "a" ), Int( 1 ) );
  }
  pService->RunAll();
  EXPECT_EQ( Heard.Take(), ( VCalls{ { "now", New, 1 }, { "posted", New, 1 } } ) );
  pHandler->RemoveAllCallbacks();
}
