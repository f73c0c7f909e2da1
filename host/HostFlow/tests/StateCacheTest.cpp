#include "FlowTestItems.h"

#include <TestSupport/Calls.h>

using namespace ZEK;
using namespace CoreMoxelTypes;
using namespace HostFlow;

namespace
{

VFlowStateRef Newest( IFlowStateCache& i_rCache )
{
  VFlowStateRef State;
  EXPECT_TRUE( i_rCache.Fetch( State, 31, 2, 0 ) );
  return State;
}

/// Counts what each notifier fired.
class VFired
{
public:
  explicit VFired( IFlowStateCache& i_rCache )
    : m_Calls{ TestSupport::VCalls( i_rCache.StatesChanged() ), TestSupport::VCalls( i_rCache.Notifier2() ),
               TestSupport::VCalls( i_rCache.Notifier3() ),     TestSupport::VCalls( i_rCache.Notifier4() ),
               TestSupport::VCalls( i_rCache.Notifier5() ),     TestSupport::VCalls( i_rCache.Notifier6() ) }
  {
  }
  /// The six counts since the last call, as text.
  std::string Take()
  {
    std::string Text;
    for ( TestSupport::VCalls& rCalls : m_Calls )
    {
      Text += std::to_string( rCalls.Take() );
    }
    return Text;
  }

private:
  TestSupport::VCalls m_Calls[6];
};

} // namespace

TEST( StateCache, GivesTheStateAddedLastNotTheOneWithTheGreatestKey )
{
  const auto pCache = MakeCache( 4 );
  VFlowStateRef State = NewState( { 77, 1, 1 } );
  EXPECT_TRUE( pCache->Fetch( State, 31, 2, 0 ) );
  EXPECT_FALSE( State ) << "an empty cache nulls what the out state held";

  for ( const std::int64_t Frame : { 10, 20, 30, 5 } )
  {
    ASSERT_TRUE( pCache->Add( NewState( { Frame, 10, 2 } ) ).IsOk() );
  }
  EXPECT_EQ( Newest( *pCache )->GetKey().Frame, 5 );
  EXPECT_TRUE( pCache->Fetch( State, 31, 0, 0 ) );
  EXPECT_EQ( State->GetKey().Frame, 10 );

  ASSERT_TRUE( pCache->Add( NewState( { 50, 10, 2 } ) ).IsOk() );
  EXPECT_TRUE( pCache->Fetch( State, 31, 0, 0 ) );
  EXPECT_EQ( State->GetKey().Frame, 20 ) << "the oldest left the ring";
  EXPECT_EQ( State->UseCount(), 2 );

  EXPECT_FALSE( pCache->Fetch( State, 31, 1, 0 ) );
  EXPECT_FALSE( State );
  EXPECT_FALSE( pCache->Fetch( State, 31, 3, 0 ) );
  EXPECT_FALSE( pCache->Fetch( State, 0, 2, 0 ) );
  EXPECT_EQ( pCache->Add( nullptr ), IResult( IResult::InvalidPointer ) );
}

TEST( StateCache, FindsByKeyAndByCoveringSpan )
{
  const auto pCache = MakeCache( 8 );
  for ( const std::int64_t Frame : { 0, 10, 20, 30 } )
  {
    AddState( *pCache, NewState( { Frame, 10, 2 } ) );
  }
  const VFlowStateRef Again = NewState( { 10, 10, 2 } );
  AddState( *pCache, Again );
  VFlowStateRef State;
  ASSERT_TRUE( pCache->FetchWhere( { 10, 1, 2 }, State, 31, 2, 0 ) );
  EXPECT_EQ( State, Again );
  ASSERT_TRUE( pCache->FetchWhere( { 10, 1, 2 }, State, 31, 0, 0 ) );
  EXPECT_NE( State, Again );
  ASSERT_TRUE( pCache->FetchWhere( { 39, 1, 2 }, State, 31, 1, 0 ) );
  EXPECT_EQ( State->GetKey().Frame, 30 );
  for ( const VFlowTimeKey& rKey : { VFlowTimeKey{ 40, 1, 2 }, VFlowTimeKey{ -1, 5, 2 }, VFlowTimeKey{ 10, 1, 1 } } )
  {
    EXPECT_FALSE( pCache->Contains( rKey, 0 ) );
    EXPECT_FALSE( pCache->FetchWhere( rKey, State, 31, 2, 0 ) );
    EXPECT_FALSE( State );
  }
  EXPECT_TRUE( pCache->Contains( { 15, 1, 2 }, 0 ) );

  std::vector< VFlowStateRef > States( 1, Again );
  ASSERT_TRUE( pCache->FetchMany( { { 10, 1, 2 }, { 20, 1, 2 } }, States, 0 ) );
  ASSERT_EQ( States.size(), 3u );
  EXPECT_EQ( States[0]->GetKey().Frame, 10 );
  EXPECT_EQ( States[1]->GetKey().Frame, 20 );
  EXPECT_EQ( States[2], Again );

  VFlowTimeRange Range;
  VFlowTimeKey Key;
  std::vector< VFlowItemRef > Items;
  EXPECT_FALSE( pCache->Query( { 10, 1, 2 }, 31, true ) || pCache->QueryRange( Range ) ||
                pCache->QueryKey( { 10, 1, 2 }, Key, {}, 0 ) || pCache->QueryItems( { 10, 1, 2 }, {}, Items ) );
}

TEST( StateCache, FiresTheNotifierOfEachEventWithNoLockHeld )
{
  const auto pCache = MakeCache( 4 );
  VFired Fired( *pCache );
  std::int64_t Seen = 0;
  const VConnection Reader = pCache->StatesChanged().Connect(
      [&]
      {
        Seen = Newest( *pCache )->GetKey().Frame;
      },
      nullptr );
  AddState( *pCache, NewState( { 3, 1, 1 } ) );
  EXPECT_EQ( Fired.Take(), "100000" );
  EXPECT_EQ( Seen, 3 ) << "a listener fetches the state that it is told of";
  const VFlowStateRef Replacement = NewState( { 3, 1, 1 } );
  AddState( *pCache, Replacement );
  EXPECT_EQ( Fired.Take(), "110000" );
  VFlowStateRef Oldest;
  ASSERT_TRUE( pCache->Fetch( Oldest, 31, 0, 0 ) );
  EXPECT_EQ( Oldest, Replacement ) << "the replaced state is gone";

  pCache->Clear();
  EXPECT_EQ( Fired.Take(), "000001" );
  EXPECT_FALSE( Newest( *pCache ) );
  AddState( *pCache, NewState( { 1, 1, 1 } ) );
  EXPECT_EQ( Newest( *pCache )->GetKey().Frame, 1 );
  Fired.Take();

  pCache->SetStatus( 1 );
  EXPECT_EQ( Fired.Take(), "000000" );
  pCache->SetStatus( 0 );
  EXPECT_EQ( Fired.Take(), "001000" );
  EXPECT_FALSE( pCache->IsActive() );
  pCache->NamesChanged();
  EXPECT_EQ( Fired.Take(), "000010" );

  const VFlowItemRef Item = NewItem< FlowVolumeProperties >();
  pCache->SetStaticItems( { Item } );
  EXPECT_EQ( Fired.Take(), "000100" );
  const auto* pProvider =
      dynamic_cast< const IFlowStaticItemProvider* >( static_cast< IFlowStateCache* >( pCache.get() ) );
  ASSERT_NE( pProvider, nullptr );
  std::vector< VFlowItemRef > Items;
  IResult Status = IResult::Failed;
  pProvider->GetStaticItems( Status, Items );
  EXPECT_TRUE( Status.IsOk() );
  ASSERT_EQ( Items.size(), 1u );
  EXPECT_EQ( Items[0], Item );
}

TEST( CacheManager, GivesTheSameCacheForTheSameName )
{
  const auto pManager = MakeCacheManager( 3 );
  std::shared_ptr< IFlowWritableStateCache > pLive, pAgain, pPlayback;
  EXPECT_TRUE( pManager->CreateCache( pLive, "Live", 0 ).IsOk() );
  EXPECT_EQ( pManager->CreateCache( pAgain, "Live", 0 ), IResult( IResult::AlreadyPresent ) );
  EXPECT_EQ( pLive, pAgain );
  EXPECT_TRUE( pManager->CreateCache( pPlayback, "Playback", 0 ).IsOk() );
  EXPECT_EQ( pManager->CreateCache( pAgain, "", 0 ), IResult( IResult::InvalidName ) );
  EXPECT_FALSE( pAgain );
  EXPECT_EQ( pManager->Names(), ( std::vector< std::string >{ "Live", "Playback" } ) );
  EXPECT_EQ( pManager->FindCache( "Playback" ), pPlayback );
  EXPECT_FALSE( pManager->FindCache( "live" ) );
  std::uint32_t IdA = 0, IdB = 0;
  pLive->GetId( IdA );
  pPlayback->GetId( IdB );
  EXPECT_NE( IdA, IdB );

  for ( std::int64_t Frame = 0; Frame < 10; ++Frame )
  {
    AddState( *pLive, NewState( { Frame, 1, 1 } ) );
  }
  VFlowStateRef Oldest;
  pLive->Fetch( Oldest, 31, 0, 0 );
  EXPECT_EQ( Oldest->GetKey().Frame, 7 ) << "the ring is as long as the manager was told";
  EXPECT_FALSE( Newest( *pPlayback ) );
}
