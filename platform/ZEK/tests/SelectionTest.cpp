#include <ZEK/Selection.h>

#include <gtest/gtest.h>

using namespace ZEK;

namespace
{
VSelectionItem Item( std::uint32_t i_Sub )
{
  return { ESelectReconstruction, {}, 0, i_Sub };
}
} // namespace

TEST( EditSelection, EachEditChangesWhatItSaysAndTheLastPickedIsCurrent )
{
  const VSelection From{ Item( 1 ), Item( 2 ), Item( 3 ) };
  const VSelection Picked{ Item( 2 ), Item( 4 ), Item( 4 ) };
  using enum ESelectionEdit;
  EXPECT_EQ( EditSelection( From, Picked, Replace ), ( VSelection{ Item( 2 ), Item( 4 ) } ) );
  EXPECT_EQ( EditSelection( From, Picked, Add ), ( VSelection{ Item( 1 ), Item( 3 ), Item( 2 ), Item( 4 ) } ) );
  EXPECT_EQ( EditSelection( From, Picked, Toggle ), ( VSelection{ Item( 1 ), Item( 3 ), Item( 4 ) } ) );
  EXPECT_EQ( EditSelection( From, Picked, Remove ), ( VSelection{ Item( 1 ), Item( 3 ) } ) );
}

TEST( EditSelection, AnEmptyPickClearsOnlyWithoutModifier )
{
  const VSelection From{ Item( 1 ) };
  using enum ESelectionEdit;
  EXPECT_TRUE( EditSelection( From, {}, Replace ).empty() );
  for ( const ESelectionEdit Edit : { Add, Toggle, Remove } )
  {
    EXPECT_EQ( EditSelection( From, {}, Edit ), From );
  }
}
