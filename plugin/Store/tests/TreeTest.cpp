#include "StoreFixture.h"

#include <TestSupport/LogGuard.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <set>
#include <thread>

using namespace ZEK;
using namespace Store;
using TestSupport::VAssertRecorder;

namespace
{
std::vector< std::string > Texts( const std::vector< VStoreEntry* >& i_rEntries )
{
  std::vector< std::string > Found;
  for ( const VStoreEntry* const pEntry : i_rEntries )
  {
    Found.push_back( pEntry->m_Path.Text() );
  }
  return Found;
}
using VTexts = std::vector< std::string >;
} // namespace

TEST( StoreTree, AHandleAloneShowsNothingAndLastsForGood )
{
  for ( const std::size_t Buckets : { 0u, 1u, 64u } )
  {
    const VTestStore Store( Buckets );
    std::vector< std::thread > Threads;
    std::array< std::vector< VStoreEntry* >, 4 > Handles;
    for ( std::vector< VStoreEntry* >& rHandles : Handles )
    {
      Threads.emplace_back(
          [&]
          {
            for ( int Number = 0; Number < 200; ++Number )
            {
              rHandles.push_back( Store[( "a/" + std::to_string( Number ) + "/b" ).c_str()] );
            }
          } );
    }
    for ( std::thread& rThread : Threads )
    {
      rThread.join();
    }
    EXPECT_TRUE( Handles[0] == Handles[1] && Handles[0] == Handles[2] && Handles[0] == Handles[3] );
    EXPECT_EQ( Store.m_pStore->Table().Count(), 402u );
    VStoreEntry* const pEntry = Handles[0][7];
    EXPECT_EQ( Store.m_pStore->EntryPath( pEntry ).Text(), "a/7/b" );
    EXPECT_EQ( &Store.m_pStore->GetEntryPath( "a/7/b" ), &pEntry->m_Path );
    EXPECT_EQ( Store.m_pStore->FindEntry( "a/7/c" ), nullptr );
    const auto ShowsNothing = [&]( const IStoreReader& i_rReader )
    {
      EXPECT_FALSE( i_rReader.Exists( pEntry ) || i_rReader.Exists( Store.m_pStore->GetRootEntry() ) );
      EXPECT_EQ( i_rReader.ChildCount( Store["a"] ), 0u );
      EXPECT_TRUE( i_rReader.FindEntries( "a/*/b" ).empty() );
    };
    Store.Read( ShowsNothing );
    Store.Write( ShowsNothing );
    // A commit of nothing makes nothing; the first write makes the root too.
    Store.Set( "a/7/b", 5 );
    Store.Write(
        [&]( IStoreWriter& io_rWriter )
        {
          EXPECT_EQ( io_rWriter.RemoveEntry( pEntry ), IResult::Ok );
          EXPECT_EQ( io_rWriter.RemoveEntry( pEntry ), IResult::NotFound );
        } );
    Store.Set( "a/7/b", 6 );
    Store.Read(
        [&]( const IStoreReader& i_rReader )
        {
          EXPECT_EQ( Store["a/7/b"], pEntry );
          EXPECT_EQ( i_rReader.VerifiedValue( pEntry ), Int( 6 ) );
          EXPECT_TRUE( i_rReader.Exists( Store.m_pStore->GetRootEntry() ) );
        } );
  }
}

TEST( StoreTree, OddPathsAreOrderedAndFoundAndLeaveNoHandlerBehind )
{
  const VTestStore Store;
  const VTexts Sorted{ "", "/", "*", "/a", "a", "a!", "aa", "b", "\xc3\xa9" };
  for ( const char* const pPath : { "\xc3\xa9", "b", "aa", "a", "/a", "a!", "/", "*" } )
  {
    Store.Set( pPath, 1 );
  }
  Store.Set( "/a/x", 1 );
  Store.Set( "a//x", 1 );
  VHeard Heard;
  std::vector< std::shared_ptr< IHandlerCallback > > Handlers;
  for ( const char* const pPattern : { "*", "/a", "a/*", "*/*", "/*", "*/x", "a//x" } )
  {
    Handlers.push_back( Store.OnPattern( pPattern ) );
    Handlers.back()->AddImmediateCallback( Heard.As( pPattern ), ChangeMask::All & ~ChangeMask::Structural );
  }
  const auto Look = [&]( const IStoreReader& i_rReader )
  {
    EXPECT_EQ( Texts( i_rReader.Children( Store[""] ) ), VTexts( Sorted.begin() + 1, Sorted.end() ) );
    EXPECT_EQ( Texts( i_rReader.FindEntries( "*" ) ), VTexts( Sorted.begin() + 1, Sorted.end() ) );
    EXPECT_EQ( i_rReader.Child( Store[""], "a" ), Store["/a"] );
    EXPECT_EQ( Texts( i_rReader.FindEntries( "/a" ) ), VTexts{ "/a" } );
    EXPECT_EQ( Texts( i_rReader.FindEntries( "" ) ), VTexts{ "" } );
    EXPECT_EQ( Texts( i_rReader.FindEntries( "a*" ) ), VTexts() );
    EXPECT_EQ( Texts( i_rReader.FindEntries( "a/*" ) ), ( VTexts{ "/a/x", "a/" } ) );
    EXPECT_EQ( Texts( i_rReader.FindEntries( "a/*/x" ) ), VTexts{ "a//x" } );
  };
  Store.Read( Look );
  Store.Write( Look );
  // A handler hears exactly the entries that reading by its pattern finds, also when they come later.
  const auto Names = [&]( const char* i_pPath, std::int32_t i_Value )
  {
    Heard.Take();
    Store.Set( i_pPath, i_Value );
    std::set< std::string > Found;
    for ( const VHeard::VCall& rCall : Heard.Take() )
    {
      Found.insert( rCall.m_Who );
    }
    return Found;
  };
  using VNames = std::set< std::string >;
  for ( const std::int32_t Value : { 2, 3 } )
  {
    EXPECT_EQ( Names( "/a", Value ), ( VNames{ "*", "/a" } ) );
    EXPECT_EQ( Names( "/a/x", Value ), ( VNames{ "*", "/a", "a/*", "*/*", "*/x" } ) );
    EXPECT_EQ( Names( "a//x", Value ), ( VNames{ "*", "a/*", "*/*", "a//x" } ) );
    EXPECT_EQ( Names( "//q", Value ), ( VNames{ "*", "/*", "*/*" } ) );
    Store.Write(
        [&]( IStoreWriter& io_rWriter )
        {
          (void)io_rWriter.RemoveEntry( Store["/a"] );
          (void)io_rWriter.RemoveEntry( Store["a/"] );
          (void)io_rWriter.RemoveEntry( Store["/"] );
        } );
    Store.Write(
        [&]( IStoreWriter& io_rWriter )
        {
          (void)io_rWriter.SetValue( Store["/a/x"], Int( 0 ) );
          (void)io_rWriter.SetValue( Store["a//x"], Int( 0 ) );
        } );
  }
  for ( const auto& rpHandler : Handlers )
  {
    rpHandler->RemoveAllCallbacks();
  }
  Handlers.clear();
  EXPECT_EQ( Store.m_pStore->HandlerCount(), 0u );
  EXPECT_TRUE( Names( "/a/x", 9 ).empty() );
}

TEST( StoreTree, ScopesOfAThreadNest )
{
  const VTestStore Store;
  IStoreReader* const pReader = Store.m_pStore->BeginRead();
  EXPECT_EQ( Store.m_pStore->BeginWrite(), nullptr );
  EXPECT_FALSE( VStoreWriteScope( *Store.m_pStore ) );
  EXPECT_EQ( Store.m_pStore->Shutdown(), IResult::NotPermitted );
  EXPECT_EQ( Store.m_pStore->BeginRead(), pReader );
  Store.m_pStore->EndRead();
  Store.m_pStore->EndRead();
  EXPECT_TRUE( Store.m_pStore->IsAtRest() );
  IStoreWriter* const pWriter = Store.m_pStore->BeginWrite();
  EXPECT_EQ( pWriter->GetSharedStore(), Store.m_pStore );
  EXPECT_EQ( pReader->GetSharedStore(), Store.m_pStore );
  (void)pWriter->SetValue( Store["a"], Int( 4 ) );
  EXPECT_EQ( Store.m_pStore->BeginWrite(), pWriter );
  IStoreReader* const pInner = Store.m_pStore->BeginRead();
  EXPECT_EQ( pInner, static_cast< IStoreReader* >( pWriter ) );
  EXPECT_EQ( pInner->VerifiedValue( Store["a"] ), Int( 4 ) );
  Store.m_pStore->EndRead();
  Store.m_pStore->EndWrite();
  EXPECT_EQ( pWriter->Generation(), ChangeId( 0 ) );
  EXPECT_EQ( Store.m_pStore->LastCommit(), 0u );
  Store.m_pStore->EndWrite();
  EXPECT_EQ( Store.m_pStore->LastCommit(), 1u );
  EXPECT_TRUE( Store.m_pStore->IsAtRest() );
}

TEST( StoreTree, MisuseIsToldAndChangesNothing )
{
  const VTestStore Store;
  const VAssertRecorder Asserts;
  Store.m_pStore->EndRead();
  Store.m_pStore->EndWrite();
  Store.m_pStore->BeginRead();
  Store.m_pStore->EndWrite();
  Store.m_pStore->EndRead();
  IStoreWriter& rWriter = *Store.m_pStore->BeginWrite();
  Store.m_pStore->EndRead();
  EXPECT_EQ( Asserts.Expressions().size(), 4u );
  // A bit that is no flag would name a value that was never set.
  rWriter.SetFlags( Store["a"], 0x10001, true );
  EXPECT_EQ( Asserts.Expressions().size(), 5u );
  EXPECT_TRUE( rWriter.VerifiedValue( Store["a"] ).IsEmpty() );
  EXPECT_EQ( rWriter.Flags( Store["a"] ), 1u );
  // Null handles read as empty, and are written to nowhere.
  EXPECT_EQ( rWriter.SetVerifiedValue( nullptr, Int( 1 ) ), IResult::InvalidHandle );
  EXPECT_EQ( rWriter.AddValueChoice( nullptr, Int( 1 ), "", "" ), IResult::InvalidHandle );
  EXPECT_EQ( rWriter.RemoveValueChoice( nullptr, 0 ), IResult::InvalidHandle );
  EXPECT_EQ( rWriter.RemoveEntry( nullptr ), IResult::NotFound );
  rWriter.SetFlag( nullptr, 1 );
  rWriter.SetExtraText1( nullptr, "x" );
  rWriter.Touch( nullptr );
  rWriter.QueueChangeNotification( { { nullptr }, {} }, EChangeVerified );
  const auto ReadNull = []( const IStoreReader& i_rReader )
  {
    EXPECT_FALSE( i_rReader.Exists( nullptr ) || i_rReader.HasChildren( nullptr ) || i_rReader.HasValue( nullptr ) );
    EXPECT_TRUE( i_rReader.Children( nullptr ).empty() && i_rReader.Choices( nullptr ).empty() );
    EXPECT_EQ( i_rReader.Child( nullptr, "a" ), nullptr );
    EXPECT_EQ( i_rReader.Schema( nullptr ), IO::GetUniquePodSchema( IO::EType::Void ) );
    EXPECT_FALSE( i_rReader.ChangeIds( nullptr ).m_Other.IsValid() );
  };
  ReadNull( rWriter );
  Store.m_pStore->EndWrite();
  Store.Read( ReadNull );
  EXPECT_TRUE( Store.m_pStore->IsAtRest() );
}

TEST( StoreTree, ManySiblingsComeAndGoInAnyOrder )
{
  std::vector< std::string > Names;
  for ( int Number = 0; Number < 5000; ++Number )
  {
    Names.push_back( "p/" + std::to_string( Number ) );
  }
  std::mt19937 Random( 11 );
  const VTestStore Store( 4096 );
  for ( int Round = 0; Round < 2; ++Round )
  {
    std::shuffle( Names.begin(), Names.end(), Random );
    Store.Write(
        [&]( IStoreWriter& io_rWriter )
        {
          for ( const std::string& rName : Names )
          {
            (void)io_rWriter.SetValue( Store[rName.c_str()], Int( 1 ) );
          }
          // Half of them go again, unseen, and then some that are asked for in between.
          for ( std::size_t Place = 0; Place < Names.size(); Place += 2 )
          {
            EXPECT_EQ( io_rWriter.RemoveEntry( Store[Names[Place].c_str()] ), IResult::Ok );
            if ( Place % 500 == 0 )
            {
              EXPECT_EQ( io_rWriter.ChildCount( Store["p"] ), Names.size() - 1 - Place / 2 );
              EXPECT_EQ( io_rWriter.Child( Store["p"], Names[Place].substr( 2 ) ), nullptr );
              EXPECT_NE( io_rWriter.Child( Store["p"], Names[Place + 1].substr( 2 ) ), nullptr );
            }
          }
        } );
    std::set< std::string > Left;
    for ( std::size_t Place = 1; Place < Names.size(); Place += 2 )
    {
      Left.insert( Names[Place] );
    }
    Store.Read(
        [&]( const IStoreReader& i_rReader )
        {
          EXPECT_EQ( Texts( i_rReader.Children( Store["p"] ) ), VTexts( Left.begin(), Left.end() ) );
        } );
    Store.Write(
        [&]( IStoreWriter& io_rWriter )
        {
          for ( const std::string& rName : Left )
          {
            EXPECT_EQ( io_rWriter.RemoveEntry( Store[rName.c_str()] ), IResult::Ok );
          }
          EXPECT_FALSE( io_rWriter.HasChildren( Store["p"] ) );
        } );
    EXPECT_EQ( Store.m_pStore->Pending().InUse(), 0u );
  }
}

TEST( StoreTree, CopiesCarryEverythingAndKeepWhatIsTheirOwn )
{
  GlobalLog().Category( "Store" ).SetMaximumLevel( ELogDetail );
  const VTestStore From, To;
  From.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        VStoreEntry* const pFull = From["keep/full"];
        io_rWriter.SetFlag( pFull, EPersistent );
        (void)io_rWriter.SetDefaultValue( pFull, Int( 3 ) );
        (void)io_rWriter.SetMinimum( pFull, Int( 0 ) );
        (void)io_rWriter.AddValueChoice( pFull, Int( 3 ), "three", "" );
        (void)io_rWriter.AddValueChoice( pFull, Int( 4 ), "", "tip" );
        io_rWriter.SetOptionalText( pFull, "" );
        io_rWriter.SetExtraNumber2( pFull, 7 );
        io_rWriter.SetFlag( From["keep/verify"], EPersistent | EVerifyRequired );
        (void)io_rWriter.SetVerifiedValue( From["keep/verify"], Int( 1 ) );
        (void)io_rWriter.SetProposedValue( From["keep/verify"], Int( 2 ) );
        (void)io_rWriter.SetValue( From["keep/passing"], Int( 9 ) );
        io_rWriter.SetFlag( From["other"], EPersistent );
        (void)io_rWriter.SetValue( From["other"], Int( 5 ) );
      } );
  To.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        (void)io_rWriter.SetVerifiedValue( To["keep/verify"], Int( 70 ) );
        (void)io_rWriter.SetValue( To["keep/own"], Int( 8 ) );
        (void)io_rWriter.AddValueChoice( To["keep/full"], Int( 1 ), "gone", "gone" );
        (void)io_rWriter.SetValue( To["other"], IO::MakeValue( 1.5 ) );
      } );
  To.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        TestSupport::ExpectFailureLine(
            "Failed to set 'other' value schema: the requested type does not match the entry type." );
        const VStoreReadScope Read( *From.m_pStore );
        EXPECT_EQ( CopyEntries( *Read, io_rWriter, true ), IResult::InvalidType );
      } );
  EXPECT_EQ( TestSupport::LogTexts( "Store", ELogDetail ),
             ( VTexts{ "Skipping non-persistable entry ''.", "Skipping non-persistable entry 'keep'.",
                       "Skipping non-persistable entry 'keep/passing'." } ) );
  GlobalLog().Category( "Store" ).SetMaximumLevel( ELogWarning );
  To.Read(
      [&]( const IStoreReader& i_rReader )
      {
        VStoreEntry* const pFull = To["keep/full"];
        EXPECT_EQ( i_rReader.Flags( pFull ), EPersistent | EUsingDefault );
        EXPECT_EQ( i_rReader.VerifiedValue( pFull ), Int( 3 ) );
        EXPECT_EQ( i_rReader.DefaultValue( pFull ), Int( 3 ) );
        EXPECT_EQ( i_rReader.Minimum( pFull ), Int( 0 ) );
        EXPECT_EQ( i_rReader.Choices( pFull ), ( std::vector< VTypedValue >{ Int( 3 ), Int( 4 ) } ) );
        EXPECT_EQ( i_rReader.ChoiceTexts( pFull ), ( VTexts{ "three", "" } ) );
        EXPECT_EQ( i_rReader.ChoiceToolTips( pFull ), ( VTexts{ "", "tip" } ) );
        EXPECT_EQ( i_rReader.OptionalText( pFull ), std::optional< std::string >( "" ) );
        EXPECT_EQ( i_rReader.ExtraNumber2( pFull ), 7u );
        EXPECT_EQ( i_rReader.VerifiedValue( To["keep/verify"] ), Int( 1 ) );
        EXPECT_EQ( i_rReader.ProposedValue( To["keep/verify"] ), Int( 2 ) );
        EXPECT_TRUE( i_rReader.IsVerificationPending( To["keep/verify"] ) );
        EXPECT_EQ( i_rReader.VerifiedValue( To["other"] ), IO::MakeValue( 1.5 ) );
        EXPECT_TRUE( i_rReader.Exists( To["keep/own"] ) );
        EXPECT_FALSE( i_rReader.Exists( To["keep/passing"] ) );
      } );
}
