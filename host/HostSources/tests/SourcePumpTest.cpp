#include <HostSources/VSimulatedCapture.h>
#include <HostSources/VSourcePump.h>

#include <HostFlow/VFlowFramework.h>

#include <TestSupport/Calls.h>
#include <TestSupport/LogGuard.h>

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <set>
#include <thread>

using namespace ZEK;
using namespace HostSources;

namespace
{

/// Empty frames, some of which fail, as slow as asked; can be held in the middle of a frame.
class VScript final : public IFrameSource
{
public:
  std::string Name() const override { return "Script"; }
  double RateHz() const override { return 1000; }
  std::int64_t FrameCount() const override { return Count; }
  std::int64_t FrameNumber( std::int64_t i_Index ) const override { return i_Index + 1; }
  EUpAxis UpAxis() const override { return EUpAxis::Z; }
  std::string UpAxisReason() const override { return "z is up."; }
  void SetUpAxis( EUpAxis ) override {}
  IResult MakeState( std::int64_t i_Index, const VStateMaker& i_rMaker, VFlowStateRef& o_rState ) override
  {
    std::this_thread::sleep_for( Slowness );
    {
      std::unique_lock Lock( Guard );
      ++Begun;
      Changed.notify_all();
      Changed.wait( Lock,
                    [this]
                    {
                      return !bHeld;
                    } );
    }
    Made.push_back( i_Index );
    if ( i_Index == Throws )
    {
      throw std::bad_alloc();
    }
    if ( i_Index >= Count && Count >= 0 )
    {
      o_rState.Reset();
      return IResult::InvalidIndex;
    }
    return i_rMaker.Factory->CreateState( o_rState, { i_Index * TicksPerFrame(), TicksPerFrame(), i_rMaker.Clock }, {},
                                          {} );
  }
  void Hold( bool i_bOn )
  {
    const std::lock_guard Lock( Guard );
    bHeld = i_bOn;
    Changed.notify_all();
  }
  void WaitBegun( int i_Count )
  {
    std::unique_lock Lock( Guard );
    Changed.wait( Lock,
                  [&]
                  {
                    return Begun >= i_Count;
                  } );
  }

  std::int64_t Count = -1, Throws = -1;
  std::chrono::milliseconds Slowness{ 0 };
  std::vector< std::int64_t > Made; ///< read after Stop

private:
  std::mutex Guard;
  std::condition_variable Changed;
  bool bHeld = false;
  int Begun = 0;
};

class SourcePump : public testing::Test
{
protected:
  std::int64_t Frame( std::uint32_t i_Mode ) const
  {
    VFlowStateRef State;
    pCache->Fetch( State, 31, i_Mode, 0 );
    return State ? State->GetKey().Frame / pSource->TicksPerFrame() : -1;
  }
  std::int64_t Newest() const { return Frame( 2 ); }
  std::int64_t Oldest() const { return Frame( 0 ); }

  std::shared_ptr< VScript > pSource = std::make_shared< VScript >();
  std::shared_ptr< HostFlow::IHostStateCache > pCache = HostFlow::MakeCache( 64 );
  VSourcePump Pump{ pSource, pCache, { HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 2 } };
};

} // namespace

TEST_F( SourcePump, FollowsAndEmptiesTheCacheOnAStepBackAndOnASeek )
{
  const TestSupport::VCalls Emptied( pCache->Notifier6() );
  Pump.Show( 5 ); // before it starts
  Pump.StartFollow();
  Pump.WaitShown();
  struct VStep
  {
    std::int64_t Index;
    bool bSeek;
    std::int64_t Oldest;
    int Emptied;
  };
  for ( const VStep& rStep :
        { VStep{ 6, false, 5, 0 }, { 7, false, 5, 0 }, { 7, false, 5, 0 }, { 6, false, 6, 1 }, { 50, true, 50, 2 } } )
  {
    Pump.Show( rStep.Index, rStep.bSeek );
    Pump.WaitShown();
    EXPECT_EQ( Newest(), rStep.Index );
    EXPECT_EQ( Oldest(), rStep.Oldest );
    EXPECT_EQ( Emptied.Count(), rStep.Emptied );
  }
  EXPECT_EQ( Pump.ShownIndex(), 50 );
  EXPECT_EQ( Pump.AddedCount(), 6u );
}

TEST_F( SourcePump, WhatLiesAroundComesWhateverIsShownAndTheFrameShownStaysTheNewest )
{
  constexpr std::int64_t Frames = 5;
  pSource->Count = 40;
  Pump.KeepAround( Frames,
                   [this]( std::vector< VFlowStateRef >& io_rStates, bool i_bTell )
                   {
                     pCache->SetAround( io_rStates, i_bTell );
                   } );
  std::atomic< std::int64_t > Asked{ -1 };
  std::atomic< int > Wrong{ 0 }, Told{ 0 };
  const VConnection Watch = pCache->StatesChanged().Connect(
      [&]
      {
        ++Told;
        Wrong += Newest() == Asked ? 0 : 1;
      },
      nullptr );
  const auto Around = [&]( std::int64_t i_Index )
  {
    const std::int64_t Ticks = pSource->TicksPerFrame();
    std::vector< VFlowStateRef > States;
    pCache->FetchMany( { { ( i_Index - Frames ) * Ticks, 1, 2 }, { ( i_Index + Frames ) * Ticks, Ticks, 2 } }, States,
                       0 );
    std::set< std::int64_t > Found;
    for ( const VFlowStateRef& rState : States )
    {
      Found.insert( rState->GetKey().Frame / Ticks );
    }
    return Found;
  };
  Pump.StartFollow();
  // Sought, played, stayed, stepped back, played on, jumped ahead to the end, looped.
  for ( const auto& [Index, bSeek] : { std::pair{ 10, true },
                                       { 11, false },
                                       { 13, false },
                                       { 13, false },
                                       { 12, false },
                                       { 13, false },
                                       { 38, false },
                                       { 0, false },
                                       { 20, true } } )
  {
    SCOPED_TRACE( Index );
    Asked = Index;
    const int Before = Told;
    Pump.Show( Index, bSeek );
    Pump.WaitShown();
    std::set< std::int64_t > Expected;
    for ( std::int64_t Frame = std::max< std::int64_t >( Index - Frames, 0 );
          Frame <= std::min< std::int64_t >( Index + Frames, 39 ); ++Frame )
    {
      Expected.insert( Frame );
    }
    // One when the frame is shown, one when what lies around is complete.
    for ( int Wait = 0; Wait < 5000 && Told < Before + 2; ++Wait )
    {
      std::this_thread::sleep_for( std::chrono::milliseconds( 1 ) );
    }
    std::set< std::int64_t > Found = Around( Index );
    EXPECT_TRUE( std::includes( Found.begin(), Found.end(), Expected.begin(), Expected.end() ) ) << Found.size();
    EXPECT_EQ( Newest(), Index );
    EXPECT_EQ( Pump.ShownIndex(), Index );
  }
  EXPECT_EQ( Wrong, 0 );
  // A frame that is wanted does not wait for those around the last one, and what the source changes is made anew.
  Pump.WithSource( []( IFrameSource& ) {} );
  pSource->Hold( true );
  Asked = 21;
  Pump.Show( 21, true );
  pSource->Hold( false );
  Pump.WaitShown();
  EXPECT_EQ( Newest(), 21 );
  Pump.Stop();
  EXPECT_EQ( std::count( pSource->Made.begin(), pSource->Made.end(), 12 ), 1 ) << "known ones are not made again";
  EXPECT_EQ( std::count( pSource->Made.begin(), pSource->Made.end(), 21 ), 2 );
}

TEST_F( SourcePump, ShowsOnlyTheNewestOfWhatWaitsButForgetsNoSeek )
{
  Pump.StartFollow();
  Pump.Show( 1 );
  Pump.WaitShown();
  pSource->Hold( true );
  Pump.Show( 2 );
  pSource->WaitBegun( 2 );
  Pump.Show( 3, true );
  for ( std::int64_t Index = 4; Index < 100; ++Index )
  {
    Pump.Show( Index );
  }
  pSource->Hold( false );
  Pump.WaitShown();
  EXPECT_EQ( Newest(), 99 );
  EXPECT_EQ( Oldest(), 99 );
  Pump.Stop();
  EXPECT_EQ( pSource->Made, ( std::vector< std::int64_t >{ 1, 2, 99 } ) );
}

TEST_F( SourcePump, AFrameThatCannotBeMadeIsSaidOnceAndTheCacheKeepsWhatItHas )
{
  pSource->Count = 10;
  Pump.StartFollow();
  for ( const std::int64_t Index : { 9, 10, 11 } )
  {
    Pump.Show( Index, Index == 11 );
    Pump.WaitShown();
  }
  EXPECT_EQ( Pump.LastResult(), IResult( IResult::InvalidIndex ) );
  EXPECT_EQ( Newest(), 9 );
  const auto Lines = TestSupport::LogTexts( "Source", ELogWarning );
  ASSERT_EQ( Lines.size(), 1u );
  EXPECT_EQ( Lines[0].find( "Frame 10 of \"Script\" could not be shown: InvalidIndex" ), 0u ) << Lines[0];
  pSource->Throws = 8;
  for ( const auto& [Index, Result] : { std::pair{ 8, IResult::AllocationFailure }, { 9, IResult::Ok } } )
  {
    Pump.Show( Index );
    Pump.WaitShown();
    EXPECT_EQ( Pump.LastResult(), IResult( Result ) );
    EXPECT_EQ( Newest(), 9 );
  }
}

TEST_F( SourcePump, LiveLeavesFramesOutWhenLateAndStandsAtTheEnd )
{
  pSource->Count = 200;
  pSource->Slowness = std::chrono::milliseconds( 15 ); // fifteen frames
  Pump.StartLive( 20 );
  while ( Pump.ShownIndex() < 199 )
  {
    std::this_thread::yield();
  }
  EXPECT_TRUE( Pump.IsRunning() );
  EXPECT_EQ( Newest(), 199 );
  Pump.WaitShown();
  Pump.Stop();
  EXPECT_FALSE( Pump.IsRunning() );
  EXPECT_EQ( pSource->Made.front(), 20 );
  EXPECT_TRUE( std::is_sorted( pSource->Made.begin(), pSource->Made.end() ) );
  EXPECT_GT( Pump.SkippedCount(), 0u );
  EXPECT_EQ( Pump.AddedCount() + Pump.SkippedCount(), 180u );
}

TEST_F( SourcePump, StopsInTheMiddleOfAFrameAndStartsAgain )
{
  pSource->Hold( true );
  Pump.StartFollow();
  Pump.Show( 1 );
  pSource->WaitBegun( 1 );
  Pump.Show( 2 );
  std::thread Release(
      [this]
      {
        pSource->Hold( false );
      } );
  Pump.Stop();
  Release.join();
  const std::uint64_t Added = Pump.AddedCount();
  Pump.Show( 3 );
  Pump.WaitShown();
  EXPECT_EQ( Pump.AddedCount(), Added );
  Pump.StartFollow();
  Pump.WaitShown();
  EXPECT_EQ( Newest(), 3 );
  Pump.Stop();
  Pump.Stop();
}

TEST( SourcePumpThreads, AsksReadersAndChangesOfTheSourceGoTogether )
{
  const auto pCapture = std::make_shared< VSimulatedCapture >( VSimulatedCaptureOptions{ .Cameras = 4 } );
  const auto pCache = HostFlow::MakeCache( 16 );
  VSourcePump Pump( pCapture, pCache, { HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 2 } );
  Pump.StartFollow();
  std::atomic< bool > bDone{ false };
  std::thread Reader(
      [&]
      {
        VFlowStateRef State;
        VFlowItemRef Points;
        while ( !bDone )
        {
          pCache->Fetch( State, 31, 2, 0 );
          if ( State )
          {
            State->FindItem( Points, 0x100d, EFlowTimeMatch::Overlap );
            EXPECT_TRUE( Points );
          }
        }
      } );
  std::thread Asker(
      [&]
      {
        for ( std::int64_t Index = 0; Index < 300; ++Index )
        {
          Pump.Show( ( Index * 37 ) % 100 );
        }
      } );
  for ( int Round = 0; Round < 50; ++Round )
  {
    Pump.WithSource(
        [&]( IFrameSource& i_rSource )
        {
          i_rSource.SetUpAxis( Round % 2 ? EUpAxis::Y : EUpAxis::Z );
        } );
  }
  Asker.join();
  Pump.WaitShown();
  Pump.Stop();
  bDone = true;
  Reader.join();
  EXPECT_EQ( Pump.ShownIndex(), 299 * 37 % 100 );
}
