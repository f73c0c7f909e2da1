// What a transformed cache adds to a fetch: hit, the same state again; miss, two states in turn that share a key, so
// that each is transformed anew. A state has 1000 items; the transform clones it and adds one. The floors fetch from
// the source itself, and make the same clone by hand.

#include <Flow2StateCache/VFlowStateCacheTransform.h>

#include <CoreMoxelTypes/FlowTypes.h>
#include <HostFlow/VFlowFramework.h>

#include <benchmark/benchmark.h>

#include <cstdlib>
#include <string>

namespace
{
constexpr int ItemCount = 1000;
constexpr ZEK::VFlowTimeKey Key{ 0, 1, 1 };

ZEK::VFlowItemRef NewItem( const std::string& i_rName )
{
  static const ZEK::VFlowStoreRef Store = HostFlow::MakeItemStore();
  ZEK::IResult Status;
  ZEK::VFlowItemRef Item;
  Store->CreateItem( Status, ZEK::FlowValueType< CoreMoxelTypes::FlowDevice >::Descriptor, Item );
  Item->MutableValue().SetName( ZEK::EFlowNameDevice, i_rName );
  return Item;
}

ZEK::VFlowStateRef NewState()
{
  ZEK::VFlowStateRef State;
  if ( HostFlow::MakeStateFactory()->CreateState( State, Key, {}, {} ).IsError() )
  {
    std::abort();
  }
  for ( int Item = 0; Item < ItemCount; ++Item )
  {
    State->AddItem( NewItem( "urn:harrow:device:" + std::to_string( Item ) ) );
  }
  return State;
}

class VTransform final : public ZEK::IFlowStateTransform
{
public:
  ZEK::VFlowStateRef& Transform( ZEK::VFlowStateRef& o_rState, const ZEK::VFlowStateRef& i_rInput,
                                 const ZEK::VFlowParameterMap& ) override
  {
    o_rState = Flow2StateCache::CloneState( *i_rInput );
    o_rState->AddItem( m_Added );
    return o_rState;
  }

private:
  const ZEK::VFlowItemRef m_Added = NewItem( "added" );
};

/// A source with one state, which its owner swaps.
struct VSetup
{
  VSetup()
  {
    Cache.SetSource( pSource );
    Cache.SetTransform( std::make_shared< VTransform >() );
    Put( 0 );
  }
  void Put( int i_Which )
  {
    if ( pSource->Add( States[i_Which] ).IsError() )
    {
      std::abort();
    }
  }
  const ZEK::VFlowStateRef States[2] = { NewState(), NewState() };
  const std::shared_ptr< HostFlow::IHostStateCache > pSource = HostFlow::MakeCache( 4 );
  Flow2StateCache::VFlowStateCacheTransform Cache;
};

void Fetch( benchmark::State& i_rState, ZEK::IFlowStateCache& i_rCache, std::size_t i_Items )
{
  ZEK::VFlowStateRef State;
  for ( auto _ : i_rState )
  {
    i_rCache.Fetch( State, 31, 2, 0 );
    benchmark::DoNotOptimize( State.Get() );
  }
  if ( !State || State->ItemCount() != i_Items )
  {
    i_rState.SkipWithError( "items are missing" );
  }
}

void Hit( benchmark::State& i_rState )
{
  VSetup Setup;
  Fetch( i_rState, Setup.Cache, ItemCount + 1 );
}

void FloorFetch( benchmark::State& i_rState )
{
  VSetup Setup;
  Fetch( i_rState, *Setup.pSource, ItemCount );
}

void Miss( benchmark::State& i_rState )
{
  VSetup Setup;
  ZEK::VFlowStateRef State;
  int Frame = 0;
  for ( auto _ : i_rState )
  {
    Setup.Put( Frame ^= 1 );
    Setup.Cache.Fetch( State, 31, 2, 0 );
    benchmark::DoNotOptimize( State->ItemCount() );
  }
}

void FloorClone( benchmark::State& i_rState )
{
  VSetup Setup;
  VTransform Transform;
  ZEK::VFlowStateRef State;
  int Frame = 0;
  for ( auto _ : i_rState )
  {
    Setup.Put( Frame ^= 1 );
    Transform.Transform( State, Setup.States[Frame], {} );
    benchmark::DoNotOptimize( State->ItemCount() );
  }
}

BENCHMARK( Hit )->Name( "transform/hit" )->Unit( benchmark::kNanosecond );
BENCHMARK( FloorFetch )->Name( "transform/floor/fetch" )->Unit( benchmark::kNanosecond );
BENCHMARK( Miss )->Name( "transform/miss" )->Unit( benchmark::kMicrosecond );
BENCHMARK( FloorClone )->Name( "transform/floor/clone" )->Unit( benchmark::kMicrosecond );
} // namespace
