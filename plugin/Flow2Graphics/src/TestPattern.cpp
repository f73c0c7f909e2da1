#include <Flow2Graphics/TestPattern.h>

#include "TestCamera.h"

#include <ZEK/FlowCacheFlags.h>
#include <ZEK/Log.h>

#include <cmath>
#include <numbers>

using namespace CoreMoxelTypes;

namespace Flow2Graphics
{
namespace
{
constexpr ZEK::VFlowTimeKey PatternKey{ 0, 2250000, 1 };
constexpr int CameraCount = 4;

void Fill( VWorldAxis& o_rAxis )
{
  o_rAxis.Up = 2; // Z
}

void Fill( VVolumeProperties& o_rVolume )
{
  o_rVolume.XMin = o_rVolume.YMin = -3000;
  o_rVolume.XMax = o_rVolume.YMax = 3000;
}

/// Three layers of five by five points, half a metre apart.
void Fill( VReconstructionSet& o_rSet )
{
  for ( int Point = 0; Point < 75; ++Point )
  {
    VReconstruction Reconstruction;
    Reconstruction.Id = static_cast< u32 >( Point );
    Reconstruction.Position = { 500.0 * ( Point % 5 - 2 ), 500.0 * ( Point / 5 % 5 - 2 ), 500.0 * ( Point / 25 + 1 ) };
    Reconstruction.Radius = 7;
    Reconstruction.Rays = CameraCount;
    o_rSet.Items.push_back( Reconstruction );
  }
}

void Fill( VDevice& o_rPlate )
{
  o_rPlate.Name = "Test plate";
  o_rPlate.Kind = VDevice::ForcePlate;
  constexpr double Signs[4][2] = { { 1, 1 }, { -1, 1 }, { -1, -1 }, { 1, -1 } };
  for ( int Corner = 0; Corner < 4; ++Corner )
  {
    o_rPlate.Corners[Corner] = { 300 * Signs[Corner][0], 200 * Signs[Corner][1], 0 };
  }
}

/// 800 N straight up at the plate's middle.
void Fill( VDeviceSamples& o_rSamples )
{
  o_rSamples.RateHz = 1000;
  o_rSamples.Wrench.push_back( { 0, 0, 800, 0, 0, 0, 0, 0, 0 } );
}

/// At a height of 2 m on the corners of a square of 6 m, looking level at its middle.
void Fill( VCameraCalibration& o_rCalibration, int i_Camera )
{
  const double Angle = std::numbers::pi * ( 0.25 + 0.5 * i_Camera );
  o_rCalibration.Position = { 3000 * std::numbers::sqrt2 * std::cos( Angle ),
                              3000 * std::numbers::sqrt2 * std::sin( Angle ), 2000 };
  // The rows of the rotation from world to camera are its axes: right, down, forward.
  const double Forward[2] = { -std::cos( Angle ), -std::sin( Angle ) };
  const double Rows[3][3] = { { Forward[1], -Forward[0], 0 }, { 0, 0, -1 }, { Forward[0], Forward[1], 0 } };
  const double Turn = std::acos( ( Rows[0][0] + Rows[1][1] + Rows[2][2] - 1 ) / 2 );
  const double Scale = Turn / ( 2 * std::sin( Turn ) );
  o_rCalibration.Rotation = { Scale * ( Rows[2][1] - Rows[1][2] ), Scale * ( Rows[0][2] - Rows[2][0] ),
                              Scale * ( Rows[1][0] - Rows[0][1] ) };
  o_rCalibration.PrincipalPoint[0] = VTestCamera::SensorWidth / 2 - 0.5;
  o_rCalibration.PrincipalPoint[1] = VTestCamera::SensorHeight / 2 - 0.5;
  o_rCalibration.FocalLength = 1000;
}

template < typename TFlow, typename... TArguments >
bool AddNew( ZEK::IResult& io_rResult, ZEK::IFlowState& io_rState, ZEK::IFlowStoreHandle& io_rStore,
             std::string_view i_Name, const TArguments&... i_rArguments )
{
  ZEK::VFlowItemRef Item;
  io_rResult = MakeTestItem< TFlow >( Item, io_rStore, i_Name );
  if ( io_rResult.IsOk() )
  {
    Fill( TestPayload< TFlow >( *Item ), i_rArguments... );
    io_rState.AddItem( Item );
  }
  return io_rResult.IsOk();
}

ZEK::IResult FillPattern( ZEK::IFlowState& io_rState, ZEK::IFlowStoreHandle& io_rStore )
{
  ZEK::IResult Result;
  (void)( AddNew< FlowWorldAxis >( Result, io_rState, io_rStore, "" ) &&
          AddNew< FlowVolumeProperties >( Result, io_rState, io_rStore, "" ) &&
          AddNew< FlowReconstructionSet >( Result, io_rState, io_rStore, "" ) &&
          AddNew< FlowDevice >( Result, io_rState, io_rStore, "Test plate" ) &&
          AddNew< FlowDeviceSamples >( Result, io_rState, io_rStore, "Test plate" ) );
  for ( int Camera = 0; Camera < CameraCount && Result.IsOk(); ++Camera )
  {
    VTestCamera Made;
    Result = MakeTestCamera( Made, io_rStore, std::string( "Test camera " ).append( std::to_string( Camera + 1 ) ) );
    for ( const ZEK::VFlowItemRef& rItem : Made.StaticItems )
    {
      io_rState.AddItem( rItem );
    }
    if ( Result.IsOk() )
    {
      AddNew< FlowCameraCalibration >( Result, io_rState, io_rStore, Made.Name, Camera );
    }
  }
  return Result;
}
} // namespace

ZEK::IResult CreateTestPattern( ZEK::IFlowStateCacheManager& io_rManager, ZEK::IFlowStateFactoryHandle& io_rFactory,
                                ZEK::IFlowStoreHandle& io_rStore )
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "TestPattern" );
  std::shared_ptr< ZEK::IFlowWritableStateCache > pCache;
  ZEK::IResult Result = io_rManager.CreateCache( pCache, TestPatternCacheName, ZEK::EFlowCacheWatchedLive );
  if ( pCache )
  {
    ZEK::VFlowStateRef State;
    Result = io_rFactory.CreateState( State, PatternKey, {}, {} );
    if ( Result.IsOk() )
    {
      Result = FillPattern( *State, io_rStore );
    }
    if ( Result.IsOk() )
    {
      Result = pCache->Add( State );
    }
  }
  if ( Result.IsError() )
  {
    ZEK::Log( rCategory, ZEK::ELogWarning, "No test pattern: %1%", Result.Text() );
  }
  return Result;
}

} // namespace Flow2Graphics
