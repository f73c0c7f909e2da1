// The standard scene through the real path: states, feeds, scene, frame. `submit` and `still` are meant for Mesa's
// empty driver (GALLIUM_NOOP=1), which leaves what the processor does; `frame` draws in full. Nothing is selected.
// Picks are timed alone, from the off-screen target's binding to the resolved items, after a moved frame was drawn.

#include "../scene/Allocations.h"
#include "../support/VOffscreen.h"
#include "BruteForcePick.h"
#include "StandardScene.h"

#include <benchmark/benchmark.h>

#include <QtGui/QGuiApplication>
#include <QtGui/QOpenGLFunctions>

#include <algorithm>
#include <chrono>
#include <sstream>

namespace
{
using namespace SubjectsBench;

/// Made by main, because it must go before the application object.
BenchSupport::VOffscreen* pOffscreen = nullptr;

enum EMotion
{
  EStill, ///< the same state, handed in again
  EMoving
};

void Draw( VStandardView& io_rView )
{
  pOffscreen->Target().bind();
  io_rView.Frame.Render( pOffscreen->Target() );
  QOpenGLContext::currentContext()->functions()->glFinish();
}

void Play( VStandardView& io_rView, int i_Frame )
{
  io_rView.pScene->Show( i_Frame );
  Draw( io_rView );
}

/// What is drawn in one repetition after another: a repetition is one frame, so that the median is that of frames.
struct VRun
{
  VStandardView* pView = nullptr;
  int Frame = 0;
  double Frames = 0, Allocations = 0, Uploaded = 0;

  /// The view, after two rounds of frames in its first repetition.
  VStandardView& Warm( int i_Scale )
  {
    if ( !std::exchange( pView, &StandardView( i_Scale ) ) )
    {
      pView->Frame.Input().bReporting = false;
      for ( ; Frame < 2 * FrameCount; ++Frame )
      {
        Play( *pView, Frame );
      }
      Play( *pView, Frame );
    }
    return *pView;
  }
};

using VClock = std::chrono::steady_clock;

double Since( VClock::time_point i_Start )
{
  return std::chrono::duration< double >( VClock::now() - i_Start ).count();
}

void Run( benchmark::State& io_rState, const std::shared_ptr< VRun >& i_rpRun, int i_Scale, EMotion i_Motion )
{
  VRun& rRun = *i_rpRun;
  VStandardView& rView = rRun.Warm( i_Scale );
  for ( auto _ : io_rState )
  {
    const std::uint64_t Before = SceneBench::AllocationCount();
    rRun.Frame += i_Motion;
    const VClock::time_point Start = VClock::now();
    Play( rView, rRun.Frame );
    io_rState.SetIterationTime( Since( Start ) );
    rRun.Frames += 1;
    rRun.Allocations += static_cast< double >( SceneBench::AllocationCount() - Before );
    rRun.Uploaded += static_cast< double >( rView.Frame.Figures().BytesUploaded );
  }
  io_rState.counters["allocations"] = rRun.Allocations / rRun.Frames;
  io_rState.counters["bytes_uploaded"] = rRun.Uploaded / rRun.Frames;
  io_rState.counters["draw_calls"] = static_cast< double >( rView.Frame.Figures().DrawCalls );
  io_rState.counters["ids"] = rView.pScene->Registry().NextId() - 1;
}

/// Picks in the frame that was drawn last; gives the seconds that the pick took.
double Pick( VStandardView& io_rView, int i_Mode, QPoint i_Start, QPoint i_Pointer )
{
  MoxelGraphics::VFrameInput& rInput = io_rView.Frame.Input();
  rInput.bReporting = true;
  rInput.PickMode = i_Mode;
  rInput.BandStart = i_Start;
  rInput.Pointer = i_Pointer;
  Draw( io_rView );
  rInput.PickMode = MoxelGraphics::EPickNone;
  return io_rView.Frame.Figures().SelectMs * 1e-3;
}

double PickPoint( VStandardView& io_rView, int i_Frame )
{
  const QPoint Pointer( 560 + i_Frame % FrameCount, 420 );
  return Pick( io_rView, MoxelGraphics::EPickClick, Pointer, Pointer );
}

/// Of the frame, y down.
const QRect BandArea( 440, 210, 400, 300 );

double PickBand( VStandardView& io_rView, int )
{
  const QPoint Far( BandArea.x() + BandArea.width(), BandArea.y() + BandArea.height() );
  return Pick( io_rView, MoxelGraphics::EPickBandDone, BandArea.topLeft(), Far );
}

/// Says which ids the band misses, or has too many, in that frame; empty when it has all.
std::string CompareBand( VStandardView& io_rView, int i_Frame )
{
  Play( io_rView, i_Frame );
  PickBand( io_rView, i_Frame );
  std::vector< std::uint32_t > Found = io_rView.Frame.Result().Ids;
  std::sort( Found.begin(), Found.end() );
  const std::vector< std::uint32_t > All = WalkBand( io_rView, BandArea );
  std::vector< std::uint32_t > Missed, Added;
  std::set_difference( All.begin(), All.end(), Found.begin(), Found.end(), std::back_inserter( Missed ) );
  std::set_difference( Found.begin(), Found.end(), All.begin(), All.end(), std::back_inserter( Added ) );
  std::ostringstream Text;
  if ( !Missed.empty() || !Added.empty() || Found.empty() )
  {
    const auto List = [&]( const char* i_pWhat, const std::vector< std::uint32_t >& i_rIds )
    {
      Text << i_pWhat;
      for ( const std::uint32_t Id : i_rIds )
      {
        Text << ' ' << Id;
      }
    };
    Text << "frame " << i_Frame << ": " << Found.size() << " found";
    List( ", missed", Missed );
    List( ", too many", Added );
  }
  return Text.str();
}

using VPick = double ( * )( VStandardView&, int );

void RunPick( benchmark::State& io_rState, const std::shared_ptr< VRun >& i_rpRun, VPick i_pPick )
{
  VRun& rRun = *i_rpRun;
  const bool bFirst = !rRun.pView;
  VStandardView& rView = rRun.Warm( 1 );
  if ( bFirst && i_pPick == PickBand )
  {
    for ( int Compared = 0; Compared < FrameCount; Compared += 20 )
    {
      if ( const std::string Text = CompareBand( rView, Compared ); !Text.empty() )
      {
        io_rState.SkipWithError( Text.c_str() );
        return;
      }
    }
  }
  for ( auto _ : io_rState )
  {
    rView.Frame.Input().bReporting = false;
    Play( rView, rRun.Frame );
    io_rState.SetIterationTime( i_pPick( rView, rRun.Frame++ ) );
  }
  const MoxelGraphics::VPickResult& rResult = rView.Frame.Result();
  io_rState.counters["ids"] = static_cast< double >( rResult.Ids.size() );
  io_rState.counters["layers"] = rResult.Layers;
}

template < typename... TArguments >
benchmark::internal::Benchmark* Add( const std::string& i_rName, int i_Frames, TArguments... i_Arguments )
{
  return benchmark::RegisterBenchmark( i_rName.c_str(), i_Arguments... )
      ->Iterations( 1 )
      ->Repetitions( i_Frames )
      ->UseManualTime()
      ->ReportAggregatesOnly();
}

void AddAll()
{
  const auto New = []
  {
    return std::make_shared< VRun >();
  };
  for ( const int Scale : { 1, 10 } )
  {
    const std::string End = std::string( "S" ).append( std::to_string( Scale ) );
    Add( std::string( "scene/submit/" ).append( End ), 10 * FrameCount, Run, New(), Scale, EMoving )
        ->Unit( benchmark::kMicrosecond );
    Add( std::string( "scene/still/" ).append( End ), 10 * FrameCount, Run, New(), Scale, EStill )
        ->Unit( benchmark::kMicrosecond );
    Add( std::string( "scene/frame/" ).append( End ), FrameCount, Run, New(), Scale, EMoving )
        ->Unit( benchmark::kMillisecond );
  }
  Add( "pick/point", FrameCount, RunPick, New(), PickPoint )->Unit( benchmark::kMicrosecond );
  Add( "pick/band", FrameCount, RunPick, New(), PickBand )->Unit( benchmark::kMicrosecond );
}
} // namespace

int main( int i_Count, char** i_ppArguments )
{
  QGuiApplication Application( i_Count, i_ppArguments );
  BenchSupport::VOffscreen Offscreen( Width, Height );
  pOffscreen = &Offscreen;
  benchmark::Initialize( &i_Count, i_ppArguments );
  AddAll();
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
