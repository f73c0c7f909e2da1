#include "StoreFixture.h"

#include <gtest/gtest.h>

#include <functional>
#include <pthread.h>

using namespace ZEK;
using namespace Store;

namespace
{
void RunOnSmallStack( const std::function< void() >& i_rWork )
{
  pthread_attr_t Attributes;
  pthread_attr_init( &Attributes );
  ASSERT_EQ( pthread_attr_setstacksize( &Attributes, 512 * 1024 ), 0 );
  pthread_t Thread;
  ASSERT_EQ( pthread_create(
                 &Thread, &Attributes,
                 []( void* i_pWork ) -> void*
                 {
                   ( *static_cast< const std::function< void() >* >( i_pWork ) )();
                   return nullptr;
                 },
                 const_cast< std::function< void() >* >( &i_rWork ) ),
             0 );
  pthread_join( Thread, nullptr );
  pthread_attr_destroy( &Attributes );
}

std::string Deep( const char* i_pName, std::size_t i_Components )
{
  std::string Text = i_pName;
  for ( std::size_t Component = 1; Component < i_Components; ++Component )
  {
    Text.append( "/" ).append( i_pName );
  }
  return Text;
}

void UseDeepPaths()
{
  // Every entry holds its whole path, so that the entries are fewer than the components of a pattern.
  constexpr std::size_t Entries = 4000, Components = 100000;
  const VTestStore Store;
  VHeard Heard;
  const std::string Path = Deep( "a", Entries );
  const std::string Pattern = std::string( "*" ).append( Path, 1 );
  Store.Set( Path.c_str(), 1 );
  const auto pDeep = Store.OnPattern( Pattern.c_str() );
  pDeep->AddImmediateCallback( Heard.As( "deep" ), ChangeMask::All );
  auto pStars = Store.OnPattern( Deep( "*", Components ).c_str() );
  const auto pNames = Store.OnPattern( Deep( "b", Components ).c_str() );
  pStars.reset();
  const auto Look = [&]( const IStoreReader& i_rReader )
  {
    EXPECT_EQ( i_rReader.FindEntries( Pattern.c_str() ).size(), 1u );
    EXPECT_TRUE( i_rReader.FindEntries( Deep( "*", Components ).c_str() ).empty() );
  };
  Store.Read( Look );
  Store.Write( Look );
  Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        io_rWriter.QueueChangeNotification( { { Store["a"] }, {} }, EPersistent );
      } );
  const VTestStore Copy;
  Copy.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        const VStoreReadScope Scope( *Store.m_pStore );
        EXPECT_EQ( CopyEntries( *Scope, io_rWriter, false ), IResult::Ok );
      } );
  EXPECT_EQ( Copy[Path.c_str()]->m_Values.m_Verified, Int( 1 ) );
  Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        EXPECT_EQ( io_rWriter.SetValue( Store[( Path + "/new" ).c_str()], Int( 2 ) ), IResult::Ok );
        EXPECT_EQ( io_rWriter.RemoveEntry( Store["a"] ), IResult::Ok );
        EXPECT_TRUE( io_rWriter.FindEntries( Pattern.c_str() ).empty() );
      } );
  EXPECT_EQ( Heard.Take(), ( std::vector< VHeard::VCall >{ { "deep", EPersistent, 3 }, { "deep", ERemoved, 4 } } ) );
  EXPECT_FALSE( Store["a"]->m_pState );
  pDeep->RemoveAllCallbacks();
}

/// Does something when the callback that holds it is released.
struct VAtEnd
{
  explicit VAtEnd( std::function< void() > i_Work )
    : m_Work( std::move( i_Work ) )
  {
  }
  ~VAtEnd() { m_Work(); }
  const std::function< void() > m_Work;
};
} // namespace

TEST( StoreLimits, DeepPathsNeedNoStack )
{
  RunOnSmallStack( UseDeepPaths );
}

TEST( StoreLimits, CallbacksReleaseOthersAndCommitWhenTheyAreReleased )
{
  const VTestStore Store;
  VHeard Heard;
  const auto pFirst = Store.OnEntry( "a" );
  auto pSecond = Store.OnEntry( "b" );
  auto pEnd = std::make_shared< VAtEnd >(
      [&]
      {
        Store.Set( "c", 7 );
      } );
  pSecond->AddImmediateCallback(
      [pKept = std::move( pEnd )]( IBitFlags< EChangeFlags >, ChangeId )
      {
        ADD_FAILURE() << "removed before its list was called";
      },
      EChangeVerified );
  const auto pThird = Store.OnEntry( "c" );
  pThird->AddImmediateCallback( Heard.As( "third" ), EChangeVerified );
  pFirst->AddImmediateCallback(
      [&]( IBitFlags< EChangeFlags >, ChangeId )
      {
        pSecond->RemoveAllCallbacks();
        pSecond.reset();
      },
      EChangeVerified );
  Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        (void)io_rWriter.SetValue( Store["a"], Int( 1 ) );
        (void)io_rWriter.SetValue( Store["b"], Int( 1 ) );
      } );
  ASSERT_EQ( Heard.Take().size(), 1u );
  EXPECT_EQ( Store["c"]->m_Values.m_Verified, Int( 7 ) );
  EXPECT_EQ( Store.m_pStore->HandlerCount(), 2u );
  EXPECT_TRUE( Store.m_pStore->IsAtRest() );
  pFirst->RemoveAllCallbacks();
  pThird->RemoveAllCallbacks();
}

TEST( StoreLimitsDeathTest, AStoreWithoutOwnersIsNotShared )
{
  const auto ShareAtTheEnd = []
  {
    VTestStore Store;
    VStore* const pRaw = Store.m_pStore.get();
    const auto pHandler = Store.OnEntry( "a" );
    auto pEnd = std::make_shared< VAtEnd >(
        [pRaw]
        {
          pRaw->BeginRead()->GetSharedStore();
        } );
    pHandler->AddImmediateCallback( [pKept = std::move( pEnd )]( IBitFlags< EChangeFlags >, ChangeId ) {},
                                    EChangeVerified );
    Store.m_pStore.reset();
  };
  EXPECT_DEATH( ShareAtTheEnd(), "pStore" );
}

TEST( StoreLimitsDeathTest, AMutexThatCannotBeLockedIsFatal )
{
  const auto LockTwice = []
  {
    pthread_mutexattr_t Attributes;
    pthread_mutexattr_init( &Attributes );
    pthread_mutexattr_settype( &Attributes, PTHREAD_MUTEX_ERRORCHECK );
    std::mutex Mutex;
    pthread_mutex_init( Mutex.native_handle(), &Attributes );
    const std::unique_lock Lock = LockOrDie( Mutex );
    (void)LockOrDie( Mutex );
  };
  EXPECT_DEATH( LockTwice(), "mutex locked" );
}
