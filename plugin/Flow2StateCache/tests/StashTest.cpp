#include <Flow2StateCache/VFlowStateStash.h>

#include <FlowTestItems.h> // of the framework

#include <TestSupport/Allocations.h>
#include <TestSupport/LogGuard.h>

#include <algorithm>
#include <map>
#include <random>

using namespace CoreMoxelTypes;
using Flow2StateCache::VFlowStateStash;

namespace
{
using VContents = std::map< std::string, const ZEK::IFlowItem* >;

VContents ContentsOf( const ZEK::IFlowState& i_rState )
{
  VContents Contents;
  for ( const ZEK::VFlowEntry& rEntry :
        HostFlow::Walk( i_rState, ZEK::FlowTag< FlowDevice >, ZEK::EFlowTimeMatch::Overlap, i_rState.GetKey() ) )
  {
    Contents[HostFlow::NameOf( *rEntry.pItem, ZEK::EFlowNameDevice )] = rEntry.pItem;
  }
  return Contents;
}

/// A stash as a list that is searched from end to end.
struct VModel
{
  struct VEntry
  {
    ZEK::VFlowTimeKey Key;
    std::uint32_t Mask;
    const ZEK::IFlowState* pState; ///< null: a clone
    VContents Contents;
  };
  std::size_t Capacity;
  std::vector< VEntry > Entries; ///< the one used last at the end

  VEntry* Use( const ZEK::VFlowTimeKey& i_rKey )
  {
    for ( std::size_t Index = 0; Index < Entries.size(); ++Index )
    {
      if ( Entries[Index].Key.Clock == i_rKey.Clock && Entries[Index].Key.Frame == i_rKey.Frame )
      {
        std::rotate( Entries.begin() + static_cast< std::ptrdiff_t >( Index ),
                     Entries.begin() + static_cast< std::ptrdiff_t >( Index ) + 1, Entries.end() );
        return &Entries.back();
      }
    }
    return nullptr;
  }
  void Add( const ZEK::IFlowState& i_rState, std::uint32_t i_Mask )
  {
    if ( VEntry* pEntry = Use( i_rState.GetKey() ) )
    {
      const bool bMerge = ( pEntry->Mask | i_Mask ) != i_Mask;
      VContents Contents = ContentsOf( i_rState );
      if ( bMerge )
      {
        Contents.merge( pEntry->Contents ); // what is there stays
      }
      *pEntry = { pEntry->Key, pEntry->Mask | i_Mask, bMerge ? nullptr : &i_rState, std::move( Contents ) };
      return;
    }
    if ( Entries.size() == Capacity )
    {
      Entries.erase( Entries.begin() );
    }
    Entries.push_back( { i_rState.GetKey(), i_Mask, &i_rState, ContentsOf( i_rState ) } );
  }
  std::ptrdiff_t Holds( const ZEK::IFlowState* i_pState ) const
  {
    return std::count_if( Entries.begin(), Entries.end(),
                          [&]( const VEntry& i_rEntry )
                          {
                            return i_rEntry.pState == i_pState;
                          } );
  }
};

class StashAgainstModel : public testing::TestWithParam< std::size_t >
{
};
} // namespace

TEST_P( StashAgainstModel, AnswersAsAListWould )
{
  for ( std::uint32_t Seed = 0; Seed < 12; ++Seed )
  {
    std::mt19937 Random( Seed );
    const auto Below = [&]( std::uint32_t i_Limit )
    {
      return static_cast< std::uint32_t >( Random() % i_Limit );
    };
    VFlowStateStash Stash( GetParam() );
    VModel Model{ std::max< std::size_t >( GetParam(), 1 ), {} };
    std::vector< ZEK::VFlowStateRef > Made;
    std::vector< VContents > MadeContents;
    for ( int Step = 0; Step < 400; ++Step )
    {
      // Frames of two clocks that lie within each other, so that both parts of a key matter, and its span does not.
      const ZEK::VFlowTimeKey Key{ static_cast< std::int64_t >( Below( 9 ) ) - 2, Below( 3 ), 1 + Below( 2 ) };
      const std::uint32_t Choice = Below( 100 );
      if ( Choice < 40 )
      {
        const ZEK::VFlowStateRef Found = Stash.Find( Key );
        const VModel::VEntry* pExpected = Model.Use( Key );
        ASSERT_EQ( Found.Get() != nullptr, pExpected != nullptr ) << "seed " << Seed << ", step " << Step;
        EXPECT_TRUE( !Found || ContentsOf( *Found ) == pExpected->Contents ) << "seed " << Seed << ", step " << Step;
        EXPECT_TRUE( !Found || !pExpected->pState || pExpected->pState == Found.Get() ) << "seed " << Seed;
      }
      else if ( Choice < 99 )
      {
        const ZEK::VFlowStateRef State = HostFlow::NewState( Key );
        for ( std::uint32_t Item = Below( 4 ); Item > 0; --Item )
        {
          State->AddItem( HostFlow::NewItem< FlowDevice >( ZEK::EFlowNameDevice, std::to_string( Below( 5 ) ) ) );
        }
        const std::uint32_t Mask = Below( 3 ) == 0 ? 31 : 1 + Below( 3 );
        Made.push_back( State );
        MadeContents.push_back( ContentsOf( *State ) );
        Model.Add( *State, Mask );
        Stash.Add( State, Mask );
      }
      else
      {
        Model.Entries.clear();
        Stash.Clear();
      }
      ASSERT_EQ( Stash.Size(), Model.Entries.size() ) << "seed " << Seed << ", step " << Step;
      for ( const VModel::VEntry& rEntry : Model.Entries )
      {
        ASSERT_EQ( Stash.MaskOf( rEntry.Key ), rEntry.Mask ) << "seed " << Seed << ", step " << Step;
      }
    }
    for ( std::size_t Index = 0; Index < Made.size(); ++Index )
    {
      EXPECT_EQ( Made[Index]->UseCount(), 1 + Model.Holds( Made[Index].Get() ) ) << "seed " << Seed;
      EXPECT_EQ( ContentsOf( *Made[Index] ), MadeContents[Index] ) << "a merge changed its input, seed " << Seed;
    }
  }
}

INSTANTIATE_TEST_SUITE_P( Capacities, StashAgainstModel, testing::Values( 0, 1, 4, 10 ) );

TEST( Stash, MergesIntoACloneThatKeepsTheInfosAndLetsGoOfItsStates )
{
  VFlowStateStash Stash( 2 );
  ZEK::VFlowStateRef State;
  ASSERT_TRUE(
      HostFlow::MakeStateFactory()->CreateState( State, { 5, 3, 1 }, { 7, 250, 1 }, { 1, 2, 3, 4, 5 } ).IsOk() );
  const ZEK::VFlowStateRef Other = HostFlow::NewState( { 5, 3, 1 } );
  {
    Stash.Add( State, 3 );
    Stash.Add( Other, 1 );
    const ZEK::VFlowStateRef Found = Stash.Find( { 5, 1, 1 } );
    ASSERT_TRUE( Found && !( Found == State ) && !( Found == Other ) );
    EXPECT_EQ( Found->GetKey().Span, 3 );
    EXPECT_EQ( Found->GetInfoA().WallClockNs, 7 );
    EXPECT_EQ( Found->GetInfoB().Seconds, 3 );
    EXPECT_EQ( Stash.MaskOf( { 5, 1, 1 } ), 3u );
  }
  const TestSupport::VAssertRecorder Recorder;
  Stash.Add( nullptr, 31 );
  EXPECT_EQ( Recorder.Expressions().size(), 1u );
  EXPECT_EQ( Stash.Size(), 1u );
  EXPECT_EQ( State->UseCount() + Other->UseCount(), 2 );
  {
    VFlowStateStash Brief( 1 );
    Brief.Add( State, 31 );
    EXPECT_EQ( State->UseCount(), 2 );
  }
  EXPECT_EQ( State->UseCount(), 1 );
}

TEST( Stash, AllocatesNothingOnceItIsMade )
{
  VFlowStateStash Stash( 10 );
  std::vector< ZEK::VFlowStateRef > States;
  for ( std::int64_t Frame = 0; Frame < 25; ++Frame )
  {
    States.push_back( HostFlow::NewState( { Frame * 7 % 25, 1, 1 } ) );
  }
  const std::uint64_t Before = TestSupport::AllocationCount();
  for ( int Round = 0; Round < 20; ++Round )
  {
    for ( const ZEK::VFlowStateRef& rState : States )
    {
      Stash.Add( rState, 31 );
      Stash.Find( States[3]->GetKey() );
    }
    if ( Round % 7 == 0 )
    {
      Stash.Clear();
    }
  }
  EXPECT_EQ( TestSupport::AllocationCount(), Before );
  EXPECT_EQ( Stash.Size(), 10u );
}
