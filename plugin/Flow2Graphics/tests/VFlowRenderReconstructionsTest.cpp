#include "FlowTestScene.h"

#include <gtest/gtest.h>

using namespace CoreMoxelTypes;

namespace
{
struct VFixture
{
  VFixture()
  {
    State = Maker.State();
    State->AddItem( Maker.Points( 6 ) );
    State->AddItem( Maker.Subject( 7, "Ada", { "LFHD", "RFHD" } ) );
    // Index 9 is off the set, subject 8 and marker 5 do not exist, and reconstruction 4 has a label already.
    State->AddItem( Maker.Item< FlowReconstructionLabelSet >(
        { { { 1, 7, 0 }, { 4, 7, 1 }, { 9, 7, 0 }, { 2, 8, 0 }, { 3, 7, 5 }, { 4, 7, 0 } } } ) );
  }
  FlowTest::VMaker Maker;
  ZEK::VFlowStateRef State;
};
} // namespace

TEST( VFlowRenderReconstructions, LabelsThatNameNothingLeaveTheirPointUnlabelled )
{
  VFixture Fixture;
  FlowTest::VScene Scene;
  Scene.Show( Fixture.State );
  EXPECT_EQ( Scene.Reconstructions().UnlabelledPoints().Reconstruction,
             ( std::vector< std::uint32_t >{ 0, 2, 3, 5 } ) );
  ASSERT_EQ( Scene.Reconstructions().LabelledPoints().Points.size(), 2u );
  EXPECT_EQ( Scene.Reconstructions().LabelledPoints().Points[1].X, 400.0F );
}

TEST( VFlowRenderReconstructions, IdsTurnBackIntoPointsAndNames )
{
  VFixture Fixture;
  FlowTest::VScene Scene;
  Scene.Show( Fixture.State );
  const auto& rFeed = Scene.Reconstructions();
  std::vector< std::string > Labels;
  const std::uint32_t Ids[] = { rFeed.Unlabelled().FirstId() + 2, rFeed.Labelled().FirstId() + 1 };
  const ZEK::VSelection Found = Scene.ResolveIds( Ids, Labels );
  ASSERT_EQ( Found.size(), 2u );
  EXPECT_EQ( Found[0], ( ZEK::VSelectionItem{ ZEK::ESelectReconstruction, "", 0, 3 } ) );
  EXPECT_EQ( Found[1], ( ZEK::VSelectionItem{ ZEK::ESelectMarker, "Ada:RFHD", 7, 1 } ) );
  EXPECT_EQ( Labels, ( std::vector< std::string >{ "Reconstruction 4", "Ada:RFHD" } ) );
  EXPECT_EQ( Scene.SelectionItemsToIds( Found ), ( std::vector< std::uint32_t >{ Ids[0], Ids[1] } ) );
  const auto Points = Scene.GetSelectionPositions( Found );
  ASSERT_EQ( Points.size(), 2u );
  EXPECT_EQ( Points[0].X, 300.0F );
  EXPECT_EQ( Points[1].X, 400.0F );
}

TEST( VFlowRenderReconstructions, ASelectionShowsOnAPausedStateAndMovesNoGeometry )
{
  VFixture Fixture;
  const auto pSelection = std::make_shared< FlowTest::VSelection >();
  FlowTest::VScene Scene( pSelection );
  Scene.Show( Fixture.State );
  EXPECT_FALSE( Scene.Reconstructions().Labelled().AnyMarked() );
  const auto* const pBefore = Scene.Reconstructions().LabelledPoints().Points.data();
  pSelection->Set( ZEK::ISelectionService::EPrimary, { { ZEK::ESelectMarker, "Ada:LFHD", 7, 0 } } );
  Scene.Show( Fixture.State );
  EXPECT_TRUE( Scene.Reconstructions().Labelled().AnyMarked() );
  EXPECT_FALSE( Scene.Reconstructions().Unlabelled().AnyMarked() );
  EXPECT_EQ( Scene.Reconstructions().LabelledPoints().Points.data(), pBefore );
  pSelection->Set( ZEK::ISelectionService::EPrimary, {} );
  Scene.Show( Fixture.State );
  EXPECT_FALSE( Scene.Reconstructions().Labelled().AnyMarked() );
}

TEST( VFlowRenderReconstructions, ColoursComeFromApplicationDataThatFits )
{
  FlowTest::VMaker Maker;
  FlowTest::VScene Scene;
  const auto Show = [&]( std::vector< std::uint32_t > i_Colours )
  {
    const ZEK::VFlowStateRef State = Maker.State();
    VSubjectApplicationData Data;
    Data.MarkerColours = std::move( i_Colours );
    State->AddItem( Maker.Points( 2 ) );
    State->AddItem( Maker.Subject( 7, "Ada", { "LFHD", "RFHD" } ) );
    State->AddItem( Maker.Item< FlowSubjectApplicationData >( Data, "Ada" ) );
    State->AddItem( Maker.Item< FlowReconstructionLabelSet >( { { { 0, 7, 1 } } } ) );
    Scene.Show( State );
    return Scene.Reconstructions().LabelledPoints().Colours.at( 0 );
  };
  EXPECT_EQ( Show( { 0xFF000001, 0xFF000002 } ), 0xFF000002 );
  EXPECT_NE( Show( { 0xFF000001 } ), 0xFF000001 ) << "too few colours are no colours";
}

TEST( VFlowRenderReconstructions, PointsVanishWithTheirSet )
{
  VFixture Fixture;
  FlowTest::VScene Scene;
  Scene.Show( Fixture.State );
  const ZEK::VFlowStateRef Empty = Fixture.Maker.State( 1 );
  Empty->AddItem( Fixture.Maker.Item< FlowWorldAxis >( { 2 } ) );
  Scene.Show( Empty );
  EXPECT_TRUE( Scene.Reconstructions().Unlabelled().IsEmpty() );
  EXPECT_TRUE( Scene.Reconstructions().Labelled().IsEmpty() );
}
