// One tree of a free root and 20 balls: 66 numbers in, 21 poses in the world out; 64 states in a loop. tree: LoadState
// of a subject; batch: Pose of all 64 states, the time of them all. The floor is the plain loop.

#include "Allocations.h"
#include "FkFloor.h"

#include <ComputeSubjectFK/VComputeSubjectFK.h>

#include <benchmark/benchmark.h>

#include <cmath>
#include <random>

using namespace ComputeSubject;

namespace
{
constexpr std::size_t StateCount = 64, Segments = FkFloor::Segments, Degrees = FkFloor::Degrees;

struct VWorkload
{
  std::vector< double > States;
  std::vector< FkFloor::VRigid > Fixed{ Segments };
  std::unique_ptr< VComputeSubjectFK > pSubject = std::make_unique< VComputeSubjectFK >();

  VWorkload()
  {
    std::mt19937 Random( 5 );
    std::uniform_real_distribution< double > Number( -1.2, 1.2 );
    for ( std::size_t Index = 0; Index < StateCount * Degrees; ++Index )
    {
      States.push_back( Number( Random ) );
    }
    for ( std::size_t Index = 0; Index < Segments; ++Index )
    {
      const double Vector[3] = { Number( Random ), Number( Random ), Number( Random ) };
      FkFloor::FromRotationVector( Vector, Fixed[Index].R );
      VJointRecord Record;
      Record.m_Type = Index == 0 ? EJointType::Free : EJointType::Ball;
      for ( std::size_t Axis = 0; Axis < 3; ++Axis )
      {
        Fixed[Index].T[Axis] = 100 * Number( Random );
        Record.m_Pre.m_Translation[Axis] = Fixed[Index].T[Axis];
      }
      std::copy_n( Fixed[Index].R, 9, Record.m_Pre.m_Rotation );
      const int Parent = FkFloor::Parents[Index];
      pSubject->AddSegment( Parent < 0 ? VComputeSubjectFK::NoParent : static_cast< std::size_t >( Parent ), Record );
    }
  }

  std::span< const double > State( std::size_t i_Index ) const
  {
    return std::span( States ).subspan( i_Index % StateCount * Degrees, Degrees );
  }

  /// Over all states and numbers; mm and elements of rotations.
  double LargestDifference() const
  {
    std::vector< FkFloor::VRigid > Plain( Segments );
    std::vector< VRigidTransform > Batch( StateCount * Segments );
    double Largest = pSubject->Pose( States, StateCount, Batch ).IsError() ? HUGE_VAL : 0;
    for ( std::size_t Index = 0; Index < StateCount; ++Index )
    {
      FkFloor::Plain( State( Index ).data(), Fixed.data(), Plain.data() );
      if ( pSubject->LoadState( State( Index ) ) != ZEK::IResult( ZEK::IResult::Ok ) )
      {
        return HUGE_VAL;
      }
      for ( std::size_t Segment = 0; Segment < Segments; ++Segment )
      {
        for ( const VRigidTransform& rSeen :
              { pSubject->WorldTransforms()[Segment], Batch[Index * Segments + Segment] } )
        {
          for ( int Element = 0; Element < 12; ++Element )
          {
            const double Seen = Element < 9 ? rSeen.m_Rotation[Element] : rSeen.m_Translation[Element - 9];
            const double Right = Element < 9 ? Plain[Segment].R[Element] : Plain[Segment].T[Element - 9];
            const double Difference = std::abs( Seen - Right );
            Largest = Difference <= Largest ? Largest : Difference;
          }
        }
      }
    }
    return Largest;
  }
};

void Tree( benchmark::State& i_rState )
{
  const VWorkload Work;
  const double Difference = Work.LargestDifference();
  if ( !( Difference <= 1e-12 ) )
  {
    i_rState.SkipWithError( "the poses are not those of the plain loop" );
    return;
  }
  std::size_t Index = 0;
  const std::uint64_t Before = SceneBench::AllocationCount();
  for ( auto _ : i_rState )
  {
    benchmark::DoNotOptimize( Work.pSubject->LoadState( Work.State( Index++ ) ) );
    benchmark::DoNotOptimize( Work.pSubject->WorldTransforms().data() );
    benchmark::ClobberMemory();
  }
  i_rState.counters["allocations"] = benchmark::Counter(
      static_cast< double >( SceneBench::AllocationCount() - Before ), benchmark::Counter::kAvgIterations );
  i_rState.counters["largest_difference_mm"] = Difference;
  i_rState.counters["segments"] = static_cast< double >( Work.pSubject->WorldTransforms().size() );
  i_rState.SetItemsProcessed( i_rState.iterations() );
}

void Batch( benchmark::State& i_rState )
{
  const VWorkload Work;
  std::vector< VRigidTransform > Poses( StateCount * Segments );
  for ( auto _ : i_rState )
  {
    benchmark::DoNotOptimize( Work.pSubject->Pose( Work.States, StateCount, Poses ) );
    benchmark::ClobberMemory();
  }
  i_rState.SetItemsProcessed( i_rState.iterations() * static_cast< std::int64_t >( StateCount ) );
}

void Floor( benchmark::State& i_rState )
{
  const VWorkload Work;
  std::vector< FkFloor::VRigid > World( Segments );
  std::size_t Index = 0;
  for ( auto _ : i_rState )
  {
    FkFloor::Plain( Work.State( Index++ ).data(), Work.Fixed.data(), World.data() );
    benchmark::ClobberMemory();
  }
  i_rState.SetItemsProcessed( i_rState.iterations() );
}

BENCHMARK( Tree )->Name( "fk/tree" );
BENCHMARK( Batch )->Name( "fk/batch_64" );
BENCHMARK( Floor )->Name( "fk/floor/plain" );
} // namespace
