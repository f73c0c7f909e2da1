#include "FlowTestItems.h"

#include "VNameBook.h"

#include <TestSupport/LogGuard.h>

#include <set>

using namespace ZEK;
using namespace CoreMoxelTypes;
using namespace HostFlow;

TEST( ItemStore, MakesEveryRegisteredKindWithItsCoreTypeAndRefusesOthers )
{
  const VFlowStoreRef Store = MakeItemStore();
  VFlowItemRef Item;
  const auto Check = [&]< typename TFlow >( TFlow* )
  {
    IResult Status = IResult::Failed;
    Store->CreateItem( Status, FlowValueType< TFlow >::Descriptor, Item );
    ASSERT_TRUE( Status.IsOk() ) << FlowValueType< TFlow >::Descriptor.Name;
    EXPECT_EQ( Item->Id().Type, FlowTag< TFlow > );
    EXPECT_NE( Item->Id().Salt, 0u );
    EXPECT_NE( FlowPayload< typename FlowValueType< TFlow >::type >( Item.Get() ), nullptr ) << FlowTag< TFlow >;
  };
  [&]< typename... TFlow >( std::tuple< TFlow*... >* )
  {
    ( Check( static_cast< TFlow* >( nullptr ) ), ... );
  }( static_cast< VAllFlowTypes* >( nullptr ) );

  for ( const std::uint32_t Tag : { 0u, 2u, 0x1004u, 0x10001000u, 0xffffffffu } )
  {
    Item = NewItem< FlowSubject >();
    IResult Status;
    Store->CreateItem( Status, VFlowItemType{ "FlowUnknown", Tag, 1, 0, 0, "" }, Item );
    EXPECT_EQ( Status, IResult( IResult::InvalidType ) ) << Tag;
    EXPECT_FALSE( Item ) << Tag;
  }
}

TEST( ItemStore, AReusedItemIsEmptyKeepsItsRoomAndHasAnIdOfItsOwn )
{
  std::set< std::int64_t > Numbers;
  const void* pFirst = nullptr;
  const void* pRoom = nullptr;
  for ( int Round = 0; Round < 3; ++Round )
  {
    const VFlowItemRef Item = NewItem< FlowGreyscaleBlobSet >();
    auto* pSet = FlowMutablePayload< VGreyscaleBlobSet >( Item.Get() );
    ASSERT_NE( pSet, nullptr );
    EXPECT_TRUE( Numbers.insert( Item->Id().Number ).second );
    EXPECT_TRUE( pSet->Blobs.empty() && pSet->Lines.empty() && pSet->Pixels.empty() );
    EXPECT_FALSE( pSet->Complete );
    EXPECT_EQ( pSet->SensorScale.x, 1 );
    EXPECT_EQ( NameOf( *Item, 2 ), "(none)" );
    Item->MutableValue().SetName( 2, "a device with a name that needs memory of its own" );
    pSet->Complete = true;
    pSet->SensorScale = { 7, 7 };
    pSet->Blobs.resize( 10 );
    pSet->Lines.resize( 100 );
    pSet->Pixels.resize( 1000 );
    EXPECT_TRUE( Round == 0 || ( pSet == pFirst && pSet->Pixels.data() == pRoom ) );
    pFirst = pSet;
    pRoom = pSet->Pixels.data();
  }
}

TEST( ItemStore, NamesAnswerToTheirSelectorOnly )
{
  const VFlowItemRef Item = NewItem< FlowSubject >( EFlowNameObject, "Ada" );
  IFlowValue& rValue = Item->MutableValue();
  rValue.SetName( EFlowNameDevice, "urn:1" );
  const auto Names = [&]
  {
    return NameOf( *Item, 0 ) + NameOf( *Item, EFlowNameTarget ) + NameOf( *Item, EFlowNameDevice ) +
           NameOf( *Item, EFlowNameObject ) + NameOf( *Item, 4 );
  };
  EXPECT_EQ( Names(), "(none)(none)urn:1Ada(none)" );
  rValue.SetName( EFlowNameObject, "" );
  const TestSupport::VAssertRecorder Recorder;
  rValue.SetName( 0, "x" );
  rValue.SetName( 4, "x" );
  EXPECT_EQ( Recorder.Expressions().size(), 2u );
  EXPECT_EQ( Names(), "(none)(none)urn:1(none)(none)" );
}

TEST( ItemStore, EqualNamesHaveOneNumberWhichNoOtherNameHasEvenLater )
{
  const auto Number = []( const VFlowItemRef& i_rItem )
  {
    return i_rItem->NameNumber( EFlowNameDevice );
  };
  std::set< std::uint32_t > Numbers;
  {
    const VFlowItemRef Kept = NewItem< FlowDevice >( EFlowNameDevice, "kept" );
    const VFlowItemRef Gone = NewItem< FlowCentroidSet >( EFlowNameDevice, "gone" );
    const VFlowItemRef Other = NewItem< FlowCentroidSet >( EFlowNameDevice, "gone" );
    Numbers = { Number( Kept ),        Number( Gone ),       Number( Other ), Gone->NameNumber( EFlowNameObject ),
                Gone->NameNumber( 0 ), Gone->NameNumber( 4 ) };
    EXPECT_EQ( Numbers.size(), 3u );
    EXPECT_TRUE( Numbers.contains( 0 ) );
    EXPECT_EQ( Number( Gone ), Number( Other ) );
    Other->MutableValue().SetName( EFlowNameObject, "kept" );
    EXPECT_EQ( Other->NameNumber( EFlowNameObject ), Number( Kept ) ) << "whatever the selector";
    Other->MutableValue().SetName( EFlowNameObject, "" );
    EXPECT_EQ( Other->NameNumber( EFlowNameObject ), 0u );
  }
  const std::size_t Names = VNameBook::Instance().Count();
  TrimPools();
  EXPECT_LE( VNameBook::Instance().Count() + 2, Names );
  const VFlowItemRef Again = NewItem< FlowDevice >( EFlowNameDevice, "gone" );
  EXPECT_FALSE( Numbers.contains( Number( Again ) ) );
  // Names that come and go for ever do not stay.
  for ( int Round = 0; Round < 20'000; ++Round )
  {
    const std::string Name = std::to_string( Round );
    const VFlowItemRef Item = NewItem< FlowDevice >( EFlowNameDevice, Name );
    ASSERT_EQ( NameOf( *Item, EFlowNameDevice ), Name );
    ASSERT_TRUE( Numbers.insert( Number( Item ) ).second );
  }
  EXPECT_LT( VNameBook::Instance().Count(), 5'000u );
}

TEST( ItemStore, AnItemOutlivesItsHandleAndItsState )
{
  VFlowItemRef Kept;
  {
    const VFlowStateRef State = NewState( { 0, 1, 1 } );
    const VFlowItemRef Item = NewItem< FlowWorldAxis >();
    FlowMutablePayload< VWorldAxis >( Item.Get() )->Up = 2;
    State->AddItem( Item );
    EXPECT_EQ( Item->UseCount(), 2 );
    State->FindItem( Kept, 0x1029, EFlowTimeMatch::Overlap );
  }
  TrimPools();
  ASSERT_TRUE( Kept );
  EXPECT_EQ( Kept->UseCount(), 1 );
  EXPECT_EQ( FlowPayload< VWorldAxis >( Kept.Get() )->Up, 2u );
}
