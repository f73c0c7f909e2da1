#include <Flow2Graphics/VStressTest.h>

#include "TestCamera.h"

#include <Flow2StateCache/VFlowStateStash.h>
#include <ZEK/FlowCacheFlags.h>
#include <ZEK/Log.h>

#include <algorithm>
#include <cstring>
#include <utility>

using namespace CoreMoxelTypes;

namespace Flow2Graphics
{
namespace
{
constexpr ZEK::VFlowTimeKey FirstKey{ 0, 2250000, 1 }; // 120 frames a second
constexpr int IntervalMs = 8;
constexpr std::uint32_t MostBlobs = 10, MostBlobSide = 128, MostCentroids = 128;
constexpr float LeastCentroidValue = 0.01f, MostCentroidValue = 64;

/// Room for the most that may come, written to at once: what only some later tick would touch the system gives only
/// then, and the test, which looks for what grows, would seem to grow itself.
template < typename T >
void TakeRoom( std::vector< T >& io_rVector, std::size_t i_Most )
{
  if ( io_rVector.capacity() < i_Most )
  {
    io_rVector.resize( i_Most );
    io_rVector.clear();
  }
}

ZEK::VLogCategory& Category()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "StressTest" );
  return rCategory;
}
} // namespace

VStressTest::VStressTest( std::weak_ptr< ZEK::IFlowStateCacheManager > i_pManager, ZEK::VFlowStateFactoryRef i_Factory,
                          ZEK::VFlowStoreRef i_Store )
  : m_pManager( std::move( i_pManager ) )
  , m_Factory( std::move( i_Factory ) )
  , m_Store( std::move( i_Store ) )
{
  m_Timer.setTimerType( Qt::PreciseTimer );
  m_Timer.setInterval( IntervalMs );
  m_Timer.callOnTimeout(
      [this]
      {
        Tick().Code();
      } );
}

VStressTest::~VStressTest() = default;

ZEK::IResult VStressTest::Start()
{
  const auto pManager = m_pManager.lock();
  ZEK::IResult Result = pManager && m_Factory && m_Store ? ZEK::IResult::Ok : ZEK::IResult::NotAvailable;
  std::shared_ptr< ZEK::IFlowWritableStateCache > pCache;
  if ( Result.IsOk() )
  {
    Result = pManager->CreateCache( pCache, CacheName, ZEK::EFlowCacheWatchedLive );
  }
  if ( pCache )
  {
    m_pCache = pCache;
    Result = m_Cameras.empty() ? MakeCameras() : ZEK::IResult::Ok;
  }
  if ( Result.IsError() )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "The stress test cannot start: %1%", Result.Text() );
    return Result;
  }
  m_Timer.start();
  return Result;
}

void VStressTest::Stop()
{
  m_Timer.stop();
}

ZEK::IResult VStressTest::MakeCameras()
{
  std::vector< VTestCamera > Cameras( CameraCount );
  for ( int Camera = 0; Camera < CameraCount; ++Camera )
  {
    const ZEK::IResult Made =
        MakeTestCamera( Cameras[static_cast< std::size_t >( Camera )], *m_Store, std::to_string( Camera ) );
    if ( Made.IsError() )
    {
      return Made;
    }
  }
  m_Cameras = std::move( Cameras );
  return ZEK::IResult::Ok;
}

ZEK::IResult VStressTest::Tick()
{
  const auto pCache = m_pCache.lock();
  const ZEK::IResult Added = pCache ? AddFrame( *pCache ) : ZEK::IResult::NotSet;
  if ( Added.IsError() && IsRunning() )
  {
    Stop();
    ZEK::Log( Category(), ZEK::ELogWarning, "The stress test stopped: %1%", Added.Text() );
  }
  return Added;
}

ZEK::IResult VStressTest::AddFrame( ZEK::IFlowWritableStateCache& io_rCache )
{
  ZEK::VFlowTimeKey Key = FirstKey;
  {
    ZEK::VFlowStateRef Latest;
    if ( io_rCache.Fetch( Latest, 31, 2, 0 ) && Latest )
    {
      Key = Latest->GetKey();
      Key.Frame += Key.Span;
    }
  }
  ZEK::VFlowStateRef State;
  ZEK::IResult Result = m_Factory->CreateState( State, Key, { 0, ZEK::FlowTicksPerSecond, Key.Span }, {} );
  for ( const VTestCamera& rCamera : m_Cameras )
  {
    if ( Result.IsOk() )
    {
      Result = AddCamera( *State, rCamera );
    }
  }
  if ( Result.IsOk() && State->UseCount() > 1 )
  {
    State = Flow2StateCache::CloneState( *State );
    Result = State ? ZEK::IResult::Ok : ZEK::IResult::AllocationFailure;
  }
  return Result.IsOk() ? io_rCache.Add( State ) : Result;
}

ZEK::IResult VStressTest::AddCamera( ZEK::IFlowState& io_rState, const VTestCamera& i_rCamera )
{
  for ( const ZEK::VFlowItemRef& rItem : i_rCamera.StaticItems )
  {
    io_rState.AddItem( rItem );
  }
  // Of the same tag, name and key as two of the static items, in whose places they come.
  ZEK::VFlowItemRef Blobs, Centroids;
  ZEK::IResult Result = MakeTestItem< FlowGreyscaleBlobSet >( Blobs, *m_Store, i_rCamera.Name );
  if ( Result.IsOk() )
  {
    Result = MakeTestItem< FlowCentroidSet >( Centroids, *m_Store, i_rCamera.Name );
  }
  if ( Result.IsOk() )
  {
    FillBlobs( *Blobs );
    FillCentroids( *Centroids );
    io_rState.AddItem( Blobs );
    io_rState.AddItem( Centroids );
  }
  return Result;
}

std::uint64_t VStressTest::NextRandom()
{
  m_Random ^= m_Random << 13;
  m_Random ^= m_Random >> 7;
  m_Random ^= m_Random << 17;
  return m_Random;
}

std::uint32_t VStressTest::Draw( std::uint32_t i_Most )
{
  return static_cast< std::uint32_t >( ( NextRandom() >> 32 ) * ( std::uint64_t{ i_Most } + 1 ) >> 32 );
}

void VStressTest::FillBlobs( ZEK::IFlowItem& io_rItem )
{
  VGreyscaleBlobSet& rSet = TestPayload< FlowGreyscaleBlobSet >( io_rItem );
  TakeRoom( rSet.Blobs, MostBlobs );
  TakeRoom( rSet.Lines, MostBlobs * MostBlobSide );
  TakeRoom( rSet.Pixels, MostBlobs * MostBlobSide * MostBlobSide );
  std::size_t PixelCount = 0;
  for ( std::uint32_t Blob = Draw( MostBlobs ); Blob > 0; --Blob )
  {
    const std::uint32_t Width = 1 + Draw( MostBlobSide - 1 ), Height = 1 + Draw( MostBlobSide - 1 );
    const std::uint32_t x = Draw( VTestCamera::SensorWidth - Width ), y = Draw( VTestCamera::SensorHeight - Height );
    rSet.Blobs.push_back( { static_cast< u32 >( rSet.Lines.size() ), Height, -1 } );
    for ( std::uint32_t Row = 0; Row < Height; ++Row )
    {
      rSet.Lines.push_back( { static_cast< u16 >( x ), static_cast< u16 >( y + Row ), static_cast< u16 >( Width ),
                              static_cast< u32 >( PixelCount ) } );
      PixelCount += Width;
    }
  }
  rSet.Pixels.resize( PixelCount );
  for ( std::size_t Pixel = 0; Pixel < PixelCount; Pixel += sizeof( std::uint64_t ) )
  {
    const std::uint64_t Bytes = NextRandom();
    std::memcpy( rSet.Pixels.data() + Pixel, &Bytes, std::min( sizeof( Bytes ), PixelCount - Pixel ) );
  }
}

void VStressTest::FillCentroids( ZEK::IFlowItem& io_rItem )
{
  const auto Value = [this]
  {
    constexpr std::uint32_t Steps = 1u << 20;
    return LeastCentroidValue +
           ( MostCentroidValue - LeastCentroidValue ) * static_cast< float >( Draw( Steps ) ) / Steps;
  };
  VCentroidSet& rSet = TestPayload< FlowCentroidSet >( io_rItem );
  TakeRoom( rSet.Centroids, MostCentroids );
  const std::uint32_t Count = Draw( MostCentroids );
  for ( std::uint32_t Id = 0; Id < Count; ++Id )
  {
    VCentroid Centroid;
    Centroid.x = Value();
    Centroid.y = Value();
    Centroid.radius = Value();
    Centroid.Id = Id;
    rSet.Centroids.push_back( Centroid );
  }
}

} // namespace Flow2Graphics
