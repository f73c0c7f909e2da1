#include "FlowTestItems.h"

#include <TestSupport/LogGuard.h>

#include <limits>
#include <random>

using namespace ZEK;
using namespace CoreMoxelTypes;
using namespace HostFlow;

namespace
{

constexpr VFlowTimeKey Now{ 1000, 10, 1 };

} // namespace

TEST( FlowState, KeepsEntriesByTagThenKeyThenInsertion )
{
  const VFlowStateRef State = NewState( Now );
  std::vector< VFlowEntry > Expected;
  std::mt19937 Random( 7 );
  for ( int Number = 0; Number < 2000; ++Number )
  {
    const VFlowTimeKey Key{ static_cast< std::int64_t >( Random() % 5 ) - 2, 1,
                            static_cast< std::uint32_t >( 1 + Random() % 2 ) };
    const std::string Name = "Camera " + std::to_string( Number );
    const VFlowItemRef Item =
        Random() % 2 ? NewItem< FlowCameraHardware >( 2, Name ) : NewItem< FlowDevice >( 2, Name );
    State->AddItemAt( Item, Key );
    Expected.push_back( { Key, Item->Id().Type, Item.Get() } );
  }
  std::stable_sort( Expected.begin(), Expected.end(),
                    []( const VFlowEntry& i_rA, const VFlowEntry& i_rB )
                    {
                      return i_rA.Tag != i_rB.Tag ? i_rA.Tag < i_rB.Tag : i_rA.Key < i_rB.Key;
                    } );
  ASSERT_EQ( State->ItemCount(), Expected.size() );
  VFlowCursor It, End;
  State->ItemsBegin( It, 0x1000, EFlowTimeMatch::AtOrAfter, { std::numeric_limits< std::int64_t >::min(), 1, 0 } );
  State->EndCursor( End );
  for ( const VFlowEntry& rEntry : Expected )
  {
    ASSERT_FALSE( It == End );
    ASSERT_EQ( It->pItem, rEntry.pItem );
    ++It;
  }
  EXPECT_EQ( It, End );
}

TEST( FlowState, ARangeHoldsWhatPassesEachMatchAndNothingOfOtherTags )
{
  const VFlowStateRef State = NewState( Now );
  State->AddItem( NewItem< FlowCameraHardware >( 2, "other tag below" ) );
  State->AddItem( NewItem< FlowDeviceSamples >( 2, "other tag above" ) );
  const VFlowTimeKey Keys[] = { { 990, 1, 1 },  { 500, 600, 1 }, { 1000, 10, 1 }, { 1000, 1, 1 }, { 1009, 1, 1 },
                                { 1010, 1, 1 }, { 1000, 10, 2 }, { 1000, 1, 0 },  { 995, 6, 1 },  { 995, 5, 1 } };
  int Number = 0;
  for ( const VFlowTimeKey& rKey : Keys )
  {
    State->AddItemAt( NewItem< FlowDevice >( 2, std::to_string( Number++ ) ), rKey );
  }
  for ( const auto Match : { EFlowTimeMatch::Equal, EFlowTimeMatch::Before, EFlowTimeMatch::BeforeOrAt,
                             EFlowTimeMatch::After, EFlowTimeMatch::AtOrAfter, EFlowTimeMatch::Overlap } )
  {
    for ( const VFlowTimeKey& rQuery : { Now, VFlowTimeKey{ 0, 1, 0 }, VFlowTimeKey{ 5000, 1, 3 },
                                         VFlowTimeKey{ 1004, 2, 1 }, VFlowTimeKey{ 1010, 0, 1 } } )
    {
      SCOPED_TRACE( testing::Message() << static_cast< int >( Match ) << " at " << rQuery.Frame << "@"
                                       << rQuery.Clock );
      std::size_t Passing = 0;
      for ( const VFlowTimeKey& rKey : Keys )
      {
        Passing += FlowTimeMatches( Match, rKey, rQuery );
      }
      EXPECT_EQ( Walk( *State, 0x1023, Match, rQuery ).size(), Passing );
      VFlowCursor It, End;
      State->ItemsBegin( It, 0x1023, Match, rQuery );
      State->ItemsEnd( End, 0x1023, Match, rQuery );
      EXPECT_EQ( It == End, Passing == 0 );
      for ( ; Match != EFlowTimeMatch::Overlap && It != End; ++It )
      {
        EXPECT_TRUE( FlowTimeMatches( Match, It->Key, rQuery ) );
      }
    }
    EXPECT_TRUE( Walk( *State, 0x1024, Match, Now ).empty() );
    VFlowItemRef Found;
    State->FindItem( Found, 0x1023, Match );
    ASSERT_TRUE( Found );
    EXPECT_EQ( Found.Get(), Walk( *State, 0x1023, Match, Now ).front().pItem );
    State->FindItem( Found, 0x1024, Match );
    EXPECT_FALSE( Found );
  }
}

TEST( FlowState, AnItemOfEqualTagKeyAndNamesReplacesTheEntry )
{
  const VFlowStateRef State = NewState( Now );
  const VFlowItemRef Old = NewItem< FlowCentroidSet >( 2, "Camera 1" );
  const VFlowItemRef Other = NewItem< FlowCentroidSet >( 2, "Camera 2" );
  const VFlowItemRef Unnamed = NewItem< FlowCentroidSet >();
  const VFlowItemRef Elsewhere = NewItem< FlowCentroidSet >( 3, "Camera 1" );
  const VFlowItemRef OtherTag = NewItem< FlowCentroidLabelSet >( 2, "Camera 1" );
  for ( const VFlowItemRef& rItem : { Old, Other, Unnamed, Elsewhere, OtherTag } )
  {
    State->AddItem( rItem );
  }
  State->AddItemAt( NewItem< FlowCentroidSet >( 2, "Camera 1" ), { 1, 1, 1 } );
  ASSERT_EQ( State->ItemCount(), 6u );

  const VFlowItemRef New = NewItem< FlowCentroidSet >( 2, "Camera 1" );
  State->AddItem( New );
  EXPECT_EQ( State->ItemCount(), 6u );
  EXPECT_EQ( Old->UseCount(), 1 );
  EXPECT_EQ( New->UseCount(), 2 );
  const auto Entries = Walk( *State, 0x1003, EFlowTimeMatch::Equal, Now );
  ASSERT_EQ( Entries.size(), 4u );
  EXPECT_EQ( Entries[0].pItem, New.Get() ) << "it stands where the old one stood";
  EXPECT_EQ( Entries[1].pItem, Other.Get() );

  // Also after the state was read, which put its entries in order.
  State->AddItem( NewItem< FlowCentroidSet >() );
  EXPECT_EQ( State->ItemCount(), 6u );
  EXPECT_EQ( Unnamed->UseCount(), 1 );
  State->AddItem( New );
  EXPECT_EQ( New->UseCount(), 2 );
}

TEST( FlowState, HoldsFullLoadAndGivesEveryReferenceBack )
{
  std::vector< VFlowItemRef > Items;
  for ( int Camera = 0; Camera < 256; ++Camera )
  {
    const std::string Name = "urn:camera:" + std::to_string( Camera );
    Items.push_back( NewItem< FlowCameraHardware >( 2, Name ) );
    Items.push_back( NewItem< FlowCentroidSet >( 2, Name ) );
  }
  VFlowStateRef State = NewState( Now );
  for ( std::size_t Step = 0; Step < 2 * Items.size(); ++Step )
  {
    State->AddItem( Items[Step % Items.size()] );
  }
  EXPECT_EQ( State->ItemCount(), Items.size() );
  EXPECT_EQ( Walk( *State, 0x1003, EFlowTimeMatch::Overlap, Now ).size(), 256u );
  State.Reset();
  for ( const VFlowItemRef& rItem : Items )
  {
    ASSERT_EQ( rItem->UseCount(), 1 );
  }
  // The next state of the pool starts empty.
  State = NewState( { 5, 6, 7 } );
  EXPECT_EQ( State->ItemCount(), 0u );
  EXPECT_TRUE( Walk( *State, 0x1003, EFlowTimeMatch::AtOrAfter, {} ).empty() );
  State->AddItem( Items[0] );
  EXPECT_EQ( State->ItemCount(), 1u );
}

TEST( FlowState, CopiesTagsAndMergesWithTheirKeys )
{
  const VFlowStateRef Source = NewState( Now );
  Source->AddItemAt( NewItem< FlowSubject >( 3, "Ada" ), { -100, 5000, 1 } );
  Source->AddItem( NewItem< FlowSubject >( 3, "Ben" ) );
  Source->AddItem( NewItem< FlowWorldAxis >() );
  Source->AddItem( NewItem< FlowReconstructionSet >() );

  const VFlowStateRef Copy = NewState( { 2000, 10, 1 } );
  const std::uint32_t Tags[] = { 0x1012, 0x1029, 0x1058 };
  Copy->CopyItems( *Source, Tags );
  EXPECT_EQ( Copy->ItemCount(), 3u );
  const auto Subjects = Walk( *Copy, 0x1012, EFlowTimeMatch::Overlap, Copy->GetKey() );
  ASSERT_EQ( Subjects.size(), 1u );
  EXPECT_EQ( NameOf( *Subjects[0].pItem, 3 ), "Ada" );
  EXPECT_EQ( Subjects[0].Key.Span, 5000 );

  Copy->Merge( *Source );
  EXPECT_EQ( Copy->ItemCount(), 4u );
  Copy->Merge( *Copy );
  Copy->CopyItems( *Copy, Tags );
  EXPECT_EQ( Copy->ItemCount(), 4u );
  EXPECT_EQ( Source->ItemCount(), 4u );
  VFlowStateRef Next;
  EXPECT_TRUE( Copy->GetFactory()->CreateState( Next, Now, { 1, 2, 3 }, { 4, 5, 6, 7, 8 } ).IsOk() );
  EXPECT_EQ( Next->GetInfoA().RateDenominator, 3 );
  EXPECT_EQ( Next->GetInfoB().Standard, 8 );
}

TEST( FlowState, TellsWhetherATagHasTheItemsOfAnotherState )
{
  using VItems = std::vector< VFlowItemRef >;
  const auto Id = []( std::int64_t i_Frame, const VItems& i_rItems, std::int64_t i_KeyOfLast )
  {
    const VFlowStateRef State = NewState( { i_Frame, 10, 1 } );
    State->AddItem( NewItem< FlowReconstructionSet >() ); // of another tag, and new each time
    for ( const VFlowItemRef& rItem : i_rItems )
    {
      State->AddItemAt( rItem, { &rItem == &i_rItems.back() ? i_KeyOfLast : i_Frame, 10, 1 } );
    }
    return State->ItemsId( FlowTag< FlowSubject > );
  };
  VFlowItemRef Ada = NewItem< FlowSubject >( 3, "Ada" );
  const VFlowItemRef Ben = NewItem< FlowSubject >( 3, "Ben" ), Other = NewItem< FlowSubject >( 3, "Ada" );
  const VFlowItemsId Both = Id( 1, { Ada, Ben }, 1 );
  EXPECT_TRUE( Both.IsKnown() );
  EXPECT_EQ( Id( 2, { Ada, Ben }, 2 ), Both ) << "each under the key of its state";
  EXPECT_FALSE( Id( 1, { Ada, Ben }, 2 ).IsKnown() ) << "under another key";
  for ( const VItems& rItems : { VItems{ Ben, Ada }, VItems{ Ada }, VItems{ Other, Ben }, VItems{} } )
  {
    EXPECT_TRUE( Id( 1, rItems, 1 ).IsKnown() );
    EXPECT_NE( Id( 1, rItems, 1 ), Both );
  }
  EXPECT_EQ( Id( 1, {}, 1 ), Id( 2, {}, 2 ) );
  // The memory of an item that went away is that of the next one.
  const VFlowItemsId Alone = Id( 1, { Ada }, 1 );
  const IFlowItem* const pPlace = Ada.Get();
  Ada.Reset();
  Ada = NewItem< FlowSubject >( 3, "Ada" );
  ASSERT_EQ( Ada.Get(), pPlace );
  EXPECT_NE( Id( 1, { Ada }, 1 ), Alone );
}

TEST( FlowState, AFrozenStateAndANullItemAreAssertionsAndChangeNothing )
{
  const VFlowStateRef State = NewState( Now );
  State->AddItem( NewItem< FlowWorldAxis >() );
  ASSERT_TRUE( MakeCache( 2 )->Add( State ).IsOk() );
  const VFlowStateRef Other = NewState( Now );
  Other->AddItem( NewItem< FlowSubject >( 3, "Ada" ) );

  const TestSupport::VAssertRecorder Recorder;
  State->AddItem( NewItem< FlowSubject >( 3, "Ben" ) );
  State->Merge( *Other );
  State->CopyItems( *Other, std::vector< std::uint32_t >{ 0x1012 } );
  EXPECT_EQ( Recorder.Expressions(), ( std::vector< std::string >( 3, "!m_bFrozen" ) ) );
  Other->AddItem( nullptr );
  EXPECT_EQ( Recorder.Expressions().size(), 4u );
  EXPECT_EQ( State->ItemCount(), 1u );
  EXPECT_EQ( Other->ItemCount(), 1u );
}
