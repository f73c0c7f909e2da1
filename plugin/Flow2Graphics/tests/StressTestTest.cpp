#include <Flow2Graphics/TestPattern.h>
#include <Flow2Graphics/VStressTest.h>

#include <CoreMoxelTypes/FlowTypes.h>
#include <Flow2TypesUtils/TaggedCoreTypeExtractor.h>
#include <HostFlow/VFlowFramework.h>
#include <HostServices/VHost.h>
#include <HostServices/VSelectionService.h>

#include "FlowTestScene.h"

#include <TestSupport/Allocations.h>
#include <TestSupport/LogGuard.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <set>

using namespace CoreMoxelTypes;
using Flow2Graphics::VStressTest;
using Flow2TypesUtils::ETagRequirement;

namespace
{
constexpr std::uint32_t NewTags[] = { ZEK::FlowTag< FlowCentroidSet >, ZEK::FlowTag< FlowGreyscaleBlobSet > };
constexpr std::uint32_t OldTags[] = { ZEK::FlowTag< FlowCameraHardware >, ZEK::FlowTag< FlowEdgePairSet >,
                                      ZEK::FlowTag< FlowCameraMaskGrid >, ZEK::FlowTag< FlowImageSet > };

ZEK::VFlowStateRef Latest( ZEK::IFlowStateCache& i_rCache )
{
  ZEK::VFlowStateRef State;
  EXPECT_TRUE( i_rCache.Fetch( State, 31, 2, 0 ) );
  return State;
}

/// The cameras of a state, as a view joins them.
class VCameras
{
public:
  VCameras()
  {
    m_Join.AddCache< FlowCameraHardware >( ETagRequirement::Required );
    m_Join.AddCache< FlowCentroidSet >( ETagRequirement::Required );
    m_Join.AddCache< FlowGreyscaleBlobSet >( ETagRequirement::Required );
    m_Join.AddCache< FlowEdgePairSet >( ETagRequirement::Required );
    m_Join.AddCache< FlowCameraMaskGrid >( ETagRequirement::Required );
    m_Join.AddCache< FlowImageSet >( ETagRequirement::Required );
    m_Join.AddCache< FlowCameraCalibration >( ETagRequirement::Optional );
  }
  const Flow2TypesUtils::VTaggedCoreTypeExtractor& Of( const ZEK::IFlowState& i_rState )
  {
    m_Join.Update( i_rState, ZEK::EFlowNameDevice, ZEK::EFlowTimeMatch::Overlap, i_rState.GetKey() );
    return m_Join;
  }

private:
  Flow2TypesUtils::VTaggedCoreTypeExtractor m_Join;
};

/// What has been drawn so far, to tell a source of numbers that leaves some out.
struct VDrawn
{
  std::set< std::size_t > Blobs, Centroids;
  std::set< std::uint32_t > Widths, Heights;
  std::set< std::uint8_t > Pixels;
  float Least = 100, Most = 0;
};

void Expect( const VGreyscaleBlobSet& i_rSet, VDrawn& io_rDrawn )
{
  std::uint32_t Line = 0, Pixel = 0;
  for ( const VGreyscaleBlob& rBlob : i_rSet.Blobs )
  {
    ASSERT_EQ( rBlob.FirstLine, Line );
    ASSERT_LE( Line + rBlob.LineCount, i_rSet.Lines.size() );
    const VGreyscaleLine First = i_rSet.Lines[Line];
    ASSERT_LE( First.x + First.length, 1280 );
    ASSERT_LE( First.y + rBlob.LineCount, 720u );
    for ( std::uint32_t Row = 0; Row < rBlob.LineCount; ++Row, ++Line )
    {
      const VGreyscaleLine& rLine = i_rSet.Lines[Line];
      ASSERT_EQ( std::tuple( rLine.x, rLine.y, rLine.length, rLine.First ),
                 std::tuple( First.x, First.y + Row, First.length, Pixel ) );
      Pixel += rLine.length;
    }
    io_rDrawn.Widths.insert( First.length );
    io_rDrawn.Heights.insert( rBlob.LineCount );
  }
  ASSERT_EQ( Line, i_rSet.Lines.size() );
  ASSERT_EQ( Pixel, i_rSet.Pixels.size() );
  io_rDrawn.Blobs.insert( i_rSet.Blobs.size() );
  io_rDrawn.Pixels.insert( i_rSet.Pixels.begin(),
                           i_rSet.Pixels.begin() + static_cast< std::ptrdiff_t >( std::min( Pixel, 50u ) ) );
}

void Expect( const VCentroidSet& i_rSet, VDrawn& io_rDrawn )
{
  for ( const VCentroid& rCentroid : i_rSet.Centroids )
  {
    io_rDrawn.Least = std::min( { io_rDrawn.Least, rCentroid.x, rCentroid.y, rCentroid.radius } );
    io_rDrawn.Most = std::max( { io_rDrawn.Most, rCentroid.x, rCentroid.y, rCentroid.radius } );
  }
  io_rDrawn.Centroids.insert( i_rSet.Centroids.size() );
}

/// Counts as an intrusive handle does, and lives as long as the test.
template < typename TInterface >
struct VTestHandle : TInterface
{
  virtual ~VTestHandle() = default;
  void AddRef() const override {}
  void Release() const override {}
};

/// Keeps a reference on every state it makes.
struct VHoldingFactory final : VTestHandle< ZEK::IFlowStateFactoryHandle >
{
  ZEK::IResult CreateState( ZEK::VFlowStateRef& o_rState, const ZEK::VFlowTimeKey& i_rKey,
                            const ZEK::VFlowInfoA& i_rInfoA, const ZEK::VFlowInfoB& i_rInfoB ) override
  {
    const ZEK::IResult Result = Own->CreateState( o_rState, i_rKey, i_rInfoA, i_rInfoB );
    Held.push_back( o_rState );
    return Result;
  }
  ZEK::VFlowStateFactoryRef Own = HostFlow::MakeStateFactory();
  std::vector< ZEK::VFlowStateRef > Held;
};

/// Gives out when it has made so many items.
struct VFailingStore final : VTestHandle< ZEK::IFlowStoreHandle >
{
  void CreateItem( ZEK::IResult& o_rStatus, const ZEK::VFlowItemType& i_rType, ZEK::VFlowItemRef& o_rItem ) override
  {
    o_rStatus = ZEK::IResult::AllocationFailure;
    if ( Left-- > 0 )
    {
      Own->CreateItem( o_rStatus, i_rType, o_rItem );
    }
  }
  ZEK::VFlowStoreRef Own = HostFlow::MakeItemStore();
  int Left = 0;
};
} // namespace

TEST( StressTest, TicksWithNewItemsInThePlacesOfOldOnesAndAllocatesNothing )
{
  HostServices::VHost Host( { .bDeveloperMode = true } ); // with the ring that a host has
  VStressTest StressTest( Host.CacheManager(), Host.StateFactory(), Host.ItemStore() );
  EXPECT_EQ( StressTest.Tick(), ZEK::IResult( ZEK::IResult::NotSet ) );
  ASSERT_TRUE( StressTest.Start().IsOk() );
  const auto pCache = Host.CacheManager()->FindCache( VStressTest::CacheName );
  ASSERT_TRUE( pCache );
  FlowTest::VScene Scene;
  VCameras Cameras;
  VDrawn Drawn;
  std::uint64_t Allocated = 0;
  const auto Tick = [&]
  {
    const std::uint64_t Before = TestSupport::AllocationCount();
    ASSERT_TRUE( StressTest.Tick().IsOk() );
    const ZEK::VFlowStateRef State = Latest( *pCache );
    Scene.Show( State );
    const auto& rJoin = Cameras.Of( *State );
    Allocated += TestSupport::AllocationCount() - Before;
    ASSERT_EQ( rJoin.Names().size(), 128u );
    ASSERT_EQ( State->ItemCount(), 6 * 128u ) << "a new item stands beside the static one";
    for ( std::size_t Camera = 0; Camera < 128; ++Camera )
    {
      Expect( *rJoin.Values< FlowGreyscaleBlobSet >()[Camera], Drawn );
      Expect( *rJoin.Values< FlowCentroidSet >()[Camera], Drawn );
    }
  };
  for ( std::int64_t Frame = 0; Frame < 12; ++Frame ) // as many as every pool needs
  {
    Tick();
    const ZEK::VFlowTimeKey Key = Latest( *pCache )->GetKey();
    ASSERT_EQ( std::tuple( Key.Frame, Key.Span, Key.Clock ), std::tuple( Frame * 2250000, 2250000, 1u ) );
  }
  EXPECT_TRUE( Cameras.Of( *Latest( *pCache ) ).Names()[19] == "115" ) << "names are decimal";
  Allocated = 0;
  for ( int Frame = 0; Frame < 60; ++Frame )
  {
    Tick();
    const auto& rJoin = Cameras.Of( *Latest( *pCache ) );
    EXPECT_FALSE( rJoin.Changed( NewTags[0] ) ) << "the same state again";
  }
  EXPECT_EQ( Allocated, 0u );
  Tick();
  for ( const std::uint32_t Tag : NewTags )
  {
    const ZEK::VFlowStateRef State = Latest( *pCache );
    StressTest.Tick().Code();
    EXPECT_TRUE( Cameras.Of( *Latest( *pCache ) ).Changed( Tag ) );
    std::vector< bool > Bits;
    Cameras.Of( *State );
    Cameras.Of( *Latest( *pCache ) ).ChangedBits( Tag, Bits );
    EXPECT_EQ( std::count( Bits.begin(), Bits.end(), true ), 128 ) << Tag;
    for ( const std::uint32_t Static : OldTags )
    {
      EXPECT_FALSE( Cameras.Of( *State ).Changed( Static ) ) << Static;
    }
  }
  std::vector< ZEK::VFlowStateRef > Kept;
  pCache->FetchMany( { { 0, 1, 1 }, { INT64_MAX, 1, 1 } }, Kept, 0 );
  EXPECT_LE( Kept.size(), HostFlow::LiveRing ) << "megabytes for each state that nobody looks back at";
  EXPECT_EQ( std::pair( Drawn.Blobs.size(), *Drawn.Blobs.rbegin() ),
             std::pair( std::size_t{ 11 }, std::size_t{ 10 } ) );
  EXPECT_EQ( std::pair( Drawn.Centroids.size(), *Drawn.Centroids.rbegin() ),
             std::pair( std::size_t{ 129 }, std::size_t{ 128 } ) );
  for ( const auto& rSides : { Drawn.Widths, Drawn.Heights } )
  {
    EXPECT_EQ( std::tuple( rSides.size(), *rSides.begin(), *rSides.rbegin() ), std::tuple( 128u, 1u, 128u ) );
  }
  EXPECT_EQ( Drawn.Pixels.size(), 256u );
  EXPECT_TRUE( Drawn.Least >= 0.01f && Drawn.Least < 0.02f && Drawn.Most <= 64 && Drawn.Most > 63.99f );
}

TEST( StressTest, ThousandsOfTicksLeaveNothingBehind )
{
  HostFlow::TrimPools();
  const std::size_t Others = HostFlow::CountPools().Items;
  HostServices::VHost Host( { .bDeveloperMode = true } );
  VStressTest StressTest( Host.CacheManager(), Host.StateFactory(), Host.ItemStore() );
  ASSERT_TRUE( StressTest.Start().IsOk() );
  const auto pCache = Host.CacheManager()->FindCache( VStressTest::CacheName );
  ASSERT_TRUE( pCache );
  FlowTest::VScene Scene;
  VCameras Cameras;
  const auto Run = [&]( int i_Ticks )
  {
    for ( int Tick = 0; Tick < i_Ticks; ++Tick )
    {
      ASSERT_TRUE( StressTest.Tick().IsOk() );
      if ( Tick % 8 == 0 ) // a view that does not keep up
      {
        Scene.Show( Latest( *pCache ) );
        Cameras.Of( *Scene.State );
      }
    }
  };
  /// All room that the kept frames' payloads have, used or not.
  const auto Bytes = [&]
  {
    std::vector< ZEK::VFlowStateRef > Kept;
    pCache->FetchMany( { { 0, 1, 1 }, { INT64_MAX, 1, 1 } }, Kept, 0 );
    std::size_t Sum = 0;
    for ( const ZEK::VFlowStateRef& rState : Kept )
    {
      const auto& rJoin = Cameras.Of( *rState );
      for ( std::size_t Camera = 0; Camera < 128; ++Camera )
      {
        const VGreyscaleBlobSet& rBlobs = *rJoin.Values< FlowGreyscaleBlobSet >()[Camera];
        Sum += rBlobs.Blobs.capacity() * sizeof( VGreyscaleBlob ) + rBlobs.Lines.capacity() * sizeof( VGreyscaleLine ) +
               rBlobs.Pixels.capacity() +
               rJoin.Values< FlowCentroidSet >()[Camera]->Centroids.capacity() * sizeof( VCentroid );
      }
    }
    return Sum / Kept.size();
  };
  Run( 40 );
  const HostFlow::VPoolFigures Before = HostFlow::CountPools();
  const std::size_t BytesBefore = Bytes();
  const std::uint64_t Allocated = TestSupport::AllocationCount();
  Run( 2000 );
  EXPECT_EQ( TestSupport::AllocationCount(), Allocated );
  const HostFlow::VPoolFigures After = HostFlow::CountPools();
  EXPECT_EQ( std::tuple( After.Items, After.States, After.Names ),
             std::tuple( Before.Items, Before.States, Before.Names ) );
  EXPECT_EQ( Bytes(), BytesBefore );
  // Four frames in the ring, two that a view and its join hold, one being made; two new items a camera in each.
  EXPECT_LE( After.Items - Others, 128u * ( 6 + 7 * 2 ) );
}

TEST( StressTest, GoesOnFromWhatItsCacheHoldsAndClonesAStateThatSomebodyHolds )
{
  const auto pManager = HostFlow::MakeCacheManager();
  std::shared_ptr< ZEK::IFlowWritableStateCache > pCache;
  ASSERT_TRUE( pManager->CreateCache( pCache, VStressTest::CacheName, 0 ).IsOk() );
  ZEK::VFlowStateRef Old;
  ASSERT_TRUE( HostFlow::MakeStateFactory()->CreateState( Old, { 100, 50, 7 }, {}, {} ).IsOk() );
  ASSERT_TRUE( pCache->Add( Old ).IsOk() );
  VHoldingFactory Factory;
  VStressTest StressTest( pManager, ZEK::VFlowStateFactoryRef( &Factory ), HostFlow::MakeItemStore() );
  EXPECT_TRUE( StressTest.Start().IsOk() || StressTest.IsRunning() );
  ASSERT_TRUE( StressTest.Tick().IsOk() );
  const ZEK::VFlowStateRef State = Latest( *pCache );
  EXPECT_EQ( std::tuple( State->GetKey().Frame, State->GetKey().Span, State->GetKey().Clock ),
             std::tuple( 150, 50, 7u ) );
  ASSERT_EQ( Factory.Held.size(), 1u );
  EXPECT_FALSE( State == Factory.Held[0] );
  EXPECT_EQ( State->ItemCount(), 6 * 128u );
  StressTest.Stop();
  EXPECT_FALSE( StressTest.IsRunning() );
}

TEST( StressTest, SaysWhyItCannotStartOrGoOn )
{
  auto pManager = HostFlow::MakeCacheManager();
  VFailingStore Store;
  VStressTest StressTest( pManager, HostFlow::MakeStateFactory(), ZEK::VFlowStoreRef( &Store ) );
  Store.Left = 128 * 6 - 1;
  EXPECT_TRUE( StressTest.Start().IsError() );
  EXPECT_FALSE( StressTest.IsRunning() );
  Store.Left = 128 * 6 + 11; // the second tick's worth is not there
  EXPECT_TRUE( StressTest.Start().IsOk() );
  EXPECT_TRUE( StressTest.IsRunning() );
  EXPECT_EQ( StressTest.Tick(), ZEK::IResult( ZEK::IResult::AllocationFailure ) );
  EXPECT_FALSE( StressTest.IsRunning() );
  EXPECT_FALSE( Latest( *pManager->FindCache( VStressTest::CacheName ) ) ) << "half a frame was shown";
  Store.Left = 1 << 20;
  EXPECT_TRUE( StressTest.Start().IsOk() );
  EXPECT_TRUE( StressTest.Tick().IsOk() );
  pManager.reset();
  EXPECT_EQ( StressTest.Tick(), ZEK::IResult( ZEK::IResult::NotSet ) ) << "its cache is the manager's";
  EXPECT_EQ( StressTest.Start(), ZEK::IResult( ZEK::IResult::NotAvailable ) );
  EXPECT_EQ( TestSupport::LogTexts( "StressTest", ZEK::ELogWarning ).size(), 4u );
}

TEST( TestPattern, HasEveryCameraWholeAndLookingAtTheMiddle )
{
  const auto pManager = HostFlow::MakeCacheManager();
  const ZEK::VFlowStateFactoryRef Factory = HostFlow::MakeStateFactory();
  const ZEK::VFlowStoreRef Store = HostFlow::MakeItemStore();
  ASSERT_TRUE( Flow2Graphics::CreateTestPattern( *pManager, *Factory, *Store ).IsOk() );
  const auto pCache = pManager->FindCache( "[DEV] Test Pattern" );
  ASSERT_TRUE( pCache );
  const ZEK::VFlowStateRef First = Latest( *pCache );
  ASSERT_TRUE( Flow2Graphics::CreateTestPattern( *pManager, *Factory, *Store ).IsOk() );
  std::vector< ZEK::VFlowStateRef > States;
  pCache->FetchMany( { { 0, 1, 1 }, { INT64_MAX, 1, 1 } }, States, 0 );
  ASSERT_EQ( States.size(), 1u );
  EXPECT_FALSE( States[0] == First );

  VCameras Cameras;
  const auto& rJoin = Cameras.Of( *States[0] );
  ASSERT_EQ( rJoin.Names().size(), 4u );
  for ( std::size_t Camera = 0; Camera < 4; ++Camera )
  {
    const VCameraCalibration& rCalibration = *rJoin.Values< FlowCameraCalibration >()[Camera];
    // The middle of the room and a point above it, turned about the rotation vector.
    const D3 Axis = rCalibration.Rotation;
    const double Angle = std::sqrt( Axis.x * Axis.x + Axis.y * Axis.y + Axis.z * Axis.z );
    const auto Turned = [&]( const D3& v )
    {
      const D3 k{ Axis.x / Angle, Axis.y / Angle, Axis.z / Angle };
      const D3 Cross{ k.y * v.z - k.z * v.y, k.z * v.x - k.x * v.z, k.x * v.y - k.y * v.x };
      const double Along = ( k.x * v.x + k.y * v.y + k.z * v.z ) * ( 1 - std::cos( Angle ) );
      return std::array{ v.x * std::cos( Angle ) + Cross.x * std::sin( Angle ) + k.x * Along,
                         v.y * std::cos( Angle ) + Cross.y * std::sin( Angle ) + k.y * Along,
                         v.z * std::cos( Angle ) + Cross.z * std::sin( Angle ) + k.z * Along };
    };
    const D3 p = rCalibration.Position;
    const auto Middle = Turned( { -p.x, -p.y, 2000 - p.z } ), Up = Turned( { 0, 0, 1 } );
    EXPECT_NEAR( std::hypot( Middle[0], Middle[1] ), 0, 1e-9 ) << Camera;
    EXPECT_NEAR( Middle[2], 3000 * std::sqrt( 2 ), 1e-9 ) << Camera;
    EXPECT_NEAR( Up[1], -1, 1e-12 ) << Camera;

    const VGreyscaleBlobSet& rBlobs = *rJoin.Values< FlowGreyscaleBlobSet >()[Camera];
    VDrawn Drawn;
    for ( const VGreyscaleLine& rLine : rBlobs.Lines )
    {
      EXPECT_LE( rLine.First + rLine.length, rBlobs.Pixels.size() );
    }
    EXPECT_EQ( rBlobs.Lines.size(), rJoin.Values< FlowEdgePairSet >()[Camera]->Pairs.size() );
    Expect( *rJoin.Values< FlowCentroidSet >()[Camera], Drawn );
    EXPECT_TRUE( Drawn.Centroids.contains( 144 ) && Drawn.Most == 1240 );
    const VCameraMaskGrid& rMask = *rJoin.Values< FlowCameraMaskGrid >()[Camera];
    EXPECT_EQ( rMask.Cells.size(), std::size_t{ rMask.Columns } * rMask.Rows );
    EXPECT_EQ( std::count( rMask.Cells.begin(), rMask.Cells.end(), 0xff ), 16 );
    const VImageSet& rImages = *rJoin.Values< FlowImageSet >()[Camera];
    EXPECT_EQ( rImages.Identifiers, ( std::vector< std::string >{ "m:123", "s:456" } ) );
    EXPECT_EQ( rImages.Images.at( 0 ).Data.size(), 160u * 90 * 3 );
  }
  VFailingStore Failing;
  Failing.Left = 20;
  EXPECT_TRUE( Flow2Graphics::CreateTestPattern( *pManager, *Factory, Failing ).IsError() );
  EXPECT_TRUE( Latest( *pCache ) == States[0] ) << "what was there stays";
  EXPECT_EQ( TestSupport::LogTexts( "TestPattern", ZEK::ELogWarning ).size(), 1u );
}
