#include "CameraTest.h"

#include <functional>
#include <limits>

using namespace FlowTest;

namespace
{
class CameraProvider : public VCameraFixture
{
};
} // namespace

TEST_F( CameraProvider, CamerasLiveAsLongAsTheirNames )
{
  Show( std::vector< VFlowItemRef >{} );
  EXPECT_TRUE( pProvider->GetCameras().empty() );
  EXPECT_EQ( pProvider->GetCamera( "a" ), nullptr );

  // An odd name, a name that is none, two items of one camera, and a calibration of no camera.
  const std::string Odd = "urn:\xC3\xBC/\"* b";
  VCameraHardware Twin = Hardware();
  Twin.SensorWidth = 1;
  Show( { Hard( "b" ), Hard( Odd ), Hard( "" ), Item< FlowCameraHardware >( Twin, "b" ),
          Item< FlowCameraCalibration >( Calibration(), "b" ), Item< FlowCameraCalibration >( Calibration(), "x" ) } );
  ASSERT_EQ( pProvider->GetCameras().size(), 2u );
  EXPECT_EQ( pProvider->GetCameras()[0]->GetName(), "b" );
  EXPECT_EQ( pProvider->GetCameras()[1]->GetName(), Odd );
  EXPECT_EQ( pProvider->GetCamera( "x" ), nullptr );
  const ZEK::VRenderCameraRef B = pProvider->GetCamera( "b" );
  EXPECT_TRUE( B->GetInfo().bCalibrated );
  EXPECT_FALSE( Camera( Odd ).GetInfo().bCalibrated );
  const auto& rDefinitions = Scene.CameraDefinitions();
  ASSERT_EQ( rDefinitions.size(), 2u );
  EXPECT_TRUE( rDefinitions[0].bCalibrated && rDefinitions[0].DisplayType == "Plain" );

  // One goes and one comes; the one that stays is the same object, and its calibration is gone, not its model.
  Show( { Hard( "a" ), Hard( "b" ) } );
  EXPECT_EQ( pProvider->GetCamera( "b" ), B );
  EXPECT_FALSE( B->GetInfo().bCalibrated );
  EXPECT_NE( B->GetModel().ImageTransform, ComputeCameraModel::Identity4 );
  EXPECT_EQ( B->GetInfo().Number, 1u );
  Show( std::vector< VFlowItemRef >{} );
  EXPECT_TRUE( pProvider->GetCameras().empty() && Scene.CameraDefinitions().empty() );
  EXPECT_EQ( B->GetName(), "b" ) << "whoever holds it has it";
}

TEST_F( CameraProvider, OnlyACalibrationThatCanBeUsedIsUsed )
{
  constexpr double NaN = std::numeric_limits< double >::quiet_NaN();
  const auto Calibrated = [&]( auto&& i_rChange )
  {
    VCameraCalibration Value = Calibration();
    VCameraHardware Sensor = Hardware();
    i_rChange( Value, Sensor );
    Show( { Item< FlowCameraHardware >( Sensor ), Item< FlowCameraCalibration >( Value ) } );
    return Camera( "a" ).GetInfo().bCalibrated;
  };
  const auto Keep = []( auto&, auto& ) {};
  ASSERT_TRUE( Calibrated( Keep ) );
  const ComputeCameraModel::VCameraModel Good = Camera( "a" ).GetModel();
  const auto& rPosition = Camera( "a" ).GetInfo().Position;
  EXPECT_FLOAT_EQ( rPosition[0], Good.WorldFromCamera[12] - 50 * Good.WorldFromCamera[8] );
  EXPECT_FLOAT_EQ( rPosition[2], Good.WorldFromCamera[14] - 50 * Good.WorldFromCamera[10] );

  const std::vector< std::function< void( VCameraCalibration&, VCameraHardware& ) > > Bad{
      []( auto& o_rC, auto& )
      {
        o_rC.RadialModel = 2;
      },
      []( auto& o_rC, auto& )
      {
        o_rC.RadialModel = 0xFFFFFFFF;
      },
      []( auto& o_rC, auto& )
      {
        o_rC.FocalLength = 0;
      },
      []( auto& o_rC, auto& )
      {
        o_rC.FocalLength = -1400;
      },
      []( auto& o_rC, auto& )
      {
        o_rC.FocalLength = NaN;
      },
      []( auto& o_rC, auto& )
      {
        o_rC.Rotation.x = NaN;
      },
      []( auto& o_rC, auto& )
      {
        o_rC.Position.z = std::numeric_limits< double >::infinity();
      },
      []( auto& o_rC, auto& )
      {
        o_rC.RadialParameters[0] = NaN;
      },
      []( auto& o_rC, auto& )
      {
        o_rC.AspectRatio = 0;
      },
      []( auto&, auto& o_rH )
      {
        o_rH.SensorWidth = 0;
      },
      []( auto&, auto& o_rH )
      {
        o_rH.SensorHeight = 0;
      },
  };
  for ( std::size_t Case = 0; Case < Bad.size(); ++Case )
  {
    EXPECT_FALSE( Calibrated( Bad[Case] ) ) << "case " << Case;
    EXPECT_EQ( Camera( "a" ).GetModel().ImageTransform, Good.ImageTransform ) << "case " << Case;
    EXPECT_GT( Camera( "a" ).GetInfo().ImageAspect, 0 );
    EXPECT_TRUE( Calibrated( Keep ) );
  }
  EXPECT_TRUE( Calibrated(
      []( auto& o_rC, auto& )
      {
        o_rC.RadialParameters = { 1, 2, 3, 4, 5 };
      } ) );
  EXPECT_TRUE( Calibrated(
      []( auto& o_rC, auto& )
      {
        o_rC.RadialParameters.clear();
      } ) );
  EXPECT_TRUE( Calibrated(
      []( auto& o_rC, auto& )
      {
        o_rC.Rotation = { 1e-12, 1e9, 0 };
      } ) );

  // A sensor of another size under the same calibration.
  const VFlowItemRef Same = Item< FlowCameraCalibration >( Calibration() );
  Show( { Hard( "a" ), Same } );
  VCameraHardware Small = Hardware();
  Small.SensorWidth = 640;
  Show( { Item< FlowCameraHardware >( Small ), Same } );
  EXPECT_NE( Camera( "a" ).GetModel().ImageTransform, Good.ImageTransform );
  EXPECT_EQ( Scene.CameraDefinitions().at( 0 ).ImageWidth, 640 );
}

TEST_F( CameraProvider, SettingsAreReadByTheirKindsAndCountAsAChange )
{
  Show( { Hard( "a" ) } );
  const auto& rInfo = Camera( "a" ).GetInfo();
  const auto Before = rInfo.ChangeCount;
  VCameraSettings Settings;
  Settings.Values = { { "Name", std::string( "Left" ) },
                      { "GammaCorrection", 2.5 },
                      { "VideoSaturation", std::int64_t( 3 ) },
                      { "Connected", false },
                      { "UserId", std::int64_t( 7 ) } };
  const VFlowItemRef Held = Item< FlowCameraSettings >( Settings );
  Show( { Hard( "a" ), Held } );
  EXPECT_EQ( Camera( "a" ).GetDisplayName(), "Left" );
  EXPECT_EQ( rInfo.GammaCorrection, 2.5F );
  EXPECT_EQ( rInfo.VideoSaturation, 3.0F );
  EXPECT_FALSE( rInfo.bConnected );
  EXPECT_EQ( rInfo.UserId, 7 );
  EXPECT_EQ( Scene.CameraDefinitions().at( 0 ).UserId, 7 );
  EXPECT_GT( rInfo.ChangeCount, Before );
  Settings.Values = { { "Name", 5.0 },
                      { "GammaCorrection", std::string( "x" ) },
                      { "UserId", true },
                      { "VideoSaturation", std::nan( "" ) } };
  Show( { Hard( "a" ), Item< FlowCameraSettings >( Settings ) } );
  EXPECT_EQ( Camera( "a" ).GetDisplayName(), "" );
  EXPECT_EQ( rInfo.GammaCorrection, 1.0F );
  EXPECT_EQ( rInfo.VideoSaturation, 1.0F );
  EXPECT_TRUE( rInfo.bConnected );
  EXPECT_EQ( rInfo.UserId, -1 );
}

TEST_F( CameraProvider, TenThousandCamerasComeAndGo )
{
  std::vector< VFlowItemRef > Items;
  for ( int Number = 0; Number < 10000; ++Number )
  {
    Items.push_back( Hard( "cam" + std::to_string( Number ) ) );
  }
  Show( Items );
  EXPECT_EQ( pProvider->GetCameras().size(), 10000u );
  EXPECT_EQ( Scene.CameraDefinitions().size(), 10000u );
  EXPECT_EQ( Camera( "cam9999" ).GetInfo().SensorWidth, 1280u );
  Items.resize( 1 );
  Show( Items );
  EXPECT_EQ( pProvider->GetCameras().size(), 1u );
}
