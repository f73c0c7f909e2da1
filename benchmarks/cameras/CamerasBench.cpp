// What cameras cost in a frame, with 128 of them and 128 centroids each, through the real provider on real states.
// update_same: nothing changed; update_moved: new centroids; drawn: the same, and the buffers of every camera are asked
// for. The floor of an update compares as many ids as there are items, that of the buffers copies as many vertices.
// The lens: a point through the exact inverse, and through the polynomial alone.

#include "../scene/Allocations.h"

#include <ComputeCameraModel/VRadialDistortion.h>
#include <CoreMoxelTypes/FlowTypes.h>
#include <Flow2Graphics/VFlowRenderCameraProvider.h>
#include <Flow2Graphics/VFlowScene.h>
#include <HostFlow/VFlowFramework.h>

#include <benchmark/benchmark.h>

#include <cstdlib>
#include <random>

using namespace CoreMoxelTypes;

namespace
{
constexpr int CameraCount = 128, CentroidCount = 128, StateCount = 8, KindCount = 7;

/// A scene that nobody draws.
class VScene : public Flow2Graphics::VFlowScene
{
public:
  VScene()
    : VFlowScene( nullptr, nullptr, nullptr, nullptr, false )
  {
  }

protected:
  ZEK::VFlowStateRef FetchState() override { return {}; }
};

class VCameras
{
public:
  VCameras()
  {
    for ( int Camera = 0; Camera < CameraCount; ++Camera )
    {
      const std::string Name = "camera " + std::to_string( Camera );
      VCameraHardware Hardware;
      Hardware.SensorWidth = 1280;
      Hardware.SensorHeight = 720;
      VCameraCalibration Calibration;
      Calibration.FocalLength = 1400;
      Calibration.Rotation = { 1.4, 0.01 * Camera, 0 };
      Calibration.RadialParameters = { -1e-7, 2e-14 };
      Calibration.DistortionCentre[0] = Calibration.PrincipalPoint[0] = 640;
      Calibration.DistortionCentre[1] = Calibration.PrincipalPoint[1] = 360;
      Add< FlowCameraHardware >( Hardware, Name );
      Add< FlowCameraCalibration >( Calibration, Name );
      Add< FlowCameraSettings >( {}, Name );
      Add< FlowCameraMaskGrid >( {}, Name );
      Add< FlowGreyscaleBlobSet >( {}, Name );
      Add< FlowEdgePairSet >( {}, Name );
    }
    for ( int Number = 0; Number < StateCount; ++Number )
    {
      States.push_back( Make( Number ) );
    }
  }
  void Show( std::size_t i_State )
  {
    Scene.Registry().Reset();
    Provider.Update( *States[i_State % States.size()] );
  }

  std::vector< ZEK::VFlowStateRef > States;
  VScene Scene;
  Flow2Graphics::VFlowRenderCameraProvider Provider{ Scene };

private:
  template < typename TFlow >
  ZEK::VFlowItemRef Item( const typename ZEK::FlowValueType< TFlow >::type& i_rValue, const std::string& i_rName )
  {
    ZEK::IResult Status;
    ZEK::VFlowItemRef New;
    m_Store->CreateItem( Status, ZEK::FlowValueType< TFlow >::Descriptor, New );
    *ZEK::FlowMutablePayload< typename ZEK::FlowValueType< TFlow >::type >( New.Get() ) = i_rValue;
    New->MutableValue().SetName( ZEK::EFlowNameDevice, i_rName );
    return New;
  }
  template < typename TFlow >
  void Add( const typename ZEK::FlowValueType< TFlow >::type& i_rValue, const std::string& i_rName )
  {
    m_Slow.push_back( Item< TFlow >( i_rValue, i_rName ) );
  }
  ZEK::VFlowStateRef Make( int i_Number )
  {
    ZEK::VFlowStateRef State;
    if ( m_Factory->CreateState( State, { 0, 1, 1 }, {}, {} ).IsError() )
    {
      std::abort();
    }
    for ( const ZEK::VFlowItemRef& rItem : m_Slow )
    {
      State->AddItem( rItem );
    }
    std::mt19937 Random( static_cast< std::uint32_t >( i_Number ) );
    for ( int Camera = 0; Camera < CameraCount; ++Camera )
    {
      VCentroidSet Set;
      for ( int Centroid = 0; Centroid < CentroidCount; ++Centroid )
      {
        Set.Centroids.push_back(
            { static_cast< float >( Random() % 1280 ), static_cast< float >( Random() % 720 ), 4 } );
      }
      State->AddItem( Item< FlowCentroidSet >( Set, "camera " + std::to_string( Camera ) ) );
    }
    return State;
  }

  ZEK::VFlowStateFactoryRef m_Factory = HostFlow::MakeStateFactory();
  ZEK::VFlowStoreRef m_Store = HostFlow::MakeItemStore();
  std::vector< ZEK::VFlowItemRef > m_Slow;
};

/// Runs the frames and counts what they allocate.
template < typename TFrame >
void Run( benchmark::State& io_rState, TFrame&& i_rFrame )
{
  for ( std::size_t Frame = 0; Frame < 2 * StateCount; ++Frame )
  {
    i_rFrame( Frame );
  }
  std::size_t Frame = 0;
  const std::uint64_t Before = SceneBench::AllocationCount();
  for ( auto Step : io_rState )
  {
    i_rFrame( Frame++ );
  }
  io_rState.counters["allocations"] = benchmark::Counter(
      static_cast< double >( SceneBench::AllocationCount() - Before ), benchmark::Counter::kAvgIterations );
}

void UpdateSame( benchmark::State& io_rState )
{
  VCameras Cameras;
  Run( io_rState,
       [&]( std::size_t )
       {
         Cameras.Show( 0 );
       } );
}
BENCHMARK( UpdateSame )->Name( "cameras/update_same" );

void UpdateMoved( benchmark::State& io_rState )
{
  VCameras Cameras;
  Run( io_rState,
       [&]( std::size_t i_Frame )
       {
         Cameras.Show( i_Frame );
       } );
}
BENCHMARK( UpdateMoved )->Name( "cameras/update_moved" );

void Drawn( benchmark::State& io_rState )
{
  VCameras Cameras;
  ZEK::VCameraLists2D Lists;
  ZEK::VDrawWords Colours;
  Run( io_rState,
       [&]( std::size_t i_Frame )
       {
         Cameras.Show( i_Frame );
         for ( const ZEK::VRenderCameraRef& rpCamera : Cameras.Provider.GetCameras() )
         {
           rpCamera->GetDrawData2D( rpCamera->GetInfo().FirstCentroidId, ZEK::EColourConnection, true, Lists, Colours );
           benchmark::DoNotOptimize( Lists.pCentroids->data() );
         }
       } );
}
BENCHMARK( Drawn )->Name( "cameras/drawn" );

void FloorUpdate( benchmark::State& io_rState )
{
  std::vector< ZEK::VFlowValueId > Held( CameraCount * KindCount ), New = Held;
  for ( auto Step : io_rState )
  {
    benchmark::DoNotOptimize( New.data() );
    bool bSame = true;
    for ( std::size_t Item = 0; Item < Held.size(); ++Item )
    {
      bSame = bSame && Held[Item] == New[Item];
    }
    benchmark::DoNotOptimize( bSame );
  }
}
BENCHMARK( FloorUpdate )->Name( "cameras/floor_update" );

void FloorDrawn( benchmark::State& io_rState )
{
  const std::vector< VCentroid > From( CameraCount * CentroidCount );
  std::vector< ZEK::VCentroidVertex > To( From.size() );
  for ( auto Step : io_rState )
  {
    for ( std::size_t Index = 0; Index < From.size(); ++Index )
    {
      To[Index] = { From[Index].x, From[Index].y, From[Index].radius, 0xFFFFFFFF };
    }
    benchmark::DoNotOptimize( To.data() );
    benchmark::ClobberMemory();
  }
}
BENCHMARK( FloorDrawn )->Name( "cameras/floor_drawn" );

/// Points all over a sensor, one an iteration.
template < typename TMap >
void Lens( benchmark::State& io_rState, TMap&& i_rMap )
{
  const ComputeCameraModel::VRadialDistortion Distortion( { 0, { -1e-7, 2e-14 }, { 640, 360 } } );
  std::vector< ComputeCameraModel::VImagePoint > Points;
  std::mt19937 Random( 1 );
  for ( int Point = 0; Point < 1024; ++Point )
  {
    Points.push_back( { static_cast< double >( Random() % 1280 ), static_cast< double >( Random() % 720 ) } );
  }
  std::size_t Next = 0;
  for ( auto Step : io_rState )
  {
    ComputeCameraModel::VImagePoint Out;
    i_rMap( Distortion, Points[Next++ % Points.size()], Out );
    benchmark::DoNotOptimize( Out );
  }
}
void Distort( benchmark::State& io_rState )
{
  Lens( io_rState,
        []( const auto& i_rLens, const auto& i_rPoint, auto& o_rOut )
        {
          benchmark::DoNotOptimize( i_rLens.Distort( i_rPoint, o_rOut ) );
        } );
}
BENCHMARK( Distort )->Name( "cameras/distort" );
void Correct( benchmark::State& io_rState )
{
  Lens( io_rState,
        []( const auto& i_rLens, const auto& i_rPoint, auto& o_rOut )
        {
          benchmark::DoNotOptimize( i_rLens.Correct( i_rPoint, o_rOut ) );
        } );
}
BENCHMARK( Correct )->Name( "cameras/correct" );
} // namespace
