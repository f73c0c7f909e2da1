// What the names of markers cost beside the markers themselves, in the same frames: 530 moving spheres, the names of
// the same points, all shown (`all`) or as many as a view shows at first (`usual`). `submit` is meant for Mesa's empty
// driver (GALLIUM_NOOP=1), which leaves what the processor does; `frame` draws in full; `still` moves nothing.

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

#include <cmath>

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
    Move( 0 );
  }
  void Move( int i_Frame )
  {
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
      m_Labels.Draw( io_rContext, { 13, 20000, m_What == EAllNames ? int( Count ) : 150, 0 } );
    }
  }

private:
  VMoxelScene& m_rScene;
  const EWhat m_What;
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

void Run( benchmark::State& io_rState, EWhat i_What, bool i_bMoving )
{
  const auto pScene = std::make_shared< VScene >( i_What );
  VSceneFrame Frame( pScene, std::make_shared< CoreGraphics::VCameraController >() );
  Frame.Resize( Size );
  const auto Draw = [&]( int i_Number )
  {
    if ( i_bMoving && pScene->pType )
    {
      pScene->pType->Move( i_Number );
    }
    pOffscreen->Target().bind();
    Frame.Render( pOffscreen->Target() );
    QOpenGLContext::currentContext()->functions()->glFinish();
  };
  int Number = 0;
  for ( ; Number < 60; ++Number )
  {
    Draw( Number );
  }
  const std::uint64_t Before = SceneBench::AllocationCount();
  std::uint64_t Uploaded = 0;
  for ( auto _ : io_rState )
  {
    Draw( ++Number );
    Uploaded += Frame.Figures().BytesUploaded;
  }
  const auto Frames = static_cast< double >( io_rState.iterations() );
  io_rState.counters["allocations"] = static_cast< double >( SceneBench::AllocationCount() - Before ) / Frames;
  io_rState.counters["bytes_uploaded"] = static_cast< double >( Uploaded ) / Frames;
  io_rState.counters["draw_calls"] = static_cast< double >( Frame.Figures().DrawCalls );
}
} // namespace

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
