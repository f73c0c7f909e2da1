#include "FlowFrame.h"

#include <CoreMoxelTypes/Parameters.h>
#include <HostSources/ReadRecording.h>
#include <HostSources/VRecordingSource.h>
#include <HostSources/VSimulatedCapture.h>
#include <TestSupport/Paths.h>

#include <gmock/gmock.h>

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

VDeviceSamples Samples( const std::array< float, 9 >& i_rWrench )
{
  VDeviceSamples Made;
  Made.Wrench = { i_rWrench, { 0, 0, 3000, 0, 0, 0, 0, 0, 0 } };
  return Made;
}

/// A place in the world from a plate's own: x and y from -1 to 1 over the surface, z 0 on it and -1 on the underside.
QVector3D OnPlate( const MoxelGraphics::VForcePlate& i_rPlate, float i_X, float i_Y, float i_Z = 0 )
{
  return QMatrix4x4( i_rPlate.Model.data() ).transposed().map( { 0.5F * i_X, 0.5F * i_Y, 0.5F + i_Z } );
}

/// Whether each corner of the device is one of the plate's, within a tenth of a millimetre.
void ExpectCorners( const MoxelGraphics::VForcePlate& i_rPlate, const D3 ( &i_rCorners )[4], float i_Within = 0.1F )
{
  for ( const D3& rCorner : i_rCorners )
  {
    const QVector3D Wanted( static_cast< float >( rCorner.x ), static_cast< float >( rCorner.y ),
                            static_cast< float >( rCorner.z ) );
    float Nearest = std::numeric_limits< float >::max();
    for ( int Corner = 0; Corner < 4; ++Corner )
    {
      const QVector3D Own = OnPlate( i_rPlate, Corner % 2 ? 1.0F : -1.0F, Corner / 2 ? 1.0F : -1.0F );
      Nearest = std::min( Nearest, Own.distanceToPoint( Wanted ) );
    }
    EXPECT_LT( Nearest, i_Within ) << rCorner.x << ", " << rCorner.y << ", " << rCorner.z;
  }
}
} // namespace

TEST( VFlowRenderForcePlates, TakesForcePlatesThatSpanAnAreaWithTheirOwnLooksAndLoads )
{
  VMaker Maker;
  VScene Scene;
  const ZEK::VFlowStateRef State = Maker.State();
  VDevice Emg = Plate( 5000 );
  Emg.Kind = VDevice::Emg;
  VDevice Flat = Plate( 6000 );
  Flat.Corners[0] = Flat.Corners[1];
  Flat.Corners[2] = Flat.Corners[3];
  VDevice Broken = Plate( 7000 );
  Broken.Corners[2].y = static_cast< double >( NaN );
  State->AddItem( Maker.Device< FlowDevice >( Plate( 1000, "Left" ), "vd:2" ) );
  State->AddItem( Maker.Device< FlowDevice >( Plate( 0 ), "vd:1" ) );
  State->AddItem( Maker.Device< FlowDevice >( Emg, "vd:3" ) );
  State->AddItem( Maker.Device< FlowDevice >( Flat, "vd:4" ) );
  State->AddItem( Maker.Device< FlowDevice >( Broken, "vd:5" ) );
  State->AddItem( Maker.Device< FlowDeviceApplicationData >( { 0x00112233 }, "vd:2" ) );
  State->AddItem( Maker.Device< FlowDeviceSamples >( Samples( { 0, 0, 700, 0, 0, 0, 1010, 20, 0 } ), "vd:2" ) );
  State->AddItem( Maker.Device< FlowDeviceSamples >( Samples( { 0, 0, NaN, 0, 0, 0, 0, 0, 0 } ), "vd:1" ) );
  State->AddItem( Maker.Device< FlowDeviceSamples >( Samples( { 0, 0, 500, 0, 0, 0, 0, 0, 0 } ), "vd:9" ) );
  Scene.Show( State );

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
  const std::uint32_t Ids[] = { rPlates.FirstId(), rPlates.FirstId() + 1 };
  const ZEK::VSelection Found = Scene.ResolveIds( Ids, Labels );
  ASSERT_EQ( Found.size(), 2u );
  EXPECT_EQ( Found[1], ( ZEK::VSelectionItem{ 1, "vd:2", 0, 0 } ) );
  EXPECT_THAT( Labels, testing::ElementsAre( "vd:1", "Left" ) );
  EXPECT_EQ( Scene.SelectionItemsToIds( Found ), ( std::vector< std::uint32_t >{ Ids[0], Ids[1] } ) );
  const auto Points = Scene.GetSelectionPositions( { Found[1] } );
  ASSERT_EQ( Points.size(), 1u );
  EXPECT_EQ( Points[0].X, 1000 );
  EXPECT_NEAR( Points[0].Radius, 360.6F, 0.1F );
  MoxelGraphics::VScenePose Pose;
  ASSERT_TRUE( Scene.GetSelectionPose( { Found[1] }, Pose ) );
  EXPECT_EQ( Pose.Matrix[12], 1000 );
  EXPECT_NEAR( Pose.Matrix[10], 1, 1e-6F );

  // Without devices there is nothing.
  const ZEK::VFlowStateRef Empty = Maker.State( 1 );
  Empty->AddItem( Maker.Points( 1 ) );
  Scene.Show( Empty );
  EXPECT_TRUE( rPlates.Plates().empty() && rPlates.Arrows().empty() );
}

TEST( VFlowRenderForcePlates, APlateHasItsTagWhileItIsMarkedAndNothingElseChanges )
{
  VMaker Maker;
  const auto pSelection = std::make_shared< FlowTest::VSelection >();
  const auto pScene = std::make_shared< VScene >( pSelection );
  FlowTest::VFrame View( pScene );
  const auto Device = Maker.Device< FlowDevice >( Plate( 0, "Left" ), "vd:1" );
  const auto Loads = Maker.Device< FlowDeviceSamples >( Samples( { 0, 0, 700, 0, 0, 0, 0, 0, 0 } ), "vd:1" );
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
  EXPECT_EQ( Show( 2, Maker.Device< FlowDeviceSamples >( Samples( { 0, 0, 800, 0, 0, 0, 0, 0, 0 } ), "vd:1" ) ),
             sizeof( MoxelGraphics::VForcePlate ) )
      << "a new load moves the arrow alone";
  EXPECT_TRUE( pScene->GetLabels( true ).empty() );
  pSelection->Set( ZEK::ISelectionService::EPrimary, { { 1, "vd:1", 0, 0 }, { 1, "vd:7", 0, 0 } } );
  Show( 3, Loads );
  ASSERT_EQ( pScene->GetLabels( true ).size(), 1u );
  EXPECT_EQ( pScene->GetLabels( true )[0]->Text, "Left" );
  EXPECT_EQ( pScene->GetLabels( true )[0]->Position, ( std::array< float, 3 >{ 0, 0, 100 } ) );
  pSelection->Set( ZEK::ISelectionService::EPrimary, {} );
  Show( 4, Loads );
  EXPECT_TRUE( pScene->GetLabels( true ).empty() );
}

TEST( VFlowRenderForcePlates, APlateOfAGaitTrialStandsAndPushesAsItWasRecorded )
{
  HARROW_NEEDS_RECORDINGS();
  auto pRecording = std::make_shared< HostSources::VRecording >();
  std::string Message;
  ASSERT_TRUE(
      HostSources::ReadRecording( TestSupport::RecordingsDir() / "c3d-trc" / "Gait.c3d", *pRecording, Message ).IsOk() )
      << Message;
  HostSources::VRecordingSource Source( pRecording );
  const auto pScene = std::make_shared< VScene >();
  ASSERT_TRUE( Source
                   .MakeState( Source.NearestFrame( 2.43 ),
                               { HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 2 }, pScene->State )
                   .IsOk() );
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
  EXPECT_NEAR( rModel[12], rWrench[6], 1e-3F );
  EXPECT_NEAR( rModel[13], rWrench[7], 1e-3F );
  EXPECT_NEAR( rModel[14], 0, 1e-3F );
  EXPECT_NEAR( rModel[10], 0.5F * 499.8F, 0.1F );
  EXPECT_NEAR( std::hypot( rModel[8], rModel[9], rModel[10] ), 0.5F * std::hypot( rWrench[0], rWrench[1], rWrench[2] ),
               0.01F );
  EXPECT_NEAR( std::hypot( rModel[0], rModel[1], rModel[2] ), 10, 1e-3F );
  EXPECT_TRUE( rModel[12] > -9.3F && rModel[12] < 905.1F && rModel[13] > -10.1F && rModel[13] < 599.5F );

  // And so it is drawn: from the centre of pressure to its tip, not beyond.
  const QVector3D Base( rModel[12], rModel[13], rModel[14] ), Along( rModel[8], rModel[9], rModel[10] );
  const auto IsArrow = [&]( float i_Share )
  {
    const QRgb Pixel = Picture.pixel( View.Screen( Base + i_Share * Along ).toPoint() );
    return qRed( Pixel ) > qGreen( Pixel ) + 25 && qRed( Pixel ) > qBlue( Pixel ) + 25;
  };
  EXPECT_TRUE( IsArrow( 0.05F ) && IsArrow( 0.9F ) );
  EXPECT_FALSE( IsArrow( 1.2F ) );
}

TEST( VFlowRenderForcePlates, PlatesOfEveryTypeOfFileShowWhatTheyCarry )
{
  HARROW_NEEDS_RECORDINGS();
  struct VCase
  {
    const char* pFile;
    std::int64_t Frame;
    std::size_t Plate;
    float Force, X, Y; // of the published figures
  };
  for ( const VCase& rCase : { VCase{ "c3d-gpl/Qualisys.c3d", 38, 0, 808.43F, 194, 292 },
                               VCase{ "c3d-gpl/Qualisys.c3d", 129, 1, 839.72F, 814, 159 },
                               VCase{ "c3d-gpl/FP_Type3.c3d", 0, 0, 886.7F, 446.5F, 291 },
                               VCase{ "c3d-trc/Gait.c3d", 252, 1, 871.17F, 675, 74 } } )
  {
    SCOPED_TRACE( rCase.pFile );
    auto pRecording = std::make_shared< HostSources::VRecording >();
    std::string Message;
    ASSERT_TRUE(
        HostSources::ReadRecording( TestSupport::RecordingsDir() / rCase.pFile, *pRecording, Message ).IsOk() );
    HostSources::VRecordingSource Source( pRecording );
    ZEK::VFlowStateRef State;
    ASSERT_TRUE(
        Source.MakeState( rCase.Frame, { HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 2 }, State ).IsOk() );
    VScene Scene;
    Scene.Show( State );
    const auto& rPlates = Scene.Plates();
    ASSERT_EQ( rPlates.Plates().size(), 2u );
    for ( std::size_t Plate = 0; Plate < 2; ++Plate )
    {
      // A plate that was measured is no exact rectangle.
      ExpectCorners( rPlates.Plates()[Plate], pRecording->ForcePlates[Plate].Corners, 3.0F );
    }
    const MoxelGraphics::VPlateLoad& rLoad = rPlates.Loads()[rCase.Plate];
    // The greatest force may lie some samples past the frame's own.
    EXPECT_NEAR( rLoad.Force[2], rCase.Force, 0.02F * rCase.Force );
    EXPECT_NEAR( rLoad.Centre[0], rCase.X, 6 );
    EXPECT_NEAR( rLoad.Centre[1], rCase.Y, 6 );
  }
}

TEST( VFlowRenderReconstructionVolume, TakesTheParametersOfItsTargetAndKeepsTheLastGoodOnes )
{
  VMaker Maker;
  VScene Scene;
  std::int64_t Frame = 0;
  const auto Show = [&]( const std::string& i_rTarget, double i_Least )
  {
    VParametersItem Value;
    Value.Target = i_rTarget;
    const double Corners[] = { i_Least, -200, 0, 300, 400, 500 };
    for ( std::size_t Index = 0; Index < 6; ++Index )
    {
      Value.Values[ReconstructionVolumeNames[Index]] = Corners[Index];
    }
    const ZEK::VFlowItemRef Item = Maker.Item< FlowParametersItem >( Value );
    Item->MutableValue().SetName( ZEK::EFlowNameTarget, i_rTarget );
    const ZEK::VFlowStateRef State = Maker.State( ++Frame );
    State->AddItem( Item );
    Scene.Show( State );
    return Scene.Volume().IsShown() ? Scene.Volume().Minimum()[0] : NaN;
  };
  EXPECT_TRUE( std::isnan( Show( "Processing:Labelling", -100 ) ) );
  EXPECT_EQ( Show( ReconstructionTarget, -100 ), -100 );
  EXPECT_EQ( Show( ReconstructionTarget, -50 ), -50 );
  EXPECT_EQ( Show( ReconstructionTarget, static_cast< double >( NaN ) ), -50 );
  EXPECT_EQ( Show( "Processing:Labelling", -100 ), -50 );
  EXPECT_EQ( Scene.Volume().Maximum(), ( std::array< float, 3 >{ 300, 400, 500 } ) );
}

TEST( EnvironmentFeeds, TheSimulatedCaptureShowsItsVolumeAndItsSteps )
{
  HostSources::VSimulatedCapture Capture;
  const HostSources::VStateMaker Maker{ HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 1 };
  VScene Scene;
  std::size_t Loaded = 0;
  for ( std::int64_t Frame = 0; Frame < 120 * 12; Frame += 6 )
  {
    ZEK::VFlowStateRef State;
    ASSERT_TRUE( Capture.MakeState( Frame, Maker, State ).IsOk() );
    Scene.Show( State );
    ASSERT_EQ( Scene.Plates().Plates().size(), 2u );
    for ( const MoxelGraphics::VForcePlate& rArrow : Scene.Plates().Arrows() )
    {
      ++Loaded;
      EXPECT_GT( rArrow.Model[10], 12.5F ) << "a step pushes the body up";
      EXPECT_LT( std::abs( rArrow.Model[12] - 2000 ), 300 );
      EXPECT_LT( std::abs( rArrow.Model[13] ), 610 );
    }
  }
  EXPECT_GT( Loaded, 10u );
  ASSERT_TRUE( Scene.Volume().IsShown() );
  EXPECT_EQ( Scene.Volume().Minimum(), ( std::array< float, 3 >{ -2800, -2800, 0 } ) );
  EXPECT_EQ( Scene.Volume().Maximum(), ( std::array< float, 3 >{ 2800, 2800, 2400 } ) );
}
