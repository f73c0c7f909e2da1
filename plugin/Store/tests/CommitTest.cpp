#include "StoreFixture.h"

#include <gtest/gtest.h>

using namespace ZEK;
using namespace Store;

namespace
{
using VCalls = std::vector< VHeard::VCall >;

/// Hears everything about some entries, by handle.
struct VCommit : testing::Test
{
  VTestStore m_Store;
  VHeard m_Heard;
  std::vector< std::shared_ptr< IHandlerCallback > > m_Handlers;

  void Listen( std::initializer_list< const char* > i_Paths, bool i_bPattern = false )
  {
    for ( const char* const pPath : i_Paths )
    {
      m_Handlers.push_back( i_bPattern ? m_Store.OnPattern( pPath ) : m_Store.OnEntry( pPath ) );
      m_Handlers.back()->AddImmediateCallback( m_Heard.As( std::string( i_bPattern ? "~" : "" ) + pPath ),
                                               ChangeMask::All );
    }
  }
  template < typename TWork >
  VCalls Told( const TWork& i_rWork )
  {
    m_Heard.Take();
    m_Store.Write( i_rWork );
    return m_Heard.Take();
  }
  std::array< std::uint64_t, 5 > Stamps( const char* i_pPath ) const
  {
    return m_Store.Read(
        [&]( const IStoreReader& i_rReader )
        {
          const VChangeIds Ids = i_rReader.ChangeIds( m_Store[i_pPath] );
          return std::array< std::uint64_t, 5 >{ Ids.m_Verified.Value(), Ids.m_Proposed.Value(), Ids.m_Other.Value(),
                                                 Ids.m_Child.Value(), Ids.m_Descendant.Value() };
        } );
  }
};
using VStamps = std::array< std::uint64_t, 5 >;
} // namespace

TEST_F( VCommit, WhatComesAndGoesIsToldUpTheTreeInOrder )
{
  Listen( { "", "a", "a/b", "a/b/c" } );
  Listen( { "a/*/c", "*" }, true );
  const auto Set = [&]( IStoreWriter& io_rWriter )
  {
    (void)io_rWriter.SetValue( m_Store["a/b/c"], Int( 1 ) );
  };
  const auto Remove = [&]( IStoreWriter& io_rWriter )
  {
    (void)io_rWriter.RemoveEntry( m_Store["a/b/c"] );
  };
  // Children before their parents, and of one entry the patterns before the handles.
  constexpr std::uint64_t V = EChangeVerified;
  EXPECT_EQ( Told( Set ), ( VCalls{ { "~a/*/c", V | EAdded, 1 },
                                    { "a/b/c", V | EAdded, 1 },
                                    { "a/b", V | EAdded | EChildAdded, 1 },
                                    { "~*", V | EAdded | EChildAdded | EDescendantAdded, 1 },
                                    { "a", V | EAdded | EChildAdded | EDescendantAdded, 1 },
                                    { "", V | EAdded | EChildAdded | EDescendantAdded, 1 } } ) );
  EXPECT_EQ( Told( Set ), VCalls() );
  EXPECT_EQ( Told( Remove ), ( VCalls{ { "~a/*/c", ERemoved, 3 },
                                       { "a/b/c", ERemoved, 3 },
                                       { "a/b", EChildRemoved, 3 },
                                       { "~*", EDescendantRemoved, 3 },
                                       { "a", EDescendantRemoved, 3 },
                                       { "", EDescendantRemoved, 3 } } ) );
  EXPECT_EQ( Stamps( "a/b" ), ( VStamps{ 1, 0, 3, 3, 0 } ) );
  EXPECT_EQ( Stamps( "" ), ( VStamps{ 1, 0, 3, 1, 3 } ) );
  EXPECT_EQ( Stamps( "a/b/c" ), VStamps() );
  // A handler by pattern hears of the entry that comes back.
  EXPECT_EQ( Told( Set )[0], ( VHeard::VCall{ "~a/*/c", V | EAdded, 4 } ) );
  EXPECT_EQ( Stamps( "a/b/c" ), ( VStamps{ 4, 0, 4, 0, 0 } ) );
  EXPECT_EQ( Stamps( "" ), ( VStamps{ 4, 0, 4, 1, 4 } ) );
}

TEST_F( VCommit, TouchedAndReplacedEntriesReportWhatWasSet )
{
  m_Store.Set( "a", 1 );
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        io_rWriter.SetExtraText1( m_Store["a"], "gone" );
        io_rWriter.SetFlag( m_Store["a/child"], 1 );
      } );
  Listen( { "a" } );
  struct VCase
  {
    bool bTouch, bRemove;
    std::uint64_t Flags;
  };
  // The text goes once, with the first removal; the child likewise.
  for ( const VCase& rCase : { VCase{ false, false, 0 },
                               { true, false, EChangeVerified | EReAdd | EForce },
                               { false, true, EChangeVerified | EForce | EChangeExtraText1 | EChildRemoved },
                               { false, true, EChangeVerified | EForce },
                               { true, true, EChangeVerified | EForce | EReAdd | EAdded } } )
  {
    const VCalls Calls = Told(
        [&]( IStoreWriter& io_rWriter )
        {
          if ( rCase.bRemove )
          {
            (void)io_rWriter.RemoveEntry( m_Store["a"] );
            EXPECT_TRUE( io_rWriter.ExtraText1( m_Store["a"] ).empty() );
            EXPECT_EQ( io_rWriter.Schema( m_Store["a"] ), IO::GetUniquePodSchema( IO::EType::Void ) );
          }
          if ( rCase.bTouch )
          {
            io_rWriter.Touch( m_Store["a"] );
          }
          EXPECT_EQ( io_rWriter.SetVerifiedValue( m_Store["a"], Int( 1 ) ), IResult::Ok );
        } );
    ASSERT_EQ( Calls.size(), rCase.Flags != 0 ? 1u : 0u );
    EXPECT_TRUE( Calls.empty() || Calls[0].m_Flags == rCase.Flags ) << std::hex << Calls[0].m_Flags;
  }
  EXPECT_EQ( m_Store.Read(
                 [&]( const IStoreReader& i_rReader )
                 {
                   return i_rReader.Children( m_Store[""] ).size();
                 } ),
             1u );
}

TEST_F( VCommit, WhatAScopeMakesAndRemovesLeavesNoTrace )
{
  m_Store.Set( "a", 1 );
  Listen( { "", "a", "a/b", "a/b/c" } );
  const VCalls Calls = Told(
      [&]( IStoreWriter& io_rWriter )
      {
        (void)io_rWriter.SetValue( m_Store["a/b/c"], Int( 1 ) );
        EXPECT_EQ( m_Store.m_pStore->Pending().InUse(), 4u );
        (void)io_rWriter.RemoveEntry( m_Store["a/b"] );
        EXPECT_EQ( m_Store.m_pStore->Pending().InUse(), 0u );
        EXPECT_EQ( io_rWriter.RemoveEntry( m_Store["a/b/c"] ), IResult::NotFound );
      } );
  EXPECT_TRUE( Calls.empty() );
  EXPECT_EQ( Stamps( "a/b" ), VStamps() );
}

TEST_F( VCommit, ChoicesVerificationAndTypesAreTold )
{
  m_Store.Set( "a", 1 );
  Listen( { "a", "b" } );
  const auto Flags = [this]( const auto& i_rWork )
  {
    const VCalls Calls = Told( i_rWork );
    EXPECT_LE( Calls.size(), 1u );
    return Calls.empty() ? 0 : Calls[0].m_Flags;
  };
  VStoreEntry* const pEntry = m_Store["a"];
  const auto Add = [&]( IStoreWriter& io_rWriter )
  {
    (void)io_rWriter.AddValueChoice( pEntry, Int( 1 ), "", "" );
  };
  EXPECT_EQ( Flags( Add ), EChangeChoices | EChangeHasChoices );
  EXPECT_EQ( Flags( Add ), EChangeChoices );
  EXPECT_EQ( Flags(
                 [&]( IStoreWriter& io_rWriter )
                 {
                   (void)io_rWriter.ClearValueChoices( pEntry );
                 } ),
             EChangeChoices | EChangeHasChoices );
  // The value moves to the proposed side, and waits there.
  EXPECT_EQ( Flags(
                 [&]( IStoreWriter& io_rWriter )
                 {
                   io_rWriter.SetFlag( pEntry, EVerifyRequired );
                 } ),
             EChangeVerified | EChangeProposed | EVerifyRequired | EVerificationNeeded );
  EXPECT_EQ( Flags(
                 [&]( IStoreWriter& io_rWriter )
                 {
                   (void)io_rWriter.SetDefaultValue( pEntry, Int( 5 ) );
                 } ),
             EChangeDefault );
  EXPECT_EQ( Flags(
                 [&]( IStoreWriter& io_rWriter )
                 {
                   io_rWriter.QueueVerificationCheck( { {}, { "*" } } );
                   io_rWriter.QueueChangeNotification( { { m_Store["b"] }, {} }, 0 );
                 } ),
             EVerificationNeeded );
  EXPECT_EQ( Flags(
                 [&]( IStoreWriter& io_rWriter )
                 {
                   io_rWriter.QueueChangeNotification( { { m_Store["b"] }, {} }, EChangeAttributes );
                 } ),
             EChangeAttributes )
      << "an entry that is not there";
  EXPECT_EQ( Flags(
                 [&]( IStoreWriter& io_rWriter )
                 {
                   (void)io_rWriter.SetVerifiedValue( pEntry, Int( 1 ) );
                 } ),
             EChangeVerified );
  // A type alone stays with a new entry, and lasts for the scope with an old one.
  const IO::ISchema* const pType = IO::GetUniquePodSchema( IO::EType::Float64 );
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        EXPECT_EQ( io_rWriter.SetSchema( m_Store["new"], pType ), IResult::Ok );
        EXPECT_EQ( io_rWriter.SetSchema( m_Store[""], pType ), IResult::Ok );
        EXPECT_EQ( io_rWriter.Schema( m_Store[""] ), pType );
      } );
  m_Store.Read(
      [&]( const IStoreReader& i_rReader )
      {
        EXPECT_EQ( i_rReader.Schema( m_Store["new"] ), pType );
        EXPECT_EQ( i_rReader.Schema( m_Store[""] ), IO::GetUniquePodSchema( IO::EType::Void ) );
      } );
}

TEST_F( VCommit, QueuedFlagsReachTheSubtree )
{
  m_Store.Set( "a/b/c", 1 );
  m_Store.Set( "a/d", 1 );
  m_Store.Set( "e", 1 );
  Listen( { "", "a", "a/b", "a/b/c", "a/d", "e" } );
  EXPECT_EQ( Told(
                 [&]( IStoreWriter& io_rWriter )
                 {
                   io_rWriter.QueueChangeNotification( { {}, { "*/b", "nobody" } }, EChangeExtraText1 );
                   io_rWriter.QueueChangeNotification( { { m_Store["a/d"] }, {} }, EChangeExtraText2 );
                   (void)io_rWriter.SetValue( m_Store["e"], Int( 2 ) );
                 } ),
             ( VCalls{ { "e", EChangeVerified, 4 },
                       { "", EChangeVerified, 4 },
                       { "a/b", EChangeExtraText1, 4 },
                       { "a/b/c", EChangeExtraText1, 4 },
                       { "a/d", EChangeExtraText2, 4 } } ) );
}

TEST_F( VCommit, AfterShutdownCommitsApplyAndAreToldToNobody )
{
  Listen( { "a" } );
  m_Handlers[0]->AddCallback( m_Heard.As( "posted" ), ChangeMask::All, IHandlerCallback::EveryDelivery );
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        (void)io_rWriter.SetValue( m_Store["a"], Int( 1 ) );
        EXPECT_EQ( m_Store.m_pStore->Shutdown(), IResult::Ok );
      } );
  bool bDeferred = false;
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        (void)io_rWriter.SetValue( m_Store["a"], Int( 2 ) );
        io_rWriter.Defer(
            [&]
            {
              bDeferred = true;
            } );
      } );
  EXPECT_TRUE( bDeferred );
  EXPECT_TRUE( m_Heard.Take().empty() );
  EXPECT_EQ( m_Store.m_pService->Waiting(), 0u );
  EXPECT_EQ( m_Store.Read(
                 [&]( const IStoreReader& i_rReader )
                 {
                   return i_rReader.VerifiedValue( m_Store["a"] );
                 } ),
             Int( 2 ) );
}
