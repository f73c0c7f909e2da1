#include "TestScene.h"

#include <TestSupport/LogGuard.h>

namespace MoxelGraphics
{

TEST( SelectionRegistry, RangesGiveTheirMembersBack )
{
  VSelectionRegistry Registry( nullptr );
  const ZEK::VSelectionItem Camera{ ZEK::ESelectDevice, "cam:7", 0, 0 };
  EXPECT_EQ( Registry.Allocate( Camera ), 1u );
  EXPECT_EQ( Registry.Allocate( { ZEK::ESelectCentroid, "cam:7", 0, 0 }, 10 ), 2u );
  EXPECT_EQ( Registry.Allocate( { ZEK::ESelectSegment, "Anna", 4, 1 }, 3 ), 12u );
  EXPECT_EQ( Registry.NextId(), 15u );

  ZEK::VSelectionItem Item;
  ASSERT_TRUE( Registry.Resolve( 1, Item ) );
  EXPECT_EQ( Item, Camera );
  ASSERT_TRUE( Registry.Resolve( 2 + 6, Item ) );
  EXPECT_EQ( Item, ( ZEK::VSelectionItem{ ZEK::ESelectCentroid, "cam:7", 0, 6 } ) );
  // A kind without members stays the item that it is.
  ASSERT_TRUE( Registry.Resolve( 14, Item ) );
  EXPECT_EQ( Item.Sub, 1u );
  // Flags and what lies above the word do not matter.
  EXPECT_TRUE( Registry.Resolve( 0x01000000u | EIdSelected | 1u, Item ) );
  EXPECT_EQ( Item, Camera );
  EXPECT_FALSE( Registry.Resolve( 0, Item ) );
  EXPECT_FALSE( Registry.Resolve( 15, Item ) );

  EXPECT_EQ( Registry.FindId( { ZEK::ESelectCentroid, "cam:7", 0, 6 } ), 8u );
  EXPECT_EQ( Registry.FindId( { ZEK::ESelectCentroid, "cam:7", 0, 10 } ), 0u );

  Registry.Reset();
  EXPECT_FALSE( Registry.Resolve( 1, Item ) );
  EXPECT_EQ( Registry.Allocate( Recon( 0 ) ), 1u );
  ASSERT_TRUE( Registry.Resolve( 1, Item ) );
  EXPECT_EQ( Item, Recon( 0 ) );
}

TEST( SelectionRegistry, AnEmptyRangeIsOverwrittenByTheNext )
{
  VSelectionRegistry Registry( nullptr );
  EXPECT_EQ( Registry.AllocateLabelled( Recon( 3 ), 0, "nobody" ), 1u );
  EXPECT_EQ( Registry.AllocateLabelled( Recon( 4 ), 1, "somebody" ), 1u );
  ZEK::VSelectionItem Item;
  std::string Label;
  ASSERT_TRUE( Registry.Resolve( 1, Item, Label ) );
  EXPECT_EQ( Item, Recon( 4 ) );
  EXPECT_EQ( Label, "somebody" );
}

TEST( SelectionRegistry, LabelsAreAskedForOnlyWhenAPickIsResolved )
{
  VTestPoints Points;
  Points.Points.resize( 1000 );
  VSelectionRegistry Registry( nullptr );
  EXPECT_EQ( Registry.AllocateLabelled( { ZEK::ESelectDevice, "plate", 0, 0 }, 1, "Plate 1" ), 1u );
  EXPECT_EQ( Registry.AllocateRange( 1000, Points ), 2u );
  EXPECT_EQ( Points.Asked, 0 );

  const std::uint32_t Ids[] = { 1, 502, 502, 5000 };
  std::vector< std::string > Labels;
  const ZEK::VSelection Selection = Registry.ResolveAll( Ids, Labels );
  EXPECT_EQ( Points.Asked, 2 );
  ASSERT_EQ( Selection.size(), 2u );
  EXPECT_EQ( Selection[1], Recon( 500 ) );
  EXPECT_EQ( Labels, ( std::vector< std::string >{ "Plate 1", "point 500", "point 500" } ) );
}

TEST( SelectionRegistry, IdsEndAtTheLastOfTheWord )
{
  VTestPoints Points;
  VSelectionRegistry Registry( nullptr );
  EXPECT_EQ( Registry.AllocateRange( 0x1FFFFE, Points ), 1u );
  EXPECT_EQ( Registry.Allocate( Recon( 0 ), 2 ), 0u );
  EXPECT_EQ( Registry.AllocateRange( 0xFFFFFFFF, Points ), 0u );
  EXPECT_EQ( Registry.Allocate( Recon( 7 ) ), 0x1FFFFFu );
  EXPECT_EQ( Registry.Allocate( Recon( 8 ) ), 0u );
  EXPECT_EQ( Registry.Word( Recon( 8 ) ), 0u );
  ZEK::VSelectionItem Item;
  ASSERT_TRUE( Registry.Resolve( 0x1FFFFF, Item ) );
  EXPECT_EQ( Item, Recon( 7 ) );
}

TEST( SelectionRegistry, WordsBearTheFlagsOfTheSetsAtReset )
{
  const auto pService = std::make_shared< VTestSelection >();
  VSelectionRegistry Registry( pService );
  pService->Set( ZEK::ISelectionService::EPrimary, { Recon( 9 ), Recon( 2 ) } );
  pService->Set( ZEK::ISelectionService::ESecondary, { Recon( 9 ) } );
  EXPECT_EQ( Registry.Flags( Recon( 9 ) ), 0u );
  const std::uint64_t Before = Registry.MarksGeneration();
  Registry.Reset();
  EXPECT_GT( Registry.MarksGeneration(), Before );
  EXPECT_EQ( Registry.Flags( Recon( 9 ) ), EIdSelected | EIdPreselected );
  EXPECT_EQ( Registry.Flags( Recon( 2 ) ), EIdSelected | EIdPrimary );
  EXPECT_EQ( Registry.Flags( Recon( 1 ) ), 0u );
  EXPECT_EQ( Registry.Marks().size(), 2u );

  EXPECT_EQ( Registry.Word( Recon( 9 ), "label", true ), 1u | EIdSelected | EIdPreselected | EIdPrimary );
  const auto Colour = VSelectionRegistry::ColourOfWord( 0x6132C8 );
  EXPECT_EQ( std::lround( Colour[0] * 255 ), 0xC8 );
  EXPECT_EQ( std::lround( Colour[1] * 255 ), 0x32 );
  EXPECT_EQ( std::lround( Colour[2] * 255 ), 0x61 );

  const std::uint64_t Quiet = Registry.MarksGeneration();
  Registry.Reset();
  EXPECT_EQ( Registry.MarksGeneration(), Quiet );
}

TEST( SelectionRegistry, AnIdThatLooksLikeTheCurrentItemIsToldOnce )
{
  const auto Told = []
  {
    return TestSupport::LogTexts( "MoxelGraphics", ZEK::ELogWarning ).size();
  };
  const auto pService = std::make_shared< VTestSelection >();
  const ZEK::VSelectionItem Cell{ ZEK::ESelectMaskCell, "cam:1", 0, 5 };
  pService->Set( ZEK::ISelectionService::EPrimary, { Recon( 3 ), Recon( 4 ), Cell } );
  pService->Set( ZEK::ISelectionService::ESecondary, { Recon( 4 ), Cell } );
  VSelectionRegistry Registry( pService );
  VTestPoints Points;
  Points.Points.resize( 10 );
  const std::size_t Before = Told();
  const auto Frame = [&]( std::uint32_t i_Others )
  {
    Registry.Reset();
    EXPECT_EQ( Registry.Allocate( { ZEK::ESelectDevice, "cam:1", 0, 0 }, i_Others ), 1u );
    return Registry.AllocateRange( 10, Points );
  };
  // The last of the ten stays below, and so does the one that bears both marks.
  EXPECT_EQ( Frame( 0x3FFFF - 5 ) + 4, 0x3FFFFu );
  Registry.Allocate( { ZEK::ESelectMaskCell, "cam:1", 0, 0 }, 100 );
  EXPECT_EQ( Told(), Before );
  EXPECT_EQ( Frame( 0x3FFFF - 4 ) + 4, 0x40000u );
  EXPECT_EQ( Told(), Before + 1 );
  Frame( 0x3FFFF );
  EXPECT_EQ( Told(), Before + 1 );
}

TEST( SelectionRegistry, PlacesAreFoundByItem )
{
  VTestPoints Points;
  Points.Points = { { 1, 2, 3, 4 }, { 5, 6, 7, 8 } };
  VSelectionRegistry Registry( nullptr );
  Registry.AllocateRange( 2, Points );
  VScenePoint Point;
  ASSERT_TRUE( Registry.GetPosition( Recon( 1 ), Point ) );
  EXPECT_EQ( Point.X, 5 );
  EXPECT_FALSE( Registry.GetPosition( Recon( 2 ), Point ) );

  const ZEK::VSelectionItem Subject{ ZEK::ESelectSubject, "Anna", 3, 0 };
  Registry.SetPosition( Subject, { 1, 0, 0, 0 } );
  Registry.SetPosition( { ZEK::ESelectSubject, "Bert", 4, 0 }, { 2, 0, 0, 0 } );
  Registry.SetPosition( Subject, { 3, 0, 0, 0 } );
  ASSERT_TRUE( Registry.GetPosition( Subject, Point ) );
  EXPECT_EQ( Point.X, 3 );
  VScenePose Pose;
  EXPECT_FALSE( Registry.GetPose( Subject, Pose ) );
  Registry.SetPose( Subject, { {}, 7 } );
  ASSERT_TRUE( Registry.GetPose( Subject, Pose ) );
  EXPECT_EQ( Pose.Index, 7 );
  Registry.Reset();
  EXPECT_FALSE( Registry.GetPosition( Subject, Point ) );
  EXPECT_FALSE( Registry.GetPose( Subject, Pose ) );
}

} // namespace MoxelGraphics
