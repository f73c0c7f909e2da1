// How the store's costs grow: many siblings, many handlers, many patterns, and the bytes of an entry.

#include <Store/Store.h>
#include <ZEK/Serialiser.h>

#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstdint>
#include <malloc.h>
#include <memory>
#include <random>
#include <string>
#include <vector>

using namespace ZEK;

namespace
{
VTypedValue Int( std::int32_t i_Value )
{
  return IO::MakeValue( i_Value );
}

std::vector< Store::VStoreEntry* > MakeSiblings( IStore& io_rStore, std::size_t i_Count, bool i_bShuffled )
{
  std::vector< std::string > Names;
  for ( std::size_t Number = 0; Number < i_Count; ++Number )
  {
    std::string Digits = std::to_string( Number );
    Names.push_back( "list/" + std::string( 8 - Digits.size(), '0' ) + Digits );
  }
  if ( i_bShuffled )
  {
    std::mt19937 Random( 5 );
    std::shuffle( Names.begin(), Names.end(), Random );
  }
  std::vector< Store::VStoreEntry* > Handles;
  for ( const std::string& rName : Names )
  {
    Handles.push_back( io_rStore.GetEntry( rName ) );
  }
  return Handles;
}

/// One scope creates 100000 entries, the next removes them one by one; names in order (0) or shuffled (1).
void Siblings( benchmark::State& io_rState )
{
  const auto pStore = Store::CreateStore( nullptr, 131072 );
  const auto Handles = MakeSiblings( *pStore, 100000, io_rState.range( 0 ) != 0 );
  for ( auto Turn : io_rState )
  {
    {
      const VStoreWriteScope Scope( *pStore );
      for ( Store::VStoreEntry* const pEntry : Handles )
      {
        (void)Scope->SetValue( pEntry, Int( 1 ) );
      }
    }
    const VStoreWriteScope Scope( *pStore );
    for ( Store::VStoreEntry* const pEntry : Handles )
    {
      (void)Scope->RemoveEntry( pEntry );
    }
  }
}
BENCHMARK( Siblings )->Name( "store/siblings_100000" )->Arg( 0 )->Arg( 1 )->Unit( benchmark::kMillisecond );

/// One change among so many handlers, each on an entry of its own.
void AmongHandlers( benchmark::State& io_rState )
{
  const auto pStore = Store::CreateStore( nullptr, 131072 );
  const auto Handles = MakeSiblings( *pStore, static_cast< std::size_t >( io_rState.range( 0 ) ), false );
  std::vector< std::shared_ptr< IHandlerCallback > > Handlers;
  std::uint64_t Sum = 0;
  for ( Store::VStoreEntry* const pEntry : Handles )
  {
    Handlers.push_back( pStore->RegisterHandler( { { pEntry }, {} } ) );
    Handlers.back()->AddImmediateCallback(
        [&Sum]( IBitFlags< EChangeFlags > i_Flags, ChangeId )
        {
          Sum += i_Flags.Bits();
        },
        ChangeMask::All );
  }
  std::int32_t Value = 0;
  for ( auto Turn : io_rState )
  {
    const VStoreWriteScope Scope( *pStore );
    (void)Scope->SetValue( Handles.back(), Int( ++Value ) );
  }
  benchmark::DoNotOptimize( Sum );
  for ( const auto& rpHandler : Handlers )
  {
    rpHandler->RemoveAllCallbacks();
  }
}
BENCHMARK( AmongHandlers )->Name( "store/change_among_handlers" )->Arg( 1 )->Arg( 1000 );

/// So many patterns with wildcards against 10000 new entries.
void PatternsAndNewEntries( benchmark::State& io_rState )
{
  const auto pStore = Store::CreateStore( nullptr, 131072 );
  std::vector< std::shared_ptr< IHandlerCallback > > Handlers;
  for ( std::int64_t Pattern = 0; Pattern < io_rState.range( 0 ); ++Pattern )
  {
    Handlers.push_back( pStore->RegisterHandler(
        { {}, { "*/Device" + std::to_string( Pattern % 100 ) + "/*/x" + std::to_string( Pattern ) } } ) );
  }
  std::vector< Store::VStoreEntry* > Handles;
  for ( int Key = 0; Key < 10000; ++Key )
  {
    Handles.push_back( pStore->GetEntry( "Group" + std::to_string( Key / 1000 ) + "/Device" +
                                         std::to_string( Key / 10 % 100 ) + "/Key" + std::to_string( Key % 10 ) + "/x" +
                                         std::to_string( Key % 1000 ) ) );
  }
  for ( auto Turn : io_rState )
  {
    {
      const VStoreWriteScope Scope( *pStore );
      for ( Store::VStoreEntry* const pEntry : Handles )
      {
        (void)Scope->SetValue( pEntry, Int( 1 ) );
      }
    }
    io_rState.PauseTiming();
    {
      const VStoreWriteScope Scope( *pStore );
      (void)Scope->RemoveEntry( pStore->GetRootEntry() );
    }
    io_rState.ResumeTiming();
  }
}
BENCHMARK( PatternsAndNewEntries )
    ->Name( "store/patterns_new_entries" )
    ->Arg( 0 )
    ->Arg( 1000 )
    ->Unit( benchmark::kMillisecond );

/// Bytes of an entry as the allocator counts them, its path and place among its siblings with it: without a value,
/// with an Int32, with extras.
void EntryBytes( benchmark::State& io_rState )
{
  constexpr std::size_t Count = 20000;
  double Bytes[3] = {};
  for ( auto Turn : io_rState )
  {
    for ( int Kind = 0; Kind < 3; ++Kind )
    {
      const auto pStore = Store::CreateStore( nullptr, 1024 );
      const std::size_t Before = mallinfo2().uordblks;
      // Scope by scope, so that pending records are few.
      const auto Handles = MakeSiblings( *pStore, Count, false );
      for ( std::size_t First = 0; First < Count; First += 100 )
      {
        const VStoreWriteScope Scope( *pStore );
        for ( std::size_t Place = First; Place < First + 100; ++Place )
        {
          Kind == 0 ? Scope->Touch( Handles[Place] ) : (void)Scope->SetValue( Handles[Place], Int( 1 ) );
          if ( Kind == 2 )
          {
            Scope->SetExtraText1( Handles[Place], "short" );
          }
        }
      }
      Bytes[Kind] = static_cast< double >( mallinfo2().uordblks - Before - Count * sizeof( void* ) ) / Count;
    }
  }
  io_rState.counters["bytes_without_value"] = Bytes[0];
  io_rState.counters["bytes_with_int32"] = Bytes[1];
  io_rState.counters["bytes_with_extras"] = Bytes[2];
}
BENCHMARK( EntryBytes )->Name( "store/entry_bytes" )->Iterations( 1 );
} // namespace
