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
}

TEST( SelectionRegistry, LabelsAreAskedForOnlyWhenAPickIsResolved )
{
  VTestPoints Points;
  Points.Points.resize( 1000 );
  VSelectionRegistry Registry( nullptr );
  EXPECT_EQ( Registry.AllocateLabelled( Recon( 3 ), 0, "nobody" ), 1u );
  EXPECT_EQ( Registry.AllocateLabelled( { ZEK::ESelectDevice, "plate", 0, 0 }, 1, "Plate 1" ), 1u );
  EXPECT_EQ( Registry.AllocateRange( 1000, Points ), 2u );
  EXPECT_EQ( Points.Asked, 0 );
  const std::uint32_t Ids[] = { 1, 502, 502, 5000 };
  std::vector< std::string > Labels;
  const ZEK::VSelection Selection = Registry.ResolveAll( Ids, Labels );
  EXPECT_EQ( Points.Asked, 2 );
  EXPECT_EQ( Selection, ( ZEK::VSelection{ { ZEK::ESelectDevice, "plate", 0, 0 }, Recon( 500 ) } ) );
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

TEST( SelectionRegistry, AnIdThatLooksLikeTheCurrentItemIsToldOnce )
{
  const auto Told = []
  {
    return TestSupport::LogTexts( "MoxelGraphics", ZEK::ELogWarning ).size();
  };
  const auto pService = std::make_shared< HostServices::VSelectionService >();
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

} // namespace MoxelGraphics
