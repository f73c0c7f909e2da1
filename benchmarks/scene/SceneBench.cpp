// Moving reconstructions through the real path: state, feed, scene, frame. `submit` and `still` are meant for Mesa's
// empty driver (GALLIUM_NOOP=1), which leaves what the processor does; `frame` draws in full. The floor's names end
// alike, so that a ratio pairs them.

#include "Allocations.h"
#include "SceneSetup.h"

#include <benchmark/benchmark.h>

#include <QtGui/QGuiApplication>
#include <QtGui/QOpenGLFunctions>

namespace
{
using namespace SceneBench;

/// Made by main, because it must go before the application object.
VOffscreen* pOffscreen = nullptr;

VOffscreen& Offscreen()
{
  return *pOffscreen;
}

struct VView
{
  explicit VView( std::size_t i_Count )
    : pScene( std::make_shared< VReconstructionScene >( VPopulation{ i_Count, 0 } ) )
    , Frame( pScene, std::make_shared< CoreGraphics::VCameraController >() )
  {
    Frame.Controller().SetSize( { Width, Height } );
    Frame.Resize( { Width, Height } );
  }

  void Draw( int i_Frame, bool i_bNew )
  {
    if ( i_bNew )
    {
      pScene->Show( i_Frame );
    }
    Offscreen().Target().bind();
    Frame.Render( Offscreen().Target() );
    QOpenGLContext::currentContext()->functions()->glFinish();
  }

  std::shared_ptr< VReconstructionScene > pScene;
  MoxelGraphics::VSceneFrame Frame;
};

void Run( benchmark::State& io_rState, bool i_bNew )
{
  VView View( static_cast< std::size_t >( io_rState.range( 0 ) ) );
  int Frame = 0;
  for ( ; Frame < FrameCount; ++Frame )
  {
    View.Draw( Frame, true );
  }
  const std::uint64_t Before = AllocationCount();
  std::uint64_t Uploaded = 0;
  for ( auto _ : io_rState )
  {
    View.Draw( Frame++, i_bNew );
    Uploaded += View.Frame.Figures().BytesUploaded;
  }
  const auto Frames = static_cast< double >( io_rState.iterations() );
  io_rState.counters["allocations"] = static_cast< double >( AllocationCount() - Before ) / Frames;
  io_rState.counters["bytes_uploaded"] = static_cast< double >( Uploaded ) / Frames;
  io_rState.counters["draw_calls"] = static_cast< double >( View.Frame.Figures().DrawCalls );
}

void Floor( benchmark::State& io_rState )
{
  VSphereFloor Floor( static_cast< std::size_t >( io_rState.range( 0 ) ) );
  Offscreen().Target().bind();
  int Frame = 0;
  for ( auto _ : io_rState )
  {
    Floor.Draw( Frame++ );
    QOpenGLContext::currentContext()->functions()->glFinish();
  }
}
} // namespace

BENCHMARK_CAPTURE( Run, submit, true )->Name( "scene/recons/submit" )->Arg( 1000 )->Arg( 10000 );
BENCHMARK( Floor )->Name( "scene/recons/floor_submit" )->Arg( 1000 )->Arg( 10000 );
BENCHMARK_CAPTURE( Run, still, false )->Name( "scene/recons/still" )->Arg( 1000 )->Arg( 10000 );
BENCHMARK_CAPTURE( Run, frame, true )
    ->Name( "scene/recons/frame" )
    ->Arg( 1000 )
    ->Arg( 10000 )
    ->Unit( benchmark::kMillisecond );
BENCHMARK( Floor )->Name( "scene/recons/floor_frame" )->Arg( 1000 )->Arg( 10000 )->Unit( benchmark::kMillisecond );

int main( int i_Count, char** i_ppArguments )
{
  QGuiApplication Application( i_Count, i_ppArguments );
  VOffscreen The( Width, Height );
  pOffscreen = &The;
  benchmark::Initialize( &i_Count, i_ppArguments );
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
