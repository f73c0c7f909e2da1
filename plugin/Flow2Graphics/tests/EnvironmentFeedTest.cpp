#include "FlowTestScene.h"

#include <CoreMoxelTypes/Parameters.h>
#include <HostSources/ReadRecording.h>
#include <HostSources/VRecordingSource.h>
#include <TestSupport/Paths.h>

#include <limits>

using namespace CoreMoxelTypes;
using FlowTest::VMaker;
using FlowTest::VScene;

namespace
{
constexpr float NaN = std::numeric_limits< float >::quiet_NaN();

VDevice Plate( double i_X, const std::string& i_rName = "" )
{
  VDevice Device;
  Device.Name = i_rName;
  Device.Kind = VDevice::ForcePlate;
  constexpr double Corners[4][2] = { { 300, 200 }, { -300, 200 }, { -300, -200 }, { 300, -200 } };
  for ( std::size_t Corner = 0; Corner < 4; ++Corner )
  {
    Device.Corners[Corner] = { i_X + Corners[Corner][0], Corners[Corner][1], 0 };
  }
  return Device;
}

/// The samples of a frame; the first one counts.
ZEK::VFlowItemRef Load( VMaker& io_rMaker, const std::string& i_rURN, float i_Up, float i_X = 0, float i_Y = 0 )
{
  VDeviceSamples Samples;
  Samples.Wrench = { { 0, 0, i_Up, 0, 0, 0, i_X, i_Y, 0 }, { 0, 0, 3000, 0, 0, 0, 0, 0, 0 } };
  return io_rMaker.Device< FlowDeviceSamples >( Samples, i_rURN );
}

/// A place in the world from a plate's own: x and y from -1 to 1 over the surface, z 0 on it and -1 on the underside.
QVector3D OnPlate( const MoxelGraphics::VForcePlate& i_rPlate, float i_X, float i_Y, float i_Z = 0 )
{
  return QMatrix4x4( i_rPlate.Model.data() ).transposed().map( { 0.5F * i_X, 0.5F * i_Y, 0.5F + i_Z } );
}

/// Whether each corner of the device is one of the plate's.
void ExpectCorners( const MoxelGraphics::VForcePlate& i_rPlate, const D3 ( &i_rCorners )[4] )
{
  for ( const auto& [X, Y, Z] : i_rCorners )
  {
    const QVector3D Wanted( static_cast< float >( X ), static_cast< float >( Y ), static_cast< float >( Z ) );
    float Nearest = std::numeric_limits< float >::max();
    for ( int Corner = 0; Corner < 4; ++Corner )
    {
      const QVector3D Own = OnPlate( i_rPlate, Corner % 2 ? 1.0F : -1.0F, Corner / 2 ? 1.0F : -1.0F );
      Nearest = std::min( Nearest, Own.distanceToPoint( Wanted ) );
    }
    EXPECT_LT( Nearest, 0.1F ) << X << ", " << Y << ", " << Z;
  }
}
} // namespace

TEST( VFlowRenderForcePlates, TakesForcePlatesThatSpanAnAreaWithTheirOwnLooksAndLoads )
{
  VMaker Maker;
  VScene Scene;
  VDevice Emg = Plate( 5000 ), Flat = Plate( 6000 ), Broken = Plate( 7000 );
  Emg.Kind = VDevice::Emg;
  Flat.Corners[0] = Flat.Corners[1];
  Flat.Corners[2] = Flat.Corners[3];
  Broken.Corners[2].y = static_cast< double >( NaN );
  Scene.Show( Maker.State(
      0, { Maker.Device< FlowDevice >( Plate( 1000, "Left" ), "vd:2" ),
           Maker.Device< FlowDevice >( Plate( 0 ), "vd:1" ), Maker.Device< FlowDevice >( Emg, "vd:3" ),
           Maker.Device< FlowDevice >( Flat, "vd:4" ), Maker.Device< FlowDevice >( Broken, "vd:5" ),
           Maker.Device< FlowDeviceApplicationData >( { 0x00112233 }, "vd:2" ), Load( Maker, "vd:2", 700, 1010, 20 ),
           Load( Maker, "vd:1", NaN ), Load( Maker, "vd:9", 500 ) } ) );
  const auto& rPlates = Scene.Plates();
  ASSERT_EQ( rPlates.Plates().size(), 2u );
  ExpectCorners( rPlates.Plates()[0], Plate( 0 ).Corners );
  ExpectCorners( rPlates.Plates()[1], Plate( 1000 ).Corners );
  EXPECT_EQ( rPlates.Plates()[1].Colour, 0xFF112233u );
  EXPECT_NE( rPlates.Plates()[0].Colour & 0xFFFFFF, 0u );
  EXPECT_NEAR( OnPlate( rPlates.Plates()[0], 0, 0, -1 ).z(), -50, 0.01F ) << "the body lies below the surface";
  ASSERT_EQ( rPlates.Arrows().size(), 1u );
  EXPECT_EQ( rPlates.Arrows()[0].Model[12], 1010 );
  EXPECT_NEAR( rPlates.Arrows()[0].Model[10], 350, 0.01F ) << "half a millimetre a newton, of the first sample";

  // Who needs the plate finds it by its item: names, place, pose.
  std::vector< std::string > Labels;
  const std::vector< std::uint32_t > Ids = { rPlates.FirstId(), rPlates.FirstId() + 1 };
  const ZEK::VSelection Found = Scene.ResolveIds( Ids, Labels );
  ASSERT_EQ( Found.size(), 2u );
  EXPECT_EQ( Found[1], ( ZEK::VSelectionItem{ 1, "vd:2", 0, 0 } ) );
  EXPECT_EQ( Labels, ( std::vector< std::string >{ "vd:1", "Left" } ) );
  EXPECT_EQ( Scene.SelectionItemsToIds( Found ), Ids );
  const auto Points = Scene.GetSelectionPositions( { Found[1] } );
  ASSERT_EQ( Points.size(), 1u );
  EXPECT_EQ( Points[0].X, 1000 );
  EXPECT_NEAR( Points[0].Radius, 360.6F, 0.1F );
  MoxelGraphics::VScenePose Pose;
  ASSERT_TRUE( Scene.GetSelectionPose( { Found[1] }, Pose ) );
  EXPECT_EQ( Pose.Matrix[12], 1000 );
  EXPECT_NEAR( Pose.Matrix[10], 1, 1e-6F );
  Scene.Show( Maker.State( 1, { Maker.Points( 1 ) } ) );
  EXPECT_TRUE( rPlates.Plates().empty() && rPlates.Arrows().empty() ) << "without devices there is nothing";
}

TEST( VFlowRenderForcePlates, APlateHasItsTagWhileItIsMarkedAndNothingElseChanges )
{
  VMaker Maker;
  const auto pScene = std::make_shared< VScene >();
  FlowTest::VFrame View( pScene );
  const auto Device = Maker.Device< FlowDevice >( Plate( 0, "Left" ), "vd:1" );
  const auto Loads = Load( Maker, "vd:1", 700 );
  const auto Show = [&]( std::int64_t i_Frame, const ZEK::VFlowItemRef& i_rLoads )
  {
    pScene->State = Maker.State( i_Frame );
    pScene->State->AddItemAt( Device, { 0, 100, 1 } );
    pScene->State->AddItemAt( i_rLoads, { 0, 100, 1 } );
    pScene->MarkDirty();
    View.Draw();
    return View.Frame().Figures().BytesUploaded;
  };
  Show( 0, Loads );
  EXPECT_EQ( Show( 1, Loads ), 0u ) << "the same values under a new state";
  EXPECT_EQ( Show( 2, Load( Maker, "vd:1", 800 ) ), sizeof( MoxelGraphics::VForcePlate ) ) << "the arrow alone moves";
  EXPECT_TRUE( pScene->GetLabels( true ).empty() );
  pScene->Select( { { 1, "vd:1", 0, 0 }, { 1, "vd:7", 0, 0 } } );
  Show( 3, Loads );
  ASSERT_EQ( pScene->GetLabels( true ).size(), 1u );
  EXPECT_EQ( pScene->GetLabels( true )[0]->Text, "Left" );
  EXPECT_EQ( pScene->GetLabels( true )[0]->Position, ( std::array< float, 3 >{ 0, 0, 100 } ) );
  pScene->Select( {} );
  Show( 4, Loads );
  EXPECT_TRUE( pScene->GetLabels( true ).empty() );
}

TEST( VFlowRenderForcePlates, APlateOfAGaitTrialStandsAndPushesAsItWasRecorded )
{
  HARROW_NEEDS_RECORDINGS();
  const auto pScene = std::make_shared< VScene >();
  const auto pRecording = std::make_shared< HostSources::VRecording >();
  std::string Message;
  const auto File = TestSupport::RecordingsDir() / "c3d-trc" / "Gait.c3d";
  ASSERT_TRUE( HostSources::ReadRecording( File, *pRecording, Message ).IsOk() ) << Message;
  HostSources::VRecordingSource Source( pRecording );
  const HostSources::VStateMaker Maker{ HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 2 };
  ASSERT_TRUE( Source.MakeState( Source.NearestFrame( 2.43 ), Maker, pScene->State ).IsOk() );
  FlowTest::VFrame View( pScene, { 1280, 720 } );
  const QImage Picture = View.Draw();
  const auto& rPlates = pScene->Plates();
  ASSERT_EQ( rPlates.Plates().size(), 2u );
  constexpr D3 Corners[2][4] = { { { -306.4, -620.7, 0 }, { -306.4, -11.1, 0 }, { 608, -11.1, 0 }, { 608, -620.7, 0 } },
                                 { { -9.3, -10.1, 0 }, { -9.3, 599.5, 0 }, { 905.1, 599.5, 0 }, { 905.1, -10.1, 0 } } };
  ExpectCorners( rPlates.Plates()[0], Corners[0] );
  ExpectCorners( rPlates.Plates()[1], Corners[1] );
  EXPECT_LT( OnPlate( rPlates.Plates()[1], 0, 0, -1 ).z(), 0 );

  // Plate 2 carries 499.8 N at analog sample 2430; the arrow's base is what the sample says.
  ASSERT_EQ( rPlates.Arrows().size(), 1u );
  const auto& rWrench = pRecording->ForcePlates[1].Wrench[2430];
  const auto& rModel = rPlates.Arrows()[0].Model;
  const QVector3D Base( rModel[12], rModel[13], rModel[14] ), Along( rModel[8], rModel[9], rModel[10] );
  EXPECT_LT( Base.distanceToPoint( { rWrench[6], rWrench[7], 0 } ), 2e-3F );
  EXPECT_NEAR( Along.z(), 0.5F * 499.8F, 0.1F );
  EXPECT_NEAR( Along.length(), 0.5F * std::hypot( rWrench[0], rWrench[1], rWrench[2] ), 0.01F );
  EXPECT_NEAR( std::hypot( rModel[0], rModel[1], rModel[2] ), 10, 1e-3F );
  EXPECT_TRUE( Base.x() > -9.3F && Base.x() < 905.1F && Base.y() > -10.1F && Base.y() < 599.5F );

  // And so it is drawn: from the centre of pressure to its tip, not beyond.
  for ( const auto& [Share, bArrow] : { std::pair( 0.05F, true ), std::pair( 0.9F, true ), std::pair( 1.2F, false ) } )
  {
    const QRgb Seen = Picture.pixel( View.Screen( Base + Share * Along ) );
    EXPECT_EQ( qRed( Seen ) > qGreen( Seen ) + 25 && qRed( Seen ) > qBlue( Seen ) + 25, bArrow ) << Share;
  }
}

TEST( VFlowRenderReconstructionVolume, TakesTheParametersOfItsTargetAndKeepsTheLastGoodOnes )
{
  VMaker Maker;
  VScene Scene;
  const auto Show = [&]( const std::string& i_rTarget, double i_Least )
  {
    VParametersItem Value;
    const double Corners[] = { i_Least, -200, 0, 300, 400, 500 };
    for ( std::size_t Index = 0; Index < 6; ++Index )
    {
      Value.Values[ReconstructionVolumeNames[Index]] = Corners[Index];
    }
    Scene.Show( Maker.State( 1, { Maker.Item< FlowParametersItem >( Value, i_rTarget, ZEK::EFlowNameTarget ) } ) );
    return Scene.Volume().IsShown() ? Scene.Volume().Minimum()[0] : NaN;
  };
  EXPECT_TRUE( std::isnan( Show( "Processing:Labelling", -100 ) ) );
  EXPECT_EQ( Show( ReconstructionTarget, -100 ), -100 );
  EXPECT_EQ( Show( ReconstructionTarget, -50 ), -50 );
  EXPECT_EQ( Show( ReconstructionTarget, static_cast< double >( NaN ) ), -50 );
  EXPECT_EQ( Show( "Processing:Labelling", -100 ), -50 );
  EXPECT_EQ( Scene.Volume().Maximum(), ( std::array< float, 3 >{ 300, 400, 500 } ) );
}
