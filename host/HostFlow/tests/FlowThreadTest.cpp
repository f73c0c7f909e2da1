#include "FlowTestItems.h"

#include <TestSupport/Calls.h>

#include <atomic>
#include <thread>

using namespace ZEK;
using namespace CoreMoxelTypes;
using namespace HostFlow;

namespace
{

constexpr int Cameras = 24;
constexpr int Frames = 1500;

/// A frame whose every centroid holds the frame's number, so that a reader can tell a torn or reused one.
VFlowStateRef MakeFrame( std::int64_t i_Frame, const VFlowStoreRef& i_rStore, const VFlowItemRef& i_rSlow )
{
  const VFlowStateRef State = NewState( { i_Frame, 1, 1 } );
  State->AddItemAt( i_rSlow, { 0, Frames * 2, 1 } );
  for ( int Camera = 0; Camera < Cameras; ++Camera )
  {
    VFlowItemRef Item;
    IResult Status;
    i_rStore->CreateItem( Status, FlowValueType< FlowCentroidSet >::Descriptor, Item );
    Item->MutableValue().SetName( 2, "Camera " + std::to_string( Camera ) );
    FlowMutablePayload< VCentroidSet >( Item.Get() )
        ->Centroids.assign( static_cast< std::size_t >( 1 + Camera % 7 ),
                            VCentroid{ static_cast< float >( i_Frame ) } );
    State->AddItem( Item );
  }
  return State;
}

bool IsWhole( const IFlowState& i_rState )
{
  const auto Entries = Walk( i_rState, 0x1003, EFlowTimeMatch::Overlap, i_rState.GetKey() );
  bool bWhole = Entries.size() == Cameras;
  for ( const VFlowEntry& rEntry : Entries )
  {
    const auto* pSet = FlowPayload< VCentroidSet >( rEntry.pItem );
    std::string_view Name;
    bWhole = bWhole && pSet && !pSet->Centroids.empty() && rEntry.pItem->Value().GetName( 2, Name ) &&
             Name.starts_with( "Camera " );
    for ( const VCentroid& rCentroid : pSet->Centroids )
    {
      bWhole = bWhole && rCentroid.x == static_cast< float >( i_rState.GetKey().Frame );
    }
  }
  VFlowItemRef Slow;
  i_rState.FindItem( Slow, 0x1031, EFlowTimeMatch::Overlap );
  return bWhole && Slow;
}

} // namespace

TEST( FlowThreads, ReadersFetchAndWalkWhileOneWrites )
{
  const auto pCache = MakeCache( 8 );
  std::atomic< bool > bDone{ false };
  std::atomic< int > Torn{ 0 }, Backward{ 0 };
  const TestSupport::VCalls Notified( pCache->StatesChanged() );
  std::vector< std::thread > Readers;
  for ( int Reader = 0; Reader < 3; ++Reader )
  {
    Readers.emplace_back(
        [&, Reader]
        {
          std::vector< VFlowStateRef > Many;
          VFlowStateRef State; // kept across fetches, so the reader is often the last to hold it
          std::int64_t Last = -1;
          while ( !bDone )
          {
            pCache->Fetch( State, 31, Reader == 2 ? 0 : 2, 0 );
            if ( State )
            {
              Torn += !IsWhole( *State );
              Backward += State->GetKey().Frame < Last;
              Last = State->GetKey().Frame;
            }
            pCache->FetchMany( { { Last, 1, 1 }, { Last + 3, 1, 1 } }, Many, 0 );
            for ( const VFlowStateRef& rState : Many )
            {
              Torn += !IsWhole( *rState );
            }
          }
        } );
  }
  {
    const VFlowStoreRef Store = MakeItemStore();
    const VFlowItemRef Slow = NewItem< FlowVolumeProperties >();
    for ( std::int64_t Frame = 0; Frame < Frames; ++Frame )
    {
      AddState( *pCache, MakeFrame( Frame, Store, Slow ) );
      if ( Frame % 500 == 499 )
      {
        TrimPools();
      }
    }
  }
  bDone = true;
  for ( std::thread& rReader : Readers )
  {
    rReader.join();
  }
  EXPECT_EQ( Torn, 0 );
  EXPECT_EQ( Backward, 0 );
  EXPECT_EQ( Notified.Count(), Frames );
  VFlowStateRef Newest;
  pCache->Fetch( Newest, 31, 2, 0 );
  EXPECT_EQ( Newest->GetKey().Frame, Frames - 1 );
  EXPECT_TRUE( IsWhole( *Newest ) );
}

TEST( FlowThreads, WritersOfTwoCachesShareThePools )
{
  std::atomic< int > Torn{ 0 };
  const auto WriteFrames = [&]
  {
    const auto pCache = MakeCache( 5 );
    const VFlowStoreRef Store = MakeItemStore();
    const VFlowItemRef Slow = NewItem< FlowVolumeProperties >();
    VFlowStateRef State;
    for ( std::int64_t Frame = 0; Frame < Frames / 2; ++Frame )
    {
      AddState( *pCache, MakeFrame( Frame, Store, Slow ) );
      pCache->Fetch( State, 31, 0, 0 );
      Torn += !IsWhole( *State );
      if ( Frame % 100 == 0 )
      {
        pCache->Clear();
      }
    }
  };
  std::thread Other( WriteFrames );
  WriteFrames();
  Other.join();
  EXPECT_EQ( Torn, 0 );
}

TEST( FlowThreads, TwoMayBeTheFirstToReadAStateThatNobodyFroze )
{
  for ( std::int64_t Round = 0; Round < 200; ++Round )
  {
    const VFlowStateRef State = MakeFrame( Round, MakeItemStore(), NewItem< FlowVolumeProperties >() );
    std::atomic< int > Whole{ 0 };
    std::thread Other(
        [&]
        {
          Whole += IsWhole( *State );
        } );
    Whole += IsWhole( *State );
    Other.join();
    ASSERT_EQ( Whole, 2 );
  }
}
