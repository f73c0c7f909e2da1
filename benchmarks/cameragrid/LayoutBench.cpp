// Laying cameras out as tiles. layout: a frame of another size; the floor is one division for each tile and each number
// of rows that leaves none empty, summed up. gesture: a turn of the wheel over one tile, and the tiles as the next
// frame draws them; the floor copies as many tiles.

#include <MoxelGraphics/VCameraGrid.h>

#include <QtGui/QWheelEvent>

#include <benchmark/benchmark.h>

namespace
{
using MoxelGraphics::VCameraGrid;

std::vector< MoxelGraphics::VCameraDefinition > Cameras( std::int64_t i_Count )
{
  std::vector< MoxelGraphics::VCameraDefinition > List( static_cast< std::size_t >( i_Count ) );
  for ( std::size_t Index = 0; Index < List.size(); ++Index )
  {
    List[Index].DeviceURN = "camera " + std::to_string( Index );
    List[Index].ImageWidth = Index % 3 == 0 ? 2048 : 1280;
    List[Index].ImageHeight = Index % 3 == 0 ? 1088 : 1024;
  }
  return List;
}

void Layout( benchmark::State& io_rState )
{
  VCameraGrid Grid( false );
  Grid.SetCameras( Cameras( io_rState.range( 0 ) ) );
  int Width = 1600;
  for ( auto _ : io_rState )
  {
    Width = Width == 1920 ? 1600 : Width + 1;
    Grid.Resize( { Width, 1080 }, 1.0f );
    benchmark::DoNotOptimize( Grid.Tiles().back().Rect );
  }
  io_rState.SetComplexityN( io_rState.range( 0 ) );
}
BENCHMARK( Layout )->Name( "layout" )->RangeMultiplier( 2 )->Range( 64, 512 )->Complexity();

void LayoutFloor( benchmark::State& io_rState )
{
  const std::vector< double > Aspects( static_cast< std::size_t >( io_rState.range( 0 ) ), 1.25 );
  double Cell = 1.0;
  for ( auto _ : io_rState )
  {
    double Best = 0.0;
    for ( std::size_t Rows = 1; Rows <= Aspects.size(); ++Rows )
    {
      const std::size_t Columns = ( Aspects.size() + Rows - 1 ) / Rows;
      if ( ( Rows - 1 ) * Columns >= Aspects.size() )
      {
        continue;
      }
      Cell += 1e-9;
      double Sum = 0.0;
      for ( const double Aspect : Aspects )
      {
        Sum += Cell / Aspect;
      }
      Best = std::max( Best, Sum );
    }
    benchmark::DoNotOptimize( Best );
  }
}
BENCHMARK( LayoutFloor )->Name( "layout/floor" )->Arg( 512 );

void Gesture( benchmark::State& io_rState )
{
  VCameraGrid Grid( false );
  Grid.SetCameras( Cameras( io_rState.range( 0 ) ) );
  Grid.Resize( { 1920, 1080 }, 1.0f );
  int Delta = 120;
  for ( auto _ : io_rState )
  {
    Delta = -Delta;
    const QPointF Place( 700, 500 );
    Grid.Wheel( QWheelEvent( Place, Place, {}, { 0, Delta }, {}, {}, Qt::NoScrollPhase, false ), 1.0 );
    benchmark::DoNotOptimize( Grid.Snapshot() );
  }
}
BENCHMARK( Gesture )->Name( "gesture" )->Arg( 128 )->Arg( 512 );

void GestureFloor( benchmark::State& io_rState )
{
  VCameraGrid Grid( false );
  Grid.SetCameras( Cameras( io_rState.range( 0 ) ) );
  for ( auto _ : io_rState )
  {
    MoxelGraphics::VCameraTiles Copy = Grid.Tiles();
    benchmark::DoNotOptimize( Copy.data() );
  }
}
BENCHMARK( GestureFloor )->Name( "gesture/floor" )->Arg( 128 )->Arg( 512 );
} // namespace
