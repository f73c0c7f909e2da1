#include "RenderCamerasTest.h"

#include <TestSupport/Allocations.h>
#include <TestSupport/Golden.h>

using namespace FlowTest;

namespace
{
class VRenderCameras : public VRenderCamerasFixture
{
protected:
  QPoint Seen( std::size_t i_Camera )
  {
    const auto& rPlace = pScene->CameraProvider()->GetCamera( Name( i_Camera ) )->GetInfo().Position;
    return View.Screen( { rPlace[0], rPlace[1], rPlace[2] } );
  }
};
} // namespace

TEST_F( VRenderCameras, BodiesFrustumsAndWhatIsSelectedOfFour )
{
  AddRing( 4 );
  Show();
  pScene->Select( { Device( 3 ), Device( 1 ) } ); // the last is the current one
  EXPECT_TRUE( TestSupport::MatchesGolden( Draw(), "cameras-selected" ) );
  Options().CameraAxes = Options().CameraRays = true;
  pScene->Select( {} );
  const QImage All = Draw();
  EXPECT_TRUE( TestSupport::MatchesGolden( All, "cameras-axes-rays" ) );
  // Each option has its share of the picture, and the first stands for all of them.
  auto& rOptions = Options();
  for ( bool* const pOption : { &rOptions.CameraAxes, &rOptions.CameraRays, &rOptions.CameraFrustums,
                                &rOptions.CameraCylinder, &rOptions.Cameras } )
  {
    *pOption = false;
    EXPECT_NE( Draw(), All );
    *pOption = true;
  }
  rOptions.Cameras = false;
  const QImage None = Draw();
  rOptions.Cameras = true;
  rOptions.CameraAxes = rOptions.CameraRays = rOptions.CameraFrustums = rOptions.CameraCylinder = false;
  EXPECT_EQ( Draw(), None );
}

TEST_F( VRenderCameras, ManyAreTwoDrawsAndStayWhereTheyAre )
{
  constexpr std::size_t Count = 1280;
  constexpr std::uint64_t Matrix = 64;
  AddRing( Count );
  Show();
  Draw();
  const std::uint64_t Calls = Figures().DrawCalls;
  Options().Cameras = false;
  Draw();
  EXPECT_EQ( Calls, Figures().DrawCalls + 2 );
  Options().Cameras = true;
  Show();
  Draw();
  EXPECT_EQ( Figures().BytesUploaded, 0u ) << "another state of the same items";
  for ( const std::size_t Other : { 70u, 71u } ) // at the first time what never changes goes up too
  {
    pScene->Select( { Device( 7 ), Device( Other ) } );
    Draw();
  }
  EXPECT_EQ( Figures().DrawCalls, Calls + 7 ) << "lines and faces, selected and current; highlight, outlines";
  EXPECT_EQ( Figures().BytesUploaded, Count * ( Matrix + 1 ) );
  Draw();
  EXPECT_EQ( Figures().BytesUploaded, 0u );
  pScene->Select( {} );
  Draw();
  // One camera is turned: the places of all go up once, as do the flags.
  Items[2] = Maker.Device< FlowCameraCalibration >( LookingAt( { 0, 0, 3000 }, { 100, 0, 0 } ), Name( 0 ) );
  Show();
  Draw();
  EXPECT_EQ( Figures().BytesUploaded, Count * 2 * Matrix );
  EXPECT_EQ( Figures().DrawCalls, Calls );
}

TEST_F( VRenderCameras, ACameraIsPickedByItsBodyItsLinesAndABandWhateverStandsBeforeIt )
{
  AddRing( 6 );
  // One stands close behind another as the eye has it, one has no calibration, one a broken one.
  Show();
  Draw();
  const QVector3D Before = Eye( 2, 6 );
  const QVector3D Towards = ( Before - View.Frame().Context()->CameraPosition() ).normalized();
  Items.push_back( Maker.Device< FlowCameraHardware >( Hardware(), Name( 6 ) ) );
  Items.push_back(
      Maker.Device< FlowCameraCalibration >( LookingAt( Before + 300 * Towards, { 0, 0, 800 } ), Name( 6 ) ) );
  Items.push_back( Maker.Device< FlowCameraHardware >( Hardware(), Name( 7 ) ) );
  Items.push_back( Maker.Device< FlowCameraHardware >( Hardware(), Name( 8 ) ) );
  VCameraCalibration Broken = LookingAt( { 0, 0, 2000 }, { 0, 100, 0 } );
  Broken.Position.x = std::nan( "" );
  Items.push_back( Maker.Device< FlowCameraCalibration >( Broken, Name( 8 ) ) );
  Options().CameraFrustums = false;
  Show();
  Draw();
  ASSERT_EQ( pScene->Cameras()->Bodies().size(), 7u );
  for ( std::size_t Index = 0; Index < 6; ++Index )
  {
    const auto Ids = Pick( Seen( Index ) );
    ASSERT_EQ( Ids.size(), 1u ) << Index;
    EXPECT_EQ( Ids.front(), pScene->Cameras()->FirstId() + Index );
    EXPECT_EQ( View.Frame().Result().Selection, ZEK::VSelection{ Device( Index ) } );
    EXPECT_EQ( View.Frame().Result().Labels, std::vector< std::string >{ "Camera " + std::to_string( Index + 1 ) } );
    EXPECT_TRUE( Pick( Seen( Index ) + QPoint( 0, 40 ) ).empty() ) << Index;
  }
  // What a band finds is what has its body in it, hidden or not.
  const QPoint Middle = Seen( 2 );
  EXPECT_EQ( Band( Middle - QPoint( 20, 20 ), Middle + QPoint( 20, 20 ) ),
             ( ZEK::VSelection{ Device( 2 ), Device( 6 ) } ) );
  EXPECT_EQ( Band( { 0, 0 }, { 639, 359 } ).size(), 7u );
  // The lines of a frustum lead to its camera, with and without a body about them.
  Options().CameraFrustums = true;
  for ( const bool bBody : { true, false } )
  {
    Options().CameraCylinder = bBody;
    for ( std::size_t Index = 0; Index < 6; ++Index )
    {
      const QMatrix4x4 Frustum =
          QMatrix4x4( pScene->CameraProvider()->GetCamera( Name( Index ) )->GetModel().FrustumTransform.data() )
              .transposed();
      Pick( View.Screen( Frustum.map( QVector3D( 1, -0.5F, 1 ) ) ) );
      EXPECT_EQ( View.Frame().Result().Selection, ZEK::VSelection{ Device( Index ) } ) << Index;
    }
  }
}

TEST_F( VRenderCameras, WhoeverNeedsACameraFindsItByItsItemAndItsNumberStandsWhereItIsSeen )
{
  AddRing( 4 );
  Items.push_back( Maker.Device< FlowCameraHardware >( Hardware(), Name( 7 ) ) );
  pScene->Show( Maker.State( 1, Items ) );
  const auto Points = pScene->GetSelectionPositions( { Device( 1 ), Device( 7 ), Device( 9 ) } );
  ASSERT_EQ( Points.size(), 1u ) << "what has no calibration has no place";
  const QVector3D Place( Points[0].X, Points[0].Y, Points[0].Z );
  EXPECT_NEAR( Place.distanceToPoint( Eye( 1, 4 ) ), 50, 0.1F );
  EXPECT_GT( Points[0].Radius, 50 );
  MoxelGraphics::VScenePose Pose;
  ASSERT_TRUE( pScene->GetSelectionPose( { Device( 1 ) }, Pose ) );
  EXPECT_EQ( Pose.Index, 2 );
  EXPECT_FLOAT_EQ( Pose.Matrix[12], Eye( 1, 4 ).x() );
  EXPECT_FALSE( pScene->GetSelectionPose( { Device( 7 ) }, Pose ) );
  EXPECT_EQ( pScene->SelectionItemsToIds( { Device( 0 ) } ), std::vector{ pScene->Cameras()->FirstId() } );
  // Cameras go, and come back in another place of the list.
  const std::weak_ptr Gone = pScene->CameraProvider()->GetCamera( Name( 1 ) );
  ASSERT_FALSE( Gone.expired() );
  pScene->Show( Maker.State( 2, { Items.begin(), Items.begin() + 3 } ) );
  EXPECT_TRUE( Gone.expired() ) << "nobody holds it";
  EXPECT_EQ( pScene->Cameras()->Bodies().size(), 1u );
  EXPECT_TRUE( pScene->GetSelectionPositions( { Device( 1 ) } ).empty() );
  pScene->Show( Maker.State( 3, { Items.begin() + 3, Items.end() } ) );
  EXPECT_EQ( pScene->SelectionItemsToIds( { Device( 1 ) } ), std::vector{ pScene->Cameras()->FirstId() } );
}

TEST_F( VRenderCameras, TenThousandAreShownAndPickedAsOne )
{
  AddRing( 10000 );
  Options().CameraRays = Options().CameraAxes = true;
  Show();
  const QImage All = Draw();
  const std::uint64_t Calls = Figures().DrawCalls;
  pScene->Select( { Device( 9999 ) } );
  EXPECT_NE( Draw(), All );
  EXPECT_EQ( Pick( Seen( 9999 ) ).size(), 1u );
  pScene->Select( {} );
  Items.resize( 3 );
  Show();
  Draw();
  EXPECT_EQ( Figures().DrawCalls, Calls );
}

TEST_F( VRenderCameras, FramesAllocateNothing )
{
  AddRing( 100 );
  VCameraMaskGrid Mask{ 2, 2, 640, 512, { 0xFF, 0, 0, 0xFF } };
  VEdgePairSet Edges;
  Edges.Pairs = { { 500, 600, 700, 10, 200 } };
  Items.push_back( Maker.Device< FlowCameraMaskGrid >( Mask, Name( 1 ) ) );
  Items.push_back( Maker.Device< FlowEdgePairSet >( Edges, Name( 1 ) ) );
  pScene->Select( { Device( 1 ), { ZEK::ESelectMaskCell, Name( 1 ), 0, 2 } } );
  Show();
  Draw();
  CoreGraphics::VRenderContext& rContext = *View.Frame().Context();
  MoxelGraphics::VSceneOptions Tile = Options();
  Tile.CameraView = Tile.CameraBorder = Tile.CameraWandSmear = true;
  Tile.OverlayCamera = QString::fromStdString( Name( 1 ) );
  MoxelGraphics::VRenderCameras& rCameras = *pScene->Cameras();
  const auto DrawAll = [&]( std::initializer_list< int > i_Modes )
  {
    pScene->Registry().Reset();
    pScene->CameraProvider()->Update( *pScene->State );
    pScene->Cameras()->Update( *pScene->State );
    rContext.ResetState();
    for ( const int Mode : i_Modes )
    {
      rContext.SetRenderMode( Mode );
      for ( const std::uint32_t Pass : { 0u, 1u, 2u } )
      {
        rCameras.Render( rContext, Options(), Pass );
        rCameras.Render( rContext, Tile, Pass );
      }
      rCameras.RenderTiles( rContext, Tile );
    }
  };
  const auto Repeat = [&]( std::initializer_list< int > i_Modes )
  {
    for ( int Times = 0; Times < 5; ++Times )
    {
      DrawAll( i_Modes );
    }
  };
  Repeat( { 0, 1, 2 } );
  const std::uint64_t Before = TestSupport::AllocationCount();
  Repeat( { 0, 1, 2 } );
  EXPECT_EQ( TestSupport::AllocationCount(), Before );
  // A pick writes what reaches into its window.
  rContext.ResetCounters();
  Repeat( { 0, 2 } );
  EXPECT_EQ( rContext.BytesUploaded(), 0u );
  EXPECT_GT( rContext.DrawCalls(), 5u * 6 );
}
