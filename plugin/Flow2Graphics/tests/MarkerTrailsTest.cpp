#include "FlowTestScene.h"

#include <Flow2Graphics/VFlowRenderMarkerTrails.h>

#include <HostFlow/VFlowFramework.h>
#include <TestSupport/Allocations.h>

#include <functional>
#include <map>
#include <random>
#include <tuple>

// Trails against what the same states say when each is read by itself.

namespace
{
using namespace CoreMoxelTypes;
using MoxelGraphics::VTrailPoint;

constexpr std::int64_t Span = ZEK::FlowTicksPerSecond / 100;

/// Shows states, and keeps others as a cache does.
class VTrailScene : public FlowTest::VScene
{
public:
  void FetchAround( const ZEK::VFlowTimeRange& i_rRange, std::vector< ZEK::VFlowStateRef >& o_rStates ) override
  {
    pKept->FetchMany( i_rRange, o_rStates, 0 );
    Most = std::max( Most, o_rStates.size() );
    Asked += o_rStates.size();
  }
  /// Through what a frame does, without drawing.
  void Look( const MoxelGraphics::VSceneOptions& i_rOptions )
  {
    for ( const auto& rpType : FlowRenderTypes() )
    {
      if ( const auto pType = std::dynamic_pointer_cast< Flow2Graphics::VFlowRenderMarkerTrails >( rpType ) )
      {
        pTrails = pType;
      }
    }
    ASSERT_TRUE( pTrails );
    pTrails->Render( m_NoContext, i_rOptions, MoxelGraphics::ERenderPassTranslucent );
  }

  std::shared_ptr< HostFlow::IHostStateCache > pKept = HostFlow::MakeCache( 2000 );
  std::shared_ptr< Flow2Graphics::VFlowRenderMarkerTrails > pTrails;
  std::size_t Most = 0, Asked = 0;

private:
  CoreGraphics::VRenderContext m_NoContext;
};

class MarkerTrails : public testing::Test
{
protected:
  MarkerTrails()
  {
    Options.MarkerTrails = true;
    Options.trialLengthPast = 8;
    Options.trialLengthFuture = 5;
  }

  /// Where a marker is in a frame; every marker has gaps of its own.
  static bool Place( int i_Marker, std::int64_t i_Frame, D3& o_rPlace )
  {
    std::mt19937 Random( static_cast< unsigned >( i_Frame * 31 + i_Marker ) );
    o_rPlace = { double( i_Frame ), double( i_Marker ), double( Random() % 1000 ) };
    return Random() % 4 != 0;
  }
  /// Markers 0 to 3 of subject 7, and a track of an unlabelled point; in an order that changes.
  ZEK::VFlowStateRef State( std::int64_t i_Frame )
  {
    VReconstructionSet Set;
    VReconstructionLabelSet Labels;
    VReconstructionTrackSet Tracks;
    for ( int Step = 0; Step < Markers; ++Step )
    {
      const int Marker = static_cast< int >( ( Step + i_Frame ) % Markers );
      D3 At;
      if ( Place( Marker, i_Frame, At ) )
      {
        const auto Index = static_cast< std::uint32_t >( Set.Items.size() );
        Set.Items.push_back( { Index, At, 7, 0, 2 } );
        Marker == Markers - 1 ? Tracks.Tracks.push_back( { 99, Index } )
                              : Labels.Labels.push_back( { Index, 7, static_cast< std::uint32_t >( Marker ) } );
      }
    }
    Labels.Labels.push_back( { 5000, 7, 0 } ); // names nothing
    Tracks.Tracks.push_back( { 98, 5000 } );
    ZEK::VFlowStateRef New;
    (void)m_Factory->CreateState( New, { i_Frame * Span, Span, 1 }, {}, {} );
    New->AddItem( Maker.Item< FlowReconstructionSet >( Set ) );
    New->AddItem( Maker.Item< FlowReconstructionLabelSet >( Labels ) );
    New->AddItem( Maker.Item< FlowReconstructionTrackSet >( Tracks ) );
    return New;
  }
  void Keep( std::int64_t i_First, std::int64_t i_Last )
  {
    for ( std::int64_t Frame = i_First; Frame <= i_Last; ++Frame )
    {
      (void)pScene->pKept->Add( State( Frame ) );
    }
  }
  void Show( std::int64_t i_Frame )
  {
    pScene->Show( State( i_Frame ) );
    pScene->Look( Options );
  }
  /// Every stretch of every trail that is drawn, as (frame, marker) of its ends, with the strength at its start.
  using VStretches = std::map< std::tuple< int, int, int >, float >;
  VStretches Drawn() const
  {
    VStretches Result;
    const std::vector< VTrailPoint >& rPoints = pScene->pTrails->Points();
    for ( std::size_t Index = 0; Index + 1 < rPoints.size(); ++Index )
    {
      const VTrailPoint &rA = rPoints[Index], &rB = rPoints[Index + 1];
      if ( rA.Strength >= 0 && rB.Strength >= 0 )
      {
        EXPECT_EQ( rA.Y, rB.Y ) << "two markers have no trail in common";
        EXPECT_TRUE( Result.emplace( std::tuple( int( rA.Y ), int( rA.X ), int( rB.X ) ), rA.Strength ).second );
      }
    }
    return Result;
  }
  VStretches Expected(
      std::int64_t i_Now, std::int64_t i_First, std::int64_t i_Last,
      const std::function< bool( int ) >& i_rChosen =
          []( int )
      {
        return true;
      } ) const
  {
    VStretches Result;
    for ( int Marker = 0; Marker < Markers; ++Marker )
    {
      for ( std::int64_t Frame = i_First; Frame < i_Last; ++Frame )
      {
        D3 A, B;
        if ( i_rChosen( Marker ) && Place( Marker, Frame, A ) && Place( Marker, Frame + 1, B ) )
        {
          const double Away = double( Frame - i_Now );
          const double Length = Away < 0 ? -double( i_Now - i_First ) : double( i_Last - i_Now );
          Result[{ Marker, int( Frame ), int( Frame ) + 1 }] =
              static_cast< float >( Away == 0 ? 1 : 1 - Away / Length );
        }
      }
    }
    return Result;
  }
  static void ExpectSame( const VStretches& i_rDrawn, const VStretches& i_rExpected )
  {
    ASSERT_EQ( i_rDrawn.size(), i_rExpected.size() );
    for ( auto A = i_rDrawn.begin(), B = i_rExpected.begin(); A != i_rDrawn.end(); ++A, ++B )
    {
      EXPECT_EQ( A->first, B->first );
      EXPECT_NEAR( A->second, B->second, 1e-5 );
    }
  }

  static constexpr int Markers = 5;
  FlowTest::VMaker Maker;
  ZEK::VFlowStateFactoryRef m_Factory = HostFlow::MakeStateFactory();
  std::shared_ptr< VTrailScene > pScene = std::make_shared< VTrailScene >();
  MoxelGraphics::VSceneOptions Options;
};

TEST_F( MarkerTrails, GoToBothSidesAsFarAsIsKeptAndBreakInGaps )
{
  Keep( 100, 160 );
  for ( const std::int64_t Now : { 130, 131, 133, 130, 120 } ) // on, over one, back, far back
  {
    SCOPED_TRACE( Now );
    Show( Now );
    ExpectSame( Drawn(), Expected( Now, Now - 8, Now + 5 ) );
  }
  Show( 103 );
  const VStretches Short = Drawn();
  ASSERT_FALSE( Short.empty() );
  EXPECT_GE( std::get< 1 >( Short.begin()->first ), 100 ) << "what nobody kept has no trail";
  // In seconds, longer than what is fetched at once: some frames later all of it is there.
  Options.TrailUnit = MoxelGraphics::ETrailSeconds;
  Options.trialLengthPast = 1;
  Options.trialLengthFuture = 0;
  Keep( 161, 400 );
  pScene->Most = 0;
  Show( 350 );
  EXPECT_LT( Drawn().size(), Expected( 350, 250, 350 ).size() );
  for ( int Frame = 0; Frame < 4; ++Frame )
  {
    pScene->Look( Options );
  }
  ExpectSame( Drawn(), Expected( 350, 250, 350 ) );
  EXPECT_LE( pScene->Most, 33u );
  const std::size_t Asked = pScene->Asked;
  pScene->Look( Options );
  EXPECT_EQ( pScene->Asked, Asked ) << "what is known is not asked for again";
  // A frame that is kept waits for none of that.
  pScene->SetSettled( true );
  Show( 399 );
  ExpectSame( Drawn(), Expected( 399, 299, 399 ) );
}

TEST_F( MarkerTrails, WhatComesAroundAFrameThatIsShownAlreadyIsTaken )
{
  const ZEK::VFlowStateRef Now = State( 130 );
  (void)pScene->pKept->Add( Now );
  const auto Look = [&]
  {
    pScene->Show( Now );
    pScene->Look( Options );
    return Drawn();
  };
  EXPECT_TRUE( Look().empty() );
  std::vector< ZEK::VFlowStateRef > Around;
  for ( std::int64_t Frame = 122; Frame <= 135; ++Frame )
  {
    Around.push_back( State( Frame ) );
  }
  pScene->pKept->SetAround( Around, true );
  ExpectSame( Look(), Expected( 130, 122, 135 ) );
  for ( const std::uint32_t Mode : { 0u, 2u } )
  {
    ZEK::VFlowStateRef Kept;
    pScene->pKept->Fetch( Kept, 31, Mode, 0 );
    EXPECT_EQ( Kept.Get(), Now.Get() ) << "the one shown is still the newest, and the oldest";
  }
  EXPECT_FALSE( pScene->pKept->Contains( { 131 * Span, Span, 1 }, 0 ) );
  pScene->pKept->Clear();
  pScene->pKept->FetchMany( { { 0, 1, 1 }, { 200 * Span, 1, 1 } }, Around, 0 );
  EXPECT_TRUE( Around.empty() );
}

TEST_F( MarkerTrails, LiveTheyGrowFromWhatComesAndAllocateNothing )
{
  Options.trialLengthFuture = 5;
  std::vector< ZEK::VFlowStateRef > States;
  for ( std::int64_t Frame = 0; Frame < 200; ++Frame )
  {
    States.push_back( State( Frame ) );
    ZEK::VFlowItemRef Item;
    States.back()->FindItem( Item, 0, ZEK::EFlowTimeMatch::Overlap ); // a state orders its items when it is first read
  }
  for ( std::int64_t Frame = 0; Frame < 120; ++Frame )
  {
    pScene->Show( States[static_cast< std::size_t >( Frame )] );
    pScene->Look( Options );
  }
  VStretches Past = Expected( 119, 111, 124 );
  std::erase_if( Past,
                 []( const auto& i_rStretch )
                 {
                   return std::get< 2 >( i_rStretch.first ) > 119;
                 } );
  ExpectSame( Drawn(), Past );
  const std::uint64_t Before = TestSupport::AllocationCount();
  for ( std::int64_t Frame = 120; Frame < 160; ++Frame )
  {
    pScene->pTrails->Update( *States[static_cast< std::size_t >( Frame )] );
    pScene->Look( Options );
  }
  EXPECT_EQ( TestSupport::AllocationCount(), Before );
  // Another time line, and a jump, begin anew.
  Show( 190 + 60 );
  EXPECT_TRUE( Drawn().empty() );
  Options.MarkerTrails = false;
  Keep( 230, 260 );
  Show( 251 );
  EXPECT_TRUE( Drawn().empty() && pScene->Asked == 0 ) << "off, nobody is asked";
}

TEST_F( MarkerTrails, OfTheSelectedOnesWhenSomeAre )
{
  Keep( 0, 40 );
  Show( 20 );
  const auto Chosen = [this]( const ZEK::VSelection& i_rSelection )
  {
    pScene->Select( i_rSelection );
    Show( 20 );
    return Drawn();
  };
  const auto Of = [this]( int i_Marker )
  {
    return Expected( 20, 12, 25,
                     [=]( int i_Other )
                     {
                       return i_Other == i_Marker;
                     } );
  };
  ExpectSame( Chosen( { { ZEK::ESelectMarker, "Ada:c", 7, 2 } } ), Of( 2 ) );
  ExpectSame( Chosen( { { ZEK::ESelectSubject, "Ada", 7, 0 } } ), Expected( 20, 12, 25,
                                                                            []( int i_Other )
                                                                            {
                                                                              return i_Other < Markers - 1;
                                                                            } ) );
  ExpectSame( Chosen( { { ZEK::ESelectDevice, "vi:1", 0, 0 } } ), Expected( 20, 12, 25 ) );
  EXPECT_TRUE( Chosen( { { ZEK::ESelectMarker, "Bob:c", 8, 2 } } ).empty() );
  // An unlabelled one by its place in the set.
  std::int64_t Now = 20;
  D3 At;
  while ( !Place( Markers - 1, Now, At ) )
  {
    ++Now;
  }
  std::uint32_t Sub = 0;
  for ( int Step = 0; ( Step + Now ) % Markers != Markers - 1; ++Step )
  {
    Sub += Place( static_cast< int >( ( Step + Now ) % Markers ), Now, At ) ? 1 : 0;
  }
  pScene->Select( { { ZEK::ESelectReconstruction, {}, 0, Sub } } );
  Show( Now );
  ExpectSame( Drawn(), Expected( Now, Now - 8, Now + 5,
                                 []( int i_Other )
                                 {
                                   return i_Other == Markers - 1;
                                 } ) );
}

TEST_F( MarkerTrails, AreSeenWhereTheMarkerWasAndWillBe )
{
  // A marker on its way along x, 100 mm a frame, that is not seen for one frame.
  const auto Step = [this]( std::int64_t i_Frame )
  {
    VReconstructionSet Set;
    VReconstructionTrackSet Tracks;
    if ( i_Frame != 16 )
    {
      Set.Items.push_back( { 1, { 100.0 * double( i_Frame - 20 ), 0, 0 }, 7, 0, 2 } );
      Tracks.Tracks.push_back( { 5, 0 } );
    }
    ZEK::VFlowStateRef New;
    (void)m_Factory->CreateState( New, { i_Frame * Span, Span, 1 }, {}, {} );
    New->AddItem( Maker.Item< FlowReconstructionSet >( Set ) );
    New->AddItem( Maker.Item< FlowReconstructionTrackSet >( Tracks ) );
    return New;
  };
  for ( std::int64_t Frame = 0; Frame < 40; ++Frame )
  {
    (void)pScene->pKept->Add( Step( Frame ) );
  }
  FlowTest::VFrame View( pScene );
  Options = {};
  Options.FloorGrid = Options.GlobalAxis = Options.Cameras = Options.ReconstructionVolume = false;
  Options.trialLengthFuture = 8;
  View.Frame().Input().Options = Options;
  pScene->Show( Step( 20 ) );
  const QImage Off = View.Draw();
  View.Frame().Input().Options.MarkerTrails = true;
  const QImage On = View.Draw();
  const auto Lit = [&]( float i_X )
  {
    const QPoint At = View.Screen( { i_X, 0, 0 } );
    int Most = 0;
    for ( int Dy = -2; Dy <= 2; ++Dy )
    {
      Most = std::max( Most, qRed( On.pixel( At + QPoint( 0, Dy ) ) ) - qRed( Off.pixel( At + QPoint( 0, Dy ) ) ) );
    }
    return Most;
  };
  EXPECT_GT( Lit( -250 ), 80 );
  EXPECT_GT( Lit( 250 ), 80 );
  EXPECT_GT( Lit( -650 ), 10 );
  EXPECT_LT( Lit( -650 ), Lit( -250 ) ) << "it fades";
  EXPECT_EQ( Lit( -400 ), 0 ) << "a gap";
  EXPECT_EQ( Lit( -1100 ), 0 ) << "its end";
  EXPECT_EQ( Lit( 850 ), 0 );
}
} // namespace
