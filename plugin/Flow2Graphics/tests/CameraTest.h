#pragma once

#include "FlowTestScene.h"

#include <Flow2Graphics/VFlowRenderCameraProvider.h>

#include <algorithm>

namespace FlowTest
{
using namespace CoreMoxelTypes;
using Flow2Graphics::VFlowRenderCamera;
using Flow2Graphics::VFlowRenderCameraProvider;
using ZEK::VFlowItemRef;

inline VCameraHardware Hardware()
{
  VCameraHardware Value;
  Value.DefaultDisplayType = "Plain";
  Value.SensorWidth = 1280;
  Value.SensorHeight = 1024;
  return Value;
}

inline VCameraCalibration Calibration( double i_Z = 1500 )
{
  VCameraCalibration Value;
  Value.Rotation = { -1.4, 0.3, 0.2 };
  Value.Position = { 3000, 0, i_Z };
  Value.PrincipalPoint[0] = 640;
  Value.PrincipalPoint[1] = 512;
  Value.RadialParameters = { -1e-7, 0 };
  Value.DistortionCentre[0] = 640;
  Value.DistortionCentre[1] = 512;
  Value.FocalLength = 1400;
  return Value;
}

inline VCentroidSet Centroids( std::size_t i_Count, float i_Step = 10 )
{
  VCentroidSet Set;
  for ( std::size_t Index = 0; Index < i_Count; ++Index )
  {
    Set.Centroids.push_back( { 100 + i_Step * static_cast< float >( Index ), 200, 4, static_cast< u32 >( Index ),
                               static_cast< u8 >( Index % 3 ), 0, 0 } );
  }
  return Set;
}

/// A provider in a scene of its own.
class VCameraFixture : public testing::Test
{
protected:
  void Show( const ZEK::VFlowStateRef& i_rState )
  {
    State = i_rState; // lives as long as what was taken from it is looked at
    Scene.Registry().Reset();
    pProvider->Update( *State );
  }
  void Show( const std::vector< VFlowItemRef >& i_rItems ) { Show( Maker.State( ++Frame, i_rItems ) ); }
  const VFlowRenderCamera& Camera( const std::string& i_rName )
  {
    const auto pCamera = pProvider->GetCamera( i_rName );
    EXPECT_TRUE( pCamera ) << i_rName;
    return dynamic_cast< const VFlowRenderCamera& >( *pCamera );
  }
  VFlowItemRef Hard( const std::string& i_rName ) { return Maker.Device< FlowCameraHardware >( Hardware(), i_rName ); }
  template < typename TFlow >
  VFlowItemRef Item( const typename ZEK::FlowValueType< TFlow >::type& i_rValue, const std::string& i_rName = "a" )
  {
    return Maker.Device< TFlow >( i_rValue, i_rName );
  }

  FlowTest::VMaker Maker;
  FlowTest::VScene Scene;
  std::shared_ptr< VFlowRenderCameraProvider > pProvider = std::make_shared< VFlowRenderCameraProvider >( Scene );
  ZEK::VFlowStateRef State;
  std::int64_t Frame = 0;
};

} // namespace FlowTest
