#include "FlowTestScene.h"

#include <gtest/gtest.h>

using namespace CoreMoxelTypes;

TEST( VFlowScene, RenderTypesAreMadeOnceInTheirOrder )
{
  FlowTest::VScene Scene;
  const auto Before = Scene.FlowRenderTypes();
  Scene.CreateRenderTypes();
  EXPECT_EQ( Scene.FlowRenderTypes(), Before );
  ASSERT_EQ( Before.size(), 4u );
  EXPECT_NE( dynamic_cast< Flow2Graphics::VFlowRenderFloorGrid* >( Before[0].get() ), nullptr );
  EXPECT_NE( dynamic_cast< Flow2Graphics::VFlowRenderForcePlates* >( Before[1].get() ), nullptr );
  EXPECT_NE( dynamic_cast< Flow2Graphics::VFlowRenderReconstructions* >( Before[2].get() ), nullptr );
  EXPECT_NE( dynamic_cast< Flow2Graphics::VFlowRenderReconstructionVolume* >( Before[3].get() ), nullptr );
}

TEST( VFlowScene, WithoutAStateTheFlagStaysAndTheNextFrameAsksAgain )
{
  FlowTest::VScene Scene;
  FlowTest::VMaker Maker;
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

TEST( VFlowScene, TheUpAxisFollowsItsItemAndStaysWithoutOne )
{
  FlowTest::VScene Scene;
  FlowTest::VMaker Maker;
  const auto Up = [&]( std::uint32_t i_Up )
  {
    const ZEK::VFlowStateRef State = Maker.State();
    State->AddItem( Maker.Item< FlowWorldAxis >( { i_Up } ) );
    return State;
  };
  Scene.Show( Up( 1 ) );
  EXPECT_TRUE( Scene.YUp() );
  const ZEK::VFlowStateRef Without = Maker.State();
  Without->AddItem( Maker.Points( 1 ) );
  Scene.Show( Without );
  EXPECT_TRUE( Scene.YUp() );
  Scene.Show( Up( 2 ) );
  EXPECT_FALSE( Scene.YUp() );
}

TEST( VFlowScene, TheFloorFollowsAChangedValueOnlyAndKeepsItWhenItGoes )
{
  FlowTest::VScene Scene;
  FlowTest::VMaker Maker;
  const ZEK::VFlowStateRef First = Maker.State( 0 );
  First->AddItem( Maker.Item< FlowVolumeProperties >( { -4000, -2000, 5000, 3000, 0, 0 } ) );
  Scene.Show( First );
  EXPECT_EQ( Scene.Floor().GetExtents(), ( std::array{ -4000, -2000, 5000, 3000 } ) );
  Scene.Floor().SetExtents( { 1, 2, 3, 4 } );
  Scene.Show( First );
  EXPECT_EQ( Scene.Floor().GetExtents(), ( std::array{ 1, 2, 3, 4 } ) ) << "the same value was taken again";
  const ZEK::VFlowStateRef Without = Maker.State( 1 );
  Without->AddItem( Maker.Points( 1 ) );
  Scene.Show( Without );
  EXPECT_EQ( Scene.Floor().GetExtents(), ( std::array{ 1, 2, 3, 4 } ) );
}

TEST( VFlowScene, TheCameraNameNeedsExactlyOneSelectedCamera )
{
  const auto pSelection = std::make_shared< FlowTest::VSelection >();
  FlowTest::VScene Scene( pSelection );
  EXPECT_EQ( Scene.SelectedName(), "" );
  Scene.SelectByName( "2107", false );
  EXPECT_EQ( Scene.SelectedName(), "2107" );
  Scene.SelectByName( "2108", true );
  EXPECT_EQ( Scene.SelectedName(), "2107" );
  EXPECT_EQ( pSelection->Get( ZEK::ISelectionService::ESecondary ).at( 0 ).Device, "2108" );
  pSelection->Set( ZEK::ISelectionService::EPrimary,
                   { { ZEK::ESelectDevice, "1", 0, 0 }, { ZEK::ESelectDevice, "2", 0, 0 } } );
  EXPECT_EQ( Scene.SelectedName(), "" );
}
