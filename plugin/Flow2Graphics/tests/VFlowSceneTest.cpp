#include "FlowTestScene.h"

using namespace CoreMoxelTypes;

namespace
{
class VFlowScene : public testing::Test
{
protected:
  /// Six points, of which 1 and 4 bear the labels of Ada's markers.
  ZEK::VFlowStateRef Labelled()
  {
    // Index 9 is off the set, subject 8 and marker 5 do not exist, and reconstruction 4 has a label already.
    const VReconstructionLabelSet Labels{
        { { 1, 7, 0 }, { 4, 7, 1 }, { 9, 7, 0 }, { 2, 8, 0 }, { 3, 7, 5 }, { 4, 7, 0 } } };
    return Maker.State( 0, { Maker.Points( 6 ), Maker.Subject( 7, "Ada", { "LFHD", "RFHD" } ),
                             Maker.Item< FlowReconstructionLabelSet >( Labels ) } );
  }
  /// A state in which there is nothing that these tests look at.
  ZEK::VFlowStateRef Without() { return Maker.State( 1, { Maker.Item< FlowSubject >( {}, "Nobody" ) } ); }

  FlowTest::VMaker Maker;
  FlowTest::VScene Scene;
};
} // namespace

TEST_F( VFlowScene, WithoutAStateTheFlagStaysAndTheNextFrameAsksAgain )
{
  const auto Types = Scene.FlowRenderTypes();
  Scene.CreateRenderTypes();
  EXPECT_EQ( Scene.FlowRenderTypes(), Types ) << "they are made once";
  Scene.Show( {} );
  EXPECT_TRUE( Scene.IsPending() );
  Scene.State = Maker.State();
  Scene.ProcessPending();
  EXPECT_EQ( Scene.Fetches, 2 ) << "a state without items counts as none";
  EXPECT_TRUE( Scene.IsPending() );
  Scene.State->AddItem( Maker.Points( 3 ) );
  Scene.ProcessPending();
  EXPECT_EQ( Scene.Reconstructions().UnlabelledPoints().Points.size(), 3u );
  EXPECT_FALSE( Scene.IsPending() );
}

TEST_F( VFlowScene, UpAxisAndFloorFollowTheirItemsAndStayWithoutThem )
{
  const ZEK::VFlowStateRef First =
      Maker.State( 0, { Maker.Item< FlowWorldAxis >( { 1 } ),
                        Maker.Item< FlowVolumeProperties >( { -4000, -2000, 5000, 3000, 0, 0 } ) } );
  Scene.Show( First );
  EXPECT_TRUE( Scene.YUp() );
  EXPECT_EQ( Scene.Floor().GetExtents(), ( std::array{ -4000, -2000, 5000, 3000 } ) );
  Scene.Floor().SetExtents( { 1, 2, 3, 4 } );
  for ( const ZEK::VFlowStateRef& rState : { First, Without() } )
  {
    Scene.Show( rState );
    EXPECT_TRUE( Scene.YUp() );
    EXPECT_EQ( Scene.Floor().GetExtents(), ( std::array{ 1, 2, 3, 4 } ) ) << "the same value was taken again";
  }
  Scene.Show( Maker.State( 2, { Maker.Item< FlowWorldAxis >( { 2 } ) } ) );
  EXPECT_FALSE( Scene.YUp() );
}

TEST_F( VFlowScene, TheCameraNameNeedsExactlyOneSelectedCamera )
{
  EXPECT_EQ( Scene.SelectedName(), "" );
  Scene.SelectByName( "2107", false );
  EXPECT_EQ( Scene.SelectedName(), "2107" );
  Scene.SelectByName( "2108", true );
  EXPECT_EQ( Scene.SelectedName(), "2107" );
  EXPECT_EQ( Scene.SelectionService()->Get( ZEK::ISelectionService::ESecondary ).at( 0 ).Device, "2108" );
  Scene.Select( { { ZEK::ESelectDevice, "1", 0, 0 }, { ZEK::ESelectDevice, "2", 0, 0 } } );
  EXPECT_EQ( Scene.SelectedName(), "" );
}

TEST_F( VFlowScene, PointsFindTheirLabelsAndIdsTurnBackIntoNames )
{
  Scene.Show( Labelled() );
  const auto& rFeed = Scene.Reconstructions();
  EXPECT_EQ( rFeed.UnlabelledPoints().Reconstruction, ( std::vector< std::uint32_t >{ 0, 2, 3, 5 } ) );
  const auto& rSubjects = Scene.Group( Flow2Graphics::EGroupSubject );
  EXPECT_EQ( rSubjects.Markers.size(), 2u );
  std::vector< std::string > Labels;
  const std::vector< std::uint32_t > Ids = { rFeed.Unlabelled().FirstId() + 2, rSubjects.MarkerIds.First + 1 };
  const ZEK::VSelection Found = Scene.ResolveIds( Ids, Labels );
  EXPECT_EQ( Found, ( ZEK::VSelection{ { ZEK::ESelectReconstruction, "", 0, 3 },
                                       { ZEK::ESelectMarker, "Ada:RFHD", 7, 1 } } ) );
  EXPECT_EQ( Labels, ( std::vector< std::string >{ "Reconstruction 4", "Ada:RFHD" } ) );
  EXPECT_EQ( Scene.SelectionItemsToIds( Found ), Ids );
  const auto Points = Scene.GetSelectionPositions( Found );
  ASSERT_EQ( Points.size(), 2u );
  EXPECT_EQ( Points[0].X, 300.0F );
  EXPECT_EQ( Points[1].X, 400.0F );
  Scene.Show( Without() );
  EXPECT_TRUE( rFeed.Unlabelled().IsEmpty() && rSubjects.Markers.empty() ) << "points vanish with their set";
}

TEST_F( VFlowScene, ASelectionShowsOnAPausedStateAndMovesNoGeometry )
{
  const ZEK::VFlowStateRef Paused = Labelled();
  const auto& rFeed = Scene.Reconstructions();
  const auto& rSubjects = Scene.Group( Flow2Graphics::EGroupSubject );
  Scene.Show( Paused );
  const std::uint64_t Before = rSubjects.MarkerGeneration;
  for ( const bool bMarked : { false, true, false } )
  {
    Scene.Select( bMarked ? ZEK::VSelection{ { ZEK::ESelectMarker, "Ada:LFHD", 7, 0 } } : ZEK::VSelection() );
    Scene.Show( Paused );
    EXPECT_EQ( rSubjects.MarkerIds.Flags,
               bMarked ? std::vector< std::uint8_t >( { 5, 0 } ) : std::vector< std::uint8_t >() );
    EXPECT_FALSE( rFeed.Unlabelled().AnyMarked() );
    EXPECT_EQ( rSubjects.MarkerGeneration, Before );
  }
}

TEST_F( VFlowScene, ASubjectWhoseColoursDoNotFitIsLeftOutAndItsPointsStay )
{
  const auto Show = [&]( std::vector< std::uint32_t > i_Colours )
  {
    VSubjectApplicationData Data;
    Data.MarkerColours = std::move( i_Colours );
    Scene.Show( Maker.State( 0, { Maker.Points( 2 ), Maker.Subject( 7, "Ada", { "LFHD", "RFHD" } ),
                                  Maker.Item< FlowSubjectApplicationData >( Data, "Ada" ),
                                  Maker.Item< FlowReconstructionLabelSet >( { { { 0, 7, 1 } } } ) } ) );
    return Scene.Group( Flow2Graphics::EGroupSubject ).MarkerColours;
  };
  EXPECT_EQ( Show( { 0xFF000001, 0xFF000002 } ), ( std::vector< std::uint32_t >{ 0xFF000001, 0xFF000002 } ) );
  EXPECT_EQ( Scene.Reconstructions().UnlabelledPoints().Points.size(), 1u );
  EXPECT_TRUE( Show( { 0xFF000001 } ).empty() );
  EXPECT_EQ( Scene.Reconstructions().UnlabelledPoints().Points.size(), 2u );
}
