// Reads and commits of the settings store with 10000 integer entries, created and visited in one fixed shuffled order.

#include <Store/Store.h>
#include <ZEK/Serialiser.h>
#include <ZEK/StoreValue.h>

#include <benchmark/benchmark.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <numeric>
#include <random>
#include <string>
#include <thread>
#include <vector>

using namespace ZEK;

namespace
{
constexpr std::size_t Keys = 10000;

struct VSettings
{
  std::shared_ptr< IStore > m_pStore = Store::CreateStore( nullptr, 131072 );
  std::vector< VEntryPath > m_Paths;
  std::vector< Store::VStoreEntry* > m_Handles;

  VSettings()
  {
    std::vector< int > Order( Keys );
    std::iota( Order.begin(), Order.end(), 0 );
    std::mt19937 Random( 3 );
    std::shuffle( Order.begin(), Order.end(), Random );
    const VStoreWriteScope Scope( *m_pStore );
    for ( const int Key : Order )
    {
      char Text[64];
      std::snprintf( Text, sizeof( Text ), "Group%02d/Device%03d/Key%d", Key / 1000, Key / 10 % 100, Key % 10 );
      m_Paths.emplace_back( Text );
      m_Handles.push_back( m_pStore->GetEntry( m_Paths.back() ) );
      (void)Scope->SetValue( m_Handles.back(), IO::MakeValue( std::int64_t( Key ) ) );
    }
  }
  void Commit( std::size_t i_First, std::size_t i_Count, std::int64_t i_Value ) const
  {
    const VStoreWriteScope Scope( *m_pStore );
    for ( std::size_t Key = i_First; Key < i_First + i_Count; ++Key )
    {
      (void)Scope->SetValue( m_Handles[Key], IO::MakeValue( i_Value ) );
    }
  }
};

/// Walks the keys round and round.
class VNext
{
public:
  explicit VNext( std::size_t i_Start = 0 )
    : m_At( i_Start )
  {
  }
  std::size_t operator()()
  {
    m_At = m_At + 1 == Keys ? 0 : m_At + 1;
    return m_At;
  }

private:
  std::size_t m_At;
};

std::int64_t ReadKey( const IStoreReader& i_rReader, Store::VStoreEntry* i_pEntry )
{
  std::int64_t Value = 0;
  (void)IO::ReadTyped( i_rReader.VerifiedValue( i_pEntry ), Value );
  return Value;
}

void ReadScoped( benchmark::State& io_rState )
{
  const VSettings Settings;
  VNext Next;
  std::int64_t Sum = 0;
  for ( auto Turn : io_rState )
  {
    const VStoreReadScope Scope( *Settings.m_pStore );
    Sum += ReadKey( *Scope, Settings.m_Handles[Next()] );
  }
  benchmark::DoNotOptimize( Sum );
}
BENCHMARK( ReadScoped )->Name( "store/read_scoped" );

void Read100( benchmark::State& io_rState )
{
  const VSettings Settings;
  VNext Next;
  std::int64_t Sum = 0;
  while ( io_rState.KeepRunningBatch( 100 ) )
  {
    const VStoreReadScope Scope( *Settings.m_pStore );
    for ( int Read = 0; Read < 100; ++Read )
    {
      Sum += ReadKey( *Scope, Settings.m_Handles[Next()] );
    }
  }
  benchmark::DoNotOptimize( Sum );
}
BENCHMARK( Read100 )->Name( "store/read_100" );

void ReadPath( benchmark::State& io_rState )
{
  const VSettings Settings;
  VNext Next;
  std::int64_t Sum = 0;
  for ( auto Turn : io_rState )
  {
    const VStoreReadScope Scope( *Settings.m_pStore );
    std::int64_t Value = 0;
    (void)ReadValue( *Scope, Settings.m_Paths[Next()], Value );
    Sum += Value;
  }
  benchmark::DoNotOptimize( Sum );
}
BENCHMARK( ReadPath )->Name( "store/read_path" );

/// Two readers with a scope a read while one writer commits 100 keys each millisecond.
void Contended( benchmark::State& io_rState )
{
  using VClock = std::chrono::steady_clock;
  const VSettings Settings;
  struct alignas( 64 ) VCount
  {
    std::atomic< std::uint64_t > m_Reads{ 0 };
  };
  std::atomic< bool > bStop{ false };
  std::array< VCount, 2 > Counts; // each written by its reader alone
  std::vector< std::thread > Readers;
  for ( std::size_t Reader = 0; Reader < Counts.size(); ++Reader )
  {
    Readers.emplace_back(
        [&, Reader]
        {
          VNext Next( Reader * 500 );
          std::int64_t Sum = 0;
          std::uint64_t Reads = 0;
          while ( !bStop.load( std::memory_order_relaxed ) )
          {
            for ( int Read = 0; Read < 64; ++Read )
            {
              const VStoreReadScope Scope( *Settings.m_pStore );
              Sum += ReadKey( *Scope, Settings.m_Handles[Next()] );
            }
            Counts[Reader].m_Reads.store( Reads += 64, std::memory_order_relaxed );
          }
          benchmark::DoNotOptimize( Sum );
        } );
  }
  std::vector< double > Commits;
  std::int64_t Value = 1000000;
  const auto CountReads = [&Counts]
  {
    return Counts[0].m_Reads + Counts[1].m_Reads;
  };
  const std::uint64_t Before = CountReads();
  for ( auto Turn : io_rState )
  {
    const VClock::time_point Begin = VClock::now();
    Settings.Commit( 0, 100, ++Value );
    Commits.push_back( std::chrono::duration< double, std::nano >( VClock::now() - Begin ).count() );
    std::this_thread::sleep_for( std::chrono::milliseconds( 1 ) );
  }
  io_rState.SetItemsProcessed( static_cast< std::int64_t >( CountReads() - Before ) );
  bStop = true;
  for ( std::thread& rReader : Readers )
  {
    rReader.join();
  }
  std::sort( Commits.begin(), Commits.end() );
  io_rState.counters["commit_median_ns"] = Commits[Commits.size() / 2];
  io_rState.counters["commit_p99_ns"] = Commits[Commits.size() * 99 / 100];
}
BENCHMARK( Contended )->Name( "store/contended" )->Iterations( 1000 )->UseRealTime();

/// One key with so many immediate callbacks of one handler.
void CommitOne( benchmark::State& io_rState, int i_Callbacks )
{
  const VSettings Settings;
  const auto pHandler = Settings.m_pStore->RegisterHandler( { { Settings.m_Handles[2] }, {} } );
  std::uint64_t Sum = 0;
  for ( int Callback = 0; Callback < i_Callbacks; ++Callback )
  {
    pHandler->AddImmediateCallback(
        [&Sum]( IBitFlags< EChangeFlags > i_Flags, ChangeId )
        {
          Sum += i_Flags.Bits();
          benchmark::ClobberMemory();
        },
        EChangeVerified );
  }
  std::int64_t Value = 1000000;
  for ( auto Turn : io_rState )
  {
    Settings.Commit( 2, 1, ++Value );
  }
  benchmark::DoNotOptimize( Sum );
  pHandler->RemoveAllCallbacks();
}
BENCHMARK_CAPTURE( CommitOne, 1, 1 )->Name( "store/commit_1_1" );
BENCHMARK_CAPTURE( CommitOne, 100, 100 )->Name( "store/commit_1_100" );

void CommitAll( benchmark::State& io_rState )
{
  const VSettings Settings;
  std::int64_t Value = 1000000;
  for ( auto Turn : io_rState )
  {
    Settings.Commit( 0, Keys, ++Value );
  }
}
BENCHMARK( CommitAll )->Name( "store/commit_10000" )->Unit( benchmark::kMicrosecond );
} // namespace
