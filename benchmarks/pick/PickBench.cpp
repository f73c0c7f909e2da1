// Picks among moving reconstructions, as a view makes them: in a frame of its own after a moved one was drawn. Timed
// is the pick alone, from the off-screen target's binding to the resolved items. The floor's names end alike.

#include "PickFloor.h"

#include <CoreGraphics/VRenderContext.h>

#include <benchmark/benchmark.h>

#include <QtGui/QGuiApplication>
#include <QtGui/QOpenGLFunctions>

#include <algorithm>
#include <chrono>

namespace
{
using namespace SceneBench;

constexpr VPopulation Spheres{ 1000, 530 };
/// Of the frame, y down.
const QRect BandArea( 440, 210, 400, 300 );
constexpr int PointerRow = 300;

/// Made by main, because it must go before the application object.
VOffscreen* pOffscreen = nullptr;

QPoint PointerAt( int i_Frame )
{
  return { 560 + i_Frame % FrameCount, PointerRow };
}

void Finish()
{
  QOpenGLContext::currentContext()->functions()->glFinish();
}

struct VView
{
  VView()
    : pScene( std::make_shared< VReconstructionScene >( Spheres ) )
    , Frame( pScene, std::make_shared< CoreGraphics::VCameraController >() )
  {
    Frame.Controller().SetSize( { Width, Height } );
    Frame.Resize( { Width, Height } );
    Frame.Input().Options.ReconstructedRadius = true;
    // The floor's picture has neither.
    Frame.Input().Options.FloorGrid = false;
    Frame.Input().Options.GlobalAxis = false;
    Frame.Input().bReporting = true;
    Moved( 0 );
  }

  void Draw( int i_Mode )
  {
    Frame.Input().PickMode = i_Mode;
    pOffscreen->Target().bind();
    Frame.Render( pOffscreen->Target() );
    Finish();
  }
  void Moved( int i_Frame )
  {
    pScene->Show( i_Frame );
    Draw( MoxelGraphics::EPickNone );
  }
  /// Picks in the frame that was drawn last; gives the seconds that the pick took.
  double PickPoint( int i_Frame )
  {
    Frame.Input().Pointer = PointerAt( i_Frame );
    Draw( MoxelGraphics::EPickClick );
    return Frame.Figures().SelectMs * 1e-3;
  }
  double PickBand()
  {
    Frame.Input().BandStart = BandArea.topLeft();
    Frame.Input().Pointer = BandArea.topLeft() + QPoint( BandArea.width(), BandArea.height() );
    Draw( MoxelGraphics::EPickBandDone );
    return Frame.Figures().SelectMs * 1e-3;
  }

  std::shared_ptr< VReconstructionScene > pScene;
  MoxelGraphics::VSceneFrame Frame;
};

struct VFloor
{
  PickBench::VPickFloor Floor = []
  {
    VView View;
    return PickBench::VPickFloor( Spheres, View.Frame.Context()->View(), View.Frame.Context()->Projection() );
  }();

  void Moved( int i_Frame )
  {
    pOffscreen->Target().bind();
    Floor.Draw( i_Frame );
    Finish();
  }
  template < typename TPick >
  static double Timed( TPick&& i_rPick )
  {
    const auto Start = std::chrono::steady_clock::now();
    i_rPick();
    return std::chrono::duration< double >( std::chrono::steady_clock::now() - Start ).count();
  }
  std::uint32_t Point( int i_Frame )
  {
    return Floor.Point( PointerAt( i_Frame ).x(), Height - PointerAt( i_Frame ).y() );
  }
  const std::vector< std::uint32_t >& Band()
  {
    return Floor.Band( BandArea.left(), Height - BandArea.top() - BandArea.height(), BandArea.left() + BandArea.width(),
                       Height - BandArea.top() );
  }
};

template < typename TRun, typename TPick >
void Run( benchmark::State& io_rState, TRun& io_rRun, TPick&& i_rPick )
{
  int Frame = 0;
  for ( ; Frame < FrameCount; ++Frame )
  {
    io_rRun.Moved( Frame );
    i_rPick( Frame );
  }
  std::size_t Ids = 0;
  for ( auto _ : io_rState )
  {
    io_rRun.Moved( Frame );
    const auto [Seconds, Count] = i_rPick( Frame++ );
    io_rState.SetIterationTime( Seconds );
    Ids += Count;
  }
  io_rState.counters["ids"] = static_cast< double >( Ids ) / static_cast< double >( io_rState.iterations() );
}

using VTimed = std::pair< double, std::size_t >;

void Point( benchmark::State& io_rState )
{
  VView View;
  Run( io_rState, View,
       [&]( int i_Frame )
       {
         const double Seconds = View.PickPoint( i_Frame );
         return VTimed( Seconds, View.Frame.Result().Selection.size() );
       } );
}

void FloorPoint( benchmark::State& io_rState )
{
  VFloor Floor;
  Run( io_rState, Floor,
       [&]( int i_Frame )
       {
         std::uint32_t Id = 0;
         const double Seconds = VFloor::Timed(
             [&]
             {
               Id = Floor.Point( i_Frame );
             } );
         return VTimed( Seconds, Id != 0 ? 1 : 0 );
       } );
}

void Band( benchmark::State& io_rState )
{
  VView View;
  int Layers = 0;
  Run( io_rState, View,
       [&]( int )
       {
         const double Seconds = View.PickBand();
         Layers = View.Frame.Result().Layers;
         return VTimed( Seconds, View.Frame.Result().Selection.size() );
       } );
  io_rState.counters["layers"] = Layers;
  // What the floor finds, which draws its spheres no larger than they are, has to be among it.
  std::vector< std::uint32_t > Found = View.Frame.Result().Ids;
  std::sort( Found.begin(), Found.end() );
  VFloor Floor;
  for ( int Frame = 0; Frame < FrameCount; ++Frame )
  {
    View.Moved( Frame );
    View.PickBand();
    Found = View.Frame.Result().Ids;
    std::sort( Found.begin(), Found.end() );
    Floor.Moved( Frame );
    std::vector< std::uint32_t > Least = Floor.Band();
    std::sort( Least.begin(), Least.end() );
    if ( !std::includes( Found.begin(), Found.end(), Least.begin(), Least.end() ) )
    {
      io_rState.SkipWithError( "the band misses what the floor finds" );
      return;
    }
  }
}

void FloorBand( benchmark::State& io_rState )
{
  VFloor Floor;
  Run( io_rState, Floor,
       [&]( int )
       {
         std::size_t Count = 0;
         const double Seconds = VFloor::Timed(
             [&]
             {
               Count = Floor.Band().size();
             } );
         return VTimed( Seconds, Count );
       } );
}
} // namespace

BENCHMARK( Point )->Name( "pick/spheres_point" )->UseManualTime()->Unit( benchmark::kMicrosecond );
BENCHMARK( FloorPoint )->Name( "pick/floor_spheres_point" )->UseManualTime()->Unit( benchmark::kMicrosecond );
BENCHMARK( Band )->Name( "pick/spheres_band" )->UseManualTime()->Unit( benchmark::kMicrosecond );
BENCHMARK( FloorBand )->Name( "pick/floor_spheres_band" )->UseManualTime()->Unit( benchmark::kMicrosecond );

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
