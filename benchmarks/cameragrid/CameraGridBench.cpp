// The tiles of 128 cameras with their centroids and grey blobs, through the real path: state, provider, scene, tiles,
// frame. `frame` draws in full; `submit` and `unchanged` are meant for Mesa's empty driver (GALLIUM_NOOP=1), which
// leaves what the processor does. `unchanged` draws the same state again. `lens` corrects all data for the lens;
// `grow` has other numbers of cameras and of centroids and blobs a camera.

#include "../scene/Allocations.h"
#include "CameraGridSetup.h"

#include <CoreGraphics/VCameraController.h>
#include <MoxelGraphics/VSceneFrame.h>

#include <benchmark/benchmark.h>

#include <QtGui/QGuiApplication>
#include <QtGui/QImage>
#include <QtGui/QOpenGLFunctions>

#include <cstdlib>

namespace
{
using namespace CameraGridBench;

/// Made by main, because it must go before the application object.
VOffscreen* pOffscreen = nullptr;

struct VView
{
  explicit VView( const VWorkload& i_rWorkload )
    : pScene( std::make_shared< VCameraScene >( i_rWorkload ) )
    , Frame( pScene, std::make_shared< CoreGraphics::VCameraController >() )
  {
    Frame.Controller().SetSize( { Width, Height } );
    Frame.Resize( { Width, Height } );
    MoxelGraphics::VFrameInput& rInput = Frame.Input();
    rInput.Options.CameraView = true;
    rInput.Options.Show3DOverlay = i_rWorkload.bLens;
    rInput.Options.Video = false;
    rInput.Options.CameraBorder = false;
    rInput.Tiles = MakeTiles( i_rWorkload.Cameras );
  }
  void Draw( int i_Frame, bool i_bNew )
  {
    if ( i_bNew )
    {
      pScene->Show( i_Frame );
    }
    pOffscreen->Target().bind();
    Frame.Render( pOffscreen->Target() );
    QOpenGLContext::currentContext()->functions()->glFinish();
  }

  std::shared_ptr< VCameraScene > pScene;
  MoxelGraphics::VSceneFrame Frame;
};

void Run( benchmark::State& io_rState, const VWorkload& i_rWorkload, bool i_bNew )
{
  VView View( i_rWorkload );
  int Frame = 0;
  for ( ; Frame < FrameCount; ++Frame )
  {
    View.Draw( Frame, true );
  }
  if ( std::getenv( "HARROW_BENCH_PICTURE" ) )
  {
    pOffscreen->Target().toImage().save( QString::fromLocal8Bit( std::getenv( "HARROW_BENCH_PICTURE" ) ) );
  }
  const std::uint64_t Before = SceneBench::AllocationCount();
  std::uint64_t Uploaded = 0;
  for ( auto _ : io_rState )
  {
    View.Draw( Frame++, i_bNew );
    Uploaded += View.Frame.Figures().BytesUploaded;
  }
  const auto Frames = static_cast< double >( io_rState.iterations() );
  io_rState.counters["allocations"] = static_cast< double >( SceneBench::AllocationCount() - Before ) / Frames;
  io_rState.counters["bytes_uploaded"] = static_cast< double >( Uploaded ) / Frames;
  io_rState.counters["draw_calls"] = static_cast< double >( View.Frame.Figures().DrawCalls );
}

void Grow( benchmark::State& io_rState )
{
  const auto Objects = static_cast< int >( io_rState.range( 1 ) );
  Run( io_rState, { static_cast< int >( io_rState.range( 0 ) ), Objects, Objects * 10 / 128, false }, true );
}
} // namespace

BENCHMARK_CAPTURE( Run, frame, VWorkload{}, true )->Name( "cameras2d/frame" )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( Run, submit, VWorkload{}, true )->Name( "cameras2d/submit" )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( Run, unchanged, VWorkload{}, false )->Name( "cameras2d/unchanged" )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( Run, lens, VWorkload{ 128, 128, 10, true }, true )
    ->Name( "cameras2d/lens_frame" )
    ->Unit( benchmark::kMillisecond );
BENCHMARK( Grow )
    ->Name( "cameras2d/grow/submit" )
    ->Args( { 32, 128 } )
    ->Args( { 128, 128 } )
    ->Args( { 512, 128 } )
    ->Args( { 128, 512 } )
    ->Unit( benchmark::kMillisecond );

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
