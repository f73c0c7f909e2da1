#include <ZEK/FlowTypes.h>

#include <gtest/gtest.h>

#include <limits>

using namespace ZEK;

TEST( VFlowTimeKey, OrdersByClockThenByFrameAndNotBySpan )
{
  EXPECT_LT( ( VFlowTimeKey{ 100, 1, 1 } ), ( VFlowTimeKey{ -5, 1, 2 } ) );
  EXPECT_LT( ( VFlowTimeKey{ -5, 1, 1 } ), ( VFlowTimeKey{ 3, 1, 1 } ) );
  EXPECT_EQ( ( VFlowTimeKey{ 3, 1, 1 } ), ( VFlowTimeKey{ 3, 9, 1 } ) );
}

TEST( FlowTimeMatches, EachMatchKeepsWhatItsTableRowSays )
{
  using enum EFlowTimeMatch;
  const VFlowTimeKey Query{ 10, 5, 1 };
  struct VRow
  {
    VFlowTimeKey Entry;
    bool Equal, Before, BeforeOrAt, After, AtOrAfter, Overlap;
  };
  const VRow Rows[] = { { { 10, 5, 1 }, true, false, true, false, true, true },
                        { { 9, 1, 1 }, false, true, true, false, false, false },
                        { { 9, 2, 1 }, false, true, true, false, false, true },
                        { { 14, 0, 1 }, false, false, false, true, true, true },
                        { { 15, 3, 1 }, false, false, false, true, true, false },
                        { { 10, 5, 2 }, false, false, false, true, true, false },
                        { { 500, 1, 0 }, false, true, true, false, false, false },
                        { { 10, 0, 1 }, true, false, true, false, true, true } };
  for ( const VRow& rRow : Rows )
  {
    SCOPED_TRACE( testing::Message() << rRow.Entry.Frame << "+" << rRow.Entry.Span << "@" << rRow.Entry.Clock );
    EXPECT_EQ( FlowTimeMatches( Equal, rRow.Entry, Query ), rRow.Equal );
    EXPECT_EQ( FlowTimeMatches( Before, rRow.Entry, Query ), rRow.Before );
    EXPECT_EQ( FlowTimeMatches( BeforeOrAt, rRow.Entry, Query ), rRow.BeforeOrAt );
    EXPECT_EQ( FlowTimeMatches( After, rRow.Entry, Query ), rRow.After );
    EXPECT_EQ( FlowTimeMatches( AtOrAfter, rRow.Entry, Query ), rRow.AtOrAfter );
    EXPECT_EQ( FlowTimeMatches( Overlap, rRow.Entry, Query ), rRow.Overlap );
  }
}

TEST( FlowTimeMatches, ASpanUpToTheGreatestNumberDoesNotOverflow )
{
  constexpr std::int64_t Greatest = std::numeric_limits< std::int64_t >::max();
  constexpr std::int64_t Least = std::numeric_limits< std::int64_t >::min();
  EXPECT_TRUE( FlowTimeMatches( EFlowTimeMatch::Overlap, { 10, Greatest, 1 }, { Greatest, 1, 1 } ) );
  EXPECT_TRUE( FlowTimeMatches( EFlowTimeMatch::Overlap, { Least, Greatest, 1 }, { -2, 1, 1 } ) );
  EXPECT_FALSE( FlowTimeMatches( EFlowTimeMatch::Overlap, { Least, Greatest, 1 }, { 0, 1, 1 } ) );
}
