// The cost of a frame of state: 256 cameras with 14 items each, of which five are new in every frame (what the cameras
// see) and nine are handed on (what the cameras are). The floor does the same with a plain vector of shared structures,
// which knows no order, no replacement and no ids. Both keep as many frames as a cache does.

#include <HostFlow/VFlowFramework.h>

#include <CoreMoxelTypes/FlowTypes.h>

#include <benchmark/benchmark.h>

#include <atomic>
#include <cstdlib>
#include <memory>
#include <mutex>
#include <new>
#include <string>
#include <vector>

using namespace ZEK;
using namespace CoreMoxelTypes;

namespace
{
std::atomic< std::uint64_t > g_Allocations{ 0 };

void* Count( std::size_t i_Size, std::size_t i_Alignment )
{
  g_Allocations.fetch_add( 1, std::memory_order_relaxed );
  void* pMemory = i_Alignment > alignof( std::max_align_t )
                      ? std::aligned_alloc( i_Alignment, ( i_Size + i_Alignment - 1 ) / i_Alignment * i_Alignment )
                      : std::malloc( i_Size ? i_Size : 1 );
  if ( !pMemory )
  {
    throw std::bad_alloc();
  }
  return pMemory;
}
} // namespace

void* operator new( std::size_t i_Size )
{
  return Count( i_Size, 0 );
}
void* operator new( std::size_t i_Size, std::align_val_t i_Alignment )
{
  return Count( i_Size, static_cast< std::size_t >( i_Alignment ) );
}
void operator delete( void* i_pMemory ) noexcept
{
  std::free( i_pMemory );
}
void operator delete( void* i_pMemory, std::size_t ) noexcept
{
  std::free( i_pMemory );
}
void operator delete( void* i_pMemory, std::align_val_t ) noexcept
{
  std::free( i_pMemory );
}
void operator delete( void* i_pMemory, std::size_t, std::align_val_t ) noexcept
{
  std::free( i_pMemory );
}

namespace
{

constexpr int Cameras = 256;
constexpr std::int64_t Ticks = FlowTicksPerSecond / 250;
constexpr VFlowTimeKey Always{ 0, std::numeric_limits< std::int64_t >::max(), 1 };
constexpr std::uint32_t Tags[] = { 0x1000, 0x1001, 0x1002, 0x1003, 0x1005, 0x1006, 0x100a,
                                   0x100b, 0x100c, 0x1022, 0x102d, 0x102e, 0x102f, 0x1037 };

/// What one camera sees in a frame, to be copied into each new value.
struct VSeen
{
  std::vector< VCentroid > Centroids = std::vector< VCentroid >( 32 );
  std::vector< VGreyscaleBlob > Blobs = std::vector< VGreyscaleBlob >( 4 );
  std::vector< VGreyscaleLine > Lines = std::vector< VGreyscaleLine >( 24 );
  std::vector< u8 > Pixels = std::vector< u8 >( 160 );
  std::vector< VEdgePair > Pairs = std::vector< VEdgePair >( 24 );
  std::vector< i32 > Assignments = std::vector< i32 >( 32 );
  std::vector< VCentroidLabel > Labels = std::vector< VCentroidLabel >( 32 );
};

const VSeen& Seen()
{
  static const VSeen Value;
  return Value;
}

void Fill( VCentroidSet& o_rValue )
{
  o_rValue.Centroids.assign( Seen().Centroids.begin(), Seen().Centroids.end() );
}
void Fill( VGreyscaleBlobSet& o_rValue )
{
  o_rValue.Blobs.assign( Seen().Blobs.begin(), Seen().Blobs.end() );
  o_rValue.Lines.assign( Seen().Lines.begin(), Seen().Lines.end() );
  o_rValue.Pixels.assign( Seen().Pixels.begin(), Seen().Pixels.end() );
}
void Fill( VEdgePairSet& o_rValue )
{
  o_rValue.Pairs.assign( Seen().Pairs.begin(), Seen().Pairs.end() );
}
void Fill( VCentroidAssignmentSet& o_rValue )
{
  o_rValue.Reconstruction.assign( Seen().Assignments.begin(), Seen().Assignments.end() );
}
void Fill( VCentroidLabelSet& o_rValue )
{
  o_rValue.Labels.assign( Seen().Labels.begin(), Seen().Labels.end() );
}

std::vector< std::string > CameraNames()
{
  std::vector< std::string > Names;
  for ( int Camera = 0; Camera < Cameras; ++Camera )
  {
    Names.push_back( "urn:harrow:camera:" + std::to_string( Camera ) );
  }
  return Names;
}

/// Makes and publishes frames through the framework.
class VFlow
{
public:
  VFlow()
  {
    for ( const std::string& rName : m_Names )
    {
      for ( const std::uint32_t Tag :
            { 0x1000u, 0x1001u, 0x1002u, 0x100au, 0x100bu, 0x102du, 0x102eu, 0x102fu, 0x1037u } )
      {
        m_Slow.push_back( Make( *FindFlowItemType( Tag ), rName ) );
      }
    }
  }

  void Publish()
  {
    VFlowStateRef State;
    const VFlowTimeKey Key{ m_Frame++ * Ticks, Ticks, 1 };
    if ( m_Factory->CreateState( State, Key, { 0, 250, 1 }, {} ).IsError() )
    {
      std::abort();
    }
    auto Slow = m_Slow.begin();
    for ( const std::string& rName : m_Names )
    {
      for ( int Item = 0; Item < 9; ++Item )
      {
        State->AddItemAt( *Slow++, Always );
      }
      AddNew< FlowCentroidSet >( *State, rName );
      AddNew< FlowGreyscaleBlobSet >( *State, rName );
      AddNew< FlowEdgePairSet >( *State, rName );
      AddNew< FlowCentroidAssignmentSet >( *State, rName );
      AddNew< FlowCentroidLabelSet >( *State, rName );
    }
    if ( m_pCache->Add( State ).IsError() )
    {
      std::abort();
    }
  }

  /// As many frames as bring every pool to its final size.
  void Settle()
  {
    for ( std::size_t Frame = 0; Frame < HostFlow::DefaultRing + 2; ++Frame )
    {
      Publish();
    }
  }
  IFlowStateCache& Cache() { return *m_pCache; }

private:
  VFlowItemRef Make( const VFlowItemType& i_rType, const std::string& i_rName )
  {
    VFlowItemRef Item;
    IResult Status;
    m_Store->CreateItem( Status, i_rType, Item );
    Item->MutableValue().SetName( EFlowNameDevice, i_rName );
    return Item;
  }

  template < typename TFlow >
  void AddNew( IFlowState& i_rState, const std::string& i_rName )
  {
    const VFlowItemRef Item = Make( FlowValueType< TFlow >::Descriptor, i_rName );
    Fill( *FlowMutablePayload< typename FlowValueType< TFlow >::type >( Item.Get() ) );
    i_rState.AddItem( Item );
  }

  std::int64_t m_Frame = 0;
  VFlowStateFactoryRef m_Factory = HostFlow::MakeStateFactory();
  VFlowStoreRef m_Store = HostFlow::MakeItemStore();
  std::shared_ptr< HostFlow::IHostStateCache > m_pCache = HostFlow::MakeCache();
  const std::vector< std::string > m_Names = CameraNames();
  std::vector< VFlowItemRef > m_Slow;
};

struct VPlainValue
{
  virtual ~VPlainValue() = default;
  std::int64_t Id = 0;
  std::string Name;
};
template < typename T >
struct VPlainTyped : VPlainValue
{
  T Payload;
};
struct VPlainEntry
{
  VFlowTimeKey Key;
  std::uint32_t Tag = 0;
  std::shared_ptr< const VPlainValue > pValue;
};
using VPlainState = std::vector< VPlainEntry >;

/// The floor.
class VPlain
{
public:
  VPlain()
  {
    for ( int Item = 0; Item < Cameras * 9; ++Item )
    {
      auto pValue = std::make_shared< VPlainTyped< VCameraHardware > >();
      pValue->Name = m_Names[static_cast< std::size_t >( Item ) / 9];
      m_Slow.push_back( pValue );
    }
  }

  void Publish()
  {
    const VFlowTimeKey Key{ m_Frame * Ticks, Ticks, 1 };
    auto pState = std::make_shared< VPlainState >();
    pState->reserve( Cameras * 14 );
    auto Slow = m_Slow.begin();
    for ( const std::string& rName : m_Names )
    {
      for ( int Item = 0; Item < 9; ++Item )
      {
        pState->push_back( { Always, 0x1000, *Slow++ } );
      }
      AddNew< VCentroidSet >( *pState, Key, 0x1003, rName );
      AddNew< VGreyscaleBlobSet >( *pState, Key, 0x1005, rName );
      AddNew< VEdgePairSet >( *pState, Key, 0x1006, rName );
      AddNew< VCentroidAssignmentSet >( *pState, Key, 0x100c, rName );
      AddNew< VCentroidLabelSet >( *pState, Key, 0x1022, rName );
    }
    {
      const std::lock_guard Lock( m_Guard );
      std::swap( m_Ring[static_cast< std::size_t >( m_Frame++ ) % m_Ring.size()], pState );
    }
  }
  void Settle()
  {
    for ( std::size_t Frame = 0; Frame < m_Ring.size() + 2; ++Frame )
    {
      Publish();
    }
  }
  std::shared_ptr< const VPlainState > Newest()
  {
    const std::lock_guard Lock( m_Guard );
    return m_Ring[static_cast< std::size_t >( m_Frame - 1 ) % m_Ring.size()];
  }

private:
  template < typename T >
  void AddNew( VPlainState& i_rState, const VFlowTimeKey& i_rKey, std::uint32_t i_Tag, const std::string& i_rName )
  {
    auto pValue = std::make_shared< VPlainTyped< T > >();
    pValue->Id = ++m_Id;
    pValue->Name = i_rName;
    Fill( pValue->Payload );
    i_rState.push_back( { i_rKey, i_Tag, std::move( pValue ) } );
  }

  std::mutex m_Guard;
  std::int64_t m_Frame = 0;
  std::int64_t m_Id = 0;
  const std::vector< std::string > m_Names = CameraNames();
  std::vector< std::shared_ptr< VPlainState > > m_Ring =
      std::vector< std::shared_ptr< VPlainState > >( HostFlow::DefaultRing );
  std::vector< std::shared_ptr< const VPlainValue > > m_Slow;
};

/// Reports the allocations an iteration of everything since it was made.
class VAllocations
{
public:
  explicit VAllocations( benchmark::State& i_rState )
    : m_rState( i_rState )
  {
  }
  ~VAllocations()
  {
    m_rState.counters["allocations"] =
        benchmark::Counter( static_cast< double >( g_Allocations - m_Before ), benchmark::Counter::kAvgIterations );
  }

private:
  benchmark::State& m_rState;
  const std::uint64_t m_Before = g_Allocations;
};

template < typename T >
void Publish( benchmark::State& i_rState )
{
  T Subject;
  Subject.Settle();
  const VAllocations Allocations( i_rState );
  for ( auto _ : i_rState )
  {
    Subject.Publish();
  }
}

void FlowWalk( benchmark::State& i_rState )
{
  VFlow Flow;
  Flow.Publish();
  VFlowStateRef State;
  Flow.Cache().Fetch( State, 31, 2, 0 );
  const VAllocations Allocations( i_rState );
  for ( auto _ : i_rState )
  {
    std::int64_t Sum = 0;
    for ( const std::uint32_t Tag : Tags )
    {
      VFlowCursor It, End;
      State->TagBegin( It, Tag, EFlowTimeMatch::Overlap );
      State->TagEnd( End, Tag, EFlowTimeMatch::Overlap );
      for ( ; It != End; ++It )
      {
        if ( FlowTimeMatches( EFlowTimeMatch::Overlap, It->Key, State->GetKey() ) )
        {
          Sum += It->pItem->Id().Number;
        }
      }
    }
    benchmark::DoNotOptimize( Sum );
  }
}

void PlainWalk( benchmark::State& i_rState )
{
  VPlain Plain;
  Plain.Publish();
  const auto pState = Plain.Newest();
  const VAllocations Allocations( i_rState );
  for ( auto _ : i_rState )
  {
    std::int64_t Sum = 0;
    for ( const VPlainEntry& rEntry : *pState )
    {
      Sum += rEntry.pValue->Id;
    }
    benchmark::DoNotOptimize( Sum );
  }
}

void FlowFetch( benchmark::State& i_rState )
{
  VFlow Flow;
  Flow.Settle();
  const VAllocations Allocations( i_rState );
  for ( auto _ : i_rState )
  {
    VFlowStateRef State;
    Flow.Cache().Fetch( State, 31, 2, 0 );
    benchmark::DoNotOptimize( State.Get() );
  }
}

void PlainFetch( benchmark::State& i_rState )
{
  VPlain Plain;
  Plain.Settle();
  const VAllocations Allocations( i_rState );
  for ( auto _ : i_rState )
  {
    const auto pState = Plain.Newest();
    benchmark::DoNotOptimize( pState.get() );
  }
}

BENCHMARK( Publish< VFlow > )->Name( "flow/publish" )->Unit( benchmark::kMicrosecond );
BENCHMARK( Publish< VPlain > )->Name( "flow/floor/publish" )->Unit( benchmark::kMicrosecond );
BENCHMARK( FlowWalk )->Name( "flow/walk" )->Unit( benchmark::kMicrosecond );
BENCHMARK( PlainWalk )->Name( "flow/floor/walk" )->Unit( benchmark::kMicrosecond );
BENCHMARK( FlowFetch )->Name( "flow/fetch" )->Unit( benchmark::kNanosecond );
BENCHMARK( PlainFetch )->Name( "flow/floor/fetch" )->Unit( benchmark::kNanosecond );

} // namespace
