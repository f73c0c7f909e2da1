// What the names of markers cost beside the markers themselves, in the same frames: 530 moving spheres, the names of
// the same points, as many as a view shows at first (`usual`) or as fit beside one another (`all`). A frame is a 60th
// of a second to the labels, so that they are chosen as often as in a window.
//
// `cost` draws a frame of nothing, one of markers and one of names in turn, and says in medians what the two add to
// nothing: `markers_us` and `names_us` of processor time, all threads together, and `names_per_marker`, the second by
// the first; `wall_...` the same by the clock on the wall, which is what a graphics card takes. With Mesa's empty
// driver (GALLIUM_NOOP=1) they are what the processor does to submit. `still` moves nothing.

#include "../scene/Allocations.h"
#include "../support/VOffscreen.h"

#include <CoreGraphics/ShaderResources.h>
#include <CoreGraphics/VCameraController.h>
#include <CoreGraphics/VRenderContext.h>
#include <MoxelGraphics/VLabelBatch.h>
#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneFrame.h>
#include <MoxelGraphics/VSphereHelper.h>

#include <benchmark/benchmark.h>

#include <QtGui/QGuiApplication>
#include <QtGui/QOpenGLFunctions>

#include <algorithm>
#include <array>
#include <chrono>
#include <cmath>
#include <ctime>

namespace
{
using namespace MoxelGraphics;

constexpr std::size_t Count = 530;
constexpr QSize Size( 1280, 720 );

BenchSupport::VOffscreen* pOffscreen = nullptr;

enum EWhat
{
  ENothing,
  ESpheres,
  EUsualNames,
  EAllNames
};

/// Ten performers of 53 markers, walking.
VScenePoint PointAt( std::size_t i_Index, int i_Frame )
{
  const auto Marker = static_cast< float >( i_Index % 53 ), Performer = static_cast< float >( i_Index / 53 );
  const float Phase = 0.05F * static_cast< float >( i_Frame ) + Marker;
  return { -2500 + 550 * Performer + 180 * std::sin( Phase ),
           300 * std::cos( 0.7F * Performer ) + 180 * std::cos( Phase ), 100 + 30 * Marker, 7 };
}

class VType : public IRenderType
{
public:
  VType( VMoxelScene& i_rScene, EWhat i_What )
    : m_rScene( i_rScene )
    , m_What( i_What )
    , m_Labels( i_rScene.Resources() )
  {
    std::vector< VLabelText > Texts;
    for ( std::size_t Index = 0; Index < Count; ++Index )
    {
      Texts.push_back( { "MK" + std::to_string( Index % 53 ), 0xFFE0E0FF } );
    }
    m_Labels.SetTexts( std::move( Texts ) );
    m_Labels.SetClock(
        [this]
        {
          return m_Frame / 60.0;
        } );
    Move( 0 );
  }
  void Move( int i_Frame )
  {
    m_Frame = i_Frame;
    m_Points.resize( Count );
    for ( std::size_t Index = 0; Index < Count; ++Index )
    {
      m_Points[Index] = PointAt( Index, i_Frame );
    }
    if ( m_What == ESpheres )
    {
      m_Spheres.SetSpheres( m_Points );
    }
    else if ( m_What != ENothing )
    {
      for ( std::size_t Index = 0; Index < Count; ++Index )
      {
        const VScenePoint& rPoint = m_Points[Index];
        m_Labels.Points()[Index] = { rPoint.X, rPoint.Y, rPoint.Z, rPoint.Radius };
      }
      m_Labels.Moved();
    }
  }
  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions&, std::uint32_t i_Pass ) override
  {
    if ( io_rContext.RenderMode() != ERenderModeNormal )
    {
      return;
    }
    if ( m_What == ESpheres && i_Pass == ERenderPassOpaque )
    {
      m_rScene.SphereHelper()->Draw( io_rContext, m_rScene, m_Spheres, {} );
    }
    else if ( m_What >= EUsualNames && i_Pass == ERenderPassOverlay )
    {
      m_Labels.Draw( io_rContext, { 13, 20000, m_What == EAllNames ? int( Count ) : VSceneOptions().LabelLimit, 0 } );
    }
  }

private:
  VMoxelScene& m_rScene;
  const EWhat m_What;
  int m_Frame = 0;
  VLabelBatch m_Labels;
  VSphereBatch m_Spheres;
  std::vector< VScenePoint > m_Points;
};

class VScene : public VMoxelScene
{
public:
  explicit VScene( EWhat i_What )
    : VMoxelScene( nullptr, nullptr, nullptr, nullptr, false )
    , m_What( i_What )
  {
  }
  void Initialise( CoreGraphics::VRenderContext& io_rContext ) override
  {
    VMoxelScene::Initialise( io_rContext );
    pType = std::make_shared< VType >( *this, m_What );
    m_RenderList = { pType };
  }
  std::shared_ptr< VType > pType;

private:
  const EWhat m_What;
};

/// A view of one kind of content.
class VView
{
public:
  explicit VView( EWhat i_What, bool i_bMoving = true )
    : m_bMoving( i_bMoving )
    , m_pScene( std::make_shared< VScene >( i_What ) )
    , m_Frame( m_pScene, std::make_shared< CoreGraphics::VCameraController >() )
  {
    m_Frame.Resize( Size );
    for ( int Number = 0; Number < 60; ++Number )
    {
      Draw();
    }
  }
  void Draw()
  {
    ++m_Number;
    if ( m_bMoving && m_pScene->pType )
    {
      m_pScene->pType->Move( m_Number );
    }
    pOffscreen->Target().bind();
    m_Frame.Render( pOffscreen->Target() );
    QOpenGLContext::currentContext()->functions()->glFinish();
  }
  const VFrameFigures& Figures() const { return m_Frame.Figures(); }

private:
  const bool m_bMoving;
  int m_Number = 0;
  std::shared_ptr< VScene > m_pScene;
  VSceneFrame m_Frame;
};

void Run( benchmark::State& io_rState, EWhat i_What, bool i_bMoving )
{
  VView View( i_What, i_bMoving );
  const std::uint64_t Before = SceneBench::AllocationCount();
  std::uint64_t Uploaded = 0;
  for ( auto _ : io_rState )
  {
    View.Draw();
    Uploaded += View.Figures().BytesUploaded;
  }
  const auto Frames = static_cast< double >( io_rState.iterations() );
  io_rState.counters["allocations"] = static_cast< double >( SceneBench::AllocationCount() - Before ) / Frames;
  io_rState.counters["bytes_uploaded"] = static_cast< double >( Uploaded ) / Frames;
  io_rState.counters["draw_calls"] = static_cast< double >( View.Figures().DrawCalls );
}

/// Of this process, all threads together, s.
double ProcessorSeconds()
{
  timespec Now{};
  clock_gettime( CLOCK_PROCESS_CPUTIME_ID, &Now );
  return static_cast< double >( Now.tv_sec ) + 1e-9 * static_cast< double >( Now.tv_nsec );
}
double WallSeconds()
{
  return std::chrono::duration< double >( std::chrono::steady_clock::now().time_since_epoch() ).count();
}

double Median( std::vector< double >& io_rValues )
{
  const auto Middle = io_rValues.begin() + static_cast< std::ptrdiff_t >( io_rValues.size() / 2 );
  std::nth_element( io_rValues.begin(), Middle, io_rValues.end() );
  return *Middle;
}

/// So many frames are one value: labels are chosen in one of them.
constexpr int FramesAValue = 12;

void Compare( benchmark::State& io_rState, EWhat i_Names )
{
  std::array< std::unique_ptr< VView >, 3 > Views{ std::make_unique< VView >( ENothing ),
                                                   std::make_unique< VView >( ESpheres ),
                                                   std::make_unique< VView >( i_Names ) };
  std::array< std::vector< double >, 3 > Processor, Wall;
  for ( auto _ : io_rState )
  {
    for ( std::size_t Which = 0; Which < Views.size(); ++Which )
    {
      const double Begin = ProcessorSeconds(), WallBegin = WallSeconds();
      for ( int Frame = 0; Frame < FramesAValue; ++Frame )
      {
        Views[Which]->Draw();
      }
      Processor[Which].push_back( ( ProcessorSeconds() - Begin ) / FramesAValue );
      Wall[Which].push_back( ( WallSeconds() - WallBegin ) / FramesAValue );
    }
  }
  for ( const auto& [pPrefix, rTimes] : { std::pair( "", std::ref( Processor ) ), { "wall_", std::ref( Wall ) } } )
  {
    auto& rAll = rTimes.get();
    const double Nothing = Median( rAll[0] ), Markers = Median( rAll[1] ) - Nothing,
                 Names = Median( rAll[2] ) - Nothing;
    const std::string Prefix = pPrefix;
    io_rState.counters[Prefix + "markers_us"] = 1e6 * Markers;
    io_rState.counters[Prefix + "names_us"] = 1e6 * Names;
    io_rState.counters[Prefix + "names_per_marker"] = Names / Markers;
  }
}
} // namespace

BENCHMARK_CAPTURE( Compare, 0, EUsualNames )->Name( "labels/cost/usual" );
BENCHMARK_CAPTURE( Compare, 1, EAllNames )->Name( "labels/cost/all" );
BENCHMARK_CAPTURE( Run, 0, ENothing, true )->Name( "labels/nothing/frame" );
BENCHMARK_CAPTURE( Run, 1, ESpheres, true )->Name( "labels/markers/frame" );
BENCHMARK_CAPTURE( Run, 2, EUsualNames, true )->Name( "labels/usual/frame" );
BENCHMARK_CAPTURE( Run, 3, EAllNames, true )->Name( "labels/all/frame" );
BENCHMARK_CAPTURE( Run, 4, ENothing, false )->Name( "labels/nothing/still" );
BENCHMARK_CAPTURE( Run, 5, ESpheres, false )->Name( "labels/markers/still" );
BENCHMARK_CAPTURE( Run, 6, EAllNames, false )->Name( "labels/all/still" );

int main( int i_Count, char** i_ppArguments )
{
  QGuiApplication Application( i_Count, i_ppArguments );
  CoreGraphics::InitBasicShaderResources();
  CoreGraphics::InitSceneShaderResources();
  BenchSupport::VOffscreen The( Size.width(), Size.height() );
  pOffscreen = &The;
  benchmark::Initialize( &i_Count, i_ppArguments );
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
